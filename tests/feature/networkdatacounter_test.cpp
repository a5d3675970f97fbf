// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"
#include "waiting.h"

#include <corvanemdm/networkdatacounter.h>

#include <QtCore/QJsonArray>
#include <QtCore/QRegularExpression>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::NetworkDataCounter;

namespace
{

const QString Service = QStringLiteral("net.connman");
const QString Prefix = QStringLiteral("/net/connman/service/");
const QString Office = QStringLiteral("wifi_02c0ffee0001_436f7276616e65204f6666696365_managed_psk");
const QString Cellular = QStringLiteral("cellular_244051234567890_context1");

QStringList list(const char *text)
{
    return QString::fromUtf8(text).split(QLatin1Char('|'), Qt::SkipEmptyParts);
}

} // namespace

/** Counting data, by the reports that the connection manager really sends. */
class NetworkDataCounterTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void metaObject();
    void startsInactive();
    void invalidSettingsAreRefused();
    void settingsAreSignalledOnce();
    void registersWhileActive();
    void newSettingsHoldFromTheNextRegistration();
    void switchedOnWithoutTheConnectionManager();
    void isInactiveAfterARestart();
    void isReleased();
    void releasedIsNotUnregistered();
    void unregistersAtItsEnd();
    void twoCountersAreIndependent();

    void countsTraffic();
    void reports_data();
    void reports();
    void reportsWhileInactive();
    void resetsANetwork();
    void resetOfStrangePathsIsLogged();

    void offersWhatTheContractSays();
    void mayBeDeletedAtAReport();
    void queuedConnectionsDeliver();

private:
    void act(const char *action, const QStringList &arguments)
    {
        m_phone->act(QLatin1String(action), arguments);
    }
    void settle() { m_phone->settle(Service); }
    /** The calls on registrations, with N in place of the object's random number. */
    QStringList registrations();
    /** The paths of the counters that the connection manager knows. */
    QStringList registered() const;

    std::unique_ptr<Phone> m_phone;
};

void NetworkDataCounterTest::init()
{
    m_phone = std::make_unique<Phone>();
}

void NetworkDataCounterTest::cleanup()
{
    m_phone->clearFaults();
    m_phone->startService(Service);
    // Known again to whoever switches a counter on next.
    NetworkDataCounter counter;
    QVERIFY(waitUntil([&] {
        counter.setActive(true);
        return counter.active();
    }));
    counter.setActive(false);
    settle();
}

QStringList NetworkDataCounterTest::registrations()
{
    settle();
    const QRegularExpression number(QStringLiteral("(?<=NetworkDataCounter_)[0-9]+(?=')"));
    QStringList calls;
    const QStringList journal = m_phone->takeJournal(Service);
    for (QString call : journal) {
        if (call.contains(QLatin1String("registerCounter"), Qt::CaseInsensitive))
            calls.append(call.replace(number, QStringLiteral("N")));
    }
    return calls;
}

QStringList NetworkDataCounterTest::registered() const
{
    QStringList paths;
    const QJsonArray counters = m_phone->state()
                                    .value(QLatin1String("network"))
                                    .toObject()
                                    .value(QLatin1String("counters"))
                                    .toArray();
    for (const QJsonValue &counter : counters)
        paths.append(counter.toObject().value(QLatin1String("path")).toString());
    return paths;
}

void NetworkDataCounterTest::metaObject()
{
    const QMetaObject &meta = NetworkDataCounter::staticMetaObject;
    for (const char *name : {"updateInterval", "updateAccuracy", "active"}) {
        const QMetaProperty property = meta.property(meta.indexOfProperty(name));
        QVERIFY2(property.isReadable() && property.isWritable(), name);
        QCOMPARE(property.notifySignal().methodSignature(), QByteArray(name) + "Changed()");
        QCOMPARE(int(property.userType()), int(qstrcmp(name, "active") ? QMetaType::Int : QMetaType::Bool));
    }
    const auto types = QMetaEnum::fromType<NetworkDataCounter::NetworkType>();
    QCOMPARE(types.keyCount(), 3);
    QCOMPARE(types.keyToValue("MobileDataHome"), 0);
    QCOMPARE(types.keyToValue("MobileDataRoaming"), 1);
    QCOMPARE(types.keyToValue("Wlan"), 2);
}

