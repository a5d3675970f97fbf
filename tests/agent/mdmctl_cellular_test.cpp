// SPDX-License-Identifier: LGPL-2.1-or-later
#include "mdmctl.h"
#include "phone.h"
#include "terminal.h"

#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QTemporaryDir>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusReply>
#include <QtTest/QtTest>

#include <csignal>

namespace
{

const QString Ofono = QStringLiteral("org.ofono");
const QString ConnMan = QStringLiteral("net.connman");
const QString Imsi = QStringLiteral("244051234567890");
const QString OtherImsi = QStringLiteral("262021234567891");
const QString Context = QStringLiteral("/ril_0/context1");
const QString Service = QStringLiteral("/net/connman/service/cellular_244051234567890_context1");

QStringList words(const QString &arguments)
{
    return arguments.split(QLatin1Char(' '));
}

Mdmctl::Result run(const char *arguments, const QByteArray &input = QByteArray())
{
    return Mdmctl::run(words(QString::fromUtf8(arguments)), input);
}

QJsonObject json(const char *text)
{
    return QJsonDocument::fromJson(text).object();
}

} // namespace

/** Radio technologies, mobile data and access points. */
class MdmctlCellularTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void showsTechnologies();
    void showsTechnologiesAsJson();
    void selectsTechnologiesOnce();
    void selectsBySim();
    void mistakes_data();
    void mistakes();
    void refusals_data();
    void refusals();
    void connectsAndDisconnects();
    void connectionAsJson();
    void flightModeIsExplained();
    void listsAccessPoints();
    void telephonyWithoutSlotsIsTold();
    void listsNoPassword();
    void leavesTheSimForDataAlone();
    void setsWhatIsNamed();
    void setsOnce();
    void setsAndReconnects();
    void takesThePasswordFrom_data();
    void takesThePasswordFrom();
    void asksForThePassword();
    void interruptedQuestionLeavesTheTerminalAsItWas();
    void clearsThePassword();
    void refusedMembersAreNamed();
    void absentServicesAreTold_data();
    void absentServicesAreTold();

private:
    void act(const char *action, const QStringList &arguments)
    {
        m_phone.act(QLatin1String(action), arguments);
    }
    QStringList writes(const QString &service)
    {
        return m_phone.takeJournal(service).filter(QStringLiteral(" SetProperty "));
    }
    QString password() const
    {
        const QDBusReply<QVariantMap> reply = QDBusConnection::systemBus().call(
            QDBusMessage::createMethodCall(Ofono, Context, QStringLiteral("org.ofono.ConnectionContext"),
                                           QStringLiteral("GetProperties")));
        return reply.value().value(QStringLiteral("Password")).toString();
    }
    QJsonObject accessPoint(const char *arguments)
    {
        return run(arguments).json().value(QLatin1String("accessPoints")).toArray().at(0).toObject();
    }
    QString fileWith(const QByteArray &content)
    {
        QFile file(m_folder.filePath(QStringLiteral("password")));
        if (!file.open(QIODevice::WriteOnly) || file.write(content) != content.size())
            qFatal("cannot write %s", qPrintable(file.fileName()));
        return file.fileName();
    }

    Phone m_phone;
    QTemporaryDir m_folder;
};

void MdmctlCellularTest::init()
{
    m_phone.takeJournal(Ofono);
}

void MdmctlCellularTest::cleanup()
{
    m_phone.clearFaults();
    m_phone.startService(Ofono);
    m_phone.startService(ConnMan);
    act("phone extensions", {QStringLiteral("on")});
    act("flight-mode", {QStringLiteral("off")});
    run("cellular disconnect 244051234567890");
    run("cellular select /ril_0 any");
    run("cellular select /ril_1 any");
    Mdmctl::run({QStringLiteral("apn"), QStringLiteral("set"), Imsi, QStringLiteral("internet"),
                 QStringLiteral("--apn"), QStringLiteral("internet.elo"), QStringLiteral("--username"),
                 QString(), QStringLiteral("--protocol"), QStringLiteral("ip"),
                 QStringLiteral("--authentication"), QStringLiteral("none"),
                 QStringLiteral("--clear-password")});
}

