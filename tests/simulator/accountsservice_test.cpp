// SPDX-License-Identifier: LGPL-2.1-or-later
#include "client.h"

#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QJsonObject>
#include <QtTest/QTest>

namespace
{

const QString service = QStringLiteral("org.corvaneos.mdmproxy");
const QString path = QStringLiteral("/Corvane/Mdm/Proxy/Accounts");
const QString interface = QStringLiteral("org.corvaneos.mdmproxy.accounts");

// Places of the arguments of createEmailAccount.
enum EmailArgument {
    Provider = 0,
    DefaultService = 1,
    Address = 2,
    IncomingProtocol = 3,
    IncomingPassword = 5,
    IncomingServer = 6,
    IncomingPort = 7,
    IncomingEncryption = 8,
    OutgoingProtocol = 10,
    OutgoingServer = 13,
    OutgoingPort = 14,
    OutgoingEncryption = 15,
    OutgoingAuthentication = 17
};

QVariantList emailArguments(const QString &address)
{
    const QString user = QStringLiteral("user");
    return {
        QStringLiteral("email"),
        QStringLiteral("email"),
        address,
        1,
        user,
        QStringLiteral("in-secret"),
        QStringLiteral("imap.example.org"),
        993,
        1,
        false,
        1,
        user,
        QStringLiteral("out-secret"),
        QStringLiteral("smtp.example.org"),
        587,
        2,
        true,
        2,
        false,
    };
}

QVariantList genericArguments(const QString &user)
{
    return {QStringLiteral("corvane-cloud"),
            QStringLiteral("corvane-cloud-sync"),
            user,
            QStringLiteral("secret"),
            QString(),
            QVariantMap(),
            false};
}

} // namespace

/** The accounts object of the simulated MDM proxy. */
class AccountsServiceTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void judgesEmailAccounts_data();
    void judgesEmailAccounts();
    void judgesGenericAccounts_data();
    void judgesGenericAccounts();
    void numbersAreNotUsedAgain();
    void eachProviderHasItsOwnNames();
    void readOnlyIsForUsers();
    void keepsItsAccounts();
    void showsNoPassword();

private:
    QString call(const char *method, const QVariantList &arguments = {}) const
    {
        return textOf(m_client.call(service, path, interface, QLatin1String(method), arguments));
    }
    QString remove(quint64 id) const { return call("deleteAccount", {id}); }
    QString removeAsUser(const char *number) const
    {
        return textOf(m_client.control(
            QStringLiteral("Act"), {QStringLiteral("account remove"), QStringList(QLatin1String(number))}));
    }
    /** The number of the account that @p method makes. */
    quint64 made(const char *method, const QVariantList &arguments) const
    {
        return m_client.call(service, path, interface, QLatin1String(method), arguments)
            .arguments()
            .value(0)
            .toULongLong();
    }
    QByteArray state() const
    {
        return m_client.control(QStringLiteral("State")).arguments().constFirst().toString().toUtf8();
    }

    Client m_client;
};

void AccountsServiceTest::judgesEmailAccounts_data()
{
    QTest::addColumn<int>("index");
    QTest::addColumn<QVariant>("value");
    QTest::addColumn<QString>("reason");
    const auto row = [](const char *name, int index, const QVariant &value, const char *reason) {
        QTest::newRow(name) << index << value << QString::fromLatin1(reason);
    };
    row("provider", Provider, QStringLiteral("mail"), "there is no account provider \"mail\", 2");
    row("kind", Provider, QStringLiteral("corvane-cloud"),
        "the account provider \"corvane-cloud\" is not for e-mail, 2");
    row("service", DefaultService, QStringLiteral("sms"),
        "the account provider \"email\" has no service \"sms\", 3");
    row("address", Address, QStringLiteral("maria"), "\"maria\" is no e-mail address, 3");
    row("address with a blank", Address, QStringLiteral("a b@c"), "\"a b@c\" is no e-mail address, 3");
    row("no domain", Address, QStringLiteral("a@"), "\"a@\" is no e-mail address, 3");
    row("empty label", Address, QStringLiteral("a@b."), "\"a@b.\" is no e-mail address, 3");
    row("password", IncomingPassword, QString(), "incoming mail: the password is missing, 3");
    row("incoming protocol", IncomingProtocol, 3, "incoming mail: there is no protocol 3, 3");
    row("negative protocol", IncomingProtocol, -1, "incoming mail: there is no protocol -1, 3");
    row("incoming server", IncomingServer, QString(), "incoming mail: the protocol wants a server, 3");
    row("incoming port", IncomingPort, 65536, "incoming mail: there is no port 65536, 3");
    row("incoming encryption", IncomingEncryption, 3, "incoming mail: there is no encryption 3, 3");
    row("outgoing protocol", OutgoingProtocol, 2, "outgoing mail: there is no protocol 2, 3");
    row("outgoing server", OutgoingServer, QString(), "outgoing mail: the protocol wants a server, 3");
    row("outgoing port", OutgoingPort, -1, "outgoing mail: there is no port -1, 3");
    row("outgoing encryption", OutgoingEncryption, -1, "outgoing mail: there is no encryption -1, 3");
    row("authentication", OutgoingAuthentication, 4, "outgoing mail: there is no authentication 4, 3");
}

void AccountsServiceTest::judgesEmailAccounts()
{
    QFETCH(int, index);
    QFETCH(QVariant, value);
    QFETCH(QString, reason);
    QVariantList arguments = emailArguments(QStringLiteral("judged@example.org"));
    arguments[index] = value;
    QCOMPARE(call("createEmailAccount", arguments), QStringLiteral("reply(0, %1)").arg(reason));
}

