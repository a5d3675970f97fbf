// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/batteryinfo.h>

namespace Corvane
{
namespace Mdm
{

BatteryInfo::BatteryInfo(QObject *parent)
    : BatteryStatus(parent)
{
}

BatteryInfo::~BatteryInfo() = default;

} // namespace Mdm
} // namespace Corvane
