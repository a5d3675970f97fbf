// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/simfilter.h>

#include "simfilter_p.h"

#include <QtCore/QHashFunctions>
#include <QtCore/QtMath>
#include <QtDBus/QDBusMetaType>

#include <algorithm>
#include <vector>

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

namespace
{

bool sameRule(const SimFilter::Rule &one, const SimFilter::Rule &other)
{
    return one == other;
}

bool sameImsi(const SimFilter::Rule &one, const SimFilter::Rule &other)
{
    return one.imsi == other.imsi;
}

/**
 * Finds the rules of a range that are the same as a given one, by the hash of their IMSIs.
 *
 * Long lists are compared while traffic waits for them, and a node of memory for each rule would cost more
 * than the rest of an update: all that is here are two arrays.
 */
class RuleIndex
{
public:
    using Iterator = SimFilter::RuleList::const_iterator;
    using Same = bool (*)(const SimFilter::Rule &, const SimFilter::Rule &);

    RuleIndex(Iterator begin, Iterator end, Same same)
        : m_begin(begin)
        , m_same(same)
        , m_slots(std::size_t(qNextPowerOfTwo(quint32(2 * (end - begin)))))
        , m_first(std::size_t(end - begin))
        , m_matched(m_first.size())
    {
        for (int index = 0; index < int(m_first.size()); ++index) {
            Slot &slot = find(begin[index]);
            if (slot.index == Nothing)
                slot.index = index;
            m_first[std::size_t(index)] = slot.index;
        }
    }

    /** From now on the rules that are the same as @p rule count as matched. */
    void match(const SimFilter::Rule &rule)
    {
        const int index = find(rule).index;
        if (index != Nothing)
            m_matched[std::size_t(index)] = true;
    }

    bool isMatched(int index) const { return m_matched[std::size_t(m_first[std::size_t(index)])]; }

private:
    static constexpr int Nothing = -1;

    struct Slot {
        uint hash = 0;
        int index = Nothing;
    };

    // The slot of the first rule that is the same, or the free one where it would be. Half of the slots are
    // free.
    Slot &find(const SimFilter::Rule &rule)
    {
        const uint hash = qHash(rule.imsi, uint(qGlobalQHashSeed()));
        std::size_t position = hash;
        for (;; ++position) {
            Slot &slot = m_slots[position & (m_slots.size() - 1)];
            if (slot.index == Nothing)
                slot.hash = hash;
            else if (slot.hash != hash || !m_same(m_begin[slot.index], rule))
                continue;
            return slot;
        }
    }

    const Iterator m_begin;
    const Same m_same;
    std::vector<Slot> m_slots;
    std::vector<int> m_first; // of each rule, the first one that is the same
    std::vector<bool> m_matched;
};

// Calls back, in order, for each rule of [begin, end) that is the same as none of `others`. Indexing the
// range and going through the others keeps the cost linear, and that of a small range small, however long the
// other list is.
template <typename Found>
void forEachUnmatched(RuleIndex::Iterator begin, RuleIndex::Iterator end, const SimFilter::RuleList &others,
                      RuleIndex::Same same, Found found)
{
    if (begin == end)
        return;

    RuleIndex index(begin, end, same);
    for (const SimFilter::Rule &other : others)
        index.match(other);
    for (auto rule = begin; rule != end; ++rule) {
        if (!index.isMatched(int(rule - begin)))
            found(*rule);
    }
}

} // namespace

SimFilter::RuleList SimFilterPrivate::addedRules(const SimFilter::RuleList &oldRules,
                                                 const SimFilter::RuleList &newRules, bool includeHangup)
{
    SimFilter::RuleList added;
    const Difference difference(oldRules, newRules);
    forEachUnmatched(newRules.begin() + difference.begin, newRules.begin() + difference.newEnd, oldRules,
                     sameRule, [&](const SimFilter::Rule &rule) {
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
    forEachUnmatched(oldRules.begin() + difference.begin, oldRules.begin() + difference.oldEnd, newRules,
                     sameImsi, [&](const SimFilter::Rule &rule) { removed.append(rule.imsi); });
    return removed;
}

void SimFilterPrivate::registerTypes()
{
    // Other threads wait until all of it is done.
    static const bool registered = [] {
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
        return true;
    }();
    Q_UNUSED(registered)
}

} // namespace Mdm
} // namespace Corvane
