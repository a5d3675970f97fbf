// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/simmobiledatafilter.h>

#include "simmobiledatafilter_p.h"

namespace Corvane
{
namespace Mdm
{

SimMobileDataFilterPrivate::SimMobileDataFilterPrivate(SimMobileDataFilter *filter)
    : QObject(filter)
    , q(filter)
    , data({QLatin1String("/mdm/gprsfilter"), QLatin1String("org.corvaneos.ofono.mdm.GprsFilter"),
            "Invalid mobile data action:", "GetAll() failed:"},
           RuleChannel::WithoutHangup, filter)
{
    connect(&data, &RuleChannel::announceDefaultAction, q, &SimMobileDataFilter::defaultActionChanged);
    connect(&data, &RuleChannel::announceRule, q, &SimMobileDataFilter::ruleAdded);
    connect(&data, &RuleChannel::announceRemoval, q, &SimMobileDataFilter::ruleRemoved);
    connect(&data, &RuleChannel::announceRules, q, &SimMobileDataFilter::rulesChanged);
}

void SimMobileDataFilterPrivate::connectSignals()
{
    data.connectSignal("RuleAdded", this,
                       SLOT(ruleAdded(quint32, Corvane::Mdm::SimFilterPrivate::RulePrivate)),
                       "Failed to connect to RuleAdded");
    data.connectSignal("RuleChanged", this,
                       SLOT(ruleChanged(quint32, Corvane::Mdm::SimFilterPrivate::RulePrivate)),
                       "Failed to connect to RuleChanged");
    data.connectSignal("RuleRemoved", this, SLOT(ruleRemoved(quint32)), "Failed to connect to RuleRemoved");
    data.connectSignal("RulesChanged", this,
                       SLOT(rulesChanged(Corvane::Mdm::SimFilterPrivate::RulePrivateList)),
                       "Failed to connect to RulesChanged");
    data.connectSignal("DefaultActionChanged", this, SLOT(setDefaultAction(uint)),
                       "Failed to connect to DefaultActionChanged");
}

void SimMobileDataFilterPrivate::start()
{
    if (!data.isValid()) {
        qWarning() << "Corvane::Mdm::SimMobileDataFilter::SimMobileDataFilter(QObject*)"
                   << "Bad interface!";
        return;
    }

    connectSignals();
    data.getAll(this, &SimMobileDataFilterPrivate::getAllFinished);
}

void SimMobileDataFilterPrivate::setDefaultAction(uint action)
{
    data.setDefaultAction(action);
}

void SimMobileDataFilterPrivate::ruleAdded(quint32 index, const SimFilterPrivate::RulePrivate &rule)
{
    data.ruleAdded(index, rule);
}

void SimMobileDataFilterPrivate::ruleChanged(quint32, const SimFilterPrivate::RulePrivate &rule)
{
    data.ruleChanged(rule);
}

void SimMobileDataFilterPrivate::ruleRemoved(quint32 index)
{
    data.ruleRemoved(index);
}

void SimMobileDataFilterPrivate::rulesChanged(const SimFilterPrivate::RulePrivateList &rules)
{
    data.resetRules(rules);
}

void SimMobileDataFilterPrivate::getAllFinished(QDBusPendingCallWatcher *watcher)
{
    if (data.getAllFinished(watcher))
        Q_EMIT q->readyChanged();
}

SimMobileDataFilter::SimMobileDataFilter(QObject *parent)
    : QObject(parent)
    , d(new SimMobileDataFilterPrivate(this))
{
    d->start();
}

SimMobileDataFilter::~SimMobileDataFilter()
{
    delete d;
}

bool SimMobileDataFilter::ready() const
{
    return d->data.isReady();
}

SimFilter::Action SimMobileDataFilter::defaultAction() const
{
    return d->data.defaultAction();
}

bool SimMobileDataFilter::setDefaultAction(SimFilter::Action action)
{
    return d->data.requestDefaultAction(action);
}

SimFilter::RuleList SimMobileDataFilter::rules() const
{
    return d->data.rules();
}

bool SimMobileDataFilter::setRules(const SimFilter::RuleList &rules)
{
    return d->data.requestRules(rules);
}

bool SimMobileDataFilter::setRule(const SimFilter::Rule &rule)
{
    return d->data.requestRule(rule);
}

bool SimMobileDataFilter::hasRuleForImsi(const QString &imsi) const
{
    return d->data.hasRuleForImsi(imsi);
}

bool SimMobileDataFilter::removeRule(const QString &imsi)
{
    return d->data.requestRemoval(imsi);
}

bool SimMobileDataFilter::clearRules()
{
    return d->data.requestClearing();
}

} // namespace Mdm
} // namespace Corvane
