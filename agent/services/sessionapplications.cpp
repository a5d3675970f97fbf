// SPDX-License-Identifier: LGPL-2.1-or-later
#include "sessionapplications.h"

#include "service.h"

namespace Corvane
{
namespace Agent
{

using Mdm::Autostart;

SessionApplications::SessionApplications()
    : m_warnings(QStringLiteral("^Got invalid reply to Autostart::"), [this](const QString &warning) {
        // All that the library has to say of it is the text between the quotation marks.
        m_refusal = warning.mid(warning.indexOf(QLatin1Char('"')) + 1);
        m_refusal.chop(1);
    })
{
}

Reply SessionApplications::list(QStringList &desktopFiles)
{
    Autostart::Result result = Autostart::InternalError;
    desktopFiles = m_autostart.query(result);
    return replyOf(result, QString());
}

Reply SessionApplications::add(const QString &desktopFile)
{
    const Autostart::Result result = m_autostart.add(desktopFile);
    return result == Autostart::AlreadyAutostarted ? Reply() : replyOf(result, desktopFile);
}

Reply SessionApplications::remove(const QString &desktopFile)
{
    return replyOf(m_autostart.remove(desktopFile), desktopFile);
}

Reply SessionApplications::replyOf(Autostart::Result result, const QString &desktopFile)
{
    const QString refusal = std::exchange(m_refusal, QString());
    if (result == Autostart::Success)
        return {};
    const Service proxy = Service::mdmProxy();
    if (!proxy.isRunning())
        return proxy.notRunning();
    QString reason = refusal.isEmpty() ? QStringLiteral("internal error") : refusal;
    if (result == Autostart::InvalidDesktopFile)
        reason = QStringLiteral("it does not accept the desktop entry \"%1\"").arg(desktopFile);
    else if (result != Autostart::InternalError)
        reason = QStringLiteral("code %1").arg(result);
    return {Reply::Refused, proxy.refusal(reason)};
}

} // namespace Agent
} // namespace Corvane
