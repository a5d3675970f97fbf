// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_CONTRACTS_H
#define CORVANE_SIMULATOR_CONTRACTS_H

#include <QtCore/QString>

#include <gio/gio.h>

namespace Corvane
{
namespace Simulator
{

/** The written contract of @p interface, from the embedded copy of dbus/. It lives as long as the process. */
GDBusInterfaceInfo *contractOf(const QString &interface);

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_CONTRACTS_H
