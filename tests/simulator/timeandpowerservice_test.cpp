// SPDX-License-Identifier: LGPL-2.1-or-later
#include "client.h"

#include <QtCore/QDateTime>
#include <QtCore/QJsonDocument>
#include <QtCore/QJsonObject>
#include <QtTest/QtTest>

#include <cstdlib>
#include <limits>

namespace
{

const QString timeService = QStringLiteral("org.freedesktop.timedate1");
const QString timePath = QStringLiteral("/org/freedesktop/timedate1");
const QString powerService = QStringLiteral("org.freedesktop.UPower");
const QString powerPath = QStringLiteral("/org/freedesktop/UPower");
const QString display = QStringLiteral("/org/freedesktop/UPower/devices/DisplayDevice");
const QString device = QStringLiteral("org.freedesktop.UPower.Device");
const QString properties = QStringLiteral("org.freedesktop.DBus.Properties");
const QString changed = QStringLiteral("PropertiesChanged");
const QString refused = QStringLiteral("org.corvaneos.simulator.Error.InvalidArguments: ");

constexpr qint64 second = 1000000; // in the service's microseconds

} // namespace

/** The simulated time and power services, in the words of the real ones. */
class TimeAndPowerServiceTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void cleanup();

    void hasTheZoneOfTheProfile();
    void announcesZoneAndNtp();
    void refusesZonesThatAreNone();
    void keepsAClockOfItsOwn();
    void networkTimeComesBack();
    void refusesTimesThatAreNone();
    void takesOnTheNetworksZone();
    void tellsTheBattery();
    void announcesTheBattery();
    void warnsOfALowBattery_data();
    void warnsOfALowBattery();
    void refusesLevelsThatAreNone();

private:
    QString call(const char *member, const QVariantList &arguments)
    {
        return textOf(m_client.call(timeService, timePath, timeService, QLatin1String(member), arguments));
    }
    QString property(const QString &service, const QString &path, const QString &interface, const char *name)
    {
        return textOf(m_client.call(service, path, properties, QStringLiteral("Get"),
                                    {interface, QLatin1String(name)}));
    }
    QString deviceProperty(const char *name) { return property(powerService, display, device, name); }
    qint64 clock()
    {
        const QDBusMessage reply = m_client.call(timeService, timePath, properties, QStringLiteral("Get"),
                                                 {timeService, QStringLiteral("TimeUSec")});
        return reply.arguments().value(0).value<QDBusVariant>().variant().toLongLong();
    }
    QString act(const char *action, const char *argument)
    {
        return textOf(m_client.control(QStringLiteral("Act"),
                                       {QLatin1String(action), QStringList{QString::fromLatin1(argument)}}));
    }

    Client m_client;
};

void TimeAndPowerServiceTest::cleanup()
{
    call("SetNTP", {true, false});
    call("SetTimezone", {QStringLiteral("Europe/Helsinki"), false});
    act("battery level", "76");
    act("battery charger", "off");
    m_client.takeSignals(timeService);
    m_client.takeSignals(powerService);
}

void TimeAndPowerServiceTest::hasTheZoneOfTheProfile()
{
    QCOMPARE(property(timeService, timePath, timeService, "Timezone"),
             QStringLiteral("reply(<Europe/Helsinki>)"));
    QCOMPARE(property(timeService, timePath, timeService, "NTP"), QStringLiteral("reply(<true>)"));
    QCOMPARE(property(timeService, timePath, timeService, "LocalRTC"), QStringLiteral("reply(<false>)"));
    QVERIFY(call("ListTimezones", {}).contains(QLatin1String("America/Sao_Paulo")));
}

void TimeAndPowerServiceTest::announcesZoneAndNtp()
{
    m_client.watch(timeService, timePath, properties, {changed});
    QCOMPARE(call("SetTimezone", {QStringLiteral("Asia/Tokyo"), false}), QStringLiteral("reply()"));
    call("SetTimezone", {QStringLiteral("Asia/Tokyo"), false});
    QCOMPARE(call("SetNTP", {false, true}), QStringLiteral("reply()"));
    const QStringList seen = m_client.takeSignals(timeService);
    QCOMPARE(seen.size(), 2);
    QVERIFY2(seen.first().contains(QLatin1String("Asia/Tokyo")), qPrintable(seen.first()));
    QVERIFY2(!seen.first().contains(QLatin1String("NTP")), qPrintable(seen.first()));
    QVERIFY2(seen.last().contains(QLatin1String("NTP")), qPrintable(seen.last()));
}

void TimeAndPowerServiceTest::refusesZonesThatAreNone()
{
    QCOMPARE(call("SetTimezone", {QStringLiteral("europe/helsinki"), false}),
             QStringLiteral("org.freedesktop.DBus.Error.InvalidArgs: Invalid or not installed time zone "
                            "'europe/helsinki'"));
}

void TimeAndPowerServiceTest::keepsAClockOfItsOwn()
{
    QVERIFY(std::abs(clock() - QDateTime::currentMSecsSinceEpoch() * 1000) < 300 * second);
    call("SetNTP", {false, false});
    const qint64 wanted = 1000 * second;
    QCOMPARE(call("SetTime", {wanted, false, false}), QStringLiteral("reply()"));
    QVERIFY(clock() >= wanted && clock() < wanted + 300 * second);
    call("SetTime", {3600 * second, true, false});
    QVERIFY(clock() >= wanted + 3600 * second && clock() < wanted + 3900 * second);
    // The machine's goes on as ever.
    QVERIFY(QDateTime::currentDateTimeUtc().date().year() > 2020);
}

