// SPDX-License-Identifier: LGPL-2.1-or-later
#include "component.h"
#include "connman.h"
#include "datacounters.h"
#include "globalproxy.h"
#include "network.h"
#include "refusal.h"
#include "service.h"

#include <QtCore/QJsonArray>
#include <QtCore/QSet>

#include <algorithm>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String managerInterface("net.connman.Manager");
const QLatin1String technologyInterface("net.connman.Technology");
const QLatin1String offlineModeProperty("OfflineMode");
const QLatin1String poweredProperty("Powered");

/** What a kind of network is called, in the order in which the connection manager prefers them. */
struct TechnologyNames {
    QString type;
    QString name;
};
const std::vector<TechnologyNames> &technologyNames()
{
    static const std::vector<TechnologyNames> names{
        {QStringLiteral("ethernet"), QStringLiteral("Wired")},
        {QStringLiteral("wifi"), QStringLiteral("WiFi")},
        {QStringLiteral("cellular"), QStringLiteral("Cellular")},
    };
    return names;
}

std::ptrdiff_t rankOf(const QString &type)
{
    const auto &names = technologyNames();
    return std::find_if(names.begin(), names.end(), [&](const auto &each) { return each.type == type; })
        - names.begin();
}

bool isOn(const QString &word)
{
    if (word != QLatin1String("on") && word != QLatin1String("off"))
        throw Refusal(QStringLiteral("\"%1\" is neither on nor off").arg(word));
    return word == QLatin1String("on");
}

/** A number of bytes. */
guint64 numberFrom(const QString &text)
{
    bool isNumber = false;
    const guint64 number = text.toULongLong(&isNumber);
    if (!isNumber)
        throw Refusal(QStringLiteral("\"%1\" is no number of bytes").arg(text));
    return number;
}

struct Technology {
    QString type;
    QString name;
    bool isThere = true;
    bool isPowered = true;
    bool wasPowered = false; ///< before flight mode
    bool isOnBus = false;
    PropertyChanges changes = PropertyChanges();

    QString path() const { return QStringLiteral("/net/connman/technology/") + type; }
};

class ConnectionManager : public Component
{
public:
    ConnectionManager(const QJsonObject &profile, Phone &phone);
    ~ConnectionManager() override { m_links.watch(nullptr); }

    void attach(Service &service) override;
    void detach() override;
    void describe(QJsonObject &state) const override;
    std::vector<Action> actions() override;

private:
    MethodHandlers managerMethods();
    MethodHandlers technologyMethods(Technology &technology);
    Properties managerProperties() const;
    Properties technologyProperties(const Technology &technology) const;
    GVariant *listTechnologies() const;
    GVariant *listServices() const;

    Technology &technology(const QString &type);
    Network &network(const QString &identifier);
    bool isListed(const Network &network) const;
    QStringList listedPaths() const;
    QString state() const;
    void setManagerProperty(MethodCall &call);
    void setTechnologyProperty(Technology &technology, MethodCall &call);
    void setOffline(bool isOffline);
    void setPowered(Technology &technology, bool isPowered);
    void followLinks();
    void sort();
    void connectUnasked();
    /** Puts in order what depends on the networks, and makes every interface tell what has changed. */
    void update();
    void announceTechnologies();
    void announceServices();
    void emitChanges(const QString &path, const QString &interface, PropertyChanges &changes,
                     const Properties &now) const;

    QString addNetwork(const QStringList &arguments);
    QString setTechnologyThere(const QString &type, bool isThere);
    std::vector<Action> networkActions();
    std::vector<Action> counterActions();
    std::vector<Action> phoneActions();

    CellularLinks &m_links;
    GlobalProxy m_globalProxy;
    const Network::Surroundings m_surroundings;
    std::vector<Technology> m_technologies;
    DataCounters::Networks m_networks; ///< all that are known, in the connection manager's order
    DataCounters m_counters;
    QStringList m_toldPaths; ///< of the services, as they were announced
    PropertyChanges m_changes;
    bool m_isOffline;
    bool m_isUpdating = false;
    bool m_mustUpdateAgain = false;
    bool m_hasNewLinks = false;
    Service *m_service = nullptr;
};

