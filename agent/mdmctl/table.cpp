// SPDX-License-Identifier: LGPL-2.1-or-later
#include "table.h"

#include <algorithm>

namespace Corvane
{
namespace Agent
{

namespace
{

QStringList linesOf(const QString &cell)
{
    return cell.split(QLatin1Char('\n'));
}

// What services tell may come from anywhere, and must not steer the terminal.
QString withoutControls(QString cell)
{
    for (QChar &character : cell) {
        if (character.category() == QChar::Other_Control && character != QLatin1Char('\n'))
            character = QChar::ReplacementCharacter;
    }
    return cell;
}

QString trimmedEnd(const QString &line)
{
    int end = line.size();
    while (end > 0 && line.at(end - 1).isSpace())
        --end;
    return line.left(end);
}

QStringList rowLines(const QStringList &cells, const QVector<int> &widths)
{
    QStringList lines;
    int start = 0;
    for (int column = 0; column < widths.size(); ++column) {
        if (widths.at(column) == 0)
            continue;
        const QStringList cellLines = linesOf(cells.at(column));
        for (int i = 0; i < cellLines.size(); ++i) {
            if (i == lines.size())
                lines.append(QString());
            lines[i] = lines.at(i).leftJustified(start) + cellLines.at(i);
        }
        start += widths.at(column) + 2;
    }
    std::transform(lines.begin(), lines.end(), lines.begin(), trimmedEnd);
    return lines;
}

} // namespace

Table::Table(const QStringList &heading)
    : m_rows{heading}
{
}

void Table::addRow(const QStringList &cells)
{
    QStringList shown;
    for (const QString &cell : cells)
        shown.append(withoutControls(cell));
    m_rows.append(shown);
}

QVector<int> Table::columnWidths() const
{
    QVector<int> widths(m_rows.first().size());
    for (int column = 0; column < widths.size(); ++column) {
        const bool used = std::any_of(m_rows.cbegin() + 1, m_rows.cend(),
                                      [column](const QStringList &row) { return !row.at(column).isEmpty(); });
        for (const QStringList &row : m_rows) {
            const QStringList lines = linesOf(used ? row.at(column) : QString());
            for (const QString &line : lines)
                widths[column] = std::max(widths.at(column), line.size());
        }
    }
    return widths;
}

QString Table::toString() const
{
    const QVector<int> widths = columnWidths();
    QStringList lines;
    for (const QStringList &row : m_rows)
        lines += rowLines(row, widths);
    return lines.join(QLatin1Char('\n'));
}

} // namespace Agent
} // namespace Corvane
