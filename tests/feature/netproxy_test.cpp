// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"
#include "waiting.h"
#include "wireobject.h"

#include <corvanemdm/netproxy.h>

#include <QtCore/QRegularExpression>
#include <QtDBus/QDBusVariant>
#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::NetProxy;

namespace
{

const QString Service = QStringLiteral("net.connman");
const QString Root = QStringLiteral("/");
const QString ManagerInterface = QStringLiteral("net.connman.Manager");
const QString ServiceInterface = QStringLiteral("net.connman.Service");
const QString GlobalInterface = QStringLiteral("org.corvaneos.connman.GlobalProxy");
const QString PropertyChanged = QStringLiteral("PropertyChanged");

const QString Prefix = QStringLiteral("/net/connman/service/");
const QString Office = QStringLiteral("wifi_02c0ffee0001_436f7276616e65204f6666696365_managed_psk");
const QString Home = QStringLiteral("wifi_02c0ffee0001_486f6d65_managed_psk");
const QString Cafe = QStringLiteral("wifi_02c0ffee0001_53746174696f6e2043616665_managed_none");
const QString Global = QStringLiteral("global");

const QString DirectSent = QStringLiteral("<{'Method': <'direct'>}>");

QStringList list(const char *text)
{
    return QString::fromUtf8(text).split(QLatin1Char('|'), Qt::SkipEmptyParts);
}

QList<QUrl> urls(const char *text)
{
    return QUrl::fromStringList(list(text));
}

QString manualSent(const char *servers, const char *excludes)
{
    return QStringLiteral("<{'Excludes': <%1>, 'Method': <'manual'>, 'Servers': <%2>}>")
        .arg(QString::fromUtf8(excludes), QString::fromUtf8(servers));
}

QString automaticSent(const char *url)
{
    return QStringLiteral("<{'Method': <'auto'>, 'URL': <'%1'>}>").arg(QString::fromUtf8(url));
}

} // namespace

/** The proxies of networks and of the phone, by what the connection manager hears and says. */
class NetProxyTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void init();
    void cleanup();

    void metaObject_data();
    void metaObject();
    void freshObject();
    void becomesValidWithTheGlobalProxy();
    void keepsAnEarlierSelection();
    void firstReadingIsSilent();
    void firstReadingStandsUntilTheNextAnnouncement();
    void announcementsMakeItValid();
    void withoutTheConnectionManager();
    void globalProxyThatCannotBeRead_data();
    void globalProxyThatCannotBeRead();
    void globalProxyThatIsNoVariant();

    void selectsAndUnselects();
    void selectsNothingThatIsNotSaved_data();
    void selectsNothingThatIsNotSaved();
    void selectsNoNetworkWhileInvalid();
    void listsIdentifiersAndTechnologies();

    void readsTheSelectedConfiguration_data();
    void readsTheSelectedConfiguration();
    void writes_data();
    void writes();
    void incompleteConfigurationsWait_data();
    void incompleteConfigurationsWait();
    void invalidTypesAreRefused_data();
    void invalidTypesAreRefused();
    void writingWhatIsNotKnownYet();
    void refusedWritesAreNeverConfirmed();

    void announcesInOrder_data();
    void announcesInOrder();
    void confirmedChangesAreAnnounced_data();
    void confirmedChangesAreAnnounced();
    void exclusionsAloneAreNotAnnounced();
    void strangeConfigurationsOfNetworks();
    void changesOfOthersAreSilent();
    void selectionIsSilent();
    void networkThatIsNotReadyIsSilent();
    void networkThatBecomesReadyIsSilent();

    void switchesTheActiveType();
    void refusedActiveType();
    void everyAnnouncementOfTheActiveType();
    void unknownProperty();
    void configurationOfAnotherType();

    void networkThatVanishes();
    void connectionManagerThatRestarts();
    void objectsAreIndependent();
    void mayBeDeletedAtAnySignal();
    void worksThroughTheMetaObject();
    void queuedConnectionsDeliver();

private:
    void act(const char *action, const QStringList &arguments)
    {
        m_phone->act(QLatin1String(action), arguments);
    }
    void settle() { m_phone->settle(Service); }
    void propertyChanged(const char *name, const QVariant &value)
    {
        m_phone->emitSignal(Service, Root, GlobalInterface, PropertyChanged,
                            {QString::fromLatin1(name), QVariant::fromValue(QDBusVariant(value))});
    }
    /** Somebody else configures what @p identifier names, a network or the global proxy. */
    void configure(const QString &identifier, const QStringList &words);
    /** What was written to what @p identifier names. */
    QStringList written(const QString &identifier);
    static std::unique_ptr<NetProxy> selected(const QString &identifier);

    std::unique_ptr<Phone> m_phone;
};

void NetProxyTest::initTestCase()
{
    WireObject::registerTypes();
    m_phone = std::make_unique<Phone>();
}

void NetProxyTest::init()
{
    m_phone->takeJournal(Service);
}

void NetProxyTest::cleanup()
{
    m_phone->clearFaults();
    m_phone->startService(Service);
    act("proxy active", {QStringLiteral("off")});
    for (const QString &identifier : {Global, Office, Home})
        configure(identifier, {QStringLiteral("direct")});
    NetProxy proxy;
    QVERIFY(waitUntil([&] { return proxy.isValid(); }));
    settle();
}

void NetProxyTest::configure(const QString &identifier, const QStringList &words)
{
    if (identifier == Global)
        act("proxy configure", words);
    else
        act("connection proxy", QStringList(identifier) + words);
}

QStringList NetProxyTest::written(const QString &identifier)
{
    settle();
    const QString call = identifier == Global
        ? QStringLiteral("/ org.corvaneos.connman.GlobalProxy.SetProperty ('Configuration', ")
        : Prefix + identifier + QStringLiteral(" net.connman.Service.SetProperty ('Proxy.Configuration', ");
    QStringList values;
    const QStringList calls = m_phone->takeJournalWithInterfaces(Service);
    for (const QString &each : calls) {
        if (each.startsWith(call))
            values.append(each.mid(call.size(), each.size() - call.size() - 1));
        else if (each.contains(QLatin1String("SetProperty")))
            values.append(each);
    }
    return values;
}

std::unique_ptr<NetProxy> NetProxyTest::selected(const QString &identifier)
{
    auto proxy = std::make_unique<NetProxy>();
    if (!waitUntil([&] { return proxy->isValid(); }) || !proxy->selectProxy(identifier))
        qFatal("%s cannot be selected", qPrintable(identifier));
    return proxy;
}

