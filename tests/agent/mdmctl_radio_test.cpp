// SPDX-License-Identifier: LGPL-2.1-or-later
#include "mdmctl.h"
#include "phone.h"

#include <QtCore/QJsonDocument>
#include <QtTest/QtTest>

#include <csignal>

namespace
{

const QString ConnMan = QStringLiteral("net.connman");

Mdmctl::Result run(const char *arguments)
{
    return Mdmctl::run(QString::fromUtf8(arguments).split(QLatin1Char(' ')));
}

QJsonObject json(const char *text)
{
    return QJsonDocument::fromJson(text).object();
}

} // namespace

/** Wi-Fi and flight mode. */
class MdmctlRadioTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void cleanup();

    void switchesAndTells_data();
    void switchesAndTells();
    void switchesOnce();
    void tellsAsJson();
    void refusalIsToldInTheServicesWords_data();
    void refusalIsToldInTheServicesWords();
    void silenceIsTold();
    void phoneWithoutWiFi();
    void watchTellsChanges();
    void watchAsJson();
    void watchEndsWithTheService();
    void absentServiceIsTold_data();
    void absentServiceIsTold();

private:
    QStringList writes();

    Phone m_phone;
};

void MdmctlRadioTest::cleanup()
{
    m_phone.clearFaults();
    m_phone.startService(ConnMan);
    m_phone.act(QStringLiteral("flight-mode"), {QStringLiteral("off")});
    m_phone.act(QStringLiteral("technology power"), {QStringLiteral("wifi"), QStringLiteral("on")});
    m_phone.takeJournal(ConnMan);
}

/** What the service was made to change. */
QStringList MdmctlRadioTest::writes()
{
    return m_phone.takeJournal(ConnMan).filter(QStringLiteral(" SetProperty "));
}

void MdmctlRadioTest::switchesAndTells_data()
{
    QTest::addColumn<QString>("command");
    QTest::addColumn<QString>("output");
    QTest::addColumn<QStringList>("sent");

    const QString wifi = QStringLiteral("/net/connman/technology/wifi SetProperty ('Powered', <%1>)");
    const QString manager = QStringLiteral("/ SetProperty ('OfflineMode', <%1>)");
    const QString yes = QStringLiteral("true");
    const QString no = QStringLiteral("false");
    QTest::newRow("wifi off") << "wifi off"
                              << "Wi-Fi is off.\n"
                              << QStringList{wifi.arg(no)};
    QTest::newRow("wifi on") << "wifi on"
                             << "Already so, nothing to change. Wi-Fi is on.\n"
                             << QStringList();
    QTest::newRow("wifi status") << "wifi status"
                                 << "Wi-Fi is on.\n"
                                 << QStringList();
    QTest::newRow("flight-mode on") << "flight-mode on"
                                    << "Flight mode is on.\n"
                                    << QStringList{manager.arg(yes)};
    QTest::newRow("flight-mode off") << "flight-mode off"
                                     << "Already so, nothing to change. Flight mode is off.\n"
                                     << QStringList();
    QTest::newRow("flight-mode status") << "flight-mode status"
                                        << "Flight mode is off.\n"
                                        << QStringList();
}

void MdmctlRadioTest::switchesAndTells()
{
    QFETCH(QString, command);
    const Mdmctl::Result done = Mdmctl::run(command.split(QLatin1Char(' ')));
    QCOMPARE(done.errors, QString());
    QTEST(done.output, "output");
    QCOMPARE(done.status, 0);
    QTEST(writes(), "sent");
}

void MdmctlRadioTest::switchesOnce()
{
    QCOMPARE(run("flight-mode on").status, 0);
    QCOMPARE(run("flight-mode on").output,
             QStringLiteral("Already so, nothing to change. Flight mode is on.\n"));
    QCOMPARE(writes().size(), 1);
    // Flight mode took Wi-Fi down, which may be wanted within.
    QCOMPARE(run("wifi status").output, QStringLiteral("Wi-Fi is off.\n"));
    QCOMPARE(run("wifi on").output, QStringLiteral("Wi-Fi is on.\n"));
    QCOMPARE(run("flight-mode off").output, QStringLiteral("Flight mode is off.\n"));
}

void MdmctlRadioTest::tellsAsJson()
{
    QCOMPARE(run("wifi status --json").json(), json(R"({"enabled": true})"));
    QCOMPARE(run("wifi off --json").json(), json(R"({"enabled": false, "changed": true})"));
    QCOMPARE(run("wifi off --json").json(), json(R"({"enabled": false, "changed": false})"));
    QCOMPARE(run("flight-mode on --json").json(), json(R"({"enabled": true, "changed": true})"));
}

void MdmctlRadioTest::refusalIsToldInTheServicesWords_data()
{
    QTest::addColumn<QString>("path");
    QTest::newRow("wifi off") << QStringLiteral("/net/connman/technology/wifi");
    QTest::newRow("flight-mode on") << QStringLiteral("/");
}

