// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"
#include "waiting.h"

#include "device/securitysettings_p.h"

#include <corvanemdm/securitysettings.h>

#include <QtCore/QDir>
#include <QtCore/QFile>
#include <QtDBus/QDBusConnection>
#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::SecuritySettings;
using Corvane::Mdm::SecuritySettingsPrivate;

namespace
{

const QString DeviceLockService = QStringLiteral("org.veldmobile.devicelock");
const QString ManagementPath = QStringLiteral("/mdm");
const QString ChangeSetting = QStringLiteral("ChangeSetting");
const QString PackageService = QStringLiteral("org.freedesktop.PackageKit");
const QString DeveloperProgram = QStringLiteral("/usr/bin/devel-su");
const QString SettingsFile = QStringLiteral("/usr/share/dapple/devicelock/devicelock_settings.conf");

const QString fetchFailed = QStringLiteral("Unable to fetch sideloading key ");
const QString changeFailed = QStringLiteral("Failed to change sideloading state QDBusError(\"");

const QString enabledChanged = QStringLiteral("developerModeEnabledChanged()");
const QString changeError = QStringLiteral("developerModeChangeError()");

void writeSettings(const QByteArray &text)
{
    QFile file(SettingsFile);
    if (!file.open(QIODevice::WriteOnly) || file.write(text) != text.size())
        qFatal("cannot write the settings");
}

QByteArray readSettings()
{
    QFile file(SettingsFile);
    return file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray();
}

} // namespace

class SecuritySettingsTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void sideloadingFromTheFile_data();
    void sideloadingFromTheFile();
    void sideloadingWithoutAnAnswer_data();
    void sideloadingWithoutAnAnswer();
    void sideloadingIsReadAnew();
    void sideloadingOnTheWire();
    void sideloadingReachesTheFile();
    void refusedSideloading();
    void sideloadingWithoutTheDaemon();
    void connectionIsMadeWhenItIsNeeded();

    void developerModeComesAndGoes();
    void developerModeThatIsInForceIsNothing();
    void refusedDeveloperMode_data();
    void refusedDeveloperMode();
    void developerModeIsAskedForTwice();
    void developerModeWithoutThePackageService();
    void destructionWhileDeveloperModeChanges();
    void otherPackagesAreIgnored();

private:
    /** What the package service is asked to do, as "Method arguments". */
    QStringList packageCalls() const;

    std::unique_ptr<Phone> m_phone;
    QByteArray m_settings;
};

void SecuritySettingsTest::init()
{
    m_phone = std::make_unique<Phone>();
    if (m_settings.isEmpty())
        m_settings = readSettings();
}

void SecuritySettingsTest::cleanup()
{
    m_phone->clearFaults();
    for (const QString &service : {DeviceLockService, PackageService})
        m_phone->startService(service);
    SecuritySettings settings;
    if (settings.developerModeEnabled()) {
        SignalSequence seen(&settings);
        settings.setDeveloperModeEnabled(false);
        QVERIFY(seen.waitFor(1));
        QCOMPARE(seen.take(), QStringList(enabledChanged));
    }
    writeSettings(m_settings);
}

void SecuritySettingsTest::sideloadingFromTheFile_data()
{
    QTest::addColumn<QByteArray>("file");
    QTest::addColumn<bool>("isAllowed");
    const auto value = [](const char *text) {
        return QByteArray("[desktop]\nveld\\devicelock\\sideloading_allowed=") + text + '\n';
    };
    QTest::newRow("1") << value("1") << true;
    QTest::newRow("2") << value("2") << true;
    QTest::newRow("0") << value("0") << false;
    QTest::newRow("-1") << value("-1") << false;
    QTest::newRow("spaces") << QByteArray("[desktop]\nveld\\devicelock\\sideloading_allowed = 1\n") << true;
    QTest::newRow("among others") << QByteArray(
        "# x\n[other]\na=1\n[desktop]\nveld\\devicelock\\automatic_locking=5\n"
        "veld\\devicelock\\sideloading_allowed=1\n")
                                  << true;
    QTest::newRow("key is missing") << QByteArray("[desktop]\nveld\\devicelock\\automatic_locking=5\n")
                                    << false;
    QTest::newRow("similar key") << QByteArray("[desktop]\nveld/devicelock/sideloading_allowed=1\n") << false;
}

