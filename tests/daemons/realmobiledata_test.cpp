// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "ofonobus.h"
#include "phone.h"
#include "signalsequence.h"
#include "waiting.h"

#include <corvanemdm/connectivitysettings.h>
#include <corvanemdm/networkdatacounter.h>

#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtTest/QtTest>

#include <arpa/inet.h>
#include <memory>
#include <net/if.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

using Corvane::Mdm::ConnectivitySettings;
using AccessPoint = ConnectivitySettings::MobileNetworkAccessPointSettings;
using Technologies = ConnectivitySettings::CellularTechnologies;
using Corvane::Mdm::NetworkDataCounter;

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

/** Whether oFono and ConnMan have come to the end of switching mobile data @p on or off. */
bool isCellular(bool on)
{
    for (const char *path : {"/ril_0", "/ril_1"}) {
        if (OfonoBus::properties(path, OfonoBus::modemInterface).value(QStringLiteral("Online")) != on)
            return false;
    }
    const QDBusMessage technology = QDBusConnection::systemBus().call(QDBusMessage::createMethodCall(
        Connman, QStringLiteral("/net/connman/technology/cellular"), QStringLiteral("net.connman.Technology"),
        QStringLiteral("GetProperties")));
    const auto properties = qdbus_cast<QVariantMap>(technology.arguments().value(0));
    return properties.value(QStringLiteral("Powered")) == on && hasService() == on;
}

/** Whether oFono has the context in use. */
bool isActive()
{
    return OfonoBus::properties("/ril_0/context1", "org.ofono.ConnectionContext")
        .value(QStringLiteral("Active"))
        .toBool();
}

