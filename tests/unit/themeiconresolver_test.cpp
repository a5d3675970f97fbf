// SPDX-License-Identifier: LGPL-2.1-or-later
#include <theme/themeiconresolver.h>

#include <QtCore/QDir>
#include <QtCore/QTemporaryDir>
#include <QtTest/QtTest>

#include <memory>

using Glent::ThemeIconResolver;

/** Themes in folders of the test's own, which the XDG variables lead to. */
class ThemeIconResolverTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();

    void takesTheFolderOfTheSize();
    void takesTheNearestSize_data();
    void takesTheNearestSize();
    void exactSizeComesBeforeScaledOne();
    void thresholdIsTwoUnlessTold();
    void scalableCoversItsRange();
    void prefersPngToSvgToXpm();
    void followsInheritance();
    void hicolorComesLast();
    void circleOfThemes();
    void defaultTheme();
    void themeThatIsNotThere();
    void usersIconsComeFirst();
    void foldersOfATheme();
    void iconsOutsideOfThemes();
    void pixmaps();
    void namesWithASuffix();
    void namesThatAreNone_data();
    void namesThatAreNone();
    void linksAndFolders();
    void brokenIndex();

private:
    /** Writes a file below the test's folder and returns its absolute path. */
    QString write(const QString &path, const QByteArray &content = "x") const;
    QString writeTheme(const QString &name, const QByteArray &keys, const QByteArray &folders) const;
    /** What resolves, relative to the test's folder. */
    QString found(const QString &name, int size, const QString &theme = QStringLiteral("one")) const;

    std::unique_ptr<QTemporaryDir> m_folder;
};

void ThemeIconResolverTest::init()
{
    m_folder = std::make_unique<QTemporaryDir>();
    qputenv("HOME", QFile::encodeName(m_folder->filePath(QStringLiteral("home"))));
    qputenv("XDG_DATA_HOME", QFile::encodeName(m_folder->filePath(QStringLiteral("user"))));
    qputenv("XDG_DATA_DIRS",
            QFile::encodeName(m_folder->filePath(QStringLiteral("local")) + QLatin1Char(':')
                              + m_folder->filePath(QStringLiteral("share"))));
}

QString ThemeIconResolverTest::write(const QString &path, const QByteArray &content) const
{
    QFile file(m_folder->filePath(path));
    QDir().mkpath(QFileInfo(file).path());
    if (!file.open(QIODevice::WriteOnly) || file.write(content) != content.size())
        qFatal("cannot write %s", qPrintable(path));
    return file.fileName();
}

QString ThemeIconResolverTest::writeTheme(const QString &name, const QByteArray &keys,
                                          const QByteArray &folders) const
{
    return write(QStringLiteral("share/icons/%1/index.theme").arg(name),
                 "[Icon Theme]\nName=" + name.toUtf8() + "\n" + keys + "\n" + folders);
}

QString ThemeIconResolverTest::found(const QString &name, int size, const QString &theme) const
{
    const QString path = ThemeIconResolver(theme).resolvePath(name, size);
    if (path.isEmpty())
        return path;
    return QDir::isAbsolutePath(path) ? QDir(m_folder->path()).relativeFilePath(path)
                                      : QStringLiteral("relative: ") + path;
}

namespace
{

const QByteArray threeSizes = "[16]\nSize=16\nType=Fixed\n"
                              "[48]\nSize=48\nType=Fixed\n"
                              "[128]\nSize=128\nType=Fixed\n";

const QString a = QStringLiteral("a");

} // namespace

void ThemeIconResolverTest::takesTheFolderOfTheSize()
{
    writeTheme(QStringLiteral("one"), "Directories=16,48,128", threeSizes);
    for (const char *size : {"16", "48", "128"})
        write(QStringLiteral("share/icons/one/%1/a.png").arg(QLatin1String(size)));
    QCOMPARE(found(a, 16), QStringLiteral("share/icons/one/16/a.png"));
    QCOMPARE(found(a, 48), QStringLiteral("share/icons/one/48/a.png"));
    QCOMPARE(found(a, 128), QStringLiteral("share/icons/one/128/a.png"));
}

