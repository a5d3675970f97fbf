// SPDX-License-Identifier: LGPL-2.1-or-later
#include "packagestore.h"

#include "glibpointers.h"

#include <QtCore/QDir>
#include <QtCore/QFile>
#include <QtCore/QFileInfo>
#include <QtCore/QJsonDocument>
#include <QtCore/QVersionNumber>

#include <algorithm>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String databaseFile("/var/lib/rpm/rpmdb.sqlite");
constexpr char databaseProgram[] = "corvane-package-database";

// PackageKit's filters.
constexpr quint64 installedFilter = 1 << 2;
constexpr quint64 notInstalledFilter = 1 << 3;
constexpr quint64 newestFilter = 1 << 16;

QVersionNumber numberOf(const QString &version)
{
    return QVersionNumber::fromString(version).normalized();
}

QByteArray jsonOf(const std::vector<Package> &packages)
{
    QJsonArray array;
    for (const Package &package : packages)
        array << package.json;
    return QJsonDocument(array).toJson(QJsonDocument::Compact);
}

QJsonArray described(const std::vector<Package> &packages)
{
    QJsonArray array;
    for (const Package &package : packages) {
        array << QJsonObject{{QStringLiteral("name"), package.name},
                             {QStringLiteral("version"), package.fullVersion()},
                             {QStringLiteral("vendor"), package.vendor}};
    }
    return array;
}

void writeFiles(const Package &package)
{
    for (const auto &[path, content] : package.files) {
        QDir().mkpath(QFileInfo(path).path());
        QFile file(path);
        if (!file.open(QIODevice::WriteOnly) || file.write(content) != content.size())
            qWarning("cannot write %s", qUtf8Printable(path));
    }
}

void removeFiles(const Package &package)
{
    for (const auto &[path, content] : package.files)
        QFile::remove(path);
}

GObjectPointer<GSubprocess> startDatabaseProgram(const std::vector<QByteArray> &arguments, QString &problem)
{
    std::vector<const gchar *> command{databaseProgram};
    for (const QByteArray &argument : arguments)
        command.push_back(argument.constData());
    command.push_back(nullptr);
    ErrorSlot error;
    GObjectPointer<GSubprocess> process(g_subprocess_newv(
        command.data(), GSubprocessFlags(G_SUBPROCESS_FLAGS_STDIN_PIPE | G_SUBPROCESS_FLAGS_STDERR_PIPE),
        &error));
    if (!process)
        problem = QString::fromUtf8(error->message);
    return process;
}

QString outcomeOf(GSubprocess *process, const gchar *output, const ErrorSlot &error)
{
    if (error)
        return QString::fromUtf8(error->message);
    return g_subprocess_get_successful(process) ? QString() : QString::fromUtf8(output).trimmed();
}

using Done = std::function<void(const QString &problem)>;

/** Runs the program that writes the database, and calls @p done when it has ended. */
void runDatabaseProgram(const std::vector<QByteArray> &arguments, const QByteArray &input, Done done)
{
    QString problem;
    const GObjectPointer<GSubprocess> process = startDatabaseProgram(arguments, problem);
    if (!process) {
        done(problem);
        return;
    }
    g_subprocess_communicate_utf8_async(
        process.get(), input.constData(), nullptr,
        [](GObject *source, GAsyncResult *result, gpointer data) {
            const std::unique_ptr<Done> finished(static_cast<Done *>(data));
            gchar *output = nullptr;
            ErrorSlot error;
            g_subprocess_communicate_utf8_finish(G_SUBPROCESS(source), result, nullptr, &output, &error);
            const GCharPointer words(output);
            (*finished)(outcomeOf(G_SUBPROCESS(source), words.get(), error));
        },
        new Done(std::move(done)));
}

/** The same, for the start of the phone: nothing else is going on. */
void fillDatabase(const QByteArray &input)
{
    QString problem;
    const GObjectPointer<GSubprocess> process = startDatabaseProgram({"add"}, problem);
    if (process) {
        gchar *output = nullptr;
        ErrorSlot error;
        g_subprocess_communicate_utf8(process.get(), input.constData(), nullptr, nullptr, &output, &error);
        problem = outcomeOf(process.get(), GCharPointer(output).get(), error);
    }
    if (!problem.isEmpty())
        qWarning("the phone has no package database: %s", qUtf8Printable(problem));
}

QString nameOf(const QString &id)
{
    return id.section(QLatin1Char(';'), 0, 0);
}

} // namespace

