// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_SYSINFO_H
#define CORVANEMDM_SYSINFO_H

#include <corvanemdm/corvanemdm_global.h>

#include <QtCore/QString>

namespace Corvane
{
namespace Mdm
{

/**
 * @brief Facts about the phone for an inventory.
 *
 * Each function looks at the moment of the call, and keeps nothing. What the phone does not tell is empty;
 * only bluetoothMacAddress() warns of it. No service answers: all of it is read from files.
 */
class CORVANEMDM_EXPORT SysInfo
{
public:
    /** Version of the operating system, for people: it may have a name in it. */
    static QString softwareVersion();
    /** Version of the operating system, for programs. */
    static QString softwareVersionId();
    /** Hardware address of the first wireless network interface, "02:00:5e:10:00:01". */
    static QString wlanMacAddress();
    /** The model, as its maker distinguishes it. */
    static QString deviceModel();
    /** What distinguishes this phone from all others. */
    static QString deviceUid();
    /** The name under which the model is sold. */
    static QString productName();
    /** The maker. */
    static QString manufacturer();
    /**
     * Hardware address of the Bluetooth adapter, in lower case.
     * @return empty (with a warning) when the phone has not stored it.
     */
    static QString bluetoothMacAddress();
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_SYSINFO_H
