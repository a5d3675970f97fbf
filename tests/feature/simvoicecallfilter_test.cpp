// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "rulechanneltest.h"
#include "signalsequence.h"
#include "waiting.h"

#include <corvanemdm/simvoicecallfilter.h>

#include <QtTest/QtTest>

using Corvane::Mdm::SimVoiceCallFilter;

namespace
{

const char *const AbsentService = "Corvane::Mdm::SimVoiceCallFilter::SimVoiceCallFilter(QObject*) "
                                  "Unable to connect to voice call filter interface!";

const TestedChannel Dial = testedChannel<SimVoiceCallFilter>(
    {"/mdm/voicecallfilter/dial", "org.corvaneos.ofono.mdm.VoiceCallFilter", "", "dial", "dialRules",
     "defaultDialAction", false, "Invalid Outgoing Call action:", "(dial) GetAll() failed:", AbsentService},
    {&SimVoiceCallFilter::setDefaultDialAction, &SimVoiceCallFilter::setDialRules,
     &SimVoiceCallFilter::setDialRule, &SimVoiceCallFilter::hasDialRuleForImsi,
     &SimVoiceCallFilter::removeDialRule, &SimVoiceCallFilter::clearDialRules,
     &SimVoiceCallFilter::defaultDialAction, &SimVoiceCallFilter::dialRules, &SimVoiceCallFilter::ready});

const TestedChannel Incoming = testedChannel<SimVoiceCallFilter>(
    {"/mdm/voicecallfilter/incoming", "org.corvaneos.ofono.mdm.VoiceCallFilter", "", "incoming",
     "incomingRules", "defaultIncomingAction", true,
     "Invalid Incoming Call action:", "(incoming) GetAll() failed:", AbsentService},
    {&SimVoiceCallFilter::setDefaultIncomingAction, &SimVoiceCallFilter::setIncomingRules,
     &SimVoiceCallFilter::setIncomingRule, &SimVoiceCallFilter::hasIncomingRuleForImsi,
     &SimVoiceCallFilter::removeIncomingRule, &SimVoiceCallFilter::clearIncomingRules,
     &SimVoiceCallFilter::defaultIncomingAction, &SimVoiceCallFilter::incomingRules,
     &SimVoiceCallFilter::ready});

} // namespace

/** What the two directions are to each other; the rest is inherited. */
class SimVoiceCallFilterTest : public RuleChannelTest
{
    Q_OBJECT

public:
    SimVoiceCallFilterTest()
        : RuleChannelTest({Dial, Incoming})
    {
    }

private Q_SLOTS:
    void constructionAsksForBothDirections();
    void becomesReadyOnceWithTheSecondAnswer();
    void isNotReadyWhenOneAnswerFails_data();
    void isNotReadyWhenOneAnswerFails();
    void isNotReadyWhenBothAnswersFail();
    void directionsHaveRulesOfTheirOwn();
    void defaultIncomingActionByItsName();
};

void SimVoiceCallFilterTest::constructionAsksForBothDirections()
{
    SimVoiceCallFilter filter;
    QVERIFY(!filter.ready());
    QCOMPARE(filter.defaultDialAction(), SimFilter::Block);
    QCOMPARE(filter.defaultIncomingAction(), SimFilter::Block);
    QCOMPARE(filter.dialRules(), RuleList());
    QCOMPARE(filter.incomingRules(), RuleList());
    QVERIFY(waitUntil([&] { return filter.ready(); }));
    QCOMPARE(phone().takeJournal(Service),
             texts({"/mdm/voicecallfilter/dial GetAll ()", "/mdm/voicecallfilter/incoming GetAll ()"}));
}

void SimVoiceCallFilterTest::becomesReadyOnceWithTheSecondAnswer()
{
    setServiceRules(Dial, {rule("1", SimFilter::Allow)}, SimFilter::Allow);
    setServiceRules(Incoming, {rule("2", SimFilter::Hangup)}, SimFilter::Hangup);
    phone().delayCalls(Service, Dial.path(), QStringLiteral("GetAll"), 30);
    SimVoiceCallFilter filter;
    SignalSequence seen(&filter);
    QVERIFY(waitUntil([&] { return filter.ready(); }));
    QCOMPARE(seen.take(),
             texts({"defaultIncomingActionChanged()", "incomingRulesChanged([], [2:hangup])",
                    "incomingRuleAdded(2:hangup)", "defaultDialActionChanged()",
                    "dialRulesChanged([], [1:allow])", "dialRuleAdded(1:allow)", "readyChanged()"}));
    QCOMPARE(filter.dialRules(), RuleList({rule("1", SimFilter::Allow)}));
    QCOMPARE(filter.defaultDialAction(), SimFilter::Allow);
    QCOMPARE(filter.incomingRules(), RuleList({rule("2", SimFilter::Hangup)}));
    QCOMPARE(filter.defaultIncomingAction(), SimFilter::Hangup);

    // What comes later changes the lists, never the readiness.
    emitFrom(Dial, "@RulesChanged", {wire(QList<WireRule>())});
    QCOMPARE(seen.take(), texts({"dialRulesChanged([1:allow], [])", "dialRuleRemoved(1)"}));
    QVERIFY(filter.ready());
}

