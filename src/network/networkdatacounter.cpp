// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/networkdatacounter.h>

#include "networkdatacounter_p.h"

#include <connman/networkmanager.h>
#include <connman/networkservice.h>

#include <QtCore/QDebug>
#include <QtCore/QRandomGenerator>
#include <QtDBus/QDBusConnection>

#include <limits>

namespace Corvane
{
namespace Mdm
{

namespace
{

const QLatin1String ServicePathPrefix("/net/connman/service/");
const QLatin1String ObjectPathPrefix("/org/veldmobile/systemsettings/NetworkDataCounter_");

const QLatin1String CellularPrefix("cellular_");
const QLatin1String WifiPrefix("wifi_");

const QLatin1String SentKey("TX.Bytes");
const QLatin1String ReceivedKey("RX.Bytes");
const QLatin1String TimeKey("Time");

/** 0 for what is no unsigned number. Connection managers differ in how many bits they send. */
quint64 numberAt(const QVariantMap &usage, QLatin1String key)
{
    const QVariant value = usage.value(key);
    switch (value.userType()) {
    case QMetaType::UChar:
    case QMetaType::UShort:
    case QMetaType::UInt:
    case QMetaType::ULongLong:
        return value.toULongLong();
    default:
        return 0;
    }
}

} // namespace

NetworkDataCounterPrivate::NetworkDataCounterPrivate(NetworkDataCounter *counter)
    : q(counter)
    , manager(NetworkManagerFactory::createInstance())
    , path(ObjectPathPrefix
           + QString::number(QRandomGenerator::global()->bounded(std::numeric_limits<int>::max())))
{
    new NetworkDataCounterAdaptor(this);
    if (!QDBusConnection::systemBus().registerObject(path, this, QDBusConnection::ExportAdaptors))
        qWarning() << "Could not register dbus object on path:" << path;
    connect(manager.data(), &NetworkManager::availabilityChanged, this,
            &NetworkDataCounterPrivate::networkManagerAvailableChanged);
}

NetworkDataCounterPrivate::~NetworkDataCounterPrivate()
{
    if (active && manager)
        manager->unregisterCounter(path);
}

void NetworkDataCounterPrivate::networkManagerAvailableChanged()
{
    updateRegistration();
}

void NetworkDataCounterPrivate::updateRegistration()
{
    if (!manager || !manager->isAvailable()) {
        registered = false;
        if (active) {
            active = false;
            Q_EMIT q->activeChanged();
        }
    } else if (!active && registered) {
        registered = false;
        manager->unregisterCounter(path);
    } else if (active && !registered) {
        registered = true;
        manager->registerCounter(path, quint32(updateAccuracy), quint32(updateInterval));
    }
}

void NetworkDataCounterPrivate::setActive(bool isActive)
{
    if (isActive == active)
        return;
    active = isActive;
    const QPointer<NetworkDataCounterPrivate> alive(this);
    updateRegistration();
    if (alive)
        Q_EMIT q->activeChanged();
}

void NetworkDataCounterPrivate::resetCounter(const QString &servicePath)
{
    if (!service)
        service = new NetworkService(this);
    service->setPath(servicePath);
    service->resetCounters();
}

void NetworkDataCounterPrivate::counterRelease()
{
    if (!active)
        return;
    active = false;
    registered = false;
    Q_EMIT q->activeChanged();
}

void NetworkDataCounterPrivate::counterUsage(const QString &identifier, NetworkDataCounter::NetworkType type,
                                             const QVariantMap &usage)
{
    NetworkDataCounter::Update update;
    update.identifier = identifier;
    update.type = type;
    update.txBytes = numberAt(usage, SentKey);
    update.rxBytes = numberAt(usage, ReceivedKey);
    update.time = numberAt(usage, TimeKey);
    if (update.txBytes != 0 || update.rxBytes != 0 || update.time != 0)
        Q_EMIT q->counterUpdate(update);
}

NetworkDataCounterAdaptor::NetworkDataCounterAdaptor(NetworkDataCounterPrivate *counter)
    : QDBusAbstractAdaptor(counter)
    , d(counter)
{
}

void NetworkDataCounterAdaptor::Release()
{
    d->counterRelease();
}

void NetworkDataCounterAdaptor::Usage(const QDBusObjectPath &service_path, const QVariantMap &home,
                                      const QVariantMap &roaming)
{
    const QString identifier = service_path.path().mid(ServicePathPrefix.size());
    if (identifier.contains(CellularPrefix)) {
        // A receiver of the first report may delete the counter.
        const QPointer<NetworkDataCounterPrivate> alive(d);
        if (!home.isEmpty())
            d->counterUsage(identifier, NetworkDataCounter::MobileDataHome, home);
        if (alive && !roaming.isEmpty())
            d->counterUsage(identifier, NetworkDataCounter::MobileDataRoaming, roaming);
    } else if (identifier.contains(WifiPrefix)) {
        d->counterUsage(identifier, NetworkDataCounter::Wlan, home);
    }
}

NetworkDataCounter::NetworkDataCounter(QObject *parent)
    : QObject(parent)
    , d(new NetworkDataCounterPrivate(this))
{
    qRegisterMetaType<Update>("Corvane::Mdm::NetworkDataCounter::Update");
    // The signal is declared with the short spelling; connections by name and queued ones look it up.
    qRegisterMetaType<Update>("NetworkDataCounter::Update");
}

NetworkDataCounter::~NetworkDataCounter()
{
    delete d;
}

int NetworkDataCounter::updateInterval() const
{
    return d->updateInterval;
}

void NetworkDataCounter::setUpdateInterval(int interval)
{
    if (interval < 1) {
        qWarning() << "Invalid update interval" << interval;
    } else if (interval != d->updateInterval) {
        d->updateInterval = interval;
        Q_EMIT updateIntervalChanged();
    }
}

int NetworkDataCounter::updateAccuracy() const
{
    return d->updateAccuracy;
}

void NetworkDataCounter::setUpdateAccuracy(int accuracy)
{
    if (accuracy < 1) {
        qWarning() << "Invalid update accuracy" << accuracy;
    } else if (accuracy != d->updateAccuracy) {
        d->updateAccuracy = accuracy;
        Q_EMIT updateAccuracyChanged();
    }
}

bool NetworkDataCounter::active() const
{
    return d->active;
}

void NetworkDataCounter::setActive(bool active)
{
    d->setActive(active);
}

void NetworkDataCounter::resetCounter(const QString &servicePath)
{
    d->resetCounter(servicePath);
}

} // namespace Mdm
} // namespace Corvane
