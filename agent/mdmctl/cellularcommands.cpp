// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commands.h"
#include "exitstatus.h"
#include "mobilenetworks.h"
#include "output.h"
#include "table.h"

#include <QtCore/QJsonArray>

#include <algorithm>

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String modemArgument("MODEM");
const QLatin1String technologyArgument("TECHNOLOGY");

using Modem = MobileNetworks::Modem;

/** What a modem offers and uses. */
struct Choice {
    Reply reply;
    Modem modem;
    QVector<Technologies> supported;
    Technologies selected;
};

Choice choiceOf(const MobileNetworks &networks, const Modem &modem)
{
    const Answer<QVector<Technologies>> supported = networks.supported(modem.path);
    const Answer<Technologies> selected = supported.reply.isDone()
        ? networks.selected(modem.path)
        : Answer<Technologies>{supported.reply, {}};
    return {selected.reply, modem, supported.value, selected.value};
}

QStringList names(const QVector<Technologies> &technologies)
{
    QStringList names;
    for (const Technologies each : technologies)
        names.append(technologiesName(each));
    return names;
}

QJsonObject toJson(const Choice &choice)
{
    return {{QStringLiteral("modem"), choice.modem.path},
            {QStringLiteral("imsi"), choice.modem.imsi},
            {QStringLiteral("selected"), technologiesName(choice.selected)},
            {QStringLiteral("supported"), QJsonArray::fromStringList(names(choice.supported))}};
}

Table choicesTable()
{
    return Table({QStringLiteral("MODEM"), QStringLiteral("IMSI"), QStringLiteral("SELECTED"),
                  QStringLiteral("SUPPORTED")});
}

void addRow(Table *table, const Choice &choice)
{
    table->addRow({choice.modem.path, choice.modem.imsi, technologiesName(choice.selected),
                   choice.supported.isEmpty() ? QStringLiteral("no choice")
                                              : names(choice.supported).join(QLatin1String(", "))});
}

int runTechnologies(MobileNetworks &networks, const Values &values)
{
    const Answer<QVector<Modem>> modems = networks.modems();
    if (!modems.reply.isDone())
        return conclude(modems.reply);
    Table table = choicesTable();
    QJsonArray json;
    for (const Modem &modem : modems.value) {
        const Choice choice = choiceOf(networks, modem);
        if (!choice.reply.isDone())
            return conclude(choice.reply);
        addRow(&table, choice);
        json.append(toJson(choice));
    }
    printResult(values, modems.value.isEmpty() ? QStringLiteral("The phone has no modem.") : table.toString(),
                {{QStringLiteral("modems"), json}});
    return ExitDone;
}

/** The modem that @p word is the path of, or that has the SIM of that IMSI. */
Answer<Modem> modemNamed(const MobileNetworks &networks, const QString &word)
{
    const Answer<QVector<Modem>> modems = networks.modems();
    if (!modems.reply.isDone())
        return {modems.reply, {}};
    const auto found = std::find_if(modems.value.cbegin(), modems.value.cend(), [&word](const Modem &modem) {
        return modem.path == word || modem.imsi == word;
    });
    if (found != modems.value.cend())
        return {{}, *found};
    return {{Reply::Refused,
             QStringLiteral("no modem or SIM %1 in the phone; \"mdmctl cellular technologies\" lists them")
                 .arg(word)},
            {}};
}

int runSelect(MobileNetworks &networks, const Values &values)
{
    const Answer<Modem> modem = modemNamed(networks, values.first(modemArgument));
    if (!modem.reply.isDone())
        return conclude(modem.reply);
    const Choice before = choiceOf(networks, modem.value);
    if (!before.reply.isDone())
        return conclude(before.reply);
    const Technologies wanted = *technologiesNamed(values.first(technologyArgument));
    if (wanted != Technologies() && !before.supported.contains(wanted)) {
        return conclude(
            {Reply::Refused,
             QStringLiteral("modem %1 does not offer %2: %3")
                 .arg(modem.value.path, technologiesName(wanted),
                      before.supported.isEmpty() ? QStringLiteral("it has no choice")
                                                 : names(before.supported).join(QLatin1String(", ")))});
    }
    const bool changed = before.selected != wanted;
    const Reply selected = changed ? networks.select(modem.value.path, wanted) : Reply{};
    if (!selected.isDone())
        return conclude(selected);
    const Choice now = choiceOf(networks, modem.value);
    if (!now.reply.isDone())
        return conclude(now.reply);

    Table table = choicesTable();
    addRow(&table, now);
    QJsonObject json = toJson(now);
    json.insert(QStringLiteral("changed"), changed);
    printResult(values, unchangedNote(changed) + table.toString(), json);
    return ExitDone;
}

int runStatus(MobileNetworks &networks, const Values &values)
{
    const Answer<QStringList> imsis = networks.imsis();
    if (!imsis.reply.isDone())
        return conclude(imsis.reply);
    Table table({QStringLiteral("IMSI"), QStringLiteral("MOBILE DATA")});
    QJsonArray json;
    for (const QString &imsi : imsis.value) {
        const Answer<bool> connected = networks.isConnected(imsi);
        if (connected.reply.outcome == Reply::ServiceLost)
            return conclude(connected.reply);
        if (!connected.reply.isDone())
            printError(connected.reply.text);
        const bool isUp = connected.reply.isDone() && connected.value;
        table.addRow({imsi, isUp ? QStringLiteral("up") : QStringLiteral("down")});
        json.append(QJsonObject{{QStringLiteral("imsi"), imsi}, {QStringLiteral("connected"), isUp}});
    }
    printResult(values,
                imsis.value.isEmpty() ? QStringLiteral("No SIM has access points.") : table.toString(),
                {{QStringLiteral("connections"), json}});
    return ExitDone;
}

