// SPDX-License-Identifier: LGPL-2.1-or-later
#include "phone.h"
#include "signalsequence.h"
#include "waiting.h"

#include <ofono/qofonoextmodemmanager.h>
#include <ofono/qofonoextsiminfo.h>
#include <ofono/qofonomanager.h>
#include <ofono/qofonosimmanager.h>

#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusVariant>
#include <QtTest/QtTest>

#include <memory>

namespace
{

const QString Service = QStringLiteral("org.ofono");
const QString Root = QStringLiteral("/");
const QString Modem0 = QStringLiteral("/ril_0");
const QString Modem1 = QStringLiteral("/ril_1");
const QString ModemInterface = QStringLiteral("org.ofono.Modem");
const QString SimInfoInterface = QStringLiteral("org.veldmobile.ofono.SimInfo");
const QString ModemManagerInterface = QStringLiteral("org.veldmobile.ofono.ModemManager");
const QString Imsi0 = QStringLiteral("244051234567890");
const QString Imsi1 = QStringLiteral("262021234567891");

QVariant paths(const QStringList &list)
{
    QList<QDBusObjectPath> result;
    for (const QString &path : list)
        result.append(QDBusObjectPath(path));
    return QVariant::fromValue(result);
}

QStringList list(const char *text)
{
    return QString::fromUtf8(text).split(QLatin1Char('|'), Qt::SkipEmptyParts);
}

} // namespace

/** The clients of the telephony service, which SimInfo and others are built on. */
class OfonoClientsTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void init();
    void cleanup();

    void managerIsSharedWhileInUse();
    void managerFollowsTheService();
    void managerFollowsModems();
    void managerNeedsAnAnswer();
    void managerSendsOneCall();

    void simManagerTellsAll();
    void simManagerPins_data();
    void simManagerPins();
    void simManagerFollowsTheCard();
    void simManagerFollowsPower();
    void simManagerFollowsTheModem();
    void simManagerFollowsTheService();
    void simManagerAsksAgainWhenTheInterfaceComes();
    void simManagerOfNoModem();
    void simManagerChangesItsModem();

    void simInfoTellsAll();
    void simInfoNeedsAllAnswers_data();
    void simInfoNeedsAllAnswers();
    void simInfoTakesChangesBeforeItIsValid();
    void simInfoNeedsNotBeListed();
    void simInfoGoesWithItsListing();

    void modemManagerTellsAll();
    void modemManagerIsReadyWhenTheServiceIs();
    void modemManagerNeedsAllAnswers_data();
    void modemManagerNeedsAllAnswers();
    void modemManagerNeedsAVersion();
    void modemManagerKeepsIndicesRight();
    void modemManagerFollowsChanges();
    void modemManagerForgetsWithTheService();

private:
    void act(const char *action, const QStringList &arguments)
    {
        m_phone->act(QLatin1String(action), arguments);
    }
    void setPower(const QString &path, bool on);
    void settle() { m_phone->settle(Service); }

    std::unique_ptr<Phone> m_phone;
};

void OfonoClientsTest::initTestCase()
{
    m_phone = std::make_unique<Phone>();
}

void OfonoClientsTest::init()
{
    m_phone->takeJournal(Service);
}

void OfonoClientsTest::cleanup()
{
    m_phone->clearFaults();
    m_phone->startService(Service);
}

void OfonoClientsTest::setPower(const QString &path, bool on)
{
    QDBusMessage call
        = QDBusMessage::createMethodCall(Service, path, ModemInterface, QStringLiteral("SetProperty"));
    for (const char *property : {"Powered", "Online"}) {
        if (!on && qstrcmp(property, "Online") == 0)
            break;
        call.setArguments({QString::fromLatin1(property), QVariant::fromValue(QDBusVariant(on))});
        QCOMPARE(QDBusConnection::systemBus().call(call).type(), QDBusMessage::ReplyMessage);
    }
}

