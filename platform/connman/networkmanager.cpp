// SPDX-License-Identifier: LGPL-2.1-or-later
#include "networkmanager_p.h"

#include "networkservice_p.h"
#include "networktechnology_p.h"

#include <QtCore/QDebug>
#include <QtCore/QHash>
#include <QtCore/QSet>
#include <QtCore/QThreadStorage>

#include <algorithm>

namespace
{

const QLatin1String serviceName("net.connman");
const QLatin1String managerPath("/");
const QLatin1String managerInterface("net.connman.Manager");
const QLatin1String serviceInterface("net.connman.Service");
const QLatin1String technologyInterface("net.connman.Technology");

const QLatin1String getPropertiesMethod("GetProperties");
const QLatin1String setPropertyMethod("SetProperty");
const QLatin1String getTechnologiesMethod("GetTechnologies");
const QLatin1String getServicesMethod("GetServices");
const QLatin1String changedServicesSignature("a(oa{sv})ao");
const QLatin1String offlineModeProperty("OfflineMode");

using PropertiesReply = QDBusPendingReply<QVariantMap>;
using AnyReply = QDBusPendingReply<>;

/** The object at @p path; null when there is none. */
template <typename Object> Object *objectAt(const QVector<Object *> &objects, const QString &path)
{
    const auto found
        = std::find_if(objects.begin(), objects.end(), [&](Object *each) { return each->path() == path; });
    return found == objects.end() ? nullptr : *found;
}

} // namespace

NetworkManager::Private::Private(NetworkManager *manager)
    : QObject(manager)
    , q(manager)
    , m_manager(serviceName, managerPath, managerInterface, this)
    , m_services(serviceName, QString(), serviceInterface, this)
    , m_technologies(serviceName, QString(), technologyInterface, this)
{
    m_manager.follow("PropertyChanged", this, SLOT(managerPropertyChanged(QString, QDBusVariant)));
    m_manager.follow("TechnologyAdded", this, SLOT(technologyAdded(QDBusObjectPath, QVariantMap)));
    m_manager.follow("TechnologyRemoved", this, SLOT(technologyRemoved(QDBusObjectPath)));
    m_manager.follow("ServicesChanged", this, SLOT(servicesChanged(QDBusMessage)));
    m_services.follow("PropertyChanged", this,
                      SLOT(servicePropertyChanged(QString, QDBusVariant, QDBusMessage)));
    m_technologies.follow("PropertyChanged", this,
                          SLOT(technologyPropertyChanged(QString, QDBusVariant, QDBusMessage)));
    connect(&m_manager, &ServiceObject::serviceAppeared, this, &Private::takeUp);
    connect(&m_manager, &ServiceObject::serviceLeft, this, &Private::leave);

    ServiceOwner::of(serviceName)->waitUntilKnown();
    // The manager last: its questions are asked when all signals are connected.
    m_services.start();
    m_technologies.start();
    m_manager.start();
}

void NetworkManager::Private::takeUp()
{
    isAvailable = true;
    Q_EMIT q->availabilityChanged(true);

    m_unanswered = 3;
    m_manager.call<PropertiesReply>(getPropertiesMethod, [this](const PropertiesReply &reply) {
        if (!reply.isError())
            setOfflineMode(reply.value().value(offlineModeProperty).toBool());
        answered(!reply.isError(), getPropertiesMethod);
    });
    m_manager.call<AnyReply>(getTechnologiesMethod, [this](const AnyReply &reply) {
        const auto listed = listedObjects(reply.reply());
        if (listed) {
            m_hasTechnologies = true;
            signalAll(arrange(&technologies, *listed, [](const QString &) { return true; }));
        }
        answered(listed.has_value(), getTechnologiesMethod);
    });
    m_manager.call<AnyReply>(getServicesMethod, [this](const AnyReply &reply) {
        const auto listed = listedObjects(reply.reply());
        if (listed) {
            m_hasServices = true;
            listServices(*listed, [](const QString &) { return true; });
        }
        answered(listed.has_value(), getServicesMethod);
    });
}

