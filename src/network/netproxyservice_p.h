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

    QString getIdentifier() const override;
    QString getName() const override;
    void setProxyConfig(const QVariantMap &configuration) override;

    QPointer<NetworkManager>
        manager; ///< not ours, and of the thread: it may be gone at the end of the program
    NetworkService *service = nullptr; ///< not ours

public Q_SLOTS:
    void managerValidChanged();

protected:
    bool hasTarget() const override { return service != nullptr; }

private:
    NetProxy *const q;
    NetProxyPrivate *const d;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_NETPROXYSERVICE_P_H
