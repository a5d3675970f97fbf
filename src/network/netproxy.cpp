// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/netproxy.h>

#include "netproxy_p.h"
#include "netproxyglobal_p.h"
#include "netproxyservice_p.h"

#include <connman/networkmanager.h>
#include <connman/networkservice.h>
#include <connman/networktechnology.h>

#include <QtCore/QDebug>
#include <QtCore/QPointer>
#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusPendingReply>

#include <algorithm>
#include <optional>

namespace Corvane
{
namespace Mdm
{

namespace
{

const QLatin1String GlobalIdentifier("global");
const QLatin1String ServicePathPrefix("/net/connman/service/");

const QLatin1String ActiveProperty("Active");
const QLatin1String ConfigurationProperty("Configuration");

/** A dictionary as it comes from the bus; empty for anything else. */
std::optional<QVariantMap> toDictionary(const QVariant &value)
{
    if (value.userType() != qMetaTypeId<QDBusArgument>())
        return std::nullopt;
    const auto argument = value.value<QDBusArgument>();
    if (argument.currentSignature() != QLatin1String("a{sv}"))
        return std::nullopt;
    return qdbus_cast<QVariantMap>(argument);
}

} // namespace

NetProxyPrivate::NetProxyPrivate(NetProxy *netProxy)
    : q(netProxy)
{
    service = new NetProxyService(q, this);
    global = new NetProxyGlobal(q, this);
}

NetProxyPrivate::~NetProxyPrivate()
{
    delete global;
    delete service;
}

QString NetProxyPrivate::pathToIdentifier(const QString &path)
{
    return path.mid(path.lastIndexOf(QLatin1Char('/')) + 1);
}

QString NetProxyPrivate::identifierToPath(const QString &identifier)
{
    return ServicePathPrefix + identifier;
}

void NetProxyPrivate::setValidService(bool isValid)
{
    setFlag(&validService, isValid);
}

void NetProxyPrivate::setValidGlobalActive(bool isValid)
{
    setFlag(&validGlobalActive, isValid);
}

void NetProxyPrivate::setValidGlobalConfig(bool isValid)
{
    setFlag(&validGlobalConfig, isValid);
}

void NetProxyPrivate::setFlag(bool *flag, bool isValid)
{
    if (*flag == isValid)
        return;
    *flag = isValid;
    setValid(validService && validGlobalActive && validGlobalConfig);
}

void NetProxyPrivate::setValid(bool isValid)
{
    if (valid == isValid)
        return;
    valid = isValid;
    if (valid && !current)
        selectGlobalProxy();
    Q_EMIT q->validChanged(valid);
}

bool NetProxyPrivate::selectProxy(const QString &identifier)
{
    if (identifier.isEmpty()) {
        unselectProxy();
        return true;
    }
    if (identifier == GlobalIdentifier) {
        selectGlobalProxy();
        return true;
    }
    return selectServiceProxy(identifier);
}

bool NetProxyPrivate::selectServiceProxy(const QString &identifier)
{
    serviceConfigReady = false;
    unselectProxy();
    if (!service->manager || !valid)
        return false;

    const QString path = identifierToPath(identifier);
    const QVector<NetworkService *> saved = service->manager->getSavedServices(QString());
    const auto found = std::find_if(saved.begin(), saved.end(),
                                    [&path](const NetworkService *each) { return each->path() == path; });
    if (found == saved.end())
        return false;

    service->service = *found;
    service->applyConfiguration(service->service->proxyConfig());
    connect(service->service, &QObject::destroyed, this, &NetProxyPrivate::serviceDestroyed);
    connect(service->service, &NetworkService::propertiesReady, this,
            &NetProxyPrivate::servicePropertiesReady, Qt::DirectConnection);
    connect(service->service, &NetworkService::proxyConfigChanged, this,
            &NetProxyPrivate::propagateProxyConfigChanged, Qt::DirectConnection);
    if (!service->service->name().isEmpty())
        serviceConfigReady = true;
    selection = SelectedService;
    current = service;
    return true;
}

void NetProxyPrivate::selectGlobalProxy()
{
    unselectProxy();
    selection = SelectedGlobal;
    current = global;
}

void NetProxyPrivate::unselectProxy()
{
    selection = SelectedNone;
    current = nullptr;
    if (!service->service)
        return;
    disconnect(service->service, nullptr, this, nullptr);
    service->service = nullptr;
}

void NetProxyPrivate::announce(const NetProxyInterface &changed, quint32 changes)
{
    // Copies: a receiver of the first signal may change or delete everything.
    const NetProxyInterface::ProxyLocalMirror now = changed.mirror;
    const QPointer<NetProxy> alive(q);
    Q_EMIT alive->proxyConfigChanged();
    if (alive && changes & ChangeType)
        Q_EMIT alive->typeChanged(now.type);
    if (alive && changes & ChangeServers)
        Q_EMIT alive->manualProxiesChanged(QUrl::fromStringList(now.servers));
    // None for ChangeExcludes alone: the exclusions are announced with the servers.
    if (alive && changes & ChangeServers)
        Q_EMIT alive->manualExclusionsChanged(now.excludes);
    if (alive && changes & ChangeUrl)
        Q_EMIT alive->automaticUrlChanged(QUrl(now.url));
}

void NetProxyPrivate::servicePropertiesReady()
{
    service->applyConfiguration(service->service->proxyConfig());
    serviceConfigReady = true;
}

void NetProxyPrivate::propagateProxyConfigChanged()
{
    const quint32 changes = service->applyConfiguration(service->service->proxyConfig());
    if (serviceConfigReady && changes)
        announce(*service, changes);
}

void NetProxyPrivate::serviceDestroyed()
{
    service->service = nullptr;
    setValidService(false);
}

void NetProxyPrivate::onGetPropertyFinishedActive(QDBusPendingCallWatcher *watcher)
{
    const QDBusPendingReply<QDBusVariant> reply = *watcher;
    watcher->deleteLater();
    if (reply.isError()) {
        qDebug() << "MDM Proxy: error: " << reply.error();
        return;
    }
    const QVariant value = reply.value().variant();
    bool isRead = false;
    if (value.userType() == QMetaType::Bool)
        isRead = global->applyActive(value.toBool());
    else
        qDebug() << "MDM Proxy: incorrect return type for Action query";
    setValidGlobalActive(isRead);
}

void NetProxyPrivate::onGetPropertyFinishedConfiguration(QDBusPendingCallWatcher *watcher)
{
    const QDBusPendingReply<QDBusVariant> reply = *watcher;
    watcher->deleteLater();
    if (reply.isError()) {
        qDebug() << "MDM Proxy: global proxy proxy error: " << reply.error();
        return;
    }
    const QVariant value = reply.value().variant();
    const auto configuration = toDictionary(value);
    if (configuration)
        global->applyConfiguration(*configuration);
    else
        qDebug() << "MDM Proxy: incorrect type: " << value.typeName();
    setValidGlobalConfig(configuration.has_value());
}

void NetProxyPrivate::onPropertyChanged(const QString &name, const QDBusVariant &value)
{
    if (name == ActiveProperty)
        activeChanged(value.variant().toBool());
    else if (name == ConfigurationProperty)
        configurationChanged(value.variant());
    else
        qDebug() << "MDM Proxy: property change: unknown property";
}

void NetProxyPrivate::activeChanged(bool isActive)
{
    const QPointer<NetProxyPrivate> alive(this);
    global->applyActive(isActive);
    Q_EMIT q->activeTypeChanged(isActive ? NetProxy::Global : NetProxy::Service);
    if (alive && selection == SelectedGlobal)
        Q_EMIT q->proxyConfigChanged();
    if (alive)
        setValidGlobalActive(true);
}

void NetProxyPrivate::configurationChanged(const QVariant &value)
{
    const QPointer<NetProxyPrivate> alive(this);
    const auto configuration = toDictionary(value);
    if (!configuration) {
        setValidGlobalConfig(false);
        qDebug() << "MDM Proxy: property change: incorrect type: " << value.typeName();
        return;
    }
    const quint32 changes = global->applyConfiguration(*configuration);
    if (changes && selection == SelectedGlobal)
        announce(*global, changes);
    if (alive)
        setValidGlobalConfig(true);
}

NetProxy::NetProxy(QObject *parent)
    : QObject(parent)
    , d(new NetProxyPrivate(this))
{
    qRegisterMetaType<QList<QUrl>>();
    // The signals are declared with short spellings; connections by name and queued ones look them up.
    qRegisterMetaType<ProxyType>("ProxyType");
    qRegisterMetaType<ActiveType>("ActiveType");
}

NetProxy::~NetProxy()
{
    delete d;
}

bool NetProxy::isValid() const
{
    return d->valid;
}

NetProxy::ProxyType NetProxy::type() const
{
    return d->current ? d->current->getType() : Invalid;
}

bool NetProxy::setType(ProxyType type)
{
    return d->current && d->current->setType(type);
}

QList<QUrl> NetProxy::manualProxies() const
{
    return d->current ? d->current->getManualProxies() : QList<QUrl>();
}

bool NetProxy::setManualProxies(const QList<QUrl> &proxies)
{
    return d->current && d->current->setManualProxies(proxies);
}

QStringList NetProxy::manualExclusions() const
{
    return d->current ? d->current->getManualExclusions() : QStringList();
}

bool NetProxy::setManualExclusions(const QStringList &exclusions)
{
    return d->current && d->current->setManualExclusions(exclusions);
}

QUrl NetProxy::automaticUrl() const
{
    return d->current ? d->current->getAutomaticUrl() : QUrl();
}

bool NetProxy::setAutomaticUrl(const QUrl &url)
{
    return d->current && d->current->setAutomaticUrl(url);
}

NetProxy::ActiveType NetProxy::activeType() const
{
    return d->global->active ? Global : Service;
}

bool NetProxy::setActiveType(ActiveType type)
{
    return d->global->setActive(type == Global);
}

bool NetProxy::selectProxy(const QString &identifier)
{
    return d->selectProxy(identifier);
}

QString NetProxy::getIdentifier() const
{
    return d->current ? d->current->getIdentifier() : QString();
}

QString NetProxy::getName() const
{
    return d->current ? d->current->getName() : QString();
}

QStringList NetProxy::getIdentifiers(const QString &technology) const
{
    QStringList identifiers;
    if (d->service->manager) {
        const QVector<NetworkService *> saved = d->service->manager->getSavedServices(technology);
        for (const NetworkService *each : saved)
            identifiers.append(NetProxyPrivate::pathToIdentifier(each->path()));
    }
    if (technology.isEmpty() || technology == GlobalIdentifier)
        identifiers.append(GlobalIdentifier);
    return identifiers;
}

QStringList NetProxy::getTechnologies() const
{
    QStringList names;
    if (d->service->manager) {
        const QVector<NetworkTechnology *> technologies = d->service->manager->getTechnologies();
        for (const NetworkTechnology *each : technologies)
            names.append(each->name());
    }
    names.append(GlobalIdentifier);
    return names;
}

} // namespace Mdm
} // namespace Corvane
