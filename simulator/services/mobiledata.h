// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_MOBILEDATA_H
#define CORVANE_SIMULATOR_MOBILEDATA_H

#include "busconnection.h"
#include "properties.h"

#include <QtCore/QJsonArray>
#include <QtCore/QJsonObject>
#include <QtCore/QMap>
#include <QtCore/QString>

#include <functional>
#include <map>
#include <vector>

namespace Corvane
{
namespace Simulator
{

class Service;

/** An access point as the telephony daemon keeps it. */
struct ConnectionContext {
    QString name; ///< last component of its path, such as "context1"
    QMap<QString, QString> texts; ///< all properties but "Active", by name
    bool isActive = false;

    QString text(const QString &property) const { return texts.value(property); }
    /** Whether it makes a network for the connection manager: an internet one that has an access point name.
     */
    bool isForInternet() const;
    Properties properties() const;
};

/** The access points of all SIMs, in and beside the phone, by IMSI. */
class ContextStore
{
public:
    using List = std::vector<ConnectionContext>;

    /** @p sims is the profile's array of them. */
    explicit ContextStore(const QJsonArray &sims);

    /** Those of a SIM that is new are what its network tells every phone. */
    List &contexts(const QString &imsi);

private:
    std::map<QString, List> m_contexts;
};

/** Mobile data of one modem: its connection manager and the contexts of its SIM. */
class MobileData
{
public:
    /** @p changed follows what a client has changed. */
    MobileData(const QString &modemPath, ContextStore &store, std::function<void()> changed);

    // Each is to be followed by announce().
    /** The SIM that it works with; empty without one that can be used. */
    void setSim(const QString &imsi);
    /** Whether the network serves the modem, and whether it is one abroad. */
    void setServed(bool served, bool roaming);

    QString imsi() const { return m_imsi; }
    bool isAttached() const;
    /** Those of the SIM. */
    const ContextStore::List &contexts() const { return contextsOfSim(); }
    /** Activates a context of the SIM or deactivates it; throws MethodError. */
    void activate(const QString &contextName, bool isActive);

    /** Of the connection manager; so are the methods. */
    Properties properties() const;
    MethodHandlers methods();

    void attach(Service &service);
    void detach();
    /** Offers the contexts that there are now, takes back the others, and announces what has changed. */
    void announce();
    QJsonArray describe() const;

private:
    QString pathOf(const ConnectionContext &context) const;
    ContextStore::List &contextsOfSim() const;
    ConnectionContext &contextNamed(const QString &name);
    void deactivateAll();
    void offer(const ConnectionContext &context);
    void setManagerProperty(MethodCall &call);
    void setContextProperty(const QString &contextName, MethodCall &call);
    void addContext(MethodCall &call);
    void removeContext(MethodCall &call);
    void emitManagerSignal(const char *member, GVariant *arguments) const;

    const QString m_modemPath;
    ContextStore &m_store;
    const std::function<void()> m_changed;
    QString m_imsi;
    bool m_isServed = false;
    bool m_isRoaming = false;
    bool m_isRoamingAllowed = false;
    bool m_isPowered = true;
    std::map<QString, PropertyChanges> m_offered; ///< by the context's name
    Service *m_service = nullptr;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_MOBILEDATA_H
