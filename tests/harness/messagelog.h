// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_MESSAGELOG_H
#define CORVANE_TEST_MESSAGELOG_H

#include <QtCore/QMutex>
#include <QtCore/QStringList>
#include <QtCore/QtGlobal>

/** Collects what is logged while it lives, in any thread, instead of printing it. One at a time. */
class MessageLog
{
public:
    MessageLog();
    ~MessageLog();

    /** Warnings since construction or the last call, oldest first. */
    QStringList takeWarnings();
    /** The same of what is worth knowing, but no problem. */
    QStringList takeInfos();

private:
    Q_DISABLE_COPY(MessageLog)

    static void handle(QtMsgType type, const QMessageLogContext &context, const QString &message);

    static MessageLog *s_current;
    QtMessageHandler m_previous;
    QMutex m_mutex;
    QStringList m_warnings;
    QStringList m_infos;
};

#endif // CORVANE_TEST_MESSAGELOG_H