void MdmctlCellularTest::showsTechnologies()
{
    const Mdmctl::Result shown = run("cellular technologies");
    QCOMPARE(shown.errors, QString());
    QCOMPARE(shown.output,
             QStringLiteral("MODEM   IMSI             SELECTED  SUPPORTED\n"
                            "/ril_0  244051234567890  any       2g, 3g, 4g\n"
                            "/ril_1  262021234567891  any       2g, 3g, 4g\n"));
    QCOMPARE(shown.status, 0);

    act("sim pull", {QStringLiteral("1")});
    m_phone.answerCalls(Ofono, QStringLiteral("/ril_1"), QStringLiteral("GetProperties"), {QVariantMap()});
    QVERIFY(run("cellular technologies")
                .output.endsWith(QStringLiteral("/ril_1                   any       no choice\n")));
    act("sim insert", {QStringLiteral("1")});
}

void MdmctlCellularTest::showsTechnologiesAsJson()
{
    QCOMPARE(run("cellular technologies --json").json(),
             json(R"({"modems": [{"modem": "/ril_0", "imsi": "244051234567890", "selected": "any",
                                  "supported": ["2g", "3g", "4g"]},
                                 {"modem": "/ril_1", "imsi": "262021234567891", "selected": "any",
                                  "supported": ["2g", "3g", "4g"]}]})"));
}

void MdmctlCellularTest::selectsTechnologiesOnce()
{
    QCOMPARE(run("cellular select /ril_0 3g").output,
             QStringLiteral("MODEM   IMSI             SELECTED  SUPPORTED\n"
                            "/ril_0  244051234567890  3g        2g, 3g, 4g\n"));
    QCOMPARE(writes(Ofono),
             QStringList(QStringLiteral("/ril_0 SetProperty ('TechnologyPreference', <'umts'>)")));
    QVERIFY(run("cellular select /ril_0 3g")
                .output.startsWith(QStringLiteral("Already so, nothing to change.\n")));
    QCOMPARE(writes(Ofono), QStringList());
}

void MdmctlCellularTest::selectsBySim()
{
    QCOMPARE(run("cellular select 262021234567891 4g --json").json(),
             json(R"({"modem": "/ril_1", "imsi": "262021234567891", "selected": "4g",
                      "supported": ["2g", "3g", "4g"], "changed": true})"));
    QCOMPARE(writes(Ofono),
             QStringList(QStringLiteral("/ril_1 SetProperty ('TechnologyPreference', <'lte'>)")));
}

