// SPDX-License-Identifier: LGPL-2.1-or-later
#include "mdmctl.h"
#include "phone.h"
#include "terminal.h"
#include "waiting.h"

#include <QtCore/QFile>
#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QSysInfo>
#include <QtTest/QtTest>

#include <csignal>

namespace
{

const QString Service = QStringLiteral("org.veldmobile.devicelock");
const QString ManagementPath = QStringLiteral("/mdm");
const QString SettingsFile = QStringLiteral("/usr/share/dapple/devicelock/devicelock_settings.conf");

Mdmctl::Result run(const char *arguments, const QByteArray &input = QByteArray())
{
    return Mdmctl::run(QString::fromUtf8(arguments).split(QLatin1Char(' ')), input);
}

Mdmctl::Result policy(const char *command, const char *text)
{
    return Mdmctl::run(
        {QStringLiteral("policy"), QLatin1String(command), QStringLiteral("-"), QStringLiteral("--json")},
        text);
}

QJsonObject json(const char *text)
{
    return QJsonDocument::fromJson(text).object();
}

QString statuses(const Mdmctl::Result &report)
{
    QStringList texts;
    const QJsonArray settings = report.json().value(QLatin1String("settings")).toArray();
    for (const QJsonValue &setting : settings)
        texts.append(setting[QLatin1String("path")].toString() + QLatin1Char('=')
                     + setting[QLatin1String("status")].toString());
    return texts.join(QLatin1Char(' '));
}

} // namespace

class MdmctlLockTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void cleanup();

    void statusTellsStateAndEncryption();
    void watchTellsChanges();
    void watchAsJson();
    void watchEndsWithTheDaemon();
    void lockoutOnAndOff();
    void lockoutIsRefused();
    void codeFromWhereItIs_data();
    void codeFromWhereItIs();
    void codeIsNowhereToBeSeen();
    void codeIsRefused();
    void wipeWantsTheName();
    void wipeIsInterrupted();
    void wipeShutsDown();
    void wipeRestarts();
    void wipeIsRefused();
    void daemonThatDoesNotAnswer();
    void daemonThatIsNotThere_data();
    void daemonThatIsNotThere();
    void wrongUsage_data();
    void wrongUsage();

    void securityStatus();
    void securityStatusOfAPhoneThatDoesNotSay();
    void sideloadingOnAndOff();
    void sideloadingIsRefused();

    void policyOfTheLock();
    void policyIsRefused();
    void policyWatchPutsRight();
    void policyWithoutTheDaemon();

private:
    QJsonObject lockState() const { return m_phone.state().value(QStringLiteral("deviceLock")).toObject(); }
    QJsonArray userFiles() const
    {
        return m_phone.state()
            .value(QStringLiteral("storage"))
            .toObject()
            .value(QStringLiteral("userFiles"))
            .toArray();
    }

    Phone m_phone;
};

void MdmctlLockTest::cleanup()
{
    m_phone.clearFaults();
    if (m_phone.state().value(QStringLiteral("power")).toString() == QLatin1String("off"))
        m_phone.act(QStringLiteral("power on"), {});
    m_phone.startService(Service);
    QCOMPARE(run("lock lockout off").status, 0);
}

void MdmctlLockTest::statusTellsStateAndEncryption()
{
    const Mdmctl::Result told = run("lock status");
    QCOMPARE(told.errors, QString());
    QCOMPARE(told.output, QStringLiteral("The phone is unlocked.\nThe user's data are encrypted.\n"));
    QCOMPARE(told.status, 0);
    QCOMPARE(run("lock status --json").json(), json(R"({"state": "unlocked", "homeEncrypted": true})"));
}

void MdmctlLockTest::watchTellsChanges()
{
    Mdmctl watch({QStringLiteral("lock"), QStringLiteral("watch")});
    QVERIFY(watch.waitForOutput(QStringLiteral("  The phone is unlocked.\n")));
    QCOMPARE(run("lock lockout on").status, 0);
    QVERIFY(watch.waitForOutput(QStringLiteral("  The phone is locked by its manager.\n")));
    QCOMPARE(run("lock lockout off").status, 0);
    QVERIFY(watch.waitForOutput(QStringLiteral("  The phone is unlocked.\n"), 2));
    watch.interrupt(SIGINT);
    QCOMPARE(watch.finish().status, 0);
}

