// SPDX-License-Identifier: LGPL-2.1-or-later
#include "client.h"

#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QJsonObject>
#include <QtTest/QTest>

namespace
{

const QString service = QStringLiteral("org.corvaneos.mdmproxy");
const QString path = QStringLiteral("/Corvane/Mdm/Proxy/SoftwareUpdate");
const QString interface = QStringLiteral("org.corvaneos.mdmproxy.softwareupdate");
const QString done = QStringLiteral("reply()");
const QString infoChanged = QStringLiteral("softwareUpdateInfoChanged()");
const QString registerClient = QStringLiteral("registerClient");
const QString unregisterClient = QStringLiteral("unregisterClient");

QString call(const Client &client, const QString &member, const QVariantList &arguments = {})
{
    return textOf(client.call(service, path, interface, member, arguments));
}

void watchAll(Client &client)
{
    client.watch(
        service, path, interface,
        {QStringLiteral("softwareUpdateInfoChanged"), QStringLiteral("softwareUpdateDownloading"),
         QStringLiteral("softwareUpdateDownloadProgress"), QStringLiteral("softwareUpdateDownloaded"),
         QStringLiteral("softwareUpdateInstallationStarted"), QStringLiteral("softwareUpdateFailed")});
}

QStringList downloadOf(const QString &version, int lastPercent)
{
    QStringList signalTexts{QStringLiteral("softwareUpdateDownloading(%1)").arg(version)};
    for (int percent = 0; percent <= lastPercent; percent += 10)
        signalTexts << QStringLiteral("softwareUpdateDownloadProgress(%1)").arg(percent);
    return signalTexts;
}

QString failure(const QString &reason)
{
    return QStringLiteral("softwareUpdateFailed(%1)").arg(reason);
}

} // namespace

/**
 * The software update object of the simulated MDM proxy.
 *
 * The functions named fails... need profiles of their own and are run apart from the others.
 */
class SoftwareUpdateServiceTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void findsTheHighestVersion();
    void downloadsAndInstalls();
    void refusesUnknownVersions();
    void refusesToInstallNothing();
    void doesOneThingAtATime();
    void answersBeforeItSignals();
    void tellsRegisteredClientsOnly();
    void countsRegistrations();
    void forgetsClientsThatLeave();
    void forgetsClientsAndOperationsWhenStopped();
    void hearsOfPublishedAndWithdrawnUpdates();

    void failsDownload();
    void failsInstallation();
    void failsCheck();

private:
    QString act(const QString &action, const QStringList &arguments) const
    {
        return textOf(m_client->control(QStringLiteral("Act"), {action, arguments}));
    }
    /** A version above all that were there before; the phone has not been told of it. */
    QString newVersion();
    void check();
    QJsonObject state() const;

    std::unique_ptr<Client> m_client;
    int m_newest = 0;
};

void SoftwareUpdateServiceTest::init()
{
    m_client = std::make_unique<Client>(Client::Own);
    watchAll(*m_client);
    m_client->control(QStringLiteral("StopService"), {service});
    m_client->control(QStringLiteral("StartService"), {service});
    QCOMPARE(call(*m_client, registerClient), done);
}

void SoftwareUpdateServiceTest::cleanup()
{
    m_client.reset();
}

QString SoftwareUpdateServiceTest::newVersion()
{
    const QString version = QStringLiteral("6.0.%1").arg(++m_newest);
    act(QStringLiteral("update publish"), {version});
    m_client->takeSignals(service);
    return version;
}

void SoftwareUpdateServiceTest::check()
{
    call(*m_client, QStringLiteral("checkForSoftwareUpdate"));
    QVERIFY(m_client->waitForSignals(1));
    QCOMPARE(m_client->takeSignals(service), QStringList{infoChanged});
}

QJsonObject SoftwareUpdateServiceTest::state() const
{
    const QDBusMessage answer = m_client->control(QStringLiteral("State"));
    return QJsonDocument::fromJson(answer.arguments().first().toString().toUtf8())
        .object()
        .value(QLatin1String("softwareUpdate"))
        .toObject();
}

void SoftwareUpdateServiceTest::findsTheHighestVersion()
{
    const QString latest = QStringLiteral("latestAvailableUpdateVersion");
    const QString available = QStringLiteral("softwareUpdateIsAvailable");
    if (state().value(QLatin1String("available")).toArray().isEmpty()) {
        QCOMPARE(call(*m_client, latest), QStringLiteral("reply()"));
        QCOMPARE(call(*m_client, available), QStringLiteral("reply(false)"));
    }
    check();
    QCOMPARE(call(*m_client, available), QStringLiteral("reply(true)"));
    const QString expected = m_newest ? QStringLiteral("6.0.%1").arg(m_newest) : QStringLiteral("5.0.0.100");
    QCOMPARE(call(*m_client, latest), QStringLiteral("reply(%1)").arg(expected));
}

