// SPDX-License-Identifier: LGPL-2.1-or-later
#include "mdmctl.h"
#include "phone.h"

#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtTest/QtTest>

namespace
{

const QString Service = QStringLiteral("org.corvaneos.mdmproxy");
const QString Path = QStringLiteral("/Corvane/Mdm/Proxy/NotificationInfo");

Mdmctl::Result run(const QStringList &arguments)
{
    return Mdmctl::run(QStringList(QStringLiteral("notify")) + arguments);
}

Mdmctl::Result run(const char *arguments)
{
    return run(QString::fromUtf8(arguments).split(QLatin1Char(' ')));
}

QJsonArray listed(const char *arguments)
{
    return run(arguments).json().value(QLatin1String("notifications")).toArray();
}

QJsonObject json(const char *text)
{
    return QJsonDocument::fromJson(text).object();
}

} // namespace

class MdmctlNotifyTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void listsAsATable();
    void listsAsJson();
    void listsSome_data();
    void listsSome();
    void sendsAndCloses();
    void sendsWhatIsNamed();
    void updatesWhatIsNamed();
    void controlCharactersAreNotShown();
    void mistakesSendNothing_data();
    void mistakesSendNothing();
    void unknownNotifications();
    void refusalsAreToldInTheServicesWords_data();
    void refusalsAreToldInTheServicesWords();
    void absentServiceIsTold_data();
    void absentServiceIsTold();

private:
    Phone m_phone;
};

void MdmctlNotifyTest::init()
{
    m_phone.takeJournal(Service);
}

void MdmctlNotifyTest::cleanup()
{
    m_phone.clearFaults();
    m_phone.startService(Service);
}

void MdmctlNotifyTest::listsAsATable()
{
    const Mdmctl::Result shown = run("list");
    QCOMPARE(shown.errors, QString());
    QCOMPARE(
        shown.output,
        QStringLiteral("ID  TIME                  URGENCY  OWNER         CATEGORY                APPLICATION"
                       "  SUMMARY      BODY\n"
                       "1   2026-03-02T16:03:05Z  normal   voicecall-ui  x-corvane.call.missed   Phone      "
                       "  Missed call  +358 40 1112233\n"
                       "2   2026-03-03T07:00:00Z  low      messages      x-corvane.message.text  Messages   "
                       "  Elo Mobile   Your data package is renewed.\n"));
    QCOMPARE(shown.status, 0);
}

void MdmctlNotifyTest::listsAsJson()
{
    QCOMPARE(listed("list --json --owner voicecall-ui").at(0).toObject(),
             json(R"({"id": 1, "time": "2026-03-02T16:03:05Z", "urgency": "normal", "owner": "voicecall-ui",
                      "category": "x-corvane.call.missed", "appName": "Phone",
                      "appIcon": "icon-lock-missed-call", "summary": "Missed call", "body": "+358 40 1112233",
                      "subText": "", "remoteActions": [{"name": "default", "displayName": "Call back",
                      "service": "com.corvane.voicecall.ui", "path": "/", "iface": "com.corvane.voicecall.ui",
                      "method": "openCallHistory",
                      "arguments": [{"number": "+358401112233", "times": [1772467385]}]}]})"));
}

void MdmctlNotifyTest::listsSome_data()
{
    QTest::addColumn<int>("count");
    QTest::newRow("list --json") << 2;
    QTest::newRow("list --json --owner messages") << 1;
    QTest::newRow("list --json --category x-corvane.call.missed") << 1;
    QTest::newRow("list --json --category x-corvane.call.missed --owner voicecall-ui") << 1;
    QTest::newRow("list --json --category x-corvane.call.missed --owner messages") << 0;
    QTest::newRow("list --json --owner nobody") << 0;
}

void MdmctlNotifyTest::listsSome()
{
    QFETCH(int, count);
    QCOMPARE(listed(QTest::currentDataTag()).size(), count);
    if (count == 0) {
        const QStringList words = QString::fromLatin1(QTest::currentDataTag())
                                      .remove(QStringLiteral("--json "))
                                      .split(QLatin1Char(' '));
        QCOMPARE(run(words).output, QStringLiteral("There are no notifications.\n"));
    }
}

