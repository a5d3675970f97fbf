// SPDX-License-Identifier: LGPL-2.1-or-later
#include "mdmctl.h"
#include "phone.h"

#include <QtCore/QFile>
#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QTemporaryDir>
#include <QtTest/QtTest>

#include <csignal>

namespace
{

const QString ConnMan = QStringLiteral("net.connman");
const QString Ofono = QStringLiteral("org.ofono");

QJsonObject json(const QByteArray &text)
{
    return QJsonDocument::fromJson(text).object();
}

QJsonObject settingOf(const Mdmctl::Result &result, int index)
{
    return result.json().value(QLatin1String("settings")).toArray().at(index).toObject();
}

QString statusOf(const Mdmctl::Result &result, int index)
{
    return settingOf(result, index).value(QLatin1String("status")).toString();
}

QString detailOf(const Mdmctl::Result &result, int index)
{
    return settingOf(result, index).value(QLatin1String("detail")).toString();
}

} // namespace

/** The sections of a policy that are about Wi-Fi, flight mode and mobile data. */
class MdmctlPolicyNetworkTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void cleanup();

    void cellularIsCompared();
    void cellularIsMadeSoOnce();
    void everyOtherSimIsMeant();
    void passwordComesFromAFile();
    void unreadablePasswordMakesThePolicyWrong();
    void simNamedTwiceMakesThePolicyWrong();
    void whatThePhoneHasNotIsUnsupported();
    void refusedCellularSettingFails();
    void cellularIsExported();
    void driftOfCellularIsPutRight();
    void insertedSimIsLookedAtAtOnce();

    void radiosAreCompared();
    void radiosAreSwitchedOnce();
    void flightModeEndsBeforeWiFiIsSwitchedOn();
    void refusedRadioFails();
    void phoneWithoutWiFiFails();
    void absentConnectionManagerIsUnsupported();
    void radiosAreExported();
    void driftOfRadiosIsPutRight();

private:
    Mdmctl::Result run(const char *command, const QByteArray &policy)
    {
        return Mdmctl::run(
            {QStringLiteral("policy"), QLatin1String(command), QStringLiteral("-"), QStringLiteral("--json")},
            policy);
    }
    QStringList writes(const QString &service)
    {
        return m_phone.takeJournal(service).filter(QStringLiteral(" SetProperty "));
    }

    QString fileWith(const char *name, const QByteArray &content)
    {
        QFile file(m_folder.filePath(QLatin1String(name)));
        if (!file.open(QIODevice::WriteOnly | QIODevice::Truncate) || file.write(content) != content.size())
            qFatal("cannot write %s", name);
        return file.fileName();
    }

    Phone m_phone;
    QTemporaryDir m_folder;
};

void MdmctlPolicyNetworkTest::cleanup()
{
    m_phone.clearFaults();
    m_phone.startService(ConnMan);
    m_phone.act(QStringLiteral("flight-mode"), {QStringLiteral("off")});
    m_phone.act(QStringLiteral("technology power"), {QStringLiteral("wifi"), QStringLiteral("on")});
    m_phone.startService(Ofono);
    Mdmctl::run(
        {QStringLiteral("cellular"), QStringLiteral("disconnect"), QStringLiteral("244051234567890")});
    run("apply", R"({"cellular": {"sims": [{"imsi": "*", "technologies": "any"}, {"imsi": "244051234567890",
        "technologies": "any", "accessPoints": {"internet": {"apn": "internet.elo", "protocol": "ip"}}}]}})");
    m_phone.takeJournal(ConnMan);
}

void MdmctlPolicyNetworkTest::radiosAreCompared()
{
    const Mdmctl::Result checked
        = run("check", R"({"wifi": {"enabled": false}, "flightMode": {"enabled": false}})");
    QCOMPARE(checked.errors, QString());
    QCOMPARE(checked.status, 1);
    QCOMPARE(settingOf(checked, 0),
             json(R"({"path": "flightMode.enabled", "status": "compliant", "present": false, "wanted": false,
                      "detail": ""})"));
    QCOMPARE(settingOf(checked, 1),
             json(R"({"path": "wifi.enabled", "status": "different", "present": true, "wanted": false,
                      "detail": ""})"));
    QCOMPARE(writes(ConnMan), QStringList());
}

