// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_NETPROXYSERVICE_P_H
#define CORVANEMDM_NETPROXYSERVICE_P_H

#include "netproxyinterface_p.h"

#include <QtCore/QPointer>

class NetworkManager;
class NetworkService;

namespace Corvane
{
namespace Mdm
{

/** The proxy of one saved network, once one is held. */
class NetProxyService : public QObject, public NetProxyInterface
{
    Q_OBJECT

public:
    NetProxyService(NetProxy *netProxy, NetProxyPrivate *netProxyPrivate);

    bool setType(NetProxy::ProxyType type) override;
    bool setManualProxies(const QList<QUrl> &proxies) override;
    bool setManualExclusions(const QStringList &exclusions) override;
    bool setAutomaticUrl(const QUrl &url) override;
    QString getIdentifier() const override;
    QString getName() const override;
    NetProxy::ProxyType getType() const override;
    QList<QUrl> getManualProxies() const override;
    QStringList getManualExclusions() const override;
    QUrl getAutomaticUrl() const override;
    void setProxyConfig(const QVariantMap &configuration) override;

    QPointer<NetworkManager>
        manager; ///< not ours, and of the thread: it may be gone at the end of the program
    NetworkService *service = nullptr; ///< not ours

public Q_SLOTS:
    void managerValidChanged();

private:
    NetProxy *const q;
    NetProxyPrivate *const d;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_NETPROXYSERVICE_P_H
