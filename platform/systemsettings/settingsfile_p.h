// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_SYSTEMSETTINGS_SETTINGSFILE_P_H
#define CORVANEMDM_PLATFORM_SYSTEMSETTINGS_SETTINGSFILE_P_H

#include <QtCore/QFileSystemWatcher>
#include <QtCore/QObject>
#include <QtCore/QString>

/** A key file that several processes read and change. */
class SettingsFile : public QObject
{
    Q_OBJECT

public:
    /** The file need not exist, nor its folder; it is followed from here on. */
    explicit SettingsFile(const QString &fileName, QObject *parent = nullptr);

    QString fileName() const { return m_fileName; }

    /**
     * Replaces the file by one that differs in this value alone; a reader sees one or the other. Nothing is
     * done when the value is there already. A failure is logged, and returns false.
     */
    bool write(const char *group, const char *key, const QString &value);

Q_SIGNALS:
    /** The file may have changed, come or gone. */
    void changed();

private:
    void watch();
    QString replace(const char *group, const char *key, const QString &value) const;

    const QString m_fileName;
    QFileSystemWatcher m_watcher;
};

#endif // CORVANEMDM_PLATFORM_SYSTEMSETTINGS_SETTINGSFILE_P_H