std::function<int(MobileNetworks &, const Values &)> runConnection(bool wanted)
{
    return [wanted](MobileNetworks &networks, const Values &values) -> int {
        const QString imsi = values.first(imsiName());
        const Answer<bool> before = networks.isConnected(imsi);
        if (!before.reply.isDone())
            return conclude(before.reply);
        // What is up may not come up by itself the next time, so that the phone is asked in any case.
        const Reply reply = networks.setConnected(imsi, wanted);
        if (!reply.isDone())
            return conclude(reply);
        const Answer<bool> now = networks.isConnected(imsi);
        if (!now.reply.isDone())
            return conclude(now.reply);
        const QString going = wanted ? QStringLiteral("coming up") : QStringLiteral("going down");
        const QString gone = wanted ? QStringLiteral("up") : QStringLiteral("down");
        printResult(
            values,
            QStringLiteral("Mobile data through SIM %1 is %2.").arg(imsi, now.value == wanted ? gone : going),
            {{QStringLiteral("imsi"), imsi},
             {QStringLiteral("connected"), now.value},
             {QStringLiteral("changed"), now.value != before.value}});
        return ExitDone;
    };
}

/** @param services those that it takes, in the order in which they are looked for */
Command command(const QString &name, const QString &summary, const QVector<Service> &services,
                const std::function<int(MobileNetworks &, const Values &)> &run)
{
    Command command;
    command.name = name;
    command.summary = summary;
    command.options = {jsonOption()};
    command.run = [services, run](const Values &values) -> int {
        for (const Service &service : services) {
            const Reply running = service.ensureRunning();
            if (!running.isDone())
                return conclude(running);
        }
        MobileNetworks networks(timeoutsOf(values).confirmation);
        return run(networks, values);
    };
    return command;
}

Command connectionCommand(const QString &name, const QString &summary, const QString &help, bool wanted)
{
    Command connection
        = command(name, summary, {Service::telephony(), Service::connectionManager()}, runConnection(wanted));
    connection.arguments = {imsiArgument()};
    connection.description
        = QStringLiteral("%1\n\nExample:\n  mdmctl cellular %2 244051234567890\n\n"
                         "JSON, after the change: {\"imsi\": \"244051234567890\", \"connected\": %3, "
                         "\"changed\": true}")
              .arg(help, name, wanted ? QStringLiteral("true") : QStringLiteral("false"));
    return connection;
}

} // namespace

Command cellularCommand()
{
    Command technologies = command(QStringLiteral("technologies"),
                                   QStringLiteral("Show which radio technologies each modem offers and uses"),
                                   {Service::telephony()}, runTechnologies);
    technologies.description = QStringLiteral(
        "JSON: {\"modems\": [{\"modem\": \"/ril_0\", \"imsi\": \"244051234567890\", \"selected\": \"any\",\n"
        "\"supported\": [\"2g\", \"3g\", \"4g\"]}]}. A modem without a choice supports [].");

    Command select
        = command(QStringLiteral("select"), QStringLiteral("Restrict the radio technologies of a modem"),
                  {Service::telephony()}, runSelect);
    select.arguments = {{modemArgument, QStringLiteral("Path of the modem, or IMSI of its SIM"), {}, {}},
                        {technologyArgument,
                         QStringLiteral("Newest generation of networks, with those before it; or any: no "
                                        "restriction"),
                         technologiesNames(),
                         {}}};
    select.description
        = QStringLiteral("A modem takes what it offers: \"4g\" is 2G, 3G and 4G.\n\n"
                         "Examples:\n"
                         "  mdmctl cellular select /ril_0 3g\n"
                         "  mdmctl cellular select 244051234567890 any\n\n"
                         "JSON, after the change: as of \"technologies\", for one modem, with \"changed\".");

    Command status
        = command(QStringLiteral("status"), QStringLiteral("Show through which SIMs mobile data is up"),
                  {Service::telephony(), Service::connectionManager()}, runStatus);
    status.description
        = QStringLiteral("Lists the SIMs that have access points.\n\n"
                         "JSON: {\"connections\": [{\"imsi\": \"244051234567890\", \"connected\": true}]}");

    Command cellular;
    cellular.name = QStringLiteral("cellular");
    cellular.summary = QStringLiteral("Manage radio technologies and mobile data");
    cellular.description = QStringLiteral("\"mdmctl apn\" manages what mobile data connects to.");
    cellular.commands = {
        technologies, select, status,
        connectionCommand(
            QStringLiteral("connect"), QStringLiteral("Bring mobile data up through a SIM"),
            QStringLiteral("Mobile data comes up by itself from now on. Ends when the phone has "
                           "connected, or has agreed to."),
            true),
        connectionCommand(QStringLiteral("disconnect"), QStringLiteral("Take mobile data through a SIM down"),
                          QStringLiteral("Mobile data does not come up by itself any more."), false)};
    return cellular;
}

} // namespace Agent
} // namespace Corvane
