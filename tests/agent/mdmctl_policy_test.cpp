// SPDX-License-Identifier: LGPL-2.1-or-later
#include "callalarm.h"
#include "mdmctl.h"
#include "phone.h"
#include "waiting.h"

#include <QtCore/QDir>
#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QTemporaryDir>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtTest/QtTest>

#include <csignal>

namespace
{

const QString Ofono = QStringLiteral("org.ofono");
const QString Proxy = QStringLiteral("org.corvaneos.mdmproxy");
const QString Dial = QStringLiteral("/mdm/voicecallfilter/dial");
const QString Incoming = QStringLiteral("/mdm/voicecallfilter/incoming");

QJsonObject json(const QByteArray &text)
{
    return QJsonDocument::fromJson(text).object();
}

/** What is left of @p calls without those that only look. */
QStringList withoutQueries(QStringList calls)
{
    static const QRegularExpression query(
        QStringLiteral(" (Get[A-Za-z]+|registerClient|unregisterClient|softwareUpdateIsAvailable|"
                       "latestAvailableUpdateVersion) "));
    for (int i = calls.size() - 1; i >= 0; --i) {
        if (query.match(calls.at(i)).hasMatch())
            calls.removeAt(i);
    }
    return calls;
}

/** The members of a policy, as they stand in a message. */
QString members()
{
    QFile schema(QStringLiteral(POLICY_SCHEMA));
    if (!schema.open(QIODevice::ReadOnly))
        qFatal("cannot read the schema");
    const QStringList names = json(schema.readAll()).value(QLatin1String("properties")).toObject().keys();
    return names.join(QStringLiteral("\", \""));
}

QString statuses(const QJsonObject &report)
{
    QStringList texts;
    const QJsonArray settings = report.value(QLatin1String("settings")).toArray();
    for (const QJsonValue &setting : settings)
        texts.append(setting[QLatin1String("path")].toString() + QLatin1Char('=')
                     + setting[QLatin1String("status")].toString());
    return texts.join(QLatin1Char(' '));
}

QString detailOf(const QJsonObject &report, int setting)
{
    return report.value(QLatin1String("settings")).toArray().at(setting)[QLatin1String("detail")].toString();
}

} // namespace

class MdmctlPolicyTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void init();
    void cleanup();

    void checkReportsAndChangesNothing();
    void checkAsATable();
    void checkOfACompliantPhone();
    void orderOfRulesDoesNotMatter();
    void policyFromStandardInput();
    void policyWithoutSettings();
    void wrongPolicyIsRefusedWithThePath_data();
    void wrongPolicyIsRefusedWithThePath();
    void applyMakesThePhoneSoOnce();
    void everySimIsExpanded();
    void unknownSimsFailTheSetting();
    void absentSimsAreNoted();
    void failingSettingDoesNotStopTheOthers();
    void silentServiceFailsTheSetting();
    void missingServiceIsUnsupported();
    void serviceThatDiesWhileApplying();
    void applyInstallsTheLatestUpdate();
    void applyInstallsAFixedVersion();
    void otherVersionIsUnsupported();
    void failedUpdateCheckFailsTheSetting();
    void exportIsWhatCheckAccepts();
    void exportWithoutAService();
    void watchAppliesAndPutsDriftRight();
    void watchFollowsTheSims();
    void watchTakesUpAServiceThatComesBack();
    void watchInstallsAnUpdateThatAppears();
    void watchDoesNotRepeatARefusedChange();
    void watchEndsWithTheBus();
    void examplesAreValid_data();
    void examplesAreValid();
    void schemaIsPrinted();

private:
    void call(const QString &path, const QString &method, const QVariantList &arguments = {});
    QString write(const QByteArray &policy);
    Mdmctl::Result run(const QString &command, const QByteArray &policy, const QStringList &options = {});
    QJsonObject filter(const QString &direction) const;
    QString publish();

    Phone m_phone;
    CallAlarm m_alarm;
    QTemporaryDir m_folder;
    int m_versions = 0;
};

void MdmctlPolicyTest::initTestCase()
{
    QCOMPARE(Mdmctl::run({QStringLiteral("update"), QStringLiteral("check")}).status, 0);
    for (const char *version : {"5.0.0.70", "5.1.0.11"})
        m_phone.act(QStringLiteral("update withdraw"), {QString::fromLatin1(version)});
}

void MdmctlPolicyTest::init()
{
    for (const QString &path : {Dial, Incoming}) {
        call(path, QStringLiteral("ClearRules"));
        call(path, QStringLiteral("SetDefaultAction"), {2u});
    }
    m_phone.takeJournal(Ofono);
}