void NetProxyTest::metaObject_data()
{
    QTest::addColumn<bool>("isWritable");
    QTest::addColumn<QByteArray>("type");
    QTest::addColumn<QByteArray>("notification");
    const auto row = [](const char *property, bool isWritable, const char *type, const char *notification) {
        QTest::newRow(property) << isWritable << QByteArray(type) << QByteArray(notification);
    };
    row("valid", false, "bool", "validChanged(bool)");
    row("type", true, "Corvane::Mdm::NetProxy::ProxyType", "typeChanged(ProxyType)");
    row("manualProxies", true, "QList<QUrl>", "manualProxiesChanged(QList<QUrl>)");
    row("manualExclusions", true, "QStringList", "manualExclusionsChanged(QStringList)");
    row("automaticUrl", true, "QUrl", "automaticUrlChanged(QUrl)");
    row("activeType", true, "Corvane::Mdm::NetProxy::ActiveType", "activeTypeChanged(ActiveType)");
}

void NetProxyTest::metaObject()
{
    QFETCH(bool, isWritable);
    const QMetaObject &meta = NetProxy::staticMetaObject;
    const QMetaProperty property = meta.property(meta.indexOfProperty(QTest::currentDataTag()));
    QVERIFY(property.isReadable());
    QCOMPARE(property.isWritable(), isWritable);
    QTEST(QByteArray(property.typeName()), "type");
    QTEST(property.notifySignal().methodSignature(), "notification");

    QCOMPARE(meta.propertyCount() - QObject::staticMetaObject.propertyCount(), 6);
    QVERIFY(meta.indexOfSignal("proxyConfigChanged()") >= 0);
    QCOMPARE(QByteArray(meta.enumerator(meta.enumeratorOffset()).name()), QByteArray("ProxyType"));
    const auto types = QMetaEnum::fromType<NetProxy::ProxyType>();
    const auto activeTypes = QMetaEnum::fromType<NetProxy::ActiveType>();
    for (const auto &[key, value] : {std::pair("Invalid", 0), {"Direct", 1}, {"Manual", 2}, {"Automatic", 3}})
        QCOMPARE(types.keyToValue(key), value);
    QCOMPARE(types.keyCount(), 4);
    QCOMPARE(activeTypes.keyToValue("Service"), 0);
    QCOMPARE(activeTypes.keyToValue("Global"), 1);
    QCOMPARE(activeTypes.keyCount(), 2);
    // Methods are no slots.
    for (int index = meta.methodOffset(); index < meta.methodCount(); ++index)
        QCOMPARE(meta.method(index).methodType(), QMetaMethod::Signal);
}

void NetProxyTest::freshObject()
{
    NetProxy proxy;
    QVERIFY(!proxy.isValid());
    QCOMPARE(proxy.type(), NetProxy::Invalid);
    QCOMPARE(proxy.manualProxies(), QList<QUrl>());
    QCOMPARE(proxy.manualExclusions(), QStringList());
    QCOMPARE(proxy.automaticUrl(), QUrl());
    QCOMPARE(proxy.activeType(), NetProxy::Service);
    QCOMPARE(proxy.getIdentifier(), QString());
    QCOMPARE(proxy.getName(), QString());
    QVERIFY(!proxy.setType(NetProxy::Direct));
    QVERIFY(!proxy.setManualProxies(urls("http://a:1")));
    QVERIFY(!proxy.setManualExclusions(list("a")));
    QVERIFY(!proxy.setAutomaticUrl(QUrl(QStringLiteral("http://pac"))));
    QVERIFY(!proxy.setActiveType(NetProxy::Service));
    QCOMPARE(written(Global), QStringList());
}

void NetProxyTest::becomesValidWithTheGlobalProxy()
{
    configure(Global, {QStringLiteral("auto"), QStringLiteral("http://pac")});
    act("proxy active", {QStringLiteral("on")});
    settle(); // it has been announced
    m_phone->takeJournal(Service);
    NetProxy proxy;
    SignalSequence seen(&proxy);
    QString atFirstSignal;
    connect(&proxy, &NetProxy::validChanged, this, [&] { atFirstSignal = proxy.getIdentifier(); });
    QVERIFY(seen.waitFor(1));
    settle();
    QCOMPARE(seen.take(), list("validChanged(true)"));
    QVERIFY(proxy.isValid());
    QCOMPARE(atFirstSignal, Global);
    QCOMPARE(proxy.getName(), QStringLiteral("Global Proxy"));
    QCOMPARE(proxy.type(), NetProxy::Automatic);
    QCOMPARE(proxy.automaticUrl(), QUrl(QStringLiteral("http://pac")));
    QCOMPARE(proxy.activeType(), NetProxy::Global);
    QCOMPARE(m_phone->takeJournal(Service),
             list("/ GetProperty ('Active',)|/ GetProperty ('Configuration',)"));
}

void NetProxyTest::keepsAnEarlierSelection()
{
    m_phone->swallowCalls(Service, Root, QStringLiteral("GetProperty"));
    NetProxy proxy;
    QVERIFY(proxy.selectProxy(Global));
    settle();
    QVERIFY(!proxy.isValid());
    propertyChanged("Active", false);
    propertyChanged("Configuration", QVariantMap());
    QVERIFY(proxy.isValid());
    QVERIFY(proxy.selectProxy(Home));
    // Validity lost and found again leaves the selection alone.
    QTest::ignoreMessage(QtDebugMsg, "MDM Proxy: property change: incorrect type:  QString");
    propertyChanged("Configuration", QStringLiteral("odd"));
    QVERIFY(!proxy.isValid());
    QCOMPARE(proxy.getIdentifier(), Home);
    propertyChanged("Configuration", QVariantMap());
    QVERIFY(proxy.isValid());
    QCOMPARE(proxy.getIdentifier(), Home);
}

void NetProxyTest::firstReadingIsSilent()
{
    configure(Global, list("manual|http://first:1|a"));
    act("proxy active", {QStringLiteral("on")});
    settle(); // it has been announced
    NetProxy proxy;
    QVERIFY(proxy.selectProxy(Global));
    SignalSequence seen(&proxy);
    QVERIFY(waitUntil([&] { return proxy.isValid(); }));
    settle();
    QCOMPARE(seen.take(), list("validChanged(true)"));
    QCOMPARE(proxy.manualProxies(), urls("http://first:1"));
    QCOMPARE(proxy.activeType(), NetProxy::Global);
}

