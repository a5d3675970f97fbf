// SPDX-License-Identifier: LGPL-2.1-or-later
#include "callalarm.h"
#include "mdmctl.h"
#include "phone.h"
#include "waiting.h"

#include <QtCore/QJsonDocument>
#include <QtCore/QSocketNotifier>
#include <QtTest/QtTest>

#include <csignal>
#include <pty.h>
#include <unistd.h>

namespace
{

const QString Service = QStringLiteral("org.corvaneos.mdmproxy");
const QString Path = QStringLiteral("/Corvane/Mdm/Proxy/SoftwareUpdate");
const QString Interface = QStringLiteral("org.corvaneos.mdmproxy.softwareupdate");
const QString Refused = QStringLiteral("mdmctl: the MDM proxy (org.corvaneos.mdmproxy) refused: ");

QStringList words(const QString &text)
{
    return text.split(QLatin1Char(' '));
}

Mdmctl::Result run(const QString &arguments)
{
    return Mdmctl::run(words(arguments));
}

QString call(const char *member, const QString &arguments = QString())
{
    return QStringLiteral("%1 %2 (%3)").arg(Path, QLatin1String(member), arguments);
}

} // namespace

class MdmctlUpdateTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void init();
    void cleanup();

    void statusTellsWhatIsKnown();
    void checkMakesThePhoneLook();
    void failedCheckIsTold();
    void downloadOfNothingFails();
    void downloadTakesTheVersionOnOffer();
    void downloadOfAGivenVersion();
    void failedDownloadIsTold();
    void progressInTenthsOfAFile();
    void progressBarOnATerminal();
    void failureOnATerminalLeavesTheBarsLine();
    void installBeginsOrWaits();
    void newerUpdateHidesTheEndOfTheInstallation();
    void installOfNothingFails();
    void queryThatFailsIsTold();
    void queryWithAWrongAnswerIsTold();
    void queryWithoutAnAnswerIsTold_data();
    void queryWithoutAnAnswerIsTold();
    void absentProxyIsToldAtOnce();
    void proxyThatDiesDuringTheDownload();
    void silenceEndsTheWait();
    void interruptedDownloadUnregisters();
    void watchTellsEverySignal();
    void watchUnregistersWhenItIsInterrupted_data();
    void watchUnregistersWhenItIsInterrupted();

private:
    void emitSignal(const char *member, const QVariantList &arguments = {});
    void standIn(const char *member);
    bool waitForCall(const QString &entry);
    QJsonObject state() const;
    QString onTerminal(const QString &arguments, const std::function<void()> &meanwhile, int *status);

    Phone m_phone;
    CallAlarm m_alarm;
    QString m_version; // on offer
    int m_versions = 0;
};

void MdmctlUpdateTest::initTestCase()
{
    // The device's own catalogue gives way to versions that each test publishes.
    QCOMPARE(run(QStringLiteral("update check")).status, 0);
    for (const char *version : {"5.0.0.70", "5.1.0.11"})
        m_phone.act(QStringLiteral("update withdraw"), {QString::fromLatin1(version)});
}

void MdmctlUpdateTest::init()
{
    m_version = QStringLiteral("6.0.%1").arg(++m_versions);
    m_phone.act(QStringLiteral("update publish"), {m_version});
    m_phone.takeJournal(Service);
}

void MdmctlUpdateTest::cleanup()
{
    m_phone.clearFaults();
    m_phone.startService(Service);
    m_phone.act(QStringLiteral("update withdraw"), {m_version});
}

void MdmctlUpdateTest::emitSignal(const char *member, const QVariantList &arguments)
{
    m_phone.emitSignal(Service, Path, Interface, QString::fromLatin1(member), arguments);
}

/** The proxy answers calls of @p member and does nothing: what becomes of it is the test's to tell. */
void MdmctlUpdateTest::standIn(const char *member)
{
    m_phone.answerCalls(Service, Path, QString::fromLatin1(member), {});
}

bool MdmctlUpdateTest::waitForCall(const QString &entry)
{
    QStringList seen;
    return waitUntil([&] {
        seen += m_phone.takeJournal(Service);
        return seen.contains(entry);
    });
}

QJsonObject MdmctlUpdateTest::state() const
{
    return m_phone.state().value(QLatin1String("softwareUpdate")).toObject();
}

