// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_SUPERVISOR_H
#define CORVANE_SIMULATOR_SUPERVISOR_H

#include "profile.h"
#include "realdaemons.h"

#include <string>
#include <vector>

namespace Corvane
{
namespace Simulator
{

/** The exit status when the phone, rather than the command, failed. */
constexpr int phoneFailed = 125;

struct RunSettings {
    Profile profile;
    std::vector<RealDaemon> realDaemons;
    std::vector<std::string> command; ///< empty: an interactive shell
};

/**
 * Sets a phone up, runs the command in it and takes everything down.
 * @return what the process has to exit with, in this process and in those that it forks.
 */
int runInPhone(const RunSettings &settings);

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_SUPERVISOR_H
