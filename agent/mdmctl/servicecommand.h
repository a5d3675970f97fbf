// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SERVICECOMMAND_H
#define CORVANE_SERVICECOMMAND_H

#include "commands.h"
#include "exitstatus.h"
#include "service.h"

namespace Corvane
{
namespace Agent
{

/** A command that uses an @p Object of the library, which is made when @p service is there. */
template <typename Object>
Command serviceCommand(const Service &service, const QString &name, const QString &summary,
                       int (*run)(Object &, const Values &))
{
    Command command;
    command.name = name;
    command.summary = summary;
    command.options = {jsonOption()};
    command.run = [service, run](const Values &values) -> int {
        const Reply running = service.ensureRunning();
        if (!running.isDone())
            return conclude(running);
        Object object;
        return run(object, values);
    };
    return command;
}

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_SERVICECOMMAND_H
