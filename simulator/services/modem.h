// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_MODEM_H
#define CORVANE_SIMULATOR_MODEM_H

#include "busconnection.h"
#include "cellularlinks.h"
#include "mobiledata.h"
#include "phone.h"
#include "properties.h"

#include <QtCore/QJsonObject>
#include <QtCore/QString>
#include <QtCore/QStringList>

#include <functional>
#include <vector>

namespace Corvane
{
namespace Simulator
{

class Service;

/** The modem of one SIM slot: the objects at its path. All that they tell is derived from what it holds. */
class Modem
{
public:
    static constexpr QLatin1String anyTechnology{"any", 3};
    /** The technologies that a slot's part of the profile gives its modem. */
    static QStringList technologiesOf(const QJsonObject &slotProfile);

    /** @p slotProfile is the slot's part of the phone's; @p changed follows what a client has changed. */
    Modem(std::size_t slot, const Sim &sim, const QJsonObject &slotProfile, ContextStore &contexts,
          std::function<void()> changed);

    QString path() const { return m_path; }
    QString imei() const;
    const Sim &sim() const { return m_sim; }
    MobileData &mobileData() { return m_mobileData; }
    /** What the connection manager can connect. */
    CellularLinks::Links links() const;
    /** Whether the daemon has this modem. */
    bool isThere() const { return m_isThere; }
    bool isEnabled() const { return m_isEnabled; }
    Properties properties() const;
    QJsonObject describe() const;

    // Each is to be followed by announce().
    void setThere(bool isThere) { m_isThere = isThere; }
    /** Also switches its power on or off. */
    void setEnabled(bool enabled);
    /** For a modem that has no power nothing changes. */
    void setOnline(bool isOnline) { m_isOnline = isOnline && m_isPowered; }
    /** The state of registration that it has with a SIM that can be used. */
    void setRegistration(const QString &status) { m_registration = status; }
    void setExtended(bool extended) { m_isExtended = extended; }

    void attach(Service &service);
    void detach();
    /** Offers what it has now, takes back what it has not any more, and announces what has changed. */
    void announce();

private:
    /** One of the interfaces at the modem's path. */
    struct Interface {
        enum Signals { PropertyChanged, OneEach };

        QLatin1String name;
        bool (Modem::*isOffered)() const;
        Properties (Modem::*properties)() const;
        MethodHandlers methods;
        Signals changeSignals;
        bool isOnBus = false;
        PropertyChanges changes = PropertyChanges();
    };

    void addInterface(QLatin1String name, bool (Modem::*isOffered)() const,
                      Properties (Modem::*known)() const, MethodHandlers furtherMethods = {});
    void addSimInfo();
    void setOnBus(Interface &interface);
    void emitChange(const Interface &interface, const QString &name, GVariant *value) const;

    bool hasSim() const { return m_isThere && m_isPowered; }
    bool hasSimInfo() const { return hasSim() && m_isExtended; }
    bool hasRegistration() const { return hasSim() && m_isOnline; }
    bool hasUsableSim() const { return hasSim() && m_sim.isUsable(); }
    QString registration() const;

    Properties simProperties() const;
    Properties simInfoProperties() const;
    Properties registrationProperties() const;
    Properties radioProperties() const;
    Properties connectionProperties() const { return m_mobileData.properties(); }
    QStringList interfaces() const;
    QStringList features() const;
    void setProperty(MethodCall &call);
    void setRadioProperty(MethodCall &call);
    void followSim();

    const std::size_t m_slot;
    const QString m_path;
    const Sim &m_sim;
    const std::function<void()> m_changed;
    bool m_isThere = true;
    bool m_isEnabled;
    bool m_isPowered;
    bool m_isOnline;
    bool m_isExtended = true;
    QString m_registration;
    const QStringList m_technologies;
    QString m_technologyPreference;
    MobileData m_mobileData;
    std::vector<Interface> m_interfaces; ///< in the order of their announcements
    Service *m_service = nullptr;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_MODEM_H
