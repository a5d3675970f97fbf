// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_COMPLETION_H
#define CORVANE_COMPLETION_H

#include "command.h"

namespace Corvane
{
namespace Agent
{

/** "completion": prints a shell's completion script for all of @p program. */
Command completionCommand(const Command &program);

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_COMPLETION_H
