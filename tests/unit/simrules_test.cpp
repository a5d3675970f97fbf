// SPDX-License-Identifier: LGPL-2.1-or-later
#include <simrules.h>

#include <QtCore/QJsonObject>
#include <QtTest/QtTest>

using namespace Corvane::Agent;
using Corvane::Mdm::SimFilter;

class SimRulesTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void actionsByTraffic();
    void families();
    void rulesAsJson();
    void rulesAsText();
    void findsTheRepeatedRule();
    void everySimIsEachSimWithoutARule();
    void everySimWithoutSims();
    void differenceIgnoresTheOrder();
    void differenceNamesEachStep();
};

namespace
{

const SimFilter::Rule block1(QStringLiteral("1"), SimFilter::Block);
const SimFilter::Rule allow1(QStringLiteral("1"), SimFilter::Allow);
const SimFilter::Rule block2(QStringLiteral("2"), SimFilter::Block);
const SimFilter::Rule allow3(QStringLiteral("3"), SimFilter::Allow);
const SimFilter::Rule blockEvery(QStringLiteral("*"), SimFilter::Block);

} // namespace

void SimRulesTest::actionsByTraffic()
{
    QCOMPARE(actionNames(Traffic::DialledCalls),
             QStringList({QStringLiteral("block"), QStringLiteral("allow")}));
    QCOMPARE(actionNames(Traffic::IncomingCalls),
             QStringList({QStringLiteral("block"), QStringLiteral("allow"), QStringLiteral("hangup")}));
    QVERIFY(!actionNamed(Traffic::DialledCalls, QStringLiteral("hangup")));
    QVERIFY(actionNamed(Traffic::IncomingCalls, QStringLiteral("hangup")) == SimFilter::Hangup);
    QVERIFY(!actionNamed(Traffic::IncomingCalls, QStringLiteral("ignore")));
    for (const Traffic traffic : {Traffic::Texts, Traffic::Data})
        QCOMPARE(actionNames(traffic), actionNames(Traffic::DialledCalls));
}

void SimRulesTest::families()
{
    const RuleFamily calls = RuleFamily::calls();
    QVERIFY(calls.hasDirections());
    QCOMPARE(calls.directionNames(), QStringList({QStringLiteral("dial"), QStringLiteral("incoming")}));
    QCOMPARE(calls.actionNames(), actionNames(Traffic::IncomingCalls));
    for (const RuleFamily &family : {calls, RuleFamily::sms(), RuleFamily::data()}) {
        for (const Traffic traffic : family.traffic)
            QVERIFY(family.trafficNamed(directionName(traffic)) == traffic);
    }
    QVERIFY(!RuleFamily::sms().hasDirections());
    QCOMPARE(RuleFamily::data().actionNames(), actionNames(Traffic::Data));
}

void SimRulesTest::rulesAsJson()
{
    const SimFilter::RuleList rules{block1, {QStringLiteral("2"), SimFilter::Hangup}};
    const QJsonArray json = rulesToJson(rules);
    QCOMPARE(json.at(0).toObject(),
             QJsonObject({{QStringLiteral("imsi"), QStringLiteral("1")},
                          {QStringLiteral("action"), QStringLiteral("block")}}));
    QCOMPARE(rulesFromJson(json), rules);
}

void SimRulesTest::rulesAsText()
{
    QCOMPARE(rulesText({}), QStringLiteral("no rules"));
    QCOMPARE(rulesText({block1, allow3}), QStringLiteral("1=block\n3=allow"));
}

void SimRulesTest::findsTheRepeatedRule()
{
    QCOMPARE(repeatedRule({}), -1);
    QCOMPARE(repeatedRule({block1, block2}), -1);
    QCOMPARE(repeatedRule({block1, block2, allow1}), 2);
    QCOMPARE(repeatedRule({blockEvery, block1, blockEvery}), 2);
}

void SimRulesTest::everySimIsEachSimWithoutARule()
{
    const QStringList sims{QStringLiteral("1"), QStringLiteral("2")};
    QCOMPARE(expandedRules({blockEvery}, sims), SimFilter::RuleList({block1, block2}));
    QCOMPARE(expandedRules({blockEvery, allow1}, sims), SimFilter::RuleList({block2, allow1}));
    QCOMPARE(expandedRules({allow1, blockEvery, allow3}, sims),
             SimFilter::RuleList({allow1, block2, allow3}));
}

void SimRulesTest::everySimWithoutSims()
{
    QCOMPARE(expandedRules({blockEvery, allow3}, {}), SimFilter::RuleList({allow3}));
    QCOMPARE(expandedRules({}, {QStringLiteral("1")}), SimFilter::RuleList());
}

void SimRulesTest::differenceIgnoresTheOrder()
{
    QVERIFY(RuleDifference({block1, block2}, {block2, block1}).isEmpty());
    QVERIFY(RuleDifference({}, {}).isEmpty());
    QCOMPARE(RuleDifference({block1}, {block1}).toString(), QString());
}

void SimRulesTest::differenceNamesEachStep()
{
    const RuleDifference difference({block1, block2}, {allow3, allow1});
    QCOMPARE(difference.added, SimFilter::RuleList({allow3}));
    QCOMPARE(difference.changed, SimFilter::RuleList({allow1}));
    QCOMPARE(difference.removed, SimFilter::RuleList({block2}));
    QVERIFY(!difference.isEmpty());
    QCOMPARE(difference.toString(), QStringLiteral("add 3=allow; change to 1=allow; remove 2"));
}

QTEST_APPLESS_MAIN(SimRulesTest)
#include "simrules_test.moc"
