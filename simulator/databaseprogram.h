// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_DATABASEPROGRAM_H
#define CORVANE_SIMULATOR_DATABASEPROGRAM_H

#include <QtCore/QByteArray>
#include <QtCore/QJsonArray>
#include <QtCore/QString>

#include <functional>
#include <vector>

namespace Corvane
{
namespace Simulator
{

/** Runs the program that writes the phone's package database; @p done is called with the problem when it has
 * ended, which is empty when all is well. */
void runDatabaseProgram(const std::vector<QByteArray> &arguments, const QByteArray &input,
                        std::function<void(const QString &problem)> done);

/** Makes the database of @p packages, as a profile lists them, unless the phone came with one. */
void fillPackageDatabase(const QJsonArray &packages);

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_DATABASEPROGRAM_H
