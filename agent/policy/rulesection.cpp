// SPDX-License-Identifier: LGPL-2.1-or-later
#include "rulesection.h"

#include "schemaexplanation.h"
#include "wait.h"

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

bool RuleSection::namesEverySim(const QJsonObject &wanted) const
{
    for (const Traffic traffic : m_family.traffic) {
        const SimFilter::RuleList rules
            = rulesFromJson(wantedFor(traffic, wanted).value(rulesMember).toArray());
        for (const SimFilter::Rule &rule : rules) {
            if (rule.imsi == AnySim)
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
    return namesEverySim(wanted) ? openSims() : Reply{};
}

Reply RuleSection::openSims()
{
    m_sims = std::make_unique<SimsOfPhone>();
    Wait wait(service(), m_timeout, QStringLiteral("tell which SIMs are in the phone"));
    wait.until(m_sims.get(), &SimsOfPhone::changed, [this] { return m_sims->isReady(); });
    const Reply known = wait.run();
    if (!known.isDone())
        return known;
    if (!m_sims->error().isEmpty())
        return {Reply::Refused, QStringLiteral("the SIMs of the phone are not known: ") + m_sims->error()};
    connect(m_sims.get(), &SimsOfPhone::changed, this, &RuleSection::drifted);
    return {};
}

void RuleSection::close()
{
    m_filter.reset();
    m_sims.reset();
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
    const SimFilter::RuleList wanted = expandedRules(rulesFromJson(setting.wanted.json.toArray()),
                                                     m_sims ? m_sims->imsis() : QStringList());
    const RuleDifference difference(present, wanted);
    setting.present = rulesValue(present);
    setting.wanted = rulesValue(wanted);
    setting.status = difference.isEmpty() ? Setting::Compliant : Setting::Different;
    setting.detail = difference.toString();
    return setting;
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
