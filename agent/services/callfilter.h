// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_CALLFILTER_H
#define CORVANE_CALLFILTER_H

#include "callrules.h"
#include "reply.h"

#include <corvanemdm/simvoicecallfilter.h>

#include <QtCore/QObject>

#include <chrono>
#include <functional>

namespace Corvane
{
namespace Agent
{

/** The rules for calls of either direction, with every change awaited until the service confirms it. */
class CallFilter : public QObject
{
    Q_OBJECT

public:
    explicit CallFilter(std::chrono::milliseconds timeout, QObject *parent = nullptr);

    /** Waits until the service's state is known; everything else needs that. */
    Reply open();

    Mdm::SimFilter::RuleList rules(CallDirection direction) const;
    bool hasRule(CallDirection direction, const QString &imsi) const;
    Mdm::SimFilter::Action defaultAction(CallDirection direction) const;

    // What holds already is done without asking the service.
    Reply setRules(CallDirection direction, const Mdm::SimFilter::RuleList &rules);
    Reply setRule(CallDirection direction, const Mdm::SimFilter::Rule &rule);
    Reply removeRule(CallDirection direction, const QString &imsi);
    Reply clearRules(CallDirection direction);
    Reply setDefaultAction(CallDirection direction, Mdm::SimFilter::Action action);

Q_SIGNALS:
    void rulesChanged(Corvane::Agent::CallDirection direction, const Mdm::SimFilter::RuleList &oldRules,
                      const Mdm::SimFilter::RuleList &newRules);
    void defaultActionChanged(Corvane::Agent::CallDirection direction);
    /** Any of the above. */
    void changed();

private:
    Reply change(const std::function<bool()> &isDone, const std::function<bool()> &request);

    Mdm::SimVoiceCallFilter m_filter;
    std::chrono::milliseconds m_timeout;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_CALLFILTER_H
