// SPDX-License-Identifier: LGPL-2.1-or-later
#include "mdmctl.h"
#include "phone.h"
#include "waiting.h"

#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QTemporaryDir>
#include <QtTest/QtTest>

#include <csignal>

namespace
{

const QString Service = QStringLiteral("net.connman");
const QString Office = QStringLiteral("wifi_02c0ffee0001_436f7276616e65204f6666696365_managed_psk");
const QString Home = QStringLiteral("wifi_02c0ffee0001_486f6d65_managed_psk");

Mdmctl::Result run(const char *arguments)
{
    return Mdmctl::run(QString::fromUtf8(arguments).split(QLatin1Char(' ')));
}

QJsonObject json(const char *text)
{
    return QJsonDocument::fromJson(text).object();
}

} // namespace

/** mdmctl proxy, and the proxies of policies. */
class MdmctlProxyTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void cleanup();

    void listsAll();
    void listsATechnology();
    void showsOne();
    void configures_data();
    void configures();
    void networkByItsName();
    void ambiguousNameIsRefused();
    void unknownNetworkIsRefused();
    void wrongUsage_data();
    void wrongUsage();
    void switchesWhatIsUsed();
    void refusedChangeIsTold();
    void silentServiceEndsTheWait();
    void watchTellsChanges();
    void watchEndsWithTheNetwork();
    void absentServiceIsTold();

    void policyIsApplied();
    void policyOfAnUnknownNetwork();
    void wrongPolicyIsRefused_data();
    void wrongPolicyIsRefused();
    void watchPutsDriftRight();
    void exportCanBeApplied();

private:
    void act(const char *action, const QStringList &arguments)
    {
        m_phone.act(QLatin1String(action), arguments);
    }
    QJsonObject network() const { return m_phone.state().value(QLatin1String("network")).toObject(); }
    QJsonObject globalProxy() const { return network().value(QLatin1String("globalProxy")).toObject(); }
    QJsonObject proxyOf(const QString &identifier) const;
    QString write(const QByteArray &policy);

    Phone m_phone;
    QTemporaryDir m_folder;
};

void MdmctlProxyTest::cleanup()
{
    m_phone.clearFaults();
    m_phone.startService(Service);
    act("proxy active", {QStringLiteral("off")});
    act("proxy configure", {QStringLiteral("direct")});
    for (const QString &identifier : {Office, Home})
        act("connection proxy", {identifier, QStringLiteral("direct")});
}

QJsonObject MdmctlProxyTest::proxyOf(const QString &identifier) const
{
    const QJsonArray services = network().value(QLatin1String("services")).toArray();
    for (const QJsonValue &service : services) {
        if (service[QLatin1String("identifier")].toString() == identifier)
            return service[QLatin1String("proxy")].toObject();
    }
    return {};
}

QString MdmctlProxyTest::write(const QByteArray &policy)
{
    QFile file(m_folder.filePath(QStringLiteral("policy.json")));
    if (!file.open(QIODevice::WriteOnly) || file.write(policy) != policy.size())
        qFatal("cannot write the policy");
    return file.fileName();
}

void MdmctlProxyTest::listsAll()
{
    act("connection proxy", {Home, QStringLiteral("auto"), QStringLiteral("http://pac")});
    const Mdmctl::Result listed = run("proxy list");
    QCOMPARE(listed.errors, QString());
    const QStringList lines = listed.output.split(QLatin1Char('\n'));
    QVERIFY(lines.at(0).startsWith(QLatin1String("IDENTIFIER  ")));
    QVERIFY(
        lines.at(1).contains(QRegularExpression(QStringLiteral("^global  +Global Proxy  +no  +direct$"))));
    QVERIFY(listed.output.contains(
        QRegularExpression(QStringLiteral("\n%1  +Home  +yes  +automatic: http://pac\n").arg(Home))));
    QCOMPARE(listed.status, 0);

    const QJsonObject asJson = run("proxy list --json").json();
    QCOMPARE(asJson.value(QLatin1String("use")).toString(), QStringLiteral("networks"));
    QCOMPARE(asJson.value(QLatin1String("proxies")).toArray().at(0).toObject(),
             json(R"({"identifier": "global", "name": "Global Proxy", "used": false, "method": "direct"})"));
}

