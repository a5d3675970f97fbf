// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"
#include "waiting.h"

#include <corvanemdm/connectivitysettings.h>
#include <corvanemdm/netproxy.h>

#include <connman/networkmanager.h>
#include <connman/networkservice.h>
#include <connman/networktechnology.h>

#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::ConnectivitySettings;
using Corvane::Mdm::NetProxy;

namespace
{

const QString Connman = QStringLiteral("net.connman");

} // namespace

/** The real ConnMan, in a phone that has a cable and no Wi-Fi. */
class RealConnmanTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void withoutWlan();
    void flightMode_data();
    void flightMode();
    void flightModeOutlivesTheDaemon();
    void daemonThatIsAway();
    void clientsKnowTheWiredNetwork();
    void clientsConfigureProxies();
    void clientsFollowARestart();
    void proxiesNeedTheGlobalOne();

private:
    Phone m_phone;
    NetworkService *wiredNetwork();

    std::unique_ptr<MessageLog> m_log;
};

void RealConnmanTest::init()
{
    m_log = std::make_unique<MessageLog>();
}

void RealConnmanTest::cleanup()
{
    const QStringList warnings = m_log->takeWarnings();
    m_log.reset();
    QCOMPARE(warnings.join(QLatin1Char('\n')), QString());
}

void RealConnmanTest::withoutWlan()
{
    ConnectivitySettings settings;
    SignalSequence seen(&settings);
    QVERIFY(settings.ready());
    QVERIFY(!settings.wlanEnabled());
    QCOMPARE(m_log->takeWarnings(),
             QStringList(QStringLiteral("Powered property not returned for WLAN technology!")));
    settings.setWlanEnabled(true);
    const QStringList warnings = m_log->takeWarnings();
    QCOMPARE(warnings.size(), 1);
    QVERIFY2(warnings.first().startsWith(
                 QLatin1String("Unable to set the power of the WLAN technology: \"Method")),
             qPrintable(warnings.first()));
    QCOMPARE(seen.take(), QStringList(QStringLiteral("wlanEnabledChanged()")));

    // The other mode waits for Wi-Fi, and tells flight mode all the same.
    ConnectivitySettings mirror(ConnectivitySettings::NetworkManagerMode);
    settings.setFlightModeEnabled(true);
    QVERIFY(waitUntil([&mirror] { return mirror.flightModeEnabled(); }));
    QVERIFY(!mirror.ready());
    QVERIFY(!mirror.wlanEnabled());
    settings.setFlightModeEnabled(false);
    QVERIFY(waitUntil([&mirror] { return !mirror.flightModeEnabled(); }));
}

void RealConnmanTest::flightMode_data()
{
    QTest::addColumn<int>("mode");
    QTest::addColumn<int>("announcements");
    // In one mode the request itself is told of as well.
    QTest::newRow("D-Bus") << int(ConnectivitySettings::DBusMode) << 2;
    QTest::newRow("network manager") << int(ConnectivitySettings::NetworkManagerMode) << 1;
}

void RealConnmanTest::flightMode()
{
    QFETCH(int, mode);
    QFETCH(int, announcements);
    ConnectivitySettings settings{ConnectivitySettings::Mode(mode)};
    SignalSequence seen(&settings);
    for (const bool wanted : {true, false}) {
        settings.setFlightModeEnabled(wanted);
        const auto announced = [&seen] {
            return seen.signalsSeen().count(QStringLiteral("flightModeEnabledChanged()"));
        };
        QVERIFY(waitUntil([&] { return announced() >= announcements; }));
        QCOMPARE(settings.flightModeEnabled(), wanted);
        m_phone.settle(Connman);
        QCOMPARE(announced(), announcements);
        seen.take();
    }
}

void RealConnmanTest::flightModeOutlivesTheDaemon()
{
    ConnectivitySettings settings;
    settings.setFlightModeEnabled(true);
    m_phone.stopService(Connman);
    m_phone.startService(Connman);
    QVERIFY(settings.flightModeEnabled());
    ConnectivitySettings mirror(ConnectivitySettings::NetworkManagerMode);
    QVERIFY(waitUntil([&mirror] { return mirror.flightModeEnabled(); }));
    mirror.setFlightModeEnabled(false);
    QVERIFY(waitUntil([&mirror] { return !mirror.flightModeEnabled(); }));
    QVERIFY(!settings.flightModeEnabled());
}