ConnectionManager::ConnectionManager(const QJsonObject &profile, Phone &phone)
    : m_links(phone.cellularLinks)
    , m_globalProxy(profile.value(QLatin1String("globalProxy")).toObject(), [this] { update(); })
    , m_surroundings{m_links, guint(profile.value(QLatin1String("stepMilliseconds")).toInt(20)),
                     [this] { update(); },
                     [this](const ProxyConfiguration &own) {
                         return m_globalProxy.inPlaceOf(own);
                     }}
    , m_counters(m_networks)
    , m_isOffline(profile.value(QLatin1String("offlineMode")).toBool(false))
{
    const QJsonArray present = profile.value(QLatin1String("technologies")).toArray();
    const QJsonArray unpowered = profile.value(QLatin1String("unpowered")).toArray();
    for (const TechnologyNames &names : technologyNames()) {
        Technology technology;
        technology.type = names.type;
        technology.name = names.name;
        technology.isThere = present.isEmpty() || present.contains(names.type);
        technology.wasPowered = !unpowered.contains(names.type);
        technology.isPowered = technology.wasPowered && !m_isOffline;
        m_technologies.push_back(technology);
    }
    const QJsonArray services = profile.value(QLatin1String("services")).toArray();
    for (const QJsonValue &service : services)
        m_networks.push_back(std::make_unique<Network>(service.toObject(), m_surroundings));
    m_links.watch([this] {
        m_hasNewLinks = true;
        update();
    });
    // A phone that is looked at has been on for a while.
    sort();
    const auto first = std::find_if(m_networks.begin(), m_networks.end(), [this](const auto &each) {
        return isListed(*each) && each->wantsConnection();
    });
    if (first != m_networks.end())
        (*first)->beConnected();
    update();
}

void ConnectionManager::attach(Service &service)
{
    m_service = &service;
    service.addObject(ConnMan::managerPath, managerInterface, managerMethods());
    m_globalProxy.attach(service);
    m_counters.attach(service);
    m_toldPaths.clear();
    for (Technology &technology : m_technologies)
        technology.isOnBus = false;
    announceTechnologies();
    update();
    m_changes.reset(managerProperties());
}

void ConnectionManager::detach()
{
    m_service = nullptr;
    m_globalProxy.detach();
    m_counters.detach();
    // They stay where they are meanwhile.
    m_isUpdating = true;
    for (const std::unique_ptr<Network> &network : m_networks)
        network->forget();
    m_isUpdating = false;
    update();
}

MethodHandlers ConnectionManager::managerMethods()
{
    return {
        {QStringLiteral("GetProperties"),
         [this](MethodCall &call) {
             call.reply(g_variant_new("(@a{sv})", toVariant(managerProperties())));
         }},
        {QStringLiteral("SetProperty"),
         [this](MethodCall &call) {
             setManagerProperty(call);
         }},
        {QStringLiteral("GetTechnologies"),
         [this](MethodCall &call) {
             call.reply(g_variant_new("(@a(oa{sv}))", listTechnologies()));
         }},
        {QStringLiteral("GetServices"),
         [this](MethodCall &call) {
             call.reply(g_variant_new("(@a(oa{sv}))", listServices()));
         }},
        {QStringLiteral("RegisterCounter"),
         [this](MethodCall &call) {
             m_counters.add(call);
         }},
        {QStringLiteral("UnregisterCounter"),
         [this](MethodCall &call) {
             m_counters.remove(call);
         }},
    };
}

MethodHandlers ConnectionManager::technologyMethods(Technology &technology)
{
    return {
        {QStringLiteral("GetProperties"),
         [this, &technology](MethodCall &call) {
             call.reply(g_variant_new("(@a{sv})", toVariant(technologyProperties(technology))));
         }},
        {QStringLiteral("SetProperty"),
         [this, &technology](MethodCall &call) {
             setTechnologyProperty(technology, call);
         }},
        {QStringLiteral("Scan"),
         [](MethodCall &call) {
             call.reply();
         }},
    };
}

QString ConnectionManager::state() const
{
    const auto any = [this](bool (Network::*is)() const) {
        return std::any_of(m_networks.begin(), m_networks.end(),
                           [is](const auto &network) { return ((*network).*is)(); });
    };
    if (any(&Network::isOnline))
        return QStringLiteral("online");
    if (any(&Network::isConnected))
        return QStringLiteral("ready");
    return m_isOffline ? QStringLiteral("offline") : QStringLiteral("idle");
}

Properties ConnectionManager::managerProperties() const
{
    return {
        {QStringLiteral("State"), fromText(state())},
        {offlineModeProperty, fromBool(m_isOffline)},
        {QStringLiteral("SessionMode"), fromBool(false)},
    };
}

