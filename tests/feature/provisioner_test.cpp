// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"

#include <corvanemdm/emailaccountprovisioner.h>
#include <corvanemdm/genericaccountprovisioner.h>

#include <QtCore/QJsonArray>
#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusMetaType>
#include <QtTest/QtTest>

#include <cstring>
#include <limits>
#include <memory>
#include <type_traits>

using namespace Corvane::Mdm::Accounts;
using AccountInfo = Provisioner::AccountInfo;

/** An account as the service sends it. */
struct WireAccount {
    quint64 id;
    QString provider;
    QString name;
};
Q_DECLARE_METATYPE(WireAccount)

QDBusArgument &operator<<(QDBusArgument &out, const WireAccount &account)
{
    out.beginStructure();
    out << account.id << account.provider << account.name;
    out.endStructure();
    return out;
}

const QDBusArgument &operator>>(const QDBusArgument &in, WireAccount &account)
{
    in.beginStructure();
    in >> account.id >> account.provider >> account.name;
    in.endStructure();
    return in;
}

namespace
{

const QString Service = QStringLiteral("org.corvaneos.mdmproxy");
const QString Path = QStringLiteral("/Corvane/Mdm/Proxy/Accounts");
const QString Delete = QStringLiteral("deleteAccount");
const QString List = QStringLiteral("listAccounts");

QVariant wire(const QList<WireAccount> &accounts)
{
    return QVariant::fromValue(accounts);
}

/** Which entry of the table of virtual functions @p function stands for. */
template <typename Function> std::size_t slotOf(Function function)
{
    // What such a pointer begins with is the entry's offset; some systems mark that in its lowest bit.
    std::size_t offset = 0;
    static_assert(sizeof function >= sizeof offset);
    std::memcpy(&offset, &function, sizeof offset);
    return offset / sizeof(void *);
}

/** The last virtual function of QObject is for those who derive from it. */
struct Derived : public QObject {
    using QObject::disconnectNotify;
};

QString text(const QList<AccountInfo> &accounts)
{
    QStringList texts;
    for (const AccountInfo &account : accounts)
        texts << QStringLiteral("%1 %2 %3")
                     .arg(account.accountId)
                     .arg(account.providerName, account.displayName);
    return texts.join(QLatin1String(", "));
}

} // namespace

/** What the kinds of accounts share: settings, listing and deleting. */
class ProvisionerTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void init();
    void cleanup();

    void startsEmpty();
    void constructionSendsNothing();
    void settersTellWhatHasChanged();
    void configurationIsComparedByValue();
    void providerNameIsLookedAt();
    void theAnswerIsComparedAfterTheSettersSignal();
    void deletionInASlot();
    void worksThroughTheMetaObject();
    void virtualFunctionsKeepTheirOrder();
    void kindsAreReachedThroughTheBase();

    void listsInTheServicesOrder();
    void listCarriesTheServicesTextAndCode();
    void listErrors();
    void oddListsAreEmpty_data();
    void oddListsAreEmpty();
    void deletes();
    void sendsTheNumber_data();
    void sendsTheNumber();
    void refusedDeletionTellsWhy();
    void oddDeletionsFail_data();
    void oddDeletionsFail();
    void deletionErrors();
    void serviceThatIsNotThere();

private:
    std::unique_ptr<Phone> m_phone;
    std::unique_ptr<MessageLog> m_log;
};

void ProvisionerTest::initTestCase()
{
    qDBusRegisterMetaType<WireAccount>();
    qDBusRegisterMetaType<QList<WireAccount>>();
}

void ProvisionerTest::init()
{
    m_phone = std::make_unique<Phone>();
    m_log = std::make_unique<MessageLog>();
}

void ProvisionerTest::cleanup()
{
    const QStringList warnings = m_log->takeWarnings();
    m_log.reset();
    m_phone->clearFaults();
    m_phone->startService(Service);
    // No call and no failure writes anything.
    QCOMPARE(warnings, QStringList());
}

void ProvisionerTest::startsEmpty()
{
    const GenericAccountProvisioner generic;
    const Provisioner &provisioner = generic;
    QVERIFY(!provisioner.canCreateAccount());
    QCOMPARE(provisioner.providerName(), QString());
    QCOMPARE(provisioner.accountDisplayName(), QString());
    QCOMPARE(provisioner.accountConfiguration(), QVariantMap());
    QVERIFY(!provisioner.accountReadOnly());
    QCOMPARE(provisioner.error(), 0);
    QCOMPARE(provisioner.errorMessage(), QString());
    const AccountInfo info;
    QCOMPARE(info.accountId, quint64(0));
}

