// SPDX-License-Identifier: LGPL-2.1-or-later
#include "component.h"
#include "mdmproxy.h"
#include "refusal.h"
#include "service.h"

#include <QtCore/QJsonArray>
#include <QtCore/QRegularExpression>

#include <algorithm>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String objectPath("/Corvane/Mdm/Proxy/Accounts");
const QLatin1String interfaceName("org.corvaneos.mdmproxy.accounts");

constexpr int highestPort = 65535;

/** What an answer of the proxy ends with. */
struct Problem {
    // Codes as the contract numbers them.
    enum Code { None = 0, NoProvider = 2, BadSetting = 3, Exists = 4, NoAccount = 5 };

    Code code = None;
    QString text;

    explicit operator bool() const { return code != None; }
};

struct Provider {
    QString name;
    QStringList services;
    bool isEmail;
};

/** The server of one direction of an e-mail account. */
struct MailServer {
    QString direction; ///< for people
    int protocol = 0;
    QString username;
    QString password;
    QString server;
    int port = 0;
    int encryption = 0;
    bool acceptsUntrusted = false;
    int authentication = 0;
};

struct Account {
    quint64 id = 0;
    QString provider;
    QString service;
    QString user; ///< the address of an e-mail account, otherwise the user name
    QString displayName;
    QString password;
    MailServer incoming;
    MailServer outgoing;
    Variant configuration; ///< null for an e-mail account
    bool readOnly = false;
};

QString quoted(const QString &text)
{
    return QLatin1Char('"') + text + QLatin1Char('"');
}

bool isAddress(const QString &text)
{
    static const QRegularExpression address(QStringLiteral("\\A[^@\\s]+@[^@\\s.]+(\\.[^@\\s.]+)*\\z"));
    return address.match(text).hasMatch();
}

/** What is wrong with @p server, whose protocol is one of those up to @p lastProtocol. */
Problem problemOf(const MailServer &server, int lastProtocol)
{
    const auto isOutside = [](int value, int last) {
        return value < 0 || value > last;
    };
    QString fault;
    if (isOutside(server.protocol, lastProtocol))
        fault = QStringLiteral("there is no protocol %1").arg(server.protocol);
    else if (isOutside(server.encryption, 2))
        fault = QStringLiteral("there is no encryption %1").arg(server.encryption);
    else if (isOutside(server.authentication, 3))
        fault = QStringLiteral("there is no authentication %1").arg(server.authentication);
    else if (isOutside(server.port, highestPort))
        fault = QStringLiteral("there is no port %1").arg(server.port);
    else if (server.protocol != 0 && server.server.isEmpty())
        fault = QStringLiteral("the protocol wants a server");
    if (fault.isEmpty())
        return {};
    return {Problem::BadSetting, QStringLiteral("%1 mail: %2").arg(server.direction, fault)};
}

QJsonObject describe(const MailServer &server)
{
    return {
        {QStringLiteral("protocol"), server.protocol},
        {QStringLiteral("username"), server.username},
        {QStringLiteral("hasPassword"), !server.password.isEmpty()},
        {QStringLiteral("server"), server.server},
        {QStringLiteral("port"), server.port},
        {QStringLiteral("encryption"), server.encryption},
        {QStringLiteral("acceptsUntrusted"), server.acceptsUntrusted},
        {QStringLiteral("authentication"), server.authentication},
    };
}

class Accounts : public Component
{
public:
    explicit Accounts(const QJsonObject &profile);

    void attach(Service &service) override;
    void detach() override { }
    void describe(QJsonObject &state) const override;
    std::vector<Action> actions() override;

private:
    void createEmailAccount(MethodCall &call);
    void createAccount(MethodCall &call);
    void deleteAccount(MethodCall &call);
    void listAccounts(MethodCall &call) const;

