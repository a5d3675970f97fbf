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

QJsonObject json(const QByteArray &text)
{
    return QJsonDocument::fromJson(text).object();
}

QJsonObject settingOf(const Mdmctl::Result &result, int index)
{
    return result.json().value(QLatin1String("settings")).toArray().at(index).toObject();
}

} // namespace

/** The sections of a policy that are about Wi-Fi and flight mode. */
class MdmctlPolicyNetworkTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void cleanup();

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

    Phone m_phone;
    QTemporaryDir m_folder;
};

void MdmctlPolicyNetworkTest::cleanup()
{
    m_phone.clearFaults();
    m_phone.startService(ConnMan);
    m_phone.act(QStringLiteral("flight-mode"), {QStringLiteral("off")});
    m_phone.act(QStringLiteral("technology power"), {QStringLiteral("wifi"), QStringLiteral("on")});
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
    QCOMPARE(settingOf(applied, 0).value(QLatin1String("status")).toString(), QStringLiteral("failed"));
    QCOMPARE(settingOf(applied, 0).value(QLatin1String("detail")).toString(),
             QStringLiteral("the connection manager (net.connman) refused: not you"));
    QCOMPARE(settingOf(applied, 1).value(QLatin1String("status")).toString(), QStringLiteral("changed"));
    QCOMPARE(applied.status, 1);
}

void MdmctlPolicyNetworkTest::phoneWithoutWiFiFails()
{
    m_phone.act(QStringLiteral("technology remove"), {QStringLiteral("wifi")});
    const Mdmctl::Result checked = run("check", R"({"wifi": {"enabled": false}})");
    QCOMPARE(settingOf(checked, 0).value(QLatin1String("status")).toString(), QStringLiteral("failed"));
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
    QFile policy(m_folder.filePath(QStringLiteral("policy.json")));
    QVERIFY(policy.open(QIODevice::WriteOnly));
    policy.write(R"({"flightMode": {"enabled": false}, "wifi": {"enabled": true}})");
    policy.close();
    Mdmctl watch({QStringLiteral("policy"), QStringLiteral("watch"), policy.fileName()});
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching for drift")));
    m_phone.act(QStringLiteral("flight-mode"), {QStringLiteral("on")});
    QVERIFY(watch.waitForOutput(QStringLiteral("flightMode.enabled: changed (from on to off)")));
    m_phone.act(QStringLiteral("technology power"), {QStringLiteral("wifi"), QStringLiteral("off")});
    QVERIFY(watch.waitForOutput(QStringLiteral("wifi.enabled: changed (from off to on)")));
    watch.interrupt(SIGINT);
    QCOMPARE(watch.finish().status, 0);
}

QTEST_GUILESS_MAIN(MdmctlPolicyNetworkTest)
#include "mdmctl_policy_network_test.moc"