void MdmctlNotifyTest::sendsAndCloses()
{
    const Mdmctl::Result sent = run({QStringLiteral("send"), QStringLiteral("Back to the office")});
    QCOMPARE(sent.errors, QString());
    QVERIFY2(sent.output.endsWith(QStringLiteral(" is shown.\n")), qPrintable(sent.output));
    QCOMPARE(sent.status, 0);
    const QJsonObject notification = listed("list --json --owner mdmctl").at(0).toObject();
    QCOMPARE(notification.value(QLatin1String("summary")).toString(), QStringLiteral("Back to the office"));
    QCOMPARE(notification.value(QLatin1String("urgency")).toString(), QStringLiteral("normal"));
    QVERIFY(!notification.value(QLatin1String("time")).toString().isEmpty());
    const QString id = QString::number(notification.value(QLatin1String("id")).toInt());
    QCOMPARE(sent.output, QStringLiteral("Notification %1 is shown.\n").arg(id));

    QCOMPARE(run({QStringLiteral("close"), id}).output,
             QStringLiteral("Notification %1 is closed.\n").arg(id));
    QCOMPARE(listed("list --json --owner mdmctl").size(), 0);
}

void MdmctlNotifyTest::sendsWhatIsNamed()
{
    const Mdmctl::Result sent = run(
        "send S --body B --owner O --category C --app-name A --app-icon I --sub-text T --urgency critical "
        "--time 2026-03-02T09:15:00Z --json");
    const int id = sent.json().value(QLatin1String("id")).toInt();
    QVERIFY(id > 0);
    QCOMPARE(listed("list --json --owner O").at(0).toObject(),
             QJsonObject({{QStringLiteral("id"), id},
                          {QStringLiteral("time"), QStringLiteral("2026-03-02T09:15:00Z")},
                          {QStringLiteral("urgency"), QStringLiteral("critical")},
                          {QStringLiteral("owner"), QStringLiteral("O")},
                          {QStringLiteral("category"), QStringLiteral("C")},
                          {QStringLiteral("appName"), QStringLiteral("A")},
                          {QStringLiteral("appIcon"), QStringLiteral("I")},
                          {QStringLiteral("summary"), QStringLiteral("S")},
                          {QStringLiteral("body"), QStringLiteral("B")},
                          {QStringLiteral("subText"), QStringLiteral("T")},
                          {QStringLiteral("remoteActions"), QJsonArray()}}));
    run({QStringLiteral("close"), QString::number(id)});
}

void MdmctlNotifyTest::updatesWhatIsNamed()
{
    const QJsonObject before = listed("list --json --owner voicecall-ui").at(0).toObject();
    const Mdmctl::Result updated = run("update 1 --body nobody --urgency low");
    QCOMPARE(updated.output, QStringLiteral("Notification 1 is updated.\n"));
    QCOMPARE(updated.status, 0);
    QJsonObject expected = before;
    expected.insert(QStringLiteral("body"), QStringLiteral("nobody"));
    expected.insert(QStringLiteral("urgency"), QStringLiteral("low"));
    // The actions came through, too.
    QCOMPARE(listed("list --json --owner voicecall-ui").at(0).toObject(), expected);
    run({QStringLiteral("update"), QStringLiteral("1"), QStringLiteral("--body"),
         QStringLiteral("+358 40 1112233"), QStringLiteral("--urgency"), QStringLiteral("normal")});
    QCOMPARE(listed("list --json --owner voicecall-ui").at(0).toObject(), before);
}

void MdmctlNotifyTest::controlCharactersAreNotShown()
{
    const Mdmctl::Result sent
        = run({QStringLiteral("send"), QStringLiteral("red \x1b[31m"), QStringLiteral("--json")});
    const Mdmctl::Result shown = run("list");
    QVERIFY(!shown.output.contains(QLatin1Char('\x1b')));
    QVERIFY(shown.output.contains(QStringLiteral("[31m")));
    run({QStringLiteral("close"), QString::number(sent.json().value(QLatin1String("id")).toInt())});
}

