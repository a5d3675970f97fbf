// SPDX-License-Identifier: LGPL-2.1-or-later
#include "settingsfile_p.h"

#include "../keyfile_p.h"

#include <QtCore/QDebug>
#include <QtCore/QDir>
#include <QtCore/QFileInfo>
#include <QtCore/QSaveFile>

#include <cerrno>
#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

namespace
{

/** Keeps other writers out of a folder while it lives. */
class FolderLock
{
public:
    explicit FolderLock(const QString &folder)
        : m_fd(open(QFile::encodeName(folder).constData(), O_RDONLY | O_DIRECTORY | O_CLOEXEC))
    {
        m_isLocked = m_fd >= 0 && flock(m_fd, LOCK_EX) == 0;
        m_error = errno;
    }
    ~FolderLock()
    {
        if (m_fd >= 0)
            close(m_fd);
    }
    Q_DISABLE_COPY(FolderLock)

    bool isLocked() const { return m_isLocked; }
    QString errorString() const { return qt_error_string(m_error); }

private:
    const int m_fd;
    bool m_isLocked = false;
    int m_error = 0;
};

} // namespace

SettingsFile::SettingsFile(const QString &fileName, QObject *parent)
    : QObject(parent)
    , m_fileName(fileName)
{
    const auto look = [this] {
        watch();
        Q_EMIT changed();
    };
    // Queued: the watcher cannot bear to be destroyed by a receiver of its signals.
    connect(&m_watcher, &QFileSystemWatcher::fileChanged, this, look, Qt::QueuedConnection);
    connect(&m_watcher, &QFileSystemWatcher::directoryChanged, this, look, Qt::QueuedConnection);
    watch();
}

void SettingsFile::watch()
{
    // A file that is replaced is another one, which only its folder tells; one that is not there yet comes
    // with its folder.
    QStringList wanted;
    if (QFileInfo::exists(m_fileName))
        wanted << m_fileName;
    QString folder = QFileInfo(m_fileName).path();
    while (!QFileInfo::exists(folder))
        folder = QFileInfo(folder).path();
    wanted << folder;

    const QStringList watched = m_watcher.files() + m_watcher.directories();
    for (const QString &path : qAsConst(wanted)) {
        if (!watched.contains(path))
            m_watcher.addPath(path);
    }
    for (const QString &path : watched) {
        if (!wanted.contains(path))
            m_watcher.removePath(path);
    }
}

bool SettingsFile::write(const char *group, const char *key, const QString &value)
{
    const QString problem = replace(group, key, value);
    if (!problem.isEmpty())
        qWarning() << "Cannot change the setting" << key << "in" << m_fileName << problem;
    return problem.isEmpty();
}

QString SettingsFile::replace(const char *group, const char *key, const QString &value) const
{
    const QString folder = QFileInfo(m_fileName).path();
    QDir().mkpath(folder);
    const FolderLock lock(folder);
    if (!lock.isLocked())
        return lock.errorString();
    KeyFile settings(m_fileName);
    if (settings.text(group, key) == value)
        return QString();
    settings.setText(group, key, value);
    QSaveFile file(m_fileName);
    if (!file.open(QIODevice::WriteOnly) || file.write(settings.toData()) < 0 || !file.commit())
        return file.errorString();
    return QString();
}