void ThemeIconResolverTest::takesTheNearestSize_data()
{
    QTest::addColumn<int>("size");
    QTest::addColumn<QString>("folder");
    QTest::newRow("smaller than all") << 1 << "16";
    QTest::newRow("between") << 40 << "48";
    QTest::newRow("between, lower") << 20 << "16";
    QTest::newRow("as far from both: the first of the index") << 32 << "16";
    QTest::newRow("larger than all") << 1000 << "128";
}

void ThemeIconResolverTest::takesTheNearestSize()
{
    QFETCH(int, size);
    QFETCH(QString, folder);
    takesTheFolderOfTheSize();
    QCOMPARE(found(a, size), QStringLiteral("share/icons/one/%1/a.png").arg(folder));
}

void ThemeIconResolverTest::exactSizeComesBeforeScaledOne()
{
    writeTheme(QStringLiteral("one"), "Directories=48@2,96\nScaledDirectories=48@2",
               "[48@2]\nSize=48\nScale=2\nType=Fixed\n[96]\nSize=96\nType=Fixed\n");
    write(QStringLiteral("share/icons/one/48@2/a.png"));
    QCOMPARE(found(a, 96), QStringLiteral("share/icons/one/48@2/a.png"));
    write(QStringLiteral("share/icons/one/96/a.png"));
    QCOMPARE(found(a, 96), QStringLiteral("share/icons/one/96/a.png"));
}

void ThemeIconResolverTest::thresholdIsTwoUnlessTold()
{
    writeTheme(QStringLiteral("one"), "Directories=44,48,60",
               "[44]\nSize=44\n[48]\nSize=48\n[60]\nSize=60\n"
               "Threshold=10\n");
    for (const char *size : {"44", "48", "60"})
        write(QStringLiteral("share/icons/one/%1/a.png").arg(QLatin1String(size)));
    // Within the thresholds of two folders, the index decides.
    QCOMPARE(found(a, 46), QStringLiteral("share/icons/one/44/a.png"));
    QCOMPARE(found(a, 47), QStringLiteral("share/icons/one/48/a.png"));
    QCOMPARE(found(a, 51), QStringLiteral("share/icons/one/60/a.png"));
    QCOMPARE(found(a, 200), QStringLiteral("share/icons/one/60/a.png"));
}

void ThemeIconResolverTest::scalableCoversItsRange()
{
    writeTheme(QStringLiteral("one"), "Directories=128,scalable",
               "[128]\nSize=128\nType=Fixed\n"
               "[scalable]\nSize=64\nMinSize=32\nMaxSize=256\nType=Scalable\n");
    write(QStringLiteral("share/icons/one/128/a.png"));
    write(QStringLiteral("share/icons/one/scalable/a.svg"));
    QCOMPARE(found(a, 128), QStringLiteral("share/icons/one/128/a.png"));
    QCOMPARE(found(a, 127), QStringLiteral("share/icons/one/scalable/a.svg"));
    QCOMPARE(found(a, 32), QStringLiteral("share/icons/one/scalable/a.svg"));
    QCOMPARE(found(a, 300), QStringLiteral("share/icons/one/scalable/a.svg"));
}

void ThemeIconResolverTest::prefersPngToSvgToXpm()
{
    writeTheme(QStringLiteral("one"), "Directories=48", "[48]\nSize=48\n");
    for (const char *suffix : {"xpm", "svg", "png"}) {
        const QString file = QStringLiteral("share/icons/one/48/a.%1").arg(QLatin1String(suffix));
        write(file);
        QCOMPARE(found(a, 48), file);
    }
    write(QStringLiteral("share/icons/one/48/b.jpg"));
    QCOMPARE(found(QStringLiteral("b"), 48), QString());
}