void MdmctlUpdateTest::statusTellsWhatIsKnown()
{
    const Mdmctl::Result known = run(QStringLiteral("update status"));
    QCOMPARE(known.output, QStringLiteral("Update %1 is available.\n").arg(m_version));
    QCOMPARE(known.status, 0);
    QCOMPARE(run(QStringLiteral("update status --json")).json(),
             QJsonObject({{QStringLiteral("available"), true}, {QStringLiteral("version"), m_version}}));
    QVERIFY(!m_phone.takeJournal(Service).contains(call("checkForSoftwareUpdate")));

    m_phone.answerCalls(Service, Path, QStringLiteral("softwareUpdateIsAvailable"), {false});
    QCOMPARE(run(QStringLiteral("update status")).output, QStringLiteral("No update is available.\n"));
    QCOMPARE(run(QStringLiteral("update status --json")).json(),
             QJsonObject({{QStringLiteral("available"), false}, {QStringLiteral("version"), QJsonValue()}}));
}

void MdmctlUpdateTest::checkMakesThePhoneLook()
{
    const Mdmctl::Result checked = run(QStringLiteral("update check"));
    QCOMPARE(checked.output, QStringLiteral("Update %1 is available.\n").arg(m_version));
    QCOMPARE(checked.status, 0);
    QVERIFY(m_phone.takeJournal(Service).contains(call("checkForSoftwareUpdate")));
    QCOMPARE(run(QStringLiteral("update check --json")).json(),
             QJsonObject({{QStringLiteral("available"), true}, {QStringLiteral("version"), m_version}}));
}

void MdmctlUpdateTest::failedCheckIsTold()
{
    standIn("checkForSoftwareUpdate");
    Mdmctl check(words(QStringLiteral("update check")));
    QVERIFY(waitForCall(call("checkForSoftwareUpdate")));
    emitSignal("softwareUpdateFailed", {QStringLiteral("No network")});
    const Mdmctl::Result failed = check.finish();
    QCOMPARE(failed.errors, QStringLiteral("mdmctl: the phone reports: No network\n"));
    QCOMPARE(failed.status, 1);
}

void MdmctlUpdateTest::downloadOfNothingFails()
{
    m_phone.answerCalls(Service, Path, QStringLiteral("softwareUpdateIsAvailable"), {false});
    const Mdmctl::Result failed = run(QStringLiteral("update download"));
    QCOMPARE(failed.errors,
             QStringLiteral("mdmctl: no update is available; \"mdmctl update check\" looks for one\n"));
    QCOMPARE(failed.status, 1);
}

void MdmctlUpdateTest::downloadTakesTheVersionOnOffer()
{
    const Mdmctl::Result downloaded = run(QStringLiteral("update download"));
    QCOMPARE(downloaded.output, QStringLiteral("Update %1 is downloaded.\n").arg(m_version));
    QCOMPARE(downloaded.status, 0);
    QCOMPARE(state().value(QLatin1String("downloaded")).toString(), m_version);
    QCOMPARE(state().value(QLatin1String("clients")).toInt(), 0);
}

void MdmctlUpdateTest::downloadOfAGivenVersion()
{
    const Mdmctl::Result downloaded = run(QStringLiteral("update download %1 --json").arg(m_version));
    QCOMPARE(downloaded.json(),
             QJsonObject({{QStringLiteral("downloaded"), true}, {QStringLiteral("version"), m_version}}));
    QCOMPARE(downloaded.errors, QString());
    QVERIFY(m_phone.takeJournal(Service).contains(
        call("downloadSoftwareUpdate", QStringLiteral("'%1',").arg(m_version))));
}

void MdmctlUpdateTest::failedDownloadIsTold()
{
    const Mdmctl::Result failed = run(QStringLiteral("update download 9.9"));
    QCOMPARE(failed.errors, QStringLiteral("mdmctl: the phone reports: Version 9.9 is not available\n"));
    QCOMPARE(failed.output, QString());
    QCOMPARE(failed.status, 1);
}

void MdmctlUpdateTest::progressInTenthsOfAFile()
{
    standIn("downloadSoftwareUpdate");
    Mdmctl download(words(QStringLiteral("update download 7")));
    QVERIFY(waitForCall(call("downloadSoftwareUpdate", QStringLiteral("'7',"))));
    for (const int percent : {0, 4, 9, 10, 19, 35, 35, 100})
        emitSignal("softwareUpdateDownloadProgress", {percent});
    emitSignal("softwareUpdateDownloaded");
    const Mdmctl::Result downloaded = download.finish();
    QCOMPARE(downloaded.errors,
             QStringLiteral("Downloading 7: 0%\n"
                            "Downloading 7: 10%\n"
                            "Downloading 7: 35%\n"
                            "Downloading 7: 100%\n"));
    QCOMPARE(downloaded.output, QStringLiteral("Update 7 is downloaded.\n"));
    QCOMPARE(downloaded.status, 0);
}

