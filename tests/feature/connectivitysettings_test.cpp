// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"
#include "texts.h"
#include "waiting.h"
#include "wireobject.h"

#include <corvanemdm/connectivitysettings.h>

#include <QtCore/QJsonArray>
#include <QtCore/QProcess>
#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusVariant>
#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::ConnectivitySettings;
using AccessPoint = ConnectivitySettings::MobileNetworkAccessPointSettings;
using Technologies = ConnectivitySettings::CellularTechnologies;

namespace
{

const QString Connman = QStringLiteral("net.connman");
const QString Ofono = QStringLiteral("org.ofono");
const QString WlanPath = QStringLiteral("/net/connman/technology/wifi");
const QString TechnologyInterface = QStringLiteral("net.connman.Technology");
const QString ManagerInterface = QStringLiteral("net.connman.Manager");
const QString RootPath = QStringLiteral("/");
const QString GetProperties = QStringLiteral("GetProperties");
const QString SetProperty = QStringLiteral("SetProperty");
const QString PropertyChanged = QStringLiteral("PropertyChanged");
const QString Failed = QStringLiteral("org.freedesktop.DBus.Error.Failed");
const QString Broken = QStringLiteral("it is broken");

const QString FirstModem = QStringLiteral("/ril_0");
const QString SecondModem = QStringLiteral("/ril_1");
const QString FirstImsi = QStringLiteral("244051234567890");
const QString SecondImsi = QStringLiteral("262021234567891");
const QString UnknownImsi = QStringLiteral("999991234567890");
const QString FirstContext = QStringLiteral("/ril_0/context1");
const QString MmsContext = QStringLiteral("/ril_0/context2");
const QString FirstService = QStringLiteral("/net/connman/service/cellular_244051234567890_context1");

QVariant variantOf(const QVariant &value)
{
    return QVariant::fromValue(QDBusVariant(value));
}

/** A list of contexts, "/path:type" each. */
QVariant contexts(const QStringList &descriptions)
{
    QList<WireObject> list;
    for (const QString &description : descriptions) {
        const QStringList parts = description.split(QLatin1Char(':'));
        list.append({QDBusObjectPath(parts.at(0)), {{QStringLiteral("Type"), parts.at(1)}}});
    }
    return QVariant::fromValue(list);
}

QString textOf(const AccessPoint &point)
{
    return QStringLiteral("%1|%2|%3|%4|%5|%6|%7|%8|%9")
        .arg(QString::number(point.type), point.name, point.accessPointName, point.username, point.password,
             QString::number(point.protocol), QString::number(point.authenticationMethod),
             point.messageCenter, point.messageProxy);
}

QStringList textsOf(const QMap<AccessPoint::Type, AccessPoint> &points)
{
    QStringList result;
    for (auto point = points.begin(); point != points.end(); ++point)
        result.append(QStringLiteral("%1=%2").arg(int(point.key())).arg(textOf(point.value())));
    return result;
}

AccessPoint companyAccessPoint(AccessPoint::Type type = AccessPoint::Internet)
{
    AccessPoint point;
    point.type = type;
    point.name = QStringLiteral("Company");
    point.accessPointName = QStringLiteral("company.apn");
    point.username = QStringLiteral("user");
    point.password = QStringLiteral("secret");
    point.protocol = AccessPoint::ProtocolDual;
    point.authenticationMethod = AccessPoint::AuthenticationChap;
    point.messageCenter = QStringLiteral("http://center/");
    point.messageProxy = QStringLiteral("proxy:80");
    return point;
}

/** What writing companyAccessPoint() to a context sends. */
QStringList companyWrites(const QString &contextPath)
{
    const QString written = contextPath + QStringLiteral(" SetProperty ('%1', <'%2'>)");
    return {
        written.arg(QStringLiteral("Name"), QStringLiteral("Company")),
        written.arg(QStringLiteral("AccessPointName"), QStringLiteral("company.apn")),
        written.arg(QStringLiteral("Username"), QStringLiteral("user")),
        written.arg(QStringLiteral("Password"), QStringLiteral("secret")),
        written.arg(QStringLiteral("AuthenticationMethod"), QStringLiteral("chap")),
        written.arg(QStringLiteral("Protocol"), QStringLiteral("dual")),
        written.arg(QStringLiteral("MessageCenter"), QStringLiteral("http://center/")),
        written.arg(QStringLiteral("MessageProxy"), QStringLiteral("proxy:80")),
    };
}

// How a SIM of the first slot is found, and its contexts.
const QStringList &contextQueries()
{
    static const QStringList calls = texts({"/ GetInterfaceVersion ()", "/ GetAvailableModems ()",
                                            "/ril_0 GetProperties ()", "/ril_0 GetContexts ()"});
    return calls;
}

// How its network is found and looked at.
const QStringList &serviceQueries()
{
    static const QStringList calls{QStringLiteral("/ GetServices ()"),
                                   FirstService + QStringLiteral(" GetProperties ()")};
    return calls;
}

} // namespace

class ConnectivitySettingsTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void init();
    void cleanup();

    void metaObject();
    void modemPaths();
    void modemPathsOfAStockService();
    void modemPathsThatCannotBeRead_data();
    void modemPathsThatCannotBeRead();
    void subscriberIdentities();
    void mobileNetworkImsis();

    void unknownModem();
    void supportedTechnologies_data();
    void supportedTechnologies();
    void selectedTechnologies_data();
    void selectedTechnologies();
    void selectTechnologies_data();
    void selectTechnologies();
    void selectTechnologiesThroughTheMetaObject();
    void unsupportedTechnologies_data();
    void unsupportedTechnologies();
    void noRestrictionIsAlwaysAccepted();
    void radioSettingsThatFail();

    void accessPoints();
    void accessPointsBecomeTheDataSims();
    void strangeAccessPoints_data();
    void strangeAccessPoints();
    void laterAccessPointsReplaceEarlierOnes();
    void accessPointsWithoutTheDataSim();
    void mobileDataOfAStockService();
    void accessPointThatCannotBeRead();
    void accessPointsOfNobody();
    void validAccessPoints();
    void writesAnAccessPoint();
    void writesWordsForStrangeValues_data();
    void writesWordsForStrangeValues();
    void warningsComeInTheOrderOfTheWrites();
    void writesThatFail_data();
    void writesThatFail();
    void writesTheFirstOfItsType();
    void typeThatTheSimLacks();
    void contextThatCannotBeOpened();

    void connectedStates_data();
    void connectedStates();
    void unknownState();
    void contextOfMobileData_data();
    void contextOfMobileData();
    void mobileDataWithoutASim();
    void mobileDataWithoutAService_data();
    void mobileDataWithoutAService();
    void connectsAndDisconnects();
    void switchingThatFails_data();
    void switchingThatFails();
    void serviceThatVanishesDuringACall();
    void writesTheInternetAccessPoint_data();
    void writesTheInternetAccessPoint();
    void writesAnMmsAccessPointWhileConnected();
    void failedWriteReconnects();
    void otherModesAreNeverReady();
    void readyAtOnceOverDBus();
    void switchesOverDBus();
    void followsAnnouncementsOverDBus();
    void failuresOverDBus();
    void switchesOverTheNetworkManager();
    void wlanThatComesAndGoes();
    void restartOverTheNetworkManager();
    void deletedByAReceiver();

private:
    QStringList takeOfonoCalls() { return m_phone->takeJournal(Ofono); }
    void answerRadio(const QVariantMap &properties);
    void answerContexts(const QStringList &descriptions);
    void takeMobileDataDown(ConnectivitySettings &settings);
    bool isContextActive() const;

    std::unique_ptr<Phone> m_phone;
    std::unique_ptr<MessageLog> m_log;
};

void ConnectivitySettingsTest::initTestCase()
{
    WireObject::registerTypes();
}

void ConnectivitySettingsTest::init()
{
    m_phone = std::make_unique<Phone>();
    m_log = std::make_unique<MessageLog>();
}

void ConnectivitySettingsTest::cleanup()
{
    // What a test has not looked at is not to be there.
    const QStringList warnings = m_log->takeWarnings();
    m_log.reset();
    m_phone->clearFaults();
    m_phone->startService(Ofono);
    m_phone->startService(Connman);
    QCOMPARE(warnings, QStringList());
}

void ConnectivitySettingsTest::answerRadio(const QVariantMap &properties)
{
    m_phone->answerCalls(Ofono, FirstModem, GetProperties, {properties});
}

void ConnectivitySettingsTest::answerContexts(const QStringList &descriptions)
{
    m_phone->answerCalls(Ofono, FirstModem, QStringLiteral("GetContexts"), {contexts(descriptions)});
}

void ConnectivitySettingsTest::takeMobileDataDown(ConnectivitySettings &settings)
{
    QVERIFY(settings.disconnectFromMobileNetwork(FirstImsi));
    QVERIFY(!settings.isConnectedToMobileNetwork(FirstImsi));
    m_log->takeInfos();
}

/** What the telephony service itself makes of the first one. */
bool ConnectivitySettingsTest::isContextActive() const
{
    const QJsonObject modem = m_phone->state().value(QLatin1String("modems")).toArray().at(0).toObject();
    const QJsonArray accessPoints = modem.value(QLatin1String("accessPoints")).toArray();
    return accessPoints.at(0).toObject().value(QLatin1String("active")).toBool();
}

