// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_APPLICATIONS_P_H
#define CORVANEMDM_APPLICATIONS_P_H

#include <corvanemdm/applications.h>

#include <PackageKit/Daemon>
#include <PackageKit/Transaction>

#include <QtCore/QMap>
#include <QtCore/QPointer>
#include <QtCore/QSharedData>
#include <QtCore/QSharedPointer>

#include <functional>

namespace Corvane
{
namespace Mdm
{

class PackageEntryPrivate : public QSharedData
{
public:
    QString name;
    QString version;
    QString vendor;
};

class ApplicationEntryPrivate : public QSharedData
{
public:
    QString name;
    PackageEntry package;
    QString iconPath;
};

class ApplicationOperationPrivate
{
public:
    QString package;
    QString packageId; ///< PackageKit's identifier of what it found
    QString version;
    bool finished = false;
    bool succeeded = true;
    QString errorString;
};

/**
 * Leads each request through PackageKit's transactions: installs through refresh, resolve and install,
 * removals through resolve and remove. A receiver of an operation's signals may delete the operation, the
 * feature, or both.
 */
class ApplicationsPrivate : public QObject
{
    Q_OBJECT

public:
    ApplicationsPrivate();
    ~ApplicationsPrivate() override;

    ApplicationOperation *install(const QString &name, const QString &version);
    ApplicationOperation *remove(const QString &name, bool autoremove);

private:
    /** Pending operations by package name. */
    using Operations = QMap<QString, QPointer<ApplicationOperation>>;

    /** An operation on its way, which its receiver may delete meanwhile. */
    struct Request {
        Operations &pending;
        const QString name;
        const QPointer<ApplicationOperation> operation;
    };
    using RequestPointer = QSharedPointer<const Request>;
    /** @p error is PackageKit's enumerator, for people. */
    using ErrorHandler = void (*)(const Request &request, const QString &error, const QString &details);

    ApplicationOperation *refuse(ApplicationOperation *operation, const QString &reason) const;
    RequestPointer accept(Operations &pending, ApplicationOperation *operation);
    /** Calls @p next when @p transaction ends well; any other end is the end of the request. */
    void follow(const RequestPointer &request, PackageKit::Transaction *transaction, ErrorHandler onError,
                const std::function<void()> &next);
    /** Looks the package up and hands its identifier to @p next. */
    void resolve(const RequestPointer &request, PackageKit::Transaction::Filters filter,
                 const std::function<void(const QString &packageId)> &next);
    static void fail(const RequestPointer &request, const QString &reason = QString());
    static void succeed(const RequestPointer &request);

    Operations m_installs;
    Operations m_removals;
    bool m_ending = false;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_APPLICATIONS_P_H
