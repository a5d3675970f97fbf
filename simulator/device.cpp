// SPDX-License-Identifier: LGPL-2.1-or-later
#include "device.h"

#include "component.h"
#include "control.h"
#include "realservice.h"
#include "refusal.h"
#include "service.h"
#include "timer.h"

#include <glib-unix.h>

#include <csignal>
#include <cstdio>
#include <memory>
#include <unistd.h>

namespace Corvane
{
namespace Simulator
{

namespace
{

using Services = std::vector<std::unique_ptr<PhoneService>>;

Services createServices(const QJsonObject &profile, const QStringList &replacedNames, Phone &phone,
                        Journal &journal, FaultTable &faults)
{
    Services services;
    for (const ComponentType &type : ComponentRegistration::all()) {
        if (replacedNames.contains(type.service))
            continue;
        // Components come ordered by service.
        if (services.empty() || services.back()->name() != type.service)
            services.push_back(std::make_unique<Service>(type.service, journal, faults));
        services.back()->addComponent(type.create(profile, phone));
    }
    return services;
}

/** Starts the services one after the other. */
class StartUp
{
public:
    /** @p done is called when all are there, or with the problem of the first that is not. */
    StartUp(const Services &services, PhoneService::Done done)
        : m_services(services)
        , m_done(std::move(done))
    {
        startNext();
    }

private:
    void startNext()
    {
        if (m_next == m_services.size()) {
            m_done(QString());
            return;
        }
        PhoneService &service = *m_services[m_next++];
        if (service.isRunning()) {
            startNext();
            return;
        }
        // It may come up when this start of the phone has been given up.
        service.start([this, life = std::weak_ptr<void>(m_life)](const QString &problem) {
            if (life.expired())
                return;
            if (problem.isEmpty())
                startNext();
            else
                m_done(problem);
        });
    }

    const Services &m_services;
    const PhoneService::Done m_done;
    std::size_t m_next = 0;
    const std::shared_ptr<void> m_life = std::make_shared<int>();
};

/** Takes the phone down and brings it up again. */
class PowerSwitch
{
public:
    PowerSwitch(Phone &phone, const Services &services)
        : m_phone(phone)
        , m_services(services)
    {
        phone.goDown = [this](bool restart) {
            // Not from within a call: its service would go away under it.
            m_timer.start(0, [this, restart] {
                m_phone.isOn = false;
                m_startUp.reset();
                m_restarts = restart;
                m_comesUp = restart;
                if (!std::exchange(m_goesDown, true))
                    stop(0);
            });
        };
        phone.comeUp = [this] {
            if (m_goesDown)
                m_comesUp = true;
            else
                start();
        };
    }

private:
    void stop(std::size_t next)
    {
        if (next == m_services.size()) {
            m_goesDown = false;
            if (m_restarts)
                ++m_phone.restarts;
            if (m_comesUp)
                start();
            return;
        }
        try {
            m_services[next]->stop([this, next](const QString &) { stop(next + 1); });
        } catch (const Refusal &) {
            // A daemon that is on its way already.
            stop(next + 1);
        }
    }

    void start()
    {
        m_phone.isOn = true;
        try {
            m_startUp = std::make_unique<StartUp>(m_services, [](const QString &problem) {
                if (!problem.isEmpty())
                    std::fprintf(stderr, "corvane-simulator: %s\n", qUtf8Printable(problem));
            });
        } catch (const std::runtime_error &error) {
            std::fprintf(stderr, "corvane-simulator: the phone cannot start: %s\n", error.what());
        }
    }

    Phone &m_phone;
    const Services &m_services;
    Timer m_timer;
    std::unique_ptr<StartUp> m_startUp;
    bool m_goesDown = false;
    // once it is down
    bool m_restarts = false;
    bool m_comesUp = false;
};

} // namespace

int runDevice(const QJsonObject &profile, const std::vector<RealDaemon> &daemons, int readyFd)
{
    int status = 0;
    try {
        const GMainLoopPointer loop(g_main_loop_new(nullptr, FALSE));
        const guint termination = g_unix_signal_add(
            SIGTERM,
            [](gpointer data) -> gboolean {
                g_main_loop_quit(static_cast<GMainLoop *>(data));
                return G_SOURCE_CONTINUE;
            },
            loop.get());

        Journal journal;
        FaultTable faults;
        Phone phone(profile);
        QStringList replacedNames;
        for (const RealDaemon &daemon : daemons)
            replacedNames << daemon.busNames;
        Services services = createServices(profile, replacedNames, phone, journal, faults);
        for (const RealDaemon &daemon : daemons)
            services.push_back(std::make_unique<RealService>(daemon, phone, [&status] { status = 1; }));
        const PowerSwitch powerSwitch(phone, services);
        const Control control(services, journal, faults,
                              {{QStringLiteral("name"), profile.value(QLatin1String("name"))}});
        const StartUp startUp(services, [&](const QString &problem) {
            if (problem.isEmpty()) {
                if (write(readyFd, "", 1) == 1)
                    close(std::exchange(readyFd, -1));
                return;
            }
            std::fprintf(stderr, "corvane-simulator: %s\n", qUtf8Printable(problem));
            status = 1;
            g_main_loop_quit(loop.get());
        });
        if (status == 0)
            g_main_loop_run(loop.get());
        services.clear();
        g_source_remove(termination);
    } catch (const BusError &error) {
        std::fprintf(stderr, "corvane-simulator: the phone's services: %s\n", error.what());
        return 1;
    }
    return status;
}

} // namespace Simulator
} // namespace Corvane
