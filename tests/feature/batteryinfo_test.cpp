// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "waiting.h"

#include <corvanemdm/batteryinfo.h>

#include <QtCore/QMetaEnum>
#include <QtDBus/QDBusMetaType>
#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::BatteryInfo;

namespace
{

const QString Service = QStringLiteral("org.freedesktop.UPower");
const QString Display = QStringLiteral("/org/freedesktop/UPower/devices/DisplayDevice");

/** "Normal Disconnected 76" */
QString textOf(const BatteryInfo &battery)
{
    return QStringLiteral("%1 %2 %3")
        .arg(QLatin1String(QMetaEnum::fromType<BatteryStatus::Status>().valueToKey(battery.status())),
             QLatin1String(
                 QMetaEnum::fromType<BatteryStatus::ChargerStatus>().valueToKey(battery.chargerStatus())))
        .arg(battery.chargePercentage());
}

const QString Nothing = QStringLiteral("BatteryStatusUnknown ChargerStatusUnknown -1");

} // namespace

class BatteryInfoTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void nothingIsKnownAtFirst();
    void followsTheBattery_data();
    void followsTheBattery();
    void eachChangeIsSignalledOnce();
    void readsWhatUPowerTells_data();
    void readsWhatUPowerTells();
    void serviceThatIsNotThere();
    void serviceThatRestarts();
    void errorsAreLogged();
    void propertiesOfOtherObjectsAreNotTaken();
    void announcementsOfAnotherShapeAreNotTaken_data();
    void announcementsOfAnotherShapeAreNotTaken();
    void deletionInASlot();
    void deletionWhenTheServiceLeaves();
    void worksThroughTheMetaObject();

private:
    void set(const char *level, const char *charger);
    void becomes(const BatteryInfo &battery, const QString &text);

    std::unique_ptr<Phone> m_phone;
};

void BatteryInfoTest::init()
{
    m_phone = std::make_unique<Phone>();
}

void BatteryInfoTest::cleanup()
{
    m_phone->clearFaults();
    m_phone->startService(Service);
    set("76", "off");
}

void BatteryInfoTest::set(const char *level, const char *charger)
{
    m_phone->act(QStringLiteral("battery level"), {QLatin1String(level)});
    m_phone->act(QStringLiteral("battery charger"), {QLatin1String(charger)});
}

void BatteryInfoTest::becomes(const BatteryInfo &battery, const QString &text)
{
    waitUntil([&] { return textOf(battery) == text; });
    QCOMPARE(textOf(battery), text);
}

