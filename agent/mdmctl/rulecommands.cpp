// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commands.h"
#include "exitstatus.h"
#include "output.h"
#include "rulefilter.h"
#include "service.h"
#include "simrules.h"
#include "suggestion.h"
#include "table.h"
#include "wait.h"

#include <QtCore/QJsonObject>

namespace Corvane
{
namespace Agent
{

using Mdm::SimFilter;

namespace
{

const QLatin1String directionArgument("DIR");
const QLatin1String actionArgument("ACTION");
const QLatin1String ruleArgument("IMSI=ACTION");

// Of the examples.
const QString noRules = QStringLiteral("[]");
const QString someRules = QStringLiteral(R"([{"imsi": "244051234567890", "action": "block"}])");

Traffic trafficOf(const RuleFamily &family, const Values &values)
{
    return family.trafficNamed(values.first(directionArgument));
}

QString ruleFault(const RuleFamily &family, const QString &rule)
{
    const int equals = rule.indexOf(QLatin1Char('='));
    if (equals < 0)
        return QStringLiteral("must be an IMSI, \"=\" and an action, as in 244051234567890=block");
    const QString fault = imsiFault(rule.left(equals));
    if (!fault.isEmpty())
        return QStringLiteral("the IMSI %1").arg(fault);
    const QString action = rule.mid(equals + 1);
    if (family.actionNames().contains(action))
        return QString();
    return QStringLiteral("unknown action \"%1\": %2").arg(action, suggestion(action, family.actionNames()));
}

/** @return false, and tells so, for an action that the family has for other traffic. */
bool fitsTraffic(Traffic traffic, const QString &action)
{
    if (actionNamed(traffic, action))
        return true;
    printError(QStringLiteral("ACTION \"%1\" is for incoming calls alone: %2")
                   .arg(action, suggestion(action, actionNames(traffic))));
    return false;
}

/** @p json with the direction, where there are several. */
QJsonObject withDirection(Traffic traffic, QJsonObject json)
{
    if (!directionName(traffic).isEmpty())
        json.insert(QStringLiteral("direction"), directionName(traffic));
    return json;
}

QJsonObject trafficJson(const RuleFilter &filter, Traffic traffic)
{
    return {{QStringLiteral("default"), actionName(filter.defaultAction(traffic))},
            {QStringLiteral("rules"), rulesToJson(filter.rules(traffic))}};
}

void addRow(Table *table, const RuleFilter &filter, Traffic traffic)
{
    QStringList imsis;
    QStringList ruleActions;
    const SimFilter::RuleList rules = filter.rules(traffic);
    for (const SimFilter::Rule &rule : rules) {
        imsis.append(rule.imsi);
        ruleActions.append(actionName(rule.action));
    }
    const QChar newLine = QLatin1Char('\n');
    table->addRow({directionName(traffic), actionName(filter.defaultAction(traffic)),
                   imsis.isEmpty() ? QStringLiteral("no rules") : imsis.join(newLine),
                   ruleActions.join(newLine)});
}

Table rulesTable()
{
    return Table({QStringLiteral("DIRECTION"), QStringLiteral("DEFAULT"), QStringLiteral("IMSI"),
                  QStringLiteral("ACTION")});
}

int runShow(RuleFilter &filter, const Values &values)
{
    const RuleFamily family = filter.family();
    Table table = rulesTable();
    QJsonObject json;
    for (const Traffic traffic : family.traffic) {
        addRow(&table, filter, traffic);
        if (family.hasDirections())
            json.insert(directionName(traffic), trafficJson(filter, traffic));
        else
            json = trafficJson(filter, traffic);
    }
    if (wantsJson(values))
        print(json);
    else
        print(table.toString());
    return ExitDone;
}

/** Makes a change and prints what now holds. */
int runChange(RuleFilter &filter, const Values &values, const std::function<Reply()> &change)
{
    const Traffic traffic = trafficOf(filter.family(), values);
    const QJsonObject before = trafficJson(filter, traffic);
    const Reply reply = change();
    if (!reply.isDone())
        return conclude(reply);

    QJsonObject now = trafficJson(filter, traffic);
    const bool changed = now != before;
    if (wantsJson(values)) {
        now.insert(QStringLiteral("changed"), changed);
        print(withDirection(traffic, now));
        return ExitDone;
    }
    Table table = rulesTable();
    addRow(&table, filter, traffic);
    print(unchangedNote(changed) + table.toString());
    return ExitDone;
}

int runAdd(RuleFilter &filter, const Values &values)
{
    const Traffic traffic = trafficOf(filter.family(), values);
    const auto action = actionNamed(traffic, values.first(actionArgument));
    return runChange(filter, values, [&] {
        return filter.setRule(traffic, {values.first(imsiName()), *action});
    });
}

int runRemove(RuleFilter &filter, const Values &values)
{
    const Traffic traffic = trafficOf(filter.family(), values);
    const QString imsi = values.first(imsiName());
    return runChange(filter, values, [&]() -> Reply {
        if (!filter.hasRule(traffic, imsi)) {
            const QStringList words{QStringLiteral("no"), directionName(traffic), QStringLiteral("rule for"),
                                    imsi, QStringLiteral("to remove")};
            return {Reply::Refused, words.join(QLatin1Char(' ')).simplified()};
        }
        return filter.removeRule(traffic, imsi);
    });
}

SimFilter::RuleList rulesOf(const Values &values)
{
    SimFilter::RuleList rules;
    const QStringList texts = values.all(ruleArgument);
    for (const QString &text : texts) {
        const QString action = text.section(QLatin1Char('='), 1);
        rules.append({text.section(QLatin1Char('='), 0, 0), actionNamed(action).value_or(SimFilter::Block)});
    }
    return rules;
}

int runSet(RuleFilter &filter, const Values &values)
{
    const Traffic traffic = trafficOf(filter.family(), values);
    return runChange(filter, values, [&] { return filter.setRules(traffic, rulesOf(values)); });
}

int runClear(RuleFilter &filter, const Values &values)
{
    const Traffic traffic = trafficOf(filter.family(), values);
    return runChange(filter, values, [&] { return filter.clearRules(traffic); });
}

int runDefault(RuleFilter &filter, const Values &values)
{
    const Traffic traffic = trafficOf(filter.family(), values);
    const auto action = actionNamed(traffic, values.first(actionArgument));
    return runChange(filter, values, [&] { return filter.setDefaultAction(traffic, *action); });
}

void logEvent(const EventLog &log, Traffic traffic, const QString &sentence, const QJsonObject &members)
{
    const QString direction = directionName(traffic);
    log.write(direction.isEmpty() ? sentence : direction + QLatin1String(": ") + sentence,
              withDirection(traffic, members));
}

void logRule(const EventLog &log, const QString &event, Traffic traffic, const SimFilter::Rule &rule)
{
    static const QMap<QString, QString> sentences{
        {QStringLiteral("ruleAdded"), QStringLiteral("rule added: %1")},
        {QStringLiteral("ruleChanged"), QStringLiteral("rule changed: %1")},
        {QStringLiteral("ruleRemoved"), QStringLiteral("rule removed: %1")},
    };
    logEvent(log, traffic, sentences.value(event).arg(ruleText(rule)),
             {{QStringLiteral("event"), event},
              {QStringLiteral("imsi"), rule.imsi},
              {QStringLiteral("action"), actionName(rule.action)}});
}

void logRules(const EventLog &log, Traffic traffic, const SimFilter::RuleList &oldRules,
              const SimFilter::RuleList &newRules)
{
    const RuleDifference difference(oldRules, newRules);
    for (const SimFilter::Rule &rule : difference.removed)
        logRule(log, QStringLiteral("ruleRemoved"), traffic, rule);
    for (const SimFilter::Rule &rule : difference.changed)
        logRule(log, QStringLiteral("ruleChanged"), traffic, rule);
    for (const SimFilter::Rule &rule : difference.added)
        logRule(log, QStringLiteral("ruleAdded"), traffic, rule);
    if (difference.isEmpty()) {
        logEvent(log, traffic, QStringLiteral("order of the rules changed"),
                 {{QStringLiteral("event"), QStringLiteral("rulesReordered")}});
    }
}

void logDefault(const EventLog &log, Traffic traffic, SimFilter::Action action)
{
    logEvent(log, traffic, QStringLiteral("default changed to %1").arg(actionName(action)),
             {{QStringLiteral("event"), QStringLiteral("defaultChanged")},
              {QStringLiteral("action"), actionName(action)}});
}

int runWatch(RuleFilter &filter, const Values &values)
{
    const EventLog log(wantsJson(values));
    Wait wait(Service::telephony(), Wait::Forever, QString());
    QObject::connect(
        &filter, &RuleFilter::rulesChanged, &wait,
        [&](Traffic traffic, const SimFilter::RuleList &oldRules, const SimFilter::RuleList &newRules) {
            logRules(log, traffic, oldRules, newRules);
        });
    QObject::connect(&filter, &RuleFilter::defaultActionChanged, &wait,
                     [&](Traffic traffic) { logDefault(log, traffic, filter.defaultAction(traffic)); });
    log.write(QStringLiteral("Watching the rules for %1.").arg(filter.family().subject),
              {{QStringLiteral("event"), QStringLiteral("watching")}});
    return concludeWatch(wait.run());
}

/** What the check of each value by itself does not find; tells it, and returns false. */
bool areConsistent(const RuleFamily &family, const Values &values)
{
    const Traffic traffic = trafficOf(family, values);
    if (values.has(actionArgument) && !fitsTraffic(traffic, values.first(actionArgument)))
        return false;
    const SimFilter::RuleList rules = rulesOf(values);
    for (const SimFilter::Rule &rule : rules) {
        if (!fitsTraffic(traffic, actionName(rule.action)))
            return false;
    }
    const int repeated = repeatedRule(rules);
    if (repeated >= 0)
        printError(QStringLiteral("IMSI %1 must be named once").arg(rules.at(repeated).imsi));
    return repeated < 0;
}

/** Makes the commands of one family; they differ in words alone. */
class FamilyCommands
{
public:
    explicit FamilyCommands(const RuleFamily &family);

