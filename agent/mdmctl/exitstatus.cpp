// SPDX-License-Identifier: LGPL-2.1-or-later
#include "exitstatus.h"

#include "output.h"

namespace Corvane
{
namespace Agent
{

ExitStatus exitStatusOf(const Reply &reply)
{
    switch (reply.outcome) {
    case Reply::Done:
        return ExitDone;
    case Reply::ServiceLost:
        return ExitNoService;
    case Reply::Refused:
    case Reply::TimedOut:
    case Reply::Interrupted:
        break;
    }
    return ExitFailed;
}

ExitStatus conclude(const Reply &reply)
{
    if (!reply.isDone())
        printError(reply.text);
    return exitStatusOf(reply);
}

ExitStatus concludeWatch(const Reply &reply)
{
    return reply.outcome == Reply::Interrupted ? ExitDone : conclude(reply);
}

} // namespace Agent
} // namespace Corvane
