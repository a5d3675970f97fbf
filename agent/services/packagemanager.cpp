// SPDX-License-Identifier: LGPL-2.1-or-later
#include "packagemanager.h"

#include "service.h"
#include "wait.h"
#include "warningcapture.h"

#include <QtCore/QPointer>
#include <QtDBus/QDBusConnection>

#include <algorithm>

namespace Corvane
{
namespace Agent
{

using Mdm::ApplicationEntry;
using Mdm::ApplicationOperation;
using Mdm::PackageEntry;

namespace
{

// The reason comes with the operation as well; and PackageKit's client library wonders at its own daemon.
const QLatin1String noNews(
    "^Error (un)?installing package |^Cannot process \"org\\.freedesktop\\.PackageKit");

template <typename Entry> QList<Entry> byName(QList<Entry> entries)
{
    std::stable_sort(entries.begin(), entries.end(),
                     [](const Entry &left, const Entry &right) { return left.name() < right.name(); });
    return entries;
}

Reply outcomeOf(const ApplicationOperation *operation)
{
    if (operation->isSucceeded())
        return {};
    const QString reason = operation->errorString();
    return {Reply::Refused, reason.isEmpty() ? QStringLiteral("PackageKit failed without a reason") : reason};
}

} // namespace

PackageManager::PackageManager(std::chrono::milliseconds timeout, QObject *parent)
    : QObject(parent)
    , m_timeout(timeout)
{
    // For a list of strings alone: QtDBus ends the program over another structure.
    QDBusConnection::systemBus().connect(
        Service::packageKit().name, QStringLiteral("/org/freedesktop/PackageKit"),
        QStringLiteral("org.freedesktop.PackageKit"), QStringLiteral("TransactionListChanged"), {},
        QStringLiteral("as"), this, SLOT(transactionListChanged(QStringList)));
}

QList<PackageEntry> PackageManager::packages() const
{
    return byName(m_applications.getInstalledPackages());
}

QList<ApplicationEntry> PackageManager::applications() const
{
    return byName(m_applications.getInstalledApplications());
}

Reply PackageManager::install(const QString &name, const QString &version)
{
    return perform(QStringLiteral("finish installing %1").arg(name),
                   [&] { return m_applications.installPackage(name, version); });
}

Reply PackageManager::remove(const QString &name, bool autoremove)
{
    return perform(QStringLiteral("finish removing %1").arg(name),
                   [&] { return m_applications.removePackage(name, autoremove); });
}

void PackageManager::transactionListChanged(const QStringList &transactions)
{
    if (transactions.isEmpty())
        Q_EMIT idle();
}

Reply PackageManager::perform(const QString &awaited, const std::function<ApplicationOperation *()> &request)
{
    Wait wait(Service::packageKit(), m_timeout, awaited);
    const WarningCapture toldAlready(noNews, [](const QString &) {});
    const QPointer<ApplicationOperation> operation(request());
    connect(operation.data(), &ApplicationOperation::finished, &wait, [&wait](ApplicationOperation *ended) {
        const Reply outcome = outcomeOf(ended);
        wait.end(outcome.outcome, outcome.text);
    });
    Reply reply = wait.run();
    // It would go by itself, but the program may end first.
    delete operation.data();
    return reply;
}

} // namespace Agent
} // namespace Corvane
