// SPDX-License-Identifier: LGPL-2.1-or-later
#include "phone.h"
#include "signalsequence.h"
#include "waiting.h"

#include <corvanemdm/siminfo.h>

#include <QtCore/QJsonArray>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusPendingCallWatcher>
#include <QtDBus/QDBusVariant>
#include <QtTest/QtTest>

#include <algorithm>
#include <memory>

using Corvane::Mdm::SimInfo;

namespace
{

const QString Service = QStringLiteral("org.ofono");
const QString Root = QStringLiteral("/");
const QString Modem0 = QStringLiteral("/ril_0");
const QString Modem1 = QStringLiteral("/ril_1");
const QString ModemInterface = QStringLiteral("org.ofono.Modem");
const QString ModemManager = QStringLiteral("org.veldmobile.ofono.ModemManager");

const QString Sim0 = QStringLiteral("/ril_0 present voice data enabled pin:0 net:1 244051234567890");
const QString Sim1 = QStringLiteral("/ril_1 present enabled pin:0 net:1 262021234567891");
const QString Empty0 = QStringLiteral("/ril_0 pin:-1 net:-1");
const QString Empty1 = QStringLiteral("/ril_1 pin:-1 net:-1");

QStringList words(const char *text)
{
    return QString::fromUtf8(text).split(QLatin1Char(' '), Qt::SkipEmptyParts);
}

QStringList stateTexts(const SimInfo &info)
{
    QStringList result;
    const QList<SimInfo::SimState> states = info.simSlotStates();
    for (const SimInfo::SimState &state : states)
        result.append(simStateText(state));
    return result;
}

QStringList slotTexts(const QList<SimInfo::SlotInfo> &infos)
{
    QStringList result;
    for (const SimInfo::SlotInfo &info : infos)
        result.append(info);
    return result;
}

QString changed(const QString &state)
{
    return QStringLiteral("simStateChanged(%1)").arg(state);
}

QVariant paths(const QStringList &list)
{
    QList<QDBusObjectPath> result;
    for (const QString &path : list)
        result.append(QDBusObjectPath(path));
    return QVariant::fromValue(result);
}

} // namespace

class SimInfoTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void init();
    void cleanup();

    void metaObject();
    void tellsBothSlots();
    void tellsEverythingOfASlot();
    void asksInThisOrder();
    void becomesAvailableBeforeItHasStates();
    void constructionWhileReadyTakesTheStatesAtOnce();
    void objectsAreIndependent();

    void state_data();
    void state();
    void pinStates_data();
    void pinStates();
    void statePartByPart_data();
    void statePartByPart();
    void statesOfASingleSlot();
    void statesWithoutModemsToAsk();

    void registrationIsFollowed_data();
    void registrationIsFollowed();
    void registrationThatFailsIsUnknown();
    void lossOfTheRegistrationInterfaceShowsWithTheNextChange();
    void providerAloneIsNoChange();
    void numbersAloneAreNoChange();
    void cardAloneIsNoChange();
    void eachPartIsFollowed_data();
    void eachPartIsFollowed();
    void otherPropertiesAreNoChange();
    void pulledAndInserted();
    void anotherSimIsInserted();
    void lockedAndUnlocked();
    void defaultsAreFollowed();
    void disabledAndEnabled();
    void presenceElsewhereIsNoReason();

    void modemRemovedAndAdded();
    void modemAddedBeforeReady();
    void modemRemovedBeforeReady();
    void modemAddedTwice();
    void notReadyKeepsTheStates();
    void notReadyWithEverythingInFlight_data();
    void notReadyWithEverythingInFlight();
    void readyAgainStartsAnew();
    void lateSignalsAreForgotten();
    void removedModemIsNotAskedAgain();
    void deletedInFlight_data();
    void deletedInFlight();
    void deletedByAReceiver();
    void deletedWhenTheServiceLeaves();
    void serviceStopsAndStarts();
    void absentService();
    void serviceThatComesLater();
    void stockService();

    void queries();
    void queriesAskInThisOrder();
    void failedImeiIsLogged();
    void failedModemIsLeftOut_data();
    void failedModemIsLeftOut();
    void slotsWithNothingAreLeftOut();
    void severalNumbersAreJoined();
    void queriesWithoutService();

private:
    void act(const char *action);
    /** Calls SetProperty of the modem in the slot. */
    void setModem(const QString &path, const char *property, bool value);
    /** What a simulator's action, or a sequence of those separated by ";", does. */
    void actAll(const QString &actions);
    /** Returns when the answers have come that are held back so far: one that is held back later comes last.
     */
    static void waitForLateAnswers(const QString &path, const QString &member);
    bool waitForStates(const SimInfo &info, const QStringList &expected);
    void settle() { m_phone->settle(Service); }

    std::unique_ptr<Phone> m_phone;
};

void SimInfoTest::initTestCase()
{
    m_phone = std::make_unique<Phone>();
}

void SimInfoTest::init()
{
    m_phone->takeJournal(Service);
}

void SimInfoTest::cleanup()
{
    m_phone->clearFaults();
    m_phone->startService(Service);
    act("phone extensions on");
    act("phone ready on");
    const QStringList imsis{QStringLiteral("244051234567890"), QStringLiteral("262021234567891")};
    for (int slot = 0; slot < imsis.size(); ++slot) {
        const QString number = QString::number(slot);
        const QJsonObject modem
            = m_phone->state().value(QLatin1String("modems")).toArray().at(slot).toObject();
        if (!modem.value(QLatin1String("there")).toBool())
            m_phone->act(QStringLiteral("modem add"), {number});
        m_phone->act(QStringLiteral("modem enable"), {number});
        const QString path = modem.value(QLatin1String("path")).toString();
        setModem(path, "Powered", true);
        setModem(path, "Online", true);
        const auto sim = [&] {
            return m_phone->state().value(QLatin1String("sims")).toArray().at(slot).toObject();
        };
        const bool isOther = sim().value(QLatin1String("imsi")).toString() != imsis.at(slot);
        if (isOther && sim().value(QLatin1String("present")).toBool())
            m_phone->act(QStringLiteral("sim pull"), {number});
        if (!sim().value(QLatin1String("present")).toBool())
            m_phone->act(QStringLiteral("sim insert"), {number, imsis.at(slot)});
        m_phone->act(QStringLiteral("sim lock"), {number, QStringLiteral("none")});
        m_phone->act(QStringLiteral("network"), {number, QStringLiteral("registered")});
    }
    act("sim provider 0 Elo");
    act("sim numbers 0 +358401234567");
    act("sim default voice 0");
    act("sim default data 0");
}

