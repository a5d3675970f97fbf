// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"
#include "waiting.h"

#include <corvanemdm/connectivitysettings.h>

#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::ConnectivitySettings;

namespace
{

const QString Connman = QStringLiteral("net.connman");

} // namespace

/** The real ConnMan, in a phone that has a cable and no Wi-Fi. */
class RealConnmanTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void withoutWlan();
    void flightMode_data();
    void flightMode();
    void flightModeOutlivesTheDaemon();
    void daemonThatIsAway();

private:
    Phone m_phone;
    std::unique_ptr<MessageLog> m_log;
};

void RealConnmanTest::init()
{
    m_log = std::make_unique<MessageLog>();
}

void RealConnmanTest::cleanup()
{
    const QStringList warnings = m_log->takeWarnings();
    m_log.reset();
    QCOMPARE(warnings.join(QLatin1Char('\n')), QString());
}

void RealConnmanTest::withoutWlan()
{
    ConnectivitySettings settings;
    SignalSequence seen(&settings);
    QVERIFY(settings.ready());
    QVERIFY(!settings.wlanEnabled());
    QCOMPARE(m_log->takeWarnings(),
             QStringList(QStringLiteral("Powered property not returned for WLAN technology!")));
    settings.setWlanEnabled(true);
    const QStringList warnings = m_log->takeWarnings();
    QCOMPARE(warnings.size(), 1);
    QVERIFY2(warnings.first().startsWith(
                 QLatin1String("Unable to set the power of the WLAN technology: \"Method")),
             qPrintable(warnings.first()));
    QCOMPARE(seen.take(), QStringList(QStringLiteral("wlanEnabledChanged()")));

    // The other mode waits for Wi-Fi, and tells flight mode all the same.
    ConnectivitySettings mirror(ConnectivitySettings::NetworkManagerMode);
    settings.setFlightModeEnabled(true);
    QVERIFY(waitUntil([&mirror] { return mirror.flightModeEnabled(); }));
    QVERIFY(!mirror.ready());
    QVERIFY(!mirror.wlanEnabled());
    settings.setFlightModeEnabled(false);
    QVERIFY(waitUntil([&mirror] { return !mirror.flightModeEnabled(); }));
}

void RealConnmanTest::flightMode_data()
{
    QTest::addColumn<int>("mode");
    QTest::addColumn<int>("announcements");
    // In one mode the request itself is told of as well.
    QTest::newRow("D-Bus") << int(ConnectivitySettings::DBusMode) << 2;
    QTest::newRow("network manager") << int(ConnectivitySettings::NetworkManagerMode) << 1;
}

void RealConnmanTest::flightMode()
{
    QFETCH(int, mode);
    QFETCH(int, announcements);
    ConnectivitySettings settings{ConnectivitySettings::Mode(mode)};
    SignalSequence seen(&settings);
    for (const bool wanted : {true, false}) {
        settings.setFlightModeEnabled(wanted);
        QVERIFY(seen.waitFor(announcements));
        QCOMPARE(seen.take().count(QStringLiteral("flightModeEnabledChanged()")), announcements);
        QCOMPARE(settings.flightModeEnabled(), wanted);
    }
}

void RealConnmanTest::flightModeOutlivesTheDaemon()
{
    ConnectivitySettings settings;
    settings.setFlightModeEnabled(true);
    m_phone.stopService(Connman);
    m_phone.startService(Connman);
    QVERIFY(settings.flightModeEnabled());
    ConnectivitySettings mirror(ConnectivitySettings::NetworkManagerMode);
    QVERIFY(waitUntil([&mirror] { return mirror.flightModeEnabled(); }));
    mirror.setFlightModeEnabled(false);
    QVERIFY(waitUntil([&mirror] { return !mirror.flightModeEnabled(); }));
    QVERIFY(!settings.flightModeEnabled());
}

void RealConnmanTest::daemonThatIsAway()
{
    ConnectivitySettings settings;
    m_phone.stopService(Connman);
    QVERIFY(!settings.flightModeEnabled());
    QCOMPARE(m_log->takeWarnings(),
             QStringList(QStringLiteral("OfflineMode property not returned for ConnMan!")));
    m_phone.startService(Connman);
    // The same object works again.
    SignalSequence seen(&settings);
    settings.setFlightModeEnabled(true);
    QVERIFY(seen.waitFor(2));
    QVERIFY(settings.flightModeEnabled());
    settings.setFlightModeEnabled(false);
}

QTEST_GUILESS_MAIN(RealConnmanTest)

#include "realconnman_test.moc"
