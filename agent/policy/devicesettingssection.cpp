// SPDX-License-Identifier: LGPL-2.1-or-later
#include "devicesettingssection.h"

namespace Corvane
{
namespace Agent
{

DeviceSettingsSection::DeviceSettingsSection(const QString &member, const DeviceSettingsMaker &make,
                                             std::chrono::milliseconds timeout)
    : m_member(member)
    , m_make(make)
    , m_timeout(timeout)
    , m_settings(make(timeout))
{
}

QString DeviceSettingsSection::fault(const QJsonObject &) const
{
    return QString();
}

QVector<Setting> DeviceSettingsSection::settings(const QJsonObject &wanted) const
{
    QVector<Setting> settings;
    for (const DeviceSetting &each : m_settings->all()) {
        if (!wanted.contains(each.name))
            continue;
        const QJsonValue value = each.normalised(wanted.value(each.name));
        Setting setting;
        setting.path = QStringLiteral("%1.%2").arg(m_member, each.name);
        setting.wanted = {value, DeviceSetting::textOf(value)};
        settings.append(setting);
    }
    return settings;
}

Reply DeviceSettingsSection::open(const QJsonObject &)
{
    // Made anew for a service that has come back.
    m_settings = m_make(m_timeout);
    const Reply opened = m_settings->open();
    if (!opened.isDone())
        return opened;
    connect(m_settings.get(), &DeviceSettings::changed, this, &DeviceSettingsSection::drifted);
    return {};
}

const DeviceSetting *DeviceSettingsSection::settingAt(const QString &path) const
{
    return m_settings->find(path.mid(m_member.size() + 1));
}

QVector<Setting> DeviceSettingsSection::compare(const QJsonObject &wanted)
{
    QVector<Setting> settings = this->settings(wanted);
    for (Setting &setting : settings) {
        const DeviceSetting *phone = settingAt(setting.path);
        const QJsonValue present = phone->read();
        setting.present = {present, DeviceSetting::textOf(present)};
        setting = setting.compared();
        const QString obstacle = setting.status == Setting::Different && phone->obstacle
            ? phone->obstacle(setting.wanted.json)
            : QString();
        if (!obstacle.isEmpty())
            setting = setting.with(Setting::Unsupported, obstacle);
    }
    return settings;
}

Reply DeviceSettingsSection::change(const Setting &setting)
{
    return m_settings->set(*settingAt(setting.path), setting.wanted.json);
}

QJsonObject DeviceSettingsSection::exported()
{
    QJsonObject all;
    for (const DeviceSetting &setting : m_settings->all()) {
        const QJsonValue value = setting.read();
        if (!setting.obstacle || setting.obstacle(value).isEmpty())
            all.insert(setting.name, value);
    }
    return all;
}

} // namespace Agent
} // namespace Corvane