/** What a terminal of 40 columns gets from mdmctl, errors and all. */
QString MdmctlUpdateTest::onTerminal(const QString &arguments, const std::function<void()> &meanwhile,
                                     int *status)
{
    winsize size = {};
    size.ws_row = 24;
    size.ws_col = 40;
    int terminal = -1;
    int line = -1;
    if (::openpty(&terminal, &line, nullptr, nullptr, &size) != 0)
        qFatal("cannot open a terminal");
    QByteArray shown;
    bool closed = false;
    QSocketNotifier notifier(terminal, QSocketNotifier::Read);
    QObject::connect(&notifier, &QSocketNotifier::activated, &notifier, [&] {
        char bytes[4096];
        const ssize_t count = ::read(terminal, bytes, sizeof bytes);
        shown.append(bytes, int(std::max<ssize_t>(count, 0)));
        closed = count <= 0;
        notifier.setEnabled(!closed);
    });

    QProcess mdmctl;
    mdmctl.setStandardOutputFile(QStringLiteral("/proc/self/fd/%1").arg(line));
    mdmctl.setStandardErrorFile(QStringLiteral("/proc/self/fd/%1").arg(line));
    mdmctl.start(QStringLiteral(MDMCTL), words(arguments));
    meanwhile();
    if (!waitUntil([&] { return mdmctl.state() == QProcess::NotRunning; }))
        qFatal("mdmctl does not end");
    ::close(line);
    waitUntil([&] { return closed; });
    ::close(terminal);
    *status = mdmctl.exitCode();
    return QString::fromUtf8(shown);
}

void MdmctlUpdateTest::progressBarOnATerminal()
{
    standIn("downloadSoftwareUpdate");
    int status = -1;
    const QString shown = onTerminal(
        QStringLiteral("update download 7"),
        [this] {
            QVERIFY(waitForCall(call("downloadSoftwareUpdate", QStringLiteral("'7',"))));
            for (const int percent : {0, 50, 50, 100})
                emitSignal("softwareUpdateDownloadProgress", {percent});
            emitSignal("softwareUpdateDownloaded");
        },
        &status);
    QCOMPARE(status, 0);
    QCOMPARE(shown,
             QStringLiteral("\r\x1b[KDownloading 7 [------------------]   0%"
                            "\r\x1b[KDownloading 7 [#########---------]  50%"
                            "\r\x1b[KDownloading 7 [##################] 100%"
                            "\r\nUpdate 7 is downloaded.\r\n"));
}

void MdmctlUpdateTest::failureOnATerminalLeavesTheBarsLine()
{
    standIn("downloadSoftwareUpdate");
    int status = -1;
    const QString shown = onTerminal(
        QStringLiteral("update download 7"),
        [this] {
            QVERIFY(waitForCall(call("downloadSoftwareUpdate", QStringLiteral("'7',"))));
            emitSignal("softwareUpdateDownloadProgress", {50});
            emitSignal("softwareUpdateFailed", {QStringLiteral("Connection lost")});
        },
        &status);
    QCOMPARE(status, 1);
    QVERIFY2(shown.endsWith(QStringLiteral("  50%\r\nmdmctl: the phone reports: Connection lost\r\n")),
             qPrintable(shown));
}

void MdmctlUpdateTest::installBeginsOrWaits()
{
    QCOMPARE(run(QStringLiteral("update download")).status, 0);
    const Mdmctl::Result installed = run(QStringLiteral("update install --wait"));
    QCOMPARE(installed.output, QStringLiteral("Update %1 is installed.\n").arg(m_version));
    QCOMPARE(installed.status, 0);
    QCOMPARE(state().value(QLatin1String("installed")).toString(), m_version);

    cleanup();
    init();
    QCOMPARE(run(QStringLiteral("update download")).status, 0);
    QCOMPARE(run(QStringLiteral("update install --json")).json(),
             QJsonObject({{QStringLiteral("installed"), false},
                          {QStringLiteral("started"), true},
                          {QStringLiteral("version"), m_version}}));
}