void ThemeIconResolverTest::followsInheritance()
{
    const QByteArray folder = "[48]\nSize=48\n";
    writeTheme(QStringLiteral("one"), "Directories=48\nInherits=two, three", folder);
    writeTheme(QStringLiteral("two"), "Directories=48\nInherits=four", folder);
    writeTheme(QStringLiteral("three"), "Directories=48", folder);
    writeTheme(QStringLiteral("four"), "Directories=48", folder);
    writeTheme(QStringLiteral("hicolor"), "Directories=48", folder);
    // The first found is the last of these: depth first, in the order of the index.
    for (const char *theme : {"hicolor", "three", "four", "two", "one"}) {
        const QString file = QStringLiteral("share/icons/%1/48/a.png").arg(QLatin1String(theme));
        write(file);
        QCOMPARE(found(a, 48), file);
    }
}

void ThemeIconResolverTest::hicolorComesLast()
{
    const QByteArray folder = "[48]\nSize=48\n";
    writeTheme(QStringLiteral("one"), "Directories=48\nInherits=hicolor,two", folder);
    writeTheme(QStringLiteral("two"), "Directories=48", folder);
    writeTheme(QStringLiteral("hicolor"), "Directories=48", folder);
    write(QStringLiteral("share/icons/hicolor/48/a.png"));
    QCOMPARE(found(a, 48), QStringLiteral("share/icons/hicolor/48/a.png"));
    QCOMPARE(found(a, 48, QStringLiteral("hicolor")), QStringLiteral("share/icons/hicolor/48/a.png"));
    write(QStringLiteral("share/icons/two/48/a.png"));
    QCOMPARE(found(a, 48), QStringLiteral("share/icons/two/48/a.png"));
}

void ThemeIconResolverTest::circleOfThemes()
{
    writeTheme(QStringLiteral("one"), "Directories=48\nInherits=two", "[48]\nSize=48\n");
    writeTheme(QStringLiteral("two"), "Directories=48\nInherits=one,two", "[48]\nSize=48\n");
    QCOMPARE(found(a, 48), QString());
    write(QStringLiteral("share/icons/two/48/a.png"));
    QCOMPARE(found(a, 48), QStringLiteral("share/icons/two/48/a.png"));
}

void ThemeIconResolverTest::defaultTheme()
{
    writeTheme(QStringLiteral("default"), "Inherits=one", "");
    writeTheme(QStringLiteral("one"), "Directories=48,128",
               "[48]\nSize=48\nType=Fixed\n[128]\nSize=128\nType=Fixed\n");
    write(QStringLiteral("share/icons/one/48/a.png"));
    const QString large = write(QStringLiteral("share/icons/one/128/a.png"));
    QCOMPARE(ThemeIconResolver().resolvePath(a), large);
}

void ThemeIconResolverTest::themeThatIsNotThere()
{
    QCOMPARE(found(a, 48), QString());
    writeTheme(QStringLiteral("hicolor"), "Directories=48", "[48]\nSize=48\n");
    write(QStringLiteral("share/icons/hicolor/48/a.png"));
    QCOMPARE(found(a, 48), QStringLiteral("share/icons/hicolor/48/a.png"));
    // A theme that is inherited and not there is passed over.
    writeTheme(QStringLiteral("one"), "Directories=48\nInherits=nowhere,", "[48]\nSize=48\n");
    QCOMPARE(found(a, 48), QStringLiteral("share/icons/hicolor/48/a.png"));
}

void ThemeIconResolverTest::usersIconsComeFirst()
{
    writeTheme(QStringLiteral("one"), "Directories=48", "[48]\nSize=48\n");
    for (const char *folder : {"share/icons", "local/icons", "user/icons", "home/.icons"}) {
        const QString file = QStringLiteral("%1/one/48/a.png").arg(QLatin1String(folder));
        write(file);
        QCOMPARE(found(a, 48), file);
    }
}

void ThemeIconResolverTest::foldersOfATheme()
{
    // What the index does not name is no part of the theme, and what it describes may be absent.
    writeTheme(QStringLiteral("one"), "Directories=48/apps,absent", "[48/apps]\nSize=48\n[32]\nSize=32\n");
    write(QStringLiteral("share/icons/one/32/a.png"));
    QCOMPARE(found(a, 32), QString());
    write(QStringLiteral("share/icons/one/48/apps/a.png"));
    QCOMPARE(found(a, 32), QStringLiteral("share/icons/one/48/apps/a.png"));
}

