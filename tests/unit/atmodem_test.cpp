// SPDX-License-Identifier: LGPL-2.1-or-later
#include "atmodem/atmodem.h"
#include "atmodem/simcard.h"

#include <QtTest/QtTest>

using namespace Corvane::Simulator;

namespace
{

Sim card()
{
    Sim sim;
    sim.imsi = QStringLiteral("244051234567890");
    sim.iccid = QStringLiteral("8935805100000012345");
    sim.provider = QStringLiteral("Elo Mobile");
    sim.numbers = QStringList{QStringLiteral("+358401234567"), QStringLiteral("112")};
    sim.present = true;
    return sim;
}

QString joined(const QStringList &lines)
{
    return lines.join(QLatin1Char('|'));
}

} // namespace

/** The emulated modem: a command line goes in, the lines of the answer come out. */
class AtModemTest : public QObject
{
    Q_OBJECT

private:
    Sim m_sim = card();

    QString ask(AtModem &modem, const char *line) { return joined(modem.answer(QString::fromUtf8(line))); }

private Q_SLOTS:
    void init() { m_sim = card(); }
    void answers_data();
    void answers();
    void answersWithoutCard_data();
    void answersWithoutCard();
    void radio();
    void networkIsAnnounced();
    void operatorNames();
    void pin();
    void puk();
    void newClientFindsEverythingOff();
    void providerNames_data();
    void providerNames();
};

void AtModemTest::answers_data()
{
    QTest::addColumn<QByteArray>("command");
    QTest::addColumn<QString>("answer");
    const auto row = [](const char *command, const char *answer) {
        QTest::newRow(command) << QByteArray(command) << QString::fromUtf8(answer);
    };
    row("", "");
    row("hello", "ERROR");
    row("AT", "OK");
    row("ATE0", "OK");
    row("AT+UNKNOWN=1,2", "OK");
    row("at+cgmi", "Corvane|OK");
    row("AT+CGSN", "358240051111101|OK");
    row("AT+CGMM;+CGMR", "Emulated modem|1.0|OK");
    row("AT+X=\"a;b\";+CGMR", "1.0|OK");
    row("AT+SIMSTATE?", "+USIMSTATE: 1|OK");
    row("AT+CPIN?", "+CPIN: READY|OK");
    row("AT+CPIN=\"1234\"", "+CME ERROR: 3");
    row("AT+CPINR", "+CPINR: SIM PIN,3,3|+CPINR: SIM PUK,10,10|OK");
    row("AT+CLCK=\"SC\",2", "+CLCK: 0|OK");
    row("AT+CLCK=\"FD\",2", "+CLCK: 0|OK");
    row("AT+CIMI", "244051234567890|OK");
    row("AT+CFUN?", "+CFUN: 0|OK");
    row("AT+CFUN=9", "+CME ERROR: 3");
    // A command that fails ends the line.
    row("AT+CFUN=9;+CGMR", "+CME ERROR: 3");
    row("AT+CREG=?", "+CREG: (0-2)|OK");
    row("AT+CREG?", "+CREG: 0,0|OK");
    row("AT+CGREG?", "+CGREG: 0,0|OK");
    row("AT+COPS?", "+COPS: 0|OK");
    row("AT+CGATT?", "+CGATT: 0|OK");
    row("AT+CGATT=1", "+CME ERROR: 30");
    row("AT+CGDCONT=?", "+CGDCONT: (1-4),\"IP\",,,(0-2),(0-4)|OK");
    row("AT+CSQ", "+CSQ: 25,99|OK");
    // Number of the card: its file, then its content.
    row("AT+CRSM=192,12258", "+CRSM: 144,0,\"0000000A2FE2040000000001020000\"|OK");
    row("AT+CRSM=176,12258,0,0,10", "+CRSM: 144,0,\"985308150000002143F5\"|OK");
    row("AT+CRSM=176,12258,0,8,2", "+CRSM: 144,0,\"43F5\"|OK");
    row("AT+CRSM=176,12258,0,8,3", "+CRSM: 103,0|OK");
    row("AT+CRSM=176,12258,-1,0,3", "+CRSM: 103,0|OK");
    row("AT+CRSM=178,12258,1,4,10", "+CRSM: 109,0|OK");
    // Own numbers.
    row("AT+CRSM=192,28480", "+CRSM: 144,0,\"0000001C6F4004000000000102010E\"|OK");
    row("AT+CRSM=178,28480,1,4,14", "+CRSM: 144,0,\"0791534810325476FFFFFFFFFFFF\"|OK");
    row("AT+CRSM=178,28480,2,4,14", "+CRSM: 144,0,\"038111F2FFFFFFFFFFFFFFFFFFFF\"|OK");
    row("AT+CRSM=178,28480,3,4,14", "+CRSM: 106,131|OK");
    row("AT+CRSM=178,28480,0,4,14", "+CRSM: 106,131|OK");
    row("AT+CRSM=178,28480,1,4,15", "+CRSM: 103,0|OK");
    // Provider.
    row("AT+CRSM=176,28486,0,0,17", "+CRSM: 144,0,\"00456C6F204D6F62696C65FFFFFFFFFFFF\"|OK");
    row("AT+CRSM=176,28589,0,0,4", "+CRSM: 144,0,\"00000002\"|OK");
    row("AT+CRSM=192,9999", "+CRSM: 106,130|OK");
    row("AT+CRSM=nonsense", "+CRSM: 106,130|OK");
}

