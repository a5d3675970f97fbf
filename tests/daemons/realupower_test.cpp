// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "waiting.h"

#include <corvanemdm/batteryinfo.h>

#include <QtTest/QtTest>

using Corvane::Mdm::BatteryInfo;

/** BatteryInfo, and what the simulated power service takes for granted, against the distribution's UPower. */
class RealUPowerTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void tellsTheBattery();
    void followsARestart();
};

void RealUPowerTest::tellsTheBattery()
{
    MessageLog log;
    const BatteryInfo battery;
    QVERIFY(waitUntil([&] {
        return battery.chargePercentage() >= 0 && battery.chargerStatus() >= 0 && battery.status() >= 0;
    }));
    QCOMPARE(battery.chargePercentage(), 76);
    QCOMPARE(battery.status(), BatteryStatus::Normal);
    QCOMPARE(battery.chargerStatus(), BatteryStatus::Disconnected);
    QCOMPARE(log.takeWarnings(), QStringList());
}

void RealUPowerTest::followsARestart()
{
    const QString service = QStringLiteral("org.freedesktop.UPower");
    Phone phone;
    const BatteryInfo battery;
    QVERIFY(waitUntil([&] { return battery.chargePercentage() == 76; }));
    phone.stopService(service);
    QVERIFY(waitUntil([&] {
        return battery.chargePercentage() == -1 && battery.status() == BatteryStatus::BatteryStatusUnknown
            && battery.chargerStatus() == BatteryStatus::ChargerStatusUnknown;
    }));
    phone.startService(service);
    QVERIFY(waitUntil([&] {
        return battery.chargePercentage() == 76 && battery.status() == BatteryStatus::Normal
            && battery.chargerStatus() == BatteryStatus::Disconnected;
    }));
}

QTEST_GUILESS_MAIN(RealUPowerTest)
#include "realupower_test.moc"