void MdmctlPolicyTest::cleanup()
{
    m_phone.clearFaults();
    m_phone.startService(Ofono);
    m_phone.startService(Proxy);
}

void MdmctlPolicyTest::call(const QString &path, const QString &method, const QVariantList &arguments)
{
    QDBusMessage message = QDBusMessage::createMethodCall(
        Ofono, path, QStringLiteral("org.corvaneos.ofono.mdm.VoiceCallFilter"), method);
    message.setArguments(arguments);
    const QDBusMessage reply = QDBusConnection::systemBus().call(message);
    QVERIFY2(reply.type() == QDBusMessage::ReplyMessage, qPrintable(reply.errorMessage()));
}

QString MdmctlPolicyTest::write(const QByteArray &policy)
{
    const QString name = m_folder.filePath(QStringLiteral("policy.json"));
    QFile file(name);
    if (!file.open(QIODevice::WriteOnly) || file.write(policy) != policy.size())
        qFatal("cannot write the policy");
    return name;
}

Mdmctl::Result MdmctlPolicyTest::run(const QString &command, const QByteArray &policy,
                                     const QStringList &options)
{
    return Mdmctl::run(QStringList({QStringLiteral("policy"), command, write(policy)}) + options);
}

QJsonObject MdmctlPolicyTest::filter(const QString &direction) const
{
    return m_phone.state().value(QLatin1String("callFilters")).toObject().value(direction).toObject();
}

QString MdmctlPolicyTest::publish()
{
    const QString version = QStringLiteral("6.0.%1").arg(++m_versions);
    m_phone.act(QStringLiteral("update publish"), {version});
    return version;
}

void MdmctlPolicyTest::checkReportsAndChangesNothing()
{
    call(Dial, QStringLiteral("AddRule"), {QStringLiteral("1"), 1u});
    m_phone.takeJournal(Ofono);
    const Mdmctl::Result checked
        = run(QStringLiteral("check"), R"({"name": "Test", "calls": {"dial": {"default": "block",
              "rules": [{"imsi": "2", "action": "allow"}]}, "incoming": {"default": "allow"}},
              "softwareUpdate": {"install": "latest"}})",
              {QStringLiteral("--json")});
    QCOMPARE(checked.errors, QString());
    QCOMPARE(checked.json(), json(R"({"policy": "Test", "compliant": false, "settings": [
        {"path": "calls.dial.default", "status": "different", "present": "allow", "wanted": "block", "detail": ""},
        {"path": "calls.dial.rules", "status": "different", "present": [{"imsi": "1", "action": "block"}],
         "wanted": [{"imsi": "2", "action": "allow"}], "detail": "add 2=allow; remove 1; no SIM 2 in the phone"},
        {"path": "calls.incoming.default", "status": "compliant", "present": "allow", "wanted": "allow", "detail": ""},
        {"path": "softwareUpdate.install", "status": "compliant", "present": null, "wanted": "latest", "detail": ""}
        ]})"));
    QCOMPARE(checked.status, 1);
    QCOMPARE(withoutQueries(m_phone.takeJournal(Ofono)), QStringList());
    QCOMPARE(withoutQueries(m_phone.takeJournal(Proxy)), QStringList());
}

void MdmctlPolicyTest::checkAsATable()
{
    const Mdmctl::Result checked
        = run(QStringLiteral("check"), R"({"name": "Test", "calls": {"dial": {"default": "allow",
              "rules": [{"imsi": "1", "action": "block"}, {"imsi": "2", "action": "allow"}]}}})");
    QCOMPARE(checked.output,
             QStringLiteral("SETTING             STATUS     PRESENT   WANTED   DETAIL\n"
                            "calls.dial.default  compliant  allow     allow\n"
                            "calls.dial.rules    different  no rules  1=block  add 1=block\n"
                            "                                         2=allow  add 2=allow\n"
                            "                                                  no SIM 1 in the phone\n"
                            "                                                  no SIM 2 in the phone\n"
                            "\n"
                            "Test: 1 compliant, 1 different.\n"));
}

void MdmctlPolicyTest::checkOfACompliantPhone()
{
    const Mdmctl::Result checked
        = run(QStringLiteral("check"), R"({"calls": {"dial": {"default": "allow"}}})");
    QCOMPARE(checked.status, 0);
    QVERIFY2(checked.output.endsWith(QStringLiteral("policy.json: 1 compliant.\n")),
             qPrintable(checked.output));
}

void MdmctlPolicyTest::orderOfRulesDoesNotMatter()
{
    call(Dial, QStringLiteral("AddRule"), {QStringLiteral("1"), 1u});
    call(Dial, QStringLiteral("AddRule"), {QStringLiteral("2"), 2u});
    QCOMPARE(run(QStringLiteral("check"), R"({"calls": {"dial": {"rules": [{"imsi": "2", "action": "allow"},
                                              {"imsi": "1", "action": "block"}]}}})")
                 .status,
             0);
}

