// SPDX-License-Identifier: LGPL-2.1-or-later
#include "ofonobus.h"

#include "phone.h"
#include "waiting.h"

#include <QtCore/QJsonArray>
#include <QtCore/QJsonObject>
#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMetaType>
#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusPendingCallWatcher>
#include <QtDBus/QDBusVariant>

#include <utility>

namespace
{

QString toText(const QVariant &value)
{
    QStringList parts;
    if (value.userType() == qMetaTypeId<QDBusObjectPath>())
        return value.value<QDBusObjectPath>().path();
    if (value.userType() == qMetaTypeId<QDBusVariant>())
        return toText(value.value<QDBusVariant>().variant());
    if (value.userType() == QMetaType::QStringList) {
        parts = value.toStringList();
    } else if (value.userType() == qMetaTypeId<QDBusArgument>()) {
        const auto argument = value.value<QDBusArgument>();
        if (argument.currentSignature() == QLatin1String("ao")) {
            const auto paths = qdbus_cast<QList<QDBusObjectPath>>(argument);
            for (const QDBusObjectPath &path : paths)
                parts << path.path();
        } else if (argument.currentSignature() == QLatin1String("ab")) {
            const auto flags = qdbus_cast<QList<bool>>(argument);
            for (const bool flag : flags)
                parts << QVariant(flag).toString();
        }
    } else {
        return value.toString();
    }
    return QLatin1Char('[') + parts.join(QLatin1Char(' ')) + QLatin1Char(']');
}

} // namespace

QDBusMessage OfonoBus::call(const char *path, const char *interface, const char *member,
                            const QVariantList &arguments)
{
    QDBusMessage message = QDBusMessage::createMethodCall(QLatin1String(service), QLatin1String(path),
                                                          QLatin1String(interface), QLatin1String(member));
    message.setArguments(arguments);
    // Signals that come before the answer have to be seen before it. Not isFinished(), which is true as soon
    // as QtDBus's thread has the answer.
    QDBusPendingCallWatcher watcher(QDBusConnection::systemBus().asyncCall(message));
    bool finished = false;
    QObject::connect(&watcher, &QDBusPendingCallWatcher::finished, [&finished] { finished = true; });
    if (!waitUntil([&finished] { return finished; }))
        qFatal("%s at %s is not answered", member, path);
    return watcher.reply();
}

QString OfonoBus::answer(const char *path, const char *interface, const char *member,
                         const QVariantList &arguments)
{
    const QDBusMessage reply = call(path, interface, member, arguments);
    return reply.type() == QDBusMessage::ErrorMessage ? QStringLiteral("error ") + reply.errorName()
                                                      : toText(reply.arguments());
}

QVariantMap OfonoBus::properties(const char *path, const char *interface)
{
    const QDBusMessage reply = call(path, interface, "GetProperties");
    return reply.type() == QDBusMessage::ReplyMessage
        ? qdbus_cast<QVariantMap>(reply.arguments().constFirst())
        : QVariantMap();
}

QString OfonoBus::toText(const QVariantList &arguments)
{
    QStringList texts;
    for (const QVariant &argument : arguments)
        texts << ::toText(argument);
    return texts.join(QLatin1Char(' '));
}

QVariant OfonoBus::objectPaths(const QStringList &paths)
{
    QList<QDBusObjectPath> list;
    for (const QString &path : paths)
        list << QDBusObjectPath(path);
    return QVariant::fromValue(list);
}

void OfonoBus::restoreModems(Phone &phone)
{
    static const QStringList cards{QStringLiteral("244051234567890"), QStringLiteral("262021234567891")};
    phone.startService(QLatin1String(service));
    const QJsonArray sims = phone.state().value(QLatin1String("sims")).toArray();
    for (int slot = 0; slot < cards.size(); ++slot) {
        const QString number = QString::number(slot);
        const QJsonObject sim = sims.at(slot).toObject();
        const bool isOwn = sim.value(QLatin1String("imsi")).toString() == cards.at(slot);
        bool isPresent = sim.value(QLatin1String("present")).toBool();
        if (isPresent && !isOwn) {
            phone.act(QStringLiteral("sim pull"), {number});
            isPresent = false;
        }
        if (!isPresent)
            phone.act(QStringLiteral("sim insert"), {number, cards.at(slot)});
        phone.act(QStringLiteral("sim lock"), {number, QStringLiteral("none")});
        phone.act(QStringLiteral("network"), {number, QStringLiteral("registered")});
    }
    call("/", modemManagerInterface, "SetEnabledModems",
         {objectPaths({QStringLiteral("/ril_0"), QStringLiteral("/ril_1")})});
    call("/", modemManagerInterface, "SetDefaultVoiceSim", {QString()});
    call("/", modemManagerInterface, "SetDefaultDataSim", {QString()});
    for (const char *path : {"/ril_0", "/ril_1"}) {
        for (const char *property : {"Powered", "Online"}) {
            call(path, modemInterface, "SetProperty",
                 {QString::fromLatin1(property), QVariant::fromValue(QDBusVariant(true))});
        }
    }
}

OfonoSignals::OfonoSignals(const QStringList &interfaces)
{
    qDBusRegisterMetaType<QList<bool>>();
    for (const QString &interface : interfaces) {
        if (!QDBusConnection::systemBus().connect(QLatin1String(OfonoBus::service), QString(), interface,
                                                  QString(), this, SLOT(record(QDBusMessage))))
            qFatal("Cannot listen to %s", qPrintable(interface));
    }
}

QStringList OfonoSignals::take()
{
    return std::exchange(m_seen, {});
}

bool OfonoSignals::waitFor(const QString &signal)
{
    return waitUntil([this, &signal] { return m_seen.contains(signal); });
}

void OfonoSignals::record(const QDBusMessage &signal)
{
    m_seen << (signal.path() + QLatin1Char(' ') + signal.member() + QLatin1Char(' ')
               + OfonoBus::toText(signal.arguments()))
                  .trimmed();
}
