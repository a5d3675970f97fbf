// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_TRUSTSTOREFOLDER_H
#define CORVANE_TEST_TRUSTSTOREFOLDER_H

#include <QtCore/QByteArray>
#include <QtCore/QDir>
#include <QtCore/QFile>
#include <QtCore/QString>

#include <poll.h>
#include <sys/inotify.h>
#include <unistd.h>

/** What the tests of the trust store do to its files, behind the back of what they test. */
namespace TrustStore
{

const QString Anchors = QStringLiteral("/etc/pki/ca-trust/source/anchors");
const QString Blacklist = QStringLiteral("/etc/pki/ca-trust/source/blacklist");
const QString Extracted = QStringLiteral("/etc/pki/ca-trust/extracted/pem");
const QString Helper = QStringLiteral("/usr/libexec/mdm-certificate");

/** The certificate of an authority that the phone is built with. */
inline QByteArray authority(const char *name)
{
    QFile file(QStringLiteral(AUTHORITIES_FOLDER "/%1.pem").arg(QLatin1String(name)));
    if (!file.open(QIODevice::ReadOnly))
        qFatal("there is no authority %s", name);
    return file.readAll();
}

inline void write(const QString &path, const QByteArray &content)
{
    QFile file(path);
    if (!file.open(QIODevice::WriteOnly) || file.write(content) != content.size())
        qFatal("cannot write %s", qPrintable(path));
}

inline QByteArray contentOf(const QString &path)
{
    QFile file(path);
    return file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray();
}

/** Empties @p folder. */
inline void clear(const QString &folder)
{
    QDir(folder).removeRecursively();
    QDir().mkpath(folder);
}

/** Counts how often the files of a folder, and the folder itself, are opened by anybody. */
class OpenCounter
{
public:
    explicit OpenCounter(const QString &folder)
        : m_fd(inotify_init1(IN_NONBLOCK | IN_CLOEXEC))
    {
        if (inotify_add_watch(m_fd, QFile::encodeName(folder).constData(), IN_OPEN) < 0)
            qFatal("cannot watch %s", qPrintable(folder));
    }
    ~OpenCounter() { close(m_fd); }

    /** Since construction or the last call. */
    int take()
    {
        int count = 0;
        alignas(inotify_event) char buffer[4096];
        for (ssize_t size = 0; (size = read(m_fd, buffer, sizeof buffer)) > 0;) {
            for (const char *at = buffer; at < buffer + size; ++count)
                at += sizeof(inotify_event) + reinterpret_cast<const inotify_event *>(at)->len;
        }
        return count;
    }

private:
    Q_DISABLE_COPY(OpenCounter)
    const int m_fd;
};

} // namespace TrustStore

#endif // CORVANE_TEST_TRUSTSTOREFOLDER_H
