// SPDX-License-Identifier: LGPL-2.1-or-later
#include "phone.h"
#include "signalsequence.h"
#include "waiting.h"

#include <corvanemdm/applications.h>
#include <corvanemdm/securitysettings.h>

#include <QtCore/QFile>
#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::ApplicationOperation;
using Corvane::Mdm::Applications;
using Corvane::Mdm::SecuritySettings;

namespace
{

const QString PackageService = QStringLiteral("org.freedesktop.PackageKit");
const QString DeveloperProgram = QStringLiteral("/usr/bin/devel-su");

} // namespace

/** Developer mode is a package: it comes and goes with it. */
class DeveloperModeTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void developerModeThatIsThereAlready();
    void developerModeIsInstalledAndRemoved();
    void operationOfAnotherPackage();
    void developerModeFails();
    void developerModeWithoutPackageKit();
    void objectDiesDuringAnInstallation();

private:
    std::unique_ptr<Phone> m_phone;
};

void DeveloperModeTest::init()
{
    m_phone = std::make_unique<Phone>();
}

void DeveloperModeTest::cleanup()
{
    m_phone->clearFaults();
    m_phone->startService(PackageService);
}

void DeveloperModeTest::developerModeThatIsThereAlready()
{
    SecuritySettings settings;
    SignalSequence seen(&settings);
    QVERIFY(!settings.developerModeEnabled());
    settings.setDeveloperModeEnabled(false);
    m_phone->settle(PackageService);
    QCOMPARE(m_phone->takeJournal(PackageService), QStringList());
    QCOMPARE(seen.take(), QStringList());

    QFile program(DeveloperProgram);
    QVERIFY(program.open(QIODevice::WriteOnly));
    program.close();
    QVERIFY(settings.developerModeEnabled());
    settings.setDeveloperModeEnabled(true);
    m_phone->settle(PackageService);
    QCOMPARE(m_phone->takeJournal(PackageService), QStringList());
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(program.remove());
}

void DeveloperModeTest::developerModeIsInstalledAndRemoved()
{
    SecuritySettings settings;
    SignalSequence seen(&settings);
    settings.setDeveloperModeEnabled(true);
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), QStringList(QStringLiteral("developerModeEnabledChanged()")));
    QVERIFY(settings.developerModeEnabled());
    QVERIFY(!m_phone->takeJournal(PackageService).filter(QStringLiteral("InstallPackages")).isEmpty());

    settings.setDeveloperModeEnabled(false);
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), QStringList(QStringLiteral("developerModeEnabledChanged()")));
    QVERIFY(!settings.developerModeEnabled());
    // What came along with it goes, too: the last argument but none.
    const QStringList removals
        = m_phone->takeJournal(PackageService).filter(QStringLiteral("RemovePackages"));
    QCOMPARE(removals.size(), 1);
    QVERIFY2(removals.first().contains(QStringLiteral("tevrik-developer-mode;"))
                 && removals.first().endsWith(QStringLiteral(", true)")),
             qPrintable(removals.first()));
}

void DeveloperModeTest::operationOfAnotherPackage()
{
    SecuritySettings settings;
    SignalSequence seen(&settings);
    Applications applications;
    bool isFinished = false;
    connect(applications.installPackage(QStringLiteral("no-such-package")), &ApplicationOperation::finished,
            this, [&isFinished] { isFinished = true; });
    QVERIFY(waitUntil([&isFinished] { return isFinished; }));
    QCOMPARE(seen.take(), QStringList());
}

void DeveloperModeTest::developerModeFails()
{
    m_phone->failCalls(PackageService, QString(), QStringLiteral("CreateTransaction"),
                       QStringLiteral("com.example.Broken"), QString());
    SecuritySettings settings;
    SignalSequence seen(&settings);
    settings.setDeveloperModeEnabled(true);
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), QStringList(QStringLiteral("developerModeChangeError()")));
    QVERIFY(!settings.developerModeEnabled());
}

void DeveloperModeTest::developerModeWithoutPackageKit()
{
    m_phone->stopService(PackageService);
    SecuritySettings settings;
    SignalSequence seen(&settings);
    settings.setDeveloperModeEnabled(true);
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), QStringList(QStringLiteral("developerModeChangeError()")));
}

void DeveloperModeTest::objectDiesDuringAnInstallation()
{
    m_phone->swallowCalls(PackageService, QString(), QStringLiteral("CreateTransaction"));
    auto settings = std::make_unique<SecuritySettings>();
    SignalSequence seen(settings.get());
    settings->setDeveloperModeEnabled(true);
    settings.reset();
    QCOMPARE(seen.take(), QStringList());
}

QTEST_GUILESS_MAIN(DeveloperModeTest)
#include "developermode_test.moc"
