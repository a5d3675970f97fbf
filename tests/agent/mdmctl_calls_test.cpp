// SPDX-License-Identifier: LGPL-2.1-or-later
#include "callalarm.h"
#include "mdmctl.h"
#include "phone.h"
#include "waiting.h"

#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtTest/QtTest>

#include <csignal>

namespace
{

const QString Service = QStringLiteral("org.ofono");
const QString Dial = QStringLiteral("/mdm/voicecallfilter/dial");
const QString Incoming = QStringLiteral("/mdm/voicecallfilter/incoming");
const QString Sim = QStringLiteral("244051234567890");

QStringList words(const char *text)
{
    return QString::fromUtf8(text).split(QLatin1Char(' '));
}

Mdmctl::Result run(const char *arguments)
{
    return Mdmctl::run(words(arguments));
}

QJsonObject json(const char *text)
{
    return QJsonDocument::fromJson(text).object();
}

} // namespace

class MdmctlCallsTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void showsBothDirections();
    void showsJson();
    void addWaitsAndShowsWhatHolds();
    void addChangesTheAction();
    void addOfWhatIsThereSendsNothing();
    void removes();
    void removeOfWhatIsNotThereFails();
    void setsTheWholeList();
    void clears();
    void setsTheDefault();
    void changesAsJson();
    void refusalIsToldInTheServicesWords();
    void refusedStateIsToldAtOnce();
    void serviceThatDoesNotAnswerEndsTheWait();
    void absentServiceIsToldAtOnce();
    void serviceThatDiesEndsTheWait();
    void absentBusIsTold();
    void interruptedWaitFails();
    void watchTellsEachChangeOnce();
    void watchForPeople();
    void watchEndsWithTheService();

private:
    void call(const QString &path, const QString &method, const QVariantList &arguments = {});
    QJsonObject filter(const QString &direction) const;
    QStringList changes();

    Phone m_phone;
    CallAlarm m_alarm;
};

void MdmctlCallsTest::init()
{
    for (const QString &path : {Dial, Incoming}) {
        call(path, QStringLiteral("ClearRules"));
        call(path, QStringLiteral("SetDefaultAction"), {2u});
    }
    m_phone.takeJournal(Service);
}

void MdmctlCallsTest::cleanup()
{
    m_phone.clearFaults();
    m_phone.startService(Service);
}

void MdmctlCallsTest::call(const QString &path, const QString &method, const QVariantList &arguments)
{
    QDBusMessage message = QDBusMessage::createMethodCall(
        Service, path, QStringLiteral("org.corvaneos.ofono.mdm.VoiceCallFilter"), method);
    message.setArguments(arguments);
    const QDBusMessage reply = QDBusConnection::systemBus().call(message);
    QVERIFY2(reply.type() == QDBusMessage::ReplyMessage, qPrintable(reply.errorMessage()));
}

QJsonObject MdmctlCallsTest::filter(const QString &direction) const
{
    return m_phone.state().value(QLatin1String("callFilters")).toObject().value(direction).toObject();
}

/** The calls that were to change something. */
QStringList MdmctlCallsTest::changes()
{
    QStringList calls = m_phone.takeJournal(Service);
    calls.erase(
        std::remove_if(calls.begin(), calls.end(),
                       [](const QString &entry) { return entry.contains(QLatin1String(" GetAll ")); }),
        calls.end());
    return calls;
}

void MdmctlCallsTest::showsBothDirections()
{
    call(Dial, QStringLiteral("AddRule"), {Sim, 1u});
    call(Dial, QStringLiteral("AddRule"), {QStringLiteral("26202"), 2u});
    call(Incoming, QStringLiteral("SetDefaultAction"), {3u});
    const Mdmctl::Result shown = run("calls show");
    QCOMPARE(shown.errors, QString());
    QCOMPARE(shown.output,
             QStringLiteral("DIRECTION  DEFAULT  IMSI             ACTION\n"
                            "dial       allow    244051234567890  block\n"
                            "                    26202            allow\n"
                            "incoming   hangup   no rules\n"));
    QCOMPARE(shown.status, 0);
}

