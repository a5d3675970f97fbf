// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_REALDAEMONS_H
#define CORVANE_SIMULATOR_REALDAEMONS_H

#include <QtCore/QString>
#include <QtCore/QStringList>

#include <string>
#include <vector>

namespace Corvane
{
namespace Simulator
{

/** A daemon of the distribution that can run in the phone in place of simulated services. */
struct RealDaemon {
    QString name; ///< as on the command line
    QStringList busNames; ///< which it owns; it is ready when it has them all
    std::vector<std::string> command; ///< the program's absolute path and its arguments
    std::string package; ///< of Debian
    std::vector<std::string> folders; ///< that it writes to, below /etc, /usr or /var

    /** Where its output goes, in the phone. */
    std::string logFile() const;
};

/** All that are known. */
const std::vector<RealDaemon> &realDaemons();

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_REALDAEMONS_H
