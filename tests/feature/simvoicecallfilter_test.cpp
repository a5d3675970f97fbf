// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"
#include "waiting.h"

#include <corvanemdm/simvoicecallfilter.h>

#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusMetaType>
#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::SimFilter;
using Corvane::Mdm::SimVoiceCallFilter;
using Rule = SimFilter::Rule;
using RuleList = SimFilter::RuleList;

/** A rule as the service sends it: any number may stand for the action. */
struct WireRule {
    QString imsi;
    quint32 action = 0;
};
Q_DECLARE_METATYPE(WireRule)

QDBusArgument &operator<<(QDBusArgument &out, const WireRule &rule)
{
    out.beginStructure();
    out << rule.imsi << rule.action;
    out.endStructure();
    return out;
}

const QDBusArgument &operator>>(const QDBusArgument &in, WireRule &rule)
{
    in.beginStructure();
    in >> rule.imsi >> rule.action;
    in.endStructure();
    return in;
}

namespace
{

const QString Service = QStringLiteral("org.ofono");
const QString Interface = QStringLiteral("org.corvaneos.ofono.mdm.VoiceCallFilter");
const QString DialPath = QStringLiteral("/mdm/voicecallfilter/dial");
const QString IncomingPath = QStringLiteral("/mdm/voicecallfilter/incoming");

QVariant wire(const char *imsi, quint32 action)
{
    return QVariant::fromValue(WireRule{QString::fromUtf8(imsi), action});
}

QVariant wire(const QList<WireRule> &rules)
{
    return QVariant::fromValue(rules);
}

WireRule wireRule(const char *imsi, quint32 action)
{
    return {QString::fromUtf8(imsi), action};
}

Rule rule(const char *imsi, SimFilter::Action action)
{
    return Rule(QString::fromUtf8(imsi), action);
}

QStringList texts(std::initializer_list<const char *> list)
{
    QStringList result;
    for (const char *text : list)
        result.append(QString::fromUtf8(text));
    return result;
}

/** The names of one direction, so that each test runs on both. */
struct Direction {
    QString path;
    QString prefix; // of the signals
    const char *rulesProperty;
    const char *defaultProperty;
    bool hangup;

    // "added 1:block" becomes "dialRuleAdded(1:block)", and so on.
    QStringList sequence(std::initializer_list<const char *> list) const
    {
        QStringList result;
        for (const char *item : list) {
            const QString text = QString::fromLatin1(item);
            const QString argument = text.section(QLatin1Char(' '), 1);
            const QString event = text.section(QLatin1Char(' '), 0, 0);
            if (event == QLatin1String("added"))
                result.append(prefix + QStringLiteral("RuleAdded(%1)").arg(argument));
            else if (event == QLatin1String("removed"))
                result.append(prefix + QStringLiteral("RuleRemoved(%1)").arg(argument));
            else if (event == QLatin1String("changed"))
                result.append(prefix + QStringLiteral("RulesChanged(%1)").arg(argument));
            else if (event == QLatin1String("default"))
                result.append(QString::fromLatin1(defaultProperty) + QStringLiteral("Changed()"));
            else
                result.append(text);
        }
        return result;
    }
};

const Direction Dial = {DialPath, QStringLiteral("dial"), "dialRules", "defaultDialAction", false};
const Direction Incoming
    = {IncomingPath, QStringLiteral("incoming"), "incomingRules", "defaultIncomingAction", true};

} // namespace

Q_DECLARE_METATYPE(Direction)

class SimVoiceCallFilterTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void init();
    void cleanup();

    void constructionAsksForBothDirections();
    void becomesReadyOnceWithTheSecondAnswer();
    void stateIsNewWhenItIsAnnounced();
    void defaultActionIsAnnouncedBeforeTheRules();
    void isNotReadyWhenOneAnswerFails_data();
    void isNotReadyWhenOneAnswerFails();
    void isNotReadyWhenBothAnswersFail();
    void answersOfAnotherTypeAreFailures();

    void ruleAdded_data() { directions(); }
    void ruleAdded();
    void hangupRuleAdded_data() { directions(); }
    void hangupRuleAdded();
    void ruleAddedWithoutImsiOrAction_data() { directions(); }
    void ruleAddedWithoutImsiOrAction();
    void ruleAddedTwice_data() { directions(); }
    void ruleAddedTwice();
    void ruleChanged_data() { directions(); }
    void ruleChanged();
    void ruleRemoved_data() { directions(); }
    void ruleRemoved();
    void rulesChanged_data() { directions(); }
    void rulesChanged();
    void rulesChangedDropsInvalidActions_data() { directions(); }
    void rulesChangedDropsInvalidActions();
    void defaultActionChanged_data() { directions(); }
    void defaultActionChanged();
    void signalsOfAnotherShapeAreNotTaken();

    void requestsForOutgoingCalls();
    void requestsForIncomingCalls();
    void refusedRequestsSendNothing();
    void requestWithAnInvalidDefaultAction();
    void requestsChangeNothingUntilTheServiceSaysSo();
    void ruleWithAnotherActionIsSent();
    void requestsReachTheService();
    void failedRequestIsLogged();

    void serviceThatIsNotThere();
    void serviceThatGoesAndComesBack();
    void twoFiltersSideBySide();
    void destructionWithCallsPending();
    void deletionInASlot_data();
    void deletionInASlot();
    void propertiesThroughTheMetaObject();
    void signalsReachQueuedAndNamedConnections();

private:
    void directions();
    void setServiceRules(const QString &path, const RuleList &rules, SimFilter::Action defaultAction);
    std::unique_ptr<SimVoiceCallFilter> readyFilter();
    void emitFrom(const QString &path, const char *member, const QVariantList &arguments);
    QVariantList getAllAnswer(quint32 defaultAction, const QList<WireRule> &rules) const;

    std::unique_ptr<Phone> m_phone;
};

void SimVoiceCallFilterTest::initTestCase()
{
    qDBusRegisterMetaType<WireRule>();
    qDBusRegisterMetaType<QList<WireRule>>();
}

