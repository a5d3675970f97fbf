// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_WARNINGCAPTURE_H
#define CORVANE_WARNINGCAPTURE_H

#include <QtCore/QRegularExpression>
#include <QtCore/QString>

#include <functional>

namespace Corvane
{
namespace Agent
{

/**
 * Takes matching warnings out of Qt's message stream for as long as it lives.
 *
 * The library tells of refused requests and failed queries by warnings alone. The newest capture is asked
 * first; what none takes is printed. Debug messages are dropped.
 */
class WarningCapture
{
public:
    /**
     * @param taker gets what a group of @p pattern captures in a warning that matches, or without groups the
     * reason of the warning, see reasonOf().
     */
    WarningCapture(const QString &pattern, std::function<void(const QString &)> taker);
    ~WarningCapture();
    Q_DISABLE_COPY(WarningCapture)

    /** Makes the captures work, and prints what no capture takes to standard error, after @p prefix. */
    static void install(const QByteArray &prefix);

    /** What the service said: the message of the D-Bus error in @p warning and its name, or all of it. */
    static QString reasonOf(const QString &warning);

private:
    static void handle(QtMsgType type, const QMessageLogContext &context, const QString &message);
    bool take(const QString &message) const;

    QRegularExpression m_pattern;
    std::function<void(const QString &)> m_taker;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_WARNINGCAPTURE_H