void TimeAndPowerServiceTest::networkTimeComesBack()
{
    QCOMPARE(call("SetTime", {second, false, false}),
             QStringLiteral("org.freedesktop.timedate1.AutomaticTimeSyncEnabled: Automatic time "
                            "synchronization is enabled"));
    call("SetNTP", {false, false});
    call("SetTime", {second, false, false});
    call("SetNTP", {true, false});
    QVERIFY(std::abs(clock() - QDateTime::currentMSecsSinceEpoch() * 1000) < 300 * second);
}

void TimeAndPowerServiceTest::refusesTimesThatAreNone()
{
    call("SetNTP", {false, false});
    const QString reason = QStringLiteral("org.freedesktop.DBus.Error.InvalidArgs: Invalid absolute time");
    QCOMPARE(call("SetTime", {0LL, false, false}), reason);
    QCOMPARE(call("SetTime", {std::numeric_limits<qint64>::min(), false, false}), reason);
    call("SetTime", {7200 * second, true, false});
    QCOMPARE(call("SetTime", {std::numeric_limits<qint64>::max(), true, false}), reason);
}

void TimeAndPowerServiceTest::takesOnTheNetworksZone()
{
    QCOMPARE(act("clock zone", "Asia/Tokyo"), QStringLiteral("reply(The phone is in Asia/Tokyo now)"));
    QCOMPARE(act("clock zone", "Nowhere"),
             refused + QLatin1String("\"Nowhere\" is no time zone; one is Europe/Helsinki"));
}

void TimeAndPowerServiceTest::tellsTheBattery()
{
    QCOMPARE(property(powerService, powerPath, powerService, "OnBattery"), QStringLiteral("reply(<true>)"));
    QCOMPARE(textOf(m_client.call(powerService, powerPath, powerService, QStringLiteral("GetDisplayDevice"))),
             QStringLiteral("reply(%1)").arg(display));
    QCOMPARE(textOf(m_client.call(powerService, powerPath, powerService, QStringLiteral("EnumerateDevices"))),
             QStringLiteral("reply([/org/freedesktop/UPower/devices/battery_battery])"));
    QCOMPARE(deviceProperty("Percentage"), QStringLiteral("reply(<76>)"));
    QCOMPARE(deviceProperty("State"), QStringLiteral("reply(<2>)"));
    QCOMPARE(deviceProperty("Type"), QStringLiteral("reply(<2>)"));
    QCOMPARE(deviceProperty("IsPresent"), QStringLiteral("reply(<true>)"));
}

void TimeAndPowerServiceTest::announcesTheBattery()
{
    m_client.watch(powerService, display, properties, {changed});
    m_client.watch(powerService, powerPath, properties, {changed});
    act("battery level", "75");
    QStringList seen = m_client.takeSignals(powerService);
    QCOMPARE(seen.size(), 1);
    QVERIFY2(seen.first().contains(QLatin1String("Percentage")), qPrintable(seen.first()));
    act("battery charger", "on");
    act("battery charger", "on");
    seen = m_client.takeSignals(powerService);
    QCOMPARE(seen.size(), 2);
    QVERIFY2(seen.first().contains(QLatin1String("OnBattery")), qPrintable(seen.first()));
    QVERIFY2(seen.last().contains(QLatin1String("State")), qPrintable(seen.last()));
    QCOMPARE(deviceProperty("State"), QStringLiteral("reply(<1>)"));
}

void TimeAndPowerServiceTest::warnsOfALowBattery_data()
{
    QTest::addColumn<QByteArray>("level");
    QTest::addColumn<int>("warning");
    QTest::newRow("21") << QByteArray("21") << 1;
    QTest::newRow("20") << QByteArray("20") << 3;
    QTest::newRow("5") << QByteArray("5") << 4;
    QTest::newRow("2") << QByteArray("2") << 5;
    QTest::newRow("0") << QByteArray("0") << 5;
}

void TimeAndPowerServiceTest::warnsOfALowBattery()
{
    QFETCH(QByteArray, level);
    QFETCH(int, warning);
    act("battery level", level.constData());
    QCOMPARE(deviceProperty("WarningLevel"), QStringLiteral("reply(<%1>)").arg(warning));
    QCOMPARE(deviceProperty("State"), QStringLiteral("reply(<%1>)").arg(level == "0" ? 3 : 2));
    act("battery charger", "on");
    QCOMPARE(deviceProperty("WarningLevel"), QStringLiteral("reply(<1>)"));
}

void TimeAndPowerServiceTest::refusesLevelsThatAreNone()
{
    for (const char *level : {"-1", "101", "nan", "half"})
        QCOMPARE(act("battery level", level),
                 refused
                     + QStringLiteral("\"%1\" is no level; it is a number from 0 to 100")
                           .arg(QLatin1String(level)));
    QCOMPARE(act("battery charger", "maybe"), refused + QLatin1String("\"maybe\" is neither on nor off"));
}

QTEST_GUILESS_MAIN(TimeAndPowerServiceTest)
#include "timeandpowerservice_test.moc"
