// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_SANDBOX_H
#define CORVANE_SIMULATOR_SANDBOX_H

#include <map>
#include <stdexcept>
#include <string>
#include <sys/types.h>
#include <vector>

namespace Corvane
{
namespace Simulator
{

/** The phone could not be set up; the text says at which step, and what to do. */
class SetUpError : public std::runtime_error
{
public:
    using std::runtime_error::runtime_error;

    /** With the text of the present errno. */
    static SetUpError fromErrno(const std::string &step, const std::string &advice = {});
};

/** What the phone has at fixed paths, beside or in place of what the machine has there. */
struct PhoneFiles {
    /** Contents by absolute path, below /etc, /usr or /var. */
    std::map<std::string, std::string> files;
    /** Where symbolic links lead to, by absolute path below /etc, /usr or /var. They hide what is there. */
    std::map<std::string, std::string> links;
    /** Folders below /etc, /usr or /var that everything in the phone may write to. */
    std::vector<std::string> writableFolders;
    /** Folders below /etc, /usr or /var in which the phone has its own files and none of the machine's. */
    std::vector<std::string> ownFolders;
};

/**
 * Forks a process that is process 1 of a phone, with every right in there also when the caller is an ordinary
 * user. The caller itself stays on the machine. Returns as fork() does.
 */
pid_t forkIntoPhone();

/**
 * Builds the phone around the calling process, which is process 1 of new namespaces: the file system, the
 * network's loopback, the host name. Everything lies in memory and goes with the last process.
 */
void buildPhone(const std::string &hostName, const PhoneFiles &files);

/** Gives up for good, for all children, what reaches past the namespaces: the clock, kernel modules,
 * reboot... */
void dropCapabilities();

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_SANDBOX_H
