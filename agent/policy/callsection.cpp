// SPDX-License-Identifier: LGPL-2.1-or-later
#include "callsection.h"

#include <functional>

namespace Corvane
{
namespace Agent
{

using Mdm::SimFilter;

namespace
{

const QLatin1String defaultMember("default");
const QLatin1String rulesMember("rules");

QString pathOf(CallDirection direction, QLatin1String member)
{
    return QStringLiteral("calls.%1.%2").arg(directionName(direction), member);
}

QJsonObject wantedFor(CallDirection direction, const QJsonObject &wanted)
{
    return wanted.value(directionName(direction)).toObject();
}

Setting::Value rulesValue(const SimFilter::RuleList &rules)
{
    return {rulesToJson(rules), rulesText(rules)};
}

bool namesSim(const QJsonObject &wanted, const std::function<bool(const QString &imsi)> &predicate)
{
    for (const CallDirection direction : allCallDirections) {
        const SimFilter::RuleList rules
            = rulesFromJson(wantedFor(direction, wanted).value(rulesMember).toArray());
        for (const SimFilter::Rule &rule : rules) {
            if (predicate(rule.imsi))
                return true;
        }
    }
    return false;
}

} // namespace

CallSection::CallSection(std::chrono::milliseconds timeout)
    : m_timeout(timeout)
{
}

QString CallSection::member() const
{
    return QStringLiteral("calls");
}

Service CallSection::service() const
{
    return Service::telephony();
}

QString CallSection::fault(const QJsonObject &wanted) const
{
    for (const CallDirection direction : allCallDirections) {
        const auto rules = rulesFromJson(wantedFor(direction, wanted).value(rulesMember).toArray());
        const int repeated = repeatedRule(rules);
        if (repeated >= 0) {
            return QStringLiteral(R"(/calls/%1/rules/%2/imsi: must be named once; "%3" has a rule already)")
                .arg(directionName(direction), QString::number(repeated), rules.at(repeated).imsi);
        }
    }
    return QString();
}

QVector<Setting> CallSection::settings(const QJsonObject &wanted) const
{
    QVector<Setting> settings;
    for (const CallDirection direction : allCallDirections) {
        const QJsonObject members = wantedFor(direction, wanted);
        if (members.contains(defaultMember)) {
            Setting setting;
            setting.path = pathOf(direction, defaultMember);
            setting.wanted = {members.value(defaultMember), members.value(defaultMember).toString()};
            settings.append(setting);
        }
        if (members.contains(rulesMember)) {
            Setting setting;
            setting.path = pathOf(direction, rulesMember);
            setting.wanted = rulesValue(rulesFromJson(members.value(rulesMember).toArray()));
            settings.append(setting);
        }
    }
    return settings;
}

Reply CallSection::open(const QJsonObject &wanted)
{
    m_filter = std::make_unique<CallFilter>(m_timeout);
    const Reply opened = m_filter->open();
    if (!opened.isDone())
        return opened;
    connect(m_filter.get(), &CallFilter::changed, this, &CallSection::drifted);
    const auto isAnySim = [](const QString &imsi) {
        return imsi == AnySim;
    };
    if (!namesSim(wanted, [](const QString &) { return true; }))
        return {};
    const Reply told = openSims();
    m_simsAreTold = told.isDone();
    // A rule for a named SIM needs no look at the slots.
    return m_simsAreTold || !namesSim(wanted, isAnySim) ? Reply{} : told;
}

Reply CallSection::openSims()
{
    m_sims = std::make_unique<SimCards>(m_timeout);
    const Reply told = m_sims->ask();
    if (told.outcome == Reply::Refused)
        return {Reply::Refused, QStringLiteral("the SIMs of the phone are not known: ") + told.text};
    connect(m_sims.get(), &SimCards::changed, this, &CallSection::drifted);
    return told;
}

void CallSection::close()
{
    m_filter.reset();
    m_sims.reset();
    m_simsAreTold = false;
}

QVector<Setting> CallSection::compare(const QJsonObject &wanted)
{
    QVector<Setting> compared;
    const QVector<Setting> named = settings(wanted);
    for (const Setting &setting : named) {
        for (const CallDirection direction : allCallDirections) {
            if (setting.path == pathOf(direction, defaultMember))
                compared.append(compareDefault(setting, direction));
            else if (setting.path == pathOf(direction, rulesMember))
                compared.append(compareRules(setting, direction));
        }
    }
    return compared;
}

Setting CallSection::compareDefault(Setting setting, CallDirection direction) const
{
    const QString action = actionName(m_filter->defaultAction(direction));
    setting.present = {action, action};
    setting.status = setting.wanted.text == action ? Setting::Compliant : Setting::Different;
    return setting;
}

Setting CallSection::compareRules(Setting setting, CallDirection direction) const
{
    const SimFilter::RuleList present = m_filter->rules(direction);
    const QStringList imsis = m_simsAreTold ? m_sims->imsis() : QStringList();
    const SimFilter::RuleList wanted = expandedRules(rulesFromJson(setting.wanted.json.toArray()), imsis);
    const RuleDifference difference(present, wanted);
    setting.present = rulesValue(present);
    setting.wanted = rulesValue(wanted);
    setting.status = difference.isEmpty() ? Setting::Compliant : Setting::Different;
    QStringList details{difference.toString(), absentSimsText(wanted, imsis)};
    details.removeAll(QString());
    setting.detail = details.join(QLatin1String("; "));
    return setting;
}

/** A rule for a SIM that is elsewhere is kept by the phone, and so it is compliant; but it may be a mistake.
 */
QString CallSection::absentSimsText(const SimFilter::RuleList &wanted, const QStringList &present) const
{
    QStringList notes;
    for (const SimFilter::Rule &rule : wanted) {
        if (m_simsAreTold && !present.contains(rule.imsi))
            notes.append(QStringLiteral("no SIM %1 in the phone").arg(rule.imsi));
    }
    return notes.join(QLatin1String("; "));
}

Reply CallSection::change(const Setting &setting)
{
    for (const CallDirection direction : allCallDirections) {
        if (setting.path == pathOf(direction, rulesMember))
            return m_filter->setRules(direction, rulesFromJson(setting.wanted.json.toArray()));
        const auto action = actionNamed(direction, setting.wanted.text);
        if (setting.path == pathOf(direction, defaultMember) && action)
            return m_filter->setDefaultAction(direction, *action);
    }
    return {Reply::Refused, QStringLiteral("no such setting")};
}

QJsonObject CallSection::exported()
{
    QJsonObject calls;
    for (const CallDirection direction : allCallDirections) {
        calls.insert(directionName(direction),
                     QJsonObject{{defaultMember, actionName(m_filter->defaultAction(direction))},
                                 {rulesMember, rulesToJson(m_filter->rules(direction))}});
    }
    return calls;
}

} // namespace Agent
} // namespace Corvane