void NetProxyTest::firstReadingStandsUntilTheNextAnnouncement()
{
    // Late enough for what is announced meanwhile.
    m_phone->delayCalls(Service, Root, QStringLiteral("GetProperty"), 2000);
    NetProxy proxy;
    SignalSequence seen(&proxy);
    propertyChanged("Active", true);
    QCOMPARE(proxy.activeType(), NetProxy::Global);
    QVERIFY(waitUntil([&] { return proxy.isValid(); }));
    QCOMPARE(proxy.activeType(), NetProxy::Service);
    QCOMPARE(seen.take(), list("activeTypeChanged(Global)|validChanged(true)"));
}

void NetProxyTest::announcementsMakeItValid()
{
    m_phone->swallowCalls(Service, Root, QStringLiteral("GetProperty"));
    NetProxy proxy;
    QVERIFY(proxy.selectProxy(Global));
    settle();
    SignalSequence seen(&proxy);
    propertyChanged("Configuration", QVariantMap());
    QCOMPARE(seen.take(), list("proxyConfigChanged()|typeChanged(Direct)"));
    // What has changed is told before that it is valid.
    propertyChanged("Active", true);
    QCOMPARE(seen.take(), list("activeTypeChanged(Global)|proxyConfigChanged()|validChanged(true)"));
    // Of what nobody has selected the type is told alone, and validity selects after that.
    NetProxy other;
    settle();
    SignalSequence otherSeen(&other);
    propertyChanged("Configuration", QVariantMap());
    QCOMPARE(otherSeen.take(), QStringList());
    propertyChanged("Active", true);
    QCOMPARE(otherSeen.take(), list("activeTypeChanged(Global)|validChanged(true)"));
    QCOMPARE(other.getIdentifier(), Global);
    QCOMPARE(other.type(), NetProxy::Direct);
}

void NetProxyTest::withoutTheConnectionManager()
{
    m_phone->stopService(Service);
    for (const char *message : {"^MDM Proxy: error: ", "^MDM Proxy: global proxy proxy error: "}) {
        QTest::ignoreMessage(
            QtDebugMsg,
            QRegularExpression(QLatin1String(message)
                               + QStringLiteral(".*org.freedesktop.DBus.Error.ServiceUnknown")));
    }
    NetProxy proxy;
    QVERIFY(waitUntil([&] { return proxy.getTechnologies() == list("global"); }));
    m_phone->settle(QStringLiteral("org.ofono"));
    QVERIFY(!proxy.isValid());
    QCOMPARE(proxy.getIdentifiers(QString()), list("global"));
    // It comes, and is not asked again: what it announces is what counts.
    SignalSequence seen(&proxy);
    m_phone->startService(Service);
    QVERIFY(waitUntil([&] { return proxy.getTechnologies().size() == 4; }));
    QVERIFY(!proxy.isValid());
    act("proxy active", {QStringLiteral("off")});
    act("proxy configure", {QStringLiteral("direct")});
    QVERIFY(seen.waitFor(2));
    QCOMPARE(seen.take(), list("activeTypeChanged(Service)|validChanged(true)"));
}

void NetProxyTest::globalProxyThatCannotBeRead_data()
{
    QTest::addColumn<QString>("property");
    QTest::addColumn<QVariant>("answer"); // invalid: an error
    QTest::addColumn<QString>("active");
    QTest::addColumn<QString>("configuration");
    QTest::newRow("error")
        << "Active" << QVariant()
        << "^MDM Proxy: error:  QDBusError\\(\"net.connman.Error.Failed\", \"no\"\\)$"
        << "^MDM Proxy: global proxy proxy error:  QDBusError\\(\"net.connman.Error.Failed\", "
           "\"no\"\\)$";
    QTest::newRow("a string") << "both" << QVariant(QStringLiteral("true"))
                              << "^MDM Proxy: incorrect return type for Action query$"
                              << "^MDM Proxy: incorrect type:  QString$";
    QTest::newRow("a list") << "both" << QVariant(QStringList(QStringLiteral("a")))
                            << "^MDM Proxy: incorrect return type for Action query$"
                            << "^MDM Proxy: incorrect type:  QStringList$";
    QTest::newRow("a boolean") << "Configuration" << QVariant(true) << QString()
                               << "^MDM Proxy: incorrect type:  bool$";
    QTest::newRow("a dictionary") << "Active" << QVariant(QVariantMap())
                                  << "^MDM Proxy: incorrect return type for Action query$" << QString();
}

void NetProxyTest::globalProxyThatCannotBeRead()
{
    QFETCH(QVariant, answer);
    QFETCH(QString, active);
    QFETCH(QString, configuration);
    if (answer.isValid()) {
        m_phone->answerCalls(Service, Root, QStringLiteral("GetProperty"),
                             {QVariant::fromValue(QDBusVariant(answer))});
    } else {
        m_phone->failCalls(Service, Root, QStringLiteral("GetProperty"),
                           QStringLiteral("net.connman.Error.Failed"), QStringLiteral("no"));
    }
    for (const QString &message : {active, configuration}) {
        if (!message.isEmpty())
            QTest::ignoreMessage(QtDebugMsg, QRegularExpression(message));
    }
    NetProxy proxy;
    SignalSequence seen(&proxy);
    QVERIFY(waitUntil([&] { return proxy.getTechnologies().size() == 4; }));
    settle();
    QVERIFY(!proxy.isValid());
    QCOMPARE(proxy.getIdentifier(), QString());
    QCOMPARE(seen.take(), QStringList());

    // What is announced later mends it.
    propertyChanged("Active", true);
    propertyChanged("Configuration", QVariantMap{{QStringLiteral("Method"), QStringLiteral("direct")}});
    QVERIFY(proxy.isValid());
    QCOMPARE(proxy.activeType(), NetProxy::Global);
    QCOMPARE(proxy.getIdentifier(), Global);
}

void NetProxyTest::globalProxyThatIsNoVariant()
{
    m_phone->answerCalls(Service, Root, QStringLiteral("GetProperty"), {true});
    for (const char *message : {"^MDM Proxy: error:  ", "^MDM Proxy: global proxy proxy error:  "}) {
        QTest::ignoreMessage(
            QtDebugMsg,
            QRegularExpression(
                QLatin1String(message)
                + QStringLiteral("QDBusError\\(\"org.freedesktop.DBus.Error.InvalidSignature\", ")));
    }
    NetProxy proxy;
    SignalSequence seen(&proxy);
    settle();
    QVERIFY(!proxy.isValid());
    QCOMPARE(proxy.activeType(), NetProxy::Service);
    QCOMPARE(seen.take(), QStringList());
}

