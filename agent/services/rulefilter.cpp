// SPDX-License-Identifier: LGPL-2.1-or-later
#include "rulefilter.h"

#include "service.h"
#include "wait.h"

#include <corvanemdm/simmobiledatafilter.h>
#include <corvanemdm/simsmsfilter.h>
#include <corvanemdm/simvoicecallfilter.h>

namespace Corvane
{
namespace Agent
{

using Mdm::SimFilter;
using Mdm::SimMobileDataFilter;
using Mdm::SimSmsFilter;
using Mdm::SimVoiceCallFilter;

namespace
{

/** How one of the library's classes calls what it has for one kind of traffic. */
template <typename Filter> struct Members {
    SimFilter::RuleList (Filter::*rules)() const;
    SimFilter::Action (Filter::*defaultAction)() const;
    bool (Filter::*setRules)(const SimFilter::RuleList &);
    bool (Filter::*setRule)(const SimFilter::Rule &);
    bool (Filter::*hasRule)(const QString &) const;
    bool (Filter::*removeRule)(const QString &);
    bool (Filter::*clearRules)();
    bool (Filter::*setDefaultAction)(SimFilter::Action);
    void (Filter::*rulesChanged)(const SimFilter::RuleList &, const SimFilter::RuleList &);
    void (Filter::*defaultActionChanged)();
};

constexpr Members<SimVoiceCallFilter> dialledCalls = {
    &SimVoiceCallFilter::dialRules,          &SimVoiceCallFilter::defaultDialAction,
    &SimVoiceCallFilter::setDialRules,       &SimVoiceCallFilter::setDialRule,
    &SimVoiceCallFilter::hasDialRuleForImsi, &SimVoiceCallFilter::removeDialRule,
    &SimVoiceCallFilter::clearDialRules,     &SimVoiceCallFilter::setDefaultDialAction,
    &SimVoiceCallFilter::dialRulesChanged,   &SimVoiceCallFilter::defaultDialActionChanged,
};

constexpr Members<SimVoiceCallFilter> incomingCalls = {
    &SimVoiceCallFilter::incomingRules,          &SimVoiceCallFilter::defaultIncomingAction,
    &SimVoiceCallFilter::setIncomingRules,       &SimVoiceCallFilter::setIncomingRule,
    &SimVoiceCallFilter::hasIncomingRuleForImsi, &SimVoiceCallFilter::removeIncomingRule,
    &SimVoiceCallFilter::clearIncomingRules,     &SimVoiceCallFilter::setDefaultIncomingAction,
    &SimVoiceCallFilter::incomingRulesChanged,   &SimVoiceCallFilter::defaultIncomingActionChanged,
};

constexpr Members<SimSmsFilter> texts = {
    &SimSmsFilter::textRules,          &SimSmsFilter::defaultTextAction,
    &SimSmsFilter::setTextRules,       &SimSmsFilter::setTextRule,
    &SimSmsFilter::hasTextRuleForImsi, &SimSmsFilter::removeTextRule,
    &SimSmsFilter::clearTextRules,     &SimSmsFilter::setDefaultTextAction,
    &SimSmsFilter::textRulesChanged,   &SimSmsFilter::defaultTextActionChanged,
};

constexpr Members<SimMobileDataFilter> data = {
    &SimMobileDataFilter::rules,          &SimMobileDataFilter::defaultAction,
    &SimMobileDataFilter::setRules,       &SimMobileDataFilter::setRule,
    &SimMobileDataFilter::hasRuleForImsi, &SimMobileDataFilter::removeRule,
    &SimMobileDataFilter::clearRules,     &SimMobileDataFilter::setDefaultAction,
    &SimMobileDataFilter::rulesChanged,   &SimMobileDataFilter::defaultActionChanged,
};

} // namespace

template <typename Filter> Filter *RuleFilter::makeFilter()
{
    auto *filter = new Filter(this);
    connect(filter, &Filter::readyChanged, this, &RuleFilter::opened);
    m_isReady = [filter] {
        return filter->ready();
    };
    return filter;
}

template <typename Filter, typename Members>
void RuleFilter::addChannel(Traffic traffic, Filter *filter, const Members &members)
{
    m_channels[traffic] = {
        [=] { return (filter->*members.rules)(); },
        [=] { return (filter->*members.defaultAction)(); },
        [=](const QString &imsi) { return (filter->*members.hasRule)(imsi); },
        [=](const SimFilter::RuleList &rules) { return (filter->*members.setRules)(rules); },
        [=](const SimFilter::Rule &rule) { return (filter->*members.setRule)(rule); },
        [=](const QString &imsi) { return (filter->*members.removeRule)(imsi); },
        [=] { return (filter->*members.clearRules)(); },
        [=](SimFilter::Action action) { return (filter->*members.setDefaultAction)(action); },
    };
    connect(filter, members.rulesChanged, this,
            [this, traffic](const SimFilter::RuleList &oldRules, const SimFilter::RuleList &newRules) {
                Q_EMIT rulesChanged(traffic, oldRules, newRules);
                Q_EMIT changed();
            });
    connect(filter, members.defaultActionChanged, this, [this, traffic] {
        Q_EMIT defaultActionChanged(traffic);
        Q_EMIT changed();
    });
}

RuleFilter::RuleFilter(const RuleFamily &family, std::chrono::milliseconds timeout, QObject *parent)
    : QObject(parent)
    , m_family(family)
    , m_timeout(timeout)
{
    switch (family.traffic.first()) {
    case Traffic::DialledCalls:
    case Traffic::IncomingCalls: {
        auto *filter = makeFilter<SimVoiceCallFilter>();
        addChannel(Traffic::DialledCalls, filter, dialledCalls);
        addChannel(Traffic::IncomingCalls, filter, incomingCalls);
        break;
    }
    case Traffic::Texts:
        addChannel(Traffic::Texts, makeFilter<SimSmsFilter>(), texts);
        break;
    case Traffic::Data:
        addChannel(Traffic::Data, makeFilter<SimMobileDataFilter>(), data);
        break;
    }
}

Reply RuleFilter::open()
{
    Wait wait(Service::telephony(), m_timeout, QStringLiteral("tell its rules for %1").arg(m_family.subject));
    wait.until(this, &RuleFilter::opened, m_isReady);
    return wait.run();
}

SimFilter::RuleList RuleFilter::rules(Traffic traffic) const
{
    return m_channels.at(traffic).rules();
}

bool RuleFilter::hasRule(Traffic traffic, const QString &imsi) const
{
    return m_channels.at(traffic).hasRule(imsi);
}

SimFilter::Action RuleFilter::defaultAction(Traffic traffic) const
{
    return m_channels.at(traffic).defaultAction();
}

Reply RuleFilter::setRules(Traffic traffic, const SimFilter::RuleList &wanted)
{
    return change([=] { return rules(traffic) == wanted; },
                  [=] { return m_channels.at(traffic).setRules(wanted); });
}

Reply RuleFilter::setRule(Traffic traffic, const SimFilter::Rule &rule)
{
    return change([=] { return rules(traffic).contains(rule); },
                  [=] { return m_channels.at(traffic).setRule(rule); });
}

Reply RuleFilter::removeRule(Traffic traffic, const QString &imsi)
{
    return change([=] { return !hasRule(traffic, imsi); },
                  [=] { return m_channels.at(traffic).removeRule(imsi); });
}

Reply RuleFilter::clearRules(Traffic traffic)
{
    return change([=] { return rules(traffic).isEmpty(); },
                  [=] { return m_channels.at(traffic).clearRules(); });
}

Reply RuleFilter::setDefaultAction(Traffic traffic, SimFilter::Action action)
{
    return change([=] { return defaultAction(traffic) == action; },
                  [=] { return m_channels.at(traffic).setDefaultAction(action); });
}

Reply RuleFilter::change(const std::function<bool()> &isDone, const std::function<bool()> &request)
{
    if (isDone())
        return {};
    Wait wait(Service::telephony(), m_timeout, QStringLiteral("confirm the change"));
    if (!request())
        return {Reply::Refused, QStringLiteral("not a change that the library sends")};
    wait.until(this, &RuleFilter::changed, isDone);
    return wait.run();
}

} // namespace Agent
} // namespace Corvane
