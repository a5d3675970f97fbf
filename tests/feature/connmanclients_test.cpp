// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"
#include "waiting.h"
#include "wireobject.h"

#include <connman/networkmanager.h>
#include <connman/networkservice.h>
#include <connman/networktechnology.h>

#include <QtCore/QThread>
#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusVariant>
#include <QtTest/QtTest>

#include <memory>

namespace
{

const QString Service = QStringLiteral("net.connman");
const QString Root = QStringLiteral("/");
const QString ManagerInterface = QStringLiteral("net.connman.Manager");
const QString ServiceInterface = QStringLiteral("net.connman.Service");
const QString WifiPath = QStringLiteral("/net/connman/technology/wifi");

const QString Prefix = QStringLiteral("/net/connman/service/");
const QString Office = QStringLiteral("wifi_02c0ffee0001_436f7276616e65204f6666696365_managed_psk");
const QString Home = QStringLiteral("wifi_02c0ffee0001_486f6d65_managed_psk");
const QString Cafe = QStringLiteral("wifi_02c0ffee0001_53746174696f6e2043616665_managed_none");

const QVariantMap Manual{{QStringLiteral("Method"), QStringLiteral("manual")},
                         {QStringLiteral("Servers"), QStringList(QStringLiteral("http://proxy:3128"))},
                         {QStringLiteral("Excludes"), QStringList(QStringLiteral("localhost"))}};
const QVariantMap Direct{{QStringLiteral("Method"), QStringLiteral("direct")}};

QStringList list(const char *text)
{
    return QString::fromUtf8(text).split(QLatin1Char('|'), Qt::SkipEmptyParts);
}

QStringList names(const QVector<NetworkService *> &services)
{
    QStringList result;
    for (const NetworkService *service : services)
        result.append(service->name());
    return result;
}

QStringList names(const QVector<NetworkTechnology *> &technologies)
{
    QStringList result;
    for (const NetworkTechnology *technology : technologies)
        result.append(technology->name());
    return result;
}

/** The networks as "ServicesChanged" and "GetServices" have them. */
QVariant wireList(const QVector<std::pair<QString, QVariantMap>> &services)
{
    return WireObject::list(Prefix, services);
}

} // namespace

/** The clients of the connection manager, which the networking features are built on. */
class ConnManClientsTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void init();
    void cleanup();

    void isAvailableFromTheBeginning();
    void asksOnce();
    void isAwayFromTheBeginning();
    void eachThreadHasItsOwn();
    void followsTheService();
    void needsAllAnswers_data();
    void needsAllAnswers();

    void listsTechnologies();
    void technologiesComeAndGo();
    void technologiesCanBeLeftOut();
    void switchesPower();
    void switchesOfflineMode();

    void listsSavedServices();
    void servicesComeAndGo();
    void servicesKeepTheConnectionManagersOrder();
    void strangeListsAreLeftAlone();
    void servicesSurviveARestart();
    void serviceThatIsGoneAfterARestart();
    void writesAndHearsOfProxies();
    void everyAnnouncementIsSignalled();
    void strangeProxiesAreEmpty();
    void loadsWhatTheListLeavesOut();
    void followsAPath();
    void resetsCounters();

    void registersCounters();
    void refusalsAreLogged();
    void requestsToNobodyAreLogged();
    void networkThatVanishesDuringARequest();

private:
    void act(const char *action, const QStringList &arguments)
    {
        m_phone->act(QLatin1String(action), arguments);
    }
    void settle() { m_phone->settle(Service); }
    static NetworkService *saved(const QString &identifier);
    NetworkManager *validManager() const;

    std::unique_ptr<Phone> m_phone;
};

void ConnManClientsTest::initTestCase()
{
    WireObject::registerTypes();
    m_phone = std::make_unique<Phone>();
}

void ConnManClientsTest::init()
{
    m_phone->takeJournal(Service);
}

void ConnManClientsTest::cleanup()
{
    m_phone->clearFaults();
    m_phone->startService(Service);
    QVERIFY(waitUntil([] { return NetworkManagerFactory::createInstance()->isValid(); }));
    settle();
}