void NetworkManager::Private::answered(bool isUsable, QLatin1String method)
{
    if (!isUsable) {
        // Without one of the answers the manager never is valid.
        qWarning() << "The connection manager gave no answer to" << method;
        return;
    }
    if (--m_unanswered > 0)
        return;
    isValid = true;
    if (!listedTechnologies().isEmpty())
        Q_EMIT q->technologiesChanged();
    Q_EMIT q->validChanged(true);
}

void NetworkManager::Private::leave()
{
    const bool hadTechnologies = !listedTechnologies().isEmpty();
    const bool wasValid = std::exchange(isValid, false);
    isAvailable = false;
    m_hasServices = false;
    m_hasTechnologies = false;
    if (hadTechnologies)
        Q_EMIT q->technologiesChanged();
    if (wasValid)
        Q_EMIT q->validChanged(false);
    Q_EMIT q->availabilityChanged(false);
}

NetworkService *NetworkManager::Private::make(const QString &path, const NetworkService *)
{
    auto *service = new NetworkService(q);
    service->d->manager = q;
    service->d->path = path;
    return service;
}

NetworkTechnology *NetworkManager::Private::make(const QString &path, const NetworkTechnology *)
{
    auto *technology = new NetworkTechnology(path, q);
    technology->d->manager = q;
    return technology;
}

/** Brings @p objects into the order of @p listed, with what is new and without those that are gone; returns
 * what there is to signal. */
template <typename Object, typename IsGone>
NetworkManager::Private::Changes<Object> NetworkManager::Private::arrange(QVector<Object *> *objects,
                                                                          const QVector<ListedObject> &listed,
                                                                          IsGone isGone)
{
    QHash<QString, Object *> known;
    for (Object *object : qAsConst(*objects))
        known.insert(object->path(), object);

    Changes<Object> changes;
    QVector<Object *> now;
    QSet<QString> seen;
    for (const ListedObject &each : listed) {
        if (seen.contains(each.path))
            continue;
        seen.insert(each.path);
        Object *object = known.value(each.path);
        if (!object)
            object = make(each.path, static_cast<Object *>(nullptr));
        now.append(object);
        changes.append({object, object->d->set(each.properties)});
    }
    for (Object *object : qAsConst(*objects)) {
        if (seen.contains(object->path()))
            continue;
        if (isGone(object->path()))
            object->deleteLater();
        else
            now.append(object);
    }
    *objects = now;
    return changes;
}

template <typename Object> void NetworkManager::Private::signalAll(const Changes<Object> &changes)
{
    for (const auto &[object, change] : changes) {
        if (object)
            object->d->signal(change);
    }
}

template <typename IsGone>
void NetworkManager::Private::listServices(const QVector<ListedObject> &listed, IsGone isGone)
{
    Changes<NetworkService> changes = arrange(&services, listed, isGone);
    for (NetworkService *follower : qAsConst(m_followers)) {
        const auto found = std::find_if(listed.begin(), listed.end(), [&](const ListedObject &each) {
            return each.path == follower->path();
        });
        if (found != listed.end())
            changes.append({follower, follower->d->set(found->properties)});
    }
    for (const NetworkService *service : qAsConst(services)) {
        if (!service->d->isLoaded)
            load(service->path());
    }
    signalAll(changes);
}

/** Asks for what the list has left out. */
void NetworkManager::Private::load(const QString &path)
{
    m_services.callAt<PropertiesReply>(
        path, getPropertiesMethod, {}, [this, path](const PropertiesReply &reply) {
            if (reply.isError())
                return; // it has gone meanwhile
            Changes<NetworkService> changes;
            const QVector<NetworkService *> loaded = servicesAt(path);
            for (NetworkService *service : loaded)
                changes.append({service, service->d->set(reply.value()) | service->d->setLoaded()});
            signalAll(changes);
        });
}