void SecuritySettingsTest::sideloadingFromTheFile()
{
    QFETCH(QByteArray, file);
    QFETCH(bool, isAllowed);
    writeSettings(file);
    const SecuritySettings settings;
    MessageLog log;
    QCOMPARE(settings.sideloadingAllowed(), isAllowed);
    QCOMPARE(log.takeWarnings(), QStringList());
}

void SecuritySettingsTest::sideloadingWithoutAnAnswer_data()
{
    QTest::addColumn<QByteArray>("file");
    QTest::addColumn<QString>("reason");
    const auto value = [](const char *text) {
        return QByteArray("[desktop]\nveld\\devicelock\\sideloading_allowed=") + text + '\n';
    };
    QTest::newRow("no file") << QByteArray() << "desktop";
    QTest::newRow("no group") << QByteArray("[other]\nveld\\devicelock\\sideloading_allowed=1\n")
                              << "desktop";
    QTest::newRow("text") << value("true") << "sideloading_allowed";
    QTest::newRow("number and text") << value("1yes") << "sideloading_allowed";
    QTest::newRow("nothing") << value("") << "";
    QTest::newRow("too large") << value("4294967297") << "sideloading_allowed";
    QTest::newRow("not a key file") << QByteArray("sideloading\n") << "desktop";
}

void SecuritySettingsTest::sideloadingWithoutAnAnswer()
{
    QFETCH(QByteArray, file);
    QFETCH(QString, reason);
    if (file.isEmpty())
        QVERIFY(QFile::remove(SettingsFile));
    else
        writeSettings(file);
    const SecuritySettings settings;
    MessageLog log;
    QVERIFY(!settings.sideloadingAllowed());
    const QStringList warnings = log.takeWarnings();
    QCOMPARE(warnings.size(), 1);
    QVERIFY2(warnings.first().startsWith(fetchFailed), qPrintable(warnings.first()));
    const QString detail = warnings.first().mid(fetchFailed.size());
    QVERIFY2(!detail.isEmpty() && detail.contains(reason), qPrintable(warnings.first()));
}

void SecuritySettingsTest::sideloadingIsReadAnew()
{
    const SecuritySettings settings;
    for (const bool isAllowed : {true, false, true}) {
        writeSettings(QByteArray("[desktop]\nveld\\devicelock\\sideloading_allowed=")
                      + (isAllowed ? '1' : '0'));
        QCOMPARE(settings.sideloadingAllowed(), isAllowed);
    }
}

void SecuritySettingsTest::sideloadingOnTheWire()
{
    m_phone->answerCalls(DeviceLockService, ManagementPath, ChangeSetting, {});
    SecuritySettings settings;
    SignalSequence seen(&settings);
    MessageLog log;
    QVERIFY(settings.setSideloadingAllowed(true));
    QVERIFY(settings.setSideloadingAllowed(false));
    QCOMPARE(m_phone->takeJournalWithInterfaces(DeviceLockService),
             QStringList({QStringLiteral("/mdm org.corvaneos.devicelock.DeviceManagement.ChangeSetting "
                                         "('/desktop/veld/devicelock/sideloading_allowed', <true>)"),
                          QStringLiteral("/mdm org.corvaneos.devicelock.DeviceManagement.ChangeSetting "
                                         "('/desktop/veld/devicelock/sideloading_allowed', <false>)")}));
    QCOMPARE(log.takeWarnings(), QStringList());
    QCOMPARE(seen.take(), QStringList());
    // The daemon did nothing of it, and nothing was kept here.
    QVERIFY(!settings.sideloadingAllowed());
}

void SecuritySettingsTest::sideloadingReachesTheFile()
{
    SecuritySettings settings;
    const SecuritySettings other;
    writeSettings("# kept\n[desktop]\nveld\\devicelock\\automatic_locking=5\n");
    QVERIFY(settings.setSideloadingAllowed(true));
    QVERIFY(settings.sideloadingAllowed() && other.sideloadingAllowed());
    QVERIFY(readSettings().contains("# kept\n"));
    QVERIFY(readSettings().contains("veld\\devicelock\\automatic_locking=5\n"));
    QVERIFY(settings.setSideloadingAllowed(false));
    QVERIFY(!settings.sideloadingAllowed() && !other.sideloadingAllowed());
}

void SecuritySettingsTest::refusedSideloading()
{
    m_phone->failCalls(DeviceLockService, ManagementPath, ChangeSetting, QStringLiteral("com.example.Broken"),
                       QStringLiteral("Out of order"));
    SecuritySettings settings;
    SignalSequence seen(&settings);
    MessageLog log;
    QVERIFY(!settings.setSideloadingAllowed(true));
    QCOMPARE(log.takeWarnings(),
             QStringList(changeFailed + QStringLiteral("com.example.Broken\", \"Out of order\")")));
    QVERIFY(!settings.sideloadingAllowed());
    QCOMPARE(seen.take(), QStringList());
}

