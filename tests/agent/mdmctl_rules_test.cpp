// SPDX-License-Identifier: LGPL-2.1-or-later
#include "callalarm.h"
#include "mdmctl.h"
#include "phone.h"
#include "waiting.h"

#include <QtCore/QJsonDocument>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtTest/QtTest>

#include <csignal>

namespace
{

const QString Service = QStringLiteral("org.ofono");

/** A family of rules without directions: its command, and the service's names for it. */
struct Family {
    QString command;
    QString subject;
    QString path;
    QString interface;
    QString word; // in the service's names
    QString state; // of the phone

    QString member(const char *pattern) const
    {
        return QString::fromLatin1(pattern).replace(QLatin1Char('@'), word);
    }
    QString call(const char *pattern, const char *arguments) const
    {
        return path + QLatin1Char(' ') + member(pattern) + QLatin1Char(' ') + QString::fromLatin1(arguments);
    }
};

QJsonObject json(const char *text)
{
    return QJsonDocument::fromJson(text).object();
}

} // namespace

Q_DECLARE_METATYPE(Family)

/** "mdmctl sms" and "mdmctl data"; what they have in common with "mdmctl calls" is tested in depth there. */
class MdmctlRulesTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void shows_data() { families(); }
    void shows();
    void addsChangesAndRemoves_data() { families(); }
    void addsChangesAndRemoves();
    void setsAndClears_data() { families(); }
    void setsAndClears();
    void setsTheDefault_data() { families(); }
    void setsTheDefault();
    void changesAsJson_data() { families(); }
    void changesAsJson();
    void knowsNoHangup_data() { families(); }
    void knowsNoHangup();
    void refusalIsToldInTheServicesWords_data() { families(); }
    void refusalIsToldInTheServicesWords();
    void silenceAndAbsenceAreTold_data() { families(); }
    void silenceAndAbsenceAreTold();
    void watches_data() { families(); }
    void watches();
    void policyIsAppliedAndExported_data() { families(); }
    void policyIsAppliedAndExported();
    void policyFaultIsToldWithItsPath_data() { families(); }
    void policyFaultIsToldWithItsPath();
    void policyWatchFollowsTheSims_data() { families(); }
    void policyWatchFollowsTheSims();

private:
    void families();
    void call(const Family &family, const char *method, const QVariantList &arguments = {});
    QJsonObject state(const Family &family) const;
    QStringList changes(const Family &family);
    Mdmctl::Result run(const Family &family, const char *arguments);

    Phone m_phone;
    CallAlarm m_alarm;
};

void MdmctlRulesTest::families()
{
    QTest::addColumn<Family>("family");
    QTest::newRow("sms") << Family{QStringLiteral("sms"),
                                   QStringLiteral("text messages"),
                                   QStringLiteral("/mdm/smsfilter/textin"),
                                   QStringLiteral("org.corvaneos.ofono.mdm.SmsFilter"),
                                   QStringLiteral("Text"),
                                   QStringLiteral("smsFilter")};
    QTest::newRow("data") << Family{QStringLiteral("data"),
                                    QStringLiteral("mobile data"),
                                    QStringLiteral("/mdm/gprsfilter"),
                                    QStringLiteral("org.corvaneos.ofono.mdm.GprsFilter"),
                                    QString(),
                                    QStringLiteral("dataFilter")};
}

void MdmctlRulesTest::init()
{
    QFETCH(Family, family);
    call(family, "Clear@Rules");
    call(family, "SetDefault@Action", {2u});
    m_phone.takeJournal(Service);
}

void MdmctlRulesTest::cleanup()
{
    m_phone.clearFaults();
    m_phone.startService(Service);
}

void MdmctlRulesTest::call(const Family &family, const char *method, const QVariantList &arguments)
{
    QDBusMessage message
        = QDBusMessage::createMethodCall(Service, family.path, family.interface, family.member(method));
    message.setArguments(arguments);
    const QDBusMessage reply = QDBusConnection::systemBus().call(message);
    QVERIFY2(reply.type() == QDBusMessage::ReplyMessage, qPrintable(reply.errorMessage()));
}

QJsonObject MdmctlRulesTest::state(const Family &family) const
{
    return m_phone.state().value(family.state).toObject();
}

/** The calls that were to change something. */
QStringList MdmctlRulesTest::changes(const Family &family)
{
    QStringList calls = m_phone.takeJournal(Service);
    calls.removeAll(family.call("GetAll", "()"));
    return calls;
}

