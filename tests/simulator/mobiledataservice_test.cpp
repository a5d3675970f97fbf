// SPDX-License-Identifier: LGPL-2.1-or-later
#include "client.h"
#include "texts.h"

#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusVariant>
#include <QtTest/QTest>

namespace
{

const QString service = QStringLiteral("org.ofono");
const QString modemPath = QStringLiteral("/ril_0");
const QString contextPath = QStringLiteral("/ril_0/context1");
const QString radioInterface = QStringLiteral("org.ofono.RadioSettings");
const QString managerInterface = QStringLiteral("org.ofono.ConnectionManager");
const QString contextInterface = QStringLiteral("org.ofono.ConnectionContext");
const QString changed = QStringLiteral("PropertyChanged");
const QString getProperties = QStringLiteral("GetProperties");
const QString done = QStringLiteral("reply()");

QString contextText(const char *active, const char *apn, const char *type, const char *name)
{
    return QStringLiteral("{Active=<%1>, AccessPointName=<%2>, Type=<%3>, Username=<>, Password=<>, "
                          "Protocol=<ip>, AuthenticationMethod=<none>, Name=<%4>, MessageCenter=<>, "
                          "MessageProxy=<>}")
        .arg(QLatin1String(active), QLatin1String(apn), QLatin1String(type), QLatin1String(name));
}

} // namespace

/** Radio settings, contexts and what the connection manager makes of them, as the simulated phone has them.
 */
class MobileDataServiceTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void restrictsTheRadio();
    void refusesStrangeTechnologies();
    void listsTheContexts();
    void writesAContext();
    void refusesStrangeContexts_data();
    void refusesStrangeContexts();
    void addsAndRemovesContexts();
    void activatesAContext();
    void attachesAndDetaches();
    void roamsWhenAllowed();
    void keepsContextsBySim();
    void lockedSimHasNone();
    void contextsBecomeNetworks();
    void flightModeTakesModemsOffline();

private:
    QString call(const QString &path, const QString &interface, const QString &member,
                 const QVariantList &arguments = {}) const
    {
        return textOf(m_client->call(service, path, interface, member, arguments));
    }
    QString set(const QString &path, const QString &interface, const char *property,
                const QVariant &value) const
    {
        return call(path, interface, QStringLiteral("SetProperty"),
                    {QLatin1String(property), QVariant::fromValue(QDBusVariant(value))});
    }
    QString act(const QString &action, const QStringList &arguments) const
    {
        return textOf(m_client->control(QStringLiteral("Act"), {action, arguments}));
    }
    bool hasNetwork(const QString &identifier) const
    {
        const QString networks
            = textOf(m_client->call(QStringLiteral("net.connman"), QStringLiteral("/"),
                                    QStringLiteral("net.connman.Manager"), QStringLiteral("GetServices")));
        return networks.contains(QStringLiteral("/net/connman/service/cellular_") + identifier);
    }
    QStringList takeSignals() const { return m_client->takeSignals(service); }

    std::unique_ptr<Client> m_client;
};

void MobileDataServiceTest::init()
{
    m_client = std::make_unique<Client>();
    m_client->watch(service, modemPath, radioInterface, {changed});
    m_client->watch(service, modemPath, managerInterface,
                    {changed, QStringLiteral("ContextAdded"), QStringLiteral("ContextRemoved")});
    m_client->watch(service, contextPath, contextInterface, {changed});
}

void MobileDataServiceTest::cleanup()
{
    m_client.reset();
}

void MobileDataServiceTest::restrictsTheRadio()
{
    const QString all = QStringLiteral("AvailableTechnologies=<[gsm, umts, lte]>})");
    QCOMPARE(call(modemPath, radioInterface, getProperties),
             QStringLiteral("reply({TechnologyPreference=<any>, ") + all);
    QCOMPARE(set(modemPath, radioInterface, "TechnologyPreference", QStringLiteral("umts")), done);
    QCOMPARE(set(modemPath, radioInterface, "TechnologyPreference", QStringLiteral("umts")), done);
    QCOMPARE(call(modemPath, radioInterface, getProperties),
             QStringLiteral("reply({TechnologyPreference=<umts>, ") + all);
    QCOMPARE(set(modemPath, radioInterface, "TechnologyPreference", QStringLiteral("any")), done);
    QCOMPARE(takeSignals(),
             texts({"PropertyChanged(TechnologyPreference, <umts>)",
                    "PropertyChanged(TechnologyPreference, <any>)"}));
}

