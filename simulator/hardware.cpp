// SPDX-License-Identifier: LGPL-2.1-or-later
#include "hardware.h"

#include "sandbox.h"

#include <QtCore/QSaveFile>

namespace Corvane
{
namespace Simulator
{

namespace
{

constexpr char osReleaseFile[] = "/etc/os-release";
constexpr char boardAddressFile[] = "/var/lib/bluetooth/board-address";
constexpr char firmwareFolder[] = "/sys/class/dmi/id/";
constexpr char wirelessFolder[] = "/sys/class/net/wlan0/";

QByteArray osRelease(const QString &version)
{
    return "NAME=\"Corvane OS\"\nID=corvane\nVERSION=\"" + version.toUtf8()
        + "\"\nVERSION_ID=" + version.toUtf8() + "\nPRETTY_NAME=\"Corvane OS " + version.toUtf8() + "\"\n";
}

} // namespace

void addHardware(const QJsonObject &profile, PhoneFiles &files)
{
    const QString installed = profile.value(QLatin1String("softwareUpdate"))
                                  .toObject()
                                  .value(QLatin1String("installed"))
                                  .toString();
    files.files[osReleaseFile] = osRelease(installed).toStdString();

    const QJsonObject hardware = profile.value(QLatin1String("hardware")).toObject();
    const auto add = [&](const std::string &path, const char *member) {
        const QString text = hardware.value(QLatin1String(member)).toString();
        if (!text.isEmpty())
            files.files[path] = text.toStdString() + "\n";
    };
    const std::string firmware(firmwareFolder);
    add(firmware + "sys_vendor", "manufacturer");
    add(firmware + "product_name", "model");
    add(firmware + "product_family", "productName");
    add(boardAddressFile, "bluetoothAddress");
    const std::string wireless(wirelessFolder);
    add(wireless + "address", "wlanAddress");
    // The mark of a wireless interface.
    if (files.files.count(wireless + "address"))
        files.writableFolders.push_back(wireless + "phy80211");
}

void setOperatingSystem(const QString &version)
{
    QSaveFile file{QLatin1String(osReleaseFile)};
    if (file.open(QIODevice::WriteOnly)) {
        file.write(osRelease(version));
        file.commit();
    }
}

} // namespace Simulator
} // namespace Corvane
