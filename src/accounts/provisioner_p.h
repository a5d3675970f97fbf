// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PROVISIONER_P_H
#define CORVANEMDM_PROVISIONER_P_H

#include <corvanemdm/provisioner.h>

#include <QtCore/QPointer>
#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusInterface>

namespace Corvane
{
namespace Mdm
{
namespace Accounts
{

/** The settings, and how the proxy is asked. A kind of account derives from it. */
class ProvisionerPrivate : public QObject
{
    Q_OBJECT

public:
    explicit ProvisionerPrivate(Provisioner *provisioner);

    virtual bool canCreateAccount() const;

    /** Calls @p method, which answers with the new account's identifier, if there is one to be made. */
    bool createAccount(const QString &method, const QVariantList &arguments);
    bool deleteAccount(quint64 accountId);
    QList<Provisioner::AccountInfo> listAccounts();

    /** Gives @p setting another value, and tells by @p changed when it is another one. */
    template <typename T, typename Feature> void set(T &setting, const T &value, void (Feature::*changed)());
    /** The same for what canCreateAccount() looks at. */
    template <typename T, typename Feature>
    void setRequired(T &setting, const T &value, void (Feature::*changed)());

private:
    /** What the proxy answered; without values when it did not. */
    QVariantList call(const QString &method, const QVariantList &arguments);
    /** Keeps what became of a call whose answer is @p values. */
    void conclude(bool success, const QVariantList &values);

    Provisioner *const q;
    QDBusInterface m_interface;

public:
    QString providerName;
    QString accountDisplayName;
    QVariantMap accountConfiguration;
    bool accountReadOnly = false;
    QString errorMessage;
    int error = 0;
};

template <typename T, typename Feature>
void ProvisionerPrivate::set(T &setting, const T &value, void (Feature::*changed)())
{
    if (setting == value)
        return;
    setting = value;
    Q_EMIT(static_cast<Feature *>(q)->*changed)();
}

template <typename T, typename Feature>
void ProvisionerPrivate::setRequired(T &setting, const T &value, void (Feature::*changed)())
{
    // A receiver of the first signal may delete the provisioner, and this with it.
    const QPointer<Provisioner> provisioner(q);
    const bool could = canCreateAccount();
    set(setting, value, changed);
    if (provisioner && canCreateAccount() != could)
        Q_EMIT provisioner->canCreateAccountChanged();
}

QDBusArgument &operator<<(QDBusArgument &out, const Provisioner::AccountInfo &account);
const QDBusArgument &operator>>(const QDBusArgument &in, Provisioner::AccountInfo &account);

} // namespace Accounts
} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_PROVISIONER_P_H
