// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_NETPROXYINTERFACE_P_H
#define CORVANEMDM_NETPROXYINTERFACE_P_H

#include "netproxy_p.h"

#include <QtCore/QVariantMap>

namespace Corvane
{
namespace Mdm
{

/** One proxy configuration of the connection manager, with a local copy of it that is read and written. */
class NetProxyInterface
{
public:
    /** The local copy. The setters return whether they have changed something, and keep that in mind. */
    struct ProxyLocalMirror {
        bool setType(NetProxy::ProxyType newType);
        bool setManualProxies(const QList<QUrl> &proxies);
        bool setManualExclusions(const QStringList &exclusions);
        bool setAutomaticUrl(const QUrl &newUrl);

        quint32 changes = 0; ///< local ones (NetProxyPrivate::ConfigChange) that were not confirmed yet
        NetProxy::ProxyType type = NetProxy::Invalid;
        QStringList servers;
        QStringList excludes;
        QString url;
    };

    // The setters return whether they have changed something; what is complete is sent in any case.
    virtual bool setType(NetProxy::ProxyType type);
    virtual bool setManualProxies(const QList<QUrl> &proxies);
    virtual bool setManualExclusions(const QStringList &exclusions);
    virtual bool setAutomaticUrl(const QUrl &url);
    virtual QString getIdentifier() const = 0;
    virtual QString getName() const = 0;
    virtual NetProxy::ProxyType getType() const;
    virtual QList<QUrl> getManualProxies() const;
    virtual QStringList getManualExclusions() const;
    virtual QUrl getAutomaticUrl() const;
    /** Hands a complete configuration to the connection manager. */
    virtual void setProxyConfig(const QVariantMap &configuration) = 0;
    virtual ~NetProxyInterface() = default;

    /** Takes over what the connection manager has, and returns the changes that are to be announced. */
    quint32 applyConfiguration(const QVariantMap &configuration);
    /** Hands over the local copy after @p change, if that concerns its type and nothing is missing; returns
     * whether it did. */
    bool globalUpdateRemoteFromLocal(NetProxyPrivate::ConfigChange change);

    ProxyLocalMirror mirror;

protected:
    /** Whether there is something to configure. Without it nothing can be set, and all that is read is empty.
     */
    virtual bool hasTarget() const = 0;

private:
    bool update(bool isChange, NetProxyPrivate::ConfigChange change);
    quint32 takeChanges(quint32 changes);
    quint32 applyType(NetProxy::ProxyType type);
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_NETPROXYINTERFACE_P_H
