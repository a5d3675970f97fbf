// SPDX-License-Identifier: LGPL-2.1-or-later
#include "ofonobus.h"
#include "phone.h"
#include "texts.h"
#include "waiting.h"

#include <QtCore/QDir>
#include <QtCore/QFile>
#include <QtDBus/QDBusVariant>
#include <QtTest/QtTest>

using namespace OfonoBus;

namespace
{

const QString firstImsi = QStringLiteral("244051234567890");
const QString secondImsi = QStringLiteral("262021234567891");
const QString choiceFile = QStringLiteral("/var/lib/ofono/veldmobile-sims");
const QString refused = QStringLiteral("error org.ofono.Error.InvalidArguments");
const QString unknown = QStringLiteral("error org.freedesktop.DBus.Error.UnknownMethod");

QString ask(const char *member)
{
    return answer("/", modemManagerInterface, member);
}

QString askSim(const char *path, const char *member)
{
    return answer(path, simInfoInterface, member);
}

QString set(const char *member, const QVariant &value)
{
    return answer("/", modemManagerInterface, member, {value});
}

void setModem(const char *path, const char *property, bool value)
{
    QCOMPARE(answer(path, modemInterface, "SetProperty",
                    {QString::fromUtf8(property), QVariant::fromValue(QDBusVariant(value))}),
             QString());
}

bool waitForOnline(const char *path, bool online)
{
    return waitUntil(
        [=] { return properties(path, modemInterface).value(QStringLiteral("Online")).toBool() == online; });
}

} // namespace

/** The extension interfaces that our plug-in gives the real oFono, by real messages. */
class OfonoPluginTest : public QObject
{
    Q_OBJECT

private:
    Phone m_phone;
    OfonoSignals m_signals{texts({modemManagerInterface, simInfoInterface})};

private Q_SLOTS:
    void init() { m_signals.take(); }
    void cleanup();
    void everythingIsTold();
    void everythingIsIntrospected();
    void otherObjectsHaveNothing();
    void choosingASim_data();
    void choosingASim();
    void anotherMethodsArgumentsAreRefused_data();
    void anotherMethodsArgumentsAreRefused();
    void pullingAndInserting();
    void lockedCard();
    void disabledModems();
    void modemThatIsEnabledAtOnceAgain();
    void modemWithoutPower();
    void choiceIsKeptOverARestart();
    void choiceThatCannotBeStoredIsNotMade();
    void storeThatIsBroken();
    void anotherCard();
};

void OfonoPluginTest::cleanup()
{
    // What one function has left is not for the others to fail over.
    if (!QTest::currentTestFailed())
        return;
    QDir(choiceFile).removeRecursively();
    restoreModems(m_phone);
    QVERIFY(waitUntil([] {
        return askSim("/ril_0", "GetSubscriberIdentity") == firstImsi
            && askSim("/ril_1", "GetSubscriberIdentity") == secondImsi
            && ask("GetPresentSims") == QLatin1String("[true true]") && ask("GetDefaultVoiceSim") == firstImsi
            && ask("GetDefaultDataSim") == firstImsi;
    }));
    QVERIFY(waitForOnline("/ril_0", true) && waitForOnline("/ril_1", true));
}

void OfonoPluginTest::everythingIsTold()
{
    QCOMPARE(ask("GetInterfaceVersion"), QStringLiteral("1"));
    QCOMPARE(ask("GetReady"), QStringLiteral("true"));
    QCOMPARE(ask("GetAvailableModems"), QStringLiteral("[/ril_0 /ril_1]"));
    QCOMPARE(ask("GetEnabledModems"), QStringLiteral("[/ril_0 /ril_1]"));
    QCOMPARE(ask("GetPresentSims"), QStringLiteral("[true true]"));
    QCOMPARE(ask("GetIMEI"), QStringLiteral("[358240051111100 358240051111101]"));
    QCOMPARE(ask("GetDefaultVoiceSim"), firstImsi);
    QCOMPARE(ask("GetDefaultDataSim"), firstImsi);
    QCOMPARE(askSim("/ril_0", "GetCardIdentifier"), QStringLiteral("8935805100000012345"));
    QCOMPARE(askSim("/ril_0", "GetSubscriberIdentity"), firstImsi);
    QCOMPARE(askSim("/ril_0", "GetServiceProviderName"), QStringLiteral("Elo Mobile"));
    QCOMPARE(askSim("/ril_1", "GetCardIdentifier"), QStringLiteral("8949020000000067891"));
    QCOMPARE(askSim("/ril_1", "GetSubscriberIdentity"), secondImsi);
    QCOMPARE(askSim("/ril_1", "GetServiceProviderName"), QStringLiteral("Tarn Telecom"));
    QCOMPARE(call("/", modemManagerInterface, "GetAvailableModems").signature(), QStringLiteral("ao"));
    QCOMPARE(call("/", modemManagerInterface, "GetPresentSims").signature(), QStringLiteral("ab"));
    QCOMPARE(call("/", modemManagerInterface, "GetIMEI").signature(), QStringLiteral("as"));
    QCOMPARE(call("/", modemManagerInterface, "GetInterfaceVersion").signature(), QStringLiteral("i"));
}

