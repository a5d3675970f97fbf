// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_PROFILE_H
#define CORVANE_SIMULATOR_PROFILE_H

#include <QtCore/QJsonObject>
#include <QtCore/QString>

namespace Corvane
{
namespace Simulator
{

/** The description of a phone, complete: what the document leaves out is as in the built-in one. */
struct Profile {
    QJsonObject object;
    QString error; ///< one line: the file, the JSON path at fault and what would be right

    bool isValid() const { return error.isEmpty(); }
    QString name() const { return object.value(QLatin1String("name")).toString(); }
    /** The name in the letters that a host name allows. */
    QString hostName() const;
};

/** Reads @p fileName ("-": standard input), or the built-in profile when it is empty. */
Profile readProfile(const QString &fileName);

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_PROFILE_H
