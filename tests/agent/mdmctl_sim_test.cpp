// SPDX-License-Identifier: LGPL-2.1-or-later
#include "mdmctl.h"
#include "phone.h"

#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtTest/QtTest>

#include <csignal>

namespace
{

const QString Service = QStringLiteral("org.ofono");

Mdmctl::Result run(const char *arguments)
{
    return Mdmctl::run(QString::fromUtf8(arguments).split(QLatin1Char(' ')));
}

QJsonObject json(const char *text)
{
    return QJsonDocument::fromJson(text).object();
}

} // namespace

class MdmctlSimTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void cleanup();

    void listsTheSlots();
    void listsAsJson();
    void listsWhatIsWrong();
    void queries_data();
    void queries();
    void queryOfNothing();
    void watchTellsChanges();
    void watchAsJson();
    void watchEndsWithTheService();
    void stockServiceIsTold();
    void serviceThatIsNotReadyEndsTheWait();
    void absentServiceIsTold();

private:
    void act(const char *action, const QStringList &arguments)
    {
        m_phone.act(QLatin1String(action), arguments);
    }

    Phone m_phone;
};

void MdmctlSimTest::cleanup()
{
    m_phone.clearFaults();
    m_phone.startService(Service);
}

void MdmctlSimTest::listsTheSlots()
{
    const Mdmctl::Result listed = run("sim list");
    QCOMPARE(listed.errors, QString());
    QCOMPARE(
        listed.output,
        QStringLiteral("MODEM   STATE       USE          IMSI             ICCID                PROVIDER      "
                       "NUMBERS\n"
                       "/ril_0  registered  calls, data  244051234567890  8935805100000012345  Elo Mobile    "
                       "+358401234567\n"
                       "/ril_1  registered               262021234567891  8949020000000067891  Tarn Telecom  "
                       "+4915112345678\n"));
    QCOMPARE(listed.status, 0);
}

void MdmctlSimTest::listsAsJson()
{
    act("network", {QStringLiteral("1"), QStringLiteral("roaming")});
    const QJsonObject listed = run("sim list --json").json();
    act("network", {QStringLiteral("1"), QStringLiteral("registered")});
    QCOMPARE(listed.value(QLatin1String("sims")).toArray().size(), 2);
    QCOMPARE(listed.value(QLatin1String("sims")).toArray().at(1).toObject(),
             json(R"({"modem": "/ril_1", "present": true, "voice": false, "data": false, "enabled": true,
                      "pin": "none", "registration": "roaming", "imsi": "262021234567891",
                      "iccid": "8949020000000067891", "provider": "Tarn Telecom",
                      "numbers": ["+4915112345678"]})"));
}

void MdmctlSimTest::listsWhatIsWrong()
{
    act("sim lock", {QStringLiteral("0"), QStringLiteral("puk")});
    act("sim pull", {QStringLiteral("1")});
    QCOMPARE(run("sim list").output,
             QStringLiteral("MODEM   STATE         USE          ICCID\n"
                            "/ril_0  PUK required  calls, data  8935805100000012345\n"
                            "/ril_1  no SIM\n"));
    act("modem disable", {QStringLiteral("1")});
    QVERIFY(run("sim list").output.contains(QStringLiteral("/ril_1  off\n")));
    act("modem enable", {QStringLiteral("1")});
    act("sim insert", {QStringLiteral("1")});
    act("sim lock", {QStringLiteral("0"), QStringLiteral("none")});
}

void MdmctlSimTest::queries_data()
{
    QTest::addColumn<QString>("table");
    QTest::addColumn<QByteArray>("slots");
    QTest::newRow("imei") << "SLOT  IMEI\n0     358240051111100\n1     358240051111101\n"
                          << QByteArray(R"({"slots": [{"slot": 0, "value": "358240051111100"},
                                                      {"slot": 1, "value": "358240051111101"}]})");
    QTest::newRow("imsi") << "SLOT  IMSI\n0     244051234567890\n1     262021234567891\n"
                          << QByteArray(R"({"slots": [{"slot": 0, "value": "244051234567890"},
                                                      {"slot": 1, "value": "262021234567891"}]})");
    QTest::newRow("iccid") << "SLOT  ICCID\n0     8935805100000012345\n1     8949020000000067891\n"
                           << QByteArray(R"({"slots": [{"slot": 0, "value": "8935805100000012345"},
                                                       {"slot": 1, "value": "8949020000000067891"}]})");
    QTest::newRow("numbers") << "SLOT  NUMBERS\n0     +358401234567\n1     +4915112345678\n"
                             << QByteArray(R"({"slots": [{"slot": 0, "value": "+358401234567"},
                                                         {"slot": 1, "value": "+4915112345678"}]})");
}

void MdmctlSimTest::queries()
{
    QFETCH(QString, table);
    QFETCH(QByteArray, slots);
    const QString query = QString::fromLatin1(QTest::currentDataTag());
    const Mdmctl::Result shown = Mdmctl::run({QStringLiteral("sim"), query});
    QCOMPARE(shown.errors, QString());
    QCOMPARE(shown.output, table);
    QCOMPARE(shown.status, 0);
    QCOMPARE(Mdmctl::run({QStringLiteral("sim"), query, QStringLiteral("--json")}).json(), json(slots));
}

