// SPDX-License-Identifier: LGPL-2.1-or-later
#include "networkservice_p.h"

#include "networkmanager_p.h"

#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusVariant>

#include <utility>

namespace
{

const QLatin1String nameProperty("Name");
const QLatin1String typeProperty("Type");
const QLatin1String favoriteProperty("Favorite");
const QLatin1String proxyProperty("Proxy.Configuration");

/** A dictionary within a dictionary arrives unread; anything else is an empty one. */
QVariantMap toMap(const QVariant &value)
{
    if (value.userType() != qMetaTypeId<QDBusArgument>())
        return value.toMap();
    const auto argument = value.value<QDBusArgument>();
    return argument.currentSignature() == QLatin1String("a{sv}") ? qdbus_cast<QVariantMap>(argument)
                                                                 : QVariantMap();
}

} // namespace

NetworkService::Private::Changes NetworkService::Private::set(const QVariantMap &properties)
{
    Changes changes;
    name = properties.value(nameProperty, name).toString();
    type = properties.value(typeProperty, type).toString();
    saved = properties.value(favoriteProperty, saved).toBool();
    if (properties.contains(proxyProperty)) {
        const QVariantMap told = toMap(properties.value(proxyProperty));
        if (std::exchange(proxyConfig, told) != told)
            changes |= ProxyConfig;
    }
    if (!name.isEmpty())
        changes |= setLoaded();
    return changes;
}

NetworkService::Private::Changes NetworkService::Private::setAnnounced(const QVariantMap &properties)
{
    const Changes changes = set(properties);
    return properties.contains(proxyProperty) ? changes | ProxyConfig : changes;
}

NetworkService::Private::Changes NetworkService::Private::setLoaded()
{
    return std::exchange(isLoaded, true) ? Changes() : Changes(Ready);
}

void NetworkService::Private::signal(Changes changes)
{
    const QPointer<NetworkService> alive(q);
    if (changes.testFlag(ProxyConfig))
        Q_EMIT q->proxyConfigChanged(proxyConfig);
    if (alive && changes.testFlag(Ready))
        Q_EMIT q->propertiesReady();
}

NetworkService::NetworkService(QObject *parent)
    : QObject(parent)
    , d(new Private(this))
{
}

NetworkService::~NetworkService()
{
    if (d->manager)
        d->manager->d->removeFollower(this);
    delete d;
}

QString NetworkService::path() const
{
    return d->path;
}

void NetworkService::setPath(const QString &path)
{
    if (path == d->path)
        return;
    if (!d->manager)
        d->manager = NetworkManagerFactory::createInstance();
    d->manager->d->follow(this, path);
}

QString NetworkService::name() const
{
    return d->name;
}

QString NetworkService::type() const
{
    return d->type;
}

bool NetworkService::saved() const
{
    return d->saved;
}

QVariantMap NetworkService::proxyConfig() const
{
    return d->proxyConfig;
}

void NetworkService::setProxyConfig(const QVariantMap &configuration)
{
    if (d->manager) {
        d->manager->d->requestOfService(
            d->path, QLatin1String("SetProperty"),
            {QString(proxyProperty), QVariant::fromValue(QDBusVariant(configuration))});
    }
}

void NetworkService::resetCounters()
{
    if (d->manager)
        d->manager->d->requestOfService(d->path, QLatin1String("ResetCounters"), {});
}
