// SPDX-License-Identifier: LGPL-2.1-or-later
#include "terminal.h"

#include "waiting.h"

#include <QtCore/QObject>

#include <cstdlib>
#include <fcntl.h>
#include <sys/ioctl.h>
#include <termios.h>
#include <unistd.h>

Terminal::Terminal()
    : m_person(::posix_openpt(O_RDWR | O_NOCTTY | O_CLOEXEC))
    , m_program(-1)
{
    if (m_person >= 0 && ::grantpt(m_person) == 0 && ::unlockpt(m_person) == 0)
        m_program = ::open(::ptsname(m_person), O_RDWR | O_NOCTTY | O_CLOEXEC);
    if (m_program < 0)
        qFatal("cannot make a terminal");
    m_notifier = std::make_unique<QSocketNotifier>(m_person, QSocketNotifier::Read);
    QObject::connect(m_notifier.get(), &QSocketNotifier::activated, m_notifier.get(), [this] {
        char bytes[256];
        const ssize_t count = ::read(m_person, bytes, sizeof bytes);
        m_shown.append(bytes, int(qMax<ssize_t>(0, count)));
    });
}

Terminal::~Terminal()
{
    m_notifier.reset();
    ::close(m_program);
    ::close(m_person);
}

void Terminal::adopt() const
{
    ::setsid();
    ::ioctl(m_program, TIOCSCTTY, 0);
}

bool Terminal::waitForText(const QByteArray &text)
{
    return waitUntil([&] { return m_shown.contains(text); });
}

void Terminal::type(const QByteArray &keys) const
{
    if (::write(m_person, keys.constData(), size_t(keys.size())) != keys.size())
        qFatal("cannot type");
}

bool Terminal::echoes() const
{
    termios modes = {};
    return ::tcgetattr(m_program, &modes) == 0 && (modes.c_lflag & ECHO) != 0;
}
