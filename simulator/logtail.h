// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_LOGTAIL_H
#define CORVANE_SIMULATOR_LOGTAIL_H

#include <string>

namespace Corvane
{
namespace Simulator
{

/** The last lines of a log, which dies with the phone; without the newline at the end. */
std::string logTail(const std::string &fileName);

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_LOGTAIL_H
