// SPDX-License-Identifier: LGPL-2.1-or-later
#include <theme/themeiconresolver.h>

#include <keyfile_p.h>

#include <QtCore/QDir>
#include <QtCore/QFileInfo>
#include <QtCore/QHash>
#include <QtCore/QSet>
#include <QtCore/QStandardPaths>
#include <QtCore/QVector>

#include <algorithm>
#include <cstdlib>

namespace Glent
{

namespace
{

const char *const ThemeGroup = "Icon Theme";
const QLatin1String DefaultTheme("default");
// The theme that every other falls back on.
const QLatin1String FallbackTheme("hicolor");
// In the order of preference.
const QLatin1String Suffixes[] = {QLatin1String(".png"), QLatin1String(".svg"), QLatin1String(".xpm")};

/** One folder of a theme, as the theme's index describes it. */
struct IconFolder {
    enum Type { Fixed, Scalable, Threshold };

    QString path; ///< relative to the theme
    Type type = Threshold;
    int size = 0;
    int scale = 1;
    int minimum = 0;
    int maximum = 0;
    int threshold = 0;

    bool matches(int wanted) const
    {
        if (scale != 1)
            return false;
        switch (type) {
        case Fixed:
            return wanted == size;
        case Scalable:
            return minimum <= wanted && wanted <= maximum;
        case Threshold:
            break;
        }
        return std::abs(wanted - size) <= threshold;
    }

    int distance(int wanted) const
    {
        switch (type) {
        case Fixed:
            return std::abs(size * scale - wanted);
        case Scalable:
            return outside(minimum * scale, maximum * scale, wanted);
        case Threshold:
            break;
        }
        return outside((size - threshold) * scale, (size + threshold) * scale, wanted);
    }

private:
    static int outside(int lower, int upper, int wanted)
    {
        return std::max({lower - wanted, wanted - upper, 0});
    }
};

struct Theme {
    QVector<IconFolder> folders;
    QStringList parents;
};

IconFolder::Type typeNamed(const QString &name)
{
    if (name == QLatin1String("Fixed"))
        return IconFolder::Fixed;
    return name == QLatin1String("Scalable") ? IconFolder::Scalable : IconFolder::Threshold;
}

Theme readTheme(const QString &indexFile)
{
    const KeyFile index(indexFile);
    Theme theme;
    theme.parents = index.list(ThemeGroup, "Inherits", ',');
    const QStringList folders
        = index.list(ThemeGroup, "Directories", ',') + index.list(ThemeGroup, "ScaledDirectories", ',');
    for (const QString &path : folders) {
        const QByteArray group = path.toUtf8();
        IconFolder folder;
        folder.path = path;
        folder.type = typeNamed(index.text(group.constData(), "Type"));
        folder.size = index.number(group.constData(), "Size", 0);
        folder.scale = index.number(group.constData(), "Scale", 1);
        folder.minimum = index.number(group.constData(), "MinSize", folder.size);
        folder.maximum = index.number(group.constData(), "MaxSize", folder.size);
        folder.threshold = index.number(group.constData(), "Threshold", 2);
        theme.folders.append(folder);
    }
    return theme;
}

QStringList dataFolders(const QString &subfolder)
{
    QStringList folders = QStandardPaths::standardLocations(QStandardPaths::GenericDataLocation);
    for (QString &folder : folders)
        folder += QLatin1Char('/') + subfolder;
    return folders;
}

} // namespace

class ThemeIconResolver::Private
{
public:
    explicit Private(const QString &theme)
        : m_iconFolders(QStringList(QDir::homePath() + QLatin1String("/.icons"))
                        + dataFolders(QStringLiteral("icons")))
        , m_pixmapFolders(dataFolders(QStringLiteral("pixmaps")))
        , m_themes(withParents(theme))
    {
    }

    QString find(const QString &name, int size)
    {
        for (const QString &theme : qAsConst(m_themes)) {
            const QString file = findInTheme(theme, name, size);
            if (!file.isEmpty())
                return file;
        }
        return findInFolders(m_iconFolders + m_pixmapFolders, QString(), name);
    }

private:
    /** @p theme and what it inherits from, in the order in which they are searched. */
    QStringList withParents(const QString &theme)
    {
        QStringList themes;
        addWithParents(theme, themes);
        // The last resort, wherever other themes inherit from it.
        themes.removeAll(FallbackTheme);
        if (!m_read.contains(FallbackTheme))
            m_read.insert(FallbackTheme, readNamed(FallbackTheme));
        return themes << FallbackTheme;
    }

