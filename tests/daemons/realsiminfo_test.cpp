// SPDX-License-Identifier: LGPL-2.1-or-later
#include "ofonobus.h"
#include "phone.h"
#include "texts.h"
#include "waiting.h"

#include <corvanemdm/siminfo.h>

#include <ofono/qofonoextmodemmanager.h>
#include <ofono/qofonoextsiminfo.h>
#include <ofono/qofonomanager.h>
#include <ofono/qofonosimmanager.h>

#include <QtDBus/QDBusVariant>
#include <QtTest/QtTest>

#include <memory>

using namespace OfonoBus;
using Corvane::Mdm::SimInfo;

namespace
{

const char firstSlot[]
    = "SimState(/ril_0), imsi: 244051234567890, present: true, voice SIM: true, data SIM: true, "
      "enabled: true, PIN required: false, Network reg: 1, ICCID: 8935805100000012345, "
      "Service provider: Elo Mobile, Subscriber numbers: +358401234567";
const char secondSlot[]
    = "SimState(/ril_1), imsi: 262021234567891, present: true, voice SIM: false, data SIM: "
      "false, enabled: true, PIN required: false, Network reg: 1, ICCID: "
      "8949020000000067891, Service provider: Tarn Telecom, Subscriber numbers: "
      "+4915112345678";

QStringList asTexts(const QList<SimInfo::SimState> &states)
{
    QStringList list;
    for (const SimInfo::SimState &state : states)
        list << QString(state);
    return list;
}

QStringList asTexts(const QList<SimInfo::SlotInfo> &infos)
{
    QStringList list;
    for (const SimInfo::SlotInfo &info : infos)
        list << QString(info);
    return list;
}

} // namespace

/** SimInfo, and the clients that it stands on, against the real oFono with our plug-in. */
class RealSimInfoTest : public QObject
{
    Q_OBJECT

private:
    SimInfo::SimState slot(int number) const { return m_info->simSlotStates().value(number); }
    /** Waits until slot @p number is as @p condition wants it. */
    template <typename Condition> bool waitForSlot(int number, Condition condition)
    {
        return waitUntil([&] { return condition(slot(number)); });
    }
    bool waitForCompleteStates()
    {
        return waitUntil([this] {
            return asTexts(m_info->simSlotStates()) == texts({firstSlot, secondSlot});
        });
    }

    Phone m_phone;
    std::unique_ptr<SimInfo> m_info;

private Q_SLOTS:
    void init();
    void cleanup();
    void clients();
    void states();
    void queries();
    void chosenSims();
    void disabledModem();
    void registration();
    void pulledSim();
    void lockedSim();
    void modemWithoutPower();
    void restartOfTheService();
};

void RealSimInfoTest::init()
{
    m_info = std::make_unique<SimInfo>();
    const bool isComplete = waitForCompleteStates();
    QVERIFY2(isComplete, qPrintable(asTexts(m_info->simSlotStates()).join(QLatin1Char('\n'))));
}

void RealSimInfoTest::cleanup()
{
    // Or the functions that follow would fail over what this one has left.
    if (QTest::currentTestFailed())
        restoreModems(m_phone);
    const bool isRestored = waitForCompleteStates();
    QVERIFY2(isRestored, qPrintable(asTexts(m_info->simSlotStates()).join(QLatin1Char('\n'))));
    m_info.reset();
}

void RealSimInfoTest::clients()
{
    const auto manager = QOfonoManager::instance();
    QVERIFY(waitUntil([&] { return manager->available() && manager->modems().size() == 2; }));
    QStringList modems = manager->modems();
    modems.sort();
    QCOMPARE(modems, texts({"/ril_0", "/ril_1"}));

    QOfonoSimManager sim;
    sim.setModemPath(QStringLiteral("/ril_1"));
    QVERIFY(waitUntil([&] { return sim.isValid(); }));
    QVERIFY(sim.present());
    QCOMPARE(sim.subscriberIdentity(), QStringLiteral("262021234567891"));
    QCOMPARE(sim.subscriberNumbers(), texts({"+4915112345678"}));
    QCOMPARE(sim.pinRequired(), QOfonoSimManager::NoPin);

    const auto modemManager = QOfonoExtModemManager::instance();
    QVERIFY(waitUntil([&] { return modemManager->ready(); }));
    QCOMPARE(modemManager->availableModems(), texts({"/ril_0", "/ril_1"}));
    QCOMPARE(modemManager->enabledModems(), texts({"/ril_0", "/ril_1"}));
    QCOMPARE(modemManager->presentSims(), (QList<bool>{true, true}));
    QCOMPARE(modemManager->defaultVoiceSim(), QStringLiteral("244051234567890"));
    QCOMPARE(modemManager->defaultDataSim(), QStringLiteral("244051234567890"));
}

void RealSimInfoTest::states()
{
    QVERIFY(m_info->available());
    QVERIFY(m_info->hotSwappingSupported());
}

void RealSimInfoTest::queries()
{
    QCOMPARE(asTexts(m_info->imeiCodes()),
             texts({"Slot(0) = (358240051111100)", "Slot(1) = (358240051111101)"}));
    QCOMPARE(asTexts(m_info->subscriberIdentities()),
             texts({"Slot(0) = (244051234567890)", "Slot(1) = (262021234567891)"}));
    QCOMPARE(asTexts(m_info->cardIdentifier()),
             texts({"Slot(0) = (8935805100000012345)", "Slot(1) = (8949020000000067891)"}));
    QCOMPARE(asTexts(m_info->subscriberNumbers()),
             texts({"Slot(0) = (+358401234567)", "Slot(1) = (+4915112345678)"}));
}