void SecuritySettingsTest::sideloadingWithoutTheDaemon()
{
    m_phone->stopService(DeviceLockService);
    SecuritySettings settings;
    MessageLog log;
    QVERIFY(!settings.setSideloadingAllowed(true));
    const QStringList warnings = log.takeWarnings();
    QCOMPARE(warnings.size(), 1);
    QVERIFY2(warnings.first().startsWith(changeFailed), qPrintable(warnings.first()));

    // The same object works when the daemon is there.
    m_phone->startService(DeviceLockService);
    QTest::ignoreMessage(QtDebugMsg, "The device lock socket is available to connect to");
    QVERIFY(waitUntil([&] { return settings.setSideloadingAllowed(true); }));
    QVERIFY(settings.sideloadingAllowed());
}

void SecuritySettingsTest::connectionIsMadeWhenItIsNeeded()
{
    // Nothing else in this process makes any: what comes next is the next number, and none is used up before.
    const auto isConnected = [](uint number) {
        return QDBusConnection(QStringLiteral("org.corvaneos.mdm.%1").arg(number)).isConnected();
    };
    const auto highest = [&isConnected] {
        for (uint number = 1000; number > 0; --number) {
            if (isConnected(number - 1))
                return number;
        }
        return 0u;
    };
    SecuritySettings settings;
    settings.sideloadingAllowed();
    QCOMPARE(highest(), 0u);
    QVERIFY(settings.setSideloadingAllowed(true));
    const uint first = highest();
    QVERIFY(first > 0);
    QVERIFY(settings.setSideloadingAllowed(false));
    QCOMPARE(highest(), first);
}

QStringList SecuritySettingsTest::packageCalls() const
{
    QStringList calls;
    const QStringList journal = m_phone->takeJournal(PackageService);
    for (const QString &call : journal) {
        const QString method = call.section(QLatin1Char(' '), 1);
        for (const char *wanted : {"InstallPackages", "RemovePackages", "Resolve"}) {
            if (method.startsWith(QLatin1String(wanted)))
                calls << method;
        }
    }
    return calls;
}

void SecuritySettingsTest::developerModeComesAndGoes()
{
    SecuritySettings settings;
    SignalSequence seen(&settings);
    MessageLog log;
    for (int times = 0; times < 2; ++times) {
        QVERIFY(!settings.developerModeEnabled());
        packageCalls();
        settings.setDeveloperModeEnabled(true);
        // Nothing blocks, and nothing is told before it is so.
        QCOMPARE(seen.take(), QStringList());
        QVERIFY(seen.waitFor(1));
        QVERIFY(settings.developerModeEnabled());
        QCOMPARE(seen.take(), QStringList(enabledChanged));
        QCOMPARE(packageCalls(),
                 QStringList({QStringLiteral("Resolve (uint64 65536, ['tevrik-developer-mode'])"),
                              QStringLiteral("InstallPackages (uint64 2, "
                                             "['tevrik-developer-mode;0.9.2-1;noarch;store'])")}));

        settings.setDeveloperModeEnabled(false);
        QVERIFY(seen.waitFor(1));
        QVERIFY(!settings.developerModeEnabled());
        QCOMPARE(seen.take(), QStringList(enabledChanged));
        // What came along with it goes along, and nothing that needs it.
        QCOMPARE(packageCalls(),
                 QStringList({QStringLiteral("Resolve (uint64 4, ['tevrik-developer-mode'])"),
                              QStringLiteral("RemovePackages (uint64 2, "
                                             "['tevrik-developer-mode;0.9.2-1;noarch;installed'], "
                                             "false, true)")}));
    }
    QCOMPARE(log.takeWarnings(), QStringList());
}

void SecuritySettingsTest::developerModeThatIsInForceIsNothing()
{
    SecuritySettings settings;
    SignalSequence seen(&settings);
    const auto isNothing = [&](bool enabled) {
        m_phone->takeJournal(PackageService);
        settings.setDeveloperModeEnabled(enabled);
        m_phone->settle(PackageService);
        return m_phone->takeJournal(PackageService).isEmpty() && seen.take().isEmpty();
    };
    QVERIFY(isNothing(false));
    // The program alone makes the mode, however it got there.
    QFile program(DeveloperProgram);
    QVERIFY(program.open(QIODevice::WriteOnly));
    program.close();
    QVERIFY(settings.developerModeEnabled());
    QVERIFY(isNothing(true));
    QVERIFY(program.remove());
    QVERIFY(!settings.developerModeEnabled());
}

