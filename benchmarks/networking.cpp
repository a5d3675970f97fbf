// SPDX-License-Identifier: LGPL-2.1-or-later
#include "frame/objectpathproperties_p.h"
#include "network/networkdatacounter_p.h"

#include <connman/networkmanager.h>
#include <connman/networkservice.h>
#include <corvanemdm/netproxy.h>
#include <corvanemdm/networkdatacounter.h>

#include <benchmark/benchmark.h>

#include <QtCore/QCoreApplication>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusMetaType>

using Corvane::Mdm::NetProxy;
using Corvane::Mdm::NetworkDataCounter;
using Corvane::Mdm::NetworkDataCounterAdaptor;
using Corvane::Mdm::NetworkDataCounterPrivate;
using Corvane::Mdm::ObjectPathProperties;
using Corvane::Mdm::ObjectPathPropertiesList;

namespace
{

const QString Prefix = QStringLiteral("/net/connman/service/");

QString identifierOf(int number)
{
    return QStringLiteral("wifi_02c0ffee0001_%1_managed_psk").arg(number, 8, 16, QLatin1Char('0'));
}

/** Makes the connection manager announce that there are @p count saved networks, and no others. */
void announceNetworks(int count)
{
    Corvane::Mdm::registerObjectPathProperties();
    qDBusRegisterMetaType<QList<QDBusVariant>>();
    const NetworkManager *manager = NetworkManagerFactory::createInstance();
    while (!manager->isValid())
        QCoreApplication::processEvents(QEventLoop::WaitForMoreEvents);

    ObjectPathPropertiesList networks;
    for (int number = 0; number < count; ++number) {
        const QVariantMap proxy{{QStringLiteral("Method"), QStringLiteral("direct")}};
        networks.append(
            ObjectPathProperties{QDBusObjectPath(Prefix + identifierOf(number)),
                                 {{QStringLiteral("Name"), QStringLiteral("Network %1").arg(number)},
                                  {QStringLiteral("Type"), QStringLiteral("wifi")},
                                  {QStringLiteral("Favorite"), true},
                                  {QStringLiteral("Proxy.Configuration"), proxy}}});
    }
    QList<QDBusObjectPath> removed;
    const QVector<NetworkService *> before = manager->getSavedServices();
    for (const NetworkService *service : before)
        removed.append(QDBusObjectPath(service->path()));

    QDBusMessage emitSignal = QDBusMessage::createMethodCall(
        QStringLiteral("org.corvaneos.simulator"), QStringLiteral("/org/corvaneos/simulator"),
        QStringLiteral("org.corvaneos.simulator.Control"), QStringLiteral("EmitSignal"));
    emitSignal.setArguments(
        {QStringLiteral("net.connman"), QStringLiteral("/"), QStringLiteral("net.connman.Manager"),
         QStringLiteral("ServicesChanged"),
         QVariant::fromValue(QList<QDBusVariant>{QDBusVariant(QVariant::fromValue(networks)),
                                                 QDBusVariant(QVariant::fromValue(removed))})});
    QDBusConnection::systemBus().call(emitSignal);
    while (manager->getSavedServices().size() != count)
        QCoreApplication::processEvents(QEventLoop::WaitForMoreEvents);
}

/** Of the last two networks of the list, in turn. */
void selectProxy(benchmark::State &state)
{
    const int count = int(state.range(0));
    announceNetworks(count);
    NetProxy proxy;
    while (!proxy.isValid())
        QCoreApplication::processEvents(QEventLoop::WaitForMoreEvents);
    const QString identifiers[] = {identifierOf(count - 1), identifierOf(count - 2)};
    bool next = false;
    for (auto _ : state) {
        next = !next;
        if (!proxy.selectProxy(identifiers[next]))
            state.SkipWithError("the network is not there");
    }
}

void walkTheList(benchmark::State &state)
{
    const int count = int(state.range(0));
    announceNetworks(count);
    const NetworkManager *manager = NetworkManagerFactory::createInstance();
    const QString paths[] = {Prefix + identifierOf(count - 1), Prefix + identifierOf(count - 2)};
    bool next = false;
    for (auto _ : state) {
        next = !next;
        const QVector<NetworkService *> saved = manager->getSavedServices();
        for (NetworkService *service : saved) {
            if (service->path() == paths[next]) {
                benchmark::DoNotOptimize(service);
                break;
            }
        }
    }
}

QVariantMap usageReport()
{
    return {{QStringLiteral("RX.Packets"), quint64(70)},
            {QStringLiteral("TX.Packets"), quint64(7)},
            {QStringLiteral("RX.Bytes"), quint64(99000)},
            {QStringLiteral("TX.Bytes"), quint64(9000)},
            {QStringLiteral("Time"), quint64(60)}};
}

/** Reports as the connection manager's calls bring them, demarshalled. */
void handleReports(benchmark::State &state)
{
    NetworkDataCounter counter;
    quint64 received = 0;
    QObject::connect(&counter, &NetworkDataCounter::counterUpdate, &counter,
                     [&received](const NetworkDataCounter::Update &update) { received += update.rxBytes; });
    NetworkDataCounterPrivate handler(&counter);
    auto *adaptor = handler.findChild<NetworkDataCounterAdaptor *>();
    const QDBusObjectPath path(Prefix + QStringLiteral("cellular_244051234567890_context1"));
    const QVariantMap report = usageReport();
    for (auto _ : state) {
        for (int i = 0; i < state.range(0); ++i)
            adaptor->Usage(path, report, QVariantMap());
    }
    benchmark::DoNotOptimize(received);
}

void readNumbers(benchmark::State &state)
{
    const QVariantMap report = usageReport();
    quint64 received = 0;
    for (auto _ : state) {
        for (int i = 0; i < state.range(0); ++i) {
            NetworkDataCounter::Update update;
            update.txBytes = report.value(QStringLiteral("TX.Bytes")).toULongLong();
            update.rxBytes = report.value(QStringLiteral("RX.Bytes")).toULongLong();
            update.time = report.value(QStringLiteral("Time")).toULongLong();
            received += update.rxBytes;
        }
    }
    benchmark::DoNotOptimize(received);
}

} // namespace

BENCHMARK(selectProxy)
    ->Name("selectproxy/library")
    ->Arg(10)
    ->Arg(100)
    ->Arg(1000)
    ->Unit(benchmark::kMicrosecond);
BENCHMARK(walkTheList)->Name("selectproxy/walk")->Arg(10)->Arg(100)->Arg(1000)->Unit(benchmark::kMicrosecond);
BENCHMARK(handleReports)->Name("usage/library")->Arg(1000)->Unit(benchmark::kMicrosecond);
BENCHMARK(readNumbers)->Name("usage/numbers")->Arg(1000)->Unit(benchmark::kMicrosecond);