void SimVoiceCallFilterTest::init()
{
    m_phone = std::make_unique<Phone>();
    setServiceRules(DialPath, {}, SimFilter::Block);
    setServiceRules(IncomingPath, {}, SimFilter::Block);
    m_phone->takeJournal(Service);
}

void SimVoiceCallFilterTest::cleanup()
{
    m_phone->clearFaults();
    m_phone->startService(Service);
}

void SimVoiceCallFilterTest::directions()
{
    QTest::addColumn<Direction>("direction");
    QTest::newRow("dial") << Dial;
    QTest::newRow("incoming") << Incoming;
}

void SimVoiceCallFilterTest::setServiceRules(const QString &path, const RuleList &rules,
                                             SimFilter::Action defaultAction)
{
    QList<WireRule> list;
    for (const Rule &item : rules)
        list.append({item.imsi, quint32(item.action)});
    const auto call = [&](const char *method, const QVariant &argument) {
        QDBusMessage message
            = QDBusMessage::createMethodCall(Service, path, Interface, QString::fromLatin1(method));
        message.setArguments({argument});
        const QDBusMessage reply = QDBusConnection::systemBus().call(message);
        QVERIFY2(reply.type() == QDBusMessage::ReplyMessage, qPrintable(reply.errorMessage()));
    };
    call("SetRules", wire(list));
    call("SetDefaultAction", quint32(defaultAction));
}

std::unique_ptr<SimVoiceCallFilter> SimVoiceCallFilterTest::readyFilter()
{
    auto filter = std::make_unique<SimVoiceCallFilter>();
    if (!waitUntil([&] { return filter->ready(); }))
        qFatal("the filter did not become ready");
    m_phone->takeJournal(Service);
    return filter;
}

void SimVoiceCallFilterTest::emitFrom(const QString &path, const char *member, const QVariantList &arguments)
{
    m_phone->emitSignal(Service, path, Interface, QLatin1String(member), arguments);
}

QVariantList SimVoiceCallFilterTest::getAllAnswer(quint32 defaultAction, const QList<WireRule> &rules) const
{
    return {quint32(99), defaultAction, wire(rules)};
}

void SimVoiceCallFilterTest::constructionAsksForBothDirections()
{
    SimVoiceCallFilter filter;
    QVERIFY(!filter.ready());
    QCOMPARE(filter.defaultDialAction(), SimFilter::Block);
    QCOMPARE(filter.defaultIncomingAction(), SimFilter::Block);
    QCOMPARE(filter.dialRules(), RuleList());
    QCOMPARE(filter.incomingRules(), RuleList());
    QVERIFY(waitUntil([&] { return filter.ready(); }));
    QCOMPARE(m_phone->takeJournal(Service),
             texts({"/mdm/voicecallfilter/dial GetAll ()", "/mdm/voicecallfilter/incoming GetAll ()"}));
}

void SimVoiceCallFilterTest::becomesReadyOnceWithTheSecondAnswer()
{
    setServiceRules(DialPath, {rule("1", SimFilter::Allow)}, SimFilter::Allow);
    setServiceRules(IncomingPath, {rule("2", SimFilter::Hangup)}, SimFilter::Hangup);
    m_phone->delayCalls(Service, DialPath, QStringLiteral("GetAll"), 30);
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
    emitFrom(DialPath, "RulesChanged", {wire(QList<WireRule>())});
    QCOMPARE(seen.take(), texts({"dialRulesChanged([1:allow], [])", "dialRuleRemoved(1)"}));
    QVERIFY(filter.ready());
}

void SimVoiceCallFilterTest::stateIsNewWhenItIsAnnounced()
{
    setServiceRules(DialPath, {rule("1", SimFilter::Allow)}, SimFilter::Allow);
    SimVoiceCallFilter filter;
    bool readyAtSignal = false;
    SimFilter::Action defaultAtSignal = SimFilter::Block;
    RuleList rulesAtSignal;
    connect(&filter, &SimVoiceCallFilter::readyChanged, this, [&] { readyAtSignal = filter.ready(); });
    connect(&filter, &SimVoiceCallFilter::defaultDialActionChanged, this,
            [&] { defaultAtSignal = filter.defaultDialAction(); });
    connect(&filter, &SimVoiceCallFilter::dialRulesChanged, this,
            [&] { rulesAtSignal = filter.dialRules(); });
    QVERIFY(waitUntil([&] { return filter.ready(); }));
    QVERIFY(readyAtSignal);
    QCOMPARE(defaultAtSignal, SimFilter::Allow);
    QCOMPARE(rulesAtSignal, RuleList({rule("1", SimFilter::Allow)}));
}

void SimVoiceCallFilterTest::defaultActionIsAnnouncedBeforeTheRules()
{
    // Of an invalid default action and an invalid rule only the valid rest is taken; the channel is ready all
    // the same.
    m_phone->answerCalls(
        Service, DialPath, QStringLiteral("GetAll"),
        getAllAnswer(9, {wireRule("1", 2), wireRule("2", 7), wireRule("", 1), wireRule("3", 3)}));
    m_phone->answerCalls(Service, IncomingPath, QStringLiteral("GetAll"),
                         getAllAnswer(2, {wireRule("4", 3), wireRule("5", 0)}));
    MessageLog log;
    SimVoiceCallFilter filter;
    SignalSequence seen(&filter);
    QVERIFY(waitUntil([&] { return filter.ready(); }));
    QCOMPARE(seen.take(),
             texts({"dialRulesChanged([], [1:allow 3:hangup])", "dialRuleAdded(1:allow)",
                    "defaultIncomingActionChanged()", "incomingRulesChanged([], [4:hangup])",
                    "incomingRuleAdded(4:hangup)", "readyChanged()"}));
    QCOMPARE(log.takeWarnings(),
             texts({"Invalid Outgoing Call action: 9", "Ignoring rule for \"2\" with invalid action: 7",
                    "Ignoring rule for \"5\" with invalid action: 0"}));
    QCOMPARE(filter.defaultDialAction(), SimFilter::Block);
}