void MdmctlPolicyNetworkTest::radiosAreSwitchedOnce()
{
    const QByteArray policy = R"({"wifi": {"enabled": false}, "flightMode": {"enabled": false}})";
    QCOMPARE(run("apply", policy).status, 0);
    QCOMPARE(writes(ConnMan),
             QStringList(QStringLiteral("/net/connman/technology/wifi SetProperty ('Powered', <false>)")));
    QCOMPARE(run("apply", policy).status, 0);
    QCOMPARE(writes(ConnMan), QStringList());
}

void MdmctlPolicyNetworkTest::flightModeEndsBeforeWiFiIsSwitchedOn()
{
    m_phone.act(QStringLiteral("flight-mode"), {QStringLiteral("on")});
    m_phone.act(QStringLiteral("technology power"), {QStringLiteral("wifi"), QStringLiteral("off")});
    const Mdmctl::Result applied
        = run("apply", R"({"wifi": {"enabled": true}, "flightMode": {"enabled": false}})");
    QCOMPARE(applied.status, 0);
    QVERIFY(writes(ConnMan).at(0).contains(QStringLiteral("OfflineMode")));
    QCOMPARE(Mdmctl::run({QStringLiteral("wifi"), QStringLiteral("status")}).output,
             QStringLiteral("Wi-Fi is on.\n"));
}

void MdmctlPolicyNetworkTest::refusedRadioFails()
{
    m_phone.failCalls(ConnMan, QStringLiteral("/"), QStringLiteral("SetProperty"),
                      QStringLiteral("net.connman.Error.PermissionDenied"), QStringLiteral("not you"));
    const Mdmctl::Result applied
        = run("apply", R"({"flightMode": {"enabled": true}, "wifi": {"enabled": false}})");
    QCOMPARE(statusOf(applied, 0), QStringLiteral("failed"));
    QCOMPARE(detailOf(applied, 0), QStringLiteral("the connection manager (net.connman) refused: not you"));
    QCOMPARE(statusOf(applied, 1), QStringLiteral("changed"));
    QCOMPARE(applied.status, 1);
}

void MdmctlPolicyNetworkTest::phoneWithoutWiFiFails()
{
    m_phone.act(QStringLiteral("technology remove"), {QStringLiteral("wifi")});
    const Mdmctl::Result checked = run("check", R"({"wifi": {"enabled": false}})");
    QCOMPARE(statusOf(checked, 0), QStringLiteral("failed"));
    m_phone.act(QStringLiteral("technology add"), {QStringLiteral("wifi")});
}

void MdmctlPolicyNetworkTest::absentConnectionManagerIsUnsupported()
{
    m_phone.stopService(ConnMan);
    const Mdmctl::Result checked = run("check", R"({"wifi": {"enabled": false}})");
    QCOMPARE(settingOf(checked, 0),
             json(R"({"path": "wifi.enabled", "status": "unsupported", "present": null, "wanted": false,
                      "detail": "the connection manager (net.connman) is not running"})"));
    QCOMPARE(checked.status, 3);
}

void MdmctlPolicyNetworkTest::radiosAreExported()
{
    m_phone.act(QStringLiteral("technology power"), {QStringLiteral("wifi"), QStringLiteral("off")});
    const QJsonObject exported = Mdmctl::run({QStringLiteral("policy"), QStringLiteral("export")}).json();
    QCOMPARE(exported.value(QLatin1String("wifi")).toObject(), json(R"({"enabled": false})"));
    QCOMPARE(exported.value(QLatin1String("flightMode")).toObject(), json(R"({"enabled": false})"));
}