void AtModemTest::answers()
{
    QFETCH(QByteArray, command);
    AtModem modem(m_sim, 1);
    QTEST(ask(modem, command.constData()), "answer");
}

void AtModemTest::answersWithoutCard_data()
{
    QTest::addColumn<QByteArray>("command");
    QTest::addColumn<QString>("answer");
    QTest::newRow("state") << QByteArray("AT+SIMSTATE?") << QStringLiteral("+USIMSTATE: 0|OK");
    for (const char *command : {"AT+CPIN?", "AT+CIMI", "AT+CRSM=192,12258", "AT+CPIN=\"1234\""})
        QTest::newRow(command) << QByteArray(command) << QStringLiteral("+CME ERROR: 10");
    QTest::newRow("registration") << QByteArray("AT+CFUN=1;+CREG?") << QStringLiteral("+CREG: 0,0|OK");
}

void AtModemTest::answersWithoutCard()
{
    QFETCH(QByteArray, command);
    Sim empty;
    AtModem modem(empty, 0);
    QTEST(ask(modem, command.constData()), "answer");
}

void AtModemTest::radio()
{
    AtModem modem(m_sim, 0);
    QCOMPARE(ask(modem, "AT+CREG=2"), QStringLiteral("OK"));
    // What a command leads to comes after its result.
    QCOMPARE(ask(modem, "AT+CFUN=1"), QStringLiteral("OK|+CREG: 1,\"1A2B\",\"00C3D4E0\",7"));
    QCOMPARE(ask(modem, "AT+CREG?"), QStringLiteral("+CREG: 2,1,\"1A2B\",\"00C3D4E0\",7|OK"));
    QCOMPARE(ask(modem, "AT+CGATT?"), QStringLiteral("+CGATT: 1|OK"));
    QCOMPARE(ask(modem, "AT+CGATT=1"), QStringLiteral("OK"));
    QVERIFY(modem.isRadioOn());
    QCOMPARE(ask(modem, "AT+CFUN=4"), QStringLiteral("OK|+CREG: 0"));
    QVERIFY(!modem.isRadioOn());
}

void AtModemTest::networkIsAnnounced()
{
    QStringList announced;
    AtModem modem(m_sim, 0);
    modem.setAnnouncer([&](const QString &line) { announced << line; });
    ask(modem, "AT+CREG=1;+CGREG=1;+CFUN=1");
    modem.setNetwork(AtModem::Roaming);
    modem.setNetwork(AtModem::Roaming);
    modem.setNetwork(AtModem::Denied);
    QCOMPARE(joined(announced), QStringLiteral("+CREG: 5|+CGREG: 5|+CREG: 3|+CGREG: 3"));
}

void AtModemTest::operatorNames()
{
    AtModem modem(m_sim, 0);
    ask(modem, "AT+CFUN=1");
    QCOMPARE(ask(modem, "AT+COPS=3,0;+COPS?"), QStringLiteral("+COPS: 0,0,\"Elo Mobile\",7|OK"));
    QCOMPARE(ask(modem, "AT+COPS=3,2;+COPS?"), QStringLiteral("+COPS: 0,2,\"24405\",7|OK"));
    QCOMPARE(ask(modem, "AT+COPS=?"),
             QStringLiteral("+COPS: (2,\"Elo Mobile\",\"Elo Mobile\",\"24405\",7),,(0-4),(0,2)|OK"));
}

