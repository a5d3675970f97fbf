// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_COMMANDLINE_H
#define CORVANE_COMMANDLINE_H

#include "command.h"

#include <QtCore/QStringList>

namespace Corvane
{
namespace Agent
{

/**
 * Finds the command that @p words (without the program's name) ask for and runs it.
 * Whatever is wrong with them is told in one line, before anything is run.
 * @return the exit status.
 */
int runCommandLine(const Command &program, const QStringList &words);

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_COMMANDLINE_H
