// SPDX-License-Identifier: LGPL-2.1-or-later
#include "network/netproxyinterface_p.h"

#include <QtTest/QtTest>

using Corvane::Mdm::NetProxy;
using Corvane::Mdm::NetProxyInterface;
using Corvane::Mdm::NetProxyPrivate;

namespace
{

constexpr quint32 Type = NetProxyPrivate::ChangeType;
constexpr quint32 Servers = NetProxyPrivate::ChangeServers;
constexpr quint32 Excludes = NetProxyPrivate::ChangeExcludes;
constexpr quint32 Url = NetProxyPrivate::ChangeUrl;
constexpr quint32 All = Type | Servers | Excludes | Url;

const QString OldServer = QStringLiteral("http://old:1");
const QString NewServer = QStringLiteral("http://new:2");
const QString OldHost = QStringLiteral("old.example");
const QString NewHost = QStringLiteral("new.example");
const QString OldUrl = QStringLiteral("http://old/pac");
const QString NewUrl = QStringLiteral("http://new/pac");

/** A backend that keeps what would be sent. */
class RecordingProxy : public NetProxyInterface
{
public:
    QString getIdentifier() const override { return QString(); }
    QString getName() const override { return QString(); }
    void setProxyConfig(const QVariantMap &configuration) override { sent.append(configuration); }

    QList<QVariantMap> sent;
    bool isThere = true;

protected:
    bool hasTarget() const override { return isThere; }
};

QVariantMap configuration(const char *method, const QVariantMap &rest = QVariantMap())
{
    QVariantMap map = rest;
    map.insert(QStringLiteral("Method"), QString::fromLatin1(method));
    return map;
}

} // namespace

/** The local copy of a proxy configuration, and how it meets the connection manager's. */
class NetProxyMirrorTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void startsEmpty();
    void appliesConfigurations_data();
    void appliesConfigurations();
    void strangeMethodsChangeNothing_data();
    void strangeMethodsChangeNothing();
    void wrongTypesAreEmpty();
    void handsOver_data();
    void handsOver();
    void invalidIsLogged();
    void settersTellOfChanges();
    void settersSend();
    void nothingThereIsEmpty();
    void pathsAndIdentifiers_data();
    void pathsAndIdentifiers();
};

void NetProxyMirrorTest::startsEmpty()
{
    const RecordingProxy proxy;
    QCOMPARE(proxy.mirror.changes, 0u);
    QCOMPARE(proxy.mirror.type, NetProxy::Invalid);
    QCOMPARE(proxy.mirror.servers, QStringList());
    QCOMPARE(proxy.mirror.excludes, QStringList());
    QCOMPARE(proxy.mirror.url, QString());
}

/** All methods after all types, with keys that are missing, the same and new, with and without local changes.
 */
