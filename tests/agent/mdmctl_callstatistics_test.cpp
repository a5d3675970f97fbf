// SPDX-License-Identifier: LGPL-2.1-or-later
#include "callalarm.h"
#include "mdmctl.h"
#include "phone.h"
#include "waiting.h"

#include <QtCore/QJsonDocument>
#include <QtTest/QtTest>

#include <csignal>

namespace
{

const QString Service = QStringLiteral("org.corvaneos.mdmproxy");
const QString Path = QStringLiteral("/Corvane/Mdm/Proxy/CallStatistics");

QStringList search(const char *arguments)
{
    return QStringLiteral("call-statistics search %1")
        .arg(QString::fromUtf8(arguments))
        .split(QLatin1Char(' '), Qt::SkipEmptyParts);
}

Mdmctl::Result run(const char *arguments)
{
    return Mdmctl::run(search(arguments));
}

} // namespace

class MdmctlCallStatisticsTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void showsWhatWasFound();
    void findsNothing();
    void passesItsOptionsOn_data();
    void passesItsOptionsOn();
    void mistakesSendNothing_data();
    void mistakesSendNothing();
    void failureOfTheSearchIsTold();
    void refusalIsToldInTheServicesWords();
    void silenceAndAbsenceAreTold();
    void interruptedWaitFails();

private:
    Phone m_phone;
    CallAlarm m_alarm;
};

void MdmctlCallStatisticsTest::init()
{
    m_phone.takeJournal(Service);
}

void MdmctlCallStatisticsTest::cleanup()
{
    m_phone.clearFaults();
    m_phone.startService(Service);
}

void MdmctlCallStatisticsTest::showsWhatWasFound()
{
    const Mdmctl::Result found = run("");
    QCOMPARE(found.errors, QString());
    QCOMPARE(found.output,
             QStringLiteral("TIME                  VALUE\n"
                            "2026-03-01T00:00:00Z  3\n"
                            "2026-03-03T00:00:00Z  1\n"
                            "2026-03-05T00:00:00Z  1\n"));
    QCOMPARE(found.status, 0);
    QCOMPARE(
        run("--first 2 --second 1 --json").json(),
        QJsonDocument::fromJson(R"({"results": [{"time": "2026-03-01T00:00:00Z", "value": 5}]})").object());
}

void MdmctlCallStatisticsTest::findsNothing()
{
    const Mdmctl::Result found = run("--from 2026-05-01");
    QCOMPARE(found.output, QStringLiteral("Nothing was found.\n"));
    QCOMPARE(found.status, 0);
    QCOMPARE(run("--from 2026-05-01 --json").json(), QJsonDocument::fromJson(R"({"results": []})").object());
}

void MdmctlCallStatisticsTest::passesItsOptionsOn_data()
{
    QTest::addColumn<QString>("sent");
    const QString open = QStringLiteral("((0, 0, 0), (-1, -1, -1, -1), 0)");
    const QString first = QStringLiteral("((2026, 3, 1), (8, 30, 0, 0), 1)");
    QTest::newRow("") << QStringLiteral("(0, 0, %1, %1)").arg(open);
    QTest::newRow("--first -2 --second 1") << QStringLiteral("(-2, 1, %1, %1)").arg(open);
    QTest::newRow("--from 2026-03-01T08:30:00Z") << QStringLiteral("(0, 0, %1, %2)").arg(first, open);
    QTest::newRow("--to 2026-03-01T10:30:00+02:00") << QStringLiteral("(0, 0, %1, %2)").arg(open, first);
    QTest::newRow("--from 2026-03-01T08:30:00Z --to 2026-03-01T08:30:00.005Z")
        << QStringLiteral("(0, 0, %1, ((2026, 3, 1), (8, 30, 0, 5), 1))").arg(first);
}

void MdmctlCallStatisticsTest::passesItsOptionsOn()
{
    QFETCH(QString, sent);
    run(QTest::currentDataTag());
    QCOMPARE(m_phone.takeJournal(Service), QStringList(Path + QStringLiteral(" search ") + sent));
}

