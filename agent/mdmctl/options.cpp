// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commands.h"

#include "output.h"

#include <cmath>

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String jsonName("--json");
const QLatin1String timeoutName("--timeout");

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

Timeouts timeoutsOf(const Values &values)
{
    if (!values.has(timeoutName))
        return {};
    const std::chrono::milliseconds given(std::llround(values.first(timeoutName).toDouble() * 1000));
    return {given, given};
}

} // namespace Agent
} // namespace Corvane