bool isOlder(const Package &left, const Package &right)
{
    const QVersionNumber leftVersion = numberOf(left.version);
    const QVersionNumber rightVersion = numberOf(right.version);
    return leftVersion < rightVersion
        || (leftVersion == rightVersion && numberOf(left.release) < numberOf(right.release));
}

PackageStore::PackageStore(const QJsonObject &profile)
    : m_installed(packagesFrom(profile.value(QLatin1String("installed")).toArray()))
    , m_available(packagesFrom(profile.value(QLatin1String("available")).toArray()))
{
    if (!QFile::exists(databaseFile))
        fillDatabase(jsonOf(m_installed));
}

QString PackageStore::idOf(const Package &package, bool installed)
{
    return QStringLiteral("%1;%2;noarch;%3")
        .arg(package.name, package.fullVersion(),
             installed ? QStringLiteral("installed") : QStringLiteral("store"));
}

const Package *PackageStore::installed(const QString &name) const
{
    const auto found = std::find_if(m_installed.begin(), m_installed.end(),
                                    [&](const Package &package) { return package.name == name; });
    return found == m_installed.end() ? nullptr : &*found;
}

const Package *PackageStore::newestAvailable(const QString &name) const
{
    const Package *newest = nullptr;
    for (const Package &package : m_available) {
        if (package.name == name && (!newest || isOlder(*newest, package)))
            newest = &package;
    }
    return newest;
}

std::vector<PackageStore::Found> PackageStore::all(quint64 filter) const
{
    std::vector<Found> found;
    // What is installed is not told again as available in the same version.
    const auto isInstalled = [this](const Package &package) {
        const Package *present = installed(package.name);
        return present && present->fullVersion() == package.fullVersion();
    };
    const auto isNewest = [this](const Package &package) {
        const Package *available = newestAvailable(package.name);
        const Package *present = installed(package.name);
        return !(available && isOlder(package, *available)) && !(present && isOlder(package, *present));
    };
    for (const Package &package : m_installed) {
        if (!(filter & notInstalledFilter) && (!(filter & newestFilter) || isNewest(package)))
            found.push_back({true, idOf(package, true), package.summary});
    }
    for (const Package &package : m_available) {
        if (!(filter & installedFilter) && !isInstalled(package)
            && (!(filter & newestFilter) || isNewest(package)))
            found.push_back({false, idOf(package, false), package.summary});
    }
    return found;
}

std::vector<PackageStore::Found> PackageStore::find(const QStringList &wanted, quint64 filter) const
{
    std::vector<Found> found = all(filter);
    found.erase(std::remove_if(found.begin(), found.end(),
                               [&](const Found &each) {
                                   return !wanted.contains(nameOf(each.id)) && !wanted.contains(each.id);
                               }),
                found.end());
    return found;
}

PackageStore::Change PackageStore::installation(const QStringList &ids, bool trustedOnly) const
{
    Change change;
    for (const QString &id : ids) {
        if (id.count(QLatin1Char(';')) != 3)
            throw PackageError(PackageError::PackageIdInvalid,
                               QStringLiteral("The package id '%1' is not valid").arg(id));
        const auto found = std::find_if(m_available.begin(), m_available.end(),
                                        [&](const Package &package) { return idOf(package, false) == id; });
        const Package *present = installed(nameOf(id));
        if (present
            && idOf(*present, true).section(QLatin1Char(';'), 0, 2) == id.section(QLatin1Char(';'), 0, 2))
            throw PackageError(PackageError::PackageAlreadyInstalled,
                               QStringLiteral("%1 is already installed").arg(present->name));
        if (found == m_available.end())
            throw PackageError(PackageError::PackageNotFound,
                               QStringLiteral("The package '%1' is in no source").arg(id));
        addWithNeeds(*found, false, trustedOnly, change);
    }
    return change;
}