void NetProxyTest::selectsAndUnselects()
{
    const auto proxy = selected(Global);
    QVERIFY(proxy->selectProxy(Home));
    QCOMPARE(proxy->getIdentifier(), Home);
    QCOMPARE(proxy->getName(), QStringLiteral("Home"));
    QVERIFY(proxy->selectProxy(Office));
    QCOMPARE(proxy->getIdentifier(), Office);
    QCOMPARE(proxy->getName(), QStringLiteral("Corvane Office"));
    QVERIFY(proxy->selectProxy(QString()));
    QCOMPARE(proxy->getIdentifier(), QString());
    QCOMPARE(proxy->getName(), QString());
    QCOMPARE(proxy->type(), NetProxy::Invalid);
    QVERIFY(!proxy->setType(NetProxy::Direct));
    QVERIFY(proxy->selectProxy(Global));
    QCOMPARE(proxy->getIdentifier(), Global);
    QCOMPARE(proxy->getName(), QStringLiteral("Global Proxy"));
    QCOMPARE(written(Global), QStringList());
}

void NetProxyTest::selectsNothingThatIsNotSaved_data()
{
    QTest::addColumn<QString>("identifier");
    QTest::newRow("not there") << "wifi_nowhere";
    QTest::newRow("not saved") << Cafe;
    QTest::newRow("a path") << Prefix + Home;
    QTest::newRow("another case") << "Global";
}

void NetProxyTest::selectsNothingThatIsNotSaved()
{
    QFETCH(QString, identifier);
    const auto proxy = selected(Home);
    QVERIFY(!proxy->selectProxy(identifier));
    QCOMPARE(proxy->getIdentifier(), QString());
    QCOMPARE(proxy->type(), NetProxy::Invalid);
    QVERIFY(!proxy->setType(NetProxy::Direct));
    QCOMPARE(written(Home), QStringList());
}

void NetProxyTest::selectsNoNetworkWhileInvalid()
{
    NetProxy proxy;
    QVERIFY(!proxy.selectProxy(Home));
    QCOMPARE(proxy.getIdentifier(), QString());
    QVERIFY(waitUntil([&] { return proxy.isValid(); }));
    QVERIFY(proxy.selectProxy(Home));
    m_phone->stopService(Service);
    QVERIFY(waitUntil([&] { return !proxy.isValid(); }));
    QVERIFY(!proxy.selectProxy(Office));
    QCOMPARE(proxy.getIdentifier(), QString());
}

void NetProxyTest::listsIdentifiersAndTechnologies()
{
    const auto proxy = selected(Global);
    QCOMPARE(proxy->getTechnologies(), list("Wired|WiFi|Cellular|global"));
    QCOMPARE(proxy->getIdentifiers(QStringLiteral("wifi")), QStringList({Office, Home}));
    QCOMPARE(proxy->getIdentifiers(QStringLiteral("WiFi")), QStringList({Office, Home}));
    QCOMPARE(proxy->getIdentifiers(QStringLiteral("ethernet")), QStringList());
    QCOMPARE(proxy->getIdentifiers(Global), QStringList(Global));
    const QStringList all = proxy->getIdentifiers(QString());
    QCOMPARE(all.mid(0, 2), QStringList({Office, Home}));
    QCOMPARE(all.last(), Global);
    QCOMPARE(all.count(Global), 1);
}

void NetProxyTest::readsTheSelectedConfiguration_data()
{
    QTest::addColumn<QString>("identifier");
    QTest::newRow("a network") << Home;
    QTest::newRow("global") << Global;
}

void NetProxyTest::readsTheSelectedConfiguration()
{
    QFETCH(QString, identifier);
    configure(identifier,
              {QStringLiteral("manual"), QStringLiteral("http://a:1,http://b:2"),
               QStringLiteral("localhost,.example")});
    auto proxy = selected(identifier);
    QCOMPARE(proxy->type(), NetProxy::Manual);
    QCOMPARE(proxy->manualProxies(), urls("http://a:1|http://b:2"));
    QCOMPARE(proxy->manualExclusions(), list("localhost|.example"));
    QCOMPARE(proxy->automaticUrl(), QUrl());
    configure(identifier, {QStringLiteral("auto"), QStringLiteral("http://pac")});
    proxy = selected(identifier);
    QCOMPARE(proxy->type(), NetProxy::Automatic);
    QCOMPARE(proxy->automaticUrl(), QUrl(QStringLiteral("http://pac")));
    configure(identifier, {QStringLiteral("direct")});
    proxy = selected(identifier);
    QCOMPARE(proxy->type(), NetProxy::Direct);
}

void NetProxyTest::writes_data()
{
    readsTheSelectedConfiguration_data();
}

void NetProxyTest::writes()
{
    QFETCH(QString, identifier);
    const auto proxy = selected(identifier);
    QVERIFY(proxy->setManualProxies(urls("http://a:1|http://b:2")));
    QCOMPARE(written(identifier), QStringList()); // not for direct
    QVERIFY(proxy->setType(NetProxy::Manual));
    QCOMPARE(proxy->type(), NetProxy::Manual); // at once
    QCOMPARE(written(identifier), QStringList(manualSent("['http://a:1', 'http://b:2']", "@as []")));
    QVERIFY(proxy->setManualExclusions(list("localhost")));
    QCOMPARE(written(identifier), QStringList(manualSent("['http://a:1', 'http://b:2']", "['localhost']")));
    QVERIFY(proxy->setManualProxies(urls("http://c:3")));
    QCOMPARE(written(identifier), QStringList(manualSent("['http://c:3']", "['localhost']")));
    QVERIFY(proxy->setAutomaticUrl(QUrl(QStringLiteral("http://pac"))));
    QCOMPARE(written(identifier), QStringList());
    QVERIFY(proxy->setType(NetProxy::Automatic));
    QCOMPARE(written(identifier), QStringList(automaticSent("http://pac")));
    QVERIFY(proxy->setType(NetProxy::Direct));
    QCOMPARE(written(identifier), QStringList(DirectSent));

    // What is the same is no change, and sent all the same.
    QVERIFY(!proxy->setType(NetProxy::Direct));
    QCOMPARE(written(identifier), QStringList(DirectSent));
    QVERIFY(!proxy->setAutomaticUrl(QUrl(QStringLiteral("http://pac"))));
    QVERIFY(!proxy->setManualProxies(urls("http://c:3")));
    QVERIFY(!proxy->setManualExclusions(list("localhost")));
    QCOMPARE(written(identifier), QStringList());
    QVERIFY(proxy->setType(NetProxy::Manual));
    QVERIFY(!proxy->setManualProxies(urls("http://c:3")));
    QVERIFY(!proxy->setManualExclusions(list("localhost")));
    QCOMPARE(written(identifier).size(), 3);
    QVERIFY(proxy->setType(NetProxy::Automatic));
    QVERIFY(!proxy->setAutomaticUrl(QUrl(QStringLiteral("http://pac"))));
    QCOMPARE(written(identifier), QStringList({automaticSent("http://pac"), automaticSent("http://pac")}));
}

