// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commands.h"

#include "output.h"

#include <QtCore/QRegularExpression>

#include <cmath>

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String jsonName("--json");
const QLatin1String timeoutName("--timeout");
const QLatin1String lookName("--look");

std::chrono::milliseconds millisecondsFrom(const QString &seconds)
{
    return std::chrono::milliseconds(std::llround(seconds.toDouble() * 1000));
}

QString timeoutFault(const QString &value)
{
    constexpr double longest = 7 * 24 * 3600;
    bool isNumber = false;
    const double seconds = value.toDouble(&isNumber);
    const bool usable = isNumber && seconds >= 0.001 && seconds <= longest;
    return usable ? QString() : QStringLiteral("must be a number of seconds greater than 0, at most a week");
}

} // namespace

Option jsonOption()
{
    return {jsonName, QStringLiteral("Print JSON"), {}, {}};
}

Option timeoutOption(const QString &meaning)
{
    return {timeoutName, meaning, QStringLiteral("SECONDS"), timeoutFault};
}

QDateTime timeFrom(const QString &text)
{
    // Neither an offset nor a zone reaches the phone, so all times are sent in UTC.
    const QDateTime time = QDateTime::fromString(text, Qt::ISODateWithMs);
    return time.isValid() ? time.toUTC() : QDateTime();
}

QString timeFault(const QString &value)
{
    return timeFrom(value).isValid()
        ? QString()
        : QStringLiteral("must be a date, or a date and time, as in 2026-03-02 or 2026-03-02T09:15:00Z");
}

Argument imsiArgument()
{
    return {imsiName(), QStringLiteral("Subscriber identity of the SIM, up to 15 digits"), {}, imsiFault};
}

QString imsiName()
{
    return QStringLiteral("IMSI");
}

QString imsiFault(const QString &imsi)
{
    static const QRegularExpression wellFormed(QStringLiteral("\\A[0-9]{1,15}\\z"));
    return wellFormed.match(imsi).hasMatch() ? QString() : QStringLiteral("must be 1 to 15 decimal digits");
}

bool wantsJson(const Values &values)
{
    return values.has(jsonName);
}

void printResult(const Values &values, const QString &text, const QJsonObject &json)
{
    if (wantsJson(values))
        print(json);
    else
        print(text);
}

QString unchangedNote(bool changed)
{
    return changed ? QString() : QStringLiteral("Already so, nothing to change.\n");
}

Option lookOption()
{
    return {lookName, QStringLiteral("Look so often at what the phone does not announce (default: 30)"),
            QStringLiteral("SECONDS"), timeoutFault};
}

Timeouts timeoutsOf(const Values &values)
{
    Timeouts timeouts;
    if (values.has(timeoutName))
        timeouts.confirmation = timeouts.silence = millisecondsFrom(values.first(timeoutName));
    if (values.has(lookName))
        timeouts.look = millisecondsFrom(values.first(lookName));
    return timeouts;
}

} // namespace Agent
} // namespace Corvane
