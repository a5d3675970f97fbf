// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commands.h"
#include "exitstatus.h"
#include "livetable.h"
#include "output.h"
#include "service.h"
#include "table.h"
#include "trafficmeter.h"
#include "wait.h"

#include <corvanemdm/networkdatacounter.h>

#include <QtCore/QElapsedTimer>
#include <QtCore/QJsonArray>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusPendingCallWatcher>

#include <utility>

namespace Corvane
{
namespace Agent
{

using Mdm::NetworkDataCounter;

namespace
{

const QString networkName = QStringLiteral("NETWORK");
const QString intervalName = QStringLiteral("--interval");
const QString accuracyName = QStringLiteral("--accuracy");
const QLatin1String servicePathPrefix("/net/connman/service/");

constexpr int watchInterval = 1; // seconds

QString typeWord(NetworkDataCounter::NetworkType type)
{
    switch (type) {
    case NetworkDataCounter::MobileDataHome:
        return QStringLiteral("home");
    case NetworkDataCounter::MobileDataRoaming:
        return QStringLiteral("roaming");
    case NetworkDataCounter::Wlan:
        break;
    }
    return QStringLiteral("wlan");
}

QString sizeText(double bytes)
{
    static const char *const units[] = {"B", "KiB", "MiB", "GiB"};
    std::size_t unit = 0;
    while (bytes >= 1024 && unit + 1 < std::size(units)) {
        bytes /= 1024;
        ++unit;
    }
    return QStringLiteral("%1 %2").arg(bytes, 0, 'f', unit == 0 ? 0 : 1).arg(QLatin1String(units[unit]));
}

QString rateText(double bytesPerSecond)
{
    return sizeText(bytesPerSecond) + QStringLiteral("/s");
}

QString durationText(quint64 seconds)
{
    return QStringLiteral("%1:%2:%3")
        .arg(seconds / 3600)
        .arg(seconds / 60 % 60, 2, 10, QLatin1Char('0'))
        .arg(seconds % 60, 2, 10, QLatin1Char('0'));
}

QString tableText(const TrafficMeter &meter)
{
    Table table({networkName, QStringLiteral("KIND"), QStringLiteral("RECEIVED"), QStringLiteral("SENT"),
                 QStringLiteral("IN"), QStringLiteral("OUT"), QStringLiteral("ONLINE")});
    for (const TrafficMeter::Reading &reading : meter.readings()) {
        table.addRow({reading.network, typeWord(reading.type), sizeText(double(reading.received)),
                      sizeText(double(reading.sent)), rateText(reading.receivedPerSecond),
                      rateText(reading.sentPerSecond), durationText(reading.seconds)});
    }
    return table.toString();
}

QString lineText(const TrafficMeter::Reading &reading)
{
    return QStringLiteral("%1 (%2): %3 received (%4), %5 sent (%6)")
        .arg(reading.network, typeWord(reading.type), sizeText(double(reading.received)),
             rateText(reading.receivedPerSecond), sizeText(double(reading.sent)),
             rateText(reading.sentPerSecond));
}

QJsonObject readingJson(const TrafficMeter::Reading &reading)
{
    return {
        {QStringLiteral("event"), QStringLiteral("usage")},
        {QStringLiteral("network"), reading.network},
        {QStringLiteral("kind"), typeWord(reading.type)},
        {QStringLiteral("received"), double(reading.received)},
        {QStringLiteral("sent"), double(reading.sent)},
        {QStringLiteral("receivedPerSecond"), reading.receivedPerSecond},
        {QStringLiteral("sentPerSecond"), reading.sentPerSecond},
        {QStringLiteral("seconds"), double(reading.seconds)},
    };
}

/**
 * Asks what the connection manager answers once it has dealt with all that it was asked before. A "Ping"
 * would not do: libraries answer it ahead of their program.
 */
QDBusPendingCall askLast(const Service &manager)
{
    return QDBusConnection::systemBus().asyncCall(QDBusMessage::createMethodCall(
        manager.name, QStringLiteral("/"), QStringLiteral("net.connman.Manager"),
        QStringLiteral("GetProperties")));
}

int runWatch(const Values &values)
{
    NetworkDataCounter counter;
    counter.setUpdateInterval(values.has(intervalName) ? values.first(intervalName).toInt() : watchInterval);
    if (values.has(accuracyName))
        counter.setUpdateAccuracy(values.first(accuracyName).toInt());

    const bool isLive = LiveTable::isPossible() && !wantsJson(values);
    LiveTable table;
    TrafficMeter meter;
    const EventLog log(wantsJson(values));
    QElapsedTimer clock;
    clock.start();
    Wait wait(Service::connectionManager(), Wait::Forever, QString());
    bool isAnnounced = isLive;
    const auto announce = [&] {
        if (!std::exchange(isAnnounced, true))
            log.write(QStringLiteral("Counting data."),
                      {{QStringLiteral("event"), QStringLiteral("watching")}});
    };
    QObject::connect(&counter, &NetworkDataCounter::counterUpdate, &wait,
                     [&](const NetworkDataCounter::Update &update) {
                         announce();
                         const TrafficMeter::Reading &reading = meter.take(update, clock.elapsed());
                         if (isLive)
                             table.show(tableText(meter));
                         else
                             log.write(lineText(reading), readingJson(reading));
                     });
    counter.setActive(true);
    // Whoever reads that data is counted may rely on it, so the registration has been taken by then.
    QDBusPendingCallWatcher last(askLast(Service::connectionManager()));
    QObject::connect(&last, &QDBusPendingCallWatcher::finished, &wait, [&] {
        if (!last.isError() && !wait.isOver())
            announce();
    });
    QObject::connect(&counter, &NetworkDataCounter::activeChanged, &wait, [&] {
        const Service manager = Service::connectionManager();
        wait.end(manager.isRunning() ? Reply::Refused : Reply::ServiceLost,
                 manager.isRunning() ? manager.toString() + QStringLiteral(" has dropped the counter")
                                     : manager.notRunning().text);
    });
    if (isLive)
        table.show(tableText(meter));
    return concludeWatch(wait.run());
}

int runReset(const Values &values)
{
    const Service manager = Service::connectionManager();
    const QStringList networks = values.all(networkName);
    NetworkDataCounter counter;
    Wait wait(manager, timeoutsOf(values).confirmation, QStringLiteral("answer"));
    for (const QString &network : networks)
        counter.resetCounter(servicePathPrefix + network);
    // Only refusals are told. Answers come in the order of the questions, so this one's is the last.
    QDBusPendingCallWatcher last(askLast(manager));
    QObject::connect(&last, &QDBusPendingCallWatcher::finished, &wait, [&wait] { wait.end(Reply::Done); });
    const Reply reply = wait.run();
    if (reply.isDone()) {
        if (wantsJson(values))
            print(QJsonObject{{QStringLiteral("reset"), QJsonArray::fromStringList(networks)}});
        else
            print(QStringLiteral("Counting %1 anew.").arg(networks.join(QLatin1String(", "))));
    }
    return conclude(reply);
}

QString numberFault(const QString &value)
{
    bool isNumber = false;
    const int number = value.toInt(&isNumber);
    return isNumber && number >= 1 ? QString() : QStringLiteral("must be a whole number, 1 or more");
}

QString networkFault(const QString &value)
{
    for (const QChar character : value) {
        if (!(character.isLetterOrNumber() && character.unicode() < 0x80) && character != QLatin1Char('_'))
            return QStringLiteral("must be an identifier, as \"mdmctl proxy list\" shows them");
    }
    return QString();
}

Command command(const QString &name, const QString &summary, const QString &description,
                int (*run)(const Values &))
{
    Command command;
    command.name = name;
    command.summary = summary;
    command.description = description;
    command.options = {jsonOption()};
    command.run = [run](const Values &values) -> int {
        const Reply running = Service::connectionManager().ensureRunning();
        return running.isDone() ? run(values) : conclude(running);
    };
    return command;
}

} // namespace

Command countersCommand()
{
    Command watch = command(
        QStringLiteral("watch"), QStringLiteral("Show data as it is used, with rates"),
        QStringLiteral(
            "On a terminal a table is kept up to date; elsewhere each report is a line. Ends when it "
            "is\ninterrupted (Ctrl-C, exit status 0).\n\n"
            "JSON: one object a line with \"time\", \"event\": \"usage\", \"network\", \"kind\" "
            "(wlan, home or\nroaming), \"received\", \"sent\" (bytes since the last reset), "
            "\"receivedPerSecond\", \"sentPerSecond\"\nand \"seconds\" of being connected; and "
            "{\"event\": \"watching\"} at the start."),
        runWatch);
    watch.options.append({intervalName, QStringLiteral("Seconds from report to report (default: 1)"),
                          QStringLiteral("SECONDS"), numberFault});
    watch.options.append({accuracyName, QStringLiteral("KiB from report to report (default: 1024)"),
                          QStringLiteral("KIB"), numberFault});

    Command reset
        = command(QStringLiteral("reset"), QStringLiteral("Count networks anew, for everybody"),
                  QStringLiteral("Example:\n"
                                 "  mdmctl counters reset wifi_02c0ffee0001_486f6d65_managed_psk\n\n"
                                 "JSON: {\"reset\": [\"...\"]}"),
                  runReset);
    reset.options.append(timeoutOption(
        QStringLiteral("Give up when the phone has not answered after so many seconds (default: 25)")));
    reset.arguments = {{networkName,
                        QStringLiteral("Identifiers of the networks"),
                        {},
                        networkFault,
                        Argument::Word,
                        Argument::Several}};

    Command counters;
    counters.name = QStringLiteral("counters");
    counters.summary = QStringLiteral("Count the data that wireless and mobile networks carry");
    counters.description = QStringLiteral("Examples:\n"
                                          "  mdmctl counters watch\n"
                                          "  mdmctl counters watch --interval 10 --json");
    counters.commands = {watch, reset};
    return counters;
}

} // namespace Agent
} // namespace Corvane
