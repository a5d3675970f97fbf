// SPDX-License-Identifier: LGPL-2.1-or-later
#include "callalarm.h"
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

const QString Service = QStringLiteral("org.corvaneos.mdmproxy");
const QString Path = QStringLiteral("/Corvane/Mdm/Proxy/Accounts");
const QString Refused = QStringLiteral("mdmctl: the MDM proxy (org.corvaneos.mdmproxy) refused: ");

QStringList words(const QString &arguments)
{
    return arguments.split(QLatin1Char(' '), Qt::SkipEmptyParts);
}

} // namespace

class MdmctlAccountTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void init();
    void cleanup();

    void listsAccounts();
    void emailOptionsReachTheProxy();
    void emailNeedsLittle();
    void createsOtherAccounts();
    void configurationIsPassedOn();
    void passwordComesFromAnywhereButArguments();
    void mistakesSendNothing_data();
    void mistakesSendNothing();
    void brokenConfigurationIsTold_data();
    void brokenConfigurationIsTold();
    void refusalsAreTold();
    void silenceIsTold();
    void deletesSeveral();
    void absenceIsTold();
    void secretsStaySecret();

    void policyMakesAndDeletesAccounts();
    void policyWithoutAPassword();
    void policyWithAPasswordThatIsNotThere();
    void policyDriftIsPutRight();
    void policyMistakes_data();
    void policyMistakes();

private:
    Mdmctl::Result run(const QString &arguments, const QByteArray &input = {})
    {
        return Mdmctl::run(words(QStringLiteral("account ") + arguments), input);
    }
    QString file(const char *name, const QByteArray &content)
    {
        QFile written(m_folder.filePath(QLatin1String(name)));
        if (!written.open(QIODevice::WriteOnly) || written.write(content) != content.size())
            qFatal("cannot write %s", name);
        return written.fileName();
    }
    Mdmctl::Result policy(const char *command, const QByteArray &json)
    {
        return Mdmctl::run({QStringLiteral("policy"), QLatin1String(command), file("policy.json", json)});
    }
    /** What the phone shows of its accounts, as "provider name". */
    QStringList accounts() const;

    QTemporaryDir m_folder;
    Phone m_phone;
    CallAlarm m_alarm;
    QString m_password;
};

void MdmctlAccountTest::initTestCase()
{
    m_password = file("password", "hush hush\n");
}

void MdmctlAccountTest::init()
{
    m_phone.takeJournal(Service);
}

void MdmctlAccountTest::cleanup()
{
    m_phone.clearFaults();
    m_phone.startService(Service);
    const QJsonArray present = m_phone.state()
                                   .value(QLatin1String("accounts"))
                                   .toObject()
                                   .value(QLatin1String("present"))
                                   .toArray();
    for (const QJsonValue &account : present) {
        const int id = account.toObject().value(QLatin1String("id")).toInt();
        if (id > 1)
            run(QStringLiteral("delete %1").arg(id));
    }
}

QStringList MdmctlAccountTest::accounts() const
{
    QStringList shown;
    const QJsonArray present = m_phone.state()
                                   .value(QLatin1String("accounts"))
                                   .toObject()
                                   .value(QLatin1String("present"))
                                   .toArray();
    for (const QJsonValue &account : present) {
        shown << account.toObject().value(QLatin1String("provider")).toString() + QLatin1Char(' ')
                + account.toObject().value(QLatin1String("displayName")).toString();
    }
    return shown;
}

void MdmctlAccountTest::listsAccounts()
{
    const Mdmctl::Result shown = run(QStringLiteral("list"));
    QCOMPARE(shown.errors, QString());
    QCOMPARE(shown.output,
             QStringLiteral("ID  PROVIDER       NAME\n"
                            "1   corvane-cloud  Maria's cloud\n"));
    QCOMPARE(shown.status, 0);
    const QJsonArray accounts
        = run(QStringLiteral("list --json")).json().value(QLatin1String("accounts")).toArray();
    QCOMPARE(accounts.size(), 1);
    QCOMPARE(accounts.first().toObject(),
             QJsonObject({{QStringLiteral("id"), 1},
                          {QStringLiteral("provider"), QStringLiteral("corvane-cloud")},
                          {QStringLiteral("name"), QStringLiteral("Maria's cloud")}}));
}