NetworkService *ConnManClientsTest::saved(const QString &identifier)
{
    for (NetworkService *service : NetworkManagerFactory::createInstance()->getSavedServices()) {
        if (service->path() == Prefix + identifier)
            return service;
    }
    return nullptr;
}

NetworkManager *ConnManClientsTest::validManager() const
{
    NetworkManager *manager = NetworkManagerFactory::createInstance();
    return waitUntil([&] { return manager->isValid(); }) ? manager : nullptr;
}

void ConnManClientsTest::isAvailableFromTheBeginning()
{
    NetworkManager *manager = NetworkManagerFactory::createInstance();
    QVERIFY(manager->isAvailable());
    QVERIFY(!manager->isValid());
    QVERIFY(manager->getTechnologies().isEmpty());
    QVERIFY(!manager->getTechnology(QStringLiteral("wifi")));
    QVERIFY(manager->getSavedServices().isEmpty());
    QCOMPARE(NetworkManagerFactory::createInstance(), manager);

    SignalSequence seen(manager);
    QVERIFY(seen.waitFor(2));
    QVERIFY(manager->isValid());
    QCOMPARE(seen.take(), list("technologiesChanged()|validChanged(true)"));
}

void ConnManClientsTest::asksOnce()
{
    m_phone->stopService(Service);
    m_phone->startService(Service);
    SignalSequence seen(NetworkManagerFactory::createInstance());
    QVERIFY(waitUntil([&] { return seen.signalsSeen().contains(QStringLiteral("validChanged(true)")); }));
    settle();
    QCOMPARE(m_phone->takeJournal(Service), list("/ GetProperties ()|/ GetTechnologies ()|/ GetServices ()"));
}

void ConnManClientsTest::isAwayFromTheBeginning()
{
    m_phone->stopService(Service);
    bool wasAvailable = true;
    std::unique_ptr<QThread> thread(
        QThread::create([&] { wasAvailable = NetworkManagerFactory::createInstance()->isAvailable(); }));
    thread->start();
    QVERIFY(thread->wait());
    QVERIFY(!wasAvailable);
}

void ConnManClientsTest::eachThreadHasItsOwn()
{
    NetworkManager *manager = nullptr;
    std::unique_ptr<QThread> thread(QThread::create([&] {
        manager = NetworkManagerFactory::createInstance();
        waitUntil([&] { return manager->isValid(); });
    }));
    thread->start();
    QVERIFY(thread->wait());
    QVERIFY(manager != NetworkManagerFactory::createInstance());
}

void ConnManClientsTest::followsTheService()
{
    NetworkManager *manager = validManager();
    SignalSequence seen(manager);
    m_phone->stopService(Service);
    QVERIFY(seen.waitFor(3));
    QVERIFY(!manager->isAvailable());
    QVERIFY(!manager->isValid());
    QVERIFY(manager->getTechnologies().isEmpty());
    QVERIFY(manager->getSavedServices().isEmpty());
    QCOMPARE(seen.take(), list("technologiesChanged()|validChanged(false)|availabilityChanged(false)"));

    m_phone->startService(Service);
    QVERIFY(seen.waitFor(3));
    settle();
    QCOMPARE(seen.take(), list("availabilityChanged(true)|technologiesChanged()|validChanged(true)"));
    QCOMPARE(manager->getTechnologies().size(), 3);
}

void ConnManClientsTest::needsAllAnswers_data()
{
    QTest::addColumn<QString>("method");
    QTest::addColumn<bool>("fails");
    for (const char *method : {"GetProperties", "GetTechnologies", "GetServices"}) {
        QTest::addRow("%s fails", method) << QString::fromLatin1(method) << true;
        QTest::addRow("%s is answered with something else", method) << QString::fromLatin1(method) << false;
    }
}

