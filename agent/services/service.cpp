// SPDX-License-Identifier: LGPL-2.1-or-later
#include "service.h"

#include "systembus.h"

#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusConnectionInterface>
#include <QtDBus/QDBusReply>

namespace Corvane
{
namespace Agent
{

Service Service::telephony()
{
    return {QStringLiteral("org.ofono"), QStringLiteral("telephony service")};
}

Service Service::connectionManager()
{
    return {QStringLiteral("net.connman"), QStringLiteral("connection manager")};
}

Service Service::mdmProxy()
{
    return {QStringLiteral("org.corvaneos.mdmproxy"), QStringLiteral("MDM proxy")};
}

Service Service::packageKit()
{
    return {QStringLiteral("org.freedesktop.PackageKit"), QStringLiteral("package manager")};
}

QString Service::toString() const
{
    return QStringLiteral("the %1 (%2)").arg(description, name);
}

bool Service::isRunning() const
{
    const QDBusConnection bus = QDBusConnection::systemBus();
    return bus.isConnected() && bus.interface()->isServiceRegistered(name);
}

Reply Service::ensureRunning() const
{
    const Reply reached = SystemBus::reach();
    if (!reached.isDone() || isRunning())
        return reached;
    const QDBusConnection bus = QDBusConnection::systemBus();
    const QStringList activatable = bus.interface()->activatableServiceNames();
    if (!activatable.contains(name))
        return notRunning();
    const QDBusReply<void> started = bus.interface()->startService(name);
    if (started.isValid())
        return {};
    return {Reply::ServiceLost,
            QStringLiteral("%1 cannot be started: %2").arg(toString(), started.error().message())};
}

Reply Service::notRunning() const
{
    return {Reply::ServiceLost, toString() + QLatin1String(" is not running")};
}

QString Service::refusal(const QString &reason) const
{
    return QStringLiteral("%1 refused: %2").arg(toString(), reason);
}

} // namespace Agent
} // namespace Corvane