void MdmctlPolicyTest::policyFromStandardInput()
{
    const QStringList arguments{QStringLiteral("policy"), QStringLiteral("check"), QStringLiteral("-")};
    const Mdmctl::Result checked = Mdmctl::run(arguments, R"({"calls": {"dial": {"default": "block"}}})");
    QVERIFY2(checked.output.endsWith(QStringLiteral("standard input: 1 different.\n")),
             qPrintable(checked.output));
    QCOMPARE(checked.status, 1);
    const Mdmctl::Result wrong = Mdmctl::run(arguments, R"({"calls": {"dial": {"default": "hangup"}}})");
    QCOMPARE(
        wrong.errors,
        QStringLiteral("mdmctl: standard input: /calls/dial/default: must be one of \"allow\", \"block\"; "
                       "is \"hangup\"\n"));
}

void MdmctlPolicyTest::policyWithoutSettings()
{
    const Mdmctl::Result checked = run(QStringLiteral("check"), R"({"name": "Nothing"})");
    QCOMPARE(checked.output, QStringLiteral("Nothing: names no settings.\n"));
    QCOMPARE(checked.status, 0);
}

void MdmctlPolicyTest::wrongPolicyIsRefusedWithThePath_data()
{
    QTest::addColumn<QByteArray>("policy");
    QTest::addColumn<QString>("error");

    QTest::newRow("syntax") << QByteArray("{\n\"calls\": ,}") << R"(FILE:2:10: illegal value)";
    QTest::newRow("unknown family")
        << QByteArray(R"({"call": {}})")
        << QStringLiteral("FILE: /call: unknown member; must be one of \"%1\"").arg(members());
    QTest::newRow("unknown member")
        << QByteArray(R"({"calls": {"dail": {}}})")
        << R"(FILE: /calls/dail: unknown member; must be one of "dial", "incoming")";
    QTest::newRow("action of the other direction")
        << QByteArray(R"({"calls": {"dial": {"rules": [{"imsi": "1", "action": "hangup"}]}}})")
        << R"(FILE: /calls/dial/rules/0/action: must be one of "allow", "block"; is "hangup")";
    QTest::newRow("imsi")
        << QByteArray(R"({"calls": {"dial": {"rules": [{"imsi": "24x", "action": "block"}]}}})")
        << R"(FILE: /calls/dial/rules/0/imsi: must be a string of the form ^([0-9]{1,15}|\*)$ (the IMSI of a SIM, up to )"
           R"(15 digits, or "*" for every SIM in the phone that no other rule names); is "24x")";
    QTest::newRow("repeated imsi")
        << QByteArray(R"({"calls": {"dial": {"rules": [{"imsi": "1", "action": "block"},
                                                       {"imsi": "1", "action": "allow"}]}}})")
        << R"(FILE: /calls/dial/rules/1/imsi: must be named once; "1" has a rule already)";
    QTest::newRow("version")
        << QByteArray(R"({"softwareUpdate": {"install": ""}})")
        << R"(FILE: /softwareUpdate/install: must be a string of at least 1 character(s); is "")";
}

void MdmctlPolicyTest::wrongPolicyIsRefusedWithThePath()
{
    QFETCH(QByteArray, policy);
    QFETCH(QString, error);
    for (const char *command : {"check", "apply", "watch"}) {
        Mdmctl::Result refused = run(QString::fromLatin1(command), policy);
        refused.errors.replace(m_folder.filePath(QStringLiteral("policy.json")), QStringLiteral("FILE"));
        QCOMPARE(refused.errors, QStringLiteral("mdmctl: %1\n").arg(error));
        QCOMPARE(refused.output, QString());
        QCOMPARE(refused.status, 2);
    }
    QCOMPARE(m_phone.takeJournal(Ofono), QStringList());
}