void NetProxyTest::incompleteConfigurationsWait_data()
{
    readsTheSelectedConfiguration_data();
}

void NetProxyTest::incompleteConfigurationsWait()
{
    QFETCH(QString, identifier);
    const auto proxy = selected(identifier);
    proxy->setManualProxies({});
    proxy->setAutomaticUrl(QUrl());
    QVERIFY(proxy->setType(NetProxy::Manual));
    proxy->setManualExclusions(list("a"));
    QCOMPARE(written(identifier), QStringList());
    QVERIFY(proxy->setManualProxies(urls("http://a:1")));
    QCOMPARE(written(identifier), QStringList(manualSent("['http://a:1']", "['a']")));
    QVERIFY(proxy->setType(NetProxy::Automatic));
    QCOMPARE(written(identifier), QStringList());
    QVERIFY(proxy->setAutomaticUrl(QUrl(QStringLiteral("http://pac"))));
    QCOMPARE(written(identifier), QStringList(automaticSent("http://pac")));
}

void NetProxyTest::invalidTypesAreRefused_data()
{
    readsTheSelectedConfiguration_data();
}

void NetProxyTest::invalidTypesAreRefused()
{
    QFETCH(QString, identifier);
    const auto proxy = selected(identifier);
    const NetProxy::ProxyType before = proxy->type();
    for (const int type : {-1, 0, 4})
        QVERIFY(!proxy->setType(NetProxy::ProxyType(type)));
    QCOMPARE(proxy->type(), before);
    QCOMPARE(written(identifier), QStringList());
}

void NetProxyTest::writingWhatIsNotKnownYet()
{
    m_phone->swallowCalls(Service, Root, QStringLiteral("GetProperty"));
    NetProxy proxy;
    QVERIFY(proxy.selectProxy(Global));
    QCOMPARE(proxy.type(), NetProxy::Invalid);
    for (int i = 0; i < 3; ++i)
        QTest::ignoreMessage(QtDebugMsg, "MDM Proxy: error updating remote global proxy configuration");
    QVERIFY(proxy.setManualProxies(urls("http://a:1")));
    QVERIFY(proxy.setManualExclusions(list("a")));
    QVERIFY(proxy.setAutomaticUrl(QUrl(QStringLiteral("http://pac"))));
    QCOMPARE(written(Global), QStringList());
    QVERIFY(proxy.setType(NetProxy::Manual));
    QCOMPARE(written(Global), QStringList(manualSent("['http://a:1']", "['a']")));
}

void NetProxyTest::refusedWritesAreNeverConfirmed()
{
    for (const QString &identifier : {Home, Global}) {
        const auto proxy = selected(identifier);
        SignalSequence seen(proxy.get());
        m_phone->failCalls(Service, QString(), QStringLiteral("SetProperty"),
                           QStringLiteral("net.connman.Error.InvalidArguments"), QString());
        MessageLog log;
        proxy->setAutomaticUrl(QUrl(QStringLiteral("http://refused")));
        QVERIFY(proxy->setType(NetProxy::Automatic));
        QCOMPARE(written(identifier).size(), 1);
        settle();
        QCOMPARE(seen.take(), QStringList());
        m_phone->clearFaults();
        // The next word of the connection manager puts it right.
        configure(identifier, {QStringLiteral("direct")});
        QVERIFY(seen.waitFor(2));
        QCOMPARE(seen.take(), list("proxyConfigChanged()|typeChanged(Direct)"));
    }
}

void NetProxyTest::announcesInOrder_data()
{
    QTest::addColumn<QString>("identifier");
    QTest::addColumn<QStringList>("before");
    QTest::addColumn<QStringList>("after");
    QTest::addColumn<QStringList>("expected");
    for (const QString &identifier : {Home, Global}) {
        const QByteArray which = identifier == Global ? "global: " : "a network: ";
        const auto row = [&](const char *name, const char *before, const char *after, const char *expected) {
            QTest::newRow(which + name) << identifier << list(before) << list(after) << list(expected);
        };
        row("to manual", "direct", "manual|http://m:1|n",
            "proxyConfigChanged()|typeChanged(Manual)|manualProxiesChanged([http://m:1])|"
            "manualExclusionsChanged(n)");
        row("to automatic", "direct", "auto|http://o/pac",
            "proxyConfigChanged()|typeChanged(Automatic)|automaticUrlChanged(http://o/pac)");
        row("to direct", "auto|http://p/pac", "direct", "proxyConfigChanged()|typeChanged(Direct)");
        row("other servers", "manual|http://q:1|n", "manual|http://r:1,http://s:2|n",
            "proxyConfigChanged()|manualProxiesChanged([http://r:1 http://s:2])|manualExclusionsChanged(n)");
        row("other exclusions", "manual|http://t:1|n", "manual|http://t:1|o,p", "proxyConfigChanged()");
        row("no exclusions any more", "manual|http://t:1|n", "manual|http://t:1", "proxyConfigChanged()");
        row("other servers and exclusions", "manual|http://t:1|n", "manual|http://u:1|o,p",
            "proxyConfigChanged()|manualProxiesChanged([http://u:1])|manualExclusionsChanged(o p)");
        row("another URL", "auto|http://p/pac", "auto|http://q/pac",
            "proxyConfigChanged()|automaticUrlChanged(http://q/pac)");
        row("no URL any more", "auto|http://p/pac", "auto", "proxyConfigChanged()|automaticUrlChanged()");
        row("the same", "auto|http://p/pac", "auto|http://p/pac", "");
    }
}

void NetProxyTest::announcesInOrder()
{
    QFETCH(QString, identifier);
    QFETCH(QStringList, before);
    QFETCH(QStringList, after);
    configure(identifier, before);
    const auto proxy = selected(identifier);
    SignalSequence seen(proxy.get());
    configure(identifier, after);
    settle();
    QTEST(seen.take(), "expected");
}

void NetProxyTest::confirmedChangesAreAnnounced_data()
{
    readsTheSelectedConfiguration_data();
}

