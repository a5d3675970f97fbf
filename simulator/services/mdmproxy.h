// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_MDMPROXY_H
#define CORVANE_SIMULATOR_MDMPROXY_H

#include <QtCore/QLatin1String>

namespace Corvane
{
namespace Simulator
{

/** What the objects of the MDM proxy share. */
namespace MdmProxy
{

const QLatin1String serviceName("org.corvaneos.mdmproxy");

} // namespace MdmProxy
} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_MDMPROXY_H
