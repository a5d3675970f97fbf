// SPDX-License-Identifier: LGPL-2.1-or-later
#include "mdmctl.h"
#include "phone.h"

#include <QtCore/QDir>
#include <QtCore/QFile>
#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QSaveFile>
#include <QtCore/QTemporaryDir>
#include <QtTest/QtTest>

#include <csignal>

namespace
{

const QString Clock = QStringLiteral("org.freedesktop.timedate1");
const QString Proxy = QStringLiteral("org.corvaneos.mdmproxy");
const QString LocationPath = QStringLiteral("/Corvane/Mdm/Proxy/LocationInfo");
const QString LocationFile = QStringLiteral("/etc/location/location.conf");

QStringList words(const char *arguments)
{
    return QString::fromUtf8(arguments).split(QLatin1Char(' '));
}

Mdmctl::Result run(const char *arguments)
{
    return Mdmctl::run(words(arguments));
}

QJsonObject json(const QByteArray &text)
{
    return QJsonDocument::fromJson(text).object();
}

QByteArray contentOf(const QString &fileName)
{
    QFile file(fileName);
    return file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray();
}

} // namespace

/** Location, time and developer mode: commands and policies. */
class MdmctlSettingsTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void cleanup();

    void showsLocationSettings();
    void setsLocationSettings_data();
    void setsLocationSettings();
    void setsOnce();
    void mistakes_data();
    void mistakes();
    void agreementComesFirst();
    void absentProviderAndReceiver();
    void unwritableSettingsAreTold();
    void findsThePosition();
    void findsNoPositionInTime();
    void refusedPositionIsTold();
    void watchFollowsThePosition();
    void showsTimeSettings();
    void setsTimeSettings();
    void refusedTimeSettingIsTold();
    void listsTimeZones();
    void setsTheClock();
    void automaticClockIsNotSet();
    void absentServicesAreTold_data();
    void absentServicesAreTold();
    void policyIsComparedAndMadeSo();
    void policyNamesWhatThePhoneHasNot();
    void policyRefusesUnknownWords();
    void policyIsExported();
    void policyDriftIsPutRight();
    void developerModeOnAndOff();
    void policyOfDeveloperMode();

private:
    Mdmctl::Result policy(const char *command, const QByteArray &text)
    {
        return Mdmctl::run(
            {QStringLiteral("policy"), QLatin1String(command), QStringLiteral("-"), QStringLiteral("--json")},
            text);
    }
    /** What another program does: mdmctl would wait to see its change, which is put right before it looks. */
    void store(const char *before, const char *after)
    {
        QSaveFile file(LocationFile);
        QVERIFY(file.open(QIODevice::WriteOnly));
        file.write(contentOf(LocationFile).replace(before, after));
        QVERIFY(file.commit());
    }
    QJsonObject state(const char *part) const
    {
        return m_phone.state().value(QLatin1String(part)).toObject();
    }

    Phone m_phone;
    QTemporaryDir m_folder;
    QByteArray m_locationFile;
};

void MdmctlSettingsTest::initTestCase()
{
    m_locationFile = contentOf(LocationFile);
    QVERIFY(!m_locationFile.isEmpty());
}

void MdmctlSettingsTest::cleanup()
{
    m_phone.clearFaults();
    m_phone.startService(Clock);
    m_phone.startService(Proxy);
    QFile file(LocationFile);
    QVERIFY(file.open(QIODevice::WriteOnly | QIODevice::Truncate));
    file.write(m_locationFile);
    file.close();
    run("time set automaticTime on");
    run("time set automaticTimeZone on");
    run("time set timeZone Europe/Helsinki");
    m_phone.takeJournal(Clock);
}

