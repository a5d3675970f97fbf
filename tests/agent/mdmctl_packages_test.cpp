// SPDX-License-Identifier: LGPL-2.1-or-later
#include "mdmctl.h"
#include "phone.h"

#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QTemporaryDir>
#include <QtTest/QtTest>

#include <csignal>

namespace
{

const QString Service = QStringLiteral("org.freedesktop.PackageKit");

Mdmctl::Result run(const char *arguments)
{
    return Mdmctl::run(QString::fromUtf8(arguments).split(QLatin1Char(' ')));
}

QJsonObject json(const QByteArray &text)
{
    return QJsonDocument::fromJson(text).object();
}

/** Whether the package manager of the phone has the package. */
bool isInstalled(const char *package)
{
    return QProcess::execute(QStringLiteral("rpm"),
                             {QStringLiteral("-q"), QStringLiteral("--quiet"), QLatin1String(package)})
        == 0;
}

} // namespace

class MdmctlPackagesTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void cleanup();

    void listsPackages();
    void listsPackagesAsJson();
    void listsApplications();
    void listsApplicationsAsJson();
    void listsNeedNoService();

    void installsAndRemoves();
    void installsAVersion();
    void severalShowProgress();
    void oneFailureDoesNotStopTheOthers();
    void resultsAsJson();
    void failures_data();
    void failures();
    void wrongUsage_data();
    void wrongUsage();
    void absentService();
    void serviceThatDies();
    void silentService();
    void interruption();

    void policyIsCheckedAndApplied();
    void pinnedVersions_data();
    void pinnedVersions();
    void failingPackagesDoNotStopTheOthers();
    void wrongPolicies_data();
    void wrongPolicies();
    void policyWithoutAService();
    void exportIsWhatCheckAccepts();
    void watchPutsDriftRight();
    void watchDoesNotRepeatARefusedChange();
    void watchSeesWhatPackageKitDidNotDo();

private:
    Mdmctl::Result policy(const char *command, const QByteArray &packages) const;
    QString write(const QByteArray &packages) const;

    Phone m_phone;
    QTemporaryDir m_folder;
};

void MdmctlPackagesTest::cleanup()
{
    m_phone.clearFaults();
    m_phone.startService(Service);
    // A test waits for calls of its own.
    m_phone.takeJournal(Service);
}

QString MdmctlPackagesTest::write(const QByteArray &packages) const
{
    QFile file(m_folder.filePath(QStringLiteral("policy.json")));
    const QByteArray policy = "{\"packages\": " + packages + "}";
    if (!file.open(QIODevice::WriteOnly | QIODevice::Truncate) || file.write(policy) != policy.size())
        qFatal("cannot write the policy");
    return file.fileName();
}

Mdmctl::Result MdmctlPackagesTest::policy(const char *command, const QByteArray &packages) const
{
    return Mdmctl::run({QStringLiteral("policy"), QLatin1String(command), write(packages)});
}

void MdmctlPackagesTest::listsPackages()
{
    const Mdmctl::Result listed = run("packages");
    QCOMPARE(listed.errors, QString());
    QCOMPARE(listed.output,
             QStringLiteral("NAME             VERSION  VENDOR\n"
                            "acme-agent       1.1.0    Acme\n"
                            "corvane-base     4.0.2    Corvane\n"
                            "corvane-library  1.0\n"
                            "corvane-notes    1.2.0    Corvane\n"
                            "corvane-setup    1.0      Corvane\n"));
    QCOMPARE(listed.status, 0);
}

void MdmctlPackagesTest::listsPackagesAsJson()
{
    const QJsonArray packages = run("packages --json").json().value(QLatin1String("packages")).toArray();
    QCOMPARE(packages.size(), 5);
    QCOMPARE(packages.at(0).toObject(),
             json(R"({"name": "acme-agent", "version": "1.1.0", "vendor": "Acme"})"));
    QCOMPARE(packages.at(2).toObject(),
             json(R"({"name": "corvane-library", "version": "1.0", "vendor": ""})"));
}