void MdmctlPolicyTest::applyMakesThePhoneSoOnce()
{
    call(Dial, QStringLiteral("AddRule"), {QStringLiteral("9"), 1u});
    m_phone.takeJournal(Ofono);
    const QByteArray policy = R"({"name": "Test", "calls": {
        "dial": {"default": "block", "rules": [{"imsi": "1", "action": "allow"}]},
        "incoming": {"default": "hangup", "rules": []}}})";
    const Mdmctl::Result applied = run(QStringLiteral("apply"), policy);
    QCOMPARE(applied.errors, QString());
    QCOMPARE(applied.output,
             QStringLiteral("SETTING                 STATUS     BEFORE    WANTED    DETAIL\n"
                            "calls.dial.default      changed    allow     block\n"
                            "calls.dial.rules        changed    9=block   1=allow   add 1=allow\n"
                            "                                                       remove 9\n"
                            "                                                       no SIM 1 in the phone\n"
                            "calls.incoming.default  changed    allow     hangup\n"
                            "calls.incoming.rules    compliant  no rules  no rules\n"
                            "\n"
                            "Test: 1 compliant, 3 changed.\n"));
    QCOMPARE(applied.status, 0);
    QCOMPARE(withoutQueries(m_phone.takeJournal(Ofono)),
             QStringList({Dial + QStringLiteral(" SetDefaultAction (uint32 1,)"),
                          Dial + QStringLiteral(" SetRules ([('1', uint32 2)],)"),
                          Incoming + QStringLiteral(" SetDefaultAction (uint32 3,)")}));
    QCOMPARE(filter(QStringLiteral("dial")),
             json(R"({"default": "block", "rules": [{"imsi": "1", "action": "allow"}]})"));

    const Mdmctl::Result again = run(QStringLiteral("apply"), policy, {QStringLiteral("--json")});
    QCOMPARE(again.status, 0);
    QCOMPARE(again.json().value(QLatin1String("compliant")), QJsonValue(true));
    QCOMPARE(withoutQueries(m_phone.takeJournal(Ofono)), QStringList());
}

void MdmctlPolicyTest::everySimIsExpanded()
{
    QCOMPARE(run(QStringLiteral("apply"), R"({"calls": {"incoming": {"rules": [
                 {"imsi": "*", "action": "hangup"}, {"imsi": "244051234567890", "action": "allow"}]}}})")
                 .status,
             0);
    QCOMPARE(filter(QStringLiteral("incoming")),
             json(R"({"default": "allow", "rules": [{"imsi": "262021234567891", "action": "hangup"},
                                                    {"imsi": "244051234567890", "action": "allow"}]})"));
}

void MdmctlPolicyTest::unknownSimsFailTheSetting()
{
    m_phone.failCalls(Ofono, QString(), QStringLiteral("GetIMEI"), QStringLiteral("org.ofono.Error.Failed"),
                      QStringLiteral("no modems"));
    const QByteArray everySim = R"({"calls": {"dial": {"rules": [{"imsi": "*", "action": "block"}]}}})";
    const Mdmctl::Result applied = run(QStringLiteral("apply"), everySim, {QStringLiteral("--json")});
    QCOMPARE(statuses(applied.json()), QStringLiteral("calls.dial.rules=failed"));
    QCOMPARE(detailOf(applied.json(), 0),
             QStringLiteral("the SIMs of the phone are not known: the telephony service (org.ofono) does not "
                            "tell its SIM slots"));
    QCOMPARE(applied.status, 1);
    QCOMPARE(withoutQueries(m_phone.takeJournal(Ofono)), QStringList());
    QCOMPARE(
        run(QStringLiteral("apply"), R"({"calls": {"dial": {"rules": [{"imsi": "1", "action": "block"}]}}})")
            .status,
        0);
}

void MdmctlPolicyTest::absentSimsAreNoted()
{
    const QByteArray policy = R"({"calls": {"dial": {"rules": [{"imsi": "244051234567890", "action": "block"},
        {"imsi": "310150123456789", "action": "block"}]}}})";
    const QString note = QStringLiteral("no SIM 310150123456789 in the phone");
    QCOMPARE(run(QStringLiteral("apply"), policy).status, 0);
    // The phone keeps a rule for a SIM that is elsewhere: the setting is as wanted.
    const Mdmctl::Result checked = run(QStringLiteral("check"), policy, {QStringLiteral("--json")});
    QCOMPARE(statuses(checked.json()), QStringLiteral("calls.dial.rules=compliant"));
    QCOMPARE(detailOf(checked.json(), 0), note);
    QCOMPARE(checked.status, 0);

    // Where the SIMs are not known there is nothing to note.
    m_phone.failCalls(Ofono, QString(), QStringLiteral("GetIMEI"), QStringLiteral("org.ofono.Error.Failed"),
                      QString());
    const Mdmctl::Result unknown = run(QStringLiteral("check"), policy, {QStringLiteral("--json")});
    QCOMPARE(statuses(unknown.json()), QStringLiteral("calls.dial.rules=compliant"));
    QCOMPARE(detailOf(unknown.json(), 0), QString());
}

