// SPDX-License-Identifier: LGPL-2.1-or-later
#include "logtail.h"

#include <deque>
#include <fstream>

namespace Corvane
{
namespace Simulator
{

std::string logTail(const std::string &fileName)
{
    constexpr std::size_t shownLines = 10;
    std::ifstream file(fileName);
    std::deque<std::string> lines;
    for (std::string line; std::getline(file, line);) {
        if (line.empty())
            continue;
        lines.push_back(line);
        if (lines.size() > shownLines)
            lines.pop_front();
    }
    std::string tail;
    for (const std::string &line : lines)
        tail += (tail.empty() ? "" : "\n") + line;
    return tail;
}

} // namespace Simulator
} // namespace Corvane