void MdmctlCallsTest::showsJson()
{
    call(Incoming, QStringLiteral("AddRule"), {Sim, 3u});
    const QJsonObject expected = json(R"({"dial": {"default": "allow", "rules": []},
                   "incoming": {"default": "allow", "rules": [{"imsi": "244051234567890", "action": "hangup"}]}})");
    QCOMPARE(run("calls show --json").json(), expected);
    QCOMPARE(run("--json calls show").json(), expected);
}

void MdmctlCallsTest::addWaitsAndShowsWhatHolds()
{
    m_phone.delayCalls(Service, Dial, QStringLiteral("AddRule"), 50);
    const Mdmctl::Result added = run("calls add dial 244051234567890 block");
    QCOMPARE(added.errors, QString());
    QCOMPARE(added.output,
             QStringLiteral("DIRECTION  DEFAULT  IMSI             ACTION\n"
                            "dial       allow    244051234567890  block\n"));
    QCOMPARE(added.status, 0);
    QCOMPARE(changes(), QStringList(Dial + QStringLiteral(" AddRule ('244051234567890', uint32 1)")));
    QCOMPARE(filter(QStringLiteral("dial")),
             json(R"({"default": "allow", "rules": [{"imsi": "244051234567890", "action": "block"}]})"));
}

void MdmctlCallsTest::addChangesTheAction()
{
    QCOMPARE(run("calls add incoming 1 block").status, 0);
    QCOMPARE(run("calls add incoming 1 hangup").status, 0);
    QCOMPARE(filter(QStringLiteral("incoming")),
             json(R"({"default": "allow", "rules": [{"imsi": "1", "action": "hangup"}]})"));
}

void MdmctlCallsTest::addOfWhatIsThereSendsNothing()
{
    call(Dial, QStringLiteral("AddRule"), {QStringLiteral("1"), 1u});
    m_phone.takeJournal(Service);
    const Mdmctl::Result added = run("calls add dial 1 block");
    QCOMPARE(added.output,
             QStringLiteral("Already so, nothing to change.\n"
                            "DIRECTION  DEFAULT  IMSI  ACTION\n"
                            "dial       allow    1     block\n"));
    QCOMPARE(added.status, 0);
    QCOMPARE(changes(), QStringList());
}

void MdmctlCallsTest::removes()
{
    call(Dial, QStringLiteral("AddRule"), {QStringLiteral("1"), 1u});
    const Mdmctl::Result removed = run("calls remove dial 1");
    QCOMPARE(removed.output,
             QStringLiteral("DIRECTION  DEFAULT  IMSI\n"
                            "dial       allow    no rules\n"));
    QCOMPARE(removed.status, 0);
    QCOMPARE(filter(QStringLiteral("dial")), json(R"({"default": "allow", "rules": []})"));
}

void MdmctlCallsTest::removeOfWhatIsNotThereFails()
{
    const Mdmctl::Result removed = run("calls remove incoming 1 --json");
    QCOMPARE(removed.errors, QStringLiteral("mdmctl: no incoming rule for 1 to remove\n"));
    QCOMPARE(removed.output, QString());
    QCOMPARE(removed.status, 1);
    QCOMPARE(changes(), QStringList());
}

void MdmctlCallsTest::setsTheWholeList()
{
    call(Incoming, QStringLiteral("AddRule"), {QStringLiteral("1"), 1u});
    QCOMPARE(run("calls set incoming 3=hangup 2=allow").status, 0);
    QCOMPARE(filter(QStringLiteral("incoming")),
             json(R"({"default": "allow", "rules": [{"imsi": "3", "action": "hangup"},
                                                    {"imsi": "2", "action": "allow"}]})"));
    m_phone.takeJournal(Service);
    QVERIFY(run("calls set incoming 3=hangup 2=allow").output.startsWith(QStringLiteral("Already so")));
    QCOMPARE(changes(), QStringList());
}

void MdmctlCallsTest::clears()
{
    call(Dial, QStringLiteral("AddRule"), {QStringLiteral("1"), 1u});
    m_phone.takeJournal(Service);
    QCOMPARE(run("calls clear dial").status, 0);
    QCOMPARE(changes(), QStringList(Dial + QStringLiteral(" ClearRules ()")));
    QCOMPARE(run("calls clear dial").status, 0);
    QCOMPARE(changes(), QStringList());
}

