// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PACKAGEDATABASE_P_H
#define CORVANEMDM_PACKAGEDATABASE_P_H

#include <corvanemdm/applications.h>

#include <rpm/rpmts.h>

namespace Corvane
{
namespace Mdm
{

/** The rpm database, opened with the first question and closed with the object. */
class PackageDatabase
{
public:
    PackageDatabase();
    ~PackageDatabase();

    /** Reads rpm's configuration, once in the process. */
    static void configure();

    /** In the order of the database. */
    QList<PackageEntry> packages() const;
    /** The package that installed @p file; invalid when none did. */
    PackageEntry ownerOf(const QString &file) const;

private:
    Q_DISABLE_COPY(PackageDatabase)

    const rpmts m_transactions;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_PACKAGEDATABASE_P_H
