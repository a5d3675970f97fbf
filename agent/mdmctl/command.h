// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_COMMAND_H
#define CORVANE_COMMAND_H

#include <QtCore/QMap>
#include <QtCore/QString>
#include <QtCore/QStringList>
#include <QtCore/QVector>

#include <functional>

namespace Corvane
{
namespace Agent
{

/** What is wrong with a value, and what would be right; empty when nothing is. */
using ValueCheck = std::function<QString(const QString &value)>;

/** A positional argument. */
struct Argument {
    enum Kind { Word, File };
    enum Count { One, Optional, Several };

    QString name;
    QString help;
    QStringList choices; ///< every value that there is; empty: any
    ValueCheck check;
    Kind kind = Word;
    Count count = One;
};

/** "--name", or "--name VALUE" when it names its value. */
struct Option {
    QString name;
    QString help;
    QString valueName;
    ValueCheck check;
};

/** What was given on the command line. */
class Values
{
public:
    void set(const QString &name, const QStringList &values) { m_values.insert(name, values); }
    bool has(const QString &name) const { return m_values.contains(name); }
    QString first(const QString &name) const { return m_values.value(name).value(0); }
    QStringList all(const QString &name) const { return m_values.value(name); }

private:
    QMap<QString, QStringList> m_values;
};

/** A word of the command line: a group of further commands, or something to do. */
struct Command {
    QString name;
    QString summary;
    QString description; ///< for its help, after the options: what one must know, and examples
    QVector<Argument> arguments;
    QVector<Option> options;
    std::function<int(const Values &values)> run; ///< returns the exit status
    QVector<Command> commands;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_COMMAND_H