void MdmctlPolicyNetworkTest::driftOfRadiosIsPutRight()
{
    Mdmctl watch(
        {QStringLiteral("policy"), QStringLiteral("watch"),
         fileWith("policy.json", R"({"flightMode": {"enabled": false}, "wifi": {"enabled": true}})")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching for drift")));
    m_phone.act(QStringLiteral("flight-mode"), {QStringLiteral("on")});
    QVERIFY(watch.waitForOutput(QStringLiteral("flightMode.enabled: changed (from on to off)")));
    m_phone.act(QStringLiteral("technology power"), {QStringLiteral("wifi"), QStringLiteral("off")});
    QVERIFY(watch.waitForOutput(QStringLiteral("wifi.enabled: changed (from off to on)")));
    watch.interrupt(SIGINT);
    QCOMPARE(watch.finish().status, 0);
}

void MdmctlPolicyNetworkTest::cellularIsCompared()
{
    const QByteArray policy = R"({"cellular": {"sims": [{"imsi": "244051234567890", "technologies": "3g",
        "accessPoints": {"internet": {"apn": "internet.elo", "protocol": "dual"}}, "connected": false}]}})";
    m_phone.takeJournal(Ofono);
    const Mdmctl::Result checked = run("check", policy);
    QCOMPARE(checked.errors, QString());
    QCOMPARE(
        settingOf(checked, 0),
        json(R"({"path": "cellular.244051234567890.technologies", "status": "different", "present": "any",
                      "wanted": "3g", "detail": ""})"));
    QCOMPARE(settingOf(checked, 1),
             json(R"({"path": "cellular.244051234567890.accessPoints.internet", "status": "different",
                      "present": {"apn": "internet.elo", "protocol": "ip"},
                      "wanted": {"apn": "internet.elo", "protocol": "dual"}, "detail": ""})"));
    QCOMPARE(settingOf(checked, 2),
             json(R"({"path": "cellular.244051234567890.connected", "status": "compliant", "present": false,
                      "wanted": false, "detail": ""})"));
    QCOMPARE(checked.status, 1);
    QCOMPARE(writes(Ofono), QStringList());
}

void MdmctlPolicyNetworkTest::cellularIsMadeSoOnce()
{
    const QByteArray policy = R"({"cellular": {"sims": [{"imsi": "244051234567890", "technologies": "3g",
        "accessPoints": {"internet": {"protocol": "dual"}}, "connected": true}]}})";
    m_phone.takeJournal(Ofono);
    const Mdmctl::Result applied = run("apply", policy);
    for (int setting = 0; setting < 3; ++setting)
        QCOMPARE(statusOf(applied, setting), QStringLiteral("changed"));
    QCOMPARE(applied.status, 0);
    const QStringList sent = writes(Ofono);
    QVERIFY(sent.contains(QStringLiteral("/ril_0 SetProperty ('TechnologyPreference', <'umts'>)")));
    QVERIFY(sent.contains(QStringLiteral("/ril_0/context1 SetProperty ('Protocol', <'dual'>)")));
    QVERIFY(
        sent.contains(QStringLiteral("/ril_0/context1 SetProperty ('AccessPointName', <'internet.elo'>)")));
    QCOMPARE(Mdmctl::run({QStringLiteral("cellular"), QStringLiteral("status")}).output,
             QStringLiteral("IMSI             MOBILE DATA\n244051234567890  up\n262021234567891  down\n"));
    QCOMPARE(run("apply", policy).status, 0);
    QCOMPARE(writes(Ofono), QStringList());
    // It comes before mobile data does.
    QVERIFY(applied.output.indexOf(QStringLiteral("accessPoints"))
            < applied.output.indexOf(QStringLiteral("connected")));
}

void MdmctlPolicyNetworkTest::everyOtherSimIsMeant()
{
    const QByteArray policy = R"({"cellular": {"sims": [{"imsi": "*", "technologies": "2g"},
                                  {"imsi": "244051234567890", "technologies": "4g"}]}})";
    const Mdmctl::Result applied = run("apply", policy);
    QCOMPARE(settingOf(applied, 0), json(R"({"path": "cellular.*.technologies", "status": "changed",
                      "present": {"262021234567891": "any"}, "wanted": {"262021234567891": "2g"},
                      "detail": ""})"));
    QCOMPARE(settingOf(applied, 1).value(QLatin1String("wanted")).toString(), QStringLiteral("4g"));
    QCOMPARE(run("check", policy).status, 0);
}

