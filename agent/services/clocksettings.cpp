// SPDX-License-Identifier: LGPL-2.1-or-later
#include "clocksettings.h"

#include "wait.h"

namespace Corvane
{
namespace Agent
{

using Mdm::DateTimeSettings;

ClockSettings::ClockSettings(std::chrono::milliseconds timeout, QObject *parent)
    : DeviceSettings(timeout, parent)
{
    add({QStringLiteral("automaticTime"),
         QStringLiteral("Whether the clock follows the network"),
         DeviceSetting::Switch,
         {},
         [this] { return m_phone->automaticDateTimeUpdate(); },
         [this](const QJsonValue &value) { m_phone->setAutomaticDateTimeUpdate(value.toBool()); },
         {}});
    add({QStringLiteral("automaticTimeZone"),
         QStringLiteral("Whether the time zone follows the network"),
         DeviceSetting::Switch,
         {},
         [this] { return m_phone->automaticTimeZoneUpdate(); },
         [this](const QJsonValue &value) { m_phone->setAutomaticTimeZoneUpdate(value.toBool()); },
         {}});
    add({QStringLiteral("timeZone"),
         QStringLiteral("The time zone, such as Europe/Helsinki"),
         DeviceSetting::Word,
         {},
         [this] { return m_phone->timeZone(); },
         [this](const QJsonValue &value) { m_phone->setTimeZone(value.toString()); },
         [this](const QJsonValue &value) {
             return m_phone->supportedTimeZones().contains(value.toString())
                 ? QString()
                 : QStringLiteral("the phone knows no time zone \"%1\"").arg(value.toString());
         }});
}

Reply ClockSettings::open()
{
    Wait wait(service(), timeout(), QStringLiteral("tell its settings"));
    const WarningCapture failure(
        QStringLiteral("^Cannot read the properties of "),
        [&](const QString &reason) { wait.end(Reply::Refused, service().refusal(reason)); });
    m_phone = std::make_unique<DateTimeSettings>();
    connect(m_phone.get(), &DateTimeSettings::automaticDateTimeUpdateChanged, this, &DeviceSettings::changed);
    connect(m_phone.get(), &DateTimeSettings::automaticTimeZoneUpdateChanged, this, &DeviceSettings::changed);
    connect(m_phone.get(), &DateTimeSettings::timeZoneChanged, this, &DeviceSettings::changed);
    wait.until(m_phone.get(), &DateTimeSettings::readyChanged, [this] { return m_phone->ready(); });
    return wait.run();
}

Reply ClockSettings::setClock(const std::function<void(DateTimeSettings &)> &change)
{
    Wait wait(service(), timeout(), QStringLiteral("confirm the change"));
    const WarningCapture refusals(QStringLiteral("^(?:Cannot |No )"), [&](const QString &reason) {
        wait.end(Reply::Refused, service().refusal(reason));
    });
    connect(m_phone.get(), &DateTimeSettings::dateTimeChanged, &wait, [&wait] { wait.end(Reply::Done); });
    change(*m_phone);
    return wait.run();
}

std::unique_ptr<DeviceSettings> makeClockSettings(std::chrono::milliseconds timeout)
{
    return std::make_unique<ClockSettings>(timeout);
}

} // namespace Agent
} // namespace Corvane
