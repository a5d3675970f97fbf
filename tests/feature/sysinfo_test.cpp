// SPDX-License-Identifier: LGPL-2.1-or-later
// The facts of the simulated phone, and of machines that have others or none: their files are laid over the
// phone's, for this process alone.
#include "messagelog.h"

#include <corvanemdm/sysinfo.h>

#include <QtCore/QDir>
#include <QtCore/QFile>
#include <QtCore/QFileInfo>
#include <QtTest/QtTest>

#include <sched.h>
#include <sys/mount.h>
#include <type_traits>

using Corvane::Mdm::SysInfo;

static_assert(std::is_empty_v<SysInfo> && !std::is_polymorphic_v<SysInfo>, "functions alone, and no object");

namespace
{

const QString NetworkFolder = QStringLiteral("/sys/class/net/");
const QString FirmwareFolder = QStringLiteral("/sys/class/dmi/id/");
const QString DeviceTreeFolder = QStringLiteral("/sys/firmware/devicetree/base/");
const QString OsRelease = QStringLiteral("/etc/os-release");
const QString VendorOsRelease = QStringLiteral("/usr/lib/os-release");
const QString MachineId = QStringLiteral("/etc/machine-id");
const QString BoardAddress = QStringLiteral("/var/lib/bluetooth/board-address");

constexpr char noAddress[] = "Unable to read file bluetooth MAC address.";

void write(const QString &fileName, const QByteArray &content)
{
    QDir().mkpath(QFileInfo(fileName).path());
    QFile::remove(fileName);
    QFile file(fileName);
    if (!file.open(QIODevice::WriteOnly) || file.write(content) != content.size())
        qFatal("cannot write %s", qPrintable(fileName));
}

void addInterface(const QString &name, const QByteArray &address, const char *wirelessFolder = nullptr)
{
    write(NetworkFolder + name + QStringLiteral("/address"), address);
    if (wirelessFolder)
        QDir().mkpath(NetworkFolder + name + QLatin1Char('/') + QLatin1String(wirelessFolder));
}

} // namespace

class SysInfoTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void phoneOfTheProfile();

    void coverTheMachine();
    void osReleaseIsAShellsFile_data();
    void osReleaseIsAShellsFile();
    void osReleaseOfTheVendor();
    void osReleaseIsReadAnew();
    void wirelessInterface();
    void firmwareTells();
    void deviceTreeTells_data();
    void deviceTreeTells();
    void nothingTells();
    void uidIsTheMachineId();

    void bluetoothAddress_data();
    void bluetoothAddress();
    void bluetoothAddressIsMissing();
};

void SysInfoTest::phoneOfTheProfile()
{
    MessageLog log;
    QCOMPARE(SysInfo::softwareVersion(), QStringLiteral("5.0.0.62"));
    QCOMPARE(SysInfo::softwareVersionId(), QStringLiteral("5.0.0.62"));
    QCOMPARE(SysInfo::manufacturer(), QStringLiteral("Veld Mobile"));
    QCOMPARE(SysInfo::productName(), QStringLiteral("Elo 2"));
    QCOMPARE(SysInfo::deviceModel(), QStringLiteral("vm-e2d"));
    QCOMPARE(SysInfo::wlanMacAddress(), QStringLiteral("02:00:5e:10:00:01"));
    QCOMPARE(SysInfo::bluetoothMacAddress(), QStringLiteral("02:00:5e:10:00:02"));
    QFile machineId(MachineId);
    QVERIFY(machineId.open(QIODevice::ReadOnly));
    QCOMPARE(SysInfo::deviceUid(), QString::fromLatin1(machineId.readAll()).trimmed());
    QCOMPARE(log.takeWarnings(), QStringList());
}

/** From here on the folders that tell of the machine are empty ones, for this process alone. */
void SysInfoTest::coverTheMachine()
{
    QVERIFY(unshare(CLONE_NEWNS) == 0);
    QVERIFY(mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0);
    for (const char *folder : {"/sys/class", "/sys/firmware"})
        QVERIFY2(mount("test", folder, "tmpfs", 0, nullptr) == 0, folder);
}

