// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_DEVICE_H
#define CORVANE_SIMULATOR_DEVICE_H

#include "realdaemons.h"

#include <QtCore/QJsonObject>

namespace Corvane
{
namespace Simulator
{

/**
 * Runs the simulated services until SIGTERM. Call it in a process of its own, inside the phone, once the bus
 * is there.
 *
 * @param daemons run in place of the simulated services whose names they own
 * @param readyFd closed after one byte when all services can be used
 * @return the exit status of the process
 */
int runDevice(const QJsonObject &profile, const std::vector<RealDaemon> &daemons, int readyFd);

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_DEVICE_H