void MdmctlCallStatisticsTest::mistakesSendNothing_data()
{
    QTest::addColumn<QString>("message");
    const auto row = [](const char *arguments, const char *message) {
        QTest::newRow(arguments) << QString::fromUtf8(message);
    };
    row("--first x", R"(--first "x": must be a whole number)");
    row("--second 1.5", R"(--second "1.5": must be a whole number)");
    row("--from noon",
        R"(--from "noon": must be a date, or a date and time, as in 2026-03-02 or 2026-03-02T09:15:00Z)");
    row("--to 2026-02-30",
        R"(--to "2026-02-30": must be a date, or a date and time, as in 2026-03-02 or 2026-03-02T09:15:00Z)");
    row("--from 2026-03-02 --to 2026-03-01", "--to must be later than --from");
    row("--from 2026-03-02T00:00:00Z --to 2026-03-02T02:00:00+02:00", "--to must be later than --from");
    row("now", R"(unexpected argument "now"; usage: mdmctl call-statistics search)");
}

void MdmctlCallStatisticsTest::mistakesSendNothing()
{
    QFETCH(QString, message);
    const Mdmctl::Result refused = run(QTest::currentDataTag());
    QCOMPARE(refused.errors, QStringLiteral("mdmctl: %1\n").arg(message));
    QCOMPARE(refused.output, QString());
    QCOMPARE(refused.status, 2);
    QCOMPARE(m_phone.takeJournal(Service), QStringList());
}

void MdmctlCallStatisticsTest::failureOfTheSearchIsTold()
{
    const Mdmctl::Result failed = run("--first 99 --json");
    QCOMPARE(failed.errors,
             QStringLiteral("mdmctl: the MDM proxy (org.corvaneos.mdmproxy) could not search this\n"));
    QCOMPARE(failed.output, QString());
    QCOMPARE(failed.status, 1);
}

void MdmctlCallStatisticsTest::refusalIsToldInTheServicesWords()
{
    m_phone.failCalls(Service, Path, QStringLiteral("search"), QStringLiteral("com.example.Denied"),
                      QStringLiteral("not you"));
    const Mdmctl::Result refused = run("");
    QCOMPARE(refused.errors,
             QStringLiteral("mdmctl: the MDM proxy (org.corvaneos.mdmproxy) refused: not you "
                            "(com.example.Denied)\n"));
    QCOMPARE(refused.status, 1);
}

void MdmctlCallStatisticsTest::silenceAndAbsenceAreTold()
{
    m_phone.swallowCalls(Service, Path, QStringLiteral("search"));
    const Mdmctl::Result silent = run("--timeout 0.2");
    QCOMPARE(silent.errors,
             QStringLiteral("mdmctl: the MDM proxy (org.corvaneos.mdmproxy) did not finish the search "
                            "within 0.2 s\n"));
    QCOMPARE(silent.status, 1);

    m_phone.stopService(Service);
    const Mdmctl::Result absent = run("");
    QCOMPARE(absent.errors,
             QStringLiteral("mdmctl: the MDM proxy (org.corvaneos.mdmproxy) is not running\n"));
    QCOMPARE(absent.status, 3);
}

void MdmctlCallStatisticsTest::interruptedWaitFails()
{
    m_phone.swallowCalls(Service, Path, QStringLiteral("search"));
    Mdmctl mdmctl(search(""));
    QVERIFY(waitUntil([this] { return !m_phone.takeJournal(Service).isEmpty(); }));
    mdmctl.interrupt(SIGINT);
    const Mdmctl::Result result = mdmctl.finish();
    QCOMPARE(result.errors, QStringLiteral("mdmctl: interrupted\n"));
    QCOMPARE(result.status, 1);
}

QTEST_GUILESS_MAIN(MdmctlCallStatisticsTest)
#include "mdmctl_callstatistics_test.moc"
