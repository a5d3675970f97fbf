// SPDX-License-Identifier: LGPL-2.1-or-later
#include "mdmctl.h"
#include "truststorefolder.h"

#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QTemporaryDir>
#include <QtNetwork/QSslCertificate>
#include <QtTest/QtTest>

#include <csignal>

using TrustStore::Anchors;
using TrustStore::Blacklist;
using TrustStore::Helper;

namespace
{

const QString Refused = QStringLiteral("mdmctl: the certificate helper refused: ");

QByteArray fingerprint(const char *authority)
{
    return QSslCertificate(TrustStore::authority(authority)).digest(QCryptographicHash::Sha256).toHex();
}

} // namespace

class MdmctlCertificatesTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void init();
    void cleanup();

    void listsBothFolders();
    void listsAsJson();
    void listsTheSystem();
    void shows();
    void installsAndUninstalls();
    void readsDerAndStandardInput();
    void mistakesChangeNothing_data();
    void mistakesChangeNothing();
    void helperThatFails_data();
    void helperThatFails();
    void helperThatTakesTooLong();
    void watches();

    void policyTrustsAndDistrusts();
    void policyReplacesOtherCertificates();
    void policyIsKept();
    void policyMistakes_data();
    void policyMistakes();

private:
    Mdmctl::Result run(const QString &arguments, const QByteArray &input = {})
    {
        return Mdmctl::run(
            QStringLiteral("certificates %1").arg(arguments).split(QLatin1Char(' '), Qt::SkipEmptyParts),
            input);
    }
    QString file(const char *name, const QByteArray &content)
    {
        const QString path = m_folder.filePath(QLatin1String(name));
        TrustStore::write(path, content);
        return path;
    }
    /** A policy that wants @p trusted in "company.crt", and distrusts the leaked authority. */
    QString policyFile(const char *trusted);

    QTemporaryDir m_folder;
    QString m_helper;
};

void MdmctlCertificatesTest::initTestCase()
{
    m_helper = QFile::symLinkTarget(Helper);
}

void MdmctlCertificatesTest::init()
{
    TrustStore::clear(Anchors);
    TrustStore::clear(Blacklist);
    TrustStore::write(Anchors + QLatin1String("/elo.crt"), TrustStore::authority("elo-mobile"));
}

void MdmctlCertificatesTest::cleanup()
{
    QFile::remove(Helper);
    QVERIFY(QFile::link(m_helper, Helper));
}

QString MdmctlCertificatesTest::policyFile(const char *trusted)
{
    const auto entry = [](const char *name, const char *authority) {
        return QJsonArray{
            QJsonObject{{QStringLiteral("file"), QLatin1String(name)},
                        {QStringLiteral("pem"), QString::fromLatin1(TrustStore::authority(authority))}}};
    };
    const QJsonObject policy{
        {QStringLiteral("name"), QStringLiteral("Test")},
        {QStringLiteral("certificates"),
         QJsonObject{{QStringLiteral("trusted"), entry("company.crt", trusted)},
                     {QStringLiteral("distrusted"), entry("leaked.crt", "leaked-trust")}}}};
    return file("policy.json", QJsonDocument(policy).toJson());
}

void MdmctlCertificatesTest::listsBothFolders()
{
    TrustStore::write(Blacklist + QLatin1String("/odd.crt"), "no certificate");
    const Mdmctl::Result shown = run(QStringLiteral("list"));
    QCOMPARE(shown.errors, QString());
    const QString expiry = QSslCertificate(TrustStore::authority("elo-mobile"))
                               .expiryDate()
                               .toUTC()
                               .date()
                               .toString(Qt::ISODate);
    QCOMPARE(shown.output,
             QStringLiteral("LIST         FILE     SUBJECT           ISSUER         EXPIRES     FINGERPRINT\n"
                            "installed    elo.crt  Elo Mobile CA     Elo Mobile CA  %1  %2\n"
                            "blacklisted  odd.crt  (no certificate)\n")
                 .arg(expiry, QString::fromLatin1(fingerprint("elo-mobile").left(16))));
    TrustStore::clear(Anchors);
    TrustStore::clear(Blacklist);
    QCOMPARE(run(QStringLiteral("list")).output, QStringLiteral("There are no files.\n"));
}