void MdmctlAccountTest::emailOptionsReachTheProxy()
{
    const QString outgoing = file("outgoing", "out\n");
    const Mdmctl::Result made = run(
        QStringLiteral("create-email maria@example.org --provider email --service email "
                       "--incoming-protocol pop3 --incoming-server pop.example.org --incoming-port 995 "
                       "--incoming-user maria --incoming-encryption ssl --incoming-accept-untrusted "
                       "--outgoing-protocol smtp --outgoing-server smtp.example.org --outgoing-port 587 "
                       "--outgoing-user m --outgoing-encryption starttls --outgoing-accept-untrusted "
                       "--outgoing-authentication cram-md5 --read-only --password-file %1 "
                       "--outgoing-password-file %2")
            .arg(m_password, outgoing));
    QCOMPARE(made.errors, QString());
    QCOMPARE(made.output, QStringLiteral("The account maria@example.org has been made.\n"));
    QCOMPARE(made.status, 0);
    QCOMPARE(
        m_phone.takeJournal(Service).first(),
        Path
            + QStringLiteral(" createEmailAccount ('email', 'email', 'maria@example.org', 2, 'maria', 'hush "
                             "hush', 'pop.example.org', 995, 1, true, 1, 'm', 'out', 'smtp.example.org', "
                             "587, 2, true, 3, true)"));
}

void MdmctlAccountTest::emailNeedsLittle()
{
    const Mdmctl::Result made
        = run(QStringLiteral("create-email little@example.org --json --password-file ") + m_password);
    QCOMPARE(made.errors, QString());
    const QJsonObject account = made.json().value(QLatin1String("account")).toObject();
    QCOMPARE(account.value(QLatin1String("name")).toString(), QStringLiteral("little@example.org"));
    QVERIFY(account.value(QLatin1String("id")).toInt() > 1);
    QCOMPARE(m_phone.takeJournal(Service).first(),
             Path
                 + QStringLiteral(
                     " createEmailAccount ('email', '', 'little@example.org', 0, '', 'hush hush', '', "
                     "0, 0, false, 0, '', '', '', 0, 0, false, 0, false)"));
}

void MdmctlAccountTest::createsOtherAccounts()
{
    const Mdmctl::Result made
        = run(QStringLiteral(
                  "create corvane-cloud corvane-cloud-sync lena --name Lena --read-only --password-file ")
              + m_password);
    QCOMPARE(made.errors, QString());
    QCOMPARE(made.output, QStringLiteral("The account Lena has been made.\n"));
    QCOMPARE(
        m_phone.takeJournal(Service).first(),
        Path
            + QStringLiteral(" createAccount ('corvane-cloud', 'corvane-cloud-sync', 'lena', 'hush hush', "
                             "'Lena', @a{sv} {}, true)"));
}

void MdmctlAccountTest::configurationIsPassedOn()
{
    const QString configuration = file("configuration", R"({"host": "h", "port": 7, "on": true})");
    const Mdmctl::Result made = run(
        QStringLiteral("create corvane-cloud corvane-cloud-sync lena --configuration %1 --password-file %2")
            .arg(configuration, m_password));
    QCOMPARE(made.errors, QString());
    const QString call = m_phone.takeJournal(Service).first();
    QVERIFY2(call.contains(QLatin1String("{'host': <'h'>, 'on': <true>, 'port': <")), qPrintable(call));
}

void MdmctlAccountTest::passwordComesFromAnywhereButArguments()
{
    const QString create = QStringLiteral("create corvane-cloud corvane-cloud-sync lena ");
    const auto isSent = [this](const char *password) {
        return m_phone.takeJournal(Service).value(0).contains(
            QStringLiteral("'lena', '%1'").arg(QLatin1String(password)));
    };
    QCOMPARE(run(create + QLatin1String("--password-file -"), "from input\n").errors, QString());
    QVERIFY(isSent("from input"));
    qputenv("CORVANE_TEST_PASSWORD", "from the environment");
    run(create + QLatin1String("--password-env CORVANE_TEST_PASSWORD"));
    qunsetenv("CORVANE_TEST_PASSWORD");
    QVERIFY(isSent("from the environment"));
}

