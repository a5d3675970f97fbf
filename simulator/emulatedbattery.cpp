// SPDX-License-Identifier: LGPL-2.1-or-later
#include "emulatedbattery.h"

#include <fstream>
#include <stdexcept>
#include <string>

namespace Corvane
{
namespace Simulator
{

namespace
{

constexpr long long fullEnergy = 12000000; // uWh

/** "P: ..." and so on, in umockdev's words. */
std::string description(const Battery &battery)
{
    const auto energy = std::to_string((long long)(fullEnergy * battery.percentage / 100));
    std::string text = "P: /devices/platform/charger/power_supply/usb\n"
                       "E: SUBSYSTEM=power_supply\n"
                       "E: POWER_SUPPLY_NAME=usb\n"
                       "A: type=USB\n"
                       "A: online="
        + std::string(battery.hasCharger ? "1" : "0") + "\n\n";
    if (battery.isPresent) {
        text += "P: /devices/platform/battery/power_supply/battery\n"
                "E: SUBSYSTEM=power_supply\n"
                "E: POWER_SUPPLY_NAME=battery\n"
                "A: type=Battery\n"
                "A: scope=System\n"
                "A: present=1\n"
                "A: status="
            + std::string(battery.hasCharger ? "Charging" : "Discharging")
            + "\n"
              "A: capacity="
            + std::to_string(int(battery.percentage))
            + "\n"
              "A: energy_full="
            + std::to_string(fullEnergy)
            + "\n"
              "A: energy_now="
            + energy
            + "\n"
              "A: power_now=1500000\n"
              "A: voltage_now=3900000\n\n";
    }
    return text;
}

} // namespace

const char *EmulatedBattery::descriptionFile()
{
    return "/run/corvane-simulator/battery.umockdev";
}

std::map<std::string, std::string> EmulatedBattery::prepare()
{
    std::ofstream file(descriptionFile());
    file << description(m_battery);
    if (!file.flush())
        throw std::runtime_error(std::string("cannot write ") + descriptionFile());
    // What umockdev-run makes of it is the phone's, too.
    return {{"TMPDIR", "/run/corvane-simulator"}};
}

void EmulatedBattery::describe(QJsonObject &state) const
{
    state.insert(QStringLiteral("battery"), m_battery.describe());
}

} // namespace Simulator
} // namespace Corvane
