// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"

#include <corvanemdm/genericaccountprovisioner.h>

#include <QtCore/QUuid>
#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusSignature>
#include <QtDBus/QDBusUnixFileDescriptor>
#include <QtDBus/QDBusVariant>
#include <QtTest/QtTest>

#include <memory>

using namespace Corvane::Mdm::Accounts;
using Generic = GenericAccountProvisioner;

namespace
{

const QString Service = QStringLiteral("org.corvaneos.mdmproxy");
const QString Path = QStringLiteral("/Corvane/Mdm/Proxy/Accounts");
const QString Create = QStringLiteral("createAccount");

void complete(Generic &generic)
{
    generic.setProviderName(QStringLiteral("corvane-cloud"));
    generic.setDefaultServiceName(QStringLiteral("corvane-cloud-sync"));
    generic.setUsername(QStringLiteral("user"));
    generic.setPassword(QStringLiteral("secret"));
}

} // namespace

class GenericAccountProvisionerTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void requiredSettings_data();
    void requiredSettings();
    void sendsSevenValues();
    void sendsAnEmptyMap();
    void mapThatCannotTravel_data();
    void mapThatCannotTravel();
    void oddMapsTravel();
    void makesAnAccount();
    void refusalTellsWhy();
    void errors();

private:
    std::unique_ptr<Phone> m_phone;
    std::unique_ptr<MessageLog> m_log;
};

void GenericAccountProvisionerTest::init()
{
    m_phone = std::make_unique<Phone>();
    m_log = std::make_unique<MessageLog>();
}

void GenericAccountProvisionerTest::cleanup()
{
    const QStringList warnings = m_log->takeWarnings();
    m_log.reset();
    m_phone->clearFaults();
    QCOMPARE(warnings, QStringList());
}

void GenericAccountProvisionerTest::requiredSettings_data()
{
    QTest::addColumn<QByteArray>("setting");
    for (const char *setting : {"providerName", "defaultServiceName", "username", "password"})
        QTest::newRow(setting) << QByteArray(setting);
}

void GenericAccountProvisionerTest::requiredSettings()
{
    QFETCH(QByteArray, setting);
    Generic generic;
    complete(generic);
    QVERIFY(generic.canCreateAccount());
    SignalSequence seen(&generic);
    const QStringList both{QString::fromLatin1(setting) + QLatin1String("Changed()"),
                           QStringLiteral("canCreateAccountChanged()")};
    generic.setProperty(setting, QString());
    QCOMPARE(seen.take(), both);
    QVERIFY(!generic.canCreateAccount());

    QVERIFY(!generic.createAccount());
    QCOMPARE(generic.error(), 1);
    QCOMPARE(generic.errorMessage(), QStringLiteral("One or more required settings have not been provided"));
    m_phone->settle(Service);
    QCOMPARE(m_phone->takeJournal(Service), QStringList());
    QCOMPARE(seen.take(), QStringList());

    generic.setProperty(setting, QStringLiteral("x"));
    QCOMPARE(seen.take(), both);
    QCOMPARE(generic.property(setting), QVariant(QStringLiteral("x")));
    generic.setProperty(setting, QStringLiteral("x"));
    QCOMPARE(seen.take(), QStringList());
    generic.setProperty(setting, QStringLiteral("y"));
    QCOMPARE(seen.take(), QStringList(both.first()));
}

void GenericAccountProvisionerTest::sendsSevenValues()
{
    Generic generic;
    generic.setProviderName(QStringLiteral("provider"));
    generic.setDefaultServiceName(QStringLiteral("service"));
    generic.setUsername(QStringLiteral("user"));
    generic.setPassword(QStringLiteral("password"));
    generic.setAccountDisplayName(QStringLiteral("display"));
    generic.setAccountConfiguration({{QStringLiteral("count"), 7},
                                     {QStringLiteral("nested"), QStringList{QStringLiteral("a")}},
                                     {QStringLiteral("on"), true}});
    generic.setAccountReadOnly(true);
    QVERIFY(!generic.createAccount());
    QCOMPARE(
        m_phone->takeJournalWithInterfaces(Service),
        QStringList(Path
                    + QStringLiteral(" org.corvaneos.mdmproxy.accounts.createAccount ('provider', 'service', "
                                     "'user', 'password', 'display', {'count': <7>, 'nested': <['a']>, 'on': "
                                     "<true>}, true)")));
    QCOMPARE(m_phone->lastSignature(), QStringLiteral("sssssa{sv}b"));
    QCOMPARE(generic.error(), 2);
}