void MdmctlAccountTest::mistakesSendNothing_data()
{
    QTest::addColumn<QString>("message");
    const auto row = [](const char *arguments, const char *message) {
        QTest::newRow(arguments) << QString::fromUtf8(message);
    };
    row("create-email", "ADDRESS is missing; usage: mdmctl account create-email ADDRESS");
    row("create-email a@b --incoming-protocol imap", R"(--incoming-protocol "imap": did you mean "imap4"?)");
    row("create-email a@b --incoming-port 65536", R"(--incoming-port "65536": must be 0 to 65535)");
    row("create-email a@b --outgoing-port x", R"(--outgoing-port "x": must be 0 to 65535)");
    row("create-email a@b --outgoing-encryption tls",
        R"(--outgoing-encryption "tls": must be one of "none", "ssl", "starttls")");
    row("create-email a@b --password hush",
        R"(unknown option "--password": did you mean "--password-file"?)");
    row("create-email a@b --password-file /no/such/file",
        "the password of the account: /no/such/file cannot be read: No such file or directory");
    row("create-email a@b --password-file x --password-env Y",
        "--password-file and --password-env exclude each other");
    row("create p s", "USER is missing; usage: mdmctl account create PROVIDER SERVICE USER");
    row("create p s u --configuration /dev/null", "/dev/null: is empty, must be a JSON object");
    row("create p s u --configuration /nowhere.json",
        "/nowhere.json: cannot be read: No such file or directory");
    row("delete", "ID is missing; usage: mdmctl account delete ID...");
    row("delete 1 x", R"(ID "x": must be the number of an account, as in "mdmctl account list")");
    row("delete 0", R"(ID "0": must be the number of an account, as in "mdmctl account list")");
}

void MdmctlAccountTest::mistakesSendNothing()
{
    QFETCH(QString, message);
    const Mdmctl::Result refused = run(QString::fromUtf8(QTest::currentDataTag()));
    QCOMPARE(refused.errors, QStringLiteral("mdmctl: %1\n").arg(message));
    QCOMPARE(refused.output, QString());
    QCOMPARE(refused.status, 2);
    QCOMPARE(m_phone.takeJournal(Service), QStringList());
}

void MdmctlAccountTest::brokenConfigurationIsTold_data()
{
    QTest::addColumn<QByteArray>("content");
    QTest::addColumn<QString>("message");

    QTest::newRow("syntax") << QByteArray("{\n  \"host\": h\n}") << ":2:10: illegal number";
    QTest::newRow("array") << QByteArray("[]") << ": must be a JSON object, is an array";
}

void MdmctlAccountTest::brokenConfigurationIsTold()
{
    QFETCH(QByteArray, content);
    QFETCH(QString, message);
    const QString configuration = file("configuration", content);
    const Mdmctl::Result refused = run(
        QStringLiteral("create p s u --configuration %1 --password-file %2").arg(configuration, m_password));
    QCOMPARE(refused.errors, QStringLiteral("mdmctl: %1%2\n").arg(configuration, message));
    QCOMPARE(refused.status, 2);
    QCOMPARE(m_phone.takeJournal(Service), QStringList());
}

void MdmctlAccountTest::refusalsAreTold()
{
    const Mdmctl::Result unknown = run(QStringLiteral("create none none lena --password-file ") + m_password);
    QCOMPARE(unknown.errors, Refused + QStringLiteral("there is no account provider \"none\" (code 2)\n"));
    QCOMPARE(unknown.status, 1);
    m_phone.failCalls(Service, Path, QString(), QStringLiteral("com.example.Denied"),
                      QStringLiteral("not you"));
    const Mdmctl::Result denied = run(QStringLiteral("list"));
    QCOMPARE(denied.errors, Refused + QStringLiteral("not you\n"));
    QCOMPARE(denied.status, 1);
}

void MdmctlAccountTest::silenceIsTold()
{
    m_phone.failCalls(Service, Path, QString(), QStringLiteral("org.freedesktop.DBus.Error.NoReply"),
                      QStringLiteral("Did not receive a reply. Possible causes include: the remote "
                                     "application did not send a reply"));
    const Mdmctl::Result silent = run(QStringLiteral("list"));
    QCOMPARE(silent.errors,
             QStringLiteral("mdmctl: the MDM proxy (org.corvaneos.mdmproxy) did not answer within 25 s\n"));
    QCOMPARE(silent.status, 1);
}

void MdmctlAccountTest::deletesSeveral()
{
    run(QStringLiteral("create corvane-cloud corvane-cloud-sync lena --password-file ") + m_password);
    const QJsonArray before
        = run(QStringLiteral("list --json")).json().value(QLatin1String("accounts")).toArray();
    const int id = before.last().toObject().value(QLatin1String("id")).toInt();
    const Mdmctl::Result result = run(QStringLiteral("delete 9999 %1").arg(id));
    QCOMPARE(result.errors, Refused + QStringLiteral("there is no account 9999 (code 5)\n"));
    QCOMPARE(result.status, 1);
    QCOMPARE(accounts(), QStringList(QStringLiteral("corvane-cloud Maria's cloud")));
}

