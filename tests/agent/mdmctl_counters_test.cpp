// SPDX-License-Identifier: LGPL-2.1-or-later
#include "mdmctl.h"
#include "phone.h"
#include "waiting.h"

#include <QtCore/QJsonArray>
#include <QtTest/QtTest>

#include <csignal>

namespace
{

const QString Service = QStringLiteral("net.connman");
const QString Office = QStringLiteral("wifi_02c0ffee0001_436f7276616e65204f6666696365_managed_psk");

Mdmctl::Result run(const char *arguments)
{
    return Mdmctl::run(QString::fromUtf8(arguments).split(QLatin1Char(' ')));
}

} // namespace

class MdmctlCountersTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void cleanup();

    void watchTellsTraffic();
    void watchAsJson();
    void watchStartsWithTheRegistration();
    void watchThatIsRefused();
    void watchEndsWithARelease();
    void watchEndsWithTheService();
    void resetCountsAnew();
    void resetOfAnUnknownNetwork();
    void wrongUsage_data();
    void wrongUsage();
    void absentServiceIsTold();

private:
    void act(const char *action, const QStringList &arguments = {})
    {
        m_phone.act(QLatin1String(action), arguments);
    }

    /** How many the connection manager knows. */
    int registeredCounters() const;

    Phone m_phone;
};

void MdmctlCountersTest::cleanup()
{
    m_phone.clearFaults();
    m_phone.startService(Service);
}

int MdmctlCountersTest::registeredCounters() const
{
    return m_phone.state()
        .value(QLatin1String("network"))
        .toObject()
        .value(QLatin1String("counters"))
        .toArray()
        .size();
}

