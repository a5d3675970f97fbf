// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_NETPROXYGLOBAL_P_H
#define CORVANEMDM_NETPROXYGLOBAL_P_H

#include "netproxyinterface_p.h"

namespace Corvane
{
namespace Mdm
{

class GlobalProxyInterfaceProxy;

/** The proxy of the phone as a whole. */
class NetProxyGlobal : public QObject, public NetProxyInterface
{
    Q_OBJECT

public:
    NetProxyGlobal(NetProxy *netProxy, NetProxyPrivate *netProxyPrivate);

    QString getIdentifier() const override;
    QString getName() const override;
    void setProxyConfig(const QVariantMap &configuration) override;

    bool applyActive(bool isActive);
    /** Stores it and asks for it; returns whether it is a change. */
    bool setActive(bool isActive);

    bool active = false; ///< whether it is used in place of those of the networks
    GlobalProxyInterfaceProxy *proxy;

protected:
    bool hasTarget() const override { return true; }

private:
    NetProxy *const q;
    NetProxyPrivate *const d;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_NETPROXYGLOBAL_P_H
