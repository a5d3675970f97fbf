// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_SYSTEMSETTINGS_TIMEZONEINFO_H
#define CORVANEMDM_PLATFORM_SYSTEMSETTINGS_TIMEZONEINFO_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QList>
#include <QtCore/QString>

/** A time zone that the system knows: a place of the zone table "/usr/share/zoneinfo/zone.tab". */
class CORVANEMDM_PLATFORM_EXPORT TimeZoneInfo
{
public:
    explicit TimeZoneInfo(const QString &name);

    /** Such as "Europe/Helsinki". */
    QString name() const;

    /** All that the table holds now, in its order; none when it cannot be read. */
    static QList<TimeZoneInfo> systemTimeZones();

private:
    QString m_name;
};

#endif // CORVANEMDM_PLATFORM_SYSTEMSETTINGS_TIMEZONEINFO_H