void MobileDataServiceTest::refusesStrangeTechnologies()
{
    const QString invalid = QStringLiteral("org.ofono.Error.InvalidArguments: ");
    QCOMPARE(set(modemPath, radioInterface, "TechnologyPreference", QStringLiteral("nr")),
             invalid + QStringLiteral("The modem has no technology \"nr\""));
    QCOMPARE(set(modemPath, radioInterface, "TechnologyPreference", 4),
             invalid + QStringLiteral("TechnologyPreference is a string"));
    QCOMPARE(set(modemPath, radioInterface, "AvailableTechnologies", QStringList()),
             invalid + QStringLiteral("There is no property AvailableTechnologies that could be set"));
    QCOMPARE(takeSignals(), QStringList());
}

void MobileDataServiceTest::listsTheContexts()
{
    QCOMPARE(call(modemPath, managerInterface, getProperties),
             QStringLiteral("reply({Attached=<true>, RoamingAllowed=<false>, Powered=<true>})"));
    QString mms = contextText("false", "mms.elo", "mms", "Elo MMS");
    mms.replace(QLatin1String("MessageCenter=<>"), QLatin1String("MessageCenter=<http://mmsc.elo.example/>"));
    mms.replace(QLatin1String("MessageProxy=<>"), QLatin1String("MessageProxy=<192.0.2.8:8080>"));
    const QString internet = contextText("false", "internet.elo", "internet", "Elo Internet");
    QCOMPARE(call(modemPath, managerInterface, QStringLiteral("GetContexts")),
             QStringLiteral("reply([(/ril_0/context1, %1), (/ril_0/context2, %2)])").arg(internet, mms));
    QCOMPARE(call(contextPath, contextInterface, getProperties), QStringLiteral("reply(%1)").arg(internet));
}

void MobileDataServiceTest::writesAContext()
{
    QCOMPARE(set(contextPath, contextInterface, "Name", QStringLiteral("Mine")), done);
    QCOMPARE(set(contextPath, contextInterface, "Name", QStringLiteral("Mine")), done);
    QCOMPARE(set(contextPath, contextInterface, "Protocol", QStringLiteral("dual")), done);
    QCOMPARE(set(contextPath, contextInterface, "AuthenticationMethod", QStringLiteral("any")), done);
    QCOMPARE(takeSignals(),
             texts({"PropertyChanged(Name, <Mine>)", "PropertyChanged(Protocol, <dual>)",
                    "PropertyChanged(AuthenticationMethod, <any>)"}));

    // What was written outlives the service.
    m_client->control(QStringLiteral("StopService"), {service});
    m_client->control(QStringLiteral("StartService"), {service});
    QVERIFY(call(contextPath, contextInterface, getProperties).contains(QLatin1String("Name=<Mine>")));
    QCOMPARE(set(contextPath, contextInterface, "Name", QStringLiteral("Elo Internet")), done);
    QCOMPARE(set(contextPath, contextInterface, "Protocol", QStringLiteral("ip")), done);
    QCOMPARE(set(contextPath, contextInterface, "AuthenticationMethod", QStringLiteral("none")), done);
}

void MobileDataServiceTest::refusesStrangeContexts_data()
{
    QTest::addColumn<QString>("property");
    QTest::addColumn<QVariant>("value");
    QTest::addColumn<QString>("error");
    const auto row = [](const char *property, const QVariant &value, const char *error) {
        QTest::newRow(error) << QString::fromLatin1(property) << value
                             << QStringLiteral("org.ofono.Error.") + QLatin1String(error);
    };
    row("Protocol", QStringLiteral("x25"), "InvalidFormat: Protocol cannot be \"x25\"");
    row("Type", QStringLiteral("any"), "InvalidFormat: Type cannot be \"any\"");
    row("AuthenticationMethod", QString(), "InvalidFormat: AuthenticationMethod cannot be \"\"");
    row("Name", 7, "InvalidArguments: Name is a string");
    row("Active", QStringLiteral("yes"), "InvalidArguments: Active is a boolean");
    row("Settings", QString(), "InvalidArguments: There is no property Settings that could be set");
}

void MobileDataServiceTest::refusesStrangeContexts()
{
    QFETCH(QString, property);
    QFETCH(QVariant, value);
    QFETCH(QString, error);
    QCOMPARE(set(contextPath, contextInterface, property.toLatin1().constData(), value), error);
    QCOMPARE(takeSignals(), QStringList());
}

