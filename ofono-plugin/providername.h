// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef VELDMOBILE_PROVIDERNAME_H
#define VELDMOBILE_PROVIDERNAME_H

#include <functional>
#include <string>

struct ofono_sim;

namespace VeldMobile
{

/**
 * Makes oFono read the provider's name from a SIM, and finds out when there is none.
 *
 * oFono reads it for whoever wants to show it, the network registration as a rule; that may be never, and the
 * end of a search without result is not announced on the bus.
 */
class ProviderName
{
public:
    /** @p settled is called once, with the name or an empty text. It does not end the object. */
    ProviderName(const std::string &modemPath, std::function<void(const std::string &name)> settled);
    ~ProviderName();
    ProviderName(const ProviderName &) = delete;
    ProviderName &operator=(const ProviderName &) = delete;

    /** Does nothing before oFono can read the SIM: something then changes on the bus, so try again. */
    void tryToAsk();

private:
    void told(const char *name);
    void settle(const std::string &name);

    const std::string m_modemPath;
    std::function<void(const std::string &)> m_settled;
    ofono_sim *m_sim = nullptr; ///< while oFono has our watch
    unsigned int m_watch = 0;
    unsigned int m_timer = 0;
    bool m_isAsking = false;
};

} // namespace VeldMobile

#endif // VELDMOBILE_PROVIDERNAME_H