void ConnManClientsTest::needsAllAnswers()
{
    QFETCH(QString, method);
    QFETCH(bool, fails);
    NetworkManager *manager = validManager();
    m_phone->stopService(Service);
    QVERIFY(waitUntil([&] { return !manager->isAvailable(); }));
    if (fails)
        m_phone->failCalls(Service, Root, method, QStringLiteral("net.connman.Error.Failed"), QString());
    else
        m_phone->answerCalls(Service, Root, method, {QStringLiteral("odd")});
    MessageLog log;
    m_phone->startService(Service);
    QVERIFY(waitUntil([&] { return manager->isAvailable(); }));
    settle();
    QVERIFY(!manager->isValid());
    QCOMPARE(log.takeWarnings(),
             QStringList(QStringLiteral("The connection manager gave no answer to \"%1\"").arg(method)));
    m_phone->stopService(Service);
    QVERIFY(waitUntil([&] { return !manager->isAvailable(); }));
}

void ConnManClientsTest::listsTechnologies()
{
    NetworkManager *manager = validManager();
    QCOMPARE(names(manager->getTechnologies()), list("Wired|WiFi|Cellular"));
    const NetworkTechnology *wifi = manager->getTechnology(QStringLiteral("wifi"));
    QVERIFY(wifi);
    QCOMPARE(wifi->path(), WifiPath);
    QCOMPARE(wifi->type(), QStringLiteral("wifi"));
    QVERIFY(wifi->powered());
    QVERIFY(!manager->getTechnology(QStringLiteral("WiFi")));
}

void ConnManClientsTest::technologiesComeAndGo()
{
    NetworkManager *manager = validManager();
    SignalSequence seen(manager);
    QSignalSpy destroyed(manager->getTechnology(QStringLiteral("wifi")), &QObject::destroyed);
    act("technology remove", {QStringLiteral("wifi")});
    QVERIFY(seen.waitFor(1));
    QVERIFY(!manager->getTechnology(QStringLiteral("wifi")));
    QVERIFY(waitUntil([&] { return destroyed.size() == 1; }));
    act("technology add", {QStringLiteral("wifi")});
    QVERIFY(seen.waitFor(2));
    QVERIFY(manager->getTechnology(QStringLiteral("wifi")));
    QCOMPARE(names(manager->getTechnologies()), list("Wired|Cellular|WiFi"));

    // One that is known already, and one that never was.
    m_phone->emitSignal(
        Service, Root, ManagerInterface, QStringLiteral("TechnologyAdded"),
        {QVariant::fromValue(QDBusObjectPath(WifiPath)), QVariantMap{{QStringLiteral("Powered"), false}}});
    m_phone->emitSignal(Service, Root, ManagerInterface, QStringLiteral("TechnologyRemoved"),
                        {QVariant::fromValue(QDBusObjectPath(QStringLiteral("/nowhere")))});
    QVERIFY(!manager->getTechnology(QStringLiteral("wifi"))->powered());
    QCOMPARE(seen.take(), list("technologiesChanged()|technologiesChanged()"));
}

void ConnManClientsTest::technologiesCanBeLeftOut()
{
    NetworkManager *manager = validManager();
    SignalSequence seen(manager);
    QVERIFY(manager->technologiesEnabled());
    manager->setTechnologiesEnabled(false);
    manager->setTechnologiesEnabled(false);
    QVERIFY(!manager->technologiesEnabled());
    QVERIFY(manager->getTechnologies().isEmpty());
    QVERIFY(!manager->getTechnology(QStringLiteral("wifi")));
    act("technology remove", {QStringLiteral("wifi")});
    act("technology add", {QStringLiteral("wifi")});
    settle();
    manager->setTechnologiesEnabled(true);
    QVERIFY(manager->getTechnology(QStringLiteral("wifi")));
    QCOMPARE(seen.take(),
             list("technologiesEnabledChanged(false)|technologiesChanged()|"
                  "technologiesEnabledChanged(true)|technologiesChanged()"));
}