    QVector<Command> all() const;

private:
    using Run = int (*)(RuleFilter &, const Values &);

    Command command(const QString &name, const QString &summary, Run run) const;
    /** One that changes something, after the arguments that tell the traffic. */
    Command change(const QString &name, const QString &summary, const QVector<Argument> &arguments,
                   Run run) const;
    /** The lines of help that show @p commands, each given from its name on, with "DIR" for a direction. */
    QString examples(const QStringList &commands, const QString &rules = someRules) const;
    QString oneOf(const QString &several) const;

    Command show() const;
    Command add() const;
    Command remove() const;
    Command set() const;
    Command clear() const;
    Command setDefault() const;
    Command watch() const;

    const RuleFamily m_family;
    const Argument m_imsi = imsiArgument();
    const Argument m_action;
    const Argument m_rules;
};

FamilyCommands::FamilyCommands(const RuleFamily &family)
    : m_family(family)
    , m_action{actionArgument,
               QStringLiteral("What happens to %1: %2")
                   .arg(family.subject,
                        family.hasDirections() ? QStringLiteral("block, allow, or hangup (incoming alone)")
                                               : family.actionNames().join(QLatin1String(" or "))),
               family.actionNames(),
               {}}
    , m_rules{ruleArgument,
              QStringLiteral("A rule, such as 244051234567890=block"),
              {},
              [family](const QString &rule) { return ruleFault(family, rule); },
              Argument::Word,
              Argument::Several}
{
}

QVector<Command> FamilyCommands::all() const
{
    return {show(), add(), remove(), set(), clear(), setDefault(), watch()};
}

Command FamilyCommands::command(const QString &name, const QString &summary, Run run) const
{
    Command command;
    command.name = name;
    command.summary = summary;
    command.options = {jsonOption(),
                       timeoutOption(QStringLiteral(
                           "Give up when the phone has not answered after so many seconds (default: 25)"))};
    command.run = [family = m_family, run](const Values &values) -> int {
        if (!areConsistent(family, values))
            return ExitUsage;
        const Reply running = Service::telephony().ensureRunning();
        if (!running.isDone())
            return conclude(running);
        RuleFilter filter(family, timeoutsOf(values).confirmation);
        const Reply opened = filter.open();
        return opened.isDone() ? run(filter, values) : conclude(opened);
    };
    return command;
}

Command FamilyCommands::change(const QString &name, const QString &summary,
                               const QVector<Argument> &arguments, Run run) const
{
    Command change = command(name, summary, run);
    if (m_family.hasDirections()) {
        change.arguments.append(
            {directionArgument,
             QStringLiteral("Direction of the %1: %2")
                 .arg(m_family.subject, m_family.directionNames().join(QLatin1String(" or "))),
             m_family.directionNames(),
             {}});
    }
    change.arguments += arguments;
    return change;
}

QString FamilyCommands::examples(const QStringList &commands, const QString &rules) const
{
    QStringList lines{commands.size() == 1 ? QStringLiteral("Example:") : QStringLiteral("Examples:")};
    for (QString command : commands) {
        command.replace(QLatin1String("DIR "),
                        m_family.hasDirections() ? QStringLiteral("dial ") : QString());
        lines.append(QStringLiteral("  mdmctl %1 %2").arg(m_family.name, command.trimmed()));
    }
    return lines.join(QLatin1Char('\n'))
        + QStringLiteral(
              "\n\nJSON, after the change: {\"changed\": true, %1\"default\": \"allow\",\n\"rules\": %2}")
              .arg(m_family.hasDirections() ? QStringLiteral("\"direction\": \"dial\", ") : QString(), rules);
}

QString FamilyCommands::oneOf(const QString &several) const
{
    return m_family.hasDirections() ? several + QLatin1String(" of a direction") : several;
}

Command FamilyCommands::show() const
{
    const bool directions = m_family.hasDirections();
    Command show = command(QStringLiteral("show"),
                           directions ? QStringLiteral("Show the rules and defaults of both directions")
                                      : QStringLiteral("Show the rules and the default"),
                           runShow);
    const QString json = QStringLiteral("{\"default\": \"allow\", \"rules\": [{\"imsi\": "
                                        "\"244051234567890\",\n\"action\": \"block\"}]}");
    show.description
        = QStringLiteral("JSON: %1, as \"%2\" in a policy.")
              .arg(directions ? QStringLiteral("{\"dial\": %1, \"incoming\": {...}}").arg(json) : json,
                   m_family.name);
    return show;
}

Command FamilyCommands::add() const
{
    Command add = change(QStringLiteral("add"),
                         QStringLiteral("Add a rule, or change the action of the one there is"),
                         {m_imsi, m_action}, runAdd);
    QStringList shown{QStringLiteral("add DIR 244051234567890 block")};
    if (m_family.hasDirections())
        shown.append(QStringLiteral("add incoming 244051234567890 hangup"));
    add.description
        = QStringLiteral("Waits until the phone confirms the rule and prints what then holds. A rule that "
                         "is\nthere already is left as it is, with exit status 0.\n\n")
        + examples(shown);
    return add;
}

Command FamilyCommands::remove() const
{
    Command remove
        = change(QStringLiteral("remove"), QStringLiteral("Remove the rule of a SIM"), {m_imsi}, runRemove);
    remove.description = QStringLiteral("A rule that is not there cannot be removed: exit status 1.\n\n")
        + examples({QStringLiteral("remove DIR 244051234567890")}, noRules);
    return remove;
}

Command FamilyCommands::set() const
{
    Command set
        = change(QStringLiteral("set"), oneOf(QStringLiteral("Replace all rules")), {m_rules}, runSet);
    set.description = examples({QStringLiteral("set DIR 244051234567890=block 262021234567891=allow")});
    return set;
}

Command FamilyCommands::clear() const
{
    Command clear = change(QStringLiteral("clear"), oneOf(QStringLiteral("Remove all rules")), {}, runClear);
    clear.description = examples({QStringLiteral("clear DIR ")}, noRules);
    return clear;
}

Command FamilyCommands::setDefault() const
{
    Command setDefault
        = change(QStringLiteral("default"),
                 QStringLiteral("Set what happens to %1 of SIMs without a rule").arg(m_family.subject),
                 {m_action}, runDefault);
    setDefault.description = examples({QStringLiteral("default DIR block")});
    return setDefault;
}

Command FamilyCommands::watch() const
{
    const bool directions = m_family.hasDirections();
    Command watch = command(QStringLiteral("watch"),
                            directions ? QStringLiteral("Follow changes of rules and defaults")
                                       : QStringLiteral("Follow changes of the rules and the default"),
                            runWatch);
    watch.description
        = QStringLiteral("Prints one line a change until it is interrupted (Ctrl-C, exit status 0).\n\n"
                         "JSON: one object a line with \"time\", \"event\"%1 and, by event,\n"
                         "  ruleAdded, ruleChanged, ruleRemoved  \"imsi\", \"action\" (of a removed rule: "
                         "the one it had)\n"
                         "  defaultChanged                       \"action\"\n"
                         "  rulesReordered\n"
                         "and {\"event\": \"watching\"} at the start.")
              .arg(directions ? QStringLiteral(", \"direction\"") : QString());
    return watch;
}

Command familyCommand(const RuleFamily &family, const QString &summary, const QString &description)
{
    Command command;
    command.name = family.name;
    command.summary = summary;
    command.description = description;
    command.commands = FamilyCommands(family).all();
    return command;
}

} // namespace

Command callsCommand()
{
    return familyCommand(
        RuleFamily::calls(), QStringLiteral("Rule which SIMs may make and take calls"),
        QStringLiteral("A rule is the IMSI of a SIM and what happens to its calls; the default is for SIMs "
                       "without\na rule. Outgoing (dial) and incoming calls have rules of their own."));
}

Command smsCommand()
{
    return familyCommand(
        RuleFamily::sms(), QStringLiteral("Rule which SIMs may get text messages"),
        QStringLiteral("A rule is the IMSI of a SIM and what happens to text messages that come for it; the "
                       "default is\nfor SIMs without a rule."));
}

Command dataCommand()
{
    return familyCommand(
        RuleFamily::data(), QStringLiteral("Rule which SIMs may use mobile data"),
        QStringLiteral("A rule is the IMSI of a SIM and what happens to its mobile data; the default is for "
                       "SIMs\nwithout a rule."));
}

} // namespace Agent
} // namespace Corvane
