// SPDX-License-Identifier: LGPL-2.1-or-later
#include "rulesection.h"

#include "schemaexplanation.h"

namespace Corvane
{
namespace Agent
{

using Mdm::SimFilter;

namespace
{

const QLatin1String defaultMember("default");
const QLatin1String rulesMember("rules");

Setting::Value rulesValue(const SimFilter::RuleList &rules)
{
    return {rulesToJson(rules), rulesText(rules)};
}

} // namespace

RuleSection::RuleSection(const RuleFamily &family, std::chrono::milliseconds timeout)
    : m_family(family)
    , m_timeout(timeout)
{
}

QStringList RuleSection::stepsTo(Traffic traffic, QLatin1String member) const
{
    if (m_family.hasDirections())
        return {m_family.name, directionName(traffic), member};
    return {m_family.name, member};
}

QString RuleSection::pathOf(Traffic traffic, QLatin1String member) const
{
    return stepsTo(traffic, member).join(QLatin1Char('.'));
}

QJsonObject RuleSection::wantedFor(Traffic traffic, const QJsonObject &wanted) const
{
    return m_family.hasDirections() ? wanted.value(directionName(traffic)).toObject() : wanted;
}

bool RuleSection::namesSim(const QJsonObject &wanted,
                           const std::function<bool(const QString &imsi)> &predicate) const
{
    for (const Traffic traffic : m_family.traffic) {
        const SimFilter::RuleList rules
            = rulesFromJson(wantedFor(traffic, wanted).value(rulesMember).toArray());
        for (const SimFilter::Rule &rule : rules) {
            if (predicate(rule.imsi))
                return true;
        }
    }
    return false;
}

QString RuleSection::member() const
{
    return m_family.name;
}

Service RuleSection::service() const
{
    return Service::telephony();
}

QString RuleSection::fault(const QJsonObject &wanted) const
{
    for (const Traffic traffic : m_family.traffic) {
        const auto rules = rulesFromJson(wantedFor(traffic, wanted).value(rulesMember).toArray());
        const int repeated = repeatedRule(rules);
        if (repeated >= 0) {
            const QStringList fault = stepsTo(traffic, rulesMember)
                + QStringList{QString::number(repeated), QStringLiteral("imsi")};
            return QStringLiteral(R"(%1: must be named once; "%2" has a rule already)")
                .arg(jsonPointer(fault), rules.at(repeated).imsi);
        }
    }
    return QString();
}

QVector<Setting> RuleSection::settings(const QJsonObject &wanted) const
{
    QVector<Setting> settings;
    for (const Traffic traffic : m_family.traffic) {
        const QJsonObject members = wantedFor(traffic, wanted);
        if (members.contains(defaultMember)) {
            Setting setting;
            setting.path = pathOf(traffic, defaultMember);
            setting.wanted = {members.value(defaultMember), members.value(defaultMember).toString()};
            settings.append(setting);
        }
        if (members.contains(rulesMember)) {
            Setting setting;
            setting.path = pathOf(traffic, rulesMember);
            setting.wanted = rulesValue(rulesFromJson(members.value(rulesMember).toArray()));
            settings.append(setting);
        }
    }
    return settings;
}

Reply RuleSection::open(const QJsonObject &wanted)
{
    m_filter = std::make_unique<RuleFilter>(m_family, m_timeout);
    const Reply opened = m_filter->open();
    if (!opened.isDone())
        return opened;
    connect(m_filter.get(), &RuleFilter::changed, this, &RuleSection::drifted);
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

Reply RuleSection::openSims()
{
    m_sims = std::make_unique<SimCards>(m_timeout);
    const Reply told = m_sims->ask();
    if (told.outcome == Reply::Refused)
        return {Reply::Refused, QStringLiteral("the SIMs of the phone are not known: ") + told.text};
    connect(m_sims.get(), &SimCards::changed, this, &RuleSection::drifted);
    return told;
}

void RuleSection::close()
{
    m_filter.reset();
    m_sims.reset();
    m_simsAreTold = false;
}

QVector<Setting> RuleSection::compare(const QJsonObject &wanted)
{
    QVector<Setting> compared;
    const QVector<Setting> named = settings(wanted);
    for (const Setting &setting : named) {
        for (const Traffic traffic : m_family.traffic) {
            if (setting.path == pathOf(traffic, defaultMember))
                compared.append(compareDefault(setting, traffic));
            else if (setting.path == pathOf(traffic, rulesMember))
                compared.append(compareRules(setting, traffic));
        }
    }
    return compared;
}

Setting RuleSection::compareDefault(Setting setting, Traffic traffic) const
{
    const QString action = actionName(m_filter->defaultAction(traffic));
    setting.present = {action, action};
    setting.status = setting.wanted.text == action ? Setting::Compliant : Setting::Different;
    return setting;
}

Setting RuleSection::compareRules(Setting setting, Traffic traffic) const
{
    const SimFilter::RuleList present = m_filter->rules(traffic);
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

QString RuleSection::absentSimsText(const SimFilter::RuleList &wanted, const QStringList &present) const
{
    // The phone keeps such rules, so that the setting is as wanted; but they may be a mistake.
    QStringList notes;
    for (const SimFilter::Rule &rule : wanted) {
        if (m_simsAreTold && !present.contains(rule.imsi))
            notes.append(QStringLiteral("no SIM %1 in the phone").arg(rule.imsi));
    }
    return notes.join(QLatin1String("; "));
}

Reply RuleSection::change(const Setting &setting)
{
    for (const Traffic traffic : m_family.traffic) {
        if (setting.path == pathOf(traffic, rulesMember))
            return m_filter->setRules(traffic, rulesFromJson(setting.wanted.json.toArray()));
        const auto action = actionNamed(traffic, setting.wanted.text);
        if (setting.path == pathOf(traffic, defaultMember) && action)
            return m_filter->setDefaultAction(traffic, *action);
    }
    return {Reply::Refused, QStringLiteral("no such setting")};
}

QJsonObject RuleSection::exported()
{
    QJsonObject all;
    for (const Traffic traffic : m_family.traffic) {
        const QJsonObject part{{defaultMember, actionName(m_filter->defaultAction(traffic))},
                               {rulesMember, rulesToJson(m_filter->rules(traffic))}};
        if (!m_family.hasDirections())
            return part;
        all.insert(directionName(traffic), part);
    }
    return all;
}

} // namespace Agent
} // namespace Corvane