void MdmctlCallsTest::setsTheDefault()
{
    QCOMPARE(run("calls default incoming hangup").status, 0);
    QCOMPARE(filter(QStringLiteral("incoming")), json(R"({"default": "hangup", "rules": []})"));
    QCOMPARE(filter(QStringLiteral("dial")), json(R"({"default": "allow", "rules": []})"));
}

void MdmctlCallsTest::changesAsJson()
{
    const QJsonObject added = run("calls add dial 1 block --json").json();
    QCOMPARE(added, json(R"({"changed": true, "direction": "dial", "default": "allow",
                             "rules": [{"imsi": "1", "action": "block"}]})"));
    QJsonObject again = added;
    again.insert(QStringLiteral("changed"), false);
    QCOMPARE(run("calls add dial 1 block --json").json(), again);
}

void MdmctlCallsTest::refusalIsToldInTheServicesWords()
{
    m_phone.failCalls(Service, Dial, QStringLiteral("AddRule"), QStringLiteral("org.ofono.Error.Failed"),
                      QStringLiteral("no room"));
    const Mdmctl::Result refused = run("calls add dial 1 block");
    QCOMPARE(refused.errors,
             QStringLiteral("mdmctl: the telephony service (org.ofono) refused: no room "
                            "(org.ofono.Error.Failed)\n"));
    QCOMPARE(refused.output, QString());
    QCOMPARE(refused.status, 1);
}

void MdmctlCallsTest::refusedStateIsToldAtOnce()
{
    m_phone.failCalls(Service, Incoming, QStringLiteral("GetAll"), QStringLiteral("org.ofono.Error.Busy"),
                      QStringLiteral("not yet"));
    const Mdmctl::Result refused = run("calls show");
    QCOMPARE(refused.errors,
             QStringLiteral("mdmctl: the telephony service (org.ofono) refused: not yet "
                            "(org.ofono.Error.Busy)\n"));
    QCOMPARE(refused.status, 1);
}

void MdmctlCallsTest::serviceThatDoesNotAnswerEndsTheWait()
{
    m_phone.swallowCalls(Service, Dial, QStringLiteral("SetRules"));
    const Mdmctl::Result silent = run("calls set dial 1=block --timeout 0.2");
    QCOMPARE(silent.errors,
             QStringLiteral("mdmctl: the telephony service (org.ofono) did not confirm the change "
                            "within 0.2 s\n"));
    QCOMPARE(silent.status, 1);

    m_phone.swallowCalls(Service, Dial, QStringLiteral("GetAll"));
    QCOMPARE(run("calls show --timeout 0.2").errors,
             QStringLiteral("mdmctl: the telephony service (org.ofono) did not tell its rules for calls "
                            "within 0.2 s\n"));
}

void MdmctlCallsTest::absentServiceIsToldAtOnce()
{
    m_phone.stopService(Service);
    for (const char *command : {"calls show", "calls add dial 1 block", "calls watch"}) {
        QElapsedTimer elapsed;
        elapsed.start();
        const Mdmctl::Result absent = run(command);
        QVERIFY(elapsed.elapsed() < Mdmctl::shortestTimeout);
        QCOMPARE(absent.errors, QStringLiteral("mdmctl: the telephony service (org.ofono) is not running\n"));
        QCOMPARE(absent.output, QString());
        QCOMPARE(absent.status, 3);
    }
}

void MdmctlCallsTest::serviceThatDiesEndsTheWait()
{
    m_phone.swallowCalls(Service, Dial, QStringLiteral("AddRule"));
    Mdmctl mdmctl(words("calls add dial 1 block"));
    QVERIFY(waitUntil([this] { return !changes().isEmpty(); }));
    m_phone.stopService(Service);
    const Mdmctl::Result result = mdmctl.finish();
    QVERIFY2(result.status == 3, qPrintable(result.errors));
    QCOMPARE(result.errors, QStringLiteral("mdmctl: the telephony service (org.ofono) is not running\n"));
}

