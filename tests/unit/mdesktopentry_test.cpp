// SPDX-License-Identifier: LGPL-2.1-or-later
#include <mlite/mdesktopentry.h>

#include <QtCore/QTemporaryDir>
#include <QtTest/QtTest>

class MDesktopEntryTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void readsWhatListsNeed();
    void nameIsNotTranslated();
    void missingKeys();
    void validity_data();
    void validity();
    void noFile_data();
    void noFile();
    void noDisplay_data();
    void noDisplay();
    void notShowIn_data();
    void notShowIn();

private:
    QString fileWith(const QByteArray &content) const;

    QTemporaryDir m_folder;
};

QString MDesktopEntryTest::fileWith(const QByteArray &content) const
{
    QFile file(m_folder.filePath(QStringLiteral("entry.desktop")));
    if (!file.open(QIODevice::WriteOnly | QIODevice::Truncate) || file.write(content) != content.size())
        qFatal("cannot write %s", qPrintable(file.fileName()));
    return file.fileName();
}

void MDesktopEntryTest::readsWhatListsNeed()
{
    const MDesktopEntry entry(fileWith("# written by hand\n"
                                       "[Desktop Entry]\n"
                                       "Type=Application\n"
                                       "Name=Caf\303\251 \\s Notes\n"
                                       "Exec=notes %U\n"
                                       "Icon=notes\n"
                                       "NoDisplay=true\n"
                                       "NotShowIn=GNOME;X-Meego;\n"
                                       "\n"
                                       "[Desktop Action new]\n"
                                       "Name=New\n"
                                       "Icon=new\n"));
    QVERIFY(entry.isValid());
    QCOMPARE(entry.nameUnlocalized(), QString::fromUtf8("Caf\303\251   Notes"));
    QCOMPARE(entry.icon(), QStringLiteral("notes"));
    QVERIFY(entry.noDisplay());
    QCOMPARE(entry.notShowIn(), QStringList({QStringLiteral("GNOME"), QStringLiteral("X-Meego")}));
}

void MDesktopEntryTest::nameIsNotTranslated()
{
    const QByteArray language = qgetenv("LANGUAGE");
    qputenv("LANGUAGE", "fi");
    const MDesktopEntry entry(
        fileWith("[Desktop Entry]\nType=Application\nName[fi]=Muistio\nName=Notes\nExec=notes\n"));
    qputenv("LANGUAGE", language);
    QCOMPARE(entry.nameUnlocalized(), QStringLiteral("Notes"));
}

void MDesktopEntryTest::missingKeys()
{
    const MDesktopEntry entry(fileWith("[Desktop Entry]\nType=Application\nName=Notes\nExec=notes\n"));
    QVERIFY(entry.isValid());
    QCOMPARE(entry.icon(), QString());
    QVERIFY(!entry.noDisplay());
    QCOMPARE(entry.notShowIn(), QStringList());
}

void MDesktopEntryTest::validity_data()
{
    QTest::addColumn<QByteArray>("content");
    QTest::addColumn<bool>("valid");
    const QByteArray group = "[Desktop Entry]\n";
    QTest::newRow("application") << group + "Type=Application\nName=N\nExec=n\n" << true;
    QTest::newRow("application of the bus") << group + "Type=Application\nName=N\nDBusActivatable=true\n"
                                            << true;
    QTest::newRow("application without a command") << group + "Type=Application\nName=N\n" << false;
    QTest::newRow("application with an empty command")
        << group + "Type=Application\nName=N\nExec=\nDBusActivatable=false\n"
        << false;
    QTest::newRow("folder") << group + "Type=Directory\nName=N\n" << true;
    QTest::newRow("no type") << group + "Name=N\nExec=n\n" << false;
    QTest::newRow("no name") << group + "Type=Application\nExec=n\n" << false;
    QTest::newRow("empty name") << group + "Type=Application\nName=\nExec=n\n" << false;
    QTest::newRow("translated name alone") << group + "Type=Application\nName[fi]=N\nExec=n\n" << false;
    QTest::newRow("name that is no text") << group + "Type=Application\nName=\xff\xfe\nExec=n\n" << false;
    QTest::newRow("another group") << QByteArray("[Entry]\nType=Application\nName=N\nExec=n\n") << false;
    QTest::newRow("no group") << QByteArray("Type=Application\nName=N\nExec=n\n") << false;
    QTest::newRow("no key file") << QByteArray("\x7f"
                                               "ELF\0\1\2",
                                               7)
                                 << false;
    QTest::newRow("empty") << QByteArray() << false;
}

void MDesktopEntryTest::validity()
{
    QFETCH(QByteArray, content);
    QFETCH(bool, valid);
    QCOMPARE(MDesktopEntry(fileWith(content)).isValid(), valid);
}

void MDesktopEntryTest::noFile_data()
{
    QTest::addColumn<QString>("path");
    QVERIFY(QFile::link(QStringLiteral("/nowhere"), m_folder.filePath(QStringLiteral("dangling.desktop"))));
    QTest::newRow("missing") << m_folder.filePath(QStringLiteral("missing.desktop"));
    QTest::newRow("dangling link") << m_folder.filePath(QStringLiteral("dangling.desktop"));
    QTest::newRow("folder") << m_folder.path();
    QTest::newRow("no name") << QString();
}

void MDesktopEntryTest::noFile()
{
    QFETCH(QString, path);
    const MDesktopEntry entry(path);
    QVERIFY(!entry.isValid());
    QCOMPARE(entry.nameUnlocalized(), QString());
    QVERIFY(!entry.noDisplay());
}

void MDesktopEntryTest::noDisplay_data()
{
    QTest::addColumn<QByteArray>("value");
    QTest::addColumn<bool>("hidden");
    QTest::newRow("true") << QByteArray("true") << true;
    QTest::newRow("false") << QByteArray("false") << false;
    QTest::newRow("old spelling") << QByteArray("1") << true;
    QTest::newRow("neither") << QByteArray("yes") << false;
    QTest::newRow("empty") << QByteArray() << false;
}

void MDesktopEntryTest::noDisplay()
{
    QFETCH(QByteArray, value);
    QFETCH(bool, hidden);
    const MDesktopEntry entry(
        fileWith("[Desktop Entry]\nType=Application\nName=N\nExec=n\nNoDisplay=" + value + '\n'));
    QVERIFY(entry.isValid());
    QCOMPARE(entry.noDisplay(), hidden);
}

void MDesktopEntryTest::notShowIn_data()
{
    QTest::addColumn<QByteArray>("value");
    QTest::addColumn<QStringList>("environments");
    const QString meego = QStringLiteral("X-Meego");
    QTest::newRow("one") << QByteArray("X-Meego;") << QStringList(meego);
    QTest::newRow("no separator at the end") << QByteArray("X-Meego") << QStringList(meego);
    QTest::newRow("several") << QByteArray("KDE;X-Meego;") << QStringList({QStringLiteral("KDE"), meego});
    QTest::newRow("another case") << QByteArray("x-meego;") << QStringList(QStringLiteral("x-meego"));
    QTest::newRow("empty") << QByteArray() << QStringList();
}

void MDesktopEntryTest::notShowIn()
{
    QFETCH(QByteArray, value);
    QFETCH(QStringList, environments);
    const MDesktopEntry entry(
        fileWith("[Desktop Entry]\nType=Application\nName=N\nExec=n\nNotShowIn=" + value + '\n'));
    QCOMPARE(entry.notShowIn(), environments);
}

QTEST_GUILESS_MAIN(MDesktopEntryTest)
#include "mdesktopentry_test.moc"
