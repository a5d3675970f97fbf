// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_RULECHANNEL_P_H
#define CORVANEMDM_RULECHANNEL_P_H

#include "frame/asynccommand_p.h"
#include "simfilter_p.h"

#include <QtCore/QObject>
#include <QtDBus/QDBusInterface>

namespace Corvane
{
namespace Mdm
{

/** The methods that change rules, as one interface of the service calls them. */
struct RuleMethods {
    QLatin1String addRule{"AddRule"};
    QLatin1String removeRule{"RemoveRule"};
    QLatin1String setRules{"SetRules"};
    QLatin1String clearRules{"ClearRules"};
    QLatin1String setDefaultAction{"SetDefaultAction"};
};

/** How one kind of traffic is called on the wire and in the log. */
struct RuleChannelNames {
    QLatin1String path;
    QLatin1String interface;
    const char *invalidDefaultAction;
    const char *getAllFailed;
    RuleMethods methods = RuleMethods();
};

/**
 * Mirrors the rules and the default action for one kind of traffic, and requests changes of them.
 *
 * The owner, a filter's private object, receives the service's signals and replies in slots named after the
 * traffic and passes them on to the functions of the same purpose here. It announces what this object signals
 * under its own names. Requests return whether something was sent; the mirror changes only through what the
 * service announces.
 */
class RuleChannel : public QObject
{
    Q_OBJECT

public:
    enum HangupRules { WithoutHangup, WithHangup };

    /**
     * @p hangup tells whether the traffic can be hung up: whether such rules can be requested, and are among
     * those that a change of the list announces. @p interfaceParent becomes the parent of the D-Bus
     * interface.
     */
    RuleChannel(const RuleChannelNames &names, HangupRules hangup, QObject *interfaceParent);

    bool isValid() const { return m_interface->isValid(); }
    bool isReady() const { return m_ready; }
    SimFilter::Action defaultAction() const { return m_defaultAction; }
    SimFilter::RuleList rules() const { return m_rules; }
    bool hasRuleForImsi(const QString &imsi) const;

    /** Connects a signal of the service to a slot of @p owner; logs @p failure when that does not work. */
    void connectSignal(const char *signal, QObject *owner, const char *slot, const char *failure) const;
    /** Asks for rules and default action; the answer goes to @p slot of @p owner. Before this, requests are
     * refused. */
    template <typename Owner> void getAll(Owner *owner, void (Owner::*slot)(QDBusPendingCallWatcher *))
    {
        m_started = true;
        askForState(m_interface, QStringLiteral("GetAll"), owner, slot);
    }

    bool requestDefaultAction(SimFilter::Action action);
    bool requestRule(const SimFilter::Rule &rule);
    bool requestRules(const SimFilter::RuleList &rules);
    bool requestRemoval(const QString &imsi);
    bool requestClearing();

    /** @return whether this answer made the channel ready. */
    bool getAllFinished(QDBusPendingCallWatcher *watcher);
    void ruleAdded(quint32 index, const SimFilterPrivate::RulePrivate &rule);
    void ruleChanged(const SimFilterPrivate::RulePrivate &rule);
    void ruleRemoved(quint32 index);
    void resetRules(const SimFilterPrivate::RulePrivateList &rules);
    void setDefaultAction(uint value);

Q_SIGNALS:
    void announceDefaultAction();
    void announceRule(const SimFilter::Rule &rule);
    void announceRemoval(const QString &imsi);
    void announceRules(const SimFilter::RuleList &oldRules, const SimFilter::RuleList &newRules);

private:
    bool accepts(const SimFilter::Rule &rule) const;
    template <typename... Arguments> bool asyncCall(QLatin1String method, Arguments &&...arguments);
    void asyncCallFinishedWithVoidReply(QDBusPendingCallWatcher *watcher);
    bool setPublicRules(const SimFilter::RuleList &newRules);

    const RuleChannelNames m_names;
    const HangupRules m_hangup;
    QDBusInterface *m_interface;
    SimFilter::RuleList m_rules;
    SimFilter::Action m_defaultAction = SimFilter::Block;
    quint32 m_firstGetAllValue = 0;
    bool m_started = false;
    bool m_ready = false;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_RULECHANNEL_P_H