void SimVoiceCallFilterTest::isNotReadyWhenOneAnswerFails_data()
{
    QTest::addColumn<QString>("failing");
    QTest::addColumn<QStringList>("warnings");
    QTest::addColumn<QStringList>("seen");
    QTest::newRow("incoming")
        << IncomingPath << texts({"(incoming) GetAll() failed: \"com.example.Broken\" \"Out of order\""})
        << texts({"defaultDialActionChanged()", "dialRulesChanged([], [1:allow])", "dialRuleAdded(1:allow)"});
    QTest::newRow("dial") << DialPath
                          << texts({"(dial) GetAll() failed: \"com.example.Broken\" \"Out of order\""})
                          << texts({"defaultIncomingActionChanged()", "incomingRulesChanged([], [1:allow])",
                                    "incomingRuleAdded(1:allow)"});
}

void SimVoiceCallFilterTest::isNotReadyWhenOneAnswerFails()
{
    QFETCH(QString, failing);
    setServiceRules(DialPath, {rule("1", SimFilter::Allow)}, SimFilter::Allow);
    setServiceRules(IncomingPath, {rule("1", SimFilter::Allow)}, SimFilter::Allow);
    m_phone->failCalls(Service, failing, QStringLiteral("GetAll"), QStringLiteral("com.example.Broken"),
                       QStringLiteral("Out of order"));
    m_phone->takeJournal(Service);
    MessageLog log;
    SimVoiceCallFilter filter;
    SignalSequence seen(&filter);
    m_phone->settle(Service);
    QTEST(log.takeWarnings(), "warnings");
    QTEST(seen.take(), "seen");
    QVERIFY(!filter.ready());

    // There is no second attempt, and later announcements of the service make it no readier.
    emitFrom(failing, "DefaultActionChanged", {2U});
    QCOMPARE(seen.take().size(), 1);
    QVERIFY(!filter.ready());
    QCOMPARE(m_phone->takeJournal(Service).size(), 2);
}

void SimVoiceCallFilterTest::isNotReadyWhenBothAnswersFail()
{
    m_phone->failCalls(Service, QString(), QStringLiteral("GetAll"), QStringLiteral("com.example.Broken"),
                       QString());
    MessageLog log;
    SimVoiceCallFilter filter;
    SignalSequence seen(&filter);
    m_phone->settle(Service);
    QCOMPARE(log.takeWarnings(),
             texts({"(dial) GetAll() failed: \"com.example.Broken\" \"\"",
                    "(incoming) GetAll() failed: \"com.example.Broken\" \"\""}));
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(!filter.ready());
}

void SimVoiceCallFilterTest::answersOfAnotherTypeAreFailures()
{
    m_phone->answerCalls(Service, DialPath, QStringLiteral("GetAll"), {QStringLiteral("all"), 1U, 2U});
    m_phone->answerCalls(Service, IncomingPath, QStringLiteral("GetAll"), {});
    MessageLog log;
    SimVoiceCallFilter filter;
    SignalSequence seen(&filter);
    m_phone->settle(Service);
    const QStringList warnings = log.takeWarnings();
    QCOMPARE(warnings.size(), 2);
    QVERIFY2(warnings.first().startsWith(QLatin1String("(dial) GetAll() failed: \"")),
             qPrintable(warnings.first()));
    QVERIFY2(warnings.last().startsWith(QLatin1String("(incoming) GetAll() failed: \"")),
             qPrintable(warnings.last()));
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(!filter.ready());
}

void SimVoiceCallFilterTest::ruleAdded()
{
    QFETCH(Direction, direction);
    const auto filter = readyFilter();
    SignalSequence seen(filter.get());
    // At the end, at the beginning, far behind the end, and where a signed number would be negative.
    emitFrom(direction.path, "RuleAdded", {0U, wire("1", 1)});
    QCOMPARE(seen.take(), direction.sequence({"changed [], [1:block]", "added 1:block", "added 1:block"}));
    emitFrom(direction.path, "RuleAdded", {0U, wire("2", 2)});
    QCOMPARE(seen.take(),
             direction.sequence({"changed [1:block], [2:allow 1:block]", "added 2:allow", "added 2:allow"}));
    emitFrom(direction.path, "RuleAdded", {17U, wire("3", 2)});
    QCOMPARE(seen.take(),
             direction.sequence(
                 {"changed [2:allow 1:block], [2:allow 1:block 3:allow]", "added 3:allow", "added 3:allow"}));
    emitFrom(direction.path, "RuleAdded", {0xffffffffU, wire("4", 1)});
    QCOMPARE(seen.take(),
             direction.sequence({"changed [2:allow 1:block 3:allow], [2:allow 1:block 3:allow 4:block]",
                                 "added 4:block", "added 4:block"}));
}

void SimVoiceCallFilterTest::hangupRuleAdded()
{
    QFETCH(Direction, direction);
    const auto filter = readyFilter();
    SignalSequence seen(filter.get());
    emitFrom(direction.path, "RuleAdded", {0U, wire("1", 3)});
    QCOMPARE(seen.take(),
             direction.hangup
                 ? direction.sequence({"changed [], [1:hangup]", "added 1:hangup", "added 1:hangup"})
                 : direction.sequence({"changed [], [1:hangup]", "added 1:hangup"}));
    QCOMPARE(filter->property(direction.rulesProperty).value<RuleList>(),
             RuleList({rule("1", SimFilter::Hangup)}));
}

void SimVoiceCallFilterTest::ruleAddedWithoutImsiOrAction()
{
    QFETCH(Direction, direction);
    const auto filter = readyFilter();
    SignalSequence seen(filter.get());
    MessageLog log;
    emitFrom(direction.path, "RuleAdded", {0U, wire("", 1)});
    QCOMPARE(log.takeWarnings(), QStringList());
    emitFrom(direction.path, "RuleAdded", {0U, wire("1", 0)});
    emitFrom(direction.path, "RuleAdded", {0U, wire("2", 4)});
    QCOMPARE(log.takeWarnings(),
             texts({"Ignoring rule for \"1\" with invalid action: 0",
                    "Ignoring rule for \"2\" with invalid action: 4"}));
    QCOMPARE(seen.take(), QStringList());
}

