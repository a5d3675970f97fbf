// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_EMAILACCOUNTPROVISIONER_P_H
#define CORVANEMDM_EMAILACCOUNTPROVISIONER_P_H

#include <corvanemdm/emailaccountprovisioner.h>

#include "provisioner_p.h"

namespace Corvane
{
namespace Mdm
{
namespace Accounts
{

class EmailAccountProvisionerPrivate : public ProvisionerPrivate
{
    Q_OBJECT

public:
    using ProvisionerPrivate::ProvisionerPrivate;

    bool canCreateAccount() const override;
    bool createAccount();

    QString defaultServiceName;
    QString emailAddress;
    EmailAccountProvisioner::IncomingProtocol incomingProtocol = EmailAccountProvisioner::NoIncomingProtocol;
    QString incomingUsername;
    QString incomingPassword;
    QString incomingServer;
    int incomingPort = 0;
    EmailAccountProvisioner::ConnectionEncryption incomingConnectionEncryption
        = EmailAccountProvisioner::NoEncryption;
    bool incomingAcceptUntrustedCertificates = false;
    EmailAccountProvisioner::OutgoingProtocol outgoingProtocol = EmailAccountProvisioner::NoOutgoingProtocol;
    QString outgoingUsername;
    QString outgoingPassword;
    QString outgoingServer;
    int outgoingPort = 0;
    EmailAccountProvisioner::ConnectionEncryption outgoingConnectionEncryption
        = EmailAccountProvisioner::NoEncryption;
    bool outgoingAcceptUntrustedCertificates = false;
    EmailAccountProvisioner::Authentication outgoingAuthentication
        = EmailAccountProvisioner::NoAuthentication;
};

} // namespace Accounts
} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_EMAILACCOUNTPROVISIONER_P_H