void NetworkDataCounterTest::startsInactive()
{
    NetworkDataCounter counter;
    QCOMPARE(counter.updateInterval(), 60);
    QCOMPARE(counter.updateAccuracy(), 1024);
    QVERIFY(!counter.active());
    QCOMPARE(registrations(), QStringList());
}

void NetworkDataCounterTest::invalidSettingsAreRefused()
{
    NetworkDataCounter counter;
    SignalSequence seen(&counter);
    MessageLog log;
    counter.setUpdateInterval(0);
    counter.setUpdateInterval(-1);
    counter.setUpdateAccuracy(0);
    counter.setUpdateAccuracy(-5);
    QCOMPARE(log.takeWarnings(),
             list("Invalid update interval 0|Invalid update interval -1|Invalid update accuracy 0|"
                  "Invalid update accuracy -5"));
    QCOMPARE(counter.updateInterval(), 60);
    QCOMPARE(counter.updateAccuracy(), 1024);
    QCOMPARE(seen.take(), QStringList());
}

void NetworkDataCounterTest::settingsAreSignalledOnce()
{
    NetworkDataCounter counter;
    SignalSequence seen(&counter);
    for (int i = 0; i < 2; ++i) {
        counter.setUpdateInterval(1);
        QVERIFY(counter.setProperty("updateAccuracy", 2));
    }
    QCOMPARE(counter.property("updateInterval").toInt(), 1);
    QCOMPARE(counter.updateAccuracy(), 2);
    QCOMPARE(seen.take(), list("updateIntervalChanged()|updateAccuracyChanged()"));
}

void NetworkDataCounterTest::registersWhileActive()
{
    NetworkDataCounter counter;
    SignalSequence seen(&counter);
    counter.setActive(true); // right after construction
    counter.setActive(true);
    QVERIFY(counter.active());
    QCOMPARE(registrations(),
             list("/ RegisterCounter (objectpath "
                  "'/org/veldmobile/systemsettings/NetworkDataCounter_N', uint32 1024, "
                  "uint32 60)"));
    QCOMPARE(registered().size(), 1);
    counter.setActive(false);
    QVERIFY(!counter.active());
    QCOMPARE(registrations(),
             list("/ UnregisterCounter (objectpath "
                  "'/org/veldmobile/systemsettings/NetworkDataCounter_N',)"));
    QCOMPARE(registered().size(), 0);
    // Of the connected network there are reports as well.
    QCOMPARE(seen.take().filter(QStringLiteral("Changed()")), list("activeChanged()|activeChanged()"));
}

void NetworkDataCounterTest::newSettingsHoldFromTheNextRegistration()
{
    NetworkDataCounter counter;
    counter.setActive(true);
    registrations();
    counter.setUpdateInterval(5);
    counter.setUpdateAccuracy(7);
    QCOMPARE(registrations(), QStringList());
    counter.setActive(false);
    counter.setActive(true);
    QCOMPARE(registrations().last(),
             QStringLiteral("/ RegisterCounter (objectpath "
                            "'/org/veldmobile/systemsettings/NetworkDataCounter_N', uint32 7, uint32 5)"));
}

void NetworkDataCounterTest::switchedOnWithoutTheConnectionManager()
{
    NetworkDataCounter counter;
    SignalSequence seen(&counter);
    counter.setActive(true);
    m_phone->stopService(Service);
    QVERIFY(waitUntil([&] { return !counter.active(); }));
    seen.take();
    counter.setActive(true);
    QVERIFY(!counter.active());
    QCOMPARE(seen.take(), list("activeChanged()|activeChanged()"));
    // Nobody switches it on when the connection manager comes.
    m_phone->startService(Service);
    NetworkDataCounter later;
    QVERIFY(waitUntil([&] {
        later.setActive(true);
        return later.active();
    }));
    QVERIFY(!counter.active());
    QCOMPARE(seen.take(), QStringList());
}

void NetworkDataCounterTest::isInactiveAfterARestart()
{
    NetworkDataCounter counter;
    counter.setActive(true);
    settle();
    SignalSequence seen(&counter);
    m_phone->stopService(Service);
    QVERIFY(seen.waitFor(1));
    QVERIFY(!counter.active());
    QCOMPARE(seen.take(), list("activeChanged()"));
    m_phone->startService(Service);
    QVERIFY(waitUntil([&] {
        counter.setActive(true);
        return counter.active();
    }));
    settle();
    QCOMPARE(registered().size(), 1);
}

