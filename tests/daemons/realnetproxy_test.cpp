// SPDX-License-Identifier: LGPL-2.1-or-later
#include "network/netproxyglobal_p.h"
#include "network/netproxyservice_p.h"

#include "phone.h"
#include "signalsequence.h"
#include "waiting.h"

#include <connman/networkmanager.h>
#include <connman/networkservice.h>

#include <QtCore/QRegularExpression>
#include <QtTest/QtTest>

using Corvane::Mdm::NetProxy;
using Corvane::Mdm::NetProxyPrivate;

namespace
{

const QString Connman = QStringLiteral("net.connman");

QStringList list(const char *text)
{
    return QString::fromUtf8(text).split(QLatin1Char('|'), Qt::SkipEmptyParts);
}

} // namespace

/** The proxy of a network of the real ConnMan. A stock one has no global proxy, hence the private class. */
class RealNetProxyTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void stockDaemonHasNoGlobalProxy();
    void proxiesOfTheWiredNetwork();
    void daemonThatRestarts();

private:
    /** Waits until the network is there and selected; what the global proxy lacks is made up for. */
    static bool selectWiredNetwork(NetProxyPrivate &proxy);

    Phone m_phone;
};

bool RealNetProxyTest::selectWiredNetwork(NetProxyPrivate &proxy)
{
    proxy.setValidGlobalActive(true);
    proxy.setValidGlobalConfig(true);
    const NetworkManager *manager = NetworkManagerFactory::createInstance();
    QVector<NetworkService *> wired;
    return waitUntil([&] {
               wired = manager->getSavedServices(QStringLiteral("ethernet"));
               return proxy.valid && !wired.isEmpty();
           })
        && proxy.selectProxy(NetProxyPrivate::pathToIdentifier(wired.first()->path()));
}

void RealNetProxyTest::stockDaemonHasNoGlobalProxy()
{
    for (const char *message :
         {"^MDM Proxy: error:  QDBusError", "^MDM Proxy: global proxy proxy error:  QDBusError"})
        QTest::ignoreMessage(QtDebugMsg, QRegularExpression(QLatin1String(message)));
    NetProxy proxy;
    QVERIFY(waitUntil([&] {
        return proxy.getTechnologies().contains(QStringLiteral("Wired"))
            && !proxy.getIdentifiers(QStringLiteral("ethernet")).isEmpty();
    }));
    m_phone.settle(QStringLiteral("org.ofono"));
    QVERIFY(!proxy.isValid());
    QCOMPARE(proxy.getIdentifiers(QStringLiteral("ethernet")).size(), 1);
}

void RealNetProxyTest::proxiesOfTheWiredNetwork()
{
    NetProxy owner;
    NetProxyPrivate proxy(&owner);
    QVERIFY(selectWiredNetwork(proxy));
    QVERIFY(proxy.current->getIdentifier().startsWith(QLatin1String("ethernet_")));
    SignalSequence seen(&owner);

    QVERIFY(proxy.current->setManualProxies({QUrl(QStringLiteral("http://proxy.example:3128"))}));
    QVERIFY(proxy.current->setManualExclusions(list("localhost|.example")));
    QVERIFY(proxy.current->setType(NetProxy::Manual));
    QVERIFY(seen.waitFor(4));
    QCOMPARE(seen.take(),
             list("proxyConfigChanged()|typeChanged(Manual)|"
                  "manualProxiesChanged([http://proxy.example:3128])|"
                  "manualExclusionsChanged(localhost .example)"));
    QVERIFY(proxy.current->setAutomaticUrl(QUrl(QStringLiteral("http://wpad.example/proxy.pac"))));
    QVERIFY(proxy.current->setType(NetProxy::Automatic));
    QVERIFY(seen.waitFor(3));
    QCOMPARE(seen.take(),
             list("proxyConfigChanged()|typeChanged(Automatic)|"
                  "automaticUrlChanged(http://wpad.example/proxy.pac)"));

    // Another object reads what the daemon has.
    NetProxy otherOwner;
    NetProxyPrivate other(&otherOwner);
    QVERIFY(selectWiredNetwork(other));
    QCOMPARE(other.current->getType(), NetProxy::Automatic);
    QCOMPARE(other.current->getAutomaticUrl(), QUrl(QStringLiteral("http://wpad.example/proxy.pac")));

    QVERIFY(proxy.current->setType(NetProxy::Direct));
    QVERIFY(seen.waitFor(2));
    QCOMPARE(seen.take(), list("proxyConfigChanged()|typeChanged(Direct)"));
    QVERIFY(waitUntil([&] { return other.current->getType() == NetProxy::Direct; }));
}

void RealNetProxyTest::daemonThatRestarts()
{
    NetProxy owner;
    NetProxyPrivate proxy(&owner);
    QVERIFY(selectWiredNetwork(proxy));
    SignalSequence seen(&owner);
    m_phone.stopService(Connman);
    QVERIFY(waitUntil([&] { return !proxy.valid; }));
    m_phone.startService(Connman);
    QVERIFY(waitUntil([&] { return proxy.valid; }));
    QCOMPARE(proxy.selection, NetProxyPrivate::SelectedService);
    // The daemon may need a while to find its network again, which may be another object then.
    QVERIFY(selectWiredNetwork(proxy));
    seen.take();
    QVERIFY(proxy.current->setAutomaticUrl(QUrl(QStringLiteral("http://again.example/proxy.pac"))));
    QVERIFY(proxy.current->setType(NetProxy::Automatic));
    QVERIFY(seen.waitFor(3));
    QCOMPARE(seen.take().first(), QStringLiteral("proxyConfigChanged()"));
    QCOMPARE(proxy.current->getType(), NetProxy::Automatic);
    QVERIFY(proxy.current->setType(NetProxy::Direct));
    QVERIFY(seen.waitFor(2));
}

QTEST_GUILESS_MAIN(RealNetProxyTest)

#include "realnetproxy_test.moc"
