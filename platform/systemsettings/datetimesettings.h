// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_SYSTEMSETTINGS_DATETIMESETTINGS_H
#define CORVANEMDM_PLATFORM_SYSTEMSETTINGS_DATETIMESETTINGS_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QDate>
#include <QtCore/QObject>
#include <QtCore/QString>

/**
 * Clock and time zone: "org.freedesktop.timedate1" on the system bus.
 *
 * Nothing blocks. What is set is so once the service tells; what it refuses is logged. That the time zone
 * follows the network is no business of that service: it is kept in the key file
 * "/etc/datetime/datetime.conf", group "datetime", key "automatic_timezone".
 */
class CORVANEMDM_PLATFORM_EXPORT DateTimeSettings : public QObject
{
    Q_OBJECT

public:
    explicit DateTimeSettings(QObject *parent = nullptr);
    ~DateTimeSettings() override;

    /** Whether the service has told its settings. They stay known when it ends, as it does when it is idle.
     */
    bool ready() const;

    /** Whether the clock follows the network. */
    bool automaticTimeUpdate() const;
    void setAutomaticTimeUpdate(bool enabled);

    /** Whether the time zone follows the network. */
    bool automaticTimezoneUpdate() const;
    void setAutomaticTimezoneUpdate(bool enabled);

    /** Empty before the service has told it. */
    QString timezone() const;
    void setTimezone(const QString &timezone);

    /** Sets the clock to the beginning of a minute of its present day, in its time zone. */
    void setTime(int hour, int minute);
    /** Sets the day and leaves the time of day. */
    void setDate(const QDate &date);

Q_SIGNALS:
    void readyChanged();
    void automaticTimeUpdateChanged();
    void automaticTimezoneUpdateChanged();
    void timezoneChanged();
    /** The clock was set through this object. */
    void timeChanged();

private:
    Q_DISABLE_COPY(DateTimeSettings)

    class Private;
    Private *const d;
};

#endif // CORVANEMDM_PLATFORM_SYSTEMSETTINGS_DATETIMESETTINGS_H