void MdmctlPolicyTest::failingSettingDoesNotStopTheOthers()
{
    m_phone.failCalls(Ofono, Dial, QStringLiteral("SetRules"), QStringLiteral("org.ofono.Error.Failed"),
                      QStringLiteral("no room"));
    const Mdmctl::Result applied
        = run(QStringLiteral("apply"), R"({"calls": {"dial": {"rules": [{"imsi": "1", "action": "block"}]},
              "incoming": {"rules": [{"imsi": "1", "action": "hangup"}]}}})",
              {QStringLiteral("--json")});
    QCOMPARE(statuses(applied.json()),
             QStringLiteral("calls.dial.rules=failed calls.incoming.rules=changed"));
    QCOMPARE(detailOf(applied.json(), 0),
             QStringLiteral("the telephony service (org.ofono) refused: no room (org.ofono.Error.Failed)"));
    QCOMPARE(applied.errors, QString());
    QCOMPARE(applied.status, 1);
    QCOMPARE(filter(QStringLiteral("incoming")),
             json(R"({"default": "allow", "rules": [{"imsi": "1", "action": "hangup"}]})"));
}

void MdmctlPolicyTest::silentServiceFailsTheSetting()
{
    m_phone.swallowCalls(Ofono, Dial, QStringLiteral("SetDefaultAction"));
    const Mdmctl::Result applied
        = run(QStringLiteral("apply"), R"({"calls": {"dial": {"default": "block"}}})",
              {QStringLiteral("--timeout"), QStringLiteral("0.2"), QStringLiteral("--json")});
    QCOMPARE(detailOf(applied.json(), 0),
             QStringLiteral("the telephony service (org.ofono) did not confirm the change within 0.2 s"));
    QCOMPARE(applied.status, 1);
}

void MdmctlPolicyTest::missingServiceIsUnsupported()
{
    m_phone.stopService(Ofono);
    const QByteArray policy
        = R"({"calls": {"dial": {"default": "allow"}}, "softwareUpdate": {"install": "latest"}})";
    for (const char *command : {"check", "apply"}) {
        const Mdmctl::Result result = run(QString::fromLatin1(command), policy, {QStringLiteral("--json")});
        QCOMPARE(statuses(result.json()),
                 QStringLiteral("calls.dial.default=unsupported softwareUpdate.install=compliant"));
        QCOMPARE(detailOf(result.json(), 0),
                 QStringLiteral("the telephony service (org.ofono) is not running"));
        QCOMPARE(result.status, 3);
    }
    publish();
    QCOMPARE(run(QStringLiteral("check"), policy).status, 1);
    QCOMPARE(run(QStringLiteral("apply"), policy).status, 3);
}

void MdmctlPolicyTest::serviceThatDiesWhileApplying()
{
    m_phone.swallowCalls(Ofono, Dial, QStringLiteral("SetDefaultAction"));
    Mdmctl apply({QStringLiteral("policy"), QStringLiteral("apply"), QStringLiteral("--json"),
                  write(R"({"calls": {"dial": {"default": "block"}, "incoming": {"default": "block"}}})")});
    QVERIFY(waitUntil([this] { return !withoutQueries(m_phone.takeJournal(Ofono)).isEmpty(); }));
    m_phone.stopService(Ofono);
    const Mdmctl::Result applied = apply.finish();
    QCOMPARE(statuses(applied.json()),
             QStringLiteral("calls.dial.default=failed calls.incoming.default=failed"));
    QCOMPARE(detailOf(applied.json(), 1), QStringLiteral("the telephony service (org.ofono) is not running"));
    QCOMPARE(applied.status, 3);
}

void MdmctlPolicyTest::applyInstallsTheLatestUpdate()
{
    const QString version = publish();
    const Mdmctl::Result applied
        = run(QStringLiteral("apply"), R"({"softwareUpdate": {"install": "latest"}})");
    QVERIFY2(applied.output.contains(
                 QStringLiteral("softwareUpdate.install  changed  %1 on offer  latest  install %1\n")
                     .arg(version)),
             qPrintable(applied.output));
    QVERIFY2(applied.errors.startsWith(QStringLiteral("softwareUpdate.install: 0%\n")),
             qPrintable(applied.errors));
    QCOMPARE(applied.status, 0);
    const QJsonObject updates = m_phone.state().value(QLatin1String("softwareUpdate")).toObject();
    QCOMPARE(updates.value(QLatin1String("installed")).toString(), version);
    QCOMPARE(updates.value(QLatin1String("clients")).toInt(), 0);
}

void MdmctlPolicyTest::applyInstallsAFixedVersion()
{
    const QByteArray version = publish().toUtf8();
    const QByteArray policy = R"({"softwareUpdate": {"install": ")" + version + R"("}})";
    QCOMPARE(run(QStringLiteral("check"), policy).status, 1);
    const Mdmctl::Result applied = run(QStringLiteral("apply"), policy, {QStringLiteral("--json")});
    QCOMPARE(statuses(applied.json()), QStringLiteral("softwareUpdate.install=changed"));
    QCOMPARE(applied.errors, QString());
    QCOMPARE(run(QStringLiteral("check"), policy).status, 0);
}

