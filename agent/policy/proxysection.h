// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_PROXYSECTION_H
#define CORVANE_PROXYSECTION_H

#include "policysection.h"
#include "proxies.h"

#include <chrono>
#include <memory>
#include <vector>

namespace Corvane
{
namespace Agent
{

/** "proxy": the proxies of the phone and of its networks, and which of them are used. */
class ProxySection : public PolicySection
{
    Q_OBJECT

public:
    explicit ProxySection(std::chrono::milliseconds timeout);

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
    Setting compareUse(Setting setting) const;
    Setting compareGlobal(Setting setting);
    Setting compareNetworks(Setting setting, const QString &name);
    void follow(const QString &identifier);

    const std::chrono::milliseconds m_timeout;
    std::unique_ptr<Proxies> m_proxies;
    std::vector<std::unique_ptr<Proxies>> m_followed; ///< one for each network of the policy that is there
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_PROXYSECTION_H