void ConnectivitySettingsTest::metaObject()
{
    const QMetaObject &meta = ConnectivitySettings::staticMetaObject;
    for (const char *name : {"ready", "flightModeEnabled", "wlanEnabled"}) {
        const QMetaProperty property = meta.property(meta.indexOfProperty(name));
        QVERIFY2(property.isReadable() && !property.isWritable() && property.hasNotifySignal(), name);
        QCOMPARE(property.notifySignal().name(), QByteArray(name) + "Changed");
        QCOMPARE(int(property.userType()), int(QMetaType::Bool));
    }
    const QMetaEnum technologies = QMetaEnum::fromType<Technologies>();
    QVERIFY(technologies.isFlag());
    QCOMPARE(technologies.keysToValue("Technology2G|Technology4G"), 5);
    QCOMPARE(QMetaEnum::fromType<ConnectivitySettings::CellularTechnology>().keyToValue("Technology5G"), 8);
    QCOMPARE(meta.indexOfEnumerator("Mode"), -1);

    const QMetaMethod select = meta.method(meta.indexOfMethod(
        "selectCellularTechnologies(QString,Corvane::Mdm::ConnectivitySettings::CellularTechnologies)"));
    QCOMPARE(select.parameterNames(), (QList<QByteArray>{"modemPath", "techs"}));
    QCOMPARE(select.returnType(), int(QMetaType::Bool));
    QCOMPARE(select.parameterType(1), qMetaTypeId<Technologies>());
}

void ConnectivitySettingsTest::modemPaths()
{
    const ConnectivitySettings settings;
    takeOfonoCalls();
    QCOMPARE(settings.modemPaths(), texts({"/ril_0", "/ril_1"}));
    QCOMPARE(m_phone->takeJournalWithInterfaces(Ofono),
             texts({"/ org.veldmobile.ofono.ModemManager.GetInterfaceVersion ()",
                    "/ org.veldmobile.ofono.ModemManager.GetAvailableModems ()"}));
}

void ConnectivitySettingsTest::modemPathsOfAStockService()
{
    const ConnectivitySettings settings;
    m_phone->act(QStringLiteral("phone extensions"), {QStringLiteral("off")});
    takeOfonoCalls();
    QCOMPARE(settings.modemPaths(), texts({"/ril_0", "/ril_1"}));
    QCOMPARE(m_phone->takeJournalWithInterfaces(Ofono),
             texts({"/ org.veldmobile.ofono.ModemManager.GetInterfaceVersion ()",
                    "/ org.ofono.Manager.GetModems ()"}));
    QCOMPARE(settings.mobileNetworkImsis(), (QStringList{FirstImsi, SecondImsi}));

    m_phone->failCalls(Ofono, RootPath, QStringLiteral("GetModems"), Failed, Broken);
    QCOMPARE(settings.modemPaths(), QStringList());
    QCOMPARE(m_log->takeWarnings(), texts({"Unable to get modems: \"it is broken\""}));
    m_phone->act(QStringLiteral("phone extensions"), {QStringLiteral("on")});

    // An extension older than its first version is none.
    m_phone->clearFaults();
    m_phone->answerCalls(Ofono, RootPath, QStringLiteral("GetInterfaceVersion"), {0});
    takeOfonoCalls();
    QCOMPARE(settings.modemPaths(), texts({"/ril_0", "/ril_1"}));
    QCOMPARE(takeOfonoCalls(), texts({"/ GetInterfaceVersion ()", "/ GetModems ()"}));
}

void ConnectivitySettingsTest::modemPathsThatCannotBeRead_data()
{
    QTest::addColumn<QString>("member");
    QTest::addColumn<QVariantList>("answer");
    QTest::addColumn<QString>("warning");

    const QString version = QStringLiteral("GetInterfaceVersion");
    const QString modems = QStringLiteral("GetAvailableModems");
    const QString ofVersion = QStringLiteral("Unable to determine modem manager interface version: ");
    const QString ofModems = QStringLiteral("Unable to get modem manager interface properties: ");
    const QString broken = QStringLiteral("\"it is broken\"");
    QTest::newRow("version fails") << version << QVariantList() << QString(ofVersion + broken);
    QTest::newRow("modems fail") << modems << QVariantList() << QString(ofModems + broken);
    QTest::newRow("version is a text") << version << QVariantList{QStringLiteral("1")} << ofVersion;
    QTest::newRow("modems are a number") << modems << QVariantList{7} << ofModems;
}

void ConnectivitySettingsTest::modemPathsThatCannotBeRead()
{
    QFETCH(QString, member);
    QFETCH(QVariantList, answer);
    QFETCH(QString, warning);
    const ConnectivitySettings settings;
    if (answer.isEmpty())
        m_phone->failCalls(Ofono, RootPath, member, Failed, Broken);
    else
        m_phone->answerCalls(Ofono, RootPath, member, answer);
    QCOMPARE(settings.modemPaths(), QStringList());
    const QStringList warnings = m_log->takeWarnings();
    QCOMPARE(warnings.size(), 1);
    QVERIFY2(warnings.first().startsWith(warning), qPrintable(warnings.first()));

    m_phone->clearFaults();
    m_phone->stopService(Ofono);
    QCOMPARE(settings.modemPaths(), QStringList());
    const QStringList unavailable = m_log->takeWarnings();
    QCOMPARE(unavailable.size(), 1);
    QVERIFY(unavailable.first().startsWith(
        QLatin1String("Unable to determine modem manager interface version: \"The name org.ofono")));
}

void ConnectivitySettingsTest::subscriberIdentities()
{
    const ConnectivitySettings settings;
    takeOfonoCalls();
    QCOMPARE(settings.modemSimImsi(SecondModem), SecondImsi);
    QCOMPARE(m_phone->takeJournalWithInterfaces(Ofono),
             texts({"/ril_1 org.ofono.SimManager.GetProperties ()"}));

    m_phone->act(QStringLiteral("sim pull"), {QStringLiteral("0")});
    QCOMPARE(settings.modemSimImsi(FirstModem), QString());
    m_phone->act(QStringLiteral("sim insert"), {QStringLiteral("0")});
    const QStringList missing = texts({"Subscriber Identity property not returned for SIM: \"/ril_0\""});
    QCOMPARE(m_log->takeWarnings(), missing);

    m_phone->failCalls(Ofono, FirstModem, GetProperties, Failed, Broken);
    QCOMPARE(settings.modemSimImsi(FirstModem), QString());
    QCOMPARE(m_log->takeWarnings(), missing);

    QCOMPARE(settings.modemSimImsi(QStringLiteral("/ril_7")), QString());
    QCOMPARE(settings.modemSimImsi(QStringLiteral("no path")), QString());
    QCOMPARE(m_log->takeWarnings(),
             texts({"Subscriber Identity property not returned for SIM: \"/ril_7\"",
                    "Subscriber Identity property not returned for SIM: \"no path\""}));
}

void ConnectivitySettingsTest::mobileNetworkImsis()
{
    const ConnectivitySettings settings;
    takeOfonoCalls();
    QCOMPARE(settings.mobileNetworkImsis(), (QStringList{FirstImsi, SecondImsi}));
    QCOMPARE(takeOfonoCalls(),
             texts({"/ GetInterfaceVersion ()", "/ GetAvailableModems ()", "/ril_0 GetProperties ()",
                    "/ril_0 GetContexts ()", "/ril_1 GetProperties ()", "/ril_1 GetContexts ()"}));

    // A SIM without contexts is none of mobile data.
    answerContexts({});
    QCOMPARE(settings.mobileNetworkImsis(), QStringList(SecondImsi));

    m_phone->clearFaults();
    m_phone->failCalls(Ofono, FirstModem, QStringLiteral("GetContexts"), Failed, Broken);
    QCOMPARE(settings.mobileNetworkImsis(), QStringList(SecondImsi));
    QCOMPARE(m_log->takeWarnings(), texts({"Unable to get contexts: \"it is broken\""}));

    m_phone->clearFaults();
    answerRadio({{QStringLiteral("SubscriberIdentity"), QString()}});
    QCOMPARE(settings.mobileNetworkImsis(), QStringList(SecondImsi));
}

void ConnectivitySettingsTest::unknownModem()
{
    ConnectivitySettings settings;
    const QString modem = QStringLiteral("/ril_7");
    QCOMPARE(settings.supportedCellularTechnologies(modem), QVector<Technologies>());
    QCOMPARE(settings.selectedCellularTechnologies(modem), Technologies());
    QVERIFY(!settings.selectCellularTechnologies(modem, ConnectivitySettings::TechnologyNone));
    const QString warning = QStringLiteral("No such modem path: \"/ril_7\" in: (\"/ril_0\", \"/ril_1\")");
    QCOMPARE(m_log->takeWarnings(), (QStringList{warning, warning, warning}));
}

