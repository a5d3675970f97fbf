// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_DEVICELOCKSECTION_H
#define CORVANE_DEVICELOCKSECTION_H

#include "devicelocker.h"
#include "policysection.h"
#include "securityswitches.h"

#include <chrono>
#include <memory>
#include <optional>

namespace Corvane
{
namespace Agent
{

/** "deviceLock": the manager's lockout, and packages from outside the store. */
class DeviceLockSection : public PolicySection
{
    Q_OBJECT

public:
    explicit DeviceLockSection(std::chrono::milliseconds timeout);

    QString member() const override;
    Service service() const override;
    QString fault(const QJsonObject &wanted) const override;
    QVector<Setting> settings(const QJsonObject &wanted) const override;
    Reply open(const QJsonObject &wanted) override;
    void close() override;
    QVector<Setting> compare(const QJsonObject &wanted) override;
    /** Nobody tells of a change of sideloading. */
    bool mayHaveDrifted() override;
    Reply change(const Setting &setting) override;
    QJsonObject exported() override;

private:
    Setting compareLockout(Setting setting) const;
    Setting compareSideloading(Setting setting);

    const std::chrono::milliseconds m_timeout;
    std::unique_ptr<DeviceLocker> m_locker;
    std::unique_ptr<SecuritySwitches> m_switches;
    std::optional<bool> m_sideloadingSeen; ///< as last compared or made, when the policy names it
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_DEVICELOCKSECTION_H