void RealSimInfoTest::chosenSims()
{
    call("/", modemManagerInterface, "SetDefaultDataSim", {QStringLiteral("262021234567891")});
    QVERIFY(waitForSlot(1, [](const SimInfo::SimState &state) { return state.dataSim && !state.voiceSim; }));
    QVERIFY(waitForSlot(0, [](const SimInfo::SimState &state) { return state.voiceSim && !state.dataSim; }));
    call("/", modemManagerInterface, "SetDefaultDataSim", {QString()});
}

void RealSimInfoTest::disabledModem()
{
    call("/", modemManagerInterface, "SetEnabledModems", {objectPaths(texts({"/ril_0"}))});
    QVERIFY(waitForSlot(1, [](const SimInfo::SimState &state) {
        return !state.enabled && state.pinRequired == SimInfo::UnknownPinState;
    }));
    call("/", modemManagerInterface, "SetEnabledModems", {objectPaths(texts({"/ril_0", "/ril_1"}))});
}

void RealSimInfoTest::registration()
{
    const std::pair<const char *, SimInfo::NetworkRegistrationStatus> known[] = {
        {"unregistered", SimInfo::NotRegistered}, {"searching", SimInfo::SearchingForRegistration},
        {"denied", SimInfo::RegistrationDenied},  {"roaming", SimInfo::Roaming},
        {"registered", SimInfo::Registered},
    };
    for (const auto &[name, status] : known) {
        m_phone.act(QStringLiteral("network"), texts({"0", name}));
        const auto expected = status;
        QVERIFY2(
            waitForSlot(
                0, [=](const SimInfo::SimState &state) { return state.networkRegistration == expected; }),
            name);
    }
}

void RealSimInfoTest::pulledSim()
{
    m_phone.act(QStringLiteral("sim pull"), texts({"0"}));
    QVERIFY(waitForSlot(
        0, [](const SimInfo::SimState &state) { return !state.present && state.imsi.isEmpty(); }));
    // The other one is used for everything then.
    QVERIFY(waitForSlot(1, [](const SimInfo::SimState &state) { return state.voiceSim && state.dataSim; }));
    QCOMPARE(asTexts(m_info->subscriberIdentities()), texts({"Slot(1) = (262021234567891)"}));
    m_phone.act(QStringLiteral("sim insert"), texts({"0"}));
}

void RealSimInfoTest::lockedSim()
{
    QOfonoSimManager sim;
    sim.setModemPath(QStringLiteral("/ril_1"));
    m_phone.act(QStringLiteral("sim lock"), texts({"1", "pin"}));
    // oFono announces one thing after the other.
    QVERIFY(waitUntil([&] {
        return sim.pinRequired() == QOfonoSimManager::SimPin && sim.present()
            && sim.subscriberIdentity().isEmpty() && sim.subscriberNumbers().isEmpty();
    }));
    // oFono has no registration for a modem whose SIM is locked: nothing is known of the slot.
    QVERIFY(waitForSlot(1, [](const SimInfo::SimState &state) { return !state.present; }));
    QCOMPARE(call("/ril_1", simInterface, "EnterPin", {QStringLiteral("pin"), QStringLiteral("1234")}).type(),
             QDBusMessage::ReplyMessage);
    QVERIFY(waitUntil([&] {
        return sim.pinRequired() == QOfonoSimManager::NoPin && sim.present()
            && sim.subscriberIdentity() == QLatin1String("262021234567891");
    }));
    QVERIFY(waitForCompleteStates());
    // Or it would ask again whenever it gets power.
    m_phone.act(QStringLiteral("sim lock"), texts({"1", "none"}));
    QVERIFY(waitForSlot(1, [](const SimInfo::SimState &state) { return !state.present; }));
}

void RealSimInfoTest::modemWithoutPower()
{
    const auto setPower = [](bool on) {
        return answer("/ril_1", modemInterface, "SetProperty",
                      {QStringLiteral("Powered"), QVariant::fromValue(QDBusVariant(on))});
    };
    QCOMPARE(setPower(false), QString());
    QVERIFY(waitForSlot(
        1, [](const SimInfo::SimState &state) { return state.imsi.isEmpty() && !state.present; }));
    QCOMPARE(asTexts(m_info->cardIdentifier()), texts({"Slot(0) = (8935805100000012345)"}));
    QCOMPARE(setPower(true), QString());
    QCOMPARE(answer("/ril_1", modemInterface, "SetProperty",
                    {QStringLiteral("Online"), QVariant::fromValue(QDBusVariant(true))}),
             QString());
}

void RealSimInfoTest::restartOfTheService()
{
    QStringList availability;
    connect(m_info.get(), &SimInfo::availableChanged, this,
            [&](bool available) { availability << QVariant(available).toString(); });
    m_phone.stopService(QLatin1String(service));
    QVERIFY(waitUntil([this] { return !m_info->available(); }));
    QVERIFY(m_info->subscriberIdentities().isEmpty());
    m_phone.startService(QLatin1String(service));
    QVERIFY(waitForCompleteStates());
    QCOMPARE(availability, texts({"false", "true"}));
}

QTEST_GUILESS_MAIN(RealSimInfoTest)
#include "realsiminfo_test.moc"