void MobileDataServiceTest::addsAndRemovesContexts()
{
    const QString add = QStringLiteral("AddContext");
    const QString remove = QStringLiteral("RemoveContext");
    const QVariant third = QVariant::fromValue(QDBusObjectPath(QStringLiteral("/ril_0/context3")));
    QCOMPARE(call(modemPath, managerInterface, add, {QStringLiteral("ims")}),
             QStringLiteral("reply(/ril_0/context3)"));
    QCOMPARE(takeSignals(),
             QStringList(QStringLiteral("ContextAdded(/ril_0/context3, %1)")
                             .arg(contextText("false", "", "ims", "Internet"))));
    QCOMPARE(call(modemPath, managerInterface, remove, {third}), done);
    QCOMPARE(takeSignals(), texts({"ContextRemoved(/ril_0/context3)"}));

    QCOMPARE(call(modemPath, managerInterface, remove, {third}),
             QStringLiteral("org.ofono.Error.NotFound: There is no context context3"));
    QCOMPARE(call(modemPath, managerInterface, remove,
                  {QVariant::fromValue(QDBusObjectPath(QStringLiteral("/ril_1/context1")))}),
             QStringLiteral("org.ofono.Error.NotFound: There is no context /ril_1/context1"));
    QCOMPARE(call(modemPath, managerInterface, add, {QStringLiteral("any")}),
             QStringLiteral("org.ofono.Error.InvalidArguments: There are no contexts of the type \"any\""));
    QCOMPARE(takeSignals(), QStringList());
}

void MobileDataServiceTest::activatesAContext()
{
    set(contextPath, contextInterface, "Active", false);
    takeSignals();
    QCOMPARE(set(contextPath, contextInterface, "Active", true), done);
    for (const char *property : {"AccessPointName", "Name", "Type"}) {
        QCOMPARE(set(contextPath, contextInterface, property, QStringLiteral("mms")),
                 QStringLiteral("org.ofono.Error.InUse: The context is active"));
    }
    QCOMPARE(set(contextPath, contextInterface, "Active", false), done);
    QCOMPARE(set(contextPath, contextInterface, "AccessPointName", QString()), done);
    QCOMPARE(set(contextPath, contextInterface, "Active", true),
             QStringLiteral("org.ofono.Error.Failed: The context has no access point name"));
    QCOMPARE(set(contextPath, contextInterface, "AccessPointName", QStringLiteral("internet.elo")), done);
    QCOMPARE(
        takeSignals(),
        texts({"PropertyChanged(Active, <true>)", "PropertyChanged(Active, <false>)",
               "PropertyChanged(AccessPointName, <>)", "PropertyChanged(AccessPointName, <internet.elo>)"}));
}

void MobileDataServiceTest::attachesAndDetaches()
{
    set(contextPath, contextInterface, "Active", true);
    takeSignals();
    QCOMPARE(set(modemPath, managerInterface, "Powered", false), done);
    QCOMPARE(takeSignals(),
             texts({"PropertyChanged(Active, <false>)", "PropertyChanged(Attached, <false>)",
                    "PropertyChanged(Powered, <false>)"}));
    QCOMPARE(set(contextPath, contextInterface, "Active", true),
             QStringLiteral("org.ofono.Error.NotAttached: GPRS is not attached"));
    QCOMPARE(set(modemPath, managerInterface, "Powered", true), done);
    QCOMPARE(set(modemPath, managerInterface, "Attached", true),
             QStringLiteral("org.ofono.Error.InvalidArguments: There is no property Attached that could be "
                            "set"));
    takeSignals();

    act(QStringLiteral("network"), {QStringLiteral("0"), QStringLiteral("searching")});
    QCOMPARE(takeSignals(), texts({"PropertyChanged(Attached, <false>)"}));
    act(QStringLiteral("network"), {QStringLiteral("0"), QStringLiteral("registered")});
    QCOMPARE(takeSignals(), texts({"PropertyChanged(Attached, <true>)"}));
}

