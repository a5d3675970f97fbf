// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/softwareupdate.h>
#include <QtCore/QCoreApplication>
#include <QtCore/QDebug>

using Corvane::Mdm::SoftwareUpdate;

int main(int argc, char **argv)
{
    QCoreApplication application(argc, argv);
    SoftwareUpdate update;
    QObject::connect(&update, &SoftwareUpdate::softwareUpdateInfoChanged, &application, [&] {
        qInfo() << "newest version:" << update.latestAvailableUpdateVersion();
        application.quit();
    });
    QObject::connect(&update, &SoftwareUpdate::softwareUpdateFailed, &application,
                     [](const QString &reason) { qFatal("%s", qPrintable(reason)); });
    update.checkForSoftwareUpdate();
    return application.exec();
}