void SysInfoTest::osReleaseIsAShellsFile_data()
{
    QTest::addColumn<QByteArray>("file");
    QTest::addColumn<QString>("version");
    QTest::addColumn<QString>("versionId");
    QTest::newRow("plain") << QByteArray("NAME=x\nVERSION=5.1\nVERSION_ID=5.1.0\n") << "5.1"
                           << "5.1.0";
    QTest::newRow("quoted") << QByteArray("VERSION=\"5.1 (Tarn)\"\nVERSION_ID='5.1 0'") << "5.1 (Tarn)"
                            << "5.1 0";
    QTest::newRow("escaped") << QByteArray("VERSION=\"a\\\"b\\$c\\\\\"\nVERSION_ID='a\\b'\n") << "a\"b$c\\"
                             << "a\\b";
    QTest::newRow("assigned twice") << QByteArray("VERSION=1\nVERSION=2\n") << "2" << QString();
    QTest::newRow("similar keys") << QByteArray("VERSION_CODENAME=x\nMY_VERSION=1\n#VERSION=2\nVERSION =3\n")
                                  << QString() << QString();
    QTest::newRow("empty values") << QByteArray("VERSION=\nVERSION_ID=\"\"\n") << QString() << QString();
    QTest::newRow("quote without end") << QByteArray("VERSION=\"5.1\nVERSION_ID=\\") << "5.1"
                                       << "\\";
    QTest::newRow("empty") << QByteArray() << QString() << QString();
    QTest::newRow("not Latin") << QByteArray("VERSION=\"5 (\xc3\x84lv)\"\n")
                               << QString::fromUtf8("5 (\xc3\x84lv)") << QString();
    QTest::newRow("bytes") << QByteArray("\0\xff\xfe\nVERSION=1\n", 13) << "1" << QString();
}

void SysInfoTest::osReleaseIsAShellsFile()
{
    QFETCH(QByteArray, file);
    write(OsRelease, file);
    QTEST(SysInfo::softwareVersion(), "version");
    QTEST(SysInfo::softwareVersionId(), "versionId");
}

void SysInfoTest::osReleaseOfTheVendor()
{
    QVERIFY(QFile::remove(OsRelease));
    write(VendorOsRelease, "VERSION=6\nVERSION_ID=6.0\n");
    QCOMPARE(SysInfo::softwareVersion(), QStringLiteral("6"));
    QCOMPARE(SysInfo::softwareVersionId(), QStringLiteral("6.0"));
    QVERIFY(QFile::remove(VendorOsRelease));
    QCOMPARE(SysInfo::softwareVersion(), QString());
}

void SysInfoTest::osReleaseIsReadAnew()
{
    for (const char *version : {"7", "8"}) {
        write(OsRelease, QByteArray("VERSION=") + version);
        QCOMPARE(SysInfo::softwareVersion(), QLatin1String(version));
    }
}

void SysInfoTest::wirelessInterface()
{
    QCOMPARE(SysInfo::wlanMacAddress(), QString());
    addInterface(QStringLiteral("eth0"), "02:00:00:00:00:0e\n");
    QCOMPARE(SysInfo::wlanMacAddress(), QString());
    addInterface(QStringLiteral("wlan1"), "02:00:00:00:00:1A\n", "phy80211");
    QCOMPARE(SysInfo::wlanMacAddress(), QStringLiteral("02:00:00:00:00:1A"));
    // The first by name, also by the older mark.
    addInterface(QStringLiteral("wlan0"), "02:00:00:00:00:00", "wireless");
    QCOMPARE(SysInfo::wlanMacAddress(), QStringLiteral("02:00:00:00:00:00"));
    // One that does not tell is passed over.
    QVERIFY(QFile::remove(NetworkFolder + QStringLiteral("wlan0/address")));
    QCOMPARE(SysInfo::wlanMacAddress(), QStringLiteral("02:00:00:00:00:1A"));
}

void SysInfoTest::firmwareTells()
{
    write(FirmwareFolder + QStringLiteral("product_name"), "20XW\n");
    QCOMPARE(SysInfo::deviceModel(), QStringLiteral("20XW"));
    QCOMPARE(SysInfo::productName(), QStringLiteral("20XW"));
    QCOMPARE(SysInfo::manufacturer(), QString());
    write(FirmwareFolder + QStringLiteral("sys_vendor"), "Maker \n");
    write(FirmwareFolder + QStringLiteral("product_family"), "Family 9\n");
    QCOMPARE(SysInfo::deviceModel(), QStringLiteral("20XW"));
    QCOMPARE(SysInfo::productName(), QStringLiteral("Family 9"));
    QCOMPARE(SysInfo::manufacturer(), QStringLiteral("Maker"));
    // Where both are, the firmware knows the device better than the tree that it hands over.
    write(DeviceTreeFolder + QStringLiteral("compatible"), "other,tree");
    QCOMPARE(SysInfo::deviceModel(), QStringLiteral("20XW"));
    QVERIFY(QDir(FirmwareFolder).removeRecursively());
}

