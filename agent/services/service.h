// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SERVICE_H
#define CORVANE_SERVICE_H

#include "reply.h"

#include <QtCore/QString>

namespace Corvane
{
namespace Agent
{

/** A service on the system bus, as the library's classes need it. */
struct Service {
    QString name; ///< on the bus; empty for what is not there
    QString description; ///< for people

    static Service telephony();
    static Service deviceLock();
    /** The bus itself, which answers for services that come and go. */
    static Service bus();
    static Service connectionManager();
    static Service mdmProxy();
    static Service packageKit();
    /** A program rather than a service of the bus: it has no name there, and is always at hand. */
    static Service certificateHelper();
    static Service clock();

    /** "the telephony service (org.ofono)" */
    QString toString() const;

    /** Whether the service has its name on the bus at this moment. */
    bool isRunning() const;

    /**
     * Makes sure that the service runs, starting it when the bus can.
     * The library's objects are told at once whether their service is there, so this comes before them.
     */
    Reply ensureRunning() const;

    /** The answer to everything that is asked of a service that is not there. */
    Reply notRunning() const;

    /** "the telephony service (org.ofono) refused: @p reason", or that it did not answer at all */
    QString refusal(const QString &reason) const;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_SERVICE_H
