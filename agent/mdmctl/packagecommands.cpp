// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commands.h"
#include "exitstatus.h"
#include "output.h"
#include "packagemanager.h"
#include "progress.h"
#include "service.h"
#include "table.h"

#include <QtCore/QJsonArray>
#include <QtCore/QJsonObject>

namespace Corvane
{
namespace Agent
{

using Mdm::ApplicationEntry;
using Mdm::PackageEntry;

namespace
{

const QLatin1String packageName("PACKAGE");
const QLatin1String autoremoveName("--autoremove");
const QChar versionSign(QLatin1Char('='));

QJsonObject packageJson(const PackageEntry &package)
{
    return {{QStringLiteral("name"), package.name()},
            {QStringLiteral("version"), package.version()},
            {QStringLiteral("vendor"), package.vendor()}};
}

int runPackages(const Values &values)
{
    const PackageManager manager(timeoutsOf(values).silence);
    Table table({QStringLiteral("NAME"), QStringLiteral("VERSION"), QStringLiteral("VENDOR")});
    QJsonArray json;
    const QList<PackageEntry> packages = manager.packages();
    for (const PackageEntry &package : packages) {
        table.addRow({package.name(), package.version(), package.vendor()});
        json.append(packageJson(package));
    }
    if (wantsJson(values))
        print(QJsonObject{{QStringLiteral("packages"), json}});
    else
        print(packages.isEmpty() ? QStringLiteral("No package is installed.") : table.toString());
    return ExitDone;
}

int runApplications(const Values &values)
{
    const PackageManager manager(timeoutsOf(values).silence);
    Table table({QStringLiteral("NAME"), QStringLiteral("PACKAGE"), QStringLiteral("VERSION"),
                 QStringLiteral("ICON")});
    QJsonArray json;
    const QList<ApplicationEntry> applications = manager.applications();
    for (const ApplicationEntry &application : applications) {
        const PackageEntry package = application.package();
        table.addRow({application.name(), package.name(), package.version(), application.iconPath()});
        json.append(QJsonObject{
            {QStringLiteral("name"), application.name()},
            {QStringLiteral("package"), package.isValid() ? QJsonValue(packageJson(package)) : QJsonValue()},
            {QStringLiteral("icon"), application.iconPath()}});
    }
    if (wantsJson(values))
        print(QJsonObject{{QStringLiteral("applications"), json}});
    else
        print(applications.isEmpty() ? QStringLiteral("No application is installed.") : table.toString());
    return ExitDone;
}

/** What is done to one package after the other. */
struct Work {
    QString progress; ///< "Installing"
    QString outcome; ///< "%1 is installed."
    std::function<Reply(PackageManager &manager, const QString &package)> perform;
};

QJsonObject resultJson(const QString &package, const Reply &reply)
{
    return {{QStringLiteral("package"), package},
            {QStringLiteral("done"), reply.isDone()},
            {QStringLiteral("error"), reply.isDone() ? QJsonValue() : QJsonValue(reply.text)}};
}

int perform(const Work &work, const Values &values)
{
    const Reply running = Service::packageKit().ensureRunning();
    if (!running.isDone())
        return conclude(running);
    PackageManager manager(timeoutsOf(values).silence);
    const QStringList packages = values.all(packageName);
    const bool json = wantsJson(values);
    Progress progress(work.progress);
    const auto showProgress = [&](int done) {
        if (!json && packages.size() > 1)
            progress.show(done * 100 / packages.size());
    };
    QJsonArray results;
    ExitStatus status = ExitDone;
    for (int index = 0; index < packages.size(); ++index) {
        const QString &package = packages.at(index);
        showProgress(index);
        const Reply reply = work.perform(manager, package);
        results.append(resultJson(package, reply));
        if (!reply.isDone()) {
            status = exitStatusOf(reply);
            printError(QStringLiteral("%1: %2").arg(package, reply.text));
        } else if (!json) {
            print(work.outcome.arg(package));
        }
        // The others would fare no better.
        if (reply.outcome == Reply::ServiceLost || reply.outcome == Reply::Interrupted)
            break;
        showProgress(index + 1);
    }
    if (json)
        print(QJsonObject{{QStringLiteral("results"), results}});
    return status;
}

QString packageFault(const QString &package)
{
    const bool isPackage = !package.startsWith(versionSign) && !package.endsWith(versionSign)
        && package.count(versionSign) <= 1 && !package.isEmpty();
    return isPackage ? QString()
                     : QStringLiteral("must be a package, such as acme-mail or acme-mail=2.1.0-3");
}

QString nameFault(const QString &name)
{
    return name.isEmpty() || name.contains(versionSign)
        ? QStringLiteral("must be the name of a package, without a version")
        : QString();
}

Option silenceOption()
{
    return timeoutOption(
        QStringLiteral("Give up on a package after so many seconds (default: 300); what goes on, goes on"));
}

const QString resultsJson
    = QStringLiteral("JSON: {\"results\": [{\"package\": \"acme-mail\", \"done\": true, \"error\": null}]}");

} // namespace

Command packagesCommand()
{
    Command packages;
    packages.name = QStringLiteral("packages");
    packages.summary = QStringLiteral("List the packages that are installed");
    packages.description = QStringLiteral("Reads the package database, and takes no service.\n\n"
                                          "JSON: {\"packages\": [{\"name\": \"corvane-notes\", \"version\": "
                                          "\"1.2.0\", \"vendor\": \"Corvane\"}]}");
    packages.options = {jsonOption()};
    packages.run = runPackages;
    return packages;
}

Command applicationsCommand()
{
    Command applications;
    applications.name = QStringLiteral("apps");
    applications.summary = QStringLiteral("List the applications that can be started");
    applications.description
        = QStringLiteral("Those that are shown, each with the package that brought it. Takes no service.\n\n"
                         "JSON: {\"applications\": [{\"name\": \"Notes\", \"icon\": \"/usr/share/...\",\n"
                         "\"package\": {\"name\": \"corvane-notes\", \"version\": \"1.2.0\", \"vendor\": "
                         "\"Corvane\"}}]}.\n\"package\" is null when no package brought it.");
    applications.options = {jsonOption()};
    applications.run = runApplications;
    return applications;
}

Command installCommand()
{
    const Work work{QStringLiteral("Installing"), QStringLiteral("%1 is installed."),
                    [](PackageManager &manager, const QString &package) {
                        return manager.install(package.section(versionSign, 0, 0),
                                               package.section(versionSign, 1));
                    }};
    Command install;
    install.name = QStringLiteral("install");
    install.summary = QStringLiteral("Install packages from the phone's sources");
    install.description
        = QStringLiteral("Installs one after the other, each in its newest version unless one is named. What "
                         "fails does\nnot stop the others.\n\n"
                         "Examples:\n"
                         "  mdmctl install acme-mail corvane-notes\n"
                         "  mdmctl install corvane-notes=1.3.0-1\n\n")
        + resultsJson;
    install.arguments = {{packageName,
                          QStringLiteral("Name, or name=version"),
                          {},
                          packageFault,
                          Argument::Word,
                          Argument::Several}};
    install.options = {jsonOption(), silenceOption()};
    install.run = [work](const Values &values) {
        return perform(work, values);
    };
    return install;
}

Command removeCommand()
{
    Command remove;
    remove.name = QStringLiteral("remove");
    remove.summary = QStringLiteral("Remove packages");
    remove.description
        = QStringLiteral(
              "Removes one after the other. A package that others need stays, and is reported. What "
              "fails does\nnot stop the others.\n\n"
              "Example:\n"
              "  mdmctl remove --autoremove acme-mail\n\n")
        + resultsJson;
    remove.arguments
        = {{packageName, QStringLiteral("Name"), {}, nameFault, Argument::Word, Argument::Several}};
    remove.options
        = {{autoremoveName, QStringLiteral("Remove as well what nothing else needs any more"), {}, {}},
           jsonOption(),
           silenceOption()};
    remove.run = [](const Values &values) {
        const bool autoremove = values.has(autoremoveName);
        return perform({QStringLiteral("Removing"), QStringLiteral("%1 is removed."),
                        [autoremove](PackageManager &manager, const QString &package) {
                            return manager.remove(package, autoremove);
                        }},
                       values);
    };
    return remove;
}

} // namespace Agent
} // namespace Corvane
