// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_LOCATIONSETTINGS_P_H
#define CORVANEMDM_LOCATIONSETTINGS_P_H

#include <corvanemdm/locationsettings.h>

#include <systemsettings/locationsettings.h>

namespace Corvane
{
namespace Mdm
{

/** In here the plain name is the base class. */
class LocationSettingsPrivate : public ::LocationSettings
{
    Q_OBJECT

public:
    LocationSettingsPrivate(Mdm::LocationSettings *settings, Mdm::LocationSettings::Mode mode);

    /** One to one. */
    void forwardSignals();

private:
    Mdm::LocationSettings *const q;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_LOCATIONSETTINGS_P_H