void MdmctlUpdateTest::newerUpdateHidesTheEndOfTheInstallation()
{
    standIn("installSoftwareUpdate");
    Mdmctl install(QStringLiteral("update install --wait").split(QLatin1Char(' ')));
    QVERIFY(waitForCall(Path + QStringLiteral(" installSoftwareUpdate ()")));
    emitSignal("softwareUpdateInstallationStarted");
    const QString newer = QStringLiteral("99.0");
    m_phone.act(QStringLiteral("update publish"), {newer});
    const Mdmctl::Result ended = install.finish();
    m_phone.act(QStringLiteral("update withdraw"), {newer});
    QCOMPARE(ended.errors,
             QStringLiteral("mdmctl: the phone offers 99.0 now, and does not tell whether %1 is installed\n")
                 .arg(m_version));
    QCOMPARE(ended.output, QString());
    QCOMPARE(ended.status, 1);
}

void MdmctlUpdateTest::installOfNothingFails()
{
    QVERIFY(waitUntil([this] { return state().value(QLatin1String("operation")) == QLatin1String("none"); }));
    const Mdmctl::Result failed = run(QStringLiteral("update install"));
    QCOMPARE(failed.errors, QStringLiteral("mdmctl: the phone reports: No update has been downloaded\n"));
    QCOMPARE(failed.status, 1);
}

void MdmctlUpdateTest::queryThatFailsIsTold()
{
    m_phone.failCalls(Service, Path, QStringLiteral("latestAvailableUpdateVersion"),
                      QStringLiteral("org.corvaneos.Error.Broken"), QStringLiteral("out of order"));
    const Mdmctl::Result failed = run(QStringLiteral("update status --json"));
    QCOMPARE(failed.errors, Refused + QStringLiteral("out of order (org.corvaneos.Error.Broken)\n"));
    QCOMPARE(failed.output, QString());
    QCOMPARE(failed.status, 1);
}

void MdmctlUpdateTest::queryWithAWrongAnswerIsTold()
{
    m_phone.answerCalls(Service, Path, QStringLiteral("latestAvailableUpdateVersion"), {7});
    const Mdmctl::Result failed = run(QStringLiteral("update check"));
    QVERIFY2(failed.errors.startsWith(Refused), qPrintable(failed.errors));
    QVERIFY2(failed.errors.contains(QStringLiteral("got \"i\"")), qPrintable(failed.errors));
    QCOMPARE(failed.status, 1);
}

void MdmctlUpdateTest::queryWithoutAnAnswerIsTold_data()
{
    QTest::addColumn<QString>("name");
    QTest::addColumn<QString>("text");
    QTest::addColumn<QString>("message");

    const QString errors = QStringLiteral("org.freedesktop.DBus.Error.");
    const QString silence
        = QStringLiteral("mdmctl: the MDM proxy (org.corvaneos.mdmproxy) did not answer within 25 s\n");
    for (const char *name : {"NoReply", "Timeout", "TimedOut"})
        QTest::newRow(name) << errors + QLatin1String(name) << QStringLiteral("no answer") << silence;
    // Of a service that died and is there again the bus tells the same name.
    const QString death = QStringLiteral("Message recipient disconnected from message bus without replying");
    QTest::newRow("died") << errors + QLatin1String("NoReply") << death
                          << QStringLiteral("%1%2 (%3NoReply)\n").arg(Refused, death, errors);
}

void MdmctlUpdateTest::queryWithoutAnAnswerIsTold()
{
    QFETCH(QString, name);
    QFETCH(QString, text);
    m_phone.failCalls(Service, Path, QStringLiteral("softwareUpdateIsAvailable"), name, text);
    const Mdmctl::Result failed = run(QStringLiteral("update status"));
    QTEST(failed.errors, "message");
    QCOMPARE(failed.output, QString());
    QCOMPARE(failed.status, 1);
}

void MdmctlUpdateTest::absentProxyIsToldAtOnce()
{
    m_phone.stopService(Service);
    for (const char *command :
         {"update status", "update check", "update download", "update install", "update watch"}) {
        QElapsedTimer elapsed;
        elapsed.start();
        const Mdmctl::Result absent = run(QString::fromLatin1(command));
        QVERIFY(elapsed.elapsed() < Mdmctl::shortestTimeout);
        QCOMPARE(absent.errors,
                 QStringLiteral("mdmctl: the MDM proxy (org.corvaneos.mdmproxy) is not running\n"));
        QCOMPARE(absent.status, 3);
    }
}

