// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_ENDURANCE_H
#define CORVANE_TEST_ENDURANCE_H

#include <QtCore/QCoreApplication>
#include <QtCore/QElapsedTimer>
#include <QtCore/QFile>

/** Memory of this process that is in use, in KiB. */
inline qint64 residentMemory()
{
    QFile status(QStringLiteral("/proc/self/statm"));
    if (!status.open(QIODevice::ReadOnly))
        return 0;
    return status.readAll().split(' ').value(1).toLongLong() * 4;
}

/** Lets the event loop run, to get to a moment that nobody chose. */
inline void runFor(int microseconds)
{
    QElapsedTimer elapsed;
    elapsed.start();
    while (elapsed.nsecsElapsed() < qint64(microseconds) * 1000)
        QCoreApplication::processEvents();
}

#endif // CORVANE_TEST_ENDURANCE_H
