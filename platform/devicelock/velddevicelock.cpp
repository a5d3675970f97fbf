// SPDX-License-Identifier: LGPL-2.1-or-later
#include <devicelock/velddevicelock.h>

#include <devicelock/velddbusconnection.h>

#include "frame/signalconnection_p.h"

#include <QtCore/QPointer>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusPendingCallWatcher>
#include <QtDBus/QDBusPendingReply>
#include <QtDBus/QDBusServiceWatcher>

#include <atomic>
#include <memory>

namespace VeldDeviceLock
{

namespace
{

const QLatin1String daemonService("org.veldmobile.devicelock");
const QLatin1String socketAddress("unix:path=/run/veld-devicelock/socket");
const QLatin1String statePath("/devicelock/state");
const QLatin1String stateInterface("org.veldmobile.devicelock.State");
const QLatin1String getMethod("Get");
const QLatin1String changedMember("Changed");

QDBusConnection newPeer()
{
    static std::atomic<uint> count{0}; // over all threads
    return QDBusConnection::connectToPeer(socketAddress,
                                          QStringLiteral("org.veldmobile.devicelock.%1").arg(count++));
}

} // namespace

class DeviceLock::Private : public QObject
{
    Q_OBJECT

public:
    explicit Private(DeviceLock *deviceLock)
        : q(deviceLock)
        , daemonWatcher(daemonService, QDBusConnection::systemBus(),
                        QDBusServiceWatcher::WatchForRegistration)
        , connection(newPeer())
    {
        connect(&daemonWatcher, &QDBusServiceWatcher::serviceRegistered, this, [this] {
            if (connection.isConnected())
                connection.verify();
            else
                reconnect();
        });
        connect(&connection, &VeldDBus::Connection::lost, this, &Private::reconnect);
        connect(&connection, &VeldDBus::Connection::connected, this, &Private::follow);
        connect(&connection, &VeldDBus::Connection::disconnected, this, &Private::forget);
        follow();
    }

    DeviceLock *const q;
    LockState state = Undefined;

private Q_SLOTS:
    void announced(uint number)
    {
        // It is newer than an answer that is still to come, which may have been overtaken.
        answer.reset();
        setState(number);
    }

private:
    // The daemon's state on the wire.
    void setState(uint number)
    {
        const LockState newState = number < uint(Undefined) ? LockState(number) : Undefined;
        if (state == newState)
            return;
        state = newState;
        Q_EMIT q->stateChanged();
    }

    void reconnect()
    {
        // What the daemon before this one told is worth nothing, also when its end has not been noticed.
        const QPointer<Private> alive(this);
        forget();
        if (alive)
            connection.reconnect(newPeer());
    }

    void follow()
    {
        if (!connection.isConnected())
            return;
        QDBusConnection peer = connection.connection();
        connectDBusSignal(peer, {QString(), statePath, stateInterface, changedMember}, this,
                          SLOT(announced(uint)));
        answer = std::make_unique<QDBusPendingCallWatcher>(
            peer.asyncCall(QDBusMessage::createMethodCall(QString(), statePath, stateInterface, getMethod)));
        connect(answer.get(), &QDBusPendingCallWatcher::finished, this, [this] {
            const QDBusPendingReply<uint> reply = *answer;
            answer.release()->deleteLater();
            setState(reply.isError() ? uint(Undefined) : reply.value());
        });
    }

    void forget()
    {
        answer.reset();
        setState(Undefined);
    }

    QDBusServiceWatcher daemonWatcher;
    VeldDBus::Connection connection;
    std::unique_ptr<QDBusPendingCallWatcher> answer; // goes before the connection that it comes over
};

DeviceLock::DeviceLock(QObject *parent)
    : QObject(parent)
    , d(new Private(this))
{
}

DeviceLock::~DeviceLock()
{
    delete d;
}

DeviceLock::LockState DeviceLock::state() const
{
    return d->state;
}

} // namespace VeldDeviceLock

#include "velddevicelock.moc"
