// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_APPLICATIONS_H
#define CORVANEMDM_APPLICATIONS_H

#include <corvanemdm/corvanemdm_global.h>

#include <QtCore/QList>
#include <QtCore/QMetaType>
#include <QtCore/QObject>
#include <QtCore/QSharedDataPointer>
#include <QtCore/QString>

namespace Corvane
{
namespace Mdm
{

class ApplicationEntryPrivate;
class ApplicationOperationPrivate;
class ApplicationsPrivate;
class PackageEntryPrivate;

/** @brief One installed package, as the package database has it. Copies are cheap. */
class CORVANEMDM_EXPORT PackageEntry
{
public:
    /** No package; not valid. */
    PackageEntry();
    /** The package @p name in the version @p version; @p vendor may be empty. */
    PackageEntry(const QString &name, const QString &version, const QString &vendor);
    /** The same package. */
    PackageEntry(const PackageEntry &other);
    ~PackageEntry();
    /** Becomes the same package. */
    PackageEntry &operator=(const PackageEntry &other);

    /** The package's name. */
    QString name() const;
    /** The package's version, without epoch and release. */
    QString version() const;
    /** Who made the package; empty when the package does not tell. */
    QString vendor() const;

    /** Whether both name and version are known. */
    bool isValid() const;

private:
    QSharedDataPointer<PackageEntryPrivate> d;
};

/** @brief One application that can be started, as its desktop entry describes it. Copies are cheap. */
class CORVANEMDM_EXPORT ApplicationEntry
{
public:
    /** No application. */
    ApplicationEntry();
    /** The application @p name, which @p package installed, with the icon at @p iconPath. */
    ApplicationEntry(const QString &name, const PackageEntry &package, const QString &iconPath);
    /** The same application. */
    ApplicationEntry(const ApplicationEntry &other);
    ~ApplicationEntry();
    /** Becomes the same application. */
    ApplicationEntry &operator=(const ApplicationEntry &other);

    /** The desktop entry's name, not translated. */
    QString name() const;
    /** The package that owns the desktop entry; not valid when none does. */
    PackageEntry package() const;
    /** The icon's absolute file path; empty when there is no such icon. */
    QString iconPath() const;

private:
    QSharedDataPointer<ApplicationEntryPrivate> d;
};

/**
 * @brief One request to install or to remove a package, from Applications.
 *
 * It has no parent and deletes itself once it has finished: do not use it any more after finished(). Who
 * deletes it earlier hears no more of the request; what PackageKit is doing for it at that moment goes on.
 */
class CORVANEMDM_EXPORT ApplicationOperation : public QObject
{
    Q_OBJECT

public:
    /** A request that Applications knows nothing of. */
    explicit ApplicationOperation(QObject *parent = nullptr);
    ~ApplicationOperation() override;

    /** The name of the package. */
    QString package() const;
    /** The version that was asked for; empty when any would do, and for removals. */
    QString version() const;
    /** Why it failed; may be empty even then, when PackageKit gave no reason. */
    QString errorString() const;
    /** Whether the outcome is known. */
    bool isFinished() const;
    /** Whether nothing has gone wrong; true as long as the outcome is not known. */
    bool isSucceeded() const;

public Q_SLOTS:
    /** Sets the reason of a failure; the request goes on. */
    void setError(QString errorString);
    /** Ends the request: as a success unless it has failed. Only the first end counts. */
    void setFinished();
    /** Ends the request as a failure. Only the first end counts. */
    void setFinishedWithError();

Q_SIGNALS:
    // Spelled as connections by name write them.

    /** The request has come to its end; the last signal, after failed() or succeeded(). */
    void finished(ApplicationOperation *applicationOperation); // clazy:exclude=fully-qualified-moc-types
    /** The request has failed; errorString() may tell why. */
    void failed(ApplicationOperation *applicationOperation); // clazy:exclude=fully-qualified-moc-types
    /** The request has succeeded. */
    void succeeded(ApplicationOperation *applicationOperation); // clazy:exclude=fully-qualified-moc-types

private:
    Q_DISABLE_COPY(ApplicationOperation)
    friend class ApplicationsPrivate;
    ApplicationOperationPrivate *const d;
};

/**
 * @brief Lists what is installed, installs packages and removes them.
 *
 * Lists are read from the package database and the desktop entries of the moment; both block while they
 * read. Installing and removing do not block: the outcome arrives with the signals of an
 * ApplicationOperation. A PackageKit that is absent, or dies meanwhile, makes the operation fail.
 *
 * Destroying the object makes the pending operations fail, from within the destructor.
 *
 * Source: the rpm database, "/usr/share/applications", and PackageKit, "org.freedesktop.PackageKit".
 */
class CORVANEMDM_EXPORT Applications : public QObject
{
    Q_OBJECT

public:
    /** The first one in the process reads the configuration of rpm. */
    explicit Applications(QObject *parent = nullptr);
    ~Applications() override;

    /**
     * Every package of the database, in its order; blocks.
     * A name or version that the database does not tell is empty, with a warning.
     */
    QList<PackageEntry> getInstalledPackages() const;

    /** Every application that is to be shown, with the package it came with; blocks. */
    QList<ApplicationEntry> getInstalledApplications() const;

    /**
     * Installs the package @p name from PackageKit's sources: the version @p version, or the newest one when
     * it is empty. Only trusted packages are installed.
     *
     * The operation fails when the package is not found, when it is being installed already, and when
     * PackageKit fails.
     * @return the operation; connect to its signals before going back to the event loop.
     */
    ApplicationOperation *installPackage(const QString &name, const QString &version = QString());

    /**
     * Removes the installed package @p name, with @p autoremove also what was installed for it alone. A
     * package that others need stays: the operation fails.
     * @return the operation; connect to its signals before going back to the event loop.
     */
    ApplicationOperation *removePackage(const QString &name, bool autoremove = false);

private:
    Q_DISABLE_COPY(Applications)
    ApplicationsPrivate *const d;
};

} // namespace Mdm
} // namespace Corvane

Q_DECLARE_METATYPE(Corvane::Mdm::PackageEntry)
Q_DECLARE_METATYPE(Corvane::Mdm::ApplicationEntry)

#endif // CORVANEMDM_APPLICATIONS_H