void ConnectivitySettingsTest::supportedTechnologies_data()
{
    QTest::addColumn<QVariantMap>("properties");
    QTest::addColumn<QVector<int>>("supported");

    const auto row = [](const char *name, const QStringList &available, const QVector<int> &supported) {
        QTest::newRow(name) << QVariantMap{{QStringLiteral("AvailableTechnologies"), available}} << supported;
    };
    row("all", texts({"gsm", "umts", "lte"}), {1, 3, 7});
    row("all, in another order", texts({"lte", "gsm", "umts"}), {1, 3, 7});
    row("without 2G", texts({"umts", "lte"}), {3, 7});
    row("4G alone", texts({"lte"}), {7});
    row("2G alone", texts({"gsm"}), {1});
    row("2G and 4G", texts({"gsm", "lte"}), {1, 7});
    row("5G is never offered", texts({"gsm", "umts", "lte", "nr"}), {1, 3, 7});
    row("unknown ones", texts({"nr", "LTE"}), {0});
    row("none", {}, {0});
    QTest::newRow("missing") << QVariantMap() << QVector<int>{0};
    QTest::newRow("a number") << QVariantMap{{QStringLiteral("AvailableTechnologies"), 3}} << QVector<int>{0};
}

void ConnectivitySettingsTest::supportedTechnologies()
{
    QFETCH(QVariantMap, properties);
    QFETCH(QVector<int>, supported);
    const ConnectivitySettings settings;
    answerRadio(properties);
    takeOfonoCalls();
    QVector<int> found;
    for (const Technologies technologies : settings.supportedCellularTechnologies(FirstModem))
        found.append(int(technologies));
    QCOMPARE(found, supported);
    QCOMPARE(m_phone->takeJournalWithInterfaces(Ofono).last(),
             QStringLiteral("/ril_0 org.ofono.RadioSettings.GetProperties ()"));
}

void ConnectivitySettingsTest::selectedTechnologies_data()
{
    QTest::addColumn<QVariantMap>("properties");
    QTest::addColumn<int>("selected");
    const auto row
        = [](const char *preference, int selected) {
              QTest::newRow(preference)
                  << QVariantMap{{QStringLiteral("TechnologyPreference"), QString::fromLatin1(preference)}}
                  << selected;
          };
    row("any", 0);
    row("gsm", 1);
    row("umts", 3);
    row("lte", 7);
    row("nr", 7);
    row("", 0);
    QTest::newRow("missing") << QVariantMap() << 0;
}

void ConnectivitySettingsTest::selectedTechnologies()
{
    QFETCH(QVariantMap, properties);
    QFETCH(int, selected);
    const ConnectivitySettings settings;
    answerRadio(properties);
    QCOMPARE(int(settings.selectedCellularTechnologies(FirstModem)), selected);
}

void ConnectivitySettingsTest::selectTechnologies_data()
{
    QTest::addColumn<int>("technologies");
    QTest::addColumn<QString>("word");
    QTest::newRow("2G") << 1 << QStringLiteral("gsm");
    QTest::newRow("3G") << 3 << QStringLiteral("umts");
    QTest::newRow("4G") << 7 << QStringLiteral("lte");
    QTest::newRow("no restriction") << 0 << QStringLiteral("any");
}

void ConnectivitySettingsTest::selectTechnologies()
{
    QFETCH(int, technologies);
    QFETCH(QString, word);
    ConnectivitySettings settings;
    takeOfonoCalls();
    QVERIFY(settings.selectCellularTechnologies(FirstModem, Technologies(technologies)));
    QCOMPARE(m_phone->takeJournalWithInterfaces(Ofono),
             (QStringList{QStringLiteral("/ org.veldmobile.ofono.ModemManager.GetInterfaceVersion ()"),
                          QStringLiteral("/ org.veldmobile.ofono.ModemManager.GetAvailableModems ()"),
                          QStringLiteral("/ril_0 org.ofono.RadioSettings.GetProperties ()"),
                          QStringLiteral("/ril_0 org.ofono.RadioSettings.SetProperty "
                                         "('TechnologyPreference', <'%1'>)")
                              .arg(word)}));
    QCOMPARE(int(settings.selectedCellularTechnologies(FirstModem)), technologies);
    QCOMPARE(int(settings.selectedCellularTechnologies(SecondModem)), 0);
}

void ConnectivitySettingsTest::selectTechnologiesThroughTheMetaObject()
{
    ConnectivitySettings settings;
    bool selected = false;
    QVERIFY(QMetaObject::invokeMethod(
        &settings, "selectCellularTechnologies", Q_RETURN_ARG(bool, selected), Q_ARG(QString, SecondModem),
        Q_ARG(Corvane::Mdm::ConnectivitySettings::CellularTechnologies, Technologies(3))));
    QVERIFY(selected);
    QCOMPARE(int(settings.selectedCellularTechnologies(SecondModem)), 3);
    QVERIFY(settings.selectCellularTechnologies(SecondModem, ConnectivitySettings::TechnologyNone));
}

void ConnectivitySettingsTest::unsupportedTechnologies_data()
{
    QTest::addColumn<int>("technologies");
    QTest::newRow("3G alone") << 2;
    QTest::newRow("4G alone") << 4;
    QTest::newRow("5G") << 8;
    QTest::newRow("2G and 4G") << 5;
    QTest::newRow("all with 5G") << 15;
    QTest::newRow("what the modem lacks") << 7;
}

void ConnectivitySettingsTest::unsupportedTechnologies()
{
    QFETCH(int, technologies);
    ConnectivitySettings settings;
    answerRadio({{QStringLiteral("AvailableTechnologies"), texts({"gsm", "umts"})}});
    takeOfonoCalls();
    QVERIFY(!settings.selectCellularTechnologies(FirstModem, Technologies(technologies)));
    QCOMPARE(m_log->takeWarnings(),
             texts({"Unsupported cellular technologies selection specified for modem: \"/ril_0\""}));
    QVERIFY(takeOfonoCalls().filter(SetProperty).isEmpty());
}

void ConnectivitySettingsTest::noRestrictionIsAlwaysAccepted()
{
    ConnectivitySettings settings;
    QVERIFY(settings.selectCellularTechnologies(FirstModem, ConnectivitySettings::Technology2G));
    QVERIFY(!settings.supportedCellularTechnologies(FirstModem).contains(Technologies()));
    QVERIFY(settings.selectCellularTechnologies(FirstModem, ConnectivitySettings::TechnologyNone));
    QCOMPARE(int(settings.selectedCellularTechnologies(FirstModem)), 0);
}

void ConnectivitySettingsTest::radioSettingsThatFail()
{
    ConnectivitySettings settings;
    m_phone->failCalls(Ofono, FirstModem, SetProperty, Failed, Broken);
    QVERIFY(!settings.selectCellularTechnologies(FirstModem, ConnectivitySettings::Technology2G));
    QCOMPARE(m_log->takeWarnings(),
             texts({"Unable to set the preferred radio technology: \"it is broken\""}));

    m_phone->failCalls(Ofono, FirstModem, GetProperties, Failed, Broken);
    QCOMPARE(settings.supportedCellularTechnologies(FirstModem), QVector<Technologies>{Technologies()});
    QCOMPARE(settings.selectedCellularTechnologies(FirstModem), Technologies());
    QVERIFY(!settings.selectCellularTechnologies(FirstModem, ConnectivitySettings::Technology2G));
    const QString unread = QStringLiteral("Unable to get radio settings properties: \"it is broken\"");
    QCOMPARE(m_log->takeWarnings(),
             (QStringList{unread, unread, unread,
                          QStringLiteral("Unsupported cellular technologies selection specified for modem: "
                                         "\"/ril_0\"")}));
}

void ConnectivitySettingsTest::accessPoints()
{
    const ConnectivitySettings settings;
    takeOfonoCalls();
    QCOMPARE(textsOf(settings.accessPointSettings(FirstImsi)),
             texts({"0=0|Elo Internet|internet.elo|||0|0||",
                    "1=1|Elo MMS|mms.elo|||0|0|http://mmsc.elo.example/|192.0.2.8:8080"}));
    const QString setDataSim = QStringLiteral("/ SetDefaultDataSim ('244051234567890',)");
    QCOMPARE(takeOfonoCalls(),
             (contextQueries()
              + QStringList{setDataSim, QStringLiteral("/ril_0/context1 GetProperties ()"), setDataSim,
                            QStringLiteral("/ril_0/context2 GetProperties ()")}));
}

void ConnectivitySettingsTest::accessPointsBecomeTheDataSims()
{
    const ConnectivitySettings settings;
    const auto dataSim = [this] {
        return m_phone->state().value(QLatin1String("telephony")).toObject().value(QLatin1String("dataSim"));
    };
    QCOMPARE(textsOf(settings.accessPointSettings(SecondImsi)), texts({"0=0|Tarn Web|web.tarn|||0|0||"}));
    QCOMPARE(dataSim().toString(), SecondImsi);
    settings.accessPointSettings(FirstImsi);
    QCOMPARE(dataSim().toString(), FirstImsi);
}

