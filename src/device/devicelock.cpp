// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/devicelock.h>

#include "deviceencryption_p.h"
#include "devicelock_p.h"
#include "frame/marshalling_p.h"

namespace Corvane
{
namespace Mdm
{

namespace
{

const QLatin1String SetLockoutMode("SetLockoutMode");
const QLatin1String ClearDevice("ClearDevice");
const QLatin1String SetSecurityCode("SetSecurityCode");

} // namespace

DeviceLockPrivate::DeviceLockPrivate(DeviceLock *publicObject)
    : q(publicObject)
    , lockoutMode(q, &DeviceLock::settingLockoutModeChanged, &DeviceLock::lockoutModeChanged,
                  &DeviceLock::lockoutModeError)
    , clearDevice(q, &DeviceLock::clearingDeviceChanged, &DeviceLock::deviceCleared,
                  &DeviceLock::clearDeviceError)
    , securityCode(q, &DeviceLock::changingSecurityCodeChanged, &DeviceLock::securityCodeChanged,
                   &DeviceLock::securityCodeChangeError)
{
}

DeviceLock::DeviceLock(QObject *parent)
    : QObject(parent)
    , d(new DeviceLockPrivate(this))
{
    connect(&d->deviceLock, &VeldDeviceLock::DeviceLock::stateChanged, this, &DeviceLock::stateChanged);
}

DeviceLock::~DeviceLock()
{
    delete d;
}

DeviceLock::State DeviceLock::state() const
{
    // The numbers are the same, for good.
    return State(d->deviceLock.state());
}

bool DeviceLock::settingLockoutMode() const
{
    return d->lockoutMode.isBusy();
}

bool DeviceLock::clearingDevice() const
{
    return d->clearDevice.isBusy();
}

bool DeviceLock::changingSecurityCode() const
{
    return d->securityCode.isBusy();
}

bool DeviceLock::isHomeEncrypted() const
{
    return DeviceEncryption::isHomeEncrypted();
}

void DeviceLock::setLockoutMode(ManagerLockoutMode mode, const QVariantMap &feedback)
{
    // QtDBus would end the program over it.
    if (isMarshallable(feedback))
        d->lockoutMode.follow(d->connection.interface()->call(SetLockoutMode, {uint(mode), feedback}));
    else
        d->lockoutMode.refuse();
}

void DeviceLock::clearDevice(ClearOptions options)
{
    d->clearDevice.follow(d->connection.interface()->call(ClearDevice, {uint(options)}));
}

void DeviceLock::setSecurityCode(const QString &code)
{
    d->securityCode.follow(d->connection.interface()->call(SetSecurityCode, {code}));
}

} // namespace Mdm
} // namespace Corvane
