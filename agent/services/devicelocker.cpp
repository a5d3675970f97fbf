// SPDX-License-Identifier: LGPL-2.1-or-later
#include "devicelocker.h"

#include "wait.h"

#include <QtCore/QVariantMap>

namespace Corvane
{
namespace Agent
{

using Mdm::DeviceLock;

DeviceLocker::DeviceLocker(std::chrono::milliseconds timeout, QObject *parent)
    : QObject(parent)
    , m_timeout(timeout)
{
}

QString DeviceLocker::wordOf(DeviceLock::State state)
{
    switch (state) {
    case DeviceLock::Unlocked:
        return QStringLiteral("unlocked");
    case DeviceLock::Locked:
        return QStringLiteral("locked");
    case DeviceLock::ManagerLockout:
        return QStringLiteral("manager-lockout");
    case DeviceLock::CodeEntryLockout:
        return QStringLiteral("code-lockout");
    case DeviceLock::Undefined:
        break;
    }
    return QStringLiteral("unknown");
}

Reply DeviceLocker::open()
{
    Wait wait(Service::deviceLock(), m_timeout, QStringLiteral("tell how the phone is locked"));
    wait.until(&m_lock, &DeviceLock::stateChanged,
               [this] { return m_lock.state() != DeviceLock::Undefined; });
    return wait.run();
}

Reply DeviceLocker::setLockout(bool on, const QString &message)
{
    QVariantMap feedback;
    if (!message.isEmpty())
        feedback.insert(QStringLiteral("message"), message);
    return perform(QStringLiteral("confirm the change"), &DeviceLock::lockoutModeChanged,
                   &DeviceLock::lockoutModeError, QStringLiteral("it has not changed the lockout"), [&] {
                       m_lock.setLockoutMode(
                           on ? DeviceLock::ManagerLockoutOn : DeviceLock::ManagerLockoutOff, feedback);
                   });
}

Reply DeviceLocker::setCode(const QString &code)
{
    return perform(QStringLiteral("confirm the change"), &DeviceLock::securityCodeChanged,
                   &DeviceLock::securityCodeChangeError, QStringLiteral("it has not taken the code"),
                   [&] { m_lock.setSecurityCode(code); });
}

Reply DeviceLocker::wipe(DeviceLock::ClearOptions options)
{
    return perform(QStringLiteral("confirm that the data are erased"), &DeviceLock::deviceCleared,
                   &DeviceLock::clearDeviceError, QStringLiteral("it has not erased the data"),
                   [&] { m_lock.clearDevice(options); });
}

Reply DeviceLocker::perform(const QString &awaited, Signal succeeded, Signal failed, const QString &refusal,
                            const std::function<void()> &command)
{
    // The daemon may be gone from the bus before its last answer is read. That the link to it breaks ends the
    // command in any case.
    Wait wait(Service::bus(), m_timeout, awaited);
    connect(&m_lock, succeeded, &wait, [&wait] { wait.end(Reply::Done); });
    connect(&m_lock, failed, &wait, [&wait, &refusal] {
        const Service daemon = Service::deviceLock();
        if (daemon.isRunning())
            wait.end(Reply::Refused, daemon.refusal(refusal));
        else
            wait.end(Reply::ServiceLost, daemon.notRunning().text);
    });
    command();
    Reply reply = wait.run();
    if (reply.outcome == Reply::TimedOut)
        reply.text = QStringLiteral("%1 did not %2 in time").arg(Service::deviceLock().toString(), awaited);
    return reply;
}

} // namespace Agent
} // namespace Corvane