void MdmctlPackagesTest::listsApplications()
{
    const Mdmctl::Result listed = run("apps");
    QCOMPARE(listed.errors, QString());
    QCOMPARE(
        listed.output,
        QStringLiteral("NAME   PACKAGE        VERSION  ICON\n"
                       "Agent  acme-agent     1.1.0    /usr/share/acme-agent/icon.png\n"
                       "Notes  corvane-notes  1.2.0    /usr/share/icons/hicolor/128x128/apps/notes.png\n"));
    QCOMPARE(listed.status, 0);
}

void MdmctlPackagesTest::listsApplicationsAsJson()
{
    const QString stray = QStringLiteral("/usr/share/applications/stray.desktop");
    QFile file(stray);
    QVERIFY(file.open(QIODevice::WriteOnly));
    file.write("[Desktop Entry]\nType=Application\nName=Stray\nExec=stray\n");
    file.close();
    const QJsonArray listed = run("apps --json").json().value(QLatin1String("applications")).toArray();
    QVERIFY(QFile::remove(stray));
    QCOMPARE(listed.size(), 3);
    QCOMPARE(listed.at(1).toObject(),
             json(R"({"name": "Notes", "icon": "/usr/share/icons/hicolor/128x128/apps/notes.png",
                      "package": {"name": "corvane-notes", "version": "1.2.0", "vendor": "Corvane"}})"));
    QCOMPARE(listed.at(2).toObject(), json(R"({"name": "Stray", "icon": "", "package": null})"));
}

void MdmctlPackagesTest::listsNeedNoService()
{
    m_phone.stopService(Service);
    QCOMPARE(run("packages").status, 0);
    QCOMPARE(run("apps").status, 0);
}

void MdmctlPackagesTest::installsAndRemoves()
{
    Mdmctl::Result result = run("install acme-mail");
    QCOMPARE(result.errors, QString());
    QCOMPARE(result.output, QStringLiteral("acme-mail is installed.\n"));
    QCOMPARE(result.status, 0);
    QVERIFY(isInstalled("acme-mail-2.1.0-3"));
    QVERIFY(isInstalled("acme-certificates"));

    result = run("remove acme-mail");
    QCOMPARE(result.output, QStringLiteral("acme-mail is removed.\n"));
    QVERIFY(!isInstalled("acme-mail"));
    QVERIFY(isInstalled("acme-certificates"));
    QCOMPARE(run("install acme-mail").status, 0);
    QCOMPARE(run("remove --autoremove acme-mail").status, 0);
    QVERIFY(!isInstalled("acme-certificates"));
}

void MdmctlPackagesTest::installsAVersion()
{
    const Mdmctl::Result result = run("install acme-mail=2.0.0-7");
    QCOMPARE(result.output, QStringLiteral("acme-mail=2.0.0-7 is installed.\n"));
    QVERIFY(isInstalled("acme-mail-2.0.0-7"));
    QCOMPARE(run("remove acme-mail").status, 0);
}

void MdmctlPackagesTest::severalShowProgress()
{
    Mdmctl::Result result = run("install acme-mail acme-certificates");
    // The second came with the first one.
    QCOMPARE(result.output, QStringLiteral("acme-mail is installed.\n"));
    QCOMPARE(result.errors,
             QStringLiteral("Installing: 0%\nInstalling: 50%\n"
                            "mdmctl: acme-certificates: acme-certificates is already installed\n"
                            "Installing: 100%\n"));
    QCOMPARE(result.status, 1);
    result = run("remove acme-mail acme-certificates");
    QCOMPARE(result.output, QStringLiteral("acme-mail is removed.\nacme-certificates is removed.\n"));
    QCOMPARE(result.errors, QStringLiteral("Removing: 0%\nRemoving: 50%\nRemoving: 100%\n"));
    QCOMPARE(result.status, 0);
}

