// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_DEVICELOCK_VELDDBUSCONNECTION_H
#define CORVANEMDM_PLATFORM_DEVICELOCK_VELDDBUSCONNECTION_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QObject>
#include <QtDBus/QDBusConnection>

#include <memory>

namespace VeldDBus
{

/**
 * A peer connection that can be replaced by a new one when its other end comes back.
 *
 * It closes each peer connection that it was given, when that is replaced and at the end; see hold().
 */
class CORVANEMDM_PLATFORM_EXPORT Connection : public QObject
{
    Q_OBJECT

public:
    /** @p connection may be one that failed to connect. */
    explicit Connection(const QDBusConnection &connection, QObject *parent = nullptr);
    ~Connection() override;

    bool isConnected() const;
    /** Uses @p connection from now on, and returns whether that is connected. */
    bool reconnect(const QDBusConnection &connection);
    QDBusConnection connection() const;
    /**
     * Keeps the peer connection of this moment open for as long as the result is held, also when it has been
     * replaced. Whoever waits for an answer has to hold it: QtDBus must not close a connection before that.
     */
    std::shared_ptr<void> hold() const;
    /**
     * Asks the other end for a sign of life. That a connection has been lost is noticed with a delay, in
     * which whoever has it may learn already that the other end is back.
     */
    void verify();

Q_SIGNALS:
    /** A new connection is in use. */
    void connected();
    /** The other end has closed the connection. */
    void disconnected();
    /** After verify(): there is no connection any more. */
    void lost();

private:
    Q_DISABLE_COPY(Connection)

    class Private;
    Private *const d;
};

} // namespace VeldDBus

#endif // CORVANEMDM_PLATFORM_DEVICELOCK_VELDDBUSCONNECTION_H