void SimVoiceCallFilterTest::ruleAddedTwice()
{
    QFETCH(Direction, direction);
    const auto filter = readyFilter();
    emitFrom(direction.path, "RuleAdded", {0U, wire("1", 1)});
    SignalSequence seen(filter.get());
    // A second rule that equals the first is new in the list, but not among the rules that the change added.
    emitFrom(direction.path, "RuleAdded", {1U, wire("1", 1)});
    QCOMPARE(seen.take(), direction.sequence({"changed [1:block], [1:block 1:block]", "added 1:block"}));
    // One with another action is.
    emitFrom(direction.path, "RuleAdded", {0U, wire("1", 2)});
    QCOMPARE(seen.take(),
             direction.sequence(
                 {"changed [1:block 1:block], [1:allow 1:block 1:block]", "added 1:allow", "added 1:allow"}));
    // The IMSI is still there after one of its rules has gone.
    emitFrom(direction.path, "RuleRemoved", {0U});
    QCOMPARE(seen.take(),
             direction.sequence({"changed [1:allow 1:block 1:block], [1:block 1:block]", "removed 1"}));
}

void SimVoiceCallFilterTest::ruleChanged()
{
    QFETCH(Direction, direction);
    const auto filter = readyFilter();
    emitFrom(direction.path, "RulesChanged", {wire({wireRule("1", 1), wireRule("2", 1), wireRule("3", 1)})});
    SignalSequence seen(filter.get());
    MessageLog log;
    // The index is not used.
    emitFrom(direction.path, "RuleChanged", {0U, wire("2", 2)});
    QCOMPARE(seen.take(),
             direction.sequence(
                 {"changed [1:block 2:block 3:block], [1:block 2:allow 3:block]", "added 2:allow"}));
    emitFrom(direction.path, "RuleChanged", {99U, wire("2", 1)});
    QCOMPARE(seen.take(),
             direction.sequence(
                 {"changed [1:block 2:allow 3:block], [1:block 2:block 3:block]", "added 2:block"}));
    // The same action, an unknown IMSI, and no rule at all change nothing.
    emitFrom(direction.path, "RuleChanged", {1U, wire("2", 1)});
    emitFrom(direction.path, "RuleChanged", {1U, wire("4", 2)});
    emitFrom(direction.path, "RuleChanged", {1U, wire("", 2)});
    QCOMPARE(log.takeWarnings(), QStringList());
    emitFrom(direction.path, "RuleChanged", {1U, wire("2", 8)});
    QCOMPARE(log.takeWarnings(), texts({"Ignoring rule for \"2\" with invalid action: 8"}));
    QCOMPARE(seen.take(), QStringList());
    // To hangup: announced as added where calls can be hung up.
    emitFrom(direction.path, "RuleChanged", {1U, wire("2", 3)});
    QCOMPARE(seen.take(),
             direction.hangup
                 ? direction.sequence(
                     {"changed [1:block 2:block 3:block], [1:block 2:hangup 3:block]", "added 2:hangup"})
                 : direction.sequence({"changed [1:block 2:block 3:block], [1:block 2:hangup 3:block]"}));
}

void SimVoiceCallFilterTest::ruleRemoved()
{
    QFETCH(Direction, direction);
    const auto filter = readyFilter();
    emitFrom(direction.path, "RulesChanged", {wire({wireRule("1", 1), wireRule("2", 3), wireRule("3", 2)})});
    SignalSequence seen(filter.get());
    emitFrom(direction.path, "RuleRemoved", {3U});
    emitFrom(direction.path, "RuleRemoved", {0xffffffffU});
    QCOMPARE(seen.take(), QStringList());
    emitFrom(direction.path, "RuleRemoved", {1U});
    QCOMPARE(seen.take(),
             direction.sequence(
                 {"changed [1:block 2:hangup 3:allow], [1:block 3:allow]", "removed 2", "removed 2"}));
    emitFrom(direction.path, "RuleRemoved", {1U});
    emitFrom(direction.path, "RuleRemoved", {0U});
    QCOMPARE(seen.take(),
             direction.sequence({"changed [1:block 3:allow], [1:block]", "removed 3", "removed 3",
                                 "changed [1:block], []", "removed 1", "removed 1"}));
    emitFrom(direction.path, "RuleRemoved", {0U});
    QCOMPARE(seen.take(), QStringList());
}

void SimVoiceCallFilterTest::rulesChanged()
{
    QFETCH(Direction, direction);
    const auto filter = readyFilter();
    SignalSequence seen(filter.get());
    emitFrom(direction.path, "RulesChanged", {wire(QList<WireRule>())});
    QCOMPARE(seen.take(), QStringList());
    emitFrom(direction.path, "RulesChanged", {wire({wireRule("3", 1), wireRule("1", 1), wireRule("2", 2)})});
    QCOMPARE(seen.take(),
             direction.sequence({"changed [], [3:block 1:block 2:allow]", "added 3:block", "added 1:block",
                                 "added 2:allow"}));
    emitFrom(direction.path, "RulesChanged", {wire({wireRule("3", 1), wireRule("1", 1), wireRule("2", 2)})});
    QCOMPARE(seen.take(), QStringList());
    // Another order alone announces the list and no rule.
    emitFrom(direction.path, "RulesChanged", {wire({wireRule("1", 1), wireRule("2", 2), wireRule("3", 1)})});
    QCOMPARE(seen.take(),
             direction.sequence({"changed [3:block 1:block 2:allow], [1:block 2:allow 3:block]"}));
    // One action changes, two SIMs go, two come: added before removed, each in the order of its list.
    emitFrom(direction.path, "RulesChanged", {wire({wireRule("5", 1), wireRule("1", 2), wireRule("4", 2)})});
    QCOMPARE(
        seen.take(),
        direction.sequence({"changed [1:block 2:allow 3:block], [5:block 1:allow 4:allow]", "added 5:block",
                            "added 1:allow", "added 4:allow", "removed 2", "removed 3"}));
    // Rules that hang up are among the added ones only where calls can be hung up.
    emitFrom(direction.path, "RulesChanged", {wire({wireRule("6", 3), wireRule("1", 2)})});
    QCOMPARE(seen.take(),
             direction.hangup ? direction.sequence({"changed [5:block 1:allow 4:allow], [6:hangup 1:allow]",
                                                    "added 6:hangup", "removed 5", "removed 4"})
                              : direction.sequence({"changed [5:block 1:allow 4:allow], [6:hangup 1:allow]",
                                                    "removed 5", "removed 4"}));
    emitFrom(direction.path, "RulesChanged", {wire(QList<WireRule>())});
    QCOMPARE(seen.take(), direction.sequence({"changed [6:hangup 1:allow], []", "removed 6", "removed 1"}));
}