void BatteryInfoTest::nothingIsKnownAtFirst()
{
    MessageLog log;
    const BatteryInfo battery;
    QCOMPARE(textOf(battery), Nothing);
    becomes(battery, QStringLiteral("Normal Disconnected 76"));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void BatteryInfoTest::followsTheBattery_data()
{
    QTest::addColumn<QByteArray>("level");
    QTest::addColumn<QByteArray>("charger");
    QTest::addColumn<QString>("text");
    QTest::newRow("half") << QByteArray("50") << QByteArray("off") << "Normal Disconnected 50";
    QTest::newRow("charging") << QByteArray("50") << QByteArray("on") << "Normal Connected 50";
    QTest::newRow("full, charger") << QByteArray("100") << QByteArray("on") << "Full Connected 100";
    QTest::newRow("full") << QByteArray("100") << QByteArray("off") << "Full Disconnected 100";
    QTest::newRow("rounded") << QByteArray("49.5") << QByteArray("off") << "Normal Disconnected 50";
    QTest::newRow("low") << QByteArray("20") << QByteArray("off") << "Low Disconnected 20";
    QTest::newRow("low, charger") << QByteArray("20") << QByteArray("on") << "Normal Connected 20";
    QTest::newRow("critical") << QByteArray("4") << QByteArray("off") << "Empty Disconnected 4";
    QTest::newRow("empty") << QByteArray("0") << QByteArray("off") << "Empty Disconnected 0";
    QTest::newRow("empty, charger") << QByteArray("0") << QByteArray("on") << "Normal Connected 0";
}

void BatteryInfoTest::followsTheBattery()
{
    QFETCH(QByteArray, level);
    QFETCH(QByteArray, charger);
    QFETCH(QString, text);
    const BatteryInfo battery;
    becomes(battery, QStringLiteral("Normal Disconnected 76"));
    set(level.constData(), charger.constData());
    becomes(battery, text);
    // As one sees it who comes later.
    const BatteryInfo later;
    becomes(later, text);
}

void BatteryInfoTest::eachChangeIsSignalledOnce()
{
    BatteryInfo battery;
    const QSignalSpy status(&battery, &BatteryInfo::statusChanged);
    const QSignalSpy charger(&battery, &BatteryInfo::chargerStatusChanged);
    const QSignalSpy percentage(&battery, &BatteryInfo::chargePercentageChanged);
    becomes(battery, QStringLiteral("Normal Disconnected 76"));
    QCOMPARE(status.size(), 1);
    QCOMPARE(status.last().first().value<BatteryStatus::Status>(), BatteryStatus::Normal);
    QCOMPARE(charger.size(), 1);
    QCOMPARE(charger.last().first().value<BatteryStatus::ChargerStatus>(), BatteryStatus::Disconnected);
    QCOMPARE(percentage.size(), 1);
    QCOMPARE(percentage.last().first().toInt(), 76);

    m_phone->act(QStringLiteral("battery level"), {QStringLiteral("75.6")});
    m_phone->act(QStringLiteral("battery level"), {QStringLiteral("18")});
    becomes(battery, QStringLiteral("Low Disconnected 18"));
    QCOMPARE(status.size(), 2);
    QCOMPARE(charger.size(), 1);
    QCOMPARE(percentage.size(), 2);
}

void BatteryInfoTest::readsWhatUPowerTells_data()
{
    QTest::addColumn<QVariantMap>("device");
    QTest::addColumn<QString>("text");
    const auto device = [](uint type, bool isPresent, uint state, const QVariant &percentage, uint warning) {
        return QVariantMap{{QStringLiteral("Type"), type},
                           {QStringLiteral("IsPresent"), isPresent},
                           {QStringLiteral("State"), state},
                           {QStringLiteral("Percentage"), percentage},
                           {QStringLiteral("WarningLevel"), warning}};
    };
    QTest::newRow("nothing") << QVariantMap() << "BatteryStatusUnknown Disconnected -1";
    QTest::newRow("no battery") << device(0, false, 0, 0.0, 0) << "BatteryStatusUnknown Disconnected -1";
    QTest::newRow("a mouse's") << device(5, true, 2, 50.0, 1) << "BatteryStatusUnknown Disconnected -1";
    QTest::newRow("taken out") << device(2, false, 2, 50.0, 1) << "BatteryStatusUnknown Disconnected -1";
    QTest::newRow("full at less") << device(2, true, 4, 97.2, 1) << "Full Disconnected 97";
    QTest::newRow("empty state") << device(2, true, 3, 1.0, 1) << "Empty Disconnected 1";
    QTest::newRow("action") << device(2, true, 2, 1.9, 5) << "Empty Disconnected 2";
    QTest::newRow("too much") << device(2, true, 2, 1e300, 1) << "Full Disconnected 100";
    QTest::newRow("less than nothing") << device(2, true, 2, -5.0, 1) << "Normal Disconnected 0";
    QTest::newRow("no number") << device(2, true, 2, qQNaN(), 1) << "Normal Disconnected 0";
    QTest::newRow("text") << device(2, true, 2, QStringLiteral("half"), 1) << "Normal Disconnected 0";
}

void BatteryInfoTest::readsWhatUPowerTells()
{
    QFETCH(QVariantMap, device);
    QFETCH(QString, text);
    m_phone->answerCalls(Service, Display, QStringLiteral("GetAll"), {device});
    const BatteryInfo battery;
    QVERIFY(waitUntil([&] { return battery.chargerStatus() != BatteryStatus::ChargerStatusUnknown; }));
    m_phone->settle(Service);
    QCOMPARE(textOf(battery), text);
}

void BatteryInfoTest::serviceThatIsNotThere()
{
    m_phone->stopService(Service);
    MessageLog log;
    const BatteryInfo battery;
    m_phone->settle(QStringLiteral("org.corvaneos.mdmproxy"));
    QCOMPARE(textOf(battery), Nothing);
    m_phone->startService(Service);
    becomes(battery, QStringLiteral("Normal Disconnected 76"));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void BatteryInfoTest::serviceThatRestarts()
{
    MessageLog log;
    const BatteryInfo battery;
    becomes(battery, QStringLiteral("Normal Disconnected 76"));
    m_phone->stopService(Service);
    becomes(battery, Nothing);
    m_phone->act(QStringLiteral("battery level"), {QStringLiteral("3")});
    m_phone->startService(Service);
    becomes(battery, QStringLiteral("Empty Disconnected 3"));
    set("60", "on");
    becomes(battery, QStringLiteral("Normal Connected 60"));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void BatteryInfoTest::errorsAreLogged()
{
    m_phone->failCalls(Service, Display, QStringLiteral("GetAll"), QStringLiteral("com.example.Broken"),
                       QStringLiteral("Out of order"));
    MessageLog log;
    const BatteryInfo battery;
    QStringList warnings;
    QVERIFY(waitUntil([&] { return !(warnings += log.takeWarnings()).isEmpty(); }));
    QCOMPARE(warnings,
             QStringList(QStringLiteral("Cannot read the properties of \"org.freedesktop.UPower.Device\" "
                                        "QDBusError(\"com.example.Broken\", \"Out of order\")")));
    becomes(battery, QStringLiteral("BatteryStatusUnknown Disconnected -1"));
}

void BatteryInfoTest::propertiesOfOtherObjectsAreNotTaken()
{
    const BatteryInfo battery;
    becomes(battery, QStringLiteral("Normal Disconnected 76"));
    const auto announce = [this](const QString &path, const char *interface, const QVariantMap &changed,
                                 const QStringList &invalidated) {
        m_phone->emitSignal(Service, path, QStringLiteral("org.freedesktop.DBus.Properties"),
                            QStringLiteral("PropertiesChanged"),
                            {QLatin1String(interface), changed, invalidated});
    };
    const QVariantMap changed{{QStringLiteral("Percentage"), 1.0}};
    announce(QStringLiteral("/org/freedesktop/UPower/devices/battery_battery"),
             "org.freedesktop.UPower.Device", changed, {});
    announce(Display, "org.freedesktop.UPower", changed, {});
    QCOMPARE(textOf(battery), QStringLiteral("Normal Disconnected 76"));
    announce(Display, "org.freedesktop.UPower.Device", changed, {});
    QCOMPARE(textOf(battery), QStringLiteral("Normal Disconnected 1"));
    // What is only said to have changed is asked for.
    announce(Display, "org.freedesktop.UPower.Device", {}, {QStringLiteral("Percentage")});
    becomes(battery, QStringLiteral("Normal Disconnected 76"));
}

void BatteryInfoTest::announcementsOfAnotherShapeAreNotTaken_data()
{
    QTest::addColumn<QVariantList>("arguments");
    const QString interface = QStringLiteral("org.freedesktop.UPower.Device");
    const QVariantMap changed{{QStringLiteral("Percentage"), 1.0}};
    const QVariant numbers = QVariant::fromValue(QList<int>{1, 2});
    QTest::newRow("nothing") << QVariantList();
    QTest::newRow("interface alone") << QVariantList{interface};
    QTest::newRow("no list") << QVariantList{interface, changed};
    QTest::newRow("number for the interface") << QVariantList{7, changed, QStringList()};
    QTest::newRow("numbers for the properties") << QVariantList{interface, numbers, QStringList()};
    QTest::newRow("numbers for the list") << QVariantList{interface, changed, numbers};
    QTest::newRow("one more") << QVariantList{interface, changed, QStringList(), 7};
}

void BatteryInfoTest::announcementsOfAnotherShapeAreNotTaken()
{
    QFETCH(QVariantList, arguments);
    qDBusRegisterMetaType<QList<int>>();
    const BatteryInfo battery;
    becomes(battery, QStringLiteral("Normal Disconnected 76"));
    m_phone->emitSignal(Service, Display, QStringLiteral("org.freedesktop.DBus.Properties"),
                        QStringLiteral("PropertiesChanged"), arguments);
    QCOMPARE(textOf(battery), QStringLiteral("Normal Disconnected 76"));
    // It still listens.
    set("50", "off");
    becomes(battery, QStringLiteral("Normal Disconnected 50"));
}

void BatteryInfoTest::deletionInASlot()
{
    auto battery = std::make_unique<BatteryInfo>();
    connect(battery.get(), &BatteryInfo::chargePercentageChanged, this, [&] { battery.reset(); });
    QVERIFY(waitUntil([&] { return !battery; }));
    battery = std::make_unique<BatteryInfo>();
    connect(battery.get(), &BatteryInfo::statusChanged, this, [&] { battery.reset(); });
    QVERIFY(waitUntil([&] { return !battery; }));
}

void BatteryInfoTest::deletionWhenTheServiceLeaves()
{
    auto battery = std::make_unique<BatteryInfo>();
    becomes(*battery, QStringLiteral("Normal Disconnected 76"));
    connect(battery.get(), &BatteryInfo::statusChanged, this, [&] { battery.reset(); });
    m_phone->stopService(Service);
    QVERIFY(waitUntil([&] { return !battery; }));
}

void BatteryInfoTest::worksThroughTheMetaObject()
{
    BatteryInfo battery;
    QCOMPARE(battery.metaObject()->className(), "Corvane::Mdm::BatteryInfo");
    becomes(battery, QStringLiteral("Normal Disconnected 76"));
    QCOMPARE(battery.property("chargePercentage").toInt(), 76);
    QCOMPARE(battery.property("status").value<BatteryStatus::Status>(), BatteryStatus::Normal);
    QCOMPARE(battery.property("chargerStatus").value<BatteryStatus::ChargerStatus>(),
             BatteryStatus::Disconnected);
    // All of it is the base class's.
    const QMetaObject *meta = battery.metaObject();
    QCOMPARE(meta->superClass(), &BatteryStatus::staticMetaObject);
    QCOMPARE(meta->propertyOffset(), meta->propertyCount());
    QCOMPARE(meta->methodOffset(), meta->methodCount());
    QObject parent;
    const auto *child = new BatteryInfo(&parent);
    QCOMPARE(child->parent(), &parent);
}

QTEST_GUILESS_MAIN(BatteryInfoTest)
#include "batteryinfo_test.moc"
