// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_RULEFILTER_H
#define CORVANE_RULEFILTER_H

#include "reply.h"
#include "simrules.h"

#include <QtCore/QObject>

#include <chrono>
#include <functional>
#include <map>

namespace Corvane
{
namespace Agent
{

/** The rules of one family, with every change awaited until the service confirms it. */
class RuleFilter : public QObject
{
    Q_OBJECT

public:
    RuleFilter(const RuleFamily &family, std::chrono::milliseconds timeout, QObject *parent = nullptr);

    RuleFamily family() const { return m_family; }

    /** Waits until the service's state is known; everything else needs that. */
    Reply open();

    // The traffic is of the family.
    Mdm::SimFilter::RuleList rules(Traffic traffic) const;
    bool hasRule(Traffic traffic, const QString &imsi) const;
    Mdm::SimFilter::Action defaultAction(Traffic traffic) const;

    // What holds already is done without asking the service.
    Reply setRules(Traffic traffic, const Mdm::SimFilter::RuleList &rules);
    Reply setRule(Traffic traffic, const Mdm::SimFilter::Rule &rule);
    Reply removeRule(Traffic traffic, const QString &imsi);
    Reply clearRules(Traffic traffic);
    Reply setDefaultAction(Traffic traffic, Mdm::SimFilter::Action action);

Q_SIGNALS:
    void rulesChanged(Corvane::Agent::Traffic traffic, const Mdm::SimFilter::RuleList &oldRules,
                      const Mdm::SimFilter::RuleList &newRules);
    void defaultActionChanged(Corvane::Agent::Traffic traffic);
    /** Any of the above. */
    void changed();
    /** The service's state is known. */
    void opened();

private:
    /** What the library's object has for one kind of traffic. */
    struct Channel {
        std::function<Mdm::SimFilter::RuleList()> rules;
        std::function<Mdm::SimFilter::Action()> defaultAction;
        std::function<bool(const QString &)> hasRule;
        std::function<bool(const Mdm::SimFilter::RuleList &)> setRules;
        std::function<bool(const Mdm::SimFilter::Rule &)> setRule;
        std::function<bool(const QString &)> removeRule;
        std::function<bool()> clearRules;
        std::function<bool(Mdm::SimFilter::Action)> setDefaultAction;
    };

    template <typename Filter> Filter *makeFilter();
    template <typename Filter, typename Members>
    void addChannel(Traffic traffic, Filter *filter, const Members &members);
    Reply change(const std::function<bool()> &isDone, const std::function<bool()> &request);

    const RuleFamily m_family;
    const std::chrono::milliseconds m_timeout;
    std::function<bool()> m_isReady;
    std::map<Traffic, Channel> m_channels;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_RULEFILTER_H
