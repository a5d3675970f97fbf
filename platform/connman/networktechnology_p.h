// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_CONNMAN_NETWORKTECHNOLOGY_P_H
#define CORVANEMDM_PLATFORM_CONNMAN_NETWORKTECHNOLOGY_P_H

#include "connman/networkmanager.h"
#include "connman/networktechnology.h"

#include <QtCore/QPointer>
#include <QtCore/QVariantMap>

class NetworkTechnology::Private
{
public:
    /** What there is to signal. */
    enum Change { Powered = 1 };
    Q_DECLARE_FLAGS(Changes, Change)

    Private(NetworkTechnology *technology, const QString &technologyPath)
        : q(technology)
        , path(technologyPath)
    {
    }

    /** Takes over what has been told; what is missing from it stays. */
    Changes set(const QVariantMap &properties);
    void signal(Changes changes);

    NetworkTechnology *const q;
    QPointer<NetworkManager> manager;
    const QString path;
    QString name;
    QString type;
    bool powered = false;
};

#endif // CORVANEMDM_PLATFORM_CONNMAN_NETWORKTECHNOLOGY_P_H