void MdmctlCertificatesTest::listsAsJson()
{
    const QJsonObject json = run(QStringLiteral("list --json")).json();
    QCOMPARE(json.keys(), QStringList({QStringLiteral("blacklisted"), QStringLiteral("installed")}));
    const QJsonObject installed = json.value(QLatin1String("installed")).toArray().first().toObject();
    QCOMPARE(installed.value(QLatin1String("file")).toString(), QStringLiteral("elo.crt"));
    const QJsonObject certificate
        = installed.value(QLatin1String("certificates")).toArray().first().toObject();
    const QSslCertificate real(TrustStore::authority("elo-mobile"));
    QCOMPARE(certificate.value(QLatin1String("subject")).toString(), QStringLiteral("Elo Mobile CA"));
    QCOMPARE(certificate.value(QLatin1String("issuer")).toString(), QStringLiteral("Elo Mobile CA"));
    QCOMPARE(certificate.value(QLatin1String("fingerprint")).toString().toLatin1(),
             fingerprint("elo-mobile"));
    QCOMPARE(certificate.value(QLatin1String("expires")).toString(),
             real.expiryDate().toUTC().toString(Qt::ISODate));
    QCOMPARE(certificate.value(QLatin1String("effective")).toString(),
             real.effectiveDate().toUTC().toString(Qt::ISODate));
}

void MdmctlCertificatesTest::listsTheSystem()
{
    const Mdmctl::Result shown = run(QStringLiteral("list --system"));
    QVERIFY2(shown.output.contains(QLatin1String("\nsystem ")), qPrintable(shown.output));
    QVERIFY(!run(QStringLiteral("list --system --json"))
                 .json()
                 .value(QLatin1String("system"))
                 .toArray()
                 .isEmpty());
}

void MdmctlCertificatesTest::shows()
{
    TrustStore::write(Blacklist + QLatin1String("/two.crt"),
                      TrustStore::authority("open-trust") + TrustStore::authority("leaked-trust"));
    const Mdmctl::Result shown = run(QStringLiteral("show two.crt --blacklisted"));
    QCOMPARE(shown.status, 0);
    QVERIFY2(shown.output.startsWith(QLatin1String("two.crt\n  Subject      Open Trust Root CA\n")),
             qPrintable(shown.output));
    QVERIFY(shown.output.contains(QLatin1String("\n\n  Subject      Leaked Trust CA\n")));
    QVERIFY(shown.output.contains(QString::fromLatin1(fingerprint("open-trust"))));
    QCOMPARE(run(QStringLiteral("show elo.crt --json")).json().value(QLatin1String("file")).toString(),
             QStringLiteral("elo.crt"));
    const Mdmctl::Result none = run(QStringLiteral("show two.crt"));
    QCOMPARE(none.errors, QStringLiteral("mdmctl: there is no installed file \"two.crt\"\n"));
    QCOMPARE(none.status, 1);
}

void MdmctlCertificatesTest::installsAndUninstalls()
{
    const QString source = file("company.pem", TrustStore::authority("open-trust"));
    const Mdmctl::Result installed = run(QStringLiteral("install ") + source);
    QCOMPARE(installed.output + installed.errors, QString());
    QCOMPARE(installed.status, 0);
    QCOMPARE(QSslCertificate(TrustStore::contentOf(Anchors + QLatin1String("/company.crt"))),
             QSslCertificate(TrustStore::authority("open-trust")));
    QCOMPARE(run(QStringLiteral("blacklist %1 --name bad.crt").arg(source)).status, 0);
    QVERIFY(QFile::exists(Blacklist + QLatin1String("/bad.crt")));

    const Mdmctl::Result removed = run(QStringLiteral("uninstall none.crt company.crt elo.crt"));
    QCOMPARE(removed.errors,
             Refused + QStringLiteral("cannot remove %1/none.crt: No such file or directory\n").arg(Anchors));
    QCOMPARE(removed.status, 1);
    QCOMPARE(QDir(Anchors).entryList(QDir::Files), QStringList());
    QCOMPARE(run(QStringLiteral("unblacklist bad.crt")).status, 0);
    QCOMPARE(QDir(Blacklist).entryList(QDir::Files), QStringList());
}

void MdmctlCertificatesTest::readsDerAndStandardInput()
{
    const QSslCertificate certificate(TrustStore::authority("open-trust"));
    QCOMPARE(run(QStringLiteral("install ") + file("der.cer", certificate.toDer())).errors, QString());
    QCOMPARE(TrustStore::contentOf(Anchors + QLatin1String("/der.crt")), certificate.toPem());
    QCOMPARE(run(QStringLiteral("install - --name input.crt"), certificate.toPem()).errors, QString());
    QCOMPARE(TrustStore::contentOf(Anchors + QLatin1String("/input.crt")), certificate.toPem());
}

