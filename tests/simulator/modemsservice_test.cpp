// SPDX-License-Identifier: LGPL-2.1-or-later
#include "client.h"

#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusVariant>
#include <QtTest/QTest>

namespace
{

const QString service = QStringLiteral("org.ofono");
const QString modemPath = QStringLiteral("/ril_1");
const QString modemInterface = QStringLiteral("org.ofono.Modem");
const QString simInterface = QStringLiteral("org.ofono.SimManager");
const QString getProperties = QStringLiteral("GetProperties");
const QString changed = QStringLiteral("PropertyChanged");
const QString done = QStringLiteral("reply()");

const QString simProperties
    = QStringLiteral("reply({Present=<true>, CardIdentifier=<8949020000000067891>, PinRequired=<none>, "
                     "ServiceProviderName=<Tarn Telecom>, SubscriberNumbers=<[+4915112345678]>, "
                     "MobileCountryCode=<262>, MobileNetworkCode=<02>, "
                     "SubscriberIdentity=<262021234567891>})");

} // namespace

/** The modems and SIMs of the simulated telephony daemon. */
class ModemsServiceTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void listsAModemASlot();
    void describesTheSim();
    void switchesPower();
    void switchesOnline();
    void refusesOtherProperties();
    void pullsAndInsertsTheSim();
    void takesAnotherSim();
    void refusesImpossibleActions();
    void changesShowEverywhere_data();
    void changesShowEverywhere();
    void setsDefaultsAndEnabledModems();
    void refusesStrangeChoices();

private:
    QString call(const QString &interface, const QString &member, const QVariantList &arguments = {}) const
    {
        return textOf(m_client->call(service, modemPath, interface, member, arguments));
    }
    QString set(const QString &property, const QVariant &value) const
    {
        return call(modemInterface, QStringLiteral("SetProperty"),
                    {property, QVariant::fromValue(QDBusVariant(value))});
    }
    QString act(const QString &action, const QStringList &arguments) const
    {
        return textOf(m_client->control(QStringLiteral("Act"), {action, arguments}));
    }
    QStringList takeSignals() const { return m_client->takeSignals(service); }

    std::unique_ptr<Client> m_client;
};

void ModemsServiceTest::init()
{
    m_client = std::make_unique<Client>();
    m_client->watch(service, modemPath, modemInterface, {changed});
    m_client->watch(service, modemPath, simInterface, {changed});
}

void ModemsServiceTest::cleanup()
{
    m_client.reset();
}

void ModemsServiceTest::listsAModemASlot()
{
    const QString interfaces
        = QStringLiteral("org.ofono.SimManager, org.veldmobile.ofono.SimInfo, org.ofono.NetworkRegistration, "
                         "org.ofono.RadioSettings, org.ofono.ConnectionManager");
    const QString first = QStringLiteral("{Powered=<true>, Online=<true>, Lockdown=<false>, "
                                         "Emergency=<false>, Name=<Slot 0>, Manufacturer=<Corvane>, "
                                         "Model=<Simulated modem>, Revision=<1.0>, Serial=<358240051111100>, "
                                         "Type=<hardware>, Features=<[net, rat, gprs, sim]>, "
                                         "Interfaces=<[%1]>}")
                              .arg(interfaces);
    QString second = first;
    second.replace(QLatin1String("Slot 0"), QLatin1String("Slot 1"));
    second.replace(QLatin1String("1100"), QLatin1String("1101"));
    QCOMPARE(textOf(m_client->call(service, QStringLiteral("/"), QStringLiteral("org.ofono.Manager"),
                                   QStringLiteral("GetModems"))),
             QStringLiteral("reply([(/ril_0, %1), (/ril_1, %2)])").arg(first, second));
    QCOMPARE(call(modemInterface, getProperties), QStringLiteral("reply(%1)").arg(second));
}

void ModemsServiceTest::describesTheSim()
{
    QCOMPARE(call(simInterface, getProperties), simProperties);
}

