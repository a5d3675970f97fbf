// SPDX-License-Identifier: LGPL-2.1-or-later
#include "phone.h"

#include "waiting.h"

#include <QtCore/QDebug>
#include <QtCore/QJsonDocument>
#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusConnectionInterface>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusMetaType>
#include <QtDBus/QDBusPendingCallWatcher>
#include <QtDBus/QDBusVariant>

namespace
{

struct JournalEntry {
    quint64 number = 0;
    quint64 time = 0;
    QString service;
    QString sender;
    QString path;
    QString interface;
    QString member;
    QString signature;
    QString arguments;
};

const QDBusArgument &operator>>(const QDBusArgument &in, JournalEntry &entry)
{
    in.beginStructure();
    in >> entry.number >> entry.time >> entry.service >> entry.sender >> entry.path
        >> entry.interface >> entry.member >> entry.signature >> entry.arguments;
    in.endStructure();
    return in;
}

QVariant asVariants(const QVariantList &arguments)
{
    QList<QDBusVariant> variants;
    for (const QVariant &argument : arguments)
        variants.append(QDBusVariant(argument));
    return QVariant::fromValue(variants);
}

} // namespace

Phone::Phone()
{
    qDBusRegisterMetaType<QList<QDBusVariant>>();
    const QVariantList entries = control(QStringLiteral("Journal"), {quint64(0)});
    QList<JournalEntry> journal;
    qvariant_cast<QDBusArgument>(entries.first()) >> journal;
    if (!journal.isEmpty())
        m_journalPosition = journal.last().number;
}

Phone::~Phone()
{
    letAnswersGo();
}

void Phone::stopService(const QString &service)
{
    control(QStringLiteral("StopService"), {service});
}

void Phone::startService(const QString &service)
{
    control(QStringLiteral("StartService"), {service});
}

void Phone::failCalls(const QString &service, const QString &path, const QString &member,
                      const QString &error, const QString &message)
{
    setFault(service, path, member, QStringLiteral("error"),
             {{QStringLiteral("error"), error}, {QStringLiteral("message"), message}});
}

void Phone::failCall(int number, const QString &service, const QString &path, const QString &member,
                     const QString &error, const QString &message)
{
    setFault(service, path, member, QStringLiteral("error"),
             {{QStringLiteral("error"), error},
              {QStringLiteral("message"), message},
              {QStringLiteral("times"), 1u}});
    letCallsPass(number - 1, service, path, member);
}

void Phone::letCallsPass(int count, const QString &service, const QString &path, const QString &member)
{
    if (count > 0)
        setFault(service, path, member, QStringLiteral("late"),
                 {{QStringLiteral("delay"), 0u}, {QStringLiteral("times"), uint(count)}});
}

void Phone::answerCalls(const QString &service, const QString &path, const QString &member,
                        const QVariantList &arguments)
{
    setFault(service, path, member, QStringLiteral("reply"),
             {{QStringLiteral("arguments"), asVariants(arguments)}});
}

void Phone::delayCalls(const QString &service, const QString &path, const QString &member, uint milliseconds)
{
    setFault(service, path, member, QStringLiteral("late"), {{QStringLiteral("delay"), milliseconds}});
}

void Phone::swallowCalls(const QString &service, const QString &path, const QString &member)
{
    setFault(service, path, member, QStringLiteral("never"), {});
}

void Phone::clearFaults()
{
    control(QStringLiteral("ClearFaults"));
}

void Phone::sendSignal(const QString &service, const QString &path, const QString &interface,
                       const QString &member, const QVariantList &arguments)
{
    control(QStringLiteral("EmitSignal"), {service, path, interface, member, asVariants(arguments)});
}

void Phone::emitSignal(const QString &service, const QString &path, const QString &interface,
                       const QString &member, const QVariantList &arguments)
{
    sendSignal(service, path, interface, member, arguments);
    settle(service);
}

