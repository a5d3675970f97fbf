// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_CONNMAN_NETWORKMANAGER_P_H
#define CORVANEMDM_PLATFORM_CONNMAN_NETWORKMANAGER_P_H

#include "connman/networkmanager.h"
#include "connman/networkservice.h"
#include "connman/networktechnology.h"

#include "frame/serviceobject_p.h"

#include <QtCore/QPointer>
#include <QtCore/QStringList>
#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusVariant>

#include <utility>

class NetworkManager::Private : public QObject
{
    Q_OBJECT

public:
    explicit Private(NetworkManager *manager);

    /** Makes @p service, which is not listed, tell of the network at @p path. */
    void follow(NetworkService *service, const QString &path);
    void removeFollower(NetworkService *service);

    void requestOfManager(QLatin1String method, const QVariantList &arguments);
    void requestOfService(const QString &path, QLatin1String method, const QVariantList &arguments);
    void requestOfTechnology(const QString &path, QLatin1String method, const QVariantList &arguments);

    QVector<NetworkTechnology *> listedTechnologies() const;
    void setTechnologiesEnabled(bool enabled);

    NetworkManager *const q;
    bool isAvailable = false;
    bool isValid = false;
    bool offlineMode = false;
    bool technologiesEnabled = true;
    QVector<NetworkService *> services; ///< as in the last list; kept while the service is away
    QVector<NetworkTechnology *> technologies; ///< likewise

private Q_SLOTS:
    void managerPropertyChanged(const QString &name, const QDBusVariant &value);
    void technologyAdded(const QDBusObjectPath &path, const QVariantMap &properties);
    void technologyRemoved(const QDBusObjectPath &path);
    void servicesChanged(const QDBusMessage &message);

    // The message tells whose property it is.
    void servicePropertyChanged(const QString &name, const QDBusVariant &value, const QDBusMessage &message);
    void technologyPropertyChanged(const QString &name, const QDBusVariant &value,
                                   const QDBusMessage &message);

private:
    template <typename Object>
    using Changes = QVector<std::pair<QPointer<Object>, typename Object::Private::Changes>>;

    void takeUp();
    void leave();
    void answered(bool isUsable, QLatin1String method);
    void setOfflineMode(bool isOffline);
    void tellOfTechnologies();

    NetworkService *make(const QString &path, const NetworkService *);
    NetworkTechnology *make(const QString &path, const NetworkTechnology *);
    template <typename Object, typename IsGone>
    Changes<Object> arrange(QVector<Object *> *objects, const QVector<ListedObject> &listed, IsGone isGone);
    template <typename Object> static void signalAll(const Changes<Object> &changes);
    template <typename IsGone> void listServices(const QVector<ListedObject> &listed, IsGone isGone);
    void load(const QString &path);
    QVector<NetworkService *> servicesAt(const QString &path) const;
    static void request(ServiceObject *object, const QString &path, QLatin1String method,
                        const QVariantList &arguments);

    ServiceObject m_manager;
    ServiceObject m_services;
    ServiceObject m_technologies;
    QVector<NetworkService *> m_followers; ///< not ours
    int m_unanswered = 0;
    bool m_hasServices = false; ///< they have been listed by this run of the service
    bool m_hasTechnologies = false;
};

#endif // CORVANEMDM_PLATFORM_CONNMAN_NETWORKMANAGER_P_H