Properties ConnectionManager::technologyProperties(const Technology &technology) const
{
    const bool isConnected = std::any_of(m_networks.begin(), m_networks.end(), [&](const auto &network) {
        return network->type() == technology.type && network->isConnected();
    });
    return {
        {poweredProperty, fromBool(technology.isPowered)},
        {QStringLiteral("Connected"), fromBool(isConnected)},
        {QStringLiteral("Name"), fromText(technology.name)},
        {QStringLiteral("Type"), fromText(technology.type)},
        {QStringLiteral("Tethering"), fromBool(false)},
    };
}

GVariant *ConnectionManager::listTechnologies() const
{
    GVariantBuilder list;
    g_variant_builder_init(&list, G_VARIANT_TYPE("a(oa{sv})"));
    for (const Technology &technology : m_technologies) {
        if (technology.isThere)
            g_variant_builder_add(&list, "(o@a{sv})", technology.path().toUtf8().constData(),
                                  toVariant(technologyProperties(technology)));
    }
    return g_variant_builder_end(&list);
}

GVariant *ConnectionManager::listServices() const
{
    GVariantBuilder list;
    g_variant_builder_init(&list, G_VARIANT_TYPE("a(oa{sv})"));
    for (const std::unique_ptr<Network> &network : m_networks) {
        if (isListed(*network))
            g_variant_builder_add(&list, "(o@a{sv})", network->path().toUtf8().constData(),
                                  toVariant(network->properties()));
    }
    return g_variant_builder_end(&list);
}

Technology &ConnectionManager::technology(const QString &type)
{
    QStringList known;
    for (Technology &each : m_technologies) {
        if (each.type == type)
            return each;
        known << each.type;
    }
    throw Refusal(QStringLiteral("There is no technology \"%1\"; there are %2")
                      .arg(type, known.join(QStringLiteral(", "))));
}

Network &ConnectionManager::network(const QString &identifier)
{
    QStringList known;
    for (const std::unique_ptr<Network> &each : m_networks) {
        if (each->identifier() == identifier)
            return *each;
        known << each->identifier();
    }
    throw Refusal(QStringLiteral("There is no network \"%1\"; there are %2")
                      .arg(identifier, known.join(QStringLiteral(", "))));
}

bool ConnectionManager::isListed(const Network &network) const
{
    const auto found = std::find_if(m_technologies.begin(), m_technologies.end(),
                                    [&](const Technology &each) { return each.type == network.type(); });
    return network.isInReach() && found->isThere && found->isPowered;
}

QStringList ConnectionManager::listedPaths() const
{
    QStringList paths;
    for (const std::unique_ptr<Network> &network : m_networks) {
        if (isListed(*network))
            paths << network->path();
    }
    return paths;
}

void ConnectionManager::setManagerProperty(MethodCall &call)
{
    if (call.text(0) != offlineModeProperty)
        throw ConnMan::invalidProperty();
    const bool isOffline = ConnMan::propertyFlag(call);
    call.reply();
    setOffline(isOffline);
}

void ConnectionManager::setOffline(bool isOffline)
{
    if (isOffline == m_isOffline)
        return;
    m_isOffline = isOffline;
    for (Technology &each : m_technologies) {
        if (isOffline)
            each.wasPowered = each.isPowered;
        each.isPowered = !isOffline && each.wasPowered;
    }
    m_links.setFlightMode(isOffline);
    update();
}

void ConnectionManager::setTechnologyProperty(Technology &technology, MethodCall &call)
{
    if (call.text(0) != poweredProperty)
        throw ConnMan::invalidProperty();
    const bool isPowered = ConnMan::propertyFlag(call);
    if (isPowered == technology.isPowered) {
        throw isPowered ? ConnMan::error("AlreadyEnabled", "Already enabled")
                        : ConnMan::error("AlreadyDisabled", "Already disabled");
    }
    call.reply();
    setPowered(technology, isPowered);
}

void ConnectionManager::setPowered(Technology &technology, bool isPowered)
{
    technology.isPowered = isPowered;
    technology.wasPowered = isPowered;
    update();
}

