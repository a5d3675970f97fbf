// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commands.h"
#include "exitstatus.h"
#include "output.h"
#include "progress.h"
#include "service.h"
#include "softwareupdater.h"
#include "wait.h"

#include <QtCore/QJsonObject>

namespace Corvane
{
namespace Agent
{

using Mdm::SoftwareUpdate;

namespace
{

const QLatin1String waitName("--wait");
const QLatin1String versionName("VERSION");

QJsonValue versionJson(const QString &version)
{
    return version.isEmpty() ? QJsonValue() : QJsonValue(version);
}

QJsonObject offerJson(const QString &version)
{
    return {{QStringLiteral("available"), !version.isEmpty()},
            {QStringLiteral("version"), versionJson(version)}};
}

QString offerText(const QString &version)
{
    return version.isEmpty() ? QStringLiteral("No update is available.")
                             : QStringLiteral("Update %1 is available.").arg(version);
}

int printOffer(const SoftwareUpdater &updater, const Values &values)
{
    const SoftwareUpdater::Offer offer = updater.offer();
    if (offer.reply.isDone())
        printResult(values, offerText(offer.version), offerJson(offer.version));
    return conclude(offer.reply);
}

int runStatus(SoftwareUpdater &updater, const Values &values)
{
    return printOffer(updater, values);
}

int runCheck(SoftwareUpdater &updater, const Values &values)
{
    const Reply checked = updater.check();
    return checked.isDone() ? printOffer(updater, values) : conclude(checked);
}

Reply downloadVisibly(SoftwareUpdater &updater, const QString &version)
{
    Progress progress(QStringLiteral("Downloading ") + version);
    QObject context;
    QObject::connect(&updater, &SoftwareUpdater::downloadProgress, &context,
                     [&](int percent) { progress.show(percent); });
    return updater.download(version);
}

int runDownload(SoftwareUpdater &updater, const Values &values)
{
    QString version = values.first(versionName);
    if (version.isEmpty()) {
        const SoftwareUpdater::Offer offer = updater.offer();
        if (!offer.reply.isDone())
            return conclude(offer.reply);
        if (offer.version.isEmpty())
            return conclude(
                {Reply::Refused,
                 QStringLiteral("no update is available; \"mdmctl update check\" looks for one")});
        version = offer.version;
    }
    const Reply reply = wantsJson(values) ? updater.download(version) : downloadVisibly(updater, version);
    if (reply.isDone())
        printResult(values, QStringLiteral("Update %1 is downloaded.").arg(version),
                    {{QStringLiteral("downloaded"), true}, {QStringLiteral("version"), version}});
    return conclude(reply);
}

int runInstall(SoftwareUpdater &updater, const Values &values)
{
    const SoftwareUpdater::Offer offer = updater.offer();
    if (!offer.reply.isDone())
        return conclude(offer.reply);
    const bool wait = values.has(waitName);
    Reply reply = updater.install();
    if (reply.isDone() && wait)
        reply = updater.waitUntilInstalled(offer.version);
    if (reply.isDone()) {
        const QString what = offer.version.isEmpty() ? QStringLiteral("the update") : offer.version;
        printResult(values,
                    wait ? QStringLiteral("Update %1 is installed.").arg(offer.version)
                         : QStringLiteral("The installation of %1 has begun.").arg(what),
                    {{QStringLiteral("installed"), wait},
                     {QStringLiteral("started"), true},
                     {QStringLiteral("version"), versionJson(offer.version)}});
    }
    return conclude(reply);
}

void logEvents(const SoftwareUpdater &updater, const EventLog &log, QObject *context)
{
    const SoftwareUpdate *updates = updater.updates();
    const QString event = QStringLiteral("event");
    const QString version = QStringLiteral("version");
    QObject::connect(updates, &SoftwareUpdate::softwareUpdateInfoChanged, context, [&, event] {
        const SoftwareUpdater::Offer offer = updater.offer();
        if (!offer.reply.isDone())
            return printError(offer.reply.text);
        QJsonObject json = offerJson(offer.version);
        json.insert(event, QStringLiteral("infoChanged"));
        log.write(offerText(offer.version), json);
    });
    QObject::connect(updates, &SoftwareUpdate::softwareUpdateDownloading, context, [=](const QString &which) {
        log.write(QStringLiteral("Downloading %1.").arg(which),
                  {{event, QStringLiteral("downloading")}, {version, which}});
    });
    QObject::connect(updates, &SoftwareUpdate::softwareUpdateDownloadProgress, context, [=](int percent) {
        log.write(QStringLiteral("Downloaded %1%.").arg(percent),
                  {{event, QStringLiteral("downloadProgress")}, {QStringLiteral("percent"), percent}});
    });
    QObject::connect(updates, &SoftwareUpdate::softwareUpdateDownloaded, context, [=] {
        log.write(QStringLiteral("The download is complete."), {{event, QStringLiteral("downloaded")}});
    });
    QObject::connect(updates, &SoftwareUpdate::softwareUpdateInstallationStarted, context, [=] {
        log.write(QStringLiteral("The installation has begun."),
                  {{event, QStringLiteral("installationStarted")}});
    });
    QObject::connect(updates, &SoftwareUpdate::softwareUpdateFailed, context, [=](const QString &reason) {
        log.write(QStringLiteral("Failed: %1").arg(reason),
                  {{event, QStringLiteral("failed")}, {QStringLiteral("reason"), reason}});
    });
}

int runWatch(SoftwareUpdater &updater, const Values &values)
{
    const EventLog log(wantsJson(values));
    Wait wait(Service::mdmProxy(), Wait::Forever, QString());
    logEvents(updater, log, &wait);
    log.write(QStringLiteral("Watching software updates."),
              {{QStringLiteral("event"), QStringLiteral("watching")}});
    return concludeWatch(wait.run());
}

Command command(const QString &name, const QString &summary, int (*run)(SoftwareUpdater &, const Values &))
{
    Command command;
    command.name = name;
    command.summary = summary;
    command.options = {jsonOption()};
    command.run = [run](const Values &values) -> int {
        const Reply running = Service::mdmProxy().ensureRunning();
        if (!running.isDone())
            return conclude(running);
        SoftwareUpdater updater(timeoutsOf(values).silence);
        return run(updater, values);
    };
    return command;
}

Option silenceOption()
{
    return timeoutOption(
        QStringLiteral("Give up after so many seconds without news from the phone (default: 300)"));
}

} // namespace

Command updateCommand()
{
    Command status = command(QStringLiteral("status"),
                             QStringLiteral("Tell which update the last check found"), runStatus);
    status.description
        = QStringLiteral("Asks the phone for what it knows; \"mdmctl update check\" makes it look.\n\n"
                         "JSON: {\"available\": true, \"version\": \"5.0.0.73\"}; the version is null "
                         "when there is no update.");

    Command check
        = command(QStringLiteral("check"),
                  QStringLiteral("Make the phone look for updates and tell what it found"), runCheck);
    check.options.append(silenceOption());
    check.description
        = QStringLiteral("Waits until the phone has looked. JSON as of \"mdmctl update status\".");

    Command download = command(QStringLiteral("download"), QStringLiteral("Download an update"), runDownload);
    download.arguments
        = {{versionName,
            QStringLiteral("The version, as \"mdmctl update status\" names it (default: the one on offer)"),
            {},
            {},
            Argument::Word,
            Argument::Optional}};
    download.options.append(silenceOption());
    download.description
        = QStringLiteral("Shows progress on standard error, and ends when the download is "
                         "complete.\n\n"
                         "Examples:\n"
                         "  mdmctl update download\n"
                         "  mdmctl update download 5.0.0.73\n\n"
                         "JSON, at the end: {\"downloaded\": true, \"version\": \"5.0.0.73\"}");

    Command install
        = command(QStringLiteral("install"), QStringLiteral("Install the downloaded update"), runInstall);
    install.options.append({waitName, QStringLiteral("Wait until the update is in place"), {}, {}});
    install.options.append(silenceOption());
    install.description
        = QStringLiteral("Ends when the installation has begun, or with --wait when the update is "
                         "on offer no\nmore. The phone may restart by itself.\n\n"
                         "Example:\n"
                         "  mdmctl update check && mdmctl update download && mdmctl update install "
                         "--wait\n\n"
                         "JSON: {\"installed\": true, \"started\": true, \"version\": \"5.0.0.73\"}");

    Command watch
        = command(QStringLiteral("watch"), QStringLiteral("Follow what happens to updates"), runWatch);
    watch.description
        = QStringLiteral("Prints one line an event until it is interrupted (Ctrl-C, exit status 0).\n\n"
                         "JSON: one object a line with \"time\", \"event\" and, by event,\n"
                         "  infoChanged          \"available\", \"version\"\n"
                         "  downloading          \"version\"\n"
                         "  downloadProgress     \"percent\"\n"
                         "  failed               \"reason\"\n"
                         "  watching, downloaded, installationStarted");

    Command update;
    update.name = QStringLiteral("update");
    update.summary = QStringLiteral("Find, download and install updates of the operating system");
    update.commands = {status, check, download, install, watch};
    return update;
}

} // namespace Agent
} // namespace Corvane
