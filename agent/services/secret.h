// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SECRET_H
#define CORVANE_SECRET_H

#include "reply.h"

#include <QtCore/QString>

namespace Corvane
{
namespace Agent
{

/**
 * One line that nobody is to see: a password, a lock code. It never is an argument of a command, as every
 * user of the machine can read those.
 */
struct Secret {
    Reply reply; ///< refused when the source has no usable secret; the text tells why, without the secret
    QString text;
};

/** The first and only line of @p fileName; "-" is standard input. */
Secret secretFromFile(const QString &fileName);

/** The value of the environment variable @p name. */
Secret secretFromEnvironment(const QString &name);

/** Asks on the terminal of the program, wherever its streams lead, without showing what is typed. */
Secret secretFromTerminal(const QString &prompt);

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_SECRET_H
