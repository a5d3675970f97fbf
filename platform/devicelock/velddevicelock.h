// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_DEVICELOCK_VELDDEVICELOCK_H
#define CORVANEMDM_PLATFORM_DEVICELOCK_VELDDEVICELOCK_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QObject>

namespace VeldDeviceLock
{

/**
 * Follows the lock state that the device-lock daemon tells over its socket: object "/devicelock/state",
 * interface "org.veldmobile.devicelock.State". Nothing blocks, and the first answer comes later.
 */
class CORVANEMDM_PLATFORM_EXPORT DeviceLock : public QObject
{
    Q_OBJECT

public:
    enum LockState : int {
        Unlocked = 0,
        Locked = 1,
        ManagerLockout = 2, ///< device management keeps everybody out
        CodeEntryLockout = 3, ///< too many wrong codes
        Undefined = 4 ///< the daemon does not tell
    };
    Q_ENUM(LockState)

    explicit DeviceLock(QObject *parent = nullptr);
    ~DeviceLock() override;

    LockState state() const;

Q_SIGNALS:
    void stateChanged();

private:
    Q_DISABLE_COPY(DeviceLock)

    class Private;
    Private *const d;
};

} // namespace VeldDeviceLock

#endif // CORVANEMDM_PLATFORM_DEVICELOCK_VELDDEVICELOCK_H