void ConnectivitySettingsTest::strangeAccessPoints_data()
{
    QTest::addColumn<QVariantMap>("properties");
    QTest::addColumn<QString>("point");
    QTest::addColumn<QStringList>("warnings");

    const QStringList noProtocol = texts({"Unknown protocol: \"\" , assuming IP"});
    const auto row = [](const char *name, QVariantMap properties, const char *point,
                        const QStringList &warnings = QStringList()) {
        if (!properties.contains(QStringLiteral("Protocol")))
            properties.insert(QStringLiteral("Protocol"), QStringLiteral("ip"));
        QTest::newRow(name) << properties << QString::fromLatin1(point) << warnings;
    };
    const QString type = QStringLiteral("Type");
    const QString protocol = QStringLiteral("Protocol");
    const QString method = QStringLiteral("AuthenticationMethod");
    row("unknown type", {{type, QStringLiteral("wap")}}, "0=0|||||0|0||");
    row("mms", {{type, QStringLiteral("mms")}}, "1=1|||||0|0||");
    row("ims", {{type, QStringLiteral("ims")}}, "2=2|||||0|0||");
    row("ipv6", {{protocol, QStringLiteral("ipv6")}}, "0=0|||||1|0||");
    row("dual", {{protocol, QStringLiteral("dual")}}, "0=0|||||2|0||");
    row("unknown protocol", {{protocol, QStringLiteral("x25")}}, "0=0|||||0|0||",
        texts({"Unknown protocol: \"x25\" , assuming IP"}));
    row("none", {{method, QStringLiteral("none")}}, "0=0|||||0|0||");
    row("pap", {{method, QStringLiteral("pap")}}, "0=0|||||0|1||");
    row("chap", {{method, QStringLiteral("chap")}}, "0=0|||||0|2||");
    row("any", {{method, QStringLiteral("any")}}, "0=0|||||0|3||");
    row("unknown method", {{method, QStringLiteral("eap")}}, "0=0|||||0|3||");
    row("empty method", {{method, QString()}}, "0=0|||||0|3||");
    row("numbers", {{QStringLiteral("Name"), 7}, {QStringLiteral("Username"), 1.5}}, "0=0|7||1.5||0|0||");
    row("lists", {{QStringLiteral("Name"), QStringList{QStringLiteral("a"), QStringLiteral("b")}}},
        "0=0|||||0|0||");
    QTest::newRow("nothing") << QVariantMap() << QStringLiteral("0=0|||||0|0||") << noProtocol;
}

void ConnectivitySettingsTest::strangeAccessPoints()
{
    QFETCH(QVariantMap, properties);
    QFETCH(QString, point);
    QFETCH(QStringList, warnings);
    const ConnectivitySettings settings;
    answerContexts({QStringLiteral("/ril_0/context1:internet")});
    m_phone->answerCalls(Ofono, FirstContext, GetProperties, {properties});
    QCOMPARE(textsOf(settings.accessPointSettings(FirstImsi)), QStringList(point));
    QCOMPARE(m_log->takeWarnings(), warnings);
}

void ConnectivitySettingsTest::laterAccessPointsReplaceEarlierOnes()
{
    const ConnectivitySettings settings;
    const QVariantMap shadow{{QStringLiteral("Type"), QStringLiteral("wap")},
                             {QStringLiteral("Name"), QStringLiteral("Shadow")},
                             {QStringLiteral("Protocol"), QStringLiteral("dual")}};
    m_phone->answerCalls(Ofono, MmsContext, GetProperties, {shadow});
    QCOMPARE(textsOf(settings.accessPointSettings(FirstImsi)), texts({"0=0|Shadow||||2|0||"}));

    answerContexts({QStringLiteral("/ril_0/context2:wap"), QStringLiteral("/ril_0/context1:internet")});
    QCOMPARE(textsOf(settings.accessPointSettings(FirstImsi)),
             texts({"0=0|Elo Internet|internet.elo|||0|0||"}));
}

void ConnectivitySettingsTest::accessPointsWithoutTheDataSim()
{
    const ConnectivitySettings settings;
    const QString setDataSim = QStringLiteral("SetDefaultDataSim");
    const QString warning = QStringLiteral("Unable to set the default data SIM: \"it is broken\"");
    m_phone->failCalls(Ofono, RootPath, setDataSim, Failed, Broken);
    takeOfonoCalls();
    QVERIFY(settings.accessPointSettings(FirstImsi).isEmpty());
    QCOMPARE(m_log->takeWarnings(), QStringList(warning));
    // The others are not tried.
    QCOMPARE(takeOfonoCalls(), contextQueries() + texts({"/ SetDefaultDataSim ('244051234567890',)"}));

    // What has been read so far is kept.
    m_phone->clearFaults();
    m_phone->failCall(2, Ofono, RootPath, setDataSim, Failed, Broken);
    QCOMPARE(textsOf(settings.accessPointSettings(FirstImsi)),
             texts({"0=0|Elo Internet|internet.elo|||0|0||"}));
    QCOMPARE(m_log->takeWarnings(), QStringList(warning));
}

void ConnectivitySettingsTest::mobileDataOfAStockService()
{
    ConnectivitySettings settings;
    m_phone->act(QStringLiteral("phone extensions"), {QStringLiteral("off")});
    QCOMPARE(settings.supportedCellularTechnologies(FirstModem).size(), 3);
    QVERIFY(settings.connectToMobileNetwork(FirstImsi));
    QVERIFY(settings.isConnectedToMobileNetwork(FirstImsi));
    QVERIFY(settings.disconnectFromMobileNetwork(FirstImsi));
    QCOMPARE(m_log->takeWarnings(), QStringList());

    // Nobody there could make the SIM the one for mobile data.
    QVERIFY(settings.accessPointSettings(FirstImsi).isEmpty());
    QVERIFY(!settings.setAccessPointSettings(FirstImsi, companyAccessPoint()));
    m_phone->act(QStringLiteral("phone extensions"), {QStringLiteral("on")});
    const QStringList warnings = m_log->takeWarnings();
    QCOMPARE(warnings.size(), 2);
    for (const QString &warning : warnings)
        QVERIFY(warning.startsWith(QLatin1String("Unable to set the default data SIM: \"")));
}

void ConnectivitySettingsTest::accessPointThatCannotBeRead()
{
    const ConnectivitySettings settings;
    m_phone->failCalls(Ofono, FirstContext, GetProperties, Failed, Broken);
    QCOMPARE(textsOf(settings.accessPointSettings(FirstImsi)),
             texts({"1=1|Elo MMS|mms.elo|||0|0|http://mmsc.elo.example/|192.0.2.8:8080"}));
    QCOMPARE(m_log->takeWarnings(), texts({"Unable to get access point settings: \"it is broken\""}));

    // One that vanished since it was listed.
    m_phone->clearFaults();
    answerContexts({QStringLiteral("/ril_0/context9:internet")});
    QVERIFY(settings.accessPointSettings(FirstImsi).isEmpty());
    const QStringList warnings = m_log->takeWarnings();
    QCOMPARE(warnings.size(), 1);
    QVERIFY(warnings.first().startsWith(QLatin1String("Unable to get access point settings: \"")));
}

void ConnectivitySettingsTest::accessPointsOfNobody()
{
    ConnectivitySettings settings;
    for (const QString &imsi : {UnknownImsi, QString()}) {
        takeOfonoCalls();
        QVERIFY(settings.accessPointSettings(imsi).isEmpty());
        QVERIFY(!settings.setAccessPointSettings(imsi, companyAccessPoint()));
        QVERIFY(takeOfonoCalls().filter(QStringLiteral("Set")).isEmpty());
        QCOMPARE(m_log->takeWarnings(), QStringList());
    }

    answerContexts({});
    QVERIFY(settings.accessPointSettings(FirstImsi).isEmpty());
    QVERIFY(!settings.setAccessPointSettings(FirstImsi, companyAccessPoint()));
    QCOMPARE(m_log->takeWarnings(), QStringList());

    m_phone->answerCalls(Ofono, FirstModem, QStringLiteral("GetContexts"), {QStringLiteral("none")});
    QVERIFY(settings.accessPointSettings(FirstImsi).isEmpty());
    const QStringList warnings = m_log->takeWarnings();
    QCOMPARE(warnings.size(), 1);
    QVERIFY(warnings.first().startsWith(QLatin1String("Unable to get contexts: \"Unexpected reply")));
}

void ConnectivitySettingsTest::validAccessPoints()
{
    AccessPoint point;
    QVERIFY(!point.isValid());
    point.username = QStringLiteral("user");
    QVERIFY(!point.isValid());
    point.accessPointName = QStringLiteral("apn");
    QVERIFY(point.isValid());
    point.name = QStringLiteral("Name");
    QVERIFY(point.isValid());
    point.accessPointName.clear();
    QVERIFY(point.isValid());
}

void ConnectivitySettingsTest::writesAnAccessPoint()
{
    ConnectivitySettings settings;
    m_phone->takeJournal({Ofono, Connman});
    QVERIFY(settings.setAccessPointSettings(FirstImsi, companyAccessPoint(AccessPoint::Mms)));
    // Mobile data is nothing that an MMS access point has to do with.
    QCOMPARE(m_phone->takeJournal({Ofono, Connman}),
             contextQueries() + texts({"/ SetDefaultDataSim ('244051234567890',)"})
                 + companyWrites(MmsContext));
    QCOMPARE(textOf(settings.accessPointSettings(FirstImsi).value(AccessPoint::Mms)),
             QStringLiteral("1|Company|company.apn|user|secret|2|2|http://center/|proxy:80"));
}

void ConnectivitySettingsTest::writesWordsForStrangeValues_data()
{
    QTest::addColumn<int>("protocol");
    QTest::addColumn<int>("method");
    QTest::addColumn<QString>("protocolWord");
    QTest::addColumn<QString>("methodWord");
    QTest::addColumn<QStringList>("warnings");
    const auto row = [](int protocol, int method, const char *protocolWord, const char *methodWord,
                        const QStringList &warnings = QStringList()) {
        QTest::addRow("%d, %d", protocol, method) << protocol << method << QString::fromLatin1(protocolWord)
                                                  << QString::fromLatin1(methodWord) << warnings;
    };
    row(0, 0, "ip", "none");
    row(1, 1, "ipv6", "pap");
    row(2, 2, "dual", "chap");
    row(0, 3, "ip", "any");
    row(3, 4, "ip", "none", texts({"Unknown protocol: 3 , assuming ip"}));
    row(-1, -1, "ip", "none", texts({"Unknown protocol: -1 , assuming ip"}));
}

