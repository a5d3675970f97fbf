// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PROVISIONER_H
#define CORVANEMDM_PROVISIONER_H

#include <corvanemdm/corvanemdm_global.h>

#include <QtCore/QList>
#include <QtCore/QMetaType>
#include <QtCore/QObject>
#include <QtCore/QString>
#include <QtCore/QVariantMap>

namespace Corvane
{
namespace Mdm
{
/** Provisioning of the phone's accounts. */
namespace Accounts
{

class ProvisionerPrivate;

/**
 * @brief What is common to all kinds of accounts that can be made on the phone.
 *
 * EmailAccountProvisioner and GenericAccountProvisioner make accounts; listing and deleting is the same with
 * each of them. They are the only ones: the private part that setPrivatePtr() takes is the library's.
 *
 * Calls to the proxy block until it has answered, or for QtDBus's default timeout (25 s); construction looks
 * the proxy up, which blocks as well. What became of the last call is told by error() and errorMessage();
 * nothing is logged. A setter emits the signal of its property when the value is another one, and then
 * canCreateAccountChanged() if that has changed with it.
 *
 * Source: MDM proxy "org.corvaneos.mdmproxy", object "/Corvane/Mdm/Proxy/Accounts".
 */
class CORVANEMDM_EXPORT Provisioner : public QObject
{
    Q_OBJECT
    /** Whether all settings that an account needs have been given. */
    Q_PROPERTY(bool canCreateAccount READ canCreateAccount NOTIFY canCreateAccountChanged)
    /** The account provider, as the phone's account framework names it. Required. */
    Q_PROPERTY(QString providerName READ providerName WRITE setProviderName NOTIFY providerNameChanged)
    /** The name that is shown for the account; e-mail accounts are shown by their address. */
    Q_PROPERTY(QString accountDisplayName READ accountDisplayName WRITE setAccountDisplayName NOTIFY
                   accountDisplayNameChanged)
    /** More settings for the provider, passed on as they are; not for e-mail accounts. */
    Q_PROPERTY(QVariantMap accountConfiguration READ accountConfiguration WRITE setAccountConfiguration NOTIFY
                   accountConfigurationChanged)
    /** Whether the user is kept from changing the account. */
    Q_PROPERTY(
        bool accountReadOnly READ accountReadOnly WRITE setAccountReadOnly NOTIFY accountReadOnlyChanged)

public:
    /** An account that the proxy manages. */
    struct AccountInfo {
        quint64 accountId = 0; ///< what deleteAccount() takes
        QString providerName; ///< as the proxy fills it
        QString displayName; ///< as the proxy fills it
    };

    /** For the kinds of accounts, which give it its private part. */
    explicit Provisioner(QObject *parent = nullptr);
    ~Provisioner() override;

    /** See the property of that name. */
    bool canCreateAccount() const;

    /**
     * Makes an account of the settings. Without all that are required nothing is sent: error() is 1 then,
     * and errorMessage() "One or more required settings have not been provided".
     * @return whether there is a new account; otherwise see error().
     */
    virtual bool createAccount() = 0;

    /**
     * Deletes the account that listAccounts() lists with @p accountId.
     * @return whether it is gone; otherwise see error().
     */
    virtual bool deleteAccount(quint64 accountId);

    /**
     * The accounts that the proxy manages, in its order.
     * @return empty also when the proxy could not be asked, see error().
     */
    virtual QList<AccountInfo> listAccounts();

    /** @name What became of the last call
     * 0 and empty: all went well. 1: the proxy could not be asked, or a required setting is missing.
     * Otherwise the proxy's own code and text.
     * @{
     */
    int error() const;
    QString errorMessage() const;
    /** @} */

    /** @name Settings
     * See the properties of these names.
     * @{
     */
    QString providerName() const;
    void setProviderName(const QString &name);
    QString accountDisplayName() const;
    void setAccountDisplayName(const QString &name);
    QVariantMap accountConfiguration() const;
    void setAccountConfiguration(const QVariantMap &configuration);
    bool accountReadOnly() const;
    void setAccountReadOnly(bool readOnly);
    /** @} */

Q_SIGNALS:
    /** The property canCreateAccount has changed; after the signal of the setting that did it. */
    void canCreateAccountChanged();
    /** The property providerName has changed. */
    void providerNameChanged();
    /** The property accountDisplayName has changed. */
    void accountDisplayNameChanged();
    /** The property accountConfiguration has changed. */
    void accountConfigurationChanged();
    /** The property accountReadOnly has changed. */
    void accountReadOnlyChanged();

protected:
    /** Gives the object its private part, a child of it; to be called by the constructors of kinds. */
    void setPrivatePtr(ProvisionerPrivate *provisionerPrivate);

private:
    Q_DISABLE_COPY(Provisioner)
    ProvisionerPrivate *d = nullptr;
};

} // namespace Accounts
} // namespace Mdm
} // namespace Corvane

Q_DECLARE_METATYPE(Corvane::Mdm::Accounts::Provisioner::AccountInfo)

#endif // CORVANEMDM_PROVISIONER_H
