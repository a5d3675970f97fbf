// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_SYSTEMSETTINGS_ABOUTSETTINGS_H
#define CORVANEMDM_PLATFORM_SYSTEMSETTINGS_ABOUTSETTINGS_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QObject>
#include <QtCore/QString>

/** Facts of the running system, read anew with each call. What cannot be found is empty. */
class CORVANEMDM_PLATFORM_EXPORT AboutSettings : public QObject
{
    Q_OBJECT

public:
    explicit AboutSettings(QObject *parent = nullptr);
    ~AboutSettings() override;

    /** For people: VERSION of os-release, which may have a name in it. */
    QString softwareVersion() const;
    /** For programs: VERSION_ID of os-release. */
    QString softwareVersionId() const;
    /** Of the first wireless interface by name, as the kernel writes it. */
    QString wlanMacAddress() const;

private:
    Q_DISABLE_COPY(AboutSettings)
};

#endif // CORVANEMDM_PLATFORM_SYSTEMSETTINGS_ABOUTSETTINGS_H
