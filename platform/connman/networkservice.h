// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_CONNMAN_NETWORKSERVICE_H
#define CORVANEMDM_PLATFORM_CONNMAN_NETWORKSERVICE_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QObject>
#include <QtCore/QString>
#include <QtCore/QVariantMap>

/**
 * One network of the connection manager: "net.connman.Service" at its path. Nothing blocks.
 *
 * The objects that NetworkManager lists are its own: each lives as long as the connection manager knows the
 * network, a restart included. Others follow the network at the path that they are given.
 */
class CORVANEMDM_PLATFORM_EXPORT NetworkService : public QObject
{
    Q_OBJECT

public:
    explicit NetworkService(QObject *parent = nullptr);
    ~NetworkService() override;

    QString path() const;
    /** Follows the network at @p path from now on. */
    void setPath(const QString &path);

    // Empty until told. While the connection manager is away they stay as they were.
    /** What a person knows the network by; some networks have none. */
    QString name() const;
    /** "wifi", "cellular", "ethernet"... */
    QString type() const;
    /** Whether the network is kept for later: it has been connected to. */
    bool saved() const;
    /** What was configured: "Method", "Servers", "Excludes", "URL". */
    QVariantMap proxyConfig() const;

    // Requests: they are sent, and what comes of them is seen in the properties. A refusal is logged.
    void setProxyConfig(const QVariantMap &configuration);
    /** Starts counting the network's data anew. */
    void resetCounters();

Q_SIGNALS:
    /** The connection manager has announced a configuration, perhaps the one that is known already. */
    void proxyConfigChanged(const QVariantMap &configuration);
    /** All properties have been told, for the first time. */
    void propertiesReady();

private:
    Q_DISABLE_COPY(NetworkService)

    friend class NetworkManager;
    class Private;
    Private *const d;
};

#endif // CORVANEMDM_PLATFORM_CONNMAN_NETWORKSERVICE_H