void AtModemTest::pin()
{
    QStringList announced;
    AtModem modem(m_sim, 0);
    modem.setAnnouncer([&](const QString &line) { announced << line; });
    m_sim.pin = QStringLiteral("pin");
    modem.cardChanged();
    QCOMPARE(joined(announced), QStringLiteral("+USIMSTATE: 1"));
    QCOMPARE(m_sim.pin, QStringLiteral("pin"));
    QCOMPARE(ask(modem, "AT+CPIN?"), QStringLiteral("+CPIN: SIM PIN|OK"));
    QCOMPARE(ask(modem, "AT+CLCK=\"SC\",2"), QStringLiteral("+CLCK: 1|OK"));
    QCOMPARE(ask(modem, "AT+CIMI"), QStringLiteral("+CME ERROR: 11"));
    QVERIFY(ask(modem, "AT+CRSM=176,12258,0,0,10").startsWith(QLatin1String("+CRSM: 144,0,")));
    QCOMPARE(ask(modem, "AT+CRSM=178,28480,1,4,14"), QStringLiteral("+CRSM: 105,130|OK"));
    QCOMPARE(ask(modem, "AT+CFUN=1;+CREG?"), QStringLiteral("+CREG: 0,0|OK"));
    QCOMPARE(ask(modem, "AT+CPIN=\"0000\""), QStringLiteral("+CME ERROR: 16"));
    QCOMPARE(ask(modem, "AT+CPINR"), QStringLiteral("+CPINR: SIM PIN,2,3|+CPINR: SIM PUK,10,10|OK"));
    QCOMPARE(ask(modem, "AT+CREG=1;+CPIN=\"1234\""),
             QStringLiteral("OK|+USIMSTATE: 0|+USIMSTATE: 1|+CREG: 1"));
    QCOMPARE(ask(modem, "AT+CIMI"), QStringLiteral("244051234567890|OK"));
    // Without power the card forgets that it was told.
    modem.reset();
    QCOMPARE(m_sim.pin, QStringLiteral("pin"));
}

void AtModemTest::puk()
{
    AtModem modem(m_sim, 0);
    m_sim.pin = QStringLiteral("pin");
    modem.cardChanged();
    for (int i = 0; i < 3; ++i)
        QCOMPARE(ask(modem, "AT+CPIN=\"0\""), QStringLiteral("+CME ERROR: 16"));
    QCOMPARE(m_sim.pin, QStringLiteral("puk"));
    QCOMPARE(ask(modem, "AT+CPIN?"), QStringLiteral("+CPIN: SIM PUK|OK"));
    QCOMPARE(ask(modem, "AT+CIMI"), QStringLiteral("+CME ERROR: 12"));
    QCOMPARE(ask(modem, "AT+CPIN=\"1234\""), QStringLiteral("+CME ERROR: 16"));
    QCOMPARE(ask(modem, "AT+CPINR"), QStringLiteral("+CPINR: SIM PIN,0,3|+CPINR: SIM PUK,9,10|OK"));
    QCOMPARE(ask(modem, "AT+CPIN=\"12345678\",\"4321\""), QStringLiteral("OK|+USIMSTATE: 0|+USIMSTATE: 1"));
    modem.reset();
    QVERIFY(ask(modem, "AT+CPIN=\"4321\"").startsWith(QLatin1String("OK")));
}

void AtModemTest::newClientFindsEverythingOff()
{
    QStringList announced;
    AtModem modem(m_sim, 0);
    modem.setAnnouncer([&](const QString &line) { announced << line; });
    ask(modem, "AT+CREG=1;+CFUN=1");
    modem.reset();
    modem.setNetwork(AtModem::Roaming);
    QCOMPARE(joined(announced), QString());
    QCOMPARE(ask(modem, "AT+CFUN?;+CREG?"), QStringLiteral("+CFUN: 0|+CREG: 0,0|OK"));
    QCOMPARE(m_sim.pin, QStringLiteral("none"));
}

void AtModemTest::providerNames_data()
{
    QTest::addColumn<QString>("name");
    QTest::addColumn<QByteArray>("content");
    QTest::newRow("none") << QString() << QByteArray();
    QTest::newRow("plain") << QStringLiteral("Elo") << QByteArray("00456c6fffffffffffffffffffffffffff");
    QTest::newRow("other letters") << QStringLiteral("\u00c4_")
                                   << QByteArray("008000c4005fffffffffffffffffffffff");
    QTest::newRow("long") << QStringLiteral("abcdefghijklmnopq")
                          << QByteArray("006162636465666768696a6b6c6d6e6f7071");
}

void AtModemTest::providerNames()
{
    QFETCH(QString, name);
    QFETCH(QByteArray, content);
    m_sim.provider = name;
    const auto files = filesOf(m_sim);
    const auto found = files.find(0x6f46);
    QCOMPARE(found != files.end(), !content.isEmpty());
    if (found != files.end())
        QCOMPARE(found->second.records.first().toHex(), content);
}

QTEST_APPLESS_MAIN(AtModemTest)
#include "atmodem_test.moc"
