// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_CONNMAN_NETWORKTECHNOLOGY_H
#define CORVANEMDM_PLATFORM_CONNMAN_NETWORKTECHNOLOGY_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QObject>
#include <QtCore/QString>

/**
 * A kind of network that the phone can use: "net.connman.Technology". Nothing blocks.
 *
 * The objects are NetworkManager's: each lives as long as the connection manager has the technology, a
 * restart included.
 */
class CORVANEMDM_PLATFORM_EXPORT NetworkTechnology : public QObject
{
    Q_OBJECT

public:
    ~NetworkTechnology() override;

    QString path() const;
    /** What a person knows it by, such as "WiFi". */
    QString name() const;
    /** "wifi", "cellular", "ethernet"... */
    QString type() const;
    bool powered() const;

    /** Asks to switch it on or off; poweredChanged() tells when it is. A refusal is logged. */
    void setPowered(bool powered);

Q_SIGNALS:
    void poweredChanged(bool powered);

private:
    Q_DISABLE_COPY(NetworkTechnology)
    NetworkTechnology(const QString &path, QObject *parent);

    friend class NetworkManager;
    class Private;
    Private *const d;
};

#endif // CORVANEMDM_PLATFORM_CONNMAN_NETWORKTECHNOLOGY_H
