// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_THEME_THEMEICONRESOLVER_H
#define CORVANEMDM_PLATFORM_THEME_THEMEICONRESOLVER_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QString>

namespace Glent
{

/**
 * Finds the files of icons by their names, by the rules of freedesktop icon themes.
 *
 * Looks into the icon folders of the user and of the XDG data folders, and last for pixmaps. What it has read
 * of the themes is kept: an object sees themes as they were when it first looked.
 */
class CORVANEMDM_PLATFORM_EXPORT ThemeIconResolver
{
public:
    /** Pixels; what a launcher shows. */
    static constexpr int LauncherSize = 128;

    /** Looks in the theme "default" first, which stands for the one that the device has chosen. */
    ThemeIconResolver();
    /** Looks in @p theme first, then in those that it inherits from. */
    explicit ThemeIconResolver(const QString &theme);
    ~ThemeIconResolver();

    /** The absolute path of the icon that fits @p size best; empty when there is none of that name. */
    QString resolvePath(const QString &iconName, int size = LauncherSize) const;

private:
    Q_DISABLE_COPY(ThemeIconResolver)

    class Private;
    Private *const d;
};

} // namespace Glent

#endif // CORVANEMDM_PLATFORM_THEME_THEMEICONRESOLVER_H
