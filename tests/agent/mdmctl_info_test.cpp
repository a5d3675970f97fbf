// SPDX-License-Identifier: LGPL-2.1-or-later
#include "mdmctl.h"
#include "phone.h"

#include <QtCore/QFile>
#include <QtCore/QJsonArray>
#include <QtTest/QtTest>

namespace
{

Mdmctl::Result info(const QStringList &options = QStringList())
{
    return Mdmctl::run(QStringList(QStringLiteral("info")) + options);
}

} // namespace

/** The inventory of the phone, and of one that keeps much to itself. */
class MdmctlInfoTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void fitsOneScreen();
    void everythingAsJson();
    void servicesThatAreNotThere();
    void factsThatAreNotThere();

private:
    Phone m_phone;
};

void MdmctlInfoTest::fitsOneScreen()
{
    const Mdmctl::Result shown = info();
    QCOMPARE(shown.errors, QString());
    QCOMPARE(shown.status, 0);
    const QStringList lines = shown.output.split(QLatin1Char('\n'));
    QVERIFY(lines.size() <= 24);
    for (const QString &line : lines)
        QVERIFY2(line.size() <= 100, qPrintable(line));
    for (const char *text : {"device       Veld Mobile Elo 2 (vm-e2d)\n",
                             "SIM 0        244051234567890, Elo Mobile, +358401234567, IMEI ",
                             "SIM 1        262021234567891, Tarn Telecom, +4915112345678, IMEI ",
                             "WLAN         02:00:5e:10:00:01\n", "Bluetooth    02:00:5e:10:00:02\n",
                             "lock         unlocked\n", "user's data  encrypted\n", "packages     "})
        QVERIFY2(shown.output.contains(QLatin1String(text)), qPrintable(shown.output));
}

void MdmctlInfoTest::everythingAsJson()
{
    const QJsonObject shown = info({QStringLiteral("--json")}).json();
    QCOMPARE(shown.value(QLatin1String("manufacturer")).toString(), QStringLiteral("Veld Mobile"));
    QCOMPARE(shown.value(QLatin1String("model")).toString(), QStringLiteral("vm-e2d"));
    QCOMPARE(shown.value(QLatin1String("productName")).toString(), QStringLiteral("Elo 2"));
    QVERIFY(!shown.value(QLatin1String("softwareVersionId")).toString().isEmpty());
    QVERIFY(!shown.value(QLatin1String("deviceUid")).toString().isEmpty());
    QCOMPARE(shown.value(QLatin1String("lockState")).toString(), QStringLiteral("unlocked"));
    QCOMPARE(shown.value(QLatin1String("homeEncrypted")), QJsonValue(true));
    const QJsonArray sims = shown.value(QLatin1String("sims")).toArray();
    QCOMPARE(sims.size(), 2);
    QCOMPARE(sims.first()[QLatin1String("imsi")].toString(), QStringLiteral("244051234567890"));
    QVERIFY(shown.value(QLatin1String("packages")).isDouble());
    QCOMPARE(shown.value(QLatin1String("missingServices")).toArray(), QJsonArray());
}

void MdmctlInfoTest::servicesThatAreNotThere()
{
    const QStringList services{QStringLiteral("org.ofono"), QStringLiteral("org.veldmobile.devicelock")};
    for (const QString &service : services)
        m_phone.stopService(service);
    const Mdmctl::Result shown = info();
    const QJsonObject json = info({QStringLiteral("--json")}).json();
    for (const QString &service : services)
        m_phone.startService(service);
    QCOMPARE(shown.errors, QString());
    QCOMPARE(shown.status, 0);
    QVERIFY(shown.output.contains(
        QStringLiteral("SIMs         not known: the telephony service (org.ofono) is not running\n")));
    QVERIFY(shown.output.contains(QStringLiteral(
        "lock         not known: the device-lock daemon (org.veldmobile.devicelock) is not running\n")));
    QVERIFY(shown.output.contains(QStringLiteral("user's data  encrypted\n")));
    QCOMPARE(json.value(QLatin1String("missingServices")).toArray(), QJsonArray::fromStringList(services));
    QVERIFY(json.value(QLatin1String("sims")).isNull());
    QVERIFY(json.value(QLatin1String("lockState")).isNull());
}

void MdmctlInfoTest::factsThatAreNotThere()
{
    const QString address = QStringLiteral("/var/lib/bluetooth/board-address");
    const QString home = QStringLiteral("/dev/corvane/home");
    QVERIFY(QFile::rename(address, address + QStringLiteral(".away")));
    QVERIFY(QFile::rename(home, home + QStringLiteral(".away")));
    const Mdmctl::Result shown = info();
    QVERIFY(QFile::rename(address + QStringLiteral(".away"), address));
    QVERIFY(QFile::rename(home + QStringLiteral(".away"), home));
    QCOMPARE(shown.errors, QString());
    QVERIFY(shown.output.contains(QStringLiteral("Bluetooth    not known\n")));
    QVERIFY(shown.output.contains(QStringLiteral("user's data  not encrypted\n")));
}

QTEST_GUILESS_MAIN(MdmctlInfoTest)
#include "mdmctl_info_test.moc"