void ConnManClientsTest::switchesPower()
{
    NetworkManager *manager = validManager();
    NetworkTechnology *wifi = manager->getTechnology(QStringLiteral("wifi"));
    SignalSequence seen(wifi);
    wifi->setPowered(false);
    QVERIFY(wifi->powered());
    QVERIFY(seen.waitFor(1));
    QVERIFY(!wifi->powered());
    // Its networks have gone with it.
    settle();
    QCOMPARE(names(manager->getSavedServices(QStringLiteral("wifi"))), QStringList());
    act("technology power", {QStringLiteral("wifi"), QStringLiteral("on")});
    QVERIFY(seen.waitFor(2));
    settle();
    QCOMPARE(seen.take(), list("poweredChanged(false)|poweredChanged(true)"));
    QCOMPARE(manager->getSavedServices(QStringLiteral("wifi")).size(), 2);
    QCOMPARE(m_phone->takeJournal(Service).first(),
             WifiPath + QStringLiteral(" SetProperty ('Powered', <false>)"));
}

void ConnManClientsTest::switchesOfflineMode()
{
    NetworkManager *manager = validManager();
    SignalSequence seen(manager);
    QVERIFY(!manager->offlineMode());
    manager->setOfflineMode(true);
    QVERIFY(!manager->offlineMode());
    QVERIFY(seen.waitFor(1));
    QVERIFY(manager->offlineMode());
    QVERIFY(waitUntil([&] { return !manager->getTechnology(QStringLiteral("wifi"))->powered(); }));
    act("flight-mode", {QStringLiteral("off")});
    QVERIFY(seen.waitFor(2));
    settle();
    QCOMPARE(seen.take(), list("offlineModeChanged(true)|offlineModeChanged(false)"));
    QCOMPARE(m_phone->takeJournal(Service), list("/ SetProperty ('OfflineMode', <true>)"));
}

void ConnManClientsTest::listsSavedServices()
{
    const NetworkManager *manager = validManager();
    QCOMPARE(names(manager->getSavedServices(QStringLiteral("wifi"))), list("Corvane Office|Home"));
    // What a technology is called does as well as its type.
    QCOMPARE(names(manager->getSavedServices(QStringLiteral("WiFi"))), list("Corvane Office|Home"));
    QCOMPARE(names(manager->getSavedServices(QStringLiteral("ethernet"))), QStringList());
    QCOMPARE(names(manager->getSavedServices(QStringLiteral("nothing"))), QStringList());
    QVERIFY(manager->getSavedServices().size() >= 2);
    const NetworkService *office = saved(Office);
    QVERIFY(office);
    QCOMPARE(office->name(), QStringLiteral("Corvane Office"));
    QCOMPARE(office->type(), QStringLiteral("wifi"));
    QVERIFY(office->saved());
    QVERIFY(!saved(Cafe));
}

void ConnManClientsTest::servicesComeAndGo()
{
    const NetworkManager *manager = validManager();
    QSignalSpy destroyed(saved(Home), &QObject::destroyed);
    act("connection vanish", {Home});
    QVERIFY(waitUntil([&] { return destroyed.size() == 1; }));
    QVERIFY(!saved(Home));
    act("connection return", {Home});
    QVERIFY(waitUntil([&] { return saved(Home) != nullptr; }));
    act("wifi appear", {QStringLiteral("Guests"), QStringLiteral("none"), QStringLiteral("saved")});
    QVERIFY(waitUntil([&] { return names(manager->getSavedServices()).contains(QStringLiteral("Guests")); }));
    act("connection vanish", {QStringLiteral("wifi_02c0ffee0001_477565737473_managed_none")});
    QVERIFY(
        waitUntil([&] { return !names(manager->getSavedServices()).contains(QStringLiteral("Guests")); }));
}

void ConnManClientsTest::servicesKeepTheConnectionManagersOrder()
{
    const NetworkManager *manager = validManager();
    const NetworkService *office = saved(Office);
    m_phone->emitSignal(Service, Root, ManagerInterface, QStringLiteral("ServicesChanged"),
                        {wireList({{Home, {}}, {Office, {}}, {Home, {}}}), WireObject::paths({})});
    QCOMPARE(names(manager->getSavedServices(QStringLiteral("wifi"))), list("Home|Corvane Office"));
    QCOMPARE(saved(Office), office);
}

