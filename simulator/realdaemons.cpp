// SPDX-License-Identifier: LGPL-2.1-or-later
#include "realdaemons.h"

namespace Corvane
{
namespace Simulator
{

std::string RealDaemon::logFile() const
{
    return "/run/corvane-simulator/" + name.toStdString() + ".log";
}

const std::vector<RealDaemon> &realDaemons()
{
    static const std::vector<RealDaemon> daemons{
        {
            QStringLiteral("ofono"),
            {QStringLiteral("org.ofono")},
            {"/usr/sbin/ofonod", "-n"},
            "ofono",
            {"/var/lib/ofono"},
        },
    };
    return daemons;
}

} // namespace Simulator
} // namespace Corvane