void SimVoiceCallFilterTest::rulesChangedDropsInvalidActions()
{
    QFETCH(Direction, direction);
    const auto filter = readyFilter();
    SignalSequence seen(filter.get());
    MessageLog log;
    emitFrom(direction.path, "RulesChanged",
             {wire({wireRule("1", 7), wireRule("2", 1), wireRule("", 2), wireRule("3", 0)})});
    QCOMPARE(seen.take(), direction.sequence({"changed [], [2:block]", "added 2:block"}));
    QCOMPARE(log.takeWarnings(),
             texts({"Ignoring rule for \"1\" with invalid action: 7",
                    "Ignoring rule for \"3\" with invalid action: 0"}));
}

void SimVoiceCallFilterTest::defaultActionChanged()
{
    QFETCH(Direction, direction);
    const auto filter = readyFilter();
    SignalSequence seen(filter.get());
    MessageLog log;
    const auto defaultAction = [&] {
        return filter->property(direction.defaultProperty).toInt();
    };
    emitFrom(direction.path, "DefaultActionChanged", {1U});
    QCOMPARE(seen.take(), QStringList());
    emitFrom(direction.path, "DefaultActionChanged", {2U});
    QCOMPARE(defaultAction(), 2);
    // The service may say what clients could not ask for.
    emitFrom(direction.path, "DefaultActionChanged", {3U});
    QCOMPARE(defaultAction(), 3);
    QCOMPARE(seen.take(), direction.sequence({"default", "default"}));
    QCOMPARE(log.takeWarnings(), QStringList());

    emitFrom(direction.path, "DefaultActionChanged", {0U});
    emitFrom(direction.path, "DefaultActionChanged", {4U});
    QCOMPARE(seen.take(), QStringList());
    QCOMPARE(defaultAction(), 3);
    QCOMPARE(log.takeWarnings(),
             direction.hangup
                 ? texts({"Invalid Incoming Call action: 0", "Invalid Incoming Call action: 4"})
                 : texts({"Invalid Outgoing Call action: 0", "Invalid Outgoing Call action: 4"}));
}

void SimVoiceCallFilterTest::signalsOfAnotherShapeAreNotTaken()
{
    const auto filter = readyFilter();
    SignalSequence seen(filter.get());
    emitFrom(DialPath, "RuleAdded", {QStringLiteral("0"), wire("1", 1)});
    emitFrom(DialPath, "RuleAdded", {0U, QStringLiteral("1")});
    emitFrom(DialPath, "RuleRemoved", {});
    emitFrom(DialPath, "RulesChanged", {QStringList()});
    emitFrom(DialPath, "DefaultActionChanged", {2});
    emitFrom(QStringLiteral("/mdm/voicecallfilter"), "DefaultActionChanged", {2U});
    QCOMPARE(seen.take(), QStringList());
}

void SimVoiceCallFilterTest::requestsForOutgoingCalls()
{
    setServiceRules(DialPath, {rule("111", SimFilter::Allow), rule("222", SimFilter::Block)},
                    SimFilter::Block);
    const auto filter = readyFilter();
    // Swallowed, so that the state stays as it is.
    m_phone->swallowCalls(Service, DialPath, QString());

    QVERIFY(filter->setDefaultDialAction(SimFilter::Allow));
    QVERIFY(filter->setDialRule(rule("333", SimFilter::Allow)));
    QVERIFY(filter->setDialRule(rule("333", SimFilter::Ignore)));
    QVERIFY(filter->setDialRule(rule("111", SimFilter::Block)));
    QVERIFY(filter->setDialRule(rule("", SimFilter::Block)));
    QVERIFY(filter->setDialRules({rule("222", SimFilter::Block), rule("111", SimFilter::Allow)}));
    QVERIFY(filter->setDialRules({}));
    QVERIFY(filter->hasDialRuleForImsi(QStringLiteral("111")));
    QVERIFY(!filter->hasDialRuleForImsi(QStringLiteral("11")));
    QVERIFY(!filter->hasDialRuleForImsi(QString()));
    QVERIFY(filter->removeDialRule(QStringLiteral("222")));
    QVERIFY(filter->clearDialRules());
    m_phone->settle(Service);
    QCOMPARE(
        m_phone->takeJournal(Service),
        texts({"/mdm/voicecallfilter/dial SetDefaultAction (uint32 2,)",
               "/mdm/voicecallfilter/dial AddRule ('333', uint32 2)",
               "/mdm/voicecallfilter/dial AddRule ('333', uint32 1)",
               "/mdm/voicecallfilter/dial AddRule ('111', uint32 1)",
               "/mdm/voicecallfilter/dial AddRule ('', uint32 1)",
               "/mdm/voicecallfilter/dial SetRules ([('222', uint32 1), ('111', 2)],)",
               "/mdm/voicecallfilter/dial SetRules (@a(su) [],)",
               "/mdm/voicecallfilter/dial RemoveRule ('222',)", "/mdm/voicecallfilter/dial ClearRules ()"}));
}

