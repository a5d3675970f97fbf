// SPDX-License-Identifier: LGPL-2.1-or-later
#include "callfilter.h"
#include "callrules.h"
#include "commands.h"
#include "exitstatus.h"
#include "output.h"
#include "service.h"
#include "suggestion.h"
#include "table.h"
#include "wait.h"

#include <QtCore/QJsonObject>
#include <QtCore/QRegularExpression>

namespace Corvane
{
namespace Agent
{

using Mdm::SimFilter;

namespace
{

constexpr QLatin1String directionArgument("DIR");
constexpr QLatin1String imsiArgument("IMSI");
constexpr QLatin1String actionArgument("ACTION");
constexpr QLatin1String ruleArgument("IMSI=ACTION");

CallDirection directionOf(const Values &values)
{
    return directionNamed(values.first(directionArgument));
}

QString imsiFault(const QString &imsi)
{
    static const QRegularExpression wellFormed(QStringLiteral("\\A[0-9]{1,15}\\z"));
    return wellFormed.match(imsi).hasMatch() ? QString() : QStringLiteral("must be 1 to 15 decimal digits");
}

QString ruleFault(const QString &rule)
{
    const int equals = rule.indexOf(QLatin1Char('='));
    if (equals < 0)
        return QStringLiteral("must be an IMSI, \"=\" and an action, as in 244051234567890=block");
    const QString fault = imsiFault(rule.left(equals));
    const QString action = rule.mid(equals + 1);
    if (!fault.isEmpty() || actionNamed(CallDirection::Incoming, action))
        return fault.isEmpty() ? fault : QStringLiteral("the IMSI %1").arg(fault);
    return QStringLiteral("unknown action \"%1\": %2")
        .arg(action, suggestion(action, actionNames(CallDirection::Incoming)));
}

/** @return false, and tells so, for an action that the direction does not have. */
bool fitsDirection(CallDirection direction, const QString &action)
{
    if (actionNamed(direction, action))
        return true;
    printError(QStringLiteral("ACTION \"%1\" is for incoming calls alone: %2")
                   .arg(action, suggestion(action, actionNames(direction))));
    return false;
}

QJsonObject directionJson(const CallFilter &filter, CallDirection direction)
{
    return {{QStringLiteral("default"), actionName(filter.defaultAction(direction))},
            {QStringLiteral("rules"), rulesToJson(filter.rules(direction))}};
}

void addRow(Table *table, const CallFilter &filter, CallDirection direction)
{
    QStringList imsis;
    QStringList ruleActions;
    const SimFilter::RuleList rules = filter.rules(direction);
    for (const SimFilter::Rule &rule : rules) {
        imsis.append(rule.imsi);
        ruleActions.append(actionName(rule.action));
    }
    const QChar newLine = QLatin1Char('\n');
    table->addRow({directionName(direction), actionName(filter.defaultAction(direction)),
                   imsis.isEmpty() ? QStringLiteral("no rules") : imsis.join(newLine),
                   ruleActions.join(newLine)});
}

Table rulesTable()
{
    return Table({QStringLiteral("DIRECTION"), QStringLiteral("DEFAULT"), QStringLiteral("IMSI"),
                  QStringLiteral("ACTION")});
}

int runShow(CallFilter &filter, const Values &values)
{
    Table table = rulesTable();
    QJsonObject json;
    for (const CallDirection direction : allCallDirections) {
        addRow(&table, filter, direction);
        json.insert(directionName(direction), directionJson(filter, direction));
    }
    if (wantsJson(values))
        print(json);
    else
        print(table.toString());
    return ExitDone;
}

/** Makes a change and prints what now holds. */
int runChange(CallFilter &filter, const Values &values, const std::function<Reply()> &change)
{
    const CallDirection direction = directionOf(values);
    const QJsonObject before = directionJson(filter, direction);
    const Reply reply = change();
    if (!reply.isDone())
        return conclude(reply);

    QJsonObject now = directionJson(filter, direction);
    const bool changed = now != before;
    if (wantsJson(values)) {
        now.insert(QStringLiteral("changed"), changed);
        now.insert(QStringLiteral("direction"), directionName(direction));
        print(now);
        return ExitDone;
    }
    if (!changed)
        print(QStringLiteral("Already so, nothing to change."));
    Table table = rulesTable();
    addRow(&table, filter, direction);
    print(table.toString());
    return ExitDone;
}

int runAdd(CallFilter &filter, const Values &values)
{
    const CallDirection direction = directionOf(values);
    const auto action = actionNamed(direction, values.first(actionArgument));
    return runChange(filter, values, [&] {
        return filter.setRule(direction, {values.first(imsiArgument), *action});
    });
}

int runRemove(CallFilter &filter, const Values &values)
{
    const CallDirection direction = directionOf(values);
    const QString imsi = values.first(imsiArgument);
    return runChange(filter, values, [&]() -> Reply {
        if (!filter.hasRule(direction, imsi)) {
            return {Reply::Refused,
                    QStringLiteral("no %1 rule for %2 to remove").arg(directionName(direction), imsi)};
        }
        return filter.removeRule(direction, imsi);
    });
}

SimFilter::RuleList rulesOf(const Values &values)
{
    SimFilter::RuleList rules;
    const QStringList texts = values.all(ruleArgument);
    for (const QString &text : texts) {
        const QString action = text.section(QLatin1Char('='), 1);
        rules.append({text.section(QLatin1Char('='), 0, 0),
                      actionNamed(CallDirection::Incoming, action).value_or(SimFilter::Block)});
    }
    return rules;
}

int runSet(CallFilter &filter, const Values &values)
{
    return runChange(filter, values, [&] { return filter.setRules(directionOf(values), rulesOf(values)); });
}

int runClear(CallFilter &filter, const Values &values)
{
    return runChange(filter, values, [&] { return filter.clearRules(directionOf(values)); });
}

int runDefault(CallFilter &filter, const Values &values)
{
    const CallDirection direction = directionOf(values);
    const auto action = actionNamed(direction, values.first(actionArgument));
    return runChange(filter, values, [&] { return filter.setDefaultAction(direction, *action); });
}

void logRule(const EventLog &log, const QString &event, CallDirection direction, const SimFilter::Rule &rule)
{
    static const QMap<QString, QString> sentences{
        {QStringLiteral("ruleAdded"), QStringLiteral("%1: rule added: %2")},
        {QStringLiteral("ruleChanged"), QStringLiteral("%1: rule changed: %2")},
        {QStringLiteral("ruleRemoved"), QStringLiteral("%1: rule removed: %2")},
    };
    log.write(sentences.value(event).arg(directionName(direction), ruleText(rule)),
              {{QStringLiteral("event"), event},
               {QStringLiteral("direction"), directionName(direction)},
               {QStringLiteral("imsi"), rule.imsi},
               {QStringLiteral("action"), actionName(rule.action)}});
}

void logRules(const EventLog &log, CallDirection direction, const SimFilter::RuleList &oldRules,
              const SimFilter::RuleList &newRules)
{
    const RuleDifference difference(oldRules, newRules);
    for (const SimFilter::Rule &rule : difference.removed)
        logRule(log, QStringLiteral("ruleRemoved"), direction, rule);
    for (const SimFilter::Rule &rule : difference.changed)
        logRule(log, QStringLiteral("ruleChanged"), direction, rule);
    for (const SimFilter::Rule &rule : difference.added)
        logRule(log, QStringLiteral("ruleAdded"), direction, rule);
    if (difference.isEmpty()) {
        log.write(directionName(direction) + QLatin1String(": order of the rules changed"),
                  {{QStringLiteral("event"), QStringLiteral("rulesReordered")},
                   {QStringLiteral("direction"), directionName(direction)}});
    }
}

void logDefault(const EventLog &log, CallDirection direction, SimFilter::Action action)
{
    log.write(QStringLiteral("%1: default changed to %2").arg(directionName(direction), actionName(action)),
              {{QStringLiteral("event"), QStringLiteral("defaultChanged")},
               {QStringLiteral("direction"), directionName(direction)},
               {QStringLiteral("action"), actionName(action)}});
}

int runWatch(CallFilter &filter, const Values &values)
{
    const EventLog log(wantsJson(values));
    Wait wait(Service::telephony(), Wait::Forever, QString());
    QObject::connect(
        &filter, &CallFilter::rulesChanged, &wait,
        [&](CallDirection direction, const SimFilter::RuleList &oldRules,
            const SimFilter::RuleList &newRules) { logRules(log, direction, oldRules, newRules); });
    QObject::connect(&filter, &CallFilter::defaultActionChanged, &wait, [&](CallDirection direction) {
        logDefault(log, direction, filter.defaultAction(direction));
    });
    log.write(QStringLiteral("Watching the rules for calls."),
              {{QStringLiteral("event"), QStringLiteral("watching")}});
    return concludeWatch(wait.run());
}

/** What the check of each value by itself does not find; tells it, and returns false. */
bool areConsistent(const Values &values)
{
    const CallDirection direction = directionOf(values);
    if (values.has(actionArgument) && !fitsDirection(direction, values.first(actionArgument)))
        return false;
    const SimFilter::RuleList rules = rulesOf(values);
    for (const SimFilter::Rule &rule : rules) {
        if (!fitsDirection(direction, actionName(rule.action)))
            return false;
    }
    const int repeated = repeatedRule(rules);
    if (repeated >= 0)
        printError(QStringLiteral("IMSI %1 must be named once").arg(rules.at(repeated).imsi));
    return repeated < 0;
}

Command command(const QString &name, const QString &summary, const QVector<Argument> &arguments,
                int (*run)(CallFilter &, const Values &))
{
    Command command;
    command.name = name;
    command.summary = summary;
    command.arguments = arguments;
    command.options = {jsonOption(),
                       timeoutOption(QStringLiteral(
                           "Give up when the phone has not answered after so many seconds (default: 25)"))};
    command.run = [run](const Values &values) -> int {
        if (!areConsistent(values))
            return ExitUsage;
        const Reply running = Service::telephony().ensureRunning();
        if (!running.isDone())
            return conclude(running);
        CallFilter filter(timeoutsOf(values).confirmation);
        const Reply opened = filter.open();
        return opened.isDone() ? run(filter, values) : conclude(opened);
    };
    return command;
}

constexpr QLatin1String changeJson(
    "JSON, after the change: {\"changed\": true, \"direction\": \"dial\", \"default\": \"allow\",\n"
    "\"rules\": [{\"imsi\": \"244051234567890\", \"action\": \"block\"}]}");

} // namespace

Command callsCommand()
{
    const Argument direction{
        directionArgument, QStringLiteral("Direction of the calls: dial or incoming"), directionNames(), {}};
    const Argument imsi{
        imsiArgument, QStringLiteral("Subscriber identity of the SIM, up to 15 digits"), {}, imsiFault};
    const Argument action{
        actionArgument,
        QStringLiteral("What happens to the calls: block, allow, or hangup (incoming alone)"),
        actionNames(CallDirection::Incoming),
        {}};
    const Argument rules{ruleArgument,
                         QStringLiteral("A rule, such as 244051234567890=block"),
                         {},
                         ruleFault,
                         Argument::Word,
                         Argument::Several};

    Command show = command(QStringLiteral("show"),
                           QStringLiteral("Show the rules and defaults of both directions"), {}, runShow);
    show.description
        = QStringLiteral("JSON: {\"dial\": {\"default\": \"allow\", \"rules\": [{\"imsi\": "
                         "\"244051234567890\",\n\"action\": \"block\"}]}, \"incoming\": {...}}, as "
                         "\"calls\" in a policy.");

    Command add = command(QStringLiteral("add"),
                          QStringLiteral("Add a rule, or change the action of the one there is"),
                          {direction, imsi, action}, runAdd);
    add.description
        = QStringLiteral("Waits until the phone confirms the rule and prints what then holds. A rule that "
                         "is\nthere already is left as it is, with exit status 0.\n\n"
                         "Examples:\n"
                         "  mdmctl calls add dial 244051234567890 block\n"
                         "  mdmctl calls add incoming 244051234567890 hangup\n\n")
        + changeJson;

    Command remove = command(QStringLiteral("remove"), QStringLiteral("Remove the rule of a SIM"),
                             {direction, imsi}, runRemove);
    remove.description = QStringLiteral("A rule that is not there cannot be removed: exit status 1.\n\n"
                                        "Example:\n"
                                        "  mdmctl calls remove dial 244051234567890\n\n")
        + changeJson;

    Command set = command(QStringLiteral("set"), QStringLiteral("Replace all rules of a direction"),
                          {direction, rules}, runSet);
    set.description
        = QStringLiteral("Example:\n"
                         "  mdmctl calls set dial 244051234567890=block 262021234567891=allow\n\n")
        + changeJson;

    Command clear = command(QStringLiteral("clear"), QStringLiteral("Remove all rules of a direction"),
                            {direction}, runClear);
    clear.description = QStringLiteral("Example:\n  mdmctl calls clear incoming\n\n") + changeJson;

    Command defaultAction = command(QStringLiteral("default"),
                                    QStringLiteral("Set what happens to calls of SIMs without a rule"),
                                    {direction, action}, runDefault);
    defaultAction.description
        = QStringLiteral("Example:\n  mdmctl calls default incoming block\n\n") + changeJson;

    Command watch = command(QStringLiteral("watch"), QStringLiteral("Follow changes of rules and defaults"),
                            {}, runWatch);
    watch.description = QStringLiteral(
        "Prints one line a change until it is interrupted (Ctrl-C, exit status 0).\n\n"
        "JSON: one object a line with \"time\", \"event\", \"direction\" and, by event,\n"
        "  ruleAdded, ruleChanged, ruleRemoved  \"imsi\", \"action\" (of a removed rule: the one it had)\n"
        "  defaultChanged                       \"action\"\n"
        "  rulesReordered\n"
        "and {\"event\": \"watching\"} at the start.");

    Command calls;
    calls.name = QStringLiteral("calls");
    calls.summary = QStringLiteral("Rule which SIMs may make and take calls");
    calls.description
        = QStringLiteral("A rule is the IMSI of a SIM and what happens to its calls; the default is "
                         "for SIMs without\na rule. Outgoing (dial) and incoming calls have rules of "
                         "their own.");
    calls.commands = {show, add, remove, set, clear, defaultAction, watch};
    return calls;
}

} // namespace Agent
} // namespace Corvane
