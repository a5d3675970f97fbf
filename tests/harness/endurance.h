// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_ENDURANCE_H
#define CORVANE_TEST_ENDURANCE_H

#include <QtCore/QtGlobal>

// What tests that do something very often look at.

/** Memory of this process that is in use, in KiB. */
qint64 residentMemory();

/** Runs the event loop for as long as that, whatever happens, and once at least. */
void runFor(int microseconds);

#endif // CORVANE_TEST_ENDURANCE_H