void MdmctlCertificatesTest::mistakesChangeNothing_data()
{
    QTest::addColumn<QString>("message");
    const auto row = [](const char *arguments, const char *message) {
        QTest::newRow(arguments) << QString::fromUtf8(message);
    };
    row("install /etc/hostname", "/etc/hostname has no certificate");
    row("install /etc/hostname --name a/b.crt", R"(--name "a/b.crt": must be a file name that ends in .crt)");
    row("install /etc/hostname --name a.pem", R"(--name "a.pem": must be a file name that ends in .crt)");
    row("blacklist -", "standard input has no name for the phone: give it one with --name");
    row("uninstall", "NAME is missing; usage: mdmctl certificates uninstall NAME...");
    row("show", "NAME is missing; usage: mdmctl certificates show NAME");
}

void MdmctlCertificatesTest::mistakesChangeNothing()
{
    QFETCH(QString, message);
    const Mdmctl::Result refused = run(QString::fromUtf8(QTest::currentDataTag()));
    QVERIFY2(refused.errors.startsWith(QStringLiteral("mdmctl: ") + message), qPrintable(refused.errors));
    QCOMPARE(refused.status, 2);
    QCOMPARE(QDir(Anchors).entryList(QDir::Files), QStringList(QStringLiteral("elo.crt")));
}

void MdmctlCertificatesTest::helperThatFails_data()
{
    QTest::addColumn<QByteArray>("script");
    QTest::addColumn<QString>("reason");
    QTest::newRow("text") << QByteArray("#!/bin/sh\necho 'no room' >&2; echo 'on \"disk\"' >&2; exit 1\n")
                          << QStringLiteral("no room; on \"disk\"");
    QTest::newRow("no text") << QByteArray("#!/bin/sh\nexit 1\n") << QStringLiteral("it does not tell why");
    QTest::newRow("crash") << QByteArray("#!/bin/sh\nkill -KILL $$\n")
                           << QStringLiteral("Installing certificate failed: mdm-certificate crashed");
    QTest::newRow("missing") << QByteArray() << QStringLiteral("Unable to execute mdm-certificate");
}

void MdmctlCertificatesTest::helperThatFails()
{
    QFETCH(QByteArray, script);
    QFETCH(QString, reason);
    QFile::remove(Helper);
    if (!script.isEmpty()) {
        TrustStore::write(Helper, script);
        QFile::setPermissions(Helper, QFile::ReadOwner | QFile::ExeOwner);
    }
    const Mdmctl::Result failed = run(QStringLiteral("uninstall elo.crt"));
    QCOMPARE(failed.errors, Refused + reason + QLatin1Char('\n'));
    QCOMPARE(failed.status, 1);
}

void MdmctlCertificatesTest::helperThatTakesTooLong()
{
    QFile::remove(Helper);
    TrustStore::write(Helper, "#!/bin/sh\nexec tail -f /dev/null --pid=$PPID\n");
    QFile::setPermissions(Helper, QFile::ReadOwner | QFile::ExeOwner);
    // The helper is left to finish, and so is what waits for it: no leak, whatever a sanitizer says.
    const QByteArray options = qgetenv("ASAN_OPTIONS");
    qputenv("ASAN_OPTIONS", "detect_leaks=0");
    const Mdmctl::Result failed = run(QStringLiteral("uninstall elo.crt --timeout 0.2"));
    qputenv("ASAN_OPTIONS", options);
    QCOMPARE(failed.errors, QStringLiteral("mdmctl: the certificate helper did not finish within 0.2 s\n"));
    QCOMPARE(failed.status, 1);
}

void MdmctlCertificatesTest::watches()
{
    Mdmctl watch({QStringLiteral("certificates"), QStringLiteral("watch")});
    QVERIFY(watch.waitForOutput(QStringLiteral("Watching the certificates.")));
    QCOMPARE(run(QStringLiteral("install ") + file("new.pem", TrustStore::authority("open-trust"))).status,
             0);
    QVERIFY(watch.waitForOutput(QStringLiteral("Installed: elo.crt, new.crt")));
    QVERIFY(watch.waitForOutput(QStringLiteral("What the system trusts has changed")));
    TrustStore::write(Blacklist + QLatin1String("/a.crt"), "x");
    QVERIFY(watch.waitForOutput(QStringLiteral("Blacklisted: a.crt")));
    watch.interrupt(SIGINT);
    QCOMPARE(watch.finish().status, 0);
}