void NetworkDataCounterTest::isReleased()
{
    NetworkDataCounter counter;
    counter.setActive(true);
    settle();
    SignalSequence seen(&counter);
    act("counter release", {});
    QVERIFY(seen.waitFor(1));
    QVERIFY(!counter.active());
    QCOMPARE(seen.take(), list("activeChanged()"));
    registrations();
    // It registers anew, and a release that comes while it is inactive means nothing.
    counter.setActive(true);
    QCOMPARE(registrations().size(), 1);
    m_phone->swallowCalls(Service, QString(), QStringLiteral("UnregisterCounter"));
    counter.setActive(false);
    seen.take();
    act("counter release", {});
    settle();
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(!counter.active());
}

void NetworkDataCounterTest::releasedIsNotUnregistered()
{
    {
        NetworkDataCounter counter;
        counter.setActive(true);
        settle();
        act("counter release", {});
        QVERIFY(waitUntil([&] { return !counter.active(); }));
        counter.setActive(false);
        registrations();
    }
    QCOMPARE(registrations(), QStringList());
}

void NetworkDataCounterTest::unregistersAtItsEnd()
{
    {
        NetworkDataCounter active;
        NetworkDataCounter inactive;
        active.setActive(true);
        QCOMPARE(registrations().size(), 1);
    }
    QCOMPARE(registrations(),
             list("/ UnregisterCounter (objectpath "
                  "'/org/veldmobile/systemsettings/NetworkDataCounter_N',)"));
    QCOMPARE(registered(), QStringList());
}

void NetworkDataCounterTest::twoCountersAreIndependent()
{
    NetworkDataCounter first;
    NetworkDataCounter second;
    first.setActive(true);
    second.setActive(true);
    settle();
    const QStringList paths = registered();
    QCOMPARE(paths.size(), 2);
    QVERIFY(paths.first() != paths.last());
    first.setActive(false);
    QVERIFY(second.active());
    settle();
    QCOMPARE(registered(), QStringList(paths.last()));
}

void NetworkDataCounterTest::countsTraffic()
{
    NetworkDataCounter counter;
    counter.resetCounter(Prefix + Office);
    counter.setUpdateAccuracy(1);
    counter.setActive(true);
    settle();
    SignalSequence seen(&counter);
    act("connection traffic", {Office, QStringLiteral("3000"), QStringLiteral("0")});
    QVERIFY(waitUntil([&] {
        return seen.signalsSeen().contains(
            QStringLiteral("counterUpdate(%1 wlan tx:0 rx:3000 time:0)").arg(Office));
    }));
    // What has not changed is not reported again.
    act("connection traffic", {Office, QStringLiteral("0"), QStringLiteral("2000")});
    QVERIFY(waitUntil([&] {
        return !seen.signalsSeen()
                    .filter(QRegularExpression(QStringLiteral("wlan tx:2000 rx:0 time:[0-9]+\\)$")))
                    .isEmpty();
    }));
}

