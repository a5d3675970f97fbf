// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_FRAME_CALLANSWER_P_H
#define CORVANEMDM_PLATFORM_FRAME_CALLANSWER_P_H

#include <QtCore/QObject>
#include <QtCore/QPointer>
#include <QtDBus/QDBusMessage>

#include <functional>

class QDBusConnection;
class QDBusError;

/**
 * The answer to a call, taken at its place among the signals of the service.
 *
 * A QDBusPendingCallWatcher that is made after the answer has arrived tells of it by a detour through the
 * event loop, and signals that were sent after the answer get ahead of it. Whoever mirrors a state would take
 * the older for the newer.
 */
class CallAnswer : public QObject
{
    Q_OBJECT

public:
    using Handler = std::function<void(const QDBusMessage &answer)>;

    /**
     * Sends @p call, and hands what comes of it, a reply or an error, to @p handler; to nobody when
     * @p context is gone by then. Not over a connection that is closed before: QtDBus cannot bear it.
     */
    static void follow(const QDBusConnection &bus, const QDBusMessage &call, QObject *context,
                       const Handler &handler, int timeout = -1);

private Q_SLOTS:
    void take(const QDBusMessage &answer);
    void takeError(const QDBusError &error, const QDBusMessage &call);

private:
    CallAnswer(QObject *context, const Handler &handler);

    const QPointer<QObject> m_context;
    const Handler m_handler;
};

#endif // CORVANEMDM_PLATFORM_FRAME_CALLANSWER_P_H
