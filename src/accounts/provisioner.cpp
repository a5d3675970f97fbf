// SPDX-License-Identifier: LGPL-2.1-or-later
#include "provisioner_p.h"

#include "frame/marshalling_p.h"
#include "frame/mdmproxy_p.h"

#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMetaType>
#include <QtDBus/QDBusPendingCall>
#include <QtDBus/QDBusPendingReply>

namespace Corvane
{
namespace Mdm
{
namespace Accounts
{

namespace
{

constexpr int LocalError = 1; ///< the code of what did not reach the proxy

// Where an answer has what.
constexpr int ResultIndex = 0;
constexpr int MessageIndex = 1;
constexpr int CodeIndex = 2;

void registerTypes()
{
    // Other threads wait until all of it is done.
    static const bool registered = [] {
        qRegisterMetaType<Provisioner::AccountInfo>("Corvane::Mdm::Accounts::Provisioner::AccountInfo");
        qDBusRegisterMetaType<Provisioner::AccountInfo>();
        qRegisterMetaType<QList<Provisioner::AccountInfo>>(
            "QList<Corvane::Mdm::Accounts::Provisioner::AccountInfo>");
        qDBusRegisterMetaType<QList<Provisioner::AccountInfo>>();
        return true;
    }();
    Q_UNUSED(registered)
}

/** The value at @p index if it is a T: Qt would take "true" for a bool, and 7 for a string. */
template <typename T> T valueAt(const QVariantList &values, int index)
{
    const QVariant value = values.value(index);
    return value.userType() == qMetaTypeId<T>() ? value.value<T>() : T();
}

/** The same for what QtDBus leaves to be taken apart. */
QList<Provisioner::AccountInfo> accountsAt(const QVariantList &values, int index)
{
    using Accounts = QList<Provisioner::AccountInfo>;
    const auto argument = valueAt<QDBusArgument>(values, index);
    const QString signature = QString::fromLatin1(QDBusMetaType::typeToSignature(qMetaTypeId<Accounts>()));
    return argument.currentSignature() == signature ? qdbus_cast<Accounts>(argument) : Accounts();
}

} // namespace

QDBusArgument &operator<<(QDBusArgument &out, const Provisioner::AccountInfo &account)
{
    out.beginStructure();
    out << account.accountId << account.providerName << account.displayName;
    out.endStructure();
    return out;
}

const QDBusArgument &operator>>(const QDBusArgument &in, Provisioner::AccountInfo &account)
{
    in.beginStructure();
    in >> account.accountId >> account.providerName >> account.displayName;
    in.endStructure();
    return in;
}

ProvisionerPrivate::ProvisionerPrivate(Provisioner *provisioner)
    : QObject(provisioner)
    , q(provisioner)
    , m_interface(MdmProxy::Service, MdmProxy::Accounts.path, MdmProxy::Accounts.interface,
                  QDBusConnection::systemBus())
{
    registerTypes();
}

bool ProvisionerPrivate::canCreateAccount() const
{
    return false;
}

QVariantList ProvisionerPrivate::call(const QString &method, const QVariantList &arguments)
{
    if (!isMarshallable(arguments)) {
        return {QVariant(), QStringLiteral("The account configuration has a value that D-Bus cannot carry"),
                LocalError};
    }
    QDBusPendingReply<> reply = m_interface.asyncCallWithArgumentList(method, arguments);
    reply.waitForFinished();
    if (reply.isValid())
        return reply.reply().arguments();
    return {QVariant(), reply.error().message(), LocalError};
}

void ProvisionerPrivate::conclude(bool success, const QVariantList &values)
{
    error = success ? 0 : valueAt<int>(values, CodeIndex);
    errorMessage = success ? QString() : valueAt<QString>(values, MessageIndex);
}

bool ProvisionerPrivate::createAccount(const QString &method, const QVariantList &arguments)
{
    if (!canCreateAccount()) {
        error = LocalError;
        errorMessage = QStringLiteral("One or more required settings have not been provided");
        return false;
    }
    const QVariantList values = call(method, arguments);
    const bool success = valueAt<quint64>(values, ResultIndex) != 0;
    conclude(success, values);
    return success;
}

bool ProvisionerPrivate::deleteAccount(quint64 accountId)
{
    const QVariantList values = call(QStringLiteral("deleteAccount"), {accountId});
    const bool success = valueAt<bool>(values, ResultIndex);
    conclude(success, values);
    return success;
}

QList<Provisioner::AccountInfo> ProvisionerPrivate::listAccounts()
{
    const QVariantList values = call(QStringLiteral("listAccounts"), {});
    // The list itself does not tell success: code and text are the answer's in any case.
    conclude(false, values);
    return accountsAt(values, ResultIndex);
}

Provisioner::Provisioner(QObject *parent)
    : QObject(parent)
{
}

Provisioner::~Provisioner() = default;

void Provisioner::setPrivatePtr(ProvisionerPrivate *provisionerPrivate)
{
    d = provisionerPrivate;
}

bool Provisioner::canCreateAccount() const
{
    return d->canCreateAccount();
}

bool Provisioner::deleteAccount(quint64 accountId)
{
    return d->deleteAccount(accountId);
}

QList<Provisioner::AccountInfo> Provisioner::listAccounts()
{
    return d->listAccounts();
}

int Provisioner::error() const
{
    return d->error;
}

QString Provisioner::errorMessage() const
{
    return d->errorMessage;
}

QString Provisioner::providerName() const
{
    return d->providerName;
}

void Provisioner::setProviderName(const QString &name)
{
    d->setRequired(d->providerName, name, &Provisioner::providerNameChanged);
}

QString Provisioner::accountDisplayName() const
{
    return d->accountDisplayName;
}

void Provisioner::setAccountDisplayName(const QString &name)
{
    d->set(d->accountDisplayName, name, &Provisioner::accountDisplayNameChanged);
}

QVariantMap Provisioner::accountConfiguration() const
{
    return d->accountConfiguration;
}

void Provisioner::setAccountConfiguration(const QVariantMap &configuration)
{
    d->set(d->accountConfiguration, configuration, &Provisioner::accountConfigurationChanged);
}

bool Provisioner::accountReadOnly() const
{
    return d->accountReadOnly;
}

void Provisioner::setAccountReadOnly(bool readOnly)
{
    d->set(d->accountReadOnly, readOnly, &Provisioner::accountReadOnlyChanged);
}

} // namespace Accounts
} // namespace Mdm
} // namespace Corvane
