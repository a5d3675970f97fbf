// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"
#include "texts.h"
#include "waiting.h"

#include <corvanemdm/softwareupdate.h>

#include <QtCore/QElapsedTimer>
#include <QtTest/QtTest>

#include <functional>
#include <memory>
#include <thread>

using Corvane::Mdm::SoftwareUpdate;

namespace
{

const QString Service = QStringLiteral("org.corvaneos.mdmproxy");
const QString Path = QStringLiteral("/Corvane/Mdm/Proxy/SoftwareUpdate");
const QString Interface = QStringLiteral("org.corvaneos.mdmproxy.softwareupdate");

QString call(const char *member, const char *arguments = "()")
{
    return Path + QLatin1Char(' ') + QLatin1String(member) + QLatin1Char(' ')
        + QString::fromLatin1(arguments);
}

} // namespace

class SoftwareUpdateTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void registersWhileItLives();
    void isConnectedBeforeItRegisters();
    void twoObjectsRegisterSeparatelyAndBothHear();
    void everySignalIsForwarded();
    void signalOfAnotherShapeIsNotForwarded();
    void signalsReachQueuedAndNamedConnections();
    void queriesAnswerWhatTheProxySays();
    void commandsSendTheirCalls();
    void waitsForAnswers();
    void updateFromCheckToInstallation();
    void failureIsForwarded();
    void failingQueriesWarnAndAreEmpty();
    void failingQueriesAreNeverStale();
    void repliesOfAnotherTypeAreFailures();
    void failingCommandsAreSilent();
    void proxyThatIsNotThere();
    void proxyThatGoesAndComesBack();
    void queriesThroughTheMetaObject();

private:
    std::unique_ptr<Phone> m_phone;
};

void SoftwareUpdateTest::init()
{
    m_phone = std::make_unique<Phone>();
}

void SoftwareUpdateTest::cleanup()
{
    m_phone->clearFaults();
    m_phone->startService(Service);
}

void SoftwareUpdateTest::registersWhileItLives()
{
    {
        SoftwareUpdate update;
        QCOMPARE(m_phone->takeJournal(Service), QStringList(call("registerClient")));
    }
    QCOMPARE(m_phone->takeJournal(Service), QStringList(call("unregisterClient")));
}

void SoftwareUpdateTest::isConnectedBeforeItRegisters()
{
    // While the constructor waits for the answer, the proxy has something to tell its new client.
    m_phone->delayCalls(Service, Path, QStringLiteral("registerClient"), 300);
    std::thread proxy([this] {
        while (!m_phone->takeJournal(Service).contains(call("registerClient"))) { }
        m_phone->sendSignal(Service, Path, Interface, QStringLiteral("softwareUpdateDownloadProgress"), {7});
    });
    SoftwareUpdate update;
    SignalSequence seen(&update);
    proxy.join();
    m_phone->settle(Service);
    QCOMPARE(seen.take(), texts({"softwareUpdateDownloadProgress(7)"}));
}

void SoftwareUpdateTest::twoObjectsRegisterSeparatelyAndBothHear()
{
    auto first = std::make_unique<SoftwareUpdate>();
    SoftwareUpdate second;
    QCOMPARE(m_phone->takeJournal(Service), QStringList({call("registerClient"), call("registerClient")}));

    SignalSequence firstSignals(first.get());
    SignalSequence secondSignals(&second);
    second.checkForSoftwareUpdate();
    QVERIFY(firstSignals.waitFor(1));
    QVERIFY(secondSignals.waitFor(1));
    QCOMPARE(firstSignals.take(), texts({"softwareUpdateInfoChanged()"}));
    QCOMPARE(secondSignals.take(), texts({"softwareUpdateInfoChanged()"}));
    m_phone->takeJournal(Service);

    first.reset();
    QCOMPARE(m_phone->takeJournal(Service), QStringList(call("unregisterClient")));
    // The proxy counts: the second object is still a client.
    second.checkForSoftwareUpdate();
    QVERIFY(secondSignals.waitFor(1));
    QCOMPARE(secondSignals.take(), texts({"softwareUpdateInfoChanged()"}));
}

void SoftwareUpdateTest::everySignalIsForwarded()
{
    SoftwareUpdate update;
    SignalSequence seen(&update);
    const auto emitSignal = [this](const char *member, const QVariantList &arguments = QVariantList()) {
        m_phone->emitSignal(Service, Path, Interface, QLatin1String(member), arguments);
    };
    // In no order that the proxy would keep: nothing is held back or put right.
    emitSignal("softwareUpdateFailed", {QStringLiteral("No space left")});
    emitSignal("softwareUpdateInstallationStarted");
    emitSignal("softwareUpdateDownloaded");
    emitSignal("softwareUpdateDownloadProgress", {100});
    emitSignal("softwareUpdateDownloadProgress", {-1});
    emitSignal("softwareUpdateDownloading", {QString()});
    emitSignal("softwareUpdateInfoChanged");
    QCOMPARE(seen.take(),
             texts({"softwareUpdateFailed(No space left)", "softwareUpdateInstallationStarted()",
                    "softwareUpdateDownloaded()", "softwareUpdateDownloadProgress(100)",
                    "softwareUpdateDownloadProgress(-1)", "softwareUpdateDownloading()",
                    "softwareUpdateInfoChanged()"}));
}

