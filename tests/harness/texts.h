// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_TEXTS_H
#define CORVANE_TEST_TEXTS_H

#include <QtCore/QStringList>

#include <initializer_list>

/** A list of literals, in UTF-8. */
inline QStringList texts(std::initializer_list<const char *> list)
{
    QStringList result;
    for (const char *text : list)
        result.append(QString::fromUtf8(text));
    return result;
}

#endif // CORVANE_TEST_TEXTS_H
