// SPDX-License-Identifier: LGPL-2.1-or-later
#include "accesspoint.h"
#include "commands.h"
#include "exitstatus.h"
#include "output.h"
#include "secretinput.h"
#include "suggestion.h"
#include "table.h"

#include <QtCore/QJsonArray>

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String typeArgument("TYPE");
const QLatin1String clearPasswordName("--clear-password");

using AccessPoints = MobileNetworks::AccessPoints;

SecretInput passwordInput()
{
    return {QStringLiteral("password"), QStringLiteral("password of the access point"),
            SecretInput::Optional};
}

/** "--message-center" for "messageCenter" */
QString optionName(const AccessPointMember &member)
{
    QString name = QStringLiteral("--");
    for (const QChar letter : member.name)
        name += letter.isUpper() ? QLatin1Char('-') + QString(letter.toLower()) : QString(letter);
    return name;
}

QJsonObject toJson(const QString &imsi, const AccessPoint &accessPoint)
{
    QJsonObject json = accessPointToJson(accessPoint);
    json.insert(QStringLiteral("imsi"), imsi);
    json.insert(QStringLiteral("type"), accessPointTypeName(accessPoint.type));
    json.insert(QStringLiteral("passwordSet"), !accessPoint.password.isEmpty());
    return json;
}

Table accessPointsTable()
{
    return Table({QStringLiteral("IMSI"), QStringLiteral("TYPE"), QStringLiteral("NAME"),
                  QStringLiteral("APN"), QStringLiteral("USERNAME"), QStringLiteral("PASSWORD"),
                  QStringLiteral("PROTOCOL"), QStringLiteral("AUTHENTICATION"),
                  QStringLiteral("MESSAGE CENTER"), QStringLiteral("MESSAGE PROXY")});
}

void addRow(Table *table, const QString &imsi, const AccessPoint &accessPoint)
{
    QStringList cells{imsi, accessPointTypeName(accessPoint.type)};
    const QJsonObject json = accessPointToJson(accessPoint);
    for (const AccessPointMember &member : accessPointMembers()) {
        cells.append(json.value(member.name).toString());
        if (member.name == QLatin1String("username"))
            cells.append(accessPoint.password.isEmpty() ? QString() : QStringLiteral("set"));
    }
    table->addRow(cells);
}

int runList(MobileNetworks &networks, const Values &values)
{
    const QString imsi = values.first(imsiName());
    const Answer<QStringList> imsis
        = imsi.isEmpty() ? networks.imsis() : Answer<QStringList>{networks.ensureSim(imsi), {imsi}};
    if (!imsis.reply.isDone())
        return conclude(imsis.reply);
    const Answer<QMap<QString, AccessPoints>> found = networks.accessPoints(imsis.value);
    Table table = accessPointsTable();
    QJsonArray json;
    for (const QString &each : imsis.value) {
        for (const AccessPoint &accessPoint : found.value.value(each)) {
            addRow(&table, each, accessPoint);
            json.append(toJson(each, accessPoint));
        }
    }
    if (!found.reply.isDone() && json.isEmpty())
        return conclude(found.reply);
    printResult(values, json.isEmpty() ? QStringLiteral("There are no access points.") : table.toString(),
                {{QStringLiteral("accessPoints"), json}});
    return conclude(found.reply);
}

/** The members that the command line names. */
QJsonObject membersFrom(const Values &values)
{
    QJsonObject members;
    for (const AccessPointMember &member : accessPointMembers()) {
        if (values.has(optionName(member)))
            members.insert(member.name, values.first(optionName(member)));
    }
    return members;
}

/** What the check of each value by itself does not find. */
QString faultOf(const Values &values)
{
    const SecretInput password = passwordInput();
    const QString fault = password.fault(values);
    if (!fault.isEmpty())
        return fault;
    if (password.isGiven(values) && values.has(clearPasswordName))
        return clearPasswordName + QLatin1String(" excludes a password");
    if (membersFrom(values).isEmpty() && !password.isGiven(values) && !values.has(clearPasswordName))
        return QStringLiteral("nothing to set; \"mdmctl apn set --help\" lists the options");
    return QString();
}

Answer<AccessPoint> present(const MobileNetworks &networks, const QString &imsi, AccessPoint::Type type)
{
    const Answer<QMap<QString, AccessPoints>> found = networks.accessPoints({imsi});
    if (!found.reply.isDone())
        return {found.reply, {}};
    const AccessPoints accessPoints = found.value.value(imsi);
    if (!accessPoints.contains(type)) {
        return {{Reply::Refused,
                 QStringLiteral("no SIM %1 with an access point of type %2 in the phone")
                     .arg(imsi, accessPointTypeName(type))},
                {}};
    }
    return {{}, accessPoints.value(type)};
}

bool areEqual(const AccessPoint &a, const AccessPoint &b)
{
    return accessPointToJson(a) == accessPointToJson(b) && a.password == b.password;
}