void ConnManClientsTest::strangeListsAreLeftAlone()
{
    const NetworkManager *manager = validManager();
    const QStringList before = names(manager->getSavedServices());
    const QList<QVariantList> strange{
        {},
        {7},
        {QStringList(Home), QStringList(Home)},
        {wireList({})},
        {wireList({}), QStringList(Prefix + Home)},
    };
    for (const QVariantList &arguments : strange)
        m_phone->emitSignal(Service, Root, ManagerInterface, QStringLiteral("ServicesChanged"), arguments);
    QCOMPARE(names(manager->getSavedServices()), before);
}

void ConnManClientsTest::servicesSurviveARestart()
{
    const NetworkManager *manager = validManager();
    NetworkService *home = saved(Home);
    act("connection proxy", {Home, QStringLiteral("auto")});
    settle();
    SignalSequence seen(home);
    QSignalSpy destroyed(home, &QObject::destroyed);
    m_phone->stopService(Service);
    QVERIFY(waitUntil([&] { return !manager->isAvailable(); }));
    QCOMPARE(home->name(), QStringLiteral("Home"));
    act("connection proxy", {Home, QStringLiteral("direct")});
    m_phone->startService(Service);
    QVERIFY(waitUntil([&] { return manager->isValid(); }));
    settle();
    QCOMPARE(saved(Home), home);
    QCOMPARE(destroyed.size(), 0);
    QCOMPARE(home->proxyConfig(), Direct);
    QCOMPARE(seen.take(), list("proxyConfigChanged({Method=direct})"));
    // A list that tells what is known already confirms nothing.
    m_phone->emitSignal(
        Service, Root, ManagerInterface, QStringLiteral("ServicesChanged"),
        {wireList({{Home, {{QStringLiteral("Proxy.Configuration"), Direct}}}}), WireObject::paths({})});
    QCOMPARE(seen.take(), QStringList());
}

void ConnManClientsTest::serviceThatIsGoneAfterARestart()
{
    const NetworkManager *manager = validManager();
    QSignalSpy destroyed(saved(Home), &QObject::destroyed);
    m_phone->stopService(Service);
    QVERIFY(waitUntil([&] { return !manager->isAvailable(); }));
    QCOMPARE(destroyed.size(), 0);
    act("connection vanish", {Home});
    m_phone->startService(Service);
    QVERIFY(waitUntil([&] { return destroyed.size() == 1; }));
    act("connection return", {Home});
    QVERIFY(waitUntil([&] { return saved(Home) != nullptr; }));
}

void ConnManClientsTest::writesAndHearsOfProxies()
{
    QVERIFY(validManager());
    NetworkService *home = saved(Home);
    SignalSequence seen(home);
    home->setProxyConfig(Manual);
    QVERIFY(seen.waitFor(1));
    QCOMPARE(home->proxyConfig(), Manual);
    QCOMPARE(seen.take(),
             list("proxyConfigChanged({Excludes=localhost Method=manual "
                  "Servers=http://proxy:3128})"));
    QCOMPARE(m_phone->takeJournal(Service),
             QStringList(Prefix + Home
                         + QStringLiteral(" SetProperty ('Proxy.Configuration', <{'Excludes': "
                                          "<['localhost']>, 'Method': <'manual'>, 'Servers': "
                                          "<['http://proxy:3128']>}>)")));
    home->setProxyConfig(Direct);
    QVERIFY(seen.waitFor(1));
    QCOMPARE(home->proxyConfig(), Direct);
}

void ConnManClientsTest::everyAnnouncementIsSignalled()
{
    QVERIFY(validManager());
    NetworkService *home = saved(Home);
    home->setProxyConfig(Direct);
    settle();
    SignalSequence seen(home);
    home->setProxyConfig(Direct);
    home->setProxyConfig(Direct);
    QVERIFY(seen.waitFor(2));
}

void ConnManClientsTest::strangeProxiesAreEmpty()
{
    QVERIFY(validManager());
    NetworkService *home = saved(Home);
    home->setProxyConfig(Direct);
    settle();
    SignalSequence seen(home);
    for (const QVariant &value :
         {QVariant(5), QVariant(QStringLiteral("direct")), QVariant(QStringList{QStringLiteral("direct")}),
          QVariant::fromValue(QList<QDBusObjectPath>{QDBusObjectPath(Root)})}) {
        m_phone->emitSignal(
            Service, Prefix + Home, ServiceInterface, QStringLiteral("PropertyChanged"),
            {QStringLiteral("Proxy.Configuration"), QVariant::fromValue(QDBusVariant(value))});
        QCOMPARE(seen.take(), list("proxyConfigChanged({})"));
        QCOMPARE(home->proxyConfig(), QVariantMap());
    }
}

