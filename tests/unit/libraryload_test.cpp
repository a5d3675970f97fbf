// SPDX-License-Identifier: LGPL-2.1-or-later
#include <QtCore/QLibrary>
#include <QtCore/QMetaType>
#include <QtDBus/QDBusMetaType>
#include <QtTest/QtTest>

class LibraryLoadTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void loadingRegistersTheTriggerMap()
    {
        const char *const name = "Maemo::Timed::Event::Triggers";
        QCOMPARE(QMetaType::type(name), int(QMetaType::UnknownType));

        QLibrary library(QStringLiteral(LIBRARY_FILE));
        QVERIFY2(library.load(), qPrintable(library.errorString()));

        const int type = QMetaType::type(name);
        QVERIFY(type != QMetaType::UnknownType);
        QCOMPARE(QDBusMetaType::typeToSignature(type), "a{uu}");
    }
};

QTEST_GUILESS_MAIN(LibraryLoadTest)
#include "libraryload_test.moc"