void MdmctlCellularTest::mistakes_data()
{
    QTest::addColumn<QString>("message");
    QTest::addColumn<int>("status");
    const auto row = [](const char *arguments, const char *message, int status) {
        QTest::newRow(arguments) << QString::fromUtf8(message) << status;
    };
    row("cellular select /ril_0 4G", R"(TECHNOLOGY "4G": did you mean "4g"?)", 2);
    row("cellular select /ril_0 5g", R"(TECHNOLOGY "5g": must be one of "any", "2g", "3g", "4g")", 2);
    row("cellular select /ril_7 4g",
        R"(no modem or SIM /ril_7 in the phone; "mdmctl cellular technologies" lists them)", 1);
    row("cellular connect me", R"(IMSI "me": must be 1 to 15 decimal digits)", 2);
    row("cellular connect 99", "no SIM 99 in the phone", 1);
    row("cellular disconnect 99", "no SIM 99 in the phone", 1);
    row("apn list 99", "no SIM 99 in the phone", 1);
    row("apn set 99 internet --apn x", "no SIM 99 with an access point of type internet in the phone", 1);
    row("apn set 244051234567890 ims --apn x",
        "no SIM 244051234567890 with an access point of type ims in the phone", 1);
    row("apn set 244051234567890 web --apn x", R"(TYPE "web": must be one of "internet", "mms", "ims")", 2);
    row("apn set 244051234567890 internet", R"(nothing to set; "mdmctl apn set --help" lists the options)",
        2);
    row("apn set 244051234567890 internet --protocol ipv7",
        R"(--protocol "ipv7": must be one of "ip", "ipv6", "dual")", 2);
    row("apn set 244051234567890 internet --password geheim",
        R"(unknown option "--password": did you mean "--password-file"?)", 2);
    row("apn set 244051234567890 internet --password-env A --password-file b",
        "--password-file and --password-env exclude each other", 2);
    row("apn set 244051234567890 internet --password-env A --clear-password",
        "--clear-password excludes a password", 2);
    row("apn set 244051234567890 internet --password-env CORVANE_NO_SUCH",
        "the password of the access point: the environment variable CORVANE_NO_SUCH is not set", 2);
    row("apn set 244051234567890 internet --password-file -",
        "the password of the access point: standard input holds no secret", 2);
}

void MdmctlCellularTest::mistakes()
{
    QFETCH(QString, message);
    const Mdmctl::Result refused = run(QTest::currentDataTag());
    QCOMPARE(refused.errors, QStringLiteral("mdmctl: %1\n").arg(message));
    QCOMPARE(refused.output, QString());
    QTEST(refused.status, "status");
    QCOMPARE(writes(Ofono), QStringList());
}

void MdmctlCellularTest::refusals_data()
{
    QTest::addColumn<QString>("service");
    QTest::addColumn<QString>("path");
    QTest::addColumn<QString>("member");
    QTest::addColumn<QString>("message");
    const QString telephony = QStringLiteral("the telephony service (org.ofono) refused: not you");
    const QString manager = QStringLiteral("the connection manager (net.connman) %1");
    const QString connecting = QStringLiteral("cellular connect 244051234567890");
    const QString root = QStringLiteral("/");
    const QString set = QStringLiteral("SetProperty");
    const QString get = QStringLiteral("GetProperties");

    QTest::newRow("cellular technologies")
        << Ofono << root << QStringLiteral("GetAvailableModems") << telephony;
    QTest::newRow("cellular select /ril_0 4g") << Ofono << QStringLiteral("/ril_0") << set << telephony;
    QTest::newRow("cellular status") << Ofono << QStringLiteral("/ril_0") << QStringLiteral("GetContexts")
                                     << telephony;
    QTest::newRow("cellular connect 244051234567890")
        << ConnMan << Service << QStringLiteral("Connect") << manager.arg(QStringLiteral("refused: not you"));
    QTest::newRow("cellular disconnect 244051234567890")
        << ConnMan << Service << set
        << manager.arg(QStringLiteral("does not change what comes up by itself: not you"));
    QTest::newRow("apn list") << Ofono << root << QStringLiteral("SetDefaultDataSim") << telephony;
    QTest::newRow("apn list 244051234567890") << Ofono << Context << get << telephony;
}

void MdmctlCellularTest::refusals()
{
    QFETCH(QString, service);
    QFETCH(QString, path);
    QFETCH(QString, member);
    QFETCH(QString, message);
    m_phone.failCalls(service, path, member, QStringLiteral("com.example.Denied"), QStringLiteral("not you"));
    const Mdmctl::Result refused = run(QTest::currentDataTag());
    QCOMPARE(refused.errors, QStringLiteral("mdmctl: %1\n").arg(message));
    QVERIFY(!refused.output.contains(QStringLiteral("no access points")));
    QCOMPARE(refused.status, 1);
}