    Problem judgeEmail(Account &account) const;
    Problem judgeGeneric(Account &account) const;
    /** Looks for the provider of @p account, for its service among the provider's, and for its like. */
    Problem judge(Account &account, bool isEmail) const;
    /** Keeps @p account unless there is a problem with it, and answers @p call. */
    void keep(Account account, const Problem &problem, MethodCall &call);
    QString removeAsUser(const QString &number);

    std::vector<Provider> m_providers;
    std::vector<Account> m_accounts;
    quint64 m_lastId = 0;
};

Accounts::Accounts(const QJsonObject &profile)
{
    const QJsonArray providers = profile.value(QLatin1String("providers")).toArray();
    for (const QJsonValue &entry : providers) {
        const QJsonObject provider = entry.toObject();
        QStringList services;
        const QJsonArray names = provider.value(QLatin1String("services")).toArray();
        for (const QJsonValue &name : names)
            services << name.toString();
        m_providers.push_back({provider.value(QLatin1String("name")).toString(), services,
                               provider.value(QLatin1String("email")).toBool()});
    }
    const QJsonArray accounts = profile.value(QLatin1String("present")).toArray();
    for (const QJsonValue &entry : accounts) {
        const QJsonObject present = entry.toObject();
        Account account;
        account.id = ++m_lastId;
        account.provider = present.value(QLatin1String("provider")).toString();
        account.user = present.value(QLatin1String("user")).toString();
        account.displayName = present.value(QLatin1String("displayName")).toString(account.user);
        account.readOnly = present.value(QLatin1String("readOnly")).toBool();
        m_accounts.push_back(account);
    }
}

void Accounts::attach(Service &service)
{
    service.addObject(objectPath, interfaceName,
                      {
                          {QStringLiteral("createEmailAccount"),
                           [this](MethodCall &call) {
                               createEmailAccount(call);
                           }},
                          {QStringLiteral("createAccount"),
                           [this](MethodCall &call) {
                               createAccount(call);
                           }},
                          {QStringLiteral("deleteAccount"),
                           [this](MethodCall &call) {
                               deleteAccount(call);
                           }},
                          {QStringLiteral("listAccounts"),
                           [this](MethodCall &call) {
                               listAccounts(call);
                           }},
                      });
}

void Accounts::createEmailAccount(MethodCall &call)
{
    Account account;
    account.incoming.direction = QStringLiteral("incoming");
    account.outgoing.direction = QStringLiteral("outgoing");
    const auto textTo = [&call](QString &text, gsize index) {
        text = call.text(index);
    };
    textTo(account.provider, 0);
    textTo(account.service, 1);
    textTo(account.user, 2);
    textTo(account.incoming.username, 4);
    textTo(account.incoming.password, 5);
    textTo(account.incoming.server, 6);
    textTo(account.outgoing.username, 11);
    textTo(account.outgoing.password, 12);
    textTo(account.outgoing.server, 13);
    gboolean incomingUntrusted = FALSE;
    gboolean outgoingUntrusted = FALSE;
    gboolean readOnly = FALSE;
    g_variant_get(call.arguments(), "(sssisssiibisssiibib)", nullptr, nullptr, nullptr,
                  &account.incoming.protocol, nullptr, nullptr, nullptr, &account.incoming.port,
                  &account.incoming.encryption, &incomingUntrusted, &account.outgoing.protocol, nullptr,
                  nullptr, nullptr, &account.outgoing.port, &account.outgoing.encryption, &outgoingUntrusted,
                  &account.outgoing.authentication, &readOnly);
    account.incoming.acceptsUntrusted = incomingUntrusted;
    account.outgoing.acceptsUntrusted = outgoingUntrusted;
    account.readOnly = readOnly;
    account.displayName = account.user;
    account.password = account.incoming.password;
    const Problem problem = judgeEmail(account);
    keep(account, problem, call);
}

