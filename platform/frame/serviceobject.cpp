// SPDX-License-Identifier: LGPL-2.1-or-later
#include "serviceobject_p.h"

#include <QtCore/QHash>
#include <QtCore/QPointer>
#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusServiceWatcher>

#include <limits>

namespace
{

const QLatin1String listSignature("a(oa{sv})");

// A modem's driver may take its time; the end of the service ends the wait.
constexpr int noTimeout = std::numeric_limits<int>::max();

} // namespace

std::optional<QVector<ListedObject>> listedObjects(const QDBusMessage &message, int index)
{
    const QVariant value = message.arguments().value(index);
    if (value.userType() != qMetaTypeId<QDBusArgument>())
        return std::nullopt;
    const auto list = value.value<QDBusArgument>();
    if (list.currentSignature() != listSignature)
        return std::nullopt;

    QVector<ListedObject> objects;
    list.beginArray();
    while (!list.atEnd()) {
        QDBusObjectPath path;
        QVariantMap properties;
        list.beginStructure();
        list >> path >> properties;
        list.endStructure();
        objects.append({path.path(), properties});
    }
    list.endArray();
    return objects;
}

QSharedPointer<ServiceOwner> ServiceOwner::of(const QString &service)
{
    static QThreadStorage<QHash<QString, QWeakPointer<ServiceOwner>>> instances;
    QWeakPointer<ServiceOwner> &known = instances.localData()[service];
    QSharedPointer<ServiceOwner> instance = known.toStrongRef();
    if (!instance) {
        instance.reset(new ServiceOwner(service));
        known = instance;
    }
    return instance;
}

ServiceOwner::ServiceOwner(const QString &service)
    : m_service(service)
{
    const QDBusConnection bus = QDBusConnection::systemBus();
    auto *watcher = new QDBusServiceWatcher(service, bus, QDBusServiceWatcher::WatchForOwnerChange, this);
    // Receivers of ours may destroy the watcher, which must not have anything left to signal then.
    connect(watcher, &QDBusServiceWatcher::serviceOwnerChanged, this,
            [this](const QString &, const QString &oldOwner, const QString &newOwner) {
                m_nextOwner = newOwner;
                if (!oldOwner.isEmpty() && !newOwner.isEmpty())
                    setOwner(newOwner);
            });
    const auto takeNextOwner = [this] {
        setOwner(QString(m_nextOwner));
    };
    connect(watcher, &QDBusServiceWatcher::serviceRegistered, this, takeNextOwner);
    connect(watcher, &QDBusServiceWatcher::serviceUnregistered, this, takeNextOwner);

    CallAnswer::follow(bus, question(), this, [this](const QDBusMessage &answer) {
        const QDBusPendingReply<QString> reply = answer;
        if (!reply.isError())
            setOwner(reply.value());
    });
}

/** Asked of the bus itself rather than through QDBusConnectionInterface, which would wait. */
QDBusMessage ServiceOwner::question() const
{
    QDBusMessage call = QDBusMessage::createMethodCall(
        QStringLiteral("org.freedesktop.DBus"), QStringLiteral("/org/freedesktop/DBus"),
        QStringLiteral("org.freedesktop.DBus"), QStringLiteral("GetNameOwner"));
    call.setArguments({m_service});
    return call;
}

void ServiceOwner::waitUntilKnown()
{
    const QDBusMessage reply = QDBusConnection::systemBus().call(question());
    if (reply.type() == QDBusMessage::ReplyMessage)
        setOwner(reply.arguments().value(0).toString());
}

void ServiceOwner::setOwner(const QString &owner)
{
    if (owner == m_owner)
        return;
    const QPointer<ServiceOwner> alive(this);
    if (!m_owner.isEmpty()) {
        m_owner.clear();
        Q_EMIT ownerChanged();
    }
    if (alive && !owner.isEmpty()) {
        m_owner = owner;
        Q_EMIT ownerChanged();
    }
}

ServiceObject::ServiceObject(const QString &service, const QString &path, QLatin1String interface,
                             QObject *parent)
    : QObject(parent)
    , m_service(ServiceOwner::of(service))
    , m_path(path)
    , m_interface(interface)
{
}

void ServiceObject::follow(const char *member, QObject *receiver, const char *slot)
{
    m_connections.append({member, receiver, slot});
}

void ServiceObject::start()
{
    connect(m_service.data(), &ServiceOwner::ownerChanged, this, &ServiceObject::ownerChanged);
    ownerChanged();
}

void ServiceObject::ownerChanged()
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

DBusSignal ServiceObject::signalOf(const Connection &connection) const
{
    return {m_owner, m_path, m_interface, QLatin1String(connection.member)};
}

void ServiceObject::connectSignals()
{
    const QDBusConnection bus = QDBusConnection::systemBus();
    for (const Connection &each : qAsConst(m_connections))
        connectDBusSignal(bus, signalOf(each), each.receiver, each.slot);
}

void ServiceObject::disconnectSignals()
{
    if (m_owner.isEmpty())
        return;
    const QDBusConnection bus = QDBusConnection::systemBus();
    for (const Connection &each : qAsConst(m_connections))
        disconnectDBusSignal(bus, signalOf(each), each.receiver, each.slot);
}

void ServiceObject::send(const QString &path, QLatin1String method, const QVariantList &arguments,
                         const CallAnswer::Handler &handler) const
{
    QDBusMessage call = QDBusMessage::createMethodCall(m_owner, path, m_interface, method);
    call.setArguments(arguments);
    CallAnswer::follow(QDBusConnection::systemBus(), call, m_answers.get(), handler, noTimeout);
}

void ServiceObject::forgetCalls()
{
    if (m_answers)
        m_answers = std::make_unique<QObject>();
}
