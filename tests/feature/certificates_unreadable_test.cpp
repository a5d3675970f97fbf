// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "truststorefolder.h"
#include "waiting.h"

#include <corvanemdm/certificates.h>

#include <QtTest/QtTest>

#include <linux/capability.h>
#include <sys/syscall.h>

using Corvane::Mdm::CertificateFile;
using Corvane::Mdm::Certificates;
using TrustStore::Anchors;

/** Files and folders that the agent has no right to read. It gives its rights as root up, hence a program of
 * its own. */
class CertificatesUnreadableTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();

    void unreadableFile();
    void unreadableFolder();
};

void CertificatesUnreadableTest::initTestCase()
{
    TrustStore::clear(Anchors);
    __user_cap_header_struct header{_LINUX_CAPABILITY_VERSION_3, 0};
    __user_cap_data_struct none[2]{};
    QCOMPARE(syscall(SYS_capset, &header, none), 0L);
}

void CertificatesUnreadableTest::unreadableFile()
{
    const QString path = Anchors + QLatin1String("/secret.crt");
    TrustStore::write(path, TrustStore::authority("elo-mobile"));
    QVERIFY(QFile::setPermissions(path, QFile::Permissions()));
    QVERIFY(!QFile(path).open(QIODevice::ReadOnly));

    MessageLog log;
    const Certificates certificates;
    const QList<CertificateFile> files = certificates.installedFiles();
    QCOMPARE(files.size(), 1);
    QCOMPARE(files.constFirst().fileName(), QStringLiteral("secret.crt"));
    QCOMPARE(files.constFirst().certificates().size(), 0);
    QCOMPARE(log.takeWarnings(), QStringList());

    QVERIFY(QFile::setPermissions(path, QFile::ReadOwner | QFile::WriteOwner));
    QVERIFY(waitUntil([&] { return certificates.installedFiles().constFirst().certificates().size() == 1; }));
    QVERIFY(waitUntil([&] { return files.constFirst().certificates().size() == 1; }));
    TrustStore::write(path, TrustStore::authority("open-trust").repeated(2));
    QVERIFY(waitUntil([&] { return files.constFirst().certificates().size() == 2; }));
}

void CertificatesUnreadableTest::unreadableFolder()
{
    const QFile::Permissions before = QFile::permissions(Anchors);
    QVERIFY(QFile::setPermissions(Anchors, QFile::Permissions()));
    MessageLog log;
    const Certificates certificates;
    QCOMPARE(certificates.installedFiles().size(), 0);
    QCOMPARE(log.takeWarnings(), QStringList());
    QVERIFY(QFile::setPermissions(Anchors, before));
    QCOMPARE(certificates.installedFiles().size(), 1);
}

QTEST_GUILESS_MAIN(CertificatesUnreadableTest)
#include "certificates_unreadable_test.moc"
