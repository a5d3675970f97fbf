// SPDX-License-Identifier: LGPL-2.1-or-later
#include "sandbox.h"

#include <cerrno>
#include <csignal>
#include <cstring>
#include <fcntl.h>
#include <fstream>
#include <net/if.h>
#include <sched.h>
#include <sys/capability.h>
#include <sys/ioctl.h>
#include <sys/mount.h>
#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <system_error>
#include <unistd.h>

#include <filesystem>
#include <memory>

namespace Corvane
{
namespace Simulator
{

namespace
{

namespace fs = std::filesystem;

/** Holds what the overlays need while the phone is built; its own tmpfs is then hidden below the phone's
 * /run. */
const std::string storage = "/run";

void writeFile(const std::string &path, const std::string &content)
{
    const int fd = open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0644);
    if (fd < 0)
        throw SetUpError::fromErrno("cannot open " + path);
    const ssize_t written = write(fd, content.data(), content.size());
    const int error = errno;
    close(fd);
    if (written != ssize_t(content.size())) {
        errno = error;
        throw SetUpError::fromErrno("cannot write " + path);
    }
}

void makeFolders(const std::string &path, mode_t mode = 0755)
{
    std::error_code error;
    fs::create_directories(path, error);
    if (error || chmod(path.c_str(), mode) < 0)
        throw SetUpError::fromErrno("cannot create " + path);
}

void mountOn(const std::string &target, const char *type, const std::string &source, unsigned long flags,
             const std::string &data = {})
{
    if (mount(source.c_str(), target.c_str(), type, flags, data.empty() ? nullptr : data.c_str()) < 0) {
        throw SetUpError::fromErrno(
            std::string("cannot mount ") + (type ? type : source) + " on " + target,
            errno == EINVAL && type && std::strcmp(type, "overlay") == 0
                ? "an ordinary user cannot cover a folder with mounts below it; run it as root"
                : "inside a container it needs the right to mount");
    }
}

bool hasCapability(cap_value_t capability)
{
    const std::unique_ptr<_cap_struct, int (*)(cap_t)> own(cap_get_proc(),
                                                           [](cap_t each) { return cap_free(each); });
    cap_flag_value_t value = CAP_CLEAR;
    return own && cap_get_flag(own.get(), capability, CAP_EFFECTIVE, &value) == 0 && value == CAP_SET;
}

/** Whether the process is in a user namespace other than the machine's. */
bool inUserNamespace()
{
    unsigned long inside = 0;
    unsigned long outside = 0;
    unsigned long count = 0;
    std::ifstream map("/proc/self/uid_map");
    map >> inside >> outside >> count;
    return !(inside == 0 && outside == 0 && count == 0xffffffffUL);
}

void mapUser(uid_t uid, gid_t gid)
{
    // The kernel wants this before an ordinary user may map a group.
    writeFile("/proc/self/setgroups", "deny");
    writeFile("/proc/self/uid_map", "0 " + std::to_string(uid) + " 1");
    writeFile("/proc/self/gid_map", "0 " + std::to_string(gid) + " 1");
}

/** Writes the phone's files to a layer that goes over the machine's folder. */
void writeLayer(const PhoneFiles &files)
{
    const std::string layer = storage + "/layer";
    for (const char *folder : {"/etc", "/usr", "/var"})
        makeFolders(layer + folder);
    for (const std::string &folder : files.writableFolders)
        makeFolders(layer + folder);
    for (const std::string &folder : files.ownFolders)
        makeFolders(layer + folder);
    for (const auto &[path, content] : files.files) {
        makeFolders(fs::path(layer + path).parent_path());
        writeFile(layer + path, content);
    }
    for (const auto &[path, target] : files.links) {
        makeFolders(fs::path(layer + path).parent_path());
        if (symlink(target.c_str(), (layer + path).c_str()) < 0)
            throw SetUpError::fromErrno("cannot create " + layer + path);
    }
}

void mountOverlays()
{
    // Inside a user namespace an overlay may only keep its notes in user attributes.
    const std::string options = inUserNamespace() ? ",userxattr" : "";
    for (const char *folder : {"/etc", "/usr", "/var"}) {
        const std::string upper = storage + "/upper" + folder;
        const std::string work = storage + "/work" + folder;
        makeFolders(upper);
        makeFolders(work);
        mountOn(folder, "overlay", "phone", 0,
                "lowerdir=" + storage + "/layer" + folder + ":" + folder + ",upperdir=" + upper
                    + ",workdir=" + work + options);
    }
}

/** Covers the machine's files in @p folders, which the overlays show beside the phone's. */
void mountOwnFolders(const std::vector<std::string> &folders)
{
    for (const std::string &folder : folders)
        mountOn(folder, nullptr, storage + "/layer" + folder, MS_BIND);
}

/** A /dev without the machine's disks, clock and kernel log. */
void mountDevices()
{
    const std::string dev = storage + "/dev";
    makeFolders(dev);
    mountOn(dev, "tmpfs", "phone", MS_NOSUID | MS_NOEXEC, "mode=0755");
    for (const char *node : {"null", "zero", "full", "random", "urandom", "tty"}) {
        const std::string device = dev + "/" + node;
        writeFile(device, {});
        mountOn(device, nullptr, std::string("/dev/") + node, MS_BIND);
    }
    // Terminals of its own: the machine's ptmx finds no terminals from another folder. The caller's terminal
    // stays one.
    makeFolders(dev + "/pts");
    mountOn(dev + "/pts", "devpts", "phone", MS_NOSUID | MS_NOEXEC, "newinstance,ptmxmode=0666,mode=0620");
    makeFolders(dev + "/shm");
    mountOn(dev + "/shm", "tmpfs", "phone", MS_NOSUID | MS_NODEV, "mode=1777");
    const std::pair<const char *, const char *> links[] = {
        {"/proc/self/fd", "/fd"},       {"/proc/self/fd/0", "/stdin"}, {"/proc/self/fd/1", "/stdout"},
        {"/proc/self/fd/2", "/stderr"}, {"pts/ptmx", "/ptmx"},
    };
    for (const auto &[target, link] : links) {
        if (symlink(target, (dev + link).c_str()) < 0)
            throw SetUpError::fromErrno("cannot create " + dev + link);
    }
    mountOn("/dev", nullptr, dev, MS_MOVE);
}

void makeReadOnly(const char *path)
{
    mountOn(path, nullptr, path, MS_BIND | MS_REC);
    mountOn(path, nullptr, path, MS_BIND | MS_REMOUNT | MS_RDONLY | MS_NOSUID | MS_NODEV | MS_NOEXEC);
}

void mountKernelFileSystems()
{
    mountOn("/proc", "proc", "proc", MS_NOSUID | MS_NODEV | MS_NOEXEC);
    // Root could reboot or reconfigure the machine through these without any capability. The network's
    // settings are the phone's own, and stay writable.
    mountOn("/proc/sys/net", nullptr, "/proc/sys/net", MS_BIND);
    makeReadOnly("/proc/sys");
    if (fs::exists("/proc/sysrq-trigger"))
        makeReadOnly("/proc/sysrq-trigger");
    // Shows the phone's network interfaces in place of the machine's.
    mountOn("/sys", "sysfs", "sysfs", MS_RDONLY | MS_NOSUID | MS_NODEV | MS_NOEXEC);
}

void mountRun()
{
    mountOn("/run", "tmpfs", "phone", MS_NOSUID | MS_NODEV, "mode=0755");
    for (const char *folder :
         {"/run/corvane-simulator", "/run/dbus", "/run/systemd/seats", "/run/systemd/sessions",
          "/run/systemd/users", "/run/systemd/machines", "/run/user"})
        makeFolders(folder);
    makeFolders("/run/lock", 01777);
    makeFolders("/run/user/" + std::to_string(getuid()), 0700);
}

void bringLoopbackUp()
{
    const int socket = ::socket(AF_INET, SOCK_DGRAM | SOCK_CLOEXEC, 0);
    ifreq request{};
    std::strcpy(request.ifr_name, "lo");
    request.ifr_flags = IFF_UP;
    const int result = socket < 0 ? -1 : ioctl(socket, SIOCSIFFLAGS, &request);
    const int error = errno;
    close(socket);
    if (result < 0) {
        errno = error;
        throw SetUpError::fromErrno("cannot bring the loopback interface up");
    }
}

} // namespace

SetUpError SetUpError::fromErrno(const std::string &step, const std::string &advice)
{
    return SetUpError(step + ": " + std::strerror(errno) + (advice.empty() ? "" : "; " + advice));
}

pid_t forkIntoPhone()
{
    const bool isOrdinaryUser = !hasCapability(CAP_SYS_ADMIN);
    const uid_t uid = getuid();
    const gid_t gid = getgid();
    // Not unshare(): the caller would no longer be able to create threads and processes of its own.
    const auto pid = pid_t(syscall(SYS_clone, SIGCHLD | CLONE_NEWPID | (isOrdinaryUser ? CLONE_NEWUSER : 0),
                                   nullptr, nullptr, nullptr, nullptr));
    if (pid < 0) {
        throw SetUpError::fromErrno("cannot create namespaces for users and processes",
                                    isOrdinaryUser ? "allow it with the sysctls user.max_user_namespaces and "
                                                     "kernel.unprivileged_userns_clone, or run it as root"
                                                   : "allow it with the sysctl user.max_pid_namespaces");
    }
    if (pid == 0 && isOrdinaryUser)
        mapUser(uid, gid);
    return pid;
}

void buildPhone(const std::string &hostName, const PhoneFiles &files)
{
    std::error_code noFolder;
    const std::string currentFolder = fs::current_path(noFolder);
    if (noFolder)
        throw SetUpError("the current folder does not exist any more; start from another one");
    const mode_t callersMask = umask(022);

    if (unshare(CLONE_NEWNS | CLONE_NEWNET | CLONE_NEWIPC | CLONE_NEWUTS) < 0)
        throw SetUpError::fromErrno("cannot create mount, network, ipc and host name namespaces");
    // Nothing that is mounted from here on reaches the machine.
    mountOn("/", nullptr, "none", MS_REC | MS_PRIVATE);

    mountOn(storage, "tmpfs", "phone", MS_NOSUID | MS_NODEV, "mode=0755");
    writeLayer(files);
    mountOverlays();
    mountOwnFolders(files.ownFolders);
    mountDevices();
    mountKernelFileSystems();
    mountRun();
    bringLoopbackUp();
    if (sethostname(hostName.data(), hostName.size()) < 0)
        throw SetUpError::fromErrno("cannot set the host name");

    umask(callersMask);
    // The folder that the process is in now may lie below a covered one.
    if (chdir(currentFolder.c_str()) < 0) {
        throw SetUpError::fromErrno("cannot enter " + currentFolder + " in the phone",
                                    "/run and /dev are the phone's own; start from another folder");
    }
}

void dropCapabilities()
{
    static constexpr cap_value_t dropped[] = {
        CAP_SYS_TIME,      CAP_WAKE_ALARM,   CAP_SYS_MODULE,    CAP_SYS_BOOT,
        CAP_SYS_RAWIO,     CAP_SYS_PACCT,    CAP_SYSLOG,        CAP_MKNOD,
        CAP_MAC_ADMIN,     CAP_MAC_OVERRIDE, CAP_BPF,           CAP_PERFMON,
        CAP_AUDIT_CONTROL, CAP_AUDIT_READ,   CAP_BLOCK_SUSPEND, CAP_LINUX_IMMUTABLE,
    };
    constexpr int count = sizeof dropped / sizeof dropped[0];

    const std::unique_ptr<_cap_struct, int (*)(cap_t)> own(cap_get_proc(),
                                                           [](cap_t each) { return cap_free(each); });
    for (const cap_value_t capability : dropped) {
        // Absent where the kernel does not know it, or somebody took it away before.
        if (cap_get_bound(capability) == 1 && cap_drop_bound(capability) < 0)
            throw SetUpError::fromErrno("cannot drop capabilities");
    }
    for (const cap_flag_t set : {CAP_EFFECTIVE, CAP_PERMITTED, CAP_INHERITABLE}) {
        if (!own || cap_set_flag(own.get(), set, count, dropped, CAP_CLEAR) < 0)
            throw SetUpError::fromErrno("cannot drop capabilities");
    }
    // Clearing the inheritable set clears the ambient one with it.
    if (cap_set_proc(own.get()) < 0)
        throw SetUpError::fromErrno("cannot drop capabilities");
}

} // namespace Simulator
} // namespace Corvane
