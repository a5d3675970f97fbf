// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMRULES_H
#define CORVANE_SIMRULES_H

#include <corvanemdm/simfilter.h>

#include <QtCore/QJsonArray>
#include <QtCore/QString>
#include <QtCore/QStringList>
#include <QtCore/QVector>

#include <optional>

namespace Corvane
{
namespace Agent
{

/** A kind of traffic that has rules of its own. */
enum class Traffic { DialledCalls, IncomingCalls, Texts, Data };

/** A feature family of rules: what has one command, one section of policies and one class of the library. */
struct RuleFamily {
    QString name; ///< of the command and of the section
    QString subject; ///< for people: "rules for ..."
    QVector<Traffic> traffic;

    static RuleFamily calls();
    static RuleFamily sms();
    static RuleFamily data();

    /** Whether its traffic has to be told apart. */
    bool hasDirections() const { return traffic.size() > 1; }
    QStringList directionNames() const;
    Traffic trafficNamed(const QString &direction) const;
    /** The actions that exist for any of its traffic. */
    QStringList actionNames() const;
};

/** "dial", "incoming"; empty for traffic that is the only one of its family. */
QString directionName(Traffic traffic);

/** "block", "allow", "hangup" */
QString actionName(Mdm::SimFilter::Action action);
/** The actions that exist for @p traffic. */
QStringList actionNames(Traffic traffic);
std::optional<Mdm::SimFilter::Action> actionNamed(Traffic traffic, const QString &name);
/** The same for any traffic. */
std::optional<Mdm::SimFilter::Action> actionNamed(const QString &name);

/** Stands for every SIM of the phone. */
const QLatin1String AnySim("*");

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

#endif // CORVANE_SIMRULES_H