void SoftwareUpdateServiceTest::downloadsAndInstalls()
{
    const QString version = newVersion();
    check();
    QCOMPARE(call(*m_client, QStringLiteral("downloadSoftwareUpdate"), {version}), done);
    const QStringList download = downloadOf(version, 100) << QStringLiteral("softwareUpdateDownloaded()");
    QVERIFY(m_client->waitForSignals(download.size()));
    QCOMPARE(m_client->takeSignals(service), download);

    QCOMPARE(call(*m_client, QStringLiteral("installSoftwareUpdate")), done);
    QVERIFY(m_client->waitForSignals(2));
    QCOMPARE(m_client->takeSignals(service),
             (QStringList{QStringLiteral("softwareUpdateInstallationStarted()"), infoChanged}));
    QCOMPARE(state().value(QLatin1String("installed")).toString(), version);
    QCOMPARE(call(*m_client, QStringLiteral("softwareUpdateIsAvailable")), QStringLiteral("reply(false)"));
    check();
    QCOMPARE(call(*m_client, QStringLiteral("latestAvailableUpdateVersion")), QStringLiteral("reply()"));
}

void SoftwareUpdateServiceTest::refusesUnknownVersions()
{
    check();
    for (const QString &version : {QStringLiteral("9.9"), QStringLiteral("5.0.0.9"), QString()}) {
        QCOMPARE(call(*m_client, QStringLiteral("downloadSoftwareUpdate"), {version}), done);
        QCOMPARE(m_client->takeSignals(service),
                 QStringList{failure(QStringLiteral("Version %1 is not available").arg(version))});
    }
}

void SoftwareUpdateServiceTest::refusesToInstallNothing()
{
    if (!state().value(QLatin1String("downloaded")).toString().isEmpty()) {
        call(*m_client, QStringLiteral("installSoftwareUpdate"));
        QVERIFY(m_client->waitForSignals(2));
        m_client->takeSignals(service);
    }
    QCOMPARE(call(*m_client, QStringLiteral("installSoftwareUpdate")), done);
    QCOMPARE(m_client->takeSignals(service),
             QStringList{failure(QStringLiteral("No update has been downloaded"))});
}

void SoftwareUpdateServiceTest::doesOneThingAtATime()
{
    const QString version = newVersion();
    const QString busy = failure(QStringLiteral("Another operation is running"));
    call(*m_client, QStringLiteral("downloadSoftwareUpdate"), {version});
    call(*m_client, QStringLiteral("downloadSoftwareUpdate"), {version});
    call(*m_client, QStringLiteral("checkForSoftwareUpdate"));
    call(*m_client, QStringLiteral("installSoftwareUpdate"));
    const QStringList download = downloadOf(version, 100) << QStringLiteral("softwareUpdateDownloaded()");
    QVERIFY(m_client->waitForSignals(download.size() + 3));
    QStringList seen = m_client->takeSignals(service);
    QCOMPARE(seen.removeAll(busy), 3);
    QCOMPARE(seen, download);
}

void SoftwareUpdateServiceTest::answersBeforeItSignals()
{
    m_client->callAndNote(service, path, interface, QStringLiteral("downloadSoftwareUpdate"),
                          {QStringLiteral("nothing")});
    QVERIFY(m_client->waitForSignals(2));
    QCOMPARE(
        m_client->takeSignals(service),
        (QStringList{QStringLiteral("answer"), failure(QStringLiteral("Version nothing is not available"))}));
}

void SoftwareUpdateServiceTest::tellsRegisteredClientsOnly()
{
    Client stranger(Client::Own);
    watchAll(stranger);
    check();
    QCOMPARE(stranger.takeSignals(service), QStringList());
    // Who starts an operation makes no difference.
    QCOMPARE(call(stranger, QStringLiteral("checkForSoftwareUpdate")), done);
    QVERIFY(m_client->waitForSignals(1));
    QCOMPARE(m_client->takeSignals(service), QStringList{infoChanged});
    QCOMPARE(stranger.takeSignals(service), QStringList());
}

void SoftwareUpdateServiceTest::countsRegistrations()
{
    QCOMPARE(call(*m_client, registerClient), done);
    check();
    QCOMPARE(call(*m_client, unregisterClient), done);
    check();
    QCOMPARE(call(*m_client, unregisterClient), done);
    QCOMPARE(call(*m_client, QStringLiteral("installSoftwareUpdate")), done);
    QCOMPARE(m_client->takeSignals(service), QStringList());
    QCOMPARE(call(*m_client, unregisterClient), done);
}

