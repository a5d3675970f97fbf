// SPDX-License-Identifier: LGPL-2.1-or-later
#include "suggestion.h"

#include <algorithm>
#include <iterator>
#include <numeric>
#include <vector>

namespace Corvane
{
namespace Agent
{

namespace
{

// Optimal string alignment: swapped neighbours are one slip.
int distance(const QString &a, const QString &b)
{
    const int columns = b.size() + 1;
    std::vector<int> beforePrevious;
    std::vector<int> previous(std::size_t(columns), 0);
    std::iota(previous.begin(), previous.end(), 0);
    for (int i = 1; i <= a.size(); ++i) {
        std::vector<int> current(std::size_t(columns), i);
        for (int j = 1; j < columns; ++j) {
            const auto column = std::size_t(j);
            const int replaced = previous[column - 1] + (a.at(i - 1) != b.at(j - 1));
            current[column] = std::min({replaced, previous[column] + 1, current[column - 1] + 1});
            const bool swapped = i > 1 && j > 1 && a.at(i - 1) == b.at(j - 2) && a.at(i - 2) == b.at(j - 1);
            if (swapped)
                current[column] = std::min(current[column], beforePrevious[column - 2] + 1);
        }
        beforePrevious = std::move(previous);
        previous = std::move(current);
    }
    return previous.back();
}

QString digitsOf(const QString &word)
{
    QString digits;
    std::copy_if(word.cbegin(), word.cend(), std::back_inserter(digits),
                 [](QChar letter) { return letter.isDigit(); });
    return digits;
}

// The choice that a slip or a cut-off word stands for; empty when none is near. Who writes another digit has
// not slipped, and a slip leaves too little of a short word.
QString nearest(const QString &given, const QStringList &choices)
{
    constexpr int shortest = 3;
    if (choices.contains(given))
        return given;
    QString found;
    int tolerated = std::min(std::max(1, given.size() / 3), given.size() - 1);
    for (const QString &choice : choices) {
        if (choice.size() < shortest)
            continue;
        if (!given.isEmpty() && choice.startsWith(given))
            return choice;
        const int slips = distance(given, choice);
        if (slips <= tolerated && digitsOf(choice) == digitsOf(given)) {
            found = choice;
            tolerated = slips - 1;
        }
    }
    return found;
}

QString quoted(const QString &text)
{
    return QLatin1Char('"') + text + QLatin1Char('"');
}

} // namespace

QString suggestion(const QString &given, const QStringList &choices)
{
    const QString candidate = nearest(given.toLower(), choices);
    if (!candidate.isEmpty())
        return QStringLiteral("did you mean %1?").arg(quoted(candidate));
    QStringList all;
    for (const QString &choice : choices)
        all.append(quoted(choice));
    return (all.size() == 1 ? QLatin1String("must be ") : QLatin1String("must be one of "))
        + all.join(QLatin1String(", "));
}

} // namespace Agent
} // namespace Corvane
