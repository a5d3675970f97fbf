// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SCHEMAEXPLANATION_H
#define CORVANE_SCHEMAEXPLANATION_H

#include <QtCore/QJsonObject>
#include <QtCore/QJsonValue>
#include <QtCore/QString>
#include <QtCore/QStringList>

namespace Corvane
{

/**
 * Says in one line what is wrong with the part of @p document that @p path leads to, and what @p schema would
 * have there. The path's elements are member names and array indexes.
 * @return "/path/at/fault: must be ..."; empty when the schema's words do not suffice to tell.
 */
QString explainViolation(const QJsonObject &schema, const QJsonValue &document, const QStringList &path);

/** @p path as a JSON Pointer (RFC 6901). */
QString jsonPointer(const QStringList &path);

} // namespace Corvane

#endif // CORVANE_SCHEMAEXPLANATION_H
