// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_REPLY_H
#define CORVANE_REPLY_H

#include <QtCore/QString>

namespace Corvane
{
namespace Agent
{

/** What became of something that a service was asked for. */
struct Reply {
    enum Outcome {
        Done,
        Refused, ///< the service said no
        TimedOut, ///< nothing came in time
        Interrupted, ///< the user or the system wants the program to end
        ServiceLost ///< the service is not there, or left during the wait
    };

    Outcome outcome = Done;
    QString text; ///< for people; empty when done

    bool isDone() const { return outcome == Done; }
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_REPLY_H
