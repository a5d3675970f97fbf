// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_COMMANDS_H
#define CORVANE_COMMANDS_H

#include "command.h"
#include "timeouts.h"

#include <QtCore/QJsonObject>

namespace Corvane
{
namespace Agent
{

// One a family; each in a file of its own, but for the families of rules.
Command updateCommand();
Command callsCommand();
Command smsCommand();
Command dataCommand();
Command callStatisticsCommand();
Command simCommand();
Command packagesCommand();
Command applicationsCommand();
Command installCommand();
Command removeCommand();
Command wifiCommand();
Command flightModeCommand();
Command policyCommand();

// Options that commands share.
Option jsonOption();
Option timeoutOption(const QString &meaning);

bool wantsJson(const Values &values);

/** Prints what was asked for in the form that was asked for. */
void printResult(const Values &values, const QString &text, const QJsonObject &json);

/** The timeouts that hold unless the command line says otherwise. */
Timeouts timeoutsOf(const Values &values);

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_COMMANDS_H
