// SPDX-License-Identifier: LGPL-2.1-or-later
#include "timer.h"

#include <utility>

namespace Corvane
{
namespace Simulator
{

void Timer::start(guint milliseconds, std::function<void()> action)
{
    stop();
    m_action = std::move(action);
    m_source = g_timeout_add(
        milliseconds,
        [](gpointer data) -> gboolean {
            auto *timer = static_cast<Timer *>(data);
            timer->m_source = 0;
            // The action may start the timer anew, or destroy it.
            const std::function<void()> due = std::move(timer->m_action);
            due();
            return G_SOURCE_REMOVE;
        },
        this);
}

void Timer::stop()
{
    if (m_source)
        g_source_remove(m_source);
    m_source = 0;
    m_action = nullptr;
}

} // namespace Simulator
} // namespace Corvane
