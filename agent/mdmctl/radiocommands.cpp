// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commands.h"
#include "exitstatus.h"
#include "output.h"
#include "radioswitch.h"
#include "wait.h"

#include <functional>

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String enabledMember("enabled");

/** One radio and the words for it: the commands of both differ in these alone. */
struct Subject {
    Radio radio;
    QString word; ///< on the command line
    QString sentence; ///< "Wi-Fi is %1."

    QString text(bool on) const { return sentence.arg(on ? QStringLiteral("on") : QStringLiteral("off")); }
};

using Run = std::function<int(RadioSwitch &, const Subject &, const Values &)>;

int runStatus(RadioSwitch &radio, const Subject &subject, const Values &values)
{
    const Answer<bool> on = radio.isOn();
    if (on.reply.isDone())
        printResult(values, subject.text(on.value), {{enabledMember, on.value}});
    return conclude(on.reply);
}

Run runSwitch(bool on)
{
    return [on](RadioSwitch &radio, const Subject &subject, const Values &values) -> int {
        const Answer<bool> before = radio.isOn();
        const Reply reply = before.reply.isDone() ? radio.set(on) : before.reply;
        if (!reply.isDone())
            return conclude(reply);
        const bool changed = before.value != on;
        const QString text = subject.text(on);
        printResult(values, changed ? text : QStringLiteral("Already so, nothing to change. ") + text,
                    {{enabledMember, on}, {QStringLiteral("changed"), changed}});
        return ExitDone;
    };
}

int runWatch(RadioSwitch &radio, const Subject &subject, const Values &values)
{
    const EventLog log(wantsJson(values));
    Answer<bool> last = radio.isOn();
    if (!last.reply.isDone())
        return conclude(last.reply);
    Wait wait(Service::connectionManager(), Wait::Forever, QString());
    const auto write = [&](const char *event) {
        log.write(subject.text(last.value),
                  {{QStringLiteral("event"), QLatin1String(event)}, {enabledMember, last.value}});
    };
    QObject::connect(&radio, &RadioSwitch::changed, &wait, [&] {
        const Answer<bool> now = radio.isOn();
        if (!now.reply.isDone())
            return printError(now.reply.text);
        if (now.value == last.value)
            return;
        last = now;
        write("changed");
    });
    write("watching");
    return concludeWatch(wait.run());
}

Command command(const Subject &subject, const QString &name, const QString &summary,
                const QString &description, const Run &run)
{
    Command command;
    command.name = name;
    command.summary = summary;
    command.description = description;
    command.options = {jsonOption(),
                       timeoutOption(QStringLiteral(
                           "Give up when the phone has not confirmed after so many seconds (default: 25)"))};
    command.run = [run, subject](const Values &values) -> int {
        const Reply running = Service::connectionManager().ensureRunning();
        if (!running.isDone())
            return conclude(running);
        RadioSwitch radio(subject.radio, timeoutsOf(values).confirmation);
        return run(radio, subject, values);
    };
    return command;
}

Command family(const Subject &subject, const QString &summary, const QString &description)
{
    const QString name = radioName(subject.radio);
    const QString changeHelp
        = QStringLiteral(
              "Waits until the phone confirms it. %1 that is so already is left as it is, with exit "
              "status 0.\n\n"
              "Example:\n  mdmctl %2 %3\n\n"
              "JSON: {\"enabled\": %4, \"changed\": true}")
              .arg(name.at(0).toUpper() + name.mid(1), subject.word);
    Command family;
    family.name = subject.word;
    family.summary = summary;
    family.description = description;
    family.commands = {
        command(subject, QStringLiteral("status"), QStringLiteral("Tell whether %1 is on").arg(name),
                QStringLiteral("JSON: {\"enabled\": true}"), runStatus),
        command(subject, QStringLiteral("on"), QStringLiteral("Switch %1 on").arg(name),
                changeHelp.arg(QStringLiteral("on"), QStringLiteral("true")), runSwitch(true)),
        command(subject, QStringLiteral("off"), QStringLiteral("Switch %1 off").arg(name),
                changeHelp.arg(QStringLiteral("off"), QStringLiteral("false")), runSwitch(false)),
        command(subject, QStringLiteral("watch"), QStringLiteral("Follow %1").arg(name),
                QStringLiteral(
                    "Prints one line a change until it is interrupted (Ctrl-C, exit status 0).\n\n"
                    "JSON: one object a line with \"time\", \"enabled\" and \"event\": \"watching\" at the "
                    "start,\nthen \"changed\"."),
                runWatch),
    };
    return family;
}

} // namespace

Command wifiCommand()
{
    return family({Radio::WiFi, QStringLiteral("wifi"), QStringLiteral("Wi-Fi is %1.")},
                  QStringLiteral("Switch Wi-Fi on and off"),
                  QStringLiteral("Flight mode takes Wi-Fi down; it can be switched on again within."));
}

Command flightModeCommand()
{
    return family({Radio::FlightMode, QStringLiteral("flight-mode"), QStringLiteral("Flight mode is %1.")},
                  QStringLiteral("Switch all radios off, and on again"),
                  QStringLiteral("Flight mode takes Wi-Fi and mobile data down."));
}

} // namespace Agent
} // namespace Corvane