Mdmctl::Result MdmctlRulesTest::run(const Family &family, const char *arguments)
{
    return Mdmctl::run(QStringList(family.command) + QString::fromUtf8(arguments).split(QLatin1Char(' ')));
}

void MdmctlRulesTest::shows()
{
    QFETCH(Family, family);
    call(family, "Add@Rule", {QStringLiteral("244051234567890"), 1u});
    call(family, "Add@Rule", {QStringLiteral("26202"), 2u});
    const Mdmctl::Result shown = run(family, "show");
    QCOMPARE(shown.errors, QString());
    QCOMPARE(shown.output,
             QStringLiteral("DEFAULT  IMSI             ACTION\n"
                            "allow    244051234567890  block\n"
                            "         26202            allow\n"));
    QCOMPARE(shown.status, 0);
    QCOMPARE(run(family, "show --json").json(), state(family));
    QCOMPARE(state(family),
             json(R"({"default": "allow", "rules": [{"imsi": "244051234567890", "action": "block"},
                                                    {"imsi": "26202", "action": "allow"}]})"));
}

void MdmctlRulesTest::addsChangesAndRemoves()
{
    QFETCH(Family, family);
    const Mdmctl::Result added = run(family, "add 1 block");
    QCOMPARE(added.errors, QString());
    QCOMPARE(added.output, QStringLiteral("DEFAULT  IMSI  ACTION\nallow    1     block\n"));
    QCOMPARE(run(family, "add 1 block").output,
             QStringLiteral("Already so, nothing to change.\nDEFAULT  IMSI  ACTION\nallow    1     block\n"));
    QCOMPARE(run(family, "add 1 allow").status, 0);
    QCOMPARE(state(family), json(R"({"default": "allow", "rules": [{"imsi": "1", "action": "allow"}]})"));
    QCOMPARE(run(family, "remove 1").output, QStringLiteral("DEFAULT  IMSI\nallow    no rules\n"));
    QCOMPARE(changes(family),
             QStringList({family.call("Add@Rule", "('1', uint32 1)"),
                          family.call("Add@Rule", "('1', uint32 2)"), family.call("Remove@Rule", "('1',)")}));

    const Mdmctl::Result nothing = run(family, "remove 1");
    QCOMPARE(nothing.errors, QStringLiteral("mdmctl: no rule for 1 to remove\n"));
    QCOMPARE(nothing.status, 1);
    QCOMPARE(changes(family), QStringList());
}

void MdmctlRulesTest::setsAndClears()
{
    QFETCH(Family, family);
    QCOMPARE(run(family, "set 3=block 2=allow").status, 0);
    QCOMPARE(state(family), json(R"({"default": "allow", "rules": [{"imsi": "3", "action": "block"},
                                                    {"imsi": "2", "action": "allow"}]})"));
    QCOMPARE(run(family, "clear").status, 0);
    QVERIFY(run(family, "clear").output.startsWith(QLatin1String("Already so")));
    QCOMPARE(changes(family),
             QStringList({family.call("Set@Rules", "([('3', uint32 1), ('2', 2)],)"),
                          family.call("Clear@Rules", "()")}));
    QCOMPARE(run(family, "set 1=block 1=allow").errors,
             QStringLiteral("mdmctl: IMSI 1 must be named once\n"));
}

void MdmctlRulesTest::setsTheDefault()
{
    QFETCH(Family, family);
    QCOMPARE(run(family, "default block").output, QStringLiteral("DEFAULT  IMSI\nblock    no rules\n"));
    QCOMPARE(changes(family), QStringList(family.call("SetDefault@Action", "(uint32 1,)")));
    QCOMPARE(state(family), json(R"({"default": "block", "rules": []})"));
}

void MdmctlRulesTest::changesAsJson()
{
    QFETCH(Family, family);
    QCOMPARE(run(family, "add 1 block --json").json(),
             json(R"({"changed": true, "default": "allow", "rules": [{"imsi": "1", "action": "block"}]})"));
    QCOMPARE(run(family, "add 1 block --json").json(),
             json(R"({"changed": false, "default": "allow", "rules": [{"imsi": "1", "action": "block"}]})"));
}

void MdmctlRulesTest::knowsNoHangup()
{
    QFETCH(Family, family);
    const QString fault = QStringLiteral("must be one of \"block\", \"allow\"\n");
    for (const char *arguments : {"add 1 hangup", "default hangup"}) {
        const Mdmctl::Result refused = run(family, arguments);
        QCOMPARE(refused.errors, QStringLiteral("mdmctl: ACTION \"hangup\": ") + fault);
        QCOMPARE(refused.status, 2);
    }
    const Mdmctl::Result refused = run(family, "set 1=hangup");
    QCOMPARE(refused.errors,
             QStringLiteral("mdmctl: IMSI=ACTION \"1=hangup\": unknown action \"hangup\": ") + fault);
    QCOMPARE(refused.status, 2);
    QCOMPARE(m_phone.takeJournal(Service), QStringList());
}