void MdmctlAccountTest::absenceIsTold()
{
    m_phone.stopService(Service);
    for (const char *command : {"list", "delete 1"}) {
        const Mdmctl::Result absent = run(QLatin1String(command));
        QCOMPARE(absent.errors,
                 QStringLiteral("mdmctl: the MDM proxy (org.corvaneos.mdmproxy) is not running\n"));
        QCOMPARE(absent.status, 3);
    }
}

void MdmctlAccountTest::secretsStaySecret()
{
    m_phone.swallowCalls(Service, Path, QStringLiteral("createAccount"));
    Mdmctl mdmctl(
        words(QStringLiteral("account create corvane-cloud corvane-cloud-sync lena --password-file ")
              + m_password));
    QStringList calls;
    QVERIFY(waitUntil([&] { return !(calls += m_phone.takeJournal(Service)).isEmpty(); }));
    QVERIFY(calls.first().contains(QLatin1String("hush hush")));

    // It holds the password now.
    const auto contentOf = [&mdmctl](const char *name) {
        QFile process(QStringLiteral("/proc/%1/%2").arg(mdmctl.processId()).arg(QLatin1String(name)));
        return process.open(QIODevice::ReadOnly) ? process.readAll() : QByteArray();
    };
    QVERIFY(contentOf("cmdline").contains("account"));
    QVERIFY(!contentOf("cmdline").contains("hush"));
    QVERIFY(!contentOf("environ").contains("hush"));
    const QByteArray limits = contentOf("limits");
    QVERIFY2(QRegularExpression(QStringLiteral("Max core file size +0 +0 "))
                 .match(QString::fromLatin1(limits))
                 .hasMatch(),
             limits.constData());
    mdmctl.interrupt(SIGKILL);
    const Mdmctl::Result result = mdmctl.finish();
    QVERIFY(!(result.output + result.errors).contains(QLatin1String("hush")));
}

void MdmctlAccountTest::policyMakesAndDeletesAccounts()
{
    const QByteArray json = QByteArray(R"({"name": "Test", "accounts": {
        "required": [{"provider": "email", "address": "maria@example.org", "passwordFile": "SECRET",
            "readOnly": true,
            "incoming": {"protocol": "imap4", "server": "imap.example.org", "encryption": "starttls"},
            "outgoing": {"protocol": "smtp", "server": "smtp.example.org", "authentication": "plain",
                         "passwordFile": "SECRET"}}],
        "forbidden": [{"provider": "corvane-cloud", "user": "lena"}]}})")
                                .replace("SECRET", m_password.toUtf8());
    run(QStringLiteral("create corvane-cloud corvane-cloud-sync lena --password-file ") + m_password);

    const Mdmctl::Result checked = policy("check", json);
    QCOMPARE(checked.output,
             QStringLiteral("SETTING                           STATUS     PRESENT  WANTED   DETAIL\n"
                            "accounts.email.maria@example.org  different  absent   present  add it\n"
                            "accounts.corvane-cloud.lena       different  present  absent   remove it\n"
                            "\nTest: 2 different.\n"));
    QCOMPARE(checked.status, 1);
    m_phone.takeJournal(Service);
    QCOMPARE(policy("apply", json).status, 0);
    QCOMPARE(
        m_phone.takeJournal(Service).filter(QStringLiteral("createEmailAccount")),
        QStringList(Path
                    + QStringLiteral(" createEmailAccount ('email', '', 'maria@example.org', 1, '', 'hush "
                                     "hush', 'imap.example.org', 0, 2, false, 1, '', 'hush hush', "
                                     "'smtp.example.org', 0, 0, false, 2, true)")));
    QCOMPARE(accounts(),
             QStringList(
                 {QStringLiteral("corvane-cloud Maria's cloud"), QStringLiteral("email maria@example.org")}));
    QCOMPARE(policy("check", json).status, 0);
    // Applying again has nothing to do.
    QCOMPARE(policy("apply", json).status, 0);
    QCOMPARE(m_phone.takeJournal(Service).filter(QStringLiteral("create")), QStringList());

    const Mdmctl::Result exported = Mdmctl::run({QStringLiteral("policy"), QStringLiteral("export")});
    const QJsonArray required = exported.json()
                                    .value(QLatin1String("accounts"))
                                    .toObject()
                                    .value(QLatin1String("required"))
                                    .toArray();
    QCOMPARE(required.size(), 2);
    QCOMPARE(required.first().toObject(),
             QJsonObject({{QStringLiteral("provider"), QStringLiteral("corvane-cloud")},
                          {QStringLiteral("user"), QStringLiteral("Maria's cloud")}}));
    QCOMPARE(required.last().toObject(),
             QJsonObject({{QStringLiteral("provider"), QStringLiteral("email")},
                          {QStringLiteral("address"), QStringLiteral("maria@example.org")}}));
    QVERIFY(!exported.output.contains(QLatin1String("hush")));
    QCOMPARE(policy("check", exported.output.toUtf8()).status, 0);
}

