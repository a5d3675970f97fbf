// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_MDMPROXY_P_H
#define CORVANEMDM_MDMPROXY_P_H

#include "frame/latin1_p.h"

namespace Corvane
{
namespace Mdm
{

/** The privileged service that serves one object and one interface per feature on the system bus. */
namespace MdmProxy
{

struct Endpoint {
    QLatin1String path;
    QLatin1String interface;
};

constexpr QLatin1String Service = "org.corvaneos.mdmproxy"_L1;

constexpr Endpoint Accounts = {"/Corvane/Mdm/Proxy/Accounts"_L1, "org.corvaneos.mdmproxy.accounts"_L1};
constexpr Endpoint CallStatistics
    = {"/Corvane/Mdm/Proxy/CallStatistics"_L1, "org.corvaneos.mdmproxy.callstatistics"_L1};
constexpr Endpoint LocationInfo
    = {"/Corvane/Mdm/Proxy/LocationInfo"_L1, "org.corvaneos.mdmproxy.locationinfo"_L1};
constexpr Endpoint NotificationInfo
    = {"/Corvane/Mdm/Proxy/NotificationInfo"_L1, "org.corvaneos.mdmproxy.notificationinfo"_L1};
constexpr Endpoint SoftwareUpdate
    = {"/Corvane/Mdm/Proxy/SoftwareUpdate"_L1, "org.corvaneos.mdmproxy.softwareupdate"_L1};
constexpr Endpoint Autostart = {"/Corvane/Mdm/Proxy/Autostart"_L1, "org.corvaneos.mdmproxy.autostart"_L1};

} // namespace MdmProxy

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_MDMPROXY_P_H