void SecuritySettingsTest::refusedDeveloperMode_data()
{
    QTest::addColumn<QString>("method");
    QTest::addColumn<bool>("enable");
    QTest::newRow("not found") << QStringLiteral("Resolve") << true;
    QTest::newRow("not installed") << QStringLiteral("InstallPackages") << true;
    QTest::newRow("not removed") << QStringLiteral("RemovePackages") << false;
}

void SecuritySettingsTest::refusedDeveloperMode()
{
    QFETCH(QString, method);
    QFETCH(bool, enable);
    SecuritySettings settings;
    SignalSequence seen(&settings);
    if (!enable) {
        settings.setDeveloperModeEnabled(true);
        QVERIFY(seen.waitFor(1));
        seen.take();
    }
    m_phone->failCalls(PackageService, QString(), method, QStringLiteral("com.example.Broken"), QString());
    const MessageLog log;
    settings.setDeveloperModeEnabled(enable);
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), QStringList(changeError));
    QCOMPARE(settings.developerModeEnabled(), !enable);

    m_phone->clearFaults();
    settings.setDeveloperModeEnabled(enable);
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), QStringList(enabledChanged));
    QCOMPARE(settings.developerModeEnabled(), enable);
}

void SecuritySettingsTest::developerModeIsAskedForTwice()
{
    SecuritySettings settings;
    SignalSequence seen(&settings);
    MessageLog log;
    settings.setDeveloperModeEnabled(true);
    settings.setDeveloperModeEnabled(true);
    // The second is refused at once: the package is being installed.
    QVERIFY(seen.waitFor(2));
    QCOMPARE(seen.take(), QStringList({changeError, enabledChanged}));
    QCOMPARE(log.takeWarnings(),
             QStringList(QStringLiteral("Trying to install package which is already being installed")));
}

void SecuritySettingsTest::developerModeWithoutThePackageService()
{
    m_phone->stopService(PackageService);
    const MessageLog log;
    SecuritySettings settings;
    SignalSequence seen(&settings);
    settings.setDeveloperModeEnabled(true);
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), QStringList(changeError));
    QVERIFY(!settings.developerModeEnabled());
    m_phone->startService(PackageService);
    settings.setDeveloperModeEnabled(true);
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), QStringList(enabledChanged));
}

void SecuritySettingsTest::destructionWhileDeveloperModeChanges()
{
    m_phone->swallowCalls(PackageService, QString(), QStringLiteral("Resolve"));
    const MessageLog log;
    auto settings = std::make_unique<SecuritySettings>();
    SignalSequence seen(settings.get());
    settings->setDeveloperModeEnabled(true);
    settings.reset();
    QCOMPARE(seen.take(), QStringList());

    // In the signal itself.
    settings = std::make_unique<SecuritySettings>();
    connect(settings.get(), &SecuritySettings::developerModeChangeError, this, [&] { settings.reset(); });
    m_phone->failCalls(PackageService, QString(), QStringLiteral("Resolve"),
                       QStringLiteral("com.example.Broken"), QString());
    settings->setDeveloperModeEnabled(true);
    QVERIFY(waitUntil([&] { return !settings; }));
}

void SecuritySettingsTest::otherPackagesAreIgnored()
{
    SecuritySettings settings;
    SignalSequence seen(&settings);
    // The outcome of an operation for another package, and of the one for this.
    SecuritySettingsPrivate outcomes(&settings);
    const auto checkPackage = [&outcomes](const char *package, bool success) {
        return QMetaObject::invokeMethod(&outcomes, "checkPackage", Q_ARG(QString, QLatin1String(package)),
                                         Q_ARG(bool, success));
    };
    QVERIFY(checkPackage("notes", true));
    QVERIFY(checkPackage("notes", false));
    QVERIFY(checkPackage("tevrik-developer-mode-doc", true));
    QVERIFY(checkPackage("", true));
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(checkPackage("tevrik-developer-mode", true));
    QVERIFY(checkPackage("tevrik-developer-mode", false));
    QCOMPARE(seen.take(), QStringList({enabledChanged, changeError}));
}

QTEST_GUILESS_MAIN(SecuritySettingsTest)
#include "securitysettings_test.moc"
