// SPDX-License-Identifier: LGPL-2.1-or-later
#include "radiosection.h"

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String enabledMember("enabled");

} // namespace

RadioSection::RadioSection(Radio radio, std::chrono::milliseconds timeout)
    : m_radio(radio)
    , m_timeout(timeout)
{
}

QString RadioSection::member() const
{
    return m_radio == Radio::WiFi ? QStringLiteral("wifi") : QStringLiteral("flightMode");
}

Service RadioSection::service() const
{
    return Service::connectionManager();
}

QString RadioSection::fault(const QJsonObject &) const
{
    return QString();
}

QVector<Setting> RadioSection::settings(const QJsonObject &wanted) const
{
    if (!wanted.contains(enabledMember))
        return {};
    Setting setting;
    setting.path = QStringLiteral("%1.%2").arg(member(), enabledMember);
    setting.wanted = Setting::Value::onOff(wanted.value(enabledMember).toBool());
    return {setting};
}

Reply RadioSection::open(const QJsonObject &)
{
    m_switch = std::make_unique<RadioSwitch>(m_radio, m_timeout);
    connect(m_switch.get(), &RadioSwitch::changed, this, &RadioSection::drifted);
    return {};
}

void RadioSection::close()
{
    m_switch.reset();
}

QVector<Setting> RadioSection::compare(const QJsonObject &wanted)
{
    QVector<Setting> settings = this->settings(wanted);
    for (Setting &setting : settings) {
        const Answer<bool> on = m_switch->isOn();
        if (on.reply.isDone())
            setting.present = Setting::Value::onOff(on.value);
        setting = on.reply.isDone() ? setting.compared() : setting.unanswered(on.reply);
    }
    return settings;
}

Reply RadioSection::change(const Setting &setting)
{
    return m_switch->set(setting.wanted.json.toBool());
}

QJsonObject RadioSection::exported()
{
    const Answer<bool> on = m_switch->isOn();
    return on.reply.isDone() ? QJsonObject{{enabledMember, on.value}} : QJsonObject();
}

} // namespace Agent
} // namespace Corvane