void ConnectivitySettingsTest::writesWordsForStrangeValues()
{
    QFETCH(int, protocol);
    QFETCH(int, method);
    QFETCH(QString, protocolWord);
    QFETCH(QString, methodWord);
    QFETCH(QStringList, warnings);
    ConnectivitySettings settings;
    AccessPoint point = companyAccessPoint(AccessPoint::Mms);
    point.protocol = AccessPoint::Protocol(protocol);
    point.authenticationMethod = AccessPoint::AuthenticationMethod(method);
    takeOfonoCalls();
    QVERIFY(settings.setAccessPointSettings(FirstImsi, point));
    QCOMPARE(m_log->takeWarnings(), warnings);
    const QStringList writes = takeOfonoCalls().filter(SetProperty);
    QCOMPARE(writes.at(4),
             MmsContext + QStringLiteral(" SetProperty ('AuthenticationMethod', <'%1'>)").arg(methodWord));
    QCOMPARE(writes.at(5),
             MmsContext + QStringLiteral(" SetProperty ('Protocol', <'%1'>)").arg(protocolWord));
}

void ConnectivitySettingsTest::warningsComeInTheOrderOfTheWrites()
{
    ConnectivitySettings settings;
    AccessPoint point = companyAccessPoint(AccessPoint::Mms);
    point.protocol = AccessPoint::Protocol(5);
    m_phone->failCalls(Ofono, MmsContext, SetProperty, Failed, Broken);
    QVERIFY(!settings.setAccessPointSettings(FirstImsi, point));
    const QStringList warnings = m_log->takeWarnings();
    QCOMPARE(warnings.size(), 9);
    QCOMPARE(warnings.at(3),
             QStringLiteral("Unable to set password for the given IMSI: \"244051234567890\""));
    const QString protocol = QStringLiteral("Unable to set protocol for the given IMSI: \"244051234567890\"");
    QCOMPARE(warnings.mid(4, 3),
             (QStringList{protocol, QStringLiteral("Unknown protocol: 5 , assuming ip"), protocol}));
}

void ConnectivitySettingsTest::writesThatFail_data()
{
    QTest::addColumn<QVector<int>>("failing");
    const char *const names[] = {"name",   "access point name", "username",       "password",
                                 "method", "protocol",          "message center", "message proxy"};
    for (int write = 0; write < 8; ++write)
        QTest::newRow(names[write]) << QVector<int>{write};
    QTest::newRow("first and last") << QVector<int>{0, 7};
    QTest::newRow("method and protocol") << QVector<int>{4, 5};
    QTest::newRow("all") << QVector<int>{0, 1, 2, 3, 4, 5, 6, 7};
}

void ConnectivitySettingsTest::writesThatFail()
{
    static const char *const warnings[] = {
        "Unable to set connection name for the given IMSI: \"244051234567890\"",
        "Unable to set access point name for the given IMSI: \"244051234567890\"",
        "Unable to set username for the given IMSI: \"244051234567890\"",
        "Unable to set password for the given IMSI: \"244051234567890\"",
        "Unable to set protocol for the given IMSI: \"244051234567890\"",
        "Unable to set protocol for the given IMSI: \"244051234567890\"",
        "Unable to set message center for the given IMSI: \"244051234567890\"",
        "Unable to set message proxy for the given IMSI: \"244051234567890\"",
    };
    QFETCH(QVector<int>, failing);
    ConnectivitySettings settings;
    // The newest fault is the first to be used up, so the calls are told off from the last one to the first.
    for (auto write = failing.crbegin(); write != failing.crend(); ++write) {
        m_phone->failCall(1, Ofono, MmsContext, SetProperty, Failed, Broken);
        const int before = std::next(write) == failing.crend() ? *write : *write - *std::next(write) - 1;
        m_phone->letCallsPass(before, Ofono, MmsContext, SetProperty);
    }
    takeOfonoCalls();
    QVERIFY(!settings.setAccessPointSettings(FirstImsi, companyAccessPoint(AccessPoint::Mms)));
    QStringList expected;
    for (const int write : qAsConst(failing))
        expected.append(QString::fromLatin1(warnings[write]));
    QCOMPARE(m_log->takeWarnings(), expected);
    // One failure does not keep the others from being written.
    QCOMPARE(takeOfonoCalls().filter(SetProperty), companyWrites(MmsContext));
}

void ConnectivitySettingsTest::writesTheFirstOfItsType()
{
    ConnectivitySettings settings;
    answerContexts({QStringLiteral("/ril_0/context2:wap"), QStringLiteral("/ril_0/context1:internet")});
    takeOfonoCalls();
    settings.setAccessPointSettings(FirstImsi, companyAccessPoint());
    QCOMPARE(takeOfonoCalls().filter(SetProperty), companyWrites(MmsContext));
    m_log->takeWarnings();

    answerContexts({QStringLiteral("/ril_0/context2:mms"), QStringLiteral("/ril_0/context1:mms")});
    takeOfonoCalls();
    QVERIFY(settings.setAccessPointSettings(FirstImsi, companyAccessPoint(AccessPoint::Mms)));
    QCOMPARE(takeOfonoCalls().filter(SetProperty), companyWrites(MmsContext));
}

void ConnectivitySettingsTest::typeThatTheSimLacks()
{
    ConnectivitySettings settings;
    takeOfonoCalls();
    QVERIFY(!settings.setAccessPointSettings(FirstImsi, companyAccessPoint(AccessPoint::Ims)));
    QVERIFY(!settings.setAccessPointSettings(FirstImsi, companyAccessPoint(AccessPoint::Type(7))));
    QCOMPARE(m_log->takeWarnings(),
             texts({"Unable to find 2 connection context for IMSI: \"244051234567890\"",
                    "Unable to find 7 connection context for IMSI: \"244051234567890\""}));
    QCOMPARE(takeOfonoCalls(), contextQueries() + contextQueries());
}

void ConnectivitySettingsTest::contextThatCannotBeOpened()
{
    ConnectivitySettings settings;
    m_phone->failCalls(Ofono, RootPath, QStringLiteral("SetDefaultDataSim"), Failed, Broken);
    QVERIFY(!settings.setAccessPointSettings(FirstImsi, companyAccessPoint()));
    QCOMPARE(m_log->takeWarnings(), texts({"Unable to set the default data SIM: \"it is broken\""}));
    QVERIFY(takeOfonoCalls().filter(SetProperty).isEmpty());
}

void ConnectivitySettingsTest::connectedStates_data()
{
    QTest::addColumn<QVariantMap>("properties");
    QTest::addColumn<bool>("connected");
    const auto row = [](const char *state, bool connected) {
        QTest::newRow(state) << QVariantMap{{QStringLiteral("State"), QString::fromLatin1(state)}}
                             << connected;
    };
    row("online", true);
    row("ready", true);
    row("idle", false);
    row("association", false);
    row("configuration", false);
    row("disconnect", false);
    row("failure", false);
    row("Ready", false);
    row("", false);
    QTest::newRow("a number") << QVariantMap{{QStringLiteral("State"), 1}} << false;
}

void ConnectivitySettingsTest::connectedStates()
{
    QFETCH(QVariantMap, properties);
    QFETCH(bool, connected);
    const ConnectivitySettings settings;
    m_phone->answerCalls(Connman, FirstService, GetProperties, {properties});
    m_phone->takeJournal({Ofono, Connman});
    QCOMPARE(settings.isConnectedToMobileNetwork(FirstImsi), connected);
    QCOMPARE(m_phone->takeJournal({Ofono, Connman}), contextQueries() + serviceQueries());
}

void ConnectivitySettingsTest::unknownState()
{
    const ConnectivitySettings settings;
    m_phone->answerCalls(Connman, FirstService, GetProperties, {QVariantMap()});
    QVERIFY(!settings.isConnectedToMobileNetwork(FirstImsi));
    QCOMPARE(m_log->takeWarnings(),
             texts({"Connection State property not returned for connection: \"/ril_0/context1\" "
                    "from IMSI: \"244051234567890\""}));

    m_phone->failCalls(Connman, FirstService, GetProperties, Failed, Broken);
    QVERIFY(!settings.isConnectedToMobileNetwork(FirstImsi));
    QCOMPARE(m_log->takeWarnings(), texts({"\"it is broken\""}));
}

void ConnectivitySettingsTest::contextOfMobileData_data()
{
    QTest::addColumn<QStringList>("contextList");
    QTest::addColumn<QString>("context");
    const QString mms = QStringLiteral("/ril_0/context2:mms");
    const QString ims = QStringLiteral("/ril_0/context3:ims");
    const QString internet = QStringLiteral("/ril_0/context1:internet");
    QTest::newRow("internet") << QStringList{mms, ims, internet} << QStringLiteral("context1");
    QTest::newRow("unknown type first")
        << QStringList{mms, QStringLiteral("/ril_0/context4:wap"), internet} << QStringLiteral("context4");
    QTest::newRow("no type") << QStringList{QStringLiteral("/ril_0/context5:"), internet}
                             << QStringLiteral("context5");
    QTest::newRow("two of a type") << QStringList{internet, QStringLiteral("/ril_0/context6:internet")}
                                   << QStringLiteral("context1");
    QTest::newRow("path without another slash")
        << QStringList{QStringLiteral("/context8:internet")} << QStringLiteral("context8");
    QTest::newRow("none") << QStringList{mms, ims} << QString();
    QTest::newRow("no context") << QStringList() << QString();
}

