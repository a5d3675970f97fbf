// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_CELLULARLINKS_H
#define CORVANE_SIMULATOR_CELLULARLINKS_H

#include <QtCore/QString>

#include <functional>
#include <vector>

namespace Corvane
{
namespace Simulator
{

/** A context for the internet that could be connected: the connection manager makes a network of it. */
struct CellularLink {
    QString contextPath; ///< object path, such as "/ril_0/context1"
    QString imsi;
    QString provider; ///< what the network is called
    bool isRoaming = false;
    bool isActive = false;

    bool operator==(const CellularLink &other) const
    {
        return contextPath == other.contextPath && imsi == other.imsi && provider == other.provider
            && isRoaming == other.isRoaming && isActive == other.isActive;
    }
};

/**
 * Mobile data between the telephony service, which has the contexts, and the connection manager, which has
 * networks made of them.
 *
 * On a phone the connection manager is a client of the telephony service. Here the two know of each other
 * without the bus, so that faults and the journal are left to the clients of the phone.
 *
 * The telephony service says by offer() what there is, whenever anything of it may have changed, and offers
 * nothing while it is stopped. The connection manager asks by activate() for a context to be switched, and
 * sees in the next offer what became of it. It also says when the phone is in flight mode.
 */
class CellularLinks
{
public:
    using Links = std::vector<CellularLink>;

    // For the telephony service.
    /** Replaces what was offered before. */
    void offer(const Links &links)
    {
        if (links == m_links)
            return;
        m_links = links;
        if (m_changed)
            m_changed();
    }
    /** @p activate switches a context on or off, offers what has come of it, and returns whether it was done.
     */
    void setActivator(std::function<bool(const QString &contextPath, bool isActive)> activate)
    {
        m_activate = std::move(activate);
    }
    /** @p changed learns whenever flight mode has been switched. */
    void watchFlightMode(std::function<void(bool isOn)> changed) { m_flightModeChanged = std::move(changed); }

    // For the connection manager.
    const Links &links() const { return m_links; }
    /** @p changed learns of every change of links(). */
    void watch(std::function<void()> changed) { m_changed = std::move(changed); }
    /** Returns false when the telephony service is away or refuses. */
    bool activate(const QString &contextPath, bool isActive) const
    {
        return m_activate && m_activate(contextPath, isActive);
    }
    void setFlightMode(bool isOn) const
    {
        if (m_flightModeChanged)
            m_flightModeChanged(isOn);
    }

private:
    Links m_links;
    std::function<bool(const QString &, bool)> m_activate;
    std::function<void()> m_changed;
    std::function<void(bool)> m_flightModeChanged;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_CELLULARLINKS_H
