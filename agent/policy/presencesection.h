// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_PRESENCESECTION_H
#define CORVANE_PRESENCESECTION_H

#include "policysection.h"

#include <QtCore/QMap>
#include <QtCore/QSet>

#include <optional>

namespace Corvane
{
namespace Agent
{

/** A section that lists what the phone must have as "required", and what it must not have as "forbidden". */
class PresenceSection : public PolicySection
{
    Q_OBJECT

public:
    QString fault(const QJsonObject &wanted) const override;
    QVector<Setting> settings(const QJsonObject &wanted) const override;
    QVector<Setting> compare(const QJsonObject &wanted) override;
    bool mayHaveDrifted() override;
    Reply change(const Setting &setting) override;

protected:
    /** What @p entry is called in reports; entries that mean the same thing have one name. */
    virtual QString nameOf(const QJsonValue &entry) const = 0;
    /** Asks the phone what it has. */
    virtual Reply look() = 0;
    /** Whether the phone had what @p entry means at the last look. */
    virtual bool has(const QJsonValue &entry) const = 0;
    virtual Reply add(const QJsonValue &entry) = 0;
    virtual Reply remove(const QJsonValue &entry) = 0;
    /** Why the policy does not suffice to add @p entry; empty when it does. */
    virtual QString obstacle(const QJsonValue &) const { return QString(); }

private:
    Setting compared(Setting setting, const QJsonValue &entry) const;
    QString pathOf(const QJsonValue &entry) const;
    /** The paths of those entries that the phone had at the last look. */
    QSet<QString> presentPaths() const;

    QMap<QString, QJsonValue> m_entries; ///< by path, of the last comparison
    std::optional<QSet<QString>> m_presentPaths; ///< as last compared or made, when it is known
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_PRESENCESECTION_H
