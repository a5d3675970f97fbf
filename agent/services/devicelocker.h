// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_DEVICELOCKER_H
#define CORVANE_DEVICELOCKER_H

#include "reply.h"

#include <corvanemdm/devicelock.h>

#include <QtCore/QObject>
#include <QtCore/QString>

#include <chrono>
#include <functional>

namespace Corvane
{
namespace Agent
{

/** The device lock, with every command awaited until the phone tells of its end. */
class DeviceLocker : public QObject
{
    Q_OBJECT

public:
    explicit DeviceLocker(std::chrono::milliseconds timeout, QObject *parent = nullptr);

    const Mdm::DeviceLock &lock() const { return m_lock; }

    /** "unlocked", "locked", "manager-lockout", "code-lockout" or "unknown". */
    static QString wordOf(Mdm::DeviceLock::State state);

    /** Waits until the state is known. */
    Reply open();

    /** Keeps everybody out of the phone, or lets them in again; @p message is for its screen. */
    Reply setLockout(bool on, const QString &message = QString());
    Reply setCode(const QString &code);
    /** Erases the user's data; the phone goes down. */
    Reply wipe(Mdm::DeviceLock::ClearOptions options);

private:
    using Signal = void (Mdm::DeviceLock::*)();

    Reply perform(const QString &awaited, Signal succeeded, Signal failed, const QString &refusal,
                  const std::function<void()> &command);

    Mdm::DeviceLock m_lock;
    std::chrono::milliseconds m_timeout;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_DEVICELOCKER_H
