// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_RULESECTION_H
#define CORVANE_RULESECTION_H

#include "policysection.h"
#include "rulefilter.h"
#include "simcards.h"

#include <chrono>
#include <functional>
#include <memory>

namespace Corvane
{
namespace Agent
{

/** The rules by SIM of one family. */
class RuleSection : public PolicySection
{
    Q_OBJECT

public:
    RuleSection(const RuleFamily &family, std::chrono::milliseconds timeout);

    QString member() const override;
    Service service() const override;
    QString fault(const QJsonObject &wanted) const override;
    QVector<Setting> settings(const QJsonObject &wanted) const override;
    Reply open(const QJsonObject &wanted) override;
    void close() override;
    QVector<Setting> compare(const QJsonObject &wanted) override;
    Reply change(const Setting &setting) override;
    QJsonObject exported() override;

private:
    Reply openSims();
    Setting compareDefault(Setting setting, Traffic traffic) const;
    Setting compareRules(Setting setting, Traffic traffic) const;

    /** The members of a policy that lead to a setting. */
    QStringList stepsTo(Traffic traffic, QLatin1String member) const;
    QString pathOf(Traffic traffic, QLatin1String member) const;
    /** What @p wanted, the section's member of a policy, has about @p traffic. */
    QJsonObject wantedFor(Traffic traffic, const QJsonObject &wanted) const;
    bool namesSim(const QJsonObject &wanted, const std::function<bool(const QString &imsi)> &predicate) const;
    /** Tells of rules for SIMs that are elsewhere. */
    QString absentSimsText(const Mdm::SimFilter::RuleList &wanted, const QStringList &present) const;

    const RuleFamily m_family;
    const std::chrono::milliseconds m_timeout;
    std::unique_ptr<RuleFilter> m_filter;
    std::unique_ptr<SimCards> m_sims; // only for a policy with rules
    bool m_simsAreTold = false;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_RULESECTION_H
