// SPDX-License-Identifier: LGPL-2.1-or-later
#include <deviceinfo/rumodeviceinfo.h>

#include <QtCore/QFile>

namespace
{

const QLatin1String firmwareFolder("/sys/class/dmi/id/");
const QLatin1String deviceTreeFolder("/sys/firmware/devicetree/base/");
const QLatin1String machineIdFile("/etc/machine-id");

/** Up to the end of the line, or the first NUL, with which device trees end their strings. */
QString firstString(const QString &fileName)
{
    QFile file(fileName);
    if (!file.open(QIODevice::ReadOnly))
        return QString();
    const QByteArray line = file.readLine();
    return QString::fromUtf8(line.constData()).trimmed();
}

} // namespace

RumoDeviceInfo::RumoDeviceInfo(const QString &model)
    : m_model(model)
{
    if (!m_model.isEmpty())
        return;
    m_model = firstString(firmwareFolder + QLatin1String("product_name"));
    if (!m_model.isEmpty()) {
        m_manufacturer = firstString(firmwareFolder + QLatin1String("sys_vendor"));
        // Where a maker has families of models, they bear the name that people know.
        m_productName = firstString(firmwareFolder + QLatin1String("product_family"));
        if (m_productName.isEmpty())
            m_productName = m_model;
        return;
    }
    // "vendor,model", of which the vendor may be missing.
    const QString compatible = firstString(deviceTreeFolder + QLatin1String("compatible"));
    m_model = compatible.section(QLatin1Char(','), -1);
    m_manufacturer = compatible.section(QLatin1Char(','), 0, -2);
    m_productName = firstString(deviceTreeFolder + QLatin1String("model"));
}

QString RumoDeviceInfo::deviceModel() const
{
    return m_model;
}

QString RumoDeviceInfo::deviceUid() const
{
    return firstString(machineIdFile);
}

QString RumoDeviceInfo::displayName(int type) const
{
    switch (type) {
    case Manufacturer:
        return m_manufacturer;
    case ProductName:
        return m_productName;
    default:
        return QString();
    }
}
