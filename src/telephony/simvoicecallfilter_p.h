// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_SIMVOICECALLFILTER_P_H
#define CORVANEMDM_SIMVOICECALLFILTER_P_H

#include <corvanemdm/simvoicecallfilter.h>

#include "rulechannel_p.h"

namespace Corvane
{
namespace Mdm
{

class SimVoiceCallFilterPrivate : public QObject
{
    Q_OBJECT

public:
    explicit SimVoiceCallFilterPrivate(SimVoiceCallFilter *filter);

    /** Follows the service from now on, unless it is not there. */
    void start();

    SimVoiceCallFilter *const q;
    RuleChannel dial;
    RuleChannel incoming;

private Q_SLOTS:
    void setDefaultDialAction(uint action);
    void dialRuleAdded(quint32 index, const Corvane::Mdm::SimFilterPrivate::RulePrivate &rule);
    void dialRuleChanged(quint32 index, const Corvane::Mdm::SimFilterPrivate::RulePrivate &rule);
    void dialRuleRemoved(quint32 index);
    void dialRulesChanged(const Corvane::Mdm::SimFilterPrivate::RulePrivateList &rules);
    void dialGetAllFinished(QDBusPendingCallWatcher *watcher);

    void setDefaultIncomingAction(uint action);
    void incomingRuleAdded(quint32 index, const Corvane::Mdm::SimFilterPrivate::RulePrivate &rule);
    void incomingRuleChanged(quint32 index, const Corvane::Mdm::SimFilterPrivate::RulePrivate &rule);
    void incomingRuleRemoved(quint32 index);
    void incomingRulesChanged(const Corvane::Mdm::SimFilterPrivate::RulePrivateList &rules);
    void incomingGetAllFinished(QDBusPendingCallWatcher *watcher);

private:
    void connectSignals();
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_SIMVOICECALLFILTER_P_H
