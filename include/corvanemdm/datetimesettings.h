// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_DATETIMESETTINGS_H
#define CORVANEMDM_DATETIMESETTINGS_H

#include <corvanemdm/corvanemdm_global.h>

#include <QtCore/QDate>
#include <QtCore/QObject>
#include <QtCore/QString>
#include <QtCore/QStringList>

namespace Corvane
{
namespace Mdm
{

class DateTimeSettingsPrivate;

/**
 * @brief Sets the clock, the date and the time zone, and whether they follow the network.
 *
 * Nothing blocks. What is set is so once the phone confirms it, which the change signals tell; what it
 * refuses is logged, and changes nothing. Setting the clock by hand is refused while it follows the network.
 *
 * Source: the phone's settings library.
 */
class CORVANEMDM_EXPORT DateTimeSettings : public QObject
{
    Q_OBJECT
    /** @see ready() */
    Q_PROPERTY(bool ready READ ready NOTIFY readyChanged)
    /** @see automaticDateTimeUpdate() */
    Q_PROPERTY(bool automaticDateTimeUpdate READ automaticDateTimeUpdate WRITE setAutomaticDateTimeUpdate
                   NOTIFY automaticDateTimeUpdateChanged)
    /** @see automaticTimeZoneUpdate() */
    Q_PROPERTY(bool automaticTimeZoneUpdate READ automaticTimeZoneUpdate WRITE setAutomaticTimeZoneUpdate
                   NOTIFY automaticTimeZoneUpdateChanged)
    /** @see timeZone() */
    Q_PROPERTY(QString timeZone READ timeZone WRITE setTimeZone NOTIFY timeZoneChanged)

public:
    /** Reads the list of time zones that the system knows now. */
    explicit DateTimeSettings(QObject *parent = nullptr);
    ~DateTimeSettings() override;

    /** Whether the settings are known; before that they are off and empty. */
    bool ready() const;

    /** Whether the clock follows the network. */
    bool automaticDateTimeUpdate() const;
    void setAutomaticDateTimeUpdate(bool enabled); ///< see automaticDateTimeUpdate()

    /** Whether the time zone follows the network. */
    bool automaticTimeZoneUpdate() const;
    void setAutomaticTimeZoneUpdate(bool enabled); ///< see automaticTimeZoneUpdate()

    /** The time zone, such as "Europe/Helsinki"; empty as long as it is not known. */
    QString timeZone() const;
    /**
     * Sets the time zone to one of supportedTimeZones(), written exactly like that. Any other is only logged:
     * "Time zone", the name, "is not supported".
     */
    void setTimeZone(const QString &timeZone);

    /** Sets the clock to @p hour (0 to 23) and @p minute of its present day, in its time zone. */
    Q_INVOKABLE void setTime(int hour, int minute);
    /** Sets the day, and leaves the time of day. */
    Q_INVOKABLE void setDate(const QDate &date);
    /** The time zones that the system knew when this object was made. */
    Q_INVOKABLE QStringList supportedTimeZones() const;

Q_SIGNALS:
    void readyChanged(); ///< see ready()
    void automaticDateTimeUpdateChanged(); ///< see automaticDateTimeUpdate()
    void automaticTimeZoneUpdateChanged(); ///< see automaticTimeZoneUpdate()
    void timeZoneChanged(); ///< see timeZone()
    void dateTimeChanged(); ///< the clock was set through this object

private:
    Q_DISABLE_COPY(DateTimeSettings)
    DateTimeSettingsPrivate *const d;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_DATETIMESETTINGS_H
