// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commands.h"
#include "exitstatus.h"
#include "output.h"
#include "service.h"
#include "simcards.h"
#include "table.h"
#include "wait.h"

#include <QtCore/QJsonArray>

namespace Corvane
{
namespace Agent
{

using Mdm::SimInfo;

namespace
{

/** The words of the library's debug forms. */
template <typename Enum> QString wordOf(Enum value)
{
    QString text;
    QDebug(&text).nospace() << value;
    return text;
}

QString pinWord(SimInfo::PinRequired pin)
{
    switch (pin) {
    case SimInfo::PinNotRequired:
        return QStringLiteral("none");
    case SimInfo::SimPinRequired:
        return QStringLiteral("pin");
    case SimInfo::SimPukRequired:
        return QStringLiteral("puk");
    case SimInfo::UnknownPinState:
        break;
    }
    return QStringLiteral("unknown");
}

QJsonObject stateJson(const SimInfo::SimState &state)
{
    return {
        {QStringLiteral("modem"), state.modemPath},
        {QStringLiteral("present"), state.present},
        {QStringLiteral("voice"), state.voiceSim},
        {QStringLiteral("data"), state.dataSim},
        {QStringLiteral("enabled"), state.enabled},
        {QStringLiteral("pin"), pinWord(state.pinRequired)},
        {QStringLiteral("registration"), wordOf(state.networkRegistration)},
        {QStringLiteral("imsi"), state.imsi},
        {QStringLiteral("iccid"), state.cardIdentifier},
        {QStringLiteral("provider"), state.serviceProviderName},
        {QStringLiteral("numbers"), QJsonArray::fromStringList(state.subscriberNumbers)},
    };
}

/** What the SIM is for: an empty slot that has nothing to do is not worth the words. */
QString useText(const SimInfo::SimState &state)
{
    QStringList uses;
    if (state.present && state.voiceSim)
        uses.append(QStringLiteral("calls"));
    if (state.present && state.dataSim)
        uses.append(QStringLiteral("data"));
    return uses.join(QLatin1String(", "));
}

/** What stands in the way of using the slot, or how it stands to the network. */
QString conditionText(const SimInfo::SimState &state)
{
    if (!state.present)
        return state.enabled ? QStringLiteral("no SIM") : QStringLiteral("off");
    if (state.pinRequired == SimInfo::SimPinRequired || state.pinRequired == SimInfo::SimPukRequired)
        return wordOf(state.pinRequired);
    return wordOf(state.networkRegistration);
}

int runList(SimCards &cards, const Values &values)
{
    const Reply opened = cards.open();
    if (!opened.isDone())
        return conclude(opened);
    Table table({QStringLiteral("MODEM"), QStringLiteral("STATE"), QStringLiteral("USE"),
                 QStringLiteral("IMSI"), QStringLiteral("ICCID"), QStringLiteral("PROVIDER"),
                 QStringLiteral("NUMBERS")});
    QJsonArray json;
    const QList<SimInfo::SimState> states = cards.info().simSlotStates();
    for (const SimInfo::SimState &state : states) {
        table.addRow({state.modemPath, conditionText(state), useText(state), state.imsi, state.cardIdentifier,
                      state.serviceProviderName, state.subscriberNumbers.join(QLatin1Char('\n'))});
        json.append(stateJson(state));
    }
    if (wantsJson(values))
        print(QJsonObject{{QStringLiteral("sims"), json}});
    else
        print(table.toString());
    return ExitDone;
}

int runWatch(SimCards &cards, const Values &values)
{
    const Reply opened = cards.open();
    if (!opened.isDone())
        return conclude(opened);
    const EventLog log(wantsJson(values));
    Wait wait(Service::telephony(), Wait::Forever, QString());
    QObject::connect(&cards.info(), &SimInfo::simStateChanged, &wait, [&](const SimInfo::SimState &state) {
        QStringList words{conditionText(state), state.imsi, useText(state)};
        words.removeAll(QString());
        QJsonObject members = stateJson(state);
        members.insert(QStringLiteral("event"), QStringLiteral("simChanged"));
        log.write(QStringLiteral("%1: %2").arg(state.modemPath, words.join(QLatin1String(", "))), members);
    });
    log.write(QStringLiteral("Watching the SIMs."), {{QStringLiteral("event"), QStringLiteral("watching")}});
    return concludeWatch(wait.run());
}

/** Asks for one thing of each slot, and shows it under @p heading. */
std::function<int(SimCards &, const Values &)> runQuery(const char *heading,
                                                        QList<SimInfo::SlotInfo> (SimInfo::*query)() const)
{
    return [heading, query](SimCards &cards, const Values &values) -> int {
        const Reply asked = cards.ask();
        if (!asked.isDone())
            return conclude(asked);
        Table table({QStringLiteral("SLOT"), QLatin1String(heading)});
        QJsonArray json;
        const QList<SimInfo::SlotInfo> slots = (cards.info().*query)();
        for (const SimInfo::SlotInfo &slot : slots) {
            table.addRow({QString::number(slot.slot), slot.value});
            json.append(
                QJsonObject{{QStringLiteral("slot"), slot.slot}, {QStringLiteral("value"), slot.value}});
        }
        if (wantsJson(values))
            print(QJsonObject{{QStringLiteral("slots"), json}});
        else
            print(slots.isEmpty() ? QStringLiteral("No slot tells it.") : table.toString());
        return ExitDone;
    };
}

Command command(const QString &name, const QString &summary, const QString &description,
                const std::function<int(SimCards &, const Values &)> &run)
{
    Command command;
    command.name = name;
    command.summary = summary;
    command.description = description;
    command.options
        = {jsonOption(),
           timeoutOption(QStringLiteral(
               "Give up when the phone has not told its SIMs after so many seconds (default: 25)"))};
    command.run = [run](const Values &values) -> int {
        const Reply running = Service::telephony().ensureRunning();
        if (!running.isDone())
            return conclude(running);
        SimCards cards(timeoutsOf(values).confirmation);
        return run(cards, values);
    };
    return command;
}

const QString slotsJson = QStringLiteral("JSON: {\"slots\": [{\"slot\": 0, \"value\": \"...\"}]}, slots "
                                         "without a value left out.");

} // namespace

Command simCommand()
{
    Command sim;
    sim.name = QStringLiteral("sim");
    sim.summary = QStringLiteral("Show what is in the SIM slots");
    sim.description = QStringLiteral("Slots are numbered from 0, in the order of the phone's modems.\n\n"
                                     "Examples:\n"
                                     "  mdmctl sim list\n"
                                     "  mdmctl sim imsi --json");
    sim.commands = {
        command(QStringLiteral("list"), QStringLiteral("Show each slot: its SIM, and what becomes of it"),
                QStringLiteral(
                    "JSON: {\"sims\": [{\"modem\": \"/ril_0\", \"present\": true, \"voice\": true, \"data\": "
                    "true,\n\"enabled\": true, \"pin\": \"none\", \"registration\": \"registered\", "
                    "\"imsi\": \"...\", \"iccid\": \"...\",\n\"provider\": \"...\", \"numbers\": "
                    "[\"...\"]}]}. \"pin\" is none, pin, puk or unknown; \"registration\" is\nregistered, "
                    "roaming, searching, denied, unregistered or unknown."),
                runList),
        command(QStringLiteral("watch"), QStringLiteral("Follow what changes in the slots"),
                QStringLiteral(
                    "Prints one line a change until it is interrupted (Ctrl-C, exit status 0).\n\n"
                    "JSON: one object a line with \"time\", \"event\": \"simChanged\" and the members of "
                    "\"sim list\";\nand {\"event\": \"watching\"} at the start."),
                runWatch),
        command(QStringLiteral("imei"), QStringLiteral("Show the serial number of each slot's modem"),
                slotsJson, runQuery("IMEI", &SimInfo::imeiCodes)),
        command(QStringLiteral("imsi"), QStringLiteral("Show the subscriber identity of each SIM"), slotsJson,
                runQuery("IMSI", &SimInfo::subscriberIdentities)),
        command(QStringLiteral("iccid"), QStringLiteral("Show the number of each card"), slotsJson,
                runQuery("ICCID", &SimInfo::cardIdentifier)),
        command(QStringLiteral("numbers"), QStringLiteral("Show the telephone numbers of each SIM"),
                slotsJson, runQuery("NUMBERS", &SimInfo::subscriberNumbers)),
    };
    return sim;
}

} // namespace Agent
} // namespace Corvane
