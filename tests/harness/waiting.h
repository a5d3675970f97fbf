// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_WAITING_H
#define CORVANE_TEST_WAITING_H

#include <QtCore/QCoreApplication>
#include <QtCore/QElapsedTimer>
#include <QtCore/QEventLoop>
#include <QtCore/QTimer>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusConnectionInterface>
#include <QtDBus/QDBusReply>

/** Runs the event loop until @p condition holds. Gives up, and returns false, only when a test has gone
 * wrong. */
template <typename Condition> bool waitUntil(Condition condition)
{
    constexpr int GiveUpMilliseconds = 30000;
    constexpr int WakeUpMilliseconds = 50;
    QElapsedTimer elapsed;
    elapsed.start();
    // A condition that asks somebody else becomes true without an event here.
    QTimer wakeUp;
    wakeUp.start(WakeUpMilliseconds);
    while (!condition()) {
        if (elapsed.elapsed() > GiveUpMilliseconds)
            return false;
        QCoreApplication::processEvents(QEventLoop::AllEvents | QEventLoop::WaitForMoreEvents);
    }
    return true;
}

/**
 * Returns when QtDBus's thread is done with all answers that have been taken. It holds the last one a moment
 * longer, and when the program ends in that moment, Qt no longer knows how to free its arguments.
 */
inline void letAnswersGo()
{
    const QDBusConnectionInterface *bus = QDBusConnection::systemBus().interface();
    if (bus)
        bus->isServiceRegistered(bus->service());
}

#endif // CORVANE_TEST_WAITING_H
