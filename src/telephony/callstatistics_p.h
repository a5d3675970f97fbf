// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_CALLSTATISTICS_P_H
#define CORVANEMDM_CALLSTATISTICS_P_H

#include <corvanemdm/callstatistics.h>

#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusInterface>

class QDBusPendingCallWatcher;

namespace Corvane
{
namespace Mdm
{

class CallStatisticsPrivate : public QObject
{
    Q_OBJECT

public:
    /** A result on the wire, (xi). */
    struct StatisticData {
        qint64 time = 0; ///< seconds since the epoch
        qint32 value = 0;
    };

    explicit CallStatisticsPrivate(CallStatistics *statistics);

    /** Receives the proxy's answers from now on. */
    void connectSignal();
    void search(const CallStatistics::Filter &filter);

private Q_SLOTS:
    void searchFinished(QDBusPendingCallWatcher *watcher);
    void handleSearchFinished(bool success,
                              const QList<Corvane::Mdm::CallStatisticsPrivate::StatisticData> &data);

private:
    CallStatistics *const q;
    QDBusInterface *m_interface;
};

QDBusArgument &operator<<(QDBusArgument &out, const CallStatisticsPrivate::StatisticData &data);
const QDBusArgument &operator>>(const QDBusArgument &in, CallStatisticsPrivate::StatisticData &data);

} // namespace Mdm
} // namespace Corvane

Q_DECLARE_METATYPE(Corvane::Mdm::CallStatisticsPrivate::StatisticData)

#endif // CORVANEMDM_CALLSTATISTICS_P_H
