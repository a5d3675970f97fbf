// SPDX-License-Identifier: LGPL-2.1-or-later
#include "client.h"
#include "waiting.h"

#include <QtTest/QtTest>

#include <memory>

namespace
{

const QString service = QStringLiteral("org.corvaneos.mdmproxy");
const QString path = QStringLiteral("/Corvane/Mdm/Proxy/LocationInfo");
const QString interface = QStringLiteral("org.corvaneos.mdmproxy.locationinfo");
const QString refused = QStringLiteral("org.corvaneos.simulator.Error.InvalidArguments: ");

} // namespace

/** The location object of the simulated MDM proxy. */
class LocationServiceTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void reportsSatellitesBeforeAPosition();
    void writesPositionsAsReceiversDo();
    void startingTwiceIsStartingOnce();
    void runsForAnybodyWhoWantsIt();
    void forgetsClientsThatLeave();
    void restsWhenTheServiceStops();
    void tunnelsHideTheSky();
    void refusesPlacesThatAreNone_data();
    void refusesPlacesThatAreNone();

private:
    static QString call(const Client &client, const char *member)
    {
        return textOf(client.call(service, path, interface, QLatin1String(member)));
    }
    QString call(const char *member) const { return call(*m_client, member); }
    QString act(const char *action, const QStringList &arguments) const
    {
        return textOf(m_client->control(QStringLiteral("Act"), {QLatin1String(action), arguments}));
    }
    bool isRunning() const
    {
        return textOf(m_client->control(QStringLiteral("State"))).contains(QLatin1String("\"running\":true"));
    }

    std::unique_ptr<Client> m_client;
};

void LocationServiceTest::init()
{
    m_client = std::make_unique<Client>();
    m_client->watch(service, path, interface,
                    {QStringLiteral("positionChanged"), QStringLiteral("satellitesChanged")});
}

void LocationServiceTest::cleanup()
{
    act("location signal", {QStringLiteral("on")});
    call("stopUpdates");
    m_client->takeSignals(service);
}

void LocationServiceTest::reportsSatellitesBeforeAPosition()
{
    QCOMPARE(call("satellitesInView"), QStringLiteral("reply(0)"));
    QCOMPARE(call("startUpdates"), QStringLiteral("reply()"));
    QVERIFY(m_client->waitForSignals(6));
    QCOMPARE(call("stopUpdates"), QStringLiteral("reply()"));
    const QStringList seen = m_client->takeSignals(service);
    QCOMPARE(seen.at(0), QStringLiteral("satellitesChanged(1, 12)"));
    QCOMPARE(seen.at(1), QStringLiteral("satellitesChanged(2, 13)"));
    QCOMPARE(seen.at(2), QStringLiteral("satellitesChanged(5, 14)"));
    QVERIFY(seen.at(3).startsWith(QLatin1String("positionChanged(")));
    QCOMPARE(seen.at(4), QStringLiteral("satellitesChanged(6, 14)"));
    QVERIFY(seen.at(5).startsWith(QLatin1String("positionChanged(")));
    QCOMPARE(call("satellitesInUse"), QStringLiteral("reply(0)"));
}

void LocationServiceTest::writesPositionsAsReceiversDo()
{
    QCOMPARE(
        act("location move", {QStringLiteral("-33.86882"), QStringLiteral("151.2"), QStringLiteral("-7")}),
        QStringLiteral("reply()"));
    const qint64 before = QDateTime::currentMSecsSinceEpoch();
    call("startUpdates");
    QVERIFY(m_client->waitForSignals(4));
    call("stopUpdates");
    const QString seen = m_client->takeSignals(service).at(3);
    const QRegularExpression form(
        QStringLiteral("^positionChanged\\((-33\\.868820;151\\.200000;-7\\.0;([0-9]{13}))\\)$"));
    const QRegularExpressionMatch match = form.match(seen);
    QVERIFY2(match.hasMatch(), qPrintable(seen));
    QVERIFY(match.captured(2).toLongLong() >= before);
    QVERIFY(match.captured(2).toLongLong() <= QDateTime::currentMSecsSinceEpoch());
    // It is known still.
    QVERIFY(call("position").startsWith(QLatin1String("reply(-33.868820;151.200000;-7.0;")));
}

void LocationServiceTest::startingTwiceIsStartingOnce()
{
    call("startUpdates");
    call("startUpdates");
    QVERIFY(isRunning());
    call("stopUpdates");
    QVERIFY(!isRunning());
    call("stopUpdates");
    QVERIFY(!isRunning());
}

void LocationServiceTest::runsForAnybodyWhoWantsIt()
{
    const Client other(Client::Own);
    call("startUpdates");
    call(other, "startUpdates");
    call("stopUpdates");
    QVERIFY(isRunning());
    m_client->takeSignals(service);
    // It is told to everybody.
    QVERIFY(m_client->waitForSignals(1));
    call(other, "stopUpdates");
    QVERIFY(!isRunning());
}

void LocationServiceTest::forgetsClientsThatLeave()
{
    auto other = std::make_unique<Client>(Client::Own);
    call(*other, "startUpdates");
    QVERIFY(isRunning());
    other.reset();
    QVERIFY(waitUntil([this] { return !isRunning(); }));
}

void LocationServiceTest::restsWhenTheServiceStops()
{
    call("startUpdates");
    QVERIFY(m_client->waitForSignals(1));
    m_client->control(QStringLiteral("StopService"), {service});
    m_client->control(QStringLiteral("StartService"), {service});
    QVERIFY(!isRunning());
    QCOMPARE(call("satellitesInView"), QStringLiteral("reply(0)"));
}

void LocationServiceTest::tunnelsHideTheSky()
{
    QCOMPARE(act("location signal", {QStringLiteral("off")}), QStringLiteral("reply()"));
    call("startUpdates");
    QVERIFY(m_client->waitForSignals(5));
    call("stopUpdates");
    const QStringList seen = m_client->takeSignals(service);
    for (const QString &each : seen)
        QCOMPARE(each, QStringLiteral("satellitesChanged(0, 0)"));
    QCOMPARE(act("location signal", {QStringLiteral("maybe")}),
             refused + QLatin1String("\"maybe\" is neither on nor off"));
}

void LocationServiceTest::refusesPlacesThatAreNone_data()
{
    QTest::addColumn<QStringList>("place");
    QTest::addColumn<QString>("reason");
    const QString nowhere
        = QStringLiteral("There is no such place: latitudes go from -90 to 90 and longitudes from -180 to "
                         "180 degrees");
    QTest::newRow("word") << QStringList{QStringLiteral("north"), QStringLiteral("1")}
                          << QStringLiteral("\"north\" is no number");
    QTest::newRow("latitude") << QStringList{QStringLiteral("90.1"), QStringLiteral("1")} << nowhere;
    QTest::newRow("longitude") << QStringList{QStringLiteral("9"), QStringLiteral("-181")} << nowhere;
    QTest::newRow("nan") << QStringList{QStringLiteral("nan"), QStringLiteral("1")} << nowhere;
}

void LocationServiceTest::refusesPlacesThatAreNone()
{
    QFETCH(QStringList, place);
    QFETCH(QString, reason);
    QCOMPARE(act("location move", place), refused + reason);
}

QTEST_GUILESS_MAIN(LocationServiceTest)
#include "locationservice_test.moc"
