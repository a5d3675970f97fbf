// SPDX-License-Identifier: LGPL-2.1-or-later
#include "ofonoobject_p.h"
#include "signalconnection_p.h"

#include <QtCore/QPointer>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusServiceWatcher>

#include <limits>

namespace
{

const QLatin1String serviceName("org.ofono");

// A modem's driver may take its time; the end of the service ends the wait.
constexpr int noTimeout = std::numeric_limits<int>::max();

} // namespace

QSharedPointer<OfonoService> OfonoService::instance()
{
    return sharedInThread<OfonoService>([] { return new OfonoService; });
}

OfonoService::OfonoService()
{
    const QDBusConnection bus = QDBusConnection::systemBus();
    auto *watcher = new QDBusServiceWatcher(serviceName, bus, QDBusServiceWatcher::WatchForOwnerChange, this);
    connect(watcher, &QDBusServiceWatcher::serviceOwnerChanged, this,
            [this](const QString &, const QString &, const QString &newOwner) { setOwner(newOwner); });

    // Asked of the bus itself rather than through QDBusConnectionInterface, which would wait.
    QDBusMessage call = QDBusMessage::createMethodCall(
        QStringLiteral("org.freedesktop.DBus"), QStringLiteral("/org/freedesktop/DBus"),
        QStringLiteral("org.freedesktop.DBus"), QStringLiteral("GetNameOwner"));
    call.setArguments({QString(serviceName)});
    auto *answer = new QDBusPendingCallWatcher(bus.asyncCall(call), this);
    connect(answer, &QDBusPendingCallWatcher::finished, this, [this](QDBusPendingCallWatcher *finished) {
        finished->deleteLater();
        const QDBusPendingReply<QString> reply = *finished;
        if (!reply.isError())
            setOwner(reply.value());
    });
}

void OfonoService::setOwner(const QString &owner)
{
    if (owner == m_owner)
        return;
    const QPointer<OfonoService> alive(this);
    if (!m_owner.isEmpty()) {
        m_owner.clear();
        Q_EMIT ownerChanged();
    }
    if (alive && !owner.isEmpty()) {
        m_owner = owner;
        Q_EMIT ownerChanged();
    }
}

OfonoObject::OfonoObject(const QString &path, QLatin1String interface, QObject *parent)
    : QObject(parent)
    , m_service(OfonoService::instance())
    , m_path(path)
    , m_interface(interface)
{
}

void OfonoObject::follow(const char *member, QObject *receiver, const char *slot)
{
    m_connections.append({member, receiver, slot});
}

void OfonoObject::start()
{
    connect(m_service.data(), &OfonoService::ownerChanged, this, &OfonoObject::ownerChanged);
    ownerChanged();
}

void OfonoObject::ownerChanged()
{
    if (m_owner == m_service->owner())
        return;
    disconnectSignals();
    m_owner = m_service->owner();
    if (m_owner.isEmpty()) {
        m_answers.reset();
        Q_EMIT serviceLeft();
    } else {
        m_answers = std::make_unique<QObject>();
        connectSignals();
        Q_EMIT serviceAppeared();
    }
}

void OfonoObject::connectSignals()
{
    const QDBusConnection bus = QDBusConnection::systemBus();
    for (const Connection &each : qAsConst(m_connections))
        connectDBusSignal(bus, {m_owner, m_path, m_interface, QLatin1String(each.member)}, each.receiver,
                          each.slot);
}

void OfonoObject::disconnectSignals()
{
    if (m_owner.isEmpty())
        return;
    const QDBusConnection bus = QDBusConnection::systemBus();
    for (const Connection &each : qAsConst(m_connections))
        disconnectDBusSignal(bus, {m_owner, m_path, m_interface, QLatin1String(each.member)}, each.receiver,
                             each.slot);
}

QDBusPendingCall OfonoObject::send(QLatin1String method) const
{
    return QDBusConnection::systemBus().asyncCall(
        QDBusMessage::createMethodCall(m_owner, m_path, m_interface, method), noTimeout);
}

void OfonoObject::forgetCalls()
{
    if (m_answers)
        m_answers = std::make_unique<QObject>();
}
