// SPDX-License-Identifier: LGPL-2.1-or-later
#include "client.h"

#include "waiting.h"

#include <QtCore/QUuid>
#include <QtCore/QXmlStreamReader>
#include <QtDBus/QDBusMetaType>
#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusPendingCall>
#include <QtDBus/QDBusPendingCallWatcher>
#include <QtDBus/QDBusVariant>

namespace
{

QString textOf(const QVariant &value);

QString textOf(const QDBusArgument &argument)
{
    QStringList parts;
    switch (argument.currentType()) {
    case QDBusArgument::ArrayType:
        argument.beginArray();
        while (!argument.atEnd())
            parts << textOf(argument.asVariant());
        argument.endArray();
        return QLatin1Char('[') + parts.join(QLatin1String(", ")) + QLatin1Char(']');
    case QDBusArgument::StructureType:
        argument.beginStructure();
        while (!argument.atEnd())
            parts << textOf(argument.asVariant());
        argument.endStructure();
        return QLatin1Char('(') + parts.join(QLatin1String(", ")) + QLatin1Char(')');
    case QDBusArgument::MapType:
        argument.beginMap();
        while (!argument.atEnd()) {
            argument.beginMapEntry();
            const QString key = textOf(argument.asVariant());
            parts << key + QLatin1Char('=') + textOf(argument.asVariant());
            argument.endMapEntry();
        }
        argument.endMap();
        return QLatin1Char('{') + parts.join(QLatin1String(", ")) + QLatin1Char('}');
    default:
        return textOf(argument.asVariant());
    }
}

QString textOf(const QVariant &value)
{
    if (value.userType() == qMetaTypeId<QDBusArgument>())
        return textOf(qvariant_cast<QDBusArgument>(value));
    if (value.userType() == qMetaTypeId<QDBusVariant>())
        return QLatin1Char('<') + textOf(qvariant_cast<QDBusVariant>(value).variant()) + QLatin1Char('>');
    if (value.userType() == qMetaTypeId<QDBusObjectPath>())
        return qvariant_cast<QDBusObjectPath>(value).path();
    if (value.userType() == QMetaType::QStringList)
        return QLatin1Char('[') + value.toStringList().join(QLatin1String(", ")) + QLatin1Char(']');
    return value.toString();
}

QString textOf(const QVariantList &values)
{
    QStringList parts;
    for (const QVariant &value : values)
        parts << textOf(value);
    return QLatin1Char('(') + parts.join(QLatin1String(", ")) + QLatin1Char(')');
}

} // namespace

Client::Client(const QString &peerAddress)
    : m_connectionName(QUuid::createUuid().toString())
    , m_isPeer(true)
    , m_connection(QDBusConnection::connectToPeer(peerAddress, m_connectionName))
{
}

Client::Client(Connection connection)
    : m_connectionName(connection == Own ? QUuid::createUuid().toString() : QString())
    , m_isPeer(false)
    , m_connection(connection == Own
                       ? QDBusConnection::connectToBus(QDBusConnection::SystemBus, m_connectionName)
                       : QDBusConnection::systemBus())
{
    qDBusRegisterMetaType<WireRule>();
    qDBusRegisterMetaType<WireRules>();
    qDBusRegisterMetaType<QList<QDBusVariant>>();
}

Client::~Client()
{
    // What is still on its way over the shared connection would be the next client's.
    if (m_connectionName.isEmpty()) {
        for (const QString &service : qAsConst(m_watched))
            takeSignals(service);
    }
    // QtDBus corrupts memory when a connection is closed under a call that is still waited for.
    qDeleteAll(findChildren<QDBusPendingCallWatcher *>());
    if (m_isPeer)
        QDBusConnection::disconnectFromPeer(m_connectionName);
    else if (!m_connectionName.isEmpty())
        QDBusConnection::disconnectFromBus(m_connectionName);
    letAnswersGo();
}

QString Client::uniqueName() const
{
    return m_connection.baseService();
}

QDBusMessage Client::call(const QString &service, const QString &path, const QString &interface,
                          const QString &member, const QVariantList &arguments) const
{
    QDBusMessage message = QDBusMessage::createMethodCall(service, path, interface, member);
    message.setArguments(arguments);
    return callOver(m_connection, message);
}