void SimInfoTest::act(const char *action)
{
    const QStringList all = words(action);
    const int actionWords = all.first() == QLatin1String("network") ? 1 : 2;
    m_phone->act(QStringList(all.mid(0, actionWords)).join(QLatin1Char(' ')), all.mid(actionWords));
}

void SimInfoTest::actAll(const QString &actions)
{
    const QStringList list = actions.split(QLatin1Char(';'), Qt::SkipEmptyParts);
    for (const QString &each : list) {
        const QString action = each.trimmed();
        if (action.startsWith(QLatin1String("offline ")))
            setModem(QStringLiteral("/ril_") + action.mid(8), "Online", false);
        else if (action.startsWith(QLatin1String("off ")))
            setModem(QStringLiteral("/ril_") + action.mid(4), "Powered", false);
        else
            act(action.toUtf8().constData());
    }
}

void SimInfoTest::setModem(const QString &path, const char *property, bool value)
{
    QDBusMessage call
        = QDBusMessage::createMethodCall(Service, path, ModemInterface, QStringLiteral("SetProperty"));
    call.setArguments({QString::fromLatin1(property), QVariant::fromValue(QDBusVariant(value))});
    const QDBusMessage reply = QDBusConnection::systemBus().call(call);
    QVERIFY2(reply.type() == QDBusMessage::ReplyMessage, qPrintable(reply.errorMessage()));
}

void SimInfoTest::waitForLateAnswers(const QString &path, const QString &member)
{
    QDBusPendingCallWatcher last(QDBusConnection::systemBus().asyncCall(
        QDBusMessage::createMethodCall(Service, path.isEmpty() ? Modem0 : path, ModemInterface,
                                       member.isEmpty() ? QStringLiteral("GetProperties") : member)));
    QVERIFY(waitUntil([&] { return last.isFinished(); }));
}

bool SimInfoTest::waitForStates(const SimInfo &info, const QStringList &expected)
{
    const bool done = waitUntil([&] { return stateTexts(info) == expected; });
    if (!done)
        qWarning() << stateTexts(info) << "instead of" << expected;
    settle();
    return done && stateTexts(info) == expected;
}

void SimInfoTest::metaObject()
{
    const QMetaObject &meta = SimInfo::staticMetaObject;
    QCOMPARE(meta.propertyCount() - meta.propertyOffset(), 1);
    const QMetaProperty available = meta.property(meta.propertyOffset());
    QCOMPARE(available.name(), "available");
    QVERIFY(!available.isWritable());
    QCOMPARE(available.notifySignal().methodSignature(), QByteArray("availableChanged(bool)"));
    QCOMPARE(meta.method(meta.methodOffset()).methodSignature(), QByteArray("availableChanged(bool)"));
    QCOMPARE(meta.method(meta.methodOffset() + 1).methodSignature(),
             QByteArray("simStateChanged(SimInfo::SimState)"));
    QCOMPARE(meta.enumeratorCount() - meta.enumeratorOffset(), 1);
    QCOMPARE(meta.enumerator(meta.enumeratorOffset()).name(), "NetworkRegistrationStatus");

    const SimInfo info;
    QVERIFY(QMetaType::type("Corvane::Mdm::SimInfo::SimState") != QMetaType::UnknownType);
    QCOMPARE(QMetaType::type("SimInfo::SimState"), qMetaTypeId<SimInfo::SimState>());
    QCOMPARE(info.property("available"), QVariant(false));
}

void SimInfoTest::tellsBothSlots()
{
    SimInfo info;
    SignalSequence seen(&info);
    QVERIFY(!info.available());
    QVERIFY(info.simSlotStates().isEmpty());
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    QVERIFY(info.available());
    QCOMPARE(info.property("available"), QVariant(true));
    // The path is known first; then one signal a slot brings all the rest but the registration.
    const QString unregistered0 = QString(Sim0).replace(QLatin1String("net:1"), QLatin1String("net:-1"));
    const QString unregistered1 = QString(Sim1).replace(QLatin1String("net:1"), QLatin1String("net:-1"));
    QStringList signalsSeen = seen.take();
    QCOMPARE(signalsSeen.takeFirst(), QStringLiteral("availableChanged(true)"));
    signalsSeen.removeAll(changed(unregistered0));
    signalsSeen.removeAll(changed(unregistered1));
    // Nobody says which slot's answers come first.
    QCOMPARE(signalsSeen.filter(Modem0), QStringList({changed(Empty0), changed(Sim0)}));
    QCOMPARE(signalsSeen.filter(Modem1), QStringList({changed(Empty1), changed(Sim1)}));
    QCOMPARE(signalsSeen.size(), 4);
}

void SimInfoTest::tellsEverythingOfASlot()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    QCOMPARE(QString(info.simSlotStates().at(1)),
             QStringLiteral("SimState(/ril_1), imsi: 262021234567891, present: true, voice SIM: false, "
                            "data SIM: false, enabled: true, PIN required: false, Network reg: 1, ICCID: "
                            "8949020000000067891, Service provider: Tarn Telecom, Subscriber numbers: "
                            "+4915112345678"));
    QCOMPARE(QString(info.simSlotStates().at(0)),
             QStringLiteral("SimState(/ril_0), imsi: 244051234567890, present: true, voice SIM: true, "
                            "data SIM: true, enabled: true, PIN required: false, Network reg: 1, ICCID: "
                            "8935805100000012345, Service provider: Elo, Subscriber numbers: "
                            "+358401234567"));
}

void SimInfoTest::asksInThisOrder()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    QStringList calls = m_phone->takeJournalWithInterfaces(Service);
    // Nobody says which slot's answers come first.
    QVERIFY(calls.size() > 2);
    std::sort(calls.end() - 2, calls.end());
    QStringList expected{
        QStringLiteral("/ org.ofono.Manager.GetModems ()"),
        QStringLiteral("/ org.veldmobile.ofono.ModemManager.GetInterfaceVersion ()"),
        QStringLiteral("/ org.veldmobile.ofono.ModemManager.GetAvailableModems ()"),
        QStringLiteral("/ org.veldmobile.ofono.ModemManager.GetEnabledModems ()"),
        QStringLiteral("/ org.veldmobile.ofono.ModemManager.GetPresentSims ()"),
        QStringLiteral("/ org.veldmobile.ofono.ModemManager.GetDefaultVoiceSim ()"),
        QStringLiteral("/ org.veldmobile.ofono.ModemManager.GetDefaultDataSim ()"),
        QStringLiteral("/ org.veldmobile.ofono.ModemManager.GetReady ()"),
    };
    for (const QString &path : {Modem0, Modem1}) {
        expected << path + QStringLiteral(" org.ofono.Modem.GetProperties ()")
                 << path + QStringLiteral(" org.ofono.SimManager.GetProperties ()")
                 << path + QStringLiteral(" org.veldmobile.ofono.SimInfo.GetCardIdentifier ()")
                 << path + QStringLiteral(" org.veldmobile.ofono.SimInfo.GetSubscriberIdentity ()")
                 << path + QStringLiteral(" org.veldmobile.ofono.SimInfo.GetServiceProviderName ()");
    }
    expected << QStringLiteral("/ril_0 org.ofono.NetworkRegistration.GetProperties ()")
             << QStringLiteral("/ril_1 org.ofono.NetworkRegistration.GetProperties ()");
    QCOMPARE(calls, expected);
}