void SimVoiceCallFilterTest::requestsForIncomingCalls()
{
    setServiceRules(IncomingPath, {rule("111", SimFilter::Hangup)}, SimFilter::Allow);
    const auto filter = readyFilter();
    m_phone->swallowCalls(Service, IncomingPath, QString());

    QVERIFY(filter->setDefaultIncomingAction(SimFilter::Hangup));
    QVERIFY(filter->setDefaultIncomingAction(SimFilter::Ignore));
    QVERIFY(filter->setIncomingRule(rule("24491", SimFilter::Hangup)));
    QVERIFY(filter->setIncomingRules({rule("1", SimFilter::Block), rule("2", SimFilter::Hangup)}));
    QVERIFY(filter->hasIncomingRuleForImsi(QStringLiteral("111")));
    QVERIFY(filter->removeIncomingRule(QStringLiteral("111")));
    QVERIFY(filter->clearIncomingRules());
    m_phone->settle(Service);
    QCOMPARE(m_phone->takeJournal(Service),
             texts({"/mdm/voicecallfilter/incoming SetDefaultAction (uint32 3,)",
                    "/mdm/voicecallfilter/incoming SetDefaultAction (uint32 1,)",
                    "/mdm/voicecallfilter/incoming AddRule ('24491', uint32 3)",
                    "/mdm/voicecallfilter/incoming SetRules ([('1', uint32 1), ('2', 3)],)",
                    "/mdm/voicecallfilter/incoming RemoveRule ('111',)",
                    "/mdm/voicecallfilter/incoming ClearRules ()"}));
}

void SimVoiceCallFilterTest::refusedRequestsSendNothing()
{
    setServiceRules(DialPath, {rule("111", SimFilter::Allow)}, SimFilter::Block);
    setServiceRules(IncomingPath, {rule("123", SimFilter::Block)}, SimFilter::Allow);
    const auto filter = readyFilter();
    SignalSequence seen(filter.get());
    MessageLog log;
    const QString tooLong = QStringLiteral("2440512345678901");

    QVERIFY(!filter->setDefaultDialAction(SimFilter::Hangup));
    QVERIFY(!filter->setDefaultDialAction(SimFilter::Block));
    QVERIFY(!filter->setDefaultDialAction(SimFilter::Ignore));
    QVERIFY(!filter->setDefaultIncomingAction(SimFilter::Allow));

    QVERIFY(!filter->setDialRule(rule("24491", SimFilter::Hangup)));
    QVERIFY(!filter->setDialRule(Rule(tooLong, SimFilter::Block)));
    QVERIFY(!filter->setDialRule(rule("12a", SimFilter::Block)));
    QVERIFY(!filter->setDialRule(rule("111", SimFilter::Allow)));
    QVERIFY(!filter->setDialRule(rule("1", SimFilter::Action(0))));
    QVERIFY(!filter->setDialRule(rule("1", SimFilter::Action(4))));
    QVERIFY(!filter->setIncomingRule(rule("123", SimFilter::Ignore)));
    QVERIFY(!filter->setIncomingRule(rule("1", SimFilter::Action(4))));
    QVERIFY(!filter->setIncomingRule(Rule(tooLong, SimFilter::Hangup)));

    QVERIFY(!filter->setDialRules({rule("111", SimFilter::Allow)}));
    QVERIFY(!filter->setDialRules({rule("1", SimFilter::Block), rule("2", SimFilter::Hangup)}));
    QVERIFY(!filter->setDialRules({rule("1", SimFilter::Block), Rule(tooLong, SimFilter::Block)}));
    QVERIFY(!filter->setIncomingRules({rule("123", SimFilter::Block)}));
    QVERIFY(!filter->setIncomingRules({rule("12a", SimFilter::Block)}));
    QVERIFY(!filter->setIncomingRules({rule("1", SimFilter::Action(0))}));

    QVERIFY(!filter->removeDialRule(QStringLiteral("123")));
    QVERIFY(!filter->removeDialRule(tooLong));
    QVERIFY(!filter->removeDialRule(QString()));
    QVERIFY(!filter->removeIncomingRule(QStringLiteral("111")));

    setServiceRules(DialPath, {}, SimFilter::Block);
    setServiceRules(IncomingPath, {}, SimFilter::Allow);
    m_phone->settle(Service);
    m_phone->takeJournal(Service);
    QCOMPARE(filter->dialRules(), RuleList());
    QVERIFY(!filter->clearDialRules());
    QVERIFY(!filter->clearIncomingRules());
    QVERIFY(!filter->setDialRules({}));

    m_phone->settle(Service);
    QCOMPARE(m_phone->takeJournal(Service), QStringList());
    QCOMPARE(log.takeWarnings(), QStringList());

    emitFrom(DialPath, "DefaultActionChanged", {2U});
    QVERIFY(!filter->setDefaultDialAction(SimFilter::Hangup));
    m_phone->settle(Service);
    QCOMPARE(m_phone->takeJournal(Service), QStringList());
}

void SimVoiceCallFilterTest::requestWithAnInvalidDefaultAction()
{
    const auto filter = readyFilter();
    m_phone->swallowCalls(Service, QString(), QStringLiteral("SetDefaultAction"));
    MessageLog log;
    QVERIFY(filter->setDefaultDialAction(SimFilter::Action(9)));
    QVERIFY(filter->setDefaultIncomingAction(SimFilter::Action(0)));
    QCOMPARE(log.takeWarnings(),
             texts({"actionToInt() given invalid action: ", "actionToInt() given invalid action: "}));
    m_phone->settle(Service);
    QCOMPARE(m_phone->takeJournal(Service),
             texts({"/mdm/voicecallfilter/dial SetDefaultAction (uint32 1,)",
                    "/mdm/voicecallfilter/incoming SetDefaultAction (uint32 1,)"}));
}

void SimVoiceCallFilterTest::requestsChangeNothingUntilTheServiceSaysSo()
{
    const auto filter = readyFilter();
    SignalSequence seen(filter.get());
    QVERIFY(filter->setIncomingRule(rule("1", SimFilter::Hangup)));
    QVERIFY(filter->setDefaultIncomingAction(SimFilter::Allow));
    QCOMPARE(filter->incomingRules(), RuleList());
    QCOMPARE(filter->defaultIncomingAction(), SimFilter::Block);
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(seen.waitFor(4));
    QCOMPARE(seen.take(),
             texts({"incomingRulesChanged([], [1:hangup])", "incomingRuleAdded(1:hangup)",
                    "incomingRuleAdded(1:hangup)", "defaultIncomingActionChanged()"}));
}

