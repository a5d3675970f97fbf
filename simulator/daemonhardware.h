// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_DAEMONHARDWARE_H
#define CORVANE_SIMULATOR_DAEMONHARDWARE_H

#include "component.h"

#include <functional>
#include <map>
#include <string>

namespace Corvane
{
namespace Simulator
{

/** The part of the phone that a real daemon drives. It stays on while the daemon is away. */
class DaemonHardware : public Component
{
public:
    // The daemon has objects of its own.
    void attach(Service &) final { }
    void detach() final { }

    /** The daemon is about to start. @return environment variables for it; throws std::runtime_error */
    virtual std::map<std::string, std::string> prepare() = 0;
    /** The daemon is on the bus: makes it switch everything on, and calls @p done when that is so. */
    virtual void bringUp(std::function<void()> done) = 0;
    /** What bringUp() still waits for, for people. */
    virtual QString missing() const = 0;
    /** The daemon is gone, or has taken too long: nothing more is to be done. */
    virtual void release() = 0;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_DAEMONHARDWARE_H
