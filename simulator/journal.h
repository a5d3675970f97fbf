// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_JOURNAL_H
#define CORVANE_SIMULATOR_JOURNAL_H

#include "glibpointers.h"

#include <QtCore/QByteArray>
#include <QtCore/QString>

#include <deque>
#include <functional>
#include <mutex>

namespace Corvane
{
namespace Simulator
{

/**
 * The calls that the services received.
 *
 * Calls are recorded by GDBus's thread before they are dispatched, so that a client that has its answer
 * always finds its call here.
 */
class Journal
{
public:
    /** How many calls are kept; the oldest go first, which the numbers show. */
    static constexpr std::size_t capacity = 100000;

    /** @p announce is given each new entry, a (ttsssssss), on GDBus's thread. Set before the first call
     * comes. */
    void setAnnouncer(std::function<void(GVariant *entry)> announce) { m_announce = std::move(announce); }

    void record(const QString &service, GDBusMessage *call);
    void clear();
    /** The entries after the number @p after: an a(ttsssssss), floating. */
    GVariant *entriesAfter(quint64 after) const;

private:
    struct Entry {
        quint64 number;
        qint64 time;
        QByteArray service;
        QByteArray sender;
        QByteArray path;
        QByteArray interface;
        QByteArray member;
        QByteArray signature;
        Variant arguments;
    };
    static GVariant *describe(const Entry &entry);

    mutable std::mutex m_mutex;
    std::deque<Entry> m_entries;
    quint64 m_lastNumber = 0;
    std::function<void(GVariant *)> m_announce;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_JOURNAL_H
