// SPDX-License-Identifier: LGPL-2.1-or-later
#include "service.h"

#include "systembus.h"

#include <QtCore/QRegularExpression>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusConnectionInterface>
#include <QtDBus/QDBusReply>

namespace Corvane
{
namespace Agent
{

namespace
{

/** Whether QtDBus or the bus gives @p reason in the place of a service that says nothing. */
bool isSilence(const QString &reason)
{
    static const QRegularExpression name(
        QStringLiteral(R"re(\borg\.freedesktop\.DBus\.Error\.(?:NoReply|Timeout|TimedOut)\)?$)re"));
    // Not every failure has its name with it.
    static const QLatin1String text("Did not receive a reply.");
    // The name is the same when the service died before it could answer.
    static const QLatin1String death("Message recipient disconnected");
    return reason.startsWith(text) || (name.match(reason).hasMatch() && !reason.startsWith(death));
}

} // namespace

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

Service Service::certificateHelper()
{
    return {QString(), QStringLiteral("certificate helper")};
}

Service Service::deviceLock()
{
    return {QStringLiteral("org.veldmobile.devicelock"), QStringLiteral("device-lock daemon")};
}

Service Service::bus()
{
    return {QStringLiteral("org.freedesktop.DBus"), QStringLiteral("system bus")};
}

Service Service::clock()
{
    return {QStringLiteral("org.freedesktop.timedate1"), QStringLiteral("time service")};
}

QString Service::toString() const
{
    if (name.isEmpty())
        return QLatin1String("the ") + description;
    return QStringLiteral("the %1 (%2)").arg(description, name);
}

bool Service::isRunning() const
{
    if (name.isEmpty())
        return true;
    const QDBusConnection bus = QDBusConnection::systemBus();
    return bus.isConnected() && bus.interface()->isServiceRegistered(name);
}

Reply Service::ensureRunning() const
{
    if (name.isEmpty())
        return {};
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
    if (isSilence(reason))
        return toString() + QLatin1String(" did not answer within 25 s");
    return QStringLiteral("%1 refused: %2").arg(toString(), reason);
}

} // namespace Agent
} // namespace Corvane
