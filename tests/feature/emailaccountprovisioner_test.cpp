// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"

#include <corvanemdm/emailaccountprovisioner.h>

#include <QtCore/QJsonArray>
#include <QtCore/QMetaEnum>
#include <QtTest/QtTest>

#include <memory>

using namespace Corvane::Mdm::Accounts;
using Email = EmailAccountProvisioner;

namespace
{

const QString Service = QStringLiteral("org.corvaneos.mdmproxy");
const QString Path = QStringLiteral("/Corvane/Mdm/Proxy/Accounts");
const QString Create = QStringLiteral("createEmailAccount");

/** Another value than the one that every setting begins with. */
QVariant otherValue(const QMetaProperty &property)
{
    if (property.isEnumType())
        return 1;
    switch (property.type()) {
    case QVariant::Bool:
        return true;
    case QVariant::Int:
        return 993;
    default:
        return QStringLiteral("x");
    }
}

void complete(Email &email)
{
    email.setProviderName(QStringLiteral("email"));
    email.setEmailAddress(QStringLiteral("maria@example.org"));
    email.setIncomingPassword(QStringLiteral("secret"));
}

} // namespace

class EmailAccountProvisionerTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void enumsHaveTheirNumbers();
    void everySettingTellsOfItself_data();
    void everySettingTellsOfItself();
    void requiredSettings_data();
    void requiredSettings();
    void missingSettingsSendNothing_data();
    void missingSettingsSendNothing();
    void sendsNineteenValues();
    void sendsWhatIsEmptyAsItIs();
    void numbersWithoutANameAreSent();
    void makesAnAccount();
    void refusalTellsWhy();
    void oddAnswersFail_data();
    void oddAnswersFail();
    void errors();
    void serviceThatIsNotThere();

private:
    std::unique_ptr<Phone> m_phone;
    std::unique_ptr<MessageLog> m_log;
};

void EmailAccountProvisionerTest::init()
{
    m_phone = std::make_unique<Phone>();
    m_log = std::make_unique<MessageLog>();
}

void EmailAccountProvisionerTest::cleanup()
{
    const QStringList warnings = m_log->takeWarnings();
    m_log.reset();
    m_phone->clearFaults();
    m_phone->startService(Service);
    // No call and no failure writes anything: there are passwords in them.
    QCOMPARE(warnings, QStringList());
}

void EmailAccountProvisionerTest::enumsHaveTheirNumbers()
{
    const auto keys = [](const QMetaEnum &meta) {
        QStringList names;
        for (int index = 0; index < meta.keyCount(); ++index)
            names << QStringLiteral("%1=%2").arg(QLatin1String(meta.key(index))).arg(meta.value(index));
        return names.join(QLatin1Char(' '));
    };
    QCOMPARE(keys(QMetaEnum::fromType<Email::IncomingProtocol>()),
             QStringLiteral("NoIncomingProtocol=0 Imap4=1 Pop3=2"));
    QCOMPARE(keys(QMetaEnum::fromType<Email::OutgoingProtocol>()),
             QStringLiteral("NoOutgoingProtocol=0 Smtp=1"));
    QCOMPARE(keys(QMetaEnum::fromType<Email::ConnectionEncryption>()),
             QStringLiteral("NoEncryption=0 SSL=1 StartTLS=2"));
    QCOMPARE(keys(QMetaEnum::fromType<Email::Authentication>()),
             QStringLiteral("NoAuthentication=0 Login=1 Plain=2 CramMd5=3"));
}

void EmailAccountProvisionerTest::everySettingTellsOfItself_data()
{
    QTest::addColumn<int>("index");
    const QMetaObject &meta = Email::staticMetaObject;
    QCOMPARE(meta.propertyCount() - meta.propertyOffset(), 17);
    for (int index = meta.propertyOffset(); index < meta.propertyCount(); ++index)
        QTest::newRow(meta.property(index).name()) << index;
}

void EmailAccountProvisionerTest::everySettingTellsOfItself()
{
    QFETCH(int, index);
    const QMetaProperty property = Email::staticMetaObject.property(index);
    Email email;
    SignalSequence seen(&email);
    const QVariant first = property.read(&email);
    QVERIFY(first == QVariant(first.userType(), nullptr) || first.toInt() == 0);
    QVERIFY(property.write(&email, first));
    QCOMPARE(seen.take(), QStringList());

    QVERIFY(property.write(&email, otherValue(property)));
    const QStringList own{QString::fromLatin1(property.name()) + QLatin1String("Changed()")};
    QCOMPARE(seen.take(), own);
    QCOMPARE(property.read(&email).toString(), otherValue(property).toString());
    QVERIFY(property.write(&email, otherValue(property)));
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(property.write(&email, first));
    QCOMPARE(seen.take(), own);
    // Nobody else's value has changed with it.
    for (int other = Email::staticMetaObject.propertyOffset();
         other < Email::staticMetaObject.propertyCount(); ++other)
        QVERIFY(!email.metaObject()->property(other).read(&email).toBool());
}