/** The listed one and those that follow the same path. */
QVector<NetworkService *> NetworkManager::Private::servicesAt(const QString &path) const
{
    QVector<NetworkService *> found;
    if (NetworkService *listed = objectAt(services, path))
        found.append(listed);
    for (NetworkService *follower : m_followers) {
        if (follower->path() == path)
            found.append(follower);
    }
    return found;
}

void NetworkManager::Private::follow(NetworkService *service, const QString &path)
{
    auto &state = *service->d;
    state.path = path;
    state.name.clear();
    state.type.clear();
    state.saved = false;
    state.proxyConfig.clear();
    state.isLoaded = false;
    if (!m_followers.contains(service))
        m_followers.append(service);

    const NetworkService *listed = objectAt(services, path);
    if (!listed || !listed->d->isLoaded)
        return;
    state.name = listed->name();
    state.type = listed->type();
    state.saved = listed->saved();
    state.proxyConfig = listed->proxyConfig();
    state.signal(state.setLoaded() | NetworkService::Private::ProxyConfig);
}

void NetworkManager::Private::removeFollower(NetworkService *service)
{
    m_followers.removeOne(service);
}

void NetworkManager::Private::managerPropertyChanged(const QString &name, const QDBusVariant &value)
{
    if (name == offlineModeProperty)
        setOfflineMode(value.variant().toBool());
}

void NetworkManager::Private::setOfflineMode(bool isOffline)
{
    if (std::exchange(offlineMode, isOffline) != isOffline)
        Q_EMIT q->offlineModeChanged(isOffline);
}

void NetworkManager::Private::technologyAdded(const QDBusObjectPath &path, const QVariantMap &properties)
{
    // What comes before the answer to GetTechnologies is in that answer.
    if (!m_hasTechnologies)
        return;
    NetworkTechnology *technology = objectAt(technologies, path.path());
    if (technology) {
        technology->d->signal(technology->d->set(properties));
        return;
    }
    technology = make(path.path(), technology);
    technology->d->set(properties);
    technologies.append(technology);
    tellOfTechnologies();
}

void NetworkManager::Private::technologyRemoved(const QDBusObjectPath &path)
{
    NetworkTechnology *technology = m_hasTechnologies ? objectAt(technologies, path.path()) : nullptr;
    if (!technology)
        return;
    technologies.removeOne(technology);
    technology->deleteLater();
    tellOfTechnologies();
}

void NetworkManager::Private::tellOfTechnologies()
{
    if (isValid && technologiesEnabled)
        Q_EMIT q->technologiesChanged();
}

void NetworkManager::Private::technologyPropertyChanged(const QString &name, const QDBusVariant &value,
                                                        const QDBusMessage &message)
{
    NetworkTechnology *technology = objectAt(technologies, message.path());
    if (technology)
        technology->d->signal(technology->d->set({{name, value.variant()}}));
}

void NetworkManager::Private::servicesChanged(const QDBusMessage &message)
{
    const auto listed = listedObjects(message);
    if (!m_hasServices || message.signature() != changedServicesSignature || !listed)
        return;
    QSet<QString> removed;
    const auto paths = qdbus_cast<QList<QDBusObjectPath>>(message.arguments().at(1));
    for (const QDBusObjectPath &path : paths)
        removed.insert(path.path());
    listServices(*listed, [&removed](const QString &path) { return removed.contains(path); });
}

void NetworkManager::Private::servicePropertyChanged(const QString &name, const QDBusVariant &value,
                                                     const QDBusMessage &message)
{
    Changes<NetworkService> changes;
    const QVector<NetworkService *> changed = servicesAt(message.path());
    for (NetworkService *service : changed)
        changes.append({service, service->d->setAnnounced({{name, value.variant()}})});
    signalAll(changes);
}

QVector<NetworkTechnology *> NetworkManager::Private::listedTechnologies() const
{
    return isValid && technologiesEnabled ? technologies : QVector<NetworkTechnology *>();
}