void MdmctlPackagesTest::oneFailureDoesNotStopTheOthers()
{
    const Mdmctl::Result result = run("install no-such-package acme-certificates");
    QCOMPARE(result.output, QStringLiteral("acme-certificates is installed.\n"));
    QVERIFY(result.errors.contains(
        QLatin1String("mdmctl: no-such-package: Package not found: no-such-package\n")));
    QCOMPARE(result.status, 1);
    QCOMPARE(run("remove acme-certificates").status, 0);
}

void MdmctlPackagesTest::resultsAsJson()
{
    const Mdmctl::Result result = run("install --json acme-certificates acme-broken");
    QCOMPARE(result.json(),
             json(R"({"results": [{"package": "acme-certificates", "done": true, "error": null},
                                  {"package": "acme-broken", "done": false, "error": "The disk is full"}]})"));
    QCOMPARE(result.errors, QStringLiteral("mdmctl: acme-broken: The disk is full\n"));
    QCOMPARE(result.status, 1);
    QCOMPARE(run("remove --json acme-certificates").json(),
             json(R"({"results": [{"package": "acme-certificates", "done": true, "error": null}]})"));
}

void MdmctlPackagesTest::failures_data()
{
    QTest::addColumn<QString>("command");
    QTest::addColumn<QString>("error");
    QTest::newRow("unsigned") << "install acme-untrusted"
                              << "acme-untrusted: acme-untrusted is not signed";
    QTest::newRow("another version") << "install acme-mail=9"
                                     << "acme-mail=9: Package not found: acme-mail";
    QTest::newRow("essential") << "remove corvane-base"
                               << "corvane-base: corvane-base is essential to the phone";
    QTest::newRow("needed") << "remove corvane-library"
                            << "corvane-library: corvane-notes needs corvane-library";
    QTest::newRow("not installed") << "remove acme-mail"
                                   << "acme-mail: Package not found: acme-mail";
}

void MdmctlPackagesTest::failures()
{
    QFETCH(QString, command);
    QFETCH(QString, error);
    const Mdmctl::Result result = run(command.toUtf8().constData());
    QCOMPARE(result.errors, QStringLiteral("mdmctl: %1\n").arg(error));
    QCOMPARE(result.output, QString());
    QCOMPARE(result.status, 1);
}

void MdmctlPackagesTest::wrongUsage_data()
{
    QTest::addColumn<QStringList>("arguments");
    const QString install = QStringLiteral("install");
    QTest::newRow("no package") << QStringList{install};
    QTest::newRow("no version") << QStringList{install, QStringLiteral("acme-mail=")};
    QTest::newRow("no name") << QStringList{install, QStringLiteral("=1.0")};
    QTest::newRow("two versions") << QStringList{install, QStringLiteral("acme-mail=1=2")};
    QTest::newRow("empty") << QStringList{install, QString()};
    QTest::newRow("version to remove")
        << QStringList{QStringLiteral("remove"), QStringLiteral("acme-mail=1")};
}

void MdmctlPackagesTest::wrongUsage()
{
    QFETCH(QStringList, arguments);
    m_phone.takeJournal(Service);
    QCOMPARE(Mdmctl::run(arguments).status, 2);
    QCOMPARE(m_phone.takeJournal(Service), QStringList());
}

void MdmctlPackagesTest::absentService()
{
    m_phone.stopService(Service);
    for (const char *command : {"install acme-mail", "remove corvane-notes"}) {
        const Mdmctl::Result result = run(command);
        QCOMPARE(result.errors,
                 QStringLiteral("mdmctl: the package manager (org.freedesktop.PackageKit) is not running\n"));
        QCOMPARE(result.status, 3);
    }
}

