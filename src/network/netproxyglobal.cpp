// SPDX-License-Identifier: LGPL-2.1-or-later
#include "netproxyglobal_p.h"

#include "frame/asynccommand_p.h"
#include "globalproxyinterfaceproxy_p.h"

namespace Corvane
{
namespace Mdm
{

namespace
{

const QLatin1String ActiveProperty("Active");
const QLatin1String ConfigurationProperty("Configuration");

} // namespace

NetProxyGlobal::NetProxyGlobal(NetProxy *netProxy, NetProxyPrivate *netProxyPrivate)
    : proxy(new GlobalProxyInterfaceProxy(netProxyPrivate))
    , q(netProxy)
    , d(netProxyPrivate)
{
    connect(proxy, SIGNAL(PropertyChanged(QString, QDBusVariant)), d,
            SLOT(onPropertyChanged(QString, QDBusVariant)));
    watchCall(proxy->GetProperty(ActiveProperty), d, &NetProxyPrivate::onGetPropertyFinishedActive);
    watchCall(proxy->GetProperty(ConfigurationProperty), d,
              &NetProxyPrivate::onGetPropertyFinishedConfiguration);
}

QString NetProxyGlobal::getIdentifier() const
{
    return QStringLiteral("global");
}

QString NetProxyGlobal::getName() const
{
    return QStringLiteral("Global Proxy");
}

void NetProxyGlobal::setProxyConfig(const QVariantMap &configuration)
{
    proxy->SetProperty(ConfigurationProperty, QDBusVariant(configuration));
}

bool NetProxyGlobal::applyActive(bool isActive)
{
    active = isActive;
    return true;
}

bool NetProxyGlobal::setActive(bool isActive)
{
    if (isActive == active)
        return false;
    active = isActive;
    proxy->SetProperty(ActiveProperty, QDBusVariant(isActive));
    return true;
}

} // namespace Mdm
} // namespace Corvane
