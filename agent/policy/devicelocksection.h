// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_DEVICELOCKSECTION_H
#define CORVANE_DEVICELOCKSECTION_H

#include "devicelocker.h"
#include "policysection.h"
#include "securityswitches.h"

#include <QtCore/QTimer>

#include <chrono>
#include <memory>

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
    Reply change(const Setting &setting) override;
    QJsonObject exported() override;

private:
    Setting compareLockout(Setting setting) const;
    Setting compareSideloading(Setting setting) const;
    void lookAtSideloading();

    const std::chrono::milliseconds m_timeout;
    std::unique_ptr<DeviceLocker> m_locker;
    std::unique_ptr<SecuritySwitches> m_switches;
    QTimer m_look; // nobody tells of a change of sideloading
    bool m_sideloadingSeen = false;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_DEVICELOCKSECTION_H
