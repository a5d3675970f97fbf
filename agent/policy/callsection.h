// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_CALLSECTION_H
#define CORVANE_CALLSECTION_H

#include "callfilter.h"
#include "policysection.h"
#include "simcards.h"

#include <chrono>
#include <memory>

namespace Corvane
{
namespace Agent
{

/** "calls": the rules for outgoing and incoming calls. */
class CallSection : public PolicySection
{
    Q_OBJECT

public:
    explicit CallSection(std::chrono::milliseconds timeout);

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
    QString absentSimsText(const Mdm::SimFilter::RuleList &wanted, const QStringList &present) const;
    Setting compareDefault(Setting setting, CallDirection direction) const;
    Setting compareRules(Setting setting, CallDirection direction) const;

    std::chrono::milliseconds m_timeout;
    std::unique_ptr<CallFilter> m_filter;
    std::unique_ptr<SimCards> m_sims; // only for a policy with rules
    bool m_simsAreTold = false;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_CALLSECTION_H