void SoftwareUpdateServiceTest::forgetsClientsThatLeave()
{
    auto leaver = std::make_unique<Client>(Client::Own);
    call(*leaver, registerClient);
    call(*leaver, registerClient);
    QCOMPARE(state().value(QLatin1String("clients")).toInt(), 2);
    leaver.reset();
    QTRY_COMPARE(state().value(QLatin1String("clients")).toInt(), 1);
}

void SoftwareUpdateServiceTest::forgetsClientsAndOperationsWhenStopped()
{
    const QString version = newVersion();
    call(*m_client, QStringLiteral("downloadSoftwareUpdate"), {version});
    m_client->control(QStringLiteral("StopService"), {service});
    m_client->control(QStringLiteral("StartService"), {service});
    QCOMPARE(state().value(QLatin1String("clients")).toInt(), 0);
    QCOMPARE(state().value(QLatin1String("operation")).toString(), QStringLiteral("none"));
    QVERIFY(state().value(QLatin1String("downloaded")).toString() != version);
    QCOMPARE(state().value(QLatin1String("latest")).toString(), version);
}

void SoftwareUpdateServiceTest::hearsOfPublishedAndWithdrawnUpdates()
{
    const QString publish = QStringLiteral("update publish");
    const QString withdraw = QStringLiteral("update withdraw");
    const QString higher = QStringLiteral("7.0");
    QCOMPARE(act(publish, {higher}), QStringLiteral("reply(7.0 is published and the phone has been told)"));
    QCOMPARE(act(publish, {QStringLiteral("6.9")}),
             QStringLiteral("reply(6.9 is published and the phone has been told)"));
    QCOMPARE(act(publish, {QStringLiteral("1.0")}).left(28), QStringLiteral("reply(1.0 is published; the "));
    QCOMPARE(m_client->takeSignals(service), QStringList{infoChanged});
    QCOMPARE(state().value(QLatin1String("latest")).toString(), higher);
    QVERIFY(act(publish, {higher}).contains(QLatin1String("in the catalogue already")));
    QVERIFY(act(publish, {QStringLiteral("new")}).contains(QLatin1String("is no version")));
    QVERIFY(
        act(publish, {QStringLiteral("8.0"), QStringLiteral("much")}).contains(QLatin1String("is no size")));

    QCOMPARE(act(withdraw, {QStringLiteral("6.9")}), QStringLiteral("reply(6.9 is withdrawn)"));
    QCOMPARE(act(withdraw, {QStringLiteral("1.0")}), QStringLiteral("reply(1.0 is withdrawn)"));
    QCOMPARE(m_client->takeSignals(service), QStringList());
    QCOMPARE(act(withdraw, {higher}), QStringLiteral("reply(7.0 is withdrawn)"));
    QCOMPARE(m_client->takeSignals(service), QStringList{infoChanged});
    QVERIFY(act(withdraw, {higher}).contains(QLatin1String("is not in the catalogue")));
}

void SoftwareUpdateServiceTest::failsDownload()
{
    const QString version = QStringLiteral("5.0.0.73");
    check();
    call(*m_client, QStringLiteral("downloadSoftwareUpdate"), {version});
    const QStringList expected = downloadOf(version, 50) << failure(QStringLiteral("The line went dead"));
    QVERIFY(m_client->waitForSignals(expected.size()));
    QCOMPARE(m_client->takeSignals(service), expected);
    QCOMPARE(state().value(QLatin1String("downloaded")).toString(), QString());
}

void SoftwareUpdateServiceTest::failsInstallation()
{
    const QString version = QStringLiteral("5.0.0.74");
    check();
    call(*m_client, QStringLiteral("downloadSoftwareUpdate"), {version});
    QVERIFY(m_client->waitForSignals(13));
    m_client->takeSignals(service);
    call(*m_client, QStringLiteral("installSoftwareUpdate"));
    QVERIFY(m_client->waitForSignals(2));
    QCOMPARE(m_client->takeSignals(service),
             (QStringList{QStringLiteral("softwareUpdateInstallationStarted()"),
                          failure(QStringLiteral("The update is damaged"))}));
    QCOMPARE(state().value(QLatin1String("installed")).toString(), QStringLiteral("5.0.0.62"));
}

void SoftwareUpdateServiceTest::failsCheck()
{
    call(*m_client, QStringLiteral("checkForSoftwareUpdate"));
    QVERIFY(m_client->waitForSignals(1));
    QCOMPARE(m_client->takeSignals(service),
             QStringList{failure(QStringLiteral("The update server does not answer"))});
    QCOMPARE(call(*m_client, QStringLiteral("softwareUpdateIsAvailable")), QStringLiteral("reply(false)"));
}

QTEST_GUILESS_MAIN(SoftwareUpdateServiceTest)
#include "softwareupdateservice_test.moc"