void MdmctlProxyTest::listsATechnology()
{
    const QJsonArray listed
        = run("proxy list --technology wifi --json").json().value(QLatin1String("proxies")).toArray();
    QCOMPARE(listed.size(), 2);
    QCOMPARE(listed.at(0)[QLatin1String("identifier")].toString(), Office);
    QCOMPARE(run("proxy list --technology ethernet").output,
             QStringLiteral("No network of that technology is saved.\n"));
}

void MdmctlProxyTest::showsOne()
{
    act("proxy active", {QStringLiteral("on")});
    act("proxy configure", {QStringLiteral("manual"), QStringLiteral("http://a:1"), QStringLiteral("x,y")});
    QCOMPARE(run("proxy show").output, QStringLiteral("Global Proxy: manual: http://a:1, but not x, y\n"));
    QCOMPARE(run("proxy show --json").json(),
             json(R"({"identifier": "global", "name": "Global Proxy", "used": true, "method": "manual",
                      "servers": ["http:\/\/a:1"], "exclusions": ["x", "y"]})"));
    QCOMPARE(run("proxy show Home").output, QStringLiteral("Home: direct (not used)\n"));
}

void MdmctlProxyTest::configures_data()
{
    QTest::addColumn<QString>("target");
    QTest::newRow("global") << "global";
    QTest::newRow("a network") << Home;
}

void MdmctlProxyTest::configures()
{
    QFETCH(QString, target);
    const auto state = [&] {
        return target == Home ? proxyOf(Home)
                              : globalProxy().value(QLatin1String("configuration")).toObject();
    };
    const auto configure = [&](const char *method, const char *rest) {
        return run(qPrintable(QStringLiteral("proxy %1 %2%3")
                                  .arg(QString::fromLatin1(method), target, QString::fromLatin1(rest))));
    };
    Mdmctl::Result result = configure("manual", " http://a:1 http://b:2 --except localhost,.x");
    QCOMPARE(result.errors, QString());
    QCOMPARE(result.status, 0);
    QVERIFY(
        result.output.contains(QStringLiteral(": manual: http://a:1, http://b:2, but not localhost, .x")));
    QCOMPARE(state(), json(R"({"method": "manual", "servers": ["http:\/\/a:1", "http:\/\/b:2"],
                               "excludes": ["localhost", ".x"]})"));
    // From manual to manual, servers and exclusions at once.
    QCOMPARE(configure("manual", " http://c:3").status, 0);
    QCOMPARE(state(), json(R"({"method": "manual", "servers": ["http:\/\/c:3"]})"));
    QCOMPARE(configure("automatic", " http://pac/x").status, 0);
    QCOMPARE(state(), json(R"({"method": "auto", "url": "http:\/\/pac/x"})"));
    QCOMPARE(configure("automatic", " http://pac/y").status, 0);
    QCOMPARE(state(), json(R"({"method": "auto", "url": "http:\/\/pac/y"})"));
    result = configure("direct", " --json");
    QCOMPARE(result.json().value(QLatin1String("method")).toString(), QStringLiteral("direct"));
    QCOMPARE(state(), json(R"({"method": "direct"})"));
    // What is so already is not sent again.
    m_phone.takeJournal(Service);
    QCOMPARE(configure("direct", "").status, 0);
    QVERIFY(m_phone.takeJournal(Service).filter(QStringLiteral("SetProperty")).isEmpty());
}

void MdmctlProxyTest::networkByItsName()
{
    QCOMPARE(Mdmctl::run({QStringLiteral("proxy"), QStringLiteral("automatic"),
                          QStringLiteral("Corvane Office"), QStringLiteral("http://pac")})
                 .output,
             QStringLiteral("Corvane Office: automatic: http://pac\n"));
    QCOMPARE(proxyOf(Office), json(R"({"method": "auto", "url": "http:\/\/pac"})"));
}

void MdmctlProxyTest::ambiguousNameIsRefused()
{
    const QString open = QStringLiteral("wifi_02c0ffee0001_486f6d65_managed_none");
    act("wifi appear", {QStringLiteral("Home"), QStringLiteral("none"), QStringLiteral("saved")});
    const Mdmctl::Result shown = run("proxy show Home");
    act("connection vanish", {open});
    QCOMPARE(shown.status, 1);
    QVERIFY(shown.errors.startsWith(QLatin1String("mdmctl: several networks are called \"Home\": ")));
    QVERIFY(shown.errors.contains(open));
}

