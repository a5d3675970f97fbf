// SPDX-License-Identifier: LGPL-2.1-or-later
#include "livetable.h"

#include <cstdio>
#include <unistd.h>

namespace Corvane
{
namespace Agent
{

bool LiveTable::isPossible()
{
    return isatty(STDOUT_FILENO);
}

void LiveTable::show(const QString &text)
{
    const QByteArray bytes = replacement(m_shown, text).toLocal8Bit();
    std::fwrite(bytes.constData(), 1, std::size_t(bytes.size()), stdout);
    std::fflush(stdout);
    m_shown = text;
}

QString LiveTable::replacement(const QString &shown, const QString &text)
{
    // Back to the first line, and nothing of the old text below: the new one may be shorter.
    const QString back = shown.isEmpty()
        ? QString()
        : QStringLiteral("\x1b[%1A\x1b[J").arg(shown.count(QLatin1Char('\n')) + 1);
    return back + text + QLatin1Char('\n');
}

} // namespace Agent
} // namespace Corvane