void OfonoPluginTest::everythingIsIntrospected()
{
    const char introspectable[] = "org.freedesktop.DBus.Introspectable";
    const QString root = answer("/", introspectable, "Introspect");
    QVERIFY(root.contains(QLatin1String("<interface name=\"org.ofono.Manager\">")));
    QVERIFY(root.contains(QLatin1String("<interface name=\"org.veldmobile.ofono.ModemManager\">")));
    QVERIFY(
        root.contains(QLatin1String("<signal name=\"PresentSimsChanged\"><arg name=\"index\" type=\"i\"/>")));
    QVERIFY(!root.contains(QLatin1String("org.veldmobile.ofono.SimInfo")));
    const QString modem = answer("/ril_0", introspectable, "Introspect");
    QVERIFY(modem.contains(QLatin1String("<interface name=\"org.ofono.SimManager\">")));
    QVERIFY(modem.contains(QLatin1String("<interface name=\"org.veldmobile.ofono.SimInfo\">")));
    const QString other = answer("/ril_0/context1", introspectable, "Introspect");
    QVERIFY(!other.contains(QLatin1String("veldmobile")));
}

void OfonoPluginTest::otherObjectsHaveNothing()
{
    QCOMPARE(answer("/ril_0", modemManagerInterface, "GetReady"), unknown);
    QCOMPARE(answer("/", simInfoInterface, "GetCardIdentifier"), unknown);
    QCOMPARE(answer("/ril_7", simInfoInterface, "GetCardIdentifier"),
             QStringLiteral("error org.freedesktop.DBus.Error.UnknownObject"));
    QCOMPARE(answer("/", modemManagerInterface, "GetWeather"), unknown);
    QCOMPARE(answer("/ril_0", simInfoInterface, "GetWeather"), unknown);
}

void OfonoPluginTest::choosingASim_data()
{
    QTest::addColumn<QByteArray>("sim");
    QTest::newRow("voice") << QByteArray("DefaultVoiceSim");
    QTest::newRow("data") << QByteArray("DefaultDataSim");
}

void OfonoPluginTest::choosingASim()
{
    QFETCH(QByteArray, sim);
    const QByteArray setter = "Set" + sim;
    const QByteArray getter = "Get" + sim;
    const QString signal = QLatin1String("/ ") + QString::fromUtf8(sim) + QLatin1String("Changed ");

    QCOMPARE(set(setter, secondImsi), QString());
    // What is set already, and what is refused, is not announced.
    QCOMPARE(set(setter, secondImsi), QString());
    QCOMPARE(set(setter, QStringLiteral("310150000000000")), refused);
    QCOMPARE(ask(getter), secondImsi);
    QCOMPARE(set(setter, QString()), QString());
    QVERIFY(m_signals.waitFor(signal + firstImsi));
    QCOMPARE(ask(getter), firstImsi);
    QCOMPARE(m_signals.take(), QStringList({signal + secondImsi, signal + firstImsi}));
}