void Accounts::createAccount(MethodCall &call)
{
    Account account;
    account.provider = call.text(0);
    account.service = call.text(1);
    account.user = call.text(2);
    account.password = call.text(3);
    account.displayName = call.text(4);
    account.configuration = Variant(g_variant_get_child_value(call.arguments(), 5));
    const Variant readOnly(g_variant_get_child_value(call.arguments(), 6));
    account.readOnly = g_variant_get_boolean(readOnly.get());
    if (account.displayName.isEmpty())
        account.displayName = account.user;
    const Problem problem = judgeGeneric(account);
    keep(account, problem, call);
}

Problem Accounts::judgeEmail(Account &account) const
{
    if (const Problem problem = judge(account, true))
        return problem;
    if (!isAddress(account.user))
        return {Problem::BadSetting, QStringLiteral("%1 is no e-mail address").arg(quoted(account.user))};
    if (account.password.isEmpty())
        return {Problem::BadSetting, QStringLiteral("incoming mail: the password is missing")};
    if (const Problem problem = problemOf(account.incoming, 2))
        return problem;
    return problemOf(account.outgoing, 1);
}

Problem Accounts::judgeGeneric(Account &account) const
{
    if (const Problem problem = judge(account, false))
        return problem;
    if (account.user.isEmpty())
        return {Problem::BadSetting, QStringLiteral("the user name is missing")};
    if (account.password.isEmpty())
        return {Problem::BadSetting, QStringLiteral("the password is missing")};
    return {};
}

Problem Accounts::judge(Account &account, bool isEmail) const
{
    const auto provider = std::find_if(m_providers.begin(), m_providers.end(),
                                       [&](const Provider &each) { return each.name == account.provider; });
    if (provider == m_providers.end())
        return {Problem::NoProvider,
                QStringLiteral("there is no account provider %1").arg(quoted(account.provider))};
    if (provider->isEmail != isEmail) {
        return {Problem::NoProvider,
                QStringLiteral("the account provider %1 is %2 for e-mail")
                    .arg(quoted(account.provider), isEmail ? QStringLiteral("not") : QStringLiteral("only"))};
    }
    if (account.service.isEmpty() && isEmail)
        account.service = provider->services.value(0);
    if (!provider->services.contains(account.service)) {
        return {Problem::BadSetting,
                QStringLiteral("the account provider %1 has no service %2")
                    .arg(quoted(account.provider), quoted(account.service))};
    }
    const bool exists = std::any_of(m_accounts.begin(), m_accounts.end(), [&](const Account &each) {
        return each.provider == account.provider && each.user == account.user;
    });
    if (exists)
        return {Problem::Exists, QStringLiteral("there is an account for %1 already").arg(account.user)};
    return {};
}

void Accounts::keep(Account account, const Problem &problem, MethodCall &call)
{
    if (!problem) {
        account.id = ++m_lastId;
        m_accounts.push_back(account);
    }
    call.reply(g_variant_new("(tsi)", guint64(account.id), problem.text.toUtf8().constData(), problem.code));
}

void Accounts::deleteAccount(MethodCall &call)
{
    guint64 id = 0;
    g_variant_get(call.arguments(), "(t)", &id);
    const auto found = std::find_if(m_accounts.begin(), m_accounts.end(),
                                    [id](const Account &account) { return account.id == id; });
    if (found == m_accounts.end()) {
        const QString text = QStringLiteral("there is no account %1").arg(id);
        call.reply(g_variant_new("(bsi)", FALSE, text.toUtf8().constData(), Problem::NoAccount));
        return;
    }
    m_accounts.erase(found);
    call.reply(g_variant_new("(bsi)", TRUE, "", Problem::None));
}

void Accounts::listAccounts(MethodCall &call) const
{
    GVariantBuilder list;
    g_variant_builder_init(&list, G_VARIANT_TYPE("a(tss)"));
    for (const Account &account : m_accounts) {
        g_variant_builder_add(&list, "(tss)", guint64(account.id), account.provider.toUtf8().constData(),
                              account.displayName.toUtf8().constData());
    }
    call.reply(g_variant_new("(a(tss)si)", &list, "", Problem::None));
}