void OfonoClientsTest::managerIsSharedWhileInUse()
{
    QSharedPointer<QOfonoManager> first = QOfonoManager::instance();
    QCOMPARE(QOfonoManager::instance().data(), first.data());
    QVERIFY(waitUntil([&] { return first->available(); }));
    first.reset();
    QVERIFY(!QOfonoManager::instance()->available());
}

void OfonoClientsTest::managerFollowsTheService()
{
    const auto manager = QOfonoManager::instance();
    SignalSequence seen(manager.data());
    QVERIFY(!manager->available());
    QVERIFY(seen.waitFor(1));
    QCOMPARE(manager->modems(), QStringList({Modem0, Modem1}));
    m_phone->stopService(Service);
    QVERIFY(seen.waitFor(2));
    QCOMPARE(manager->modems(), QStringList());
    m_phone->startService(Service);
    QVERIFY(seen.waitFor(3));
    settle();
    QCOMPARE(seen.take(), list("availableChanged(true)|availableChanged(false)|availableChanged(true)"));
    QCOMPARE(manager->modems(), QStringList({Modem0, Modem1}));
}

void OfonoClientsTest::managerFollowsModems()
{
    const auto manager = QOfonoManager::instance();
    SignalSequence seen(manager.data());
    QVERIFY(seen.waitFor(1));
    act("modem remove", {QStringLiteral("0")});
    QVERIFY(seen.waitFor(2));
    QCOMPARE(manager->modems(), QStringList(Modem1));
    act("modem add", {QStringLiteral("0")});
    QVERIFY(seen.waitFor(3));
    QCOMPARE(manager->modems(), QStringList({Modem1, Modem0}));
    QCOMPARE(seen.take(), list("availableChanged(true)|modemRemoved(/ril_0)|modemAdded(/ril_0)"));
}

void OfonoClientsTest::managerNeedsAnAnswer()
{
    for (const QVariantList &answer : {QVariantList(), QVariantList{7}, QVariantList{QStringList()}}) {
        m_phone->answerCalls(Service, Root, QStringLiteral("GetModems"), answer);
        const auto manager = QOfonoManager::instance();
        settle();
        settle();
        QVERIFY(!manager->available());
        m_phone->clearFaults();
    }
}

void OfonoClientsTest::managerSendsOneCall()
{
    const auto manager = QOfonoManager::instance();
    QVERIFY(waitUntil([&] { return manager->available(); }));
    QCOMPARE(m_phone->takeJournal(Service), list("/ GetModems ()"));
}

void OfonoClientsTest::simManagerTellsAll()
{
    QOfonoSimManager sim;
    SignalSequence seen(&sim);
    QVERIFY(!sim.isValid());
    sim.setModemPath(Modem0);
    QCOMPARE(sim.modemPath(), Modem0);
    // All is there at the first signal.
    bool complete = false;
    connect(&sim, &QOfonoSimManager::presenceChanged, this, [&] {
        complete = sim.isValid() && sim.present() && sim.subscriberIdentity() == Imsi0
            && sim.subscriberNumbers() == list("+358401234567")
            && sim.pinRequired() == QOfonoSimManager::NoPin;
    });
    QVERIFY(waitUntil([&] { return sim.isValid(); }));
    settle();
    QVERIFY(complete);
    QCOMPARE(seen.take().size(), 4);
}

void OfonoClientsTest::simManagerPins_data()
{
    QTest::addColumn<QString>("word");
    QTest::addColumn<int>("number");
    const QStringList words = list("none|pin|pin2|phone|firstphone|network|netsub|service|corp|puk|puk2|"
                                   "firstphonepuk|networkpuk|netsubpuk|servicepuk|corppuk");
    for (int number = 0; number < words.size(); ++number)
        QTest::newRow(qPrintable(words.at(number))) << words.at(number) << number;
    QTest::newRow("a word that is not documented") << "fingerprint" << 0;
}