void ProvisionerTest::constructionSendsNothing()
{
    const EmailAccountProvisioner email;
    const GenericAccountProvisioner generic;
    m_phone->settle(Service);
    QCOMPARE(m_phone->takeJournal(Service), QStringList());
}

void ProvisionerTest::settersTellWhatHasChanged()
{
    GenericAccountProvisioner provisioner;
    SignalSequence seen(&provisioner);
    provisioner.setProviderName(QString());
    provisioner.setAccountDisplayName(QString());
    provisioner.setAccountConfiguration({});
    provisioner.setAccountReadOnly(false);
    QCOMPARE(seen.take(), QStringList());

    provisioner.setProviderName(QStringLiteral("p"));
    provisioner.setAccountDisplayName(QStringLiteral("d"));
    provisioner.setAccountConfiguration({{QStringLiteral("k"), 1}});
    provisioner.setAccountReadOnly(true);
    const QStringList all{
        QStringLiteral("providerNameChanged()"), QStringLiteral("accountDisplayNameChanged()"),
        QStringLiteral("accountConfigurationChanged()"), QStringLiteral("accountReadOnlyChanged()")};
    QCOMPARE(seen.take(), all);
    QCOMPARE(provisioner.providerName(), QStringLiteral("p"));
    QCOMPARE(provisioner.accountDisplayName(), QStringLiteral("d"));
    QCOMPARE(provisioner.accountConfiguration(), QVariantMap({{QStringLiteral("k"), 1}}));
    QVERIFY(provisioner.accountReadOnly());

    provisioner.setProviderName(QStringLiteral("p"));
    provisioner.setAccountDisplayName(QStringLiteral("d"));
    provisioner.setAccountReadOnly(true);
    QCOMPARE(seen.take(), QStringList());
}

void ProvisionerTest::configurationIsComparedByValue()
{
    GenericAccountProvisioner provisioner;
    const QString key = QStringLiteral("k");
    const auto nested = [&key](int value) {
        return QVariantMap{{key, QVariantMap{{key, QVariantList{value, QStringLiteral("x")}}}}};
    };
    provisioner.setAccountConfiguration(nested(1));
    SignalSequence seen(&provisioner);
    provisioner.setAccountConfiguration(nested(1));
    QCOMPARE(seen.take(), QStringList());
    provisioner.setAccountConfiguration(nested(2));
    provisioner.setAccountConfiguration({});
    QCOMPARE(seen.take(),
             QStringList({QStringLiteral("accountConfigurationChanged()"),
                          QStringLiteral("accountConfigurationChanged()")}));
}

void ProvisionerTest::providerNameIsLookedAt()
{
    GenericAccountProvisioner provisioner;
    provisioner.setDefaultServiceName(QStringLiteral("s"));
    provisioner.setUsername(QStringLiteral("u"));
    provisioner.setPassword(QStringLiteral("p"));
    QVERIFY(!provisioner.canCreateAccount());
    SignalSequence seen(&provisioner);
    provisioner.setProviderName(QStringLiteral("a"));
    QCOMPARE(
        seen.take(),
        QStringList({QStringLiteral("providerNameChanged()"), QStringLiteral("canCreateAccountChanged()")}));
    QVERIFY(provisioner.canCreateAccount());
    provisioner.setProviderName(QStringLiteral("b"));
    QCOMPARE(seen.take(), QStringList(QStringLiteral("providerNameChanged()")));
    provisioner.setProviderName(QStringLiteral("b"));
    QCOMPARE(seen.take(), QStringList());
    provisioner.setProviderName(QString());
    QCOMPARE(
        seen.take(),
        QStringList({QStringLiteral("providerNameChanged()"), QStringLiteral("canCreateAccountChanged()")}));
    QVERIFY(!provisioner.canCreateAccount());
}

