// SPDX-License-Identifier: LGPL-2.1-or-later
#include "securityswitches.h"

#include "wait.h"
#include "warningcapture.h"

namespace Corvane
{
namespace Agent
{

using Mdm::SecuritySettings;

SecuritySwitches::SecuritySwitches(std::chrono::milliseconds timeout, QObject *parent)
    : QObject(parent)
    , m_timeout(timeout)
{
    connect(&m_settings, &SecuritySettings::developerModeEnabledChanged, this,
            &SecuritySwitches::developerModeChanged);
}

bool SecuritySwitches::developerMode() const
{
    return m_settings.developerModeEnabled();
}

Reply SecuritySwitches::setDeveloperMode(bool enabled)
{
    // The library says nothing of a state that is there already.
    if (developerMode() == enabled)
        return {};
    const Service packages = Service::packageKit();
    const Reply running = packages.ensureRunning();
    if (!running.isDone())
        return running;
    // It goes from the bus when it has nothing to do.
    Wait wait(Service::bus(), m_timeout,
              enabled ? QStringLiteral("install developer mode") : QStringLiteral("remove developer mode"));
    connect(&m_settings, &SecuritySettings::developerModeEnabledChanged, &wait,
            [&wait] { wait.end(Reply::Done); });
    connect(&m_settings, &SecuritySettings::developerModeChangeError, &wait, [&wait, packages, enabled] {
        wait.end(
            Reply::Refused,
            QStringLiteral("%1 could not %2 the package of developer mode")
                .arg(packages.toString(), enabled ? QStringLiteral("install") : QStringLiteral("remove")));
    });
    m_settings.setDeveloperModeEnabled(enabled);
    Reply reply = wait.run();
    if (reply.outcome == Reply::TimedOut)
        reply.text = QStringLiteral("%1 did not come to an end in time").arg(packages.toString());
    return reply;
}

Answer<bool> SecuritySwitches::sideloading() const
{
    Answer<bool> answer;
    // The daemon's file is read without the daemon.
    const WarningCapture capture(QStringLiteral("^Unable to fetch sideloading key"),
                                 [&answer](const QString &reason) {
                                     answer.reply = {Reply::Refused,
                                                     QStringLiteral("the phone does not say whether packages "
                                                                    "from outside the store are allowed: ")
                                                         + reason};
                                 });
    answer.value = m_settings.sideloadingAllowed();
    return answer;
}

Reply SecuritySwitches::setSideloading(bool allowed)
{
    return ask(Service::deviceLock(), QStringLiteral("^Failed to change sideloading state"),
               [&] { m_settings.setSideloadingAllowed(allowed); });
}

} // namespace Agent
} // namespace Corvane