void OfonoPluginTest::anotherMethodsArgumentsAreRefused_data()
{
    QTest::addColumn<QByteArray>("member");
    QTest::addColumn<QVariantList>("arguments");
    QTest::newRow("none") << QByteArray("SetDefaultVoiceSim") << QVariantList();
    QTest::newRow("number") << QByteArray("SetDefaultVoiceSim") << QVariantList{7};
    QTest::newRow("two") << QByteArray("SetDefaultDataSim") << QVariantList{firstImsi, secondImsi};
    QTest::newRow("strings") << QByteArray("SetEnabledModems")
                             << QVariantList{QStringList{QStringLiteral("/ril_0")}};
    QTest::newRow("variant") << QByteArray("SetDefaultDataSim")
                             << QVariantList{QVariant::fromValue(QDBusVariant(firstImsi))};
    QTest::newRow("getter") << QByteArray("GetReady") << QVariantList{true};
}

void OfonoPluginTest::anotherMethodsArgumentsAreRefused()
{
    QFETCH(QByteArray, member);
    QFETCH(QVariantList, arguments);
    QCOMPARE(answer("/", modemManagerInterface, member, arguments), refused);
    QCOMPARE(m_signals.take(), QStringList());
}

void OfonoPluginTest::pullingAndInserting()
{
    QCOMPARE(set("SetDefaultVoiceSim", secondImsi), QString());
    m_phone.act(QStringLiteral("sim pull"), texts({"1"}));
    QVERIFY(m_signals.waitFor(QStringLiteral("/ DefaultVoiceSimChanged ") + firstImsi));
    QCOMPARE(ask("GetPresentSims"), QStringLiteral("[true false]"));
    QCOMPARE(askSim("/ril_1", "GetSubscriberIdentity"), QString());
    QCOMPARE(askSim("/ril_1", "GetCardIdentifier"), QString());
    QCOMPARE(set("SetDefaultDataSim", secondImsi), refused);
    QCOMPARE(m_signals.take(),
             texts({"/ DefaultVoiceSimChanged 262021234567891", "/ PresentSimsChanged 1 false",
                    "/ril_1 CardIdentifierChanged", "/ril_1 ServiceProviderNameChanged",
                    "/ril_1 SubscriberIdentityChanged", "/ DefaultVoiceSimChanged 244051234567890"}));

    m_phone.act(QStringLiteral("sim insert"), texts({"1"}));
    QVERIFY(m_signals.waitFor(QStringLiteral("/ DefaultVoiceSimChanged ") + secondImsi));
    QCOMPARE(ask("GetPresentSims"), QStringLiteral("[true true]"));
    // Who waits for the IMSI finds the rest.
    QCOMPARE(m_signals.take(),
             texts({"/ PresentSimsChanged 1 true", "/ril_1 CardIdentifierChanged 8949020000000067891",
                    "/ril_1 ServiceProviderNameChanged Tarn Telecom",
                    "/ril_1 SubscriberIdentityChanged 262021234567891",
                    "/ DefaultVoiceSimChanged 262021234567891"}));
    QCOMPARE(set("SetDefaultVoiceSim", QString()), QString());
}

void OfonoPluginTest::lockedCard()
{
    m_phone.act(QStringLiteral("sim lock"), texts({"1", "pin"}));
    const auto isLocked = [] {
        return properties("/ril_1", simInterface).value(QStringLiteral("PinRequired"))
            == QLatin1String("pin");
    };
    QVERIFY(waitUntil(isLocked));
    QCOMPARE(ask("GetPresentSims"), QStringLiteral("[true true]"));
    QVERIFY(waitUntil([] { return !askSim("/ril_1", "GetCardIdentifier").isEmpty(); }));
    QCOMPARE(askSim("/ril_1", "GetSubscriberIdentity"), QString());
    m_signals.take();

    const QString enterPin = QStringLiteral("pin");
    QVERIFY(answer("/ril_1", simInterface, "EnterPin", {enterPin, QStringLiteral("0000")})
                .startsWith(QLatin1String("error ")));
    QCOMPARE(answer("/ril_1", simInterface, "EnterPin", {enterPin, QStringLiteral("1234")}), QString());
    QVERIFY(m_signals.waitFor(QStringLiteral("/ril_1 SubscriberIdentityChanged ") + secondImsi));
    QVERIFY(!isLocked());
    // Without a PIN again, also when it gets power anew.
    m_signals.take();
    m_phone.act(QStringLiteral("sim lock"), texts({"1", "none"}));
    QVERIFY(m_signals.waitFor(QStringLiteral("/ril_1 SubscriberIdentityChanged ") + secondImsi));
}

