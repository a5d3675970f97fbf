// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_GLOBALPROXYINTERFACEPROXY_P_H
#define CORVANEMDM_GLOBALPROXYINTERFACEPROXY_P_H

#include <QtDBus/QDBusAbstractInterface>
#include <QtDBus/QDBusPendingCall>
#include <QtDBus/QDBusVariant>

namespace Corvane
{
namespace Mdm
{

/** "org.corvaneos.connman.GlobalProxy" of the connection manager. The members are named as on the wire. */
class GlobalProxyInterfaceProxy : public QDBusAbstractInterface
{
    Q_OBJECT

public:
    explicit GlobalProxyInterfaceProxy(QObject *parent);

    /** Answered with a QDBusVariant. */
    QDBusPendingCall GetProperty(const QString &name);
    QDBusPendingCall SetProperty(const QString &name, const QDBusVariant &value);

Q_SIGNALS:
    void PropertyChanged(const QString &name, const QDBusVariant &value);
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_GLOBALPROXYINTERFACEPROXY_P_H
