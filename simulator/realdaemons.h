// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_REALDAEMONS_H
#define CORVANE_SIMULATOR_REALDAEMONS_H

#include "daemonhardware.h"

#include <QtCore/QString>
#include <QtCore/QStringList>

#include <functional>
#include <map>
#include <memory>
#include <string>
#include <vector>

namespace Corvane
{
namespace Simulator
{

/** A daemon of the distribution that can run in the phone in place of simulated services. */
struct RealDaemon {
    QString name; ///< as on the command line
    QStringList busNames; ///< which it owns; it is started and stopped by the name of the first
    std::vector<std::string> command; ///< the program's absolute path and its arguments
    std::string package; ///< of Debian
    std::vector<std::string> folders; ///< that it writes to, below /etc, /usr or /var
    /** What of ours it loads: absolute paths in the phone, and where that lies, seen from the simulator. */
    std::map<std::string, std::string> additions;
    /** What it drives. */
    std::function<std::unique_ptr<DaemonHardware>(Phone &phone)> createHardware;

    /** Where its output goes, in the phone. */
    std::string logFile() const;
};

/** All that are known. */
const std::vector<RealDaemon> &realDaemons();

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_REALDAEMONS_H