void ConnManClientsTest::loadsWhatTheListLeavesOut()
{
    const NetworkManager *manager = validManager();
    m_phone->swallowCalls(Service, Prefix + Cafe, QStringLiteral("GetProperties"));
    m_phone->emitSignal(
        Service, Root, ManagerInterface, QStringLiteral("ServicesChanged"),
        {wireList({}), QVariant::fromValue(QList<QDBusObjectPath>{QDBusObjectPath(Prefix + Cafe)})});
    m_phone->emitSignal(Service, Root, ManagerInterface, QStringLiteral("ServicesChanged"),
                        {wireList({{Cafe, {{QStringLiteral("Favorite"), true}}}}), WireObject::paths({})});
    NetworkService *cafe = saved(Cafe);
    QVERIFY(cafe);
    QCOMPARE(cafe->name(), QString());
    SignalSequence seen(cafe);

    // The next list finds it still unknown, and this time there is an answer.
    m_phone->clearFaults();
    m_phone->emitSignal(Service, Root, ManagerInterface, QStringLiteral("ServicesChanged"),
                        {wireList({{Cafe, {}}}), WireObject::paths({})});
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), list("propertiesReady()"));
    QCOMPARE(cafe->name(), QStringLiteral("Station Cafe"));
    QCOMPARE(cafe->type(), QStringLiteral("wifi"));
    // It is not saved after all.
    QVERIFY(!names(manager->getSavedServices()).contains(cafe->name()));
}

void ConnManClientsTest::followsAPath()
{
    QVERIFY(validManager());
    saved(Home)->setProxyConfig(Direct);
    QVERIFY(waitUntil([&] { return saved(Home)->proxyConfig() == Direct; }));
    settle();

    NetworkService follower;
    SignalSequence seen(&follower);
    QCOMPARE(follower.path(), QString());
    follower.setProxyConfig(Manual); // of nothing
    follower.setPath(Prefix + Home);
    QCOMPARE(follower.path(), Prefix + Home);
    QCOMPARE(follower.name(), QStringLiteral("Home"));
    QCOMPARE(follower.type(), QStringLiteral("wifi"));
    QVERIFY(follower.saved());
    QCOMPARE(seen.take(), list("proxyConfigChanged({Method=direct})|propertiesReady()"));
    follower.setPath(Prefix + Home);
    QCOMPARE(seen.take(), QStringList());

    act("connection proxy", {Home, QStringLiteral("auto"), QStringLiteral("http://pac")});
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), list("proxyConfigChanged({Method=auto URL=http://pac})"));
    QCOMPARE(saved(Home)->proxyConfig(), follower.proxyConfig());

    follower.setPath(Prefix + QStringLiteral("wifi_nowhere"));
    QCOMPARE(follower.name(), QString());
    QCOMPARE(follower.proxyConfig(), QVariantMap());
    // It comes later.
    m_phone->emitSignal(
        Service, Root, ManagerInterface, QStringLiteral("ServicesChanged"),
        {wireList({{QStringLiteral("wifi_nowhere"), {{QStringLiteral("Name"), QStringLiteral("Nowhere")}}}}),
         WireObject::paths({})});
    QCOMPARE(seen.take(), list("propertiesReady()"));
    QCOMPARE(follower.name(), QStringLiteral("Nowhere"));
    m_phone->emitSignal(Service, Root, ManagerInterface, QStringLiteral("ServicesChanged"),
                        {wireList({}),
                         QVariant::fromValue(QList<QDBusObjectPath>{
                             QDBusObjectPath(Prefix + QStringLiteral("wifi_nowhere"))})});
}

