// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_WAITING_H
#define CORVANE_TEST_WAITING_H

#include <QtCore/QCoreApplication>
#include <QtCore/QElapsedTimer>
#include <QtCore/QEventLoop>
#include <QtCore/QTimer>

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

#endif // CORVANE_TEST_WAITING_H
