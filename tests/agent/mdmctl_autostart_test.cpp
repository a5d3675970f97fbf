// SPDX-License-Identifier: LGPL-2.1-or-later
#include "callalarm.h"
#include "mdmctl.h"
#include "phone.h"

#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QTemporaryDir>
#include <QtTest/QtTest>

#include <csignal>

namespace
{

const QString Service = QStringLiteral("org.corvaneos.mdmproxy");
const QString Path = QStringLiteral("/Corvane/Mdm/Proxy/Autostart");
const QString Refused = QStringLiteral("mdmctl: the MDM proxy (org.corvaneos.mdmproxy) refused: ");
const QString Folder = QStringLiteral("/usr/share/applications/");

Mdmctl::Result run(const char *arguments)
{
    return Mdmctl::run(QStringLiteral("autostart %1")
                           .arg(QLatin1String(arguments))
                           .split(QLatin1Char(' '), Qt::SkipEmptyParts));
}

} // namespace

class MdmctlAutostartTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void init();
    void cleanup();

    void addsListsAndRemoves();
    void oneThatFailsDoesNotStopTheOthers();
    void refusalsAreTold();
    void absenceIsTold();
    void policy();
    void policyDriftIsPutRight();
    void policyNamesEachOnce();

private:
    Mdmctl::Result policy(const char *command, const QByteArray &json);
    QString write(const QByteArray &json) const;

    QTemporaryDir m_folder;
    Phone m_phone;
    CallAlarm m_alarm;
};

void MdmctlAutostartTest::initTestCase()
{
    for (const char *name : {"test-a.desktop", "test-b.desktop"}) {
        QFile file(Folder + QLatin1String(name));
        QVERIFY(file.open(QIODevice::WriteOnly));
        file.write("[Desktop Entry]\nType=Application\nName=A\nExec=/usr/bin/a\n");
    }
}

void MdmctlAutostartTest::init()
{
    m_phone.takeJournal(Service);
}

void MdmctlAutostartTest::cleanup()
{
    m_phone.clearFaults();
    m_phone.startService(Service);
    run("remove test-a.desktop test-b.desktop");
}

Mdmctl::Result MdmctlAutostartTest::policy(const char *command, const QByteArray &json)
{
    return Mdmctl::run({QStringLiteral("policy"), QLatin1String(command), write(json)});
}

QString MdmctlAutostartTest::write(const QByteArray &json) const
{
    QFile file(m_folder.filePath(QStringLiteral("policy.json")));
    if (!file.open(QIODevice::WriteOnly) || file.write(json) != json.size())
        qFatal("cannot write the policy");
    return file.fileName();
}

void MdmctlAutostartTest::addsListsAndRemoves()
{
    QCOMPARE(run("list").output, QStringLiteral("Nothing starts with the session.\n"));
    QCOMPARE(run("list --json").json(), QJsonDocument::fromJson(R"({"autostart": []})").object());
    m_phone.takeJournal(Service);
    const Mdmctl::Result added = run("add test-a.desktop");
    QCOMPARE(added.output + added.errors, QString());
    QCOMPARE(added.status, 0);
    QCOMPARE(m_phone.takeJournal(Service), QStringList(Path + QLatin1String(" add ('test-a.desktop',)")));
    // It starts already.
    QCOMPARE(run("add test-a.desktop").status, 0);
    QCOMPARE(run("list").output, Folder + QLatin1String("test-a.desktop\n"));
    QCOMPARE(run("list --json").json().value(QLatin1String("autostart")).toArray(),
             QJsonArray{Folder + QLatin1String("test-a.desktop")});
    QCOMPARE(run("remove test-a.desktop").status, 0);
    QCOMPARE(run("list").output, QStringLiteral("Nothing starts with the session.\n"));
}

void MdmctlAutostartTest::oneThatFailsDoesNotStopTheOthers()
{
    const Mdmctl::Result added = run("add none.desktop test-a.desktop test-b.desktop");
    QCOMPARE(added.errors,
             Refused + QStringLiteral("it does not accept the desktop entry \"none.desktop\"\n"));
    QCOMPARE(added.status, 1);
    QCOMPARE(run("list").output.count(QLatin1Char('\n')), 2);
}

