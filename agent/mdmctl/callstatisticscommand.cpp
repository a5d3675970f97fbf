// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commands.h"
#include "exitstatus.h"
#include "output.h"
#include "service.h"
#include "table.h"
#include "wait.h"

#include <corvanemdm/callstatistics.h>

#include <QtCore/QJsonArray>
#include <QtCore/QJsonObject>

namespace Corvane
{
namespace Agent
{

using Mdm::CallStatistics;
using Results = QList<CallStatistics::Result>;

namespace
{

const QLatin1String firstName("--first");
const QLatin1String secondName("--second");
const QLatin1String fromName("--from");
const QLatin1String toName("--to");

QString numberFault(const QString &value)
{
    bool isNumber = false;
    value.toInt(&isNumber);
    return isNumber ? QString() : QStringLiteral("must be a whole number");
}

CallStatistics::Filter filterFrom(const Values &values)
{
    CallStatistics::Filter filter;
    filter.firstSelector = values.first(firstName).toInt();
    filter.secondSelector = values.first(secondName).toInt();
    filter.start = timeFrom(values.first(fromName));
    filter.end = timeFrom(values.first(toName));
    return filter;
}

void printResults(const Results &results, bool json)
{
    QJsonArray array;
    Table table({QStringLiteral("TIME"), QStringLiteral("VALUE")});
    for (const CallStatistics::Result &result : results) {
        const QString time = result.time.toString(Qt::ISODate);
        array.append(QJsonObject{{QStringLiteral("time"), time}, {QStringLiteral("value"), result.value}});
        table.addRow({time, QString::number(result.value)});
    }
    if (json)
        print({{QStringLiteral("results"), array}});
    else
        print(results.isEmpty() ? QStringLiteral("Nothing was found.") : table.toString());
}

int runSearch(const Values &values)
{
    const CallStatistics::Filter filter = filterFrom(values);
    if (filter.start.isValid() && filter.end.isValid() && filter.start >= filter.end) {
        printError(QStringLiteral("--to must be later than --from"));
        return ExitUsage;
    }
    const Service service = Service::mdmProxy();
    const Reply running = service.ensureRunning();
    if (!running.isDone())
        return conclude(running);

    CallStatistics statistics;
    Results results;
    Wait wait(service, timeoutsOf(values).confirmation, QStringLiteral("finish the search"));
    QObject::connect(
        &statistics, &CallStatistics::searchFinished, &wait, [&](bool success, const Results &found) {
            results = found;
            wait.end(success ? Reply::Done : Reply::Refused,
                     success ? QString() : service.toString() + QLatin1String(" could not search this"));
        });
    statistics.search(filter);
    const Reply reply = wait.run();
    if (reply.isDone())
        printResults(results, wantsJson(values));
    return conclude(reply);
}

} // namespace

Command callStatisticsCommand()
{
    Command search;
    search.name = QStringLiteral("search");
    search.summary = QStringLiteral("Search the phone's calls and print what it found");
    const QString number = QStringLiteral("N");
    const QString time = QStringLiteral("TIME");
    search.options = {
        {firstName, QStringLiteral("First selector (default: 0)"), number, numberFault},
        {secondName, QStringLiteral("Second selector (default: 0)"), number, numberFault},
        {fromName, QStringLiteral("Beginning of the range (default: open)"), time, timeFault},
        {toName, QStringLiteral("End of the range, later than its beginning (default: open)"), time,
         timeFault},
        jsonOption(),
        timeoutOption(
            QStringLiteral("Give up when the phone has not answered after so many seconds (default: 25)")),
    };
    search.description = QStringLiteral(
        "A time without a zone is local. What the selectors choose, and what the values count, is the MDM "
        "proxy's\n"
        "matter. A search that somebody else does at the same time can bring its results here.\n\n"
        "Examples:\n"
        "  mdmctl call-statistics search\n"
        "  mdmctl call-statistics search --first 1 --second 1 --from 2026-03-01 --to 2026-04-01\n\n"
        "JSON: {\"results\": [{\"time\": \"2026-03-02T00:00:00Z\", \"value\": 3}]}");
    search.run = runSearch;

    Command statistics;
    statistics.name = QStringLiteral("call-statistics");
    statistics.summary = QStringLiteral("Search statistics on calls");
    statistics.commands = {search};
    return statistics;
}

} // namespace Agent
} // namespace Corvane
