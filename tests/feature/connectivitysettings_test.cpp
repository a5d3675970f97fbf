// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"
#include "waiting.h"

#include <corvanemdm/connectivitysettings.h>

#include <QtCore/QJsonArray>
#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusMetaType>
#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusVariant>
#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::ConnectivitySettings;
using AccessPoint = ConnectivitySettings::MobileNetworkAccessPointSettings;
using Technologies = ConnectivitySettings::CellularTechnologies;

/** An object as the services list it. */
struct WireObject {
    QDBusObjectPath path;
    QVariantMap properties;
};
Q_DECLARE_METATYPE(WireObject)

QDBusArgument &operator<<(QDBusArgument &out, const WireObject &object)
{
    out.beginStructure();
    out << object.path << object.properties;
    out.endStructure();
    return out;
}

const QDBusArgument &operator>>(const QDBusArgument &in, WireObject &object)
{
    in.beginStructure();
    in >> object.path >> object.properties;
    in.endStructure();
    return in;
}

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

QStringList texts(std::initializer_list<const char *> list)
{
    QStringList result;
    for (const char *text : list)
        result.append(QString::fromUtf8(text));
    return result;
}

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
    void strangeAccessPoints();
    void laterAccessPointsReplaceEarlierOnes();
    void accessPointsWithoutTheDataSim();
    void accessPointThatCannotBeRead();
    void accessPointsOfNobody();
    void validAccessPoints();
    void writesAnAccessPoint();
    void writesWordsForStrangeValues();
    void writesThatFail_data();
    void writesThatFail();
    void writesTheFirstOfItsType();
    void typeThatTheSimLacks();
    void contextThatCannotBeOpened();

private:
    QStringList takeOfonoCalls() { return m_phone->takeJournal(Ofono); }
    void answerRadio(const QVariantMap &properties);
    void answerContexts(const QStringList &descriptions);

    std::unique_ptr<Phone> m_phone;
    std::unique_ptr<MessageLog> m_log;
};

void ConnectivitySettingsTest::initTestCase()
{
    qDBusRegisterMetaType<WireObject>();
    qDBusRegisterMetaType<QList<WireObject>>();
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
             contextQueries()
                 + QStringList{setDataSim, QStringLiteral("/ril_0/context1 GetProperties ()"), setDataSim,
                               QStringLiteral("/ril_0/context2 GetProperties ()")});
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

void ConnectivitySettingsTest::strangeAccessPoints()
{
    const ConnectivitySettings settings;
    const auto read = [&](const QVariantMap &properties) {
        m_phone->clearFaults();
        m_phone->answerCalls(Ofono, FirstContext, GetProperties, {properties});
        return textsOf(settings.accessPointSettings(FirstImsi)).first();
    };
    answerContexts({QStringLiteral("/ril_0/context1:internet")});

    QCOMPARE(read({{QStringLiteral("Type"), QStringLiteral("wap")},
                   {QStringLiteral("Protocol"), QStringLiteral("ipv6")},
                   {QStringLiteral("AuthenticationMethod"), QStringLiteral("eap")}}),
             QStringLiteral("0=0||||| 1|3||").remove(QLatin1Char(' ')));
    QCOMPARE(m_log->takeWarnings(), QStringList());

    QCOMPARE(read({{QStringLiteral("Type"), QStringLiteral("ims")},
                   {QStringLiteral("Protocol"), QStringLiteral("x25")},
                   {QStringLiteral("AuthenticationMethod"), QStringLiteral("any")}}),
             QStringLiteral("0=0|Elo"));
}

void ConnectivitySettingsTest::laterAccessPointsReplaceEarlierOnes()
{
    const ConnectivitySettings settings;
    answerContexts({QStringLiteral("/ril_0/context2:mms"), QStringLiteral("/ril_0/context1:internet")});
    m_phone->answerCalls(Ofono, MmsContext, GetProperties,
                         {QVariantMap{{QStringLiteral("Type"), QStringLiteral("wap")},
                                      {QStringLiteral("Name"), QStringLiteral("Shadow")},
                                      {QStringLiteral("Protocol"), QStringLiteral("dual")}}});
    QCOMPARE(textsOf(settings.accessPointSettings(FirstImsi)),
             texts({"0=0|Elo Internet|internet.elo|||0|0||"}));

    m_phone->clearFaults();
    m_phone->answerCalls(Ofono, MmsContext, GetProperties,
                         {QVariantMap{{QStringLiteral("Type"), QStringLiteral("wap")},
                                      {QStringLiteral("Name"), QStringLiteral("Shadow")},
                                      {QStringLiteral("Protocol"), QStringLiteral("dual")}}});
    QCOMPARE(textsOf(settings.accessPointSettings(FirstImsi)), texts({"0=0|Shadow||||2|0||"}));
}

QTEST_GUILESS_MAIN(ConnectivitySettingsTest)

#include "connectivitysettings_test.moc"
