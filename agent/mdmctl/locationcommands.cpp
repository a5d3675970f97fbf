// SPDX-License-Identifier: LGPL-2.1-or-later
#include "answer.h"
#include "commands.h"
#include "output.h"
#include "servicecommand.h"
#include "settingcommands.h"
#include "wait.h"

#include <corvanemdm/locationinfo.h>

namespace Corvane
{
namespace Agent
{

using Mdm::LocationInfo;

namespace
{

// What the library warns of, and nothing else tells.
const QLatin1String failures("^(?:Failed to |Invalid position information received:)");

/** What the phone reported last, for people and as JSON. */
struct Report {
    QString text;
    QJsonObject json;
};

QJsonValue knownNumber(int number)
{
    return number < 0 ? QJsonValue() : QJsonValue(number);
}

Report reportOf(const LocationInfo &info)
{
    const LocationInfo::Position position = info.position();
    const int inUse = info.satellitesInUse();
    const int inView = info.satellitesInView();
    constexpr int degreeDigits = 6; // a tenth of a metre
    QStringList texts;
    QJsonObject json{{QStringLiteral("satellitesInUse"), knownNumber(inUse)},
                     {QStringLiteral("satellitesInView"), knownNumber(inView)}};
    if (position.timestamp.isValid()) {
        const QString time = position.timestamp.toUTC().toString(Qt::ISODateWithMs);
        texts.append(QStringLiteral("%1, %2, %3 m at %4")
                         .arg(QString::number(position.latitude, 'f', degreeDigits),
                              QString::number(position.longitude, 'f', degreeDigits),
                              QString::number(position.altitude, 'f', 1), time));
        json.insert(QStringLiteral("latitude"), position.latitude);
        json.insert(QStringLiteral("longitude"), position.longitude);
        json.insert(QStringLiteral("altitude"), position.altitude);
        json.insert(QStringLiteral("fixed"), time);
    } else {
        texts.append(QStringLiteral("no position yet"));
    }
    if (inUse >= 0 && inView >= 0)
        texts.append(QStringLiteral("%1 of %2 satellites").arg(inUse).arg(inView));
    return {texts.join(QLatin1String("; ")), json};
}

/** Has @p request made; what the phone refuses ends the wait. */
void request(Wait *wait, const std::function<void()> &request)
{
    const Reply reply = ask(Service::mdmProxy(), failures, request);
    if (!reply.isDone())
        wait->end(reply.outcome, reply.text);
}

int runOnce(LocationInfo &info, const Values &values)
{
    Wait wait(Service::mdmProxy(), timeoutsOf(values).silence, QStringLiteral("find the position"));
    QObject::connect(&info, &LocationInfo::positionChanged, &wait, [&wait] { wait.end(Reply::Done); });
    request(&wait, [&info] { info.requestUpdate(); });
    const Reply reply = wait.run();
    if (reply.isDone()) {
        const Report report = reportOf(info);
        printResult(values, report.text, report.json);
    }
    return conclude(reply);
}

int runWatch(LocationInfo &info, const Values &values)
{
    const EventLog log(wantsJson(values));
    const QString event = QStringLiteral("event");
    Wait wait(Service::mdmProxy(), Wait::Forever, QString());
    const auto write = [&](const QString &name) {
        Report report = reportOf(info);
        report.json.insert(event, name);
        log.write(report.text, report.json);
    };
    QObject::connect(&info, &LocationInfo::positionChanged, &wait,
                     [&] { write(QStringLiteral("position")); });
    QObject::connect(&info, &LocationInfo::satellitesChanged, &wait,
                     [&] { write(QStringLiteral("satellites")); });
    log.write(QStringLiteral("Watching the position."), {{event, QStringLiteral("watching")}});
    request(&wait, [&info] { info.startUpdates(); });
    const Reply reply = wait.run();
    // A phone that nobody watches lets its receiver rest.
    if (reply.outcome == Reply::Interrupted)
        info.stopUpdates();
    return concludeWatch(reply);
}

Command command(const QString &name, const QString &summary, int (*run)(LocationInfo &, const Values &))
{
    return serviceCommand(Service::mdmProxy(), name, summary, run);
}

} // namespace

Command locationCommand()
{
    const QString members
        = QStringLiteral("\"latitude\", \"longitude\" (degrees), \"altitude\" (metres), \"fixed\" (the time "
                         "of the\nposition), \"satellitesInUse\", \"satellitesInView\"; what is not known is "
                         "left out or null");

    Command once = command(QStringLiteral("once"), QStringLiteral("Find out where the phone is"), runOnce);
    once.options.append(
        timeoutOption(QStringLiteral("Give up after so many seconds without a position (default: 300)")));
    once.description = QStringLiteral("No position comes while location is switched off: \"mdmctl location "
                                      "settings\" shows\nwhether it is.\n\n"
                                      "JSON: an object with %1.")
                           .arg(members);

    Command watch = command(QStringLiteral("watch"), QStringLiteral("Follow where the phone is"), runWatch);
    watch.description
        = QStringLiteral(
              "Keeps the receiver running, and prints one line a report, until it is interrupted "
              "(Ctrl-C, exit\nstatus 0).\n\n"
              "JSON: one object a line with \"time\" and \"event\": \"watching\" at the start, then "
              "\"position\" or\n\"satellites\" with %1.")
              .arg(members);

    const SettingCommands settings{QStringLiteral("location"), makeLocationSettings};
    Command location;
    location.name = QStringLiteral("location");
    location.summary = QStringLiteral("Find out where the phone is, and rule whether it may");
    location.commands = {
        once, watch,
        settings.show(QStringLiteral("settings"), QStringLiteral("Show what the phone may locate itself by")),
        settings.set(QStringLiteral("gps off"))};
    return location;
}

} // namespace Agent
} // namespace Corvane