void OfonoPluginTest::disabledModems()
{
    QCOMPARE(set("SetEnabledModems", objectPaths(texts({"/ril_1"}))), QString());
    QCOMPARE(ask("GetEnabledModems"), QStringLiteral("[/ril_1]"));
    QVERIFY(waitForOnline("/ril_0", false));
    // The SIM can be seen, but is not the first choice any more.
    QCOMPARE(ask("GetPresentSims"), QStringLiteral("[true true]"));
    QCOMPARE(ask("GetDefaultVoiceSim"), secondImsi);
    // Nobody else takes it online.
    setModem("/ril_0", "Online", true);
    QVERIFY(waitForOnline("/ril_0", false));

    QCOMPARE(set("SetEnabledModems", objectPaths(texts({"/ril_0", "/ril_9"}))), refused);
    QCOMPARE(set("SetEnabledModems", objectPaths({})), QString());
    QCOMPARE(ask("GetDefaultDataSim"), QString());
    QVERIFY(waitForOnline("/ril_1", false));
    QCOMPARE(set("SetEnabledModems", objectPaths(texts({"/ril_1", "/ril_0"}))), QString());
    QVERIFY(waitForOnline("/ril_0", true));
    QVERIFY(waitForOnline("/ril_1", true));
    QCOMPARE(m_signals.take(),
             texts({"/ EnabledModemsChanged [/ril_1]", "/ DefaultVoiceSimChanged 262021234567891",
                    "/ DefaultDataSimChanged 262021234567891", "/ EnabledModemsChanged []",
                    "/ DefaultVoiceSimChanged", "/ DefaultDataSimChanged",
                    "/ EnabledModemsChanged [/ril_0 /ril_1]", "/ DefaultVoiceSimChanged 244051234567890",
                    "/ DefaultDataSimChanged 244051234567890"}));
}

void OfonoPluginTest::modemThatIsEnabledAtOnceAgain()
{
    OfonoSignals modemSignals(texts({modemInterface}));
    QCOMPARE(set("SetEnabledModems", objectPaths(texts({"/ril_0"}))), QString());
    QCOMPARE(set("SetEnabledModems", objectPaths(texts({"/ril_0", "/ril_1"}))), QString());
    QVERIFY(modemSignals.waitFor(QStringLiteral("/ril_1 PropertyChanged Online false")));
    QVERIFY(modemSignals.waitFor(QStringLiteral("/ril_1 PropertyChanged Online true")));
}

void OfonoPluginTest::modemWithoutPower()
{
    setModem("/ril_1", "Powered", false);
    QVERIFY(m_signals.waitFor(QStringLiteral("/ril_1 SubscriberIdentityChanged")));
    QCOMPARE(askSim("/ril_1", "GetCardIdentifier"), unknown);
    QCOMPARE(ask("GetAvailableModems"), QStringLiteral("[/ril_0 /ril_1]"));
    QCOMPARE(ask("GetPresentSims"), QStringLiteral("[true false]"));
    setModem("/ril_1", "Powered", true);
    setModem("/ril_1", "Online", true);
    QVERIFY(m_signals.waitFor(QStringLiteral("/ril_1 SubscriberIdentityChanged ") + secondImsi));
    QCOMPARE(askSim("/ril_1", "GetServiceProviderName"), QStringLiteral("Tarn Telecom"));
    QCOMPARE(ask("GetReady"), QStringLiteral("true"));
}

