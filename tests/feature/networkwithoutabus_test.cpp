// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "waiting.h"

#include <corvanemdm/netproxy.h>
#include <corvanemdm/networkdatacounter.h>

#include <QtCore/QRegularExpression>
#include <QtTest/QtTest>

using Corvane::Mdm::NetProxy;
using Corvane::Mdm::NetworkDataCounter;

/** What the networking classes do where there is no system bus. */
class NetworkWithoutABusTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void counterWarns();
    void proxyStaysInvalid();
};

void NetworkWithoutABusTest::counterWarns()
{
    MessageLog log;
    NetworkDataCounter counter;
    const QStringList warnings = log.takeWarnings().filter(
        QRegularExpression(QStringLiteral("^Could not register dbus object on path: "
                                          "\"/org/veldmobile/systemsettings/NetworkDataCounter_[0-9]+\"$")));
    QCOMPARE(warnings.size(), 1);
    // It still works for who has it.
    counter.setUpdateInterval(5);
    QCOMPARE(counter.updateInterval(), 5);
    QSignalSpy changed(&counter, &NetworkDataCounter::activeChanged);
    counter.setActive(true);
    QVERIFY(!counter.active());
    QCOMPARE(changed.size(), 2);
}

void NetworkWithoutABusTest::proxyStaysInvalid()
{
    NetProxy proxy;
    QCoreApplication::processEvents();
    QVERIFY(!proxy.isValid());
    QVERIFY(!proxy.selectProxy(QStringLiteral("wifi_1")));
    QCOMPARE(proxy.getTechnologies(), QStringList(QStringLiteral("global")));
    QCOMPARE(proxy.getIdentifiers(QString()), QStringList(QStringLiteral("global")));
}

QTEST_GUILESS_MAIN(NetworkWithoutABusTest)

#include "networkwithoutabus_test.moc"
