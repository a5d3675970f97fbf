// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TRAFFICMETER_H
#define CORVANE_TRAFFICMETER_H

#include <corvanemdm/networkdatacounter.h>

#include <QtCore/QString>
#include <QtCore/QVector>

namespace Corvane
{
namespace Agent
{

/** Makes totals and rates of the reports on data, which have only what has changed. */
class TrafficMeter
{
public:
    /** One network, or a network at home or abroad. */
    struct Reading {
        QString network;
        Mdm::NetworkDataCounter::NetworkType type = Mdm::NetworkDataCounter::Wlan;
        quint64 received = 0; ///< bytes, as all totals since the last reset
        quint64 sent = 0;
        quint64 seconds = 0; ///< of being connected
        double receivedPerSecond = 0; ///< since the report before
        double sentPerSecond = 0;
        qint64 time = 0; ///< of the last report, in milliseconds
    };

    /** Takes @p update, which came at @p milliseconds of any clock that does not jump. */
    const Reading &take(const Mdm::NetworkDataCounter::Update &update, qint64 milliseconds);

    /** In the order in which they were first reported. */
    const QVector<Reading> &readings() const { return m_readings; }

private:
    QVector<Reading> m_readings;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_TRAFFICMETER_H
