// SPDX-License-Identifier: LGPL-2.1-or-later
#include "securitysection.h"

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String developerModeMember("developerMode");

} // namespace

SecuritySection::SecuritySection(std::chrono::milliseconds timeout)
    : m_timeout(timeout)
{
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
    return {};
}

void SecuritySection::close()
{
    m_switches.reset();
}

bool SecuritySection::mayHaveDrifted()
{
    return m_switches->developerMode() != m_developerModeSeen;
}

QVector<Setting> SecuritySection::compare(const QJsonObject &wanted)
{
    m_developerModeSeen = m_switches->developerMode();
    QVector<Setting> settings = this->settings(wanted);
    for (Setting &setting : settings) {
        setting.present = Setting::Value::onOff(m_developerModeSeen);
        setting = setting.compared();
    }
    return settings;
}

Reply SecuritySection::change(const Setting &setting)
{
    const Reply reply = m_switches->setDeveloperMode(setting.wanted.json.toBool());
    m_developerModeSeen = m_switches->developerMode();
    return reply;
}

QJsonObject SecuritySection::exported()
{
    return {{developerModeMember, m_switches->developerMode()}};
}

} // namespace Agent
} // namespace Corvane