void OfonoClientsTest::simManagerPins()
{
    QFETCH(QString, word);
    QFETCH(int, number);
    m_phone->answerCalls(
        Service, Modem0, QStringLiteral("GetProperties"),
        {QVariantMap({{QStringLiteral("Present"), true}, {QStringLiteral("PinRequired"), word}})});
    QOfonoSimManager sim;
    sim.setModemPath(Modem0);
    QVERIFY(waitUntil([&] { return sim.isValid(); }));
    QCOMPARE(int(sim.pinRequired()), number);

    SignalSequence seen(&sim);
    const QString other = number == 9 ? QStringLiteral("pin") : QStringLiteral("puk");
    for (const QString &each : {other, word}) {
        m_phone->emitSignal(Service, Modem0, QStringLiteral("org.ofono.SimManager"),
                            QStringLiteral("PropertyChanged"),
                            {QStringLiteral("PinRequired"), QVariant::fromValue(QDBusVariant(each))});
    }
    QCOMPARE(seen.take(),
             QStringList({QStringLiteral("pinRequiredChanged(%1)").arg(number == 9 ? 1 : 9),
                          QStringLiteral("pinRequiredChanged(%1)").arg(number)}));
}

void OfonoClientsTest::simManagerFollowsTheCard()
{
    QOfonoSimManager sim;
    sim.setModemPath(Modem0);
    QVERIFY(waitUntil([&] { return sim.isValid(); }));
    SignalSequence seen(&sim);
    act("sim pull", {QStringLiteral("0")});
    QVERIFY(seen.waitFor(3));
    settle();
    QCOMPARE(seen.take(),
             list("presenceChanged(false)|subscriberNumbersChanged()|subscriberIdentityChanged()"));
    QVERIFY(sim.isValid());
    act("sim insert", {QStringLiteral("0")});
    QVERIFY(seen.waitFor(3));
    settle();
    QCOMPARE(seen.take().size(), 3);
    QCOMPARE(sim.subscriberIdentity(), Imsi0);
}

void OfonoClientsTest::simManagerFollowsPower()
{
    QOfonoSimManager sim;
    sim.setModemPath(Modem0);
    QVERIFY(waitUntil([&] { return sim.isValid(); }));
    setPower(Modem0, false);
    QVERIFY(waitUntil([&] { return !sim.isValid(); }));
    QVERIFY(!sim.present());
    QCOMPARE(sim.subscriberIdentity(), QString());
    setPower(Modem0, true);
    QVERIFY(waitUntil([&] { return sim.isValid(); }));
    QCOMPARE(sim.subscriberIdentity(), Imsi0);
}

void OfonoClientsTest::simManagerFollowsTheModem()
{
    QOfonoSimManager sim;
    sim.setModemPath(Modem0);
    QVERIFY(waitUntil([&] { return sim.isValid(); }));
    act("modem remove", {QStringLiteral("0")});
    QVERIFY(waitUntil([&] { return !sim.isValid(); }));
    act("modem add", {QStringLiteral("0")});
    QVERIFY(waitUntil([&] { return sim.isValid(); }));
}

void OfonoClientsTest::simManagerFollowsTheService()
{
    QOfonoSimManager sim;
    sim.setModemPath(Modem0);
    QVERIFY(waitUntil([&] { return sim.isValid(); }));
    SignalSequence seen(&sim);
    m_phone->stopService(Service);
    QVERIFY(waitUntil([&] { return !sim.isValid(); }));
    m_phone->startService(Service);
    QVERIFY(waitUntil([&] { return sim.isValid(); }));
    settle();
    QCOMPARE(seen.take().filter(QStringLiteral("valid")), list("validChanged(false)|validChanged(true)"));
}

void OfonoClientsTest::simManagerAsksAgainWhenTheInterfaceComes()
{
    setPower(Modem0, false);
    QOfonoSimManager sim;
    sim.setModemPath(Modem0);
    settle();
    settle();
    QVERIFY(!sim.isValid());
    setPower(Modem0, true);
    QVERIFY(waitUntil([&] { return sim.isValid(); }));
}

void OfonoClientsTest::simManagerOfNoModem()
{
    QOfonoSimManager sim;
    sim.setModemPath(QStringLiteral("/nowhere"));
    settle();
    settle();
    QVERIFY(!sim.isValid());
}

