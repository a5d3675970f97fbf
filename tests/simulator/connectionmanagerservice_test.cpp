// SPDX-License-Identifier: LGPL-2.1-or-later
#include "client.h"

#include <QtCore/QElapsedTimer>
#include <QtCore/QRegularExpression>
#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusVariant>
#include <QtTest/QTest>

namespace
{

const QString service = QStringLiteral("net.connman");
const QString root = QStringLiteral("/");
const QString managerInterface = QStringLiteral("net.connman.Manager");
const QString serviceInterface = QStringLiteral("net.connman.Service");
const QString technologyInterface = QStringLiteral("net.connman.Technology");
const QString proxyInterface = QStringLiteral("org.corvaneos.connman.GlobalProxy");
const QString changed = QStringLiteral("PropertyChanged");
const QString setPropertyMethod = QStringLiteral("SetProperty");
const QString done = QStringLiteral("reply()");

const QString office = QStringLiteral("wifi_02c0ffee0001_436f7276616e65204f6666696365_managed_psk");
const QString home = QStringLiteral("wifi_02c0ffee0001_486f6d65_managed_psk");
const QString cafe = QStringLiteral("wifi_02c0ffee0001_53746174696f6e2043616665_managed_none");

QString pathOf(const QString &identifier)
{
    return QStringLiteral("/net/connman/service/") + identifier;
}

QVariant boxedValue(const QVariant &value)
{
    return QVariant::fromValue(QDBusVariant(value));
}

QString error(const char *name, const char *text)
{
    return QStringLiteral("net.connman.Error.%1: %2").arg(QLatin1String(name), QLatin1String(text));
}

} // namespace

/** The simulated connection manager. */
class ConnectionManagerServiceTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void describesItself();
    void connectsInSteps();
    void failsToConnect();
    void refusesWhatIsSoAlready();
    void disconnects();
    void abortsAConnection();
    void connectsUnasked();
    void forgetsANetwork();
    void announcesEveryProxy();
    void refusesWrongProxies_data();
    void refusesWrongProxies();
    void refusesWrongProperties();
    void networksComeAndGo();
    void switchesTechnologies();
    void flightModeKeepsWhatWasOn();
    void globalProxyIsUsed();
    void keepsWhatAPhoneStores();
    void refusesWrongCounters();
    void forgetsTheCountersOfClientsThatLeave();

private:
    QString call(const QString &path, const QString &interface, const QString &member,
                 const QVariantList &arguments = {}) const
    {
        return textOf(m_client->call(service, path, interface, member, arguments));
    }
    QString callNetwork(const QString &identifier, const char *member,
                        const QVariantList &arguments = {}) const
    {
        return call(pathOf(identifier), serviceInterface, QLatin1String(member), arguments);
    }
    QString setNetwork(const QString &identifier, const char *property, const QVariant &value) const
    {
        return callNetwork(identifier, "SetProperty", {QString::fromLatin1(property), boxedValue(value)});
    }
    QString act(const QString &action, const QStringList &arguments) const
    {
        return textOf(m_client->control(QStringLiteral("Act"), {action, arguments}));
    }
    /** The property of a network as text. */
    QString property(const QString &identifier, const char *name) const;
    bool becomes(const QString &identifier, const char *state) const;
    QStringList takeStates() { return m_client->takeSignals(service).filter(QStringLiteral("(State, ")); }
    QString properties(const QString &identifier) const { return callNetwork(identifier, "GetProperties"); }

    std::unique_ptr<Client> m_client;
};

void ConnectionManagerServiceTest::init()
{
    m_client = std::make_unique<Client>();
    QVERIFY(becomes(office, "online"));
}

void ConnectionManagerServiceTest::cleanup()
{
    act(QStringLiteral("flight-mode"), {QStringLiteral("off")});
    callNetwork(cafe, "Remove");
    // What was done in this run of the service is forgotten with it.
    m_client->control(QStringLiteral("StopService"), {service});
    m_client->control(QStringLiteral("StartService"), {service});
    m_client.reset();
}

bool ConnectionManagerServiceTest::becomes(const QString &identifier, const char *state) const
{
    constexpr int giveUpMilliseconds = 30000;
    QElapsedTimer elapsed;
    elapsed.start();
    while (property(identifier, "State") != QLatin1String(state)) {
        if (elapsed.elapsed() > giveUpMilliseconds)
            return false;
    }
    return true;
}

QString ConnectionManagerServiceTest::property(const QString &identifier, const char *name) const
{
    const QRegularExpression value(QLatin1String(name) + QStringLiteral("=<([^>]*)>"));
    return value.match(properties(identifier)).captured(1);
}

