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

bool NetProxyGlobal::setType(NetProxy::ProxyType type)
{
    if (type < NetProxy::Direct || type > NetProxy::Automatic)
        return false;
    const bool isChange = mirror.setType(type);
    globalUpdateRemoteFromLocal(NetProxyPrivate::ChangeType);
    return isChange;
}

bool NetProxyGlobal::setManualProxies(const QList<QUrl> &proxies)
{
    const bool isChange = mirror.setManualProxies(proxies);
    globalUpdateRemoteFromLocal(NetProxyPrivate::ChangeServers);
    return isChange;
}

bool NetProxyGlobal::setManualExclusions(const QStringList &exclusions)
{
    const bool isChange = mirror.setManualExclusions(exclusions);
    globalUpdateRemoteFromLocal(NetProxyPrivate::ChangeExcludes);
    return isChange;
}

bool NetProxyGlobal::setAutomaticUrl(const QUrl &url)
{
    const bool isChange = mirror.setAutomaticUrl(url);
    globalUpdateRemoteFromLocal(NetProxyPrivate::ChangeUrl);
    return isChange;
}

QString NetProxyGlobal::getIdentifier() const
{
    return QStringLiteral("global");
}

QString NetProxyGlobal::getName() const
{
    return QStringLiteral("Global Proxy");
}

NetProxy::ProxyType NetProxyGlobal::getType() const
{
    return mirror.type;
}

QList<QUrl> NetProxyGlobal::getManualProxies() const
{
    return QUrl::fromStringList(mirror.servers);
}

QStringList NetProxyGlobal::getManualExclusions() const
{
    return mirror.excludes;
}

QUrl NetProxyGlobal::getAutomaticUrl() const
{
    return QUrl(mirror.url);
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
