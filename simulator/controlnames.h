// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_CONTROLNAMES_H
#define CORVANE_SIMULATOR_CONTROLNAMES_H

namespace Corvane
{
namespace Simulator
{

/** Where the phone is steered: for its one service and its one client. */
namespace ControlNames
{
constexpr char service[] = "org.corvaneos.simulator";
constexpr char path[] = "/org/corvaneos/simulator";
constexpr char interface[] = "org.corvaneos.simulator.Control";
constexpr char refusal[] = "org.corvaneos.simulator.Error.InvalidArguments";
} // namespace ControlNames

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_CONTROLNAMES_H
