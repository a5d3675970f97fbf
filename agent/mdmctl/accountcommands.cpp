// SPDX-License-Identifier: LGPL-2.1-or-later
#include "accounts.h"
#include "commands.h"
#include "exitstatus.h"
#include "output.h"
#include "secretinput.h"
#include "service.h"
#include "suggestion.h"
#include "table.h"

#include <jsondocument.h>

#include <QtCore/QJsonArray>
#include <QtCore/QJsonObject>

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String idArgument("ID");
const QLatin1String addressArgument("ADDRESS");
const QLatin1String providerArgument("PROVIDER");
const QLatin1String serviceArgument("SERVICE");
const QLatin1String userArgument("USER");
const QLatin1String providerName("--provider");
const QLatin1String serviceName("--service");
const QLatin1String nameName("--name");
const QLatin1String configurationName("--configuration");
const QLatin1String readOnlyName("--read-only");

const SecretInput &passwordInput()
{
    static const SecretInput input(QStringLiteral("password"), QStringLiteral("password of the account"),
                                   SecretInput::Required);
    return input;
}

const SecretInput &outgoingPasswordInput()
{
    static const SecretInput input(QStringLiteral("outgoing-password"),
                                   QStringLiteral("password for sending mail"), SecretInput::Optional);
    return input;
}

QJsonObject accountJson(const AccountInfo &account)
{
    return {{QStringLiteral("id"), double(account.accountId)},
            {QStringLiteral("provider"), account.providerName},
            {QStringLiteral("name"), account.displayName}};
}

int runList(const Values &values)
{
    QList<AccountInfo> accounts;
    const Reply reply = Accounts::list(accounts);
    if (!reply.isDone())
        return conclude(reply);
    Table table({QStringLiteral("ID"), QStringLiteral("PROVIDER"), QStringLiteral("NAME")});
    QJsonArray json;
    for (const AccountInfo &account : qAsConst(accounts)) {
        table.addRow({QString::number(account.accountId), account.providerName, account.displayName});
        json.append(accountJson(account));
    }
    if (wantsJson(values))
        print({{QStringLiteral("accounts"), json}});
    else
        print(accounts.isEmpty() ? QStringLiteral("There are no accounts.") : table.toString());
    return ExitDone;
}

QString idFault(const QString &value)
{
    bool isNumber = false;
    return value.toULongLong(&isNumber) > 0 && isNumber
        ? QString()
        : QStringLiteral("must be the number of an account, as in \"mdmctl account list\"");
}

int runDelete(const Values &values)
{
    ExitStatus status = ExitDone;
    const QStringList ids = values.all(idArgument);
    for (const QString &id : ids) {
        const ExitStatus each = conclude(Accounts::remove(id.toULongLong()));
        if (each != ExitDone)
            status = each;
    }
    return status;
}

/** Makes the account, and tells which one it is. */
int makeAccount(const QJsonObject &description, const AccountPasswords &passwords, const Values &values)
{
    const Reply made = Accounts::make(description, passwords);
    if (!made.isDone())
        return conclude(made);
    AccountInfo newest;
    QList<AccountInfo> accounts;
    if (Accounts::list(accounts).isDone()) {
        for (const AccountInfo &account : qAsConst(accounts)) {
            const bool isMeant
                = account.providerName == description.value(QLatin1String("provider")).toString()
                && account.displayName == Accounts::shownName(description);
            if (isMeant && account.accountId > newest.accountId)
                newest = account;
        }
    }
    if (wantsJson(values))
        print(
            {{QStringLiteral("account"), newest.accountId ? QJsonValue(accountJson(newest)) : QJsonValue()}});
    else
        print(QStringLiteral("The account %1 has been made.").arg(Accounts::shownName(description)));
    return ExitDone;
}

/** A server's settings as the options that begin with @p direction have them. */
QJsonObject serverFrom(const Values &values, const QString &direction)
{
    const auto name = [&direction](const char *option) {
        return QStringLiteral("--%1-%2").arg(direction, QLatin1String(option));
    };
    QJsonObject server;
    for (const char *member : {"protocol", "server", "user", "encryption", "authentication"}) {
        if (values.has(name(member)))
            server.insert(QLatin1String(member), values.first(name(member)));
    }
    if (values.has(name("port")))
        server.insert(QStringLiteral("port"), values.first(name("port")).toInt());
    server.insert(QStringLiteral("acceptUntrusted"), values.has(name("accept-untrusted")));
    return server;
}