void MdmctlNotifyTest::mistakesSendNothing_data()
{
    QTest::addColumn<QString>("message");
    const auto row = [](const char *arguments, const char *message) {
        QTest::newRow(arguments) << QString::fromUtf8(message);
    };
    row("send", "SUMMARY is missing; usage: mdmctl notify send SUMMARY");
    row("send S --urgency high", R"(--urgency "high": must be one of "low", "normal", "critical")");
    row("send S --urgency critcal", R"(--urgency "critcal": did you mean "critical"?)");
    row("send S --time soon",
        R"(--time "soon": must be a date, or a date and time, as in 2026-03-02 or 2026-03-02T09:15:00Z)");
    row("send S --summary T",
        R"(unknown option "--summary": must be one of "--help", "--json", "--body", "--owner", "--category", "--app-name", "--app-icon", "--sub-text", "--urgency", "--time")");
    row("close 0", R"(ID "0": must be a number, as "mdmctl notify list" shows it)");
    row("close all", R"(ID "all": must be a number, as "mdmctl notify list" shows it)");
    row("update -1", R"(ID "-1": must be a number, as "mdmctl notify list" shows it)");
}

void MdmctlNotifyTest::mistakesSendNothing()
{
    QFETCH(QString, message);
    const Mdmctl::Result refused = run(QTest::currentDataTag());
    QVERIFY2(refused.errors.startsWith(QStringLiteral("mdmctl: ") + message), qPrintable(refused.errors));
    QCOMPARE(refused.output, QString());
    QCOMPARE(refused.status, 2);
    QCOMPARE(m_phone.takeJournal(Service), QStringList());
}

void MdmctlNotifyTest::unknownNotifications()
{
    const Mdmctl::Result updated = run("update 4711 --body x");
    QCOMPARE(updated.errors, QStringLiteral("mdmctl: no notification 4711 on the phone\n"));
    QCOMPARE(updated.status, 1);
    const Mdmctl::Result closed = run("close 4711");
    QVERIFY2(
        closed.errors.startsWith(QStringLiteral("mdmctl: the MDM proxy (org.corvaneos.mdmproxy) refused: ")),
        qPrintable(closed.errors));
    QCOMPARE(closed.output, QString());
    QCOMPARE(closed.status, 1);
}

void MdmctlNotifyTest::refusalsAreToldInTheServicesWords_data()
{
    QTest::addColumn<QString>("member");
    QTest::addColumn<QString>("reason");
    const QString whole = QStringLiteral("not you (com.example.Denied)");
    QTest::newRow("list") << QStringLiteral("notifications") << whole;
    QTest::newRow("list --category x") << QStringLiteral("notificationsByCategory") << whole;
    QTest::newRow("send S") << QStringLiteral("createNotification") << whole;
    QTest::newRow("update 1 --body x") << QStringLiteral("updateNotification") << whole;
    QTest::newRow("close 1") << QStringLiteral("closeNotification") << QStringLiteral("not you");
}

void MdmctlNotifyTest::refusalsAreToldInTheServicesWords()
{
    QFETCH(QString, member);
    QFETCH(QString, reason);
    m_phone.failCalls(Service, Path, member, QStringLiteral("com.example.Denied"), QStringLiteral("not you"));
    const Mdmctl::Result refused = run(QTest::currentDataTag());
    QCOMPARE(refused.errors,
             QStringLiteral("mdmctl: the MDM proxy (org.corvaneos.mdmproxy) refused: %1\n").arg(reason));
    QCOMPARE(refused.output, QString());
    QCOMPARE(refused.status, 1);
}

void MdmctlNotifyTest::absentServiceIsTold_data()
{
    QTest::addColumn<QString>("command");
    for (const char *command : {"list", "send S", "update 1 --body x", "close 1"})
        QTest::newRow(command) << QString::fromLatin1(command);
}

void MdmctlNotifyTest::absentServiceIsTold()
{
    QFETCH(QString, command);
    m_phone.stopService(Service);
    const Mdmctl::Result told = run(command.split(QLatin1Char(' ')));
    QCOMPARE(told.errors, QStringLiteral("mdmctl: the MDM proxy (org.corvaneos.mdmproxy) is not running\n"));
    QCOMPARE(told.status, 3);
}

QTEST_GUILESS_MAIN(MdmctlNotifyTest)
#include "mdmctl_notify_test.moc"