void SimInfoTest::becomesAvailableBeforeItHasStates()
{
    m_phone->swallowCalls(Service, Root, QStringLiteral("GetReady"));
    SimInfo info;
    SignalSequence seen(&info);
    QVERIFY(waitUntil([&] { return info.available(); }));
    settle();
    QCOMPARE(seen.take(), QStringList(QStringLiteral("availableChanged(true)")));
    QVERIFY(info.simSlotStates().isEmpty());
}

void SimInfoTest::constructionWhileReadyTakesTheStatesAtOnce()
{
    SimInfo first;
    QVERIFY(waitForStates(first, {Sim0, Sim1}));
    m_phone->takeJournal(Service);

    // The objects share what they know of the service: it is not asked about that again.
    SimInfo second;
    QVERIFY(second.available());
    QCOMPARE(stateTexts(second), QStringList({Empty0, Empty1}));
    QVERIFY(waitForStates(second, {Sim0, Sim1}));
    const QStringList calls = m_phone->takeJournal(Service);
    QVERIFY2(calls.filter(QRegularExpression(QStringLiteral("^/ "))).isEmpty(),
             qPrintable(calls.join(QLatin1Char('\n'))));
}

void SimInfoTest::objectsAreIndependent()
{
    auto first = std::make_unique<SimInfo>();
    SimInfo second;
    QVERIFY(waitForStates(*first, {Sim0, Sim1}));
    QVERIFY(waitForStates(second, {Sim0, Sim1}));
    first.reset();
    SignalSequence seen(&second);
    act("network 1 roaming");
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(),
             QStringList(changed(QStringLiteral("/ril_1 present enabled pin:0 net:4 262021234567891"))));
}

void SimInfoTest::state_data()
{
    QTest::addColumn<QString>("actions");
    QTest::addColumn<QStringList>("expected");

    QTest::newRow("two SIMs") << QString() << QStringList({Sim0, Sim1});
    QTest::newRow("the other SIM is chosen")
        << "sim default voice 1; sim default data 1"
        << QStringList({QStringLiteral("/ril_0 present enabled pin:0 net:1 244051234567890"),
                        QStringLiteral("/ril_1 present voice data enabled pin:0 net:1 262021234567891")});
    QTest::newRow("one for calls, one for data")
        << "sim default data 1"
        << QStringList({QStringLiteral("/ril_0 present voice enabled pin:0 net:1 244051234567890"),
                        QStringLiteral("/ril_1 present data enabled pin:0 net:1 262021234567891")});
    // A slot without a card is voice and data SIM, beside the one that is.
    QTest::newRow("empty slot") << "sim pull 1"
                                << QStringList(
                                       {Sim0, QStringLiteral("/ril_1 voice data enabled pin:-1 net:0")});
    QTest::newRow("both slots empty")
        << "sim pull 0; sim pull 1"
        << QStringList({QStringLiteral("/ril_0 voice data enabled pin:-1 net:0"),
                        QStringLiteral("/ril_1 voice data enabled pin:-1 net:0")});
    QTest::newRow("locked") << "sim lock 1 pin"
                            << QStringList({Sim0, QStringLiteral("/ril_1 present enabled pin:1 net:0")});
    QTest::newRow("blocked") << "sim lock 1 puk"
                             << QStringList({Sim0, QStringLiteral("/ril_1 present enabled pin:2 net:0")});
    QTest::newRow("second PIN")
        << "sim lock 1 pin2"
        << QStringList({Sim0, QStringLiteral("/ril_1 present enabled pin:0 net:1 262021234567891")});
    // Without an IMSI there is none that could be equal to a default: with no default at all, there is.
    QTest::newRow("both locked") << "sim lock 0 pin; sim lock 1 pin"
                                 << QStringList(
                                        {QStringLiteral("/ril_0 present voice data enabled pin:1 net:0"),
                                         QStringLiteral("/ril_1 present voice data enabled pin:1 net:0")});
    QTest::newRow("disabled modem") << "modem disable 1" << QStringList({Sim0, Empty1});
    QTest::newRow("modem without power") << "off 1" << QStringList({Sim0, Empty1});
    QTest::newRow("no registration interface") << "offline 1" << QStringList({Sim0, Empty1});
    QTest::newRow("no modem at all") << "modem remove 0; modem remove 1" << QStringList();
    QTest::newRow("one modem") << "modem remove 0"
                               << QStringList(QStringLiteral(
                                      "/ril_1 present voice data enabled pin:0 net:1 262021234567891"));
    QTest::newRow("one modem, locked")
        << "modem remove 0; sim lock 1 puk"
        << QStringList(QStringLiteral("/ril_1 present voice data enabled pin:2 net:0"));
    QTest::newRow("one modem, empty")
        << "modem remove 0; sim pull 1"
        << QStringList(QStringLiteral("/ril_1 voice data enabled pin:-1 net:0"));
}

/** Found so at construction, and reached from another state. */
void SimInfoTest::state()
{
    QFETCH(QString, actions);
    QFETCH(QStringList, expected);

    actAll(actions);
    SimInfo info;
    if (!expected.isEmpty())
        QVERIFY(waitForStates(info, expected));
    QVERIFY(waitUntil([&] { return info.available(); }));
    settle();
    QCOMPARE(stateTexts(info), expected);
}

