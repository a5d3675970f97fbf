// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/simfilter.h>

#include "simfilter_p.h"

#include <QtCore/QSet>
#include <QtDBus/QDBusMetaType>

#include <algorithm>

namespace Corvane
{
namespace Mdm
{

namespace
{

constexpr int MaximumImsiLength = 15;

// The part of two lists that differs: what lies between their common beginning and their common end. Lists
// mostly change in one place, and strings that are shared compare at no cost.
struct Difference {
    Difference(const SimFilter::RuleList &oldRules, const SimFilter::RuleList &newRules)
    {
        const auto parting
            = std::mismatch(oldRules.begin(), oldRules.end(), newRules.begin(), newRules.end());
        const auto oldBegin = std::make_reverse_iterator(parting.first);
        const auto newBegin = std::make_reverse_iterator(parting.second);
        const auto meeting = std::mismatch(oldRules.rbegin(), oldBegin, newRules.rbegin(), newBegin);
        begin = int(parting.first - oldRules.begin());
        oldEnd = int(meeting.first.base() - oldRules.begin());
        newEnd = int(meeting.second.base() - newRules.begin());
    }

    int begin;
    int oldEnd;
    int newEnd;
};

} // namespace

SimFilter::SimFilter(QObject *parent)
    : QObject(parent)
{
}

SimFilter::~SimFilter() = default;

bool SimFilter::isValidImsi(const QString &imsi)
{
    return imsi.length() <= MaximumImsiLength
        && std::all_of(imsi.begin(), imsi.end(), [](QChar character) { return character.isDigit(); });
}

SimFilter::Rule::Rule()
    : action(Block)
{
}

SimFilter::Rule::Rule(const QString &simImsi, Action simAction)
    : imsi(simImsi)
    , action(simAction)
{
}

bool SimFilter::Rule::operator==(const Rule &other) const
{
    return action == other.action && imsi == other.imsi;
}

bool SimFilter::Rule::operator!=(const Rule &other) const
{
    return !(*this == other);
}

SimFilter::Rule::operator QString() const
{
    return QStringLiteral("Rule (imsi=%1, action=%2)").arg(imsi, QString::number(action));
}

QDebug operator<<(QDebug debug, const SimFilter::Action &action)
{
    const char *word = "";
    switch (action) {
    case SimFilter::Block:
        word = "block";
        break;
    case SimFilter::Allow:
        word = "allow";
        break;
    case SimFilter::Hangup:
        word = "hangup";
        break;
    }
    return debug << word;
}

QDebug operator<<(QDebug debug, const SimFilter::Rule *rule)
{
    const QDebugStateSaver saver(debug);
    debug.nospace();
    if (rule)
        debug << "Rule (imsi=" << rule->imsi << ", action=" << rule->action << ")";
    else
        debug << "Rule (this = 0x0)";
    return debug;
}

SimFilterPrivate::RulePrivate::RulePrivate()
    : action(0)
{
}

SimFilterPrivate::RulePrivate::RulePrivate(const SimFilter::Rule &rule)
    : imsi(rule.imsi)
    , action(actionToInt(rule.action))
{
}

QDBusArgument &operator<<(QDBusArgument &out, const SimFilterPrivate::RulePrivate &rule)
{
    out.beginStructure();
    out << rule.imsi << rule.action;
    out.endStructure();
    return out;
}

const QDBusArgument &operator>>(const QDBusArgument &in, SimFilterPrivate::RulePrivate &rule)
{
    in.beginStructure();
    in >> rule.imsi >> rule.action;
    in.endStructure();
    return in;
}

SimFilter::Action SimFilterPrivate::actionFromInt(uint value, bool *ok)
{
    const bool known = value == SimFilter::Block || value == SimFilter::Allow || value == SimFilter::Hangup;
    if (ok)
        *ok = known;
    return known ? SimFilter::Action(value) : SimFilter::Block;
}

uint SimFilterPrivate::actionToInt(SimFilter::Action action)
{
    switch (action) {
    case SimFilter::Block:
    case SimFilter::Allow:
    case SimFilter::Hangup:
        return action;
    }
    qWarning() << "actionToInt() given invalid action:" << action;
    return SimFilter::Block;
}

SimFilter::Rule SimFilterPrivate::publicRuleFromPrivate(const RulePrivate &rule)
{
    bool ok = false;
    const SimFilter::Action action = actionFromInt(rule.action, &ok);
    if (ok)
        return SimFilter::Rule(rule.imsi, action);

    qWarning() << "Ignoring rule for" << rule.imsi << "with invalid action:" << rule.action;
    return SimFilter::Rule();
}

// Beside the rule's class, where look-up by argument finds it; the conversion of a rule to a string would do
// otherwise.
static uint qHash(const SimFilter::Rule &rule, uint seed = 0)
{
    return ::qHash(rule.imsi, seed) ^ uint(rule.action);
}

namespace
{

// Calls back, in order, for each rule of [begin, end) whose key no rule of `others` has. Hashing the range
// and going through the others keeps the cost linear, and that of a small range small, however long the other
// list is.
template <typename Key, typename Found>
void forEachUnmatched(SimFilter::RuleList::const_iterator begin, SimFilter::RuleList::const_iterator end,
                      const SimFilter::RuleList &others, Key key, Found found)
{
    if (begin == end)
        return;

    QSet<std::decay_t<decltype(key(*begin))>> unmatched;
    unmatched.reserve(int(end - begin));
    for (auto rule = begin; rule != end; ++rule)
        unmatched.insert(key(*rule));
    for (const SimFilter::Rule &other : others)
        unmatched.remove(key(other));
    for (auto rule = begin; rule != end && !unmatched.isEmpty(); ++rule) {
        if (unmatched.contains(key(*rule)))
            found(*rule);
    }
}

} // namespace

SimFilter::RuleList SimFilterPrivate::addedRules(const SimFilter::RuleList &oldRules,
                                                 const SimFilter::RuleList &newRules, bool includeHangup)
{
    SimFilter::RuleList added;
    const Difference difference(oldRules, newRules);
    forEachUnmatched(
        newRules.begin() + difference.begin, newRules.begin() + difference.newEnd, oldRules,
        [](const SimFilter::Rule &rule) { return rule; },
        [&](const SimFilter::Rule &rule) {
            if (includeHangup || rule.action != SimFilter::Hangup)
                added.append(rule);
        });
    return added;
}

QStringList SimFilterPrivate::removedImsis(const SimFilter::RuleList &oldRules,
                                           const SimFilter::RuleList &newRules)
{
    QStringList removed;
    const Difference difference(oldRules, newRules);
    forEachUnmatched(
        oldRules.begin() + difference.begin, oldRules.begin() + difference.oldEnd, newRules,
        [](const SimFilter::Rule &rule) { return rule.imsi; },
        [&](const SimFilter::Rule &rule) { removed.append(rule.imsi); });
    return removed;
}

void SimFilterPrivate::registerTypes()
{
    static bool registered = false;
    if (registered)
        return;
    registered = true;

    qRegisterMetaType<SimFilter::Rule>("Corvane::Mdm::SimFilter::Rule");
    qRegisterMetaType<SimFilter::RuleList>("Corvane::Mdm::SimFilter::RuleList");
    qRegisterMetaType<RulePrivate>("Corvane::Mdm::SimFilterPrivate::RulePrivate");
    qDBusRegisterMetaType<RulePrivate>();
    qRegisterMetaType<Rule>("Corvane::Mdm::SimFilterPrivate::Rule");
    qRegisterMetaType<RulePrivateList>("Corvane::Mdm::SimFilterPrivate::RulePrivateList");
    qDBusRegisterMetaType<RulePrivateList>();
    qRegisterMetaType<RuleList>("Corvane::Mdm::SimFilterPrivate::RuleList");

    // Signals are declared with the short spellings; connections by name and queued ones look them up.
    qRegisterMetaType<SimFilter::Rule>("SimFilter::Rule");
    qRegisterMetaType<SimFilter::RuleList>("SimFilter::RuleList");
    qRegisterMetaType<SimFilter::Action>("Corvane::Mdm::SimFilter::Action");
    qRegisterMetaType<SimFilter::Action>("SimFilter::Action");
}

} // namespace Mdm
} // namespace Corvane
