// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_DEVICEINFO_RUMODEVICEINFO_H
#define CORVANEMDM_PLATFORM_DEVICEINFO_RUMODEVICEINFO_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QString>

/**
 * What a device is and which one it is. The running device is read from the firmware's tables (DMI) or, where
 * there are none, from the device tree. What cannot be found is empty.
 */
class CORVANEMDM_PLATFORM_EXPORT RumoDeviceInfo
{
public:
    enum DisplayNameType : int { Manufacturer = 0, ProductName = 1 };

    /** @param model the model to tell of; empty: the running device. Of another one only the model is known.
     */
    explicit RumoDeviceInfo(const QString &model);

    /** For programs: what distinguishes the model. */
    QString deviceModel() const;
    /** What distinguishes this device from all others: its machine-id, a number in hexadecimal digits. */
    QString deviceUid() const;
    /** For people. */
    QString displayName(int type) const;

private:
    QString m_model;
    QString m_manufacturer;
    QString m_productName;
};

#endif // CORVANEMDM_PLATFORM_DEVICEINFO_RUMODEVICEINFO_H
