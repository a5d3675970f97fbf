// SPDX-License-Identifier: LGPL-2.1-or-later
#include "device.h"

#include "component.h"
#include "control.h"
#include "service.h"

#include <glib-unix.h>

#include <csignal>
#include <cstdio>
#include <unistd.h>

namespace Corvane
{
namespace Simulator
{

namespace
{

std::vector<std::unique_ptr<Service>> createServices(const QJsonObject &profile,
                                                     const QStringList &replacedNames, Phone &phone,
                                                     Journal &journal, FaultTable &faults)
{
    std::vector<std::unique_ptr<Service>> services;
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

} // namespace

int runDevice(const QJsonObject &profile, const QStringList &replacedNames, int readyFd)
{
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
        auto services = createServices(profile, replacedNames, phone, journal, faults);
        const Control control(services, journal, faults,
                              {{QStringLiteral("name"), profile.value(QLatin1String("name"))}});
        for (const std::unique_ptr<Service> &service : services)
            service->start();

        BusConnection observer;
        const auto tellWhenReady = [&] {
            for (const QString &name : replacedNames) {
                if (readyFd < 0 || !observer.nameHasOwner(name))
                    return;
            }
            if (write(readyFd, "", 1) == 1)
                close(std::exchange(readyFd, -1));
        };
        observer.watchNames([&](const QString &, const QString &) {
            if (readyFd >= 0)
                tellWhenReady();
        });
        tellWhenReady();

        g_main_loop_run(loop.get());
        services.clear();
        g_source_remove(termination);
    } catch (const BusError &error) {
        std::fprintf(stderr, "corvane-simulator: the phone's services: %s\n", error.what());
        return 1;
    }
    return 0;
}

} // namespace Simulator
} // namespace Corvane