void MdmctlLockTest::watchAsJson()
{
    Mdmctl watch({QStringLiteral("lock"), QStringLiteral("watch"), QStringLiteral("--json")});
    QVERIFY(watch.waitForOutput(QStringLiteral("\"watching\"")));
    QCOMPARE(run("lock lockout on").status, 0);
    QVERIFY(watch.waitForOutput(QStringLiteral("\"manager-lockout\"")));
    watch.interrupt(SIGTERM);
    const QVector<QJsonObject> lines = watch.finish().jsonLines();
    QCOMPARE(lines.size(), 2);
    QCOMPARE(lines.at(0).value(QLatin1String("event")).toString(), QStringLiteral("watching"));
    QCOMPARE(lines.at(0).value(QLatin1String("state")).toString(), QStringLiteral("unlocked"));
    QCOMPARE(lines.at(1).value(QLatin1String("event")).toString(), QStringLiteral("stateChanged"));
}

void MdmctlLockTest::watchEndsWithTheDaemon()
{
    Mdmctl watch({QStringLiteral("lock"), QStringLiteral("watch")});
    QVERIFY(watch.waitForOutput(QStringLiteral("  The phone is unlocked.\n")));
    m_phone.stopService(Service);
    const Mdmctl::Result ended = watch.finish();
    QCOMPARE(ended.errors,
             QStringLiteral("mdmctl: the device-lock daemon (org.veldmobile.devicelock) is not running\n"));
    QCOMPARE(ended.status, 3);
}

void MdmctlLockTest::lockoutOnAndOff()
{
    const Mdmctl::Result locked
        = Mdmctl::run({QStringLiteral("lock"), QStringLiteral("lockout"), QStringLiteral("on"),
                       QStringLiteral("--message"), QStringLiteral("Call us \u00fc")});
    QCOMPARE(locked.errors, QString());
    QCOMPARE(locked.output, QStringLiteral("The phone is locked by its manager.\n"));
    QCOMPARE(locked.status, 0);
    QCOMPARE(lockState().value(QStringLiteral("feedback")).toString(),
             QStringLiteral("{'message': <'Call us \u00fc'>}"));
    QCOMPARE(run("lock status").output.section(QLatin1Char('\n'), 0, 0),
             QStringLiteral("The phone is locked by its manager."));
    QCOMPARE(run("lock lockout off --json").json(), json(R"({"lockout": false})"));
    QCOMPARE(lockState().value(QStringLiteral("state")).toString(), QStringLiteral("unlocked"));
}

void MdmctlLockTest::lockoutIsRefused()
{
    m_phone.failCalls(Service, ManagementPath, QStringLiteral("SetLockoutMode"), QStringLiteral("a.b.C"),
                      QString());
    const Mdmctl::Result refused = run("lock lockout on");
    QCOMPARE(refused.output, QString());
    QCOMPARE(refused.errors,
             QStringLiteral(
                 "mdmctl: the device-lock daemon (org.veldmobile.devicelock) refused: it has not changed "
                 "the lockout\n"));
    QCOMPARE(refused.status, 1);
    m_phone.clearFaults();
}

void MdmctlLockTest::codeFromWhereItIs_data()
{
    QTest::addColumn<QString>("arguments");
    QTest::addColumn<QByteArray>("input");
    QTest::addColumn<QString>("code");
    QTest::newRow("standard input") << "lock set-code --code-file -" << QByteArray("2468\n") << "2468";
    QTest::newRow("file") << "lock set-code --code-file /run/code" << QByteArray() << "13579";
    QTest::newRow("environment") << "lock set-code --code-env LOCK_CODE" << QByteArray() << "97531";
}

void MdmctlLockTest::codeFromWhereItIs()
{
    QFETCH(QString, arguments);
    QFETCH(QByteArray, input);
    QFETCH(QString, code);
    QFile file(QStringLiteral("/run/code"));
    QVERIFY(file.open(QIODevice::WriteOnly));
    file.write("13579");
    file.close();
    qputenv("LOCK_CODE", "97531");
    const Mdmctl::Result set = run(arguments.toUtf8().constData(), input);
    QCOMPARE(set.errors, QString());
    QCOMPARE(set.output, QStringLiteral("The security code is set.\n"));
    QCOMPARE(set.status, 0);
    QCOMPARE(lockState().value(QStringLiteral("code")).toString(), code);
}

