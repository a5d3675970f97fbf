// SPDX-License-Identifier: LGPL-2.1-or-later
#include "progress.h"

#include <algorithm>
#include <cstdio>
#include <sys/ioctl.h>
#include <unistd.h>

namespace Corvane
{
namespace Agent
{

namespace
{

// Asked for each time, as the window may be resized.
int terminalWidth()
{
    winsize size = {};
    const bool known = ::ioctl(STDERR_FILENO, TIOCGWINSZ, &size) == 0 && size.ws_col > 0;
    return known ? size.ws_col : 80;
}

void write(const QString &text)
{
    std::fputs(text.toUtf8().constData(), stderr);
    std::fflush(stderr);
}

} // namespace

Progress::Progress(const QString &label)
    : m_label(label)
    , m_onTerminal(::isatty(STDERR_FILENO) == 1)
{
}

Progress::~Progress()
{
    if (m_drawn)
        write(QStringLiteral("\n"));
}

void Progress::show(int percent)
{
    percent = std::clamp(percent, 0, 100);
    if (percent == m_shown)
        return;
    if (m_onTerminal) {
        // One column stays free: a full line would wrap on some terminals.
        write(QLatin1String("\r\x1b[K") + bar(m_label, percent, terminalWidth() - 1));
        m_drawn = true;
    } else if (percent / 10 != m_shown / 10 || m_shown < 0) {
        write(QStringLiteral("%1: %2%\n").arg(m_label).arg(percent));
    }
    m_shown = percent;
}

QString Progress::bar(const QString &label, int percent, int width)
{
    const QString number = QStringLiteral("%1%").arg(percent, 4);
    const int room = width - label.size() - number.size() - 3;
    constexpr int usefulRoom = 5;
    if (room < usefulRoom)
        return (label + number).right(std::max(width, 0));
    constexpr int widestBar = 50;
    const int cells = std::min(room, widestBar);
    const int done = cells * percent / 100;
    return QStringLiteral("%1 [%2%3]%4")
        .arg(label, QString(done, QLatin1Char('#')), QString(cells - done, QLatin1Char('-')), number);
}

} // namespace Agent
} // namespace Corvane