void EmailAccountProvisionerTest::requiredSettings_data()
{
    QTest::addColumn<QByteArray>("setting");
    for (const char *setting : {"providerName", "emailAddress", "incomingPassword"})
        QTest::newRow(setting) << QByteArray(setting);
}

void EmailAccountProvisionerTest::requiredSettings()
{
    QFETCH(QByteArray, setting);
    Email email;
    complete(email);
    QVERIFY(email.canCreateAccount());
    SignalSequence seen(&email);
    const QStringList both{QString::fromLatin1(setting) + QLatin1String("Changed()"),
                           QStringLiteral("canCreateAccountChanged()")};
    email.setProperty(setting, QString());
    QCOMPARE(seen.take(), both);
    QVERIFY(!email.canCreateAccount());
    email.setProperty(setting, QStringLiteral("a@b"));
    QCOMPARE(seen.take(), both);
    QVERIFY(email.canCreateAccount());
    email.setProperty(setting, QStringLiteral("c@d"));
    QCOMPARE(seen.take(), QStringList(both.first()));

    // The others neither take it away nor give it.
    email.setIncomingServer(QStringLiteral("imap.example.org"));
    email.setOutgoingPassword(QStringLiteral("p"));
    QCOMPARE(seen.take(),
             QStringList(
                 {QStringLiteral("incomingServerChanged()"), QStringLiteral("outgoingPasswordChanged()")}));
}

void EmailAccountProvisionerTest::missingSettingsSendNothing_data()
{
    requiredSettings_data();
}

void EmailAccountProvisionerTest::missingSettingsSendNothing()
{
    QFETCH(QByteArray, setting);
    Email email;
    complete(email);
    email.setProperty(setting, QString());
    QVERIFY(!email.createAccount());
    QCOMPARE(email.error(), 1);
    QCOMPARE(email.errorMessage(), QStringLiteral("One or more required settings have not been provided"));
    m_phone->settle(Service);
    QCOMPARE(m_phone->takeJournal(Service), QStringList());
}

void EmailAccountProvisionerTest::sendsNineteenValues()
{
    Email email;
    email.setProviderName(QStringLiteral("provider"));
    email.setDefaultServiceName(QStringLiteral("service"));
    email.setEmailAddress(QStringLiteral("address"));
    email.setIncomingProtocol(Email::Pop3);
    email.setIncomingUsername(QStringLiteral("in-user"));
    email.setIncomingPassword(QStringLiteral("in-password"));
    email.setIncomingServer(QStringLiteral("in-server"));
    email.setIncomingPort(995);
    email.setIncomingConnectionEncryption(Email::SSL);
    email.setIncomingAcceptUntrustedCertificates(true);
    email.setOutgoingProtocol(Email::Smtp);
    email.setOutgoingUsername(QStringLiteral("out-user"));
    email.setOutgoingPassword(QStringLiteral("out-password"));
    email.setOutgoingServer(QStringLiteral("out-server"));
    email.setOutgoingPort(587);
    email.setOutgoingConnectionEncryption(Email::StartTLS);
    email.setOutgoingAcceptUntrustedCertificates(false);
    email.setOutgoingAuthentication(Email::CramMd5);
    email.setAccountReadOnly(true);
    // Not for e-mail accounts.
    email.setAccountDisplayName(QStringLiteral("display"));
    email.setAccountConfiguration({{QStringLiteral("k"), 1}});
    QVERIFY(!email.createAccount());
    // The journal writes int32 without its name, and other numbers with theirs.
    QCOMPARE(m_phone->takeJournalWithInterfaces(Service),
             QStringList(Path
                         + QStringLiteral(
                             " org.corvaneos.mdmproxy.accounts.createEmailAccount ('provider', 'service', "
                             "'address', 2, 'in-user', 'in-password', 'in-server', 995, 1, true, 1, "
                             "'out-user', 'out-password', 'out-server', 587, 2, false, 3, true)")));
    QCOMPARE(m_phone->lastSignature(), QStringLiteral("sssisssiibisssiibib"));
    QCOMPARE(email.error(), 2);
    QCOMPARE(email.errorMessage(), QStringLiteral("there is no account provider \"provider\""));
}

