// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_PACKAGESTORE_H
#define CORVANE_SIMULATOR_PACKAGESTORE_H

#include "package.h"

#include <functional>
#include <stdexcept>
#include <vector>

namespace Corvane
{
namespace Simulator
{

/** Why the package manager cannot do something, with PackageKit's number for it. */
class PackageError : public std::runtime_error
{
public:
    enum Code : quint32 {
        PackageIdInvalid = 6,
        PackageNotInstalled = 7,
        PackageNotFound = 8,
        PackageAlreadyInstalled = 9,
        DependenciesUnresolved = 13,
        TransactionError = 16,
        TransactionCancelled = 17,
        NoCache = 18,
        CannotRemoveSystemPackage = 20,
        CannotInstallUnsigned = 50,
        FailedToInstall = 58,
        FailedToRemove = 59,
    };

    PackageError(Code code, const QString &details)
        : std::runtime_error(details.toStdString())
        , m_code(code)
    {
    }
    Code code() const { return m_code; }
    QString details() const { return QString::fromUtf8(what()); }

private:
    Code m_code;
};

/** What the phone has installed and what it could install: in the rpm database, as files, and in the sources.
 */
class PackageStore
{
public:
    /** A package with the identifier that PackageKit has for it. */
    struct Found {
        bool installed;
        QString id;
        QString summary;
    };
    struct Change {
        std::vector<Package> removed;
        std::vector<Package> added;
        QString fails; ///< the reason why it will fail half way; empty: it will not
    };

    /** @p profile is the packages' member of a profile. Makes the database if the phone came without one. */
    explicit PackageStore(const QJsonObject &profile);

    /** By names or identifiers, or all; @p filter is PackageKit's. */
    std::vector<Found> find(const QStringList &wanted, quint64 filter) const;
    std::vector<Found> all(quint64 filter) const;

    /** What installing would change; throws PackageError. */
    Change installation(const QStringList &ids, bool trustedOnly) const;
    /** What removing would change; throws PackageError. */
    Change removal(const QStringList &ids, bool allowDependents, bool autoremove) const;
    /** Makes the change, which others can see when @p done is called; @p problem is empty when all is well.
     */
    void make(const Change &change, std::function<void(const QString &problem)> done);

    /** Makes @p package available, in place of the same version of it. */
    void publish(const Package &package);
    /** Takes all versions of a package out of the sources. @return whether there were any */
    bool withdraw(const QString &name);

    QJsonObject describe() const;

    static QString idOf(const Package &package, bool installed);

private:
    const Package *installed(const QString &name) const;
    const Package *newestAvailable(const QString &name) const;
    void addWithNeeds(const Package &package, bool automatic, bool trustedOnly, Change &change) const;
    std::vector<const Package *> dependentsOn(const Package &package, const Change &change) const;
    void apply(const Change &change);

    std::vector<Package> m_installed;
    std::vector<Package> m_available;
};

/** Whether @p left is an older version of the same package. */
bool isOlder(const Package &left, const Package &right);

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_PACKAGESTORE_H
