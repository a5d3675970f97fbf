// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_NETWORKDATACOUNTER_P_H
#define CORVANEMDM_NETWORKDATACOUNTER_P_H

#include <corvanemdm/networkdatacounter.h>

#include <QtCore/QPointer>
#include <QtCore/QVariantMap>
#include <QtDBus/QDBusAbstractAdaptor>
#include <QtDBus/QDBusObjectPath>

class NetworkManager;
class NetworkService;

namespace Corvane
{
namespace Mdm
{

class NetworkDataCounterPrivate : public QObject
{
    Q_OBJECT

public:
    explicit NetworkDataCounterPrivate(NetworkDataCounter *counter);
    ~NetworkDataCounterPrivate() override;

    void setActive(bool isActive);
    void resetCounter(const QString &servicePath);

    /** The connection manager has dropped the counter. */
    void counterRelease();
    void counterUsage(const QString &identifier, NetworkDataCounter::NetworkType type,
                      const QVariantMap &usage);

    NetworkDataCounter *const q;
    QPointer<NetworkManager>
        manager; ///< not ours, and of the thread: it may be gone at the end of the program
    NetworkService *service = nullptr; ///< for resetting alone
    QString path; ///< of the object that the connection manager calls
    int updateAccuracy = 1024;
    int updateInterval = 60;
    bool registered = false;
    bool active = false;

public Q_SLOTS:
    void networkManagerAvailableChanged();

private:
    void updateRegistration();
};

/** What the connection manager calls. */
class NetworkDataCounterAdaptor : public QDBusAbstractAdaptor
{
    Q_OBJECT
    Q_CLASSINFO("D-Bus Interface", "net.connman.Counter")

public:
    explicit NetworkDataCounterAdaptor(NetworkDataCounterPrivate *counter);

public Q_SLOTS:
    void Release();
    void Usage(const QDBusObjectPath &service_path, const QVariantMap &home, const QVariantMap &roaming);

private:
    NetworkDataCounterPrivate *const d;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_NETWORKDATACOUNTER_P_H