QDBusMessage Client::callOver(const QDBusConnection &connection, const QDBusMessage &message)
{
    QDBusPendingCallWatcher watcher(connection.asyncCall(message));
    // Not isFinished(), which is true as soon as QtDBus's thread has the answer: signals that came before it
    // must not stay behind.
    bool finished = false;
    connect(&watcher, &QDBusPendingCallWatcher::finished, &watcher, [&finished] { finished = true; });
    waitUntil([&finished] { return finished; });
    return watcher.reply();
}

QDBusMessage Client::control(const QString &member, const QVariantList &arguments) const
{
    QDBusMessage message = QDBusMessage::createMethodCall(
        QStringLiteral("org.corvaneos.simulator"), QStringLiteral("/org/corvaneos/simulator"),
        QStringLiteral("org.corvaneos.simulator.Control"), member);
    message.setArguments(arguments);
    return callOver(m_isPeer ? QDBusConnection::systemBus() : m_connection, message);
}

void Client::send(const QString &service, const QString &path, const QString &interface,
                  const QString &member, const QVariantList &arguments) const
{
    QDBusMessage message = QDBusMessage::createMethodCall(service, path, interface, member);
    message.setArguments(arguments);
    m_connection.send(message);
}

void Client::callAndNote(const QString &service, const QString &path, const QString &interface,
                         const QString &member, const QVariantList &arguments)
{
    QDBusMessage message = QDBusMessage::createMethodCall(service, path, interface, member);
    message.setArguments(arguments);
    // Not with a watcher: when the answer is there before the watcher is, it tells of it one turn of the
    // event loop late, after signals that came later.
    if (!m_connection.callWithCallback(message, this, SLOT(noteAnswer()), SLOT(noteError(QDBusError))))
        qFatal("cannot call %s", qPrintable(member));
}

void Client::watch(const QString &service, const QString &path, const QString &interface,
                   const QStringList &members)
{
    m_watched.insert(service);
    for (const QString &member : members) {
        if (!m_connection.connect(service, path, interface, member, this, SLOT(note(QDBusMessage))))
            qFatal("cannot watch %s", qPrintable(member));
    }
}

bool Client::waitForSignals(int count) const
{
    return waitUntil([&] { return m_signals.size() >= count; });
}

QStringList Client::takeSignals(const QString &service)
{
    const auto ping = [&] {
        call(service, QStringLiteral("/"), QStringLiteral("org.freedesktop.DBus.Peer"),
             QStringLiteral("Ping"));
    };
    // Pings are answered past the queue in which calls wait for the services; the control interface shares
    // that.
    ping();
    control(QStringLiteral("Services"));
    ping();
    return std::exchange(m_signals, {});
}

void Client::note(const QDBusMessage &signal)
{
    m_signals << signal.member() + textOf(signal.arguments());
}

void Client::noteAnswer()
{
    m_signals << QStringLiteral("answer");
}

void Client::noteError(const QDBusError &error)
{
    m_signals << error.name();
}

QVariant boxed(const QVariantList &values)
{
    QList<QDBusVariant> boxes;
    for (const QVariant &value : values)
        boxes << QDBusVariant(value);
    return QVariant::fromValue(boxes);
}

QStringList membersOf(const QByteArray &xml, const QString &interface)
{
    QStringList members;
    bool isWanted = false;
    QXmlStreamReader reader(xml);
    while (!reader.atEnd()) {
        if (reader.readNext() != QXmlStreamReader::StartElement)
            continue;
        const QXmlStreamAttributes attributes = reader.attributes();
        if (reader.name() == QLatin1String("node")) {
            isWanted = false;
        } else if (reader.name() == QLatin1String("interface")) {
            isWanted = attributes.value(QLatin1String("name")) == interface;
        } else if (isWanted && reader.name() == QLatin1String("arg")) {
            members.last()
                += QStringLiteral(" %1:%2:%3")
                       .arg(attributes.value(QLatin1String("direction")),
                            attributes.value(QLatin1String("type")), attributes.value(QLatin1String("name")));
        } else if (isWanted) {
            members << reader.name() + QLatin1Char(' ') + attributes.value(QLatin1String("name"));
        }
    }
    return members;
}

QString textOf(const QDBusMessage &message)
{
    if (message.type() == QDBusMessage::ErrorMessage)
        return message.errorName() + QStringLiteral(": ") + message.errorMessage();
    return QStringLiteral("reply") + textOf(message.arguments());
}