/** Makes a network of each context, and takes back those whose context has gone. */
void ConnectionManager::followLinks()
{
    const CellularLinks::Links links = m_links.links();
    const auto linkOf = [&links](const Network &network) {
        return std::find_if(links.begin(), links.end(), [&](const CellularLink &link) {
            return link.contextPath == network.contextPath() && network.identifier().contains(link.imsi);
        });
    };
    for (const std::unique_ptr<Network> &network : m_networks) {
        if (network->contextPath().isEmpty())
            continue;
        const auto link = linkOf(*network);
        network->setInReach(link != links.end());
        if (link != links.end())
            network->follow(*link);
    }
    for (const CellularLink &link : links) {
        const bool isKnown = std::any_of(m_networks.begin(), m_networks.end(), [&](const auto &network) {
            return network->contextPath() == link.contextPath && network->identifier().contains(link.imsi);
        });
        if (!isKnown) {
            m_networks.push_back(std::make_unique<Network>(link, m_surroundings));
            m_networks.back()->follow(link);
        }
    }
}

/** Connected ones first, then by kind, those that are kept, and strength. */
void ConnectionManager::sort()
{
    const auto key = [](const std::unique_ptr<Network> &network) {
        return std::make_tuple(!network->isConnected(), rankOf(network->type()), !network->isSaved(),
                               -int(network->strength()));
    };
    std::stable_sort(m_networks.begin(), m_networks.end(),
                     [&](const auto &left, const auto &right) { return key(left) < key(right); });
}

/** Connects the best network that may be, when there is no connection and none on its way. */
void ConnectionManager::connectUnasked()
{
    for (const std::unique_ptr<Network> &network : m_networks) {
        if (isListed(*network) && network->isBusy())
            return;
    }
    const auto wanted = std::find_if(m_networks.begin(), m_networks.end(), [this](const auto &network) {
        return isListed(*network) && network->wantsConnection();
    });
    if (wanted != m_networks.end())
        (*wanted)->connect();
}

void ConnectionManager::update()
{
    // What is done here changes networks, which calls this again.
    if (std::exchange(m_isUpdating, true)) {
        m_mustUpdateAgain = true;
        return;
    }
    do {
        m_mustUpdateAgain = false;
        if (std::exchange(m_hasNewLinks, false))
            followLinks();
        for (const std::unique_ptr<Network> &network : m_networks) {
            if (!isListed(*network) && network->isBusy())
                network->lose();
        }
        if (m_service)
            connectUnasked();
        sort();
        // Traffic goes over the first one.
        for (std::size_t i = 0; i < m_networks.size(); ++i)
            m_networks[i]->setOnline(i == 0);
    } while (m_mustUpdateAgain);
    m_isUpdating = false;

    if (!m_service)
        return;
    announceTechnologies();
    announceServices();
    emitChanges(ConnMan::managerPath, managerInterface, m_changes, managerProperties());
}

void ConnectionManager::announceTechnologies()
{
    for (Technology &technology : m_technologies) {
        const Properties now = technologyProperties(technology);
        if (technology.isThere && technology.isOnBus) {
            emitChanges(technology.path(), technologyInterface, technology.changes, now);
        } else if (technology.isThere) {
            m_service->addObject(technology.path(), technologyInterface, technologyMethods(technology));
            technology.changes.reset(now);
            m_service->emitSignal(
                ConnMan::managerPath, managerInterface, QStringLiteral("TechnologyAdded"),
                g_variant_new("(o@a{sv})", technology.path().toUtf8().constData(), toVariant(now)));
        } else if (technology.isOnBus) {
            m_service->removeObject(technology.path(), technologyInterface);
            m_service->emitSignal(ConnMan::managerPath, managerInterface, QStringLiteral("TechnologyRemoved"),
                                  g_variant_new("(o)", technology.path().toUtf8().constData()));
        }
        technology.isOnBus = technology.isThere;
    }
}

void ConnectionManager::announceServices()
{
    const QStringList paths = listedPaths();
    const QStringList told = std::exchange(m_toldPaths, paths);
    GVariantBuilder services;
    g_variant_builder_init(&services, G_VARIANT_TYPE("a(oa{sv})"));
    GVariantBuilder removed;
    g_variant_builder_init(&removed, G_VARIANT_TYPE_OBJECT_PATH_ARRAY);
    for (const std::unique_ptr<Network> &network : m_networks) {
        const QString path = network->path();
        const bool isNew = !told.contains(path);
        if (paths.contains(path)) {
            if (isNew)
                network->offer(m_service);
            g_variant_builder_add(&services, "(o@a{sv})", path.toUtf8().constData(),
                                  toVariant(isNew ? network->properties() : Properties()));
        } else if (!isNew) {
            network->offer(nullptr);
            g_variant_builder_add(&removed, "o", path.toUtf8().constData());
        }
    }
    const Variant change(
        g_variant_new("(@a(oa{sv})@ao)", g_variant_builder_end(&services), g_variant_builder_end(&removed)));
    if (paths != told)
        m_service->emitSignal(ConnMan::managerPath, managerInterface, QStringLiteral("ServicesChanged"),
                              g_variant_ref(change.get()));
    for (const std::unique_ptr<Network> &network : m_networks) {
        network->announce();
        if (network->isOffered() && network->isConnected())
            m_counters.reportTraffic(*network);
    }
}

