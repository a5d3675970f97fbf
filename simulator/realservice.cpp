// SPDX-License-Identifier: LGPL-2.1-or-later
#include "realservice.h"

#include "logtail.h"
#include "refusal.h"

#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>

namespace Corvane
{
namespace Simulator
{

namespace
{
constexpr int bringUpTimeout = 30; // s
constexpr int farewellTimeout = 15; // s; oFono itself gives its modems ten
} // namespace

RealService::RealService(const RealDaemon &daemon, Phone &phone, std::function<void()> onCollapse)
    : PhoneService(daemon.busNames.first())
    , m_daemon(daemon)
    , m_onCollapse(std::move(onCollapse))
    , m_self(std::make_shared<RealService *>(this))
{
    std::unique_ptr<DaemonHardware> hardware = daemon.createHardware(phone);
    m_hardware = hardware.get();
    addComponent(std::move(hardware));
    m_connection.watchNames([this](const QString &changed, const QString &) {
        if (m_daemon.busNames.contains(changed))
            advance();
    });
}

RealService::~RealService()
{
    *m_self = nullptr;
    if (m_timer)
        g_source_remove(m_timer);
    kill();
}

void RealService::start(const Done &done)
{
    if (m_phase != Idle)
        throw Refusal(QStringLiteral("%1 is being started or stopped already").arg(name()));
    QString problem;
    if (!launch(problem)) {
        done(problem);
        return;
    }
    m_done = done;
    m_phase = Appearing;
    startTimer(bringUpTimeout);
}

bool RealService::launch(QString &problem)
{
    const GObjectPointer<GSubprocessLauncher> launcher(
        g_subprocess_launcher_new(GSubprocessFlags(G_SUBPROCESS_FLAGS_STDERR_MERGE)));
    const int log = open(m_daemon.logFile().c_str(), O_WRONLY | O_CREAT | O_APPEND | O_CLOEXEC, 0644);
    if (log < 0) {
        problem
            = QStringLiteral("cannot open %1: %2")
                  .arg(QString::fromStdString(m_daemon.logFile()), QString::fromUtf8(std::strerror(errno)));
        return false;
    }
    g_subprocess_launcher_take_stdout_fd(launcher.get(), log);
    try {
        for (const auto &[variable, value] : m_hardware->prepare())
            g_subprocess_launcher_setenv(launcher.get(), variable.c_str(), value.c_str(), TRUE);
    } catch (const std::runtime_error &error) {
        problem = QString::fromUtf8(error.what());
        return false;
    }

    // What it starts goes with it.
    g_subprocess_launcher_set_child_setup(
        launcher.get(), [](gpointer) { setpgid(0, 0); }, nullptr, nullptr);

    std::vector<const gchar *> arguments;
    for (const std::string &argument : m_daemon.command)
        arguments.push_back(argument.c_str());
    arguments.push_back(nullptr);
    ErrorSlot error;
    m_process.reset(g_subprocess_launcher_spawnv(launcher.get(), arguments.data(), &error));
    if (!m_process) {
        problem = QString::fromUtf8(error->message);
        return false;
    }
    // None when it has ended already.
    const gchar *number = g_subprocess_get_identifier(m_process.get());
    m_group = number ? pid_t(std::strtol(number, nullptr, 10)) : 0;
    g_subprocess_wait_async(
        m_process.get(), nullptr,
        [](GObject *process, GAsyncResult *result, gpointer data) {
            const std::unique_ptr<std::shared_ptr<RealService *>> self(
                static_cast<std::shared_ptr<RealService *> *>(data));
            g_subprocess_wait_finish(G_SUBPROCESS(process), result, nullptr);
            if (**self)
                (**self)->ended(G_SUBPROCESS(process));
        },
        new std::shared_ptr<RealService *>(m_self));
    return true;
}

void RealService::stop(const Done &done)
{
    if (!m_process) {
        done(QString());
        return;
    }
    if (m_phase != Idle)
        throw Refusal(QStringLiteral("%1 is being started or stopped already").arg(name()));
    m_done = done;
    m_phase = Stopping;
    m_hardware->release();
    startTimer(farewellTimeout);
    g_subprocess_send_signal(m_process.get(), SIGTERM);
}

void RealService::ended(GSubprocess *process)
{
    m_status = g_subprocess_get_status(process);
    m_process.reset();
    kill();
    m_group = 0;
    m_hardware->release();
    if (m_phase == Stopping) {
        advance();
        return;
    }
    const bool wasStarting = m_phase != Idle;
    if (wasStarting) {
        finish(obituary());
        return;
    }
    std::fprintf(stderr, "corvane-simulator: %s\n", qUtf8Printable(obituary()));
    m_onCollapse();
}

void RealService::advance()
{
    const auto isOnBus = [this](const QString &each) {
        return m_connection.nameHasOwner(each);
    };
    const QStringList &names = m_daemon.busNames;
    if (m_phase == Appearing && std::all_of(names.begin(), names.end(), isOnBus)) {
        m_phase = BeingBroughtUp;
        m_hardware->bringUp([this] { finish(QString()); });
    } else if (m_phase == Stopping && !m_process && std::none_of(names.begin(), names.end(), isOnBus)) {
        // A daemon that does not end well when it is asked to is broken, perhaps by our own addition to it.
        // Some leave the end to the signal.
        const bool endedWell = m_status == 0 || (WIFSIGNALED(m_status) && WTERMSIG(m_status) == SIGTERM);
        finish(endedWell ? QString() : obituary());
    }
}

void RealService::startTimer(int seconds)
{
    m_timer = g_timeout_add_seconds(
        guint(seconds),
        [](gpointer data) -> gboolean {
            static_cast<RealService *>(data)->timedOut();
            return G_SOURCE_REMOVE;
        },
        this);
}

void RealService::timedOut()
{
    m_timer = 0;
    if (m_phase == Stopping) {
        // Its end, which is then no good one, is reported.
        kill();
        return;
    }
    const QString waitedFor = m_phase == Appearing
        ? QStringLiteral("%1 is not on the bus").arg(m_daemon.busNames.join(QStringLiteral(", ")))
        : m_hardware->missing();
    m_hardware->release();
    finish(QStringLiteral("%1: %2 after %3 s%4")
               .arg(m_daemon.name, waitedFor)
               .arg(bringUpTimeout)
               .arg(lastWords()));
}

void RealService::kill() const
{
    if (m_group > 0)
        ::kill(-m_group, SIGKILL);
}

void RealService::finish(const QString &problem)
{
    // Hardware may be up only after its daemon has ended, or been given up.
    if (m_phase == Idle)
        return;
    if (m_timer)
        g_source_remove(std::exchange(m_timer, 0));
    m_phase = Idle;
    const Done done = std::exchange(m_done, nullptr);
    done(problem);
}

QString RealService::obituary() const
{
    const QString program = QString::fromStdString(m_daemon.command.front());
    return (WIFSIGNALED(m_status)
                ? QStringLiteral("%1 was ended by signal %2").arg(program).arg(WTERMSIG(m_status))
                : QStringLiteral("%1 ended with status %2").arg(program).arg(WEXITSTATUS(m_status)))
        + lastWords();
}

QString RealService::lastWords() const
{
    const std::string tail = logTail(m_daemon.logFile());
    return tail.empty() ? QString()
                        : QStringLiteral("; %1 said:\n%2").arg(m_daemon.name, QString::fromStdString(tail));
}

} // namespace Simulator
} // namespace Corvane
