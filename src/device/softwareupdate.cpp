// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/softwareupdate.h>

#include "frame/blockingquery_p.h"
#include "frame/mdmproxy_p.h"
#include "platform/frame/signalconnection_p.h"
#include "softwareupdate_p.h"

#include <QtDBus/QDBusConnection>

namespace Corvane
{
namespace Mdm
{

SoftwareUpdatePrivate::SoftwareUpdatePrivate()
    : QDBusInterface(MdmProxy::Service, MdmProxy::SoftwareUpdate.path, MdmProxy::SoftwareUpdate.interface,
                     QDBusConnection::systemBus())
{
}

SoftwareUpdate::SoftwareUpdate(QObject *parent)
    : QObject(parent)
    , d(new SoftwareUpdatePrivate)
{
    const auto forward = [this](const char *name, const char *signal) {
        connectDBusSignal(QDBusConnection::systemBus(),
                          {MdmProxy::Service, MdmProxy::SoftwareUpdate.path,
                           MdmProxy::SoftwareUpdate.interface, QLatin1String(name)},
                          this, signal);
    };
    forward("softwareUpdateInfoChanged", SIGNAL(softwareUpdateInfoChanged()));
    forward("softwareUpdateDownloading", SIGNAL(softwareUpdateDownloading(QString)));
    forward("softwareUpdateDownloadProgress", SIGNAL(softwareUpdateDownloadProgress(int)));
    forward("softwareUpdateDownloaded", SIGNAL(softwareUpdateDownloaded()));
    forward("softwareUpdateInstallationStarted", SIGNAL(softwareUpdateInstallationStarted()));
    forward("softwareUpdateFailed", SIGNAL(softwareUpdateFailed(QString)));

    d->call(QStringLiteral("registerClient"));
}

SoftwareUpdate::~SoftwareUpdate()
{
    d->call(QStringLiteral("unregisterClient"));
    delete d;
}

QString SoftwareUpdate::latestAvailableUpdateVersion() const
{
    return blockingQuery<QString>(d, QStringLiteral("latestAvailableUpdateVersion"),
                                  "Failed to get latest available OS version");
}

bool SoftwareUpdate::softwareUpdateIsAvailable() const
{
    return blockingQuery<bool>(d, QStringLiteral("softwareUpdateIsAvailable"),
                               "Failed to check OS update availability");
}

void SoftwareUpdate::checkForSoftwareUpdate()
{
    d->call(QStringLiteral("checkForSoftwareUpdate"));
}

void SoftwareUpdate::downloadSoftwareUpdate(const QString &version)
{
    d->call(QStringLiteral("downloadSoftwareUpdate"), version);
}

void SoftwareUpdate::installSoftwareUpdate()
{
    d->call(QStringLiteral("installSoftwareUpdate"));
}

} // namespace Mdm
} // namespace Corvane