void SoftwareUpdateTest::signalOfAnotherShapeIsNotForwarded()
{
    SoftwareUpdate update;
    SignalSequence seen(&update);
    m_phone->emitSignal(Service, Path, Interface, QStringLiteral("softwareUpdateDownloadProgress"),
                        {QStringLiteral("50")});
    m_phone->emitSignal(Service, Path, Interface, QStringLiteral("softwareUpdateFailed"), {});
    m_phone->emitSignal(Service, Path, QStringLiteral("org.corvaneos.mdmproxy.autostart"),
                        QStringLiteral("softwareUpdateInfoChanged"));
    m_phone->emitSignal(Service, QStringLiteral("/"), Interface, QStringLiteral("softwareUpdateInfoChanged"));
    QCOMPARE(seen.take(), QStringList());
}

void SoftwareUpdateTest::signalsReachQueuedAndNamedConnections()
{
    SoftwareUpdate update;
    QSignalSpy named(&update, SIGNAL(softwareUpdateDownloading(QString)));
    int queued = 0;
    connect(
        &update, &SoftwareUpdate::softwareUpdateDownloadProgress, this,
        [&queued](int percent) { queued = percent; }, Qt::QueuedConnection);
    m_phone->emitSignal(Service, Path, Interface, QStringLiteral("softwareUpdateDownloading"),
                        {QStringLiteral("5.1")});
    m_phone->emitSignal(Service, Path, Interface, QStringLiteral("softwareUpdateDownloadProgress"), {42});
    QVERIFY(waitUntil([&] { return queued != 0; }));
    QCOMPARE(queued, 42);
    QCOMPARE(named.size(), 1);
    QCOMPARE(named.first().first().toString(), QStringLiteral("5.1"));
}

void SoftwareUpdateTest::queriesAnswerWhatTheProxySays()
{
    SoftwareUpdate update;
    m_phone->takeJournal(Service);
    m_phone->answerCalls(Service, Path, QStringLiteral("latestAvailableUpdateVersion"),
                         {QStringLiteral("9.8.7 \u00fc")});
    m_phone->answerCalls(Service, Path, QStringLiteral("softwareUpdateIsAvailable"), {true});
    QCOMPARE(update.latestAvailableUpdateVersion(), QStringLiteral("9.8.7 \u00fc"));
    QCOMPARE(update.softwareUpdateIsAvailable(), true);
    m_phone->answerCalls(Service, Path, QStringLiteral("softwareUpdateIsAvailable"), {false});
    QCOMPARE(update.softwareUpdateIsAvailable(), false);
    QCOMPARE(m_phone->takeJournal(Service),
             QStringList({call("latestAvailableUpdateVersion"), call("softwareUpdateIsAvailable"),
                          call("softwareUpdateIsAvailable")}));
}

void SoftwareUpdateTest::commandsSendTheirCalls()
{
    SoftwareUpdate update;
    SignalSequence seen(&update);
    m_phone->takeJournal(Service);
    update.installSoftwareUpdate();
    update.downloadSoftwareUpdate(QStringLiteral("1.2.3"));
    update.downloadSoftwareUpdate(QString());
    update.checkForSoftwareUpdate();
    QCOMPARE(m_phone->takeJournal(Service),
             QStringList({call("installSoftwareUpdate"), call("downloadSoftwareUpdate", "('1.2.3',)"),
                          call("downloadSoftwareUpdate", "('',)"), call("checkForSoftwareUpdate")}));
    QVERIFY(seen.waitFor(4));
    QCOMPARE(seen.take().last(), QStringLiteral("softwareUpdateInfoChanged()"));
}

void SoftwareUpdateTest::waitsForAnswers()
{
    constexpr int milliseconds = 200;
    const auto waits = [this](const char *member, const std::function<void()> &act) {
        m_phone->delayCalls(Service, Path, QLatin1String(member), milliseconds);
        QElapsedTimer elapsed;
        elapsed.start();
        act();
        const qint64 waited = elapsed.elapsed();
        m_phone->clearFaults();
        return waited >= milliseconds;
    };
    std::unique_ptr<SoftwareUpdate> update;
    QVERIFY(waits("registerClient", [&] { update = std::make_unique<SoftwareUpdate>(); }));
    QVERIFY(waits("checkForSoftwareUpdate", [&] { update->checkForSoftwareUpdate(); }));
    QVERIFY(waits("softwareUpdateIsAvailable", [&] { update->softwareUpdateIsAvailable(); }));
    QVERIFY(waits("downloadSoftwareUpdate", [&] { update->downloadSoftwareUpdate(QStringLiteral("5.1")); }));
    QVERIFY(waits("installSoftwareUpdate", [&] { update->installSoftwareUpdate(); }));
    QVERIFY(waits("unregisterClient", [&] { update.reset(); }));
}

