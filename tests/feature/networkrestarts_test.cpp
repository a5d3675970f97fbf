// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "servicerestarts.h"
#include "signalsequence.h"
#include "waiting.h"

#include <corvanemdm/connectivitysettings.h>
#include <corvanemdm/netproxy.h>
#include <corvanemdm/networkdatacounter.h>

#include <QtCore/QElapsedTimer>
#include <QtCore/QJsonArray>
#include <QtTest/QtTest>

using Corvane::Mdm::ConnectivitySettings;
using Corvane::Mdm::NetProxy;
using Corvane::Mdm::NetworkDataCounter;

namespace
{

const QString Service = QStringLiteral("net.connman");
const QString Home = QStringLiteral("wifi_02c0ffee0001_486f6d65_managed_psk");
constexpr int LongestRunMicroseconds = 10000; // somewhat longer than until everything has been told

} // namespace

/** The connection manager goes away at moments that nobody chose, the same ones in every run of the test. */
class NetworkRestartsTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void objectsSurvive();
};

void NetworkRestartsTest::objectsSurvive()
{
    Phone phone;
    ServiceRestarts restarts(phone, Service, LongestRunMicroseconds);

    NetProxy global;
    NetProxy home;
    NetworkDataCounter counter;
    const ConnectivitySettings byManager(ConnectivitySettings::NetworkManagerMode);
    const ConnectivitySettings byDBus;
    const auto isTakenUp = [&] {
        return global.isValid() && home.isValid() && byManager.ready();
    };
    QVERIFY(waitUntil(isTakenUp));
    QVERIFY(home.selectProxy(Home));

    // The last of them to come makes a run one that was not cut short, and some are left with a counter.
    bool wasTakenUp = false;
    const auto look = [&] {
        wasTakenUp = wasTakenUp || isTakenUp();
        if (isTakenUp())
            counter.setActive(true);
    };
    connect(&global, &NetProxy::validChanged, &counter, look);
    connect(&home, &NetProxy::validChanged, &counter, look);
    connect(&byManager, &ConnectivitySettings::readyChanged, &counter, look);

    int cutShort = 0;
    qint64 slowest = 0;
    SignalSequence seen(&home);
    for (int round = 0; round < restarts.rounds(); ++round) {
        counter.setActive(true);
        restarts.stop();
        QVERIFY(waitUntil([&] { return !global.isValid() && !home.isValid() && !byManager.ready(); }));
        QVERIFY(waitUntil([&] { return !counter.active(); }));
        QCOMPARE(home.getIdentifier(), Home);
        QVERIFY(byDBus.ready());
        // Neither of these reaches anybody.
        counter.setActive(true);
        QVERIFY(!counter.active());
        {
            MessageLog log;
            QVERIFY(!byDBus.flightModeEnabled());
            QCOMPARE(log.takeWarnings(),
                     QStringList(QStringLiteral("OfflineMode property not returned for ConnMan!")));
        }

        // A run that ends at any point of taking up the service...
        wasTakenUp = false;
        restarts.runBriefly();
        cutShort += wasTakenUp ? 0 : 1;

        // ... and one that lasts.
        restarts.start();
        QElapsedTimer elapsed;
        elapsed.start();
        // A change of the owner may still be on its way.
        QVERIFY(waitUntil([&] { return !home.isValid() || elapsed.elapsed() > 0; }));
        QVERIFY(waitUntil(isTakenUp));
        slowest = qMax(slowest, elapsed.elapsed());
        phone.settle(Service);
        QVERIFY(waitUntil(isTakenUp));
        QCOMPARE(home.getIdentifier(), Home);
        QCOMPARE(home.getName(), QStringLiteral("Home"));
        QCOMPARE(global.getIdentifier(), QStringLiteral("global"));
        QVERIFY(byManager.wlanEnabled());

        // The objects still work: what happens now is told once.
        seen.take();
        const QString url = QStringLiteral("http://round%1/").arg(round);
        phone.act(QStringLiteral("connection proxy"), {Home, QStringLiteral("auto"), url});
        QVERIFY(waitUntil([&] { return home.automaticUrl() == QUrl(url); }));
        phone.settle(Service);
        QCOMPARE(seen.take().filter(QStringLiteral("automaticUrlChanged")).size(), 1);
        counter.setActive(false);
        counter.setActive(true);
        QVERIFY(counter.active());
        phone.settle(Service);
        QCOMPARE(phone.state()
                     .value(QLatin1String("network"))
                     .toObject()
                     .value(QLatin1String("counters"))
                     .toArray()
                     .size(),
                 1);
        restarts.endRound();
    }
    qInfo("%s, %d runs of the service cut short while it was taken up, slowest return of all objects %lld ms",
          qPrintable(restarts.summary()), cutShort, slowest);
}

QTEST_GUILESS_MAIN(NetworkRestartsTest)

#include "networkrestarts_test.moc"
