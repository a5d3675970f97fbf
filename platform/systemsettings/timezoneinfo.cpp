// SPDX-License-Identifier: LGPL-2.1-or-later
#include <systemsettings/timezoneinfo.h>

#include <QtCore/QFile>

TimeZoneInfo::TimeZoneInfo(const QString &name)
    : m_name(name)
{
}

QString TimeZoneInfo::name() const
{
    return m_name;
}

QList<TimeZoneInfo> TimeZoneInfo::systemTimeZones()
{
    // A zone a line: countries, coordinates, name, and perhaps a comment, divided by tabs.
    constexpr int nameColumn = 2;
    QList<TimeZoneInfo> zones;
    QFile table(QStringLiteral("/usr/share/zoneinfo/zone.tab"));
    if (!table.open(QIODevice::ReadOnly))
        return zones;
    while (!table.atEnd()) {
        const QString line = QString::fromUtf8(table.readLine()).trimmed();
        const QString name = line.section(QLatin1Char('\t'), nameColumn, nameColumn);
        if (!line.startsWith(QLatin1Char('#')) && !name.isEmpty())
            zones.append(TimeZoneInfo(name));
    }
    return zones;
}