void ConnectivitySettingsTest::contextOfMobileData()
{
    QFETCH(QStringList, contextList);
    QFETCH(QString, context);
    ConnectivitySettings settings;
    answerContexts(contextList);
    // No service belongs to it, so that the text tells which context was taken.
    m_phone->answerCalls(Connman, RootPath, QStringLiteral("GetServices"), {contexts({})});
    const QString warning = context.isEmpty()
        ? QStringLiteral("Unable to find \"internet\" connection context for IMSI: \"244051234567890\"")
        : QStringLiteral("Unable to find network service: "
                         "\"/net/connman/service/cellular_244051234567890_%1\" of type: \"cellular\" "
                         "from IMSI: \"244051234567890\"")
              .arg(context);
    QVERIFY(!settings.isConnectedToMobileNetwork(FirstImsi));
    QVERIFY(!settings.connectToMobileNetwork(FirstImsi));
    QVERIFY(!settings.disconnectFromMobileNetwork(FirstImsi));
    QCOMPARE(m_log->takeWarnings(), (QStringList{warning, warning, warning}));
}

void ConnectivitySettingsTest::mobileDataWithoutASim()
{
    ConnectivitySettings settings;
    const QString warning
        = QStringLiteral("Unable to find \"internet\" connection context for IMSI: \"999991234567890\"");
    m_phone->takeJournal(Connman);
    QVERIFY(!settings.isConnectedToMobileNetwork(UnknownImsi));
    QVERIFY(!settings.connectToMobileNetwork(UnknownImsi));
    QVERIFY(!settings.disconnectFromMobileNetwork(UnknownImsi));
    QCOMPARE(m_log->takeWarnings(), (QStringList{warning, warning, warning}));
    QCOMPARE(m_phone->takeJournal(Connman), QStringList());

    m_phone->failCalls(Ofono, FirstModem, QStringLiteral("GetContexts"), Failed, Broken);
    QVERIFY(!settings.isConnectedToMobileNetwork(FirstImsi));
    QCOMPARE(m_log->takeWarnings(),
             texts({"Unable to get contexts: \"it is broken\"",
                    "Unable to find \"internet\" connection context for IMSI: \"244051234567890\""}));
}

void ConnectivitySettingsTest::mobileDataWithoutAService_data()
{
    QTest::addColumn<QVariant>("services");
    QTest::addColumn<QString>("warning");
    const QString notFound
        = QStringLiteral("Unable to find network service: "
                         "\"/net/connman/service/cellular_244051234567890_context1\" of type: \"cellular\" "
                         "from IMSI: \"244051234567890\"");
    const QString unread = QStringLiteral("Unable to read network services");
    QTest::newRow("error") << QVariant() << unread;
    QTest::newRow("a text") << QVariant(QStringLiteral("none")) << unread;
    QTest::newRow("nothing") << contexts({}) << notFound;
    QTest::newRow("another type") << contexts({FirstService + QStringLiteral(":wifi")}) << notFound;
    QTest::newRow("another path") << contexts({FirstService + QStringLiteral("0:cellular")}) << notFound;
}

void ConnectivitySettingsTest::mobileDataWithoutAService()
{
    QFETCH(QVariant, services);
    QFETCH(QString, warning);
    ConnectivitySettings settings;
    const QString getServices = QStringLiteral("GetServices");
    if (services.isValid())
        m_phone->answerCalls(Connman, RootPath, getServices, {services});
    else
        m_phone->failCalls(Connman, RootPath, getServices, Failed, Broken);
    QVERIFY(!settings.isConnectedToMobileNetwork(FirstImsi));
    QVERIFY(!settings.connectToMobileNetwork(FirstImsi));
    QVERIFY(!settings.disconnectFromMobileNetwork(FirstImsi));
    QCOMPARE(m_log->takeWarnings(), (QStringList{warning, warning, warning}));
}

void ConnectivitySettingsTest::connectsAndDisconnects()
{
    ConnectivitySettings settings;
    takeMobileDataDown(settings);
    m_phone->takeJournal({Ofono, Connman});
    QVERIFY(settings.connectToMobileNetwork(FirstImsi));
    QCOMPARE(m_log->takeInfos(), texts({"Already connected to network via IMSI: \"244051234567890\""}));
    QCOMPARE(m_phone->takeJournal({Ofono, Connman}),
             (contextQueries() + texts({"/ GetServices ()"})
              + QStringList{FirstService + QStringLiteral(" SetProperty ('AutoConnect', <true>)"),
                            FirstService + QStringLiteral(" Connect ()")}
              + contextQueries() + serviceQueries()));
    QVERIFY(settings.isConnectedToMobileNetwork(FirstImsi));
    QVERIFY(isContextActive());

    // What is there already is no failure.
    QVERIFY(settings.connectToMobileNetwork(FirstImsi));
    QCOMPARE(m_log->takeInfos().size(), 1);

    m_phone->takeJournal({Ofono, Connman});
    QVERIFY(settings.disconnectFromMobileNetwork(FirstImsi));
    QCOMPARE(m_log->takeInfos(), texts({"Already disconnected from network via IMSI: \"244051234567890\""}));
    QCOMPARE(m_phone->takeJournal({Ofono, Connman}),
             (contextQueries() + texts({"/ GetServices ()"})
              + QStringList{FirstService + QStringLiteral(" SetProperty ('AutoConnect', <false>)"),
                            FirstService + QStringLiteral(" Disconnect ()")}
              + contextQueries() + serviceQueries()));
    QVERIFY(!settings.isConnectedToMobileNetwork(FirstImsi));
    QVERIFY(!isContextActive());
    QVERIFY(settings.disconnectFromMobileNetwork(FirstImsi));
    QCOMPARE(m_log->takeInfos().size(), 1);
}

void ConnectivitySettingsTest::switchingThatFails_data()
{
    QTest::addColumn<bool>("on");
    QTest::addColumn<QString>("error"); // of the method; empty: none
    QTest::addColumn<bool>("autoConnectFails");
    QTest::addColumn<QString>("state"); // afterwards
    QTest::addColumn<bool>("result");
    QTest::addColumn<QStringList>("warnings");
    QTest::addColumn<bool>("informs");

    const QString none;
    const QString ready = QStringLiteral("ready");
    const QString idle = QStringLiteral("idle");
    const QStringList noAutoConnect = texts({"Unable to set auto connect: \"it is broken\""});
    const auto row = [](const char *name, bool on, const QString &error, bool autoConnectFails,
                        const QString &state, bool result, const QStringList &warnings, bool informs) {
        QTest::newRow(name) << on << error << autoConnectFails << state << result << warnings << informs;
    };
    const QString already = QStringLiteral("Already connected");
    const QString inProgress = QStringLiteral("In progress");
    const QString notConnected = QStringLiteral("Not connected");
    row("connect, still coming", true, none, false, idle, true, {}, false);
    row("connect, coming for once", true, none, true, idle, false, noAutoConnect, false);
    row("connect, there for once", true, none, true, ready, true, noAutoConnect, true);
    row("connect, already", true, already, false, ready, true, {}, true);
    row("connect, already, for once", true, already, true, ready, true, noAutoConnect, true);
    row("connect, in progress", true, inProgress, false, idle, true, {}, false);
    row("connect, in progress for once", true, inProgress, true, idle, false, noAutoConnect, false);
    row("connect, not connected", true, notConnected, false, idle, false,
        texts({"Unable to connect: \"Not connected\""}), false);
    row("connect, broken", true, Broken, false, ready, false, texts({"Unable to connect: \"it is broken\""}),
        false);
    row("connect, all broken", true, Broken, true, idle, false,
        noAutoConnect + texts({"Unable to connect: \"it is broken\""}), false);

    row("disconnect, still going", false, none, false, ready, true, {}, false);
    row("disconnect, going for once", false, none, true, ready, false, noAutoConnect, false);
    row("disconnect, gone for once", false, none, true, idle, true, noAutoConnect, true);
    row("disconnect, not connected", false, notConnected, false, idle, true, {}, true);
    row("disconnect, not connected, for once", false, notConnected, true, ready, false, noAutoConnect, false);
    row("disconnect, already connected", false, already, false, idle, false,
        texts({"Unable to disconnect: \"Already connected\""}), false);
    row("disconnect, in progress", false, inProgress, false, idle, false,
        texts({"Unable to disconnect: \"In progress\""}), false);
    row("disconnect, broken", false, Broken, false, ready, false,
        texts({"Unable to disconnect: \"it is broken\""}), false);
}