void MdmctlRadioTest::refusalIsToldInTheServicesWords()
{
    QFETCH(QString, path);
    m_phone.failCalls(ConnMan, path, QStringLiteral("SetProperty"),
                      QStringLiteral("net.connman.Error.PermissionDenied"), QStringLiteral("not you"));
    const Mdmctl::Result refused = run(QTest::currentDataTag());
    QCOMPARE(refused.errors,
             QStringLiteral("mdmctl: the connection manager (net.connman) refused: not you\n"));
    QCOMPARE(refused.output, QString());
    QCOMPARE(refused.status, 1);
}

void MdmctlRadioTest::silenceIsTold()
{
    // It agrees, and does nothing.
    m_phone.answerCalls(ConnMan, QStringLiteral("/"), QStringLiteral("SetProperty"), {});
    const Mdmctl::Result silent = run("flight-mode on --timeout 0.2");
    QCOMPARE(silent.errors,
             QStringLiteral(
                 "mdmctl: the connection manager (net.connman) did not confirm the change within 0.2 s\n"));
    QCOMPARE(silent.status, 1);
}

void MdmctlRadioTest::phoneWithoutWiFi()
{
    m_phone.act(QStringLiteral("technology remove"), {QStringLiteral("wifi")});
    for (const char *command : {"wifi status", "wifi on", "wifi watch"}) {
        const Mdmctl::Result told = run(command);
        QCOMPARE(told.errors,
                 QStringLiteral("mdmctl: the connection manager (net.connman) does not tell whether Wi-Fi is "
                                "on; the phone may have none\n"));
        QCOMPARE(told.status, 1);
    }
    QCOMPARE(run("flight-mode status").status, 0);
    m_phone.act(QStringLiteral("technology add"), {QStringLiteral("wifi")});
}

void MdmctlRadioTest::watchTellsChanges()
{
    Mdmctl watch({QStringLiteral("flight-mode"), QStringLiteral("watch")});
    QVERIFY(watch.waitForOutput(QStringLiteral("  Flight mode is off.\n")));
    m_phone.act(QStringLiteral("flight-mode"), {QStringLiteral("on")});
    QVERIFY(watch.waitForOutput(QStringLiteral("  Flight mode is on.\n")));
    m_phone.act(QStringLiteral("flight-mode"), {QStringLiteral("off")});
    QVERIFY(watch.waitForOutput(QStringLiteral("  Flight mode is off.\n"), 2));
    watch.interrupt(SIGINT);
    const Mdmctl::Result ended = watch.finish();
    QCOMPARE(ended.status, 0);
    QCOMPARE(ended.output.count(QLatin1Char('\n')), 3);
}

void MdmctlRadioTest::watchAsJson()
{
    Mdmctl watch({QStringLiteral("wifi"), QStringLiteral("watch"), QStringLiteral("--json")});
    QVERIFY(watch.waitForOutput(QStringLiteral("\"watching\"")));
    m_phone.act(QStringLiteral("technology power"), {QStringLiteral("wifi"), QStringLiteral("off")});
    QVERIFY(watch.waitForOutput(QStringLiteral("\"changed\"")));
    watch.interrupt(SIGTERM);
    const QVector<QJsonObject> lines = watch.finish().jsonLines();
    QCOMPARE(lines.size(), 2);
    QCOMPARE(lines.at(0).value(QLatin1String("enabled")), QJsonValue(true));
    QCOMPARE(lines.at(1).value(QLatin1String("enabled")), QJsonValue(false));
    QVERIFY(lines.at(1).contains(QStringLiteral("time")));
}

void MdmctlRadioTest::watchEndsWithTheService()
{
    Mdmctl watch({QStringLiteral("wifi"), QStringLiteral("watch")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Wi-Fi is on.\n")));
    m_phone.stopService(ConnMan);
    const Mdmctl::Result ended = watch.finish();
    QCOMPARE(ended.errors, QStringLiteral("mdmctl: the connection manager (net.connman) is not running\n"));
    QCOMPARE(ended.status, 3);
}

void MdmctlRadioTest::absentServiceIsTold_data()
{
    QTest::addColumn<QString>("command");
    for (const char *command : {"wifi status", "wifi on", "wifi watch", "flight-mode off"})
        QTest::newRow(command) << QString::fromLatin1(command);
}

void MdmctlRadioTest::absentServiceIsTold()
{
    QFETCH(QString, command);
    m_phone.stopService(ConnMan);
    const Mdmctl::Result told = Mdmctl::run(command.split(QLatin1Char(' ')));
    QCOMPARE(told.errors, QStringLiteral("mdmctl: the connection manager (net.connman) is not running\n"));
    QCOMPARE(told.status, 3);
}

QTEST_GUILESS_MAIN(MdmctlRadioTest)
#include "mdmctl_radio_test.moc"
