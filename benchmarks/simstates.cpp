// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/siminfo.h>

#include <benchmark/benchmark.h>

#include <QtCore/QEventLoop>
#include <QtCore/QMap>
#include <QtCore/QPointer>
#include <QtCore/QStringList>
#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusPendingCallWatcher>
#include <QtDBus/QDBusVariant>

#include <functional>

using Corvane::Mdm::SimInfo;

namespace
{

const QString Service = QStringLiteral("org.ofono");
const QString ModemManager = QStringLiteral("org.veldmobile.ofono.ModemManager");
const QString SimInfoInterface = QStringLiteral("org.veldmobile.ofono.SimInfo");

QDBusMessage control(const QString &method, const QVariantList &arguments)
{
    QDBusMessage call = QDBusMessage::createMethodCall(
        QStringLiteral("org.corvaneos.simulator"), QStringLiteral("/org/corvaneos/simulator"),
        QStringLiteral("org.corvaneos.simulator.Control"), method);
    call.setArguments(arguments);
    return QDBusConnection::systemBus().call(call);
}

/** Leaves the phone, which has eight slots, with @p count modems. */
void keepModems(int count)
{
    constexpr int slots = 8;
    for (int slot = 0; slot < slots; ++slot) {
        control(QStringLiteral("Act"),
                {slot < count ? QStringLiteral("modem add") : QStringLiteral("modem remove"),
                 QStringList(QString::number(slot))});
    }
}

/** Calls that the telephony service received while @p measured ran; introspection counts. */
template <typename Measured> int callsDuring(Measured measured)
{
    control(QStringLiteral("ClearJournal"), {});
    measured();
    const QDBusMessage journal = control(QStringLiteral("Journal"), {quint64(0)});
    const auto entries = journal.arguments().constFirst().value<QDBusArgument>();
    int calls = 0;
    entries.beginArray();
    while (!entries.atEnd()) {
        quint64 number = 0;
        QString text;
        QString service;
        entries.beginStructure();
        entries >> number >> number >> service;
        while (!entries.atEnd())
            entries >> text;
        entries.endStructure();
        calls += service == Service ? 1 : 0;
    }
    entries.endArray();
    return calls;
}

} // namespace

/**
 * The least that comes to the same states: it asks for what the states are made of and nothing else, follows
 * all that can change, and waits for nothing that it need not wait for.
 */
class HandWrittenStates : public QObject
{
    Q_OBJECT

public:
    HandWrittenStates()
    {
        follow(QStringLiteral("/"), QStringLiteral("org.ofono.Manager"), "ModemAdded",
               SLOT(changed(QDBusMessage)));
        follow(QStringLiteral("/"), QStringLiteral("org.ofono.Manager"), "ModemRemoved",
               SLOT(changed(QDBusMessage)));
        for (const char *signal : {"AvailableModemsChanged", "EnabledModemsChanged", "PresentSimsChanged",
                                   "DefaultVoiceSimChanged", "DefaultDataSimChanged", "ReadyChanged"})
            follow(QStringLiteral("/"), ModemManager, signal, SLOT(changed(QDBusMessage)));
        ask(QStringLiteral("/"), QStringLiteral("org.ofono.Manager"), "GetModems", {});
        ask(QStringLiteral("/"), ModemManager, "GetInterfaceVersion", [this](const QDBusMessage &) {
            for (const char *method : {"GetEnabledModems", "GetPresentSims", "GetDefaultVoiceSim",
                                       "GetDefaultDataSim", "GetReady"})
                ask(QStringLiteral("/"), ModemManager, method, {});
            ask(QStringLiteral("/"), ModemManager, "GetAvailableModems", [this](const QDBusMessage &reply) {
                const auto paths = qdbus_cast<QList<QDBusObjectPath>>(reply.arguments().constFirst());
                for (const QDBusObjectPath &path : paths)
                    takeUp(path.path());
            });
        });
    }