void NetProxyMirrorTest::appliesConfigurations_data()
{
    QTest::addColumn<int>("typeBefore");
    QTest::addColumn<quint32>("pending");
    QTest::addColumn<QVariantMap>("configuration");
    QTest::addColumn<quint32>("announced");
    QTest::addColumn<quint32>("stillPending");
    QTest::addColumn<int>("type");
    QTest::addColumn<QStringList>("servers");
    QTest::addColumn<QStringList>("excludes");
    QTest::addColumn<QString>("url");

    const auto key = [](const char *name, const QVariant &value) {
        return QVariantMap{{QString::fromLatin1(name), value}};
    };
    const QStringList variants{QStringLiteral("missing"), QStringLiteral("same"), QStringLiteral("new")};
    for (int before = NetProxy::Invalid; before <= NetProxy::Automatic; ++before) {
        for (const quint32 pending : {0u, Type, Servers, Excludes, Url, All}) {
            const auto row = [&](const QString &what, const QVariantMap &map, quint32 concerned,
                                 quint32 found, NetProxy::ProxyType type, const QStringList &servers,
                                 const QStringList &excludes, const QString &url) {
                const quint32 changed = found | (before == type ? 0 : Type);
                QTest::addRow("%s after %d, pending %u", qPrintable(what), before, pending)
                    << before << pending << map << ((pending & concerned) | changed) << (pending & ~concerned)
                    << int(type) << servers << excludes << url;
            };
            const QStringList oldServers(OldServer);
            const QStringList oldExcludes(OldHost);
            row(QStringLiteral("direct"), configuration("direct"), Type, 0, NetProxy::Direct, oldServers,
                oldExcludes, OldUrl);
            row(QStringLiteral("nothing"), QVariantMap(), Type, 0, NetProxy::Direct, oldServers, oldExcludes,
                OldUrl);
            for (const QString &servers : variants) {
                for (const QString &excludes : variants) {
                    QVariantMap map;
                    QStringList serversAfter;
                    QStringList excludesAfter;
                    if (servers != variants.first()) {
                        serversAfter = QStringList(servers == variants.last() ? NewServer : OldServer);
                        map.insert(key("Servers", serversAfter));
                    }
                    if (excludes != variants.first()) {
                        excludesAfter = QStringList(excludes == variants.last() ? NewHost : OldHost);
                        map.insert(key("Excludes", excludesAfter));
                    }
                    row(QStringLiteral("manual, %1 servers, %2 excludes").arg(servers, excludes),
                        configuration("manual", map), Type | Servers | Excludes,
                        (serversAfter == oldServers ? 0 : Servers)
                            | (excludesAfter == oldExcludes ? 0 : Excludes),
                        NetProxy::Manual, serversAfter, excludesAfter, OldUrl);
                }
            }
            for (const QString &url : variants) {
                const QString urlAfter = url == variants.first() ? QString()
                    : url == variants.last()                     ? NewUrl
                                                                 : OldUrl;
                row(QStringLiteral("auto, %1 URL").arg(url),
                    configuration("auto", url == variants.first() ? QVariantMap() : key("URL", urlAfter)),
                    Type | Url, urlAfter == OldUrl ? 0 : Url, NetProxy::Automatic, oldServers, oldExcludes,
                    urlAfter);
            }
        }
    }
}

void NetProxyMirrorTest::appliesConfigurations()
{
    QFETCH(int, typeBefore);
    QFETCH(quint32, pending);
    QFETCH(QVariantMap, configuration);
    RecordingProxy proxy;
    proxy.mirror
        = {pending, NetProxy::ProxyType(typeBefore), QStringList(OldServer), QStringList(OldHost), OldUrl};
    QTEST(proxy.applyConfiguration(configuration), "announced");
    QTEST(proxy.mirror.changes, "stillPending");
    QTEST(int(proxy.mirror.type), "type");
    QTEST(proxy.mirror.servers, "servers");
    QTEST(proxy.mirror.excludes, "excludes");
    QTEST(proxy.mirror.url, "url");
    QCOMPARE(proxy.sent.size(), 0);
}

void NetProxyMirrorTest::strangeMethodsChangeNothing_data()
{
    QTest::addColumn<QVariant>("method");
    QTest::newRow("an unknown word") << QVariant(QStringLiteral("wpad"));
    QTest::newRow("another case") << QVariant(QStringLiteral("Direct"));
    QTest::newRow("empty") << QVariant(QString());
    QTest::newRow("a number") << QVariant(1);
    QTest::newRow("a map") << QVariant(QVariantMap());
}

void NetProxyMirrorTest::strangeMethodsChangeNothing()
{
    QFETCH(QVariant, method);
    RecordingProxy proxy;
    proxy.mirror = {All, NetProxy::Manual, QStringList(OldServer), QStringList(OldHost), OldUrl};
    QCOMPARE(proxy.applyConfiguration({{QStringLiteral("Method"), method},
                                       {QStringLiteral("Servers"), QStringList(NewServer)},
                                       {QStringLiteral("URL"), NewUrl}}),
             0u);
    QCOMPARE(proxy.mirror.changes, All);
    QCOMPARE(proxy.mirror.type, NetProxy::Manual);
    QCOMPARE(proxy.mirror.servers, QStringList(OldServer));
    QCOMPARE(proxy.mirror.excludes, QStringList(OldHost));
    QCOMPARE(proxy.mirror.url, OldUrl);
}

void NetProxyMirrorTest::wrongTypesAreEmpty()
{
    RecordingProxy proxy;
    proxy.mirror.servers = QStringList(OldServer);
    QCOMPARE(proxy.applyConfiguration(configuration(
                 "manual", {{QStringLiteral("Servers"), 5}, {QStringLiteral("Excludes"), QVariantMap()}})),
             Type | Servers);
    QCOMPARE(proxy.mirror.servers, QStringList());
    QCOMPARE(proxy.mirror.excludes, QStringList());
    QCOMPARE(proxy.applyConfiguration(
                 configuration("auto", {{QStringLiteral("URL"), QVariantList{QStringLiteral("x")}}})),
             Type);
    QCOMPARE(proxy.mirror.url, QString());
}