void AccountsServiceTest::judgesGenericAccounts_data()
{
    QTest::addColumn<int>("index");
    QTest::addColumn<QVariant>("value");
    QTest::addColumn<QString>("reason");
    const auto row = [](const char *name, int index, const QString &value, const char *reason) {
        QTest::newRow(name) << index << QVariant(value) << QString::fromLatin1(reason);
    };
    row("provider", 0, QString(), "there is no account provider \"\", 2");
    row("kind", 0, QStringLiteral("email"), "the account provider \"email\" is only for e-mail, 2");
    row("service", 1, QStringLiteral("email"),
        "the account provider \"corvane-cloud\" has no service \"email\", 3");
    row("no service", 1, QString(), "the account provider \"corvane-cloud\" has no service \"\", 3");
    row("user", 2, QString(), "the user name is missing, 3");
    row("password", 3, QString(), "the password is missing, 3");
    row("again", 2, QStringLiteral("maria"), "there is an account for maria already, 4");
}

void AccountsServiceTest::judgesGenericAccounts()
{
    QFETCH(int, index);
    QFETCH(QVariant, value);
    QFETCH(QString, reason);
    QVariantList arguments = genericArguments(QStringLiteral("judged"));
    arguments[index] = value;
    QCOMPARE(call("createAccount", arguments), QStringLiteral("reply(0, %1)").arg(reason));
}

void AccountsServiceTest::numbersAreNotUsedAgain()
{
    const quint64 first = made("createAccount", genericArguments(QStringLiteral("numbered")));
    QVERIFY(first > 1);
    QCOMPARE(remove(first), QStringLiteral("reply(true, , 0)"));
    QCOMPARE(remove(first), QStringLiteral("reply(false, there is no account %1, 5)").arg(first));
    m_client.control(QStringLiteral("StopService"), {service});
    m_client.control(QStringLiteral("StartService"), {service});
    const quint64 second = made("createAccount", genericArguments(QStringLiteral("numbered")));
    QVERIFY(second > first);
    QCOMPARE(remove(second), QStringLiteral("reply(true, , 0)"));
}

void AccountsServiceTest::eachProviderHasItsOwnNames()
{
    const QString name = QStringLiteral("both@example.org");
    const quint64 generic = made("createAccount", genericArguments(name));
    QVariantList arguments = emailArguments(name);
    arguments[DefaultService] = QString();
    const quint64 email = made("createEmailAccount", arguments);
    QVERIFY(generic != 0 && email > generic);
    QVERIFY(call("listAccounts")
                .endsWith(QStringLiteral("(%1, corvane-cloud, %3), (%2, email, %3)], , 0)")
                              .arg(generic)
                              .arg(email)
                              .arg(name)));
    remove(generic);
    remove(email);
}

void AccountsServiceTest::readOnlyIsForUsers()
{
    QVariantList arguments = genericArguments(QStringLiteral("fixed"));
    arguments.last() = true;
    const QByteArray number = QByteArray::number(made("createAccount", arguments));
    QCOMPARE(
        removeAsUser(number.constData()),
        QStringLiteral("org.corvaneos.simulator.Error.InvalidArguments: The account for fixed is read-only: "
                       "its user cannot change it"));
    QCOMPARE(
        removeAsUser("x"),
        QStringLiteral("org.corvaneos.simulator.Error.InvalidArguments: There is no account \"x\"; \"state "
                       "accounts\" shows those that there are"));
    QCOMPARE(remove(number.toULongLong()), QStringLiteral("reply(true, , 0)"));

    const QByteArray free
        = QByteArray::number(made("createAccount", genericArguments(QStringLiteral("free"))));
    QCOMPARE(removeAsUser(free.constData()), QStringLiteral("reply(The account for free is gone)"));
    QCOMPARE(remove(free.toULongLong()),
             QStringLiteral("reply(false, there is no account %1, 5)").arg(QLatin1String(free)));
}

void AccountsServiceTest::keepsItsAccounts()
{
    const QString before = call("listAccounts");
    QCOMPARE(before, QStringLiteral("reply([(1, corvane-cloud, Maria's cloud)], , 0)"));
    m_client.control(QStringLiteral("StopService"), {service});
    m_client.control(QStringLiteral("StartService"), {service});
    QCOMPARE(call("listAccounts"), before);
}

void AccountsServiceTest::showsNoPassword()
{
    const quint64 email = made("createEmailAccount", emailArguments(QStringLiteral("shown@example.org")));
    QVariantList arguments = genericArguments(QStringLiteral("shown"));
    arguments[5] = QVariantMap{{QStringLiteral("port"), 7}};
    const quint64 generic = made("createAccount", arguments);
    const QByteArray text = state();
    QVERIFY2(!text.contains("secret"), text.constData());

    const QJsonObject accounts
        = QJsonDocument::fromJson(text).object().value(QLatin1String("accounts")).toObject();
    const QJsonArray present = accounts.value(QLatin1String("present")).toArray();
    QCOMPARE(present.size(), 3);
    const QJsonObject incoming = present.at(1).toObject().value(QLatin1String("incoming")).toObject();
    QCOMPARE(incoming.value(QLatin1String("server")).toString(), QStringLiteral("imap.example.org"));
    QCOMPARE(incoming.value(QLatin1String("hasPassword")).toBool(), true);
    const QJsonObject outgoing = present.at(1).toObject().value(QLatin1String("outgoing")).toObject();
    QCOMPARE(outgoing.value(QLatin1String("port")).toInt(), 587);
    QCOMPARE(outgoing.value(QLatin1String("acceptsUntrusted")).toBool(), true);
    QCOMPARE(present.at(2).toObject().value(QLatin1String("configuration")).toString(),
             QStringLiteral("{'port': <7>}"));
    remove(email);
    remove(generic);
}

QTEST_GUILESS_MAIN(AccountsServiceTest)
#include "accountsservice_test.moc"