void MdmctlAutostartTest::refusalsAreTold()
{
    m_phone.failCalls(Service, Path, QString(), QStringLiteral("com.example.Denied"),
                      QStringLiteral("not \"you\""));
    for (const char *command : {"list", "add test-a.desktop", "remove test-a.desktop"}) {
        const Mdmctl::Result refused = run(command);
        QVERIFY2(refused.errors.startsWith(Refused + QLatin1String("not ")), qPrintable(refused.errors));
        QCOMPARE(refused.errors.count(QLatin1Char('\n')), 1);
        QCOMPARE(refused.status, 1);
    }
    m_phone.clearFaults();
    m_phone.answerCalls(Service, Path, QStringLiteral("add"), {7});
    QCOMPARE(run("add test-a.desktop").errors, Refused + QLatin1String("code 7\n"));
    m_phone.clearFaults();
    m_phone.answerCalls(Service, Path, QStringLiteral("add"), {1});
    QCOMPARE(run("add test-a.desktop").errors, Refused + QLatin1String("internal error\n"));
}

void MdmctlAutostartTest::absenceIsTold()
{
    m_phone.stopService(Service);
    const Mdmctl::Result absent = run("add test-a.desktop");
    QCOMPARE(absent.errors,
             QStringLiteral("mdmctl: the MDM proxy (org.corvaneos.mdmproxy) is not running\n"));
    QCOMPARE(absent.status, 3);
}

void MdmctlAutostartTest::policy()
{
    const QByteArray json = R"({"name": "Test", "autostart": {"required": ["test-a.desktop"],
                                "forbidden": ["/usr/share/applications/test-b.desktop"]}})";
    run("add test-b.desktop");
    const Mdmctl::Result checked = policy("check", json);
    QVERIFY2(checked.output.contains(QLatin1String("autostart.test-a.desktop"))
                 && checked.output.contains(QLatin1String("Test: 2 different.")),
             qPrintable(checked.output));
    QCOMPARE(checked.status, 1);
    QCOMPARE(policy("apply", json).status, 0);
    QCOMPARE(run("list").output, Folder + QLatin1String("test-a.desktop\n"));
    QCOMPARE(policy("check", json).status, 0);
    const QJsonObject exported = Mdmctl::run({QStringLiteral("policy"), QStringLiteral("export")}).json();
    QCOMPARE(exported.value(QLatin1String("autostart")).toObject(),
             QJsonDocument::fromJson(R"({"required": ["/usr/share/applications/test-a.desktop"]})").object());

    const Mdmctl::Result failed = policy("apply", R"({"autostart": {"required": ["none.desktop"]}})");
    QVERIFY2(failed.output.contains(QLatin1String("it does not accept the desktop entry \"none.desktop\"")),
             qPrintable(failed.output));
    QCOMPARE(failed.status, 1);
}

void MdmctlAutostartTest::policyDriftIsPutRight()
{
    const QString policy = write(
        R"({"autostart": {"required": ["test-a.desktop", "none.desktop"], "forbidden": ["test-b.desktop"]}})");
    Mdmctl watch({QStringLiteral("policy"), QStringLiteral("watch"), policy, QStringLiteral("--look"),
                  QStringLiteral("0.2")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching for drift")));
    // Nobody announces these.
    QCOMPARE(run("remove test-a.desktop").status, 0);
    QVERIFY(watch.waitForOutput(QStringLiteral("autostart.test-a.desktop: changed (add it)"), 2));
    QCOMPARE(run("add test-b.desktop").status, 0);
    QVERIFY(watch.waitForOutput(QStringLiteral("autostart.test-b.desktop: changed (remove it)")));
    watch.interrupt(SIGINT);
    const Mdmctl::Result watched = watch.finish();
    QCOMPARE(watched.status, 0);
    // A change that was refused is not asked for again while nothing else happens.
    const int attempts = m_phone.takeJournal(Service).filter(QStringLiteral("none.desktop")).size();
    QVERIFY2(attempts <= 3, qPrintable(QString::number(attempts)));
}

void MdmctlAutostartTest::policyNamesEachOnce()
{
    const Mdmctl::Result refused = policy("check", R"({"autostart": {"required": ["a", "a"]}})");
    QVERIFY2(refused.errors.endsWith(
                 QLatin1String("/autostart/required/1: must be named once; \"a\" is there already\n")),
             qPrintable(refused.errors));
    QCOMPARE(refused.status, 2);
}

QTEST_GUILESS_MAIN(MdmctlAutostartTest)
#include "mdmctl_autostart_test.moc"