void MdmctlSettingsTest::showsLocationSettings()
{
    const Mdmctl::Result shown = run("location settings");
    QCOMPARE(shown.errors, QString());
    QVERIFY(shown.output.startsWith(QStringLiteral("SETTING        VALUE")));
    QVERIFY(shown.output.contains(QStringLiteral("\nmode           high-accuracy")));
    QCOMPARE(shown.status, 0);
    QCOMPARE(run("location settings --json").json(),
             json(R"({"enabled": true, "mode": "high-accuracy", "gps": true, "gpsFlightMode": false,
                      "sources": ["online", "sensors", "bluetooth", "wlan", "cells", "gps", "glonass",
                      "beidou", "galileo", "qzss", "sbas"], "mlsAgreement": true, "mls": false,
                      "hereAgreement": false, "here": false})"));
}

void MdmctlSettingsTest::setsLocationSettings_data()
{
    QTest::addColumn<QString>("output");
    QTest::addColumn<QByteArray>("stored");
    const auto row = [](const char *arguments, const char *output, const char *stored) {
        QTest::newRow(arguments) << QString::fromUtf8(output) << QByteArray(stored);
    };
    row("enabled off", "enabled is off.\n", "\nenabled=false\n");
    row("gps off", "gps is off.\n", "\ngps_enabled=false\n");
    row("gpsFlightMode on", "gpsFlightMode is on.\n", "\ngps_flight_mode=true\n");
    row("mode device-only", "mode is device-only.\n", "\nmode=2\n");
    // 0x2000000 + 0x8000 + 0x1
    row("sources gps,wlan,online", "sources is online, wlan, gps.\n", "\nallowed_data_sources=33587201\n");
    row("sources none", "sources is none.\n", "\nallowed_data_sources=0\n");
    row("mlsAgreement off", "mlsAgreement is off.\n", "\nmls_online_state=0\n");
    row("mls on", "mls is on.\n", "\nmls_online_state=2\n");
    row("hereAgreement on", "hereAgreement is on.\n", "\nhere_state=1\n");
}

void MdmctlSettingsTest::setsLocationSettings()
{
    QFETCH(QString, output);
    QFETCH(QByteArray, stored);
    const Mdmctl::Result set = Mdmctl::run(words("location set") + words(QTest::currentDataTag()));
    QCOMPARE(set.errors, QString());
    QCOMPARE(set.output, output);
    QCOMPARE(set.status, 0);
    const QByteArray file = '\n' + contentOf(LocationFile) + '\n';
    QVERIFY2(file.contains(stored), file.constData());
}

void MdmctlSettingsTest::setsOnce()
{
    QCOMPARE(run("location set gps off --json").json(), json(R"({"gps": false, "changed": true})"));
    QCOMPARE(run("location set gps off --json").json(), json(R"({"gps": false, "changed": false})"));
    QCOMPARE(run("location set gps off").output,
             QStringLiteral("Already so, nothing to change.\ngps is off.\n"));
}

void MdmctlSettingsTest::mistakes_data()
{
    QTest::addColumn<QString>("message");
    QTest::addColumn<int>("status");
    const auto row = [](const char *arguments, const char *message, int status) {
        QTest::newRow(arguments) << QString::fromUtf8(message) << status;
    };
    row("location set gsp on", R"(SETTING "gsp": did you mean "gps"?)", 2);
    row("location set gps yes", R"(VALUE "yes": must be on or off)", 2);
    row("location set mode fast",
        R"(VALUE "fast": must be high-accuracy, battery-saving, device-only, custom)", 2);
    row("location set sources gps,sky",
        R"(VALUE "gps,sky": must be none, or with commas between them: online, sensors, bluetooth, wlan, )"
        "cells, gps, glonass, beidou, galileo, qzss, sbas",
        2);
    row("time set timeZone Europe/Atlantis", R"(the phone knows no time zone "Europe/Atlantis")", 1);
    row("time set timeZone europe/helsinki", R"(the phone knows no time zone "europe/helsinki")", 1);
    row("time clock", "--date, --time or both are needed", 2);
    row("time clock --time 24:00", R"(--time "24:00": must be a time of day, as in 09:15)", 2);
    row("time clock --date 2026-02-30", R"(--date "2026-02-30": must be a date, as in 2026-03-02)", 2);
}