void MdmctlLockTest::codeIsNowhereToBeSeen()
{
    const Mdmctl::Result set = run("lock set-code --code-file - --json", "86420");
    QCOMPARE(set.json(), json(R"({"changed": true})"));
    QVERIFY(!set.errors.contains(QStringLiteral("86420")));
    m_phone.failCalls(Service, ManagementPath, QStringLiteral("SetSecurityCode"), QStringLiteral("a.b.C"),
                      QStringLiteral("86420"));
    QVERIFY(!run("lock set-code --code-file -", "86420").errors.contains(QStringLiteral("86420")));
    m_phone.clearFaults();
}

void MdmctlLockTest::codeIsRefused()
{
    const Mdmctl::Result refused = run("lock set-code --code-file -", "1");
    QCOMPARE(
        refused.errors,
        QStringLiteral("mdmctl: the device-lock daemon (org.veldmobile.devicelock) refused: it has not taken "
                       "the code\n"));
    QCOMPARE(refused.status, 1);
}

void MdmctlLockTest::wipeWantsTheName()
{
    const QByteArray name = QSysInfo::machineHostName().toLocal8Bit();
    for (const QByteArray &input :
         {QByteArray(), QByteArray("\n"), QByteArray("yes\n"), QByteArray("x" + name)}) {
        const Mdmctl::Result asked = run("lock wipe --reboot --partitions --external-media", input);
        QCOMPARE(asked.output, QString());
        QCOMPARE(
            asked.errors,
            QStringLiteral(
                "This erases the data of its user, the data partition as a whole, memory cards on \"%1\", "
                "for good, and then restarts it.\n"
                "Type the name of the device to go on: \n"
                "mdmctl: that is not the name of this device; nothing was erased\n")
                .arg(QSysInfo::machineHostName()));
        QCOMPARE(asked.status, 1);
    }
    QVERIFY(!userFiles().isEmpty());
    QVERIFY(m_phone.takeJournal(Service).filter(QStringLiteral("ClearDevice")).isEmpty());
}

void MdmctlLockTest::wipeIsInterrupted()
{
    Terminal terminal;
    Mdmctl wipe({QStringLiteral("lock"), QStringLiteral("wipe")}, &terminal);
    const QString prompt = QStringLiteral("Type the name of the device to go on: ");
    QVERIFY(wipe.waitForErrors(prompt));
    terminal.type("\x03");
    const Mdmctl::Result ended = wipe.finish();
    QVERIFY2(ended.errors.endsWith(prompt + QLatin1String("\nmdmctl: interrupted; nothing was erased\n")),
             qPrintable(ended.errors));
    QCOMPARE(ended.status, 1);
    QVERIFY(m_phone.takeJournal(Service).filter(QStringLiteral("ClearDevice")).isEmpty());
}

void MdmctlLockTest::wipeShutsDown()
{
    m_phone.takeJournal(Service);
    const QByteArray name = QSysInfo::machineHostName().toLocal8Bit();
    const Mdmctl::Result wiped = run("lock wipe", name + '\n');
    QVERIFY2(wiped.errors.startsWith(
                 QStringLiteral("This erases the data of its user on \"%1\", for good, and then "
                                "shuts it down.\n")
                     .arg(QSysInfo::machineHostName())),
             qPrintable(wiped.errors));
    QCOMPARE(wiped.output, QStringLiteral("The data are erased; the phone shuts down.\n"));
    QCOMPARE(wiped.status, 0);
    QCOMPARE(m_phone.takeJournal(Service).filter(QStringLiteral("ClearDevice")),
             QStringList(QStringLiteral("/mdm ClearDevice (uint32 0,)")));
    QVERIFY(waitUntil(
        [&] { return m_phone.state().value(QStringLiteral("power")).toString() == QLatin1String("off"); }));
    QVERIFY(userFiles().isEmpty());
}

void MdmctlLockTest::wipeRestarts()
{
    m_phone.takeJournal(Service);
    const Mdmctl::Result wiped = run("lock wipe --yes --reboot --partitions --external-media --json");
    QCOMPARE(wiped.errors, QString());
    QCOMPARE(wiped.json(), json(R"({"erased": true})"));
    QCOMPARE(m_phone.takeJournal(Service).filter(QStringLiteral("ClearDevice")),
             QStringList(QStringLiteral("/mdm ClearDevice (uint32 7,)")));
    QVERIFY(waitUntil([&] { return m_phone.state().value(QStringLiteral("restarts")).toInt() == 1; }));
    QVERIFY(waitUntil([&] { return run("lock status").status == 0; }));
    QCOMPARE(run("lock status").output,
             QStringLiteral("The phone is unlocked.\nThe user's data are not encrypted.\n"));
}

