// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_SIMSMSFILTER_H
#define CORVANEMDM_SIMSMSFILTER_H

#include <corvanemdm/simfilter.h>

namespace Corvane
{
namespace Mdm
{

class SimSmsFilterPrivate;

/**
 * @brief Decides per SIM what happens to incoming text messages.
 *
 * The telephony service keeps a list of rules by IMSI and a default action for SIMs that no rule names. The
 * object mirrors both and follows the service's changes. Nothing blocks after construction, which looks the
 * service up.
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
 * never ready, an empty list, Block as the default, and every mutator returns false. It also stays unready,
 * with a warning, when the service refuses to tell its rules.
 *
 * Source: telephony service "org.ofono", object "/mdm/smsfilter/textin".
 */
class CORVANEMDM_EXPORT SimSmsFilter : public QObject
{
    Q_OBJECT
    /** Whether the state has been taken over from the service; once true it stays true. */
    Q_PROPERTY(bool ready READ ready NOTIFY readyChanged)
    /** Action for text messages to SIMs without a rule. */
    Q_PROPERTY(Corvane::Mdm::SimFilter::Action defaultTextAction READ defaultTextAction WRITE
                   setDefaultTextAction NOTIFY defaultTextActionChanged)
    /** Rules for text messages, in the service's order. */
    Q_PROPERTY(
        Corvane::Mdm::SimFilter::RuleList textRules READ textRules WRITE setTextRules NOTIFY textRulesChanged)

public:
    /** Looks the service up, which blocks, and asks for its rules; readyChanged() tells when they are there.
     */
    explicit SimSmsFilter(QObject *parent = nullptr);
    ~SimSmsFilter() override;

    /** False until readyChanged(), and for good where the service is absent or does not tell its rules. */
    bool ready() const;

    /** SimFilter::Block until the object is ready. */
    SimFilter::Action defaultTextAction() const;
    /** Requests @p action for text messages; Hangup, or the action that is set already, is refused. */
    bool setDefaultTextAction(SimFilter::Action action);

    /** Empty until the object is ready. */
    SimFilter::RuleList textRules() const;
    /**
     * Requests that @p rules replace the whole list. A list equal to the present one is refused, and so is
     * one with an invalid IMSI or an action other than Block and Allow.
     */
    bool setTextRules(const SimFilter::RuleList &rules);
    /**
     * Requests a rule. A rule that the list has already is refused, and so is one with an invalid IMSI or an
     * action other than Block and Allow. A rule for an IMSI that has another action is sent.
     */
    Q_INVOKABLE bool setTextRule(const Corvane::Mdm::SimFilter::Rule &rule);
    /** Whether a rule has exactly this @p imsi. */
    Q_INVOKABLE bool hasTextRuleForImsi(const QString &imsi) const;
    /** Requests the removal of the rule for @p imsi; refused when there is none. */
    Q_INVOKABLE bool removeTextRule(const QString &imsi);
    /** Requests an empty list; refused when it is empty already. */
    Q_INVOKABLE bool clearTextRules();

Q_SIGNALS:
    /** The state has been taken over; emitted once. */
    void readyChanged();

    /** The service has another default action. */
    void defaultTextActionChanged();
    /**
     * @p rule is new in the list, or has a new action. The service's announcement of a single rule is
     * signalled twice: by the change of the list and by the announcement itself.
     */
    void textRuleAdded(const SimFilter::Rule &rule);
    /** The list has no rule for @p imsi any more. The removal of a single rule is signalled twice. */
    void textRuleRemoved(const QString &imsi);
    /** The list changed; comes before the signals about single rules. */
    void textRulesChanged(const SimFilter::RuleList &oldRules, const SimFilter::RuleList &newRules);

private:
    Q_DISABLE_COPY(SimSmsFilter)
    SimSmsFilterPrivate *const d;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_SIMSMSFILTER_H
