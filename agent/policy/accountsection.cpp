// SPDX-License-Identifier: LGPL-2.1-or-later
#include "accountsection.h"

#include "secret.h"

#include <QtCore/QJsonArray>

#include <algorithm>

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String passwordFile("passwordFile");

bool isMeant(const AccountInfo &account, const QJsonObject &entry)
{
    return account.providerName == entry.value(QLatin1String("provider")).toString()
        && account.displayName == Accounts::shownName(entry);
}

/** The secret in the file that @p holder names; none when it names none. */
Secret secretOf(const QJsonObject &holder)
{
    const QString file = holder.value(passwordFile).toString();
    return file.isEmpty() ? Secret() : secretFromFile(file);
}

} // namespace

QString AccountSection::member() const
{
    return QStringLiteral("accounts");
}

Service AccountSection::service() const
{
    return Service::mdmProxy();
}

QString AccountSection::fault(const QJsonObject &wanted) const
{
    for (const QLatin1String list : {QLatin1String("required"), QLatin1String("forbidden")}) {
        const QJsonArray entries = wanted.value(list).toArray();
        for (int i = 0; i < entries.size(); ++i) {
            const QJsonObject entry = entries.at(i).toObject();
            if (Accounts::isEmail(entry) == entry.contains(QLatin1String("user")))
                return QStringLiteral("/accounts/%1/%2: must have either address or user").arg(list).arg(i);
        }
    }
    return PresenceSection::fault(wanted);
}

Reply AccountSection::open(const QJsonObject &)
{
    return {};
}

QString AccountSection::nameOf(const QJsonValue &entry) const
{
    const QJsonObject description = entry.toObject();
    return QStringLiteral("%1.%2").arg(description.value(QLatin1String("provider")).toString(),
                                       Accounts::shownName(description));
}

Reply AccountSection::look()
{
    return Accounts::list(m_accounts);
}

bool AccountSection::has(const QJsonValue &entry) const
{
    const QJsonObject description = entry.toObject();
    return std::any_of(m_accounts.cbegin(), m_accounts.cend(),
                       [&](const AccountInfo &account) { return isMeant(account, description); });
}

QString AccountSection::obstacle(const QJsonValue &entry) const
{
    return entry.toObject().contains(passwordFile)
        ? QString()
        : QStringLiteral("the policy names no passwordFile for it");
}

Reply AccountSection::add(const QJsonValue &entry)
{
    const QJsonObject description = entry.toObject();
    const Secret password = secretOf(description);
    if (!password.reply.isDone())
        return password.reply;
    const Secret outgoing = secretOf(description.value(QLatin1String("outgoing")).toObject());
    if (!outgoing.reply.isDone())
        return outgoing.reply;
    return Accounts::make(description, {password.text, outgoing.text});
}

Reply AccountSection::remove(const QJsonValue &entry)
{
    const QJsonObject description = entry.toObject();
    for (const AccountInfo &account : qAsConst(m_accounts)) {
        if (!isMeant(account, description))
            continue;
        const Reply reply = Accounts::remove(account.accountId);
        if (!reply.isDone())
            return reply;
    }
    return {};
}

QJsonObject AccountSection::exported()
{
    QJsonArray accounts;
    if (!look().isDone())
        return {};
    for (const AccountInfo &account : qAsConst(m_accounts)) {
        // Of an account only what it is shown by is told.
        const bool isAddress = account.displayName.contains(QLatin1Char('@'));
        accounts.append(QJsonObject{
            {QStringLiteral("provider"), account.providerName},
            {isAddress ? QStringLiteral("address") : QStringLiteral("user"), account.displayName}});
    }
    return {{QStringLiteral("required"), accounts}};
}

} // namespace Agent
} // namespace Corvane
