// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commands.h"
#include "exitstatus.h"
#include "output.h"
#include "policy.h"
#include "policyengine.h"
#include "progress.h"
#include "table.h"

#include <QtCore/QJsonArray>
#include <QtCore/QJsonObject>

#include <algorithm>
#include <memory>

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String fileArgument("FILE");

bool isAsWanted(const Setting &setting)
{
    return setting.status == Setting::Compliant || setting.status == Setting::Changed;
}

ExitStatus exitStatusOf(const QVector<Setting> &settings)
{
    ExitStatus status = ExitDone;
    for (const Setting &setting : settings) {
        if (!isAsWanted(setting) && !setting.serviceMissing)
            return ExitFailed;
        if (setting.serviceMissing)
            status = ExitNoService;
    }
    return status;
}

QJsonObject reportJson(const Policy &policy, const QVector<Setting> &settings)
{
    QJsonArray rows;
    for (const Setting &setting : settings)
        rows.append(setting.toJson());
    return {{QStringLiteral("policy"), policy.name},
            {QStringLiteral("compliant"), std::all_of(settings.cbegin(), settings.cend(), isAsWanted)},
            {QStringLiteral("settings"), rows}};
}

QString countsText(const QVector<Setting> &settings)
{
    QStringList counts;
    for (const Setting::Status status :
         {Setting::Compliant, Setting::Different, Setting::Changed, Setting::Failed, Setting::Unsupported}) {
        Setting example;
        example.status = status;
        const auto count
            = std::count_if(settings.cbegin(), settings.cend(),
                            [status](const Setting &setting) { return setting.status == status; });
        if (count > 0)
            counts.append(QStringLiteral("%1 %2").arg(count).arg(example.statusName()));
    }
    return counts.join(QLatin1String(", "));
}

QString reportText(const Policy &policy, const QVector<Setting> &settings, const QString &presentHeading)
{
    if (settings.isEmpty())
        return QStringLiteral("%1: names no settings.").arg(policy.name);
    Table table({QStringLiteral("SETTING"), QStringLiteral("STATUS"), presentHeading,
                 QStringLiteral("WANTED"), QStringLiteral("DETAIL")});
    for (const Setting &setting : settings) {
        QString detail = setting.detail;
        detail.replace(QLatin1String("; "), QLatin1String("\n"));
        table.addRow({setting.path, setting.statusName(), setting.present.text, setting.wanted.text, detail});
    }
    return QStringLiteral("%1\n\n%2: %3.").arg(table.toString(), policy.name, countsText(settings));
}

/** Shows how far the engine is with what takes long. */
class EngineProgress
{
public:
    explicit EngineProgress(PolicyEngine *engine)
    {
        QObject::connect(engine, &PolicyEngine::progress, &m_context,
                         [this](const QString &path, int percent) {
                             if (!m_progress)
                                 m_progress = std::make_unique<Progress>(path);
                             m_progress->show(percent);
                         });
    }

private:
    QObject m_context;
    std::unique_ptr<Progress> m_progress;
};

int runCheck(PolicyEngine &engine, const Policy &policy, const Values &values)
{
    const QVector<Setting> settings = engine.check(policy);
    if (wantsJson(values))
        print(reportJson(policy, settings));
    else
        print(reportText(policy, settings, QStringLiteral("PRESENT")));
    return exitStatusOf(settings);
}

int runApply(PolicyEngine &engine, const Policy &policy, const Values &values)
{
    QVector<Setting> settings;
    if (wantsJson(values)) {
        settings = engine.apply(policy);
        print(reportJson(policy, settings));
    } else {
        {
            const EngineProgress progress(&engine);
            settings = engine.apply(policy);
        }
        print(reportText(policy, settings, QStringLiteral("BEFORE")));
    }
    return exitStatusOf(settings);
}

QString reportLine(const Setting &setting)
{
    QString why = setting.detail;
    if (why.isEmpty() && setting.status == Setting::Changed)
        why = QStringLiteral("from %1 to %2").arg(setting.present.text, setting.wanted.text);
    const QString line = QStringLiteral("%1: %2").arg(setting.path, setting.statusName());
    return why.isEmpty() ? line : QStringLiteral("%1 (%2)").arg(line, why);
}

int runWatch(PolicyEngine &engine, const Policy &policy, const Values &values)
{
    const EventLog log(wantsJson(values));
    const QString event = QStringLiteral("event");
    QObject::connect(&engine, &PolicyEngine::reported, &engine, [&](const Setting &setting) {
        QJsonObject json = setting.toJson();
        json.insert(event, QStringLiteral("setting"));
        log.write(reportLine(setting), json);
    });
    QObject::connect(&engine, &PolicyEngine::watching, &engine, [&] {
        log.write(QStringLiteral("Watching for drift from %1.").arg(policy.name),
                  {{event, QStringLiteral("watching")}, {QStringLiteral("policy"), policy.name}});
    });
    return concludeWatch(engine.watch(policy, timeoutsOf(values).look));
}

