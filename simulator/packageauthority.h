// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_PACKAGEAUTHORITY_H
#define CORVANE_SIMULATOR_PACKAGEAUTHORITY_H

#include "busconnection.h"
#include "daemonhardware.h"

namespace Corvane
{
namespace Simulator
{

/** What a real PackageKit finds in the phone: the package database, and polkitd, which it asks who may do
 * what. */
class PackageAuthority : public DaemonHardware
{
public:
    explicit PackageAuthority(const Phone &phone);
    ~PackageAuthority() override;

    void describe(QJsonObject &) const override { }
    std::map<std::string, std::string> prepare() override;
    void bringUp(std::function<void()> done) override;
    QString missing() const override;
    void release() override { m_done = nullptr; }

private:
    void look();

    BusConnection m_connection;
    GObjectPointer<GSubprocess> m_process;
    std::function<void()> m_done;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_PACKAGEAUTHORITY_H
