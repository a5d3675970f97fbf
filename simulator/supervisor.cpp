// SPDX-License-Identifier: LGPL-2.1-or-later
#include "supervisor.h"

#include "busconnection.h"
#include "component.h"
#include "device.h"
#include "logtail.h"
#include "sandbox.h"

#include <QtCore/QCryptographicHash>

#include <algorithm>
#include <cerrno>
#include <climits>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <fstream>
#include <map>
#include <optional>
#include <poll.h>
#include <sstream>
#include <sys/prctl.h>
#include <sys/signalfd.h>
#include <sys/wait.h>
#include <unistd.h>

namespace Corvane
{
namespace Simulator
{

namespace
{

constexpr int readinessTimeout = 20000; // ms; a loaded machine may take seconds
constexpr int daemonsTimeout = 120000; // ms; those who start them give up earlier, and say more
constexpr int farewellTimeout = 5000; // ms

const std::string busConfigurationFile = "/run/corvane-simulator/bus.conf";
const std::string busLogFile = "/run/corvane-simulator/dbus-daemon.log";

/** What is passed on to the command when somebody sends it to the simulator. */
constexpr int forwardedSignals[] = {SIGHUP, SIGINT, SIGQUIT, SIGTERM, SIGUSR1, SIGUSR2};

sigset_t handledSignals()
{
    sigset_t set;
    sigemptyset(&set);
    sigaddset(&set, SIGCHLD);
    for (const int number : forwardedSignals)
        sigaddset(&set, number);
    return set;
}

/** A signal that a terminal sends goes to its whole foreground, so the command has it already. */
bool isFromTerminal(int code)
{
    return code == SI_KERNEL;
}

int exitStatus(int waitStatus)
{
    return WIFSIGNALED(waitStatus) ? 128 + WTERMSIG(waitStatus) : WEXITSTATUS(waitStatus);
}

class Pipe
{
public:
    Pipe()
    {
        if (pipe2(m_ends, O_CLOEXEC) < 0)
            throw SetUpError::fromErrno("cannot create a pipe");
    }
    ~Pipe()
    {
        closeReader();
        closeWriter();
    }
    Pipe(const Pipe &) = delete;
    Pipe &operator=(const Pipe &) = delete;

    int reader() const { return m_ends[0]; }
    int writer() const { return m_ends[1]; }
    void closeReader() { closeEnd(0); }
    void closeWriter() { closeEnd(1); }
    int releaseWriter() { return std::exchange(m_ends[1], -1); }

private:
    void closeEnd(int end)
    {
        if (m_ends[end] >= 0)
            close(std::exchange(m_ends[end], -1));
    }
    int m_ends[2] = {-1, -1};
};

std::string contentOf(const std::string &fileName)
{
    std::ifstream file(fileName, std::ios::binary);
    std::ostringstream content;
    content << file.rdbuf();
    if (!file)
        throw SetUpError::fromErrno("cannot read " + fileName,
                                    "it belongs to what --real wants; build or install it");
    return content.str();
}

void redirect(const std::string &fileName, int flags, int fd)
{
    const int file = open(fileName.c_str(), flags | O_CLOEXEC, 0644);
    if (file >= 0) {
        dup2(file, fd);
        close(file);
    }
}

/** Whether a shell would find @p program, which execvp() does not tell from a folder in PATH that it cannot
 * enter. */
bool isFound(const std::string &program)
{
    if (program.find('/') != std::string::npos)
        return access(program.c_str(), F_OK) == 0;
    std::istringstream folders(std::getenv("PATH"));
    for (std::string folder; std::getline(folders, folder, ':');) {
        if (access((folder + "/" + program).c_str(), F_OK) == 0)
            return true;
    }
    return false;
}

/** A signal that asked for the end before the command could start. */
struct Interruption {
    int signal;
};

/** Process 1 of the phone: starts everything in it, and ends with the command. */
class Supervisor
{
public:
    Supervisor(const RunSettings &settings, const sigset_t &callersSignals);
    ~Supervisor();
    Supervisor(const Supervisor &) = delete;
    Supervisor &operator=(const Supervisor &) = delete;