void MdmctlPolicyTest::otherVersionIsUnsupported()
{
    const QString version = publish();
    const Mdmctl::Result applied = run(QStringLiteral("apply"), R"({"softwareUpdate": {"install": "5.5"}})",
                                       {QStringLiteral("--json")});
    QCOMPARE(statuses(applied.json()), QStringLiteral("softwareUpdate.install=unsupported"));
    QCOMPARE(detailOf(applied.json(), 0),
             QStringLiteral("the phone offers %1 and no other version").arg(version));
    QCOMPARE(applied.status, 1);
    m_phone.act(QStringLiteral("update withdraw"), {version});
}

void MdmctlPolicyTest::failedUpdateCheckFailsTheSetting()
{
    m_phone.answerCalls(Proxy, QString(), QStringLiteral("checkForSoftwareUpdate"), {});
    Mdmctl apply(
        {QStringLiteral("policy"), QStringLiteral("apply"), QStringLiteral("--json"),
         write(R"({"calls": {"dial": {"default": "block"}}, "softwareUpdate": {"install": "latest"}})")});
    QVERIFY(waitUntil([this] { return !withoutQueries(m_phone.takeJournal(Proxy)).isEmpty(); }));
    m_phone.emitSignal(Proxy, QStringLiteral("/Corvane/Mdm/Proxy/SoftwareUpdate"),
                       QStringLiteral("org.corvaneos.mdmproxy.softwareupdate"),
                       QStringLiteral("softwareUpdateFailed"), {QStringLiteral("No network")});
    const Mdmctl::Result applied = apply.finish();
    QCOMPARE(statuses(applied.json()),
             QStringLiteral("calls.dial.default=changed softwareUpdate.install=failed"));
    QCOMPARE(detailOf(applied.json(), 1), QStringLiteral("the phone reports: No network"));
    QCOMPARE(applied.status, 1);
}

void MdmctlPolicyTest::exportIsWhatCheckAccepts()
{
    call(Dial, QStringLiteral("AddRule"), {QStringLiteral("1"), 1u});
    call(Incoming, QStringLiteral("SetDefaultAction"), {3u});
    const Mdmctl::Result exported = Mdmctl::run({QStringLiteral("policy"), QStringLiteral("export")});
    QCOMPARE(exported.errors, QString());
    QCOMPARE(exported.status, 0);
    const QJsonObject policy = exported.json();
    QVERIFY(policy.value(QLatin1String("name")).toString().startsWith(QStringLiteral("Exported from ")));
    const QJsonObject expected
        = json(R"({"calls": {"dial": {"default": "allow", "rules": [{"imsi": "1", "action": "block"}]},
                             "incoming": {"default": "hangup", "rules": []}},
                   "sms": {"default": "allow", "rules": []},
                   "data": {"default": "allow", "rules": []},
                   "softwareUpdate": {"install": "latest"}})");
    for (auto section = expected.begin(); section != expected.end(); ++section)
        QCOMPARE(policy.value(section.key()), *section);
    QCOMPARE(run(QStringLiteral("check"), exported.output.toUtf8()).status, 0);
    call(Dial, QStringLiteral("ClearRules"));
    QCOMPARE(run(QStringLiteral("check"), exported.output.toUtf8()).status, 1);
    QCOMPARE(run(QStringLiteral("apply"), exported.output.toUtf8()).status, 0);
    QCOMPARE(filter(QStringLiteral("dial")),
             json(R"({"default": "allow", "rules": [{"imsi": "1", "action": "block"}]})"));

    const QString version = publish();
    const Mdmctl::Result behind = Mdmctl::run({QStringLiteral("policy"), QStringLiteral("export")});
    QVERIFY(!behind.json().contains(QStringLiteral("softwareUpdate")));
    QCOMPARE(run(QStringLiteral("check"), behind.output.toUtf8()).status, 0);
    m_phone.act(QStringLiteral("update withdraw"), {version});
}

void MdmctlPolicyTest::exportWithoutAService()
{
    m_phone.stopService(Ofono);
    const Mdmctl::Result exported = Mdmctl::run({QStringLiteral("policy"), QStringLiteral("export")});
    const QStringList errors = exported.errors.split(QLatin1Char('\n'), Qt::SkipEmptyParts);
    const QString error
        = QStringLiteral("mdmctl: \"%1\" is left out: the telephony service (org.ofono) is not running");
    for (const char *section : {"calls", "sms", "data"})
        QVERIFY2(errors.contains(error.arg(QLatin1String(section))), qPrintable(exported.errors));
    QVERIFY(exported.json().contains(QStringLiteral("softwareUpdate")));
    QCOMPARE(exported.status, 3);
}

