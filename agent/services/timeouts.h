// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TIMEOUTS_H
#define CORVANE_TIMEOUTS_H

#include <chrono>

namespace Corvane
{
namespace Agent
{

/** How long services are waited for. */
struct Timeouts {
    std::chrono::milliseconds confirmation{std::chrono::seconds(25)}; ///< of a setting
    std::chrono::milliseconds silence{
        std::chrono::minutes(5)}; ///< during a software update, and for a package
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_TIMEOUTS_H