void EmailAccountProvisionerTest::sendsWhatIsEmptyAsItIs()
{
    Email email;
    complete(email);
    email.setEmailAddress(QStringLiteral("empty@example.org"));
    QVERIFY(email.createAccount());
    QCOMPARE(m_phone->takeJournal(Service),
             QStringList(Path
                         + QStringLiteral(" createEmailAccount ('email', '', 'empty@example.org', 0, '', "
                                          "'secret', '', 0, 0, false, 0, '', '', '', 0, 0, false, 0, "
                                          "false)")));
}

void EmailAccountProvisionerTest::numbersWithoutANameAreSent()
{
    Email email;
    complete(email);
    email.setIncomingProtocol(Email::IncomingProtocol(-1));
    email.setOutgoingAuthentication(Email::Authentication(1000));
    email.setIncomingPort(-5);
    QVERIFY(!email.createAccount());
    const QStringList calls = m_phone->takeJournal(Service);
    QCOMPARE(calls.size(), 1);
    QVERIFY2(calls.first().contains(QLatin1String("'maria@example.org', -1, '', 'secret', '', -5, 0"))
                 && calls.first().endsWith(QLatin1String("false, 1000, false)")),
             qPrintable(calls.first()));
}

void EmailAccountProvisionerTest::makesAnAccount()
{
    Email email;
    complete(email);
    email.setEmailAddress(QStringLiteral("new@example.org"));
    email.setAccountReadOnly(true);
    QVERIFY(email.createAccount());
    QCOMPARE(email.error(), 0);
    QCOMPARE(email.errorMessage(), QString());
    const QList<Provisioner::AccountInfo> accounts = email.listAccounts();
    QCOMPARE(accounts.last().displayName, QStringLiteral("new@example.org"));
    QCOMPARE(accounts.last().providerName, QStringLiteral("email"));

    QVERIFY(!email.createAccount());
    QCOMPARE(email.error(), 4);
    QVERIFY(email.deleteAccount(accounts.last().accountId));
    QCOMPARE(email.error(), 0);
    QVERIFY(email.createAccount());
}

void EmailAccountProvisionerTest::refusalTellsWhy()
{
    Email email;
    complete(email);
    m_phone->answerCalls(Service, Path, Create, {quint64(0), QStringLiteral("no room"), 77});
    QVERIFY(!email.createAccount());
    QCOMPARE(email.error(), 77);
    QCOMPARE(email.errorMessage(), QStringLiteral("no room"));

    m_phone->answerCalls(Service, Path, Create, {quint64(1) << 40, QStringLiteral("made"), 3});
    QVERIFY(email.createAccount());
    QCOMPARE(email.error(), 0);
    QCOMPARE(email.errorMessage(), QString());
}

void EmailAccountProvisionerTest::oddAnswersFail_data()
{
    QTest::addColumn<QVariantList>("values");
    QTest::addColumn<int>("code");
    QTest::newRow("nothing") << QVariantList() << 0;
    QTest::newRow("signed") << QVariantList{qint64(5), QStringLiteral("m"), 6} << 6;
    QTest::newRow("text") << QVariantList{QStringLiteral("5"), QStringLiteral("m"), 6} << 6;
    QTest::newRow("true") << QVariantList{true, QStringLiteral("m"), QStringLiteral("6")} << 0;
}

void EmailAccountProvisionerTest::oddAnswersFail()
{
    QFETCH(QVariantList, values);
    QFETCH(int, code);
    Email email;
    complete(email);
    m_phone->answerCalls(Service, Path, Create, values);
    QVERIFY(!email.createAccount());
    QCOMPARE(email.error(), code);
    QCOMPARE(email.errorMessage(), values.isEmpty() ? QString() : QStringLiteral("m"));
}

void EmailAccountProvisionerTest::errors()
{
    Email email;
    complete(email);
    m_phone->failCalls(Service, Path, Create, QStringLiteral("com.example.Broken"),
                       QStringLiteral("Out of order"));
    QVERIFY(!email.createAccount());
    QCOMPARE(email.error(), 1);
    QCOMPARE(email.errorMessage(), QStringLiteral("Out of order"));
}

void EmailAccountProvisionerTest::serviceThatIsNotThere()
{
    m_phone->stopService(Service);
    Email email;
    complete(email);
    email.setEmailAddress(QStringLiteral("late@example.org"));
    QVERIFY(!email.createAccount());
    QCOMPARE(email.error(), 1);
    QVERIFY(!email.errorMessage().isEmpty());
    m_phone->startService(Service);
    QVERIFY(email.createAccount());
    QCOMPARE(email.error(), 0);
}

QTEST_GUILESS_MAIN(EmailAccountProvisionerTest)
#include "emailaccountprovisioner_test.moc"