void NetProxyTest::confirmedChangesAreAnnounced()
{
    QFETCH(QString, identifier);
    const auto proxy = selected(identifier);
    SignalSequence seen(proxy.get());
    proxy->setManualProxies(urls("http://a:1"));
    proxy->setManualExclusions(list("a"));
    proxy->setAutomaticUrl(QUrl(QStringLiteral("http://pac")));
    proxy->setType(NetProxy::Manual);
    QCOMPARE(seen.take(), QStringList()); // nothing before it is confirmed
    QVERIFY(seen.waitFor(4));
    settle();
    // The echo has what is here already, and the URL is still a change of one's own.
    QCOMPARE(seen.take(),
             list("proxyConfigChanged()|typeChanged(Manual)|manualProxiesChanged([http://a:1])|"
                  "manualExclusionsChanged(a)"));
    proxy->setType(NetProxy::Automatic);
    QVERIFY(seen.waitFor(3));
    settle();
    QCOMPARE(seen.take(),
             list("proxyConfigChanged()|typeChanged(Automatic)|automaticUrlChanged(http://pac)"));
    // What was no change is not announced.
    proxy->setType(NetProxy::Automatic);
    settle();
    QCOMPARE(seen.take(), QStringList());
}

void NetProxyTest::exclusionsAloneAreNotAnnounced()
{
    for (const QString &identifier : {Home, Global}) {
        configure(identifier, list("manual|http://a:1|a"));
        const auto proxy = selected(identifier);
        SignalSequence seen(proxy.get());
        QVERIFY(proxy->setManualExclusions(list("b|c")));
        QVERIFY(seen.waitFor(1));
        settle();
        QCOMPARE(seen.take(), list("proxyConfigChanged()"));
        QCOMPARE(proxy->manualExclusions(), list("b|c"));
    }
}

void NetProxyTest::strangeConfigurationsOfNetworks()
{
    configure(Home, list("manual|http://a:1|a"));
    const auto proxy = selected(Home);
    SignalSequence seen(proxy.get());
    const auto emitConfiguration = [this](const QVariantMap &configuration) {
        m_phone->emitSignal(Service, Prefix + Home, ServiceInterface, PropertyChanged,
                            {QStringLiteral("Proxy.Configuration"),
                             QVariant::fromValue(QDBusVariant(QVariant(configuration)))});
    };
    emitConfiguration({{QStringLiteral("Method"), QStringLiteral("odd")}});
    emitConfiguration({{QStringLiteral("Method"), 7}});
    emitConfiguration({{QStringLiteral("Method"), list("direct|manual")}});
    QCOMPARE(proxy->type(), NetProxy::Manual);
    QCOMPARE(seen.take(), QStringList());
    // Nested arrays and numbers for texts are empty.
    emitConfiguration({{QStringLiteral("Method"), QStringLiteral("manual")},
                       {QStringLiteral("Servers"), QVariantList{QVariantList{1}}},
                       {QStringLiteral("Excludes"), 5}});
    QCOMPARE(seen.take(), list("proxyConfigChanged()|manualProxiesChanged([])|manualExclusionsChanged()"));
    QCOMPARE(proxy->manualProxies(), QList<QUrl>());
    emitConfiguration({});
    QCOMPARE(seen.take(), list("proxyConfigChanged()|typeChanged(Direct)"));
}

void NetProxyTest::changesOfOthersAreSilent()
{
    const auto proxy = selected(Home);
    SignalSequence seen(proxy.get());
    configure(Global, list("manual|http://global:1"));
    configure(Office, list("manual|http://office:1"));
    settle();
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(proxy->selectProxy(Global));
    QCOMPARE(proxy->manualProxies(), urls("http://global:1"));
    configure(Home, list("manual|http://home:1"));
    settle();
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(proxy->selectProxy(Home));
    QCOMPARE(proxy->manualProxies(), urls("http://home:1"));
    QVERIFY(proxy->selectProxy(QString()));
    configure(Home, list("direct"));
    configure(Global, list("direct"));
    settle();
    QCOMPARE(seen.take(), QStringList());
}

void NetProxyTest::selectionIsSilent()
{
    configure(Home, list("manual|http://home:1"));
    configure(Office, list("auto|http://pac"));
    const auto proxy = selected(Global);
    SignalSequence seen(proxy.get());
    for (const QString &identifier : {Home, Office, Global, QString(), Home})
        QVERIFY(proxy->selectProxy(identifier));
    settle();
    QCOMPARE(seen.take(), QStringList());
    // A change that was not confirmed yet does not turn up with the next network.
    configure(Home, list("direct"));
    settle();
    seen.take();
    QVERIFY(proxy->selectProxy(Office));
    QCOMPARE(proxy->automaticUrl(), QUrl(QStringLiteral("http://pac")));
}

void NetProxyTest::networkThatIsNotReadyIsSilent()
{
    const QString strange = QStringLiteral("wifi_strange");
    const auto services = [](const QVector<std::pair<QString, QVariantMap>> &listed) {
        return WireObject::list(Prefix, listed);
    };
    const auto proxy = selected(Global);
    SignalSequence seen(proxy.get());
    m_phone->swallowCalls(Service, Prefix + strange, QStringLiteral("GetProperties"));
    m_phone->emitSignal(Service, Root, ManagerInterface, QStringLiteral("ServicesChanged"),
                        {services({{strange, {{QStringLiteral("Favorite"), true}}}}), WireObject::paths({})});
    QVERIFY(proxy->selectProxy(strange));
    QCOMPARE(proxy->getName(), QString());
    const auto changeProperty = [&](const char *name, const QVariant &value) {
        m_phone->emitSignal(Service, Prefix + strange, ServiceInterface, PropertyChanged,
                            {QString::fromLatin1(name), QVariant::fromValue(QDBusVariant(value))});
    };
    changeProperty("Proxy.Configuration",
                   QVariantMap{{QStringLiteral("Method"), QStringLiteral("auto")},
                               {QStringLiteral("URL"), QStringLiteral("http://early")}});
    QCOMPARE(proxy->type(), NetProxy::Automatic);
    QCOMPARE(proxy->automaticUrl(), QUrl(QStringLiteral("http://early")));
    QCOMPARE(seen.take(), QStringList());

    // From the moment that its properties are there, it is as any other.
    changeProperty("Name", QStringLiteral("Strange"));
    QCOMPARE(proxy->getName(), QStringLiteral("Strange"));
    QCOMPARE(seen.take(), QStringList());
    changeProperty("Proxy.Configuration", QVariantMap{{QStringLiteral("Method"), QStringLiteral("direct")}});
    QCOMPARE(seen.take(), list("proxyConfigChanged()|typeChanged(Direct)"));
    m_phone->emitSignal(Service, Root, ManagerInterface, QStringLiteral("ServicesChanged"),
                        {services({}), WireObject::paths({Prefix + strange})});
}