void MdmctlCallsTest::absentBusIsTold()
{
    qputenv("DBUS_SYSTEM_BUS_ADDRESS", "unix:path=/nowhere");
    const Mdmctl::Result absent = run("calls show");
    qunsetenv("DBUS_SYSTEM_BUS_ADDRESS");
    QVERIFY2(absent.errors.startsWith(QStringLiteral("mdmctl: the system bus cannot be reached: ")),
             qPrintable(absent.errors));
    QCOMPARE(absent.status, 3);
}

void MdmctlCallsTest::interruptedWaitFails()
{
    m_phone.swallowCalls(Service, Dial, QStringLiteral("AddRule"));
    Mdmctl mdmctl(words("calls add dial 1 block"));
    QVERIFY(waitUntil([this] { return !changes().isEmpty(); }));
    mdmctl.interrupt(SIGINT);
    const Mdmctl::Result result = mdmctl.finish();
    QCOMPARE(result.errors, QStringLiteral("mdmctl: interrupted\n"));
    QCOMPARE(result.status, 1);
}

void MdmctlCallsTest::watchTellsEachChangeOnce()
{
    call(Dial, QStringLiteral("AddRule"), {QStringLiteral("1"), 1u});
    Mdmctl watch(words("calls watch --json"));
    QVERIFY(watch.waitForOutput(QStringLiteral("watching")));
    call(Dial, QStringLiteral("AddRule"), {QStringLiteral("2"), 2u});
    call(Dial, QStringLiteral("AddRule"), {QStringLiteral("1"), 2u});
    call(Dial, QStringLiteral("RemoveRule"), {QStringLiteral("2")});
    call(Incoming, QStringLiteral("SetDefaultAction"), {3u});
    QVERIFY(watch.waitForOutput(QStringLiteral("defaultChanged")));
    watch.interrupt(SIGINT);
    const Mdmctl::Result watched = watch.finish();
    QCOMPARE(watched.status, 0);
    QCOMPARE(watched.errors, QString());

    QVector<QJsonObject> events = watched.jsonLines();
    for (QJsonObject &event : events) {
        const QString time = event.take(QStringLiteral("time")).toString();
        QVERIFY2(QDateTime::fromString(time, Qt::ISODateWithMs).isValid(), qPrintable(time));
    }
    QCOMPARE(events,
             QVector<QJsonObject>(
                 {json(R"({"event": "watching"})"),
                  json(R"({"event": "ruleAdded", "direction": "dial", "imsi": "2", "action": "allow"})"),
                  json(R"({"event": "ruleChanged", "direction": "dial", "imsi": "1", "action": "allow"})"),
                  json(R"({"event": "ruleRemoved", "direction": "dial", "imsi": "2", "action": "allow"})"),
                  json(R"({"event": "defaultChanged", "direction": "incoming", "action": "hangup"})")}));
}

void MdmctlCallsTest::watchForPeople()
{
    QCOMPARE(run("calls set dial 1=block 2=allow").status, 0);
    Mdmctl watch(words("calls watch"));
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching the rules for calls.")));
    QCOMPARE(run("calls set dial 2=allow 1=block").status, 0);
    QVERIFY(watch.waitForOutput(QStringLiteral("Z  dial: order of the rules changed\n")));
    QCOMPARE(run("calls set dial 2=block 3=allow").status, 0);
    QVERIFY(watch.waitForOutput(QStringLiteral("Z  dial: rule removed: 1=block\n")));
    QVERIFY(watch.waitForOutput(QStringLiteral("Z  dial: rule changed: 2=block\n")));
    QVERIFY(watch.waitForOutput(QStringLiteral("Z  dial: rule added: 3=allow\n")));
    watch.interrupt(SIGTERM);
    QCOMPARE(watch.finish().status, 0);
}

void MdmctlCallsTest::watchEndsWithTheService()
{
    Mdmctl watch(words("calls watch"));
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching")));
    m_phone.stopService(Service);
    const Mdmctl::Result watched = watch.finish();
    QCOMPARE(watched.errors, QStringLiteral("mdmctl: the telephony service (org.ofono) is not running\n"));
    QCOMPARE(watched.status, 3);
}

QTEST_GUILESS_MAIN(MdmctlCallsTest)
#include "mdmctl_calls_test.moc"