void MdmctlPackagesTest::serviceThatDies()
{
    m_phone.swallowCalls(Service, QString(), QStringLiteral("InstallPackages"));
    Mdmctl install(
        {QStringLiteral("install"), QStringLiteral("acme-certificates"), QStringLiteral("acme-mail")});
    QStringList calls;
    QTRY_VERIFY((calls += m_phone.takeJournal(Service))
                    .join(QLatin1Char(' '))
                    .contains(QLatin1String("InstallPackages")));
    m_phone.stopService(Service);
    const Mdmctl::Result result = install.finish();
    QCOMPARE(result.errors,
             QStringLiteral("Installing: 0%\nmdmctl: acme-certificates: the package manager "
                            "(org.freedesktop.PackageKit) is not running\n"));
    QCOMPARE(result.status, 3);
}

void MdmctlPackagesTest::silentService()
{
    m_phone.swallowCalls(Service, QString(), QStringLiteral("RefreshCache"));
    const Mdmctl::Result result = run("install acme-certificates --timeout 0.3");
    QCOMPARE(
        result.errors,
        QStringLiteral("mdmctl: acme-certificates: the package manager (org.freedesktop.PackageKit) did not "
                       "finish installing acme-certificates within 0.3 s\n"));
    QCOMPARE(result.status, 1);
}

void MdmctlPackagesTest::interruption()
{
    m_phone.swallowCalls(Service, QString(), QStringLiteral("RefreshCache"));
    Mdmctl install(
        {QStringLiteral("install"), QStringLiteral("acme-certificates"), QStringLiteral("acme-mail")});
    QStringList calls;
    QTRY_VERIFY((calls += m_phone.takeJournal(Service))
                    .join(QLatin1Char(' '))
                    .contains(QLatin1String("RefreshCache")));
    install.interrupt(SIGTERM);
    const Mdmctl::Result result = install.finish();
    QCOMPARE(result.errors, QStringLiteral("Installing: 0%\nmdmctl: acme-certificates: interrupted\n"));
    QCOMPARE(result.status, 1);
}

void MdmctlPackagesTest::policyIsCheckedAndApplied()
{
    QCOMPARE(run("install acme-certificates").status, 0);
    const QByteArray wanted
        = R"({"required": ["corvane-notes", "acme-mail"], "forbidden": ["acme-certificates",
                                   "no-such-package"], "pinned": [{"name": "corvane-base", "version": "4.0.2-1"}]})";
    Mdmctl::Result result = policy("check", wanted);
    QCOMPARE(result.status, 1);
    QCOMPARE(result.errors, QString());
    const QStringList rows = result.output.split(QLatin1Char('\n'));
    const auto has = [&rows](const char *pattern) {
        return !rows.filter(QRegularExpression(QLatin1String(pattern))).isEmpty();
    };
    QVERIFY2(has("packages\\.required\\.corvane-notes +compliant"), qPrintable(result.output));
    QVERIFY2(has("packages\\.required\\.acme-mail +different +not installed"), qPrintable(result.output));
    QVERIFY2(has("packages\\.pinned\\.corvane-base +compliant"), qPrintable(result.output));
    QVERIFY2(has("packages\\.forbidden\\.acme-certificates +different +2026\\.1"), qPrintable(result.output));
    QVERIFY2(has("packages\\.forbidden\\.no-such-package +compliant"), qPrintable(result.output));

    const QByteArray possible = R"({"required": ["acme-mail"], "forbidden": ["no-such-package"]})";
    result = policy("apply", possible);
    QCOMPARE(result.errors, QString());
    QCOMPARE(result.status, 0);
    QVERIFY(isInstalled("acme-mail"));
    QCOMPARE(policy("check", possible).status, 0);
    // Nothing is asked for the second time.
    m_phone.takeJournal(Service);
    QCOMPARE(policy("apply", possible).status, 0);
    QCOMPARE(m_phone.takeJournal(Service), QStringList());

    const QByteArray opposite = R"({"forbidden": ["acme-mail", "acme-certificates"]})";
    QCOMPARE(policy("apply", opposite).status, 0);
    QVERIFY(!isInstalled("acme-mail"));
    QVERIFY(!isInstalled("acme-certificates"));
    QCOMPARE(policy("check", opposite).status, 0);
}