void MdmctlCountersTest::watchTellsTraffic()
{
    run(qPrintable(QStringLiteral("counters reset ") + Office));
    Mdmctl watch({QStringLiteral("counters"), QStringLiteral("watch"), QStringLiteral("--accuracy"),
                  QStringLiteral("1"), QStringLiteral("--interval"), QStringLiteral("60")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Counting data.")));
    act("connection traffic", {Office, QStringLiteral("3145728"), QStringLiteral("2048")});
    QVERIFY(watch.waitForOutput(Office + QStringLiteral(" (wlan): 3.0 MiB received (")));
    watch.interrupt(SIGINT);
    const Mdmctl::Result watched = watch.finish();
    QCOMPARE(watched.errors, QString());
    QCOMPARE(watched.status, 0);
    QVERIFY(watched.output.contains(QStringLiteral("2.0 KiB sent (")));
    // It goes from the connection manager as well, which may hear of it later than this test.
    QVERIFY(waitUntil([this] {
        m_phone.settle(Service);
        return registeredCounters() == 0;
    }));
}

void MdmctlCountersTest::watchAsJson()
{
    Mdmctl watch({QStringLiteral("counters"), QStringLiteral("watch"), QStringLiteral("--json")});
    QVERIFY(watch.waitForOutput(QStringLiteral("\"watching\"")));
    act("counter usage",
        {QStringLiteral("/net/connman/service/cellular_1_context1"),
         QStringLiteral("{'RX.Bytes': <uint64 1000>, 'TX.Bytes': <uint64 10>, 'Time': <uint64 7>}"),
         QStringLiteral("{'RX.Bytes': <uint64 5>}")});
    QVERIFY(watch.waitForOutput(QStringLiteral("\"roaming\"")));
    watch.interrupt(SIGINT);
    const Mdmctl::Result watched = watch.finish();
    QVector<QJsonObject> usage;
    const QVector<QJsonObject> lines = watched.jsonLines();
    for (const QJsonObject &line : lines) {
        if (line.value(QLatin1String("network")).toString() == QLatin1String("cellular_1_context1"))
            usage.append(line);
    }
    QCOMPARE(usage.size(), 2);
    QCOMPARE(usage.at(0).value(QLatin1String("event")).toString(), QStringLiteral("usage"));
    QCOMPARE(usage.at(0).value(QLatin1String("kind")).toString(), QStringLiteral("home"));
    QCOMPARE(usage.at(0).value(QLatin1String("received")).toInt(), 1000);
    QCOMPARE(usage.at(0).value(QLatin1String("sent")).toInt(), 10);
    QCOMPARE(usage.at(0).value(QLatin1String("seconds")).toInt(), 7);
    QCOMPARE(usage.at(1).value(QLatin1String("kind")).toString(), QStringLiteral("roaming"));
}

void MdmctlCountersTest::watchStartsWithTheRegistration()
{
    // Both ways to say so: who reads it may count on every byte from then on.
    for (const bool asJson : {false, true}) {
        Mdmctl watch(QStringList{QStringLiteral("counters"), QStringLiteral("watch")}
                     + (asJson ? QStringList(QStringLiteral("--json")) : QStringList()));
        QVERIFY(
            watch.waitForOutput(asJson ? QStringLiteral("\"watching\"") : QStringLiteral("Counting data.")));
        QCOMPARE(registeredCounters(), 1);
        // Reports come after it, also those that the registration itself brings.
        QVERIFY(watch.waitForOutput(asJson ? QStringLiteral("\"usage\"") : Office));
        watch.interrupt(SIGINT);
        const QStringList lines = watch.finish().output.split(QLatin1Char('\n'));
        QVERIFY2(
            lines.first().contains(asJson ? QStringLiteral("watching") : QStringLiteral("Counting data.")),
            qPrintable(lines.first()));
        QCOMPARE(lines.filter(asJson ? QStringLiteral("watching") : QStringLiteral("Counting data.")).size(),
                 1);
        QVERIFY(waitUntil([this] {
            m_phone.settle(Service);
            return registeredCounters() == 0;
        }));
    }
}

void MdmctlCountersTest::watchThatIsRefused()
{
    m_phone.failCalls(Service, QStringLiteral("/"), QStringLiteral("RegisterCounter"),
                      QStringLiteral("net.connman.Error.AlreadyExists"), QStringLiteral("Already exists"));
    const Mdmctl::Result refused = run("counters watch");
    QCOMPARE(refused.output, QString());
    QCOMPARE(refused.status, 1);
    QVERIFY2(
        refused.errors.startsWith(QLatin1String("mdmctl: the connection manager (net.connman) refused: ")),
        qPrintable(refused.errors));
}

void MdmctlCountersTest::watchEndsWithARelease()
{
    Mdmctl watch({QStringLiteral("counters"), QStringLiteral("watch")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Counting data.")));
    act("counter release");
    const Mdmctl::Result watched = watch.finish();
    QCOMPARE(watched.status, 1);
    QCOMPARE(watched.errors,
             QStringLiteral("mdmctl: the connection manager (net.connman) has dropped the counter\n"));
}

void MdmctlCountersTest::watchEndsWithTheService()
{
    Mdmctl watch({QStringLiteral("counters"), QStringLiteral("watch")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Counting data.")));
    m_phone.stopService(Service);
    const Mdmctl::Result watched = watch.finish();
    QCOMPARE(watched.status, 3);
    QCOMPARE(watched.errors, QStringLiteral("mdmctl: the connection manager (net.connman) is not running\n"));
}

void MdmctlCountersTest::resetCountsAnew()
{
    act("connection traffic", {Office, QStringLiteral("1000"), QStringLiteral("1")});
    const Mdmctl::Result reset = run(qPrintable(QStringLiteral("counters reset --json ") + Office));
    QCOMPARE(reset.status, 0);
    QCOMPARE(reset.json().value(QLatin1String("reset")).toArray(), QJsonArray{Office});
    const QJsonArray services = m_phone.state()
                                    .value(QLatin1String("network"))
                                    .toObject()
                                    .value(QLatin1String("services"))
                                    .toArray();
    for (const QJsonValue &service : services) {
        if (service[QLatin1String("identifier")].toString() == Office)
            QCOMPARE(service[QLatin1String("dataHome")][QLatin1String("received")].toInt(), 0);
    }
}

void MdmctlCountersTest::resetOfAnUnknownNetwork()
{
    const Mdmctl::Result reset = run("counters reset wifi_nowhere");
    QCOMPARE(reset.status, 1);
    QVERIFY2(reset.errors.startsWith(QLatin1String("mdmctl: the connection manager (net.connman) refused: ")),
             qPrintable(reset.errors));
}

void MdmctlCountersTest::wrongUsage_data()
{
    QTest::addColumn<QString>("arguments");
    QTest::addColumn<QString>("error");
    QTest::newRow("interval") << "counters watch --interval 0"
                              << "mdmctl: --interval \"0\": must be a whole number, 1 or more\n";
    QTest::newRow("accuracy") << "counters watch --accuracy much"
                              << "mdmctl: --accuracy \"much\": must be a whole number, 1 or more\n";
    QTest::newRow("a name") << "counters reset Corvane/Office"
                            << "mdmctl: NETWORK \"Corvane/Office\": must be an identifier, as \"mdmctl proxy "
                               "list\" shows them\n";
}

void MdmctlCountersTest::wrongUsage()
{
    QFETCH(QString, arguments);
    const Mdmctl::Result result = run(qPrintable(arguments));
    QCOMPARE(result.status, 2);
    QTEST(result.errors, "error");
}

void MdmctlCountersTest::absentServiceIsTold()
{
    m_phone.stopService(Service);
    for (const char *arguments : {"counters watch", "counters reset wifi_1"}) {
        const Mdmctl::Result result = run(arguments);
        QCOMPARE(result.status, 3);
        QCOMPARE(result.errors,
                 QStringLiteral("mdmctl: the connection manager (net.connman) is not running\n"));
    }
}

QTEST_GUILESS_MAIN(MdmctlCountersTest)

#include "mdmctl_counters_test.moc"
