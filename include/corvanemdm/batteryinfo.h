// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_BATTERYINFO_H
#define CORVANEMDM_BATTERYINFO_H

#include <corvanemdm/corvanemdm_global.h>

#include <systemsettings/batterystatus.h>

namespace Corvane
{
namespace Mdm
{

/**
 * @brief How full the phone's battery is, and whether it is being charged.
 *
 * All of it is BatteryStatus's, of the phone's settings library.
 */
class CORVANEMDM_EXPORT BatteryInfo : public BatteryStatus
{
    Q_OBJECT

public:
    /** Does not wait for what it tells: the change signals announce it. */
    explicit BatteryInfo(QObject *parent = nullptr);
    ~BatteryInfo() override;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_BATTERYINFO_H
