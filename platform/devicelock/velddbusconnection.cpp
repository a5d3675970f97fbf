// SPDX-License-Identifier: LGPL-2.1-or-later
#include <devicelock/velddbusconnection.h>

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

    ~Private() override { close(); }

    void follow()
    {
        current.connect(QString(), localPath, localInterface, disconnectedMember, this, SLOT(tellEnd()));
    }

    void close()
    {
        current.disconnect(QString(), localPath, localInterface, disconnectedMember, this, SLOT(tellEnd()));
        QDBusConnection::disconnectFromPeer(current.name());
    }

    Connection *const q;
    QDBusConnection current;

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
    delete d;
}

bool Connection::isConnected() const
{
    return d->current.isConnected();
}

bool Connection::reconnect(const QDBusConnection &connection)
{
    d->close();
    d->current = connection;
    if (!isConnected())
        return false;
    d->follow();
    Q_EMIT connected();
    return true;
}

QDBusConnection Connection::connection() const
{
    return d->current;
}

void Connection::verify()
{
    const QDBusMessage ping
        = QDBusMessage::createMethodCall(QString(), QStringLiteral("/"), peerInterface, pingMethod);
    auto *watcher = new QDBusPendingCallWatcher(d->current.asyncCall(ping), d);
    connect(watcher, &QDBusPendingCallWatcher::finished, this, [this, watcher] {
        watcher->deleteLater();
        if (!isConnected())
            Q_EMIT lost();
    });
}

} // namespace VeldDBus

#include "velddbusconnection.moc"