void MdmctlSimTest::queryOfNothing()
{
    act("sim pull", {QStringLiteral("0")});
    QCOMPARE(run("sim imsi").output, QStringLiteral("SLOT  IMSI\n1     262021234567891\n"));
    act("sim pull", {QStringLiteral("1")});
    const Mdmctl::Result shown = run("sim imsi");
    QCOMPARE(shown.output, QStringLiteral("No slot tells it.\n"));
    QCOMPARE(shown.status, 0);
    QCOMPARE(run("sim imsi --json").json(), json(R"({"slots": []})"));
    act("sim insert", {QStringLiteral("0")});
    act("sim insert", {QStringLiteral("1")});
}

void MdmctlSimTest::watchTellsChanges()
{
    Mdmctl watch({QStringLiteral("sim"), QStringLiteral("watch")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching the SIMs.\n")));
    act("sim pull", {QStringLiteral("1")});
    QVERIFY(watch.waitForOutput(QStringLiteral("  /ril_1: no SIM\n")));
    act("sim insert", {QStringLiteral("1")});
    QVERIFY(watch.waitForOutput(QStringLiteral("  /ril_1: registered, 262021234567891\n")));
    act("network", {QStringLiteral("0"), QStringLiteral("searching")});
    QVERIFY(watch.waitForOutput(QStringLiteral("  /ril_0: searching, 244051234567890, calls, data\n")));
    act("network", {QStringLiteral("0"), QStringLiteral("registered")});
    QVERIFY(watch.waitForOutput(QStringLiteral("  /ril_0: registered, 244051234567890, calls, data\n")));
    watch.interrupt(SIGINT);
    QCOMPARE(watch.finish().status, 0);
}

void MdmctlSimTest::watchAsJson()
{
    Mdmctl watch({QStringLiteral("sim"), QStringLiteral("watch"), QStringLiteral("--json")});
    QVERIFY(watch.waitForOutput(QStringLiteral("\"watching\"")));
    act("network", {QStringLiteral("0"), QStringLiteral("denied")});
    QVERIFY(watch.waitForOutput(QStringLiteral("\"denied\"")));
    act("network", {QStringLiteral("0"), QStringLiteral("registered")});
    QVERIFY(watch.waitForOutput(QStringLiteral("\"registered\"")));
    watch.interrupt(SIGTERM);
    const QVector<QJsonObject> lines = watch.finish().jsonLines();
    QCOMPARE(lines.size(), 3);
    QCOMPARE(lines.at(0).value(QLatin1String("event")).toString(), QStringLiteral("watching"));
    QCOMPARE(lines.at(1).value(QLatin1String("event")).toString(), QStringLiteral("simChanged"));
    QCOMPARE(lines.at(1).value(QLatin1String("modem")).toString(), QStringLiteral("/ril_0"));
    QVERIFY(lines.at(1).contains(QStringLiteral("time")));
}

void MdmctlSimTest::watchEndsWithTheService()
{
    Mdmctl watch({QStringLiteral("sim"), QStringLiteral("watch")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching the SIMs.\n")));
    m_phone.stopService(Service);
    const Mdmctl::Result ended = watch.finish();
    QCOMPARE(ended.errors, QStringLiteral("mdmctl: the telephony service (org.ofono) is not running\n"));
    QCOMPARE(ended.status, 3);
}

void MdmctlSimTest::stockServiceIsTold()
{
    act("phone extensions", {QStringLiteral("off")});
    for (const char *command : {"sim list", "sim imsi", "sim watch"}) {
        const Mdmctl::Result told = run(command);
        QCOMPARE(told.errors,
                 QStringLiteral("mdmctl: the telephony service (org.ofono) does not tell its SIM slots\n"));
        QCOMPARE(told.output, QString());
        QCOMPARE(told.status, 1);
    }
    act("phone extensions", {QStringLiteral("on")});
}

void MdmctlSimTest::serviceThatIsNotReadyEndsTheWait()
{
    act("phone ready", {QStringLiteral("off")});
    const Mdmctl::Result told = run("sim list --timeout 0.2");
    QCOMPARE(
        told.errors,
        QStringLiteral("mdmctl: the telephony service (org.ofono) did not tell which SIMs are in the phone "
                       "within 0.2 s\n"));
    QCOMPARE(told.status, 1);
    // What needs no states is told all the same.
    QCOMPARE(run("sim imei").status, 0);
    act("phone ready", {QStringLiteral("on")});
}

void MdmctlSimTest::absentServiceIsTold()
{
    m_phone.stopService(Service);
    for (const char *command : {"sim list", "sim iccid"}) {
        const Mdmctl::Result told = run(command);
        QCOMPARE(told.errors, QStringLiteral("mdmctl: the telephony service (org.ofono) is not running\n"));
        QCOMPARE(told.status, 3);
    }
}

QTEST_GUILESS_MAIN(MdmctlSimTest)
#include "mdmctl_sim_test.moc"
