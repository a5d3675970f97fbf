// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_EMULATEDBATTERY_H
#define CORVANE_SIMULATOR_EMULATEDBATTERY_H

#include "daemonhardware.h"
#include "phone.h"

namespace Corvane
{
namespace Simulator
{

/** The battery and the charger that a real UPower finds in the phone, as the profile has them. */
class EmulatedBattery : public DaemonHardware
{
public:
    /** What umockdev-run takes for the machine's devices. */
    static const char *descriptionFile();

    explicit EmulatedBattery(const Battery &battery)
        : m_battery(battery)
    {
    }

    std::map<std::string, std::string> prepare() override;
    void bringUp(std::function<void()> done) override { done(); }
    QString missing() const override { return QString(); }
    void release() override { }
    void describe(QJsonObject &state) const override;

private:
    const Battery m_battery;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_EMULATEDBATTERY_H