    int run();

private:
    /** What a forked process that is not the supervisor has to exit with; empty in the supervisor itself. */
    using ForkedStatus = std::optional<int>;

    PhoneFiles phoneFiles() const;
    void prepareEnvironment() const;
    static void writeBusConfiguration();

    static pid_t forkChild(const std::string &name);
    /** In a child: a session of its own, nothing on standard input, all output to the log or standard error.
     */
    static void becomeService(const std::string &logFile = {});
    [[noreturn]] static void execute(const std::vector<std::string> &command);
    void startProgram(const std::string &name, const std::vector<std::string> &command,
                      const std::string &logFile, int keptFd = -1);
    void startBus();
    ForkedStatus startDevice();
    void startCommand();

    /** Waits for the first byte from the other end of @p pipe. */
    void waitUntilReady(Pipe &pipe, const std::string &what, const std::string &logFile, int timeout);
    static std::string lastWords(const std::string &logFile);
    signalfd_siginfo readSignal() const;
    void reapChildren();
    int waitForCommand();
    void endServices();

    const RunSettings &m_settings;
    const sigset_t m_callersSignals;
    const std::string m_programFolder;
    int m_signalFd = -1;
    std::map<pid_t, std::string> m_services; ///< what runs as long as the command, by process
    pid_t m_device = 0;
    pid_t m_command = 0;
    std::optional<int> m_commandStatus;
    bool m_isEnding = false;
    std::string m_failure; ///< of a service that should not have ended
};

Supervisor::Supervisor(const RunSettings &settings, const sigset_t &callersSignals)
    : m_settings(settings)
    , m_callersSignals(callersSignals)
    , m_programFolder(std::filesystem::read_symlink("/proc/self/exe").parent_path())
{
    const sigset_t handled = handledSignals();
    m_signalFd = signalfd(-1, &handled, SFD_CLOEXEC);
    if (m_signalFd < 0)
        throw SetUpError::fromErrno("cannot watch signals");
}

Supervisor::~Supervisor()
{
    close(m_signalFd);
}

PhoneFiles Supervisor::phoneFiles() const
{
    const std::string name = m_settings.profile.hostName().toStdString();
    PhoneFiles phone;
    phone.files["/etc/hostname"] = name + "\n";
    phone.files["/etc/hosts"] = "127.0.0.1 localhost\n::1 localhost\n127.0.1.1 " + name + "\n";
    phone.files["/etc/machine-id"]
        = QCryptographicHash::hash(QByteArray::fromStdString(name), QCryptographicHash::Md5)
              .toHex()
              .toStdString()
        + "\n";
    for (const ComponentType &type : ComponentRegistration::all()) {
        if (type.addFiles)
            type.addFiles(m_settings.profile.object, phone);
    }
    for (const RealDaemon &daemon : m_settings.realDaemons) {
        phone.writableFolders.insert(phone.writableFolders.end(), daemon.folders.begin(),
                                     daemon.folders.end());
        for (const auto &[path, origin] : daemon.additions)
            phone.files[path] = contentOf(m_programFolder + "/" + origin);
    }
    return phone;
}

void Supervisor::prepareEnvironment() const
{
    for (const char *variable : {"DBUS_SYSTEM_BUS_ADDRESS", "DBUS_SESSION_BUS_ADDRESS",
                                 "DBUS_STARTER_ADDRESS", "DBUS_STARTER_BUS_TYPE", "XDG_SESSION_ID",
                                 "XDG_SEAT", "XDG_VTNR", "NOTIFY_SOCKET", "LISTEN_FDS", "LISTEN_PID"})
        unsetenv(variable);
    setenv("XDG_RUNTIME_DIR", ("/run/user/" + std::to_string(getuid())).c_str(), 1);
    const char *path = std::getenv("PATH");
    setenv("PATH", (m_programFolder + ":" + (path ? path : "/usr/local/bin:/usr/bin:/bin")).c_str(), 1);
    // Debian's shells show it in their prompt.
    setenv("debian_chroot", "phone", 1);
}

void Supervisor::writeBusConfiguration()
{
    std::ofstream file(busConfigurationFile);
    file << "<!DOCTYPE busconfig PUBLIC \"-//freedesktop//DTD D-Bus Bus Configuration 1.0//EN\"\n"
            " \"http://www.freedesktop.org/standards/dbus/1.0/busconfig.dtd\">\n"
            "<busconfig>\n"
            "  <type>system</type>\n"
            "  <listen>"
         << busAddress
         << "</listen>\n"
            "  <auth>EXTERNAL</auth>\n"
            "  <policy context=\"default\">\n"
            "    <allow user=\"*\"/>\n"
            "    <allow own=\"*\"/>\n"
            "    <allow send_destination=\"*\" eavesdrop=\"true\"/>\n"
            "    <allow receive_sender=\"*\" eavesdrop=\"true\"/>\n"
            "    <allow send_type=\"method_call\"/>\n"
            "  </policy>\n";
    for (const char *limit : {"max_incoming_bytes", "max_outgoing_bytes", "max_message_size"})
        file << "  <limit name=\"" << limit << "\">1000000000</limit>\n";
    for (const char *limit :
         {"max_completed_connections", "max_connections_per_user", "max_names_per_connection",
          "max_match_rules_per_connection", "max_replies_per_connection"})
        file << "  <limit name=\"" << limit << "\">1000000</limit>\n";
    file << "  <limit name=\"auth_timeout\">240000</limit>\n"
            "</busconfig>\n";
    if (!file.flush())
        throw SetUpError::fromErrno("cannot write " + busConfigurationFile);
}

pid_t Supervisor::forkChild(const std::string &name)
{
    const pid_t pid = fork();
    if (pid < 0)
        throw SetUpError::fromErrno("cannot start " + name);
    return pid;
}

void Supervisor::becomeService(const std::string &logFile)
{
    sigset_t none;
    sigemptyset(&none);
    sigprocmask(SIG_SETMASK, &none, nullptr);
    // The terminal's keys are not for services.
    setsid();
    redirect("/dev/null", O_RDONLY, STDIN_FILENO);
    // Whoever reads the command's output must not have to wait for a service.
    dup2(STDERR_FILENO, STDOUT_FILENO);
    if (!logFile.empty()) {
        redirect(logFile, O_WRONLY | O_CREAT | O_APPEND, STDOUT_FILENO);
        dup2(STDOUT_FILENO, STDERR_FILENO);
    }
}

void Supervisor::execute(const std::vector<std::string> &command)
{
    std::vector<char *> arguments;
    for (const std::string &argument : command)
        arguments.push_back(const_cast<char *>(argument.c_str()));
    arguments.push_back(nullptr);
    execvp(arguments[0], arguments.data());
    int error = errno;
    if (error == EACCES && !isFound(command.front()))
        error = ENOENT;
    std::fprintf(stderr, "corvane-simulator: %s: %s\n", arguments[0],
                 error == ENOENT ? "command not found" : std::strerror(error));
    _exit(error == ENOENT ? 127 : 126);
}

void Supervisor::startProgram(const std::string &name, const std::vector<std::string> &command,
                              const std::string &logFile, int keptFd)
{
    const pid_t pid = forkChild(name);
    if (pid == 0) {
        becomeService(logFile);
        if (keptFd >= 0)
            fcntl(keptFd, F_SETFD, 0);
        execute(command);
    }
    m_services[pid] = name;
}

void Supervisor::startBus()
{
    writeBusConfiguration();
    Pipe address;
    startProgram("dbus-daemon",
                 {"dbus-daemon", "--nofork", "--nopidfile", "--config-file=" + busConfigurationFile,
                  "--print-address=" + std::to_string(address.writer())},
                 busLogFile, address.writer());
    waitUntilReady(address, "the phone's system bus", busLogFile, readinessTimeout);
}

Supervisor::ForkedStatus Supervisor::startDevice()
{
    Pipe readiness;
    m_device = forkChild("the phone's services");
    if (m_device == 0) {
        becomeService();
        return runDevice(m_settings.profile.object, m_settings.realDaemons, readiness.releaseWriter());
    }
    m_services[m_device] = "the phone's services";
    waitUntilReady(readiness, "the set of the phone's services", {},
                   m_settings.realDaemons.empty() ? readinessTimeout : daemonsTimeout);
    return std::nullopt;
}

void Supervisor::startCommand()
{
    std::vector<std::string> command = m_settings.command;
    if (command.empty()) {
        const char *shell = std::getenv("SHELL");
        command = {shell && access(shell, X_OK) == 0 ? shell : "/bin/sh"};
        if (isatty(STDIN_FILENO)) {
            std::printf("This shell is inside the simulated phone \"%s\"; what you change here is gone when "
                        "you leave.\n"
                        "corvane-simctl --help tells how to steer the phone, exit takes you out.\n",
                        qUtf8Printable(m_settings.profile.name()));
            std::fflush(stdout);
        }
    }
    m_command = forkChild(command.front());
    if (m_command == 0) {
        sigprocmask(SIG_SETMASK, &m_callersSignals, nullptr);
        execute(command);
    }
}

std::string Supervisor::lastWords(const std::string &logFile)
{
    const std::string tail = logFile.empty() ? std::string() : logTail(logFile);
    return tail.empty() ? std::string() : "; it said:\n" + tail;
}

void Supervisor::waitUntilReady(Pipe &pipe, const std::string &what, const std::string &logFile, int timeout)
{
    pipe.closeWriter();
    pollfd polled[] = {{m_signalFd, POLLIN, 0}, {pipe.reader(), POLLIN, 0}};
    for (;;) {
        const int count = poll(polled, 2, timeout);
        if (count == 0)
            throw SetUpError(what + " is not there after " + std::to_string(timeout / 1000) + " s"
                             + lastWords(logFile));
        if (polled[0].revents) {
            const signalfd_siginfo signal = readSignal();
            if (signal.ssi_signo != SIGCHLD)
                throw Interruption{int(signal.ssi_signo)};
            reapChildren();
            if (!m_failure.empty())
                throw SetUpError(m_failure + lastWords(logFile));
        }
        if (polled[1].revents) {
            char byte = 0;
            if (read(pipe.reader(), &byte, 1) == 1)
                return;
            // It is about to end, which SIGCHLD tells.
            polled[1].fd = -1;
        }
    }
}

signalfd_siginfo Supervisor::readSignal() const
{
    signalfd_siginfo signal{};
    if (read(m_signalFd, &signal, sizeof signal) != sizeof signal)
        throw SetUpError::fromErrno("cannot read signals");
    return signal;
}

void Supervisor::reapChildren()
{
    int status = 0;
    while (const pid_t pid = waitpid(-1, &status, WNOHANG)) {
        if (pid < 0)
            return;
        if (pid == m_command) {
            m_commandStatus = exitStatus(status);
            continue;
        }
        const auto service = m_services.find(pid);
        if (service == m_services.end())
            continue;
        // The services themselves always end well when they are asked to; daemons may have their own ways.
        if (!m_isEnding || (pid == m_device && status != 0)) {
            m_failure
                = service->second + " ended unexpectedly with status " + std::to_string(exitStatus(status));
            if (m_command)
                std::fprintf(stderr, "corvane-simulator: %s\n", m_failure.c_str());
        }
        m_services.erase(service);
    }
}

int Supervisor::waitForCommand()
{
    while (!m_commandStatus) {
        const signalfd_siginfo signal = readSignal();
        if (signal.ssi_signo == SIGCHLD)
            reapChildren();
        else if (!isFromTerminal(signal.ssi_code))
            kill(m_command, int(signal.ssi_signo));
    }
    return *m_commandStatus;
}

void Supervisor::endServices()
{
    m_isEnding = true;
    if (m_services.count(m_device))
        kill(m_device, SIGTERM);
    pollfd polled{m_signalFd, POLLIN, 0};
    while (m_services.count(m_device)) {
        if (poll(&polled, 1, farewellTimeout) == 0) {
            m_failure = "the phone's services did not end";
            std::fprintf(stderr, "corvane-simulator: %s\n", m_failure.c_str());
            return;
        }
        if (readSignal().ssi_signo == SIGCHLD)
            reapChildren();
    }
    // Whatever else runs in the phone is killed by the kernel with process 1.
}

int Supervisor::run()
{
    buildPhone(m_settings.profile.hostName().toStdString(), phoneFiles());
    dropCapabilities();
    prepareEnvironment();
    startBus();
    if (const ForkedStatus status = startDevice())
        return *status;
    startCommand();
    const int status = waitForCommand();
    endServices();
    return status == 0 && !m_failure.empty() ? phoneFailed : status;
}

/** Makes the calling process, process 1 of the phone, die with the simulator. */
void dieWithSimulator(Pipe &simulatorsLife)
{
    simulatorsLife.closeWriter();
    prctl(PR_SET_PDEATHSIG, SIGKILL);
    // The simulator may have died before that.
    pollfd polled{simulatorsLife.reader(), 0, 0};
    if (poll(&polled, 1, 0) > 0)
        _exit(phoneFailed);
}

/** Gives the terminal back: a shell in the phone takes it for its jobs, and cannot tell whom it had it from.
 */
class TerminalKeeper
{
public:
    TerminalKeeper()
        : m_isOurs(tcgetpgrp(STDIN_FILENO) == getpgrp())
    {
    }
    ~TerminalKeeper()
    {
        if (!m_isOurs)
            return;
        // From the background, which we may be in now, this would stop us.
        signal(SIGTTOU, SIG_IGN);
        tcsetpgrp(STDIN_FILENO, getpgrp());
        signal(SIGTTOU, SIG_DFL);
    }
    TerminalKeeper(const TerminalKeeper &) = delete;
    TerminalKeeper &operator=(const TerminalKeeper &) = delete;

private:
    const bool m_isOurs;
};

/** Passes signals on to process 1 of the phone until that ends. */
int waitForPhone(pid_t phone)
{
    const sigset_t handled = handledSignals();
    for (;;) {
        siginfo_t info{};
        const int number = sigwaitinfo(&handled, &info);
        if (number == SIGCHLD) {
            int status = 0;
            if (waitpid(phone, &status, WNOHANG) == phone)
                return exitStatus(status);
        } else if (number > 0 && !isFromTerminal(info.si_code)) {
            kill(phone, number);
        }
    }
}

} // namespace

int runInPhone(const RunSettings &settings)
{
    try {
        for (const RealDaemon &daemon : settings.realDaemons) {
            if (access(daemon.command.front().c_str(), X_OK) < 0) {
                throw SetUpError(daemon.command.front() + " is not there; install Debian's package "
                                 + daemon.package);
            }
        }

        // A caller that ignores the end of its children makes us ignore that of ours.
        signal(SIGCHLD, SIG_DFL);
        const sigset_t handled = handledSignals();
        sigset_t callersSignals;
        sigprocmask(SIG_BLOCK, &handled, &callersSignals);

        Pipe life;
        const pid_t phone = forkIntoPhone();
        if (phone == 0) {
            dieWithSimulator(life);
            return Supervisor(settings, callersSignals).run();
        }
        life.closeReader();
        const TerminalKeeper keeper;
        return waitForPhone(phone);
    } catch (const SetUpError &error) {
        std::fprintf(stderr, "corvane-simulator: %s\n", error.what());
        return phoneFailed;
    } catch (const Interruption &interruption) {
        return 128 + interruption.signal;
    }
}

} // namespace Simulator
} // namespace Corvane