int runExport(const Values &values)
{
    PolicyEngine engine(makePolicySections(timeoutsOf(values)));
    const PolicyEngine::Export exported = engine.exportPolicy();
    print(exported.policy);
    for (const Setting &section : exported.missing)
        printError(QStringLiteral("\"%1\" is left out: %2").arg(section.path, section.detail));
    return exitStatusOf(exported.missing);
}

Command command(const QString &name, const QString &summary,
                int (*run)(PolicyEngine &, const Policy &, const Values &))
{
    Command command;
    command.name = name;
    command.summary = summary;
    command.arguments
        = {{fileArgument, QStringLiteral("The policy; - reads standard input"), {}, {}, Argument::File}};
    command.options = {
        jsonOption(),
        timeoutOption(QStringLiteral(
            "Give up when the phone has been silent for so many seconds (default: 25, during updates 300)"))};
    command.run = [run](const Values &values) -> int {
        PolicyEngine engine(makePolicySections(timeoutsOf(values)));
        const Policy policy = readPolicy(values.first(fileArgument), engine.sections());
        if (policy.isValid())
            return run(engine, policy, values);
        printError(policy.error);
        return ExitUsage;
    };
    return command;
}

const QLatin1String reportHelp(
    "JSON: {\"policy\": \"...\", \"compliant\": false, \"settings\": [{\"path\": \"calls.dial.default\",\n"
    "\"status\": \"different\", \"present\": \"allow\", \"wanted\": \"block\", \"detail\": \"\"}]}");

} // namespace

Command policyCommand()
{
    Command check
        = command(QStringLiteral("check"), QStringLiteral("Compare the phone with a policy"), runCheck);
    check.description
        = QStringLiteral(
              "Changes nothing, and does not make the phone look for updates. Each setting "
              "is compliant,\ndifferent, failed (could not be read) or unsupported. Exit status 1: not all "
              "are compliant.\n\n"
              "Example:\n"
              "  mdmctl policy check company-phone.json\n\n")
        + reportHelp;

    Command apply
        = command(QStringLiteral("apply"), QStringLiteral("Make the phone as a policy wants it"), runApply);
    apply.description
        = QStringLiteral("Sends only what differs, waits until the phone confirms it, and goes on when "
                         "a setting fails.\nEach setting is compliant, changed, failed or unsupported. "
                         "Exit status 1: not all are as wanted.\n\n"
                         "Example:\n"
                         "  mdmctl policy apply company-phone.json\n\n")
        + reportHelp;

    Command watch
        = command(QStringLiteral("watch"), QStringLiteral("Keep the phone as a policy wants it"), runWatch);
    watch.options.append(lookOption());
    watch.description = QStringLiteral(
        "Applies the policy, then puts right what drifts from it, until it is interrupted (Ctrl-C, exit\n"
        "status 0). A service that leaves and comes back is taken up again.\n"
        "What the phone does not announce is looked at every 30 seconds: accounts, autostart, packages\n"
        "that were installed past the package manager, technologies, access points and mobile data,\n"
        "assistance data for locations, sideloading and developer mode.\n\n"
        "JSON: one object a line with \"time\" and \"event\": \"setting\" with the members that \"policy "
        "apply\"\n"
        "gives a setting, and \"watching\" with \"policy\" once the policy has been applied.");

    Command exportCommand;
    exportCommand.name = QStringLiteral("export");
    exportCommand.summary = QStringLiteral("Write the phone's present state as a policy");
    exportCommand.options
        = {jsonOption(),
           timeoutOption(
               QStringLiteral("Give up when the phone has been silent for so many seconds (default: 25)"))};
    exportCommand.description
        = QStringLiteral("Writes JSON with or without --json. What cannot be read is left out, "
                         "and told on standard error.\n\n"
                         "Example:\n"
                         "  mdmctl policy export > phone.json && mdmctl policy check phone.json");
    exportCommand.run = runExport;

    Command schema;
    schema.name = QStringLiteral("schema");
    schema.summary = QStringLiteral("Print the JSON Schema of policies");
    schema.description = QStringLiteral("For editors and other tools that check JSON.");
    schema.run = [](const Values &) {
        print(QString::fromUtf8(policySchema().trimmed()));
        return ExitDone;
    };

    Command policy;
    policy.name = QStringLiteral("policy");
    policy.summary = QStringLiteral("Compare the phone with a policy, and keep it there");
    policy.description = QStringLiteral(
        "A policy is a JSON document: {\"calls\": {\"dial\": {\"default\": \"block\"}}, "
        "\"softwareUpdate\":\n{\"install\": \"latest\"}}. Settings that it does not name are left alone.");
    policy.commands = {check, apply, watch, exportCommand, schema};
    return policy;
}

} // namespace Agent
} // namespace Corvane