void OfonoClientsTest::simManagerChangesItsModem()
{
    QOfonoSimManager sim;
    sim.setModemPath(Modem0);
    QVERIFY(waitUntil([&] { return sim.isValid(); }));
    sim.setModemPath(Modem1);
    QVERIFY(!sim.isValid());
    QVERIFY(waitUntil([&] { return sim.isValid(); }));
    QCOMPARE(sim.subscriberIdentity(), Imsi1);
    sim.setModemPath(QString());
    QVERIFY(!sim.isValid());
}

void OfonoClientsTest::simInfoTellsAll()
{
    QOfonoExtSimInfo info;
    info.setModemPath(Modem0);
    QCOMPARE(info.modemPath(), Modem0);
    SignalSequence seen(&info);
    QVERIFY(waitUntil([&] { return info.isValid(); }));
    settle();
    QCOMPARE(seen.take(),
             list("cardIdentifierChanged(8935805100000012345)|subscriberIdentityChanged(244051234567890)|"
                  "serviceProviderNameChanged(Elo Mobile)|validChanged(true)"));
    QCOMPARE(info.cardIdentifier(), QStringLiteral("8935805100000012345"));
    QCOMPARE(info.subscriberIdentity(), Imsi0);
    QCOMPARE(info.serviceProviderName(), QStringLiteral("Elo Mobile"));

    act("sim pull", {QStringLiteral("0")});
    QVERIFY(seen.waitFor(3));
    settle();
    QCOMPARE(seen.take(),
             list("cardIdentifierChanged()|serviceProviderNameChanged()|subscriberIdentityChanged()"));
    QVERIFY(info.isValid());
    act("sim insert", {QStringLiteral("0")});
    QVERIFY(seen.waitFor(3));
    m_phone->stopService(Service);
    QVERIFY(waitUntil([&] { return !info.isValid(); }));
    QCOMPARE(info.subscriberIdentity(), QString());
    m_phone->startService(Service);
    QVERIFY(waitUntil([&] { return info.isValid(); }));
}

void OfonoClientsTest::simInfoNeedsAllAnswers_data()
{
    QTest::addColumn<QString>("failing");
    QTest::newRow("ICCID") << "GetCardIdentifier";
    QTest::newRow("IMSI") << "GetSubscriberIdentity";
    QTest::newRow("provider") << "GetServiceProviderName";
}

void OfonoClientsTest::simInfoNeedsAllAnswers()
{
    QFETCH(QString, failing);
    m_phone->failCalls(Service, Modem0, failing, QStringLiteral("org.ofono.Error.Failed"), QString());
    QOfonoExtSimInfo info;
    info.setModemPath(Modem0);
    settle();
    settle();
    QVERIFY(!info.isValid());
}

void OfonoClientsTest::simInfoTakesChangesBeforeItIsValid()
{
    m_phone->delayCalls(Service, Modem0, QStringLiteral("GetServiceProviderName"), 50);
    QOfonoExtSimInfo info;
    info.setModemPath(Modem0);
    QVERIFY(waitUntil([&] { return info.subscriberIdentity() == Imsi0; }));
    m_phone->emitSignal(Service, Modem0, SimInfoInterface, QStringLiteral("SubscriberIdentityChanged"),
                        {QStringLiteral("1")});
    QVERIFY(waitUntil([&] { return info.isValid(); }));
    QCOMPARE(info.subscriberIdentity(), QStringLiteral("1"));
}

