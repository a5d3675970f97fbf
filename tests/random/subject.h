// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_SUBJECT_H
#define CORVANE_TEST_SUBJECT_H

#include <QtCore/QStringList>

/** Lives the lives that the stranger gives it, with objects of @p classes; returns the exit status of the
 * process. */
int runSubject(const QStringList &classes, bool verbose);

#endif // CORVANE_TEST_SUBJECT_H
