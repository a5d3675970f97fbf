// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_CALLRULES_H
#define CORVANE_CALLRULES_H

#include <corvanemdm/simfilter.h>

#include <QtCore/QJsonArray>
#include <QtCore/QString>
#include <QtCore/QStringList>

#include <optional>

namespace Corvane
{
namespace Agent
{

/** A direction of calls that has rules of its own. */
enum class CallDirection { Dial, Incoming };

constexpr CallDirection allCallDirections[] = {CallDirection::Dial, CallDirection::Incoming};

/** "dial", "incoming" */
QString directionName(CallDirection direction);
QStringList directionNames();
CallDirection directionNamed(const QString &name);

/** "block", "allow", "hangup" */
QString actionName(Mdm::SimFilter::Action action);
/** The actions that exist for calls in @p direction. */
QStringList actionNames(CallDirection direction);
std::optional<Mdm::SimFilter::Action> actionNamed(CallDirection direction, const QString &name);

/** Stands for every SIM of the phone. */
constexpr QLatin1String AnySim("*");

/** [{"imsi": "244...", "action": "block"}] */
QJsonArray rulesToJson(const Mdm::SimFilter::RuleList &rules);
/** The reverse, for an array that the schema of policies has accepted. */
Mdm::SimFilter::RuleList rulesFromJson(const QJsonArray &rules);

/** "244...=block" */
QString ruleText(const Mdm::SimFilter::Rule &rule);
/** One rule a line, "no rules" for none. */
QString rulesText(const Mdm::SimFilter::RuleList &rules);

/** The position of the first rule for an IMSI that an earlier rule names; -1 when each has one rule. */
int repeatedRule(const Mdm::SimFilter::RuleList &rules);

/** @p rules with the one for AnySim replaced by one for each of @p imsis that no other rule names. */
Mdm::SimFilter::RuleList expandedRules(const Mdm::SimFilter::RuleList &rules, const QStringList &imsis);

/** What leads from one rule list to another, the order aside. */
struct RuleDifference {
    Mdm::SimFilter::RuleList added;
    Mdm::SimFilter::RuleList changed; ///< with their new action
    Mdm::SimFilter::RuleList removed;

    RuleDifference(const Mdm::SimFilter::RuleList &from, const Mdm::SimFilter::RuleList &to);
    bool isEmpty() const { return added.isEmpty() && changed.isEmpty() && removed.isEmpty(); }
    /** "add 244...=block; remove 244..." */
    QString toString() const;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_CALLRULES_H