void ModemsServiceTest::switchesPower()
{
    QCOMPARE(set(QStringLiteral("Powered"), true), done);
    QCOMPARE(set(QStringLiteral("Powered"), false), done);
    QCOMPARE(takeSignals(),
             (QStringList{QStringLiteral("PropertyChanged(Powered, <false>)"),
                          QStringLiteral("PropertyChanged(Online, <false>)"),
                          QStringLiteral("PropertyChanged(Features, <[]>)"),
                          QStringLiteral("PropertyChanged(Interfaces, <[]>)")}));
    QVERIFY(call(simInterface, getProperties)
                .startsWith(QLatin1String("org.freedesktop.DBus.Error.UnknownMethod")));
    QCOMPARE(set(QStringLiteral("Online"), true),
             QStringLiteral("org.ofono.Error.NotAvailable: The modem is not powered"));

    // A restart changes nothing.
    m_client->control(QStringLiteral("StopService"), {service});
    m_client->control(QStringLiteral("StartService"), {service});
    QVERIFY(call(simInterface, getProperties)
                .startsWith(QLatin1String("org.freedesktop.DBus.Error.UnknownMethod")));

    QCOMPARE(set(QStringLiteral("Powered"), true), done);
    QCOMPARE(set(QStringLiteral("Online"), true), done);
    QCOMPARE(takeSignals(),
             (QStringList{QStringLiteral("PropertyChanged(Powered, <true>)"),
                          QStringLiteral("PropertyChanged(Features, <[rat, gprs, sim]>)"),
                          QStringLiteral("PropertyChanged(Interfaces, <[org.ofono.SimManager, "
                                         "org.veldmobile.ofono.SimInfo, org.ofono.RadioSettings, "
                                         "org.ofono.ConnectionManager]>)"),
                          QStringLiteral("PropertyChanged(Online, <true>)"),
                          QStringLiteral("PropertyChanged(Features, <[net, rat, gprs, sim]>)"),
                          QStringLiteral("PropertyChanged(Interfaces, <[org.ofono.SimManager, "
                                         "org.veldmobile.ofono.SimInfo, org.ofono.NetworkRegistration, "
                                         "org.ofono.RadioSettings, org.ofono.ConnectionManager]>)")}));
    QCOMPARE(call(simInterface, getProperties), simProperties);
}

void ModemsServiceTest::switchesOnline()
{
    QCOMPARE(set(QStringLiteral("Online"), false), done);
    QCOMPARE(set(QStringLiteral("Online"), false), done);
    QCOMPARE(set(QStringLiteral("Online"), true), done);
    QCOMPARE(takeSignals(),
             (QStringList{QStringLiteral("PropertyChanged(Online, <false>)"),
                          QStringLiteral("PropertyChanged(Features, <[rat, gprs, sim]>)"),
                          QStringLiteral("PropertyChanged(Interfaces, <[org.ofono.SimManager, "
                                         "org.veldmobile.ofono.SimInfo, org.ofono.RadioSettings, "
                                         "org.ofono.ConnectionManager]>)"),
                          QStringLiteral("PropertyChanged(Online, <true>)"),
                          QStringLiteral("PropertyChanged(Features, <[net, rat, gprs, sim]>)"),
                          QStringLiteral("PropertyChanged(Interfaces, <[org.ofono.SimManager, "
                                         "org.veldmobile.ofono.SimInfo, org.ofono.NetworkRegistration, "
                                         "org.ofono.RadioSettings, org.ofono.ConnectionManager]>)")}));
}

void ModemsServiceTest::refusesOtherProperties()
{
    const QString invalid = QStringLiteral("org.ofono.Error.InvalidArguments: ");
    QVERIFY(set(QStringLiteral("Powered"), 1).startsWith(invalid));
    QVERIFY(set(QStringLiteral("Name"), QStringLiteral("mine")).startsWith(invalid));
    QCOMPARE(takeSignals(), QStringList());
}

