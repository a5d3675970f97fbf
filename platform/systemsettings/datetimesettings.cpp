// SPDX-License-Identifier: LGPL-2.1-or-later
#include <systemsettings/datetimesettings.h>

#include "../keyfile_p.h"
#include "remoteproperties_p.h"
#include "settingsfile_p.h"

#include <QtCore/QDateTime>
#include <QtCore/QDebug>
#include <QtCore/QPointer>
#include <QtCore/QQueue>
#include <QtCore/QTimeZone>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusPendingCallWatcher>
#include <QtDBus/QDBusPendingReply>
#include <QtDBus/QDBusVariant>

#include <cstdlib>
#include <functional>
#include <limits>
#include <utility>

namespace
{

const QLatin1String service("org.freedesktop.timedate1");
const QLatin1String path("/org/freedesktop/timedate1");
const QLatin1String interface("org.freedesktop.timedate1");

const QLatin1String timezoneProperty("Timezone");
const QLatin1String ntpProperty("NTP");
const QLatin1String timeProperty("TimeUSec");

const char group[] = "datetime";
const char automaticTimezoneKey[] = "automatic_timezone";

constexpr int microsecondsPerMillisecond = 1000;
// The service asks nobody for a password: there may be nobody.
constexpr bool notInteractive = false;

QDBusMessage callOf(const QString &calledInterface, const QString &method, const QVariantList &arguments)
{
    QDBusMessage call = QDBusMessage::createMethodCall(service, path, calledInterface, method);
    call.setArguments(arguments);
    return call;
}

} // namespace

class DateTimeSettings::Private
{
public:
    /** What the clock is to be set to, seen from what it shows. */
    using ClockChange = std::function<QDateTime(const QDateTime &now)>;

    explicit Private(DateTimeSettings *settings);

    /** Calls @p handler with the answer; nobody when the object is gone by then. */
    void send(const QDBusMessage &call, const std::function<void(const QDBusPendingCall &answer)> &handler);
    void command(const QString &method, const QVariantList &arguments, const char *failure);

    void changeClock(const ClockChange &change);
    void readPropertiesAgain();
    void readFileAgain();

    DateTimeSettings *const q;
    RemoteProperties properties;
    SettingsFile file;
    bool isReady = false;
    bool automaticTime = false;
    bool automaticTimezone = false;
    QString timezone;

private:
    void beginChange();
    void setClock(const QDateTime &time);
    void endChange();

    // One after the other: each begins with what the one before has left.
    QQueue<ClockChange> m_changes;
};

DateTimeSettings::Private::Private(DateTimeSettings *settings)
    : q(settings)
    , properties(service, path, interface)
    , file(QStringLiteral("/etc/datetime/datetime.conf"))
{
    QObject::connect(&properties, &RemoteProperties::changed, q, [this] { readPropertiesAgain(); });
    QObject::connect(&file, &SettingsFile::changed, q, [this] { readFileAgain(); });
    readFileAgain();
}

void DateTimeSettings::Private::send(const QDBusMessage &call,
                                     const std::function<void(const QDBusPendingCall &)> &handler)
{
    auto *watcher = new QDBusPendingCallWatcher(QDBusConnection::systemBus().asyncCall(call), q);
    QObject::connect(watcher, &QDBusPendingCallWatcher::finished, q,
                     [handler](QDBusPendingCallWatcher *finished) {
                         finished->deleteLater();
                         handler(*finished);
                     });
}

void DateTimeSettings::Private::command(const QString &method, const QVariantList &arguments,
                                        const char *failure)
{
    send(callOf(interface, method, arguments), [failure](const QDBusPendingCall &answer) {
        if (answer.isError())
            qWarning() << failure << answer.error();
    });
}

void DateTimeSettings::Private::readPropertiesAgain()
{
    const bool timeWasAutomatic = std::exchange(automaticTime, properties.value(ntpProperty).toBool());
    const QString zoneBefore = std::exchange(timezone, properties.value(timezoneProperty).toString());
    const bool wasReady = std::exchange(isReady, true);
    // A receiver may delete the object, and this with it.
    const QPointer<DateTimeSettings> alive(q);
    if (automaticTime != timeWasAutomatic)
        Q_EMIT alive->automaticTimeUpdateChanged();
    if (alive && timezone != zoneBefore)
        Q_EMIT alive->timezoneChanged();
    if (alive && !wasReady)
        Q_EMIT alive->readyChanged();
}

