// SPDX-License-Identifier: LGPL-2.1-or-later
#include "genericaccountprovisioner_p.h"

namespace Corvane
{
namespace Mdm
{
namespace Accounts
{

bool GenericAccountProvisionerPrivate::canCreateAccount() const
{
    return !providerName.isEmpty() && !defaultServiceName.isEmpty() && !username.isEmpty()
        && !password.isEmpty();
}

bool GenericAccountProvisionerPrivate::createAccount()
{
    return ProvisionerPrivate::createAccount(QStringLiteral("createAccount"),
                                             {
                                                 providerName,
                                                 defaultServiceName,
                                                 username,
                                                 password,
                                                 accountDisplayName,
                                                 accountConfiguration,
                                                 accountReadOnly,
                                             });
}

GenericAccountProvisioner::GenericAccountProvisioner(QObject *parent)
    : Provisioner(parent)
    , d(new GenericAccountProvisionerPrivate(this))
{
    setPrivatePtr(d);
}

GenericAccountProvisioner::~GenericAccountProvisioner() = default;

bool GenericAccountProvisioner::createAccount()
{
    return d->createAccount();
}

QString GenericAccountProvisioner::defaultServiceName() const
{
    return d->defaultServiceName;
}

void GenericAccountProvisioner::setDefaultServiceName(const QString &name)
{
    d->setRequired(d->defaultServiceName, name, &GenericAccountProvisioner::defaultServiceNameChanged);
}

QString GenericAccountProvisioner::username() const
{
    return d->username;
}

void GenericAccountProvisioner::setUsername(const QString &name)
{
    d->setRequired(d->username, name, &GenericAccountProvisioner::usernameChanged);
}

QString GenericAccountProvisioner::password() const
{
    return d->password;
}

void GenericAccountProvisioner::setPassword(const QString &password)
{
    d->setRequired(d->password, password, &GenericAccountProvisioner::passwordChanged);
}

} // namespace Accounts
} // namespace Mdm
} // namespace Corvane