void OfonoPluginTest::choiceIsKeptOverARestart()
{
    const QString service = QLatin1String(OfonoBus::service);
    QCOMPARE(set("SetDefaultVoiceSim", secondImsi), QString());
    QCOMPARE(set("SetDefaultDataSim", firstImsi), QString());
    QCOMPARE(set("SetEnabledModems", objectPaths(texts({"/ril_1"}))), QString());
    m_phone.stopService(service);
    QCOMPARE(ask("GetReady"), QStringLiteral("error org.freedesktop.DBus.Error.ServiceUnknown"));
    m_signals.take();
    m_phone.startService(service);
    QVERIFY(m_signals.waitFor(QStringLiteral("/ril_0 SubscriberIdentityChanged ") + firstImsi));
    QVERIFY(m_signals.waitFor(QStringLiteral("/ril_1 SubscriberIdentityChanged ") + secondImsi));
    QCOMPARE(ask("GetReady"), QStringLiteral("true"));
    QCOMPARE(ask("GetDefaultVoiceSim"), secondImsi);
    // The chosen one is in a slot that is not in use.
    QCOMPARE(ask("GetDefaultDataSim"), secondImsi);
    QCOMPARE(ask("GetEnabledModems"), QStringLiteral("[/ril_1]"));
    QVERIFY(waitForOnline("/ril_0", false));

    // It is ready before any card is read, and tells of each thing once it is so.
    const QStringList seen = m_signals.take();
    const QStringList told = seen.filter(QStringLiteral("Changed"));
    QVERIFY(told.indexOf(QStringLiteral("/ ReadyChanged true"))
            > told.lastIndexOf(QStringLiteral("/ AvailableModemsChanged [/ril_0 /ril_1]")));
    QVERIFY(told.indexOf(QStringLiteral("/ ReadyChanged true"))
            < told.indexOf(QStringLiteral("/ PresentSimsChanged 0 true")));
    QCOMPARE(told.count(QStringLiteral("/ ReadyChanged true")), 1);

    QCOMPARE(set("SetEnabledModems", objectPaths(texts({"/ril_0", "/ril_1"}))), QString());
    QCOMPARE(ask("GetDefaultVoiceSim"), secondImsi);
    QCOMPARE(ask("GetDefaultDataSim"), firstImsi);
    QCOMPARE(set("SetDefaultVoiceSim", QString()), QString());
    QCOMPARE(set("SetDefaultDataSim", QString()), QString());
    QVERIFY(waitForOnline("/ril_0", true));
}

void OfonoPluginTest::choiceThatCannotBeStoredIsNotMade()
{
    QFile::remove(choiceFile);
    QVERIFY(QDir().mkpath(choiceFile + QStringLiteral("/in-the-way")));
    QCOMPARE(set("SetDefaultVoiceSim", secondImsi), QStringLiteral("error org.ofono.Error.Failed"));
    QCOMPARE(ask("GetDefaultVoiceSim"), firstImsi);
    QCOMPARE(m_signals.take(), QStringList());
    QVERIFY(QDir(choiceFile).removeRecursively());
}

void OfonoPluginTest::storeThatIsBroken()
{
    QFile file(choiceFile);
    QVERIFY(file.open(QIODevice::WriteOnly));
    file.write("no key file at all\n");
    file.close();
    const QString service = QLatin1String(OfonoBus::service);
    m_phone.stopService(service);
    m_phone.startService(service);
    QVERIFY(waitUntil([] { return ask("GetDefaultVoiceSim") == firstImsi; }));
    QCOMPARE(ask("GetEnabledModems"), QStringLiteral("[/ril_0 /ril_1]"));
    QFile log(QStringLiteral("/run/corvane-simulator/ofono.log"));
    QVERIFY(log.open(QIODevice::ReadOnly));
    QVERIFY(log.readAll().contains("Cannot read the chosen SIMs: "));
}

void OfonoPluginTest::anotherCard()
{
    m_phone.act(QStringLiteral("sim pull"), texts({"1"}));
    m_phone.act(QStringLiteral("sim insert"), texts({"1", "310150123456789"}));
    QVERIFY(m_signals.waitFor(QStringLiteral("/ril_1 SubscriberIdentityChanged 310150123456789")));
    QCOMPARE(askSim("/ril_1", "GetCardIdentifier"), QStringLiteral("8900310150123456789"));
    QCOMPARE(askSim("/ril_1", "GetServiceProviderName"), QStringLiteral("Operator 31015"));
    QCOMPARE(set("SetDefaultDataSim", QStringLiteral("310150123456789")), QString());
    QCOMPARE(ask("GetDefaultDataSim"), QStringLiteral("310150123456789"));
    QCOMPARE(set("SetDefaultDataSim", QString()), QString());
}

QTEST_GUILESS_MAIN(OfonoPluginTest)
#include "ofonoplugin_test.moc"
