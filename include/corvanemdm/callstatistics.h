// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_CALLSTATISTICS_H
#define CORVANEMDM_CALLSTATISTICS_H

#include <corvanemdm/corvanemdm_global.h>

#include <QtCore/QDateTime>
#include <QtCore/QList>
#include <QtCore/QMetaType>
#include <QtCore/QObject>

namespace Corvane
{
namespace Mdm
{

class CallStatisticsPrivate;

/**
 * @brief Asks the phone for statistics on calls over a range of time.
 *
 * A search is one request that does not block; the proxy's answer comes as searchFinished(). An answer
 * carries nothing that tells which search it belongs to, and every object in every process gets each one:
 * who searches for several things at a time has to expect the answers in the proxy's order.
 *
 * Construction looks the proxy up, which blocks. An object that was made while the proxy was away works once
 * it is there.
 *
 * Source: MDM proxy "org.corvaneos.mdmproxy", object "/Corvane/Mdm/Proxy/CallStatistics".
 */
class CORVANEMDM_EXPORT CallStatistics : public QObject
{
    Q_OBJECT

public:
    /** @brief What to search for. */
    struct Filter {
        int firstSelector = 0; ///< its meaning is the proxy's
        int secondSelector = 0; ///< its meaning is the proxy's
        /**
         * Beginning of the range; open when invalid. Use UTC or local time: date, time and Qt::TimeSpec are
         * all that travels, an offset or a time zone of its own does not.
         */
        QDateTime start;
        QDateTime end; ///< end of the range, in the same way
    };

    /** @brief One item of an answer. */
    struct Result {
        QDateTime time; ///< in UTC, to the second; invalid when the proxy sent one beyond QDateTime
        int value = 0; ///< its meaning and unit are the proxy's
    };

    /** Looks the proxy up, which blocks; a proxy that is away is not reported. */
    explicit CallStatistics(QObject *parent = nullptr);
    ~CallStatistics() override;

    /**
     * Sends a search to the proxy.
     *
     * A range whose ends are both given and whose start is not earlier than its end is only logged ("Error:
     * filter end date/time is not after start date/time"): nothing is sent and searchFinished() does not
     * follow. A request that the proxy refuses, or that does not reach it, is logged as well ("search()
     * failed:", the error's name and message), and searchFinished() does not follow either.
     */
    Q_INVOKABLE void search(const Corvane::Mdm::CallStatistics::Filter &filter);

Q_SIGNALS:
    /**
     * The proxy has finished a search, of this object or of another one.
     * @p results are in the proxy's order; empty without @p success.
     */
    void searchFinished(bool success, const QList<CallStatistics::Result> &results);

private:
    Q_DISABLE_COPY(CallStatistics)
    CallStatisticsPrivate *const d;
};

} // namespace Mdm
} // namespace Corvane

Q_DECLARE_METATYPE(Corvane::Mdm::CallStatistics::Filter)
Q_DECLARE_METATYPE(Corvane::Mdm::CallStatistics::Result)

#endif // CORVANEMDM_CALLSTATISTICS_H
