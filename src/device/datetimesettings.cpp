// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/datetimesettings.h>

#include "datetimesettings_p.h"

#include <systemsettings/timezoneinfo.h>

#include <QtCore/QDebug>

namespace Corvane
{
namespace Mdm
{

DateTimeSettingsPrivate::DateTimeSettingsPrivate()
{
    const QList<TimeZoneInfo> zones = TimeZoneInfo::systemTimeZones();
    for (const TimeZoneInfo &zone : zones)
        m_supportedTimeZones.append(zone.name());
}

DateTimeSettings::DateTimeSettings(QObject *parent)
    : QObject(parent)
    , d(new DateTimeSettingsPrivate)
{
    using Platform = ::DateTimeSettings;
    connect(d, &Platform::readyChanged, this, &DateTimeSettings::readyChanged);
    connect(d, &Platform::automaticTimeUpdateChanged, this,
            &DateTimeSettings::automaticDateTimeUpdateChanged);
    connect(d, &Platform::automaticTimezoneUpdateChanged, this,
            &DateTimeSettings::automaticTimeZoneUpdateChanged);
    connect(d, &Platform::timezoneChanged, this, &DateTimeSettings::timeZoneChanged);
    connect(d, &Platform::timeChanged, this, &DateTimeSettings::dateTimeChanged);
}

DateTimeSettings::~DateTimeSettings()
{
    delete d;
}

bool DateTimeSettings::ready() const
{
    return d->ready();
}

bool DateTimeSettings::automaticDateTimeUpdate() const
{
    return d->automaticTimeUpdate();
}

void DateTimeSettings::setAutomaticDateTimeUpdate(bool enabled)
{
    d->setAutomaticTimeUpdate(enabled);
}

bool DateTimeSettings::automaticTimeZoneUpdate() const
{
    return d->automaticTimezoneUpdate();
}

void DateTimeSettings::setAutomaticTimeZoneUpdate(bool enabled)
{
    d->setAutomaticTimezoneUpdate(enabled);
}

QString DateTimeSettings::timeZone() const
{
    return d->timezone();
}

void DateTimeSettings::setTimeZone(const QString &timeZone)
{
    if (d->supportedTimeZones().contains(timeZone))
        d->setTimezone(timeZone);
    else
        qWarning() << "Time zone" << timeZone << "is not supported";
}

void DateTimeSettings::setTime(int hour, int minute)
{
    d->setTime(hour, minute);
}

void DateTimeSettings::setDate(const QDate &date)
{
    d->setDate(date);
}

QStringList DateTimeSettings::supportedTimeZones() const
{
    return d->supportedTimeZones();
}

} // namespace Mdm
} // namespace Corvane
