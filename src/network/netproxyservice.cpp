// SPDX-License-Identifier: LGPL-2.1-or-later
#include "netproxyservice_p.h"

#include <connman/networkmanager.h>
#include <connman/networkservice.h>

namespace Corvane
{
namespace Mdm
{

NetProxyService::NetProxyService(NetProxy *netProxy, NetProxyPrivate *netProxyPrivate)
    : manager(NetworkManagerFactory::createInstance())
    , q(netProxy)
    , d(netProxyPrivate)
{
    if (manager->isValid())
        d->setValidService(true);
    connect(manager.data(), &NetworkManager::validChanged, this, &NetProxyService::managerValidChanged);
}

void NetProxyService::managerValidChanged()
{
    d->setValidService(manager->isValid());
}

bool NetProxyService::setType(NetProxy::ProxyType type)
{
    if (!service || type < NetProxy::Direct || type > NetProxy::Automatic)
        return false;
    const bool isChange = mirror.setType(type);
    globalUpdateRemoteFromLocal(NetProxyPrivate::ChangeType);
    return isChange;
}

bool NetProxyService::setManualProxies(const QList<QUrl> &proxies)
{
    if (!service)
        return false;
    const bool isChange = mirror.setManualProxies(proxies);
    globalUpdateRemoteFromLocal(NetProxyPrivate::ChangeServers);
    return isChange;
}

bool NetProxyService::setManualExclusions(const QStringList &exclusions)
{
    if (!service)
        return false;
    const bool isChange = mirror.setManualExclusions(exclusions);
    globalUpdateRemoteFromLocal(NetProxyPrivate::ChangeExcludes);
    return isChange;
}

bool NetProxyService::setAutomaticUrl(const QUrl &url)
{
    if (!service)
        return false;
    const bool isChange = mirror.setAutomaticUrl(url);
    globalUpdateRemoteFromLocal(NetProxyPrivate::ChangeUrl);
    return isChange;
}

QString NetProxyService::getIdentifier() const
{
    return service ? NetProxyPrivate::pathToIdentifier(service->path()) : QString();
}

QString NetProxyService::getName() const
{
    return service ? service->name() : QString();
}

NetProxy::ProxyType NetProxyService::getType() const
{
    return service ? mirror.type : NetProxy::Invalid;
}

QList<QUrl> NetProxyService::getManualProxies() const
{
    return service ? QUrl::fromStringList(mirror.servers) : QList<QUrl>();
}

QStringList NetProxyService::getManualExclusions() const
{
    return service ? mirror.excludes : QStringList();
}

QUrl NetProxyService::getAutomaticUrl() const
{
    return service ? QUrl(mirror.url) : QUrl();
}

void NetProxyService::setProxyConfig(const QVariantMap &configuration)
{
    if (service)
        service->setProxyConfig(configuration);
}

} // namespace Mdm
} // namespace Corvane