void ConnectionManagerServiceTest::describesItself()
{
    QVERIFY(call(root, managerInterface, QStringLiteral("GetProperties"))
                .contains(QStringLiteral("State=<online>, OfflineMode=<false>")));
    const QString technologies = call(root, managerInterface, QStringLiteral("GetTechnologies"));
    QVERIFY(technologies.contains(QStringLiteral("/net/connman/technology/wifi")));
    QVERIFY(call(QStringLiteral("/net/connman/technology/wifi"), technologyInterface,
                 QStringLiteral("GetProperties"))
                .contains(QStringLiteral("Powered=<true>, Connected=<true>, Name=<WiFi>, Type=<wifi>")));
    const QString office0 = properties(office);
    QVERIFY2(office0.startsWith(QStringLiteral("reply({State=<online>, Name=<Corvane Office>, Type=<wifi>, "
                                               "Security=<[psk]>, Strength=<")),
             qPrintable(office0));
    QVERIFY(office0.contains(QStringLiteral("Favorite=<true>, Immutable=<false>, AutoConnect=<true>")));
    // Connected ones come first.
    const QString services = call(root, managerInterface, QStringLiteral("GetServices"));
    QVERIFY(services.indexOf(office) < services.indexOf(home));
    QVERIFY(services.indexOf(home) < services.indexOf(cafe));
}

void ConnectionManagerServiceTest::connectsInSteps()
{
    QCOMPARE(property(cafe, "Favorite"), QStringLiteral("false"));
    m_client->watch(service, pathOf(cafe), serviceInterface, {changed});
    QCOMPARE(callNetwork(cafe, "Connect"), done); // answered when it is connected
    QCOMPARE(takeStates(),
             QStringList({QStringLiteral("PropertyChanged(State, <association>)"),
                          QStringLiteral("PropertyChanged(State, <configuration>)"),
                          QStringLiteral("PropertyChanged(State, <ready>)")}));
    QCOMPARE(property(cafe, "Favorite"), QStringLiteral("true"));
    // The other one stays the one that traffic goes over, until it is lost.
    QCOMPARE(property(office, "State"), QStringLiteral("online"));
    act(QStringLiteral("connection lose"), {office});
    QCOMPARE(property(cafe, "State"), QStringLiteral("online"));
}

void ConnectionManagerServiceTest::failsToConnect()
{
    act(QStringLiteral("connection fail"), {home, QStringLiteral("invalid-key")});
    m_client->watch(service, pathOf(home), serviceInterface, {changed});
    QCOMPARE(callNetwork(home, "Connect"), error("Failed", "Input/output error"));
    QCOMPARE(m_client->takeSignals(service),
             QStringList({QStringLiteral("PropertyChanged(State, <association>)"),
                          QStringLiteral("PropertyChanged(State, <failure>)"),
                          QStringLiteral("PropertyChanged(Error, <invalid-key>)")}));
    QCOMPARE(callNetwork(home, "ClearProperty", {QStringLiteral("Name")}),
             error("InvalidProperty", "Invalid property"));
    QCOMPARE(callNetwork(home, "ClearProperty", {QStringLiteral("Error")}), done);
    QCOMPARE(property(home, "State"), QStringLiteral("idle"));
    QCOMPARE(property(home, "Error"), QString());
    QCOMPARE(callNetwork(home, "Connect"), done);
}

void ConnectionManagerServiceTest::refusesWhatIsSoAlready()
{
    QCOMPARE(callNetwork(office, "Connect"), error("AlreadyConnected", "Already connected"));
    QCOMPARE(callNetwork(home, "Disconnect"), error("NotConnected", "Not connected"));
    m_client->callAndNote(service, pathOf(home), serviceInterface, QStringLiteral("Connect"));
    QCOMPARE(callNetwork(home, "Connect"), error("InProgress", "In progress"));
    QVERIFY(m_client->waitForSignals(1));
    QCOMPARE(m_client->takeSignals(service), QStringList(QStringLiteral("answer")));
}

void ConnectionManagerServiceTest::disconnects()
{
    m_client->watch(service, pathOf(office), serviceInterface, {changed});
    QCOMPARE(callNetwork(office, "Disconnect"), done);
    QVERIFY(becomes(office, "idle"));
    QCOMPARE(takeStates(),
             QStringList({QStringLiteral("PropertyChanged(State, <disconnect>)"),
                          QStringLiteral("PropertyChanged(State, <idle>)")}));
}