    void addWithParents(const QString &name, QStringList &themes)
    {
        // Themes may inherit from each other in a circle.
        if (m_read.contains(name))
            return;
        const Theme theme = readNamed(name);
        m_read.insert(name, theme);
        themes.append(name);
        for (const QString &parent : theme.parents)
            addWithParents(parent.trimmed(), themes);
    }

    /** The theme as the first of its indexes has it. */
    Theme readNamed(const QString &name) const
    {
        for (const QString &folder : m_iconFolders) {
            const QString index = folder + QLatin1Char('/') + name + QLatin1String("/index.theme");
            if (QFileInfo::exists(index))
                return readTheme(index);
        }
        return Theme();
    }

    QString findInTheme(const QString &theme, const QString &name, int size)
    {
        const QStringList folders = foldersBySize(theme, size);
        for (const QString &folder : folders) {
            const QString file
                = findInFolders(m_iconFolders, QLatin1Char('/') + theme + QLatin1Char('/') + folder, name);
            if (!file.isEmpty())
                return file;
        }
        return QString();
    }

    /** Those that are made for @p size first, then the others, the nearest size first. */
    QStringList foldersBySize(const QString &theme, int size)
    {
        const QPair<QString, int> key(theme, size);
        const auto known = m_foldersBySize.constFind(key);
        if (known != m_foldersBySize.constEnd())
            return *known;
        QVector<IconFolder> folders = m_read.value(theme).folders;
        const auto rank = [size](const IconFolder &folder) {
            return folder.matches(size) ? -1 : folder.distance(size);
        };
        std::stable_sort(
            folders.begin(), folders.end(),
            [rank](const IconFolder &left, const IconFolder &right) { return rank(left) < rank(right); });
        QStringList paths;
        for (const IconFolder &folder : qAsConst(folders))
            paths.append(folder.path);
        m_foldersBySize.insert(key, paths);
        return paths;
    }

    QString findInFolders(const QStringList &folders, const QString &subfolder, const QString &name)
    {
        for (const QString &folder : folders) {
            const QString path = folder + subfolder;
            const QSet<QString> &files = filesOf(path);
            if (files.isEmpty())
                continue;
            for (const QLatin1String suffix : Suffixes) {
                if (!files.contains(name + suffix))
                    continue;
                const QString file = path + QLatin1Char('/') + name + suffix;
                if (QFileInfo(file).isFile())
                    return file;
            }
        }
        return QString();
    }

    /** Read once a folder: a theme has hundreds, and asking for each icon in each of them takes far longer.
     */
    const QSet<QString> &filesOf(const QString &folder)
    {
        auto known = m_files.find(folder);
        if (known == m_files.end()) {
            const QStringList files = QDir(folder).entryList(QDir::Files);
            known = m_files.insert(folder, QSet<QString>(files.begin(), files.end()));
        }
        return *known;
    }

    const QStringList m_iconFolders;
    const QStringList m_pixmapFolders;
    QHash<QString, Theme> m_read; ///< by name
    QHash<QPair<QString, int>, QStringList> m_foldersBySize;
    QHash<QString, QSet<QString>> m_files; ///< by folder
    const QStringList m_themes;
};

ThemeIconResolver::ThemeIconResolver()
    : ThemeIconResolver(DefaultTheme)
{
}

ThemeIconResolver::ThemeIconResolver(const QString &theme)
    : d(new Private(theme))
{
}

ThemeIconResolver::~ThemeIconResolver()
{
    delete d;
}

QString ThemeIconResolver::resolvePath(const QString &iconName, int size) const
{
    // A path is no name, and must not lead out of the themes.
    if (iconName.isEmpty() || iconName.contains(QLatin1Char('/')))
        return QString();
    const QString file = d->find(iconName, size);
    if (!file.isEmpty())
        return file;
    // Many desktop entries have the name with a suffix, which is not to be there.
    for (const QLatin1String suffix : Suffixes) {
        if (iconName.endsWith(suffix))
            return d->find(iconName.chopped(suffix.size()), size);
    }
    return QString();
}

} // namespace Glent
