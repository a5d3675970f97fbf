// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_SOFTWAREUPDATE_H
#define CORVANEMDM_SOFTWAREUPDATE_H

#include <corvanemdm/corvanemdm_global.h>

#include <QtCore/QObject>
#include <QtCore/QString>

namespace Corvane
{
namespace Mdm
{

class SoftwareUpdatePrivate;

/**
 * @brief Checks for, downloads and installs updates of the operating system.
 *
 * Queries and commands block until the MDM proxy has answered, or for QtDBus's default timeout (25 s).
 * What a command sets going is reported by signals alone, in this order:
 *
 *  1. checkForSoftwareUpdate(): softwareUpdateInfoChanged(), after which the two queries tell the result;
 *  2. downloadSoftwareUpdate(): softwareUpdateDownloading(), softwareUpdateDownloadProgress() repeatedly,
 *     softwareUpdateDownloaded();
 *  3. installSoftwareUpdate(): softwareUpdateInstallationStarted().
 *
 * softwareUpdateFailed() ends any of them instead. The proxy, not this class, enforces the order. Nothing is
 * kept here: each query asks the proxy. Signals reach every object of the class, whichever client started the
 * operation. The object registers with the proxy as a client when it is made and leaves when it is deleted,
 * which block as well. It registers once: a proxy that was away then, or has restarted since, does not know
 * it and may send it nothing; another object has to be made.
 *
 * Source: MDM proxy "org.corvaneos.mdmproxy", object "/Corvane/Mdm/Proxy/SoftwareUpdate".
 */
class CORVANEMDM_EXPORT SoftwareUpdate : public QObject
{
    Q_OBJECT

public:
    /** Registers with the proxy as a client, which blocks; a proxy that is away is not reported. */
    explicit SoftwareUpdate(QObject *parent = nullptr);
    ~SoftwareUpdate() override;

    /**
     * The newest version that the last check found, in the proxy's own notation.
     * @return empty when there is none, or (with a warning) when the proxy could not be asked.
     */
    Q_INVOKABLE QString latestAvailableUpdateVersion() const;

    /**
     * Whether the last check found an update.
     * @return false also (with a warning) when the proxy could not be asked.
     */
    Q_INVOKABLE bool softwareUpdateIsAvailable() const;

    /** Makes the phone look for updates. A proxy that cannot be reached is not reported. */
    Q_INVOKABLE void checkForSoftwareUpdate();

    /**
     * Makes the phone download @p version, as latestAvailableUpdateVersion() names it.
     * A proxy that cannot be reached is not reported.
     */
    Q_INVOKABLE void downloadSoftwareUpdate(const QString &version);

    /** Makes the phone install what it has downloaded. A proxy that cannot be reached is not reported. */
    Q_INVOKABLE void installSoftwareUpdate();

Q_SIGNALS:
    /** Availability or latest version changed; ask again. */
    void softwareUpdateInfoChanged();
    /** The download of @p version started. */
    void softwareUpdateDownloading(const QString &version);
    /** The download has reached @p percent, 0 to 100. */
    void softwareUpdateDownloadProgress(int percent);
    /** The download is complete. */
    void softwareUpdateDownloaded();
    /** The installation began. */
    void softwareUpdateInstallationStarted();
    /** The running operation failed; @p reason is the proxy's text. */
    void softwareUpdateFailed(const QString &reason);

private:
    Q_DISABLE_COPY(SoftwareUpdate)
    SoftwareUpdatePrivate *const d;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_SOFTWAREUPDATE_H