void NetProxyTest::networkThatBecomesReadyIsSilent()
{
    const QString strange = QStringLiteral("wifi_slow");
    const QString path = Prefix + strange;
    const QString getProperties = QStringLiteral("GetProperties");
    const auto listIt = [&] {
        m_phone->emitSignal(Service, Root, ManagerInterface, QStringLiteral("ServicesChanged"),
                            {WireObject::list(Prefix, {{strange, {{QStringLiteral("Favorite"), true}}}}),
                             WireObject::paths({})});
    };
    const auto proxy = selected(Global);
    m_phone->swallowCalls(Service, path, getProperties);
    listIt();
    QVERIFY(proxy->selectProxy(strange));
    QCOMPARE(proxy->type(), NetProxy::Direct); // as of a network that tells nothing of it
    SignalSequence seen(proxy.get());
    // The next list asks for its properties anew.
    m_phone->clearFaults();
    m_phone->answerCalls(
        Service, path, getProperties,
        {QVariantMap{{QStringLiteral("Name"), QStringLiteral("Slow")},
                     {QStringLiteral("Proxy.Configuration"),
                      QVariantMap{{QStringLiteral("Method"), QStringLiteral("auto")},
                                  {QStringLiteral("URL"), QStringLiteral("http://slow")}}}}});
    listIt();
    QVERIFY(waitUntil([&] { return proxy->getName() == QLatin1String("Slow"); }));
    settle();
    QCOMPARE(proxy->automaticUrl(), QUrl(QStringLiteral("http://slow")));
    QCOMPARE(seen.take(), QStringList());
    m_phone->emitSignal(
        Service, path, ServiceInterface, PropertyChanged,
        {QStringLiteral("Proxy.Configuration"), QVariant::fromValue(QDBusVariant(QVariantMap()))});
    QCOMPARE(seen.take(), list("proxyConfigChanged()|typeChanged(Direct)"));
    m_phone->emitSignal(Service, Root, ManagerInterface, QStringLiteral("ServicesChanged"),
                        {WireObject::list(Prefix, {}), WireObject::paths({path})});
}

void NetProxyTest::switchesTheActiveType()
{
    const auto proxy = selected(Home);
    SignalSequence seen(proxy.get());
    QVERIFY(!proxy->setActiveType(NetProxy::Service));
    QCOMPARE(written(Home), QStringList());
    QVERIFY(proxy->setActiveType(NetProxy::Global));
    QCOMPARE(proxy->activeType(), NetProxy::Global); // at once, and unannounced
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(!proxy->setActiveType(NetProxy::Global));
    QCOMPARE(written(Home), list("/ org.corvaneos.connman.GlobalProxy.SetProperty ('Active', <true>)"));
    QCOMPARE(seen.take(), list("activeTypeChanged(Global)"));
    QVERIFY(proxy->selectProxy(Global));
    QVERIFY(proxy->setActiveType(NetProxy::Service));
    QVERIFY(seen.waitFor(2));
    QCOMPARE(seen.take(), list("activeTypeChanged(Service)|proxyConfigChanged()"));
}

void NetProxyTest::refusedActiveType()
{
    const auto proxy = selected(Global);
    SignalSequence seen(proxy.get());
    m_phone->failCalls(Service, Root, QStringLiteral("SetProperty"),
                       QStringLiteral("net.connman.Error.PermissionDenied"), QString());
    QVERIFY(proxy->setActiveType(NetProxy::Global));
    settle();
    // Nobody looks at the answer: it stays so until something is announced.
    QCOMPARE(proxy->activeType(), NetProxy::Global);
    QCOMPARE(seen.take(), QStringList());
    propertyChanged("Active", false);
    QCOMPARE(proxy->activeType(), NetProxy::Service);
    QCOMPARE(seen.take(), list("activeTypeChanged(Service)|proxyConfigChanged()"));
}

void NetProxyTest::everyAnnouncementOfTheActiveType()
{
    const auto proxy = selected(Home);
    SignalSequence seen(proxy.get());
    propertyChanged("Active", false);
    propertyChanged("Active", true);
    propertyChanged("Active", 1);
    propertyChanged("Active", QStringLiteral("false"));
    QCOMPARE(seen.take(),
             list("activeTypeChanged(Service)|activeTypeChanged(Global)|"
                  "activeTypeChanged(Global)|activeTypeChanged(Service)"));
}

void NetProxyTest::unknownProperty()
{
    const auto proxy = selected(Global);
    SignalSequence seen(proxy.get());
    QTest::ignoreMessage(QtDebugMsg, "MDM Proxy: property change: unknown property");
    propertyChanged("Colour", true);
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(proxy->isValid());
}

void NetProxyTest::configurationOfAnotherType()
{
    configure(Global, list("auto|http://pac"));
    const auto proxy = selected(Global);
    SignalSequence seen(proxy.get());
    QTest::ignoreMessage(QtDebugMsg, "MDM Proxy: property change: incorrect type:  QString");
    propertyChanged("Configuration", QStringLiteral("direct"));
    QCOMPARE(seen.take(), list("validChanged(false)"));
    QCOMPARE(proxy->type(), NetProxy::Automatic);
    QTest::ignoreMessage(QtDebugMsg, "MDM Proxy: property change: incorrect type:  QDBusArgument");
    propertyChanged("Configuration", QVariant::fromValue(QList<QDBusObjectPath>{QDBusObjectPath(Root)}));
    QCOMPARE(seen.take(), QStringList());
    // A proper one mends it; the changes come before the validity.
    propertyChanged("Configuration", QVariantMap());
    QCOMPARE(seen.take(), list("proxyConfigChanged()|typeChanged(Direct)|validChanged(true)"));
}

void NetProxyTest::networkThatVanishes()
{
    configure(Home, list("manual|http://home:1"));
    const auto proxy = selected(Home);
    SignalSequence seen(proxy.get());
    act("connection vanish", {Home});
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), list("validChanged(false)"));
    QCOMPARE(proxy->getIdentifier(), QString());
    QCOMPARE(proxy->getName(), QString());
    QCOMPARE(proxy->type(), NetProxy::Invalid);
    QCOMPARE(proxy->manualProxies(), QList<QUrl>());
    QCOMPARE(proxy->manualExclusions(), QStringList());
    QCOMPARE(proxy->automaticUrl(), QUrl());
    QVERIFY(!proxy->setType(NetProxy::Direct));
    QVERIFY(!proxy->setManualProxies(urls("http://a:1")));
    QVERIFY(!proxy->setManualExclusions(list("a")));
    QVERIFY(!proxy->setAutomaticUrl(QUrl(QStringLiteral("http://pac"))));
    QCOMPARE(written(Home), QStringList());
    act("connection return", {Home});
    settle();
    QVERIFY(!proxy->isValid());
    QVERIFY(!proxy->selectProxy(Home));

    // The connection manager's own return makes it valid again, with the global proxy.
    m_phone->stopService(Service);
    m_phone->startService(Service);
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), list("validChanged(true)"));
    QCOMPARE(proxy->getIdentifier(), Global);
}