void MdmctlPolicyNetworkTest::passwordComesFromAFile()
{
    const QString file = fileWith("password", "geheim\n");
    const QByteArray policy = QStringLiteral(R"({"cellular": {"sims": [{"imsi": "244051234567890",
        "accessPoints": {"internet": {"passwordFile": "%1"}}}]}})")
                                  .arg(file)
                                  .toUtf8();
    const Mdmctl::Result applied = run("apply", policy);
    QCOMPARE(statusOf(applied, 0), QStringLiteral("changed"));
    QCOMPARE(settingOf(applied, 0).value(QLatin1String("wanted")).toObject(),
             QJsonObject({{QStringLiteral("passwordFile"), file}}));
    QVERIFY(!applied.output.contains(QStringLiteral("geheim")));
    QCOMPARE(run("check", policy).status, 0);
    fileWith("password", "anders\n");
    const Mdmctl::Result checked = run("check", policy);
    QCOMPARE(statusOf(checked, 0), QStringLiteral("different"));
    QVERIFY(!checked.output.contains(QStringLiteral("anders")));
    QVERIFY(!Mdmctl::run({QStringLiteral("policy"), QStringLiteral("export")})
                 .output.contains(QStringLiteral("geheim")));
}

void MdmctlPolicyNetworkTest::unreadablePasswordMakesThePolicyWrong()
{
    const Mdmctl::Result refused = run("apply", R"({"wifi": {"enabled": false}, "cellular": {"sims": [
        {"imsi": "1", "accessPoints": {"mms": {"passwordFile": "/nowhere"}}}]}})");
    QCOMPARE(
        refused.errors,
        QStringLiteral("mdmctl: standard input: /cellular/sims/0/accessPoints/mms/passwordFile: /nowhere "
                       "cannot be read: No such file or directory\n"));
    QCOMPARE(refused.status, 2);
    QCOMPARE(writes(ConnMan), QStringList());
    const Mdmctl::Result relative = run("apply", R"({"cellular": {"sims": [{"imsi": "1",
        "accessPoints": {"mms": {"passwordFile": "here"}}}]}})");
    QVERIFY(
        relative.errors.contains(QStringLiteral("/cellular/sims/0/accessPoints/mms/passwordFile: must be ")));
    QCOMPARE(relative.status, 2);
}

void MdmctlPolicyNetworkTest::simNamedTwiceMakesThePolicyWrong()
{
    const Mdmctl::Result refused
        = run("check", R"({"cellular": {"sims": [{"imsi": "1"}, {"imsi": "2"}, {"imsi": "1"}]}})");
    QCOMPARE(refused.errors,
             QStringLiteral("mdmctl: standard input: /cellular/sims/2/imsi: must be named once; \"1\" has "
                            "settings already\n"));
    QCOMPARE(refused.status, 2);
}

void MdmctlPolicyNetworkTest::whatThePhoneHasNotIsUnsupported()
{
    m_phone.answerCalls(
        Ofono, QStringLiteral("/ril_1"), QStringLiteral("GetProperties"),
        {QVariantMap{{QStringLiteral("SubscriberIdentity"), QStringLiteral("262021234567891")}}});
    const Mdmctl::Result checked = run("check", R"({"cellular": {"sims": [
        {"imsi": "1", "technologies": "4g"}, {"imsi": "262021234567891", "technologies": "4g"},
        {"imsi": "244051234567890", "accessPoints": {"ims": {"apn": "x"}}}]}})");
    QCOMPARE(detailOf(checked, 0), QStringLiteral("no SIM 1 in the phone"));
    QCOMPARE(detailOf(checked, 1), QStringLiteral("modem /ril_1 does not offer 4g"));
    QCOMPARE(detailOf(checked, 2), QStringLiteral("SIM 244051234567890 has no access point of this type"));
    for (int setting = 0; setting < 3; ++setting)
        QCOMPARE(statusOf(checked, setting), QStringLiteral("unsupported"));
    QCOMPARE(checked.status, 1);

    m_phone.stopService(ConnMan);
    const Mdmctl::Result absent = run("check", R"({"cellular": {"sims": [{"imsi": "244051234567890",
                                                   "connected": true}]}})");
    QCOMPARE(statusOf(absent, 0), QStringLiteral("unsupported"));
    QCOMPARE(detailOf(absent, 0), QStringLiteral("the connection manager (net.connman) is not running"));
    QCOMPARE(absent.status, 3);
}