void MdmctlProxyTest::unknownNetworkIsRefused()
{
    const Mdmctl::Result shown = run("proxy direct Nowhere");
    QCOMPARE(shown.status, 1);
    QCOMPARE(
        shown.errors,
        QStringLiteral("mdmctl: there is no saved network \"Nowhere\"; \"mdmctl proxy list\" shows them\n"));
}

void MdmctlProxyTest::wrongUsage_data()
{
    QTest::addColumn<QString>("arguments");
    QTest::addColumn<QString>("error");
    QTest::newRow("no URL") << "proxy manual global 10.0.0.1:80"
                            << "mdmctl: SERVER \"10.0.0.1:80\": must be a URL, such as "
                               "http://proxy.example:3128\n";
    QTest::newRow("no host") << "proxy automatic global http://"
                             << "mdmctl: URL \"http://\": must be a URL, such as http://proxy.example:3128\n";
    QTest::newRow("no server") << "proxy manual global"
                               << "mdmctl: SERVER is missing; usage: mdmctl proxy manual TARGET SERVER...\n";
    QTest::newRow("use") << "proxy use both"
                         << "mdmctl: WHICH \"both\": must be one of \"global\", \"networks\"\n";
}

void MdmctlProxyTest::wrongUsage()
{
    QFETCH(QString, arguments);
    m_phone.takeJournal(Service);
    const Mdmctl::Result result = run(qPrintable(arguments));
    QCOMPARE(result.status, 2);
    QTEST(result.errors, "error");
    QCOMPARE(m_phone.takeJournal(Service), QStringList());
}

void MdmctlProxyTest::switchesWhatIsUsed()
{
    QCOMPARE(run("proxy use global").output, QStringLiteral("The global proxy is used for all networks.\n"));
    QVERIFY(globalProxy().value(QLatin1String("active")).toBool());
    QCOMPARE(run("proxy use networks --json").json(), json(R"({"use": "networks"})"));
    QVERIFY(!globalProxy().value(QLatin1String("active")).toBool());
    QCOMPARE(run("proxy use networks").output, QStringLiteral("Each network uses its own proxy.\n"));
}

void MdmctlProxyTest::refusedChangeIsTold()
{
    m_phone.failCalls(Service, QString(), QStringLiteral("SetProperty"),
                      QStringLiteral("net.connman.Error.PermissionDenied"),
                      QStringLiteral("Permission denied"));
    const Mdmctl::Result result = run("proxy automatic Home http://pac");
    QCOMPARE(result.status, 1);
    QCOMPARE(result.errors,
             QStringLiteral("mdmctl: the connection manager (net.connman) refused: Permission "
                            "denied (net.connman.Error.PermissionDenied)\n"));
}

void MdmctlProxyTest::silentServiceEndsTheWait()
{
    m_phone.swallowCalls(Service, QStringLiteral("/"), QStringLiteral("SetProperty"));
    const Mdmctl::Result result = run("proxy use global --timeout 0.2");
    QCOMPARE(result.status, 1);
    QCOMPARE(result.errors,
             QStringLiteral("mdmctl: the connection manager (net.connman) did not confirm the change within "
                            "0.2 s\n"));
    m_phone.swallowCalls(Service, QStringLiteral("/"), QStringLiteral("GetProperty"));
    QCOMPARE(
        run("proxy show --timeout 0.2").errors,
        QStringLiteral("mdmctl: the connection manager (net.connman) did not tell its proxies within 0.2 "
                       "s\n"));
}

void MdmctlProxyTest::watchTellsChanges()
{
    Mdmctl watch(
        {QStringLiteral("proxy"), QStringLiteral("watch"), QStringLiteral("Home"), QStringLiteral("--json")});
    QVERIFY(watch.waitForOutput(QStringLiteral("\"watching\"")));
    act("connection proxy", {Home, QStringLiteral("auto"), QStringLiteral("http://pac")});
    QVERIFY(watch.waitForOutput(QStringLiteral("\"url\":\"http://pac\"")));
    act("proxy active", {QStringLiteral("on")});
    QVERIFY(watch.waitForOutput(QStringLiteral("\"used\":false")));
    watch.interrupt(SIGINT);
    const Mdmctl::Result watched = watch.finish();
    QCOMPARE(watched.status, 0);
    QCOMPARE(watched.jsonLines().size(), 3);
}