void SimVoiceCallFilterTest::ruleWithAnotherActionIsSent()
{
    setServiceRules(DialPath, {rule("1", SimFilter::Block), rule("2", SimFilter::Block)}, SimFilter::Block);
    const auto filter = readyFilter();
    SignalSequence seen(filter.get());
    QVERIFY(filter->setDialRule(rule("2", SimFilter::Allow)));
    QVERIFY(seen.waitFor(2));
    m_phone->settle(Service);
    QCOMPARE(seen.take(),
             texts({"dialRulesChanged([1:block 2:block], [1:block 2:allow])", "dialRuleAdded(2:allow)"}));
}

void SimVoiceCallFilterTest::requestsReachTheService()
{
    const auto filter = readyFilter();
    SignalSequence seen(filter.get());
    QVERIFY(filter->setDialRules({rule("1", SimFilter::Block), rule("2", SimFilter::Allow)}));
    QVERIFY(seen.waitFor(3));
    QCOMPARE(seen.take(),
             texts({"dialRulesChanged([], [1:block 2:allow])", "dialRuleAdded(1:block)",
                    "dialRuleAdded(2:allow)"}));
    QVERIFY(filter->removeDialRule(QStringLiteral("1")));
    QVERIFY(seen.waitFor(3));
    QCOMPARE(seen.take(),
             texts({"dialRulesChanged([1:block 2:allow], [2:allow])", "dialRuleRemoved(1)",
                    "dialRuleRemoved(1)"}));
    QVERIFY(filter->clearDialRules());
    QVERIFY(seen.waitFor(2));
    m_phone->settle(Service);
    QCOMPARE(seen.take(), texts({"dialRulesChanged([2:allow], [])", "dialRuleRemoved(2)"}));
}

void SimVoiceCallFilterTest::failedRequestIsLogged()
{
    const auto filter = readyFilter();
    SignalSequence seen(filter.get());
    m_phone->failCalls(Service, DialPath, QString(), QStringLiteral("org.ofono.Error.AccessDenied"),
                       QStringLiteral("Operation not permitted"));
    MessageLog log;
    QVERIFY(filter->setDialRule(rule("1", SimFilter::Allow)));
    m_phone->settle(Service);
    QCOMPARE(log.takeWarnings(),
             texts({"Method call failed: \"org.ofono.Error.AccessDenied\" \"Operation not permitted\""}));
    QCOMPARE(seen.take(), QStringList());
    QCOMPARE(filter->dialRules(), RuleList());
}

void SimVoiceCallFilterTest::serviceThatIsNotThere()
{
    m_phone->stopService(Service);
    MessageLog log;
    SimVoiceCallFilter filter;
    SignalSequence seen(&filter);
    QCOMPARE(log.takeWarnings(),
             texts({"Corvane::Mdm::SimVoiceCallFilter::SimVoiceCallFilter(QObject*) "
                    "Unable to connect to voice call filter interface!"}));
    const auto everyRequestIsRefused = [&] {
        return !filter.setDefaultDialAction(SimFilter::Allow)
            && !filter.setDefaultIncomingAction(SimFilter::Hangup)
            && !filter.setDialRule(rule("1", SimFilter::Block))
            && !filter.setIncomingRule(rule("1", SimFilter::Block))
            && !filter.setDialRules({rule("1", SimFilter::Block)})
            && !filter.setIncomingRules({rule("1", SimFilter::Block)})
            && !filter.removeDialRule(QStringLiteral("1")) && !filter.removeIncomingRule(QStringLiteral("1"))
            && !filter.clearDialRules() && !filter.clearIncomingRules();
    };
    QVERIFY(everyRequestIsRefused());

    // It stays so when the service appears.
    m_phone->startService(Service);
    emitFrom(DialPath, "RuleAdded", {0U, wire("1", 1)});
    emitFrom(IncomingPath, "DefaultActionChanged", {2U});
    QVERIFY(everyRequestIsRefused());
    m_phone->settle(Service);
    QCOMPARE(m_phone->takeJournal(Service), QStringList());
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(!filter.ready());
    QCOMPARE(filter.dialRules(), RuleList());
    QCOMPARE(filter.defaultIncomingAction(), SimFilter::Block);
    QCOMPARE(log.takeWarnings(), QStringList());
}

void SimVoiceCallFilterTest::serviceThatGoesAndComesBack()
{
    setServiceRules(DialPath, {rule("1", SimFilter::Allow)}, SimFilter::Allow);
    const auto filter = readyFilter();
    SignalSequence seen(filter.get());
    m_phone->stopService(Service);
    {
        MessageLog log;
        QVERIFY(filter->setDialRule(rule("2", SimFilter::Allow)));
        QStringList warnings;
        QVERIFY(waitUntil([&] { return !(warnings += log.takeWarnings()).isEmpty(); }));
        QCOMPARE(warnings.size(), 1);
        QVERIFY2(warnings.first().startsWith(
                     QLatin1String("Method call failed: \"org.freedesktop.DBus.Error.ServiceUnknown\" \"")),
                 qPrintable(warnings.first()));
    }
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(filter->ready());
    QCOMPARE(filter->dialRules(), RuleList({rule("1", SimFilter::Allow)}));

    m_phone->startService(Service);
    QVERIFY(filter->setDialRule(rule("2", SimFilter::Allow)));
    QVERIFY(seen.waitFor(3));
    QCOMPARE(seen.take(),
             texts({"dialRulesChanged([1:allow], [1:allow 2:allow])", "dialRuleAdded(2:allow)",
                    "dialRuleAdded(2:allow)"}));
    emitFrom(IncomingPath, "DefaultActionChanged", {3U});
    QCOMPARE(seen.take(), texts({"defaultIncomingActionChanged()"}));
}

void SimVoiceCallFilterTest::twoFiltersSideBySide()
{
    auto first = readyFilter();
    const auto second = readyFilter();
    SignalSequence firstSeen(first.get());
    SignalSequence secondSeen(second.get());
    QVERIFY(first->setDialRule(rule("1", SimFilter::Allow)));
    QVERIFY(firstSeen.waitFor(3));
    QVERIFY(secondSeen.waitFor(3));
    QCOMPARE(firstSeen.take(), secondSeen.take());
    QCOMPARE(m_phone->takeJournal(Service), texts({"/mdm/voicecallfilter/dial AddRule ('1', uint32 2)"}));

    first.reset();
    QVERIFY(second->clearDialRules());
    QVERIFY(secondSeen.waitFor(2));
    QCOMPARE(secondSeen.take(), texts({"dialRulesChanged([1:allow], [])", "dialRuleRemoved(1)"}));
}

