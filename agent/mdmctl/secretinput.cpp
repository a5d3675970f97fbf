// SPDX-License-Identifier: LGPL-2.1-or-later
#include "secretinput.h"

#include "output.h"
#include "secret.h"

namespace Corvane
{
namespace Agent
{

SecretInput::SecretInput(const QString &name, const QString &meaning, Need need)
    : m_askName(QLatin1String("--ask-") + name)
    , m_fileName(QStringLiteral("--%1-file").arg(name))
    , m_environmentName(QStringLiteral("--%1-env").arg(name))
    , m_meaning(meaning)
    , m_need(need)
{
}

QVector<Option> SecretInput::options() const
{
    QVector<Option> options;
    if (m_need == Optional)
        options.append({m_askName, QStringLiteral("Ask for the ") + m_meaning, {}, {}});
    options.append(
        {m_fileName,
         QStringLiteral("Read the %1 from a file of one line; - reads standard input").arg(m_meaning),
         QStringLiteral("FILE"),
         {}});
    options.append({m_environmentName,
                    QStringLiteral("Take the %1 from an environment variable").arg(m_meaning),
                    QStringLiteral("VARIABLE"),
                    {}});
    return options;
}

QStringList SecretInput::given(const Values &values) const
{
    QStringList names;
    for (const QString &name : {m_askName, m_fileName, m_environmentName}) {
        if (values.has(name))
            names.append(name);
    }
    return names;
}

QString SecretInput::fault(const Values &values) const
{
    const QStringList names = given(values);
    return names.size() > 1 ? QStringLiteral("%1 and %2 exclude each other").arg(names.at(0), names.at(1))
                            : QString();
}

bool SecretInput::isGiven(const Values &values) const
{
    return m_need == Required || !given(values).isEmpty();
}

SecretInput::Result SecretInput::read(const Values &values) const
{
    Secret secret;
    if (values.has(m_fileName))
        secret = secretFromFile(values.first(m_fileName));
    else if (values.has(m_environmentName))
        secret = secretFromEnvironment(values.first(m_environmentName));
    else
        secret = secretFromTerminal(m_meaning.at(0).toUpper() + m_meaning.mid(1));
    if (secret.reply.isDone())
        return {ExitDone, secret.text};
    if (secret.reply.outcome == Reply::Interrupted)
        return {conclude(secret.reply), {}};
    printError(QStringLiteral("the %1: %2").arg(m_meaning, secret.reply.text));
    return {ExitUsage, {}};
}

} // namespace Agent
} // namespace Corvane