void ModemsServiceTest::pullsAndInsertsTheSim()
{
    const QString pull = QStringLiteral("sim pull");
    const QString insert = QStringLiteral("sim insert");
    const QString slot = QStringLiteral("1");
    QCOMPARE(act(pull, {slot}), QStringLiteral("reply(The SIM 262021234567891 is out of slot 1)"));
    QCOMPARE(call(simInterface, getProperties), QStringLiteral("reply({Present=<false>})"));
    QCOMPARE(takeSignals(),
             (QStringList{QStringLiteral("PropertyChanged(Present, <false>)"),
                          QStringLiteral("PropertyChanged(Features, <[net]>)"),
                          QStringLiteral("PropertyChanged(Interfaces, <[org.ofono.SimManager, "
                                         "org.veldmobile.ofono.SimInfo, org.ofono.NetworkRegistration]>)")}));

    QCOMPARE(act(insert, {slot}), QStringLiteral("reply(The SIM 262021234567891 is in slot 1)"));
    QCOMPARE(call(simInterface, getProperties), simProperties);
    QCOMPARE(takeSignals(),
             (QStringList{QStringLiteral("PropertyChanged(Present, <true>)"),
                          QStringLiteral("PropertyChanged(CardIdentifier, <8949020000000067891>)"),
                          QStringLiteral("PropertyChanged(PinRequired, <none>)"),
                          QStringLiteral("PropertyChanged(ServiceProviderName, <Tarn Telecom>)"),
                          QStringLiteral("PropertyChanged(SubscriberNumbers, <[+4915112345678]>)"),
                          QStringLiteral("PropertyChanged(MobileCountryCode, <262>)"),
                          QStringLiteral("PropertyChanged(MobileNetworkCode, <02>)"),
                          QStringLiteral("PropertyChanged(SubscriberIdentity, <262021234567891>)"),
                          QStringLiteral("PropertyChanged(Features, <[net, rat, gprs, sim]>)"),
                          QStringLiteral("PropertyChanged(Interfaces, <[org.ofono.SimManager, "
                                         "org.veldmobile.ofono.SimInfo, org.ofono.NetworkRegistration, "
                                         "org.ofono.RadioSettings, org.ofono.ConnectionManager]>)")}));
}

void ModemsServiceTest::takesAnotherSim()
{
    const QString pull = QStringLiteral("sim pull");
    const QString insert = QStringLiteral("sim insert");
    const QString slot = QStringLiteral("0");
    const QString path = QStringLiteral("/ril_0");
    const QString own = QStringLiteral("244051234567890");
    const QString before = textOf(m_client->call(service, path, simInterface, getProperties));
    act(pull, {slot});
    QCOMPARE(act(insert, {slot, QStringLiteral("310150123456789")}),
             QStringLiteral("reply(The SIM 310150123456789 is in slot 0)"));
    QCOMPARE(
        textOf(m_client->call(service, path, simInterface, getProperties)),
        QStringLiteral("reply({Present=<true>, CardIdentifier=<8900310150123456789>, PinRequired=<none>, "
                       "ServiceProviderName=<Operator 31015>, SubscriberNumbers=<[]>, "
                       "MobileCountryCode=<310>, MobileNetworkCode=<15>, "
                       "SubscriberIdentity=<310150123456789>})"));
    act(pull, {slot});
    act(insert, {slot, own});
    QCOMPARE(textOf(m_client->call(service, path, simInterface, getProperties)), before);
}

void ModemsServiceTest::refusesImpossibleActions()
{
    const QString pull = QStringLiteral("sim pull");
    const QString insert = QStringLiteral("sim insert");
    const QString slot = QStringLiteral("1");
    const QString refused = QStringLiteral("org.corvaneos.simulator.Error.InvalidArguments: ");
    QCOMPARE(act(pull, {QStringLiteral("2")}),
             refused + QStringLiteral("There is no SIM slot \"2\"; the phone has 2, numbered from 0"));
    QCOMPARE(act(insert, {slot}), refused + QStringLiteral("There is a SIM in slot 1; pull it first"));
    act(pull, {slot});
    QCOMPARE(act(pull, {slot}), refused + QStringLiteral("There is no SIM in slot 1"));
    QCOMPARE(act(insert, {slot, QStringLiteral("12x")}),
             refused + QStringLiteral("\"12x\" is no IMSI; it has 6 to 15 digits"));
    QCOMPARE(act(insert, {slot, QStringLiteral("244051234567890")}),
             refused + QStringLiteral("The SIM 244051234567890 is in another slot; pull it there first"));
    act(insert, {slot});
}