void MdmctlProxyTest::watchEndsWithTheNetwork()
{
    Mdmctl watch({QStringLiteral("proxy"), QStringLiteral("watch"), QStringLiteral("Home")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Home: direct")));
    act("connection vanish", {Home});
    const Mdmctl::Result watched = watch.finish();
    act("connection return", {Home});
    QCOMPARE(watched.status, 1);
    QCOMPARE(watched.errors, QStringLiteral("mdmctl: the network has gone\n"));
}

void MdmctlProxyTest::absentServiceIsTold()
{
    m_phone.stopService(Service);
    const Mdmctl::Result result = run("proxy list");
    QCOMPARE(result.status, 3);
    QCOMPARE(result.errors, QStringLiteral("mdmctl: the connection manager (net.connman) is not running\n"));
}

void MdmctlProxyTest::policyIsApplied()
{
    const QString policy = write(R"({"proxy": {"use": "global",
        "global": {"method": "manual", "servers": ["http:\/\/a:1"], "exclusions": ["localhost"]},
        "networks": {"Home": {"method": "automatic", "url": "http:\/\/pac"}}}})");
    QJsonArray settings
        = Mdmctl::run({QStringLiteral("policy"), QStringLiteral("check"), policy, QStringLiteral("--json")})
              .json()
              .value(QLatin1String("settings"))
              .toArray();
    QCOMPARE(settings.size(), 3);
    QCOMPARE(settings.at(0).toObject(),
             json(R"({"path": "proxy.global", "status": "different", "present": {"method": "direct"},
                      "wanted": {"method": "manual", "servers": ["http:\/\/a:1"], "exclusions": ["localhost"]},
                      "detail": ""})"));
    const Mdmctl::Result applied
        = Mdmctl::run({QStringLiteral("policy"), QStringLiteral("apply"), policy, QStringLiteral("--json")});
    QCOMPARE(applied.status, 0);
    settings = applied.json().value(QLatin1String("settings")).toArray();
    for (const QJsonValue &setting : qAsConst(settings))
        QCOMPARE(setting[QLatin1String("status")].toString(), QStringLiteral("changed"));
    QCOMPARE(globalProxy(), json(R"({"active": true, "configuration": {"method": "manual",
                                     "servers": ["http:\/\/a:1"], "excludes": ["localhost"]}})"));
    QCOMPARE(proxyOf(Home), json(R"({"method": "auto", "url": "http:\/\/pac"})"));
    // Applying again changes nothing.
    m_phone.takeJournal(Service);
    QCOMPARE(Mdmctl::run({QStringLiteral("policy"), QStringLiteral("apply"), policy}).status, 0);
    QVERIFY(m_phone.takeJournal(Service).filter(QStringLiteral("SetProperty")).isEmpty());
}

void MdmctlProxyTest::policyOfAnUnknownNetwork()
{
    const QString policy = write(R"({"proxy": {"networks": {"Nowhere": {"method": "direct"}}}})");
    const Mdmctl::Result checked
        = Mdmctl::run({QStringLiteral("policy"), QStringLiteral("check"), policy, QStringLiteral("--json")});
    const QJsonObject setting = checked.json().value(QLatin1String("settings")).toArray().at(0).toObject();
    QCOMPARE(setting.value(QLatin1String("status")).toString(), QStringLiteral("unsupported"));
    QCOMPARE(setting.value(QLatin1String("detail")).toString(),
             QStringLiteral("the phone has no such network saved now"));
}