void SimInfoTest::pinStates_data()
{
    QTest::addColumn<QString>("word");
    QTest::addColumn<int>("expected");
    const QStringList inOrder{
        QStringLiteral("none"),       QStringLiteral("pin"),        QStringLiteral("pin2"),
        QStringLiteral("phone"),      QStringLiteral("firstphone"), QStringLiteral("network"),
        QStringLiteral("netsub"),     QStringLiteral("service"),    QStringLiteral("corp"),
        QStringLiteral("puk"),        QStringLiteral("puk2"),       QStringLiteral("firstphonepuk"),
        QStringLiteral("networkpuk"), QStringLiteral("netsubpuk"),  QStringLiteral("servicepuk"),
        QStringLiteral("corppuk"),
    };
    for (int value = 0; value < inOrder.size(); ++value) {
        const int expected = value == 1 ? SimInfo::SimPinRequired
            : value == 9                ? SimInfo::SimPukRequired
                                        : SimInfo::PinNotRequired;
        QTest::addRow("%d %s", value, qPrintable(inOrder.at(value))) << inOrder.at(value) << expected;
    }
}

void SimInfoTest::pinStates()
{
    QFETCH(QString, word);
    QFETCH(int, expected);
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    m_phone->act(QStringLiteral("sim lock"), {QStringLiteral("1"), word});
    QVERIFY(waitUntil([&] { return info.simSlotStates().at(1).pinRequired == expected; }));
    settle();
    QCOMPARE(int(info.simSlotStates().at(1).pinRequired), expected);
    QCOMPARE(info.simSlotStates().at(1).present, true);
}

void SimInfoTest::statePartByPart_data()
{
    QTest::addColumn<QString>("path");
    QTest::addColumn<QString>("member");
    QTest::addColumn<QVariantList>("answer"); // none: an error
    QTest::addColumn<QString>("expected");

    const auto row = [](const char *name, const QString &path, const char *member, const QVariantList &answer,
                        const QString &expected) {
        QTest::newRow(name) << path << QString::fromLatin1(member) << answer << expected;
    };
    row("not among the enabled modems", Root, "GetEnabledModems", {paths({Modem1})},
        QStringLiteral("/ril_0 present voice data pin:-1 net:1 244051234567890"));
    row("not reported as present", Root, "GetPresentSims", {QVariant::fromValue(QList<bool>({false, true}))},
        QStringLiteral("/ril_0 present voice data enabled pin:-1 net:1 244051234567890"));
    row("fewer reports than modems", Root, "GetPresentSims", {QVariant::fromValue(QList<bool>())},
        QStringLiteral("/ril_0 present voice data enabled pin:-1 net:1 244051234567890"));
    row("no default for calls", Root, "GetDefaultVoiceSim", {QString()},
        QStringLiteral("/ril_0 present data enabled pin:0 net:1 244051234567890"));
    row("no default for data", Root, "GetDefaultDataSim", {QString()},
        QStringLiteral("/ril_0 present voice enabled pin:0 net:1 244051234567890"));
    row("IMSI of the extension", Modem0, "GetSubscriberIdentity", {QStringLiteral("1")},
        QStringLiteral("/ril_0 present enabled pin:0 net:1 1"));
    row("no ICCID told", Modem0, "GetCardIdentifier", {}, Empty0);
    row("no IMSI told", Modem0, "GetSubscriberIdentity", {}, Empty0);
    row("no provider told", Modem0, "GetServiceProviderName", {}, Empty0);
    row("IMSI of a wrong type", Modem0, "GetSubscriberIdentity", {7}, Empty0);
    row("no properties told", Modem0, "GetProperties", {}, Empty0);
}

void SimInfoTest::statePartByPart()
{
    QFETCH(QString, path);
    QFETCH(QString, member);
    QFETCH(QVariantList, answer);
    QFETCH(QString, expected);

    if (answer.isEmpty())
        m_phone->failCalls(Service, path, member, QStringLiteral("org.ofono.Error.Failed"), QString());
    else
        m_phone->answerCalls(Service, path, member, answer);
    SimInfo info;
    QVERIFY(waitUntil([&] {
        return info.simSlotStates().size() == 2
            && info.simSlotStates().at(1).networkRegistration == SimInfo::Registered
            && stateTexts(info).at(0) == expected;
    }));
    settle();
    QCOMPARE(stateTexts(info).at(0), expected);
}

void SimInfoTest::statesOfASingleSlot()
{
    act("modem remove 1");
    act("sim default voice 1");
    m_phone->answerCalls(Service, Root, QStringLiteral("GetDefaultVoiceSim"),
                         {QStringLiteral("262021234567891")});
    m_phone->answerCalls(Service, Root, QStringLiteral("GetDefaultDataSim"), {QString()});
    SimInfo info;
    // With one slot nobody asks which SIM it is.
    QVERIFY(waitForStates(info, {Sim0}));
}

void SimInfoTest::statesWithoutModemsToAsk()
{
    // The list names a modem that the service does not have.
    m_phone->answerCalls(Service, Root, QStringLiteral("GetAvailableModems"),
                         {paths({QStringLiteral("/nowhere"), Modem1})});
    SimInfo info;
    QVERIFY(waitForStates(info, {QStringLiteral("/nowhere pin:-1 net:-1"), Sim1}));
}

void SimInfoTest::registrationIsFollowed_data()
{
    QTest::addColumn<QString>("status");
    QTest::addColumn<int>("expected");
    QTest::newRow("unregistered") << "unregistered" << 0;
    QTest::newRow("searching") << "searching" << 2;
    QTest::newRow("denied") << "denied" << 3;
    QTest::newRow("roaming") << "roaming" << 4;
    QTest::newRow("unknown") << "unknown" << -1;
}

void SimInfoTest::registrationIsFollowed()
{
    QFETCH(QString, status);
    QFETCH(int, expected);
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    SignalSequence seen(&info);
    m_phone->act(QStringLiteral("network"), {QStringLiteral("0"), status});
    QVERIFY(seen.waitFor(1));
    m_phone->act(QStringLiteral("network"), {QStringLiteral("0"), QStringLiteral("registered")});
    QVERIFY(seen.waitFor(2));
    settle();
    QCOMPARE(
        seen.take(),
        QStringList({changed(QStringLiteral("/ril_0 present voice data enabled pin:0 net:%1 244051234567890")
                                 .arg(expected)),
                     changed(Sim0)}));
}

void SimInfoTest::registrationThatFailsIsUnknown()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    setModem(Modem0, "Online", false);
    settle();
    // The interface comes back, and does not tell.
    m_phone->failCalls(Service, Modem0, QStringLiteral("GetProperties"),
                       QStringLiteral("org.ofono.Error.Failed"), QString());
    setModem(Modem0, "Online", true);
    QVERIFY(waitForStates(
        info, {QStringLiteral("/ril_0 present voice data enabled pin:0 net:-1 244051234567890"), Sim1}));
}