/** Sends so many datagrams of a KiB out over mobile data; the network behind it has nobody who minds. */
bool sendDatagrams(int count)
{
    const int sender = socket(AF_INET, SOCK_DGRAM | SOCK_CLOEXEC, 0);
    const int yes = 1;
    bool isSent = setsockopt(sender, SOL_SOCKET, SO_BROADCAST, &yes, sizeof yes) == 0
        && setsockopt(sender, SOL_SOCKET, SO_BINDTODEVICE, "dummy0", sizeof "dummy0") == 0;
    sockaddr_in everybody = {};
    everybody.sin_family = AF_INET;
    everybody.sin_port = htons(9); // discard
    inet_pton(AF_INET, "198.51.100.255", &everybody.sin_addr);
    const QByteArray datagram(1024, 'x');
    for (int sent = 0; isSent && sent < count; ++sent) {
        isSent = sendto(sender, datagram.constData(), std::size_t(datagram.size()), 0,
                        reinterpret_cast<const sockaddr *>(&everybody), sizeof everybody)
            == datagram.size();
    }
    close(sender);
    return isSent;
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
    void countsData();
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
    // Whoever comes next begins without a connection, also when this function has failed.
    if (QTest::currentTestFailed()) {
        for (const QString &daemon : {Ofono, Connman})
            m_phone.startService(daemon);
        ConnectivitySettings().setFlightModeEnabled(false);
    }
    QVERIFY(waitUntil(hasService));
    {
        ConnectivitySettings settings;
        if (settings.isConnectedToMobileNetwork(Imsi))
            settings.disconnectFromMobileNetwork(Imsi);
        QVERIFY(waitUntil([&settings] { return !settings.isConnectedToMobileNetwork(Imsi) && !isActive(); }));
    }
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
    for (const int technologies : {1, 3, 7, 0}) {
        QVERIFY(settings.selectCellularTechnologies(Modem, Technologies(technologies)));
        QCOMPARE(int(settings.selectedCellularTechnologies(Modem)), technologies);
    }
    QCOMPARE(OfonoBus::properties("/ril_0", "org.ofono.RadioSettings")
                 .value(QStringLiteral("TechnologyPreference"))
                 .toString(),
             QStringLiteral("any"));
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
    QVERIFY(!settings.isConnectedToMobileNetwork(Imsi));
    QVERIFY(settings.disconnectFromMobileNetwork(Imsi));
    QVERIFY(settings.connectToMobileNetwork(Imsi));
    // ConnMan takes the choice only for a network that was connected to before; then it makes the same
    // itself.
    const QString refused = QStringLiteral("Unable to set auto connect: \"Invalid service\"");
    QCOMPARE(m_log->takeWarnings(), (QStringList{refused, refused}));
    QVERIFY(settings.isConnectedToMobileNetwork(Imsi));
    QVERIFY(waitUntil(isActive));
    // "Already connected", in ConnMan's own words.
    QVERIFY(settings.connectToMobileNetwork(Imsi));
    QCOMPARE(m_log->takeInfos().last(),
             QStringLiteral("Already connected to network via IMSI: \"244051234567890\""));

    QVERIFY(settings.disconnectFromMobileNetwork(Imsi));
    QVERIFY(waitUntil([&] { return !settings.isConnectedToMobileNetwork(Imsi); }));
    QVERIFY(waitUntil([] { return !isActive(); }));
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

void RealMobileDataTest::countsData()
{
    constexpr int datagrams = 200;
    constexpr int bytesEach = 1024;
    ConnectivitySettings settings;
    NetworkDataCounter counter;
    counter.setUpdateInterval(1);
    counter.setUpdateAccuracy(1);
    quint64 sent = 0;
    int reports = 0;
    connect(&counter, &NetworkDataCounter::counterUpdate, this,
            [&](const NetworkDataCounter::Update &update) {
                if (update.identifier != QLatin1String("cellular_244051234567890_context1")
                    || update.type != NetworkDataCounter::MobileDataHome)
                    return;
                ++reports;
                // Numbers that have not changed are left out.
                if (update.txBytes > 0)
                    sent = update.txBytes;
            });
    counter.setActive(true);
    QVERIFY(counter.active());
    QVERIFY(settings.connectToMobileNetwork(Imsi));
    QVERIFY(waitUntil([&reports] { return reports > 0; }));
    const quint64 before = sent;
    QVERIFY(sendDatagrams(datagrams));
    QVERIFY(waitUntil([&] { return sent >= before + datagrams * bytesEach; }));
    QVERIFY(sent < before + 2 * datagrams * bytesEach);

    counter.resetCounter(ServicePath);
    // From here on it is counted anew; when exactly is ConnMan's affair.
    QVERIFY(waitUntil([&] { return sendDatagrams(1) && sent < datagrams * bytesEach; }));
    QVERIFY(counter.active());
    QVERIFY(settings.disconnectFromMobileNetwork(Imsi));
    counter.setActive(false);
    QVERIFY(!counter.active());
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
    QVERIFY(waitUntil([] { return isCellular(true); }));
    ConnectivitySettings settings{ConnectivitySettings::Mode(mode)};
    SignalSequence seen(&settings);
    const QString changed = QStringLiteral("flightModeEnabledChanged()");
    // In one mode the request itself is told of as well.
    const int announcements = mode == ConnectivitySettings::DBusMode ? 2 : 1;
    for (const bool wanted : {true, false}) {
        settings.setFlightModeEnabled(wanted);
        QVERIFY(waitUntil([&] { return seen.signalsSeen().filter(changed).size() == announcements; }));
        QCOMPARE(settings.flightModeEnabled(), wanted);
        // Who asks for the contrary while they are still at it is not heard.
        QVERIFY2(waitUntil([wanted] { return isCellular(!wanted); }), wanted ? "on" : "off");
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
    // ConnMan takes the modems' power along when it goes, and gives it back one by one.
    m_phone.startService(daemon);
    QVERIFY(waitUntil([] { return isCellular(true); }));
    QVERIFY(settings.connectToMobileNetwork(Imsi));
    QVERIFY(settings.isConnectedToMobileNetwork(Imsi));
    QVERIFY(settings.disconnectFromMobileNetwork(Imsi));
    QVERIFY(!settings.accessPointSettings(Imsi).isEmpty());
}

QTEST_GUILESS_MAIN(RealMobileDataTest)

#include "realmobiledata_test.moc"