void OfonoClientsTest::simInfoNeedsNotBeListed()
{
    const auto listInterfaces = [this](const QStringList &interfaces) {
        m_phone->emitSignal(Service, Modem0, ModemInterface, QStringLiteral("PropertyChanged"),
                            {QStringLiteral("Interfaces"), QVariant::fromValue(QDBusVariant(interfaces))});
    };
    m_phone->failCalls(Service, Modem0, QStringLiteral("GetCardIdentifier"),
                       QStringLiteral("org.freedesktop.DBus.Error.UnknownMethod"), QString());
    QOfonoExtSimInfo info;
    info.setModemPath(Modem0);
    settle();
    settle();
    QVERIFY(!info.isValid());
    // It comes with other interfaces...
    m_phone->clearFaults();
    listInterfaces({QStringLiteral("org.ofono.SimManager")});
    QVERIFY(waitUntil([&] { return info.isValid(); }));
    SignalSequence seen(&info);
    listInterfaces({QStringLiteral("org.ofono.SimManager"), QStringLiteral("org.ofono.Phonebook")});
    settle();
    QCOMPARE(seen.take(), QStringList());
    // ... and goes with them.
    m_phone->failCalls(Service, Modem0, QString(), QStringLiteral("org.freedesktop.DBus.Error.UnknownMethod"),
                       QString());
    listInterfaces({});
    QVERIFY(waitUntil([&] { return !info.isValid(); }));
}

void OfonoClientsTest::simInfoGoesWithItsListing()
{
    QOfonoExtSimInfo info;
    info.setModemPath(Modem0);
    QVERIFY(waitUntil([&] { return info.isValid(); }));
    setPower(Modem0, false);
    QVERIFY(waitUntil([&] { return !info.isValid(); }));
    setPower(Modem0, true);
    QVERIFY(waitUntil([&] { return info.isValid(); }));
    setPower(Modem0, false);
    settle();
    QVERIFY(!info.isValid());
    setPower(Modem0, true);
    QVERIFY(waitUntil([&] { return info.isValid(); }));
}

void OfonoClientsTest::modemManagerTellsAll()
{
    const auto manager = QOfonoExtModemManager::instance();
    QCOMPARE(QOfonoExtModemManager::instance().data(), manager.data());
    SignalSequence seen(manager.data());
    QVERIFY(!manager->ready());
    QVERIFY(waitUntil([&] { return manager->ready(); }));
    settle();
    QCOMPARE(seen.take().last(), QStringLiteral("readyChanged(true)"));
    QCOMPARE(manager->availableModems(), QStringList({Modem0, Modem1}));
    QCOMPARE(manager->enabledModems(), QStringList({Modem0, Modem1}));
    QCOMPARE(manager->presentSims(), QList<bool>({true, true}));
    QCOMPARE(manager->defaultVoiceSim(), Imsi0);
    QCOMPARE(manager->defaultDataSim(), Imsi0);
}

void OfonoClientsTest::modemManagerIsReadyWhenTheServiceIs()
{
    act("phone ready", {QStringLiteral("off")});
    const auto manager = QOfonoExtModemManager::instance();
    QVERIFY(waitUntil([&] { return manager->defaultDataSim() == Imsi0; }));
    settle();
    QVERIFY(!manager->ready());
    SignalSequence seen(manager.data());
    act("phone ready", {QStringLiteral("on")});
    QVERIFY(seen.waitFor(1));
    act("phone ready", {QStringLiteral("off")});
    QVERIFY(seen.waitFor(2));
    QCOMPARE(seen.take(), list("readyChanged(true)|readyChanged(false)"));
    QCOMPARE(manager->defaultDataSim(), Imsi0);
    act("phone ready", {QStringLiteral("on")});
}

void OfonoClientsTest::modemManagerNeedsAllAnswers_data()
{
    QTest::addColumn<QString>("failing");
    for (const char *method : {"GetInterfaceVersion", "GetAvailableModems", "GetEnabledModems",
                               "GetPresentSims", "GetDefaultVoiceSim", "GetDefaultDataSim", "GetReady"})
        QTest::newRow(method) << QString::fromLatin1(method);
}

void OfonoClientsTest::modemManagerNeedsAllAnswers()
{
    QFETCH(QString, failing);
    m_phone->failCalls(Service, Root, failing, QStringLiteral("org.ofono.Error.Failed"), QString());
    const auto manager = QOfonoExtModemManager::instance();
    settle();
    settle();
    settle();
    QVERIFY(!manager->ready());
    // The next run of the service may do better.
    m_phone->clearFaults();
    m_phone->stopService(Service);
    m_phone->startService(Service);
    QVERIFY(waitUntil([&] { return manager->ready(); }));
}

