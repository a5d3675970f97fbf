// SPDX-License-Identifier: LGPL-2.1-or-later
#include "choicefile.h"
#include "simslots.h"

#include <QtCore/QFile>
#include <QtCore/QTemporaryDir>
#include <QtTest/QtTest>

using namespace VeldMobile;

namespace
{

Modem modemWith(const char *imsi)
{
    Modem modem;
    modem.simPresent = true;
    modem.imsi = imsi;
    modem.providerIsSettled = true;
    return modem;
}

SimSlots dualSim()
{
    SimSlots phone;
    phone.modems["/a_10"] = modemWith("333");
    phone.modems["/a_9"] = modemWith("222");
    return phone;
}

} // namespace

/** What the oFono plug-in makes of modems and choices. */
class SimSlotsTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void slotsAreInNaturalOrder();
    void defaultSim_data();
    void defaultSim();
    void imsiWaitsForTheProvider();
    void enablingKeepsWhatIsAway();
    void choiceIsStored();
    void choiceOfNothingIsRead();
    void brokenFileIsAProblem();
};

void SimSlotsTest::slotsAreInNaturalOrder()
{
    const SimSlots::View view = dualSim().view();
    QCOMPARE(view.availableModems, (std::vector<std::string>{"/a_9", "/a_10"}));
    QCOMPARE(view.enabledModems, view.availableModems);
    QCOMPARE(view.presentSims, (std::vector<bool>{true, true}));
    QVERIFY(!view.ready);
}

void SimSlotsTest::defaultSim_data()
{
    QTest::addColumn<QByteArray>("chosen");
    QTest::addColumn<QByteArray>("disabled");
    QTest::addColumn<QByteArray>("expected");
    QTest::newRow("none chosen") << QByteArray() << QByteArray() << QByteArray("222");
    QTest::newRow("chosen") << QByteArray("333") << QByteArray() << QByteArray("333");
    QTest::newRow("chosen is away") << QByteArray("444") << QByteArray() << QByteArray("222");
    QTest::newRow("first is disabled") << QByteArray() << QByteArray("/a_9") << QByteArray("333");
    QTest::newRow("chosen is disabled") << QByteArray("222") << QByteArray("/a_9") << QByteArray("333");
}

void SimSlotsTest::defaultSim()
{
    QFETCH(QByteArray, chosen);
    QFETCH(QByteArray, disabled);
    QFETCH(QByteArray, expected);
    SimSlots phone = dualSim();
    phone.choice.voiceSim = chosen.toStdString();
    phone.choice.dataSim = chosen.toStdString();
    if (!disabled.isEmpty())
        phone.choice.disabledModems.insert(disabled.toStdString());
    QCOMPARE(phone.view().defaultVoiceSim, expected.toStdString());
    QCOMPARE(phone.view().defaultDataSim, expected.toStdString());
}

void SimSlotsTest::imsiWaitsForTheProvider()
{
    SimSlots phone = dualSim();
    phone.find("/a_9")->providerIsSettled = false;
    // It can be chosen before it is announced.
    QVERIFY(phone.hasSim("222"));
    QCOMPARE(phone.view().defaultVoiceSim, std::string("333"));
    phone.find("/a_9")->forgetSim();
    QVERIFY(!phone.hasSim("222"));
    QVERIFY(!phone.hasSim(""));
    QCOMPARE(phone.view().presentSims, (std::vector<bool>{false, true}));
}

void SimSlotsTest::enablingKeepsWhatIsAway()
{
    SimSlots phone = dualSim();
    phone.choice.disabledModems = {"/away", "/a_9"};
    QCOMPARE(phone.choiceWithEnabled({"/a_9"}).disabledModems, (std::set<std::string>{"/a_10", "/away"}));
}

void SimSlotsTest::choiceIsStored()
{
    const QTemporaryDir folder;
    const std::string name = folder.filePath(QStringLiteral("choice")).toStdString();
    Choice choice;
    choice.voiceSim = "222";
    choice.disabledModems = {"/a;b", "/c"};
    QCOMPARE(writeChoice(name, choice), std::string());
    std::string problem;
    QVERIFY(readChoice(name, problem) == choice);
    QCOMPARE(problem, std::string());
    QCOMPARE(QFile::permissions(QString::fromStdString(name))
                 & (QFile::ReadGroup | QFile::ReadOther | QFile::WriteOther),
             QFile::Permissions());
    QVERIFY(!writeChoice(folder.filePath(QStringLiteral("none/choice")).toStdString(), choice).empty());
}

void SimSlotsTest::choiceOfNothingIsRead()
{
    std::string problem;
    QVERIFY(readChoice("/nonexistent/choice", problem) == Choice());
    QCOMPARE(problem, std::string());
}

void SimSlotsTest::brokenFileIsAProblem()
{
    const QTemporaryDir folder;
    QFile file(folder.filePath(QStringLiteral("choice")));
    QVERIFY(file.open(QIODevice::WriteOnly));
    file.write("nonsense\n");
    file.close();
    std::string problem;
    QVERIFY(readChoice(file.fileName().toStdString(), problem) == Choice());
    QVERIFY(!problem.empty());
}

QTEST_APPLESS_MAIN(SimSlotsTest)
#include "simslots_test.moc"
