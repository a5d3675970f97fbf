// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"

#include <utility>

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
    const QMutexLocker lock(&m_mutex);
    return std::exchange(m_warnings, {});
}

QStringList MessageLog::takeInfos()
{
    const QMutexLocker lock(&m_mutex);
    return std::exchange(m_infos, {});
}

void MessageLog::handle(QtMsgType type, const QMessageLogContext &context, const QString &message)
{
    const QMutexLocker lock(&s_current->m_mutex);
    if (type == QtWarningMsg)
        s_current->m_warnings.append(message);
    else if (type == QtInfoMsg)
        s_current->m_infos.append(message);
    else
        s_current->m_previous(type, context, message);
}
