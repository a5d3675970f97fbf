// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_SUBJECT_H
#define CORVANE_TEST_SUBJECT_H

/** Lives the lives that the stranger gives it; returns the exit status of the process. */
int runSubject(bool verbose);

#endif // CORVANE_TEST_SUBJECT_H
