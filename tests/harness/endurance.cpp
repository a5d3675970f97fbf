// SPDX-License-Identifier: LGPL-2.1-or-later
#include "endurance.h"

#include <QtCore/QCoreApplication>
#include <QtCore/QElapsedTimer>
#include <QtCore/QFile>

qint64 residentMemory()
{
    QFile status(QStringLiteral("/proc/self/statm"));
    if (!status.open(QIODevice::ReadOnly))
        return 0;
    return status.readAll().split(' ').value(1).toLongLong() * 4;
}

void runFor(int microseconds)
{
    QElapsedTimer elapsed;
    elapsed.start();
    do {
        QCoreApplication::processEvents();
    } while (elapsed.nsecsElapsed() < qint64(microseconds) * 1000);
}
