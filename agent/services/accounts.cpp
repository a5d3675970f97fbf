// SPDX-License-Identifier: LGPL-2.1-or-later
#include "accounts.h"

#include "service.h"

#include <corvanemdm/emailaccountprovisioner.h>
#include <corvanemdm/genericaccountprovisioner.h>

#include <algorithm>

namespace Corvane
{
namespace Agent
{

using Mdm::Accounts::EmailAccountProvisioner;
using Mdm::Accounts::GenericAccountProvisioner;
using Mdm::Accounts::Provisioner;

namespace
{

// Each at the place that its number gives it.
const QStringList incomingProtocolWords{QStringLiteral("none"), QStringLiteral("imap4"),
                                        QStringLiteral("pop3")};
const QStringList outgoingProtocolWords{QStringLiteral("none"), QStringLiteral("smtp")};
const QStringList encryptionWords{QStringLiteral("none"), QStringLiteral("ssl"), QStringLiteral("starttls")};
const QStringList authenticationWords{QStringLiteral("none"), QStringLiteral("login"),
                                      QStringLiteral("plain"), QStringLiteral("cram-md5")};

template <typename Enum> Enum numberOf(const QJsonValue &word, const QStringList &words)
{
    return Enum(std::max(0, words.indexOf(word.toString())));
}

/** What became of the last call of @p provisioner. */
Reply replyOf(const Provisioner &provisioner)
{
    const int error = provisioner.error();
    if (error == 0)
        return {};
    const Service proxy = Service::mdmProxy();
    if (error != 1)
        return {Reply::Refused,
                proxy.refusal(QStringLiteral("%1 (code %2)").arg(provisioner.errorMessage()).arg(error))};
    return proxy.isRunning() ? Reply{Reply::Refused, proxy.refusal(provisioner.errorMessage())}
                             : proxy.notRunning();
}

void describeIncoming(EmailAccountProvisioner &email, const QJsonObject &server)
{
    using Email = EmailAccountProvisioner;
    email.setIncomingProtocol(
        numberOf<Email::IncomingProtocol>(server.value(QLatin1String("protocol")), incomingProtocolWords));
    email.setIncomingUsername(server.value(QLatin1String("user")).toString());
    email.setIncomingServer(server.value(QLatin1String("server")).toString());
    email.setIncomingPort(server.value(QLatin1String("port")).toInt());
    email.setIncomingConnectionEncryption(
        numberOf<Email::ConnectionEncryption>(server.value(QLatin1String("encryption")), encryptionWords));
    email.setIncomingAcceptUntrustedCertificates(server.value(QLatin1String("acceptUntrusted")).toBool());
}

void describeOutgoing(EmailAccountProvisioner &email, const QJsonObject &server)
{
    using Email = EmailAccountProvisioner;
    email.setOutgoingProtocol(
        numberOf<Email::OutgoingProtocol>(server.value(QLatin1String("protocol")), outgoingProtocolWords));
    email.setOutgoingUsername(server.value(QLatin1String("user")).toString());
    email.setOutgoingServer(server.value(QLatin1String("server")).toString());
    email.setOutgoingPort(server.value(QLatin1String("port")).toInt());
    email.setOutgoingConnectionEncryption(
        numberOf<Email::ConnectionEncryption>(server.value(QLatin1String("encryption")), encryptionWords));
    email.setOutgoingAcceptUntrustedCertificates(server.value(QLatin1String("acceptUntrusted")).toBool());
    email.setOutgoingAuthentication(
        numberOf<Email::Authentication>(server.value(QLatin1String("authentication")), authenticationWords));
}

void describe(Provisioner &provisioner, const QJsonObject &description)
{
    provisioner.setProviderName(description.value(QLatin1String("provider")).toString());
    provisioner.setAccountDisplayName(description.value(QLatin1String("name")).toString());
    provisioner.setAccountConfiguration(
        description.value(QLatin1String("configuration")).toObject().toVariantMap());
    provisioner.setAccountReadOnly(description.value(QLatin1String("readOnly")).toBool());
}

Reply made(Provisioner &provisioner)
{
    provisioner.createAccount();
    return replyOf(provisioner);
}

} // namespace

QStringList Accounts::incomingProtocols()
{
    return incomingProtocolWords;
}

QStringList Accounts::outgoingProtocols()
{
    return outgoingProtocolWords;
}

QStringList Accounts::encryptions()
{
    return encryptionWords;
}

QStringList Accounts::authentications()
{
    return authenticationWords;
}

bool Accounts::isEmail(const QJsonObject &description)
{
    return description.contains(QLatin1String("address"));
}

QString Accounts::shownName(const QJsonObject &description)
{
    if (isEmail(description))
        return description.value(QLatin1String("address")).toString();
    const QString name = description.value(QLatin1String("name")).toString();
    return name.isEmpty() ? description.value(QLatin1String("user")).toString() : name;
}

Reply Accounts::list(QList<AccountInfo> &accounts)
{
    GenericAccountProvisioner provisioner;
    accounts = provisioner.listAccounts();
    return replyOf(provisioner);
}

Reply Accounts::make(const QJsonObject &description, const AccountPasswords &passwords)
{
    const QString service = description.value(QLatin1String("service")).toString();
    if (!isEmail(description)) {
        GenericAccountProvisioner generic;
        describe(generic, description);
        generic.setDefaultServiceName(service);
        generic.setUsername(description.value(QLatin1String("user")).toString());
        generic.setPassword(passwords.password);
        return made(generic);
    }
    EmailAccountProvisioner email;
    describe(email, description);
    email.setDefaultServiceName(service);
    email.setEmailAddress(description.value(QLatin1String("address")).toString());
    describeIncoming(email, description.value(QLatin1String("incoming")).toObject());
    email.setIncomingPassword(passwords.password);
    describeOutgoing(email, description.value(QLatin1String("outgoing")).toObject());
    email.setOutgoingPassword(passwords.outgoing);
    return made(email);
}

Reply Accounts::remove(quint64 id)
{
    GenericAccountProvisioner provisioner;
    provisioner.deleteAccount(id);
    return replyOf(provisioner);
}

} // namespace Agent
} // namespace Corvane
