// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_FAULTS_H
#define CORVANE_SIMULATOR_FAULTS_H

#include "glibpointers.h"

#include <QtCore/QString>

#include <deque>
#include <mutex>
#include <optional>

namespace Corvane
{
namespace Simulator
{

/** What a service does with some calls in place of its own behaviour. */
struct Fault {
    enum class Kind { Error, Late, Never, Reply };

    quint32 id = 0;
    QString service;
    QString path; ///< empty: any; so are interface and member
    QString interface;
    QString member;
    Kind kind = Kind::Never;
    QString errorName;
    QString errorMessage;
    quint32 delay = 0; ///< milliseconds
    Variant arguments; ///< the tuple that a Reply answers with
    std::optional<quint32> times; ///< how many calls are left
};

/** The faults that are set. Asked on GDBus's thread. */
class FaultTable
{
public:
    /**
     * Adds a fault as org.corvaneos.simulator.Control.SetFault describes it and returns its number.
     * Throws MethodError with what would be right.
     */
    quint32 add(const QString &service, const QString &path, const QString &interface, const QString &member,
                const QString &kind, GVariant *options);
    /** Returns false when there is no such fault. */
    bool remove(quint32 id);
    void clear();
    /** The newest fault that matches @p call, which uses up one of its times. */
    std::optional<Fault> take(const QString &service, GDBusMessage *call);
    /** An a(usssssa{sv}), floating. */
    GVariant *describe() const;

private:
    mutable std::mutex m_mutex;
    std::deque<Fault> m_faults; ///< newest first
    quint32 m_lastId = 0;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_FAULTS_H
