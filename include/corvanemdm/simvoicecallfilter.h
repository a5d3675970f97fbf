// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_SIMVOICECALLFILTER_H
#define CORVANEMDM_SIMVOICECALLFILTER_H

#include <corvanemdm/simfilter.h>

namespace Corvane
{
namespace Mdm
{

class SimVoiceCallFilterPrivate;

/**
 * @brief Decides per SIM what happens to outgoing ("dial") and incoming calls.
 *
 * The telephony service keeps, for each direction, a list of rules by IMSI and a default action for SIMs that
 * no rule names. The object mirrors both directions and follows the service's changes. Nothing blocks after
 * construction, which looks the service up.
 *
 * A mutator returns whether a request was sent; false means that its arguments were refused or that it would
 * change nothing. The mirrored state changes only when the service announces the change. A request that the
 * service refuses is logged ("Method call failed:", the error's name and message) and changes nothing.
 *
 * Requests are compared with the mirrored state, which is empty and Block until readyChanged(): before that,
 * false may also mean that the request would change something. The state is asked for once: the changes of a
 * service that was away in between are not seen.
 *
 * An object whose service was not running at construction stays inert, also when the service appears later:
 * never ready, empty lists, Block as the defaults, and every mutator returns false. It also stays unready,
 * with a warning, when the service refuses to tell the rules of either direction.
 *
 * Source: telephony service "org.ofono", objects "/mdm/voicecallfilter/dial" and
 * "/mdm/voicecallfilter/incoming".
 */
class CORVANEMDM_EXPORT SimVoiceCallFilter : public QObject
{
    Q_OBJECT
    /** Whether the state of both directions has been taken over from the service; once true it stays true. */
    Q_PROPERTY(bool ready READ ready NOTIFY readyChanged)
    /** Action for outgoing calls of SIMs without a rule. */
    Q_PROPERTY(Corvane::Mdm::SimFilter::Action defaultDialAction READ defaultDialAction WRITE
                   setDefaultDialAction NOTIFY defaultDialActionChanged)
    /** Action for incoming calls of SIMs without a rule. */
    Q_PROPERTY(Corvane::Mdm::SimFilter::Action defaultIncomingAction READ defaultIncomingAction WRITE
                   setDefaultIncomingAction NOTIFY defaultIncomingActionChanged)
    /** Rules for outgoing calls, in the service's order. */
    Q_PROPERTY(
        Corvane::Mdm::SimFilter::RuleList dialRules READ dialRules WRITE setDialRules NOTIFY dialRulesChanged)
    /** Rules for incoming calls, in the service's order. */
    Q_PROPERTY(Corvane::Mdm::SimFilter::RuleList incomingRules READ incomingRules WRITE setIncomingRules
                   NOTIFY incomingRulesChanged)

public:
    /** Looks the service up, which blocks, and asks for its rules; readyChanged() tells when they are there.
     */
    explicit SimVoiceCallFilter(QObject *parent = nullptr);
    ~SimVoiceCallFilter() override;

    /** False until readyChanged(), and for good where the service is absent or does not tell its rules. */
    bool ready() const;

    /** SimFilter::Block until the object is ready. */
    SimFilter::Action defaultDialAction() const;
    /** Requests @p action for outgoing calls; Hangup, or the action that is set already, is refused. */
    bool setDefaultDialAction(SimFilter::Action action);

    /** Empty until the object is ready. */
    SimFilter::RuleList dialRules() const;
    /**
     * Requests that @p rules replace the whole outgoing list. A list equal to the present one is refused, and
     * so is one with an invalid IMSI or an action other than Block and Allow.
     */
    bool setDialRules(const SimFilter::RuleList &rules);
    /**
     * Requests an outgoing rule. A rule that the list has already is refused, and so is one with an invalid
     * IMSI or an action other than Block and Allow. A rule for an IMSI that has another action is sent.
     */
    Q_INVOKABLE bool setDialRule(const Corvane::Mdm::SimFilter::Rule &rule);
    /** Whether an outgoing rule has exactly this @p imsi. */
    Q_INVOKABLE bool hasDialRuleForImsi(const QString &imsi) const;
    /** Requests the removal of the outgoing rule for @p imsi; refused when there is none. */
    Q_INVOKABLE bool removeDialRule(const QString &imsi);
    /** Requests an empty outgoing list; refused when it is empty already. */
    Q_INVOKABLE bool clearDialRules();

    /** SimFilter::Block until the object is ready. */
    SimFilter::Action defaultIncomingAction() const;
    /** Requests @p action for incoming calls; the action that is set already is refused. */
    bool setDefaultIncomingAction(SimFilter::Action action);

    /** Empty until the object is ready. */
    SimFilter::RuleList incomingRules() const;
    /** As setDialRules(), for incoming calls; Hangup is accepted too. */
    bool setIncomingRules(const SimFilter::RuleList &rules);
    /** As setDialRule(), for incoming calls; Hangup is accepted too. */
    Q_INVOKABLE bool setIncomingRule(const Corvane::Mdm::SimFilter::Rule &rule);
    /** Whether an incoming rule has exactly this @p imsi. */
    Q_INVOKABLE bool hasIncomingRuleForImsi(const QString &imsi) const;
    /** Requests the removal of the incoming rule for @p imsi; refused when there is none. */
    Q_INVOKABLE bool removeIncomingRule(const QString &imsi);
    /** Requests an empty incoming list; refused when it is empty already. */
    Q_INVOKABLE bool clearIncomingRules();

Q_SIGNALS:
    /** Both directions have been taken over; emitted once. */
    void readyChanged();

    /** The service has another default action for outgoing calls. */
    void defaultDialActionChanged();
    /**
     * @p rule is new in the outgoing list, or has a new action. The service's announcement of a single rule
     * is signalled twice: by the change of the list and by the announcement itself.
     */
    void dialRuleAdded(const SimFilter::Rule &rule);
    /** The list has no rule for @p imsi any more. The removal of a single rule is signalled twice. */
    void dialRuleRemoved(const QString &imsi);
    /** The outgoing list changed; comes before the signals about single rules. */
    void dialRulesChanged(const SimFilter::RuleList &oldRules, const SimFilter::RuleList &newRules);

    /** As defaultDialActionChanged(), for incoming calls. */
    void defaultIncomingActionChanged();
    /** As dialRuleAdded(), for incoming calls. */
    void incomingRuleAdded(const SimFilter::Rule &rule);
    /** As dialRuleRemoved(), for incoming calls. */
    void incomingRuleRemoved(const QString &imsi);
    /** As dialRulesChanged(), for incoming calls. */
    void incomingRulesChanged(const SimFilter::RuleList &oldRules, const SimFilter::RuleList &newRules);

private:
    Q_DISABLE_COPY(SimVoiceCallFilter)
    SimVoiceCallFilterPrivate *const d;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_SIMVOICECALLFILTER_H
