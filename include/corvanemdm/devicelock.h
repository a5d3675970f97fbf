// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_DEVICELOCK_H
#define CORVANEMDM_DEVICELOCK_H

#include <corvanemdm/corvanemdm_global.h>

#include <QtCore/QFlags>
#include <QtCore/QObject>
#include <QtCore/QString>
#include <QtCore/QVariantMap>

namespace Corvane
{
namespace Mdm
{

class DeviceLockPrivate;

/**
 * @brief Tells whether the phone is locked, locks it for its manager, sets its security code, and wipes it.
 *
 * The three commands do not block. Each has a busy property, and tells its end with one of two signals, after
 * the busy property has gone down. One that is given while the last of its kind still runs supersedes that:
 * the phone may carry out both, but only the end of the newer one is told. A daemon that is away, or goes
 * away, or does not answer for QtDBus's default timeout (25 s), is a failure. Why a command failed is not
 * told.
 *
 * An object that was made while the daemon was away works once it is there, and again after each restart.
 *
 * Source: device-lock daemon "org.veldmobile.devicelock", over its socket.
 */
class CORVANEMDM_EXPORT DeviceLock : public QObject
{
    Q_OBJECT
    /** How the phone is locked. Undefined until the daemon has told, and while it is away. */
    Q_PROPERTY(Corvane::Mdm::DeviceLock::State state READ state NOTIFY stateChanged)
    /** Whether setLockoutMode() runs. */
    Q_PROPERTY(bool settingLockoutMode READ settingLockoutMode NOTIFY settingLockoutModeChanged)
    /** Whether clearDevice() runs. */
    Q_PROPERTY(bool clearingDevice READ clearingDevice NOTIFY clearingDeviceChanged)
    /** Whether setSecurityCode() runs. */
    Q_PROPERTY(bool changingSecurityCode READ changingSecurityCode NOTIFY changingSecurityCodeChanged)
    /** Whether the user's data are encrypted; looked up with every read. */
    Q_PROPERTY(bool homeEncrypted READ isHomeEncrypted) // clazy:exclude=qproperty-without-notify

public:
    /** How the phone is locked. */
    enum State : int {
        Unlocked = 0, ///< anybody can use it
        Locked = 1, ///< the security code opens it
        ManagerLockout = 2, ///< setLockoutMode() keeps everybody out
        CodeEntryLockout = 3, ///< too many wrong codes were entered
        Undefined = 4 ///< the daemon does not tell
    };
    Q_ENUM(State)

    /** What clearDevice() does beside erasing the user's data. */
    enum ClearOption : int {
        ShutdownAfterClear = 0, ///< shut down afterwards, unless RebootAfterClear is there
        RebootAfterClear = 1, ///< restart afterwards
        WipePartitions = 2, ///< erase the data partition as a whole
        ClearExternalMedia = 4 ///< erase memory cards as well
    };
    /** Several of them. */
    Q_DECLARE_FLAGS(ClearOptions, ClearOption)
    Q_FLAG(ClearOptions)

    /** Whether the manager keeps everybody out. */
    enum ManagerLockoutMode : int {
        ManagerLockoutOff = 0, ///< let the users in again, with their code if there is one
        ManagerLockoutOn = 1 ///< keep everybody out
    };

    /** Connects to the daemon; one that is away is not reported. */
    explicit DeviceLock(QObject *parent = nullptr);
    ~DeviceLock() override;

    /** How the phone is locked; mirrored, see stateChanged(). */
    State state() const;
    /** True from setLockoutMode() to lockoutModeChanged() or lockoutModeError(). */
    bool settingLockoutMode() const;
    /** True from clearDevice() to deviceCleared() or clearDeviceError(). */
    bool clearingDevice() const;
    /** True from setSecurityCode() to securityCodeChanged() or securityCodeChangeError(). */
    bool changingSecurityCode() const;

    /**
     * Whether the partition of the user's data, "/dev/corvane/home", is encrypted. Looks at it with each
     * call.
     * @return false also when there is none, or the caller may not read it; the logging category
     * "org.corvaneos.device.encryption" has the reason, as debug output.
     */
    Q_INVOKABLE bool isHomeEncrypted() const;

    /**
     * Keeps everybody out of the phone, or lets them in again.
     * @param mode what to do
     * @param feedback what the phone tells who finds it locked; the daemon defines the keys. With a value
     * that D-Bus has no type for, an invalid QVariant included, the command fails without being sent.
     */
    Q_INVOKABLE void setLockoutMode(Corvane::Mdm::DeviceLock::ManagerLockoutMode mode,
                                    const QVariantMap &feedback = QVariantMap());

    /** Erases the user's data, for good, and then shuts the phone down or restarts it. */
    Q_INVOKABLE void clearDevice(Corvane::Mdm::DeviceLock::ClearOptions options = ClearOptions());

    /** Sets the code that unlocks the phone; the daemon refuses codes that it has no use for. */
    Q_INVOKABLE void setSecurityCode(const QString &code);

Q_SIGNALS:
    /** state() is another one. */
    void stateChanged();
    /** setLockoutMode() has been done. */
    void lockoutModeChanged();
    /** setLockoutMode() failed. */
    void lockoutModeError();
    /** settingLockoutMode() changed; sent as well when a command supersedes another. */
    void settingLockoutModeChanged();
    /** clearDevice() has been done; the phone goes down. */
    void deviceCleared();
    /** clearDevice() failed. */
    void clearDeviceError();
    /** clearingDevice() changed; sent as well when a command supersedes another. */
    void clearingDeviceChanged();
    /** setSecurityCode() has been done. */
    void securityCodeChanged();
    /** setSecurityCode() failed. */
    void securityCodeChangeError();
    /** changingSecurityCode() changed; sent as well when a command supersedes another. */
    void changingSecurityCodeChanged();

private:
    Q_DISABLE_COPY(DeviceLock)
    DeviceLockPrivate *const d;
};

} // namespace Mdm
} // namespace Corvane

Q_DECLARE_OPERATORS_FOR_FLAGS(Corvane::Mdm::DeviceLock::ClearOptions)

#endif // CORVANEMDM_DEVICELOCK_H