void ConnectionManager::emitChanges(const QString &path, const QString &interface, PropertyChanges &changes,
                                    const Properties &now) const
{
    changes.take(now, [&](const QString &name, GVariant *value) {
        m_service->emitSignal(path, interface, QStringLiteral("PropertyChanged"),
                              g_variant_new("(sv)", name.toUtf8().constData(), value));
    });
}

void ConnectionManager::describe(QJsonObject &state) const
{
    QJsonArray technologies;
    for (const Technology &technology : m_technologies) {
        if (technology.isThere)
            technologies << QJsonObject{{QStringLiteral("type"), technology.type},
                                        {QStringLiteral("powered"), technology.isPowered}};
    }
    QJsonArray services;
    for (const std::unique_ptr<Network> &network : m_networks)
        services << network->describe();
    state.insert(QStringLiteral("network"),
                 QJsonObject{{QStringLiteral("state"), this->state()},
                             {QStringLiteral("offlineMode"), m_isOffline},
                             {QStringLiteral("technologies"), technologies},
                             {QStringLiteral("services"), services},
                             {QStringLiteral("globalProxy"), m_globalProxy.describe()},
                             {QStringLiteral("counters"), m_counters.describe()}});
}

QString ConnectionManager::addNetwork(const QStringList &arguments)
{
    const QJsonObject profile{
        {QStringLiteral("type"), QStringLiteral("wifi")},
        {QStringLiteral("name"), arguments.at(0)},
        {QStringLiteral("security"), arguments.value(1, QStringLiteral("psk"))},
        {QStringLiteral("saved"), arguments.value(2) == QLatin1String("saved")},
    };
    auto added = std::make_unique<Network>(profile, m_surroundings);
    const QString identifier = added->identifier();
    const auto known = std::find_if(m_networks.begin(), m_networks.end(),
                                    [&](const auto &each) { return each->identifier() == identifier; });
    if (known == m_networks.end())
        m_networks.push_back(std::move(added));
    else
        (*known)->setInReach(true);
    update();
    return identifier;
}

QString ConnectionManager::setTechnologyThere(const QString &type, bool isThere)
{
    technology(type).isThere = isThere;
    update();
    return QString();
}

std::vector<Action> ConnectionManager::actions()
{
    std::vector<Action> actions = networkActions();
    for (const std::vector<Action> &others : {counterActions(), phoneActions()})
        actions.insert(actions.end(), others.begin(), others.end());
    return actions;
}

/** What happens to a network. */
std::vector<Action> ConnectionManager::networkActions()
{
    return {
        {QStringLiteral("wifi appear"), QStringLiteral("NAME [SECURITY [saved]]"),
         QStringLiteral("brings a wireless network into reach; tells its identifier"), 1, 3,
         [this](const QStringList &arguments) {
             return addNetwork(arguments);
         }},
        {QStringLiteral("connection vanish"), QStringLiteral("IDENTIFIER"),
         QStringLiteral("takes a network out of reach"), 1, 1,
         [this](const QStringList &arguments) {
             network(arguments.first()).setInReach(false);
             return QString();
         }},
        {QStringLiteral("connection return"), QStringLiteral("IDENTIFIER"),
         QStringLiteral("brings it back into reach"), 1, 1,
         [this](const QStringList &arguments) {
             network(arguments.first()).setInReach(true);
             return QString();
         }},
        {QStringLiteral("connection lose"), QStringLiteral("IDENTIFIER"),
         QStringLiteral("ends a connection from the network's side"), 1, 1,
         [this](const QStringList &arguments) {
             network(arguments.first()).lose();
             return QString();
         }},
        {QStringLiteral("connection fail"), QStringLiteral("IDENTIFIER ERROR"),
         QStringLiteral("makes the next attempt to connect fail, such as with invalid-key"), 2, 2,
         [this](const QStringList &arguments) {
             network(arguments.first()).setFailure(arguments.at(1));
             return QString();
         }},
        {QStringLiteral("connection traffic"), QStringLiteral("IDENTIFIER RECEIVED SENT"),
         QStringLiteral("lets a network carry so many bytes"), 3, 3,
         [this](const QStringList &arguments) {
             Network &carrier = network(arguments.first());
             carrier.count(numberFrom(arguments.at(1)), numberFrom(arguments.at(2)));
             m_counters.reportTraffic(carrier);
             return QString();
         }},
        {QStringLiteral("connection proxy"), QStringLiteral("IDENTIFIER ") + ProxyConfiguration::usage(),
         QStringLiteral("configures the proxy of a network, as somebody else would"), 2, 4,
         [this](const QStringList &arguments) {
             network(arguments.first()).setProxy(ProxyConfiguration(arguments.mid(1)));
             return QString();
         }},
    };
}