void MdmctlCellularTest::connectsAndDisconnects()
{
    QCOMPARE(run("cellular connect 244051234567890").output,
             QStringLiteral("Mobile data through SIM 244051234567890 is up.\n"));
    QCOMPARE(run("cellular status").output,
             QStringLiteral("IMSI             MOBILE DATA\n"
                            "244051234567890  up\n"
                            "262021234567891  down\n"));
    const QStringList sent = m_phone.takeJournal(ConnMan);
    QVERIFY(sent.contains(Service + QStringLiteral(" SetProperty ('AutoConnect', <true>)")));
    QVERIFY(sent.contains(Service + QStringLiteral(" Connect ()")));
    QCOMPARE(run("cellular disconnect 244051234567890").output,
             QStringLiteral("Mobile data through SIM 244051234567890 is down.\n"));
    QVERIFY(writes(ConnMan).contains(Service + QStringLiteral(" SetProperty ('AutoConnect', <false>)")));
}

void MdmctlCellularTest::connectionAsJson()
{
    QCOMPARE(run("cellular connect 244051234567890 --json").json(),
             json(R"({"imsi": "244051234567890", "connected": true, "changed": true})"));
    QCOMPARE(run("cellular connect 244051234567890 --json").json(),
             json(R"({"imsi": "244051234567890", "connected": true, "changed": false})"));
    QCOMPARE(run("cellular status --json").json(),
             json(R"({"connections": [{"imsi": "244051234567890", "connected": true},
                                      {"imsi": "262021234567891", "connected": false}]})"));
}

void MdmctlCellularTest::flightModeIsExplained()
{
    act("flight-mode", {QStringLiteral("on")});
    const Mdmctl::Result refused = run("cellular connect 244051234567890");
    QCOMPARE(refused.errors,
             QStringLiteral("mdmctl: the connection manager (net.connman) has no network for SIM "
                            "244051234567890; is flight mode on, or the SIM not registered?\n"));
    QCOMPARE(refused.status, 1);
}

void MdmctlCellularTest::listsAccessPoints()
{
    const Mdmctl::Result listed = run("apn list");
    QCOMPARE(listed.errors, QString());
    QCOMPARE(
        listed.output,
        QStringLiteral("IMSI             TYPE      NAME          APN           PROTOCOL  AUTHENTICATION  "
                       "MESSAGE CENTER            MESSAGE PROXY\n"
                       "244051234567890  internet  Elo Internet  internet.elo  ip        none\n"
                       "244051234567890  mms       Elo MMS       mms.elo       ip        none            "
                       "http://mmsc.elo.example/  192.0.2.8:8080\n"
                       "262021234567891  internet  Tarn Web      web.tarn      ip        none\n"));
    QCOMPARE(listed.status, 0);
    QCOMPARE(run("apn list 262021234567891 --json").json(),
             json(R"({"accessPoints": [{"imsi": "262021234567891", "type": "internet", "name": "Tarn Web",
                      "apn": "web.tarn", "username": "", "passwordSet": false, "protocol": "ip",
                      "authentication": "none", "messageCenter": "", "messageProxy": ""}]})"));
}

void MdmctlCellularTest::telephonyWithoutSlotsIsTold()
{
    act("phone extensions", {QStringLiteral("off")});
    for (const char *command : {"apn list", "apn list --json", "apn list 244051234567890",
                                "apn set 244051234567890 internet --apn x"}) {
        const Mdmctl::Result told = run(command);
        QCOMPARE(told.errors,
                 QStringLiteral("mdmctl: the telephony service (org.ofono) does not tell its SIM slots\n"));
        QCOMPARE(told.output, QString());
        QCOMPARE(told.status, 1);
    }
}

void MdmctlCellularTest::listsNoPassword()
{
    QCOMPARE(run("apn set 244051234567890 internet --password-file - --json", "geheim\n").status, 0);
    for (const char *command : {"apn list", "apn list --json", "policy export"}) {
        const Mdmctl::Result shown = run(command);
        QVERIFY(!shown.output.contains(QStringLiteral("geheim")));
        QVERIFY(!shown.errors.contains(QStringLiteral("geheim")));
    }
    QCOMPARE(accessPoint("apn list 244051234567890 --json").value(QLatin1String("passwordSet")),
             QJsonValue(true));
    QVERIFY(run("apn list 244051234567890").output.contains(QStringLiteral("  set ")));
}

