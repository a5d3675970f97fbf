// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/siminfo.h>

#include <QtTest/QtTest>

#include <functional>

using Corvane::Mdm::SimInfo;

namespace
{

SimInfo::SimState fullState()
{
    SimInfo::SimState state;
    state.modemPath = QStringLiteral("/ril_0");
    state.present = true;
    state.voiceSim = true;
    state.enabled = true;
    state.pinRequired = SimInfo::PinNotRequired;
    state.networkRegistration = SimInfo::Roaming;
    state.imsi = QStringLiteral("244051234567890");
    state.cardIdentifier = QStringLiteral("8935805100000012345");
    state.serviceProviderName = QStringLiteral("Elo");
    state.subscriberNumbers = QStringList({QStringLiteral("+1"), QStringLiteral("+2")});
    return state;
}

template <typename T> QString debugText(const T &value)
{
    QString text;
    QDebug(&text).nospace() << value;
    return text;
}

} // namespace

using Change = std::function<void(SimInfo::SimState &)>;
Q_DECLARE_METATYPE(Change)

class SimInfoValuesTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void defaults();
    void equality_data();
    void equality();
    void order();
    void stateText();
    void stateTextOfPins_data();
    void stateTextOfPins();
    void stateTextKeepsWhatLooksLikeAPlace();
    void pinText();
    void registrationText();
    void slotText();
    void enumValues();
};

void SimInfoValuesTest::defaults()
{
    const SimInfo::SimState state;
    QCOMPARE(QString(state),
             QStringLiteral("SimState(), imsi: , present: false, voice SIM: false, data SIM: false, enabled: "
                            "false, PIN required: unknown, Network reg: -1, ICCID: , Service provider: , "
                            "Subscriber numbers: "));
    QVERIFY(state == SimInfo::SimState());
    QCOMPARE(SimInfo::SlotInfo().slot, 0);
    QCOMPARE(SimInfo::SlotInfo().value, QString());
}

void SimInfoValuesTest::equality_data()
{
    QTest::addColumn<Change>("change");
    QTest::addColumn<bool>("equal");
    const auto row = [](const char *name, bool equal, const Change &change) {
        QTest::newRow(name) << change << equal;
    };
    row("nothing", true, [](SimInfo::SimState &) {});
    row("path", false, [](SimInfo::SimState &state) { state.modemPath += QLatin1Char('1'); });
    row("present", false, [](SimInfo::SimState &state) { state.present = false; });
    row("voice", false, [](SimInfo::SimState &state) { state.voiceSim = false; });
    row("data", false, [](SimInfo::SimState &state) { state.dataSim = true; });
    row("enabled", false, [](SimInfo::SimState &state) { state.enabled = false; });
    row("PIN", false, [](SimInfo::SimState &state) { state.pinRequired = SimInfo::SimPukRequired; });
    row("registration", false,
        [](SimInfo::SimState &state) { state.networkRegistration = SimInfo::NotRegistered; });
    row("IMSI", false, [](SimInfo::SimState &state) { state.imsi.clear(); });
    row("ICCID", true, [](SimInfo::SimState &state) { state.cardIdentifier.clear(); });
    row("provider", true, [](SimInfo::SimState &state) { state.serviceProviderName.clear(); });
    row("numbers", true, [](SimInfo::SimState &state) { state.subscriberNumbers.clear(); });
}

void SimInfoValuesTest::equality()
{
    QFETCH(Change, change);
    QFETCH(bool, equal);
    SimInfo::SimState other = fullState();
    change(other);
    QCOMPARE(fullState() == other, equal);
    QCOMPARE(other == fullState(), equal);
    QCOMPARE(fullState() != other, !equal);
}

void SimInfoValuesTest::order()
{
    SimInfo::SimState first = fullState();
    SimInfo::SimState second;
    second.modemPath = QStringLiteral("/ril_1");
    QVERIFY(first < second && !(second < first));
    QVERIFY(second > first && !(first > second));
    QVERIFY(first <= second && !(second <= first));
    QVERIFY(second >= first && !(first >= second));

    // The path alone orders; and as a string, so that 10 comes before 2.
    second.modemPath = first.modemPath;
    QVERIFY(!(first < second) && !(first > second) && first <= second && first >= second);
    first.modemPath = QStringLiteral("/ril_10");
    second.modemPath = QStringLiteral("/ril_2");
    QVERIFY(first < second);
}