void ConnectivitySettingsTest::switchingThatFails()
{
    QFETCH(bool, on);
    QFETCH(QString, error);
    QFETCH(bool, autoConnectFails);
    QFETCH(QString, state);
    QFETCH(bool, result);
    QFETCH(QStringList, warnings);
    QFETCH(bool, informs);
    ConnectivitySettings settings;
    const QString method = on ? QStringLiteral("Connect") : QStringLiteral("Disconnect");
    m_phone->answerCalls(Connman, FirstService, SetProperty, {});
    m_phone->answerCalls(Connman, FirstService, method, {});
    m_phone->answerCalls(Connman, FirstService, GetProperties,
                         {QVariantMap{{QStringLiteral("State"), state}}});
    if (!error.isEmpty())
        m_phone->failCalls(Connman, FirstService, method, QStringLiteral("net.connman.Error.Failed"), error);
    if (autoConnectFails)
        m_phone->failCalls(Connman, FirstService, SetProperty, Failed, Broken);
    QCOMPARE(on ? settings.connectToMobileNetwork(FirstImsi)
                : settings.disconnectFromMobileNetwork(FirstImsi),
             result);
    QCOMPARE(m_log->takeWarnings(), warnings);
    const QString info = on ? QStringLiteral("Already connected to network via IMSI: \"244051234567890\"")
                            : QStringLiteral("Already disconnected from network via IMSI: "
                                             "\"244051234567890\"");
    QCOMPARE(m_log->takeInfos(), informs ? QStringList(info) : QStringList());
}

void ConnectivitySettingsTest::serviceThatVanishesDuringACall()
{
    // The call blocks this process, so that another one takes the service away, once the call has arrived.
    QProcess other;
    other.start(QStringLiteral("sh"),
                {QStringLiteral("-c"),
                 QStringLiteral("corvane-simctl fault never net.connman Connect --times 1 && "
                                "while corvane-simctl faults | grep -q never; do :; done && "
                                "corvane-simctl stop net.connman")});
    QVERIFY(other.waitForReadyRead());
    ConnectivitySettings settings;
    QVERIFY(!settings.connectToMobileNetwork(FirstImsi));
    QVERIFY(other.waitForFinished());
    QCOMPARE(other.exitCode(), 0);
    const QStringList warnings = m_log->takeWarnings();
    QCOMPARE(warnings.size(), 1);
    QVERIFY2(
        warnings.first().startsWith(QLatin1String("Unable to connect: \"Message recipient disconnected")),
        qPrintable(warnings.first()));
    QVERIFY(!settings.connectToMobileNetwork(FirstImsi));
    QCOMPARE(m_log->takeWarnings(), texts({"Unable to read network services"}));
}

void ConnectivitySettingsTest::writesTheInternetAccessPoint_data()
{
    QTest::addColumn<bool>("connected");
    QTest::newRow("mobile data is up") << true;
    QTest::newRow("mobile data is down") << false;
}

void ConnectivitySettingsTest::writesTheInternetAccessPoint()
{
    QFETCH(bool, connected);
    ConnectivitySettings settings;
    if (connected)
        QVERIFY(settings.connectToMobileNetwork(FirstImsi));
    else
        takeMobileDataDown(settings);
    m_log->takeInfos();
    const AccessPoint before = settings.accessPointSettings(FirstImsi).value(AccessPoint::Internet);

    m_phone->takeJournal({Ofono, Connman});
    QVERIFY(settings.setAccessPointSettings(FirstImsi, companyAccessPoint()));
    QStringList expected = contextQueries() + texts({"/ SetDefaultDataSim ('244051234567890',)"})
        + contextQueries() + serviceQueries();
    const QString setProperty = FirstService + QStringLiteral(" SetProperty ('AutoConnect', <%1>)");
    if (connected) {
        expected += contextQueries() + texts({"/ GetServices ()"})
            + QStringList{setProperty.arg(QStringLiteral("false")),
                          FirstService + QStringLiteral(" Disconnect ()")}
            + contextQueries() + serviceQueries();
    }
    expected += companyWrites(FirstContext);
    if (connected) {
        expected += contextQueries() + texts({"/ GetServices ()"})
            + QStringList{setProperty.arg(QStringLiteral("true")),
                          FirstService + QStringLiteral(" Connect ()")}
            + contextQueries() + serviceQueries();
    }
    QCOMPARE(m_phone->takeJournal({Ofono, Connman}), expected);
    QCOMPARE(isContextActive(), connected);
    QCOMPARE(settings.isConnectedToMobileNetwork(FirstImsi), connected);
    QCOMPARE(textOf(settings.accessPointSettings(FirstImsi).value(AccessPoint::Internet)),
             QStringLiteral("0|Company|company.apn|user|secret|2|2|http://center/|proxy:80"));
    QVERIFY(settings.setAccessPointSettings(FirstImsi, before));
}

void ConnectivitySettingsTest::writesAnMmsAccessPointWhileConnected()
{
    ConnectivitySettings settings;
    QVERIFY(settings.connectToMobileNetwork(FirstImsi));
    m_phone->takeJournal(Connman);
    QVERIFY(settings.setAccessPointSettings(FirstImsi, companyAccessPoint(AccessPoint::Mms)));
    QCOMPARE(m_phone->takeJournal(Connman), QStringList());
    QVERIFY(settings.isConnectedToMobileNetwork(FirstImsi));
    takeMobileDataDown(settings);
}

void ConnectivitySettingsTest::failedWriteReconnects()
{
    ConnectivitySettings settings;
    QVERIFY(settings.connectToMobileNetwork(FirstImsi));
    m_phone->failCalls(Ofono, FirstContext, SetProperty, Failed, Broken);
    // The connection manager does not speak to the context over the bus.
    QVERIFY(!settings.setAccessPointSettings(FirstImsi, companyAccessPoint()));
    QCOMPARE(m_log->takeWarnings().size(), 8);
    QVERIFY(settings.isConnectedToMobileNetwork(FirstImsi));
    takeMobileDataDown(settings);
}

void ConnectivitySettingsTest::otherModesAreNeverReady()
{
    m_phone->takeJournal(Connman);
    ConnectivitySettings settings(ConnectivitySettings::Mode(2));
    SignalSequence seen(&settings);
    QVERIFY(!settings.ready());
    QVERIFY(!settings.wlanEnabled());
    QVERIFY(!settings.flightModeEnabled());
    settings.setWlanEnabled(true);
    settings.setFlightModeEnabled(true);
    m_phone->emitSignal(Connman, RootPath, ManagerInterface, PropertyChanged,
                        {QStringLiteral("OfflineMode"), variantOf(true)});
    QVERIFY(!settings.ready());
    QCOMPARE(seen.take(), QStringList());
    QCOMPARE(m_phone->takeJournal(Connman), QStringList());
    // Mobile data has nothing to do with it.
    QCOMPARE(settings.modemPaths(), texts({"/ril_0", "/ril_1"}));
}

void ConnectivitySettingsTest::readyAtOnceOverDBus()
{
    m_phone->swallowCalls(Connman, QString(), GetProperties);
    QVERIFY(ConnectivitySettings().ready());
    m_phone->stopService(Connman);
    const ConnectivitySettings settings(ConnectivitySettings::DBusMode);
    QVERIFY(settings.ready());
    m_phone->startService(Connman);
    m_phone->clearFaults();
    QVERIFY(settings.wlanEnabled());
    QVERIFY(!settings.flightModeEnabled());
}

void ConnectivitySettingsTest::switchesOverDBus()
{
    ConnectivitySettings settings;
    SignalSequence seen(&settings);
    m_phone->takeJournal(Connman);

    settings.setWlanEnabled(false);
    QCOMPARE(seen.take(), texts({"wlanEnabledChanged()"}));
    m_phone->settle(Connman);
    // Once more, as the connection manager has announced it.
    QCOMPARE(seen.take(), texts({"wlanEnabledChanged()"}));
    QVERIFY(!settings.wlanEnabled());
    settings.setWlanEnabled(true);
    m_phone->settle(Connman);
    QCOMPARE(seen.take(), texts({"wlanEnabledChanged()", "wlanEnabledChanged()"}));
    QVERIFY(settings.wlanEnabled());
    QCOMPARE(m_phone->takeJournalWithInterfaces(Connman),
             texts({"/net/connman/technology/wifi net.connman.Technology.SetProperty ('Powered', <false>)",
                    "/net/connman/technology/wifi net.connman.Technology.GetProperties ()",
                    "/net/connman/technology/wifi net.connman.Technology.SetProperty ('Powered', <true>)",
                    "/net/connman/technology/wifi net.connman.Technology.GetProperties ()"}));

    settings.setFlightModeEnabled(true);
    QCOMPARE(seen.take(), texts({"flightModeEnabledChanged()"}));
    m_phone->settle(Connman);
    QCOMPARE(seen.take().filter(QStringLiteral("flight")), texts({"flightModeEnabledChanged()"}));
    QVERIFY(settings.flightModeEnabled());
    settings.setFlightModeEnabled(false);
    m_phone->settle(Connman);
    QVERIFY(!settings.flightModeEnabled());
    QCOMPARE(m_phone->takeJournalWithInterfaces(Connman),
             texts({"/ net.connman.Manager.SetProperty ('OfflineMode', <true>)",
                    "/ net.connman.Manager.GetProperties ()",
                    "/ net.connman.Manager.SetProperty ('OfflineMode', <false>)",
                    "/ net.connman.Manager.GetProperties ()"}));
}