/** The library makes a SIM the one for data to reach its access points. */
void MdmctlCellularTest::leavesTheSimForDataAlone()
{
    for (const char *command :
         {"apn list", "apn list 262021234567891", "apn set 262021234567891 internet --name Tarn"}) {
        QCOMPARE(run(command).status, 0);
        const QStringList choices = m_phone.takeJournal(Ofono).filter(QStringLiteral(" SetDefaultDataSim "));
        QVERIFY(choices.contains(QStringLiteral("/ SetDefaultDataSim ('%1',)").arg(OtherImsi)));
        QCOMPARE(choices.last(), QStringLiteral("/ SetDefaultDataSim ('%1',)").arg(Imsi));
    }
    Mdmctl::run({QStringLiteral("apn"), QStringLiteral("set"), OtherImsi, QStringLiteral("internet"),
                 QStringLiteral("--name"), QStringLiteral("Tarn Web")});
}

void MdmctlCellularTest::setsWhatIsNamed()
{
    const Mdmctl::Result set
        = run("apn set 244051234567890 internet --apn web.elo --username elo --protocol dual "
              "--authentication pap --json");
    QCOMPARE(set.errors, QString());
    QCOMPARE(set.json(),
             json(R"({"imsi": "244051234567890", "type": "internet", "name": "Elo Internet", "apn": "web.elo",
                      "username": "elo", "passwordSet": false, "protocol": "dual", "authentication": "pap",
                      "messageCenter": "", "messageProxy": "", "changed": true})"));
    const QStringList sent = writes(Ofono);
    QVERIFY(sent.contains(Context + QStringLiteral(" SetProperty ('AccessPointName', <'web.elo'>)")));
    QVERIFY(sent.contains(Context + QStringLiteral(" SetProperty ('Protocol', <'dual'>)")));
    QVERIFY(sent.contains(Context + QStringLiteral(" SetProperty ('AuthenticationMethod', <'pap'>)")));
}

void MdmctlCellularTest::setsOnce()
{
    const Mdmctl::Result set = run("apn set 244051234567890 internet --apn internet.elo");
    QVERIFY(set.output.startsWith(QStringLiteral("Already so, nothing to change.\n")));
    QCOMPARE(set.status, 0);
    QCOMPARE(writes(Ofono), QStringList());
}

void MdmctlCellularTest::setsAndReconnects()
{
    run("cellular connect 244051234567890");
    m_phone.takeJournal(ConnMan);
    QCOMPARE(run("apn set 244051234567890 internet --apn web.elo").status, 0);
    const QStringList calls = m_phone.takeJournal(ConnMan);
    const int down = calls.indexOf(Service + QStringLiteral(" Disconnect ()"));
    const int up = calls.indexOf(Service + QStringLiteral(" Connect ()"));
    QVERIFY(down >= 0);
    QVERIFY(up > down);
}

void MdmctlCellularTest::takesThePasswordFrom_data()
{
    QTest::addColumn<QString>("option");
    QTest::addColumn<QByteArray>("input");
    QTest::newRow("file") << QStringLiteral("--password-file ") + fileWith("geheim\n") << QByteArray();
    QTest::newRow("standard input") << QStringLiteral("--password-file -") << QByteArray("geheim\n");
    QTest::newRow("environment") << QStringLiteral("--password-env CORVANE_TEST_PASSWORD") << QByteArray();
}