    bool isComplete() const { return m_unanswered == 0; }

Q_SIGNALS:
    void complete();

private Q_SLOTS:
    void changed(const QDBusMessage &) { }

private:
    using Take = std::function<void(const QDBusMessage &reply)>;

    void takeUp(const QString &path)
    {
        const QString modem = QStringLiteral("org.ofono.Modem");
        const QString registration = QStringLiteral("org.ofono.NetworkRegistration");
        for (const char *interface : {"org.ofono.Modem", "org.ofono.SimManager"}) {
            follow(path, QLatin1String(interface), "PropertyChanged", SLOT(changed(QDBusMessage)));
        }
        for (const char *signal :
             {"CardIdentifierChanged", "SubscriberIdentityChanged", "ServiceProviderNameChanged"})
            follow(path, SimInfoInterface, signal, SLOT(changed(QDBusMessage)));
        ask(path, modem, "GetProperties", [this, path, registration](const QDBusMessage &reply) {
            const auto properties = qdbus_cast<QVariantMap>(reply.arguments().constFirst());
            if (!properties.value(QStringLiteral("Interfaces")).toStringList().contains(registration))
                return;
            follow(path, registration, "PropertyChanged", SLOT(changed(QDBusMessage)));
            ask(path, registration, "GetProperties", {});
        });
        ask(path, QStringLiteral("org.ofono.SimManager"), "GetProperties", {});
        for (const char *method : {"GetCardIdentifier", "GetSubscriberIdentity", "GetServiceProviderName"})
            ask(path, SimInfoInterface, method, {});
    }

    void follow(const QString &path, const QString &interface, const char *signal, const char *slot)
    {
        QDBusConnection::systemBus().connect(Service, path, interface, QLatin1String(signal), this, slot);
    }

    void ask(const QString &path, const QString &interface, const char *method, const Take &take)
    {
        ++m_unanswered;
        auto *watcher = new QDBusPendingCallWatcher(
            QDBusConnection::systemBus().asyncCall(
                QDBusMessage::createMethodCall(Service, path, interface, QLatin1String(method))),
            this);
        connect(watcher, &QDBusPendingCallWatcher::finished, this, [this, take, watcher] {
            const QDBusMessage reply = watcher->reply();
            watcher->deleteLater();
            m_values.append(reply.arguments());
            if (take)
                take(reply);
            if (--m_unanswered == 0)
                Q_EMIT complete();
        });
    }

    QVariantList m_values;
    int m_unanswered = 0;
};

namespace
{

bool isComplete(const SimInfo &info, int modems)
{
    const QList<SimInfo::SimState> states = info.simSlotStates();
    int complete = 0;
    for (const SimInfo::SimState &state : states)
        complete += state.networkRegistration == SimInfo::Registered ? 1 : 0;
    return complete == modems;
}

void takeStatesByTheLibrary(int modems)
{
    const SimInfo info;
    QEventLoop loop;
    QObject::connect(&info, &SimInfo::simStateChanged, &loop, [&] {
        if (isComplete(info, modems))
            loop.quit();
    });
    loop.exec();
}

void takeStatesByHand(int)
{
    const HandWrittenStates states;
    QEventLoop loop;
    QObject::connect(&states, &HandWrittenStates::complete, &loop, &QEventLoop::quit);
    loop.exec();
}

void takeStates(benchmark::State &state, void (*take)(int))
{
    const int modems = int(state.range(0));
    keepModems(modems);
    state.counters["calls"] = callsDuring([&] { take(modems); });
    for (auto _ : state)
        take(modems);
}

} // namespace

BENCHMARK_CAPTURE(takeStates, library, takeStatesByTheLibrary)
    ->Name("states/library")
    ->Arg(1)
    ->Arg(2)
    ->Arg(8)
    ->UseRealTime()
    ->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(takeStates, QtDBus, takeStatesByHand)
    ->Name("states/QtDBus")
    ->Arg(1)
    ->Arg(2)
    ->Arg(8)
    ->UseRealTime()
    ->Unit(benchmark::kMicrosecond);

#include "simstates.moc"
