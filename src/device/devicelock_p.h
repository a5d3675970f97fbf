// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_DEVICELOCK_P_H
#define CORVANEMDM_DEVICELOCK_P_H

#include <corvanemdm/devicelock.h>

#include "devicelockconnection_p.h"
#include "frame/asynccommand_p.h"

#include <devicelock/velddbusresponse.h>
#include <devicelock/velddevicelock.h>

namespace Corvane
{
namespace Mdm
{

/** A response goes away by itself once it has been given. */
template <typename Success, typename Failure>
void connectOutcome(VeldDBus::Response *response, QObject *context, Success success, Failure failure)
{
    QObject::connect(response, &VeldDBus::Response::success, context, success);
    QObject::connect(response, &VeldDBus::Response::failure, context, failure);
}

/** The connection, the state and the three commands. */
class DeviceLockPrivate
{
public:
    explicit DeviceLockPrivate(DeviceLock *deviceLock);

    using Command = AsyncCommand<DeviceLock, VeldDBus::Response>;

    DeviceLock *const q;
    DevicelockConnection connection;
    VeldDeviceLock::DeviceLock deviceLock;
    Command lockoutMode;
    Command clearDevice;
    Command securityCode;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_DEVICELOCK_P_H
