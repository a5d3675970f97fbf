// SPDX-License-Identifier: LGPL-2.1-or-later
#include "answer.h"
#include "commands.h"
#include "output.h"
#include "servicecommand.h"
#include "suggestion.h"
#include "table.h"

#include <corvanemdm/notificationinfo.h>

#include <QtCore/QJsonArray>

#include <algorithm>

namespace Corvane
{
namespace Agent
{

using Mdm::NotificationData;
using Mdm::NotificationInfo;

namespace
{

const QLatin1String idArgument("ID");
const QLatin1String summaryArgument("SUMMARY");
const QLatin1String ownerName("--owner");
const QLatin1String categoryName("--category");
const QLatin1String urgencyName("--urgency");
const QLatin1String timeName("--time");

/** An option that is one text of a notification. */
struct TextOption {
    QLatin1String name;
    QString help;
    QString NotificationData::*text;
};

const QVector<TextOption> &textOptions()
{
    static const QVector<TextOption> options{
        {QLatin1String("--summary"), QStringLiteral("Its one-line text"), &NotificationData::summary},
        {QLatin1String("--body"), QStringLiteral("What it says below the summary"), &NotificationData::body},
        {ownerName, QStringLiteral("The program that it belongs to (default: mdmctl)"),
         &NotificationData::owner},
        {categoryName, QStringLiteral("Its kind, such as x-corvane.message"), &NotificationData::category},
        {QLatin1String("--app-name"), QStringLiteral("Name of the application, for people (default: mdmctl)"),
         &NotificationData::appName},
        {QLatin1String("--app-icon"), QStringLiteral("Icon of the application: a name, or a file"),
         &NotificationData::appIcon},
        {QLatin1String("--sub-text"), QStringLiteral("What it says beside the application's name"),
         &NotificationData::subText},
    };
    return options;
}

// By value.
const QStringList &urgencies()
{
    static const QStringList words{QStringLiteral("low"), QStringLiteral("normal"),
                                   QStringLiteral("critical")};
    return words;
}

QString urgencyText(int urgency)
{
    return urgencies().value(urgency, QString::number(urgency));
}

QString idFault(const QString &value)
{
    bool isNumber = false;
    const uint id = value.toUInt(&isNumber);
    return isNumber && id > 0 ? QString()
                              : QStringLiteral("must be a number, as \"mdmctl notify list\" shows it");
}

QString timeText(const QDateTime &time)
{
    return time.isValid() ? time.toUTC().toString(Qt::ISODate) : QString();
}

QJsonObject toJson(const NotificationData &notification)
{
    return {
        {QStringLiteral("id"), double(notification.id)},
        {QStringLiteral("time"), timeText(notification.timestamp)},
        {QStringLiteral("urgency"), urgencyText(notification.urgency)},
        {QStringLiteral("owner"), notification.owner},
        {QStringLiteral("category"), notification.category},
        {QStringLiteral("appName"), notification.appName},
        {QStringLiteral("appIcon"), notification.appIcon},
        {QStringLiteral("summary"), notification.summary},
        {QStringLiteral("body"), notification.body},
        {QStringLiteral("subText"), notification.subText},
        {QStringLiteral("remoteActions"), QJsonArray::fromVariantList(notification.remoteActions)},
    };
}

/** Asks the phone; the library names failures in the same way. */
Reply askPhone(const std::function<void()> &question)
{
    return ask(Service::mdmProxy(),
               QStringLiteral("^Failed to (?:create notification|update notification|retrieve "
                              "notifications|retrieve notifications by category): "
                              "|^Failed to close notification: \"(.*)\"$"),
               question);
}

Answer<QList<NotificationData>> notifications(const NotificationInfo &info, const Values &values)
{
    Answer<QList<NotificationData>> answer;
    answer.reply = askPhone([&] {
        answer.value = values.has(categoryName) ? info.notificationsByCategory(values.first(categoryName))
                                                : info.notifications(values.first(ownerName));
    });
    return answer;
}

int runList(NotificationInfo &info, const Values &values)
{
    Answer<QList<NotificationData>> found = notifications(info, values);
    if (!found.reply.isDone())
        return conclude(found.reply);
    // The phone is asked for either; a program and a category together are what they have in common.
    if (values.has(categoryName) && values.has(ownerName)) {
        const auto isOthers = [owner = values.first(ownerName)](const NotificationData &notification) {
            return notification.owner != owner;
        };
        found.value.erase(std::remove_if(found.value.begin(), found.value.end(), isOthers),
                          found.value.end());
    }
    Table table({QStringLiteral("ID"), QStringLiteral("TIME"), QStringLiteral("URGENCY"),
                 QStringLiteral("OWNER"), QStringLiteral("CATEGORY"), QStringLiteral("APPLICATION"),
                 QStringLiteral("SUMMARY"), QStringLiteral("BODY")});
    QJsonArray json;
    for (const NotificationData &notification : qAsConst(found.value)) {
        table.addRow({QString::number(notification.id), timeText(notification.timestamp),
                      urgencyText(notification.urgency), notification.owner, notification.category,
                      notification.appName, notification.summary, notification.body});
        json.append(toJson(notification));
    }
    printResult(values,
                found.value.isEmpty() ? QStringLiteral("There are no notifications.") : table.toString(),
                {{QStringLiteral("notifications"), json}});
    return ExitDone;
}

/** @p notification with what the command line says in place of its own. */
NotificationData withOptions(NotificationData notification, const Values &values)
{
    for (const TextOption &option : textOptions()) {
        if (values.has(option.name))
            notification.*option.text = values.first(option.name);
    }
    if (values.has(urgencyName))
        notification.urgency = urgencies().indexOf(values.first(urgencyName));
    if (values.has(timeName))
        notification.timestamp = timeFrom(values.first(timeName));
    return notification;
}

int printId(const Reply &reply, const Values &values, uint id, const QString &text)
{
    if (reply.isDone())
        printResult(values, text.arg(id), {{QStringLiteral("id"), double(id)}});
    return conclude(reply);
}

int runSend(NotificationInfo &info, const Values &values)
{
    NotificationData notification;
    notification.owner = QStringLiteral("mdmctl");
    notification.appName = notification.owner;
    notification.urgency = urgencies().indexOf(QLatin1String("normal"));
    notification.summary = values.first(summaryArgument);
    notification = withOptions(notification, values);
    uint id = 0;
    const Reply reply = askPhone([&] { id = info.createNotification(notification); });
    return printId(reply, values, id, QStringLiteral("Notification %1 is shown."));
}

int runUpdate(NotificationInfo &info, const Values &values)
{
    const uint id = values.first(idArgument).toUInt();
    Answer<QList<NotificationData>> all;
    all.reply = askPhone([&] { all.value = info.notifications(); });
    if (!all.reply.isDone())
        return conclude(all.reply);
    const auto found
        = std::find_if(all.value.cbegin(), all.value.cend(),
                       [id](const NotificationData &notification) { return notification.id == id; });
    if (found == all.value.cend())
        return conclude({Reply::Refused, QStringLiteral("no notification %1 on the phone").arg(id)});
    const Reply reply = askPhone([&] { info.updateNotification(id, withOptions(*found, values)); });
    return printId(reply, values, id, QStringLiteral("Notification %1 is updated."));
}

int runClose(NotificationInfo &info, const Values &values)
{
    const uint id = values.first(idArgument).toUInt();
    const Reply reply = askPhone([&] { info.closeNotification(id); });
    return printId(reply, values, id, QStringLiteral("Notification %1 is closed."));
}

Command command(const QString &name, const QString &summary, int (*run)(NotificationInfo &, const Values &))
{
    return serviceCommand(Service::mdmProxy(), name, summary, run);
}

/** The options that describe a notification, without the one for its summary if an argument is that. */
QVector<Option> contentOptions(bool withSummary)
{
    QVector<Option> options;
    for (const TextOption &option : textOptions()) {
        if (withSummary || option.text != &NotificationData::summary)
            options.append({option.name, option.help, QStringLiteral("TEXT"), {}});
    }
    options.append({urgencyName, QStringLiteral("low, normal or critical"), QStringLiteral("URGENCY"),
                    [](const QString &value) {
                        return urgencies().contains(value) ? QString() : suggestion(value, urgencies());
                    }});
    options.append(
        {timeName, QStringLiteral("When it happened (default: now)"), QStringLiteral("TIME"), timeFault});
    return options;
}

const QLatin1String idJson("JSON: {\"id\": 7}");

} // namespace

Command notifyCommand()
{
    const Argument id{idArgument, QStringLiteral("Number of the notification"), {}, idFault};

    Command list = command(QStringLiteral("list"), QStringLiteral("Show the phone's notifications"), runList);
    list.options += {{ownerName, QStringLiteral("Those of one program"), QStringLiteral("OWNER"), {}},
                     {categoryName, QStringLiteral("Those of one category"), QStringLiteral("CATEGORY"), {}}};
    list.description = QStringLiteral(
        "Times are UTC.\n\n"
        "JSON: {\"notifications\": [{\"id\": 7, \"time\": \"2026-03-02T16:03:05Z\", \"urgency\": "
        "\"normal\",\n"
        "\"owner\": \"voicecall-ui\", \"category\": \"x-corvane.call.missed\", \"appName\": \"Phone\", "
        "\"appIcon\": \"...\",\n\"summary\": \"Missed call\", \"body\": \"...\", \"subText\": \"\", "
        "\"remoteActions\": [{...}]}]}");

    Command send = command(QStringLiteral("send"), QStringLiteral("Show a notification"), runSend);
    send.arguments = {{summaryArgument, QStringLiteral("Its one-line text"), {}, {}}};
    send.options += contentOptions(false);
    send.description
        = QStringLiteral("Prints the number that the phone gave it.\n\n"
                         "Example:\n"
                         "  mdmctl notify send \"Back to the office\" --body \"The battery is due for a "
                         "change.\" \\\n    --urgency critical\n\n")
        + idJson;

    Command update = command(QStringLiteral("update"), QStringLiteral("Change a notification"), runUpdate);
    update.arguments = {id};
    update.options += contentOptions(true);
    update.description = QStringLiteral("What no option names stays as it is.\n\n"
                                        "Example:\n"
                                        "  mdmctl notify update 7 --body \"Come by before noon.\"\n\n")
        + idJson;

    Command close = command(QStringLiteral("close"), QStringLiteral("Take a notification away"), runClose);
    close.arguments = {id};
    close.description = idJson;

    Command notify;
    notify.name = QStringLiteral("notify");
    notify.summary = QStringLiteral("Show, change and close notifications");
    notify.commands = {list, send, update, close};
    return notify;
}

} // namespace Agent
} // namespace Corvane
