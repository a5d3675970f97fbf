// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_DATETIMESETTINGS_P_H
#define CORVANEMDM_DATETIMESETTINGS_P_H

#include <systemsettings/datetimesettings.h>

#include <QtCore/QStringList>

namespace Corvane
{
namespace Mdm
{

class DateTimeSettingsPrivate : public ::DateTimeSettings
{
    Q_OBJECT

public:
    DateTimeSettingsPrivate();

    const QStringList &supportedTimeZones() const { return m_supportedTimeZones; }

private:
    QStringList m_supportedTimeZones; ///< as they were at construction
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_DATETIMESETTINGS_P_H
