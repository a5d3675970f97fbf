// SPDX-License-Identifier: LGPL-2.1-or-later
#include "component.h"
#include "ofono.h"
#include "refusal.h"
#include "service.h"

#include <QtCore/QJsonArray>
#include <QtCore/QSet>

#include <algorithm>
#include <array>

namespace Corvane
{
namespace Simulator
{

namespace
{

constexpr guint32 contractVersion = 1;
constexpr int longestImsi = 15;

enum Verdict : guint32 { Block = 1, Allow = 2, HangUp = 3 };

/** The profile's words for the verdicts 1, 2 and 3. */
const std::array<QLatin1String, 3> verdictWords{QLatin1String("block"), QLatin1String("allow"),
                                                QLatin1String("hangup")};

QString word(guint32 verdict)
{
    return verdictWords.at(verdict - 1);
}

guint32 verdictOf(const QString &word)
{
    return guint32(
               std::distance(verdictWords.begin(), std::find(verdictWords.begin(), verdictWords.end(), word)))
        + 1;
}

struct Rule {
    QString imsi;
    guint32 verdict;
};

bool operator==(const Rule &left, const Rule &right)
{
    return left.imsi == right.imsi && left.verdict == right.verdict;
}

GVariant *toVariant(const Rule &rule)
{
    return g_variant_new("(su)", rule.imsi.toUtf8().constData(), rule.verdict);
}

GVariant *toVariant(const std::vector<Rule> &rules)
{
    GVariantBuilder list;
    g_variant_builder_init(&list, G_VARIANT_TYPE("a(su)"));
    for (const Rule &rule : rules)
        g_variant_builder_add_value(&list, toVariant(rule));
    return g_variant_builder_end(&list);
}

/** How one kind of traffic is called, on the wire, in profiles and by those who act on the phone. */
struct FilterNames {
    QString path;
    QString interface;
    QString word; ///< in the members of the interface, as in "Add@Rule"
    guint32 highestVerdict;
    QString group; ///< the profile's member
    QString member; ///< of the group; empty: the group is this filter's alone
    QString action;
    QString actionUsage;
    QString traffic; ///< completes "what happens to"
};

const std::array<FilterNames, 4> allFilters{{
    {QStringLiteral("/mdm/voicecallfilter/dial"), QStringLiteral("org.corvaneos.ofono.mdm.VoiceCallFilter"),
     QString(), Allow, QStringLiteral("callFilters"), QStringLiteral("dial"), QStringLiteral("call dial"),
     QStringLiteral("IMSI|SLOT [NUMBER]"), QStringLiteral("such a call over that SIM")},
    {QStringLiteral("/mdm/voicecallfilter/incoming"),
     QStringLiteral("org.corvaneos.ofono.mdm.VoiceCallFilter"), QString(), HangUp,
     QStringLiteral("callFilters"), QStringLiteral("incoming"), QStringLiteral("call incoming"),
     QStringLiteral("IMSI|SLOT [NUMBER]"), QStringLiteral("such a call over that SIM")},
    {QStringLiteral("/mdm/smsfilter/textin"), QStringLiteral("org.corvaneos.ofono.mdm.SmsFilter"),
     QStringLiteral("Text"), Allow, QStringLiteral("smsFilter"), QString(), QStringLiteral("text"),
     QStringLiteral("IMSI|SLOT [NUMBER]"), QStringLiteral("a text message to that SIM")},
    {QStringLiteral("/mdm/gprsfilter"), QStringLiteral("org.corvaneos.ofono.mdm.GprsFilter"), QString(),
     Allow, QStringLiteral("dataFilter"), QString(), QStringLiteral("data"), QStringLiteral("IMSI|SLOT"),
     QStringLiteral("mobile data over that SIM")},
}};

/** What @p object, a profile or a state of the phone, has about a filter. */
QJsonObject partOf(const QJsonObject &object, const FilterNames &names)
{
    const QJsonObject group = object.value(names.group).toObject();
    return names.member.isEmpty() ? group : group.value(names.member).toObject();
}

/** The rules and the default action for one kind of traffic: an object of its own. */
class Filter
{
public:
    Filter(const FilterNames &names, const QJsonObject &profile);

    const FilterNames &names() const { return m_names; }
    void attach(Service &service);
    void detach() { m_service = nullptr; }
    void describe(QJsonObject &state) const;
    /** What happens to the traffic of the SIM with @p imsi, and why. */
    QString judge(const QString &imsi) const;

private:
    using Rules = std::vector<Rule>;

    void checkVerdict(guint32 verdict) const;
    void checkRule(const Rule &rule) const;
    Rules::iterator find(const QString &imsi);
    /** @p pattern is the member with "@" where the interface has its word. */
    QString memberName(const char *pattern) const;
    void emitSignal(const char *pattern, GVariant *arguments) const;
    void emitRules() const;
    void emitRule(const char *pattern, Rules::const_iterator rule) const;