void MdmctlCellularTest::takesThePasswordFrom()
{
    QFETCH(QString, option);
    QFETCH(QByteArray, input);
    qputenv("CORVANE_TEST_PASSWORD", "geheim");
    const Mdmctl::Result set
        = Mdmctl::run(words(QStringLiteral("apn set 244051234567890 internet ") + option), input);
    qunsetenv("CORVANE_TEST_PASSWORD");
    QCOMPARE(set.errors, QString());
    QVERIFY(!set.output.contains(QStringLiteral("geheim")));
    QCOMPARE(set.status, 0);
    QCOMPARE(password(), QStringLiteral("geheim"));
}

void MdmctlCellularTest::asksForThePassword()
{
    Terminal terminal;
    Mdmctl set(words(QStringLiteral("apn set 244051234567890 internet --ask-password")), &terminal);
    QVERIFY(terminal.waitForText("Password of the access point: "));
    terminal.type("geheim\n");
    const Mdmctl::Result done = set.finish();
    QCOMPARE(done.errors, QString());
    QCOMPARE(done.status, 0);
    QCOMPARE(password(), QStringLiteral("geheim"));
    QCOMPARE(terminal.shown(), QByteArray("Password of the access point: \r\n"));
}

void MdmctlCellularTest::interruptedQuestionLeavesTheTerminalAsItWas()
{
    Terminal terminal;
    QVERIFY(terminal.echoes());
    Mdmctl set(words(QStringLiteral("apn set 244051234567890 internet --ask-password")), &terminal);
    QVERIFY(terminal.waitForText("Password of the access point: "));
    QVERIFY(!terminal.echoes());
    terminal.type("gehe\x03");
    const Mdmctl::Result ended = set.finish();
    QCOMPARE(ended.errors, QStringLiteral("mdmctl: interrupted\n"));
    QCOMPARE(ended.status, 1);
    QVERIFY(terminal.echoes());
    QVERIFY(!terminal.shown().contains("gehe"));
    QCOMPARE(writes(Ofono), QStringList());
}

void MdmctlCellularTest::clearsThePassword()
{
    run("apn set 244051234567890 internet --password-file -", "geheim\n");
    m_phone.takeJournal(Ofono);
    const Mdmctl::Result cleared = run("apn set 244051234567890 internet --clear-password --json");
    QCOMPARE(cleared.json().value(QLatin1String("passwordSet")), QJsonValue(false));
    QCOMPARE(password(), QString());
}

void MdmctlCellularTest::refusedMembersAreNamed()
{
    m_phone.failCalls(Ofono, Context, QStringLiteral("SetProperty"), QStringLiteral("com.example.Denied"),
                      QStringLiteral("not you"));
    const Mdmctl::Result refused = run("apn set 244051234567890 internet --apn web.elo");
    QVERIFY(refused.errors.contains(
        QStringLiteral("the telephony service (org.ofono) did not take the access point name")));
    QCOMPARE(refused.status, 1);
}

void MdmctlCellularTest::absentServicesAreTold_data()
{
    QTest::addColumn<QString>("service");
    QTest::addColumn<QString>("message");
    const QString telephony = QStringLiteral("mdmctl: the telephony service (org.ofono) is not running\n");
    const QString manager = QStringLiteral("mdmctl: the connection manager (net.connman) is not running\n");
    for (const char *command :
         {"cellular technologies", "cellular select /ril_0 4g", "cellular status",
          "cellular connect 244051234567890", "apn list", "apn set 244051234567890 internet --apn x"})
        QTest::newRow(command) << Ofono << telephony;
    QTest::newRow("cellular disconnect 244051234567890") << ConnMan << manager;
}

void MdmctlCellularTest::absentServicesAreTold()
{
    QFETCH(QString, service);
    m_phone.stopService(service);
    const Mdmctl::Result told = run(QTest::currentDataTag());
    QTEST(told.errors, "message");
    QCOMPARE(told.status, 3);
}

QTEST_GUILESS_MAIN(MdmctlCellularTest)
#include "mdmctl_cellular_test.moc"