void SimInfoTest::lossOfTheRegistrationInterfaceShowsWithTheNextChange()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    SignalSequence seen(&info);
    setModem(Modem1, "Online", false);
    settle();
    settle();
    QCOMPARE(seen.take(), QStringList());
    act("sim provider 1 Other");
    settle();
    QCOMPARE(seen.take(), QStringList(changed(Empty1)));
    setModem(Modem1, "Online", true);
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    QCOMPARE(info.simSlotStates().at(1).serviceProviderName, QStringLiteral("Other"));
}

void SimInfoTest::providerAloneIsNoChange()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    SignalSequence seen(&info);
    act("sim provider 0 Other");
    settle();
    QCOMPARE(seen.take(), QStringList());
    QCOMPARE(info.simSlotStates().at(0).serviceProviderName, QStringLiteral("Elo"));
    // It is taken over together with what counts.
    act("network 0 roaming");
    QVERIFY(seen.waitFor(1));
    QCOMPARE(info.simSlotStates().at(0).serviceProviderName, QStringLiteral("Other"));
}

void SimInfoTest::numbersAloneAreNoChange()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    SignalSequence seen(&info);
    act("sim numbers 0 1 2");
    settle();
    QCOMPARE(seen.take(), QStringList());
    QCOMPARE(info.simSlotStates().at(0).subscriberNumbers, QStringList(QStringLiteral("+358401234567")));
    act("network 0 roaming");
    QVERIFY(seen.waitFor(1));
    QCOMPARE(info.simSlotStates().at(0).subscriberNumbers,
             QStringList({QStringLiteral("1"), QStringLiteral("2")}));
}

void SimInfoTest::cardAloneIsNoChange()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    SignalSequence seen(&info);
    m_phone->emitSignal(Service, Modem0, QStringLiteral("org.veldmobile.ofono.SimInfo"),
                        QStringLiteral("CardIdentifierChanged"), {QStringLiteral("89")});
    QCOMPARE(seen.take(), QStringList());
    QCOMPARE(info.simSlotStates().at(0).cardIdentifier, QStringLiteral("8935805100000012345"));
}

void SimInfoTest::eachPartIsFollowed_data()
{
    QTest::addColumn<QString>("interface");
    QTest::addColumn<QString>("member");
    QTest::addColumn<QVariantList>("arguments");
    QTest::addColumn<QString>("state");
    const QString pending = QStringLiteral("/ril_0 present voice data enabled pin:-1 net:1 244051234567890");
    const QString simManager = QStringLiteral("org.ofono.SimManager");
    const QString simInfo = QStringLiteral("org.veldmobile.ofono.SimInfo");
    const QString property = QStringLiteral("PropertyChanged");
    const auto arguments = [](const char *name, const QVariant &value) {
        return QVariantList{QString::fromLatin1(name), QVariant::fromValue(QDBusVariant(value))};
    };
    QTest::newRow("numbers") << simManager << property
                             << arguments("SubscriberNumbers", QStringList(QStringLiteral("1"))) << pending;
    QTest::newRow("IMSI of the SIM manager")
        << simManager << property << arguments("SubscriberIdentity", QStringLiteral("1")) << pending;
    QTest::newRow("presence") << simManager << property << arguments("Present", false)
                              << QStringLiteral("/ril_0 voice data enabled pin:-1 net:1 244051234567890");
    QTest::newRow("card") << simInfo << QStringLiteral("CardIdentifierChanged")
                          << QVariantList{QStringLiteral("89")} << pending;
    QTest::newRow("IMSI") << simInfo << QStringLiteral("SubscriberIdentityChanged")
                          << QVariantList{QStringLiteral("1")}
                          << QStringLiteral("/ril_0 present enabled pin:-1 net:1 1");
}

void SimInfoTest::eachPartIsFollowed()
{
    QFETCH(QString, interface);
    QFETCH(QString, member);
    QFETCH(QVariantList, arguments);
    QFETCH(QString, state);
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    SignalSequence seen(&info);
    // Nobody looks at this one before something else changes, so that whatever is heard of shows.
    m_phone->emitSignal(Service, Root, ModemManager, QStringLiteral("PresentSimsChanged"), {0, false});
    QCOMPARE(seen.take(), QStringList());
    m_phone->emitSignal(Service, Modem0, interface, member, arguments);
    QCOMPARE(seen.take(), QStringList(changed(state)));
}

void SimInfoTest::otherPropertiesAreNoChange()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    SignalSequence seen(&info);
    const QVariant value = QVariant::fromValue(QDBusVariant(QStringLiteral("x")));
    for (const char *interface :
         {"org.ofono.Modem", "org.ofono.SimManager", "org.ofono.NetworkRegistration"}) {
        m_phone->emitSignal(Service, Modem0, QLatin1String(interface), QStringLiteral("PropertyChanged"),
                            {QStringLiteral("Name"), value});
    }
    QCOMPARE(seen.take(), QStringList());
    QCOMPARE(stateTexts(info), QStringList({Sim0, Sim1}));
}

void SimInfoTest::pulledAndInserted()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    act("sim pull 0");
    QVERIFY(waitForStates(info,
                          {QStringLiteral("/ril_0 voice data enabled pin:-1 net:0"),
                           QStringLiteral("/ril_1 present voice data enabled pin:0 net:1 262021234567891")}));
    const SimInfo::SimState pulled = info.simSlotStates().at(0);
    QCOMPARE(pulled.cardIdentifier + pulled.serviceProviderName + pulled.subscriberNumbers.join(QString()),
             QString());
    act("sim insert 0");
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    const SimInfo::SimState inserted = info.simSlotStates().at(0);
    QCOMPARE(inserted.cardIdentifier, QStringLiteral("8935805100000012345"));
    QCOMPARE(inserted.serviceProviderName, QStringLiteral("Elo"));
    QCOMPARE(inserted.subscriberNumbers, QStringList(QStringLiteral("+358401234567")));
}

void SimInfoTest::anotherSimIsInserted()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    act("sim pull 1");
    act("sim insert 1 262029999999999");
    QVERIFY(
        waitForStates(info, {Sim0, QStringLiteral("/ril_1 present enabled pin:0 net:1 262029999999999")}));
    QCOMPARE(info.simSlotStates().at(1).cardIdentifier, QStringLiteral("8900262029999999999"));
}