void MdmctlRulesTest::refusalIsToldInTheServicesWords()
{
    QFETCH(Family, family);
    m_phone.failCalls(Service, family.path, family.member("Add@Rule"),
                      QStringLiteral("org.ofono.Error.Failed"), QStringLiteral("no room"));
    const Mdmctl::Result refused = run(family, "add 1 block");
    QCOMPARE(refused.errors,
             QStringLiteral("mdmctl: the telephony service (org.ofono) refused: no room "
                            "(org.ofono.Error.Failed)\n"));
    QCOMPARE(refused.status, 1);

    m_phone.failCalls(Service, family.path, QStringLiteral("GetAll"), QStringLiteral("org.ofono.Error.Busy"),
                      QStringLiteral("not yet"));
    QCOMPARE(run(family, "show").errors,
             QStringLiteral("mdmctl: the telephony service (org.ofono) refused: not yet "
                            "(org.ofono.Error.Busy)\n"));
}

void MdmctlRulesTest::silenceAndAbsenceAreTold()
{
    QFETCH(Family, family);
    m_phone.swallowCalls(Service, family.path, QStringLiteral("GetAll"));
    const Mdmctl::Result silent = run(family, "show --timeout 0.2");
    QCOMPARE(silent.errors,
             QStringLiteral("mdmctl: the telephony service (org.ofono) did not tell its rules for %1 "
                            "within 0.2 s\n")
                 .arg(family.subject));
    QCOMPARE(silent.status, 1);

    m_phone.stopService(Service);
    const Mdmctl::Result absent = run(family, "default block");
    QCOMPARE(absent.errors, QStringLiteral("mdmctl: the telephony service (org.ofono) is not running\n"));
    QCOMPARE(absent.status, 3);
}

void MdmctlRulesTest::watches()
{
    QFETCH(Family, family);
    call(family, "Add@Rule", {QStringLiteral("1"), 1u});
    Mdmctl asJson({family.command, QStringLiteral("watch"), QStringLiteral("--json")});
    QVERIFY(asJson.waitForOutput(QStringLiteral("watching")));
    Mdmctl forPeople({family.command, QStringLiteral("watch")});
    QVERIFY(forPeople.waitForOutput(QStringLiteral("Watching the rules for %1.\n").arg(family.subject)));
    call(family, "Add@Rule", {QStringLiteral("1"), 2u});
    call(family, "Remove@Rule", {QStringLiteral("1")});
    call(family, "SetDefault@Action", {1u});
    QVERIFY(asJson.waitForOutput(QStringLiteral("defaultChanged")));
    QVERIFY(forPeople.waitForOutput(QStringLiteral("Z  rule changed: 1=allow\n")));
    QVERIFY(forPeople.waitForOutput(QStringLiteral("Z  rule removed: 1=allow\n")));
    QVERIFY(forPeople.waitForOutput(QStringLiteral("Z  default changed to block\n")));
    asJson.interrupt(SIGINT);
    forPeople.interrupt(SIGTERM);
    QCOMPARE(forPeople.finish().status, 0);
    const Mdmctl::Result watched = asJson.finish();
    QCOMPARE(watched.status, 0);

    QVector<QJsonObject> events = watched.jsonLines();
    for (QJsonObject &event : events)
        event.remove(QStringLiteral("time"));
    QCOMPARE(events,
             QVector<QJsonObject>({json(R"({"event": "watching"})"),
                                   json(R"({"event": "ruleChanged", "imsi": "1", "action": "allow"})"),
                                   json(R"({"event": "ruleRemoved", "imsi": "1", "action": "allow"})"),
                                   json(R"({"event": "defaultChanged", "action": "block"})")}));
}

