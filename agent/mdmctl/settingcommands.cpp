// SPDX-License-Identifier: LGPL-2.1-or-later
#include "settingcommands.h"

#include "commands.h"
#include "exitstatus.h"
#include "output.h"
#include "table.h"
#include "timeouts.h"

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String settingArgument("SETTING");
const QLatin1String valueArgument("VALUE");

QJsonObject allOf(const DeviceSettings &settings)
{
    QJsonObject json;
    for (const DeviceSetting &setting : settings.all())
        json.insert(setting.name, setting.read());
    return json;
}

int runShow(DeviceSettings &settings, const Values &values)
{
    Table table({QStringLiteral("SETTING"), QStringLiteral("VALUE"), QStringLiteral("MEANING")});
    for (const DeviceSetting &setting : settings.all())
        table.addRow({setting.name, DeviceSetting::textOf(setting.read()), setting.description});
    printResult(values, table.toString(), allOf(settings));
    return ExitDone;
}

int runSet(DeviceSettings &settings, const Values &values)
{
    const DeviceSetting *setting = settings.find(values.first(settingArgument));
    const QString text = values.first(valueArgument);
    const QJsonValue value = setting->valueOf(text);
    if (value.isUndefined()) {
        printError(QStringLiteral("VALUE \"%1\": must be %2").arg(text, setting->usage()));
        return ExitUsage;
    }
    const bool changed = setting->read() != value;
    const Reply reply = settings.set(*setting, value);
    if (reply.isDone()) {
        printResult(values,
                    unchangedNote(changed)
                        + QStringLiteral("%1 is %2.").arg(setting->name, DeviceSetting::textOf(value)),
                    {{setting->name, value}, {QStringLiteral("changed"), changed}});
    }
    return conclude(reply);
}

QStringList namesOf(const QVector<DeviceSetting> &settings)
{
    QStringList names;
    for (const DeviceSetting &setting : settings)
        names.append(setting.name);
    return names;
}

} // namespace

SettingCommands::SettingCommands(const QString &family, const DeviceSettingsMaker &make)
    : m_family(family)
    , m_make(make)
    , m_settings(make(Timeouts().confirmation)->all())
{
}

Command SettingCommands::command(const QString &name, const QString &summary, Run run) const
{
    Command command;
    command.name = name;
    command.summary = summary;
    command.options = {jsonOption(),
                       timeoutOption(QStringLiteral(
                           "Give up when the phone has not answered after so many seconds (default: 25)"))};
    command.run = [make = m_make, run](const Values &values) -> int {
        const std::unique_ptr<DeviceSettings> settings = make(timeoutsOf(values).confirmation);
        Reply opened = settings->service().ensureRunning();
        if (opened.isDone())
            opened = settings->open();
        return opened.isDone() ? run(*settings, values) : conclude(opened);
    };
    return command;
}

Command SettingCommands::show(const QString &name, const QString &summary) const
{
    Command show = command(name, summary, runShow);
    show.description
        = QStringLiteral("JSON: an object with %1.").arg(namesOf(m_settings).join(QStringLiteral(", ")));
    return show;
}

Command SettingCommands::set(const QString &example) const
{
    Command set = command(QStringLiteral("set"), QStringLiteral("Change a setting"), runSet);
    QStringList lines;
    for (const DeviceSetting &setting : m_settings) {
        const QString usage = setting.usage();
        lines.append(QStringLiteral("  %1  %2")
                         .arg(setting.name.leftJustified(17),
                              usage.isEmpty() ? setting.description
                                              : QStringLiteral("%1: %2").arg(setting.description, usage)));
    }
    set.arguments = {{settingArgument, QStringLiteral("Which setting"), namesOf(m_settings), {}},
                     {valueArgument, QStringLiteral("What it is to be"), {}, {}}};
    set.description = QStringLiteral("Settings and values:\n%1\n\n"
                                     "Waits until the phone confirms the change.\n\n"
                                     "Example:\n  mdmctl %2 set %3\n\n"
                                     "JSON, after the change: {\"%4\": ..., \"changed\": true}")
                          .arg(lines.join(QLatin1Char('\n')), m_family, example, m_settings.first().name);
    return set;
}

} // namespace Agent
} // namespace Corvane
