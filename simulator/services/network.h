// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_NETWORK_H
#define CORVANE_SIMULATOR_NETWORK_H

#include "cellularlinks.h"
#include "properties.h"
#include "proxyconfiguration.h"
#include "timer.h"

#include "busconnection.h"

#include <QtCore/QJsonObject>
#include <QtCore/QString>

#include <functional>
#include <vector>

namespace Corvane
{
namespace Simulator
{

class Service;

/** What a network has carried since the last reset. */
struct DataTotals {
    guint64 receivedBytes = 0;
    guint64 sentBytes = 0;
    guint64 seconds = 0;

    /** Of all members that a report has. */
    Properties properties() const;
};

/** One network of the connection manager: a wireless one, a cable, or a context of the telephony service. */
class Network
{
public:
    /** What the networks need of the connection manager. */
    struct Surroundings {
        CellularLinks &links;
        guint stepMilliseconds; ///< how long each step of connecting takes
        std::function<void()> changed; ///< something of a network has changed
        std::function<ProxyConfiguration(const ProxyConfiguration &own)> proxyInUse;
    };

    /** A network of @p profile: a member of the profile's list. */
    Network(const QJsonObject &profile, const Surroundings &surroundings);
    /** The network of a context. */
    Network(const CellularLink &link, const Surroundings &surroundings);

    QString type() const { return m_type; }
    QString identifier() const { return m_identifier; }
    QString path() const;
    QString contextPath() const { return m_contextPath; }
    bool isInReach() const { return m_isInReach; }
    bool isSaved() const { return m_isSaved; }
    bool isConnected() const;
    bool isOnline() const;
    /** Whether it is connected, or on its way to it. */
    bool isBusy() const;
    bool isRoaming() const { return m_isRoaming; }
    /** Whether the connection manager may connect it unasked. */
    bool wantsConnection() const;
    quint8 strength() const { return m_strength; }
    DataTotals totals(bool roaming) const;
    Properties properties() const;
    QJsonObject describe() const;

    // Each of these tells the surroundings.
    void setInReach(bool isInReach);
    void setSaved() { m_isSaved = true; }
    /** The next attempt to connect ends with @p error. */
    void setFailure(const QString &error) { m_nextError = error; }
    void setProxy(const ProxyConfiguration &proxy);
    /** Connected, it is the one that traffic goes over, or not. */
    void setOnline(bool isOnline);
    /** What has become of its context. */
    void follow(const CellularLink &link);
    void connect();
    /** At once, as one that has been connected since before anybody looked. */
    void beConnected();
    /** The other side has ended the connection. */
    void lose();
    void count(guint64 receivedBytes, guint64 sentBytes);

    /** Offers the network over @p service from now on, or, when null, no more. */
    void offer(Service *service);
    bool isOffered() const { return m_service != nullptr; }
    void announce();
    /** The service stops. */
    void forget();

private:
    void setState(const QString &state);
    void step(const QString &state);
    void finishAttempt(const MethodError *error);
    void takeDown();
    void end(const QString &state);
    MethodHandlers methods();
    void setProperty(MethodCall &call);
    void clearProperty(const MethodCall &call);
    void connectFor(MethodCall &call);
    void disconnect();
    void remove();
    void resetTotals();
    void announceProxy();
    void emitChange(const QString &name, GVariant *value) const;

    const Surroundings &m_surroundings;
    const QString m_type;
    QString m_name;
    QString m_security; ///< of a wireless network
    QString m_identifier;
    QString m_contextPath; ///< of a cellular one
    quint8 m_strength = 0;
    bool m_isInReach = true;
    bool m_isSaved = false;
    bool m_isAutomatic = true; ///< AutoConnect
    bool m_isRoaming = false;
    bool m_isUnwanted = false; ///< somebody has disconnected it
    ProxyConfiguration m_proxy;
    QString m_state = QStringLiteral("idle");
    QString m_error;
    QString m_nextError;
    DataTotals m_home;
    DataTotals m_roaming;
    gint64 m_connectedSince = 0; ///< monotonic microseconds
    std::vector<MethodCall> m_waiting; ///< calls of Connect
    Timer m_timer;
    PropertyChanges m_changes;
    Service *m_service = nullptr;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_NETWORK_H
