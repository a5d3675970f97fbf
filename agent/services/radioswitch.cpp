// SPDX-License-Identifier: LGPL-2.1-or-later
#include "radioswitch.h"

#include "service.h"
#include "wait.h"
#include "warningcapture.h"

namespace Corvane
{
namespace Agent
{

using Mdm::ConnectivitySettings;

namespace
{

// What the library warns of.
const QLatin1String untold("^(?:Powered|OfflineMode) property not returned for ");
const QLatin1String refusal("^Unable to set the (?:power of the WLAN technology|offline mode): \"(.*)\"$");

} // namespace

QString radioName(Radio radio)
{
    return radio == Radio::WiFi ? QStringLiteral("Wi-Fi") : QStringLiteral("flight mode");
}

RadioSwitch::RadioSwitch(Radio radio, std::chrono::milliseconds timeout, QObject *parent)
    : QObject(parent)
    , m_radio(radio)
    , m_timeout(timeout)
{
    connect(&m_settings,
            radio == Radio::WiFi ? &ConnectivitySettings::wlanEnabledChanged
                                 : &ConnectivitySettings::flightModeEnabledChanged,
            this, &RadioSwitch::changed);
}

Answer<bool> RadioSwitch::isOn() const
{
    Answer<bool> answer;
    const Service manager = Service::connectionManager();
    answer.reply = ask(manager, untold, [&] {
        answer.value = m_radio == Radio::WiFi ? m_settings.wlanEnabled() : m_settings.flightModeEnabled();
    });
    if (answer.reply.outcome == Reply::Refused) {
        answer.reply.text
            = QStringLiteral("%1 does not tell whether %2 is on%3")
                  .arg(manager.toString(), radioName(m_radio),
                       m_radio == Radio::WiFi ? QStringLiteral("; the phone may have none") : QString());
    }
    return answer;
}

Reply RadioSwitch::set(bool on)
{
    const Answer<bool> before = isOn();
    if (!before.reply.isDone() || before.value == on)
        return before.reply;
    Wait wait(Service::connectionManager(), m_timeout, QStringLiteral("confirm the change"));
    const WarningCapture refusals(refusal, [&](const QString &reason) {
        wait.end(Reply::Refused, Service::connectionManager().refusal(reason));
    });
    if (m_radio == Radio::WiFi)
        m_settings.setWlanEnabled(on);
    else
        m_settings.setFlightModeEnabled(on);
    wait.until(this, &RadioSwitch::changed, [this, on] {
        const Answer<bool> now = isOn();
        return now.reply.isDone() && now.value == on;
    });
    return wait.run();
}

} // namespace Agent
} // namespace Corvane
