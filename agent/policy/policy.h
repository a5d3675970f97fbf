// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_POLICY_H
#define CORVANE_POLICY_H

#include "policysections.h"

#include <QtCore/QByteArray>
#include <QtCore/QJsonObject>
#include <QtCore/QString>

namespace Corvane
{
namespace Agent
{

/** A policy as read from a file: checked against the schema and against what the sections know beyond it. */
struct Policy {
    QString name; ///< as the policy calls itself, or else the file's name
    QJsonObject settings; ///< one member a section
    QString error; ///< one line; empty for a usable policy

    bool isValid() const { return error.isEmpty(); }
    QJsonObject settingsOf(const PolicySection &section) const;
};

/** Reads @p fileName; "-" is standard input. */
Policy readPolicy(const QString &fileName, const PolicySections &sections);

/** The JSON Schema of policies. */
QByteArray policySchema();

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_POLICY_H
