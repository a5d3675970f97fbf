// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_ACCOUNTS_H
#define CORVANE_ACCOUNTS_H

#include "reply.h"

#include <corvanemdm/provisioner.h>

#include <QtCore/QJsonObject>
#include <QtCore/QList>
#include <QtCore/QStringList>

namespace Corvane
{
namespace Agent
{

using AccountInfo = Mdm::Accounts::Provisioner::AccountInfo;

/** The passwords of an account to be. */
struct AccountPasswords {
    QString password; ///< of the user; at the server that mail is fetched from, for an e-mail account
    QString outgoing; ///< at the server that mail is sent to
};

/**
 * The accounts of the phone. What an account is to be like is told by an object as policies have it: one with
 * an "address" is an e-mail account.
 */
namespace Accounts
{

/** The words of a description. */
QStringList incomingProtocols();
QStringList outgoingProtocols();
QStringList encryptions();
QStringList authentications();

bool isEmail(const QJsonObject &description);
/** What the phone will show the account by. */
QString shownName(const QJsonObject &description);

Reply list(QList<AccountInfo> &accounts);
Reply make(const QJsonObject &description, const AccountPasswords &passwords);
Reply remove(quint64 id);

} // namespace Accounts
} // namespace Agent
} // namespace Corvane

#endif // CORVANE_ACCOUNTS_H