void ModemsServiceTest::changesShowEverywhere_data()
{
    QTest::addColumn<QString>("action");
    QTest::addColumn<QString>("undo");
    QTest::addColumn<QStringList>("seen");

    QTest::newRow("pull") << "sim pull 0"
                          << "sim insert 0"
                          << QStringList{
                                 QStringLiteral("PresentSimsChanged(0, false)"),
                                 QStringLiteral("CardIdentifierChanged()"),
                                 QStringLiteral("ServiceProviderNameChanged()"),
                                 QStringLiteral("SubscriberIdentityChanged()"),
                                 QStringLiteral("PropertyChanged(Status, <unregistered>)"),
                                 QStringLiteral("DefaultVoiceSimChanged(262021234567891)"),
                                 QStringLiteral("DefaultDataSimChanged(262021234567891)"),
                             };
    // The choice comes back with the SIM.
    QTest::newRow("lock") << "sim lock 0 pin"
                          << "sim lock 0 none"
                          << QStringList{
                                 QStringLiteral("PresentSimsChanged(0, false)"),
                                 QStringLiteral("CardIdentifierChanged()"),
                                 QStringLiteral("ServiceProviderNameChanged()"),
                                 QStringLiteral("SubscriberIdentityChanged()"),
                                 QStringLiteral("PropertyChanged(Status, <unregistered>)"),
                                 QStringLiteral("DefaultVoiceSimChanged(262021234567891)"),
                                 QStringLiteral("DefaultDataSimChanged(262021234567891)"),
                                 QStringLiteral("PresentSimsChanged(0, true)"),
                                 QStringLiteral("CardIdentifierChanged(8935805100000012345)"),
                             };
    QTest::newRow("rename") << "sim provider 0 Other"
                            << "sim provider 0 Elo"
                            << QStringList{QStringLiteral("ServiceProviderNameChanged(Other)"),
                                           QStringLiteral("PropertyChanged(Name, <Other>)")};
    QTest::newRow("network") << "network 0 denied"
                             << "network 0 registered"
                             << QStringList{QStringLiteral("PropertyChanged(Status, <denied>)")};
    QTest::newRow("choose") << "sim default data 1"
                            << "sim default data 0"
                            << QStringList{QStringLiteral("DefaultDataSimChanged(262021234567891)")};
    QTest::newRow("disable") << "modem disable 0"
                             << "modem enable 0"
                             << QStringList{QStringLiteral("EnabledModemsChanged([/ril_1])"),
                                            QStringLiteral("DefaultVoiceSimChanged(262021234567891)"),
                                            QStringLiteral("DefaultDataSimChanged(262021234567891)")};
    QTest::newRow("remove") << "modem remove 0"
                            << "modem add 0"
                            << QStringList{QStringLiteral("ModemRemoved(/ril_0)"),
                                           QStringLiteral("AvailableModemsChanged([/ril_1])"),
                                           QStringLiteral("EnabledModemsChanged([/ril_1])"),
                                           QStringLiteral("DefaultVoiceSimChanged(262021234567891)"),
                                           QStringLiteral("DefaultDataSimChanged(262021234567891)")};
    QTest::newRow("not ready") << "phone ready off"
                               << "phone ready on" << QStringList{QStringLiteral("ReadyChanged(false)")};
}

void ModemsServiceTest::changesShowEverywhere()
{
    QFETCH(QString, action);
    QFETCH(QString, undo);
    QFETCH(QStringList, seen);
    const auto perform = [this](const QString &text) {
        const QStringList words = text.split(QLatin1Char(' '));
        const int count = words.first() == QLatin1String("network") ? 1 : 2;
        const QString answer = act(QStringList(words.mid(0, count)).join(QLatin1Char(' ')), words.mid(count));
        QVERIFY2(answer.startsWith(QLatin1String("reply(")), qPrintable(answer));
    };
    perform(QStringLiteral("sim default voice 0"));
    perform(QStringLiteral("sim default data 0"));
    takeSignals();

    const QString path = QStringLiteral("/ril_0");
    const QString root = QStringLiteral("/");
    m_client->watch(service, path, QStringLiteral("org.veldmobile.ofono.SimInfo"),
                    {QStringLiteral("CardIdentifierChanged"), QStringLiteral("ServiceProviderNameChanged"),
                     QStringLiteral("SubscriberIdentityChanged")});
    m_client->watch(service, path, QStringLiteral("org.ofono.NetworkRegistration"), {changed});
    m_client->watch(service, root, QStringLiteral("org.ofono.Manager"), {QStringLiteral("ModemRemoved")});
    m_client->watch(service, root, QStringLiteral("org.veldmobile.ofono.ModemManager"),
                    {QStringLiteral("AvailableModemsChanged"), QStringLiteral("EnabledModemsChanged"),
                     QStringLiteral("PresentSimsChanged"), QStringLiteral("DefaultVoiceSimChanged"),
                     QStringLiteral("DefaultDataSimChanged"), QStringLiteral("ReadyChanged")});
    perform(action);
    QCOMPARE(takeSignals(), seen);
    perform(undo);
}

