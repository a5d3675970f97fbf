// SPDX-License-Identifier: LGPL-2.1-or-later
#include <trafficmeter.h>

#include <QtTest/QtTest>

using Corvane::Agent::TrafficMeter;
using Corvane::Mdm::NetworkDataCounter;

namespace
{

NetworkDataCounter::Update update(const char *network, NetworkDataCounter::NetworkType type, quint64 received,
                                  quint64 sent, quint64 seconds)
{
    NetworkDataCounter::Update update;
    update.identifier = QString::fromLatin1(network);
    update.type = type;
    update.rxBytes = received;
    update.txBytes = sent;
    update.time = seconds;
    return update;
}

} // namespace

class TrafficMeterTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void firstReportHasNoRate();
    void ratesAreOfTheTimeBetweenReports();
    void whatIsNotReportedStays();
    void resetBeginsAnew();
    void networksAndKindsAreApart();
    void reportsAtOnceHaveNoRate();
};

void TrafficMeterTest::firstReportHasNoRate()
{
    TrafficMeter meter;
    const TrafficMeter::Reading reading
        = meter.take(update("wifi_1", NetworkDataCounter::Wlan, 1000, 100, 60), 5000);
    QCOMPARE(reading.network, QStringLiteral("wifi_1"));
    QCOMPARE(reading.received, quint64(1000));
    QCOMPARE(reading.sent, quint64(100));
    QCOMPARE(reading.seconds, quint64(60));
    QCOMPARE(reading.receivedPerSecond, 0.0);
    QCOMPARE(reading.sentPerSecond, 0.0);
}

void TrafficMeterTest::ratesAreOfTheTimeBetweenReports()
{
    TrafficMeter meter;
    meter.take(update("wifi_1", NetworkDataCounter::Wlan, 1000, 100, 60), 5000);
    const TrafficMeter::Reading reading
        = meter.take(update("wifi_1", NetworkDataCounter::Wlan, 4000, 200, 62), 7000);
    QCOMPARE(reading.receivedPerSecond, 1500.0);
    QCOMPARE(reading.sentPerSecond, 50.0);
    QCOMPARE(meter.readings().size(), 1);
}

void TrafficMeterTest::whatIsNotReportedStays()
{
    TrafficMeter meter;
    meter.take(update("wifi_1", NetworkDataCounter::Wlan, 1000, 100, 60), 0);
    const TrafficMeter::Reading reading
        = meter.take(update("wifi_1", NetworkDataCounter::Wlan, 0, 300, 0), 1000);
    QCOMPARE(reading.received, quint64(1000));
    QCOMPARE(reading.sent, quint64(300));
    QCOMPARE(reading.seconds, quint64(60));
    QCOMPARE(reading.receivedPerSecond, 0.0);
    QCOMPARE(reading.sentPerSecond, 200.0);
}

void TrafficMeterTest::resetBeginsAnew()
{
    TrafficMeter meter;
    meter.take(update("wifi_1", NetworkDataCounter::Wlan, 1000, 100, 60), 0);
    const TrafficMeter::Reading reading
        = meter.take(update("wifi_1", NetworkDataCounter::Wlan, 500, 0, 1), 1000);
    QCOMPARE(reading.received, quint64(500));
    QCOMPARE(reading.receivedPerSecond, 500.0);
}

void TrafficMeterTest::networksAndKindsAreApart()
{
    TrafficMeter meter;
    meter.take(update("cellular_1", NetworkDataCounter::MobileDataHome, 1, 0, 0), 0);
    meter.take(update("cellular_1", NetworkDataCounter::MobileDataRoaming, 2, 0, 0), 0);
    meter.take(update("wifi_1", NetworkDataCounter::Wlan, 3, 0, 0), 0);
    QCOMPARE(meter.readings().size(), 3);
    for (int i = 0; i < 3; ++i)
        QCOMPARE(meter.readings().at(i).received, quint64(i + 1));
}

void TrafficMeterTest::reportsAtOnceHaveNoRate()
{
    TrafficMeter meter;
    meter.take(update("wifi_1", NetworkDataCounter::Wlan, 1, 0, 0), 10);
    QCOMPARE(meter.take(update("wifi_1", NetworkDataCounter::Wlan, 9, 0, 0), 10).receivedPerSecond, 0.0);
}

QTEST_APPLESS_MAIN(TrafficMeterTest)

#include "trafficmeter_test.moc"
