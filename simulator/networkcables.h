// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_NETWORKCABLES_H
#define CORVANE_SIMULATOR_NETWORKCABLES_H

#include "busconnection.h"
#include "daemonhardware.h"
#include "glibpointers.h"

#include <memory>
#include <vector>

namespace Corvane
{
namespace Simulator
{

/**
 * The interfaces that a real ConnMan finds in the phone, each with a network behind it that gives addresses
 * and leads nowhere: "eth0", and "dummy0", which a real oFono's emulated modems send mobile data through.
 */
class NetworkCables : public DaemonHardware
{
public:
    NetworkCables();
    ~NetworkCables() override;

    std::map<std::string, std::string> prepare() override;
    /** Waits until the wired network is up, unless the phone was left in flight mode. */
    void bringUp(std::function<void()> done) override;
    QString missing() const override;
    void release() override;
    void describe(QJsonObject &state) const override;
    std::vector<Action> actions() override;

private:
    struct Cable;
    class BringUp;

    QString setPlugged(const QStringList &arguments, bool isPlugged);

    std::vector<std::unique_ptr<Cable>> m_cables;
    std::unique_ptr<BringUp> m_bringUp;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_NETWORKCABLES_H
