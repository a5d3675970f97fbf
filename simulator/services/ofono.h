// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_OFONO_H
#define CORVANE_SIMULATOR_OFONO_H

#include "busconnection.h"

namespace Corvane
{
namespace Simulator
{

/** What the parts of the telephony daemon share. */
namespace Ofono
{

const QLatin1String serviceName("org.ofono");

inline MethodError invalidArguments(const QString &message)
{
    return MethodError(QStringLiteral("org.ofono.Error.InvalidArguments"), message);
}

inline MethodError notFound(const QString &message)
{
    return MethodError(QStringLiteral("org.ofono.Error.NotFound"), message);
}

inline MethodError notAvailable(const QString &message)
{
    return MethodError(QStringLiteral("org.ofono.Error.NotAvailable"), message);
}

} // namespace Ofono
} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_OFONO_H
