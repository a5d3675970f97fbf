// SPDX-License-Identifier: LGPL-2.1-or-later
#include "globalproxyinterfaceproxy_p.h"

#include <QtDBus/QDBusConnection>

namespace Corvane
{
namespace Mdm
{

GlobalProxyInterfaceProxy::GlobalProxyInterfaceProxy(QObject *parent)
    : QDBusAbstractInterface(QStringLiteral("net.connman"), QStringLiteral("/"),
                             "org.corvaneos.connman.GlobalProxy", QDBusConnection::systemBus(), parent)
{
}

QDBusPendingCall GlobalProxyInterfaceProxy::GetProperty(const QString &name)
{
    return asyncCall(QStringLiteral("GetProperty"), name);
}

QDBusPendingCall GlobalProxyInterfaceProxy::SetProperty(const QString &name, const QDBusVariant &value)
{
    return asyncCall(QStringLiteral("SetProperty"), name, QVariant::fromValue(value));
}

} // namespace Mdm
} // namespace Corvane