void ProvisionerTest::theAnswerIsComparedAfterTheSettersSignal()
{
    GenericAccountProvisioner provisioner;
    provisioner.setDefaultServiceName(QStringLiteral("s"));
    provisioner.setUsername(QStringLiteral("u"));
    provisioner.setPassword(QStringLiteral("p"));
    SignalSequence seen(&provisioner);
    connect(&provisioner, &Provisioner::providerNameChanged, &provisioner,
            [&] { provisioner.setUsername(QString()); });
    provisioner.setProviderName(QStringLiteral("a"));
    // With the name it could; without the user, which went in between, it cannot, as before.
    QCOMPARE(seen.take(),
             QStringList({QStringLiteral("providerNameChanged()"), QStringLiteral("usernameChanged()"),
                          QStringLiteral("canCreateAccountChanged()")}));
    QVERIFY(!provisioner.canCreateAccount());
}

void ProvisionerTest::deletionInASlot()
{
    auto provisioner = std::make_unique<GenericAccountProvisioner>();
    connect(provisioner.get(), &Provisioner::providerNameChanged, this, [&] { provisioner.reset(); });
    provisioner->setProviderName(QStringLiteral("a"));
    QVERIFY(!provisioner);
}

void ProvisionerTest::worksThroughTheMetaObject()
{
    GenericAccountProvisioner provisioner;
    const auto roundTrip = [&provisioner](const char *name, const QVariant &value) {
        return provisioner.setProperty(name, value) && provisioner.property(name) == value;
    };
    QVERIFY(roundTrip("providerName", QStringLiteral("p")));
    QVERIFY(roundTrip("accountDisplayName", QStringLiteral("d")));
    QVERIFY(roundTrip("accountConfiguration", QVariantMap({{QStringLiteral("k"), 1}})));
    QVERIFY(roundTrip("accountReadOnly", true));
    QVERIFY(!provisioner.setProperty("canCreateAccount", true));
    QCOMPARE(provisioner.property("canCreateAccount"), QVariant(false));

    const QMetaObject &meta = Provisioner::staticMetaObject;
    for (int index = meta.propertyOffset(); index < meta.propertyCount(); ++index) {
        const QMetaProperty property = meta.property(index);
        QCOMPARE(property.notifySignal().name(), QByteArray(property.name()) + "Changed");
    }
    QCOMPARE(QMetaType::type("Corvane::Mdm::Accounts::Provisioner::AccountInfo"), qMetaTypeId<AccountInfo>());
    QCOMPARE(QMetaType::type("QList<Corvane::Mdm::Accounts::Provisioner::AccountInfo>"),
             qMetaTypeId<QList<AccountInfo>>());
    QCOMPARE(QByteArray(QDBusMetaType::typeToSignature(qMetaTypeId<AccountInfo>())), QByteArray("(tss)"));
    QCOMPARE(QByteArray(QDBusMetaType::typeToSignature(qMetaTypeId<QList<AccountInfo>>())),
             QByteArray("a(tss)"));
    // The calls are for C++ alone.
    QCOMPARE(meta.indexOfMethod("listAccounts()"), -1);
    QCOMPARE(meta.indexOfMethod("deleteAccount(quint64)"), -1);
    QCOMPARE(meta.indexOfMethod("createAccount()"), -1);
}

void ProvisionerTest::virtualFunctionsKeepTheirOrder()
{
    // Agents were compiled with these numbers.
    const std::size_t last = slotOf(&Derived::disconnectNotify);
    QCOMPARE(slotOf(&Provisioner::createAccount), last + 1);
    QCOMPARE(slotOf(&Provisioner::deleteAccount), last + 2);
    QCOMPARE(slotOf(&Provisioner::listAccounts), last + 3);
    // The kinds answer in the same place.
    QCOMPARE(slotOf(&EmailAccountProvisioner::createAccount), last + 1);
    QCOMPARE(slotOf(&GenericAccountProvisioner::createAccount), last + 1);
}

void ProvisionerTest::kindsAreReachedThroughTheBase()
{
    EmailAccountProvisioner email;
    GenericAccountProvisioner generic;
    for (Provisioner *provisioner : std::initializer_list<Provisioner *>{&email, &generic}) {
        provisioner->setProviderName(QStringLiteral("p"));
        QVERIFY(!provisioner->createAccount());
        QCOMPARE(provisioner->errorMessage(),
                 QStringLiteral("One or more required settings have not been provided"));
    }
    static_assert(std::is_abstract<Provisioner>::value, "only kinds of accounts can be made");
    static_assert(std::has_virtual_destructor<Provisioner>::value, "kinds are deleted as provisioners");
}

