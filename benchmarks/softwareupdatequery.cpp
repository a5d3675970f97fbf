// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/softwareupdate.h>

#include <benchmark/benchmark.h>

#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>

#include <systemd/sd-bus.h>

namespace
{

constexpr char Service[] = "org.corvaneos.mdmproxy";
constexpr char Path[] = "/Corvane/Mdm/Proxy/SoftwareUpdate";
constexpr char Interface[] = "org.corvaneos.mdmproxy.softwareupdate";
constexpr char Method[] = "softwareUpdateIsAvailable";

void query(benchmark::State &state)
{
    const Corvane::Mdm::SoftwareUpdate update;
    for (auto _ : state)
        benchmark::DoNotOptimize(update.softwareUpdateIsAvailable());
}

void queryThroughQtDBus(benchmark::State &state)
{
    const QDBusConnection bus = QDBusConnection::systemBus();
    for (auto _ : state) {
        const QDBusMessage reply = bus.call(QDBusMessage::createMethodCall(
            QLatin1String(Service), QLatin1String(Path), QLatin1String(Interface), QLatin1String(Method)));
        if (reply.type() != QDBusMessage::ReplyMessage) {
            state.SkipWithError(qPrintable(reply.errorMessage()));
            return;
        }
        benchmark::DoNotOptimize(reply.arguments().constFirst().toBool());
    }
}

void queryThroughSdBus(benchmark::State &state)
{
    sd_bus *bus = nullptr;
    int result = sd_bus_open_system(&bus);
    for (auto _ : state) {
        sd_bus_error error = SD_BUS_ERROR_NULL;
        sd_bus_message *reply = nullptr;
        int available = 0;
        if (result >= 0)
            result = sd_bus_call_method(bus, Service, Path, Interface, Method, &error, &reply, "");
        if (result >= 0)
            result = sd_bus_message_read(reply, "b", &available);
        sd_bus_message_unref(reply);
        sd_bus_error_free(&error);
        if (result < 0) {
            state.SkipWithError("sd-bus failed");
            break;
        }
        benchmark::DoNotOptimize(available);
    }
    sd_bus_flush_close_unref(bus);
}

} // namespace

BENCHMARK(query)->Name("query/library")->UseRealTime()->Unit(benchmark::kMicrosecond);
BENCHMARK(queryThroughQtDBus)->Name("query/QtDBus")->UseRealTime()->Unit(benchmark::kMicrosecond);
BENCHMARK(queryThroughSdBus)->Name("query/sd-bus")->UseRealTime()->Unit(benchmark::kMicrosecond);
