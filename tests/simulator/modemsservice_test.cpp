// SPDX-License-Identifier: LGPL-2.1-or-later
#include "client.h"

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
    = QStringLiteral("reply({Present=<true>, SubscriberIdentity=<262021234567891>, "
                     "CardIdentifier=<8949020000000067891>, ServiceProviderName=<Tarn Telecom>, "
                     "SubscriberNumbers=<[+4915112345678]>, MobileCountryCode=<262>, MobileNetworkCode=<02>, "
                     "PinRequired=<none>})");

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
    const QString first = QStringLiteral("{Powered=<true>, Online=<true>, Lockdown=<false>, "
                                         "Emergency=<false>, Name=<Slot 0>, Manufacturer=<Corvane>, "
                                         "Model=<Simulated modem>, Revision=<1.0>, Serial=<358240051111100>, "
                                         "Type=<hardware>, Features=<[sim]>, "
                                         "Interfaces=<[org.ofono.SimManager]>}");
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
             (QStringList{QStringLiteral("PropertyChanged(Online, <false>)"),
                          QStringLiteral("PropertyChanged(Powered, <false>)"),
                          QStringLiteral("PropertyChanged(Interfaces, <[]>)"),
                          QStringLiteral("PropertyChanged(Features, <[]>)")}));
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
                          QStringLiteral("PropertyChanged(Interfaces, <[org.ofono.SimManager]>)"),
                          QStringLiteral("PropertyChanged(Features, <[sim]>)"),
                          QStringLiteral("PropertyChanged(Online, <true>)")}));
    QCOMPARE(call(simInterface, getProperties), simProperties);
}

void ModemsServiceTest::switchesOnline()
{
    QCOMPARE(set(QStringLiteral("Online"), false), done);
    QCOMPARE(set(QStringLiteral("Online"), false), done);
    QCOMPARE(set(QStringLiteral("Online"), true), done);
    QCOMPARE(takeSignals(),
             (QStringList{QStringLiteral("PropertyChanged(Online, <false>)"),
                          QStringLiteral("PropertyChanged(Online, <true>)")}));
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
                          QStringLiteral("PropertyChanged(Features, <[]>)")}));

    QCOMPARE(act(insert, {slot}), QStringLiteral("reply(The SIM 262021234567891 is in slot 1)"));
    QCOMPARE(call(simInterface, getProperties), simProperties);
    QCOMPARE(takeSignals(),
             (QStringList{QStringLiteral("PropertyChanged(Present, <true>)"),
                          QStringLiteral("PropertyChanged(SubscriberIdentity, <262021234567891>)"),
                          QStringLiteral("PropertyChanged(CardIdentifier, <8949020000000067891>)"),
                          QStringLiteral("PropertyChanged(ServiceProviderName, <Tarn Telecom>)"),
                          QStringLiteral("PropertyChanged(SubscriberNumbers, <[+4915112345678]>)"),
                          QStringLiteral("PropertyChanged(MobileCountryCode, <262>)"),
                          QStringLiteral("PropertyChanged(MobileNetworkCode, <02>)"),
                          QStringLiteral("PropertyChanged(PinRequired, <none>)"),
                          QStringLiteral("PropertyChanged(Features, <[sim]>)")}));
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
    QCOMPARE(textOf(m_client->call(service, path, simInterface, getProperties)),
             QStringLiteral("reply({Present=<true>, SubscriberIdentity=<310150123456789>, "
                            "CardIdentifier=<8900310150123456789>, ServiceProviderName=<Operator 31015>, "
                            "SubscriberNumbers=<[]>, MobileCountryCode=<310>, MobileNetworkCode=<15>, "
                            "PinRequired=<none>})"));
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

QTEST_GUILESS_MAIN(ModemsServiceTest)
#include "modemsservice_test.moc"
