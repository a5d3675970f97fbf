// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_MDMPROXY_P_H
#define CORVANEMDM_MDMPROXY_P_H

#include <QtCore/QLatin1String>

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

// Not constexpr: QLatin1String counts its characters with strlen, which Clang does not take for a constant.
const QLatin1String Service("org.corvaneos.mdmproxy");

const Endpoint Accounts
    = {QLatin1String("/Corvane/Mdm/Proxy/Accounts"), QLatin1String("org.corvaneos.mdmproxy.accounts")};
const Endpoint CallStatistics = {QLatin1String("/Corvane/Mdm/Proxy/CallStatistics"),
                                 QLatin1String("org.corvaneos.mdmproxy.callstatistics")};
const Endpoint LocationInfo = {QLatin1String("/Corvane/Mdm/Proxy/LocationInfo"),
                               QLatin1String("org.corvaneos.mdmproxy.locationinfo")};
const Endpoint NotificationInfo = {QLatin1String("/Corvane/Mdm/Proxy/NotificationInfo"),
                                   QLatin1String("org.corvaneos.mdmproxy.notificationinfo")};
const Endpoint SoftwareUpdate = {QLatin1String("/Corvane/Mdm/Proxy/SoftwareUpdate"),
                                 QLatin1String("org.corvaneos.mdmproxy.softwareupdate")};
const Endpoint Autostart
    = {QLatin1String("/Corvane/Mdm/Proxy/Autostart"), QLatin1String("org.corvaneos.mdmproxy.autostart")};

} // namespace MdmProxy

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_MDMPROXY_P_H