void PackageStore::addWithNeeds(const Package &package, bool automatic, bool trustedOnly,
                                Change &change) const
{
    if (trustedOnly && !package.trusted)
        throw PackageError(PackageError::CannotInstallUnsigned,
                           QStringLiteral("%1 is not signed").arg(package.name));
    if (const Package *present = installed(package.name)) {
        if (isOlder(package, *present))
            throw PackageError(
                PackageError::PackageAlreadyInstalled,
                QStringLiteral("A newer version of %1 is already installed").arg(package.name));
        change.removed.push_back(*present);
    }
    change.added.push_back(package);
    change.added.back().automatic = automatic;
    if (change.fails.isEmpty())
        change.fails = package.installFails;
    for (const QString &need : package.needs) {
        const bool isComing = std::any_of(change.added.begin(), change.added.end(),
                                          [&](const Package &added) { return added.name == need; });
        if (installed(need) || isComing)
            continue;
        const Package *provider = newestAvailable(need);
        if (!provider)
            throw PackageError(PackageError::DependenciesUnresolved,
                               QStringLiteral("Nothing provides %1, which %2 needs").arg(need, package.name));
        addWithNeeds(*provider, true, trustedOnly, change);
    }
}

std::vector<const Package *> PackageStore::dependentsOn(const Package &package, const Change &change) const
{
    std::vector<const Package *> dependents;
    for (const Package &other : m_installed) {
        const bool isGoing = std::any_of(change.removed.begin(), change.removed.end(),
                                         [&](const Package &removed) { return removed.name == other.name; });
        if (!isGoing && other.needs.contains(package.name))
            dependents.push_back(&other);
    }
    return dependents;
}

PackageStore::Change PackageStore::removal(const QStringList &ids, bool allowDependents,
                                           bool autoremove) const
{
    Change change;
    for (const QString &id : ids) {
        const Package *package = installed(nameOf(id));
        if (!package || idOf(*package, true) != id)
            throw PackageError(PackageError::PackageNotInstalled,
                               QStringLiteral("The package '%1' is not installed").arg(id));
        change.removed.push_back(*package);
    }
    // Grows while it is walked through.
    for (std::size_t index = 0; index < change.removed.size(); ++index) {
        const Package package = change.removed[index];
        if (package.essential)
            throw PackageError(PackageError::CannotRemoveSystemPackage,
                               QStringLiteral("%1 is essential to the phone").arg(package.name));
        if (change.fails.isEmpty())
            change.fails = package.removeFails;
        for (const Package *dependent : dependentsOn(package, change)) {
            if (!allowDependents)
                throw PackageError(PackageError::DependenciesUnresolved,
                                   QStringLiteral("%1 needs %2").arg(dependent->name, package.name));
            change.removed.push_back(*dependent);
        }
        for (const QString &need : package.needs) {
            const Package *needed = autoremove ? installed(need) : nullptr;
            if (needed && needed->automatic && dependentsOn(*needed, change).empty())
                change.removed.push_back(*needed);
        }
    }
    return change;
}

void PackageStore::make(const Change &change, std::function<void(const QString &)> done)
{
    const auto finish = [this, change, done](const QString &problem) {
        if (problem.isEmpty())
            apply(change);
        done(problem);
    };
    const auto add = [change, finish](const QString &problem) {
        if (!problem.isEmpty() || change.added.empty())
            finish(problem);
        else
            runDatabaseProgram({"add"}, jsonOf(change.added), finish);
    };
    if (change.removed.empty()) {
        add(QString());
        return;
    }
    std::vector<QByteArray> arguments{"remove"};
    for (const Package &package : change.removed)
        arguments.push_back(package.name.toUtf8());
    runDatabaseProgram(arguments, QByteArray(), add);
}

void PackageStore::apply(const Change &change)
{
    for (const Package &removed : change.removed) {
        removeFiles(removed);
        m_installed.erase(std::remove_if(m_installed.begin(), m_installed.end(),
                                         [&](const Package &each) { return each.name == removed.name; }),
                          m_installed.end());
    }
    for (const Package &added : change.added) {
        writeFiles(added);
        m_installed.push_back(added);
    }
}

void PackageStore::publish(const Package &package)
{
    m_available.erase(std::remove_if(m_available.begin(), m_available.end(),
                                     [&](const Package &each) {
                                         return each.name == package.name
                                             && each.fullVersion() == package.fullVersion();
                                     }),
                      m_available.end());
    m_available.push_back(package);
}

bool PackageStore::withdraw(const QString &name)
{
    const auto end = std::remove_if(m_available.begin(), m_available.end(),
                                    [&](const Package &each) { return each.name == name; });
    const bool hadAny = end != m_available.end();
    m_available.erase(end, m_available.end());
    return hadAny;
}

QJsonObject PackageStore::describe() const
{
    return {{QStringLiteral("installed"), described(m_installed)},
            {QStringLiteral("available"), described(m_available)}};
}

} // namespace Simulator
} // namespace Corvane