void ConnManClientsTest::resetsCounters()
{
    QVERIFY(validManager());
    act("connection traffic", {Home, QStringLiteral("100"), QStringLiteral("50")});
    NetworkService service;
    service.setPath(Prefix + Home);
    service.resetCounters();
    settle();
    QCOMPARE(m_phone->takeJournal(Service), QStringList(Prefix + Home + QStringLiteral(" ResetCounters ()")));
}

void ConnManClientsTest::registersCounters()
{
    NetworkManager *manager = validManager();
    manager->registerCounter(QStringLiteral("/counter"), 10, 60);
    settle();
    QCOMPARE(m_phone->state()
                 .value(QLatin1String("network"))
                 .toObject()
                 .value(QLatin1String("counters"))
                 .toArray()
                 .size(),
             1);
    manager->unregisterCounter(QStringLiteral("/counter"));
    settle();
    QCOMPARE(m_phone->takeJournal(Service),
             list("/ RegisterCounter (objectpath '/counter', uint32 10, uint32 60)|"
                  "/ UnregisterCounter (objectpath '/counter',)"));
}

void ConnManClientsTest::refusalsAreLogged()
{
    NetworkManager *manager = validManager();
    MessageLog log;
    manager->unregisterCounter(QStringLiteral("/unknown"));
    saved(Home)->setProxyConfig({{QStringLiteral("Method"), QStringLiteral("odd")}});
    manager->getTechnology(QStringLiteral("wifi"))->setPowered(true);
    settle();
    QCOMPARE(log.takeWarnings(),
             QStringList({QStringLiteral("The connection manager refused \"UnregisterCounter\" of \"/\" "
                                         "QDBusError(\"net.connman.Error.NotRegistered\", \"Not "
                                         "registered\")"),
                          QStringLiteral("The connection manager refused \"SetProperty\" of \"%1\" "
                                         "QDBusError(\"net.connman.Error.InvalidArguments\", \"Invalid "
                                         "arguments\")")
                              .arg(Prefix + Home),
                          QStringLiteral("The connection manager refused \"SetProperty\" of \"%1\" "
                                         "QDBusError(\"net.connman.Error.AlreadyEnabled\", \"Already "
                                         "enabled\")")
                              .arg(WifiPath)}));
}

void ConnManClientsTest::requestsToNobodyAreLogged()
{
    NetworkManager *manager = validManager();
    NetworkService service;
    service.setPath(QStringLiteral("no slash"));
    MessageLog log;
    service.resetCounters();
    settle();
    // Qt's own words come first.
    QVERIFY(log.takeWarnings().last().startsWith(
        QLatin1String("The connection manager refused \"ResetCounters\" of \"no slash\" QDBusError(")));

    m_phone->stopService(Service);
    QVERIFY(waitUntil([&] { return !manager->isAvailable(); }));
    manager->setOfflineMode(true);
    QCOMPARE(log.takeWarnings(),
             QStringList(QStringLiteral("The connection manager is away: \"SetProperty\" of \"/\"")));
    QVERIFY(!manager->offlineMode());
}

void ConnManClientsTest::networkThatVanishesDuringARequest()
{
    QVERIFY(validManager());
    NetworkService *home = saved(Home);
    QSignalSpy destroyed(home, &QObject::destroyed);
    m_phone->delayCalls(Service, Prefix + Home, QStringLiteral("SetProperty"), 50);
    MessageLog log;
    home->setProxyConfig(Manual);
    home->setProxyConfig({});
    settle();
    act("connection vanish", {Home});
    QVERIFY(waitUntil([&] { return destroyed.size() == 1; }));
    // The answers still come, and nobody minds.
    QStringList warnings;
    QVERIFY(waitUntil([&] {
        warnings += log.takeWarnings();
        return !warnings.isEmpty();
    }));
    QVERIFY(warnings.first().contains(QLatin1String("net.connman.Error.InvalidArguments")));
    act("connection return", {Home});
    QVERIFY(waitUntil([&] { return saved(Home) != nullptr; }));
    QCOMPARE(saved(Home)->proxyConfig(), Manual);
}

QTEST_GUILESS_MAIN(ConnManClientsTest)

#include "connmanclients_test.moc"
