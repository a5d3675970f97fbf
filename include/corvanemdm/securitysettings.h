// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_SECURITYSETTINGS_H
#define CORVANEMDM_SECURITYSETTINGS_H

#include <corvanemdm/corvanemdm_global.h>

#include <QtCore/QObject>
#include <QtCore/QString>

namespace Corvane
{
namespace Mdm
{

class SecuritySettingsPrivate;

/**
 * @brief Controls developer mode, and packages from outside the store.
 *
 * Nothing is kept here: each query looks anew. The two settings have nothing to do with each other.
 *
 * Source: developer mode is a package, which PackageKit installs and removes; sideloading is a setting of the
 * device-lock daemon "org.veldmobile.devicelock", changed over its socket and read from its file.
 */
class CORVANEMDM_EXPORT SecuritySettings : public QObject
{
    Q_OBJECT

public:
    /** Connects to nothing yet. */
    explicit SecuritySettings(QObject *parent = nullptr);
    ~SecuritySettings() override;

    /** Whether developer mode is on: the phone has the program that it brings. */
    bool developerModeEnabled() const;

    /**
     * Switches developer mode on or off, by installing or removing its package.
     *
     * Does not block: developerModeEnabledChanged() or developerModeChangeError() tell the end. Nothing
     * happens, and neither comes, when the phone is like that already.
     */
    void setDeveloperModeEnabled(bool enabled);

    /**
     * Whether packages from outside the store may be installed.
     * @return false also when the phone does not say. A setting that is merely missing is no reason to warn;
     * a file that is missing or makes no sense is.
     */
    bool sideloadingAllowed() const;

    /**
     * Allows packages from outside the store, or forbids them. Blocks until the daemon has answered, or for
     * QtDBus's default timeout (25 s).
     * @return false (with a warning) when the daemon refused or could not be asked.
     */
    bool setSideloadingAllowed(bool allowed);

Q_SIGNALS:
    /** setDeveloperModeEnabled() has been done. */
    void developerModeEnabledChanged();
    /** setDeveloperModeEnabled() failed. */
    void developerModeChangeError();

private:
    Q_DISABLE_COPY(SecuritySettings)
    SecuritySettingsPrivate *const d;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_SECURITYSETTINGS_H