void NetworkDataCounterTest::reports_data()
{
    QTest::addColumn<QString>("path");
    QTest::addColumn<QString>("home");
    QTest::addColumn<QString>("roaming");
    QTest::addColumn<QStringList>("updates");
    const auto row = [](const char *name, const QString &path, const char *home, const char *roaming,
                        const char *updates) {
        QTest::newRow(name) << path << QString::fromLatin1(home) << QString::fromLatin1(roaming)
                            << list(updates);
    };
    const QString cellular = Prefix + Cellular;
    const QString wifi = Prefix + QStringLiteral("wifi_1_2_managed_psk");
    row("home", cellular, "{'TX.Bytes': <uint64 1>, 'RX.Bytes': <uint64 2>, 'Time': <uint64 3>}", "{}",
        "cellular_244051234567890_context1 home tx:1 rx:2 time:3");
    row("roaming", cellular, "{}", "{'TX.Bytes': <uint64 1>}",
        "cellular_244051234567890_context1 roaming tx:1 rx:0 time:0");
    row("both, home first", cellular, "{'RX.Bytes': <uint64 2>}", "{'Time': <uint64 3>}",
        "cellular_244051234567890_context1 home tx:0 rx:2 time:0|"
        "cellular_244051234567890_context1 roaming tx:0 rx:0 time:3");
    row("both are zero", cellular, "{'RX.Bytes': <uint64 0>}", "{'Time': <uint64 0>, 'TX.Bytes': <uint64 0>}",
        "");
    row("nothing", cellular, "{}", "{}", "");
    row("other numbers", cellular, "{'RX.Packets': <uint64 2>, 'TX.Errors': <uint64 1>}", "{}", "");
    row("wireless", wifi, "{'TX.Bytes': <uint64 1>}", "{'TX.Bytes': <uint64 2>}",
        "wifi_1_2_managed_psk wlan tx:1 rx:0 time:0");
    row("wireless, zero", wifi, "{'TX.Bytes': <uint64 0>}", "{'TX.Bytes': <uint64 2>}", "");
    row("wireless, nothing", wifi, "{}", "{}", "");
    row("a cable", Prefix + QStringLiteral("ethernet_1_cable"), "{'TX.Bytes': <uint64 1>}",
        "{'TX.Bytes': <uint64 2>}", "");
    row("a tunnel", Prefix + QStringLiteral("vpn_1"), "{'TX.Bytes': <uint64 1>}", "{}", "");
    row("no network", QStringLiteral("/"), "{'TX.Bytes': <uint64 1>}", "{}", "");
    row("a short path", QStringLiteral("/cellular_1"), "{'TX.Bytes': <uint64 1>}", "{}", "");
    // The numbers of daemons are of several types, and of 64 bits at most.
    row("32 bits", wifi, "{'TX.Bytes': <uint32 4294967295>, 'RX.Bytes': <uint32 5>}", "{}",
        "wifi_1_2_managed_psk wlan tx:4294967295 rx:5 time:0");
    row("16 and 8 bits", wifi, "{'TX.Bytes': <uint16 65535>, 'RX.Bytes': <byte 255>}", "{}",
        "wifi_1_2_managed_psk wlan tx:65535 rx:255 time:0");
    row("the largest", wifi, "{'TX.Bytes': <uint64 18446744073709551615>}", "{}",
        "wifi_1_2_managed_psk wlan tx:18446744073709551615 rx:0 time:0");
    row("no numbers", wifi,
        "{'TX.Bytes': <'1'>, 'RX.Bytes': <[uint64 1]>, 'Time': <true>, 'Other': <@a{sv} {}>}", "{}", "");
    row("signed and broken ones", wifi, "{'TX.Bytes': <-1>, 'RX.Bytes': <1.5>, 'Time': <int64 7>}", "{}", "");
    row("one that is none among others", wifi, "{'TX.Bytes': <'1'>, 'RX.Bytes': <uint64 9>}", "{}",
        "wifi_1_2_managed_psk wlan tx:0 rx:9 time:0");
}

void NetworkDataCounterTest::reports()
{
    QFETCH(QString, path);
    QFETCH(QString, home);
    QFETCH(QString, roaming);
    NetworkDataCounter counter;
    counter.setActive(true);
    settle();
    SignalSequence seen(&counter);
    act("counter usage", {path, home, roaming});
    settle();
    QStringList updates = seen.take();
    // That a second has passed is told of the connected network at any time.
    updates = updates.filter(QRegularExpression(QStringLiteral("^(?!.*%1)").arg(Office)));
    for (QString &update : updates)
        update = update.mid(int(qstrlen("counterUpdate(")), update.size() - int(qstrlen("counterUpdate()")));
    QTEST(updates, "updates");
}

void NetworkDataCounterTest::reportsWhileInactive()
{
    NetworkDataCounter counter;
    counter.setActive(true);
    settle();
    m_phone->swallowCalls(Service, QString(), QStringLiteral("UnregisterCounter"));
    counter.setActive(false);
    SignalSequence seen(&counter);
    // What is still on its way counts.
    act("counter usage",
        {Prefix + Cellular, QStringLiteral("{'RX.Bytes': <uint64 2>}"), QStringLiteral("{}")});
    settle();
    QCOMPARE(seen.take().filter(Cellular),
             QStringList(QStringLiteral("counterUpdate(%1 home tx:0 rx:2 time:0)").arg(Cellular)));
}

