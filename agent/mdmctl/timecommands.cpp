// SPDX-License-Identifier: LGPL-2.1-or-later
#include "clocksettings.h"
#include "commands.h"
#include "exitstatus.h"
#include "output.h"
#include "settingcommands.h"

#include <QtCore/QJsonArray>
#include <QtCore/QTime>

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String dateName("--date");
const QLatin1String timeName("--time");

using Mdm::DateTimeSettings;

QTime timeOfDay(const QString &text)
{
    return QTime::fromString(text, QStringLiteral("HH:mm"));
}

QDate dateFrom(const QString &text)
{
    return QDate::fromString(text, Qt::ISODate);
}

int runZones(ClockSettings &clock, const Values &values)
{
    QStringList zones = clock.timeZones();
    zones.sort();
    printResult(values, zones.join(QLatin1Char('\n')),
                {{QStringLiteral("timeZones"), QJsonArray::fromStringList(zones)}});
    return ExitDone;
}

int runClock(ClockSettings &clock, const Values &values)
{
    QJsonObject json;
    QStringList texts;
    // The day first, as the time of day is one of that day.
    if (values.has(dateName)) {
        const QDate date = dateFrom(values.first(dateName));
        const Reply reply = clock.setClock([date](DateTimeSettings &phone) { phone.setDate(date); });
        if (!reply.isDone())
            return conclude(reply);
        texts.append(date.toString(Qt::ISODate));
        json.insert(QStringLiteral("date"), texts.last());
    }
    if (values.has(timeName)) {
        const QTime time = timeOfDay(values.first(timeName));
        const Reply reply
            = clock.setClock([time](DateTimeSettings &phone) { phone.setTime(time.hour(), time.minute()); });
        if (!reply.isDone())
            return conclude(reply);
        texts.append(values.first(timeName));
        json.insert(QStringLiteral("time"), texts.last());
    }
    printResult(values, QStringLiteral("The clock is set to %1.").arg(texts.join(QLatin1Char(' '))), json);
    return ExitDone;
}

Command command(const QString &name, const QString &summary, int (*run)(ClockSettings &, const Values &))
{
    Command command;
    command.name = name;
    command.summary = summary;
    command.options = {jsonOption(),
                       timeoutOption(QStringLiteral(
                           "Give up when the phone has not answered after so many seconds (default: 25)"))};
    command.run = [run](const Values &values) -> int {
        ClockSettings clock(timeoutsOf(values).confirmation);
        Reply opened = clock.service().ensureRunning();
        if (opened.isDone())
            opened = clock.open();
        return opened.isDone() ? run(clock, values) : conclude(opened);
    };
    return command;
}

} // namespace

Command timeCommand()
{
    const SettingCommands settings{QStringLiteral("time"), makeClockSettings};

    Command zones = command(QStringLiteral("zones"),
                            QStringLiteral("List the time zones that the phone knows"), runZones);
    zones.description = QStringLiteral("JSON: {\"timeZones\": [\"Africa/Abidjan\", ...]}");

    Command clock = command(QStringLiteral("clock"), QStringLiteral("Set the clock"), runClock);
    clock.options
        += {{dateName, QStringLiteral("The day, as in 2026-03-02"), QStringLiteral("DATE"),
             [](const QString &value) {
                 return dateFrom(value).isValid() ? QString()
                                                  : QStringLiteral("must be a date, as in 2026-03-02");
             }},
            {timeName, QStringLiteral("The time of day, as in 09:15"), QStringLiteral("TIME"),
             [](const QString &value) {
                 return timeOfDay(value).isValid() ? QString()
                                                   : QStringLiteral("must be a time of day, as in 09:15");
             }}};
    clock.description
        = QStringLiteral("In the phone's time zone. A clock that follows the network is not set: "
                         "\"mdmctl time set\nautomaticTime off\" comes first.\n\n"
                         "Example:\n  mdmctl time clock --date 2026-03-02 --time 09:15\n\n"
                         "JSON: {\"date\": \"2026-03-02\", \"time\": \"09:15\"}");
    const auto run = clock.run;
    clock.run = [run](const Values &values) -> int {
        if (values.has(dateName) || values.has(timeName))
            return run(values);
        printError(QStringLiteral("--date, --time or both are needed"));
        return ExitUsage;
    };

    Command time;
    time.name = QStringLiteral("time");
    time.summary = QStringLiteral("Rule what clock and time zone follow, and set the clock");
    time.commands
        = {settings.show(QStringLiteral("status"), QStringLiteral("Show what clock and time zone follow")),
           settings.set(QStringLiteral("timeZone Europe/Helsinki")), zones, clock};
    return time;
}

} // namespace Agent
} // namespace Corvane
