// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "ofonobus.h"
#include "phone.h"
#include "signalsequence.h"
#include "waiting.h"

#include <corvanemdm/siminfo.h>
#include <corvanemdm/simvoicecallfilter.h>

#include <QtTest/QtTest>

using namespace OfonoBus;
using Corvane::Mdm::SimInfo;
using Corvane::Mdm::SimVoiceCallFilter;

/** oFono as the distribution packages it, on the modems that the phone emulates. */
class StockOfonoTest : public QObject
{
    Q_OBJECT

private:
    Phone m_phone;

private Q_SLOTS:
    void modems();
    void sims_data();
    void sims();
    void registration();
    void contexts();
    void extensionsAreUnknown_data();
    void extensionsAreUnknown();
    void simInfoHasNoStates();
    void voiceCallFilterNeverGetsReady();
};

void StockOfonoTest::modems()
{
    const QDBusMessage reply = call("/", managerInterface, "GetModems");
    QCOMPARE(reply.signature(), QStringLiteral("a(oa{sv})"));
    for (const char *path : {"/ril_0", "/ril_1"}) {
        const auto property = [path](const char *name) {
            return properties(path, modemInterface).value(QLatin1String(name));
        };
        QCOMPARE(property("Powered"), QVariant(true));
        QCOMPARE(property("Online"), QVariant(true));
        QCOMPARE(property("Type").toString(), QStringLiteral("hardware"));
        // Each comes when its driver is done with its questions.
        for (const char *interface : {simInterface, registrationInterface, "org.ofono.RadioSettings",
                                      "org.ofono.ConnectionManager", "org.ofono.VoiceCallManager"}) {
            QVERIFY2(waitUntil([&] {
                         return property("Interfaces").toStringList().contains(QLatin1String(interface));
                     }),
                     interface);
        }
    }
    QVERIFY(waitUntil([] {
        return properties("/ril_1", modemInterface).value(QStringLiteral("Serial"))
            == QLatin1String("358240051111101");
    }));
}

void StockOfonoTest::sims_data()
{
    QTest::addColumn<QByteArray>("path");
    QTest::addColumn<QString>("imsi");
    QTest::addColumn<QString>("iccid");
    QTest::addColumn<QString>("provider");
    QTest::addColumn<QStringList>("numbers");
    QTest::newRow("first") << QByteArray("/ril_0") << QStringLiteral("244051234567890")
                           << QStringLiteral("8935805100000012345") << QStringLiteral("Elo Mobile")
                           << QStringList{QStringLiteral("+358401234567")};
    QTest::newRow("second") << QByteArray("/ril_1") << QStringLiteral("262021234567891")
                            << QStringLiteral("8949020000000067891") << QStringLiteral("Tarn Telecom")
                            << QStringList{QStringLiteral("+4915112345678")};
}

void StockOfonoTest::sims()
{
    QFETCH(QByteArray, path);
    const QVariantMap sim = properties(path, simInterface);
    QCOMPARE(sim.value(QStringLiteral("Present")), QVariant(true));
    QTEST(sim.value(QStringLiteral("SubscriberIdentity")).toString(), "imsi");
    QTEST(sim.value(QStringLiteral("CardIdentifier")).toString(), "iccid");
    QTEST(sim.value(QStringLiteral("ServiceProviderName")).toString(), "provider");
    QTEST(sim.value(QStringLiteral("SubscriberNumbers")).toStringList(), "numbers");
    QCOMPARE(sim.value(QStringLiteral("PinRequired")).toString(), QStringLiteral("none"));
}

void StockOfonoTest::registration()
{
    const auto status = [] {
        return properties("/ril_1", registrationInterface).value(QStringLiteral("Status")).toString();
    };
    QCOMPARE(status(), QStringLiteral("registered"));
    for (const char *state : {"denied", "roaming", "searching", "unregistered", "registered"}) {
        m_phone.act(QStringLiteral("network"), {QStringLiteral("1"), QString::fromUtf8(state)});
        QVERIFY2(waitUntil([&] { return status() == QLatin1String(state); }), state);
    }
}

