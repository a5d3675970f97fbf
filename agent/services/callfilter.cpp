// SPDX-License-Identifier: LGPL-2.1-or-later
#include "callfilter.h"

#include "service.h"
#include "wait.h"

namespace Corvane
{
namespace Agent
{

using Mdm::SimFilter;
using Mdm::SimVoiceCallFilter;

namespace
{

struct Members {
    SimFilter::RuleList (SimVoiceCallFilter::*rules)() const;
    SimFilter::Action (SimVoiceCallFilter::*defaultAction)() const;
    bool (SimVoiceCallFilter::*setRules)(const SimFilter::RuleList &);
    bool (SimVoiceCallFilter::*setRule)(const SimFilter::Rule &);
    bool (SimVoiceCallFilter::*hasRule)(const QString &) const;
    bool (SimVoiceCallFilter::*removeRule)(const QString &);
    bool (SimVoiceCallFilter::*clearRules)();
    bool (SimVoiceCallFilter::*setDefaultAction)(SimFilter::Action);
    void (SimVoiceCallFilter::*rulesChanged)(const SimFilter::RuleList &, const SimFilter::RuleList &);
    void (SimVoiceCallFilter::*defaultActionChanged)();
};

constexpr Members dialMembers = {
    &SimVoiceCallFilter::dialRules,          &SimVoiceCallFilter::defaultDialAction,
    &SimVoiceCallFilter::setDialRules,       &SimVoiceCallFilter::setDialRule,
    &SimVoiceCallFilter::hasDialRuleForImsi, &SimVoiceCallFilter::removeDialRule,
    &SimVoiceCallFilter::clearDialRules,     &SimVoiceCallFilter::setDefaultDialAction,
    &SimVoiceCallFilter::dialRulesChanged,   &SimVoiceCallFilter::defaultDialActionChanged,
};

constexpr Members incomingMembers = {
    &SimVoiceCallFilter::incomingRules,          &SimVoiceCallFilter::defaultIncomingAction,
    &SimVoiceCallFilter::setIncomingRules,       &SimVoiceCallFilter::setIncomingRule,
    &SimVoiceCallFilter::hasIncomingRuleForImsi, &SimVoiceCallFilter::removeIncomingRule,
    &SimVoiceCallFilter::clearIncomingRules,     &SimVoiceCallFilter::setDefaultIncomingAction,
    &SimVoiceCallFilter::incomingRulesChanged,   &SimVoiceCallFilter::defaultIncomingActionChanged,
};

const Members &membersOf(CallDirection direction)
{
    return direction == CallDirection::Dial ? dialMembers : incomingMembers;
}

} // namespace

CallFilter::CallFilter(std::chrono::milliseconds timeout, QObject *parent)
    : QObject(parent)
    , m_timeout(timeout)
{
    for (const CallDirection direction : allCallDirections) {
        connect(&m_filter, membersOf(direction).rulesChanged, this,
                [this, direction](const SimFilter::RuleList &oldRules, const SimFilter::RuleList &newRules) {
                    Q_EMIT rulesChanged(direction, oldRules, newRules);
                    Q_EMIT changed();
                });
        connect(&m_filter, membersOf(direction).defaultActionChanged, this, [this, direction] {
            Q_EMIT defaultActionChanged(direction);
            Q_EMIT changed();
        });
    }
}

Reply CallFilter::open()
{
    Wait wait(Service::telephony(), m_timeout, QStringLiteral("tell its rules for calls"));
    wait.until(&m_filter, &SimVoiceCallFilter::readyChanged, [this] { return m_filter.ready(); });
    return wait.run();
}

SimFilter::RuleList CallFilter::rules(CallDirection direction) const
{
    return (m_filter.*membersOf(direction).rules)();
}

bool CallFilter::hasRule(CallDirection direction, const QString &imsi) const
{
    return (m_filter.*membersOf(direction).hasRule)(imsi);
}

SimFilter::Action CallFilter::defaultAction(CallDirection direction) const
{
    return (m_filter.*membersOf(direction).defaultAction)();
}

Reply CallFilter::setRules(CallDirection direction, const SimFilter::RuleList &wanted)
{
    return change([=] { return rules(direction) == wanted; },
                  [=] { return (m_filter.*membersOf(direction).setRules)(wanted); });
}

Reply CallFilter::setRule(CallDirection direction, const SimFilter::Rule &rule)
{
    return change([=] { return rules(direction).contains(rule); },
                  [=] { return (m_filter.*membersOf(direction).setRule)(rule); });
}

Reply CallFilter::removeRule(CallDirection direction, const QString &imsi)
{
    return change([=] { return !hasRule(direction, imsi); },
                  [=] { return (m_filter.*membersOf(direction).removeRule)(imsi); });
}

Reply CallFilter::clearRules(CallDirection direction)
{
    return change([=] { return rules(direction).isEmpty(); },
                  [=] { return (m_filter.*membersOf(direction).clearRules)(); });
}

Reply CallFilter::setDefaultAction(CallDirection direction, SimFilter::Action action)
{
    return change([=] { return defaultAction(direction) == action; },
                  [=] { return (m_filter.*membersOf(direction).setDefaultAction)(action); });
}

Reply CallFilter::change(const std::function<bool()> &isDone, const std::function<bool()> &request)
{
    if (isDone())
        return {};
    Wait wait(Service::telephony(), m_timeout, QStringLiteral("confirm the change"));
    if (!request())
        return {Reply::Refused, QStringLiteral("not a change that the library sends")};
    wait.until(this, &CallFilter::changed, isDone);
    return wait.run();
}

} // namespace Agent
} // namespace Corvane