void SimInfoValuesTest::stateText()
{
    QCOMPARE(QString(fullState()),
             QStringLiteral("SimState(/ril_0), imsi: 244051234567890, present: true, voice SIM: true, data "
                            "SIM: false, enabled: true, PIN required: false, Network reg: 4, ICCID: "
                            "8935805100000012345, Service provider: Elo, Subscriber numbers: +1, +2"));
}

void SimInfoValuesTest::stateTextOfPins_data()
{
    QTest::addColumn<int>("pin");
    QTest::addColumn<QString>("text");
    QTest::newRow("unknown") << -1 << "PIN required: unknown,";
    QTest::newRow("none") << 0 << "PIN required: false,";
    QTest::newRow("PIN") << 1 << "PIN required: true,";
    QTest::newRow("PUK") << 2 << "PIN required: true,";
}

void SimInfoValuesTest::stateTextOfPins()
{
    QFETCH(int, pin);
    QFETCH(QString, text);
    SimInfo::SimState state;
    state.pinRequired = SimInfo::PinRequired(pin);
    QVERIFY(QString(state).contains(text));
}

void SimInfoValuesTest::stateTextKeepsWhatLooksLikeAPlace()
{
    SimInfo::SimState state = fullState();
    state.modemPath = QStringLiteral("%2%9");
    state.cardIdentifier = QStringLiteral("%3");
    state.serviceProviderName = QStringLiteral("100%1");
    const QString text(state);
    QVERIFY(text.startsWith(QLatin1String("SimState(%2%9), imsi: 244051234567890,")));
    QVERIFY(text.endsWith(QLatin1String("ICCID: %3, Service provider: 100%1, Subscriber numbers: +1, +2")));
}

void SimInfoValuesTest::pinText()
{
    QCOMPARE(debugText(SimInfo::UnknownPinState), QStringLiteral("unknown"));
    QCOMPARE(debugText(SimInfo::PinNotRequired), QStringLiteral("not required"));
    QCOMPARE(debugText(SimInfo::SimPinRequired), QStringLiteral("PIN required"));
    QCOMPARE(debugText(SimInfo::SimPukRequired), QStringLiteral("PUK required"));
    QCOMPARE(debugText(SimInfo::PinRequired(7)), QString());
}

void SimInfoValuesTest::registrationText()
{
    const char *const words[] = {"unknown", "unregistered", "registered", "searching", "denied", "roaming"};
    for (int value = -1; value <= 4; ++value)
        QCOMPARE(debugText(SimInfo::NetworkRegistrationStatus(value)), QString::fromLatin1(words[value + 1]));
    QCOMPARE(debugText(SimInfo::NetworkRegistrationStatus(7)), QString());
}

void SimInfoValuesTest::slotText()
{
    const SimInfo::SlotInfo info(3, QStringLiteral("%1"));
    QCOMPARE(QString(info), QStringLiteral("Slot(3) = (%1)"));
    QCOMPARE(debugText(&info), QStringLiteral("SlotInfo(3) = \"%1\""));
    const SimInfo::SlotInfo *none = nullptr;
    QCOMPARE(debugText(none), QStringLiteral("SlotInfo (this = 0x0)"));
}

void SimInfoValuesTest::enumValues()
{
    QCOMPARE(int(SimInfo::UnknownPinState), -1);
    QCOMPARE(int(SimInfo::PinNotRequired), 0);
    QCOMPARE(int(SimInfo::SimPinRequired), 1);
    QCOMPARE(int(SimInfo::SimPukRequired), 2);
    QCOMPARE(int(SimInfo::UnknownRegistrationStatus), -1);
    QCOMPARE(int(SimInfo::NotRegistered), 0);
    QCOMPARE(int(SimInfo::Registered), 1);
    QCOMPARE(int(SimInfo::SearchingForRegistration), 2);
    QCOMPARE(int(SimInfo::RegistrationDenied), 3);
    QCOMPARE(int(SimInfo::Roaming), 4);
}

QTEST_APPLESS_MAIN(SimInfoValuesTest)

#include "siminfovalues_test.moc"
