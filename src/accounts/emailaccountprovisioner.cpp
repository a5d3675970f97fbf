// SPDX-License-Identifier: LGPL-2.1-or-later
#include "emailaccountprovisioner_p.h"

namespace Corvane
{
namespace Mdm
{
namespace Accounts
{

bool EmailAccountProvisionerPrivate::canCreateAccount() const
{
    return !providerName.isEmpty() && !emailAddress.isEmpty() && !incomingPassword.isEmpty();
}

bool EmailAccountProvisionerPrivate::createAccount()
{
    return ProvisionerPrivate::createAccount(QStringLiteral("createEmailAccount"),
                                             {
                                                 providerName,
                                                 defaultServiceName,
                                                 emailAddress,
                                                 int(incomingProtocol),
                                                 incomingUsername,
                                                 incomingPassword,
                                                 incomingServer,
                                                 incomingPort,
                                                 int(incomingConnectionEncryption),
                                                 incomingAcceptUntrustedCertificates,
                                                 int(outgoingProtocol),
                                                 outgoingUsername,
                                                 outgoingPassword,
                                                 outgoingServer,
                                                 outgoingPort,
                                                 int(outgoingConnectionEncryption),
                                                 outgoingAcceptUntrustedCertificates,
                                                 int(outgoingAuthentication),
                                                 accountReadOnly,
                                             });
}

EmailAccountProvisioner::EmailAccountProvisioner(QObject *parent)
    : Provisioner(parent)
    , d(new EmailAccountProvisionerPrivate(this))
{
    setPrivatePtr(d);
}

EmailAccountProvisioner::~EmailAccountProvisioner() = default;

bool EmailAccountProvisioner::createAccount()
{
    return d->createAccount();
}

QString EmailAccountProvisioner::defaultServiceName() const
{
    return d->defaultServiceName;
}

void EmailAccountProvisioner::setDefaultServiceName(const QString &name)
{
    d->set(d->defaultServiceName, name, &EmailAccountProvisioner::defaultServiceNameChanged);
}

QString EmailAccountProvisioner::emailAddress() const
{
    return d->emailAddress;
}

void EmailAccountProvisioner::setEmailAddress(const QString &address)
{
    d->setRequired(d->emailAddress, address, &EmailAccountProvisioner::emailAddressChanged);
}

EmailAccountProvisioner::IncomingProtocol EmailAccountProvisioner::incomingProtocol() const
{
    return d->incomingProtocol;
}

void EmailAccountProvisioner::setIncomingProtocol(IncomingProtocol protocol)
{
    d->set(d->incomingProtocol, protocol, &EmailAccountProvisioner::incomingProtocolChanged);
}

QString EmailAccountProvisioner::incomingUsername() const
{
    return d->incomingUsername;
}

void EmailAccountProvisioner::setIncomingUsername(const QString &name)
{
    d->set(d->incomingUsername, name, &EmailAccountProvisioner::incomingUsernameChanged);
}

QString EmailAccountProvisioner::incomingPassword() const
{
    return d->incomingPassword;
}

void EmailAccountProvisioner::setIncomingPassword(const QString &password)
{
    d->setRequired(d->incomingPassword, password, &EmailAccountProvisioner::incomingPasswordChanged);
}

QString EmailAccountProvisioner::incomingServer() const
{
    return d->incomingServer;
}

void EmailAccountProvisioner::setIncomingServer(const QString &server)
{
    d->set(d->incomingServer, server, &EmailAccountProvisioner::incomingServerChanged);
}

int EmailAccountProvisioner::incomingPort() const
{
    return d->incomingPort;
}

void EmailAccountProvisioner::setIncomingPort(int port)
{
    d->set(d->incomingPort, port, &EmailAccountProvisioner::incomingPortChanged);
}

EmailAccountProvisioner::ConnectionEncryption EmailAccountProvisioner::incomingConnectionEncryption() const
{
    return d->incomingConnectionEncryption;
}

void EmailAccountProvisioner::setIncomingConnectionEncryption(ConnectionEncryption encryption)
{
    d->set(d->incomingConnectionEncryption, encryption,
           &EmailAccountProvisioner::incomingConnectionEncryptionChanged);
}

bool EmailAccountProvisioner::incomingAcceptUntrustedCertificates() const
{
    return d->incomingAcceptUntrustedCertificates;
}

void EmailAccountProvisioner::setIncomingAcceptUntrustedCertificates(bool accept)
{
    d->set(d->incomingAcceptUntrustedCertificates, accept,
           &EmailAccountProvisioner::incomingAcceptUntrustedCertificatesChanged);
}

EmailAccountProvisioner::OutgoingProtocol EmailAccountProvisioner::outgoingProtocol() const
{
    return d->outgoingProtocol;
}

void EmailAccountProvisioner::setOutgoingProtocol(OutgoingProtocol protocol)
{
    d->set(d->outgoingProtocol, protocol, &EmailAccountProvisioner::outgoingProtocolChanged);
}

QString EmailAccountProvisioner::outgoingUsername() const
{
    return d->outgoingUsername;
}

void EmailAccountProvisioner::setOutgoingUsername(const QString &name)
{
    d->set(d->outgoingUsername, name, &EmailAccountProvisioner::outgoingUsernameChanged);
}

QString EmailAccountProvisioner::outgoingPassword() const
{
    return d->outgoingPassword;
}

void EmailAccountProvisioner::setOutgoingPassword(const QString &password)
{
    d->set(d->outgoingPassword, password, &EmailAccountProvisioner::outgoingPasswordChanged);
}

QString EmailAccountProvisioner::outgoingServer() const
{
    return d->outgoingServer;
}

void EmailAccountProvisioner::setOutgoingServer(const QString &server)
{
    d->set(d->outgoingServer, server, &EmailAccountProvisioner::outgoingServerChanged);
}

int EmailAccountProvisioner::outgoingPort() const
{
    return d->outgoingPort;
}

void EmailAccountProvisioner::setOutgoingPort(int port)
{
    d->set(d->outgoingPort, port, &EmailAccountProvisioner::outgoingPortChanged);
}

EmailAccountProvisioner::ConnectionEncryption EmailAccountProvisioner::outgoingConnectionEncryption() const
{
    return d->outgoingConnectionEncryption;
}

void EmailAccountProvisioner::setOutgoingConnectionEncryption(ConnectionEncryption encryption)
{
    d->set(d->outgoingConnectionEncryption, encryption,
           &EmailAccountProvisioner::outgoingConnectionEncryptionChanged);
}

bool EmailAccountProvisioner::outgoingAcceptUntrustedCertificates() const
{
    return d->outgoingAcceptUntrustedCertificates;
}

void EmailAccountProvisioner::setOutgoingAcceptUntrustedCertificates(bool accept)
{
    d->set(d->outgoingAcceptUntrustedCertificates, accept,
           &EmailAccountProvisioner::outgoingAcceptUntrustedCertificatesChanged);
}

EmailAccountProvisioner::Authentication EmailAccountProvisioner::outgoingAuthentication() const
{
    return d->outgoingAuthentication;
}

void EmailAccountProvisioner::setOutgoingAuthentication(Authentication authentication)
{
    d->set(d->outgoingAuthentication, authentication,
           &EmailAccountProvisioner::outgoingAuthenticationChanged);
}

} // namespace Accounts
} // namespace Mdm
} // namespace Corvane