void MdmctlCertificatesTest::policyTrustsAndDistrusts()
{
    const QString policy = policyFile("open-trust");
    const auto command = [&policy](const char *name) {
        return Mdmctl::run({QStringLiteral("policy"), QLatin1String(name), policy});
    };
    const Mdmctl::Result checked = command("check");
    QVERIFY2(checked.output.contains(QLatin1String("certificates.trusted.company.crt")),
             qPrintable(checked.output));
    QVERIFY(checked.output.contains(QLatin1String("Open Trust Root CA")));
    QVERIFY(checked.output.contains(QLatin1String("Test: 2 different.")));
    QCOMPARE(checked.status, 1);
    const Mdmctl::Result applied = command("apply");
    QCOMPARE(applied.status, 0);
    QVERIFY(QFile::exists(Anchors + QLatin1String("/company.crt")));
    QVERIFY(QFile::exists(Blacklist + QLatin1String("/leaked.crt")));
    // What the policy does not name is left alone.
    QVERIFY(QFile::exists(Anchors + QLatin1String("/elo.crt")));
    QCOMPARE(command("check").status, 0);

    const Mdmctl::Result exported = Mdmctl::run({QStringLiteral("policy"), QStringLiteral("export")});
    const QJsonObject part = exported.json().value(QLatin1String("certificates")).toObject();
    QCOMPARE(part.value(QLatin1String("trusted")).toArray().size(), 2);
    TrustStore::clear(Anchors);
    TrustStore::clear(Blacklist);
    const QString back
        = file("exported.json", QJsonDocument(QJsonObject{{QStringLiteral("certificates"), part}}).toJson());
    QCOMPARE(Mdmctl::run({QStringLiteral("policy"), QStringLiteral("apply"), back}).status, 0);
    QCOMPARE(QDir(Anchors).entryList(QDir::Files),
             QStringList({QStringLiteral("company.crt"), QStringLiteral("elo.crt")}));
}

void MdmctlCertificatesTest::policyReplacesOtherCertificates()
{
    TrustStore::write(Anchors + QLatin1String("/company.crt"), TrustStore::authority("corvane-root"));
    const Mdmctl::Result applied
        = Mdmctl::run({QStringLiteral("policy"), QStringLiteral("apply"), policyFile("open-trust")});
    QVERIFY2(applied.output.contains(QLatin1String("Corvane Root CA")), qPrintable(applied.output));
    QVERIFY(applied.output.contains(QLatin1String("replace it")));
    QCOMPARE(QSslCertificate(TrustStore::contentOf(Anchors + QLatin1String("/company.crt"))),
             QSslCertificate(TrustStore::authority("open-trust")));

    QFile::remove(Helper);
    const Mdmctl::Result failed
        = Mdmctl::run({QStringLiteral("policy"), QStringLiteral("apply"), policyFile("elo-mobile")});
    QVERIFY2(failed.output.contains(
                 QLatin1String("the certificate helper refused: Unable to execute mdm-certificate")),
             qPrintable(failed.output));
    QCOMPARE(failed.status, 1);
}

void MdmctlCertificatesTest::policyIsKept()
{
    Mdmctl watch({QStringLiteral("policy"), QStringLiteral("watch"), QStringLiteral("--json"),
                  policyFile("open-trust")});
    QVERIFY(watch.waitForOutput(QStringLiteral("\"watching\"")));
    QVERIFY(QFile::remove(Anchors + QLatin1String("/company.crt")));
    QVERIFY(watch.waitForOutput(QStringLiteral("\"changed\""), 3));
    QVERIFY(QFile::exists(Anchors + QLatin1String("/company.crt")));
    watch.interrupt(SIGTERM);
    watch.finish();
}

void MdmctlCertificatesTest::policyMistakes_data()
{
    QTest::addColumn<QByteArray>("json");
    QTest::addColumn<QString>("reason");
    QTest::newRow("name") << QByteArray(R"({"certificates": {"trusted": [{"file": "a/b.crt", "pem": "x"}]}})")
                          << QStringLiteral(
                                 "/certificates/trusted/0/file: must be a file name that ends in .crt");
    QTest::newRow("content")
        << QByteArray(R"({"certificates": {"distrusted": [{"file": "a.crt", "pem": "x"}]}})")
        << QStringLiteral("/certificates/distrusted/0/pem: must hold certificates in PEM form");
    const QByteArray entry
        = QJsonDocument(
              QJsonObject{{QStringLiteral("file"), QStringLiteral("a.crt")},
                          {QStringLiteral("pem"), QString::fromLatin1(TrustStore::authority("elo-mobile"))}})
              .toJson();
    QTest::newRow("twice") << QByteArray(R"({"certificates": {"trusted": [)") + entry + ',' + entry + "]}}"
                           << QStringLiteral("/certificates/trusted/1/file: must be named once");
}

void MdmctlCertificatesTest::policyMistakes()
{
    QFETCH(QByteArray, json);
    QFETCH(QString, reason);
    const Mdmctl::Result refused
        = Mdmctl::run({QStringLiteral("policy"), QStringLiteral("check"), file("wrong.json", json)});
    QVERIFY2(refused.errors.contains(reason), qPrintable(refused.errors));
    QCOMPARE(refused.status, 2);
}

QTEST_GUILESS_MAIN(MdmctlCertificatesTest)
#include "mdmctl_certificates_test.moc"
