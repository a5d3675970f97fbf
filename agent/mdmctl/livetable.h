// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_LIVETABLE_H
#define CORVANE_LIVETABLE_H

#include <QtCore/QString>

namespace Corvane
{
namespace Agent
{

/** Text on standard output that is replaced in place when there is a newer one; for terminals. */
class LiveTable
{
public:
    /** Whether standard output is a terminal. */
    static bool isPossible();

    void show(const QString &text);

    /** What makes a terminal that shows @p shown show @p text there; @p shown is empty at first. */
    static QString replacement(const QString &shown, const QString &text);

private:
    QString m_shown;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_LIVETABLE_H
