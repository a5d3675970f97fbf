// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_HARDWARE_H
#define CORVANE_SIMULATOR_HARDWARE_H

#include <QtCore/QJsonObject>
#include <QtCore/QString>

namespace Corvane
{
namespace Simulator
{

struct PhoneFiles;

/** Adds the files by which the phone of @p profile says what it is, and which one. */
void addHardware(const QJsonObject &profile, PhoneFiles &files);

/** Makes the running phone say that its operating system is of @p version. */
void setOperatingSystem(const QString &version);

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_HARDWARE_H