void MdmctlLockTest::wipeIsRefused()
{
    m_phone.failCalls(Service, ManagementPath, QStringLiteral("ClearDevice"), QStringLiteral("a.b.C"),
                      QString());
    const Mdmctl::Result refused = run("lock wipe --yes");
    QCOMPARE(refused.output, QString());
    QCOMPARE(refused.errors,
             QStringLiteral(
                 "mdmctl: the device-lock daemon (org.veldmobile.devicelock) refused: it has not erased "
                 "the data\n"));
    QCOMPARE(refused.status, 1);
}

void MdmctlLockTest::daemonThatDoesNotAnswer()
{
    m_phone.swallowCalls(Service, ManagementPath, QString());
    const Mdmctl::Result silent = run("lock lockout on --timeout 0.2");
    QCOMPARE(silent.errors,
             QStringLiteral(
                 "mdmctl: the device-lock daemon (org.veldmobile.devicelock) did not confirm the change "
                 "in time\n"));
    QCOMPARE(silent.status, 1);
    m_phone.clearFaults();
}

void MdmctlLockTest::daemonThatIsNotThere_data()
{
    QTest::addColumn<QString>("arguments");
    for (const char *arguments :
         {"lock status", "lock watch", "lock lockout on", "lock set-code --code-file -", "lock wipe --yes",
          "security sideloading on"})
        QTest::newRow(arguments) << QString::fromLatin1(arguments);
}

void MdmctlLockTest::daemonThatIsNotThere()
{
    QFETCH(QString, arguments);
    m_phone.stopService(Service);
    const Mdmctl::Result told = run(arguments.toUtf8().constData(), "2468\n");
    QCOMPARE(told.output, QString());
    QCOMPARE(told.errors,
             QStringLiteral("mdmctl: the device-lock daemon (org.veldmobile.devicelock) is not running\n"));
    QCOMPARE(told.status, 3);
}

void MdmctlLockTest::wrongUsage_data()
{
    QTest::addColumn<QString>("arguments");
    for (const char *arguments :
         {"lock", "lock lockout", "lock lockout maybe", "lock set-code 2468", "lock wipe now",
          "security sideloading", "security sideloading yes", "lock set-code --code-file a --code-env B",
          "lock set-code --code-file /nowhere"})
        QTest::newRow(arguments) << QString::fromLatin1(arguments);
}

void MdmctlLockTest::wrongUsage()
{
    QFETCH(QString, arguments);
    m_phone.takeJournal(Service);
    const Mdmctl::Result told = run(arguments.toUtf8().constData());
    QCOMPARE(told.output, QString());
    QVERIFY(told.errors.startsWith(QLatin1String("mdmctl: ")));
    QCOMPARE(told.status, 2);
    QVERIFY(m_phone.takeJournal(Service).filter(ManagementPath).isEmpty());
}

void MdmctlLockTest::securityStatus()
{
    const Mdmctl::Result told = run("security status");
    QCOMPARE(told.errors, QString());
    QCOMPARE(told.output,
             QStringLiteral("Developer mode is off.\nPackages from outside the store are forbidden.\n"));
    QCOMPARE(run("security status --json").json(), json(R"({"developerMode": false, "sideloading": false})"));
}

void MdmctlLockTest::securityStatusOfAPhoneThatDoesNotSay()
{
    QVERIFY(QFile::rename(SettingsFile, SettingsFile + QStringLiteral(".away")));
    const Mdmctl::Result told = run("security status");
    QVERIFY(QFile::rename(SettingsFile + QStringLiteral(".away"), SettingsFile));
    QCOMPARE(told.output, QString());
    QVERIFY2(told.errors.startsWith(QLatin1String(
                 "mdmctl: the phone does not say whether packages from outside the store are allowed: ")),
             qPrintable(told.errors));
    QCOMPARE(told.status, 1);
}

void MdmctlLockTest::sideloadingOnAndOff()
{
    QCOMPARE(run("security sideloading on").output,
             QStringLiteral("Packages from outside the store are allowed.\n"));
    QCOMPARE(run("security status --json").json().value(QLatin1String("sideloading")), QJsonValue(true));
    QCOMPARE(run("security sideloading off --json").json(), json(R"({"sideloading": false})"));
    QCOMPARE(run("security status --json").json().value(QLatin1String("sideloading")), QJsonValue(false));
}

