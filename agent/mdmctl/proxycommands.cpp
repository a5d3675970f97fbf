// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commands.h"
#include "exitstatus.h"
#include "output.h"
#include "proxies.h"
#include "service.h"
#include "table.h"
#include "wait.h"

#include <QtCore/QJsonArray>

namespace Corvane
{
namespace Agent
{

using Mdm::NetProxy;

namespace
{

const QString targetName = QStringLiteral("TARGET");
const QString serverName = QStringLiteral("SERVER");
const QString urlName = QStringLiteral("URL");
const QString useName = QStringLiteral("WHICH");
const QString exceptName = QStringLiteral("--except");
const QString technologyName = QStringLiteral("--technology");

const QString globalWord = QStringLiteral("global");
const QString networksWord = QStringLiteral("networks");

const QString proxyJson
    = QStringLiteral("{\"identifier\": \"global\", \"name\": \"Global Proxy\", \"used\": true, \"method\": "
                     "\"manual\",\n\"servers\": [\"...\"], \"exclusions\": [\"...\"]}; \"direct\" has "
                     "neither, \"automatic\" has \"url\".");

/** Whether traffic goes by what is selected, where it goes at all. */
bool isUsed(const Proxies &proxies)
{
    return proxies.usesGlobal() == (proxies.identifier() == Proxies::global());
}

QJsonObject selectedJson(const Proxies &proxies)
{
    QJsonObject json = proxies.configuration().toJson();
    json.insert(QStringLiteral("identifier"), proxies.identifier());
    json.insert(QStringLiteral("name"), proxies.name());
    json.insert(QStringLiteral("used"), isUsed(proxies));
    return json;
}

QString selectedText(const Proxies &proxies)
{
    return QStringLiteral("%1: %2%3")
        .arg(proxies.name(), proxies.configuration().toString(),
             isUsed(proxies) ? QString() : QStringLiteral(" (not used)"));
}

void printSelected(const Proxies &proxies, const Values &values)
{
    if (wantsJson(values))
        print(selectedJson(proxies));
    else
        print(selectedText(proxies));
}

/** Selects what is named on the command line: the global proxy unless there is something else. */
Reply selectTarget(Proxies &proxies, const Values &values)
{
    const QString target = values.has(targetName) ? values.first(targetName) : Proxies::global();
    if (target == Proxies::global())
        return proxies.select(target);
    const QStringList networks = proxies.networksNamed(target);
    if (networks.size() == 1)
        return proxies.select(networks.first());
    if (networks.isEmpty()) {
        return {
            Reply::Refused,
            QStringLiteral("there is no saved network \"%1\"; \"mdmctl proxy list\" shows them").arg(target)};
    }
    return {Reply::Refused,
            QStringLiteral("several networks are called \"%1\": %2")
                .arg(target, networks.join(QLatin1String(", ")))};
}

int runList(Proxies &proxies, const Values &values)
{
    QStringList targets = proxies.networks(values.first(technologyName));
    if (!values.has(technologyName))
        targets.prepend(Proxies::global());
    Table table({QStringLiteral("IDENTIFIER"), QStringLiteral("NAME"), QStringLiteral("USED"),
                 QStringLiteral("PROXY")});
    QJsonArray json;
    for (const QString &target : qAsConst(targets)) {
        if (!proxies.select(target).isDone())
            continue; // it has just gone
        table.addRow({proxies.identifier(), proxies.name(),
                      isUsed(proxies) ? QStringLiteral("yes") : QStringLiteral("no"),
                      proxies.configuration().toString()});
        json.append(selectedJson(proxies));
    }
    if (wantsJson(values)) {
        print(QJsonObject{{QStringLiteral("use"), proxies.usesGlobal() ? globalWord : networksWord},
                          {QStringLiteral("proxies"), json}});
    } else {
        print(json.isEmpty() ? QStringLiteral("No network of that technology is saved.") : table.toString());
    }
    return ExitDone;
}

int runShow(Proxies &proxies, const Values &values)
{
    const Reply selected = selectTarget(proxies, values);
    if (selected.isDone())
        printSelected(proxies, values);
    return conclude(selected);
}

int configure(Proxies &proxies, const Values &values, const ProxyConfiguration &wanted)
{
    Reply reply = selectTarget(proxies, values);
    if (reply.isDone())
        reply = proxies.configure(wanted);
    if (reply.isDone())
        printSelected(proxies, values);
    return conclude(reply);
}

int runDirect(Proxies &proxies, const Values &values)
{
    return configure(proxies, values, {NetProxy::Direct, {}, {}, {}});
}

int runManual(Proxies &proxies, const Values &values)
{
    const QStringList exclusions = values.first(exceptName).split(QLatin1Char(','), Qt::SkipEmptyParts);
    return configure(proxies, values, {NetProxy::Manual, values.all(serverName), exclusions, {}});
}

int runAutomatic(Proxies &proxies, const Values &values)
{
    return configure(proxies, values, {NetProxy::Automatic, {}, {}, values.first(urlName)});
}

int runUse(Proxies &proxies, const Values &values)
{
    const bool global = values.first(useName) == globalWord;
    const Reply reply = proxies.useGlobal(global);
    if (reply.isDone()) {
        if (wantsJson(values))
            print(QJsonObject{{QStringLiteral("use"), values.first(useName)}});
        else
            print(global ? QStringLiteral("The global proxy is used for all networks.")
                         : QStringLiteral("Each network uses its own proxy."));
    }
    return conclude(reply);
}

int runWatch(Proxies &proxies, const Values &values)
{
    const Reply selected = selectTarget(proxies, values);
    if (!selected.isDone())
        return conclude(selected);
    const EventLog log(wantsJson(values));
    Wait wait(Service::connectionManager(), Wait::Forever, QString());
    const auto write = [&](const char *event) {
        QJsonObject members = selectedJson(proxies);
        members.insert(QStringLiteral("event"), QLatin1String(event));
        log.write(selectedText(proxies), members);
    };
    QObject::connect(&proxies, &Proxies::changed, &wait, [&] {
        if (proxies.identifier().isEmpty())
            wait.end(Reply::Refused, QStringLiteral("the network has gone"));
        else
            write("proxyChanged");
    });
    write("watching");
    return concludeWatch(wait.run());
}

Command command(const QString &name, const QString &summary, const QString &description,
                int (*run)(Proxies &, const Values &))
{
    Command command;
    command.name = name;
    command.summary = summary;
    command.description = description;
    command.options = {jsonOption(),
                       timeoutOption(QStringLiteral("Give up when the phone has not answered after so many "
                                                    "seconds (default: 25)"))};
    command.run = [run](const Values &values) -> int {
        const Reply running = Service::connectionManager().ensureRunning();
        if (!running.isDone())
            return conclude(running);
        Proxies proxies(timeoutsOf(values).confirmation);
        const Reply opened = proxies.open();
        return opened.isDone() ? run(proxies, values) : conclude(opened);
    };
    return command;
}

Argument targetArgument(Argument::Count count)
{
    return {targetName,
            QStringLiteral("\"global\", or the name or identifier of a saved network"),
            {},
            {},
            Argument::Word,
            count};
}

Command listCommand()
{
    Command list = command(
        QStringLiteral("list"), QStringLiteral("Show the proxies of the phone and of each saved network"),
        QStringLiteral("JSON: {\"use\": \"global\", \"proxies\": [...]}, each ") + proxyJson, runList);
    list.options.append({technologyName,
                         QStringLiteral("Only networks of that technology, such as wifi or cellular"),
                         QStringLiteral("TYPE"),
                         {}});
    return list;
}

Command manualCommand()
{
    Command manual = command(
        QStringLiteral("manual"), QStringLiteral("Send traffic through proxy servers"),
        QStringLiteral("Examples:\n"
                       "  mdmctl proxy manual global http://proxy.example:3128\n"
                       "  mdmctl proxy manual \"Corvane Office\" http://a:3128 http://b:3128 --except "
                       "localhost,.example\n\n"
                       "JSON, when it is confirmed: ")
            + proxyJson,
        runManual);
    manual.arguments = {targetArgument(Argument::One),
                        {serverName,
                         QStringLiteral("URLs of the servers"),
                         {},
                         ProxyConfiguration::urlFault,
                         Argument::Word,
                         Argument::Several}};
    manual.options.append({exceptName,
                           QStringLiteral("Hosts that are reached without a proxy"),
                           QStringLiteral("HOST,..."),
                           {}});
    return manual;
}

} // namespace

Command proxyCommand()
{
    Command direct = command(QStringLiteral("direct"), QStringLiteral("Send traffic without a proxy"),
                             QStringLiteral("JSON, when it is confirmed: ") + proxyJson, runDirect);
    direct.arguments = {targetArgument(Argument::One)};
    Command automatic = command(QStringLiteral("automatic"), QStringLiteral("Let a script choose the proxy"),
                                QStringLiteral("JSON, when it is confirmed: ") + proxyJson, runAutomatic);
    automatic.arguments = {targetArgument(Argument::One),
                           {urlName,
                            QStringLiteral("Where the script is"),
                            {},
                            ProxyConfiguration::urlFault,
                            Argument::Word,
                            Argument::One}};
    Command show
        = command(QStringLiteral("show"), QStringLiteral("Show one proxy: the global one, or a network's"),
                  QStringLiteral("JSON: ") + proxyJson, runShow);
    show.arguments = {targetArgument(Argument::Optional)};
    Command use = command(QStringLiteral("use"),
                          QStringLiteral("Choose between the global proxy and those of the networks"),
                          QStringLiteral("JSON, when it is confirmed: {\"use\": \"global\"}"), runUse);
    use.arguments = {{useName,
                      QStringLiteral("global: for all networks; networks: each its own"),
                      {globalWord, networksWord},
                      {},
                      Argument::Word,
                      Argument::One}};
    Command watch = command(QStringLiteral("watch"), QStringLiteral("Follow what becomes of one proxy"),
                            QStringLiteral("Prints one line a change until it is interrupted (Ctrl-C, exit "
                                           "status 0).\n\nJSON: one object a line with \"time\", \"event\": "
                                           "\"proxyChanged\" and ")
                                + proxyJson,
                            runWatch);
    watch.arguments = {targetArgument(Argument::Optional)};

    Command proxy;
    proxy.name = QStringLiteral("proxy");
    proxy.summary = QStringLiteral("Point traffic at proxies, of each network or of the whole phone");
    proxy.description = QStringLiteral("Examples:\n"
                                       "  mdmctl proxy list\n"
                                       "  mdmctl proxy manual global http://proxy.example:3128\n"
                                       "  mdmctl proxy use global");
    proxy.commands = {listCommand(), show, direct, manualCommand(), automatic, use, watch};
    return proxy;
}

} // namespace Agent
} // namespace Corvane
