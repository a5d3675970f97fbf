// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_CONNMAN_NETWORKMANAGER_H
#define CORVANEMDM_PLATFORM_CONNMAN_NETWORKMANAGER_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QObject>
#include <QtCore/QString>
#include <QtCore/QVector>

class NetworkManager;
class NetworkService;
class NetworkTechnology;

/** Where the manager comes from. */
class CORVANEMDM_PLATFORM_EXPORT NetworkManagerFactory
{
public:
    /**
     * The one manager of the calling thread, which keeps it. The first call asks the bus whether the
     * connection manager is there, and waits for that answer.
     */
    static NetworkManager *createInstance();

    NetworkManagerFactory() = delete;
};

/**
 * The connection manager, "net.connman", with its networks and technologies.
 *
 * Nothing blocks: the getters tell what is known, and requests are sent. Restarts of the connection manager
 * are followed.
 */
class CORVANEMDM_PLATFORM_EXPORT NetworkManager : public QObject
{
    Q_OBJECT

public:
    ~NetworkManager() override;

    /** Whether the connection manager is there; known from the beginning. */
    bool isAvailable() const;
    /** Whether it is there and has told everything. The lists below are empty before. */
    bool isValid() const;

    /** Flight mode. */
    bool offlineMode() const;
    /** Asks for it; offlineModeChanged() tells when it is so. A refusal is logged. */
    void setOfflineMode(bool offlineMode);

    /** In the connection manager's order, as the networks. */
    QVector<NetworkTechnology *> getTechnologies() const;
    /** The one of that type, such as "wifi"; null when there is none. */
    NetworkTechnology *getTechnology(const QString &type) const;
    /** Whether technologies are listed at all, as they are at first. */
    bool technologiesEnabled() const;
    void setTechnologiesEnabled(bool enabled);

    /** The networks that are kept for later; of one technology, given by its type or its name, or of all. */
    QVector<NetworkService *> getSavedServices(const QString &technology = QString()) const;

    /**
     * Makes the connection manager report on data to the "net.connman.Counter" that this process offers at
     * @p path: every @p period seconds, and every @p accuracy KiB. A refusal is logged.
     */
    void registerCounter(const QString &path, quint32 accuracy, quint32 period);
    void unregisterCounter(const QString &path);

Q_SIGNALS:
    void availabilityChanged(bool available);
    void validChanged(bool valid);
    void offlineModeChanged(bool offlineMode);
    /** Technologies came or went. */
    void technologiesChanged();
    void technologiesEnabledChanged(bool enabled);

private:
    Q_DISABLE_COPY(NetworkManager)
    NetworkManager();

    friend class NetworkManagerFactory;
    friend class NetworkService;
    friend class NetworkTechnology;
    class Private;
    Private *const d;
};

#endif // CORVANEMDM_PLATFORM_CONNMAN_NETWORKMANAGER_H