void MdmctlPackagesTest::pinnedVersions_data()
{
    QTest::addColumn<QByteArray>("version");
    QTest::addColumn<int>("status");
    QTest::newRow("with its release") << QByteArray("1.2.0-5") << 0;
    QTest::newRow("of any release") << QByteArray("1.2.0") << 0;
    QTest::newRow("another one") << QByteArray("1.2") << 1;
    QTest::newRow("longer") << QByteArray("1.2.0.1-5") << 1;
}

void MdmctlPackagesTest::pinnedVersions()
{
    QFETCH(QByteArray, version);
    QFETCH(int, status);
    const QByteArray pinned
        = "{\"pinned\": [{\"name\": \"corvane-notes\", \"version\": \"" + version + "\"}]}";
    QCOMPARE(policy("check", pinned).status, status);
}

void MdmctlPackagesTest::failingPackagesDoNotStopTheOthers()
{
    const QByteArray wanted
        = R"({"required": ["acme-broken"], "pinned": [{"name": "acme-mail", "version": "2.0.0-7"},
              {"name": "acme-certificates", "version": "1-1"}], "forbidden": ["corvane-base"]})";
    const Mdmctl::Result result = policy("apply", wanted);
    QCOMPARE(result.status, 1);
    for (const char *text : {"The disk is full", "Package not found: acme-certificates",
                             "corvane-base is essential to the phone", "packages.pinned.acme-mail"})
        QVERIFY2(result.output.contains(QLatin1String(text)), qPrintable(result.output));
    QVERIFY(isInstalled("acme-mail-2.0.0-7"));
    QCOMPARE(run("remove acme-mail").status, 0);
}

void MdmctlPackagesTest::wrongPolicies_data()
{
    QTest::addColumn<QByteArray>("packages");
    QTest::addColumn<QString>("error");
    QTest::newRow("required and forbidden")
        << QByteArray(R"({"required": ["a", "b"], "forbidden": ["b"]})")
        << R"(/packages/forbidden/0: must be named once; "b" is among the required packages already)";
    QTest::newRow("pinned and required")
        << QByteArray(R"({"required": ["a"], "pinned": [{"name": "a", "version": "1"}]})")
        << R"(/packages/pinned/0: must be named once; "a" is among the required packages already)";
    QTest::newRow("twice")
        << QByteArray(R"({"forbidden": ["a", "a"]})")
        << R"(/packages/forbidden/1: must be named once; "a" is among the forbidden packages already)";
    QTest::newRow("no name") << QByteArray(R"({"required": [""]})") << "/packages/required/0: ";
    QTest::newRow("no version") << QByteArray(R"({"pinned": [{"name": "a"}]})") << "/packages/pinned/0";
    QTest::newRow("unknown list") << QByteArray(R"({"allowed": []})") << "/packages/allowed";
}

void MdmctlPackagesTest::wrongPolicies()
{
    QFETCH(QByteArray, packages);
    QFETCH(QString, error);
    const Mdmctl::Result result = policy("check", packages);
    QVERIFY2(result.errors.contains(error), qPrintable(result.errors));
    QCOMPARE(result.status, 2);
}

void MdmctlPackagesTest::policyWithoutAService()
{
    m_phone.stopService(Service);
    const Mdmctl::Result result = policy("check", R"({"required": ["corvane-notes"]})");
    QVERIFY2(result.output.contains(QLatin1String("unsupported")), qPrintable(result.output));
    QCOMPARE(result.status, 3);
}

