// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_BUSADDRESS_H
#define CORVANE_SIMULATOR_BUSADDRESS_H

namespace Corvane
{
namespace Simulator
{

/** Where the phone's system bus listens: where every client of a system bus looks for it. */
constexpr char busAddress[] = "unix:path=/run/dbus/system_bus_socket";

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_BUSADDRESS_H