void ProvisionerTest::listsInTheServicesOrder()
{
    EmailAccountProvisioner provisioner;
    QCOMPARE(text(provisioner.listAccounts()), QStringLiteral("1 corvane-cloud Maria's cloud"));
    QCOMPARE(m_phone->takeJournalWithInterfaces(Service),
             QStringList(QStringLiteral("%1 org.corvaneos.mdmproxy.accounts.listAccounts ()").arg(Path)));
    m_phone->answerCalls(Service, Path, List,
                         {wire({{std::numeric_limits<quint64>::max(), QString(), QStringLiteral("z")},
                                {0, QStringLiteral("p"), QStringLiteral("a")},
                                {0, QStringLiteral("p"), QStringLiteral("a")}}),
                          QString(), 0});
    QCOMPARE(text(provisioner.listAccounts()), QStringLiteral("18446744073709551615  z, 0 p a, 0 p a"));
    QCOMPARE(provisioner.error(), 0);
}

void ProvisionerTest::listCarriesTheServicesTextAndCode()
{
    GenericAccountProvisioner provisioner;
    m_phone->answerCalls(
        Service, Path, List,
        {wire({{3, QStringLiteral("p"), QStringLiteral("n")}}), QStringLiteral("half of it"), -7});
    QCOMPARE(text(provisioner.listAccounts()), QStringLiteral("3 p n"));
    QCOMPARE(provisioner.error(), -7);
    QCOMPARE(provisioner.errorMessage(), QStringLiteral("half of it"));
    m_phone->clearFaults();
    provisioner.listAccounts();
    QCOMPARE(provisioner.error(), 0);
    QCOMPARE(provisioner.errorMessage(), QString());
}

void ProvisionerTest::listErrors()
{
    GenericAccountProvisioner provisioner;
    m_phone->failCalls(Service, Path, List, QStringLiteral("com.example.Broken"),
                       QStringLiteral("Out of order"));
    QCOMPARE(provisioner.listAccounts().size(), 0);
    QCOMPARE(provisioner.error(), 1);
    QCOMPARE(provisioner.errorMessage(), QStringLiteral("Out of order"));
}

void ProvisionerTest::oddListsAreEmpty_data()
{
    QTest::addColumn<QVariantList>("values");
    QTest::addColumn<QString>("message");
    QTest::addColumn<int>("code");
    QTest::newRow("nothing") << QVariantList() << QString() << 0;
    QTest::newRow("text") << QVariantList{QStringLiteral("x"), QStringLiteral("m"), 4} << QStringLiteral("m")
                          << 4;
    QTest::newRow("strings") << QVariantList{QStringList{QStringLiteral("x")}, QString(), 0} << QString()
                             << 0;
    QTest::newRow("map") << QVariantList{QVariantMap{{QStringLiteral("x"), 1}}, QString(), 0} << QString()
                         << 0;
    QTest::newRow("list only") << QVariantList{wire({})} << QString() << 0;
    QTest::newRow("swapped") << QVariantList{wire({}), 4, QStringLiteral("m")} << QString() << 0;
    QTest::newRow("unsigned code") << QVariantList{wire({}), QStringLiteral("m"), 4u} << QStringLiteral("m")
                                   << 0;
}

void ProvisionerTest::oddListsAreEmpty()
{
    QFETCH(QVariantList, values);
    QFETCH(QString, message);
    QFETCH(int, code);
    m_phone->answerCalls(Service, Path, List, values);
    GenericAccountProvisioner provisioner;
    QCOMPARE(provisioner.listAccounts().size(), 0);
    QCOMPARE(provisioner.errorMessage(), message);
    QCOMPARE(provisioner.error(), code);
}

void ProvisionerTest::deletes()
{
    GenericAccountProvisioner provisioner;
    provisioner.setProviderName(QStringLiteral("corvane-cloud"));
    provisioner.setDefaultServiceName(QStringLiteral("corvane-cloud-sync"));
    provisioner.setUsername(QStringLiteral("short"));
    provisioner.setPassword(QStringLiteral("p"));
    QVERIFY(provisioner.createAccount());
    const QList<AccountInfo> accounts = provisioner.listAccounts();
    QCOMPARE(accounts.size(), 2);
    QVERIFY(provisioner.deleteAccount(accounts.last().accountId));
    QCOMPARE(provisioner.error(), 0);
    QCOMPARE(m_phone->state()
                 .value(QLatin1String("accounts"))
                 .toObject()
                 .value(QLatin1String("present"))
                 .toArray()
                 .size(),
             1);
}

