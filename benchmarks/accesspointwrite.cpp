// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/connectivitysettings.h>

#include <benchmark/benchmark.h>

#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusVariant>

#include <systemd/sd-bus.h>

using AccessPoint = Corvane::Mdm::ConnectivitySettings::MobileNetworkAccessPointSettings;

namespace
{

constexpr char Service[] = "org.ofono";
constexpr char Modem[] = "/ril_0";
constexpr char Interface[] = "org.ofono.ConnectionContext";
constexpr char Imsi[] = "244051234567890";

struct Write {
    const char *property;
    const char *value;
};

constexpr Write Writes[] = {
    {"Name", "Company MMS"},
    {"AccessPointName", "mms.company"},
    {"Username", "user"},
    {"Password", "secret"},
    {"AuthenticationMethod", "chap"},
    {"Protocol", "ip"},
    {"MessageCenter", "http://mmsc.company.example/"},
    {"MessageProxy", "192.0.2.8:8080"},
};

QDBusMessage call(const QString &path, const char *interface, const char *method,
                  const QVariantList &arguments)
{
    QDBusMessage message = QDBusMessage::createMethodCall(QLatin1String(Service), path,
                                                          QLatin1String(interface), QLatin1String(method));
    message.setArguments(arguments);
    return QDBusConnection::systemBus().call(message);
}

/** An access point for multimedia messages: with one for the internet, mobile data would be measured as well.
 */
const QString &contextPath()
{
    static const QString path
        = call(QLatin1String(Modem), "org.ofono.ConnectionManager", "AddContext", {QStringLiteral("mms")})
              .arguments()
              .value(0)
              .value<QDBusObjectPath>()
              .path();
    return path;
}

void write(benchmark::State &state)
{
    contextPath();
    Corvane::Mdm::ConnectivitySettings settings;
    AccessPoint point;
    point.type = AccessPoint::Mms;
    point.name = QLatin1String(Writes[0].value);
    point.accessPointName = QLatin1String(Writes[1].value);
    point.username = QLatin1String(Writes[2].value);
    point.password = QLatin1String(Writes[3].value);
    point.authenticationMethod = AccessPoint::AuthenticationChap;
    point.messageCenter = QLatin1String(Writes[6].value);
    point.messageProxy = QLatin1String(Writes[7].value);
    for (auto _ : state) {
        if (!settings.setAccessPointSettings(QLatin1String(Imsi), point)) {
            state.SkipWithError("the access point was refused");
            return;
        }
    }
}

void writeThroughQtDBus(benchmark::State &state)
{
    const QString path = contextPath();
    for (auto _ : state) {
        for (const Write &each : Writes) {
            const QDBusMessage reply
                = call(path, Interface, "SetProperty",
                       {QLatin1String(each.property),
                        QVariant::fromValue(QDBusVariant(QString(QLatin1String(each.value))))});
            if (reply.type() != QDBusMessage::ReplyMessage) {
                state.SkipWithError(qPrintable(reply.errorMessage()));
                return;
            }
        }
    }
}

void writeThroughSdBus(benchmark::State &state)
{
    const QByteArray path = contextPath().toUtf8();
    sd_bus *bus = nullptr;
    int result = sd_bus_open_system(&bus);
    for (auto _ : state) {
        for (const Write &each : Writes) {
            sd_bus_error error = SD_BUS_ERROR_NULL;
            if (result >= 0)
                result = sd_bus_call_method(bus, Service, path.constData(), Interface, "SetProperty", &error,
                                            nullptr, "sv", each.property, "s", each.value);
            sd_bus_error_free(&error);
        }
        if (result < 0) {
            state.SkipWithError("sd-bus failed");
            break;
        }
    }
    sd_bus_flush_close_unref(bus);
}

} // namespace

BENCHMARK(write)->Name("accesspoint/library")->UseRealTime()->Unit(benchmark::kMicrosecond);
BENCHMARK(writeThroughQtDBus)->Name("accesspoint/QtDBus")->UseRealTime()->Unit(benchmark::kMicrosecond);
BENCHMARK(writeThroughSdBus)->Name("accesspoint/sd-bus")->UseRealTime()->Unit(benchmark::kMicrosecond);
