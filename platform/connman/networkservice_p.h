// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_CONNMAN_NETWORKSERVICE_P_H
#define CORVANEMDM_PLATFORM_CONNMAN_NETWORKSERVICE_P_H

#include "connman/networkmanager.h"
#include "connman/networkservice.h"

#include <QtCore/QPointer>

class NetworkService::Private
{
public:
    /** What there is to signal. */
    enum Change { ProxyConfig = 1, Ready = 2 };
    Q_DECLARE_FLAGS(Changes, Change)

    explicit Private(NetworkService *service)
        : q(service)
    {
    }

    /** Takes over what a list has told; what is missing from it stays. */
    Changes set(const QVariantMap &properties);
    /** The same with what was announced, which is a change for those who wait for a confirmation. */
    Changes setAnnounced(const QVariantMap &properties);
    Changes setLoaded();
    void signal(Changes changes);

    NetworkService *const q;
    QPointer<NetworkManager> manager; ///< that tells it of the network
    QString path;
    QString name;
    QString type;
    bool saved = false;
    QVariantMap proxyConfig;
    bool isLoaded = false; ///< all properties have been told
};

#endif // CORVANEMDM_PLATFORM_CONNMAN_NETWORKSERVICE_P_H