void SoftwareUpdateTest::updateFromCheckToInstallation()
{
    SoftwareUpdate update;
    SignalSequence seen(&update);

    update.checkForSoftwareUpdate();
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), texts({"softwareUpdateInfoChanged()"}));
    QVERIFY(update.softwareUpdateIsAvailable());
    const QString version = update.latestAvailableUpdateVersion();
    QCOMPARE(version, QStringLiteral("5.1.0.11"));

    update.downloadSoftwareUpdate(version);
    QVERIFY(
        waitUntil([&] { return seen.signalsSeen().contains(QStringLiteral("softwareUpdateDownloaded()")); }));
    QStringList download = seen.take();
    QCOMPARE(download.takeFirst(), QStringLiteral("softwareUpdateDownloading(5.1.0.11)"));
    QCOMPARE(download.takeLast(), QStringLiteral("softwareUpdateDownloaded()"));
    QVERIFY(download.size() >= 2);
    QStringList ascending = download;
    std::sort(ascending.begin(), ascending.end(), [](const QString &one, const QString &other) {
        const auto percent = [](const QString &text) {
            return text.section(QLatin1Char('('), 1).chopped(1).toInt();
        };
        return percent(one) < percent(other);
    });
    QCOMPARE(download, ascending);
    QCOMPARE(download.last(), QStringLiteral("softwareUpdateDownloadProgress(100)"));

    update.installSoftwareUpdate();
    QVERIFY(seen.waitFor(2));
    QCOMPARE(seen.take(), texts({"softwareUpdateInstallationStarted()", "softwareUpdateInfoChanged()"}));
    QVERIFY(!update.softwareUpdateIsAvailable());
    QCOMPARE(update.latestAvailableUpdateVersion(), QString());
    QCOMPARE(m_phone->state()
                 .value(QStringLiteral("softwareUpdate"))
                 .toObject()
                 .value(QStringLiteral("installed"))
                 .toString(),
             version);
}

void SoftwareUpdateTest::failureIsForwarded()
{
    SoftwareUpdate update;
    SignalSequence seen(&update);
    update.downloadSoftwareUpdate(QStringLiteral("no such version"));
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), texts({"softwareUpdateFailed(Version no such version is not available)"}));
}

void SoftwareUpdateTest::failingQueriesWarnAndAreEmpty()
{
    SoftwareUpdate update;
    m_phone->failCalls(Service, Path, QString(), QStringLiteral("com.example.Broken"),
                       QStringLiteral("Out of order"));
    MessageLog log;
    QVERIFY(update.latestAvailableUpdateVersion().isNull());
    QCOMPARE(log.takeWarnings(),
             texts({"Failed to get latest available OS version QDBusError(\"com.example.Broken\", \"Out of "
                    "order\")"}));
    QCOMPARE(update.softwareUpdateIsAvailable(), false);
    QCOMPARE(
        log.takeWarnings(),
        texts(
            {"Failed to check OS update availability QDBusError(\"com.example.Broken\", \"Out of order\")"}));
}

void SoftwareUpdateTest::failingQueriesAreNeverStale()
{
    SoftwareUpdate update;
    m_phone->answerCalls(Service, Path, QStringLiteral("latestAvailableUpdateVersion"),
                         {QStringLiteral("6")});
    m_phone->answerCalls(Service, Path, QStringLiteral("softwareUpdateIsAvailable"), {true});
    QCOMPARE(update.latestAvailableUpdateVersion(), QStringLiteral("6"));
    QVERIFY(update.softwareUpdateIsAvailable());

    m_phone->failCalls(Service, Path, QString(), QStringLiteral("com.example.Broken"), QString());
    MessageLog log;
    QCOMPARE(update.latestAvailableUpdateVersion(), QString());
    QCOMPARE(update.softwareUpdateIsAvailable(), false);
    QCOMPARE(log.takeWarnings().size(), 2);
}