void NetProxyTest::connectionManagerThatRestarts()
{
    const auto proxy = selected(Home);
    SignalSequence seen(proxy.get());
    m_phone->stopService(Service);
    QVERIFY(seen.waitFor(1));
    configure(Home, list("auto|http://pac"));
    m_phone->startService(Service);
    QVERIFY(seen.waitFor(5));
    settle();
    QCOMPARE(seen.take(),
             list("validChanged(false)|proxyConfigChanged()|typeChanged(Automatic)|"
                  "automaticUrlChanged(http://pac)|validChanged(true)"));
    QCOMPARE(proxy->getIdentifier(), Home);
    // The selection still works.
    QVERIFY(proxy->setType(NetProxy::Direct));
    QVERIFY(seen.waitFor(2));
    QCOMPARE(seen.take(), list("proxyConfigChanged()|typeChanged(Direct)"));
}

void NetProxyTest::objectsAreIndependent()
{
    const auto first = selected(Home);
    const auto second = selected(Home);
    const auto third = selected(Global);
    SignalSequence firstSeen(first.get());
    SignalSequence secondSeen(second.get());
    SignalSequence thirdSeen(third.get());
    QVERIFY(first->setAutomaticUrl(QUrl(QStringLiteral("http://pac"))));
    QVERIFY(first->setType(NetProxy::Automatic));
    QCOMPARE(second->type(), NetProxy::Direct);
    QVERIFY(secondSeen.waitFor(3));
    settle();
    const QStringList expected
        = list("proxyConfigChanged()|typeChanged(Automatic)|automaticUrlChanged(http://pac)");
    QCOMPARE(firstSeen.take(), expected);
    QCOMPARE(secondSeen.take(), expected);
    QCOMPARE(thirdSeen.take(), QStringList());
}

void NetProxyTest::mayBeDeletedAtAnySignal()
{
    const auto deleteAt = [this](const QString &identifier, auto signal, const auto &provoke) {
        configure(identifier, list("direct"));
        NetProxy *proxy = selected(identifier).release();
        bool isDeleted = false;
        connect(proxy, signal, this, [&] {
            isDeleted = true;
            delete proxy;
        });
        provoke();
        QVERIFY(waitUntil([&] { return isDeleted; }));
        settle();
    };
    for (const QString &identifier : {Home, Global}) {
        const auto change = [&] {
            configure(identifier, list("manual|http://deleted:1|a"));
        };
        deleteAt(identifier, &NetProxy::proxyConfigChanged, change);
        deleteAt(identifier, &NetProxy::typeChanged, change);
        deleteAt(identifier, &NetProxy::manualProxiesChanged, change);
        deleteAt(identifier, &NetProxy::manualExclusionsChanged, change);
        configure(identifier, list("direct"));
        deleteAt(identifier, &NetProxy::automaticUrlChanged,
                 [&] { configure(identifier, list("auto|http://deleted")); });
        deleteAt(identifier, &NetProxy::activeTypeChanged,
                 [&] { act("proxy active", {QStringLiteral("on")}); });
    }
    deleteAt(Home, &NetProxy::validChanged, [&] { m_phone->stopService(Service); });
    m_phone->startService(Service);
}

void NetProxyTest::worksThroughTheMetaObject()
{
    const auto proxy = selected(Home);
    QVERIFY(proxy->property("valid").toBool());
    QVERIFY(proxy->setProperty("manualProxies", QVariant::fromValue(urls("http://a:1"))));
    QVERIFY(proxy->setProperty("manualExclusions", list("a")));
    QVERIFY(proxy->setProperty("automaticUrl", QUrl(QStringLiteral("http://pac"))));
    QVERIFY(proxy->setProperty("type", QVariant::fromValue(NetProxy::Manual)));
    QVERIFY(proxy->setProperty("activeType", QVariant::fromValue(NetProxy::Global)));
    QCOMPARE(proxy->property("type").value<NetProxy::ProxyType>(), NetProxy::Manual);
    QCOMPARE(proxy->property("manualProxies").value<QList<QUrl>>(), urls("http://a:1"));
    QCOMPARE(proxy->property("manualExclusions").toStringList(), list("a"));
    QCOMPARE(proxy->property("automaticUrl").toUrl(), QUrl(QStringLiteral("http://pac")));
    QCOMPARE(proxy->property("activeType").value<NetProxy::ActiveType>(), NetProxy::Global);
    QVERIFY(!proxy->property("valid").isNull());
    QCOMPARE(proxy->metaObject()->indexOfMethod("selectProxy(QString)"), -1);
    QCOMPARE(NetProxy::staticMetaObject.enumerator(0).name(), "ProxyType");
}

void NetProxyTest::queuedConnectionsDeliver()
{
    const auto proxy = selected(Home);
    QList<QUrl> servers;
    NetProxy::ProxyType type = NetProxy::Invalid;
    NetProxy::ActiveType activeType = NetProxy::Service;
    connect(
        proxy.get(), &NetProxy::manualProxiesChanged, this, [&](const QList<QUrl> &now) { servers = now; },
        Qt::QueuedConnection);
    connect(
        proxy.get(), &NetProxy::typeChanged, this, [&](NetProxy::ProxyType now) { type = now; },
        Qt::QueuedConnection);
    connect(
        proxy.get(), &NetProxy::activeTypeChanged, this, [&](NetProxy::ActiveType now) { activeType = now; },
        Qt::QueuedConnection);
    QSignalSpy spy(proxy.get(), SIGNAL(typeChanged(ProxyType)));
    configure(Home, list("manual|http://queued:1"));
    act("proxy active", {QStringLiteral("on")});
    QVERIFY(waitUntil([&] { return activeType == NetProxy::Global; }));
    QCOMPARE(servers, urls("http://queued:1"));
    QCOMPARE(type, NetProxy::Manual);
    QCOMPARE(spy.size(), 1);
    QCOMPARE(spy.first().first().value<NetProxy::ProxyType>(), NetProxy::Manual);
}

QTEST_GUILESS_MAIN(NetProxyTest)

#include "netproxy_test.moc"
