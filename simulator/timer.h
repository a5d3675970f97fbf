// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_TIMER_H
#define CORVANE_SIMULATOR_TIMER_H

#include <glib.h>

#include <functional>

namespace Corvane
{
namespace Simulator
{

/** Runs something later on the main loop, unless it is stopped or destroyed before. */
class Timer
{
public:
    Timer() = default;
    ~Timer() { stop(); }
    Timer(const Timer &) = delete;
    Timer &operator=(const Timer &) = delete;

    /** Forgets what was waiting and runs @p action after @p milliseconds. */
    void start(guint milliseconds, std::function<void()> action);
    void stop();

private:
    guint m_source = 0;
    std::function<void()> m_action;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_TIMER_H
