// SPDX-License-Identifier: LGPL-2.1-or-later
#include "answer.h"

#include "warningcapture.h"

namespace Corvane
{
namespace Agent
{

Reply ask(const Service &service, const QString &failures, const std::function<void()> &question)
{
    Reply reply;
    {
        const WarningCapture capture(failures, [&](const QString &reason) {
            if (reply.isDone())
                reply = {Reply::Refused, service.refusal(reason)};
        });
        question();
    }
    // A service that died under the question explains the failure better than the bus does.
    return reply.isDone() || service.isRunning() ? reply : service.notRunning();
}

} // namespace Agent
} // namespace Corvane
