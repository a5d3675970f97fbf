// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_GENERICACCOUNTPROVISIONER_P_H
#define CORVANEMDM_GENERICACCOUNTPROVISIONER_P_H

#include <corvanemdm/genericaccountprovisioner.h>

#include "provisioner_p.h"

namespace Corvane
{
namespace Mdm
{
namespace Accounts
{

class GenericAccountProvisionerPrivate : public ProvisionerPrivate
{
    Q_OBJECT

public:
    using ProvisionerPrivate::ProvisionerPrivate;

    bool canCreateAccount() const override;
    bool createAccount();

    QString defaultServiceName;
    QString username;
    QString password;
};

} // namespace Accounts
} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_GENERICACCOUNTPROVISIONER_P_H
