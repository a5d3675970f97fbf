// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/applications.h>

#include "applications_p.h"
#include "packagedatabase_p.h"

#include <mlite/mdesktopentry.h>
#include <theme/themeiconresolver.h>

#include <QtCore/QDebug>
#include <QtCore/QDir>
#include <QtCore/QMetaEnum>

#include <cstring>
#include <utility>

namespace Corvane
{
namespace Mdm
{

using PackageKit::Daemon;
using PackageKit::Transaction;

namespace
{

const QLatin1String DesktopEntryFolder("/usr/share/applications");
const QLatin1String ThisEnvironment("X-Meego");

const QLatin1String AlreadyBeingInstalled("Trying to install package which is already being installed");
const QLatin1String AlreadyBeingRemoved("Trying to remove a package which is already being removed");
const QLatin1String NotFound("Package not found: %1");
const QLatin1String Destroyed("Applications object destroyed while operation %1 in progress");

void registerTypes()
{
    qRegisterMetaType<ApplicationOperation *>("Corvane::Mdm::ApplicationOperation*");
    // The signals are declared with the short spelling; connections by name and queued ones look it up.
    qRegisterMetaType<ApplicationOperation *>("ApplicationOperation*");
}

/** What is behind an enumerator. The wire brings any number, and one that nobody knows is no value of the
 * type. */
template <typename Enum> int numberOf(const Enum &enumerator)
{
    int number = 0;
    static_assert(sizeof enumerator == sizeof number);
    std::memcpy(&number, &enumerator, sizeof number);
    return number;
}

/** As QDebug writes the enumerator. */
QString textOf(const Transaction::Error &error)
{
    const int number = numberOf(error);
    const QString key = QString::fromLatin1(QMetaEnum::fromType<Transaction::Error>().valueToKey(number));
    return QLatin1String("PackageKit::Transaction::")
        + (key.isEmpty() ? QStringLiteral("Error(%1)").arg(number) : key);
}

bool isVisible(const MDesktopEntry &entry)
{
    return entry.isValid() && !entry.noDisplay() && !entry.notShowIn().contains(ThisEnvironment);
}

QString iconPathOf(const MDesktopEntry &entry, const Glent::ThemeIconResolver &icons)
{
    const QString icon = entry.icon();
    if (QDir::isAbsolutePath(icon) && QFileInfo(icon).isFile())
        return icon;
    return icons.resolvePath(icon);
}

} // namespace

PackageEntry::PackageEntry()
    : d(new PackageEntryPrivate)
{
}

PackageEntry::PackageEntry(const QString &name, const QString &version, const QString &vendor)
    : d(new PackageEntryPrivate)
{
    d->name = name;
    d->version = version;
    d->vendor = vendor;
}

PackageEntry::PackageEntry(const PackageEntry &) = default;
PackageEntry::~PackageEntry() = default;
PackageEntry &PackageEntry::operator=(const PackageEntry &) = default;

QString PackageEntry::name() const
{
    return d->name;
}

QString PackageEntry::version() const
{
    return d->version;
}

QString PackageEntry::vendor() const
{
    return d->vendor;
}

bool PackageEntry::isValid() const
{
    return !d->name.isEmpty() && !d->version.isEmpty();
}

ApplicationEntry::ApplicationEntry()
    : d(new ApplicationEntryPrivate)
{
}

ApplicationEntry::ApplicationEntry(const QString &name, const PackageEntry &package, const QString &iconPath)
    : d(new ApplicationEntryPrivate)
{
    d->name = name;
    d->package = package;
    d->iconPath = iconPath;
}

ApplicationEntry::ApplicationEntry(const ApplicationEntry &) = default;
ApplicationEntry::~ApplicationEntry() = default;
ApplicationEntry &ApplicationEntry::operator=(const ApplicationEntry &) = default;

QString ApplicationEntry::name() const
{
    return d->name;
}

PackageEntry ApplicationEntry::package() const
{
    return d->package;
}

QString ApplicationEntry::iconPath() const
{
    return d->iconPath;
}

ApplicationOperation::ApplicationOperation(QObject *parent)
    : QObject(parent)
    , d(new ApplicationOperationPrivate)
{
    registerTypes();
}

ApplicationOperation::~ApplicationOperation()
{
    delete d;
}

QString ApplicationOperation::package() const
{
    return d->package;
}

QString ApplicationOperation::version() const
{
    return d->version;
}

QString ApplicationOperation::errorString() const
{
    return d->errorString;
}

bool ApplicationOperation::isFinished() const
{
    return d->finished;
}

bool ApplicationOperation::isSucceeded() const
{
    return d->succeeded;
}

void ApplicationOperation::setError(QString errorString)
{
    d->errorString = errorString;
}

void ApplicationOperation::setFinished()
{
    if (d->finished)
        return;
    d->finished = true;
    // A receiver may delete the operation at each signal.
    const QPointer<ApplicationOperation> self(this);
    if (d->succeeded)
        Q_EMIT succeeded(this);
    if (self)
        Q_EMIT finished(this);
    if (self)
        deleteLater();
}

void ApplicationOperation::setFinishedWithError()
{
    if (d->finished)
        return;
    d->succeeded = false;
    const QPointer<ApplicationOperation> self(this);
    Q_EMIT failed(this);
    if (self)
        setFinished();
}

ApplicationsPrivate::ApplicationsPrivate()
{
    registerTypes();
    PackageDatabase::configure();
}

ApplicationsPrivate::~ApplicationsPrivate()
{
    m_ending = true;
    for (Operations *pending : {&m_installs, &m_removals}) {
        const Operations abandoned = std::exchange(*pending, {});
        for (auto each = abandoned.begin(); each != abandoned.end(); ++each) {
            if (!each.value())
                continue;
            each.value()->setError(QString(Destroyed).arg(each.key()));
            each.value()->setFinishedWithError();
        }
    }
}

ApplicationOperation *ApplicationsPrivate::install(const QString &name, const QString &version)
{
    auto *operation = new ApplicationOperation;
    operation->d->package = name;
    operation->d->version = version;
    if (m_ending)
        return refuse(operation, QString(Destroyed).arg(name));
    if (m_installs.contains(name)) {
        qWarning("%s", AlreadyBeingInstalled.data());
        return refuse(operation, AlreadyBeingInstalled);
    }

    const RequestPointer request = accept(m_installs, operation);
    const auto logRefreshError = [](const Request &, const QString &error, const QString &details) {
        qDebug() << "Error refreshing cache" << qPrintable(error) << details;
    };
    const auto takeInstallError = [](const Request &failed, const QString &error, const QString &details) {
        qWarning() << "Error installing package"
                   << ":" << qPrintable(error);
        failed.operation->setError(details);
    };
    const auto installFound = [this, request, takeInstallError](const QString &packageId) {
        follow(request, Daemon::installPackage(packageId, Transaction::TransactionFlagOnlyTrusted),
               takeInstallError, [request] { succeed(request); });
    };
    const Transaction::Filter filter
        = version.isEmpty() ? Transaction::FilterNewest : Transaction::FilterNone;
    follow(request, Daemon::refreshCache(false), logRefreshError,
           [this, request, filter, installFound] { resolve(request, filter, installFound); });
    return operation;
}

ApplicationOperation *ApplicationsPrivate::remove(const QString &name, bool autoremove)
{
    auto *operation = new ApplicationOperation;
    operation->d->package = name;
    if (m_ending)
        return refuse(operation, QString(Destroyed).arg(name));
    if (m_removals.contains(name)) {
        qWarning("%s", AlreadyBeingRemoved.data());
        return refuse(operation, AlreadyBeingRemoved);
    }

    const RequestPointer request = accept(m_removals, operation);
    const auto takeRemoveError = [](const Request &failed, const QString &error, const QString &details) {
        qWarning() << "Error uninstalling package"
                   << ":" << qPrintable(error);
        failed.operation->setError(details);
    };
    resolve(request, Transaction::FilterInstalled,
            [this, request, autoremove, takeRemoveError](const QString &packageId) {
                qDebug() << "Uninstalling " << packageId;
                follow(request,
                       Daemon::removePackage(packageId, false, autoremove,
                                             Transaction::TransactionFlagOnlyTrusted),
                       takeRemoveError, [request] { succeed(request); });
            });
    return operation;
}

ApplicationOperation *ApplicationsPrivate::refuse(ApplicationOperation *operation,
                                                  const QString &reason) const
{
    operation->setError(reason);
    // Queued, so that the caller can connect to the signals first.
    QMetaObject::invokeMethod(operation, "setFinishedWithError", Qt::QueuedConnection);
    return operation;
}

ApplicationsPrivate::RequestPointer ApplicationsPrivate::accept(Operations &pending,
                                                                ApplicationOperation *operation)
{
    pending.insert(operation->d->package, operation);
    return RequestPointer(new Request{pending, operation->d->package, operation});
}

void ApplicationsPrivate::follow(const RequestPointer &request, Transaction *transaction,
                                 ErrorHandler onError, const std::function<void()> &next)
{
    connect(transaction, &Transaction::errorCode, this,
            [request, onError](const Transaction::Error &error, const QString &details) {
                if (request->operation)
                    onError(*request, textOf(error), details);
            });
    connect(transaction, &Transaction::finished, this,
            [request, transaction, next, this](const Transaction::Exit &status) {
                // A transaction ends once, whatever comes of it later.
                transaction->disconnect(this);
                if (numberOf(status) == Transaction::ExitSuccess && request->operation)
                    next();
                else
                    fail(request);
            });
}

void ApplicationsPrivate::resolve(const RequestPointer &request, Transaction::Filters filter,
                                  const std::function<void(const QString &)> &next)
{
    Transaction *transaction = Daemon::resolve(request->name, filter);
    connect(transaction, &Transaction::package, this,
            [request](const Transaction::Info &, const QString &packageId, const QString &) {
                if (!request->operation)
                    return;
                ApplicationOperationPrivate *operation = request->operation->d;
                if (operation->version.isEmpty() || Daemon::packageVersion(packageId) == operation->version)
                    operation->packageId = packageId;
            });
    const auto logError = [](const Request &, const QString &error, const QString &details) {
        qDebug() << "Error resolving package" << qPrintable(error) << details;
    };
    follow(request, transaction, logError, [request, next] {
        const QString packageId = request->operation->d->packageId;
        if (packageId.isEmpty())
            fail(request, QString(NotFound).arg(request->name));
        else
            next(packageId);
    });
}

void ApplicationsPrivate::fail(const RequestPointer &request, const QString &reason)
{
    request->pending.remove(request->name);
    if (!request->operation)
        return;
    if (!reason.isEmpty())
        request->operation->setError(reason);
    request->operation->setFinishedWithError();
}

void ApplicationsPrivate::succeed(const RequestPointer &request)
{
    request->pending.remove(request->name);
    request->operation->setFinished();
}

Applications::Applications(QObject *parent)
    : QObject(parent)
    , d(new ApplicationsPrivate)
{
}

Applications::~Applications()
{
    delete d;
}

QList<PackageEntry> Applications::getInstalledPackages() const
{
    return PackageDatabase().packages();
}

QList<ApplicationEntry> Applications::getInstalledApplications() const
{
    const QDir folder(DesktopEntryFolder);
    const QStringList files = folder.entryList({QStringLiteral("*.desktop")}, QDir::NoFilter, QDir::NoSort);
    const PackageDatabase database;
    const Glent::ThemeIconResolver icons;
    QList<ApplicationEntry> entries;
    for (const QString &file : files) {
        const QString path = folder.absoluteFilePath(file);
        const MDesktopEntry entry(path);
        if (isVisible(entry))
            entries.append(
                ApplicationEntry(entry.nameUnlocalized(), database.ownerOf(path), iconPathOf(entry, icons)));
    }
    return entries;
}

ApplicationOperation *Applications::installPackage(const QString &name, const QString &version)
{
    return d->install(name, version);
}

ApplicationOperation *Applications::removePackage(const QString &name, bool autoremove)
{
    return d->remove(name, autoremove);
}

} // namespace Mdm
} // namespace Corvane
