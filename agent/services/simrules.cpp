// SPDX-License-Identifier: LGPL-2.1-or-later
#include "simrules.h"

#include <QtCore/QJsonObject>
#include <QtCore/QMap>
#include <QtCore/QSet>

namespace Corvane
{
namespace Agent
{

using Mdm::SimFilter;

namespace
{

struct NamedAction {
    SimFilter::Action action;
    QLatin1String name;
    bool incomingCallsOnly;
};

const NamedAction actions[] = {
    {SimFilter::Block, QLatin1String("block"), false},
    {SimFilter::Allow, QLatin1String("allow"), false},
    {SimFilter::Hangup, QLatin1String("hangup"), true},
};

const QLatin1String imsiMember("imsi");
const QLatin1String actionMember("action");

bool fits(const NamedAction &named, Traffic traffic)
{
    return traffic == Traffic::IncomingCalls || !named.incomingCallsOnly;
}

QMap<QString, SimFilter::Action> byImsi(const SimFilter::RuleList &rules)
{
    QMap<QString, SimFilter::Action> map;
    for (const SimFilter::Rule &rule : rules)
        map.insert(rule.imsi, rule.action);
    return map;
}

} // namespace

RuleFamily RuleFamily::calls()
{
    return {
        QStringLiteral("calls"), QStringLiteral("calls"), {Traffic::DialledCalls, Traffic::IncomingCalls}};
}

RuleFamily RuleFamily::sms()
{
    return {QStringLiteral("sms"), QStringLiteral("text messages"), {Traffic::Texts}};
}

RuleFamily RuleFamily::data()
{
    return {QStringLiteral("data"), QStringLiteral("mobile data"), {Traffic::Data}};
}

QStringList RuleFamily::directionNames() const
{
    QStringList names;
    for (const Traffic each : traffic)
        names.append(directionName(each));
    return names;
}

Traffic RuleFamily::trafficNamed(const QString &direction) const
{
    const int index = directionNames().indexOf(direction);
    return traffic.at(index < 0 ? 0 : index);
}

QStringList RuleFamily::actionNames() const
{
    QStringList names;
    for (const Traffic each : traffic)
        names += Agent::actionNames(each);
    names.removeDuplicates();
    return names;
}

QString directionName(Traffic traffic)
{
    switch (traffic) {
    case Traffic::DialledCalls:
        return QStringLiteral("dial");
    case Traffic::IncomingCalls:
        return QStringLiteral("incoming");
    case Traffic::Texts:
    case Traffic::Data:
        break;
    }
    return QString();
}

QString actionName(SimFilter::Action action)
{
    for (const NamedAction &named : actions) {
        if (named.action == action)
            return named.name;
    }
    return QString::number(action);
}

QStringList actionNames(Traffic traffic)
{
    QStringList names;
    for (const NamedAction &named : actions) {
        if (fits(named, traffic))
            names.append(named.name);
    }
    return names;
}

std::optional<SimFilter::Action> actionNamed(Traffic traffic, const QString &name)
{
    for (const NamedAction &named : actions) {
        if (named.name == name && fits(named, traffic))
            return named.action;
    }
    return std::nullopt;
}

std::optional<SimFilter::Action> actionNamed(const QString &name)
{
    // No action exists for other traffic alone.
    return actionNamed(Traffic::IncomingCalls, name);
}

QJsonArray rulesToJson(const SimFilter::RuleList &rules)
{
    QJsonArray array;
    for (const SimFilter::Rule &rule : rules)
        array.append(QJsonObject{{imsiMember, rule.imsi}, {actionMember, actionName(rule.action)}});
    return array;
}

SimFilter::RuleList rulesFromJson(const QJsonArray &rules)
{
    SimFilter::RuleList list;
    for (const QJsonValue &element : rules) {
        const QString action = element[actionMember].toString();
        list.append({element[imsiMember].toString(), actionNamed(action).value_or(SimFilter::Block)});
    }
    return list;
}

QString ruleText(const SimFilter::Rule &rule)
{
    return rule.imsi + QLatin1Char('=') + actionName(rule.action);
}

QString rulesText(const SimFilter::RuleList &rules)
{
    QStringList lines;
    for (const SimFilter::Rule &rule : rules)
        lines.append(ruleText(rule));
    return lines.isEmpty() ? QStringLiteral("no rules") : lines.join(QLatin1Char('\n'));
}

int repeatedRule(const SimFilter::RuleList &rules)
{
    QSet<QString> seen;
    for (int i = 0; i < rules.size(); ++i) {
        if (seen.contains(rules.at(i).imsi))
            return i;
        seen.insert(rules.at(i).imsi);
    }
    return -1;
}

SimFilter::RuleList expandedRules(const SimFilter::RuleList &rules, const QStringList &imsis)
{
    const QMap<QString, SimFilter::Action> named = byImsi(rules);
    SimFilter::RuleList expanded;
    for (const SimFilter::Rule &rule : rules) {
        if (rule.imsi != AnySim) {
            expanded.append(rule);
            continue;
        }
        for (const QString &imsi : imsis) {
            if (!named.contains(imsi))
                expanded.append({imsi, rule.action});
        }
    }
    return expanded;
}

RuleDifference::RuleDifference(const SimFilter::RuleList &from, const SimFilter::RuleList &to)
{
    const QMap<QString, SimFilter::Action> before = byImsi(from);
    const QMap<QString, SimFilter::Action> after = byImsi(to);
    for (const SimFilter::Rule &rule : to) {
        if (!before.contains(rule.imsi))
            added.append(rule);
        else if (before.value(rule.imsi) != rule.action)
            changed.append(rule);
    }
    for (const SimFilter::Rule &rule : from) {
        if (!after.contains(rule.imsi))
            removed.append(rule);
    }
}

QString RuleDifference::toString() const
{
    QStringList steps;
    for (const SimFilter::Rule &rule : added)
        steps.append(QLatin1String("add ") + ruleText(rule));
    for (const SimFilter::Rule &rule : changed)
        steps.append(QLatin1String("change to ") + ruleText(rule));
    for (const SimFilter::Rule &rule : removed)
        steps.append(QLatin1String("remove ") + rule.imsi);
    return steps.join(QLatin1String("; "));
}

} // namespace Agent
} // namespace Corvane