void RealConnmanTest::daemonThatIsAway()
{
    ConnectivitySettings settings;
    m_phone.stopService(Connman);
    QVERIFY(!settings.flightModeEnabled());
    QCOMPARE(m_log->takeWarnings(),
             QStringList(QStringLiteral("OfflineMode property not returned for ConnMan!")));
    m_phone.startService(Connman);
    // The same object works again.
    SignalSequence seen(&settings);
    settings.setFlightModeEnabled(true);
    QVERIFY(seen.waitFor(2));
    QVERIFY(settings.flightModeEnabled());
    settings.setFlightModeEnabled(false);
}

/** As the clients of the connection manager list it. */
NetworkService *RealConnmanTest::wiredNetwork()
{
    NetworkManager *manager = NetworkManagerFactory::createInstance();
    const QString type = QStringLiteral("ethernet");
    if (!waitUntil([&] { return manager->isValid() && manager->getSavedServices(type).size() == 1; }))
        qFatal("The real ConnMan has no wired network");
    return manager->getSavedServices(type).constFirst();
}

void RealConnmanTest::clientsKnowTheWiredNetwork()
{
    const NetworkService *network = wiredNetwork();
    QVERIFY(network->path().startsWith(QLatin1String("/net/connman/service/ethernet_")));
    QCOMPARE(network->name(), QStringLiteral("Wired"));
    QCOMPARE(network->type(), QStringLiteral("ethernet"));
    QVERIFY(network->saved());
    const NetworkTechnology *technology = nullptr;
    QVERIFY(waitUntil([&technology] {
        technology = NetworkManagerFactory::createInstance()->getTechnology(QStringLiteral("ethernet"));
        return technology && technology->powered();
    }));
    QCOMPARE(technology->name(), QStringLiteral("Wired"));
}

void RealConnmanTest::clientsConfigureProxies()
{
    NetworkService *network = wiredNetwork();
    const QString method = QStringLiteral("Method");
    const QVariantMap manual{
        {method, QStringLiteral("manual")},
        {QStringLiteral("Servers"),
         QStringList{QStringLiteral("proxy.example:8080"), QStringLiteral("10.0.0.1:3128")}},
        {QStringLiteral("Excludes"), QStringList{QStringLiteral("intranet.example")}}};
    const QVariantMap automatic{{method, QStringLiteral("auto")},
                                {QStringLiteral("URL"), QStringLiteral("http://pac.example/proxy.pac")}};
    const QVariantMap direct{{method, QStringLiteral("direct")}};
    for (const QVariantMap &configuration : {manual, automatic, direct}) {
        network->setProxyConfig(configuration);
        QVERIFY(waitUntil([&] { return network->proxyConfig() == configuration; }));
        // Another client reads the same anew.
        NetworkService other;
        QSignalSpy read(&other, &NetworkService::propertiesReady);
        other.setPath(network->path());
        QVERIFY(waitUntil([&] { return !read.isEmpty() || other.proxyConfig() == configuration; }));
        QCOMPARE(other.proxyConfig(), configuration);
    }
}

void RealConnmanTest::clientsFollowARestart()
{
    const QString path = wiredNetwork()->path();
    NetworkManager *manager = NetworkManagerFactory::createInstance();
    m_phone.stopService(Connman);
    QVERIFY(waitUntil([manager] { return !manager->isAvailable(); }));
    QVERIFY(manager->getTechnologies().isEmpty());
    m_phone.startService(Connman);
    QCOMPARE(wiredNetwork()->path(), path);
    QVERIFY(waitUntil([manager] { return manager->getTechnology(QStringLiteral("ethernet")); }));
}

void RealConnmanTest::proxiesNeedTheGlobalOne()
{
    // The global proxy is a plug-in of phones, which the distribution's ConnMan lacks.
    NetProxy proxy;
    const QString identifier = wiredNetwork()->path().section(QLatin1Char('/'), -1);
    m_phone.settle(Connman);
    QVERIFY(!proxy.isValid());
    QCOMPARE(proxy.type(), NetProxy::Invalid);
    QVERIFY(!proxy.selectProxy(identifier));
    QVERIFY(!proxy.setType(NetProxy::Manual));
    QCOMPARE(proxy.getIdentifier(), QString());
}

QTEST_GUILESS_MAIN(RealConnmanTest)

#include "realconnman_test.moc"
