// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SECRETINPUT_H
#define CORVANE_SECRETINPUT_H

#include "command.h"
#include "exitstatus.h"

namespace Corvane
{
namespace Agent
{

/** The options by which a command is told where a secret is, and the reading of it. */
class SecretInput
{
public:
    enum Need {
        Required, ///< asked for unless an option names another source
        Optional ///< asked for with "--ask-NAME"
    };

    /** @param meaning for people, as in "password of the access point" */
    SecretInput(const QString &name, const QString &meaning, Need need);

    /** "--NAME-file FILE", "--NAME-env VARIABLE" and, when it is optional, "--ask-NAME". */
    QVector<Option> options() const;

    /** What is wrong with the choice of sources; empty when nothing is. */
    QString fault(const Values &values) const;

    /** Whether there is a secret to be read. */
    bool isGiven(const Values &values) const;

    struct Result {
        ExitStatus status;
        QString text;
    };

    /** Reads the secret, from the terminal when no option names a source. What goes wrong is printed. */
    Result read(const Values &values) const;

private:
    QStringList given(const Values &values) const;

    QString m_askName;
    QString m_fileName;
    QString m_environmentName;
    QString m_meaning;
    Need m_need;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_SECRETINPUT_H
