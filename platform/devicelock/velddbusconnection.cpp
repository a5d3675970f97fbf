// SPDX-License-Identifier: LGPL-2.1-or-later
#include <devicelock/velddbusconnection.h>

#include "frame/signalconnection_p.h"

#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusPendingCallWatcher>

namespace VeldDBus
{

namespace
{

// What libdbus itself tells of a connection.
const QLatin1String localPath("/org/freedesktop/DBus/Local");
const QLatin1String localInterface("org.freedesktop.DBus.Local");
const QLatin1String disconnectedMember("Disconnected");

// Every D-Bus library answers this by itself, for any object.
const QLatin1String peerInterface("org.freedesktop.DBus.Peer");
const QLatin1String pingMethod("Ping");

/** Closes a peer connection at its end. */
class Link
{
public:
    explicit Link(const QString &name)
        : m_name(name)
    {
    }
    ~Link() { QDBusConnection::disconnectFromPeer(m_name); }
    Q_DISABLE_COPY(Link)

private:
    const QString m_name;
};

} // namespace

class Connection::Private : public QObject
{
    Q_OBJECT

public:
    Private(Connection *connection, const QDBusConnection &peer)
        : q(connection)
        , current(peer)
    {
        follow();
    }

    void follow()
    {
        link = std::make_shared<Link>(current.name());
        connectDBusSignal(current, {QString(), localPath, localInterface, disconnectedMember}, this,
                          SLOT(tellEnd()));
    }

    void forget()
    {
        ping.reset();
        disconnectDBusSignal(current, {QString(), localPath, localInterface, disconnectedMember}, this,
                             SLOT(tellEnd()));
        link.reset();
    }

    Connection *const q;
    QDBusConnection current;
    std::shared_ptr<Link> link;
    std::unique_ptr<QDBusPendingCallWatcher> ping; // goes before the link that it is sent over

private Q_SLOTS:
    void tellEnd()
    {
        // It may come late, from a connection that has been replaced.
        if (!current.isConnected())
            Q_EMIT q->disconnected();
    }
};

Connection::Connection(const QDBusConnection &connection, QObject *parent)
    : QObject(parent)
    , d(new Private(this, connection))
{
}

Connection::~Connection()
{
    d->forget();
    delete d;
}

bool Connection::isConnected() const
{
    return d->current.isConnected();
}

bool Connection::reconnect(const QDBusConnection &connection)
{
    d->forget();
    d->current = connection;
    d->follow();
    if (!isConnected())
        return false;
    Q_EMIT connected();
    return true;
}

QDBusConnection Connection::connection() const
{
    return d->current;
}

std::shared_ptr<void> Connection::hold() const
{
    return d->link;
}

void Connection::verify()
{
    const QDBusMessage ping
        = QDBusMessage::createMethodCall(QString(), QStringLiteral("/"), peerInterface, pingMethod);
    d->ping = std::make_unique<QDBusPendingCallWatcher>(d->current.asyncCall(ping));
    connect(d->ping.get(), &QDBusPendingCallWatcher::finished, this, [this] {
        d->ping.release()->deleteLater();
        if (!isConnected())
            Q_EMIT lost();
    });
}

} // namespace VeldDBus

#include "velddbusconnection.moc"
