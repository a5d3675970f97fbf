// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commands.h"
#include "exitstatus.h"
#include "securityswitches.h"
#include "service.h"

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String modeName("MODE");

const QString on = QStringLiteral("on");

QString developerModeText(bool isOn)
{
    return isOn ? QStringLiteral("Developer mode is on.") : QStringLiteral("Developer mode is off.");
}

QString sideloadingText(bool isAllowed)
{
    return isAllowed ? QStringLiteral("Packages from outside the store are allowed.")
                     : QStringLiteral("Packages from outside the store are forbidden.");
}

int report(const Reply &reply, const Values &values, const QString &text, const QJsonObject &json)
{
    if (reply.isDone())
        printResult(values, text, json);
    return conclude(reply);
}

int runStatus(const Values &values)
{
    const SecuritySwitches switches(timeoutsOf(values).confirmation);
    const bool developerMode = switches.developerMode();
    const Answer<bool> sideloading = switches.sideloading();
    if (!sideloading.reply.isDone())
        return conclude(sideloading.reply);
    printResult(values,
                developerModeText(developerMode) + QLatin1Char('\n') + sideloadingText(sideloading.value),
                {{QStringLiteral("developerMode"), developerMode},
                 {QStringLiteral("sideloading"), sideloading.value}});
    return ExitDone;
}

int runDeveloperMode(const Values &values)
{
    const bool isOn = values.first(modeName) == on;
    SecuritySwitches switches(timeoutsOf(values).silence);
    return report(switches.setDeveloperMode(isOn), values, developerModeText(isOn),
                  {{QStringLiteral("developerMode"), isOn}});
}

int runSideloading(const Values &values)
{
    const Reply running = Service::deviceLock().ensureRunning();
    if (!running.isDone())
        return conclude(running);
    const bool isAllowed = values.first(modeName) == on;
    SecuritySwitches switches(timeoutsOf(values).confirmation);
    return report(switches.setSideloading(isAllowed), values, sideloadingText(isAllowed),
                  {{QStringLiteral("sideloading"), isAllowed}});
}

Command switchCommand(const QString &name, const QString &summary, const QString &description,
                      int (*run)(const Values &))
{
    Command command;
    command.name = name;
    command.summary = summary;
    command.description = description;
    command.arguments = {{modeName,
                          QStringLiteral("on or off"),
                          {on, QStringLiteral("off")},
                          {},
                          Argument::Word,
                          Argument::One}};
    command.options = {jsonOption()};
    command.run = run;
    return command;
}

} // namespace

Command securityCommand()
{
    Command status;
    status.name = QStringLiteral("status");
    status.summary
        = QStringLiteral("Show developer mode, and whether packages from outside the store are allowed");
    status.description = QStringLiteral("JSON: {\"developerMode\": false, \"sideloading\": false}");
    status.options = {jsonOption()};
    status.run = runStatus;

    Command developerMode = switchCommand(
        QStringLiteral("developer-mode"), QStringLiteral("Switch developer mode on or off, by its package"),
        QStringLiteral("JSON: {\"developerMode\": true}"), runDeveloperMode);
    developerMode.options.append(timeoutOption(QStringLiteral(
        "Give up when the package is not installed or removed after so many seconds (default: 300)")));

    Command security;
    security.name = QStringLiteral("security");
    security.summary = QStringLiteral("Switch developer mode and packages from outside the store");
    security.description = QStringLiteral("Examples:\n"
                                          "  mdmctl security status\n"
                                          "  mdmctl security sideloading off");
    security.commands
        = {status, developerMode,
           switchCommand(QStringLiteral("sideloading"),
                         QStringLiteral("Allow packages from outside the store, or forbid them"),
                         QStringLiteral("JSON: {\"sideloading\": true}"), runSideloading)};
    return security;
}

} // namespace Agent
} // namespace Corvane
