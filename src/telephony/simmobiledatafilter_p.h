// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_SIMMOBILEDATAFILTER_P_H
#define CORVANEMDM_SIMMOBILEDATAFILTER_P_H

#include <corvanemdm/simmobiledatafilter.h>

#include "rulechannel_p.h"

namespace Corvane
{
namespace Mdm
{

class SimMobileDataFilterPrivate : public QObject
{
    Q_OBJECT

public:
    explicit SimMobileDataFilterPrivate(SimMobileDataFilter *filter);

    /** Follows the service from now on, unless it is not there. */
    void start();

    SimMobileDataFilter *const q;
    RuleChannel data;

private Q_SLOTS:
    void setDefaultAction(uint action);
    void ruleAdded(quint32 index, const Corvane::Mdm::SimFilterPrivate::RulePrivate &rule);
    void ruleChanged(quint32 index, const Corvane::Mdm::SimFilterPrivate::RulePrivate &rule);
    void ruleRemoved(quint32 index);
    void rulesChanged(const Corvane::Mdm::SimFilterPrivate::RulePrivateList &rules);
    void getAllFinished(QDBusPendingCallWatcher *watcher);

private:
    void connectSignals();
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_SIMMOBILEDATAFILTER_P_H