    void addRule(MethodCall &call);
    void removeRule(MethodCall &call);
    void setRules(MethodCall &call);
    void clearRules(MethodCall &call);
    void setDefault(MethodCall &call);

    const FilterNames &m_names;
    guint32 m_default;
    Rules m_rules;
    Service *m_service = nullptr;
};

Filter::Filter(const FilterNames &names, const QJsonObject &profile)
    : m_names(names)
    , m_default(verdictOf(profile.value(QLatin1String("default")).toString()))
{
    const QJsonArray rules = profile.value(QLatin1String("rules")).toArray();
    for (const QJsonValue &rule : rules) {
        m_rules.push_back({rule.toObject().value(QLatin1String("imsi")).toString(),
                           verdictOf(rule.toObject().value(QLatin1String("action")).toString())});
    }
}

void Filter::attach(Service &service)
{
    m_service = &service;
    service.addObject(
        m_names.path, m_names.interface,
        {
            {QStringLiteral("GetAll"),
             [this](MethodCall &call) {
                 call.reply(g_variant_new("(uu@a(su))", contractVersion, m_default, toVariant(m_rules)));
             }},
            {memberName("Add@Rule"),
             [this](MethodCall &call) {
                 addRule(call);
             }},
            {memberName("Remove@Rule"),
             [this](MethodCall &call) {
                 removeRule(call);
             }},
            {memberName("Set@Rules"),
             [this](MethodCall &call) {
                 setRules(call);
             }},
            {memberName("Clear@Rules"),
             [this](MethodCall &call) {
                 clearRules(call);
             }},
            {memberName("SetDefault@Action"),
             [this](MethodCall &call) {
                 setDefault(call);
             }},
        });
}

void Filter::checkVerdict(guint32 verdict) const
{
    if (verdict < Block || verdict > m_names.highestVerdict)
        throw Ofono::invalidArguments(QStringLiteral("%1 is no action here").arg(verdict));
}

void Filter::checkRule(const Rule &rule) const
{
    const bool isImsi = rule.imsi.size() <= longestImsi
        && std::all_of(rule.imsi.begin(), rule.imsi.end(),
                       [](QChar c) { return c >= QLatin1Char('0') && c <= QLatin1Char('9'); });
    if (!isImsi)
        throw Ofono::invalidArguments(QStringLiteral("\"%1\" is no IMSI").arg(rule.imsi));
    checkVerdict(rule.verdict);
}

Filter::Rules::iterator Filter::find(const QString &imsi)
{
    return std::find_if(m_rules.begin(), m_rules.end(), [&](const Rule &rule) { return rule.imsi == imsi; });
}

QString Filter::memberName(const char *pattern) const
{
    return QString::fromLatin1(pattern).replace(QLatin1Char('@'), m_names.word);
}

void Filter::emitSignal(const char *pattern, GVariant *arguments) const
{
    m_service->emitSignal(m_names.path, m_names.interface, memberName(pattern), arguments);
}

void Filter::emitRules() const
{
    emitSignal("@RulesChanged", g_variant_new("(@a(su))", toVariant(m_rules)));
}

void Filter::emitRule(const char *pattern, Rules::const_iterator rule) const
{
    emitSignal(pattern,
               g_variant_new("(u@(su))", guint32(std::distance(m_rules.begin(), rule)), toVariant(*rule)));
}

void Filter::addRule(MethodCall &call)
{
    const Rule rule{call.text(0), call.number(1)};
    checkRule(rule);
    call.reply();

    const auto known = find(rule.imsi);
    if (known == m_rules.end()) {
        m_rules.push_back(rule);
        emitRule("@RuleAdded", std::prev(m_rules.cend()));
    } else if (known->verdict != rule.verdict) {
        known->verdict = rule.verdict;
        emitRule("@RuleChanged", known);
    }
}

void Filter::removeRule(MethodCall &call)
{
    const QString imsi = call.text(0);
    const auto known = find(imsi);
    if (known == m_rules.end())
        throw Ofono::notFound(QStringLiteral("There is no rule for \"%1\"").arg(imsi));
    call.reply();

    const auto index = guint32(std::distance(m_rules.begin(), known));
    m_rules.erase(known);
    emitSignal("@RuleRemoved", g_variant_new("(u)", index));
}

void Filter::setRules(MethodCall &call)
{
    Rules rules;
    QSet<QString> imsis;
    const Variant list(g_variant_get_child_value(call.arguments(), 0));
    rules.reserve(g_variant_n_children(list.get()));
    GVariantIter iter;
    g_variant_iter_init(&iter, list.get());
    const gchar *imsi = nullptr;
    guint32 verdict = 0;
    while (g_variant_iter_next(&iter, "(&su)", &imsi, &verdict)) {
        const Rule rule{QString::fromUtf8(imsi), verdict};
        checkRule(rule);
        if (imsis.contains(rule.imsi))
            throw Ofono::invalidArguments(QStringLiteral("There are two rules for \"%1\"").arg(rule.imsi));
        imsis.insert(rule.imsi);
        rules.push_back(rule);
    }
    call.reply();

    if (rules != m_rules) {
        m_rules = std::move(rules);
        emitRules();
    }
}

void Filter::clearRules(MethodCall &call)
{
    call.reply();
    if (!m_rules.empty()) {
        m_rules.clear();
        emitRules();
    }
}

void Filter::setDefault(MethodCall &call)
{
    const guint32 verdict = call.number(0);
    checkVerdict(verdict);
    call.reply();
    if (verdict != m_default) {
        m_default = verdict;
        emitSignal("Default@ActionChanged", g_variant_new("(u)", verdict));
    }
}

void Filter::describe(QJsonObject &state) const
{
    QJsonArray rules;
    for (const Rule &rule : m_rules)
        rules << QJsonObject{{QStringLiteral("imsi"), rule.imsi},
                             {QStringLiteral("action"), word(rule.verdict)}};
    const QJsonObject part{{QStringLiteral("default"), word(m_default)}, {QStringLiteral("rules"), rules}};
    if (m_names.member.isEmpty()) {
        state.insert(m_names.group, part);
        return;
    }
    QJsonObject group = state.value(m_names.group).toObject();
    group.insert(m_names.member, part);
    state.insert(m_names.group, group);
}

QString Filter::judge(const QString &imsi) const
{
    const auto rule
        = std::find_if(m_rules.begin(), m_rules.end(), [&](const Rule &each) { return each.imsi == imsi; });
    if (rule == m_rules.end())
        return QStringLiteral("%1 (default action)").arg(word(m_default));
    return QStringLiteral("%1 (rule %2, for %3)")
        .arg(word(rule->verdict), QString::number(std::distance(m_rules.begin(), rule)), imsi);
}

class RuleFilters : public Component
{
public:
    RuleFilters(const QJsonObject &profile, Phone &phone);