void SimInfoTest::lockedAndUnlocked()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    act("sim lock 1 pin");
    QVERIFY(waitForStates(info, {Sim0, QStringLiteral("/ril_1 present enabled pin:1 net:0")}));
    act("sim lock 1 puk");
    QVERIFY(waitForStates(info, {Sim0, QStringLiteral("/ril_1 present enabled pin:2 net:0")}));
    act("sim lock 1 none");
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    QCOMPARE(info.simSlotStates().at(1).subscriberNumbers, QStringList(QStringLiteral("+4915112345678")));
}

void SimInfoTest::defaultsAreFollowed()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    SignalSequence seen(&info);
    act("sim default voice 1");
    QVERIFY(seen.waitFor(2));
    act("sim default data 1");
    QVERIFY(seen.waitFor(4));
    settle();
    QCOMPARE(seen.take(),
             QStringList(
                 {changed(QStringLiteral("/ril_0 present data enabled pin:0 net:1 244051234567890")),
                  changed(QStringLiteral("/ril_1 present voice enabled pin:0 net:1 262021234567891")),
                  changed(QStringLiteral("/ril_0 present enabled pin:0 net:1 244051234567890")),
                  changed(QStringLiteral("/ril_1 present voice data enabled pin:0 net:1 262021234567891"))}));
}

void SimInfoTest::disabledAndEnabled()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    SignalSequence seen(&info);
    // The list alone: the modem itself stays as it is.
    m_phone->emitSignal(Service, Root, ModemManager, QStringLiteral("EnabledModemsChanged"),
                        {paths({Modem0})});
    QCOMPARE(seen.take(),
             QStringList(changed(QStringLiteral("/ril_1 present pin:-1 net:1 262021234567891"))));
    m_phone->emitSignal(Service, Root, ModemManager, QStringLiteral("EnabledModemsChanged"),
                        {paths({Modem0, Modem1})});
    QCOMPARE(seen.take(), QStringList(changed(Sim1)));

    act("modem disable 1");
    QVERIFY(waitForStates(info, {Sim0, Empty1}));
    act("modem enable 1");
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
}

void SimInfoTest::presenceElsewhereIsNoReason()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    SignalSequence seen(&info);
    // What the modem manager reports of SIMs is looked at when something else changes.
    m_phone->emitSignal(Service, Root, ModemManager, QStringLiteral("PresentSimsChanged"), {0, false});
    QCOMPARE(seen.take(), QStringList());
    act("network 0 roaming");
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(),
             QStringList(
                 changed(QStringLiteral("/ril_0 present voice data enabled pin:-1 net:4 244051234567890"))));
}

void SimInfoTest::modemRemovedAndAdded()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    SignalSequence seen(&info);
    act("modem remove 0");
    // The slot that is left has no other beside it; the state of the one that went is kept, empty.
    const QString alone = QStringLiteral("/ril_1 present voice data enabled pin:0 net:1 262021234567891");
    QVERIFY(waitForStates(info, {Empty0, alone}));
    QCOMPARE(seen.take(), QStringList({changed(Empty0), changed(alone)}));
    act("modem add 0");
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    QCOMPARE(info.simSlotStates().at(0).cardIdentifier, QStringLiteral("8935805100000012345"));
}

void SimInfoTest::modemAddedBeforeReady()
{
    act("modem remove 1");
    act("phone ready off");
    SimInfo info;
    SignalSequence seen(&info);
    QVERIFY(waitUntil([&] { return info.available(); }));
    settle();
    act("modem add 1");
    settle();
    QCOMPARE(seen.take(), QStringList(QStringLiteral("availableChanged(true)")));
    QVERIFY(info.simSlotStates().isEmpty());
    act("phone ready on");
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
}

void SimInfoTest::modemRemovedBeforeReady()
{
    act("phone ready off");
    SimInfo info;
    SignalSequence seen(&info);
    QVERIFY(waitUntil([&] { return info.available(); }));
    settle();
    act("modem remove 1");
    settle();
    QCOMPARE(seen.take(), QStringList({QStringLiteral("availableChanged(true)"), changed(Empty1)}));
    act("phone ready on");
    QVERIFY(waitForStates(info, {Sim0, Empty1}));
}

void SimInfoTest::modemAddedTwice()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    m_phone->takeJournal(Service);
    SignalSequence seen(&info);
    m_phone->emitSignal(Service, Root, QStringLiteral("org.ofono.Manager"), QStringLiteral("ModemAdded"),
                        {QVariant::fromValue(QDBusObjectPath(Modem0)), QVariantMap()});
    settle();
    QCOMPARE(seen.take(), QStringList());
    QCOMPARE(stateTexts(info), QStringList({Sim0, Sim1}));
    act("network 0 roaming");
    QVERIFY(seen.waitFor(1));
    settle();
    QCOMPARE(seen.take().size(), 1);
}

void SimInfoTest::notReadyKeepsTheStates()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    SignalSequence seen(&info);
    act("phone ready off");
    settle();
    act("network 0 roaming");
    act("sim pull 1");
    act("sim default voice 0");
    settle();
    QCOMPARE(seen.take(), QStringList());
    QCOMPARE(stateTexts(info), QStringList({Sim0, Sim1}));
    QVERIFY(info.available());
}

void SimInfoTest::notReadyWithEverythingInFlight_data()
{
    QTest::addColumn<QString>("path");
    QTest::addColumn<QString>("unanswered");
    QTest::newRow("modems and SIMs") << QString() << "GetProperties";
    QTest::newRow("one modem's") << Modem0 << "GetProperties";
    QTest::newRow("IMSIs") << QString() << "GetSubscriberIdentity";
    QTest::newRow("everything of a modem") << Modem1 << QString();
}

void SimInfoTest::notReadyWithEverythingInFlight()
{
    QFETCH(QString, path);
    QFETCH(QString, unanswered);
    m_phone->delayCalls(Service, path, unanswered, 50);
    SimInfo info;
    SignalSequence seen(&info);
    QVERIFY(waitUntil([&] { return info.simSlotStates().size() == 2; }));
    m_phone->sendSignal(Service, Root, ModemManager, QStringLiteral("ReadyChanged"), {false});
    // The answer comes after the calls that are held back.
    m_phone->settle(Service);
    const QStringList kept = stateTexts(info);
    seen.take();
    // What was held back finds nobody.
    waitForLateAnswers(path, unanswered);
    m_phone->clearFaults();
    QCOMPARE(seen.take(), QStringList());
    QCOMPARE(stateTexts(info), kept);
    m_phone->emitSignal(Service, Root, ModemManager, QStringLiteral("ReadyChanged"), {true});
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
}

