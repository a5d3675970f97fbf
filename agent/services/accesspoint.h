// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_ACCESSPOINT_H
#define CORVANE_ACCESSPOINT_H

#include "mobilenetworks.h"

#include <QtCore/QJsonObject>
#include <QtCore/QString>
#include <QtCore/QStringList>

namespace Corvane
{
namespace Agent
{

/** "internet", "mms", "ims". */
QString accessPointTypeName(AccessPoint::Type type);
std::optional<AccessPoint::Type> accessPointTypeNamed(const QString &name);
QStringList accessPointTypeNames();

/** A member of an access point, beside its type and password, as commands and policies have it. */
struct AccessPointMember {
    QString name; ///< in JSON
    QString description; ///< for people
    QStringList choices; ///< empty: any text
};

/** In the order in which they are shown. */
const QVector<AccessPointMember> &accessPointMembers();

/** All members but the password. */
QJsonObject accessPointToJson(const AccessPoint &accessPoint);

/** @p accessPoint with the members of @p json, which are known ones, in place of its own. */
AccessPoint accessPointWith(AccessPoint accessPoint, const QJsonObject &json);

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_ACCESSPOINT_H
