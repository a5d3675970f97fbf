// SPDX-License-Identifier: LGPL-2.1-or-later
#include "telephony/simfilter_p.h"

#include <QtCore/QMetaEnum>
#include <QtCore/QRandomGenerator>
#include <QtDBus/QDBusMetaType>
#include <QtTest/QtTest>

using Corvane::Mdm::SimFilter;
using Corvane::Mdm::SimFilterPrivate;
using Rule = SimFilter::Rule;
using RuleList = SimFilter::RuleList;

namespace
{

template <typename T> QString debugText(const T &value)
{
    QString text;
    QDebug(&text).nospace() << value;
    return text;
}

QString imsi(const char *digits)
{
    return QString::fromUtf8(digits);
}

// The definition of the two comparisons, word for word; the library's are faster.
RuleList addedByDefinition(const RuleList &oldRules, const RuleList &newRules, bool includeHangup)
{
    RuleList added;
    for (const Rule &rule : newRules) {
        if (!oldRules.contains(rule) && (includeHangup || rule.action != SimFilter::Hangup))
            added.append(rule);
    }
    return added;
}

QStringList removedByDefinition(const RuleList &oldRules, const RuleList &newRules)
{
    QStringList removed;
    for (const Rule &oldRule : oldRules) {
        const bool kept = std::any_of(newRules.begin(), newRules.end(),
                                      [&](const Rule &newRule) { return newRule.imsi == oldRule.imsi; });
        if (!kept)
            removed.append(oldRule.imsi);
    }
    return removed;
}

RuleList randomRules(QRandomGenerator *random)
{
    RuleList rules;
    // Few IMSIs, so that lists share rules, change actions and name a SIM twice.
    for (int count = random->bounded(8); count > 0; --count)
        rules.append(Rule(QString::number(random->bounded(5)), SimFilter::Action(1 + random->bounded(3))));
    return rules;
}

} // namespace

class SimFilterTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void actionsHaveTheirValues()
    {
        QCOMPARE(int(SimFilter::Block), 1);
        QCOMPARE(int(SimFilter::Ignore), 1);
        QCOMPARE(int(SimFilter::Allow), 2);
        QCOMPARE(int(SimFilter::Hangup), 3);

        const QMetaEnum actions = QMetaEnum::fromType<SimFilter::Action>();
        QStringList keys;
        for (int index = 0; index < actions.keyCount(); ++index)
            keys.append(QString::fromLatin1(actions.key(index)));
        QCOMPARE(keys,
                 QStringList({QStringLiteral("Block"), QStringLiteral("Ignore"), QStringLiteral("Allow"),
                              QStringLiteral("Hangup")}));
    }

    void imsiIsValid_data()
    {
        QTest::addColumn<QString>("imsi");
        QTest::addColumn<bool>("valid");
        QTest::newRow("null") << QString() << true;
        QTest::newRow("empty") << QStringLiteral("") << true;
        QTest::newRow("one digit") << imsi("0") << true;
        QTest::newRow("15 digits") << imsi("244051234567890") << true;
        QTest::newRow("16 digits") << imsi("2440512345678901") << false;
        QTest::newRow("16 letters") << imsi("abcdefghijklmnop") << false;
        QTest::newRow("letter at the end") << imsi("12a") << false;
        QTest::newRow("letter at the beginning") << imsi("a12") << false;
        QTest::newRow("blank") << imsi("12 4") << false;
        QTest::newRow("sign") << imsi("-12") << false;
        QTest::newRow("just below the digits") << imsi("/") << false;
        QTest::newRow("just above the digits") << imsi(":") << false;
        QTest::newRow("wildcard") << imsi("*") << false;
        QTest::newRow("full-width digits") << QStringLiteral(u"\uff12\uff14\uff14") << true;
        QTest::newRow("Arabic-Indic digits") << QStringLiteral(u"\u0661\u0662") << true;
        QTest::newRow("superscript two, a number but no decimal digit") << QStringLiteral(u"\u00b2") << false;
        QTest::newRow("Roman numeral") << QStringLiteral(u"\u2163") << false;
    }

    void imsiIsValid()
    {
        QFETCH(QString, imsi);
        QFETCH(bool, valid);
        QCOMPARE(SimFilter::isValidImsi(imsi), valid);
    }

    void defaultRuleBlocksNobody()
    {
        const Rule rule;
        QVERIFY(rule.imsi.isNull());
        QCOMPARE(int(rule.action), int(SimFilter::Block));
        QVERIFY(rule == Rule(QString(), SimFilter::Block));
    }

    void rulesCompareByImsiAndAction()
    {
        const Rule rule(imsi("1"), SimFilter::Block);
        QVERIFY(rule == Rule(imsi("1"), SimFilter::Ignore));
        QVERIFY(!(rule != Rule(imsi("1"), SimFilter::Ignore)));
        QVERIFY(rule != Rule(imsi("1"), SimFilter::Allow));
        QVERIFY(rule != Rule(imsi("2"), SimFilter::Block));
        QVERIFY(!(rule == Rule(imsi("2"), SimFilter::Block)));
    }

    void ruleAsString()
    {
        QCOMPARE(QString(Rule(imsi("244"), SimFilter::Allow)), QStringLiteral("Rule (imsi=244, action=2)"));
        QCOMPARE(QString(Rule()), QStringLiteral("Rule (imsi=, action=1)"));
        // An IMSI that looks like a placeholder is not filled in.
        QCOMPARE(QString(Rule(imsi("%2"), SimFilter::Hangup)), QStringLiteral("Rule (imsi=%2, action=3)"));
    }

    void debugForms()
    {
        QCOMPARE(debugText(SimFilter::Block), QStringLiteral("block"));
        QCOMPARE(debugText(SimFilter::Ignore), QStringLiteral("block"));
        QCOMPARE(debugText(SimFilter::Allow), QStringLiteral("allow"));
        QCOMPARE(debugText(SimFilter::Hangup), QStringLiteral("hangup"));
        QCOMPARE(debugText(SimFilter::Action(0)), QString());
        QCOMPARE(debugText(SimFilter::Action(4)), QString());

        const Rule rule(imsi("244"), SimFilter::Hangup);
        const Rule *pointer = &rule;
        QCOMPARE(debugText(pointer), QStringLiteral("Rule (imsi=\"244\", action=hangup)"));
        pointer = nullptr;
        QCOMPARE(debugText(pointer), QStringLiteral("Rule (this = 0x0)"));
    }

    void debugFormLeavesTheStreamAsItWas()
    {
        const Rule rule(imsi("1"), SimFilter::Allow);
        const Rule *const pointer = &rule;
        QString text;
        QDebug(&text) << "a" << pointer << "b";
        QCOMPARE(text, QStringLiteral("a Rule (imsi=\"1\", action=allow) b "));
    }

    void actionFromInt()
    {
        for (uint value = 1; value <= 3; ++value) {
            bool ok = false;
            QCOMPARE(uint(SimFilterPrivate::actionFromInt(value, &ok)), value);
            QVERIFY(ok);
        }
        for (const uint value : {0U, 4U, 7U, 0xffffffffU, 0x80000001U}) {
            bool ok = true;
            QCOMPARE(SimFilterPrivate::actionFromInt(value, &ok), SimFilter::Block);
            QVERIFY(!ok);
        }
        QCOMPARE(SimFilterPrivate::actionFromInt(3, nullptr), SimFilter::Hangup);
        QCOMPARE(SimFilterPrivate::actionFromInt(0, nullptr), SimFilter::Block);
    }

    void actionToInt()
    {
        QCOMPARE(SimFilterPrivate::actionToInt(SimFilter::Block), 1U);
        QCOMPARE(SimFilterPrivate::actionToInt(SimFilter::Ignore), 1U);
        QCOMPARE(SimFilterPrivate::actionToInt(SimFilter::Allow), 2U);
        QCOMPARE(SimFilterPrivate::actionToInt(SimFilter::Hangup), 3U);
        QTest::ignoreMessage(QtWarningMsg, "actionToInt() given invalid action: ");
        QCOMPARE(SimFilterPrivate::actionToInt(SimFilter::Action(0)), 1U);
        QTest::ignoreMessage(QtWarningMsg, "actionToInt() given invalid action: ");
        QCOMPARE(SimFilterPrivate::actionToInt(SimFilter::Action(4)), 1U);
    }

    void wireRules()
    {
        const SimFilterPrivate::RulePrivate empty;
        QVERIFY(empty.imsi.isNull());
        QCOMPARE(empty.action, 0U);

        const SimFilterPrivate::RulePrivate rule(Rule(imsi("244"), SimFilter::Hangup));
        QCOMPARE(rule.imsi, imsi("244"));
        QCOMPARE(rule.action, 3U);
        QCOMPARE(SimFilterPrivate::publicRuleFromPrivate(rule), Rule(imsi("244"), SimFilter::Hangup));
    }

    void wireRuleWithoutAnActionIsNoRule()
    {
        SimFilterPrivate::RulePrivate rule(Rule(imsi("244"), SimFilter::Allow));
        rule.action = 7;
        QTest::ignoreMessage(QtWarningMsg, "Ignoring rule for \"244\" with invalid action: 7");
        QCOMPARE(SimFilterPrivate::publicRuleFromPrivate(rule), Rule());
    }

    void typesAreRegistered()
    {
        // Twice, as two filters do.
        SimFilterPrivate::registerTypes();
        SimFilterPrivate::registerTypes();

        const auto type = [](const char *name) {
            return QMetaType::type(name);
        };
        const int rule = qMetaTypeId<Rule>();
        const int rules = qMetaTypeId<RuleList>();
        const int wireRule = qMetaTypeId<SimFilterPrivate::RulePrivate>();
        const int wireRules = qMetaTypeId<SimFilterPrivate::RulePrivateList>();
        QCOMPARE(type("Corvane::Mdm::SimFilter::Rule"), rule);
        QCOMPARE(type("SimFilter::Rule"), rule);
        QCOMPARE(type("Corvane::Mdm::SimFilter::RuleList"), rules);
        QCOMPARE(type("SimFilter::RuleList"), rules);
        QCOMPARE(type("Corvane::Mdm::SimFilterPrivate::RulePrivate"), wireRule);
        QCOMPARE(type("Corvane::Mdm::SimFilterPrivate::Rule"), wireRule);
        QCOMPARE(type("Corvane::Mdm::SimFilterPrivate::RulePrivateList"), wireRules);
        QCOMPARE(type("Corvane::Mdm::SimFilterPrivate::RuleList"), wireRules);
        QCOMPARE(type("Corvane::Mdm::SimFilter::Action"), qMetaTypeId<SimFilter::Action>());
        QCOMPARE(type("SimFilter::Action"), qMetaTypeId<SimFilter::Action>());

        QCOMPARE(QDBusMetaType::typeToSignature(wireRule), "(su)");
        QCOMPARE(QDBusMetaType::typeToSignature(wireRules), "a(su)");
    }

    void comparingLists_data()
    {
        QTest::addColumn<RuleList>("oldRules");
        QTest::addColumn<RuleList>("newRules");
        QTest::addColumn<RuleList>("added");
        QTest::addColumn<RuleList>("addedWithHangup");
        QTest::addColumn<QStringList>("removed");

        const Rule block1(imsi("1"), SimFilter::Block);
        const Rule allow1(imsi("1"), SimFilter::Allow);
        const Rule block2(imsi("2"), SimFilter::Block);
        const Rule hangup2(imsi("2"), SimFilter::Hangup);
        const Rule block3(imsi("3"), SimFilter::Block);

        QTest::newRow("both empty") << RuleList() << RuleList() << RuleList() << RuleList() << QStringList();
        QTest::newRow("from empty, in order")
            << RuleList() << RuleList({block3, block1, block2}) << RuleList({block3, block1, block2})
            << RuleList({block3, block1, block2}) << QStringList();
        QTest::newRow("to empty, in order") << RuleList({block3, block1, block2}) << RuleList() << RuleList()
                                            << RuleList() << QStringList({imsi("3"), imsi("1"), imsi("2")});
        QTest::newRow("changed action is added, not removed")
            << RuleList({block1}) << RuleList({allow1}) << RuleList({allow1}) << RuleList({allow1})
            << QStringList();
        QTest::newRow("another order is no change of rules")
            << RuleList({block1, block2, block3}) << RuleList({block3, block2, block1}) << RuleList()
            << RuleList() << QStringList();
        QTest::newRow("hangup is left out unless asked for")
            << RuleList({block1}) << RuleList({block1, hangup2}) << RuleList() << RuleList({hangup2})
            << QStringList();
        QTest::newRow("removed hangup counts")
            << RuleList({hangup2}) << RuleList() << RuleList() << RuleList() << QStringList({imsi("2")});
        QTest::newRow("a rule that stands twice is removed twice")
            << RuleList({block1, block1}) << RuleList() << RuleList() << RuleList()
            << QStringList({imsi("1"), imsi("1")});
        QTest::newRow("a rule that is doubled is not new")
            << RuleList({block1}) << RuleList({block1, block1}) << RuleList() << RuleList() << QStringList();
        QTest::newRow("a new rule that stands twice is added twice")
            << RuleList() << RuleList({block1, block1}) << RuleList({block1, block1})
            << RuleList({block1, block1}) << QStringList();
    }

    void comparingLists()
    {
        QFETCH(RuleList, oldRules);
        QFETCH(RuleList, newRules);
        QTEST(SimFilterPrivate::addedRules(oldRules, newRules, false), "added");
        QTEST(SimFilterPrivate::addedRules(oldRules, newRules, true), "addedWithHangup");
        QTEST(SimFilterPrivate::removedImsis(oldRules, newRules), "removed");
    }

    void comparingRandomListsFollowsTheDefinition()
    {
        QRandomGenerator random(20240229);
        for (int round = 0; round < 20000; ++round) {
            const RuleList oldRules = randomRules(&random);
            const RuleList newRules = randomRules(&random);
            QCOMPARE(SimFilterPrivate::addedRules(oldRules, newRules, false),
                     addedByDefinition(oldRules, newRules, false));
            QCOMPARE(SimFilterPrivate::addedRules(oldRules, newRules, true),
                     addedByDefinition(oldRules, newRules, true));
            QCOMPARE(SimFilterPrivate::removedImsis(oldRules, newRules),
                     removedByDefinition(oldRules, newRules));
        }
    }
};

QTEST_GUILESS_MAIN(SimFilterTest)
#include "simfilter_test.moc"
