// SPDX-License-Identifier: LGPL-2.1-or-later
#include "phone.h"
#include "waiting.h"

#include <corvanemdm/connectivitysettings.h>
#include <corvanemdm/netproxy.h>
#include <corvanemdm/networkdatacounter.h>

#include <QtCore/QCoreApplication>
#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::ConnectivitySettings;
using Corvane::Mdm::NetProxy;
using Corvane::Mdm::NetworkDataCounter;

/** Objects that a program destroys after its application object, as those of static storage are. */
class NetworkWithoutAnApplicationTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void objectsOutliveTheApplication();
};

void NetworkWithoutAnApplicationTest::objectsOutliveTheApplication()
{
    const QString home = QStringLiteral("wifi_02c0ffee0001_486f6d65_managed_psk");
    int argumentCount = 1;
    char name[] = "networkwithoutanapplication_test";
    char *arguments[] = {name, nullptr};
    auto application = std::make_unique<QCoreApplication>(argumentCount, arguments);

    NetProxy proxy;
    NetProxy global;
    NetworkDataCounter counter;
    ConnectivitySettings settings(ConnectivitySettings::NetworkManagerMode);
    QVERIFY(waitUntil([&] { return proxy.isValid() && global.isValid() && settings.ready(); }));
    QVERIFY(proxy.selectProxy(home));
    counter.setActive(true);
    QVERIFY(counter.active());
    Phone().settle(QStringLiteral("net.connman"));

    application.reset();
    QVERIFY(!proxy.isValid());
    QCOMPARE(proxy.getIdentifier(), QString());
    QVERIFY(!proxy.setType(NetProxy::Direct));
    QVERIFY(!proxy.selectProxy(home));
    QCOMPARE(proxy.getTechnologies(), QStringList(QStringLiteral("global")));
    QCOMPARE(proxy.getIdentifiers(QString()), QStringList(QStringLiteral("global")));
    QCOMPARE(global.getIdentifier(), QStringLiteral("global"));
    counter.setActive(false);
    counter.setActive(true);
    QVERIFY(!counter.active());
    QVERIFY(!settings.ready());
    QVERIFY(!settings.wlanEnabled());
    QVERIFY(!settings.flightModeEnabled());
    settings.setWlanEnabled(false);
    settings.setFlightModeEnabled(true);
}

QTEST_APPLESS_MAIN(NetworkWithoutAnApplicationTest)

#include "networkwithoutanapplication_test.moc"
