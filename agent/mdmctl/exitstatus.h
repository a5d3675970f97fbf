// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_EXITSTATUS_H
#define CORVANE_EXITSTATUS_H

#include "reply.h"

namespace Corvane
{
namespace Agent
{

enum ExitStatus {
    ExitDone = 0,
    ExitFailed = 1, ///< refused or failed
    ExitUsage = 2, ///< wrong usage: nothing was sent
    ExitNoService = 3 ///< the service is not there
};

ExitStatus exitStatusOf(const Reply &reply);

/** The same, with the reply's text on standard error when it is not done. */
ExitStatus conclude(const Reply &reply);

/** The same, for what runs until it is interrupted. */
ExitStatus concludeWatch(const Reply &reply);

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_EXITSTATUS_H
