// SPDX-License-Identifier: LGPL-2.1-or-later
#include "trafficmeter.h"

#include <algorithm>

namespace Corvane
{
namespace Agent
{

using Mdm::NetworkDataCounter;

namespace
{

/** Stores what was reported, 0 being nothing, and returns how much came; after a reset all of it has. */
quint64 advance(quint64 *total, quint64 reported)
{
    if (reported == 0)
        return 0;
    const quint64 before = *total;
    *total = reported;
    return reported >= before ? reported - before : reported;
}

} // namespace

const TrafficMeter::Reading &TrafficMeter::take(const NetworkDataCounter::Update &update, qint64 milliseconds)
{
    auto reading = std::find_if(m_readings.begin(), m_readings.end(), [&](const Reading &each) {
        return each.network == update.identifier && each.type == update.type;
    });
    const bool isFirst = reading == m_readings.end();
    if (isFirst) {
        Reading added;
        added.network = update.identifier;
        added.type = update.type;
        m_readings.append(added);
        reading = m_readings.end() - 1;
    }
    const quint64 received = advance(&reading->received, update.rxBytes);
    const quint64 sent = advance(&reading->sent, update.txBytes);
    advance(&reading->seconds, update.time);
    const double elapsed = double(milliseconds - reading->time) / 1000;
    reading->time = milliseconds;
    // The first report is on a time that nobody has measured.
    const bool hasRates = !isFirst && elapsed > 0;
    reading->receivedPerSecond = hasRates ? double(received) / elapsed : 0;
    reading->sentPerSecond = hasRates ? double(sent) / elapsed : 0;
    return *reading;
}

} // namespace Agent
} // namespace Corvane
