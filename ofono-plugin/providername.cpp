// SPDX-License-Identifier: LGPL-2.1-or-later
#include "providername.h"

#include <glib.h>
#include <ofono/modem.h>
#include <ofono/sim.h>

#include <utility>

namespace VeldMobile
{

namespace
{
constexpr guint patience = 5; // s
} // namespace

ProviderName::ProviderName(const std::string &modemPath, std::function<void(const std::string &)> settled)
    : m_modemPath(modemPath)
    , m_settled(std::move(settled))
{
    // Who came to a search that had ended before is not told its result.
    m_timer = g_timeout_add_seconds(
        patience,
        [](gpointer data) -> gboolean {
            auto *self = static_cast<ProviderName *>(data);
            self->m_timer = 0;
            self->settle({});
            return G_SOURCE_REMOVE;
        },
        this);
}

ProviderName::~ProviderName()
{
    if (m_timer)
        g_source_remove(m_timer);
    if (m_sim)
        ofono_sim_remove_spn_watch(m_sim, &m_watch);
}

void ProviderName::tryToAsk()
{
    if (m_sim || !m_settled)
        return;
    ofono_modem *modem = ofono_modem_find(
        [](ofono_modem *candidate, void *self) -> ofono_bool_t {
            return static_cast<ProviderName *>(self)->m_modemPath == ofono_modem_get_path(candidate);
        },
        this);
    ofono_sim *sim = modem ? ofono_modem_get_sim(modem) : nullptr;
    if (!sim || ofono_sim_get_state(sim) != OFONO_SIM_STATE_READY)
        return;
    m_sim = sim;
    m_isAsking = true;
    const bool isWatching = ofono_sim_add_spn_watch(
        sim, &m_watch,
        [](const char *name, const char *, void *self) { static_cast<ProviderName *>(self)->told(name); },
        this,
        // The SIM goes, and our watch with it.
        [](void *self) { static_cast<ProviderName *>(self)->m_sim = nullptr; });
    m_isAsking = false;
    if (!isWatching)
        m_sim = nullptr;
}

void ProviderName::told(const char *name)
{
    // Others may be searching already; then this first answer is what is known so far.
    if (name || !m_isAsking)
        settle(name ? name : "");
}

void ProviderName::settle(const std::string &name)
{
    if (const auto settled = std::exchange(m_settled, nullptr))
        settled(name);
}

} // namespace VeldMobile
