// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_OUTPUT_H
#define CORVANE_OUTPUT_H

#include <QtCore/QJsonObject>
#include <QtCore/QString>

namespace Corvane
{
namespace Agent
{

/** Writes a line to standard output. */
void print(const QString &line);

/** Writes @p object to standard output, indented. */
void print(const QJsonObject &object);

/** Writes one line of what a watch sees, after the time, for people or as JSON. Each line is out at once. */
class EventLog
{
public:
    explicit EventLog(bool json)
        : m_json(json)
    {
    }

    /** @param members what the JSON object holds beside the time. */
    void write(const QString &text, const QJsonObject &members) const;

private:
    bool m_json;
};

/** Writes "mdmctl: @p text" to standard error. */
void printError(const QString &text);

/** Whether all that was printed has reached standard output. */
bool flushOutput();

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_OUTPUT_H