void ThemeIconResolverTest::iconsOutsideOfThemes()
{
    write(QStringLiteral("share/icons/a.xpm"));
    QCOMPARE(found(a, 48), QStringLiteral("share/icons/a.xpm"));
    write(QStringLiteral("share/icons/a.png"));
    QCOMPARE(found(a, 48), QStringLiteral("share/icons/a.png"));
}

void ThemeIconResolverTest::pixmaps()
{
    write(QStringLiteral("share/pixmaps/a.png"));
    QCOMPARE(found(a, 48), QStringLiteral("share/pixmaps/a.png"));
    writeTheme(QStringLiteral("one"), "Directories=16", "[16]\nSize=16\n");
    write(QStringLiteral("share/icons/one/16/a.xpm"));
    QCOMPARE(found(a, 48), QStringLiteral("share/icons/one/16/a.xpm"));
}

void ThemeIconResolverTest::namesWithASuffix()
{
    write(QStringLiteral("share/pixmaps/a.svg"));
    QCOMPARE(found(QStringLiteral("a.png"), 48), QStringLiteral("share/pixmaps/a.svg"));
    write(QStringLiteral("share/pixmaps/a.png.png"));
    QCOMPARE(found(QStringLiteral("a.png"), 48), QStringLiteral("share/pixmaps/a.png.png"));
    write(QStringLiteral("share/pixmaps/org.example.App.png"));
    QCOMPARE(found(QStringLiteral("org.example.App"), 48),
             QStringLiteral("share/pixmaps/org.example.App.png"));
}

void ThemeIconResolverTest::namesThatAreNone_data()
{
    QTest::addColumn<QString>("name");
    QTest::newRow("empty") << QString();
    QTest::newRow("suffix alone") << QStringLiteral(".png");
    QTest::newRow("unknown") << QStringLiteral("b");
    QTest::newRow("path") << m_folder->filePath(QStringLiteral("share/pixmaps/a.png"));
    QTest::newRow("relative path") << QStringLiteral("../pixmaps/a");
    QTest::newRow("another case") << QStringLiteral("A");
}

void ThemeIconResolverTest::namesThatAreNone()
{
    QFETCH(QString, name);
    write(QStringLiteral("share/pixmaps/a.png"));
    QCOMPARE(found(name, 48), QString());
}

void ThemeIconResolverTest::linksAndFolders()
{
    writeTheme(QStringLiteral("one"), "Directories=48,16", "[48]\nSize=48\n[16]\nSize=16\n");
    const QString target = write(QStringLiteral("share/icons/one/16/a.png"));
    QDir(m_folder->path()).mkpath(QStringLiteral("share/icons/one/48/b.png"));
    QVERIFY(QFile::link(QStringLiteral("/nowhere"),
                        m_folder->filePath(QStringLiteral("share/icons/one/48/a.png"))));
    QCOMPARE(found(a, 48), QStringLiteral("share/icons/one/16/a.png"));
    QCOMPARE(found(QStringLiteral("b"), 48), QString());
    QVERIFY(QFile::link(target, m_folder->filePath(QStringLiteral("share/icons/one/48/c.png"))));
    QCOMPARE(found(QStringLiteral("c"), 48), QStringLiteral("share/icons/one/48/c.png"));
}

void ThemeIconResolverTest::brokenIndex()
{
    write(QStringLiteral("share/icons/one/index.theme"),
          "\x7f"
          "ELF\n");
    write(QStringLiteral("share/icons/one/48/a.png"));
    QCOMPARE(found(a, 48), QString());
    writeTheme(QStringLiteral("one"), "Directories=48", "[48]\nSize=large\nType=Round\nScale=\n");
    QCOMPARE(found(a, 48), QStringLiteral("share/icons/one/48/a.png"));
}

QTEST_GUILESS_MAIN(ThemeIconResolverTest)
#include "themeiconresolver_test.moc"