void SimVoiceCallFilterTest::destructionWithCallsPending()
{
    m_phone->delayCalls(Service, QString(), QString(), 20);
    MessageLog log;
    {
        // "GetAll" of both directions in flight.
        SimVoiceCallFilter filter;
    }
    {
        SimVoiceCallFilter filter;
        QVERIFY(waitUntil([&] { return filter.ready(); }));
        QVERIFY(filter.setDialRule(rule("1", SimFilter::Allow)));
        QVERIFY(filter.setIncomingRule(rule("", SimFilter::Allow)));
        QVERIFY(filter.setDefaultDialAction(SimFilter::Allow));
    }
    m_phone->settle(Service);
    QCOMPARE(log.takeWarnings(), QStringList());
}

void SimVoiceCallFilterTest::deletionInASlot_data()
{
    QTest::addColumn<int>("survivedSignals");
    // The first answer of the service causes seven signals.
    for (int signal = 0; signal < 7; ++signal)
        QTest::newRow(qPrintable(QStringLiteral("signal %1").arg(signal))) << signal;
}

void SimVoiceCallFilterTest::deletionInASlot()
{
    QFETCH(int, survivedSignals);
    setServiceRules(DialPath, {rule("1", SimFilter::Allow), rule("2", SimFilter::Allow)}, SimFilter::Allow);
    setServiceRules(IncomingPath, {rule("2", SimFilter::Hangup)}, SimFilter::Block);
    auto filter = std::make_unique<SimVoiceCallFilter>();
    int signalsSeen = 0;
    const auto countAndDelete = [&] {
        if (signalsSeen++ == survivedSignals)
            filter.reset();
    };
    connect(filter.get(), &SimVoiceCallFilter::defaultDialActionChanged, this, countAndDelete);
    connect(filter.get(), &SimVoiceCallFilter::dialRulesChanged, this, countAndDelete);
    connect(filter.get(), &SimVoiceCallFilter::dialRuleAdded, this, countAndDelete);
    connect(filter.get(), &SimVoiceCallFilter::incomingRulesChanged, this, countAndDelete);
    connect(filter.get(), &SimVoiceCallFilter::incomingRuleAdded, this, countAndDelete);
    connect(filter.get(), &SimVoiceCallFilter::readyChanged, this, countAndDelete);
    QVERIFY(waitUntil([&] { return !filter; }));
    m_phone->settle(Service);
    QCOMPARE(signalsSeen, survivedSignals + 1);
}

void SimVoiceCallFilterTest::propertiesThroughTheMetaObject()
{
    setServiceRules(DialPath, {rule("1", SimFilter::Allow)}, SimFilter::Allow);
    const auto filter = readyFilter();
    SignalSequence seen(filter.get());
    QCOMPARE(filter->property("ready").toBool(), true);
    QCOMPARE(filter->property("dialRules").value<RuleList>(), RuleList({rule("1", SimFilter::Allow)}));
    QCOMPARE(filter->property("defaultDialAction").value<SimFilter::Action>(), SimFilter::Allow);

    QVERIFY(filter->setProperty("dialRules", QVariant::fromValue(RuleList({rule("2", SimFilter::Block)}))));
    QVERIFY(seen.waitFor(3));
    // As QML does, by the enumerator's name or number.
    QVERIFY(filter->setProperty("defaultIncomingAction", QStringLiteral("Hangup")));
    QVERIFY(filter->setProperty("defaultDialAction", int(SimFilter::Block)));
    QVERIFY(seen.waitFor(5));
    m_phone->settle(Service);
    QCOMPARE(seen.take(),
             texts({"dialRulesChanged([1:allow], [2:block])", "dialRuleAdded(2:block)", "dialRuleRemoved(1)",
                    "defaultIncomingActionChanged()", "defaultDialActionChanged()"}));

    const QMetaObject *metaObject = filter->metaObject();
    for (const char *name :
         {"ready", "defaultDialAction", "defaultIncomingAction", "dialRules", "incomingRules"}) {
        const QMetaProperty property = metaObject->property(metaObject->indexOfProperty(name));
        QVERIFY2(property.hasNotifySignal(), name);
        QVERIFY2(property.userType() != QMetaType::UnknownType, name);
        QCOMPARE(property.isWritable(), qstrcmp(name, "ready") != 0);
    }
}

void SimVoiceCallFilterTest::signalsReachQueuedAndNamedConnections()
{
    const auto filter = readyFilter();
    QSignalSpy rulesChanged(filter.get(), SIGNAL(dialRulesChanged(SimFilter::RuleList, SimFilter::RuleList)));
    QSignalSpy ruleAdded(filter.get(), SIGNAL(dialRuleAdded(SimFilter::Rule)));
    QVERIFY(rulesChanged.isValid());
    QVERIFY(ruleAdded.isValid());
    RuleList queued;
    connect(
        filter.get(), &SimVoiceCallFilter::dialRulesChanged, this,
        [&queued](const RuleList &, const RuleList &newRules) { queued = newRules; }, Qt::QueuedConnection);
    QVERIFY(filter->setDialRule(rule("1", SimFilter::Allow)));
    QVERIFY(waitUntil([&] { return !queued.isEmpty(); }));
    QCOMPARE(queued, RuleList({rule("1", SimFilter::Allow)}));
    QCOMPARE(rulesChanged.size(), 1);
    QCOMPARE(rulesChanged.first().at(1).value<RuleList>(), queued);
    QCOMPARE(ruleAdded.size(), 2);
    QCOMPARE(ruleAdded.first().first().value<Rule>(), rule("1", SimFilter::Allow));
}

QTEST_GUILESS_MAIN(SimVoiceCallFilterTest)
#include "simvoicecallfilter_test.moc"
