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

QString NetProxyService::getIdentifier() const
{
    return service ? NetProxyPrivate::pathToIdentifier(service->path()) : QString();
}

QString NetProxyService::getName() const
{
    return service ? service->name() : QString();
}

void NetProxyService::setProxyConfig(const QVariantMap &configuration)
{
    if (service)
        service->setProxyConfig(configuration);
}

} // namespace Mdm
} // namespace Corvane
