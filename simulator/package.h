// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_PACKAGE_H
#define CORVANE_SIMULATOR_PACKAGE_H

#include <QtCore/QJsonArray>
#include <QtCore/QJsonObject>
#include <QtCore/QString>
#include <QtCore/QStringList>

#include <map>
#include <vector>

namespace Corvane
{
namespace Simulator
{

/** A software package, with the files that it brings. */
struct Package {
    QString name;
    QString version;
    QString release;
    QString vendor;
    QString summary;
    QStringList needs; ///< names of packages
    std::map<QString, QByteArray> files; ///< contents by absolute path
    bool essential = false; ///< may not be removed
    bool automatic = false; ///< came along with a package that needs it
    bool trusted = true;
    QString installFails; ///< for this reason; empty: it does not
    QString removeFails;
    QJsonObject json; ///< the profile's words for it

    /** "1.2.0-1" */
    QString fullVersion() const { return version + QLatin1Char('-') + release; }

    static Package fromJson(const QJsonObject &json);
};

std::vector<Package> packagesFrom(const QJsonArray &json);

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_PACKAGE_H