void SoftwareUpdateTest::repliesOfAnotherTypeAreFailures()
{
    SoftwareUpdate update;
    m_phone->answerCalls(Service, Path, QStringLiteral("latestAvailableUpdateVersion"), {7U});
    m_phone->answerCalls(Service, Path, QStringLiteral("softwareUpdateIsAvailable"),
                         {QStringLiteral("true")});
    MessageLog log;
    QCOMPARE(update.latestAvailableUpdateVersion(), QString());
    QCOMPARE(update.softwareUpdateIsAvailable(), false);
    m_phone->answerCalls(Service, Path, QString(), {});
    QCOMPARE(update.latestAvailableUpdateVersion(), QString());
    QCOMPARE(update.softwareUpdateIsAvailable(), false);
    const QStringList warnings = log.takeWarnings();
    QCOMPARE(warnings.size(), 4);
    for (int index = 0; index < warnings.size(); ++index) {
        QVERIFY2(warnings.at(index).startsWith(
                     index % 2 == 0 ? QLatin1String("Failed to get latest available OS version QDBusError(")
                                    : QLatin1String("Failed to check OS update availability QDBusError(")),
                 qPrintable(warnings.at(index)));
    }
}

void SoftwareUpdateTest::failingCommandsAreSilent()
{
    m_phone->failCalls(Service, Path, QString(), QStringLiteral("com.example.Broken"), QString());
    MessageLog log;
    {
        SoftwareUpdate update;
        SignalSequence seen(&update);
        update.checkForSoftwareUpdate();
        update.downloadSoftwareUpdate(QStringLiteral("5.1"));
        update.installSoftwareUpdate();
        m_phone->settle(Service);
        QCOMPARE(seen.take(), QStringList());
    }
    QCOMPARE(log.takeWarnings(), QStringList());
    QCOMPARE(m_phone->takeJournal(Service),
             QStringList({call("registerClient"), call("checkForSoftwareUpdate"),
                          call("downloadSoftwareUpdate", "('5.1',)"), call("installSoftwareUpdate"),
                          call("unregisterClient")}));
}

void SoftwareUpdateTest::proxyThatIsNotThere()
{
    m_phone->stopService(Service);
    MessageLog log;
    QElapsedTimer elapsed;
    elapsed.start();
    {
        SoftwareUpdate update;
        QCOMPARE(log.takeWarnings(), QStringList());
        SignalSequence seen(&update);
        QCOMPARE(update.latestAvailableUpdateVersion(), QString());
        QCOMPARE(update.softwareUpdateIsAvailable(), false);
        const QStringList warnings = log.takeWarnings();
        QCOMPARE(warnings.size(), 2);
        QVERIFY2(warnings.first().startsWith(
                     QLatin1String("Failed to get latest available OS version "
                                   "QDBusError(\"org.freedesktop.DBus.Error.ServiceUnknown\", ")),
                 qPrintable(warnings.first()));
        QVERIFY2(warnings.last().startsWith(
                     QLatin1String("Failed to check OS update availability "
                                   "QDBusError(\"org.freedesktop.DBus.Error.ServiceUnknown\", ")),
                 qPrintable(warnings.last()));
        update.checkForSoftwareUpdate();
        update.downloadSoftwareUpdate(QStringLiteral("5.1"));
        update.installSoftwareUpdate();
        QCOMPARE(seen.take(), QStringList());
    }
    QCOMPARE(log.takeWarnings(), QStringList());
    // Nothing waited for a time-out.
    QVERIFY(elapsed.elapsed() < 10000);
}

void SoftwareUpdateTest::proxyThatGoesAndComesBack()
{
    SoftwareUpdate update;
    SignalSequence seen(&update);
    m_phone->answerCalls(Service, Path, QStringLiteral("latestAvailableUpdateVersion"),
                         {QStringLiteral("6")});
    QCOMPARE(update.latestAvailableUpdateVersion(), QStringLiteral("6"));

    m_phone->stopService(Service);
    {
        MessageLog log;
        QCOMPARE(update.latestAvailableUpdateVersion(), QString());
        QCOMPARE(log.takeWarnings().size(), 1);
    }

    m_phone->startService(Service);
    QCOMPARE(update.latestAvailableUpdateVersion(), QStringLiteral("6"));
    // What the new proxy tells everybody is heard, too.
    m_phone->emitSignal(Service, Path, Interface, QStringLiteral("softwareUpdateInfoChanged"));
    QCOMPARE(seen.take(), texts({"softwareUpdateInfoChanged()"}));
}

void SoftwareUpdateTest::queriesThroughTheMetaObject()
{
    SoftwareUpdate update;
    m_phone->answerCalls(Service, Path, QStringLiteral("latestAvailableUpdateVersion"),
                         {QStringLiteral("6")});
    QString version;
    QVERIFY(
        QMetaObject::invokeMethod(&update, "latestAvailableUpdateVersion", Q_RETURN_ARG(QString, version)));
    QCOMPARE(version, QStringLiteral("6"));
}

QTEST_GUILESS_MAIN(SoftwareUpdateTest)
#include "softwareupdate_test.moc"