void MdmctlSettingsTest::mistakes()
{
    QFETCH(QString, message);
    const Mdmctl::Result refused = run(QTest::currentDataTag());
    QCOMPARE(refused.errors, QStringLiteral("mdmctl: %1\n").arg(message));
    QCOMPARE(refused.output, QString());
    QTEST(refused.status, "status");
    QVERIFY(m_phone.takeJournal(Clock).filter(QStringLiteral(" Set")).isEmpty());
}

void MdmctlSettingsTest::agreementComesFirst()
{
    const Mdmctl::Result refused = run("location set here on");
    QCOMPARE(refused.errors,
             QStringLiteral("mdmctl: Unable to enable HERE aGPS - usage agreement has not been accepted!\n"));
    QCOMPARE(refused.status, 1);
    QCOMPARE(run("location set hereAgreement on").status, 0);
    QCOMPARE(run("location set here on").output, QStringLiteral("here is on.\n"));
}

void MdmctlSettingsTest::absentProviderAndReceiver()
{
    QFile file(LocationFile);
    QVERIFY(file.open(QIODevice::WriteOnly | QIODevice::Truncate));
    file.write("[location]\nhere_available=false\n");
    file.close();
    const Mdmctl::Result refused = run("location set hereAgreement on");
    QCOMPARE(refused.errors, QStringLiteral("mdmctl: the phone has no HERE\n"));
    QCOMPARE(refused.status, 1);
    // What is off anyway needs none.
    QCOMPARE(run("location set here off").status, 0);
}

void MdmctlSettingsTest::unwritableSettingsAreTold()
{
    // A folder in the file's place.
    QVERIFY(QFile::remove(LocationFile));
    QVERIFY(QDir().mkpath(LocationFile + QStringLiteral("/x")));
    const Mdmctl::Result refused = run("location set enabled on");
    QVERIFY(QDir(LocationFile).removeRecursively());
    QCOMPARE(refused.errors,
             QStringLiteral("mdmctl: Filename refers to a directory (/etc/location/location.conf)\n"));
    QCOMPARE(refused.status, 1);
}

void MdmctlSettingsTest::findsThePosition()
{
    const Mdmctl::Result found = run("location once --json");
    QCOMPARE(found.errors, QString());
    QCOMPARE(found.status, 0);
    const QJsonObject position = found.json();
    for (const char *member : {"latitude", "longitude", "altitude"})
        QVERIFY2(position.value(QLatin1String(member)).isDouble(), member);
    QVERIFY(position.value(QLatin1String("satellitesInView")).toInt() > 0);
    QVERIFY(QDateTime::fromString(position.value(QLatin1String("fixed")).toString(), Qt::ISODateWithMs)
                .isValid());
    QVERIFY(!state("location").value(QLatin1String("running")).toBool());
    static const QRegularExpression line(QStringLiteral(
        "^-?\\d+\\.\\d{6}, -?\\d+\\.\\d{6}, -?\\d+\\.\\d m at [-0-9T:.]+Z; \\d+ of \\d+ satellites\n$"));
    const Mdmctl::Result text = run("location once");
    QVERIFY2(line.match(text.output).hasMatch(), qPrintable(text.output));
}

void MdmctlSettingsTest::findsNoPositionInTime()
{
    m_phone.act(QStringLiteral("location signal"), {QStringLiteral("off")});
    const Mdmctl::Result none = run("location once --timeout 0.3");
    QCOMPARE(none.errors,
             QStringLiteral("mdmctl: the MDM proxy (org.corvaneos.mdmproxy) did not find the position within "
                            "0.3 s\n"));
    QCOMPARE(none.status, 1);
    m_phone.act(QStringLiteral("location signal"), {QStringLiteral("on")});
}

