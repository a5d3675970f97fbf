// SPDX-License-Identifier: LGPL-2.1-or-later
#include "netproxyinterface_p.h"

#include <QtCore/QDebug>

#include <utility>

namespace Corvane
{
namespace Mdm
{

namespace
{

const QLatin1String MethodKey("Method");
const QLatin1String ServersKey("Servers");
const QLatin1String ExcludesKey("Excludes");
const QLatin1String UrlKey("URL");

const QLatin1String DirectMethod("direct");
const QLatin1String ManualMethod("manual");
const QLatin1String AutomaticMethod("auto");

/** Stores @p value in @p field; returns @p change when that makes a difference. */
template <typename T> quint32 store(T *field, const T &value, NetProxyPrivate::ConfigChange change)
{
    return std::exchange(*field, value) == value ? 0u : quint32(change);
}

} // namespace

bool NetProxyInterface::ProxyLocalMirror::setType(NetProxy::ProxyType newType)
{
    const quint32 change = store(&type, newType, NetProxyPrivate::ChangeType);
    changes |= change;
    return change != 0;
}

bool NetProxyInterface::ProxyLocalMirror::setManualProxies(const QList<QUrl> &proxies)
{
    if (QUrl::fromStringList(servers) == proxies)
        return false;
    servers = QUrl::toStringList(proxies);
    changes |= NetProxyPrivate::ChangeServers;
    return true;
}

bool NetProxyInterface::ProxyLocalMirror::setManualExclusions(const QStringList &exclusions)
{
    const quint32 change = store(&excludes, exclusions, NetProxyPrivate::ChangeExcludes);
    changes |= change;
    return change != 0;
}

bool NetProxyInterface::ProxyLocalMirror::setAutomaticUrl(const QUrl &newUrl)
{
    if (QUrl(url) == newUrl)
        return false;
    url = newUrl.toString();
    changes |= NetProxyPrivate::ChangeUrl;
    return true;
}

bool NetProxyInterface::setType(NetProxy::ProxyType type)
{
    return hasTarget() && type >= NetProxy::Direct && type <= NetProxy::Automatic
        && update(mirror.setType(type), NetProxyPrivate::ChangeType);
}

bool NetProxyInterface::setManualProxies(const QList<QUrl> &proxies)
{
    return hasTarget() && update(mirror.setManualProxies(proxies), NetProxyPrivate::ChangeServers);
}

bool NetProxyInterface::setManualExclusions(const QStringList &exclusions)
{
    return hasTarget() && update(mirror.setManualExclusions(exclusions), NetProxyPrivate::ChangeExcludes);
}

bool NetProxyInterface::setAutomaticUrl(const QUrl &url)
{
    return hasTarget() && update(mirror.setAutomaticUrl(url), NetProxyPrivate::ChangeUrl);
}

NetProxy::ProxyType NetProxyInterface::getType() const
{
    return hasTarget() ? mirror.type : NetProxy::Invalid;
}

QList<QUrl> NetProxyInterface::getManualProxies() const
{
    return hasTarget() ? QUrl::fromStringList(mirror.servers) : QList<QUrl>();
}

QStringList NetProxyInterface::getManualExclusions() const
{
    return hasTarget() ? mirror.excludes : QStringList();
}

QUrl NetProxyInterface::getAutomaticUrl() const
{
    return hasTarget() ? QUrl(mirror.url) : QUrl();
}

quint32 NetProxyInterface::applyConfiguration(const QVariantMap &configuration)
{
    const QString method = configuration.value(MethodKey, QString(DirectMethod)).toString();
    if (method == DirectMethod)
        return applyType(NetProxy::Direct);
    if (method == ManualMethod) {
        return applyType(NetProxy::Manual)
            | takeChanges(NetProxyPrivate::ChangeServers | NetProxyPrivate::ChangeExcludes)
            | store(&mirror.servers, configuration.value(ServersKey).toStringList(),
                    NetProxyPrivate::ChangeServers)
            | store(&mirror.excludes, configuration.value(ExcludesKey).toStringList(),
                    NetProxyPrivate::ChangeExcludes);
    }
    if (method == AutomaticMethod) {
        return applyType(NetProxy::Automatic) | takeChanges(NetProxyPrivate::ChangeUrl)
            | store(&mirror.url, configuration.value(UrlKey).toString(), NetProxyPrivate::ChangeUrl);
    }
    return 0;
}

/** What was set goes to the connection manager, even if it is no change; returns whether it is one. */
bool NetProxyInterface::update(bool isChange, NetProxyPrivate::ConfigChange change)
{
    globalUpdateRemoteFromLocal(change);
    return isChange;
}

/** What of @p changes was made here is confirmed, hence to be announced, even if nothing comes of it. */
quint32 NetProxyInterface::takeChanges(quint32 changes)
{
    const quint32 taken = mirror.changes & changes;
    mirror.changes &= ~changes;
    return taken;
}

quint32 NetProxyInterface::applyType(NetProxy::ProxyType type)
{
    return takeChanges(NetProxyPrivate::ChangeType) | store(&mirror.type, type, NetProxyPrivate::ChangeType);
}

bool NetProxyInterface::globalUpdateRemoteFromLocal(NetProxyPrivate::ConfigChange change)
{
    quint32 concerned = 0;
    QVariantMap configuration;
    switch (mirror.type) {
    case NetProxy::Invalid:
        qDebug() << "MDM Proxy: error updating remote global proxy configuration";
        return false;
    case NetProxy::Direct:
        concerned = NetProxyPrivate::ChangeType;
        configuration = {{MethodKey, QString(DirectMethod)}};
        break;
    case NetProxy::Manual:
        if (mirror.servers.isEmpty())
            return false;
        concerned
            = NetProxyPrivate::ChangeType | NetProxyPrivate::ChangeServers | NetProxyPrivate::ChangeExcludes;
        configuration = {
            {MethodKey, QString(ManualMethod)}, {ServersKey, mirror.servers}, {ExcludesKey, mirror.excludes}};
        break;
    case NetProxy::Automatic:
        if (mirror.url.isEmpty())
            return false;
        concerned = NetProxyPrivate::ChangeType | NetProxyPrivate::ChangeUrl;
        configuration = {{MethodKey, QString(AutomaticMethod)}, {UrlKey, mirror.url}};
        break;
    }
    if (!(change & concerned))
        return false;
    setProxyConfig(configuration);
    return true;
}

} // namespace Mdm
} // namespace Corvane