QString Accounts::removeAsUser(const QString &number)
{
    const auto found = std::find_if(m_accounts.begin(), m_accounts.end(), [&number](const Account &account) {
        return QString::number(account.id) == number;
    });
    if (found == m_accounts.end())
        throw Refusal(QStringLiteral("There is no account %1; \"state accounts\" shows those that there are")
                          .arg(quoted(number)));
    if (found->readOnly)
        throw Refusal(
            QStringLiteral("The account for %1 is read-only: its user cannot change it").arg(found->user));
    const QString user = found->user;
    m_accounts.erase(found);
    return QStringLiteral("The account for %1 is gone").arg(user);
}

void Accounts::describe(QJsonObject &state) const
{
    QJsonArray providers;
    for (const Provider &provider : m_providers) {
        providers << QJsonObject{{QStringLiteral("name"), provider.name},
                                 {QStringLiteral("services"), QJsonArray::fromStringList(provider.services)},
                                 {QStringLiteral("email"), provider.isEmail}};
    }
    // No password: the state is shown to everybody.
    QJsonArray accounts;
    for (const Account &account : m_accounts) {
        QJsonObject entry{
            {QStringLiteral("id"), double(account.id)},
            {QStringLiteral("provider"), account.provider},
            {QStringLiteral("service"), account.service},
            {QStringLiteral("user"), account.user},
            {QStringLiteral("displayName"), account.displayName},
            {QStringLiteral("hasPassword"), !account.password.isEmpty()},
            {QStringLiteral("readOnly"), account.readOnly},
        };
        if (account.configuration) {
            const GCharPointer text(g_variant_print(account.configuration.get(), FALSE));
            entry.insert(QStringLiteral("configuration"), QString::fromUtf8(text.get()));
        }
        if (!account.incoming.direction.isEmpty()) {
            entry.insert(QStringLiteral("incoming"), Simulator::describe(account.incoming));
            entry.insert(QStringLiteral("outgoing"), Simulator::describe(account.outgoing));
        }
        accounts << entry;
    }
    state.insert(
        QStringLiteral("accounts"),
        QJsonObject{{QStringLiteral("providers"), providers}, {QStringLiteral("present"), accounts}});
}

std::vector<Action> Accounts::actions()
{
    return {
        {QStringLiteral("account remove"), QStringLiteral("NUMBER"),
         QStringLiteral("removes an account as its user would, who cannot when it is read-only"), 1, 1,
         [this](const QStringList &arguments) {
             return removeAsUser(arguments.first());
         }},
    };
}

QString problemOfProfile(const QJsonObject &profile)
{
    const QJsonObject accounts = profile.value(QLatin1String("accounts")).toObject();
    QStringList providers;
    const QJsonArray known = accounts.value(QLatin1String("providers")).toArray();
    for (int i = 0; i < known.size(); ++i) {
        const QString name = known.at(i).toObject().value(QLatin1String("name")).toString();
        if (providers.contains(name))
            return QStringLiteral(
                       "/accounts/providers/%1/name: %2 is there already; each provider is named once")
                .arg(i)
                .arg(name);
        providers << name;
    }
    const QJsonArray present = accounts.value(QLatin1String("present")).toArray();
    for (int i = 0; i < present.size(); ++i) {
        const QString name = present.at(i).toObject().value(QLatin1String("provider")).toString();
        if (!providers.contains(name))
            return QStringLiteral("/accounts/present/%1/provider: there is no provider %2; must be one of %3")
                .arg(i)
                .arg(name, providers.join(QStringLiteral(", ")));
    }
    return QString();
}

const ComponentRegistration registration({
    MdmProxy::serviceName,
    [](const QJsonObject &profile, Phone &) {
        return std::make_unique<Accounts>(profile.value(QLatin1String("accounts")).toObject());
    },
    problemOfProfile,
});

} // namespace

} // namespace Simulator
} // namespace Corvane
