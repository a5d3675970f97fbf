// SPDX-License-Identifier: LGPL-2.1-or-later
#include "callanswer_p.h"

#include <QtCore/QThreadStorage>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusError>

namespace
{

/** Holds what waits in this thread, to its end. */
QObject *waitingRoom()
{
    static QThreadStorage<QObject *> rooms;
    if (!rooms.hasLocalData())
        rooms.setLocalData(new QObject);
    return rooms.localData();
}

} // namespace

// It does not go with the context: QtDBus's thread looks for its receiver without a lock.
CallAnswer::CallAnswer(QObject *context, const Handler &handler)
    : QObject(waitingRoom())
    , m_context(context)
    , m_handler(handler)
{
}

void CallAnswer::follow(const QDBusConnection &bus, const QDBusMessage &call, QObject *context,
                        const Handler &handler, int timeout)
{
    auto *answer = new CallAnswer(context, handler);
    const bool isSent = bus.callWithCallback(call, answer, SLOT(take(QDBusMessage)),
                                             SLOT(takeError(QDBusError, QDBusMessage)), timeout);
    if (isSent)
        return;
    const QDBusError error(QDBusError::Disconnected, QStringLiteral("Not connected to D-Bus server"));
    QMetaObject::invokeMethod(
        answer, [answer, error, call] { answer->takeError(error, call); }, Qt::QueuedConnection);
}

void CallAnswer::take(const QDBusMessage &answer)
{
    deleteLater();
    if (m_context)
        m_handler(answer);
}

void CallAnswer::takeError(const QDBusError &error, const QDBusMessage &call)
{
    take(call.createErrorReply(error));
}