void NetProxyMirrorTest::handsOver_data()
{
    QTest::addColumn<int>("type");
    QTest::addColumn<quint32>("change");
    QTest::addColumn<bool>("isComplete");
    QTest::addColumn<bool>("isSent");
    for (int type = NetProxy::Direct; type <= NetProxy::Automatic; ++type) {
        for (const quint32 change : {Type, Servers, Excludes, Url}) {
            for (const bool isComplete : {false, true}) {
                const bool isSent = type == NetProxy::Direct ? change == Type
                    : type == NetProxy::Manual               ? isComplete && change != Url
                                               : isComplete && (change == Type || change == Url);
                QTest::addRow("type %d, change %u, %s", type, change, isComplete ? "complete" : "incomplete")
                    << type << change << isComplete << isSent;
            }
        }
    }
}

void NetProxyMirrorTest::handsOver()
{
    QFETCH(int, type);
    QFETCH(quint32, change);
    QFETCH(bool, isComplete);
    QFETCH(bool, isSent);
    RecordingProxy proxy;
    proxy.mirror.type = NetProxy::ProxyType(type);
    if (isComplete) {
        proxy.mirror.servers = QStringList(OldServer);
        proxy.mirror.url = OldUrl;
    }
    QCOMPARE(proxy.globalUpdateRemoteFromLocal(NetProxyPrivate::ConfigChange(change)), isSent);
    const QVariantMap expected = type == NetProxy::Direct ? configuration("direct")
        : type == NetProxy::Manual                        ? configuration("manual",
                                                                          {{QStringLiteral("Servers"), QStringList(OldServer)},
                                                                           // Also when there are none.
                                                                           {QStringLiteral("Excludes"), QStringList()}})
                                   : configuration("auto", {{QStringLiteral("URL"), OldUrl}});
    QCOMPARE(proxy.sent, isSent ? QList<QVariantMap>{expected} : QList<QVariantMap>());
}

void NetProxyMirrorTest::invalidIsLogged()
{
    RecordingProxy proxy;
    proxy.mirror.servers = QStringList(OldServer);
    QTest::ignoreMessage(QtDebugMsg, "MDM Proxy: error updating remote global proxy configuration");
    QVERIFY(!proxy.globalUpdateRemoteFromLocal(NetProxyPrivate::ChangeServers));
    QCOMPARE(proxy.sent.size(), 0);
}

void NetProxyMirrorTest::settersTellOfChanges()
{
    NetProxyInterface::ProxyLocalMirror mirror;
    QVERIFY(mirror.setType(NetProxy::Manual));
    QCOMPARE(mirror.changes, Type);
    QVERIFY(!mirror.setType(NetProxy::Manual));
    QVERIFY(mirror.setManualProxies({QUrl(OldServer), QUrl(NewServer)}));
    QCOMPARE(mirror.changes, Type | Servers);
    QCOMPARE(mirror.servers, QStringList({OldServer, NewServer}));
    QVERIFY(!mirror.setManualProxies({QUrl(OldServer), QUrl(NewServer)}));
    // The order matters.
    QVERIFY(mirror.setManualProxies({QUrl(NewServer), QUrl(OldServer)}));
    QVERIFY(mirror.setManualExclusions({OldHost}));
    QVERIFY(!mirror.setManualExclusions({OldHost}));
    QCOMPARE(mirror.changes, Type | Servers | Excludes);
    QVERIFY(mirror.setAutomaticUrl(QUrl(OldUrl)));
    QVERIFY(!mirror.setAutomaticUrl(QUrl(OldUrl)));
    QCOMPARE(mirror.changes, All);
    QCOMPARE(mirror.url, OldUrl);
    // What is no different URL is no change.
    mirror.url = QStringLiteral("HTTP://OLD/pac");
    mirror.changes = 0;
    QVERIFY(!mirror.setAutomaticUrl(QUrl(OldUrl)));
    QCOMPARE(mirror.changes, 0u);
}

