// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_DEVICEENCRYPTION_P_H
#define CORVANEMDM_DEVICEENCRYPTION_P_H

namespace Corvane
{
namespace Mdm
{

/** How the phone keeps its data. */
namespace DeviceEncryption
{

/** Whether the partition of the user's data has a LUKS header; looks with each call. */
bool isHomeEncrypted();

} // namespace DeviceEncryption

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_DEVICEENCRYPTION_P_H
