// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_DEVICE_H
#define CORVANE_SIMULATOR_DEVICE_H

#include <QtCore/QJsonObject>
#include <QtCore/QStringList>

namespace Corvane
{
namespace Simulator
{

/**
 * Runs the simulated services until SIGTERM. Call it in a process of its own, inside the phone, once the bus
 * is there.
 *
 * @param replacedNames bus names that real daemons own in place of the simulated services; they are waited
 * for
 * @param readyFd closed after one byte when every name is on the bus
 * @return the exit status of the process
 */
int runDevice(const QJsonObject &profile, const QStringList &replacedNames, int readyFd);

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_DEVICE_H
