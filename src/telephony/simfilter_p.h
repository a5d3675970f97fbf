// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_SIMFILTER_P_H
#define CORVANEMDM_SIMFILTER_P_H

#include <corvanemdm/simfilter.h>

#include <QtCore/QStringList>
#include <QtDBus/QDBusArgument>

namespace Corvane
{
namespace Mdm
{

/** What the SIM filters share: the wire form of rules, and conversions and comparisons of rule lists. */
class SimFilterPrivate
{
public:
    /** A rule on the wire, (su): any number may arrive as the action. */
    struct RulePrivate {
        RulePrivate();
        RulePrivate(const SimFilter::Rule &rule);

        QString imsi;
        quint32 action;
    };

    /** a(su) on the wire. */
    typedef QList<RulePrivate> RulePrivateList;

    // The same types under the names that the signals of the filter service were first handled with.
    typedef RulePrivate Rule;
    typedef RulePrivateList RuleList;

    /** @p ok, which may be null, tells whether @p value is an action. */
    static SimFilter::Action actionFromInt(uint value, bool *ok);
    static uint actionToInt(SimFilter::Action action);

    /** An action that is none gives a rule without an IMSI, which stands for no rule. */
    static SimFilter::Rule publicRuleFromPrivate(const RulePrivate &rule);

    /** The rules of @p newRules that @p oldRules does not have, those with Hangup only if @p includeHangup.
     */
    static SimFilter::RuleList addedRules(const SimFilter::RuleList &oldRules,
                                          const SimFilter::RuleList &newRules, bool includeHangup);
    /** The IMSIs of @p oldRules that @p newRules has no rule for. */
    static QStringList removedImsis(const SimFilter::RuleList &oldRules, const SimFilter::RuleList &newRules);

    /** To be called before the first D-Bus call of a filter; works once per process. */
    static void registerTypes();
};

QDBusArgument &operator<<(QDBusArgument &out, const SimFilterPrivate::RulePrivate &rule);
const QDBusArgument &operator>>(const QDBusArgument &in, SimFilterPrivate::RulePrivate &rule);

} // namespace Mdm
} // namespace Corvane

Q_DECLARE_METATYPE(Corvane::Mdm::SimFilterPrivate::RulePrivate)

#endif // CORVANEMDM_SIMFILTER_P_H
