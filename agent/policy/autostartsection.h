// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_AUTOSTARTSECTION_H
#define CORVANE_AUTOSTARTSECTION_H

#include "presencesection.h"
#include "sessionapplications.h"

#include <memory>

namespace Corvane
{
namespace Agent
{

/** "autostart": the applications that must, and must not, start with the user session, by desktop entry. */
class AutostartSection : public PresenceSection
{
    Q_OBJECT

public:
    QString member() const override;
    Service service() const override;
    Reply open(const QJsonObject &wanted) override;
    void close() override;
    QJsonObject exported() override;

protected:
    QString nameOf(const QJsonValue &entry) const override;
    Reply look() override;
    bool has(const QJsonValue &entry) const override;
    Reply add(const QJsonValue &entry) override;
    Reply remove(const QJsonValue &entry) override;

private:
    /** The phone's own name of what @p entry means; empty when it has none. */
    QString presentEntry(const QJsonValue &entry) const;

    std::unique_ptr<SessionApplications> m_applications;
    QStringList m_desktopFiles;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_AUTOSTARTSECTION_H
