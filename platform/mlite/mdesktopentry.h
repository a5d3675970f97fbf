// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_MLITE_MDESKTOPENTRY_H
#define CORVANEMDM_PLATFORM_MLITE_MDESKTOPENTRY_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QString>
#include <QtCore/QStringList>

/** One desktop entry file, read at construction. */
class CORVANEMDM_PLATFORM_EXPORT MDesktopEntry
{
public:
    explicit MDesktopEntry(const QString &fileName);
    ~MDesktopEntry();

    /**
     * Whether the file is a desktop entry with the keys that every one needs: Type, Name, and for an
     * application that the bus does not start, Exec.
     */
    bool isValid() const;

    /** The name, not translated. */
    QString nameUnlocalized() const;
    /** The name of an icon or the path of its file; empty when there is none. */
    QString icon() const;
    /** Whether the entry is not to be shown in menus. */
    bool noDisplay() const;
    /** The environments that are not to show the entry. */
    QStringList notShowIn() const;

private:
    Q_DISABLE_COPY(MDesktopEntry)

    class Private;
    Private *const d;
};

#endif // CORVANEMDM_PLATFORM_MLITE_MDESKTOPENTRY_H