void NetworkManager::Private::setTechnologiesEnabled(bool enabled)
{
    if (std::exchange(technologiesEnabled, enabled) == enabled)
        return;
    Q_EMIT q->technologiesEnabledChanged(enabled);
    if (isValid && !technologies.isEmpty())
        Q_EMIT q->technologiesChanged();
}

void NetworkManager::Private::requestOfManager(QLatin1String method, const QVariantList &arguments)
{
    request(&m_manager, managerPath, method, arguments);
}

void NetworkManager::Private::requestOfService(const QString &path, QLatin1String method,
                                               const QVariantList &arguments)
{
    request(&m_services, path, method, arguments);
}

void NetworkManager::Private::requestOfTechnology(const QString &path, QLatin1String method,
                                                  const QVariantList &arguments)
{
    request(&m_technologies, path, method, arguments);
}

void NetworkManager::Private::request(ServiceObject *object, const QString &path, QLatin1String method,
                                      const QVariantList &arguments)
{
    if (!object->isServiceThere()) {
        qWarning() << "The connection manager is away:" << method << "of" << path;
        return;
    }
    object->callAt<AnyReply>(path, method, arguments, [path, method](const AnyReply &reply) {
        if (reply.isError())
            qWarning() << "The connection manager refused" << method << "of" << path << reply.error();
    });
}

NetworkManager *NetworkManagerFactory::createInstance()
{
    // Of the thread: it goes with the thread, or with the application's object for the main one.
    static QThreadStorage<NetworkManager *> instances;
    if (!instances.hasLocalData())
        instances.setLocalData(new NetworkManager);
    return instances.localData();
}

NetworkManager::NetworkManager()
    : d(new Private(this))
{
}

NetworkManager::~NetworkManager() = default;

bool NetworkManager::isAvailable() const
{
    return d->isAvailable;
}

bool NetworkManager::isValid() const
{
    return d->isValid;
}

bool NetworkManager::offlineMode() const
{
    return d->offlineMode;
}

void NetworkManager::setOfflineMode(bool offlineMode)
{
    d->requestOfManager(setPropertyMethod,
                        {QString(offlineModeProperty), QVariant::fromValue(QDBusVariant(offlineMode))});
}

QVector<NetworkTechnology *> NetworkManager::getTechnologies() const
{
    return d->listedTechnologies();
}

NetworkTechnology *NetworkManager::getTechnology(const QString &type) const
{
    const QVector<NetworkTechnology *> technologies = d->listedTechnologies();
    const auto found = std::find_if(technologies.begin(), technologies.end(),
                                    [&](const auto *technology) { return technology->type() == type; });
    return found == technologies.end() ? nullptr : *found;
}

bool NetworkManager::technologiesEnabled() const
{
    return d->technologiesEnabled;
}

void NetworkManager::setTechnologiesEnabled(bool enabled)
{
    d->setTechnologiesEnabled(enabled);
}

QVector<NetworkService *> NetworkManager::getSavedServices(const QString &technology) const
{
    QVector<NetworkService *> saved;
    if (!d->isValid)
        return saved;
    QString type = technology;
    for (const NetworkTechnology *each : qAsConst(d->technologies)) {
        if (each->name() == technology)
            type = each->type();
    }
    for (NetworkService *service : qAsConst(d->services)) {
        if (service->saved() && (type.isEmpty() || service->type() == type))
            saved.append(service);
    }
    return saved;
}

void NetworkManager::registerCounter(const QString &path, quint32 accuracy, quint32 period)
{
    d->requestOfManager(QLatin1String("RegisterCounter"),
                        {QVariant::fromValue(QDBusObjectPath(path)), accuracy, period});
}

void NetworkManager::unregisterCounter(const QString &path)
{
    d->requestOfManager(QLatin1String("UnregisterCounter"), {QVariant::fromValue(QDBusObjectPath(path))});
}
