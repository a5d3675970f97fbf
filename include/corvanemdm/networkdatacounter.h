// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_NETWORKDATACOUNTER_H
#define CORVANEMDM_NETWORKDATACOUNTER_H

#include <corvanemdm/corvanemdm_global.h>

#include <QtCore/QMetaType>
#include <QtCore/QObject>
#include <QtCore/QString>

namespace Corvane
{
namespace Mdm
{

class NetworkDataCounterPrivate;

/**
 * @brief Counts the data that goes over wireless and mobile networks.
 *
 * While it is active, the connection manager reports on each connected network: once with all that was
 * counted since the last reset, then as often as interval and accuracy say, with the numbers that have
 * changed. Several counters do not disturb each other.
 *
 * A counter that loses the connection manager, or is released by it, is inactive afterwards and stays so.
 *
 * Nothing blocks, except that the construction asks the bus for the connection manager.
 *
 * Source: connection manager "net.connman"; it calls "net.connman.Counter" of an object that this class
 * offers on the system bus.
 */
class CORVANEMDM_EXPORT NetworkDataCounter : public QObject
{
    Q_OBJECT
    Q_PROPERTY(int updateInterval READ updateInterval WRITE setUpdateInterval NOTIFY updateIntervalChanged)
    Q_PROPERTY(int updateAccuracy READ updateAccuracy WRITE setUpdateAccuracy NOTIFY updateAccuracyChanged)
    Q_PROPERTY(bool active READ active WRITE setActive NOTIFY activeChanged)

public:
    /** What carried the data. */
    enum NetworkType : int {
        MobileDataHome = 0, ///< the network of the SIM's provider
        MobileDataRoaming = 1, ///< another provider's network
        Wlan = 2 ///< a wireless network
    };
    Q_ENUM(NetworkType)

    /** @brief A report on one network: totals since the last reset. A number that was not reported is 0. */
    struct Update {
        QString identifier; ///< of the network, as NetProxy has them
        NetworkType type = Wlan;
        quint64 txBytes = 0; ///< sent
        quint64 rxBytes = 0; ///< received
        quint64 time = 0; ///< seconds of being connected
    };

    explicit NetworkDataCounter(QObject *parent = nullptr);
    ~NetworkDataCounter() override;

    /** Seconds from report to report; 60 at first. */
    int updateInterval() const;
    /** From the next activation on. Less than 1 is only logged ("Invalid update interval"). */
    void setUpdateInterval(int interval);

    /** KiB from report to report; 1024 at first. */
    int updateAccuracy() const;
    /** From the next activation on. Less than 1 is only logged ("Invalid update accuracy"). */
    void setUpdateAccuracy(int accuracy);

    bool active() const;
    /** Without the connection manager a counter that is switched on is inactive again at once; both is
     * signalled. */
    void setActive(bool active);

    /**
     * Makes the connection manager count the network at @p servicePath ("/net/connman/service/" and its
     * identifier) anew, for all counters. A refusal is logged.
     */
    void resetCounter(const QString &servicePath);

Q_SIGNALS:
    void updateIntervalChanged();
    void updateAccuracyChanged();
    void activeChanged();
    /** A report in which something is counted. One on mobile data at home comes before one on roaming. */
    void counterUpdate(const NetworkDataCounter::Update &update);

private:
    Q_DISABLE_COPY(NetworkDataCounter)
    NetworkDataCounterPrivate *const d;
};

} // namespace Mdm
} // namespace Corvane

Q_DECLARE_METATYPE(Corvane::Mdm::NetworkDataCounter::Update)

#endif // CORVANEMDM_NETWORKDATACOUNTER_H
