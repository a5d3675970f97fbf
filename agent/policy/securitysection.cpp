// SPDX-License-Identifier: LGPL-2.1-or-later
#include "securitysection.h"

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String developerModeMember("developerMode");

constexpr std::chrono::milliseconds lookEvery(2000);

} // namespace

SecuritySection::SecuritySection(std::chrono::milliseconds timeout)
    : m_timeout(timeout)
{
    connect(&m_look, &QTimer::timeout, this, &SecuritySection::lookAtDeveloperMode);
}

QString SecuritySection::member() const
{
    return QStringLiteral("security");
}

Service SecuritySection::service() const
{
    // Looking needs nobody; the package manager is called when there is something to change.
    return Service::bus();
}

QString SecuritySection::fault(const QJsonObject &) const
{
    return QString();
}

QVector<Setting> SecuritySection::settings(const QJsonObject &wanted) const
{
    if (!wanted.contains(developerModeMember))
        return {};
    Setting setting;
    setting.path = QStringLiteral("security.developerMode");
    setting.wanted = Setting::Value::onOff(wanted.value(developerModeMember).toBool());
    return {setting};
}

Reply SecuritySection::open(const QJsonObject &)
{
    m_switches = std::make_unique<SecuritySwitches>(m_timeout);
    m_developerModeSeen = m_switches->developerMode();
    m_look.start(lookEvery);
    return {};
}

void SecuritySection::close()
{
    m_look.stop();
    m_switches.reset();
}

void SecuritySection::lookAtDeveloperMode()
{
    const bool isOn = m_switches->developerMode();
    if (isOn == m_developerModeSeen)
        return;
    m_developerModeSeen = isOn;
    Q_EMIT drifted();
}

QVector<Setting> SecuritySection::compare(const QJsonObject &wanted)
{
    QVector<Setting> settings = this->settings(wanted);
    for (Setting &setting : settings) {
        setting.present = Setting::Value::onOff(m_switches->developerMode());
        setting = setting.compared();
    }
    return settings;
}

Reply SecuritySection::change(const Setting &setting)
{
    return m_switches->setDeveloperMode(setting.wanted.json.toBool());
}

QJsonObject SecuritySection::exported()
{
    return {{developerModeMember, m_switches->developerMode()}};
}

} // namespace Agent
} // namespace Corvane