void ConnectionManagerServiceTest::abortsAConnection()
{
    m_client->callAndNote(service, pathOf(home), serviceInterface, QStringLiteral("Connect"));
    QCOMPARE(callNetwork(home, "Disconnect"), done);
    QVERIFY(m_client->waitForSignals(1));
    QCOMPARE(m_client->takeSignals(service),
             QStringList(QStringLiteral("net.connman.Error.OperationAborted")));
}

void ConnectionManagerServiceTest::connectsUnasked()
{
    QCOMPARE(callNetwork(office, "Disconnect"), done);
    // The next best that is saved and may be; by itself.
    QVERIFY(becomes(home, "online"));
    QCOMPARE(property(cafe, "State"), QStringLiteral("idle"));
    QCOMPARE(property(office, "State"), QStringLiteral("idle"));
}

void ConnectionManagerServiceTest::forgetsANetwork()
{
    QCOMPARE(callNetwork(cafe, "Connect"), done);
    QCOMPARE(setNetwork(cafe, "AutoConnect", false), done);
    QCOMPARE(setNetwork(cafe, "Proxy.Configuration",
                        QVariantMap{{QStringLiteral("Method"), QStringLiteral("direct")}}),
             done);
    QCOMPARE(callNetwork(cafe, "Remove"), done);
    QCOMPARE(property(cafe, "Favorite"), QStringLiteral("false"));
    QCOMPARE(property(cafe, "State"), QStringLiteral("idle"));
    QVERIFY(properties(cafe).contains(QStringLiteral("Proxy.Configuration=<{}>")));
    QCOMPARE(setNetwork(cafe, "AutoConnect", false), error("InvalidService", "Invalid service"));
    QCOMPARE(callNetwork(QStringLiteral("cellular_244051234567890_context1"), "Remove"),
             error("NotSupported", "Not supported"));
}

void ConnectionManagerServiceTest::announcesEveryProxy()
{
    m_client->watch(service, pathOf(home), serviceInterface, {changed});
    const QVariantMap direct{{QStringLiteral("Method"), QStringLiteral("direct")}};
    for (int i = 0; i < 2; ++i)
        QCOMPARE(setNetwork(home, "Proxy.Configuration", direct), done);
    QCOMPARE(m_client->takeSignals(service),
             QStringList({QStringLiteral("PropertyChanged(Proxy.Configuration, <{Method=<direct>}>)"),
                          QStringLiteral("PropertyChanged(Proxy.Configuration, <{Method=<direct>}>)")}));
}

void ConnectionManagerServiceTest::refusesWrongProxies_data()
{
    QTest::addColumn<QVariant>("value");
    QTest::newRow("no dictionary") << QVariant(QStringLiteral("direct"));
    QTest::newRow("empty") << QVariant(QVariantMap());
    QTest::newRow("unknown method") << QVariant(QVariantMap{{QStringLiteral("Method"), QStringLiteral("x")}});
    QTest::newRow("number") << QVariant(QVariantMap{{QStringLiteral("Method"), 1}});
    QTest::newRow("no servers") << QVariant(
        QVariantMap{{QStringLiteral("Method"), QStringLiteral("manual")}});
    QTest::newRow("servers of another type")
        << QVariant(QVariantMap{{QStringLiteral("Method"), QStringLiteral("manual")},
                                {QStringLiteral("Servers"), QStringLiteral("http://a")}});
}

void ConnectionManagerServiceTest::refusesWrongProxies()
{
    QFETCH(QVariant, value);
    const QString refused = error("InvalidArguments", "Invalid arguments");
    QCOMPARE(setNetwork(home, "Proxy.Configuration", value), refused);
    QCOMPARE(
        call(root, proxyInterface, setPropertyMethod, {QStringLiteral("Configuration"), boxedValue(value)}),
        refused);
}

void ConnectionManagerServiceTest::refusesWrongProperties()
{
    const QString invalid = error("InvalidProperty", "Invalid property");
    const QString refused = error("InvalidArguments", "Invalid arguments");
    QCOMPARE(setNetwork(home, "Name", QStringLiteral("x")), invalid);
    QCOMPARE(setNetwork(home, "AutoConnect", 1), refused);
    QCOMPARE(call(root, managerInterface, setPropertyMethod, {QStringLiteral("State"), boxedValue(true)}),
             invalid);
    QCOMPARE(call(root, managerInterface, setPropertyMethod, {QStringLiteral("OfflineMode"), boxedValue(1)}),
             refused);
    const QString wifi = QStringLiteral("/net/connman/technology/wifi");
    QCOMPARE(call(wifi, technologyInterface, setPropertyMethod, {QStringLiteral("Name"), boxedValue(true)}),
             invalid);
    QCOMPARE(
        call(wifi, technologyInterface, setPropertyMethod, {QStringLiteral("Powered"), boxedValue(true)}),
        error("AlreadyEnabled", "Already enabled"));
    QCOMPARE(call(root, proxyInterface, setPropertyMethod, {QStringLiteral("Active"), boxedValue(1)}),
             refused);
    QCOMPARE(call(root, proxyInterface, setPropertyMethod, {QStringLiteral("Colour"), boxedValue(1)}),
             invalid);
    QCOMPARE(call(root, proxyInterface, QStringLiteral("GetProperty"), {QStringLiteral("Colour")}), invalid);
}