void NetProxyMirrorTest::settersSend()
{
    RecordingProxy proxy;
    for (const int type : {-1, 0, 4})
        QVERIFY(!proxy.setType(NetProxy::ProxyType(type)));
    QCOMPARE(proxy.sent.size(), 0);
    QVERIFY(proxy.setType(NetProxy::Manual));
    QVERIFY(proxy.setManualExclusions({OldHost}));
    QCOMPARE(proxy.sent.size(), 0);
    QVERIFY(proxy.setManualProxies({QUrl(OldServer)}));
    QCOMPARE(proxy.sent.size(), 1);
    QCOMPARE(proxy.sent.first(),
             configuration("manual",
                           {{QStringLiteral("Servers"), QStringList(OldServer)},
                            {QStringLiteral("Excludes"), QStringList(OldHost)}}));
    QVERIFY(proxy.setAutomaticUrl(QUrl(OldUrl)));
    QCOMPARE(proxy.sent.size(), 1);
    // What is no change is sent all the same.
    QVERIFY(!proxy.setManualProxies({QUrl(OldServer)}));
    QVERIFY(!proxy.setManualExclusions({OldHost}));
    QVERIFY(!proxy.setType(NetProxy::Manual));
    QCOMPARE(proxy.sent.size(), 4);
    QVERIFY(proxy.setType(NetProxy::Automatic));
    QVERIFY(!proxy.setAutomaticUrl(QUrl(OldUrl)));
    QCOMPARE(proxy.sent.size(), 6);
    QCOMPARE(proxy.sent.last(), configuration("auto", {{QStringLiteral("URL"), OldUrl}}));
    QCOMPARE(proxy.getType(), NetProxy::Automatic);
    QCOMPARE(proxy.getManualProxies(), QList<QUrl>{QUrl(OldServer)});
    QCOMPARE(proxy.getManualExclusions(), QStringList(OldHost));
    QCOMPARE(proxy.getAutomaticUrl(), QUrl(OldUrl));
}

void NetProxyMirrorTest::nothingThereIsEmpty()
{
    RecordingProxy proxy;
    proxy.mirror = {0, NetProxy::Manual, QStringList(OldServer), QStringList(OldHost), OldUrl};
    proxy.isThere = false;
    QCOMPARE(proxy.getType(), NetProxy::Invalid);
    QCOMPARE(proxy.getManualProxies(), QList<QUrl>());
    QCOMPARE(proxy.getManualExclusions(), QStringList());
    QCOMPARE(proxy.getAutomaticUrl(), QUrl());
    QVERIFY(!proxy.setType(NetProxy::Direct));
    QVERIFY(!proxy.setManualProxies({QUrl(NewServer)}));
    QVERIFY(!proxy.setManualExclusions({NewHost}));
    QVERIFY(!proxy.setAutomaticUrl(QUrl(NewUrl)));
    QCOMPARE(proxy.sent.size(), 0);
    QCOMPARE(proxy.mirror.changes, 0u);
    QCOMPARE(proxy.mirror.type, NetProxy::Manual);
    QCOMPARE(proxy.mirror.servers, QStringList(OldServer));
}

void NetProxyMirrorTest::pathsAndIdentifiers_data()
{
    QTest::addColumn<QString>("path");
    QTest::addColumn<QString>("identifier");
    QTest::newRow("a network") << "/net/connman/service/wifi_1_psk"
                               << "wifi_1_psk";
    QTest::newRow("somewhere else") << "/a/b"
                                    << "b";
    QTest::newRow("without a slash") << "ab"
                                     << "ab";
    QTest::newRow("a slash at the end") << "/a/"
                                        << "";
    QTest::newRow("empty") << ""
                           << "";
}

void NetProxyMirrorTest::pathsAndIdentifiers()
{
    QFETCH(QString, path);
    QFETCH(QString, identifier);
    QCOMPARE(NetProxyPrivate::pathToIdentifier(path), identifier);
    QCOMPARE(NetProxyPrivate::pathToIdentifier(NetProxyPrivate::identifierToPath(identifier)), identifier);
    QCOMPARE(NetProxyPrivate::identifierToPath(identifier),
             QStringLiteral("/net/connman/service/") + identifier);
}

QTEST_APPLESS_MAIN(NetProxyMirrorTest)

#include "netproxymirror_test.moc"