    void attach(Service &service) override;
    void detach() override;
    void describe(QJsonObject &state) const override;
    std::vector<Action> actions() override;

private:
    QString imsiFor(const QString &imsiOrSlot) const;

    const Phone &m_phone;
    std::vector<Filter> m_filters;
};

RuleFilters::RuleFilters(const QJsonObject &profile, Phone &phone)
    : m_phone(phone)
{
    for (const FilterNames &names : allFilters)
        m_filters.emplace_back(names, partOf(profile, names));
}

void RuleFilters::attach(Service &service)
{
    for (Filter &filter : m_filters)
        filter.attach(service);
}

void RuleFilters::detach()
{
    for (Filter &filter : m_filters)
        filter.detach();
}

void RuleFilters::describe(QJsonObject &state) const
{
    for (const Filter &filter : m_filters)
        filter.describe(state);
}

QString RuleFilters::imsiFor(const QString &imsiOrSlot) const
{
    const std::optional<std::size_t> slot = m_phone.slotNumbered(imsiOrSlot);
    if (!slot)
        return imsiOrSlot;
    const Sim &sim = m_phone.sims.at(*slot);
    if (!sim.present)
        throw Refusal(
            QStringLiteral("There is no SIM in slot %1; insert one or name an IMSI").arg(imsiOrSlot));
    return sim.imsi;
}

std::vector<Action> RuleFilters::actions()
{
    std::vector<Action> actions;
    for (const Filter &filter : m_filters) {
        const FilterNames &names = filter.names();
        const int most = names.actionUsage.count(QLatin1Char(' ')) + 1;
        actions.push_back({names.action, names.actionUsage,
                           QStringLiteral("tells what happens to %1, and why").arg(names.traffic), 1, most,
                           [this, &filter](const QStringList &arguments) {
                               return filter.judge(imsiFor(arguments.first()));
                           }});
    }
    return actions;
}

QString problemOf(const QJsonObject &profile)
{
    for (const FilterNames &names : allFilters) {
        QSet<QString> seen;
        const QJsonArray rules = partOf(profile, names).value(QLatin1String("rules")).toArray();
        for (int i = 0; i < rules.size(); ++i) {
            const QString imsi = rules.at(i).toObject().value(QLatin1String("imsi")).toString();
            if (seen.contains(imsi)) {
                const QString path
                    = names.member.isEmpty() ? names.group : names.group + QLatin1Char('/') + names.member;
                return QStringLiteral(
                           "/%1/rules/%2/imsi: there is a rule for %3 already; one rule an IMSI is allowed")
                    .arg(path, QString::number(i), imsi);
            }
            seen.insert(imsi);
        }
    }
    return QString();
}

const ComponentRegistration registration({
    Ofono::serviceName,
    [](const QJsonObject &profile, Phone &phone) { return std::make_unique<RuleFilters>(profile, phone); },
    problemOf,
});

} // namespace

} // namespace Simulator
} // namespace Corvane