void MdmctlProxyTest::wrongPolicyIsRefused_data()
{
    QTest::addColumn<QByteArray>("proxy");
    QTest::addColumn<QString>("error");
    QTest::newRow("manual without servers") << QByteArray(R"({"global": {"method": "manual"}})")
                                            << "/proxy/global: a manual proxy needs \"servers\"";
    QTest::newRow("automatic without a URL")
        << QByteArray(R"({"networks": {"a/b": {"method": "automatic"}}})")
        << "/proxy/networks/a~1b: an automatic proxy needs \"url\"";
    QTest::newRow("no URL")
        << QByteArray(R"({"global": {"method": "manual", "servers": ["http:\/\/a", "b:1"]}})")
        << "/proxy/global/servers/1: must be a URL, such as http://proxy.example:3128; is "
           "\"b:1\"";
    QTest::newRow("no URL of a script")
        << QByteArray(R"({"global": {"method": "automatic", "url": "pac"}})")
        << "/proxy/global/url: must be a URL, such as http://proxy.example:3128; is \"pac\"";
    QTest::newRow("use") << QByteArray(R"({"use": "none"})")
                         << "/proxy/use: must be one of \"global\", \"networks\"; is \"none\"";
}

void MdmctlProxyTest::wrongPolicyIsRefused()
{
    QFETCH(QByteArray, proxy);
    QFETCH(QString, error);
    m_phone.takeJournal(Service);
    const Mdmctl::Result result = Mdmctl::run(
        {QStringLiteral("policy"), QStringLiteral("apply"), write("{\"proxy\": " + proxy + "}")});
    QCOMPARE(result.status, 2);
    QVERIFY2(result.errors.endsWith(error + QLatin1Char('\n')), qPrintable(result.errors));
    QCOMPARE(m_phone.takeJournal(Service), QStringList());
}

void MdmctlProxyTest::watchPutsDriftRight()
{
    Mdmctl watch(
        {QStringLiteral("policy"), QStringLiteral("watch"),
         write(R"({"proxy": {"use": "global", "global": {"method": "automatic", "url": "http:\/\/pac"},
                            "networks": {"Home": {"method": "direct"}}}})")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching for drift")));
    act("proxy configure", {QStringLiteral("direct")});
    QVERIFY(waitUntil([this] {
        return globalProxy().value(QLatin1String("configuration")).toObject()
            == json(R"({"method": "auto", "url": "http:\/\/pac"})");
    }));
    act("proxy active", {QStringLiteral("off")});
    QVERIFY(waitUntil([this] { return globalProxy().value(QLatin1String("active")).toBool(); }));
    act("connection proxy", {Home, QStringLiteral("manual"), QStringLiteral("http://drift:1")});
    QVERIFY(waitUntil([this] { return proxyOf(Home) == json(R"({"method": "direct"})"); }));
    // Also after the connection manager was away.
    m_phone.stopService(Service);
    QVERIFY(watch.waitForOutput(QStringLiteral("proxy.use: unsupported")));
    act("connection proxy", {Home, QStringLiteral("manual"), QStringLiteral("http://drift:1")});
    m_phone.startService(Service);
    QVERIFY(waitUntil([this] { return proxyOf(Home) == json(R"({"method": "direct"})"); }));
    watch.interrupt(SIGTERM);
    QCOMPARE(watch.finish().status, 0);
}

void MdmctlProxyTest::exportCanBeApplied()
{
    act("connection proxy",
        {Home, QStringLiteral("manual"), QStringLiteral("http://a:1"), QStringLiteral("x")});
    // Nobody could ask for what the network finds by itself.
    act("connection proxy", {Office, QStringLiteral("auto")});
    const Mdmctl::Result exported = run("policy export");
    const QJsonObject proxy = exported.json().value(QLatin1String("proxy")).toObject();
    QCOMPARE(proxy.value(QLatin1String("use")).toString(), QStringLiteral("networks"));
    QCOMPARE(proxy.value(QLatin1String("global")).toObject(), json(R"({"method": "direct"})"));
    const QJsonObject networks = proxy.value(QLatin1String("networks")).toObject();
    QCOMPARE(networks.value(Home).toObject(),
             json(R"({"method": "manual", "servers": ["http:\/\/a:1"], "exclusions": ["x"]})"));
    QVERIFY(!networks.contains(Office));
    QCOMPARE(Mdmctl::run({QStringLiteral("policy"), QStringLiteral("check"), write(exported.output.toUtf8())})
                 .status,
             0);
}

QTEST_GUILESS_MAIN(MdmctlProxyTest)

#include "mdmctl_proxy_test.moc"