void MdmctlPolicyTest::watchAppliesAndPutsDriftRight()
{
    Mdmctl watch({QStringLiteral("policy"), QStringLiteral("watch"), QStringLiteral("--json"),
                  write(R"({"name": "Test", "calls": {"dial": {"default": "block", "rules": []}}})")});
    QVERIFY(watch.waitForOutput(QStringLiteral("\"watching\"")));
    QCOMPARE(filter(QStringLiteral("dial")), json(R"({"default": "block", "rules": []})"));

    call(Dial, QStringLiteral("AddRule"), {QStringLiteral("1"), 1u});
    QVERIFY(watch.waitForOutput(QStringLiteral("\"remove 1\"")));
    QCOMPARE(filter(QStringLiteral("dial")), json(R"({"default": "block", "rules": []})"));
    call(Dial, QStringLiteral("SetDefaultAction"), {2u});
    QVERIFY(watch.waitForOutput(QStringLiteral("\"changed\""), 3));
    QCOMPARE(filter(QStringLiteral("dial")), json(R"({"default": "block", "rules": []})"));

    watch.interrupt(SIGINT);
    const Mdmctl::Result watched = watch.finish();
    QCOMPARE(watched.status, 0);
    QCOMPARE(watched.errors, QString());
    QVector<QJsonObject> events = watched.jsonLines();
    QStringList news;
    for (const QJsonObject &event : qAsConst(events)) {
        QVERIFY(event.contains(QStringLiteral("time")));
        news.append(QStringList({event.value(QLatin1String("event")).toString(),
                                 event.value(QLatin1String("path")).toString(),
                                 event.value(QLatin1String("status")).toString()})
                        .join(QLatin1Char(' ')));
    }
    QCOMPARE(news,
             QStringList({QStringLiteral("setting calls.dial.default changed"),
                          QStringLiteral("setting calls.dial.rules compliant"), QStringLiteral("watching  "),
                          QStringLiteral("setting calls.dial.rules changed"),
                          QStringLiteral("setting calls.dial.default changed")}));
}

void MdmctlPolicyTest::watchFollowsTheSims()
{
    m_phone.act(QStringLiteral("sim pull"), {QStringLiteral("1")});
    Mdmctl watch({QStringLiteral("policy"), QStringLiteral("watch"),
                  write(R"({"calls": {"dial": {"rules": [{"imsi": "*", "action": "block"}]}}})")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching for drift from ")));
    QCOMPARE(filter(QStringLiteral("dial")),
             json(R"({"default": "allow", "rules": [{"imsi": "244051234567890", "action": "block"}]})"));
    m_phone.act(QStringLiteral("sim insert"), {QStringLiteral("1"), QStringLiteral("262029999999999")});
    QVERIFY(watch.waitForOutput(QStringLiteral("calls.dial.rules: changed (add 262029999999999=block)\n")));
    m_phone.act(QStringLiteral("sim pull"), {QStringLiteral("1")});
    QVERIFY(watch.waitForOutput(QStringLiteral("calls.dial.rules: changed (remove 262029999999999)\n")));
    m_phone.act(QStringLiteral("sim insert"), {QStringLiteral("1"), QStringLiteral("262021234567891")});
    QVERIFY(watch.waitForOutput(QStringLiteral("add 262021234567891=block")));
    QVERIFY(waitUntil([this] {
        return filter(QStringLiteral("dial"))
            == json(R"({"default": "allow", "rules": [{"imsi": "244051234567890", "action": "block"},
                                                      {"imsi": "262021234567891", "action": "block"}]})");
    }));
    watch.interrupt(SIGTERM);
    QCOMPARE(watch.finish().status, 0);
}