void ConnectivitySettingsTest::followsAnnouncementsOverDBus()
{
    const std::unique_ptr<ConnectivitySettings> settings = std::make_unique<ConnectivitySettings>();
    SignalSequence seen(settings.get());
    const auto announce = [this](const QString &path, const QString &interface, const QString &name) {
        m_phone->emitSignal(Connman, path, interface, PropertyChanged, {name, variantOf(true)});
    };
    announce(WlanPath, TechnologyInterface, QStringLiteral("Powered"));
    QCOMPARE(seen.take(), texts({"wlanEnabledChanged()"}));
    announce(RootPath, ManagerInterface, QStringLiteral("OfflineMode"));
    QCOMPARE(seen.take(), texts({"flightModeEnabledChanged()"}));

    announce(WlanPath, TechnologyInterface, QStringLiteral("Connected"));
    announce(WlanPath, TechnologyInterface, QStringLiteral("OfflineMode"));
    announce(RootPath, ManagerInterface, QStringLiteral("State"));
    announce(RootPath, ManagerInterface, QStringLiteral("Powered"));
    announce(QStringLiteral("/net/connman/technology/cellular"), TechnologyInterface,
             QStringLiteral("Powered"));
    QCOMPARE(seen.take(), QStringList());
}

void ConnectivitySettingsTest::failuresOverDBus()
{
    ConnectivitySettings settings;
    SignalSequence seen(&settings);
    const QStringList missing = texts({"Powered property not returned for WLAN technology!",
                                       "OfflineMode property not returned for ConnMan!"});
    const auto readsNothing = [&settings] {
        return !settings.wlanEnabled() && !settings.flightModeEnabled();
    };

    m_phone->answerCalls(Connman, QString(), GetProperties, {QVariantMap()});
    QVERIFY(readsNothing());
    QCOMPARE(m_log->takeWarnings(), missing);
    m_phone->failCalls(Connman, QString(), GetProperties, Failed, Broken);
    QVERIFY(readsNothing());
    QCOMPARE(m_log->takeWarnings(), missing);
    m_phone->answerCalls(Connman, QString(), GetProperties, {QStringLiteral("Powered")});
    QVERIFY(readsNothing());
    QCOMPARE(m_log->takeWarnings(), missing);
    QCOMPARE(seen.take(), QStringList());

    m_phone->failCalls(Connman, QString(), SetProperty, Failed, Broken);
    settings.setWlanEnabled(false);
    settings.setFlightModeEnabled(true);
    QCOMPARE(m_log->takeWarnings(),
             texts({"Unable to set the power of the WLAN technology: \"it is broken\"",
                    "Unable to set the offline mode: \"it is broken\""}));
    QCOMPARE(seen.take(), texts({"wlanEnabledChanged()", "flightModeEnabledChanged()"}));

    m_phone->clearFaults();
    m_phone->stopService(Connman);
    QVERIFY(readsNothing());
    QCOMPARE(m_log->takeWarnings(), missing);
    settings.setWlanEnabled(false);
    settings.setFlightModeEnabled(true);
    const QStringList warnings = m_log->takeWarnings();
    QCOMPARE(warnings.size(), 2);
    QVERIFY(warnings.at(0).startsWith(
        QLatin1String("Unable to set the power of the WLAN technology: \"The name net.connman")));
    QVERIFY(
        warnings.at(1).startsWith(QLatin1String("Unable to set the offline mode: \"The name net.connman")));
    QCOMPARE(seen.take(), texts({"wlanEnabledChanged()", "flightModeEnabledChanged()"}));
}

void ConnectivitySettingsTest::switchesOverTheNetworkManager()
{
    ConnectivitySettings settings(ConnectivitySettings::NetworkManagerMode);
    QVERIFY(waitUntil([&settings] { return settings.ready(); }));
    SignalSequence seen(&settings);
    m_phone->settle(Connman);
    m_phone->takeJournal(Connman);
    seen.take();
    QVERIFY(settings.wlanEnabled());
    QVERIFY(!settings.flightModeEnabled());

    // What is so already is not asked for.
    settings.setWlanEnabled(true);
    settings.setFlightModeEnabled(false);
    m_phone->settle(Connman);
    QCOMPARE(m_phone->takeJournal(Connman), QStringList());

    settings.setWlanEnabled(false);
    QVERIFY(settings.wlanEnabled()); // not yet
    QVERIFY(waitUntil([&settings] { return !settings.wlanEnabled(); }));
    settings.setWlanEnabled(true);
    QVERIFY(waitUntil([&settings] { return settings.wlanEnabled(); }));
    QCOMPARE(seen.take(), texts({"wlanEnabledChanged()", "wlanEnabledChanged()"}));

    settings.setFlightModeEnabled(true);
    QVERIFY(waitUntil([&settings] { return settings.flightModeEnabled(); }));
    settings.setFlightModeEnabled(false);
    QVERIFY(waitUntil([&settings] { return !settings.flightModeEnabled(); }));
    QCOMPARE(seen.take().filter(QStringLiteral("flight")),
             texts({"flightModeEnabledChanged()", "flightModeEnabledChanged()"}));
    QCOMPARE(m_phone->takeJournal(Connman).filter(SetProperty),
             texts({"/net/connman/technology/wifi SetProperty ('Powered', <false>)",
                    "/net/connman/technology/wifi SetProperty ('Powered', <true>)",
                    "/ SetProperty ('OfflineMode', <true>)", "/ SetProperty ('OfflineMode', <false>)"}));
}

void ConnectivitySettingsTest::wlanThatComesAndGoes()
{
    ConnectivitySettings settings(ConnectivitySettings::NetworkManagerMode);
    QVERIFY(waitUntil([&settings] { return settings.ready(); }));
    m_phone->settle(Connman);
    SignalSequence seen(&settings);
    const QVariant wlan = QVariant::fromValue(QDBusObjectPath(WlanPath));

    m_phone->emitSignal(Connman, RootPath, ManagerInterface, QStringLiteral("TechnologyRemoved"), {wlan});
    QCOMPARE(seen.take(), texts({"readyChanged()", "wlanEnabledChanged()"}));
    QVERIFY(!settings.ready());
    QVERIFY(!settings.wlanEnabled());
    settings.setWlanEnabled(true);

    m_phone->emitSignal(
        Connman, RootPath, ManagerInterface, QStringLiteral("TechnologyAdded"),
        {wlan,
         QVariantMap{{QStringLiteral("Type"), QStringLiteral("wifi")}, {QStringLiteral("Powered"), true}}});
    QCOMPARE(seen.take(), texts({"readyChanged()", "wlanEnabledChanged()"}));
    QVERIFY(settings.ready());
    QVERIFY(settings.wlanEnabled());

    // Other technologies make no difference.
    const QVariant bluetooth
        = QVariant::fromValue(QDBusObjectPath(QStringLiteral("/net/connman/technology/bluetooth")));
    m_phone->emitSignal(Connman, RootPath, ManagerInterface, QStringLiteral("TechnologyAdded"),
                        {bluetooth, QVariantMap{{QStringLiteral("Type"), QStringLiteral("bluetooth")}}});
    m_phone->emitSignal(Connman, RootPath, ManagerInterface, QStringLiteral("TechnologyRemoved"),
                        {bluetooth});
    QCOMPARE(seen.take(), QStringList());

    // Nor does what another client says.
    m_phone->forgeSignal(Connman, WlanPath, TechnologyInterface, PropertyChanged,
                         {QStringLiteral("Powered"), variantOf(false)});
    QCOMPARE(seen.take(), QStringList());

    m_phone->emitSignal(Connman, WlanPath, TechnologyInterface, PropertyChanged,
                        {QStringLiteral("Powered"), variantOf(false)});
    QCOMPARE(seen.take(), texts({"wlanEnabledChanged()"}));
    QVERIFY(!settings.wlanEnabled());
    m_phone->emitSignal(Connman, WlanPath, TechnologyInterface, PropertyChanged,
                        {QStringLiteral("Powered"), variantOf(true)});
}

void ConnectivitySettingsTest::restartOverTheNetworkManager()
{
    ConnectivitySettings settings(ConnectivitySettings::NetworkManagerMode);
    QVERIFY(waitUntil([&settings] { return settings.ready(); }));
    m_phone->stopService(Connman);
    QVERIFY(waitUntil([&settings] { return !settings.ready(); }));
    m_phone->startService(Connman);
    QVERIFY(waitUntil([&settings] { return settings.ready(); }));
    QVERIFY(settings.wlanEnabled());
}

void ConnectivitySettingsTest::deletedByAReceiver()
{
    for (const auto signal :
         {&ConnectivitySettings::readyChanged, &ConnectivitySettings::wlanEnabledChanged}) {
        auto *settings = new ConnectivitySettings(ConnectivitySettings::NetworkManagerMode);
        bool isDeleted = settings->ready();
        if (isDeleted) {
            // Known from before: the next change is made up.
            m_phone->sendSignal(Connman, RootPath, ManagerInterface, QStringLiteral("TechnologyRemoved"),
                                {QVariant::fromValue(QDBusObjectPath(WlanPath))});
            isDeleted = false;
        }
        connect(settings, signal, [&] {
            isDeleted = true;
            delete settings;
        });
        QVERIFY(waitUntil([&isDeleted] { return isDeleted; }));
        m_phone->stopService(Connman);
        m_phone->startService(Connman);
        m_phone->settle(Connman);
    }
}

QTEST_GUILESS_MAIN(ConnectivitySettingsTest)

#include "connectivitysettings_test.moc"
