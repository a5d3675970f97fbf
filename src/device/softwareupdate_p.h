// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_SOFTWAREUPDATE_P_H
#define CORVANEMDM_SOFTWAREUPDATE_P_H

#include <QtDBus/QDBusInterface>

namespace Corvane
{
namespace Mdm
{

/** The proxy's software-update object. */
class SoftwareUpdatePrivate : public QDBusInterface
{
public:
    SoftwareUpdatePrivate();
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_SOFTWAREUPDATE_P_H
