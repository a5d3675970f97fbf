// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_SIMSMSFILTER_P_H
#define CORVANEMDM_SIMSMSFILTER_P_H

#include <corvanemdm/simsmsfilter.h>

#include "rulechannel_p.h"

namespace Corvane
{
namespace Mdm
{

class SimSmsFilterPrivate : public QObject
{
    Q_OBJECT

public:
    explicit SimSmsFilterPrivate(SimSmsFilter *filter);

    /** Follows the service from now on, unless it is not there. */
    void start();

    SimSmsFilter *const q;
    RuleChannel text;

private Q_SLOTS:
    void setDefaultTextAction(uint action);
    void textRuleAdded(quint32 index, const Corvane::Mdm::SimFilterPrivate::RulePrivate &rule);
    void textRuleChanged(quint32 index, const Corvane::Mdm::SimFilterPrivate::RulePrivate &rule);
    void textRuleRemoved(quint32 index);
    void textRulesChanged(const Corvane::Mdm::SimFilterPrivate::RulePrivateList &rules);
    void getAllFinished(QDBusPendingCallWatcher *watcher);

private:
    void connectSignals();
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_SIMSMSFILTER_P_H
