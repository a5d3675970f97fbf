// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TABLE_H
#define CORVANE_TABLE_H

#include <QtCore/QString>
#include <QtCore/QStringList>
#include <QtCore/QVector>

namespace Corvane
{
namespace Agent
{

/** Rows of text in aligned columns. A cell may have several lines; other control characters are replaced. */
class Table
{
public:
    explicit Table(const QStringList &heading);

    void addRow(const QStringList &cells);

    /** The lines, without trailing spaces; columns that are empty below the heading are left out. */
    QString toString() const;

private:
    QVector<int> columnWidths() const;

    QVector<QStringList> m_rows;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_TABLE_H
