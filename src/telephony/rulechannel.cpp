// SPDX-License-Identifier: LGPL-2.1-or-later
#include "platform/frame/signalconnection_p.h"
#include "rulechannel_p.h"

#include <QtCore/QPointer>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusPendingReply>

#include <algorithm>

namespace Corvane
{
namespace Mdm
{

namespace
{

const QLatin1String OfonoService("org.ofono");

auto hasImsi(const QString &imsi)
{
    return [&imsi](const SimFilter::Rule &rule) {
        return rule.imsi == imsi;
    };
}

} // namespace

RuleChannel::RuleChannel(const RuleChannelNames &names, HangupRules hangup, QObject *interfaceParent)
    : m_names(names)
    , m_hangup(hangup)
{
    SimFilterPrivate::registerTypes();
    m_interface = new QDBusInterface(OfonoService, names.path, names.interface, QDBusConnection::systemBus(),
                                     interfaceParent);
}

bool RuleChannel::hasRuleForImsi(const QString &imsi) const
{
    return std::any_of(m_rules.begin(), m_rules.end(), hasImsi(imsi));
}

void RuleChannel::connectSignal(const char *signal, QObject *owner, const char *slot,
                                const char *failure) const
{
    if (!connectDBusSignal(QDBusConnection::systemBus(),
                           {OfonoService, m_names.path, m_names.interface, QLatin1String(signal)}, owner,
                           slot))
        qWarning() << failure;
}

bool RuleChannel::requestDefaultAction(SimFilter::Action action)
{
    if (action == SimFilter::Hangup && m_hangup == WithoutHangup)
        return false;
    return action != m_defaultAction
        && asyncCall(m_names.methods.setDefaultAction, SimFilterPrivate::actionToInt(action));
}

bool RuleChannel::requestRule(const SimFilter::Rule &rule)
{
    return accepts(rule) && !m_rules.contains(rule)
        && asyncCall(m_names.methods.addRule, rule.imsi, SimFilterPrivate::actionToInt(rule.action));
}

bool RuleChannel::requestRules(const SimFilter::RuleList &rules)
{
    const auto accepted = [this](const SimFilter::Rule &rule) {
        return accepts(rule);
    };
    if (rules == m_rules || !std::all_of(rules.begin(), rules.end(), accepted))
        return false;

    SimFilterPrivate::RulePrivateList list;
    list.reserve(rules.size());
    std::copy(rules.begin(), rules.end(), std::back_inserter(list));
    return asyncCall(m_names.methods.setRules, QVariant::fromValue(list));
}

bool RuleChannel::requestRemoval(const QString &imsi)
{
    return SimFilter::isValidImsi(imsi) && hasRuleForImsi(imsi)
        && asyncCall(m_names.methods.removeRule, imsi);
}

bool RuleChannel::requestClearing()
{
    return !m_rules.isEmpty() && asyncCall(m_names.methods.clearRules);
}

bool RuleChannel::getAllFinished(QDBusPendingCallWatcher *watcher)
{
    const QDBusPendingReply<quint32, quint32, SimFilterPrivate::RulePrivateList> reply = *watcher;
    watcher->deleteLater();
    if (reply.isError()) {
        qWarning() << m_names.getAllFailed << reply.error().name() << reply.error().message();
        return false;
    }

    m_firstGetAllValue = reply.argumentAt<0>();
    const QPointer<RuleChannel> self(this);
    setDefaultAction(reply.argumentAt<1>());
    if (self)
        resetRules(reply.argumentAt<2>());
    if (!self || m_ready)
        return false;
    m_ready = true;
    return true;
}

void RuleChannel::ruleAdded(quint32 index, const SimFilterPrivate::RulePrivate &rule)
{
    const SimFilter::Rule added = SimFilterPrivate::publicRuleFromPrivate(rule);
    if (added.imsi.isEmpty())
        return;

    SimFilter::RuleList rules = m_rules;
    rules.insert(int(std::min(index, quint32(rules.size()))), added);
    // The change of the list and the service's announcement are two events: both are signalled.
    if (setPublicRules(rules))
        Q_EMIT announceRule(added);
}

void RuleChannel::ruleChanged(const SimFilterPrivate::RulePrivate &rule)
{
    const SimFilter::Rule changed = SimFilterPrivate::publicRuleFromPrivate(rule);
    const auto known = std::find_if(m_rules.cbegin(), m_rules.cend(), hasImsi(changed.imsi));
    if (changed.imsi.isEmpty() || known == m_rules.cend() || known->action == changed.action)
        return;

    SimFilter::RuleList rules = m_rules;
    rules[int(known - m_rules.cbegin())].action = changed.action;
    setPublicRules(rules);
}

void RuleChannel::ruleRemoved(quint32 index)
{
    if (index >= quint32(m_rules.size()))
        return;

    SimFilter::RuleList rules = m_rules;
    const SimFilter::Rule removed = rules.takeAt(int(index));
    // Signalled twice, as an added rule is.
    if (setPublicRules(rules))
        Q_EMIT announceRemoval(removed.imsi);
}

void RuleChannel::resetRules(const SimFilterPrivate::RulePrivateList &rules)
{
    SimFilter::RuleList accepted;
    accepted.reserve(rules.size());
    for (const SimFilterPrivate::RulePrivate &rule : rules) {
        const SimFilter::Rule publicRule = SimFilterPrivate::publicRuleFromPrivate(rule);
        if (!publicRule.imsi.isEmpty())
            accepted.append(publicRule);
    }
    setPublicRules(accepted);
}

void RuleChannel::setDefaultAction(uint value)
{
    bool ok = false;
    const SimFilter::Action action = SimFilterPrivate::actionFromInt(value, &ok);
    if (!ok) {
        qWarning() << m_names.invalidDefaultAction << value;
    } else if (action != m_defaultAction) {
        m_defaultAction = action;
        Q_EMIT announceDefaultAction();
    }
}

bool RuleChannel::accepts(const SimFilter::Rule &rule) const
{
    const bool actionAccepted = rule.action == SimFilter::Block || rule.action == SimFilter::Allow
        || (rule.action == SimFilter::Hangup && m_hangup == WithHangup);
    return actionAccepted && SimFilter::isValidImsi(rule.imsi);
}

template <typename... Arguments> bool RuleChannel::asyncCall(QLatin1String method, Arguments &&...arguments)
{
    if (!m_started)
        return false;
    watchCall(m_interface->asyncCall(method, std::forward<Arguments>(arguments)...), this,
              &RuleChannel::asyncCallFinishedWithVoidReply);
    return true;
}

void RuleChannel::asyncCallFinishedWithVoidReply(QDBusPendingCallWatcher *watcher)
{
    watcher->deleteLater();
    if (watcher->isError())
        qWarning() << "Method call failed:" << watcher->error().name() << watcher->error().message();
}

// The one place where the mirrored list changes. Returns whether this object outlived the receivers of its
// signals.
bool RuleChannel::setPublicRules(const SimFilter::RuleList &newRules)
{
    if (newRules == m_rules)
        return true;

    const SimFilter::RuleList oldRules = m_rules;
    const SimFilter::RuleList added
        = SimFilterPrivate::addedRules(oldRules, newRules, m_hangup == WithHangup);
    const QStringList removed = SimFilterPrivate::removedImsis(oldRules, newRules);
    m_rules = newRules;

    const QPointer<RuleChannel> self(this);
    Q_EMIT announceRules(oldRules, newRules);
    for (auto rule = added.begin(); self && rule != added.end(); ++rule)
        Q_EMIT announceRule(*rule);
    for (auto imsi = removed.begin(); self && imsi != removed.end(); ++imsi)
        Q_EMIT announceRemoval(*imsi);
    return !self.isNull();
}

} // namespace Mdm
} // namespace Corvane