int runCreateEmail(const Values &values)
{
    const QJsonObject description{
        {QStringLiteral("provider"),
         values.has(providerName) ? values.first(providerName) : QStringLiteral("email")},
        {QStringLiteral("service"), values.first(serviceName)},
        {QStringLiteral("address"), values.first(addressArgument)},
        {QStringLiteral("readOnly"), values.has(readOnlyName)},
        {QStringLiteral("incoming"), serverFrom(values, QStringLiteral("incoming"))},
        {QStringLiteral("outgoing"), serverFrom(values, QStringLiteral("outgoing"))},
    };
    const SecretInput::Result password = passwordInput().read(values);
    if (password.status != ExitDone)
        return password.status;
    AccountPasswords passwords{password.text, {}};
    if (outgoingPasswordInput().isGiven(values)) {
        const SecretInput::Result outgoing = outgoingPasswordInput().read(values);
        if (outgoing.status != ExitDone)
            return outgoing.status;
        passwords.outgoing = outgoing.text;
    }
    return makeAccount(description, passwords, values);
}

int runCreate(const Values &values)
{
    QJsonObject description{
        {QStringLiteral("provider"), values.first(providerArgument)},
        {QStringLiteral("service"), values.first(serviceArgument)},
        {QStringLiteral("user"), values.first(userArgument)},
        {QStringLiteral("name"), values.first(nameName)},
        {QStringLiteral("readOnly"), values.has(readOnlyName)},
    };
    if (values.has(configurationName)) {
        // What a provider takes is known to the phone alone.
        const JsonDocument document = readJsonDocument(values.first(configurationName), "{}");
        if (!document.isValid()) {
            printError(document.error);
            return ExitUsage;
        }
        description.insert(QStringLiteral("configuration"), document.object);
    }
    const SecretInput::Result password = passwordInput().read(values);
    if (password.status != ExitDone)
        return password.status;
    return makeAccount(description, {password.text, {}}, values);
}

ValueCheck oneOf(const QStringList &words)
{
    return [words](const QString &value) {
        return words.contains(value) ? QString() : suggestion(value, words);
    };
}

QString portFault(const QString &value)
{
    constexpr int highest = 65535;
    bool isNumber = false;
    const int port = value.toInt(&isNumber);
    return isNumber && port >= 0 && port <= highest ? QString() : QStringLiteral("must be 0 to 65535");
}

/** The options of one server; @p purpose completes "the server that ...". */
QVector<Option> serverOptions(const QString &direction, const QString &purpose, const QStringList &protocols)
{
    const auto name = [&direction](const char *option) {
        return QStringLiteral("--%1-%2").arg(direction, QLatin1String(option));
    };
    return {
        {name("protocol"), protocols.join(QLatin1String(", ")) + QStringLiteral(" (default: none)"),
         QStringLiteral("PROTOCOL"), oneOf(protocols)},
        {name("server"), QStringLiteral("The server that ") + purpose, QStringLiteral("HOST"), {}},
        {name("port"), QStringLiteral("Its port (default: the protocol's)"), QStringLiteral("PORT"),
         portFault},
        {name("user"), QStringLiteral("The user's name there"), QStringLiteral("NAME"), {}},
        {name("encryption"), QStringLiteral("none, ssl, starttls (default: none)"), QStringLiteral("KIND"),
         oneOf(Accounts::encryptions())},
        {name("accept-untrusted"),
         QStringLiteral("Accept its certificate when nothing vouches for it"),
         {},
         {}},
    };
}

Command command(const QString &name, const QString &summary, int (*run)(const Values &))
{
    Command command;
    command.name = name;
    command.summary = summary;
    command.run = [run](const Values &values) -> int {
        for (const SecretInput *input : {&passwordInput(), &outgoingPasswordInput()}) {
            const QString fault = input->fault(values);
            if (!fault.isEmpty()) {
                printError(fault);
                return ExitUsage;
            }
        }
        const Reply running = Service::mdmProxy().ensureRunning();
        return running.isDone() ? run(values) : conclude(running);
    };
    return command;
}

