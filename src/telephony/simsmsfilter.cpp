// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/simsmsfilter.h>

#include "simsmsfilter_p.h"

namespace Corvane
{
namespace Mdm
{

SimSmsFilterPrivate::SimSmsFilterPrivate(SimSmsFilter *filter)
    : QObject(filter)
    , q(filter)
    , text({QLatin1String("/mdm/smsfilter/textin"),
            QLatin1String("org.corvaneos.ofono.mdm.SmsFilter"),
            "Invalid Text SMS action:",
            "GetAll() failed:",
            {QLatin1String("AddTextRule"), QLatin1String("RemoveTextRule"), QLatin1String("SetTextRules"),
             QLatin1String("ClearTextRules"), QLatin1String("SetDefaultTextAction")}},
           RuleChannel::WithoutHangup, filter)
{
    connect(&text, &RuleChannel::announceDefaultAction, q, &SimSmsFilter::defaultTextActionChanged);
    connect(&text, &RuleChannel::announceRule, q, &SimSmsFilter::textRuleAdded);
    connect(&text, &RuleChannel::announceRemoval, q, &SimSmsFilter::textRuleRemoved);
    connect(&text, &RuleChannel::announceRules, q, &SimSmsFilter::textRulesChanged);
}

void SimSmsFilterPrivate::connectSignals()
{
    text.connectSignal("TextRuleAdded", this,
                       SLOT(textRuleAdded(quint32, Corvane::Mdm::SimFilterPrivate::RulePrivate)),
                       "Failed to connect to TextRuleAdded");
    text.connectSignal("TextRuleChanged", this,
                       SLOT(textRuleChanged(quint32, Corvane::Mdm::SimFilterPrivate::RulePrivate)),
                       "Failed to connect to TextRuleChanged");
    text.connectSignal("TextRuleRemoved", this, SLOT(textRuleRemoved(quint32)),
                       "Failed to connect to TextRuleRemoved");
    text.connectSignal("TextRulesChanged", this,
                       SLOT(textRulesChanged(Corvane::Mdm::SimFilterPrivate::RulePrivateList)),
                       "Failed to connect to TextRulesChanged");
    text.connectSignal("DefaultTextActionChanged", this, SLOT(setDefaultTextAction(uint)),
                       "Failed to connect to DefaultTextActionChanged");
}

void SimSmsFilterPrivate::start()
{
    if (!text.isValid()) {
        qWarning() << "Corvane::Mdm::SimSmsFilter::SimSmsFilter(QObject*)"
                   << "Bad interface!";
        return;
    }

    connectSignals();
    text.getAll(this, &SimSmsFilterPrivate::getAllFinished);
}

void SimSmsFilterPrivate::setDefaultTextAction(uint action)
{
    text.setDefaultAction(action);
}

void SimSmsFilterPrivate::textRuleAdded(quint32 index, const SimFilterPrivate::RulePrivate &rule)
{
    text.ruleAdded(index, rule);
}

void SimSmsFilterPrivate::textRuleChanged(quint32, const SimFilterPrivate::RulePrivate &rule)
{
    text.ruleChanged(rule);
}

void SimSmsFilterPrivate::textRuleRemoved(quint32 index)
{
    text.ruleRemoved(index);
}

void SimSmsFilterPrivate::textRulesChanged(const SimFilterPrivate::RulePrivateList &rules)
{
    text.resetRules(rules);
}

void SimSmsFilterPrivate::getAllFinished(QDBusPendingCallWatcher *watcher)
{
    if (text.getAllFinished(watcher))
        Q_EMIT q->readyChanged();
}

SimSmsFilter::SimSmsFilter(QObject *parent)
    : QObject(parent)
    , d(new SimSmsFilterPrivate(this))
{
    d->start();
}

SimSmsFilter::~SimSmsFilter()
{
    delete d;
}

bool SimSmsFilter::ready() const
{
    return d->text.isReady();
}

SimFilter::Action SimSmsFilter::defaultTextAction() const
{
    return d->text.defaultAction();
}

bool SimSmsFilter::setDefaultTextAction(SimFilter::Action action)
{
    return d->text.requestDefaultAction(action);
}

SimFilter::RuleList SimSmsFilter::textRules() const
{
    return d->text.rules();
}

bool SimSmsFilter::setTextRules(const SimFilter::RuleList &rules)
{
    return d->text.requestRules(rules);
}

bool SimSmsFilter::setTextRule(const SimFilter::Rule &rule)
{
    return d->text.requestRule(rule);
}

bool SimSmsFilter::hasTextRuleForImsi(const QString &imsi) const
{
    return d->text.hasRuleForImsi(imsi);
}

bool SimSmsFilter::removeTextRule(const QString &imsi)
{
    return d->text.requestRemoval(imsi);
}

bool SimSmsFilter::clearTextRules()
{
    return d->text.requestClearing();
}

} // namespace Mdm
} // namespace Corvane