void SimVoiceCallFilterTest::isNotReadyWhenOneAnswerFails_data()
{
    QTest::addColumn<TestedChannel>("failing");
    QTest::addColumn<QStringList>("warnings");
    QTest::addColumn<QStringList>("seen");
    QTest::newRow("incoming")
        << Incoming << texts({"(incoming) GetAll() failed: \"com.example.Broken\" \"Out of order\""})
        << texts({"defaultDialActionChanged()", "dialRulesChanged([], [1:allow])", "dialRuleAdded(1:allow)"});
    QTest::newRow("dial") << Dial
                          << texts({"(dial) GetAll() failed: \"com.example.Broken\" \"Out of order\""})
                          << texts({"defaultIncomingActionChanged()", "incomingRulesChanged([], [1:allow])",
                                    "incomingRuleAdded(1:allow)"});
}

void SimVoiceCallFilterTest::isNotReadyWhenOneAnswerFails()
{
    QFETCH(TestedChannel, failing);
    setServiceRules(Dial, {rule("1", SimFilter::Allow)}, SimFilter::Allow);
    setServiceRules(Incoming, {rule("1", SimFilter::Allow)}, SimFilter::Allow);
    phone().failCalls(Service, failing.path(), QStringLiteral("GetAll"), QStringLiteral("com.example.Broken"),
                      QStringLiteral("Out of order"));
    phone().takeJournal(Service);
    MessageLog log;
    SimVoiceCallFilter filter;
    SignalSequence seen(&filter);
    phone().settle(Service);
    QTEST(log.takeWarnings(), "warnings");
    QTEST(seen.take(), "seen");
    QVERIFY(!filter.ready());

    // There is no second attempt, and later announcements of the service make it no readier.
    emitFrom(failing, "Default@ActionChanged", {2U});
    QCOMPARE(seen.take().size(), 1);
    QVERIFY(!filter.ready());
    QCOMPARE(phone().takeJournal(Service).size(), 2);
}

void SimVoiceCallFilterTest::isNotReadyWhenBothAnswersFail()
{
    phone().failCalls(Service, QString(), QStringLiteral("GetAll"), QStringLiteral("com.example.Broken"),
                      QString());
    MessageLog log;
    SimVoiceCallFilter filter;
    SignalSequence seen(&filter);
    phone().settle(Service);
    // Which of the two answers is taken up first is open.
    QStringList warnings = log.takeWarnings();
    warnings.sort();
    QCOMPARE(warnings,
             texts({"(dial) GetAll() failed: \"com.example.Broken\" \"\"",
                    "(incoming) GetAll() failed: \"com.example.Broken\" \"\""}));
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(!filter.ready());
}

void SimVoiceCallFilterTest::directionsHaveRulesOfTheirOwn()
{
    setServiceRules(Dial, {rule("111", SimFilter::Allow)}, SimFilter::Block);
    setServiceRules(Incoming, {rule("123", SimFilter::Block)}, SimFilter::Allow);
    SimVoiceCallFilter filter;
    QVERIFY(waitUntil([&] { return filter.ready(); }));
    phone().takeJournal(Service);
    QVERIFY(!filter.removeDialRule(QStringLiteral("123")));
    QVERIFY(!filter.removeIncomingRule(QStringLiteral("111")));
    QVERIFY(!filter.hasDialRuleForImsi(QStringLiteral("123")));
    QVERIFY(!filter.hasIncomingRuleForImsi(QStringLiteral("111")));
    phone().settle(Service);
    QCOMPARE(phone().takeJournal(Service), QStringList());

    SignalSequence seen(&filter);
    QVERIFY(filter.setDialRule(rule("123", SimFilter::Block)));
    QVERIFY(filter.setDefaultDialAction(SimFilter::Allow));
    QVERIFY(filter.clearIncomingRules());
    QVERIFY(seen.waitFor(6));
    phone().settle(Service);
    QCOMPARE(phone().takeJournal(Service),
             texts({"/mdm/voicecallfilter/dial AddRule ('123', uint32 1)",
                    "/mdm/voicecallfilter/dial SetDefaultAction (uint32 2,)",
                    "/mdm/voicecallfilter/incoming ClearRules ()"}));
    QCOMPARE(seen.take(),
             texts({"dialRulesChanged([111:allow], [111:allow 123:block])", "dialRuleAdded(123:block)",
                    "dialRuleAdded(123:block)", "defaultDialActionChanged()",
                    "incomingRulesChanged([123:block], [])", "incomingRuleRemoved(123)"}));
}

void SimVoiceCallFilterTest::defaultIncomingActionByItsName()
{
    SimVoiceCallFilter filter;
    QVERIFY(waitUntil([&] { return filter.ready(); }));
    QVERIFY(filter.setProperty("defaultIncomingAction", QStringLiteral("Hangup")));
    QVERIFY(waitUntil([&] { return filter.defaultIncomingAction() == SimFilter::Hangup; }));
}

QTEST_GUILESS_MAIN(SimVoiceCallFilterTest)
#include "simvoicecallfilter_test.moc"
