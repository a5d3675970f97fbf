// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_DEVICESETTINGSSECTION_H
#define CORVANE_DEVICESETTINGSSECTION_H

#include "devicesettings.h"
#include "policysection.h"

#include <chrono>
#include <memory>

namespace Corvane
{
namespace Agent
{

/** A section whose members are settings of the phone by their names: "location" and "time". */
class DeviceSettingsSection : public PolicySection
{
    Q_OBJECT

public:
    DeviceSettingsSection(const QString &member, const DeviceSettingsMaker &make,
                          std::chrono::milliseconds timeout);

    QString member() const override { return m_member; }
    Service service() const override { return m_settings->service(); }
    QString fault(const QJsonObject &wanted) const override;
    QVector<Setting> settings(const QJsonObject &wanted) const override;
    Reply open(const QJsonObject &wanted) override;
    void close() override { }
    QVector<Setting> compare(const QJsonObject &wanted) override;
    /** Not every setting announces its changes. */
    bool mayHaveDrifted() override { return true; }
    Reply change(const Setting &setting) override;
    QJsonObject exported() override;

private:
    const DeviceSetting *settingAt(const QString &path) const;

    const QString m_member;
    const DeviceSettingsMaker m_make;
    const std::chrono::milliseconds m_timeout;
    std::unique_ptr<DeviceSettings> m_settings;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_DEVICESETTINGSSECTION_H