void MdmctlPolicyTest::watchTakesUpAServiceThatComesBack()
{
    Mdmctl watch(
        {QStringLiteral("policy"), QStringLiteral("watch"),
         write(R"({"calls": {"dial": {"default": "block"}}, "softwareUpdate": {"install": "latest"}})")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching for drift from ")));
    m_phone.stopService(Ofono);
    QVERIFY(watch.waitForOutput(QStringLiteral(
        "calls.dial.default: unsupported (the telephony service (org.ofono) is not running)\n")));
    m_phone.startService(Ofono);
    QVERIFY(watch.waitForOutput(QStringLiteral("calls.dial.default: compliant\n")));
    call(Dial, QStringLiteral("SetDefaultAction"), {2u});
    QVERIFY(watch.waitForOutput(QStringLiteral("calls.dial.default: changed (from allow to block)\n"), 2));
    QCOMPARE(filter(QStringLiteral("dial")).value(QLatin1String("default")).toString(),
             QStringLiteral("block"));
    watch.interrupt(SIGINT);
    const Mdmctl::Result watched = watch.finish();
    QCOMPARE(watched.errors, QString());
    QCOMPARE(watched.status, 0);
}

void MdmctlPolicyTest::watchInstallsAnUpdateThatAppears()
{
    Mdmctl watch({QStringLiteral("policy"), QStringLiteral("watch"),
                  write(R"({"softwareUpdate": {"install": "latest"}})")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching for drift from ")));
    const QString version = publish();
    QVERIFY(
        watch.waitForOutput(QStringLiteral("softwareUpdate.install: changed (install %1)\n").arg(version)));
    QCOMPARE(m_phone.state()
                 .value(QLatin1String("softwareUpdate"))
                 .toObject()
                 .value(QLatin1String("installed"))
                 .toString(),
             version);
    watch.interrupt(SIGINT);
    QCOMPARE(watch.finish().status, 0);
    QCOMPARE(m_phone.state()
                 .value(QLatin1String("softwareUpdate"))
                 .toObject()
                 .value(QLatin1String("clients"))
                 .toInt(),
             0);
}

void MdmctlPolicyTest::watchDoesNotRepeatARefusedChange()
{
    m_phone.failCalls(Ofono, Dial, QStringLiteral("SetDefaultAction"),
                      QStringLiteral("org.ofono.Error.Failed"), QStringLiteral("no"));
    Mdmctl watch({QStringLiteral("policy"), QStringLiteral("watch"),
                  write(R"({"calls": {"dial": {"default": "block"}}})")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching for drift from ")));
    m_phone.settle(Ofono);
    QCOMPARE(withoutQueries(m_phone.takeJournal(Ofono)),
             QStringList(Dial + QStringLiteral(" SetDefaultAction (uint32 1,)")));
    m_phone.clearFaults();
    call(Dial, QStringLiteral("AddRule"), {QStringLiteral("1"), 1u});
    QVERIFY(watch.waitForOutput(QStringLiteral("calls.dial.default: changed (from allow to block)\n")));
    watch.interrupt(SIGINT);
    QCOMPARE(watch.finish().status, 0);
}

void MdmctlPolicyTest::watchEndsWithTheBus()
{
    QProcess bus;
    bus.start(QStringLiteral("dbus-daemon"),
              {QStringLiteral("--session"), QStringLiteral("--nofork"), QStringLiteral("--print-address")});
    QVERIFY(bus.waitForReadyRead());
    qputenv("DBUS_SYSTEM_BUS_ADDRESS", bus.readLine().trimmed());
    Mdmctl watch({QStringLiteral("policy"), QStringLiteral("watch"),
                  write(R"({"calls": {"dial": {"default": "block"}}})")});
    qunsetenv("DBUS_SYSTEM_BUS_ADDRESS");
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching for drift from ")));
    bus.kill();
    QVERIFY(bus.waitForFinished());
    const Mdmctl::Result watched = watch.finish();
    QCOMPARE(watched.errors, QStringLiteral("mdmctl: the system bus is gone\n"));
    QCOMPARE(watched.status, 3);
}

void MdmctlPolicyTest::examplesAreValid_data()
{
    QTest::addColumn<QString>("file");
    const QFileInfoList files
        = QDir(QStringLiteral(EXAMPLE_POLICIES)).entryInfoList({QStringLiteral("*.json")});
    QVERIFY(!files.isEmpty());
    for (const QFileInfo &file : files)
        QTest::newRow(qPrintable(file.fileName())) << file.filePath();
}

void MdmctlPolicyTest::examplesAreValid()
{
    QFETCH(QString, file);
    const Mdmctl::Result applied = Mdmctl::run({QStringLiteral("policy"), QStringLiteral("apply"), file});
    QCOMPARE(applied.errors, QString());
    QCOMPARE(applied.status, 0);
}

void MdmctlPolicyTest::schemaIsPrinted()
{
    const Mdmctl::Result schema = Mdmctl::run({QStringLiteral("policy"), QStringLiteral("schema")});
    QFile file(QStringLiteral(POLICY_SCHEMA));
    QVERIFY(file.open(QIODevice::ReadOnly));
    QCOMPARE(schema.output, QString::fromUtf8(file.readAll()));
    QCOMPARE(schema.status, 0);
}

QTEST_GUILESS_MAIN(MdmctlPolicyTest)
#include "mdmctl_policy_test.moc"