void MdmctlSettingsTest::refusedPositionIsTold()
{
    m_phone.failCalls(Proxy, LocationPath, QString(), QStringLiteral("com.example.Denied"),
                      QStringLiteral("not you"));
    for (const char *command : {"location once", "location watch"}) {
        const Mdmctl::Result refused = run(command);
        QVERIFY2(refused.errors.contains(QStringLiteral(
                     "the MDM proxy (org.corvaneos.mdmproxy) refused: not you (com.example.Denied)\n")),
                 qPrintable(refused.errors));
        QCOMPARE(refused.status, 1);
    }
}

void MdmctlSettingsTest::watchFollowsThePosition()
{
    Mdmctl watch(words("location watch --json"));
    QVERIFY(watch.waitForOutput(QStringLiteral("\"watching\"")));
    QVERIFY(watch.waitForOutput(QStringLiteral("\"position\"")));
    QVERIFY(watch.waitForOutput(QStringLiteral("\"satellites\"")));
    QVERIFY(state("location").value(QLatin1String("running")).toBool());
    watch.interrupt(SIGINT);
    const Mdmctl::Result watched = watch.finish();
    QCOMPARE(watched.errors, QString());
    QCOMPARE(watched.status, 0);
    // The receiver rests again.
    QVERIFY(!state("location").value(QLatin1String("running")).toBool());
}

void MdmctlSettingsTest::showsTimeSettings()
{
    QCOMPARE(run("time status").output,
             QStringLiteral("SETTING            VALUE            MEANING\n"
                            "automaticTime      on               Whether the clock follows the network\n"
                            "automaticTimeZone  on               Whether the time zone follows the network\n"
                            "timeZone           Europe/Helsinki  The time zone, such as Europe/Helsinki\n"));
    QCOMPARE(run("time status --json").json(),
             json(R"({"automaticTime": true, "automaticTimeZone": true, "timeZone": "Europe/Helsinki"})"));
}

void MdmctlSettingsTest::setsTimeSettings()
{
    QCOMPARE(run("time set automaticTime off").output, QStringLiteral("automaticTime is off.\n"));
    QCOMPARE(run("time set automaticTimeZone off --json").json(),
             json(R"({"automaticTimeZone": false, "changed": true})"));
    QCOMPARE(run("time set timeZone Europe/Berlin").output, QStringLiteral("timeZone is Europe/Berlin.\n"));
    const QJsonObject clock = state("clock");
    QCOMPARE(clock.value(QLatin1String("automaticTime")), QJsonValue(false));
    QCOMPARE(clock.value(QLatin1String("automaticTimeZone")), QJsonValue(false));
    QCOMPARE(clock.value(QLatin1String("timeZone")).toString(), QStringLiteral("Europe/Berlin"));
}

void MdmctlSettingsTest::refusedTimeSettingIsTold()
{
    m_phone.failCalls(Clock, QString(), QStringLiteral("SetTimezone"), QStringLiteral("com.example.Denied"),
                      QStringLiteral("not you"));
    const Mdmctl::Result refused = run("time set timeZone Europe/Berlin");
    QVERIFY2(refused.errors.contains(QStringLiteral("not you (com.example.Denied)")),
             qPrintable(refused.errors));
    QCOMPARE(refused.status, 1);
}

void MdmctlSettingsTest::listsTimeZones()
{
    const Mdmctl::Result listed = run("time zones");
    QVERIFY(listed.output.split(QLatin1Char('\n')).contains(QStringLiteral("Europe/Helsinki")));
    QVERIFY(run("time zones --json")
                .json()
                .value(QLatin1String("timeZones"))
                .toArray()
                .contains(QStringLiteral("Europe/Helsinki")));
}

void MdmctlSettingsTest::setsTheClock()
{
    run("time set automaticTime off");
    const Mdmctl::Result set = run("time clock --date 2026-03-02 --time 09:15");
    QCOMPARE(set.errors, QString());
    QCOMPARE(set.output, QStringLiteral("The clock is set to 2026-03-02 09:15.\n"));
    QCOMPARE(set.status, 0);
    const QDateTime now
        = QDateTime::fromString(state("clock").value(QLatin1String("time")).toString(), Qt::ISODateWithMs);
    // Helsinki is two hours ahead in winter.
    QVERIFY2(qAbs(now.secsTo(QDateTime(QDate(2026, 3, 2), QTime(7, 15), Qt::UTC))) < 60,
             qPrintable(now.toString(Qt::ISODate)));
}