void DateTimeSettings::Private::readFileAgain()
{
    const bool now = KeyFile(file.fileName()).flag(group, automaticTimezoneKey);
    if (std::exchange(automaticTimezone, now) != now)
        Q_EMIT q->automaticTimezoneUpdateChanged();
}

void DateTimeSettings::Private::changeClock(const ClockChange &change)
{
    m_changes.enqueue(change);
    if (m_changes.size() == 1)
        beginChange();
}

void DateTimeSettings::Private::beginChange()
{
    const QDBusMessage question = callOf(QStringLiteral("org.freedesktop.DBus.Properties"),
                                         QStringLiteral("Get"), {QString(interface), QString(timeProperty)});
    send(question, [this](const QDBusPendingCall &answer) {
        const QDBusPendingReply<QDBusVariant> time = answer;
        if (time.isError()) {
            qWarning() << "Cannot read the clock:" << time.error();
            endChange();
            return;
        }
        const QTimeZone zone(timezone.toUtf8());
        const qint64 now = time.value().variant().toLongLong() / microsecondsPerMillisecond;
        setClock(m_changes.head()(
            QDateTime::fromMSecsSinceEpoch(now, zone.isValid() ? zone : QTimeZone::systemTimeZone())));
    });
}

void DateTimeSettings::Private::setClock(const QDateTime &time)
{
    constexpr qint64 latest = std::numeric_limits<qint64>::max() / microsecondsPerMillisecond;
    if (std::abs(time.toMSecsSinceEpoch()) > latest) {
        qWarning() << "No clock shows" << time;
        endChange();
        return;
    }
    constexpr bool isRelative = false;
    const qint64 microseconds = time.toMSecsSinceEpoch() * microsecondsPerMillisecond;
    send(callOf(interface, QStringLiteral("SetTime"), {microseconds, isRelative, notInteractive}),
         [this](const QDBusPendingCall &answer) {
             const QPointer<DateTimeSettings> alive(q);
             if (answer.isError())
                 qWarning() << "Cannot set the clock:" << answer.error();
             else
                 Q_EMIT q->timeChanged();
             if (alive)
                 endChange();
         });
}

void DateTimeSettings::Private::endChange()
{
    m_changes.dequeue();
    if (!m_changes.isEmpty())
        beginChange();
}

DateTimeSettings::DateTimeSettings(QObject *parent)
    : QObject(parent)
    , d(new Private(this))
{
}

DateTimeSettings::~DateTimeSettings()
{
    delete d;
}

bool DateTimeSettings::ready() const
{
    return d->isReady;
}

bool DateTimeSettings::automaticTimeUpdate() const
{
    return d->automaticTime;
}

void DateTimeSettings::setAutomaticTimeUpdate(bool enabled)
{
    d->command(QStringLiteral("SetNTP"), {enabled, notInteractive}, "Cannot switch automatic time:");
}

bool DateTimeSettings::automaticTimezoneUpdate() const
{
    return d->automaticTimezone;
}

void DateTimeSettings::setAutomaticTimezoneUpdate(bool enabled)
{
    const QString value = enabled ? QStringLiteral("true") : QStringLiteral("false");
    if (d->file.write(group, automaticTimezoneKey, value))
        d->readFileAgain();
}

QString DateTimeSettings::timezone() const
{
    return d->timezone;
}

void DateTimeSettings::setTimezone(const QString &timezone)
{
    d->command(QStringLiteral("SetTimezone"), {timezone, notInteractive}, "Cannot set the time zone:");
}

void DateTimeSettings::setTime(int hour, int minute)
{
    const QTime time(hour, minute);
    if (!time.isValid()) {
        qWarning() << "No time of day:" << hour << minute;
        return;
    }
    d->changeClock([time](QDateTime now) {
        now.setTime(time);
        return now;
    });
}

void DateTimeSettings::setDate(const QDate &date)
{
    if (!date.isValid()) {
        qWarning() << "No date:" << date;
        return;
    }
    d->changeClock([date](QDateTime now) {
        now.setDate(date);
        return now;
    });
}