void MobileDataServiceTest::roamsWhenAllowed()
{
    act(QStringLiteral("network"), {QStringLiteral("0"), QStringLiteral("roaming")});
    QCOMPARE(takeSignals(), texts({"PropertyChanged(Attached, <false>)"}));
    QCOMPARE(set(modemPath, managerInterface, "RoamingAllowed", true), done);
    QCOMPARE(takeSignals(),
             texts({"PropertyChanged(Attached, <true>)", "PropertyChanged(RoamingAllowed, <true>)"}));
    QVERIFY(hasNetwork(QStringLiteral("244051234567890_context1")));
    QCOMPARE(set(modemPath, managerInterface, "RoamingAllowed", false), done);
    QVERIFY(!hasNetwork(QStringLiteral("244051234567890_context1")));
    act(QStringLiteral("network"), {QStringLiteral("0"), QStringLiteral("registered")});
}

void MobileDataServiceTest::keepsContextsBySim()
{
    const QString slot = QStringLiteral("0");
    const QString before = call(modemPath, managerInterface, QStringLiteral("GetContexts"));
    act(QStringLiteral("sim pull"), {slot});
    QVERIFY(call(modemPath, managerInterface, QStringLiteral("GetContexts"))
                .startsWith(QLatin1String("org.freedesktop.DBus.Error.UnknownMethod")));
    QVERIFY(call(contextPath, contextInterface, getProperties)
                .startsWith(QLatin1String("org.freedesktop.DBus.Error.UnknownMethod")));
    act(QStringLiteral("sim insert"), {slot, QStringLiteral("310150123456789")});
    QCOMPARE(call(modemPath, managerInterface, QStringLiteral("GetContexts")),
             QStringLiteral("reply([(/ril_0/context1, %1)])")
                 .arg(contextText("false", "internet", "internet", "Internet")));
    act(QStringLiteral("sim pull"), {slot});
    act(QStringLiteral("sim insert"), {slot, QStringLiteral("244051234567890")});
    QCOMPARE(call(modemPath, managerInterface, QStringLiteral("GetContexts")), before);
}

void MobileDataServiceTest::lockedSimHasNone()
{
    act(QStringLiteral("sim lock"), {QStringLiteral("0"), QStringLiteral("pin")});
    for (const QString &interface : {radioInterface, managerInterface}) {
        QVERIFY(call(modemPath, interface, getProperties)
                    .startsWith(QLatin1String("org.freedesktop.DBus.Error.UnknownMethod")));
    }
    act(QStringLiteral("sim lock"), {QStringLiteral("0"), QStringLiteral("none")});
    QVERIFY(call(modemPath, managerInterface, getProperties).startsWith(QLatin1String("reply(")));
}

void MobileDataServiceTest::contextsBecomeNetworks()
{
    const QString first = QStringLiteral("244051234567890_context1");
    QVERIFY(hasNetwork(first));
    QVERIFY(hasNetwork(QStringLiteral("262021234567891_context1")));
    // The other one is for multimedia messages.
    QVERIFY(!hasNetwork(QStringLiteral("244051234567890_context2")));
    set(contextPath, contextInterface, "Active", false);
    set(contextPath, contextInterface, "AccessPointName", QString());
    QVERIFY(!hasNetwork(first));
    set(contextPath, contextInterface, "AccessPointName", QStringLiteral("internet.elo"));
    QVERIFY(hasNetwork(first));

    m_client->control(QStringLiteral("StopService"), {service});
    QVERIFY(!hasNetwork(first));
    m_client->control(QStringLiteral("StartService"), {service});
    QVERIFY(hasNetwork(first));
}

void MobileDataServiceTest::flightModeTakesModemsOffline()
{
    const auto setFlightMode = [this](bool isOn) {
        m_client->call(QStringLiteral("net.connman"), QStringLiteral("/"),
                       QStringLiteral("net.connman.Manager"), QStringLiteral("SetProperty"),
                       {QStringLiteral("OfflineMode"), QVariant::fromValue(QDBusVariant(isOn))});
    };
    const auto isOnline = [this] {
        return call(modemPath, QStringLiteral("org.ofono.Modem"), getProperties)
            .contains(QLatin1String("Online=<true>"));
    };
    setFlightMode(true);
    QVERIFY(!isOnline());
    QVERIFY(!hasNetwork(QStringLiteral("244051234567890_context1")));
    setFlightMode(false);
    QVERIFY(isOnline());
    QVERIFY(hasNetwork(QStringLiteral("244051234567890_context1")));
}

QTEST_GUILESS_MAIN(MobileDataServiceTest)

#include "mobiledataservice_test.moc"