void ConnectionManagerServiceTest::networksComeAndGo()
{
    m_client->watch(service, root, managerInterface, {QStringLiteral("ServicesChanged")});
    const QString identifier = QStringLiteral("wifi_02c0ffee0001_477565737473_managed_none");
    QCOMPARE(act(QStringLiteral("wifi appear"),
                 {QStringLiteral("Guests"), QStringLiteral("none"), QStringLiteral("saved")}),
             QStringLiteral("reply(%1)").arg(identifier));
    QCOMPARE(act(QStringLiteral("connection vanish"), {identifier}), QStringLiteral("reply()"));
    const QStringList seen = m_client->takeSignals(service);
    QCOMPARE(seen.size(), 2);
    QVERIFY2(seen.first().contains(QStringLiteral("Name=<Guests>")), qPrintable(seen.first()));
    QVERIFY(seen.first().endsWith(QStringLiteral(", [])")));
    QVERIFY2(seen.last().endsWith(QStringLiteral("[%1])").arg(pathOf(identifier))), qPrintable(seen.last()));
    QVERIFY(
        callNetwork(identifier, "GetProperties").startsWith(QLatin1String("org.freedesktop.DBus.Error.")));
    QVERIFY(act(QStringLiteral("connection vanish"), {QStringLiteral("wifi_nowhere")})
                .startsWith(QLatin1String("org.corvaneos.simulator.Error.InvalidArguments: There is no "
                                          "network \"wifi_nowhere\"; there are ")));
}

void ConnectionManagerServiceTest::switchesTechnologies()
{
    const QString wifi = QStringLiteral("/net/connman/technology/wifi");
    m_client->watch(service, wifi, technologyInterface, {changed});
    m_client->watch(service, root, managerInterface,
                    {QStringLiteral("TechnologyAdded"), QStringLiteral("TechnologyRemoved")});
    QCOMPARE(
        call(wifi, technologyInterface, setPropertyMethod, {QStringLiteral("Powered"), boxedValue(false)}),
        done);
    QVERIFY(m_client->takeSignals(service).contains(QStringLiteral("PropertyChanged(Powered, <false>)")));
    QVERIFY(!call(root, managerInterface, QStringLiteral("GetServices")).contains(QLatin1String("wifi_")));
    QCOMPARE(call(wifi, technologyInterface, QStringLiteral("Scan")), done);
    act(QStringLiteral("technology power"), {QStringLiteral("wifi"), QStringLiteral("on")});
    m_client->takeSignals(service);
    act(QStringLiteral("technology remove"), {QStringLiteral("wifi")});
    act(QStringLiteral("technology add"), {QStringLiteral("wifi")});
    const QStringList seen = m_client->takeSignals(service).filter(QStringLiteral("Technology"));
    QCOMPARE(seen.first(), QStringLiteral("TechnologyRemoved(%1)").arg(wifi));
    QVERIFY(seen.last().startsWith(QStringLiteral("TechnologyAdded(%1, {Powered=<true>").arg(wifi)));
}

void ConnectionManagerServiceTest::flightModeKeepsWhatWasOn()
{
    act(QStringLiteral("technology power"), {QStringLiteral("ethernet"), QStringLiteral("off")});
    QCOMPARE(
        call(root, managerInterface, setPropertyMethod, {QStringLiteral("OfflineMode"), boxedValue(true)}),
        done);
    QVERIFY(!call(root, managerInterface, QStringLiteral("GetTechnologies"))
                 .contains(QStringLiteral("Powered=<true>")));
    QVERIFY(call(root, managerInterface, QStringLiteral("GetProperties"))
                .contains(QStringLiteral("State=<offline>, OfflineMode=<true>")));
    QCOMPARE(
        call(root, managerInterface, setPropertyMethod, {QStringLiteral("OfflineMode"), boxedValue(false)}),
        done);
    QCOMPARE(call(root, managerInterface, QStringLiteral("GetTechnologies"))
                 .count(QStringLiteral("Powered=<true>")),
             2);
    act(QStringLiteral("technology power"), {QStringLiteral("ethernet"), QStringLiteral("on")});
}

