// SPDX-License-Identifier: LGPL-2.1-or-later
#include "rulechanneltest.h"

#include "messagelog.h"
#include "signalsequence.h"
#include "waiting.h"

#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusMetaType>
#include <QtTest/QtTest>

QVariant wire(const char *imsi, quint32 action)
{
    return QVariant::fromValue(wireRule(imsi, action));
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

QString TestedChannel::wireName(const char *pattern) const
{
    return QString::fromLatin1(pattern).replace(QLatin1Char('@'), QLatin1String(names.wireWord));
}

QStringList TestedChannel::calls(std::initializer_list<const char *> list) const
{
    QStringList result;
    for (const char *call : list) {
        const QString text = QString::fromLatin1(call);
        const QString member = text.section(QLatin1Char(' '), 0, 0);
        result.append(path() + QLatin1Char(' ') + wireName(qPrintable(member)) + text.mid(member.size()));
    }
    return result;
}

QString TestedChannel::signal(const char *event) const
{
    QString name = QString::fromLatin1(names.prefix) + QLatin1String(event);
    name[0] = name.at(0).toLower();
    return name;
}

QStringList TestedChannel::sequence(std::initializer_list<const char *> list) const
{
    QStringList result;
    for (const char *item : list) {
        const QString text = QString::fromLatin1(item);
        const QString argument = QLatin1Char('(') + text.section(QLatin1Char(' '), 1) + QLatin1Char(')');
        const QString event = text.section(QLatin1Char(' '), 0, 0);
        if (event == QLatin1String("added"))
            result.append(signal("RuleAdded") + argument);
        else if (event == QLatin1String("removed"))
            result.append(signal("RuleRemoved") + argument);
        else if (event == QLatin1String("changed"))
            result.append(signal("RulesChanged") + argument);
        else if (event == QLatin1String("default"))
            result.append(QLatin1String(names.defaultProperty) + QStringLiteral("Changed()"));
        else
            result.append(event + QStringLiteral("Changed()"));
    }
    return result;
}

/** Looks at what it likes each time that an object emits one of its own class's signals. */
class SignalWitness : public QObject
{
    Q_OBJECT

public:
    SignalWitness(const QObject *object, const std::function<void()> &look,
                  Qt::ConnectionType type = Qt::DirectConnection)
        : m_look(look)
    {
        const QMetaObject *metaObject = object->metaObject();
        const QMetaMethod slot = staticMetaObject.method(staticMetaObject.indexOfSlot("see()"));
        for (int index = metaObject->methodOffset(); index < metaObject->methodCount(); ++index) {
            if (metaObject->method(index).methodType() == QMetaMethod::Signal)
                connect(object, metaObject->method(index), this, slot, type);
        }
    }

private Q_SLOTS:
    void see() { m_look(); }

private:
    const std::function<void()> m_look;
};

const QString RuleChannelTest::Service = QStringLiteral("org.ofono");

RuleChannelTest::RuleChannelTest(const QVector<TestedChannel> &channels)
    : m_channels(channels)
{
}

void RuleChannelTest::initTestCase()
{
    qDBusRegisterMetaType<WireRule>();
    qDBusRegisterMetaType<QList<WireRule>>();
}

void RuleChannelTest::init()
{
    m_phone = std::make_unique<Phone>();
    for (const TestedChannel &channel : m_channels)
        setServiceRules(channel, {}, SimFilter::Block);
    m_phone->takeJournal(Service);
}

void RuleChannelTest::cleanup()
{
    m_phone->clearFaults();
    m_phone->startService(Service);
}

void RuleChannelTest::addChannels()
{
    QTest::addColumn<TestedChannel>("channel");
    for (const TestedChannel &channel : m_channels)
        QTest::newRow(channel.names.path) << channel;
}

void RuleChannelTest::setServiceRules(const TestedChannel &channel, const RuleList &rules,
                                      SimFilter::Action defaultAction)
{
    QList<WireRule> list;
    for (const Rule &item : rules)
        list.append({item.imsi, quint32(item.action)});
    const auto call = [&](const char *method, const QVariant &argument) {
        QDBusMessage message = QDBusMessage::createMethodCall(
            Service, channel.path(), QString::fromLatin1(channel.names.interface), channel.wireName(method));
        message.setArguments({argument});
        const QDBusMessage reply = QDBusConnection::systemBus().call(message);
        QVERIFY2(reply.type() == QDBusMessage::ReplyMessage, qPrintable(reply.errorMessage()));
    };
    call("Set@Rules", wire(list));
    call("SetDefault@Action", quint32(defaultAction));
}

void RuleChannelTest::emitFrom(const TestedChannel &channel, const char *member,
                               const QVariantList &arguments)
{
    m_phone->emitSignal(Service, channel.path(), QString::fromLatin1(channel.names.interface),
                        channel.wireName(member), arguments);
}

QVariantList RuleChannelTest::getAllAnswer(quint32 defaultAction, const QList<WireRule> &rules) const
{
    return {quint32(99), defaultAction, wire(rules)};
}

std::unique_ptr<TestedFilter> RuleChannelTest::readyFilter(const TestedChannel &channel)
{
    auto filter = channel.make();
    if (!waitUntil([&] { return filter->ready(); }))
        qFatal("the filter did not become ready");
    m_phone->takeJournal(Service);
    return filter;
}

// Calls to other objects of the same filter are not this channel's.
QStringList RuleChannelTest::takeCalls(const TestedChannel &channel)
{
    QStringList calls = m_phone->takeJournal(Service);
    calls.erase(std::remove_if(
                    calls.begin(), calls.end(),
                    [&](const QString &call) { return !call.startsWith(channel.path() + QLatin1Char(' ')); }),
                calls.end());
    return calls;
}

void RuleChannelTest::initialState()
{
    QFETCH(TestedChannel, channel);
    setServiceRules(channel, {rule("1", SimFilter::Allow)}, SimFilter::Allow);
    m_phone->takeJournal(Service);
    const auto filter = channel.make();
    QVERIFY(!filter->ready());
    QCOMPARE(filter->defaultAction(), SimFilter::Block);
    QCOMPARE(filter->rules(), RuleList());
    QVERIFY(waitUntil([&] { return filter->ready(); }));
    QCOMPARE(takeCalls(channel), channel.calls({"GetAll ()"}));
}

void RuleChannelTest::takesOverTheServicesState()
{
    QFETCH(TestedChannel, channel);
    setServiceRules(channel, {rule("1", SimFilter::Allow), rule("2", SimFilter::Block)}, SimFilter::Allow);
    const auto filter = channel.make();
    SignalSequence seen(filter->object());
    // What is announced is so already.
    QStringList states;
    const SignalWitness witness(filter->object(), [&] {
        states.append(QStringLiteral("%1 %2 %3")
                          .arg(filter->ready())
                          .arg(filter->defaultAction())
                          .arg(filter->rules().size()));
    });
    QVERIFY(waitUntil([&] { return filter->ready(); }));
    QCOMPARE(seen.take(),
             channel.sequence(
                 {"default", "changed [], [1:allow 2:block]", "added 1:allow", "added 2:block", "ready"}));
    QCOMPARE(states, texts({"0 2 0", "0 2 2", "0 2 2", "0 2 2", "1 2 2"}));
    QCOMPARE(filter->defaultAction(), SimFilter::Allow);
    QCOMPARE(filter->rules(), RuleList({rule("1", SimFilter::Allow), rule("2", SimFilter::Block)}));

    // What comes later changes the list, never the readiness.
    emitFrom(channel, "@RulesChanged", {wire(QList<WireRule>())});
    QCOMPARE(seen.take(), channel.sequence({"changed [1:allow 2:block], []", "removed 1", "removed 2"}));
    QVERIFY(filter->ready());
}

void RuleChannelTest::takesOverOnlyWhatIsValid()
{
    QFETCH(TestedChannel, channel);
    m_phone->answerCalls(
        Service, channel.path(), QStringLiteral("GetAll"),
        getAllAnswer(9, {wireRule("1", 2), wireRule("2", 7), wireRule("", 1), wireRule("3", 3)}));
    MessageLog log;
    const auto filter = channel.make();
    SignalSequence seen(filter->object());
    QVERIFY(waitUntil([&] { return filter->ready(); }));
    QCOMPARE(
        seen.take(),
        channel.names.hangup
            ? channel.sequence({"changed [], [1:allow 3:hangup]", "added 1:allow", "added 3:hangup", "ready"})
            : channel.sequence({"changed [], [1:allow 3:hangup]", "added 1:allow", "ready"}));
    QCOMPARE(log.takeWarnings(),
             QStringList({QString::fromLatin1(channel.names.invalidDefaultAction) + QLatin1String(" 9"),
                          QStringLiteral("Ignoring rule for \"2\" with invalid action: 7")}));
    QCOMPARE(filter->defaultAction(), SimFilter::Block);
}

void RuleChannelTest::isNeverReadyWhenTheAnswerFails()
{
    QFETCH(TestedChannel, channel);
    setServiceRules(channel, {rule("1", SimFilter::Allow)}, SimFilter::Allow);
    m_phone->failCalls(Service, channel.path(), QStringLiteral("GetAll"),
                       QStringLiteral("com.example.Broken"), QStringLiteral("Out of order"));
    m_phone->takeJournal(Service);
    MessageLog log;
    const auto filter = channel.make();
    SignalSequence seen(filter->object());
    m_phone->settle(Service);
    QCOMPARE(log.takeWarnings(),
             QStringList(QString::fromLatin1(channel.names.getAllFailed)
                         + QLatin1String(R"( "com.example.Broken" "Out of order")")));
    QCOMPARE(seen.take(), QStringList());

    // There is no second attempt, and later announcements of the service make it no readier.
    emitFrom(channel, "Default@ActionChanged", {2U});
    emitFrom(channel, "@RuleAdded", {0U, wire("1", 2)});
    QCOMPARE(seen.take(),
             channel.sequence({"default", "changed [], [1:allow]", "added 1:allow", "added 1:allow"}));
    QVERIFY(!filter->ready());
    // Requests are sent all the same.
    QVERIFY(filter->setRule(rule("3", SimFilter::Block)));
    m_phone->settle(Service);
    QCOMPARE(takeCalls(channel), channel.calls({"GetAll ()", "Add@Rule ('3', uint32 1)"}));
}

void RuleChannelTest::answerOfAnotherTypeIsAFailure()
{
    QFETCH(TestedChannel, channel);
    const QList<QVariantList> answers{
        {}, {QStringLiteral("all"), 1U, 2U}, {1U, 2U}, {1U, 2, wire(QList<WireRule>())}};
    for (const QVariantList &answer : answers) {
        m_phone->answerCalls(Service, channel.path(), QStringLiteral("GetAll"), answer);
        MessageLog log;
        const auto filter = channel.make();
        SignalSequence seen(filter->object());
        m_phone->settle(Service);
        const QStringList warnings = log.takeWarnings();
        QCOMPARE(warnings.size(), 1);
        QVERIFY2(warnings.first().startsWith(QString::fromLatin1(channel.names.getAllFailed)
                                             + QLatin1String(" \"")),
                 qPrintable(warnings.first()));
        QCOMPARE(seen.take(), QStringList());
        QVERIFY(!filter->ready());
    }
}

void RuleChannelTest::ruleAdded()
{
    QFETCH(TestedChannel, channel);
    const auto filter = readyFilter(channel);
    SignalSequence seen(filter->object());
    // At the end, at the beginning, far behind the end, and where a signed number would be negative.
    emitFrom(channel, "@RuleAdded", {0U, wire("1", 1)});
    QCOMPARE(seen.take(), channel.sequence({"changed [], [1:block]", "added 1:block", "added 1:block"}));
    emitFrom(channel, "@RuleAdded", {0U, wire("2", 2)});
    QCOMPARE(seen.take(),
             channel.sequence({"changed [1:block], [2:allow 1:block]", "added 2:allow", "added 2:allow"}));
    emitFrom(channel, "@RuleAdded", {17U, wire("3", 2)});
    QCOMPARE(seen.take(),
             channel.sequence(
                 {"changed [2:allow 1:block], [2:allow 1:block 3:allow]", "added 3:allow", "added 3:allow"}));
    emitFrom(channel, "@RuleAdded", {0xffffffffU, wire("4", 1)});
    QCOMPARE(seen.take(),
             channel.sequence({"changed [2:allow 1:block 3:allow], [2:allow 1:block 3:allow 4:block]",
                               "added 4:block", "added 4:block"}));
}

void RuleChannelTest::hangupRuleAdded()
{
    QFETCH(TestedChannel, channel);
    const auto filter = readyFilter(channel);
    SignalSequence seen(filter->object());
    emitFrom(channel, "@RuleAdded", {0U, wire("1", 3)});
    QCOMPARE(seen.take(),
             channel.names.hangup
                 ? channel.sequence({"changed [], [1:hangup]", "added 1:hangup", "added 1:hangup"})
                 : channel.sequence({"changed [], [1:hangup]", "added 1:hangup"}));
    QCOMPARE(filter->rules(), RuleList({rule("1", SimFilter::Hangup)}));
}

void RuleChannelTest::ruleAddedWithoutImsiOrAction()
{
    QFETCH(TestedChannel, channel);
    const auto filter = readyFilter(channel);
    SignalSequence seen(filter->object());
    MessageLog log;
    emitFrom(channel, "@RuleAdded", {0U, wire("", 1)});
    QCOMPARE(log.takeWarnings(), QStringList());
    emitFrom(channel, "@RuleAdded", {0U, wire("1", 0)});
    emitFrom(channel, "@RuleAdded", {0U, wire("2", 4)});
    QCOMPARE(log.takeWarnings(),
             texts({"Ignoring rule for \"1\" with invalid action: 0",
                    "Ignoring rule for \"2\" with invalid action: 4"}));
    QCOMPARE(seen.take(), QStringList());
}

void RuleChannelTest::ruleAddedTwice()
{
    QFETCH(TestedChannel, channel);
    const auto filter = readyFilter(channel);
    emitFrom(channel, "@RuleAdded", {0U, wire("1", 1)});
    SignalSequence seen(filter->object());
    // A second rule that equals the first is new in the list, but not among the rules that the change added.
    emitFrom(channel, "@RuleAdded", {1U, wire("1", 1)});
    QCOMPARE(seen.take(), channel.sequence({"changed [1:block], [1:block 1:block]", "added 1:block"}));
    // One with another action is.
    emitFrom(channel, "@RuleAdded", {0U, wire("1", 2)});
    QCOMPARE(seen.take(),
             channel.sequence(
                 {"changed [1:block 1:block], [1:allow 1:block 1:block]", "added 1:allow", "added 1:allow"}));
    // The IMSI is still there after one of its rules has gone.
    emitFrom(channel, "@RuleRemoved", {0U});
    QCOMPARE(seen.take(),
             channel.sequence({"changed [1:allow 1:block 1:block], [1:block 1:block]", "removed 1"}));
}

void RuleChannelTest::ruleChanged()
{
    QFETCH(TestedChannel, channel);
    const auto filter = readyFilter(channel);
    emitFrom(channel, "@RulesChanged", {wire({wireRule("1", 1), wireRule("2", 1), wireRule("3", 1)})});
    SignalSequence seen(filter->object());
    MessageLog log;
    // The index is not used.
    emitFrom(channel, "@RuleChanged", {0U, wire("2", 2)});
    QCOMPARE(
        seen.take(),
        channel.sequence({"changed [1:block 2:block 3:block], [1:block 2:allow 3:block]", "added 2:allow"}));
    emitFrom(channel, "@RuleChanged", {99U, wire("2", 1)});
    QCOMPARE(
        seen.take(),
        channel.sequence({"changed [1:block 2:allow 3:block], [1:block 2:block 3:block]", "added 2:block"}));
    // The same action, an unknown IMSI, and no rule at all change nothing.
    emitFrom(channel, "@RuleChanged", {1U, wire("2", 1)});
    emitFrom(channel, "@RuleChanged", {1U, wire("4", 2)});
    emitFrom(channel, "@RuleChanged", {1U, wire("", 2)});
    QCOMPARE(log.takeWarnings(), QStringList());
    emitFrom(channel, "@RuleChanged", {1U, wire("2", 8)});
    QCOMPARE(log.takeWarnings(), texts({"Ignoring rule for \"2\" with invalid action: 8"}));
    QCOMPARE(seen.take(), QStringList());
    // To hangup: announced as added where calls can be hung up.
    emitFrom(channel, "@RuleChanged", {1U, wire("2", 3)});
    QCOMPARE(seen.take(),
             channel.names.hangup
                 ? channel.sequence(
                     {"changed [1:block 2:block 3:block], [1:block 2:hangup 3:block]", "added 2:hangup"})
                 : channel.sequence({"changed [1:block 2:block 3:block], [1:block 2:hangup 3:block]"}));
}

void RuleChannelTest::ruleChangedOfAnImsiThatIsThereTwice()
{
    QFETCH(TestedChannel, channel);
    const auto filter = readyFilter(channel);
    emitFrom(channel, "@RulesChanged", {wire({wireRule("1", 1), wireRule("1", 2)})});
    SignalSequence seen(filter->object());
    // The first one counts, and has that action already.
    emitFrom(channel, "@RuleChanged", {1U, wire("1", 1)});
    QCOMPARE(seen.take(), QStringList());
    // A rule that equals another one is not among those that the change added.
    emitFrom(channel, "@RuleChanged", {1U, wire("1", 2)});
    QCOMPARE(seen.take(), channel.sequence({"changed [1:block 1:allow], [1:allow 1:allow]"}));
}

void RuleChannelTest::ruleRemoved()
{
    QFETCH(TestedChannel, channel);
    const auto filter = readyFilter(channel);
    emitFrom(channel, "@RulesChanged", {wire({wireRule("1", 1), wireRule("2", 3), wireRule("3", 2)})});
    SignalSequence seen(filter->object());
    emitFrom(channel, "@RuleRemoved", {3U});
    emitFrom(channel, "@RuleRemoved", {0xffffffffU});
    QCOMPARE(seen.take(), QStringList());
    emitFrom(channel, "@RuleRemoved", {1U});
    QCOMPARE(seen.take(),
             channel.sequence(
                 {"changed [1:block 2:hangup 3:allow], [1:block 3:allow]", "removed 2", "removed 2"}));
    emitFrom(channel, "@RuleRemoved", {1U});
    emitFrom(channel, "@RuleRemoved", {0U});
    QCOMPARE(seen.take(),
             channel.sequence({"changed [1:block 3:allow], [1:block]", "removed 3", "removed 3",
                               "changed [1:block], []", "removed 1", "removed 1"}));
    emitFrom(channel, "@RuleRemoved", {0U});
    QCOMPARE(seen.take(), QStringList());
}

void RuleChannelTest::rulesChanged()
{
    QFETCH(TestedChannel, channel);
    const auto filter = readyFilter(channel);
    SignalSequence seen(filter->object());
    emitFrom(channel, "@RulesChanged", {wire(QList<WireRule>())});
    QCOMPARE(seen.take(), QStringList());
    emitFrom(channel, "@RulesChanged", {wire({wireRule("3", 1), wireRule("1", 1), wireRule("2", 2)})});
    QCOMPARE(seen.take(),
             channel.sequence({"changed [], [3:block 1:block 2:allow]", "added 3:block", "added 1:block",
                               "added 2:allow"}));
    emitFrom(channel, "@RulesChanged", {wire({wireRule("3", 1), wireRule("1", 1), wireRule("2", 2)})});
    QCOMPARE(seen.take(), QStringList());
    // Another order alone announces the list and no rule.
    emitFrom(channel, "@RulesChanged", {wire({wireRule("1", 1), wireRule("2", 2), wireRule("3", 1)})});
    QCOMPARE(seen.take(), channel.sequence({"changed [3:block 1:block 2:allow], [1:block 2:allow 3:block]"}));
    // One action changes, two SIMs go, two come: added before removed, each in the order of its list.
    emitFrom(channel, "@RulesChanged", {wire({wireRule("5", 1), wireRule("1", 2), wireRule("4", 2)})});
    QCOMPARE(seen.take(),
             channel.sequence({"changed [1:block 2:allow 3:block], [5:block 1:allow 4:allow]",
                               "added 5:block", "added 1:allow", "added 4:allow", "removed 2", "removed 3"}));
    // Rules that hang up are among the added ones only where calls can be hung up.
    emitFrom(channel, "@RulesChanged", {wire({wireRule("6", 3), wireRule("1", 2)})});
    QCOMPARE(seen.take(),
             channel.names.hangup ? channel.sequence({"changed [5:block 1:allow 4:allow], [6:hangup 1:allow]",
                                                      "added 6:hangup", "removed 5", "removed 4"})
                                  : channel.sequence({"changed [5:block 1:allow 4:allow], [6:hangup 1:allow]",
                                                      "removed 5", "removed 4"}));
    emitFrom(channel, "@RulesChanged", {wire(QList<WireRule>())});
    QCOMPARE(seen.take(), channel.sequence({"changed [6:hangup 1:allow], []", "removed 6", "removed 1"}));
}

void RuleChannelTest::rulesChangedDropsInvalidActions()
{
    QFETCH(TestedChannel, channel);
    const auto filter = readyFilter(channel);
    SignalSequence seen(filter->object());
    MessageLog log;
    emitFrom(channel, "@RulesChanged",
             {wire({wireRule("1", 7), wireRule("2", 1), wireRule("", 2), wireRule("3", 0)})});
    QCOMPARE(seen.take(), channel.sequence({"changed [], [2:block]", "added 2:block"}));
    QCOMPARE(log.takeWarnings(),
             texts({"Ignoring rule for \"1\" with invalid action: 7",
                    "Ignoring rule for \"3\" with invalid action: 0"}));
}

void RuleChannelTest::defaultActionChanged()
{
    QFETCH(TestedChannel, channel);
    const auto filter = readyFilter(channel);
    SignalSequence seen(filter->object());
    MessageLog log;
    const auto defaultAction = [&] {
        return int(filter->defaultAction());
    };
    emitFrom(channel, "Default@ActionChanged", {1U});
    QCOMPARE(seen.take(), QStringList());
    emitFrom(channel, "Default@ActionChanged", {2U});
    QCOMPARE(defaultAction(), 2);
    // The service may say what clients could not ask for.
    emitFrom(channel, "Default@ActionChanged", {3U});
    QCOMPARE(defaultAction(), 3);
    QCOMPARE(seen.take(), channel.sequence({"default", "default"}));
    QCOMPARE(log.takeWarnings(), QStringList());

    emitFrom(channel, "Default@ActionChanged", {0U});
    emitFrom(channel, "Default@ActionChanged", {4U});
    QCOMPARE(seen.take(), QStringList());
    QCOMPARE(defaultAction(), 3);
    QCOMPARE(log.takeWarnings(),
             QStringList({QString::fromLatin1(channel.names.invalidDefaultAction) + QLatin1String(" 0"),
                          QString::fromLatin1(channel.names.invalidDefaultAction) + QLatin1String(" 4")}));
}

void RuleChannelTest::signalsOfAnotherShapeAreNotTaken()
{
    QFETCH(TestedChannel, channel);
    const auto filter = readyFilter(channel);
    SignalSequence seen(filter->object());
    emitFrom(channel, "@RuleAdded", {QStringLiteral("0"), wire("1", 1)});
    emitFrom(channel, "@RuleAdded", {0U, QStringLiteral("1")});
    emitFrom(channel, "@RuleChanged", {0U});
    emitFrom(channel, "@RuleRemoved", {});
    emitFrom(channel, "@RulesChanged", {QStringList()});
    emitFrom(channel, "Default@ActionChanged", {2});
    m_phone->emitSignal(Service, QStringLiteral("/mdm"), QString::fromLatin1(channel.names.interface),
                        channel.wireName("Default@ActionChanged"), {2U});
    m_phone->emitSignal(Service, channel.path(), QStringLiteral("com.example.Filter"),
                        channel.wireName("Default@ActionChanged"), {2U});
    QCOMPARE(seen.take(), QStringList());
}

void RuleChannelTest::requestsAreSentBeforeTheStateIsKnown()
{
    QFETCH(TestedChannel, channel);
    setServiceRules(channel, {rule("1", SimFilter::Block)}, SimFilter::Allow);
    m_phone->takeJournal(Service);
    m_phone->swallowCalls(Service, channel.path(), QStringLiteral("GetAll"));
    const auto filter = channel.make();
    QVERIFY(filter->setRule(rule("2", SimFilter::Allow)));
    QVERIFY(filter->setRules({rule("3", SimFilter::Block)}));
    QVERIFY(filter->setDefaultAction(SimFilter::Allow));
    // What is known so far is compared with.
    QVERIFY(!filter->setDefaultAction(SimFilter::Block));
    QVERIFY(!filter->removeRule(QStringLiteral("1")));
    QVERIFY(!filter->clearRules());
    m_phone->settle(Service);
    QVERIFY(!filter->ready());
    QCOMPARE(takeCalls(channel),
             channel.calls({"GetAll ()", "Add@Rule ('2', uint32 2)", "Set@Rules ([('3', uint32 1)],)",
                            "SetDefault@Action (uint32 2,)"}));
}

void RuleChannelTest::requestsAreSent()
{
    QFETCH(TestedChannel, channel);
    setServiceRules(channel, {rule("111", SimFilter::Allow), rule("222", SimFilter::Block)},
                    SimFilter::Block);
    const auto filter = readyFilter(channel);
    // Swallowed, so that the state stays as it is.
    m_phone->swallowCalls(Service, channel.path(), QString());

    QVERIFY(filter->setDefaultAction(SimFilter::Allow));
    QVERIFY(filter->setRule(rule("333", SimFilter::Allow)));
    QVERIFY(filter->setRule(rule("333", SimFilter::Ignore)));
    QVERIFY(filter->setRule(rule("111", SimFilter::Block)));
    QVERIFY(filter->setRule(rule("", SimFilter::Block)));
    QVERIFY(filter->setRules({rule("222", SimFilter::Block), rule("111", SimFilter::Allow)}));
    QVERIFY(filter->setRules({}));
    QVERIFY(filter->hasRule("111"));
    QVERIFY(!filter->hasRule("11"));
    QVERIFY(!filter->hasRule(""));
    QVERIFY(filter->removeRule(QStringLiteral("222")));
    QVERIFY(filter->clearRules());
    m_phone->settle(Service);
    QCOMPARE(takeCalls(channel),
             channel.calls({"SetDefault@Action (uint32 2,)", "Add@Rule ('333', uint32 2)",
                            "Add@Rule ('333', uint32 1)", "Add@Rule ('111', uint32 1)",
                            "Add@Rule ('', uint32 1)", "Set@Rules ([('222', uint32 1), ('111', 2)],)",
                            "Set@Rules (@a(su) [],)", "Remove@Rule ('222',)", "Clear@Rules ()"}));
}

void RuleChannelTest::hangupIsSentWhereItExists()
{
    QFETCH(TestedChannel, channel);
    const bool hangup = channel.names.hangup;
    setServiceRules(channel, {rule("111", SimFilter::Allow)}, SimFilter::Allow);
    const auto filter = readyFilter(channel);
    m_phone->swallowCalls(Service, channel.path(), QString());
    MessageLog log;
    QCOMPARE(filter->setDefaultAction(SimFilter::Hangup), hangup);
    QCOMPARE(filter->setRule(rule("1234", SimFilter::Hangup)), hangup);
    QCOMPARE(filter->setRule(rule("111", SimFilter::Hangup)), hangup);
    QCOMPARE(filter->setRules({rule("1", SimFilter::Block), rule("2", SimFilter::Hangup)}), hangup);
    m_phone->settle(Service);
    QCOMPARE(takeCalls(channel),
             hangup
                 ? channel.calls({"SetDefault@Action (uint32 3,)", "Add@Rule ('1234', uint32 3)",
                                  "Add@Rule ('111', uint32 3)", "Set@Rules ([('1', uint32 1), ('2', 3)],)"})
                 : QStringList());
    QCOMPARE(log.takeWarnings(), QStringList());
}

void RuleChannelTest::refusedRequestsSendNothing()
{
    QFETCH(TestedChannel, channel);
    setServiceRules(channel, {rule("111", SimFilter::Allow), rule("123", SimFilter::Block)},
                    SimFilter::Block);
    const auto filter = readyFilter(channel);
    SignalSequence seen(filter->object());
    MessageLog log;
    const QString tooLong = QStringLiteral("2440512345678901");

    QVERIFY(!filter->setDefaultAction(SimFilter::Block));
    QVERIFY(!filter->setDefaultAction(SimFilter::Ignore));

    QVERIFY(!filter->setRule(Rule(tooLong, SimFilter::Block)));
    QVERIFY(!filter->setRule(rule("12a", SimFilter::Block)));
    QVERIFY(!filter->setRule(rule("111", SimFilter::Allow)));
    QVERIFY(!filter->setRule(rule("123", SimFilter::Ignore)));
    QVERIFY(!filter->setRule(rule("1", SimFilter::Action(0))));
    QVERIFY(!filter->setRule(rule("1", SimFilter::Action(4))));

    QVERIFY(!filter->setRules({rule("111", SimFilter::Allow), rule("123", SimFilter::Block)}));
    QVERIFY(!filter->setRules({rule("1", SimFilter::Block), Rule(tooLong, SimFilter::Block)}));
    QVERIFY(!filter->setRules({rule("12a", SimFilter::Block), rule("1", SimFilter::Block)}));
    QVERIFY(!filter->setRules({rule("1", SimFilter::Action(0))}));

    QVERIFY(!filter->removeRule(QStringLiteral("12")));
    QVERIFY(!filter->removeRule(tooLong));
    QVERIFY(!filter->removeRule(QString()));
    m_phone->settle(Service);
    QCOMPARE(takeCalls(channel), QStringList());
    QCOMPARE(seen.take(), QStringList());

    setServiceRules(channel, {}, SimFilter::Allow);
    m_phone->settle(Service);
    m_phone->takeJournal(Service);
    QCOMPARE(filter->rules(), RuleList());
    QVERIFY(!filter->clearRules());
    QVERIFY(!filter->setRules({}));
    QVERIFY(!filter->setDefaultAction(SimFilter::Allow));
    m_phone->settle(Service);
    QCOMPARE(takeCalls(channel), QStringList());
    QCOMPARE(log.takeWarnings(), QStringList());
}

void RuleChannelTest::requestWithAnInvalidDefaultAction()
{
    QFETCH(TestedChannel, channel);
    const auto filter = readyFilter(channel);
    m_phone->swallowCalls(Service, channel.path(), QString());
    MessageLog log;
    QVERIFY(filter->setDefaultAction(SimFilter::Action(9)));
    QCOMPARE(log.takeWarnings(), texts({"actionToInt() given invalid action: "}));
    m_phone->settle(Service);
    QCOMPARE(takeCalls(channel), channel.calls({"SetDefault@Action (uint32 1,)"}));
}

void RuleChannelTest::requestsChangeNothingUntilTheServiceSaysSo()
{
    QFETCH(TestedChannel, channel);
    const auto filter = readyFilter(channel);
    SignalSequence seen(filter->object());
    QVERIFY(filter->setRule(rule("1", SimFilter::Allow)));
    QVERIFY(filter->setDefaultAction(SimFilter::Allow));
    QCOMPARE(filter->rules(), RuleList());
    QCOMPARE(filter->defaultAction(), SimFilter::Block);
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(seen.waitFor(4));
    QCOMPARE(seen.take(),
             channel.sequence({"changed [], [1:allow]", "added 1:allow", "added 1:allow", "default"}));
}

void RuleChannelTest::ruleWithAnotherActionIsSent()
{
    QFETCH(TestedChannel, channel);
    setServiceRules(channel, {rule("1", SimFilter::Block), rule("2", SimFilter::Block)}, SimFilter::Block);
    const auto filter = readyFilter(channel);
    SignalSequence seen(filter->object());
    QVERIFY(filter->setRule(rule("2", SimFilter::Allow)));
    QVERIFY(seen.waitFor(2));
    m_phone->settle(Service);
    QCOMPARE(seen.take(),
             channel.sequence({"changed [1:block 2:block], [1:block 2:allow]", "added 2:allow"}));
}

void RuleChannelTest::requestsReachTheService()
{
    QFETCH(TestedChannel, channel);
    const auto filter = readyFilter(channel);
    SignalSequence seen(filter->object());
    QVERIFY(filter->setRules({rule("1", SimFilter::Block), rule("2", SimFilter::Allow)}));
    QVERIFY(seen.waitFor(3));
    QCOMPARE(seen.take(),
             channel.sequence({"changed [], [1:block 2:allow]", "added 1:block", "added 2:allow"}));
    QVERIFY(filter->removeRule(QStringLiteral("1")));
    QVERIFY(seen.waitFor(3));
    QCOMPARE(seen.take(),
             channel.sequence({"changed [1:block 2:allow], [2:allow]", "removed 1", "removed 1"}));
    QVERIFY(filter->clearRules());
    QVERIFY(seen.waitFor(2));
    m_phone->settle(Service);
    QCOMPARE(seen.take(), channel.sequence({"changed [2:allow], []", "removed 2"}));
}

void RuleChannelTest::failedRequestIsLogged()
{
    QFETCH(TestedChannel, channel);
    const auto filter = readyFilter(channel);
    SignalSequence seen(filter->object());
    m_phone->failCalls(Service, channel.path(), QString(), QStringLiteral("org.ofono.Error.AccessDenied"),
                       QStringLiteral("Operation not permitted"));
    MessageLog log;
    QVERIFY(filter->setRule(rule("1", SimFilter::Allow)));
    QVERIFY(filter->setDefaultAction(SimFilter::Allow));
    m_phone->settle(Service);
    const QString warning
        = QStringLiteral("Method call failed: \"org.ofono.Error.AccessDenied\" \"Operation not permitted\"");
    QCOMPARE(log.takeWarnings(), QStringList({warning, warning}));
    QCOMPARE(seen.take(), QStringList());
    QCOMPARE(filter->rules(), RuleList());
    QCOMPARE(filter->defaultAction(), SimFilter::Block);
}

void RuleChannelTest::serviceThatIsNotThere()
{
    QFETCH(TestedChannel, channel);
    m_phone->stopService(Service);
    MessageLog log;
    const auto filter = channel.make();
    SignalSequence seen(filter->object());
    QCOMPARE(log.takeWarnings(), texts({channel.names.absentService}));
    const auto everyRequestIsRefused = [&] {
        return !filter->setDefaultAction(SimFilter::Allow) && !filter->setRule(rule("1", SimFilter::Block))
            && !filter->setRules({rule("1", SimFilter::Block)}) && !filter->removeRule(QStringLiteral("1"))
            && !filter->clearRules();
    };
    QVERIFY(everyRequestIsRefused());

    // It stays so when the service appears.
    m_phone->startService(Service);
    emitFrom(channel, "@RuleAdded", {0U, wire("1", 1)});
    emitFrom(channel, "Default@ActionChanged", {2U});
    QVERIFY(everyRequestIsRefused());
    m_phone->settle(Service);
    QCOMPARE(m_phone->takeJournal(Service), QStringList());
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(!filter->ready());
    QCOMPARE(filter->rules(), RuleList());
    QCOMPARE(filter->defaultAction(), SimFilter::Block);
    QCOMPARE(log.takeWarnings(), QStringList());
}

void RuleChannelTest::serviceThatGoesAndComesBack()
{
    QFETCH(TestedChannel, channel);
    setServiceRules(channel, {rule("1", SimFilter::Allow)}, SimFilter::Allow);
    const auto filter = readyFilter(channel);
    SignalSequence seen(filter->object());
    m_phone->stopService(Service);
    {
        MessageLog log;
        QVERIFY(filter->setRule(rule("2", SimFilter::Allow)));
        QStringList warnings;
        QVERIFY(waitUntil([&] { return !(warnings += log.takeWarnings()).isEmpty(); }));
        QCOMPARE(warnings.size(), 1);
        QVERIFY2(warnings.first().startsWith(
                     QLatin1String("Method call failed: \"org.freedesktop.DBus.Error.ServiceUnknown\" \"")),
                 qPrintable(warnings.first()));
    }
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(filter->ready());
    QCOMPARE(filter->rules(), RuleList({rule("1", SimFilter::Allow)}));

    m_phone->startService(Service);
    QVERIFY(filter->setRule(rule("2", SimFilter::Allow)));
    QVERIFY(seen.waitFor(3));
    QCOMPARE(seen.take(),
             channel.sequence({"changed [1:allow], [1:allow 2:allow]", "added 2:allow", "added 2:allow"}));
    emitFrom(channel, "Default@ActionChanged", {3U});
    QCOMPARE(seen.take(), channel.sequence({"default"}));
}

void RuleChannelTest::twoFiltersSideBySide()
{
    QFETCH(TestedChannel, channel);
    auto first = readyFilter(channel);
    const auto second = readyFilter(channel);
    SignalSequence firstSeen(first->object());
    SignalSequence secondSeen(second->object());
    QVERIFY(first->setRule(rule("1", SimFilter::Allow)));
    QVERIFY(firstSeen.waitFor(3));
    QVERIFY(secondSeen.waitFor(3));
    QCOMPARE(firstSeen.take(), secondSeen.take());
    QCOMPARE(takeCalls(channel), channel.calls({"Add@Rule ('1', uint32 2)"}));

    first.reset();
    QVERIFY(second->clearRules());
    QVERIFY(secondSeen.waitFor(2));
    QCOMPARE(secondSeen.take(), channel.sequence({"changed [1:allow], []", "removed 1"}));
}

void RuleChannelTest::destructionWithCallsPending()
{
    QFETCH(TestedChannel, channel);
    m_phone->delayCalls(Service, QString(), QString(), 20);
    MessageLog log;
    {
        // "GetAll" in flight.
        const auto filter = channel.make();
    }
    {
        const auto filter = channel.make();
        QVERIFY(waitUntil([&] { return filter->ready(); }));
        QVERIFY(filter->setRule(rule("1", SimFilter::Allow)));
        QVERIFY(filter->setDefaultAction(SimFilter::Allow));
    }
    m_phone->settle(Service);
    QCOMPARE(log.takeWarnings(), QStringList());
}

void RuleChannelTest::deletionInASlot_data()
{
    QTest::addColumn<TestedChannel>("channel");
    QTest::addColumn<int>("survivedSignals");
    // The service's answer causes five signals, its announcements of one rule more and of one less three
    // each.
    for (const TestedChannel &channel : m_channels) {
        for (int signal = 0; signal < 11; ++signal)
            QTest::addRow("%s, signal %d", channel.names.path, signal) << channel << signal;
    }
}

void RuleChannelTest::deletionInASlot()
{
    QFETCH(TestedChannel, channel);
    QFETCH(int, survivedSignals);
    setServiceRules(channel, {rule("1", SimFilter::Allow), rule("2", SimFilter::Allow)}, SimFilter::Allow);
    auto filter = channel.make();
    int signalsSeen = 0;
    const SignalWitness witness(filter->object(), [&] {
        if (signalsSeen++ == survivedSignals)
            filter.reset();
    });
    QVERIFY(waitUntil([&] { return !filter || filter->ready(); }));
    emitFrom(channel, "@RuleAdded", {0U, wire("3", 1)});
    emitFrom(channel, "@RuleRemoved", {0U});
    QVERIFY(!filter);
    m_phone->settle(Service);
    QCOMPARE(signalsSeen, survivedSignals + 1);
}

void RuleChannelTest::propertiesThroughTheMetaObject()
{
    QFETCH(TestedChannel, channel);
    setServiceRules(channel, {rule("1", SimFilter::Allow)}, SimFilter::Allow);
    const auto filter = readyFilter(channel);
    QObject *object = filter->object();
    SignalSequence seen(object);
    QCOMPARE(object->property("ready").toBool(), true);
    QCOMPARE(object->property(channel.names.rulesProperty).value<RuleList>(),
             RuleList({rule("1", SimFilter::Allow)}));
    QCOMPARE(object->property(channel.names.defaultProperty).value<SimFilter::Action>(), SimFilter::Allow);

    QVERIFY(object->setProperty(channel.names.rulesProperty,
                                QVariant::fromValue(RuleList({rule("2", SimFilter::Block)}))));
    QVERIFY(seen.waitFor(3));
    // As QML does, by the enumerator's number or name.
    QVERIFY(object->setProperty(channel.names.defaultProperty, int(SimFilter::Block)));
    QVERIFY(seen.waitFor(4));
    QVERIFY(object->setProperty(channel.names.defaultProperty, QStringLiteral("Allow")));
    QVERIFY(seen.waitFor(5));
    m_phone->settle(Service);
    QCOMPARE(seen.take(),
             channel.sequence(
                 {"changed [1:allow], [2:block]", "added 2:block", "removed 1", "default", "default"}));

    const QMetaObject *metaObject = object->metaObject();
    const auto property = [&](const char *name) {
        return metaObject->property(metaObject->indexOfProperty(name));
    };
    for (const char *name : {"ready", channel.names.defaultProperty, channel.names.rulesProperty}) {
        QCOMPARE(QString::fromLatin1(property(name).notifySignal().name()),
                 QLatin1String(name) + QLatin1String("Changed"));
        QVERIFY2(property(name).userType() != QMetaType::UnknownType, name);
        QCOMPARE(property(name).isWritable(), qstrcmp(name, "ready") != 0);
    }
}

void RuleChannelTest::signalsReachQueuedAndNamedConnections()
{
    QFETCH(TestedChannel, channel);
    const auto filter = readyFilter(channel);
    QObject *object = filter->object();
    // By name, as SIGNAL() spells it.
    const auto spelled = [&](const char *event, const char *arguments) {
        return QByteArray("2") + channel.signal(event).toLatin1() + arguments;
    };
    QSignalSpy rulesChanged(object, spelled("RulesChanged", "(SimFilter::RuleList,SimFilter::RuleList)"));
    QSignalSpy ruleAdded(object, spelled("RuleAdded", "(SimFilter::Rule)"));
    QVERIFY(rulesChanged.isValid());
    QVERIFY(ruleAdded.isValid());
    int queued = 0;
    const SignalWitness witness(
        object, [&queued] { ++queued; }, Qt::QueuedConnection);
    QVERIFY(filter->setRule(rule("1", SimFilter::Allow)));
    QVERIFY(waitUntil([&] { return queued == 3; }));
    QCOMPARE(rulesChanged.size(), 1);
    QCOMPARE(rulesChanged.first().at(1).value<RuleList>(), RuleList({rule("1", SimFilter::Allow)}));
    QCOMPARE(ruleAdded.size(), 2);
    QCOMPARE(ruleAdded.first().first().value<Rule>(), rule("1", SimFilter::Allow));
}

#include "rulechanneltest.moc"