void MdmctlAccountTest::policyWithoutAPassword()
{
    const Mdmctl::Result applied
        = policy("apply", R"({"accounts": {"required": [{"provider": "email", "address": "a@b"}]}})");
    QVERIFY2(
        applied.output.contains(QLatin1String(
            "accounts.email.a@b  unsupported  absent  present  the policy names no passwordFile for it")),
        qPrintable(applied.output));
    QCOMPARE(applied.status, 1);
}

void MdmctlAccountTest::policyWithAPasswordThatIsNotThere()
{
    const Mdmctl::Result applied = policy("apply", R"({"accounts": {"required": [
        {"provider": "email", "address": "a@b", "passwordFile": "/no/such/file"}]}})");
    QVERIFY2(applied.output.contains(QLatin1String("/no/such/file")), qPrintable(applied.output));
    QVERIFY(applied.output.contains(QLatin1String("failed")));
    QCOMPARE(applied.status, 1);
    QCOMPARE(accounts().size(), 1);
}

void MdmctlAccountTest::policyDriftIsPutRight()
{
    const QString policy = file("policy.json", R"({"accounts": {
        "forbidden": [{"provider": "corvane-cloud", "user": "lena"}]}})");
    Mdmctl watch({QStringLiteral("policy"), QStringLiteral("watch"), policy, QStringLiteral("--look"),
                  QStringLiteral("0.2")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching for drift")));
    // Nobody announces this.
    QCOMPARE(run(QStringLiteral("create corvane-cloud corvane-cloud-sync lena --password-file ") + m_password)
                 .status,
             0);
    QVERIFY(watch.waitForOutput(QStringLiteral("accounts.corvane-cloud.lena: changed (remove it)")));
    watch.interrupt(SIGINT);
    QCOMPARE(watch.finish().status, 0);
    QCOMPARE(accounts(), QStringList(QStringLiteral("corvane-cloud Maria's cloud")));
}

void MdmctlAccountTest::policyMistakes_data()
{
    QTest::addColumn<QByteArray>("json");
    QTest::addColumn<QString>("reason");
    QTest::newRow("neither") << QByteArray(R"({"accounts": {"required": [{"provider": "email"}]}})")
                             << QStringLiteral("/accounts/required/0: must have either address or user");
    QTest::newRow("both") << QByteArray(
        R"({"accounts": {"forbidden": [{"provider": "email", "address": "a@b", "user": "a"}]}})")
                          << QStringLiteral("/accounts/forbidden/0: must have either address or user");
    QTest::newRow("twice") << QByteArray(R"({"accounts": {"required": [{"provider": "p", "user": "a"}],
                                                         "forbidden": [{"provider": "p", "user": "a"}]}})")
                           << QStringLiteral(
                                  "/accounts/forbidden/0: must be named once; \"p.a\" is there already");
    QTest::newRow("a password") << QByteArray(
        R"({"accounts": {"required": [{"provider": "p", "user": "a", "password": "x"}]}})")
                                << QStringLiteral("/accounts/required/0/password");
}

void MdmctlAccountTest::policyMistakes()
{
    QFETCH(QByteArray, json);
    QFETCH(QString, reason);
    const Mdmctl::Result refused = policy("check", json);
    QVERIFY2(refused.errors.contains(reason), qPrintable(refused.errors));
    QCOMPARE(refused.status, 2);
}

QTEST_GUILESS_MAIN(MdmctlAccountTest)
#include "mdmctl_account_test.moc"
