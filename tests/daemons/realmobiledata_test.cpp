// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "ofonobus.h"
#include "phone.h"
#include "signalsequence.h"
#include "waiting.h"

#include <corvanemdm/connectivitysettings.h>

#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::ConnectivitySettings;
using AccessPoint = ConnectivitySettings::MobileNetworkAccessPointSettings;
using Technologies = ConnectivitySettings::CellularTechnologies;

namespace
{

const QString Ofono = QStringLiteral("org.ofono");
const QString Connman = QStringLiteral("net.connman");
const QString Imsi = QStringLiteral("244051234567890");
const QString OtherImsi = QStringLiteral("262021234567891");
const QString Modem = QStringLiteral("/ril_0");
const QString ServicePath = QStringLiteral("/net/connman/service/cellular_244051234567890_context1");

/** Oddities of the real oFono: it has these two for multimedia messages alone. */
const QStringList &messageWarnings()
{
    static const QStringList warnings{
        QStringLiteral("Unable to set message center for the given IMSI: \"244051234567890\""),
        QStringLiteral("Unable to set message proxy for the given IMSI: \"244051234567890\"")};
    return warnings;
}

AccessPoint accessPoint(const char *apn)
{
    AccessPoint point;
    point.name = QStringLiteral("Company");
    point.accessPointName = QLatin1String(apn);
    point.username = QStringLiteral("user");
    point.password = QStringLiteral("secret");
    point.authenticationMethod = AccessPoint::AuthenticationPap;
    return point;
}

/** Whether ConnMan has made a network of the context. */
bool hasService()
{
    const QDBusMessage reply = QDBusConnection::systemBus().call(QDBusMessage::createMethodCall(
        Connman, ServicePath, QStringLiteral("net.connman.Service"), QStringLiteral("GetProperties")));
    return reply.type() == QDBusMessage::ReplyMessage;
}

} // namespace

/** Mobile data over the real oFono and the real ConnMan, with no simulated service in between. */
class RealMobileDataTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void init();
    void cleanup();

    void modemsAndSims();
    void radioTechnologies();
    void accessPoints();
    void connectsAndDisconnects();
    void writesWhileConnected();
    void flightMode_data();
    void flightMode();
    void restarts_data();
    void restarts();

private:
    Phone m_phone;
    std::unique_ptr<MessageLog> m_log;
};

void RealMobileDataTest::initTestCase()
{
    m_log = std::make_unique<MessageLog>();
    // Without an access point name there is no network, and a first write has none to look at.
    ConnectivitySettings settings;
    QVERIFY(!settings.setAccessPointSettings(Imsi, accessPoint("internet.elo")));
    QCOMPARE(m_log->takeWarnings(),
             QStringList(QStringLiteral("Unable to find network service: \"%1\" of type: \"cellular\" from "
                                        "IMSI: \"%2\"")
                             .arg(ServicePath, Imsi))
                 + messageWarnings());
    QVERIFY(waitUntil(hasService));
}

void RealMobileDataTest::init()
{
    m_log = std::make_unique<MessageLog>();
}

void RealMobileDataTest::cleanup()
{
    const QStringList warnings = m_log->takeWarnings();
    m_log.reset();
    QCOMPARE(warnings.join(QLatin1Char(0x0a)), QString());
}

void RealMobileDataTest::modemsAndSims()
{
    const ConnectivitySettings settings;
    QCOMPARE(settings.modemPaths(), (QStringList{Modem, QStringLiteral("/ril_1")}));
    QCOMPARE(settings.modemSimImsi(Modem), Imsi);
    QCOMPARE(settings.mobileNetworkImsis(), (QStringList{Imsi, OtherImsi}));
}

void RealMobileDataTest::radioTechnologies()
{
    ConnectivitySettings settings;
    QCOMPARE(settings.supportedCellularTechnologies(Modem),
             (QVector<Technologies>{Technologies(1), Technologies(3), Technologies(7)}));
    QCOMPARE(int(settings.selectedCellularTechnologies(Modem)), 0);
    // The driver for emulated modems leaves the setting out, which oFono tells in its own words.
    QVERIFY(!settings.selectCellularTechnologies(Modem, Technologies(3)));
    QCOMPARE(m_log->takeWarnings().join(QLatin1Char('\n')),
             QStringLiteral("Unable to set the preferred radio technology: \"Implementation not provided\""));
    QCOMPARE(int(settings.selectedCellularTechnologies(Modem)), 0);
}

void RealMobileDataTest::accessPoints()
{
    ConnectivitySettings settings;
    const auto read = [&settings] {
        return settings.accessPointSettings(Imsi).value(AccessPoint::Internet);
    };
    AccessPoint point = read();
    QCOMPARE(point.name, QStringLiteral("Company"));
    QCOMPARE(point.accessPointName, QStringLiteral("internet.elo"));
    QCOMPARE(point.username, QStringLiteral("user"));
    QCOMPARE(point.password, QStringLiteral("secret"));
    QCOMPARE(int(point.protocol), int(AccessPoint::ProtocolIp));
    QCOMPARE(int(point.authenticationMethod), int(AccessPoint::AuthenticationPap));

    // Not so the last one: this oFono knows no "any".
    point.authenticationMethod = AccessPoint::AuthenticationAny;
    point.protocol = AccessPoint::ProtocolDual;
    point.name = QStringLiteral("Other");
    QVERIFY(!settings.setAccessPointSettings(Imsi, point));
    QCOMPARE(m_log->takeWarnings(),
             QStringList(QStringLiteral("Unable to set protocol for the given IMSI: \"244051234567890\""))
                 + messageWarnings());
    const AccessPoint written = read();
    QCOMPARE(written.name, QStringLiteral("Other"));
    QCOMPARE(int(written.protocol), int(AccessPoint::ProtocolDual));
    QCOMPARE(int(written.authenticationMethod), int(AccessPoint::AuthenticationPap));
    settings.setAccessPointSettings(Imsi, accessPoint("internet.elo"));
    m_log->takeWarnings();

    // Our plug-in has made it the SIM for mobile data.
    QCOMPARE(OfonoBus::answer("/", OfonoBus::modemManagerInterface, "GetDefaultDataSim"), Imsi);
    settings.accessPointSettings(OtherImsi);
    QCOMPARE(OfonoBus::answer("/", OfonoBus::modemManagerInterface, "GetDefaultDataSim"), OtherImsi);
}