void MdmctlPolicyNetworkTest::refusedCellularSettingFails()
{
    m_phone.failCalls(Ofono, QStringLiteral("/ril_0"), QStringLiteral("SetProperty"),
                      QStringLiteral("com.example.Denied"), QStringLiteral("not you"));
    const Mdmctl::Result applied = run("apply", R"({"cellular": {"sims": [{"imsi": "244051234567890",
        "technologies": "4g", "accessPoints": {"internet": {"protocol": "dual"}}}]}})");
    QCOMPARE(statusOf(applied, 0), QStringLiteral("failed"));
    QCOMPARE(detailOf(applied, 0), QStringLiteral("the telephony service (org.ofono) refused: not you"));
    QCOMPARE(statusOf(applied, 1), QStringLiteral("changed"));
    QCOMPARE(applied.status, 1);
}

void MdmctlPolicyNetworkTest::cellularIsExported()
{
    const Mdmctl::Result exported = Mdmctl::run({QStringLiteral("policy"), QStringLiteral("export")});
    const QJsonArray sims
        = exported.json().value(QLatin1String("cellular")).toObject().value(QLatin1String("sims")).toArray();
    QCOMPARE(sims.size(), 2);
    QCOMPARE(sims.at(1).toObject(),
             json(R"({"imsi": "262021234567891", "technologies": "any", "connected": false,
                      "accessPoints": {"internet": {"name": "Tarn Web", "apn": "web.tarn", "username": "",
                      "protocol": "ip", "authentication": "none", "messageCenter": "", "messageProxy": ""}}})"));
    QCOMPARE(run("check", exported.output.toUtf8()).status, 0);
}

void MdmctlPolicyNetworkTest::driftOfCellularIsPutRight()
{
    Mdmctl watch({QStringLiteral("policy"), QStringLiteral("watch"), QStringLiteral("--look"),
                  QStringLiteral("0.1"),
                  fileWith("policy.json", R"({"cellular": {"sims": [{"imsi": "244051234567890",
                                              "technologies": "3g"}]}})")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching for drift")));
    QCOMPARE(Mdmctl::run({QStringLiteral("cellular"), QStringLiteral("select"), QStringLiteral("/ril_0"),
                          QStringLiteral("2g")})
                 .status,
             0);
    QVERIFY(watch.waitForOutput(
        QStringLiteral("cellular.244051234567890.technologies: changed (from 2g to 3g)")));
    watch.interrupt(SIGINT);
    QCOMPARE(watch.finish().status, 0);
}

void MdmctlPolicyNetworkTest::insertedSimIsLookedAtAtOnce()
{
    m_phone.act(QStringLiteral("sim pull"), {QStringLiteral("1")});
    Mdmctl watch({QStringLiteral("policy"), QStringLiteral("watch"), QStringLiteral("--look"),
                  QStringLiteral("3600"),
                  fileWith("policy.json", R"({"cellular": {"sims": [{"imsi": "262021234567891",
                                              "technologies": "2g"}]}})")});
    QVERIFY(watch.waitForOutput(QStringLiteral("unsupported (no SIM 262021234567891 in the phone)")));
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching for drift")));
    m_phone.act(QStringLiteral("sim insert"), {QStringLiteral("1")});
    QVERIFY(watch.waitForOutput(QStringLiteral("changed (from any to 2g)")));
    watch.interrupt(SIGINT);
    QCOMPARE(watch.finish().status, 0);
}

QTEST_GUILESS_MAIN(MdmctlPolicyNetworkTest)
#include "mdmctl_policy_network_test.moc"
