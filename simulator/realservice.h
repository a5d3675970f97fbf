// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_REALSERVICE_H
#define CORVANE_SIMULATOR_REALSERVICE_H

#include "busconnection.h"
#include "phoneservice.h"
#include "realdaemons.h"

#include <sys/types.h>

namespace Corvane
{
namespace Simulator
{

/** A daemon of the distribution, run in the phone in place of simulated services. */
class RealService : public PhoneService
{
public:
    /** @p onCollapse learns when the daemon ends without having been stopped. */
    RealService(const RealDaemon &daemon, Phone &phone, std::function<void()> onCollapse);
    ~RealService() override;

    bool isRunning() const override { return m_process != nullptr; }
    void start(const Done &done) override;
    /** A clean end, which the daemon is asked for; it is killed when that takes too long. */
    void stop(const Done &done) override;

private:
    enum Phase { Idle, Appearing, BeingBroughtUp, Stopping };

    bool launch(QString &problem);
    void ended(GSubprocess *process);
    /** Looks whether what the present phase waits for has come. */
    void advance();
    void startTimer(int seconds);
    void timedOut();
    /** Ends the daemon and what it started. */
    void kill() const;
    void finish(const QString &problem);
    /** How the daemon ended, and what it said last. */
    QString obituary() const;
    QString lastWords() const;

    const RealDaemon m_daemon;
    const std::function<void()> m_onCollapse;
    DaemonHardware *m_hardware;
    BusConnection m_connection;
    GObjectPointer<GSubprocess> m_process;
    pid_t m_group = 0; ///< of the daemon's processes
    Phase m_phase = Idle;
    Done m_done;
    guint m_timer = 0;
    int m_status = 0; ///< of the last end
    /** Outlives the daemon in the hands of callbacks that come too late. */
    std::shared_ptr<RealService *> m_self;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_REALSERVICE_H