void NetworkDataCounterTest::resetsANetwork()
{
    const auto received = [this] {
        const QJsonArray services = m_phone->state()
                                        .value(QLatin1String("network"))
                                        .toObject()
                                        .value(QLatin1String("services"))
                                        .toArray();
        for (const QJsonValue &service : services) {
            if (service.toObject().value(QLatin1String("identifier")) == Office) {
                return service.toObject()
                    .value(QLatin1String("dataHome"))
                    .toObject()
                    .value(QLatin1String("received"))
                    .toInt();
            }
        }
        return -1;
    };
    act("connection traffic", {Office, QStringLiteral("50"), QStringLiteral("1")});
    QVERIFY(received() >= 50);
    m_phone->takeJournal(Service);
    NetworkDataCounter counter;
    counter.resetCounter(Prefix + Office);
    counter.resetCounter(Prefix + Office);
    settle();
    QCOMPARE(received(), 0);
    QCOMPARE(m_phone->takeJournalWithInterfaces(Service),
             QStringList({Prefix + Office + QStringLiteral(" net.connman.Service.ResetCounters ()"),
                          Prefix + Office + QStringLiteral(" net.connman.Service.ResetCounters ()")}));
}

void NetworkDataCounterTest::resetOfStrangePathsIsLogged()
{
    NetworkDataCounter counter;
    MessageLog log;
    for (const char *path : {"/net/connman/service/wifi_nowhere", "wifi_without_slash"}) {
        counter.resetCounter(QString::fromLatin1(path));
        settle();
        QVERIFY(log.takeWarnings().last().startsWith(
            QStringLiteral("The connection manager refused \"ResetCounters\" of \"%1\"")
                .arg(QString::fromLatin1(path))));
    }
    m_phone->stopService(Service);
    QVERIFY(waitUntil([&] {
        counter.setActive(true);
        return !counter.active();
    }));
    counter.resetCounter(Prefix + Office);
    QCOMPARE(log.takeWarnings().size(), 1);
}

void NetworkDataCounterTest::offersWhatTheContractSays()
{
    NetworkDataCounter counter;
    counter.setActive(true);
    settle();
    QDBusMessage call = QDBusMessage::createMethodCall(
        QDBusConnection::systemBus().baseService(), registered().value(0),
        QStringLiteral("org.freedesktop.DBus.Introspectable"), QStringLiteral("Introspect"));
    const QString offered = QDBusConnection::systemBus().call(call).arguments().value(0).toString();
    QVERIFY(offered.contains(QLatin1String("<interface name=\"net.connman.Counter\">")));
    QVERIFY(offered.contains(QLatin1String("<method name=\"Release\"")));
    QRegularExpression usage(QStringLiteral("<method name=\"Usage\">.*type=\"o\".*type=\"a\\{sv\\}\".*"
                                            "type=\"a\\{sv\\}\".*</method>"),
                             QRegularExpression::DotMatchesEverythingOption);
    QVERIFY2(usage.match(offered).hasMatch(), qPrintable(offered));
}

void NetworkDataCounterTest::mayBeDeletedAtAReport()
{
    auto *counter = new NetworkDataCounter;
    counter->setActive(true);
    settle();
    int updates = 0;
    connect(counter, &NetworkDataCounter::counterUpdate, this, [&] {
        ++updates;
        delete counter;
    });
    act("counter usage",
        {Prefix + Cellular, QStringLiteral("{'RX.Bytes': <uint64 2>}"),
         QStringLiteral("{'RX.Bytes': <uint64 2>}")});
    QVERIFY(waitUntil([&] { return updates > 0; }));
    settle();
    QCOMPARE(updates, 1);
    QCOMPARE(registered(), QStringList());

    auto *released = new NetworkDataCounter;
    released->setActive(true);
    settle();
    bool isDeleted = false;
    connect(released, &NetworkDataCounter::activeChanged, this, [&] {
        isDeleted = true;
        delete released;
    });
    act("counter release", {});
    QVERIFY(waitUntil([&] { return isDeleted; }));
}

void NetworkDataCounterTest::queuedConnectionsDeliver()
{
    NetworkDataCounter counter;
    counter.setActive(true);
    settle();
    QString identifier;
    connect(
        &counter, &NetworkDataCounter::counterUpdate, this,
        [&](const NetworkDataCounter::Update &update) { identifier = update.identifier; },
        Qt::QueuedConnection);
    QSignalSpy spy(&counter, SIGNAL(counterUpdate(NetworkDataCounter::Update)));
    act("counter usage",
        {Prefix + Cellular, QStringLiteral("{'RX.Bytes': <uint64 2>}"), QStringLiteral("{}")});
    QVERIFY(waitUntil([&] { return identifier == Cellular; }));
    QCOMPARE(spy.last().first().value<NetworkDataCounter::Update>().rxBytes, quint64(2));
}

QTEST_GUILESS_MAIN(NetworkDataCounterTest)

#include "networkdatacounter_test.moc"
