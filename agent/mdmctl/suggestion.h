// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SUGGESTION_H
#define CORVANE_SUGGESTION_H

#include <QtCore/QString>
#include <QtCore/QStringList>

namespace Corvane
{
namespace Agent
{

/** "did you mean "block"?" when one of @p choices is near to @p given, or else "must be one of ...". */
QString suggestion(const QString &given, const QStringList &choices);

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_SUGGESTION_H