void SysInfoTest::deviceTreeTells_data()
{
    QTest::addColumn<QByteArray>("compatible");
    QTest::addColumn<QString>("deviceModel");
    QTest::addColumn<QString>("manufacturer");
    QTest::newRow("usual") << QByteArray("veld,e2\0soc,sm1\0", 16) << "e2"
                           << "veld";
    QTest::newRow("no maker") << QByteArray("e2\0", 3) << "e2" << QString();
    QTest::newRow("no end") << QByteArray("veld,e2") << "e2"
                            << "veld";
    QTest::newRow("nothing") << QByteArray("\0", 1) << QString() << QString();
}

void SysInfoTest::deviceTreeTells()
{
    QFETCH(QByteArray, compatible);
    write(DeviceTreeFolder + QStringLiteral("compatible"), compatible);
    write(DeviceTreeFolder + QStringLiteral("model"), QByteArray("Veld Elo 2\0", 11));
    QTEST(SysInfo::deviceModel(), "deviceModel");
    QTEST(SysInfo::manufacturer(), "manufacturer");
    QCOMPARE(SysInfo::productName(), QStringLiteral("Veld Elo 2"));
}

void SysInfoTest::nothingTells()
{
    QVERIFY(QDir(DeviceTreeFolder).removeRecursively());
    MessageLog log;
    QCOMPARE(SysInfo::deviceModel(), QString());
    QCOMPARE(SysInfo::manufacturer(), QString());
    QCOMPARE(SysInfo::productName(), QString());
    QCOMPARE(log.takeWarnings(), QStringList());
}

void SysInfoTest::uidIsTheMachineId()
{
    write(MachineId, "0123456789abcdef0123456789abcdef\n");
    QCOMPARE(SysInfo::deviceUid(), QStringLiteral("0123456789abcdef0123456789abcdef"));
    QVERIFY(QFile::remove(MachineId));
    QCOMPARE(SysInfo::deviceUid(), QString());
}

void SysInfoTest::bluetoothAddress_data()
{
    QTest::addColumn<QByteArray>("file");
    QTest::addColumn<QString>("address");
    QTest::newRow("upper case") << QByteArray("AA:BB:CC:DD:EE:0F\n") << "aa:bb:cc:dd:ee:0f";
    QTest::newRow("no newline") << QByteArray("aa:bb:cc:dd:ee:0f") << "aa:bb:cc:dd:ee:0f";
    QTest::newRow("spaces") << QByteArray(" \tAA:bb:cc:dd:ee:0f \r\n") << "aa:bb:cc:dd:ee:0f";
    QTest::newRow("several lines") << QByteArray("AA:BB\nCC:DD\n") << "aa:bb";
    QTest::newRow("Latin-1") << QByteArray("\xc4X\n") << QString::fromUtf8("\xc3\xa4x");
    // A line without an address is a line.
    QTest::newRow("empty line") << QByteArray("\nAA\n") << "";
}

void SysInfoTest::bluetoothAddress()
{
    QFETCH(QByteArray, file);
    write(BoardAddress, file);
    MessageLog log;
    QTEST(SysInfo::bluetoothMacAddress(), "address");
    QCOMPARE(log.takeWarnings(), QStringList());
}

void SysInfoTest::bluetoothAddressIsMissing()
{
    write(BoardAddress, QByteArray());
    QTest::ignoreMessage(QtWarningMsg, noAddress);
    QCOMPARE(SysInfo::bluetoothMacAddress(), QString());
    QVERIFY(QFile::remove(BoardAddress));
    QTest::ignoreMessage(QtWarningMsg, noAddress);
    QCOMPARE(SysInfo::bluetoothMacAddress(), QString());
    QVERIFY(QDir().mkpath(BoardAddress));
    QTest::ignoreMessage(QtWarningMsg, noAddress);
    QCOMPARE(SysInfo::bluetoothMacAddress(), QString());
}

QTEST_GUILESS_MAIN(SysInfoTest)
#include "sysinfo_test.moc"
