// SPDX-License-Identifier: LGPL-2.1-or-later
#include "simsofphone.h"

#include "service.h"

#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusMetaType>
#include <QtDBus/QDBusPendingCallWatcher>
#include <QtDBus/QDBusPendingReply>

namespace Corvane
{
namespace Agent
{

struct Modem {
    QDBusObjectPath path;
    QVariantMap properties;
};

static QDBusArgument &operator<<(QDBusArgument &argument, const Modem &modem)
{
    argument.beginStructure();
    argument << modem.path << modem.properties;
    argument.endStructure();
    return argument;
}

static const QDBusArgument &operator>>(const QDBusArgument &argument, Modem &modem)
{
    argument.beginStructure();
    argument >> modem.path >> modem.properties;
    argument.endStructure();
    return argument;
}

} // namespace Agent
} // namespace Corvane

Q_DECLARE_METATYPE(Corvane::Agent::Modem)

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String managerInterface("org.ofono.Manager");
const QLatin1String modemInterface("org.ofono.Modem");
const QLatin1String simInterface("org.ofono.SimManager");
const QLatin1String identity("SubscriberIdentity");
const QLatin1String present("Present");

QDBusPendingCall call(const QString &path, const QString &interface, const QString &method)
{
    const QDBusMessage message
        = QDBusMessage::createMethodCall(Service::telephony().name, path, interface, method);
    return QDBusConnection::systemBus().asyncCall(message);
}

} // namespace

SimsOfPhone::SimsOfPhone(QObject *parent)
    : QObject(parent)
{
    qDBusRegisterMetaType<Modem>();
    qDBusRegisterMetaType<QList<Modem>>();

    const auto follow = [this](const QString &interface, const char *signal, const char *slot) {
        // Without a path: the modems come and go.
        QDBusConnection::systemBus().connect(Service::telephony().name, QString(), interface,
                                             QLatin1String(signal), this, slot);
    };
    follow(managerInterface, "ModemAdded", SLOT(modemAdded(QDBusObjectPath)));
    follow(managerInterface, "ModemRemoved", SLOT(modemRemoved(QDBusObjectPath)));
    follow(modemInterface, "PropertyChanged",
           SLOT(modemPropertyChanged(QString, QDBusVariant, QDBusMessage)));
    follow(simInterface, "PropertyChanged", SLOT(simPropertyChanged(QString, QDBusVariant, QDBusMessage)));
    askForModems();
}

bool SimsOfPhone::isReady() const
{
    return m_modemsKnown && m_asked.isEmpty();
}

QString SimsOfPhone::error() const
{
    return m_error;
}

QStringList SimsOfPhone::imsis() const
{
    QStringList known = m_imsiOfModem.values();
    known.removeAll(QString());
    return known;
}

void SimsOfPhone::askForModems()
{
    auto *watcher = new QDBusPendingCallWatcher(
        call(QStringLiteral("/"), managerInterface, QStringLiteral("GetModems")), this);
    connect(watcher, &QDBusPendingCallWatcher::finished, this, [this, watcher] {
        watcher->deleteLater();
        const QDBusPendingReply<QList<Modem>> reply = *watcher;
        m_modemsKnown = true;
        if (reply.isError()) {
            m_error = reply.error().message();
        } else {
            const QList<Modem> modems = reply.value();
            for (const Modem &modem : modems)
                askForSim(modem.path.path());
        }
        Q_EMIT changed();
    });
}

void SimsOfPhone::askForSim(const QString &modem)
{
    auto *watcher
        = new QDBusPendingCallWatcher(call(modem, simInterface, QStringLiteral("GetProperties")), this);
    m_asked.insert(modem, watcher);
    connect(watcher, &QDBusPendingCallWatcher::finished, this, [this, watcher, modem] {
        watcher->deleteLater();
        if (m_asked.value(modem) != watcher)
            return;
        m_asked.remove(modem);
        // A modem without power has no SIM interface; it is as good as one without a SIM.
        const QDBusPendingReply<QVariantMap> reply = *watcher;
        const QVariantMap properties = reply.isError() ? QVariantMap() : reply.value();
        const bool inserted = properties.value(present).toBool();
        setImsi(modem, inserted ? properties.value(identity).toString() : QString());
    });
}

void SimsOfPhone::setImsi(const QString &modem, const QString &imsi)
{
    m_imsiOfModem.insert(modem, imsi);
    Q_EMIT changed();
}

void SimsOfPhone::modemAdded(const QDBusObjectPath &path)
{
    askForSim(path.path());
}

void SimsOfPhone::modemRemoved(const QDBusObjectPath &path)
{
    m_asked.remove(path.path());
    m_imsiOfModem.remove(path.path());
    Q_EMIT changed();
}

void SimsOfPhone::modemPropertyChanged(const QString &name, const QDBusVariant &, const QDBusMessage &message)
{
    if (name == QLatin1String("Interfaces"))
        askForSim(message.path());
}

void SimsOfPhone::simPropertyChanged(const QString &name, const QDBusVariant &value,
                                     const QDBusMessage &message)
{
    if (name == identity)
        setImsi(message.path(), value.variant().toString());
    else if (name == present)
        askForSim(message.path());
}

} // namespace Agent
} // namespace Corvane