void MdmctlRulesTest::policyIsAppliedAndExported()
{
    QFETCH(Family, family);
    const QByteArray policy = "{\"name\": \"Test\", \"" + family.command.toLatin1()
        + R"(": {"default": "block", "rules": [{"imsi": "*", "action": "block"},
                                              {"imsi": "244051234567890", "action": "allow"}]}})";
    const QStringList words{QStringLiteral("policy"), QStringLiteral("apply"), QStringLiteral("-")};
    const Mdmctl::Result applied = Mdmctl::run(words, policy);
    QCOMPARE(applied.errors, QString());
    QString expected = QStringLiteral("SETTING        STATUS   BEFORE    WANTED                 DETAIL\n"
                                      "sms.default    changed  allow     block\n"
                                      "sms.rules      changed  no rules  262021234567891=block  add "
                                      "262021234567891=block\n"
                                      "                                  244051234567890=allow  add "
                                      "244051234567890=allow\n"
                                      "\n"
                                      "Test: 2 changed.\n");
    // Columns are as wide as what is in them.
    expected.replace(QLatin1String("sms."), family.command + QLatin1Char('.'));
    const auto squeezed = [](QString text) {
        return text.replace(QRegularExpression(QStringLiteral(" +")), QStringLiteral(" "));
    };
    QCOMPARE(squeezed(applied.output), squeezed(expected));
    QCOMPARE(applied.status, 0);
    const QJsonObject wanted
        = json(R"({"default": "block", "rules": [{"imsi": "262021234567891", "action": "block"},
                                                 {"imsi": "244051234567890", "action": "allow"}]})");
    QCOMPARE(state(family), wanted);

    m_phone.takeJournal(Service);
    QCOMPARE(Mdmctl::run(words, policy).status, 0);
    for (const QString &call : m_phone.takeJournal(Service))
        QVERIFY2(call.contains(QLatin1String(" Get")), qPrintable(call));

    const Mdmctl::Result exported = Mdmctl::run({QStringLiteral("policy"), QStringLiteral("export")});
    QCOMPARE(exported.json().value(family.command).toObject(), wanted);
    call(family, "Clear@Rules");
    QCOMPARE(
        Mdmctl::run({QStringLiteral("policy"), QStringLiteral("check"), QStringLiteral("-")}, policy).status,
        1);
}

void MdmctlRulesTest::policyFaultIsToldWithItsPath()
{
    QFETCH(Family, family);
    const auto errorOf = [&](const char *section) {
        const QByteArray policy = "{\"" + family.command.toLatin1() + "\": " + QByteArray(section) + "}";
        const Mdmctl::Result refused
            = Mdmctl::run({QStringLiteral("policy"), QStringLiteral("apply"), QStringLiteral("-")}, policy);
        return QStringLiteral("%1 %2").arg(refused.status).arg(refused.errors);
    };
    const QString start = QStringLiteral("2 mdmctl: standard input: /") + family.command;
    QCOMPARE(errorOf(R"({"rules": [{"imsi": "1", "action": "block"}, {"imsi": "1", "action": "allow"}]})"),
             start + QStringLiteral("/rules/1/imsi: must be named once; \"1\" has a rule already\n"));
    QCOMPARE(errorOf(R"({"rules": [{"imsi": "1", "action": "hangup"}]})"),
             start + QStringLiteral("/rules/0/action: must be one of \"allow\", \"block\"; is \"hangup\"\n"));
    QCOMPARE(errorOf(R"({"default": "hangup"})"),
             start + QStringLiteral("/default: must be one of \"allow\", \"block\"; is \"hangup\"\n"));
    QCOMPARE(m_phone.takeJournal(Service), QStringList());
}

void MdmctlRulesTest::policyWatchFollowsTheSims()
{
    QFETCH(Family, family);
    QTemporaryFile file;
    QVERIFY(file.open());
    file.write("{\"" + family.command.toLatin1() + R"(": {"rules": [{"imsi": "*", "action": "block"}]}})");
    file.close();
    Mdmctl watch({QStringLiteral("policy"), QStringLiteral("watch"), file.fileName()});
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching for drift from ")));
    m_phone.act(QStringLiteral("sim pull"), {QStringLiteral("1")});
    m_phone.act(QStringLiteral("sim insert"), {QStringLiteral("1"), QStringLiteral("262029999999999")});
    QVERIFY(watch.waitForOutput(QStringLiteral("add 262029999999999=block")));
    call(family, "Clear@Rules");
    QVERIFY(watch.waitForOutput(QStringLiteral("add 244051234567890=block; add 262029999999999=block")));
    m_phone.act(QStringLiteral("sim pull"), {QStringLiteral("1")});
    m_phone.act(QStringLiteral("sim insert"), {QStringLiteral("1"), QStringLiteral("262021234567891")});
    QVERIFY(watch.waitForOutput(QStringLiteral("add 262021234567891=block")));
    watch.interrupt(SIGINT);
    QCOMPARE(watch.finish().status, 0);
}

QTEST_GUILESS_MAIN(MdmctlRulesTest)
#include "mdmctl_rules_test.moc"