void ConnectionManagerServiceTest::globalProxyIsUsed()
{
    m_client->watch(service, root, proxyInterface, {changed});
    const QVariantMap automatic{{QStringLiteral("Method"), QStringLiteral("auto")},
                                {QStringLiteral("URL"), QStringLiteral("http://pac")}};
    QCOMPARE(call(root, proxyInterface, setPropertyMethod,
                  {QStringLiteral("Configuration"), boxedValue(automatic)}),
             done);
    QCOMPARE(call(root, proxyInterface, setPropertyMethod, {QStringLiteral("Active"), boxedValue(true)}),
             done);
    QVERIFY(properties(office).contains(QStringLiteral("Proxy=<{Method=<auto>, URL=<http://pac>}>")));
    QCOMPARE(call(root, proxyInterface, QStringLiteral("GetProperty"), {QStringLiteral("Active")}),
             QStringLiteral("reply(<true>)"));
    QCOMPARE(call(root, proxyInterface, setPropertyMethod, {QStringLiteral("Active"), boxedValue(false)}),
             done);
    QVERIFY(!properties(office).contains(QStringLiteral("http://pac")));
    QCOMPARE(
        m_client->takeSignals(service),
        QStringList({QStringLiteral("PropertyChanged(Configuration, <{Method=<auto>, URL=<http://pac>}>)"),
                     QStringLiteral("PropertyChanged(Active, <true>)"),
                     QStringLiteral("PropertyChanged(Active, <false>)")}));
}

void ConnectionManagerServiceTest::keepsWhatAPhoneStores()
{
    setNetwork(home, "Proxy.Configuration",
               QVariantMap{{QStringLiteral("Method"), QStringLiteral("auto")},
                           {QStringLiteral("URL"), QStringLiteral("http://kept")}});
    m_client->control(QStringLiteral("StopService"), {service});
    m_client->control(QStringLiteral("StartService"), {service});
    QVERIFY(properties(home).contains(QStringLiteral("URL=<http://kept>")));
    // It connects anew.
    QVERIFY(becomes(office, "online"));
}

void ConnectionManagerServiceTest::refusesWrongCounters()
{
    const QVariant path = QVariant::fromValue(QDBusObjectPath(QStringLiteral("/c")));
    const QString registerCounter = QStringLiteral("RegisterCounter");
    const QString unregister = QStringLiteral("UnregisterCounter");
    QCOMPARE(call(root, managerInterface, registerCounter, {path, 1u, 0u}),
             error("InvalidArguments", "Invalid arguments"));
    QCOMPARE(call(root, managerInterface, registerCounter, {path, 1u, 1u}), done);
    QCOMPARE(call(root, managerInterface, registerCounter, {path, 1u, 1u}),
             error("AlreadyExists", "Already exists"));
    QCOMPARE(call(root, managerInterface, unregister, {path}), done);
    QCOMPARE(call(root, managerInterface, unregister, {path}), error("NotRegistered", "Not registered"));
    for (const char *text : {"{'a': 1}", "x"}) {
        QVERIFY(act(QStringLiteral("counter usage"),
                    {QStringLiteral("/n"), QString::fromLatin1(text), QStringLiteral("{}")})
                    .contains(QStringLiteral("is no dictionary")));
    }
    QVERIFY(act(QStringLiteral("counter usage"),
                {QStringLiteral("n"), QStringLiteral("{}"), QStringLiteral("{}")})
                .contains(QStringLiteral("is no object path")));
}

void ConnectionManagerServiceTest::forgetsTheCountersOfClientsThatLeave()
{
    const auto counters = [this] {
        return textOf(m_client->control(QStringLiteral("State"))).contains(QStringLiteral("\"/left\""));
    };
    {
        const Client leaving(Client::Own);
        QCOMPARE(
            textOf(leaving.call(service, root, managerInterface, QStringLiteral("RegisterCounter"),
                                {QVariant::fromValue(QDBusObjectPath(QStringLiteral("/left"))), 1u, 60u})),
            done);
        QVERIFY(counters());
    }
    QElapsedTimer elapsed;
    elapsed.start();
    while (counters())
        QVERIFY(elapsed.elapsed() < 30000);
}

QTEST_GUILESS_MAIN(ConnectionManagerServiceTest)

#include "connectionmanagerservice_test.moc"