void SimInfoTest::readyAgainStartsAnew()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    act("phone ready off");
    settle();
    act("sim pull 1");
    act("phone ready on");
    QVERIFY(waitForStates(info, {Sim0, QStringLiteral("/ril_1 voice data enabled pin:-1 net:0")}));
    SignalSequence seen(&info);
    act("network 0 roaming");
    QVERIFY(seen.waitFor(1));
    settle();
    // Once: nothing of the first time is left to listen.
    QCOMPARE(seen.take().size(), 1);
}

void SimInfoTest::lateSignalsAreForgotten()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    // Sent before the modem goes, taken in after it.
    act("network 1 roaming");
    m_phone->sendSignal(Service, Root, QStringLiteral("org.ofono.Manager"), QStringLiteral("ModemRemoved"),
                        {QVariant::fromValue(QDBusObjectPath(Modem1))});
    act("network 1 denied");
    act("sim provider 1 Other");
    m_phone->sendSignal(
        Service, Modem1, ModemInterface, QStringLiteral("PropertyChanged"),
        {QStringLiteral("Interfaces"),
         QVariant::fromValue(QDBusVariant(QStringList(QStringLiteral("org.ofono.NetworkRegistration"))))});
    QVERIFY(waitForStates(info, {Sim0, Empty1}));
}

void SimInfoTest::removedModemIsNotAskedAgain()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    m_phone->emitSignal(Service, Root, QStringLiteral("org.ofono.Manager"), QStringLiteral("ModemRemoved"),
                        {QVariant::fromValue(QDBusObjectPath(Modem1))});
    m_phone->takeJournal(Service);
    for (const QStringList &interfaces :
         {QStringList(), QStringList(QStringLiteral("org.ofono.NetworkRegistration"))}) {
        m_phone->emitSignal(Service, Modem1, ModemInterface, QStringLiteral("PropertyChanged"),
                            {QStringLiteral("Interfaces"), QVariant::fromValue(QDBusVariant(interfaces))});
    }
    QCOMPARE(m_phone->takeJournal(Service).filter(Modem1), QStringList());
}

void SimInfoTest::deletedInFlight_data()
{
    QTest::addColumn<QString>("unanswered");
    QTest::newRow("nothing answered") << QString();
    QTest::newRow("modems") << "GetModems";
    QTest::newRow("version") << "GetInterfaceVersion";
    QTest::newRow("ready") << "GetReady";
    QTest::newRow("properties") << "GetProperties";
    QTest::newRow("IMSI") << "GetSubscriberIdentity";
}

void SimInfoTest::deletedInFlight()
{
    QFETCH(QString, unanswered);
    m_phone->delayCalls(Service, QString(), unanswered, 50);
    {
        SimInfo info;
        settle();
        settle();
    }
    // What was held back finds nobody.
    waitForLateAnswers(QString(), unanswered);
    m_phone->clearFaults();
    SimInfo next;
    QVERIFY(waitForStates(next, {Sim0, Sim1}));
}

void SimInfoTest::deletedByAReceiver()
{
    // At every signal there is: the first, the second, and so on.
    for (int count = 1;; ++count) {
        auto *info = new SimInfo;
        QPointer<SimInfo> alive(info);
        int seen = 0;
        const auto deleteInTime = [&] {
            if (++seen == count)
                delete info;
        };
        connect(info, &SimInfo::availableChanged, this, deleteInTime);
        connect(info, &SimInfo::simStateChanged, this, deleteInTime);
        QVERIFY(waitUntil([&] { return !alive || stateTexts(*alive) == QStringList({Sim0, Sim1}); }));
        if (alive) {
            delete info;
            QVERIFY(count >= 5);
            break;
        }
        settle();
    }

    auto *info = new SimInfo;
    QPointer<SimInfo> alive(info);
    QVERIFY(waitForStates(*info, {Sim0, Sim1}));
    connect(info, &SimInfo::simStateChanged, info, [info] { delete info; });
    act("modem remove 0");
    QVERIFY(waitUntil([&] { return !alive; }));
    settle();
}

void SimInfoTest::deletedWhenTheServiceLeaves()
{
    auto *info = new SimInfo;
    const QPointer<SimInfo> alive(info);
    QVERIFY(waitForStates(*info, {Sim0, Sim1}));
    connect(info, &SimInfo::availableChanged, info, [info] { delete info; });
    m_phone->stopService(Service);
    QVERIFY(waitUntil([&] { return !alive; }));
    m_phone->startService(Service);
    settle();
}

void SimInfoTest::serviceStopsAndStarts()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    SignalSequence seen(&info);
    m_phone->stopService(Service);
    QVERIFY(seen.waitFor(1));
    // The last states are kept.
    QCOMPARE(seen.take(), QStringList(QStringLiteral("availableChanged(false)")));
    QVERIFY(!info.available());
    QCOMPARE(stateTexts(info), QStringList({Sim0, Sim1}));

    act("sim pull 1");
    m_phone->startService(Service);
    const QString empty = QStringLiteral("/ril_1 voice data enabled pin:-1 net:0");
    QVERIFY(waitForStates(info, {Sim0, empty}));
    const QStringList all = seen.take();
    QCOMPARE(all.mid(0, 3),
             QStringList({QStringLiteral("availableChanged(true)"), changed(Empty0), changed(Empty1)}));
    QVERIFY(all.contains(changed(Sim0)));
    QCOMPARE(all.last(), changed(empty));
    act("network 0 roaming");
    QVERIFY(seen.waitFor(1));
    settle();
    QCOMPARE(seen.take().size(), 1);
}

void SimInfoTest::absentService()
{
    m_phone->stopService(Service);
    SimInfo info;
    SignalSequence seen(&info);
    QVERIFY(!info.available());
    // What has been sent to the bus so far is answered before this.
    QDBusConnection::systemBus().call(QDBusMessage::createMethodCall(
        QStringLiteral("org.freedesktop.DBus"), QStringLiteral("/org/freedesktop/DBus"),
        QStringLiteral("org.freedesktop.DBus"), QStringLiteral("ListNames")));
    QCoreApplication::processEvents();
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(info.simSlotStates().isEmpty());
}

void SimInfoTest::serviceThatComesLater()
{
    m_phone->stopService(Service);
    SimInfo info;
    m_phone->startService(Service);
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    QVERIFY(info.available());
}