void GenericAccountProvisionerTest::sendsAnEmptyMap()
{
    Generic generic;
    complete(generic);
    generic.setUsername(QStringLiteral("plain"));
    QVERIFY(generic.createAccount());
    QCOMPARE(m_phone->takeJournal(Service),
             QStringList(Path
                         + QStringLiteral(" createAccount ('corvane-cloud', 'corvane-cloud-sync', 'plain', "
                                          "'secret', '', @a{sv} {}, false)")));
}

void GenericAccountProvisionerTest::mapThatCannotTravel_data()
{
    QTest::addColumn<QVariant>("value");
    const QString key = QStringLiteral("k");
    QTest::newRow("nothing") << QVariant();
    QTest::newRow("nothing in a list") << QVariant(QVariantList{1, QVariant()});
    QTest::newRow("nothing in a map") << QVariant(QVariantMap{{key, QVariant()}});
    QTest::newRow("nothing in a hash") << QVariant(QVariantHash{{key, QVariant()}});
    QTest::newRow("nothing in a variant") << QVariant::fromValue(QDBusVariant(QVariant()));
    QTest::newRow("not registered") << QVariant::fromValue(QUuid::createUuid());
    QTest::newRow("no path") << QVariant::fromValue(QDBusObjectPath());
    QTest::newRow("no signature") << QVariant::fromValue(QDBusSignature());
    QTest::newRow("no file") << QVariant::fromValue(QDBusUnixFileDescriptor());
}

void GenericAccountProvisionerTest::mapThatCannotTravel()
{
    QFETCH(QVariant, value);
    Generic generic;
    complete(generic);
    generic.setAccountConfiguration({{QStringLiteral("key"), value}});
    QVERIFY(!generic.createAccount());
    QCOMPARE(generic.error(), 1);
    QCOMPARE(generic.errorMessage(),
             QStringLiteral("The account configuration has a value that D-Bus cannot carry"));
    m_phone->settle(Service);
    QCOMPARE(m_phone->takeJournal(Service), QStringList());
}

void GenericAccountProvisionerTest::oddMapsTravel()
{
    Generic generic;
    complete(generic);
    generic.setUsername(QStringLiteral("odd"));
    generic.setAccountConfiguration(
        {{QStringLiteral("a"), QVariant::fromValue(QDBusVariant(1u))},
         {QStringLiteral("b"), QVariantList{QVariantHash{{QStringLiteral("x"), 0.5}}}},
         {QString(), QVariant::fromValue(QDBusObjectPath(QStringLiteral("/p")))},
         {QStringLiteral("c"), QByteArray("\0z", 2)}});
    QVERIFY2(generic.createAccount(), qPrintable(generic.errorMessage()));
    const QStringList calls = m_phone->takeJournal(Service);
    QVERIFY2(calls.first().contains(QLatin1String("{'': <objectpath '/p'>, 'a': <<uint32 1>>, 'b': "
                                                  "<[<{'x': <0.5>}>]>, 'c': <[byte 0x00, 0x7a]>}")),
             qPrintable(calls.first()));
}

void GenericAccountProvisionerTest::makesAnAccount()
{
    Generic generic;
    complete(generic);
    generic.setUsername(QStringLiteral("shown"));
    generic.setAccountDisplayName(QStringLiteral("Shown by this"));
    QVERIFY(generic.createAccount());
    QCOMPARE(generic.error(), 0);
    QCOMPARE(generic.errorMessage(), QString());
    QCOMPARE(generic.listAccounts().last().displayName, QStringLiteral("Shown by this"));
    QVERIFY(!generic.createAccount());
    QCOMPARE(generic.error(), 4);
    QCOMPARE(generic.errorMessage(), QStringLiteral("there is an account for shown already"));
}

void GenericAccountProvisionerTest::refusalTellsWhy()
{
    Generic generic;
    complete(generic);
    m_phone->answerCalls(Service, Path, Create, {quint64(0), QStringLiteral("no room"), -2});
    QVERIFY(!generic.createAccount());
    QCOMPARE(generic.error(), -2);
    QCOMPARE(generic.errorMessage(), QStringLiteral("no room"));
    m_phone->answerCalls(Service, Path, Create, {quint64(9), QStringLiteral("made"), 3});
    QVERIFY(generic.createAccount());
    QCOMPARE(generic.error(), 0);
    QCOMPARE(generic.errorMessage(), QString());
}

void GenericAccountProvisionerTest::errors()
{
    Generic generic;
    complete(generic);
    m_phone->failCalls(Service, Path, Create, QStringLiteral("com.example.Broken"),
                       QStringLiteral("Out of order"));
    QVERIFY(!generic.createAccount());
    QCOMPARE(generic.error(), 1);
    QCOMPARE(generic.errorMessage(), QStringLiteral("Out of order"));
}

QTEST_GUILESS_MAIN(GenericAccountProvisionerTest)
#include "genericaccountprovisioner_test.moc"
