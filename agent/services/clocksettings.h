// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_CLOCKSETTINGS_H
#define CORVANE_CLOCKSETTINGS_H

#include "devicesettings.h"

#include <corvanemdm/datetimesettings.h>

namespace Corvane
{
namespace Agent
{

/** What clock and time zone follow, and the clock. */
class ClockSettings : public DeviceSettings
{
    Q_OBJECT

public:
    explicit ClockSettings(std::chrono::milliseconds timeout, QObject *parent = nullptr);

    Service service() const override { return Service::clock(); }
    Reply open() override;

    QStringList timeZones() const { return m_phone->supportedTimeZones(); }

    /** Waits until the phone confirms that @p change has set the clock. */
    Reply setClock(const std::function<void(Mdm::DateTimeSettings &)> &change);

private:
    std::unique_ptr<Mdm::DateTimeSettings> m_phone; // asks the phone from the beginning
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_CLOCKSETTINGS_H