void ModemsServiceTest::setsDefaultsAndEnabledModems()
{
    const QString root = QStringLiteral("/");
    const QString manager = QStringLiteral("org.veldmobile.ofono.ModemManager");
    const auto ask = [&](const char *method, const QVariantList &arguments = {}) {
        return textOf(m_client->call(service, root, manager, QLatin1String(method), arguments));
    };
    const QString own = QStringLiteral("244051234567890");
    const QString other = QStringLiteral("262021234567891");
    QCOMPARE(ask("GetInterfaceVersion"), QStringLiteral("reply(1)"));
    QCOMPARE(ask("GetIMEI"), QStringLiteral("reply([358240051111100, 358240051111101])"));
    QCOMPARE(ask("GetPresentSims"), QStringLiteral("reply([true, true])"));
    QCOMPARE(ask("SetDefaultDataSim", {other}), done);
    QCOMPARE(ask("SetDefaultVoiceSim", {other}), done);
    QCOMPARE(ask("GetDefaultDataSim"), QStringLiteral("reply(%1)").arg(other));
    QCOMPARE(ask("GetDefaultVoiceSim"), QStringLiteral("reply(%1)").arg(other));

    // Choices outlive the service.
    const QList<QDBusObjectPath> second{QDBusObjectPath(modemPath)};
    const QList<QDBusObjectPath> first{QDBusObjectPath(QStringLiteral("/ril_0"))};
    QCOMPARE(ask("SetEnabledModems", {QVariant::fromValue(first)}), done);
    m_client->control(QStringLiteral("StopService"), {service});
    m_client->control(QStringLiteral("StartService"), {service});
    QCOMPARE(ask("GetEnabledModems"), QStringLiteral("reply([/ril_0])"));
    QCOMPARE(ask("GetDefaultDataSim"), QStringLiteral("reply(%1)").arg(own));
    QCOMPARE(ask("SetEnabledModems", {QVariant::fromValue(first + second)}), done);
    QCOMPARE(ask("GetDefaultDataSim"), QStringLiteral("reply(%1)").arg(other));
    QCOMPARE(ask("SetDefaultDataSim", {QString()}), done);
    QCOMPARE(ask("SetDefaultVoiceSim", {own}), done);
    QCOMPARE(ask("GetDefaultDataSim"), QStringLiteral("reply(%1)").arg(own));
}

void ModemsServiceTest::refusesStrangeChoices()
{
    const QString root = QStringLiteral("/");
    const QString manager = QStringLiteral("org.veldmobile.ofono.ModemManager");
    const QString invalid = QStringLiteral("org.ofono.Error.InvalidArguments: ");
    QCOMPARE(textOf(m_client->call(service, root, manager, QStringLiteral("SetDefaultDataSim"),
                                   {QStringLiteral("1")})),
             invalid + QStringLiteral("There is no SIM 1 in the phone"));
    const QList<QDBusObjectPath> nowhere{QDBusObjectPath(QStringLiteral("/nowhere"))};
    QCOMPARE(textOf(m_client->call(service, root, manager, QStringLiteral("SetEnabledModems"),
                                   {QVariant::fromValue(nowhere)})),
             invalid + QStringLiteral("There is no modem /nowhere"));
    const QString refused = QStringLiteral("org.corvaneos.simulator.Error.InvalidArguments: ");
    QVERIFY(act(QStringLiteral("sim lock"), {QStringLiteral("0"), QStringLiteral("fingerprint")})
                .startsWith(refused + QStringLiteral("\"fingerprint\" is none of none, pin, ")));
    QVERIFY(
        act(QStringLiteral("network"), {QStringLiteral("0"), QStringLiteral("gone")}).startsWith(refused));
    QVERIFY(act(QStringLiteral("sim default"), {QStringLiteral("video"), QStringLiteral("0")})
                .startsWith(refused));
    QVERIFY(act(QStringLiteral("modem add"), {QStringLiteral("0")}).startsWith(refused));
    QVERIFY(act(QStringLiteral("phone ready"), {QStringLiteral("yes")}).startsWith(refused));
}

QTEST_GUILESS_MAIN(ModemsServiceTest)
#include "modemsservice_test.moc"
