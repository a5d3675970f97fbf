// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SECURITYSECTION_H
#define CORVANE_SECURITYSECTION_H

#include "policysection.h"
#include "securityswitches.h"

#include <chrono>
#include <memory>

namespace Corvane
{
namespace Agent
{

/** "security": developer mode. */
class SecuritySection : public PolicySection
{
    Q_OBJECT

public:
    explicit SecuritySection(std::chrono::milliseconds timeout);

    QString member() const override;
    Service service() const override;
    QString fault(const QJsonObject &wanted) const override;
    QVector<Setting> settings(const QJsonObject &wanted) const override;
    Reply open(const QJsonObject &wanted) override;
    void close() override;
    QVector<Setting> compare(const QJsonObject &wanted) override;
    /** Nobody tells of a package that somebody else installs. */
    bool mayHaveDrifted() override;
    Reply change(const Setting &setting) override;
    QJsonObject exported() override;

private:
    const std::chrono::milliseconds m_timeout;
    std::unique_ptr<SecuritySwitches> m_switches;
    bool m_developerModeSeen = false; ///< as last compared or made
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_SECURITYSECTION_H
