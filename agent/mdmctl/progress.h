// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_PROGRESS_H
#define CORVANE_PROGRESS_H

#include <QtCore/QString>

namespace Corvane
{
namespace Agent
{

/**
 * Shows on standard error how far something has come: as a bar that is redrawn in place on a terminal, and as
 * a line for each tenth elsewhere. The line of the bar ends with the object.
 */
class Progress
{
public:
    explicit Progress(const QString &label);
    ~Progress();
    Q_DISABLE_COPY(Progress)

    void show(int percent);

    /** The bar as a line that fits @p width columns. */
    static QString bar(const QString &label, int percent, int width);

private:
    QString m_label;
    bool m_onTerminal;
    bool m_drawn = false;
    int m_shown = -1; // percent
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_PROGRESS_H