void Phone::forgeSignal(const QString &service, const QString &path, const QString &interface,
                        const QString &member, const QVariantList &arguments)
{
    static const QDBusConnection stranger
        = QDBusConnection::connectToBus(QDBusConnection::SystemBus, QStringLiteral("stranger"));
    QDBusMessage signal = QDBusMessage::createSignal(path, interface, member);
    signal.setArguments(arguments);
    if (!stranger.send(signal) || !stranger.interface()->isServiceRegistered(service))
        qFatal("a stranger cannot emit %s", qPrintable(member));
    settle(service);
}

void Phone::settle(const QString &service)
{
    // The first answer means that all earlier calls are in the service's queue, the second that the queue has
    // been worked off, and the last that what came of it has arrived here.
    ping(service);
    control(QStringLiteral("Services"));
    ping(service);
}

QStringList Phone::takeJournal(const QString &service)
{
    return takeJournal(QStringList(service), false);
}

QStringList Phone::takeJournal(const QStringList &services)
{
    return takeJournal(services, false);
}

QStringList Phone::takeJournalWithInterfaces(const QString &service)
{
    return takeJournal(QStringList(service), true);
}

QStringList Phone::takeJournal(const QStringList &services, bool withInterfaces)
{
    QList<JournalEntry> journal;
    qvariant_cast<QDBusArgument>(control(QStringLiteral("Journal"), {m_journalPosition}).first()) >> journal;
    QStringList calls;
    for (const JournalEntry &entry : qAsConst(journal)) {
        m_journalPosition = entry.number;
        if (!services.contains(entry.service)
            || entry.interface.startsWith(QLatin1String("org.freedesktop.DBus")))
            continue;
        m_lastSignature = entry.signature;
        const QString member
            = withInterfaces ? entry.interface + QLatin1Char('.') + entry.member : entry.member;
        calls.append(entry.path + QLatin1Char(' ') + member + QLatin1Char(' ') + entry.arguments);
    }
    return calls;
}

void Phone::act(const QString &action, const QStringList &arguments)
{
    control(QStringLiteral("Act"), {action, arguments});
}

QJsonObject Phone::state() const
{
    return QJsonDocument::fromJson(control(QStringLiteral("State")).first().toString().toUtf8()).object();
}

void Phone::ping(const QString &service) const
{
    QDBusPendingCallWatcher watcher(QDBusConnection::systemBus().asyncCall(QDBusMessage::createMethodCall(
        service, QStringLiteral("/"), QStringLiteral("org.freedesktop.DBus.Peer"), QStringLiteral("Ping"))));
    // Not isFinished(): that is true as soon as QtDBus's thread has the answer, while the signal comes
    // through the event loop of this one, after all that arrived before.
    bool finished = false;
    QObject::connect(&watcher, &QDBusPendingCallWatcher::finished, [&finished] { finished = true; });
    if (!waitUntil([&finished] { return finished; }))
        qFatal("%s does not answer", qPrintable(service));
}

QVariantList Phone::control(const QString &method, const QVariantList &arguments) const
{
    QDBusMessage call = QDBusMessage::createMethodCall(
        QStringLiteral("org.corvaneos.simulator"), QStringLiteral("/org/corvaneos/simulator"),
        QStringLiteral("org.corvaneos.simulator.Control"), method);
    call.setArguments(arguments);
    const QDBusMessage reply = QDBusConnection::systemBus().call(call);
    if (reply.type() != QDBusMessage::ReplyMessage)
        qFatal("The simulated phone refused %s: %s (run the test inside corvane-simulator)",
               qPrintable(method), qPrintable(reply.errorMessage()));
    return reply.arguments();
}

void Phone::setFault(const QString &service, const QString &path, const QString &member, const QString &kind,
                     const QVariantMap &options)
{
    control(QStringLiteral("SetFault"), {service, path, QString(), member, kind, options});
}
