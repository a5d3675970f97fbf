// SPDX-License-Identifier: LGPL-2.1-or-later
#include <livetable.h>
#include <progress.h>
#include <suggestion.h>
#include <table.h>

#include <QtTest/QtTest>

using namespace Corvane::Agent;

class MdmctlPartsTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void suggestions_data();
    void suggestions();
    void suggestionsThatWouldMislead_data();
    void suggestionsThatWouldMislead();
    void tableIsAligned();
    void tableWithCellsOfSeveralLines();
    void tableWithoutEmptyColumns();
    void tableWithoutControlCharacters();
    void barFitsTheWidth_data();
    void barFitsTheWidth();
    void liveTableIsReplacedInPlace();
};

void MdmctlPartsTest::liveTableIsReplacedInPlace()
{
    const QString two = QStringLiteral("a\nb");
    QCOMPARE(LiveTable::replacement(QString(), two), QStringLiteral("a\nb\n"));
    QCOMPARE(LiveTable::replacement(two, QStringLiteral("c")), QStringLiteral("\x1b[2A\x1b[Jc\n"));
    QCOMPARE(LiveTable::replacement(QStringLiteral("c"), two), QStringLiteral("\x1b[1A\x1b[Ja\nb\n"));
}

void MdmctlPartsTest::suggestions_data()
{
    QTest::addColumn<QString>("given");
    QTest::addColumn<QString>("expected");

    const QString all = QStringLiteral(R"(must be one of "block", "allow", "hangup")");
    QTest::newRow("left out") << "blok"
                              << R"(did you mean "block"?)";
    QTest::newRow("swapped") << "alolw"
                             << R"(did you mean "allow"?)";
    QTest::newRow("capital") << "Block"
                             << R"(did you mean "block"?)";
    QTest::newRow("cut off") << "hang"
                             << R"(did you mean "hangup"?)";
    QTest::newRow("two slips in a long word") << "hamgop"
                                              << R"(did you mean "hangup"?)";
    QTest::newRow("something else") << "deny" << all;
    QTest::newRow("one letter") << "x" << all;
    QTest::newRow("nothing") << "" << all;
}

void MdmctlPartsTest::suggestions()
{
    QFETCH(QString, given);
    QTEST(suggestion(given, {QStringLiteral("block"), QStringLiteral("allow"), QStringLiteral("hangup")}),
          "expected");
}

void MdmctlPartsTest::suggestionsThatWouldMislead_data()
{
    QTest::addColumn<QString>("given");
    QTest::addColumn<QString>("expected");

    const QString all = QStringLiteral(R"(must be one of "2g", "ip", "ipv6", "imap4")");
    QTest::newRow("another digit") << "imap5" << all;
    QTest::newRow("short, another digit") << "5g" << all;
    QTest::newRow("short") << "ipx" << all;
    QTest::newRow("short, cut off") << "2" << all;
    QTest::newRow("short, capital") << "2G"
                                    << R"(did you mean "2g"?)";
    QTest::newRow("digit cut off") << "imap"
                                   << R"(did you mean "imap4"?)";
    QTest::newRow("slip beside the digit") << "imp4"
                                           << R"(did you mean "imap4"?)";
}

void MdmctlPartsTest::suggestionsThatWouldMislead()
{
    QFETCH(QString, given);
    QTEST(suggestion(
              given,
              {QStringLiteral("2g"), QStringLiteral("ip"), QStringLiteral("ipv6"), QStringLiteral("imap4")}),
          "expected");
}

void MdmctlPartsTest::tableIsAligned()
{
    Table table({QStringLiteral("A"), QStringLiteral("LONG"), QStringLiteral("C")});
    table.addRow({QStringLiteral("wide cell"), QStringLiteral("x"), QStringLiteral("y")});
    table.addRow({QStringLiteral("n"), QString(), QString()});
    QCOMPARE(table.toString(),
             QStringLiteral("A          LONG  C\n"
                            "wide cell  x     y\n"
                            "n"));
}

void MdmctlPartsTest::tableWithCellsOfSeveralLines()
{
    Table table({QStringLiteral("A"), QStringLiteral("B"), QStringLiteral("C")});
    table.addRow({QStringLiteral("1"), QStringLiteral("2\n33"), QStringLiteral("4\n5\n6")});
    QCOMPARE(table.toString(),
             QStringLiteral("A  B   C\n"
                            "1  2   4\n"
                            "   33  5\n"
                            "       6"));
}

void MdmctlPartsTest::tableWithoutEmptyColumns()
{
    Table table({QStringLiteral("A"), QStringLiteral("B"), QStringLiteral("C")});
    table.addRow({QStringLiteral("1"), QString(), QStringLiteral("3")});
    QCOMPARE(table.toString(), QStringLiteral("A  C\n1  3"));
}

void MdmctlPartsTest::tableWithoutControlCharacters()
{
    Table table({QStringLiteral("A")});
    table.addRow({QStringLiteral("a\x1b[2Jb\tc\nd")});
    QCOMPARE(table.toString(), QString::fromUtf8("A\na�[2Jb�c\nd"));
}

void MdmctlPartsTest::barFitsTheWidth_data()
{
    QTest::addColumn<int>("percent");
    QTest::addColumn<int>("width");
    QTest::addColumn<QString>("expected");

    QTest::newRow("begin") << 0 << 20 << "Get [---------]   0%";
    QTest::newRow("half") << 50 << 20 << "Get [####-----]  50%";
    QTest::newRow("end") << 100 << 20 << "Get [#########] 100%";
    QTest::newRow("no room for a bar") << 50 << 12 << "Get  50%";
    QTest::newRow("no room for the label") << 50 << 5 << "  50%";
    QTest::newRow("no room") << 50 << 0 << "";
    QTest::newRow("wide") << 50 << 200 << "Get [#########################-------------------------]  50%";
}

void MdmctlPartsTest::barFitsTheWidth()
{
    QFETCH(int, percent);
    QFETCH(int, width);
    QTEST(Progress::bar(QStringLiteral("Get"), percent, width), "expected");
}

QTEST_APPLESS_MAIN(MdmctlPartsTest)
#include "mdmctlparts_test.moc"