void StockOfonoTest::contexts()
{
    QVERIFY(waitUntil([] {
        return properties("/ril_0", "org.ofono.ConnectionManager").value(QStringLiteral("Attached")).toBool();
    }));
    QVERIFY(waitUntil([] {
        return call("/ril_0/context1", "org.ofono.ConnectionContext", "GetProperties").type()
            == QDBusMessage::ReplyMessage;
    }));
    QVariantMap radio;
    QVERIFY(waitUntil([&radio] {
        radio = properties("/ril_0", "org.ofono.RadioSettings");
        return !radio.isEmpty();
    }));
    QCOMPARE(radio.value(QStringLiteral("AvailableTechnologies")).toStringList(),
             QStringList({QStringLiteral("gsm"), QStringLiteral("umts"), QStringLiteral("lte")}));
}

void StockOfonoTest::extensionsAreUnknown_data()
{
    QTest::addColumn<QByteArray>("path");
    QTest::addColumn<QByteArray>("interface");
    QTest::addColumn<QByteArray>("member");
    QTest::addColumn<QString>("error");
    const QString unknownMethod = QStringLiteral("error org.freedesktop.DBus.Error.UnknownMethod");
    for (const char *member : {"GetInterfaceVersion", "GetAvailableModems", "GetIMEI", "GetReady"})
        QTest::newRow(member) << QByteArray("/") << QByteArray(modemManagerInterface) << QByteArray(member)
                              << unknownMethod;
    QTest::newRow("GetCardIdentifier") << QByteArray("/ril_0") << QByteArray(simInfoInterface)
                                       << QByteArray("GetCardIdentifier") << unknownMethod;
    QTest::newRow("GetAll") << QByteArray("/mdm/voicecallfilter/dial")
                            << QByteArray("org.corvaneos.ofono.mdm.VoiceCallFilter") << QByteArray("GetAll")
                            << QStringLiteral("error org.freedesktop.DBus.Error.UnknownObject");
}

void StockOfonoTest::extensionsAreUnknown()
{
    QFETCH(QByteArray, path);
    QFETCH(QByteArray, interface);
    QFETCH(QByteArray, member);
    QTEST(answer(path, interface, member), "error");
}

void StockOfonoTest::simInfoHasNoStates()
{
    SimInfo info;
    SignalSequence seen(&info);
    QVERIFY(seen.waitFor(1));
    QVERIFY(info.available());
    m_phone.settle(QLatin1String(service));
    QCOMPARE(seen.take(), QStringList{QStringLiteral("availableChanged(true)")});
    QVERIFY(info.simSlotStates().isEmpty());
    QTest::ignoreMessage(QtDebugMsg,
                         "Failed to fetch IMEI codes. Wait SimInfo to change available before calling this.");
    QVERIFY(info.imeiCodes().isEmpty());
    QVERIFY(info.subscriberIdentities().isEmpty());
    QVERIFY(info.cardIdentifier().isEmpty());
    QVERIFY(info.subscriberNumbers().isEmpty());

    m_phone.stopService(QLatin1String(service));
    QVERIFY(waitUntil([&] { return !info.available(); }));
    m_phone.startService(QLatin1String(service));
    QVERIFY(waitUntil([&] { return info.available(); }));
    const QStringList availability = seen.take().filter(QStringLiteral("availableChanged"));
    QCOMPARE(
        availability,
        QStringList({QStringLiteral("availableChanged(false)"), QStringLiteral("availableChanged(true)")}));
    // A modem that oFono removes when it ends has nothing but its path.
    const QList<SimInfo::SimState> states = info.simSlotStates();
    for (const SimInfo::SimState &state : states) {
        SimInfo::SimState nothing;
        nothing.modemPath = state.modemPath;
        QVERIFY(state == nothing);
    }
}

void StockOfonoTest::voiceCallFilterNeverGetsReady()
{
    MessageLog log;
    SimVoiceCallFilter filter;
    SignalSequence seen(&filter);
    QStringList warnings;
    QVERIFY(waitUntil([&] {
        warnings << log.takeWarnings();
        return warnings.size() >= 2;
    }));
    m_phone.settle(QLatin1String(service));
    warnings << log.takeWarnings();
    QCOMPARE(warnings.size(), 2);
    for (const QString &warning : qAsConst(warnings))
        QVERIFY2(warning.contains(QLatin1String("org.freedesktop.DBus.Error.UnknownObject")),
                 qPrintable(warning));
    QVERIFY(!filter.ready());
    QVERIFY(!filter.clearDialRules());
    QCOMPARE(seen.take(), QStringList());
}

QTEST_GUILESS_MAIN(StockOfonoTest)
#include "stockofono_test.moc"
