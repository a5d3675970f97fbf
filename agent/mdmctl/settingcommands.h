// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SETTINGCOMMANDS_H
#define CORVANE_SETTINGCOMMANDS_H

#include "command.h"
#include "devicesettings.h"

namespace Corvane
{
namespace Agent
{

/** Makes the commands that show and change settings of the phone. */
class SettingCommands
{
public:
    SettingCommands(const QString &family, const DeviceSettingsMaker &make);

    Command show(const QString &name, const QString &summary) const;
    /** "set"; @p example is its arguments. */
    Command set(const QString &example) const;

private:
    using Run = int (*)(DeviceSettings &, const Values &);

    Command command(const QString &name, const QString &summary, Run run) const;

    QString m_family;
    DeviceSettingsMaker m_make;
    QVector<DeviceSetting> m_settings; ///< what there is, to be described alone
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_SETTINGCOMMANDS_H