void MdmctlSettingsTest::automaticClockIsNotSet()
{
    const Mdmctl::Result refused = run("time clock --time 09:15");
    QCOMPARE(
        refused.errors,
        QStringLiteral("mdmctl: the time service (org.freedesktop.timedate1) refused: Automatic time "
                       "synchronization is enabled (org.freedesktop.timedate1.AutomaticTimeSyncEnabled)\n"));
    QCOMPARE(refused.status, 1);
}

void MdmctlSettingsTest::absentServicesAreTold_data()
{
    QTest::addColumn<QString>("service");
    QTest::addColumn<QString>("message");
    for (const char *command : {"time status", "time set automaticTime off", "time clock --time 09:15"}) {
        QTest::newRow(command)
            << Clock
            << QStringLiteral("mdmctl: the time service (org.freedesktop.timedate1) is not running\n");
    }
    for (const char *command : {"location once", "location watch"}) {
        QTest::newRow(command) << Proxy
                               << QStringLiteral(
                                      "mdmctl: the MDM proxy (org.corvaneos.mdmproxy) is not running\n");
    }
}

void MdmctlSettingsTest::absentServicesAreTold()
{
    QFETCH(QString, service);
    m_phone.stopService(service);
    const Mdmctl::Result told = run(QTest::currentDataTag());
    QTEST(told.errors, "message");
    QCOMPARE(told.status, 3);
    // The settings of location are in a file.
    QCOMPARE(run("location settings").status, 0);
}

void MdmctlSettingsTest::policyIsComparedAndMadeSo()
{
    const QByteArray wanted = R"({"name": "Test", "location": {"gps": false, "sources": ["gps", "wlan"],
        "hereAgreement": true, "here": true}, "time": {"automaticTimeZone": false,
        "timeZone": "Europe/Berlin"}})";
    const Mdmctl::Result checked = policy("check", wanted);
    QCOMPARE(checked.status, 1);
    const QJsonArray settings = checked.json().value(QLatin1String("settings")).toArray();
    QCOMPARE(settings.at(1).toObject().value(QLatin1String("wanted")).toArray(),
             QJsonArray({QStringLiteral("wlan"), QStringLiteral("gps")}));
    QCOMPARE(settings.at(5).toObject(),
             json(R"({"path": "time.timeZone", "status": "different", "present": "Europe/Helsinki",
                      "wanted": "Europe/Berlin", "detail": ""})"));
    QCOMPARE(contentOf(LocationFile), m_locationFile);

    const Mdmctl::Result applied = policy("apply", wanted);
    const QJsonArray changes = applied.json().value(QLatin1String("settings")).toArray();
    QCOMPARE(changes.size(), 6);
    for (const QJsonValue &change : changes)
        QCOMPARE(change[QLatin1String("status")].toString(), QStringLiteral("changed"));
    QCOMPARE(applied.status, 0);
    QCOMPARE(policy("check", wanted).status, 0);
    QCOMPARE(state("clock").value(QLatin1String("timeZone")).toString(), QStringLiteral("Europe/Berlin"));
}

void MdmctlSettingsTest::policyNamesWhatThePhoneHasNot()
{
    const Mdmctl::Result zone = policy("check", R"({"time": {"timeZone": "Europe/Atlantis"}})");
    const QJsonObject setting = zone.json().value(QLatin1String("settings")).toArray().at(0).toObject();
    QCOMPARE(setting.value(QLatin1String("status")).toString(), QStringLiteral("unsupported"));
    QCOMPARE(setting.value(QLatin1String("detail")).toString(),
             QStringLiteral("the phone knows no time zone \"Europe/Atlantis\""));
    QCOMPARE(zone.status, 1);
    m_phone.stopService(Clock);
    QCOMPARE(policy("check", R"({"time": {"timeZone": "Europe/Helsinki"}})").status, 3);
    // A policy that is not about time needs no time service.
    QCOMPARE(policy("check", R"({"location": {"enabled": true}})").status, 0);
}

