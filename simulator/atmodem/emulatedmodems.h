// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_EMULATEDMODEMS_H
#define CORVANE_SIMULATOR_EMULATEDMODEMS_H

#include "atmodem.h"
#include "atport.h"
#include "busconnection.h"
#include "daemonhardware.h"
#include "simtray.h"

#include <memory>
#include <vector>

namespace Corvane
{
namespace Simulator
{

/** The modems of the phone's SIM slots, for a real oFono with its driver for emulated modems. */
class EmulatedModems : public DaemonHardware
{
public:
    explicit EmulatedModems(Phone &phone);
    ~EmulatedModems() override;

    std::map<std::string, std::string> prepare() override;
    void bringUp(std::function<void()> done) override;
    QString missing() const override;
    void release() override;
    void describe(QJsonObject &state) const override;
    std::vector<Action> actions() override;

private:
    class BringUp;
    struct Slot {
        Slot(Sim &sim, std::size_t number)
            : modem(sim, number)
            , port(modem)
        {
        }
        AtModem modem;
        AtPort port;
    };

    QString lockSim(const QStringList &arguments);
    QString setNetwork(const QStringList &arguments);
    QString setTrace(const QStringList &arguments);

    Phone &m_phone;
    const SimTray m_tray;
    std::vector<std::unique_ptr<Slot>> m_slots;
    std::unique_ptr<BringUp> m_bringUp;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_EMULATEDMODEMS_H
