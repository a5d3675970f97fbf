// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_ATPORT_H
#define CORVANE_SIMULATOR_ATPORT_H

#include "atmodem.h"
#include "glibpointers.h"

#include <QtCore/QByteArray>

namespace Corvane
{
namespace Simulator
{

/** Offers a modem on a TCP port of the loopback interface, to one client at a time: a new one takes over. */
class AtPort
{
public:
    /** Throws std::runtime_error when no port can be opened. */
    explicit AtPort(AtModem &modem);
    ~AtPort();
    AtPort(const AtPort &) = delete;
    AtPort &operator=(const AtPort &) = delete;

    guint16 number() const { return m_number; }
    /** Writes all traffic to standard error from now on, after @p label; an empty one ends that. */
    void setTraceLabel(const QString &label) { m_traceLabel = label; }

private:
    void accept(GSocketConnection *connection);
    void hangUp();
    void read();
    void send(const QString &line);
    void trace(const char *direction, const QString &line) const;

    AtModem &m_modem;
    GObjectPointer<GSocketService> m_service;
    GObjectPointer<GSocketConnection> m_connection;
    guint m_source = 0;
    guint16 m_number = 0;
    QByteArray m_received; ///< up to a command that is not complete yet
    QString m_traceLabel;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_ATPORT_H