void MdmctlLockTest::sideloadingIsRefused()
{
    m_phone.failCalls(Service, ManagementPath, QStringLiteral("ChangeSetting"), QStringLiteral("a.b.C"),
                      QStringLiteral("not today"));
    const Mdmctl::Result refused = run("security sideloading on");
    QCOMPARE(refused.errors,
             QStringLiteral(
                 "mdmctl: the device-lock daemon (org.veldmobile.devicelock) refused: not today (a.b.C)\n"));
    QCOMPARE(refused.status, 1);
}

void MdmctlLockTest::policyOfTheLock()
{
    const char *const text = R"({"deviceLock": {"lockout": true, "sideloading": true}})";
    const Mdmctl::Result checked = policy("check", text);
    QCOMPARE(statuses(checked),
             QStringLiteral("deviceLock.lockout=different deviceLock.sideloading=different"));
    QCOMPARE(checked.status, 1);
    QCOMPARE(statuses(policy("apply", text)),
             QStringLiteral("deviceLock.lockout=changed deviceLock.sideloading=changed"));
    m_phone.takeJournal(Service);
    QCOMPARE(statuses(policy("apply", text)),
             QStringLiteral("deviceLock.lockout=compliant deviceLock.sideloading=compliant"));
    QVERIFY(m_phone.takeJournal(Service).filter(ManagementPath).isEmpty());
    QCOMPARE(lockState().value(QStringLiteral("state")).toString(), QStringLiteral("manager-lockout"));

    const QJsonObject exported = run("policy export").json();
    QCOMPARE(exported.value(QLatin1String("deviceLock")).toObject(),
             json(R"({"lockout": true, "sideloading": true})"));
    QCOMPARE(statuses(policy("apply", R"({"deviceLock": {"lockout": false, "sideloading": false}})")),
             QStringLiteral("deviceLock.lockout=changed deviceLock.sideloading=changed"));
    QCOMPARE(policy("check", R"({"deviceLock": {"lockout": "yes"}})").status, 2);
}

void MdmctlLockTest::policyIsRefused()
{
    m_phone.failCalls(Service, ManagementPath, QStringLiteral("SetLockoutMode"), QStringLiteral("a.b.C"),
                      QString());
    const Mdmctl::Result applied
        = policy("apply", R"({"deviceLock": {"lockout": true, "sideloading": true}})");
    QCOMPARE(statuses(applied), QStringLiteral("deviceLock.lockout=failed deviceLock.sideloading=changed"));
    QCOMPARE(applied.status, 1);
    m_phone.clearFaults();
    QCOMPARE(run("security sideloading off").status, 0);
}

void MdmctlLockTest::policyWatchPutsRight()
{
    QFile file(QStringLiteral("/run/policy.json"));
    QVERIFY(file.open(QIODevice::WriteOnly));
    file.write(R"({"deviceLock": {"lockout": true, "sideloading": false}})");
    file.close();
    Mdmctl watch({QStringLiteral("policy"), QStringLiteral("watch"), file.fileName(),
                  QStringLiteral("--json"), QStringLiteral("--look"), QStringLiteral("0.2")});
    QVERIFY(watch.waitForOutput(QStringLiteral("\"watching\"")));
    QCOMPARE(lockState().value(QStringLiteral("state")).toString(), QStringLiteral("manager-lockout"));
    const auto changes = [this](const char *method) {
        return m_phone.takeJournal(Service).filter(QLatin1String(method)).size();
    };
    changes("x");
    QCOMPARE(run("lock lockout off").status, 0);
    // Once by the command, once by the watch.
    int seen = 0;
    QVERIFY(waitUntil([&] { return (seen += changes("SetLockoutMode")) == 2; }));
    QVERIFY(waitUntil([&] {
        return lockState().value(QStringLiteral("state")).toString() == QLatin1String("manager-lockout");
    }));
    QCOMPARE(run("security sideloading on").status, 0);
    seen = 0;
    QVERIFY(waitUntil([&] { return (seen += changes("ChangeSetting")) >= 2; }));
    watch.interrupt(SIGINT);
    QCOMPARE(watch.finish().status, 0);
    QCOMPARE(run("security status --json").json().value(QLatin1String("sideloading")), QJsonValue(false));
}

void MdmctlLockTest::policyWithoutTheDaemon()
{
    m_phone.stopService(Service);
    const Mdmctl::Result checked = policy("check", R"({"deviceLock": {"lockout": true}})");
    QCOMPARE(statuses(checked), QStringLiteral("deviceLock.lockout=unsupported"));
    QCOMPARE(checked.status, 3);
}

QTEST_GUILESS_MAIN(MdmctlLockTest)
#include "mdmctl_lock_test.moc"