void ProvisionerTest::sendsTheNumber_data()
{
    QTest::addColumn<quint64>("number");
    QTest::newRow("none") << quint64(0);
    QTest::newRow("above 32 bits") << quint64(1) + std::numeric_limits<quint32>::max();
    QTest::newRow("largest") << std::numeric_limits<quint64>::max();
}

void ProvisionerTest::sendsTheNumber()
{
    QFETCH(quint64, number);
    GenericAccountProvisioner provisioner;
    QVERIFY(!provisioner.deleteAccount(number));
    QCOMPARE(m_phone->takeJournal(Service),
             QStringList(QStringLiteral("%1 deleteAccount (uint64 %2,)").arg(Path).arg(number)));
}

void ProvisionerTest::refusedDeletionTellsWhy()
{
    GenericAccountProvisioner provisioner;
    m_phone->answerCalls(Service, Path, Delete, {false, QStringLiteral("not that one"), 42});
    QVERIFY(!provisioner.deleteAccount(1));
    QCOMPARE(provisioner.error(), 42);
    QCOMPARE(provisioner.errorMessage(), QStringLiteral("not that one"));

    // Success clears both, whatever else the answer says.
    m_phone->answerCalls(Service, Path, Delete, {true, QStringLiteral("gone"), 3});
    QVERIFY(provisioner.deleteAccount(1));
    QCOMPARE(provisioner.error(), 0);
    QCOMPARE(provisioner.errorMessage(), QString());
}

void ProvisionerTest::oddDeletionsFail_data()
{
    QTest::addColumn<QVariantList>("values");
    QTest::addColumn<QString>("message");
    QTest::addColumn<int>("code");
    QTest::newRow("nothing") << QVariantList() << QString() << 0;
    QTest::newRow("number") << QVariantList{1, QStringLiteral("m"), 4} << QStringLiteral("m") << 4;
    QTest::newRow("word") << QVariantList{QStringLiteral("true"), QStringLiteral("m"), 4}
                          << QStringLiteral("m") << 4;
    QTest::newRow("failure, odd text") << QVariantList{false, 7, 4} << QString() << 4;
    QTest::newRow("failure, odd code")
        << QVariantList{false, QStringLiteral("m"), QStringLiteral("4")} << QStringLiteral("m") << 0;
}

void ProvisionerTest::oddDeletionsFail()
{
    QFETCH(QVariantList, values);
    QFETCH(QString, message);
    QFETCH(int, code);
    m_phone->answerCalls(Service, Path, Delete, values);
    GenericAccountProvisioner provisioner;
    QVERIFY(!provisioner.deleteAccount(1));
    QCOMPARE(provisioner.errorMessage(), message);
    QCOMPARE(provisioner.error(), code);

    m_phone->answerCalls(Service, Path, Delete, {true});
    QVERIFY(provisioner.deleteAccount(1));
}

void ProvisionerTest::deletionErrors()
{
    GenericAccountProvisioner provisioner;
    m_phone->failCalls(Service, Path, Delete, QStringLiteral("com.example.Broken"),
                       QStringLiteral("Out of order"));
    QVERIFY(!provisioner.deleteAccount(1));
    QCOMPARE(provisioner.error(), 1);
    QCOMPARE(provisioner.errorMessage(), QStringLiteral("Out of order"));
}

void ProvisionerTest::serviceThatIsNotThere()
{
    m_phone->stopService(Service);
    EmailAccountProvisioner provisioner;
    QCOMPARE(provisioner.error(), 0);
    QCOMPARE(provisioner.listAccounts().size(), 0);
    QCOMPARE(provisioner.error(), 1);
    QVERIFY(!provisioner.errorMessage().isEmpty());
    QVERIFY(!provisioner.deleteAccount(1));
    QCOMPARE(provisioner.error(), 1);

    m_phone->startService(Service);
    QCOMPARE(provisioner.listAccounts().size(), 1);
    QCOMPARE(provisioner.error(), 0);
    QCOMPARE(provisioner.errorMessage(), QString());
}

QTEST_GUILESS_MAIN(ProvisionerTest)
#include "provisioner_test.moc"
