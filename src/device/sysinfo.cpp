// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/sysinfo.h>

#include <deviceinfo/rumodeviceinfo.h>
#include <systemsettings/aboutsettings.h>

#include <QtCore/QDebug>
#include <QtCore/QFile>

namespace Corvane
{
namespace Mdm
{

namespace
{

const QLatin1String BoardAddressFile("/var/lib/bluetooth/board-address");

RumoDeviceInfo runningDevice()
{
    return RumoDeviceInfo(QString());
}

} // namespace

QString SysInfo::softwareVersion()
{
    return AboutSettings().softwareVersion();
}

QString SysInfo::softwareVersionId()
{
    return AboutSettings().softwareVersionId();
}

QString SysInfo::wlanMacAddress()
{
    return AboutSettings().wlanMacAddress();
}

QString SysInfo::deviceModel()
{
    return runningDevice().deviceModel();
}

QString SysInfo::deviceUid()
{
    return runningDevice().deviceUid();
}

QString SysInfo::productName()
{
    return runningDevice().displayName(RumoDeviceInfo::ProductName);
}

QString SysInfo::manufacturer()
{
    return runningDevice().displayName(RumoDeviceInfo::Manufacturer);
}

QString SysInfo::bluetoothMacAddress()
{
    QFile file(BoardAddressFile);
    QByteArray line;
    if (file.open(QIODevice::ReadOnly))
        line = file.readLine();
    if (line.isNull()) {
        qWarning("Unable to read file bluetooth MAC address.");
        return QString();
    }
    return QString::fromLatin1(line).toLower().trimmed();
}

} // namespace Mdm
} // namespace Corvane
