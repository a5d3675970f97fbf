// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/simvoicecallfilter.h>

#include "simvoicecallfilter_p.h"

namespace Corvane
{
namespace Mdm
{

namespace
{

const QLatin1String Interface("org.corvaneos.ofono.mdm.VoiceCallFilter");

} // namespace

SimVoiceCallFilterPrivate::SimVoiceCallFilterPrivate(SimVoiceCallFilter *filter)
    : QObject(filter)
    , q(filter)
    , dial({QLatin1String("/mdm/voicecallfilter/dial"), Interface,
            "Invalid Outgoing Call action:", "(dial) GetAll() failed:"},
           RuleChannel::WithoutHangup, filter)
    , incoming({QLatin1String("/mdm/voicecallfilter/incoming"), Interface,
                "Invalid Incoming Call action:", "(incoming) GetAll() failed:"},
               RuleChannel::WithHangup, filter)
{
    connect(&dial, &RuleChannel::announceDefaultAction, q, &SimVoiceCallFilter::defaultDialActionChanged);
    connect(&dial, &RuleChannel::announceRule, q, &SimVoiceCallFilter::dialRuleAdded);
    connect(&dial, &RuleChannel::announceRemoval, q, &SimVoiceCallFilter::dialRuleRemoved);
    connect(&dial, &RuleChannel::announceRules, q, &SimVoiceCallFilter::dialRulesChanged);
    connect(&incoming, &RuleChannel::announceDefaultAction, q,
            &SimVoiceCallFilter::defaultIncomingActionChanged);
    connect(&incoming, &RuleChannel::announceRule, q, &SimVoiceCallFilter::incomingRuleAdded);
    connect(&incoming, &RuleChannel::announceRemoval, q, &SimVoiceCallFilter::incomingRuleRemoved);
    connect(&incoming, &RuleChannel::announceRules, q, &SimVoiceCallFilter::incomingRulesChanged);
}

void SimVoiceCallFilterPrivate::connectSignals()
{
    dial.connectSignal("RuleAdded", this,
                       SLOT(dialRuleAdded(quint32, Corvane::Mdm::SimFilterPrivate::RulePrivate)),
                       "Failed to connect to (dial) RuleAdded");
    dial.connectSignal("RuleChanged", this,
                       SLOT(dialRuleChanged(quint32, Corvane::Mdm::SimFilterPrivate::RulePrivate)),
                       "Failed to connect to (dial) RuleChanged");
    dial.connectSignal("RuleRemoved", this, SLOT(dialRuleRemoved(quint32)),
                       "Failed to connect to (dial) RuleRemoved");
    dial.connectSignal("RulesChanged", this,
                       SLOT(dialRulesChanged(Corvane::Mdm::SimFilterPrivate::RulePrivateList)),
                       "Failed to connect to (dial) RulesChanged");
    dial.connectSignal("DefaultActionChanged", this, SLOT(setDefaultDialAction(uint)),
                       "Failed to connect to (dial) DefaultActionChanged");

    incoming.connectSignal("RuleAdded", this,
                           SLOT(incomingRuleAdded(quint32, Corvane::Mdm::SimFilterPrivate::RulePrivate)),
                           "Failed to connect to (incoming) RuleAdded");
    incoming.connectSignal("RuleChanged", this,
                           SLOT(incomingRuleChanged(quint32, Corvane::Mdm::SimFilterPrivate::RulePrivate)),
                           "Failed to connect to (incoming) RuleChanged");
    incoming.connectSignal("RuleRemoved", this, SLOT(incomingRuleRemoved(quint32)),
                           "Failed to connect to (incoming) RuleRemoved");
    incoming.connectSignal("RulesChanged", this,
                           SLOT(incomingRulesChanged(Corvane::Mdm::SimFilterPrivate::RulePrivateList)),
                           "Failed to connect to (incoming) RulesChanged");
    incoming.connectSignal("DefaultActionChanged", this, SLOT(setDefaultIncomingAction(uint)),
                           "Failed to connect to (incoming) DefaultActionChanged");
}

void SimVoiceCallFilterPrivate::start()
{
    if (!dial.isValid() || !incoming.isValid()) {
        qWarning() << "Corvane::Mdm::SimVoiceCallFilter::SimVoiceCallFilter(QObject*)"
                   << "Unable to connect to voice call filter interface!";
        return;
    }

    connectSignals();
    dial.getAll(this, &SimVoiceCallFilterPrivate::dialGetAllFinished);
    incoming.getAll(this, &SimVoiceCallFilterPrivate::incomingGetAllFinished);
}

void SimVoiceCallFilterPrivate::setDefaultDialAction(uint action)
{
    dial.setDefaultAction(action);
}

void SimVoiceCallFilterPrivate::dialRuleAdded(quint32 index, const SimFilterPrivate::RulePrivate &rule)
{
    dial.ruleAdded(index, rule);
}

void SimVoiceCallFilterPrivate::dialRuleChanged(quint32, const SimFilterPrivate::RulePrivate &rule)
{
    dial.ruleChanged(rule);
}

void SimVoiceCallFilterPrivate::dialRuleRemoved(quint32 index)
{
    dial.ruleRemoved(index);
}

void SimVoiceCallFilterPrivate::dialRulesChanged(const SimFilterPrivate::RulePrivateList &rules)
{
    dial.resetRules(rules);
}

void SimVoiceCallFilterPrivate::dialGetAllFinished(QDBusPendingCallWatcher *watcher)
{
    if (dial.getAllFinished(watcher) && incoming.isReady())
        Q_EMIT q->readyChanged();
}

void SimVoiceCallFilterPrivate::setDefaultIncomingAction(uint action)
{
    incoming.setDefaultAction(action);
}

void SimVoiceCallFilterPrivate::incomingRuleAdded(quint32 index, const SimFilterPrivate::RulePrivate &rule)
{
    incoming.ruleAdded(index, rule);
}

void SimVoiceCallFilterPrivate::incomingRuleChanged(quint32, const SimFilterPrivate::RulePrivate &rule)
{
    incoming.ruleChanged(rule);
}

void SimVoiceCallFilterPrivate::incomingRuleRemoved(quint32 index)
{
    incoming.ruleRemoved(index);
}

void SimVoiceCallFilterPrivate::incomingRulesChanged(const SimFilterPrivate::RulePrivateList &rules)
{
    incoming.resetRules(rules);
}

void SimVoiceCallFilterPrivate::incomingGetAllFinished(QDBusPendingCallWatcher *watcher)
{
    if (incoming.getAllFinished(watcher) && dial.isReady())
        Q_EMIT q->readyChanged();
}

SimVoiceCallFilter::SimVoiceCallFilter(QObject *parent)
    : QObject(parent)
    , d(new SimVoiceCallFilterPrivate(this))
{
    d->start();
}

SimVoiceCallFilter::~SimVoiceCallFilter()
{
    delete d;
}

bool SimVoiceCallFilter::ready() const
{
    return d->dial.isReady() && d->incoming.isReady();
}

SimFilter::Action SimVoiceCallFilter::defaultDialAction() const
{
    return d->dial.defaultAction();
}

bool SimVoiceCallFilter::setDefaultDialAction(SimFilter::Action action)
{
    return d->dial.requestDefaultAction(action);
}

SimFilter::RuleList SimVoiceCallFilter::dialRules() const
{
    return d->dial.rules();
}

bool SimVoiceCallFilter::setDialRules(const SimFilter::RuleList &rules)
{
    return d->dial.requestRules(rules);
}

bool SimVoiceCallFilter::setDialRule(const SimFilter::Rule &rule)
{
    return d->dial.requestRule(rule);
}

bool SimVoiceCallFilter::hasDialRuleForImsi(const QString &imsi) const
{
    return d->dial.hasRuleForImsi(imsi);
}

bool SimVoiceCallFilter::removeDialRule(const QString &imsi)
{
    return d->dial.requestRemoval(imsi);
}

bool SimVoiceCallFilter::clearDialRules()
{
    return d->dial.requestClearing();
}

SimFilter::Action SimVoiceCallFilter::defaultIncomingAction() const
{
    return d->incoming.defaultAction();
}

bool SimVoiceCallFilter::setDefaultIncomingAction(SimFilter::Action action)
{
    return d->incoming.requestDefaultAction(action);
}

SimFilter::RuleList SimVoiceCallFilter::incomingRules() const
{
    return d->incoming.rules();
}

bool SimVoiceCallFilter::setIncomingRules(const SimFilter::RuleList &rules)
{
    return d->incoming.requestRules(rules);
}

bool SimVoiceCallFilter::setIncomingRule(const SimFilter::Rule &rule)
{
    return d->incoming.requestRule(rule);
}

bool SimVoiceCallFilter::hasIncomingRuleForImsi(const QString &imsi) const
{
    return d->incoming.hasRuleForImsi(imsi);
}

bool SimVoiceCallFilter::removeIncomingRule(const QString &imsi)
{
    return d->incoming.requestRemoval(imsi);
}

bool SimVoiceCallFilter::clearIncomingRules()
{
    return d->incoming.requestClearing();
}

} // namespace Mdm
} // namespace Corvane
