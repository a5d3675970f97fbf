// SPDX-License-Identifier: LGPL-2.1-or-later
#include "softwareupdater.h"

#include "answer.h"
#include "service.h"
#include "wait.h"

namespace Corvane
{
namespace Agent
{

using Mdm::SoftwareUpdate;

namespace
{

void fail(Wait *wait, const QString &reason)
{
    wait->end(Reply::Refused, QLatin1String("the phone reports: ") + reason);
}

void failWith(Wait *wait, const SoftwareUpdate *updates)
{
    QObject::connect(updates, &SoftwareUpdate::softwareUpdateFailed, wait,
                     [wait](const QString &reason) { fail(wait, reason); });
}

} // namespace

SoftwareUpdater::SoftwareUpdater(std::chrono::milliseconds timeout, QObject *parent)
    : QObject(parent)
    , m_timeout(timeout)
{
    connect(&m_updates, &SoftwareUpdate::softwareUpdateDownloadProgress, this,
            &SoftwareUpdater::downloadProgress);
    connect(&m_updates, &SoftwareUpdate::softwareUpdateFailed, this,
            [this](const QString &reason) { m_failure = reason; });
}

SoftwareUpdater::Offer SoftwareUpdater::offer() const
{
    Offer offer;
    offer.reply = ask(Service::mdmProxy(), QStringLiteral("^Failed to "), [&] {
        if (m_updates.softwareUpdateIsAvailable())
            offer.version = m_updates.latestAvailableUpdateVersion();
    });
    if (!offer.reply.isDone())
        offer.version.clear();
    return offer;
}

Reply SoftwareUpdater::check()
{
    return perform(QStringLiteral("finish looking for updates"), &SoftwareUpdate::softwareUpdateInfoChanged,
                   [this] { m_updates.checkForSoftwareUpdate(); });
}

Reply SoftwareUpdater::download(const QString &version)
{
    return perform(QStringLiteral("go on with the download"), &SoftwareUpdate::softwareUpdateDownloaded,
                   [this, version] { m_updates.downloadSoftwareUpdate(version); });
}

Reply SoftwareUpdater::install()
{
    return perform(QStringLiteral("begin the installation"),
                   &SoftwareUpdate::softwareUpdateInstallationStarted,
                   [this] { m_updates.installSoftwareUpdate(); });
}

Reply SoftwareUpdater::waitUntilInstalled(const QString &version)
{
    Wait wait(Service::mdmProxy(), m_timeout, QStringLiteral("finish the installation"));
    failWith(&wait, &m_updates);
    if (m_failure)
        fail(&wait, *m_failure);
    wait.until(&m_updates, &SoftwareUpdate::softwareUpdateInfoChanged, [this, version, &wait] {
        const Offer now = offer();
        if (!now.reply.isDone() || now.version == version)
            return false;
        // One that was published in the meantime hides the end of the installation.
        if (!now.version.isEmpty())
            wait.end(Reply::Refused,
                     QStringLiteral("the phone offers %1 now, and does not tell whether %2 is installed")
                         .arg(now.version, version));
        return true;
    });
    return wait.run();
}

const SoftwareUpdate *SoftwareUpdater::updates() const
{
    return &m_updates;
}

Reply SoftwareUpdater::perform(const QString &awaited, void (SoftwareUpdate::*completion)(),
                               const std::function<void()> &command)
{
    Wait wait(Service::mdmProxy(), m_timeout, awaited);
    failWith(&wait, &m_updates);
    connect(&m_updates, completion, &wait, [&wait] { wait.end(Reply::Done); });
    connect(&m_updates, &SoftwareUpdate::softwareUpdateDownloading, &wait, [&wait] { wait.prolong(); });
    connect(&m_updates, &SoftwareUpdate::softwareUpdateDownloadProgress, &wait, [&wait] { wait.prolong(); });
    m_failure.reset();
    command();
    return wait.run();
}

} // namespace Agent
} // namespace Corvane
