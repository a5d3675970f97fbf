// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_TRAFFIC_H
#define CORVANE_SIMULATOR_TRAFFIC_H

#include "faults.h"
#include "journal.h"

#include <QtCore/QString>

#include <map>
#include <utility>

namespace Corvane
{
namespace Simulator
{

/**
 * What passes over one connection of a service: writes calls to the journal and carries out the faults.
 *
 * It works on GDBus's thread, before any dispatch, so that every call counts: of the standard interfaces,
 * with a wrong signature, to objects that are not there.
 */
class Traffic
{
public:
    /** Watches @p connection until that is closed; all that is given must live longer. */
    static void watch(GDBusConnection *connection, const QString &service, Journal &journal,
                      FaultTable &faults);

private:
    Traffic(const QString &service, Journal &journal, FaultTable &faults);

    GDBusMessage *filter(GDBusConnection *connection, GDBusMessage *message, bool incoming);
    /** Returns whether the call goes on to the service. */
    bool admit(GDBusConnection *connection, GDBusMessage *call);
    /** Returns whether the answer goes out now. */
    bool dismiss(GDBusConnection *connection, GDBusMessage *answer);

    const QString m_service;
    Journal &m_journal;
    FaultTable &m_faults;
    /** Delays in milliseconds by caller and serial of the call. */
    std::map<std::pair<QByteArray, guint32>, quint32> m_late;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_TRAFFIC_H
