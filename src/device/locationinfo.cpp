// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/locationinfo.h>

#include "frame/blockingquery_p.h"
#include "frame/mdmproxy_p.h"
#include "locationinfo_p.h"
#include "platform/frame/signalconnection_p.h"

#include <QtDBus/QDBusConnection>

#include <utility>

namespace Corvane
{
namespace Mdm
{

namespace
{

constexpr int noCount = -1;

/** "latitude;longitude;altitude;milliseconds since the epoch" */
LocationInfo::Position positionFrom(const QString &text)
{
    constexpr int fieldCount = 4;
    const QStringList fields = text.split(QLatin1Char(';'));
    if (fields.size() != fieldCount) {
        qWarning() << "Invalid position information received:" << text;
        return {};
    }
    return {fields.at(0).toDouble(), fields.at(1).toDouble(), fields.at(2).toDouble(),
            QDateTime::fromMSecsSinceEpoch(fields.at(3).toLongLong(), Qt::UTC)};
}

} // namespace

LocationInfoPrivate::LocationInfoPrivate(LocationInfo *info)
    : q(info)
    , m_interface(MdmProxy::Service, MdmProxy::LocationInfo.path, MdmProxy::LocationInfo.interface,
                  QDBusConnection::systemBus())
{
    qRegisterMetaType<LocationInfo::Position>("Corvane::Mdm::LocationInfo::Position");
}

void LocationInfoPrivate::connectSignals()
{
    const auto follow = [this](const QString &name, const char *slot) {
        connectDBusSignal(
            QDBusConnection::systemBus(),
            {MdmProxy::Service, MdmProxy::LocationInfo.path, MdmProxy::LocationInfo.interface, name}, this,
            slot);
    };
    follow(QStringLiteral("positionChanged"), SLOT(handlePositionChanged(QString)));
    follow(QStringLiteral("satellitesChanged"), SLOT(handleSatellitesChanged(int, int)));
}

void LocationInfoPrivate::startUpdates()
{
    m_updatesRunning = true;
    m_positionStale = true;
    m_satellitesStale = true;
    blockingCommand(&m_interface, QStringLiteral("startUpdates"), "Failed to start location updates:");
}

void LocationInfoPrivate::stopUpdates()
{
    m_updatesRunning = false;
    blockingCommand(&m_interface, QStringLiteral("stopUpdates"), "Failed to stop location updates:");
}

void LocationInfoPrivate::requestUpdate()
{
    m_positionStale = true;
    m_satellitesStale = true;
    m_positionRequestedOnce = true;
    m_satellitesRequestedOnce = true;
    blockingCommand(&m_interface, QStringLiteral("startUpdates"), "Failed to request location update:");
}

LocationInfo::Position LocationInfoPrivate::position()
{
    if (m_positionStale) {
        const auto text
            = tryQuery<QString>(&m_interface, QStringLiteral("position"), "Failed to retrieve position:");
        if (!text)
            return {};
        m_position = positionFrom(*text);
        m_positionStale = false;
    }
    return m_position;
}

int LocationInfoPrivate::satellites(int *cached, const QString &method, const char *failure)
{
    // They stay stale: only a report tells that the receiver has begun anew.
    if (m_satellitesStale) {
        const auto count = tryQuery<int>(&m_interface, method, failure);
        if (!count)
            return noCount;
        *cached = *count;
    }
    return *cached;
}

int LocationInfoPrivate::satellitesInUse()
{
    return satellites(&m_satellitesInUse, QStringLiteral("satellitesInUse"),
                      "Failed to retrieve satellites in use:");
}

int LocationInfoPrivate::satellitesInView()
{
    return satellites(&m_satellitesInView, QStringLiteral("satellitesInView"),
                      "Failed to retrieve satellites in view:");
}

void LocationInfoPrivate::stopAfterBothReports()
{
    if (!m_positionRequestedOnce && !m_satellitesRequestedOnce && !m_updatesRunning)
        stopUpdates();
}

void LocationInfoPrivate::handlePositionChanged(const QString &text)
{
    m_position = positionFrom(text);
    m_positionStale = false;
    const bool wasRequested = std::exchange(m_positionRequestedOnce, false);
    if (wasRequested)
        stopAfterBothReports();
    if (wasRequested || m_updatesRunning)
        Q_EMIT q->positionChanged();
}

void LocationInfoPrivate::handleSatellitesChanged(int inUse, int inView)
{
    m_satellitesInUse = inUse;
    m_satellitesInView = inView;
    m_satellitesStale = false;
    const bool wasRequested = std::exchange(m_satellitesRequestedOnce, false);
    if (wasRequested)
        stopAfterBothReports();
    if (wasRequested || m_updatesRunning)
        Q_EMIT q->satellitesChanged();
}

LocationInfo::LocationInfo(QObject *parent)
    : QObject(parent)
    , d(new LocationInfoPrivate(this))
{
    d->connectSignals();
}

LocationInfo::~LocationInfo()
{
    delete d;
}

double LocationInfo::latitude() const
{
    return d->position().latitude;
}

double LocationInfo::longitude() const
{
    return d->position().longitude;
}

double LocationInfo::altitude() const
{
    return d->position().altitude;
}

QDateTime LocationInfo::timestamp() const
{
    return d->position().timestamp;
}

LocationInfo::Position LocationInfo::position() const
{
    return d->position();
}

int LocationInfo::satellitesInUse() const
{
    return d->satellitesInUse();
}

int LocationInfo::satellitesInView() const
{
    return d->satellitesInView();
}

void LocationInfo::startUpdates()
{
    d->startUpdates();
}

void LocationInfo::stopUpdates()
{
    d->stopUpdates();
}

void LocationInfo::requestUpdate()
{
    d->requestUpdate();
}

} // namespace Mdm
} // namespace Corvane