const QString secretsText
    = QStringLiteral("The password is asked for unless an option names another place. It is "
                     "no argument, as everybody can\nread those.\n\n");

Command createEmailCommand()
{
    Command create
        = command(QStringLiteral("create-email"), QStringLiteral("Make an e-mail account"), runCreateEmail);
    create.arguments = {{addressArgument, QStringLiteral("The address"), {}, {}}};
    create.options = {
        {providerName, QStringLiteral("The account provider (default: email)"), QStringLiteral("NAME"), {}},
        {serviceName,
         QStringLiteral("The service to switch on (default: the provider's)"),
         QStringLiteral("NAME"),
         {}},
    };
    create.options += serverOptions(QStringLiteral("incoming"), QStringLiteral("mail is fetched from"),
                                    Accounts::incomingProtocols());
    create.options += serverOptions(QStringLiteral("outgoing"), QStringLiteral("mail is sent to"),
                                    Accounts::outgoingProtocols());
    create.options.append({QStringLiteral("--outgoing-authentication"),
                           QStringLiteral("none, login, plain, cram-md5 (default: none)"),
                           QStringLiteral("KIND"), oneOf(Accounts::authentications())});
    create.options += passwordInput().options();
    create.options += outgoingPasswordInput().options();
    create.options.append({readOnlyName, QStringLiteral("Keep the user from changing it"), {}, {}});
    create.options.append(jsonOption());
    create.description = secretsText
        + QStringLiteral("Example:\n"
                         "  mdmctl account create-email maria@example.org --incoming-protocol imap4 \\\n"
                         "      --incoming-server imap.example.org --incoming-encryption ssl "
                         "--password-file secret\n\n"
                         "JSON: {\"account\": {\"id\": 2, \"provider\": \"email\", \"name\": "
                         "\"maria@example.org\"}}");
    return create;
}

Command createCommand()
{
    Command create = command(QStringLiteral("create"),
                             QStringLiteral("Make an account of any other provider"), runCreate);
    create.arguments
        = {{providerArgument, QStringLiteral("The account provider, as the phone names it"), {}, {}},
           {serviceArgument, QStringLiteral("The service of it to switch on"), {}, {}},
           {userArgument, QStringLiteral("The user's name there"), {}, {}}};
    create.options = {
        {nameName,
         QStringLiteral("What to show the account by (default: the user's name)"),
         QStringLiteral("TEXT"),
         {}},
        {configurationName,
         QStringLiteral("More settings, a JSON object; - reads standard input"),
         QStringLiteral("FILE"),
         {}},
    };
    create.options += passwordInput().options();
    create.options.append({readOnlyName, QStringLiteral("Keep the user from changing it"), {}, {}});
    create.options.append(jsonOption());
    create.description
        = secretsText
        + QStringLiteral(
              "Example:\n"
              "  mdmctl account create corvane-cloud corvane-cloud-sync maria --password-file secret\n\n"
              "JSON: {\"account\": {\"id\": 2, \"provider\": \"corvane-cloud\", \"name\": \"maria\"}}");
    return create;
}

} // namespace

Command accountCommand()
{
    Command list = command(QStringLiteral("list"), QStringLiteral("Show the accounts"), runList);
    list.options = {jsonOption()};
    list.description = QStringLiteral(
        "JSON: {\"accounts\": [{\"id\": 1, \"provider\": \"email\", \"name\": \"maria@example.org\"}]}");
    Command remove = command(QStringLiteral("delete"), QStringLiteral("Delete accounts"), runDelete);
    remove.arguments = {{idArgument,
                         QStringLiteral("The number of an account, as the list has it"),
                         {},
                         idFault,
                         Argument::Word,
                         Argument::Several}};

    Command account;
    account.name = QStringLiteral("account");
    account.summary = QStringLiteral("Manage the accounts of the phone");
    account.description = QStringLiteral("Examples:\n"
                                         "  mdmctl account list\n"
                                         "  mdmctl account create-email maria@example.org\n"
                                         "  mdmctl account delete 3");
    account.commands = {list, createEmailCommand(), createCommand(), remove};
    return account;
}

} // namespace Agent
} // namespace Corvane
