// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_PACKAGETRANSACTION_H
#define CORVANE_SIMULATOR_PACKAGETRANSACTION_H

#include "packagestore.h"
#include "service.h"
#include "timer.h"

namespace Corvane
{
namespace Simulator
{

/** One request to PackageKit, as its client sees it. */
class PackageTransaction
{
public:
    // PackageKit's numbers.
    enum Role : quint32 {
        UnknownRole = 0,
        GetPackages = 5,
        InstallPackages = 11,
        RefreshCache = 13,
        RemovePackages = 14,
        Resolve = 17,
    };
    enum Status : quint32 {
        WaitingForOthers = 1,
        SettingUp = 2,
        Querying = 4,
        Removing = 6,
        RefreshingCache = 7,
        Installing = 9,
        FinishedStatus = 18,
    };
    enum Exit : quint32 { Success = 1, Failed = 2, Cancelled = 3 };
    enum Flag : quint64 { OnlyTrusted = 1 << 1 };

    PackageTransaction(Service &service, const QString &path, const QString &client);

    QString path() const { return m_path; }
    QString client() const { return m_client; }
    bool isBegun() const { return m_role != UnknownRole; }
    bool isFinished() const { return m_status == FinishedStatus; }
    /** Whether it can still be given up. */
    bool isCancellable() const { return !isFinished() && m_cancellable; }
    guint32 percentage() const { return m_percentage; }
    /** For what the transaction does next. */
    Timer &timer() { return m_timer; }

    /** Puts the object on the bus. */
    void offer(MethodHandlers handlers);
    /** Says farewell and takes the object off the bus. */
    void withdraw();

    /** Throws MethodError unless @p client may make its one request now. */
    void use(const QString &client);
    void setHints(const QString &client, const QStringList &hints);
    /** Throws MethodError unless @p client may cancel now. */
    void checkCancellable(const QString &client) const;

    void begin(quint32 role, quint64 flags);
    void setStatus(Status status);
    void setPercentage(guint32 percentage);
    void setCancellable(bool cancellable);
    void tellPackages(const std::vector<PackageStore::Found> &packages) const;
    void tellError(PackageError::Code code, const QString &details) const;
    void finish(Exit exit);

private:
    PropertyReaders properties() const;
    void tellProperty(const char *name, GVariant *value) const;
    void emitSignal(const char *member, GVariant *arguments = nullptr) const;
    void checkClient(const QString &client) const;

    Service &m_service;
    const QString m_path;
    const QString m_client;
    const gint64 m_created; ///< µs
    bool m_used = false;
    bool m_pluralSignals = false;
    bool m_cancellable = true;
    quint32 m_role = UnknownRole;
    quint32 m_status = SettingUp;
    quint64 m_flags = 0;
    guint32 m_percentage = 0;
    Timer m_timer;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_PACKAGETRANSACTION_H
