// SPDX-License-Identifier: LGPL-2.1-or-later
#include "secret.h"

#include "interruption.h"

#include <inputfile.h>

#include <algorithm>
#include <fcntl.h>
#include <sys/prctl.h>
#include <sys/resource.h>
#include <termios.h>
#include <unistd.h>

namespace Corvane
{
namespace Agent
{

namespace
{

constexpr int largestSecret = 4096; // bytes; a terminal takes no longer line

Secret refused(const QString &source, const QString &why)
{
    return {{Reply::Refused, QStringLiteral("%1 %2").arg(source, why)}, {}};
}

/** What is in memory must not come into a file by a crash, nor to another process of the same user. */
void keepMemoryPrivate()
{
    constexpr rlimit none{0, 0};
    ::setrlimit(RLIMIT_CORE, &none);
    ::prctl(PR_SET_DUMPABLE, 0);
}

/** The secret that @p bytes are, but for a line end behind it. */
Secret secretFrom(const QString &source, QByteArray bytes)
{
    keepMemoryPrivate();
    for (const char lineEnd : {'\n', '\r'}) {
        if (bytes.endsWith(lineEnd))
            bytes.chop(1);
    }
    if (bytes.isEmpty())
        return refused(source, QStringLiteral("holds no secret"));
    if (bytes.contains('\n'))
        return refused(source, QStringLiteral("must hold one line"));
    const QString text = QString::fromUtf8(bytes);
    if (bytes.contains('\0') || text.toUtf8() != bytes)
        return refused(source, QStringLiteral("must hold text in UTF-8"));
    return {{}, text};
}

/** The terminal that the program was started on; what is typed is not shown as long as the object lives. */
class Terminal
{
public:
    Terminal()
        : m_descriptor(::open("/dev/tty", O_RDWR | O_CLOEXEC | O_NOCTTY))
    {
        m_isSilent = m_descriptor >= 0 && ::tcgetattr(m_descriptor, &m_before) == 0;
        if (!m_isSilent)
            return;
        termios silent = m_before;
        silent.c_lflag &= ~tcflag_t(ECHO);
        silent.c_lflag |= ICANON | ECHONL; // the end of the line is seen
        m_isSilent = ::tcsetattr(m_descriptor, TCSAFLUSH, &silent) == 0;
    }
    ~Terminal()
    {
        if (m_isSilent)
            ::tcsetattr(m_descriptor, TCSAFLUSH, &m_before);
        if (m_descriptor >= 0)
            ::close(m_descriptor);
    }
    Q_DISABLE_COPY(Terminal)

    bool isSilent() const { return m_isSilent; }
    int descriptor() const { return m_descriptor; }

    void write(const QByteArray &text) const
    {
        [[maybe_unused]] const ssize_t written = ::write(m_descriptor, text.constData(), size_t(text.size()));
    }

    QByteArray readLine() const
    {
        QByteArray line(largestSecret, '\0');
        line.resize(int(std::max<ssize_t>(0, ::read(m_descriptor, line.data(), size_t(line.size())))));
        return line;
    }

private:
    int m_descriptor;
    bool m_isSilent;
    termios m_before = {};
};

} // namespace

Secret secretFromFile(const QString &fileName)
{
    const InputFile file = readInputFile(fileName, largestSecret);
    return file.error.isEmpty() ? secretFrom(file.name, file.content) : refused(file.name, file.error);
}

Secret secretFromEnvironment(const QString &name)
{
    const QString source = QStringLiteral("the environment variable ") + name;
    const QByteArray variable = name.toLocal8Bit();
    return qEnvironmentVariableIsSet(variable.constData()) ? secretFrom(source, qgetenv(variable.constData()))
                                                           : refused(source, QStringLiteral("is not set"));
}

Secret secretFromTerminal(const QString &prompt)
{
    const Terminal terminal;
    if (!terminal.isSilent())
        return refused(QStringLiteral("no terminal"), QStringLiteral("to ask on"));
    terminal.write(prompt.toLocal8Bit() + ": ");
    if (Interruption::waitForInput(terminal.descriptor()))
        return secretFrom(QStringLiteral("what was typed"), terminal.readLine());
    terminal.write("\n");
    return {{Reply::Interrupted, QStringLiteral("interrupted")}, {}};
}

} // namespace Agent
} // namespace Corvane
