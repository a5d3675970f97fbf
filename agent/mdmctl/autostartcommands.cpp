// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commands.h"
#include "exitstatus.h"
#include "output.h"
#include "service.h"
#include "sessionapplications.h"

#include <QtCore/QJsonArray>
#include <QtCore/QJsonObject>

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String entryArgument("DESKTOP-ENTRY");

int runList(SessionApplications &applications, const Values &values)
{
    QStringList entries;
    const Reply reply = applications.list(entries);
    if (!reply.isDone())
        return conclude(reply);
    if (wantsJson(values))
        print({{QStringLiteral("autostart"), QJsonArray::fromStringList(entries)}});
    else
        print(entries.isEmpty() ? QStringLiteral("Nothing starts with the session.")
                                : entries.join(QLatin1Char('\n')));
    return ExitDone;
}

/** Does the same to each of several entries; one that fails does not stop the others. */
std::function<int(SessionApplications &, const Values &)> runForEach(
    Reply (SessionApplications::*request)(const QString &))
{
    return [request](SessionApplications &applications, const Values &values) -> int {
        ExitStatus status = ExitDone;
        const QStringList entries = values.all(entryArgument);
        for (const QString &entry : entries) {
            const ExitStatus each = conclude((applications.*request)(entry));
            if (each != ExitDone)
                status = each;
        }
        return status;
    };
}

Command command(const QString &name, const QString &summary,
                const std::function<int(SessionApplications &, const Values &)> &run)
{
    Command command;
    command.name = name;
    command.summary = summary;
    command.run = [run](const Values &values) -> int {
        const Reply running = Service::mdmProxy().ensureRunning();
        if (!running.isDone())
            return conclude(running);
        SessionApplications applications;
        return run(applications, values);
    };
    return command;
}

} // namespace

Command autostartCommand()
{
    Command list
        = command(QStringLiteral("list"), QStringLiteral("Show what starts with the session"), runList);
    list.options = {jsonOption()};
    list.description = QStringLiteral("JSON: {\"autostart\": [\"/usr/share/applications/mail.desktop\"]}");

    const Argument entries{entryArgument,
                           QStringLiteral("Absolute path, or file name in the folder of applications"),
                           {},
                           {},
                           Argument::File,
                           Argument::Several};
    Command add = command(QStringLiteral("add"), QStringLiteral("Make applications start with the session"),
                          runForEach(&SessionApplications::add));
    add.arguments = {entries};
    add.description = QStringLiteral("One that starts already is fine.");
    Command remove = command(QStringLiteral("remove"),
                             QStringLiteral("Make applications start with the session no more"),
                             runForEach(&SessionApplications::remove));
    remove.arguments = {entries};

    Command autostart;
    autostart.name = QStringLiteral("autostart");
    autostart.summary = QStringLiteral("Choose the applications that start with the session");
    autostart.description = QStringLiteral("Examples:\n"
                                           "  mdmctl autostart add mail.desktop\n"
                                           "  mdmctl autostart list --json");
    autostart.commands = {list, add, remove};
    return autostart;
}

} // namespace Agent
} // namespace Corvane