/** What happens to the counters of clients. */
std::vector<Action> ConnectionManager::counterActions()
{
    return {
        {QStringLiteral("counter usage"), QStringLiteral("PATH HOME ROAMING"),
         QStringLiteral("sends all counters a report as it is given, with dictionaries such as "
                        "{'RX.Bytes': <uint64 100>}"),
         3, 3,
         [this](const QStringList &arguments) {
             m_counters.sendUsage(arguments.at(0), arguments.at(1), arguments.at(2));
             return QString();
         }},
        {QStringLiteral("counter release"), QString(),
         QStringLiteral("tells all counters that they are not registered any more"), 0, 0,
         [this](const QStringList &) {
             m_counters.releaseAll();
             return QString();
         }},
    };
}

/** What happens to the phone. */
std::vector<Action> ConnectionManager::phoneActions()
{
    return {
        {QStringLiteral("flight-mode"), QStringLiteral("on|off"), QStringLiteral("switches all radios"), 1, 1,
         [this](const QStringList &arguments) {
             setOffline(isOn(arguments.first()));
             return QString();
         }},
        {QStringLiteral("technology power"), QStringLiteral("TYPE on|off"),
         QStringLiteral("switches wifi, cellular or ethernet"), 2, 2,
         [this](const QStringList &arguments) {
             setPowered(technology(arguments.first()), isOn(arguments.at(1)));
             return QString();
         }},
        {QStringLiteral("technology remove"), QStringLiteral("TYPE"),
         QStringLiteral("takes a technology out of the phone"), 1, 1,
         [this](const QStringList &arguments) {
             return setTechnologyThere(arguments.first(), false);
         }},
        {QStringLiteral("technology add"), QStringLiteral("TYPE"), QStringLiteral("brings it back"), 1, 1,
         [this](const QStringList &arguments) {
             return setTechnologyThere(arguments.first(), true);
         }},
        {QStringLiteral("proxy active"), QStringLiteral("on|off"),
         QStringLiteral("whether the global proxy is used in place of those of the networks"), 1, 1,
         [this](const QStringList &arguments) {
             m_globalProxy.setActive(isOn(arguments.first()));
             return QString();
         }},
        {QStringLiteral("proxy configure"), ProxyConfiguration::usage(),
         QStringLiteral("configures the global proxy, as somebody else would"), 1, 3,
         [this](const QStringList &arguments) {
             m_globalProxy.setConfiguration(ProxyConfiguration(arguments));
             return QString();
         }},
    };
}

QString problemOf(const QJsonObject &profile)
{
    QSet<QString> seen;
    const QJsonArray services
        = profile.value(QLatin1String("network")).toObject().value(QLatin1String("services")).toArray();
    for (int i = 0; i < services.size(); ++i) {
        const QJsonObject service = services.at(i).toObject();
        const bool isCable = service.value(QLatin1String("type")) == QLatin1String("ethernet");
        const QString name = isCable ? QString() : service.value(QLatin1String("name")).toString();
        if (!isCable && name.isEmpty())
            return QStringLiteral("/network/services/%1/name: a wireless network needs one").arg(i);
        const QString key = name + QLatin1Char('\n')
            + service.value(QLatin1String("security")).toString(QStringLiteral("psk"));
        if (seen.contains(isCable ? QString() : key)) {
            return isCable
                ? QStringLiteral("/network/services/%1: a phone has one cable").arg(i)
                : QStringLiteral("/network/services/%1/name: there is %2 already").arg(i).arg(name);
        }
        seen.insert(isCable ? QString() : key);
    }
    return QString();
}

const ComponentRegistration registration({
    ConnMan::serviceName,
    [](const QJsonObject &profile, Phone &phone) {
        return std::make_unique<ConnectionManager>(profile.value(QLatin1String("network")).toObject(), phone);
    },
    problemOf,
});

} // namespace

} // namespace Simulator
} // namespace Corvane