void OfonoClientsTest::modemManagerNeedsAVersion()
{
    m_phone->answerCalls(Service, Root, QStringLiteral("GetInterfaceVersion"), {0});
    const auto manager = QOfonoExtModemManager::instance();
    settle();
    settle();
    QVERIFY(!manager->ready());
    QCOMPARE(m_phone->takeJournal(Service), list("/ GetInterfaceVersion ()"));
}

void OfonoClientsTest::modemManagerKeepsIndicesRight()
{
    act("sim pull", {QStringLiteral("1")});
    const auto manager = QOfonoExtModemManager::instance();
    QVERIFY(waitUntil([&] { return manager->ready(); }));
    QCOMPARE(manager->presentSims(), QList<bool>({true, false}));
    m_phone->takeJournal(Service);

    QList<bool> atOnce;
    connect(manager.data(), &QOfonoExtModemManager::enabledModemsChanged, this,
            [&] { atOnce = manager->presentSims(); });
    act("modem remove", {QStringLiteral("0")});
    QVERIFY(waitUntil([&] { return manager->enabledModems() == QStringList(Modem1); }));
    QCOMPARE(atOnce, QList<bool>({false}));
    settle();
    QCOMPARE(manager->presentSims(), QList<bool>({false}));
    QCOMPARE(m_phone->takeJournal(Service), list("/ GetPresentSims ()"));
    act("modem add", {QStringLiteral("0")});
    QVERIFY(waitUntil([&] { return manager->presentSims() == QList<bool>({true, false}); }));
    act("sim insert", {QStringLiteral("1")});
    QVERIFY(waitUntil([&] { return manager->presentSims() == QList<bool>({true, true}); }));
    // An index of nothing is of no use.
    m_phone->emitSignal(Service, Root, ModemManagerInterface, QStringLiteral("PresentSimsChanged"),
                        {2, true});
    m_phone->emitSignal(Service, Root, ModemManagerInterface, QStringLiteral("PresentSimsChanged"),
                        {-1, true});
    QCOMPARE(manager->presentSims(), QList<bool>({true, true}));
}

void OfonoClientsTest::modemManagerFollowsChanges()
{
    const auto manager = QOfonoExtModemManager::instance();
    QVERIFY(waitUntil([&] { return manager->ready(); }));
    settle();
    SignalSequence seen(manager.data());
    act("sim default", {QStringLiteral("voice"), QStringLiteral("1")});
    act("sim default", {QStringLiteral("data"), QStringLiteral("1")});
    QVERIFY(seen.waitFor(2));
    m_phone->emitSignal(Service, Root, ModemManagerInterface, QStringLiteral("EnabledModemsChanged"),
                        {paths({Modem1})});
    QCOMPARE(seen.take().mid(0, 2),
             list("defaultVoiceSimChanged(262021234567891)|defaultDataSimChanged(262021234567891)"));
    QCOMPARE(manager->enabledModems(), QStringList(Modem1));
    QCOMPARE(manager->defaultVoiceSim(), Imsi1);
    act("sim default", {QStringLiteral("voice"), QStringLiteral("0")});
    act("sim default", {QStringLiteral("data"), QStringLiteral("0")});
}

void OfonoClientsTest::modemManagerForgetsWithTheService()
{
    const auto manager = QOfonoExtModemManager::instance();
    QVERIFY(waitUntil([&] { return manager->ready(); }));
    SignalSequence seen(manager.data());
    m_phone->stopService(Service);
    QVERIFY(waitUntil([&] { return !manager->ready(); }));
    QCOMPARE(seen.take().first(), QStringLiteral("readyChanged(false)"));
    QCOMPARE(manager->availableModems(), QStringList());
    QCOMPARE(manager->presentSims(), QList<bool>());
    QCOMPARE(manager->defaultVoiceSim(), QString());
    m_phone->startService(Service);
    QVERIFY(waitUntil([&] { return manager->ready(); }));
    QCOMPARE(manager->defaultVoiceSim(), Imsi0);
}

QTEST_GUILESS_MAIN(OfonoClientsTest)

#include "ofonoclients_test.moc"
