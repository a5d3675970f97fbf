// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"

MessageLog *MessageLog::s_current = nullptr;

MessageLog::MessageLog()
{
    Q_ASSERT(!s_current);
    s_current = this;
    m_previous = qInstallMessageHandler(handle);
}

MessageLog::~MessageLog()
{
    qInstallMessageHandler(m_previous);
    s_current = nullptr;
}

QStringList MessageLog::takeWarnings()
{
    QStringList warnings;
    warnings.swap(m_warnings);
    return warnings;
}

void MessageLog::handle(QtMsgType type, const QMessageLogContext &context, const QString &message)
{
    if (type == QtWarningMsg)
        s_current->m_warnings.append(message);
    else
        s_current->m_previous(type, context, message);
}