void MdmctlSettingsTest::policyRefusesUnknownWords()
{
    const Mdmctl::Result refused = policy("check", R"({"location": {"sources": ["gps", "sky"]}})");
    QVERIFY2(refused.errors.contains(QStringLiteral("/location/sources/1: must be one of ")),
             qPrintable(refused.errors));
    QCOMPARE(refused.status, 2);
}

void MdmctlSettingsTest::policyIsExported()
{
    const QJsonObject exported = run("policy export").json();
    QCOMPARE(exported.value(QLatin1String("time")).toObject(),
             json(R"({"automaticTime": true, "automaticTimeZone": true, "timeZone": "Europe/Helsinki"})"));
    QCOMPARE(exported.value(QLatin1String("location")).toObject(), run("location settings --json").json());
}

void MdmctlSettingsTest::policyDriftIsPutRight()
{
    QFile file(m_folder.filePath(QStringLiteral("policy.json")));
    QVERIFY(file.open(QIODevice::WriteOnly));
    file.write(R"({"location": {"gps": true, "mls": false}, "time": {"automaticTime": true}})");
    file.close();
    Mdmctl watch({QStringLiteral("policy"), QStringLiteral("watch"), file.fileName(),
                  QStringLiteral("--look"), QStringLiteral("0.2")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching for drift")));
    store("gps_enabled=true", "gps_enabled=false");
    QVERIFY(watch.waitForOutput(QStringLiteral("location.gps: changed (from off to on)")));
    // Nobody announces this one.
    store("mls_online_state=1", "mls_online_state=2");
    QVERIFY(watch.waitForOutput(QStringLiteral("location.mls: changed (from on to off)")));
    run("time set automaticTime off");
    QVERIFY(watch.waitForOutput(QStringLiteral("time.automaticTime: changed (from off to on)")));
    watch.interrupt(SIGINT);
    QCOMPARE(watch.finish().status, 0);
}

void MdmctlSettingsTest::developerModeOnAndOff()
{
    const auto isOn = [] {
        return run("security status --json").json().value(QLatin1String("developerMode"));
    };
    const Mdmctl::Result on = run("security developer-mode on");
    QCOMPARE(on.errors, QString());
    QCOMPARE(on.status, 0);
    QCOMPARE(isOn(), QJsonValue(true));
    QCOMPARE(run("security developer-mode off --json").json(), json(R"({"developerMode": false})"));
    QCOMPARE(isOn(), QJsonValue(false));
}

void MdmctlSettingsTest::policyOfDeveloperMode()
{
    QCOMPARE(policy("check", R"({"security": {"developerMode": true}})").status, 1);
    QCOMPARE(policy("apply", R"({"security": {"developerMode": true}})").status, 0);
    QCOMPARE(policy("check", R"({"security": {"developerMode": true}})").status, 0);

    QFile file(m_folder.filePath(QStringLiteral("policy.json")));
    QVERIFY(file.open(QIODevice::WriteOnly | QIODevice::Truncate));
    file.write(R"({"security": {"developerMode": false}})");
    file.close();
    Mdmctl watch({QStringLiteral("policy"), QStringLiteral("watch"), file.fileName(),
                  QStringLiteral("--look"), QStringLiteral("0.2")});
    const QString changed = QStringLiteral("security.developerMode: changed (from on to off)");
    QVERIFY(watch.waitForOutput(changed));
    // It may be off again before this one sees that it was on.
    Mdmctl on(words("security developer-mode on"));
    QVERIFY(watch.waitForOutput(changed, 2));
    watch.interrupt(SIGINT);
    QCOMPARE(watch.finish().status, 0);
}

QTEST_GUILESS_MAIN(MdmctlSettingsTest)
#include "mdmctl_settings_test.moc"
