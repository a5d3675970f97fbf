// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_ACCOUNTSECTION_H
#define CORVANE_ACCOUNTSECTION_H

#include "accounts.h"
#include "presencesection.h"

namespace Corvane
{
namespace Agent
{

/** "accounts": those that the phone must have, and must not have, by provider and by what they are shown by.
 */
class AccountSection : public PresenceSection
{
    Q_OBJECT

public:
    QString member() const override;
    Service service() const override;
    QString fault(const QJsonObject &wanted) const override;
    Reply open(const QJsonObject &wanted) override;
    void close() override { }
    QJsonObject exported() override;

protected:
    QString nameOf(const QJsonValue &entry) const override;
    Reply look() override;
    bool has(const QJsonValue &entry) const override;
    Reply add(const QJsonValue &entry) override;
    Reply remove(const QJsonValue &entry) override;
    QString obstacle(const QJsonValue &entry) const override;

private:
    QList<AccountInfo> m_accounts;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_ACCOUNTSECTION_H
