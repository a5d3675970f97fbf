// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SESSIONAPPLICATIONS_H
#define CORVANE_SESSIONAPPLICATIONS_H

#include "reply.h"
#include "warningcapture.h"

#include <corvanemdm/autostart.h>

#include <QtCore/QStringList>

namespace Corvane
{
namespace Agent
{

/** The applications that start with the user session. */
class SessionApplications
{
public:
    SessionApplications();

    Reply list(QStringList &desktopFiles);
    /** That it starts already is fine. */
    Reply add(const QString &desktopFile);
    Reply remove(const QString &desktopFile);

private:
    Reply replyOf(Mdm::Autostart::Result result, const QString &desktopFile);

    Mdm::Autostart m_autostart;
    QString m_refusal; ///< what the library has told of a call that failed
    WarningCapture m_warnings;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_SESSIONAPPLICATIONS_H