void SimInfoTest::stockService()
{
    m_phone->stopService(Service);
    act("phone extensions off");
    m_phone->startService(Service);
    m_phone->takeJournal(Service);
    SimInfo info;
    SignalSequence seen(&info);
    QVERIFY(waitUntil([&] { return info.available(); }));
    settle();
    act("sim pull 1");
    act("network 0 roaming");
    settle();
    QCOMPARE(seen.take(), QStringList(QStringLiteral("availableChanged(true)")));
    QVERIFY(info.simSlotStates().isEmpty());
    QCOMPARE(m_phone->takeJournal(Service),
             QStringList({QStringLiteral("/ GetModems ()"), QStringLiteral("/ GetInterfaceVersion ()")}));
    QVERIFY(info.subscriberIdentities().isEmpty());
    QVERIFY(info.cardIdentifier().isEmpty());
}

void SimInfoTest::queries()
{
    const SimInfo info;
    QCOMPARE(slotTexts(info.imeiCodes()),
             QStringList({QStringLiteral("Slot(0) = (358240051111100)"),
                          QStringLiteral("Slot(1) = (358240051111101)")}));
    QCOMPARE(slotTexts(info.subscriberIdentities()),
             QStringList({QStringLiteral("Slot(0) = (244051234567890)"),
                          QStringLiteral("Slot(1) = (262021234567891)")}));
    QCOMPARE(slotTexts(info.cardIdentifier()),
             QStringList({QStringLiteral("Slot(0) = (8935805100000012345)"),
                          QStringLiteral("Slot(1) = (8949020000000067891)")}));
    QCOMPARE(slotTexts(info.subscriberNumbers()),
             QStringList({QStringLiteral("Slot(0) = (+358401234567)"),
                          QStringLiteral("Slot(1) = (+4915112345678)")}));
}

void SimInfoTest::queriesAskInThisOrder()
{
    SimInfo info;
    QVERIFY(waitForStates(info, {Sim0, Sim1}));
    const QString list = QStringLiteral("/ org.veldmobile.ofono.ModemManager.GetAvailableModems ()");
    m_phone->takeJournal(Service);
    info.imeiCodes();
    QCOMPARE(m_phone->takeJournalWithInterfaces(Service),
             QStringList(QStringLiteral("/ org.veldmobile.ofono.ModemManager.GetIMEI ()")));
    info.subscriberIdentities();
    const QStringList ofSims{list, QStringLiteral("/ril_0 org.ofono.SimManager.GetProperties ()"),
                             QStringLiteral("/ril_1 org.ofono.SimManager.GetProperties ()")};
    QCOMPARE(m_phone->takeJournalWithInterfaces(Service), ofSims);
    info.subscriberNumbers();
    QCOMPARE(m_phone->takeJournalWithInterfaces(Service), ofSims);
    info.cardIdentifier();
    QCOMPARE(m_phone->takeJournalWithInterfaces(Service),
             QStringList({list, QStringLiteral("/ril_0 org.veldmobile.ofono.SimInfo.GetCardIdentifier ()"),
                          QStringLiteral("/ril_1 org.veldmobile.ofono.SimInfo.GetCardIdentifier ()")}));
}

void SimInfoTest::failedImeiIsLogged()
{
    const SimInfo info;
    const char *const text
        = "Failed to fetch IMEI codes. Wait SimInfo to change available before calling this.";
    m_phone->failCalls(Service, Root, QStringLiteral("GetIMEI"), QStringLiteral("org.ofono.Error.Failed"),
                       QString());
    QTest::ignoreMessage(QtDebugMsg, text);
    QVERIFY(info.imeiCodes().isEmpty());
    m_phone->clearFaults();
    m_phone->answerCalls(Service, Root, QStringLiteral("GetIMEI"), {7});
    QTest::ignoreMessage(QtDebugMsg, text);
    QVERIFY(info.imeiCodes().isEmpty());
    m_phone->clearFaults();
    m_phone->answerCalls(Service, Root, QStringLiteral("GetIMEI"), {QStringList()});
    QVERIFY(info.imeiCodes().isEmpty());
}

void SimInfoTest::failedModemIsLeftOut_data()
{
    QTest::addColumn<QString>("failing");
    QTest::addColumn<QStringList>("expected"); // slots
    QTest::newRow("the middle one") << Modem1 << QStringList({QStringLiteral("0"), QStringLiteral("2")});
    QTest::newRow("the first") << Modem0 << QStringList({QStringLiteral("1")});
    QTest::newRow("all") << QString() << QStringList();
}

void SimInfoTest::failedModemIsLeftOut()
{
    QFETCH(QString, failing);
    QFETCH(QStringList, expected);
    // The third slot is that of the first modem once more.
    m_phone->answerCalls(Service, Root, QStringLiteral("GetAvailableModems"),
                         {paths({Modem0, Modem1, Modem0})});
    for (const char *member : {"GetProperties", "GetCardIdentifier"}) {
        m_phone->failCalls(Service, failing, QLatin1String(member), QStringLiteral("org.ofono.Error.Failed"),
                           QString());
    }
    const SimInfo info;
    for (const QList<SimInfo::SlotInfo> &infos :
         {info.subscriberIdentities(), info.cardIdentifier(), info.subscriberNumbers()}) {
        QStringList found;
        for (const SimInfo::SlotInfo &slot : infos)
            found.append(QString::number(slot.slot));
        QCOMPARE(found, expected);
    }
}

void SimInfoTest::slotsWithNothingAreLeftOut()
{
    act("sim pull 0");
    const SimInfo info;
    QCOMPARE(slotTexts(info.subscriberIdentities()),
             QStringList(QStringLiteral("Slot(1) = (262021234567891)")));
    QCOMPARE(slotTexts(info.cardIdentifier()),
             QStringList(QStringLiteral("Slot(1) = (8949020000000067891)")));
    QCOMPARE(slotTexts(info.subscriberNumbers()), QStringList(QStringLiteral("Slot(1) = (+4915112345678)")));
    QCOMPARE(info.imeiCodes().size(), 2);
}

void SimInfoTest::severalNumbersAreJoined()
{
    act("sim numbers 0 +1 +2 +3");
    const SimInfo info;
    QCOMPARE(slotTexts(info.subscriberNumbers()).at(0), QStringLiteral("Slot(0) = (+1,+2,+3)"));
}

void SimInfoTest::queriesWithoutService()
{
    m_phone->stopService(Service);
    const SimInfo info;
    QTest::ignoreMessage(QtDebugMsg,
                         "Failed to fetch IMEI codes. Wait SimInfo to change available before calling this.");
    QVERIFY(info.imeiCodes().isEmpty());
    QVERIFY(info.subscriberIdentities().isEmpty());
    QVERIFY(info.cardIdentifier().isEmpty());
    QVERIFY(info.subscriberNumbers().isEmpty());
}

QTEST_GUILESS_MAIN(SimInfoTest)

#include "siminfo_test.moc"