void RealMobileDataTest::connectsAndDisconnects()
{
    ConnectivitySettings settings;
    const auto isActive = [] {
        return OfonoBus::properties("/ril_0/context1", "org.ofono.ConnectionContext")
            .value(QStringLiteral("Active"))
            .toBool();
    };
    QVERIFY(!settings.isConnectedToMobileNetwork(Imsi));
    QVERIFY(settings.disconnectFromMobileNetwork(Imsi));
    QVERIFY(settings.connectToMobileNetwork(Imsi));
    // ConnMan takes the choice only for a network that was connected to before; then it makes the same
    // itself.
    const QString refused = QStringLiteral("Unable to set auto connect: \"Invalid service\"");
    QCOMPARE(m_log->takeWarnings(), (QStringList{refused, refused}));
    QVERIFY(settings.isConnectedToMobileNetwork(Imsi));
    QVERIFY(isActive());
    // "Already connected", in ConnMan's own words.
    QVERIFY(settings.connectToMobileNetwork(Imsi));
    QCOMPARE(m_log->takeInfos().last(),
             QStringLiteral("Already connected to network via IMSI: \"244051234567890\""));

    QVERIFY(settings.disconnectFromMobileNetwork(Imsi));
    QVERIFY(waitUntil([&] { return !settings.isConnectedToMobileNetwork(Imsi); }));
    QVERIFY(waitUntil([&] { return !isActive(); }));
    QVERIFY(settings.disconnectFromMobileNetwork(Imsi));
    QCOMPARE(m_log->takeInfos().last(),
             QStringLiteral("Already disconnected from network via IMSI: \"244051234567890\""));
}

void RealMobileDataTest::writesWhileConnected()
{
    ConnectivitySettings settings;
    QVERIFY(settings.connectToMobileNetwork(Imsi));
    // oFono refuses to change a context in use.
    QVERIFY(!settings.setAccessPointSettings(Imsi, accessPoint("company.elo")));
    QCOMPARE(m_log->takeWarnings(), messageWarnings());
    QCOMPARE(settings.accessPointSettings(Imsi).value(AccessPoint::Internet).accessPointName,
             QStringLiteral("company.elo"));
    QVERIFY(waitUntil([&] { return settings.isConnectedToMobileNetwork(Imsi); }));
    QVERIFY(settings.disconnectFromMobileNetwork(Imsi));
    m_log->takeWarnings();
}

void RealMobileDataTest::flightMode_data()
{
    QTest::addColumn<int>("mode");
    QTest::newRow("D-Bus") << int(ConnectivitySettings::DBusMode);
    QTest::newRow("network manager") << int(ConnectivitySettings::NetworkManagerMode);
}

void RealMobileDataTest::flightMode()
{
    QFETCH(int, mode);
    ConnectivitySettings settings{ConnectivitySettings::Mode(mode)};
    SignalSequence seen(&settings);
    const auto isOnline = [] {
        return OfonoBus::properties("/ril_0", OfonoBus::modemInterface)
            .value(QStringLiteral("Online"))
            .toBool();
    };
    const QString changed = QStringLiteral("flightModeEnabledChanged()");
    // In one mode the request itself is told of as well.
    const int announcements = mode == ConnectivitySettings::DBusMode ? 2 : 1;
    for (const bool wanted : {true, false}) {
        settings.setFlightModeEnabled(wanted);
        QVERIFY(waitUntil([&] { return seen.signalsSeen().filter(changed).size() == announcements; }));
        QCOMPARE(settings.flightModeEnabled(), wanted);
        QVERIFY(waitUntil([&] { return isOnline() == !wanted; }));
        QVERIFY(waitUntil([&] { return hasService() == !wanted; }));
        seen.take();
    }
}

void RealMobileDataTest::restarts_data()
{
    QTest::addColumn<QString>("daemon");
    QTest::newRow("oFono") << Ofono;
    QTest::newRow("ConnMan") << Connman;
}

void RealMobileDataTest::restarts()
{
    QFETCH(QString, daemon);
    ConnectivitySettings settings;
    m_phone.stopService(daemon);
    QVERIFY(!settings.connectToMobileNetwork(Imsi));
    const QStringList warnings = m_log->takeWarnings();
    QVERIFY(!warnings.isEmpty());
    // ConnMan takes the modems' power along when it goes.
    m_phone.startService(daemon);
    QVERIFY(waitUntil(hasService));
    QVERIFY(settings.connectToMobileNetwork(Imsi));
    QVERIFY(settings.isConnectedToMobileNetwork(Imsi));
    QVERIFY(settings.disconnectFromMobileNetwork(Imsi));
    QVERIFY(!settings.accessPointSettings(Imsi).isEmpty());
}

QTEST_GUILESS_MAIN(RealMobileDataTest)

#include "realmobiledata_test.moc"
