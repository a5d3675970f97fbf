// SPDX-License-Identifier: LGPL-2.1-or-later
#include "realdaemons.h"

#include "atmodem/emulatedmodems.h"
#include "networkcables.h"

namespace Corvane
{
namespace Simulator
{

namespace
{

std::unique_ptr<DaemonHardware> createModems(Phone &phone)
{
    return std::make_unique<EmulatedModems>(phone);
}

RealDaemon stockOfono(const QString &name)
{
    return {
        name,
        {QStringLiteral("org.ofono")},
        {"/usr/sbin/ofonod", "-n"},
        "ofono",
        {"/var/lib/ofono"},
        {},
        createModems,
    };
}

RealDaemon ofonoWithOurPlugin()
{
    RealDaemon ofono = stockOfono(QStringLiteral("ofono"));
    ofono.additions = {{"/usr/lib/ofono/plugins/veldmobile.so", "../lib/ofono/plugins/veldmobile.so"}};
    return ofono;
}

RealDaemon connman()
{
    return {
        QStringLiteral("connman"),
        {QStringLiteral("net.connman")},
        // Its DNS proxy has nothing to forward to.
        {"/usr/sbin/connmand", "-n", "-r"},
        "connman",
        {"/var/lib/connman"},
        {},
        [](Phone &) -> std::unique_ptr<DaemonHardware> { return std::make_unique<NetworkCables>(); },
    };
}

} // namespace

std::string RealDaemon::logFile() const
{
    return "/run/corvane-simulator/" + name.toStdString() + ".log";
}

const std::vector<RealDaemon> &realDaemons()
{
    static const std::vector<RealDaemon> daemons{ofonoWithOurPlugin(),
                                                 stockOfono(QStringLiteral("stock-ofono")), connman()};
    return daemons;
}

} // namespace Simulator
} // namespace Corvane
