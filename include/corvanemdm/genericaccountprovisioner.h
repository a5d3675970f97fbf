// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_GENERICACCOUNTPROVISIONER_H
#define CORVANEMDM_GENERICACCOUNTPROVISIONER_H

#include <corvanemdm/provisioner.h>

namespace Corvane
{
namespace Mdm
{
namespace Accounts
{

class GenericAccountProvisionerPrivate;

/**
 * @brief Makes accounts of any provider that wants a service, a user's name and a password.
 *
 * An account needs these three and Provisioner::providerName.
 */
class CORVANEMDM_EXPORT GenericAccountProvisioner : public Provisioner
{
    Q_OBJECT
    /** The service of the account that is switched on first, as the provider names it. Required. */
    Q_PROPERTY(QString defaultServiceName READ defaultServiceName WRITE setDefaultServiceName NOTIFY
                   defaultServiceNameChanged)
    /** The user's name at the provider. Required. */
    Q_PROPERTY(QString username READ username WRITE setUsername NOTIFY usernameChanged)
    /** The password there. Required. Goes to the proxy as it is, and is kept until the object goes. */
    Q_PROPERTY(QString password READ password WRITE setPassword NOTIFY passwordChanged)

public:
    /** Looks the proxy up, which blocks; a proxy that is away is not reported. */
    explicit GenericAccountProvisioner(QObject *parent = nullptr);
    ~GenericAccountProvisioner() override;

    bool createAccount() override;

    /** @name Settings
     * See the properties of these names.
     * @{
     */
    QString defaultServiceName() const;
    void setDefaultServiceName(const QString &name);
    QString username() const;
    void setUsername(const QString &name);
    QString password() const;
    void setPassword(const QString &password);
    /** @} */

Q_SIGNALS:
    /** The property defaultServiceName has changed. */
    void defaultServiceNameChanged();
    /** The property username has changed. */
    void usernameChanged();
    /** The property password has changed. */
    void passwordChanged();

private:
    Q_DISABLE_COPY(GenericAccountProvisioner)
    GenericAccountProvisionerPrivate *const d;
};

} // namespace Accounts
} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_GENERICACCOUNTPROVISIONER_H