void MdmctlUpdateTest::proxyThatDiesDuringTheDownload()
{
    standIn("downloadSoftwareUpdate");
    Mdmctl download(words(QStringLiteral("update download 7")));
    QVERIFY(waitForCall(call("downloadSoftwareUpdate", QStringLiteral("'7',"))));
    emitSignal("softwareUpdateDownloadProgress", {50});
    QVERIFY(download.waitForErrors(QStringLiteral("50%")));
    m_phone.stopService(Service);
    const Mdmctl::Result failed = download.finish();
    QVERIFY2(failed.errors.endsWith(
                 QStringLiteral("mdmctl: the MDM proxy (org.corvaneos.mdmproxy) is not running\n")),
             qPrintable(failed.errors));
    QCOMPARE(failed.status, 3);
}

void MdmctlUpdateTest::silenceEndsTheWait()
{
    standIn("downloadSoftwareUpdate");
    const Mdmctl::Result silent = run(QStringLiteral("update download 7 --timeout 0.2"));
    QCOMPARE(silent.errors,
             QStringLiteral("mdmctl: the MDM proxy (org.corvaneos.mdmproxy) did not go on with the "
                            "download within 0.2 s\n"));
    QCOMPARE(silent.status, 1);
}

void MdmctlUpdateTest::interruptedDownloadUnregisters()
{
    standIn("downloadSoftwareUpdate");
    Mdmctl download(words(QStringLiteral("update download 7")));
    QVERIFY(waitForCall(call("downloadSoftwareUpdate", QStringLiteral("'7',"))));
    download.interrupt(SIGINT);
    const Mdmctl::Result interrupted = download.finish();
    QCOMPARE(interrupted.errors, QStringLiteral("mdmctl: interrupted\n"));
    QCOMPARE(interrupted.status, 1);
    QVERIFY(m_phone.takeJournal(Service).contains(call("unregisterClient")));
}

void MdmctlUpdateTest::watchTellsEverySignal()
{
    Mdmctl watch(words(QStringLiteral("update watch --json")));
    QVERIFY(watch.waitForOutput(QStringLiteral("watching")));
    emitSignal("softwareUpdateInfoChanged");
    emitSignal("softwareUpdateDownloading", {QStringLiteral("7")});
    emitSignal("softwareUpdateDownloadProgress", {30});
    emitSignal("softwareUpdateDownloaded");
    emitSignal("softwareUpdateInstallationStarted");
    emitSignal("softwareUpdateFailed", {QStringLiteral("Battery low")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Battery low")));
    watch.interrupt(SIGINT);
    QVector<QJsonObject> events = watch.finish().jsonLines();
    for (QJsonObject &event : events)
        QVERIFY(QDateTime::fromString(event.take(QStringLiteral("time")).toString(), Qt::ISODateWithMs)
                    .isValid());
    const QByteArray expected[] = {
        R"({"event": "watching"})",
        R"({"event": "infoChanged", "available": true, "version": ")" + m_version.toUtf8() + R"("})",
        R"({"event": "downloading", "version": "7"})",
        R"({"event": "downloadProgress", "percent": 30})",
        R"({"event": "downloaded"})",
        R"({"event": "installationStarted"})",
        R"({"event": "failed", "reason": "Battery low"})",
    };
    QCOMPARE(events.size(), int(std::size(expected)));
    for (int i = 0; i < events.size(); ++i)
        QCOMPARE(events.at(i), QJsonDocument::fromJson(expected[i]).object());
}

void MdmctlUpdateTest::watchUnregistersWhenItIsInterrupted_data()
{
    QTest::addColumn<int>("signal");
    QTest::newRow("SIGINT") << SIGINT;
    QTest::newRow("SIGTERM") << SIGTERM;
}

void MdmctlUpdateTest::watchUnregistersWhenItIsInterrupted()
{
    QFETCH(int, signal);
    Mdmctl watch(words(QStringLiteral("update watch")));
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching software updates.\n")));
    QCOMPARE(state().value(QLatin1String("clients")).toInt(), 1);
    emitSignal("softwareUpdateDownloadProgress", {30});
    QVERIFY(watch.waitForOutput(QStringLiteral("Z  Downloaded 30%.\n")));
    watch.interrupt(signal);
    const Mdmctl::Result watched = watch.finish();
    QCOMPARE(watched.status, 0);
    QCOMPARE(watched.errors, QString());
    QCOMPARE(m_phone.takeJournal(Service), QStringList({call("registerClient"), call("unregisterClient")}));
}

QTEST_GUILESS_MAIN(MdmctlUpdateTest)
#include "mdmctl_update_test.moc"
