// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_WAIT_H
#define CORVANE_WAIT_H

#include "reply.h"
#include "service.h"
#include "systembus.h"
#include "warningcapture.h"

#include <QtCore/QEventLoop>
#include <QtCore/QObject>
#include <QtCore/QTimer>
#include <QtDBus/QDBusServiceWatcher>

#include <chrono>
#include <functional>

namespace Corvane
{
namespace Agent
{

/**
 * Waits for something that a service announces.
 *
 * The wait begins with the object, so make it before the request. It ends with what comes first: the
 * condition of until() holds, end() is called, the library warns of a refusal, the service leaves the bus,
 * the time is over, or an Interruption is requested.
 */
class Wait : public QObject
{
    Q_OBJECT

public:
    /** As time: waits for as long as it takes. */
    static constexpr std::chrono::milliseconds Forever{-1};

    /** @param awaited completes the sentence "... did not ... within 25 s", such as "confirm the change". */
    Wait(const Service &service, std::chrono::milliseconds time, const QString &awaited);

    /** Ends the wait as done when @p condition holds: now, or later when @p sender emits @p signal. */
    template <typename Sender, typename Signal>
    void until(const Sender *sender, Signal signal, const std::function<bool()> &condition);

    /** Ends the wait; later ends are ignored. */
    void end(Reply::Outcome outcome, const QString &text = QString());

    /** Whether it has ended, although run() may not have returned yet. */
    bool isOver() const { return m_ended; }

    /** Starts the time anew, as something happened. */
    void prolong();

    Reply run();

private:
    Service m_service;
    QEventLoop m_loop;
    QTimer m_timer;
    SystemBus m_bus;
    QDBusServiceWatcher m_watcher;
    WarningCapture m_refusals;
    Reply m_reply;
    bool m_ended = false;
};

template <typename Sender, typename Signal>
void Wait::until(const Sender *sender, Signal signal, const std::function<bool()> &condition)
{
    const auto look = [this, condition] {
        if (condition())
            end(Reply::Done);
    };
    connect(sender, signal, this, look);
    look();
}

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_WAIT_H