void MdmctlPackagesTest::exportIsWhatCheckAccepts()
{
    const Mdmctl::Result exported = run("policy export");
    const QJsonObject packages = exported.json().value(QLatin1String("packages")).toObject();
    QCOMPARE(packages, json(R"({"required": ["acme-agent", "corvane-base", "corvane-library", "corvane-notes",
                                   "corvane-setup"]})"));
    const Mdmctl::Result checked = policy("check", QJsonDocument(packages).toJson());
    QCOMPARE(checked.status, 0);
}

void MdmctlPackagesTest::watchPutsDriftRight()
{
    Mdmctl watch({QStringLiteral("policy"), QStringLiteral("watch"),
                  write(R"({"required": ["acme-certificates"], "forbidden": ["acme-mail"]})")});
    QVERIFY(watch.waitForOutput(QStringLiteral("packages.required.acme-certificates")));
    QTRY_VERIFY(isInstalled("acme-certificates"));
    QCOMPARE(run("install acme-mail=2.0.0-7").status, 0);
    QTRY_VERIFY_WITH_TIMEOUT(!isInstalled("acme-mail"), 30000);
    QCOMPARE(run("remove acme-certificates").status, 0);
    QTRY_VERIFY_WITH_TIMEOUT(isInstalled("acme-certificates"), 30000);
    watch.interrupt(SIGINT);
    QCOMPARE(watch.finish().status, 0);
    QCOMPARE(run("remove acme-certificates").status, 0);
}

void MdmctlPackagesTest::watchDoesNotRepeatARefusedChange()
{
    Mdmctl watch({QStringLiteral("policy"), QStringLiteral("watch"), QStringLiteral("--json"),
                  write(R"({"required": ["acme-broken"]})")});
    QVERIFY(watch.waitForOutput(QStringLiteral("The disk is full")));
    m_phone.takeJournal(Service);
    // Something that changes no package, and something that changes another one.
    QCOMPARE(run("install no-such-package").status, 1);
    QCOMPARE(run("install acme-certificates").status, 0);
    QStringList calls;
    const auto attempts = [&] {
        calls += m_phone.takeJournal(Service);
        return calls.join(QLatin1Char('\n')).count(QLatin1String("acme-broken;1.0-1"));
    };
    QTRY_VERIFY_WITH_TIMEOUT(attempts() == 1, 30000);
    watch.interrupt(SIGINT);
    QCOMPARE(watch.finish().status, 0);
    QCOMPARE(run("remove acme-certificates").status, 0);
}

void MdmctlPackagesTest::watchSeesWhatPackageKitDidNotDo()
{
    Mdmctl watch({QStringLiteral("policy"), QStringLiteral("watch"), QStringLiteral("--look"),
                  QStringLiteral("0.2"), write(R"({"forbidden": ["desk-clock"]})")});
    QVERIFY(watch.waitForOutput(QStringLiteral("packages.forbidden.desk-clock: compliant")));
    QProcess database;
    database.start(QStringLiteral("corvane-package-database"), {QStringLiteral("add")});
    database.write(R"([{"name": "desk-clock", "version": "3.0"}])");
    database.closeWriteChannel();
    QVERIFY(database.waitForFinished());
    QCOMPARE(database.exitCode(), 0);
    // PackageKit of the simulated phone knows its own packages alone.
    QVERIFY(watch.waitForOutput(
        QStringLiteral("packages.forbidden.desk-clock: failed (Package not found: desk-clock)")));
    QCOMPARE(QProcess::execute(QStringLiteral("corvane-package-database"),
                               {QStringLiteral("remove"), QStringLiteral("desk-clock")}),
             0);
    QVERIFY(watch.waitForOutput(QStringLiteral("packages.forbidden.desk-clock: compliant"), 2));
    watch.interrupt(SIGINT);
    QCOMPARE(watch.finish().status, 0);
}

QTEST_GUILESS_MAIN(MdmctlPackagesTest)
#include "mdmctl_packages_test.moc"
