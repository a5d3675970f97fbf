// SPDX-License-Identifier: LGPL-2.1-or-later
#include "datacounters.h"

#include "connman.h"
#include "refusal.h"
#include "service.h"

#include <algorithm>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String counterInterface("net.connman.Counter");
constexpr guint64 bytesAKibibyte = 1024;
constexpr guint millisecondsASecond = 1000;

/** Those of @p now that are not among @p told. */
Properties changesIn(const Properties &now, const Properties &told)
{
    Properties changes;
    for (const auto &property : now) {
        const bool isTold = std::any_of(told.begin(), told.end(), [&](const auto &each) {
            return each.first == property.first && g_variant_equal(each.second.get(), property.second.get());
        });
        if (!isTold)
            changes.push_back(property);
    }
    return changes;
}

guint64 bytesOf(const Network &network)
{
    guint64 bytes = 0;
    for (const bool roaming : {false, true}) {
        const DataTotals totals = network.totals(roaming);
        bytes += totals.receivedBytes + totals.sentBytes;
    }
    return bytes;
}

Variant parseDictionary(const QString &text)
{
    ErrorSlot error;
    Variant value(
        g_variant_parse(G_VARIANT_TYPE_VARDICT, text.toUtf8().constData(), nullptr, nullptr, &error));
    if (!value)
        throw Refusal(QStringLiteral("\"%1\" is no dictionary: %2; one is {'RX.Bytes': <uint64 100>}")
                          .arg(text, QString::fromUtf8(error->message)));
    return value;
}

} // namespace

DataCounters::DataCounters(const Networks &networks)
    : m_networks(networks)
{
}

void DataCounters::attach(Service &service)
{
    m_service = &service;
    service.watchClients([this](const QString &client) { forgetClient(client); });
}

void DataCounters::detach()
{
    m_counters.clear();
    m_service = nullptr;
}

void DataCounters::add(MethodCall &call)
{
    auto counter = std::make_unique<Counter>();
    counter->owner = call.sender();
    counter->path = call.text(0);
    counter->accuracy = call.number(1);
    counter->period = call.number(2);
    if (counter->period < 1)
        throw ConnMan::invalidArguments();
    const bool isKnown = std::any_of(m_counters.begin(), m_counters.end(),
                                     [&](const auto &each) { return each->path == counter->path; });
    if (isKnown)
        throw ConnMan::error("AlreadyExists", "Already exists");
    call.reply();
    m_counters.push_back(std::move(counter));
    reportPeriodically(*m_counters.back());
}

void DataCounters::remove(MethodCall &call)
{
    const std::size_t before = m_counters.size();
    removeIf([owner = call.sender(), path = call.text(0)](const Counter &each) {
        return each.owner == owner && each.path == path;
    });
    if (m_counters.size() == before)
        throw ConnMan::error("NotRegistered", "Not registered");
    call.reply();
}

void DataCounters::removeIf(const std::function<bool(const Counter &)> &matches)
{
    m_counters.erase(std::remove_if(m_counters.begin(), m_counters.end(),
                                    [&](const auto &each) { return matches(*each); }),
                     m_counters.end());
}

void DataCounters::forgetClient(const QString &owner)
{
    removeIf([&owner](const Counter &each) { return each.owner == owner; });
}

void DataCounters::releaseAll()
{
    for (const std::unique_ptr<Counter> &counter : std::exchange(m_counters, {}))
        send(*counter, "Release", nullptr);
}

void DataCounters::reportPeriodically(Counter &counter)
{
    for (const std::unique_ptr<Network> &network : m_networks) {
        if (network->isConnected())
            report(counter, *network);
    }
    counter.timer.start(std::min(counter.period, G_MAXUINT / millisecondsASecond) * millisecondsASecond,
                        [this, &counter] { reportPeriodically(counter); });
}

void DataCounters::reportTraffic(const Network &network)
{
    const guint64 bytes = bytesOf(network);
    for (const std::unique_ptr<Counter> &counter : m_counters) {
        const auto told = counter->told.find(network.path());
        if (told == counter->told.end()
            || bytes - std::min(told->second.bytes, bytes) >= counter->accuracy * bytesAKibibyte)
            report(*counter, network);
    }
}

void DataCounters::report(Counter &counter, const Network &network)
{
    const auto [told, isFirst] = counter.told.try_emplace(network.path());
    const Properties home = network.totals(false).properties();
    const Properties roaming = network.totals(true).properties();
    Properties homeReport = changesIn(home, told->second.home);
    Properties roamingReport = changesIn(roaming, told->second.roaming);
    if (!isFirst)
        (network.isRoaming() ? homeReport : roamingReport).clear();
    told->second = {home, roaming, bytesOf(network)};
    if (homeReport.empty() && roamingReport.empty())
        return;
    send(counter, "Usage",
         g_variant_new("(o@a{sv}@a{sv})", network.path().toUtf8().constData(), toVariant(homeReport),
                       toVariant(roamingReport)));
}

void DataCounters::send(const Counter &counter, const char *member, GVariant *arguments) const
{
    m_service->callClient({counter.owner, counter.path, counterInterface, QLatin1String(member)}, arguments);
}

void DataCounters::sendUsage(const QString &networkPath, const QString &home, const QString &roaming) const
{
    if (!g_variant_is_object_path(networkPath.toUtf8().constData()))
        throw Refusal(QStringLiteral("\"%1\" is no object path").arg(networkPath));
    const Variant homeReport = parseDictionary(home);
    const Variant roamingReport = parseDictionary(roaming);
    for (const std::unique_ptr<Counter> &counter : m_counters) {
        send(*counter, "Usage",
             g_variant_new("(o@a{sv}@a{sv})", networkPath.toUtf8().constData(), homeReport.get(),
                           roamingReport.get()));
    }
}

QJsonArray DataCounters::describe() const
{
    QJsonArray counters;
    for (const std::unique_ptr<Counter> &counter : m_counters) {
        counters << QJsonObject{{QStringLiteral("path"), counter->path},
                                {QStringLiteral("accuracy"), double(counter->accuracy)},
                                {QStringLiteral("period"), double(counter->period)}};
    }
    return counters;
}

} // namespace Simulator
} // namespace Corvane