int runSet(MobileNetworks &networks, const Values &values)
{
    const QString imsi = values.first(imsiName());
    const AccessPoint::Type type = *accessPointTypeNamed(values.first(typeArgument));
    const SecretInput password = passwordInput();
    const SecretInput::Result secret
        = password.isGiven(values) ? password.read(values) : SecretInput::Result{ExitDone, {}};
    if (secret.status != ExitDone)
        return secret.status;
    const Answer<AccessPoint> before = present(networks, imsi, type);
    if (!before.reply.isDone())
        return conclude(before.reply);
    AccessPoint wanted = accessPointWith(before.value, membersFrom(values));
    if (values.has(clearPasswordName))
        wanted.password.clear();
    if (password.isGiven(values))
        wanted.password = secret.text;
    const bool changed = !areEqual(before.value, wanted);
    const Reply written = changed ? networks.setAccessPoint(imsi, wanted) : Reply{};
    if (!written.isDone())
        return conclude(written);
    const Answer<AccessPoint> now = changed ? present(networks, imsi, type) : before;
    if (!now.reply.isDone())
        return conclude(now.reply);

    Table table = accessPointsTable();
    addRow(&table, imsi, now.value);
    QJsonObject json = toJson(imsi, now.value);
    json.insert(QStringLiteral("changed"), changed);
    printResult(values, unchangedNote(changed) + table.toString(), json);
    return ExitDone;
}

Command command(const QString &name, const QString &summary, int (*run)(MobileNetworks &, const Values &),
                QString (*fault)(const Values &))
{
    Command command;
    command.name = name;
    command.summary = summary;
    command.options = {jsonOption()};
    command.run = [run, fault](const Values &values) -> int {
        const QString wrong = fault(values);
        if (!wrong.isEmpty()) {
            printError(wrong);
            return ExitUsage;
        }
        const Reply running = Service::telephony().ensureRunning();
        if (!running.isDone())
            return conclude(running);
        MobileNetworks networks(timeoutsOf(values).confirmation);
        return run(networks, values);
    };
    return command;
}

} // namespace

Command apnCommand()
{
    Command list
        = command(QStringLiteral("list"), QStringLiteral("Show the access points of all SIMs, or of one"),
                  runList, [](const Values &) { return QString(); });
    list.arguments = {imsiArgument()};
    list.arguments.first().count = Argument::Optional;
    list.description = QStringLiteral(
        "Passwords are not shown, only whether there is one.\n\n"
        "JSON: {\"accessPoints\": [{\"imsi\": \"244051234567890\", \"type\": \"internet\", \"name\": \"Elo "
        "Internet\",\n\"apn\": \"internet.elo\", \"username\": \"\", \"passwordSet\": false, \"protocol\": "
        "\"ip\",\n\"authentication\": \"none\", \"messageCenter\": \"\", \"messageProxy\": \"\"}]}");

    Command set
        = command(QStringLiteral("set"), QStringLiteral("Change an access point of a SIM"), runSet, faultOf);
    set.arguments = {imsiArgument(),
                     {typeArgument,
                      QStringLiteral("What the access point is for: internet, mms or ims"),
                      accessPointTypeNames(),
                      {}}};
    for (const AccessPointMember &member : accessPointMembers()) {
        const QStringList choices = member.choices;
        ValueCheck check;
        QString help = member.description;
        if (!choices.isEmpty()) {
            check = [choices](const QString &value) {
                return choices.contains(value) ? QString() : suggestion(value, choices);
            };
            help += QLatin1String(": ") + choices.join(QLatin1String(", "));
        }
        set.options.append({optionName(member), help, QStringLiteral("TEXT"), check});
    }
    set.options += passwordInput().options();
    set.options.append({clearPasswordName, QStringLiteral("Remove the password"), {}, {}});
    set.description = QStringLiteral(
        "What no option names stays as it is. Mobile data that is up through the SIM is taken down before "
        "its\ninternet access point is changed, and brought up again afterwards.\n\n"
        "A password is never an argument, as every user of the machine can read those.\n\n"
        "Examples:\n"
        "  mdmctl apn set 244051234567890 internet --apn internet.elo --protocol dual\n"
        "  mdmctl apn set 244051234567890 internet --username elo --authentication pap --ask-password\n"
        "  pass show elo | mdmctl apn set 244051234567890 internet --password-file -\n\n"
        "JSON, after the change: as of \"list\", for one access point, with \"changed\".");

    Command apn;
    apn.name = QStringLiteral("apn");
    apn.summary = QStringLiteral("Manage the access points that mobile data connects to");
    apn.description = QStringLiteral(
        "A SIM has an access point of each type: internet, mms (multimedia messages), ims (the operator's "
        "own\n"
        "services). To reach them the phone makes the SIM the one for mobile data; the one that was is made "
        "so\nagain afterwards.");
    apn.commands = {list, set};
    return apn;
}

} // namespace Agent
} // namespace Corvane
