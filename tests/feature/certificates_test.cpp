// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "signalsequence.h"
#include "truststorefolder.h"
#include "waiting.h"

#include <corvanemdm/certificates.h>

#include <QtCore/QFileInfo>
#include <QtNetwork/QSslConfiguration>
#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::CertificateFile;
using Corvane::Mdm::Certificates;
using TrustStore::Anchors;
using TrustStore::Blacklist;
using TrustStore::Extracted;
using TrustStore::Helper;

namespace
{

const QString BrokenStart = QStringLiteral("Unable to execute mdm-certificate");
const QString Failed = QStringLiteral("Installing certificate failed:");

QString name(const QSslCertificate &certificate)
{
    return certificate.subjectInfo(QSslCertificate::CommonName).join(QLatin1Char('/'));
}

QStringList names(const QList<QSslCertificate> &certificates)
{
    QStringList list;
    for (const QSslCertificate &certificate : certificates)
        list << name(certificate);
    return list;
}

QStringList names(const QList<CertificateFile> &files)
{
    QStringList list;
    for (const CertificateFile &file : files)
        list << file.fileName();
    return list;
}

QList<QSslCertificate> parsed(const QByteArray &pem)
{
    return QSslCertificate::fromData(pem, QSsl::Pem);
}

/** Puts a shell script in the place of the helper; it can use "$1", "$2" and its standard input. */
void replaceHelper(const QByteArray &script)
{
    QFile::remove(Helper);
    TrustStore::write(Helper, "#!/bin/sh\n" + script + '\n');
    QFile::setPermissions(Helper, QFile::permissions(Helper) | QFile::ExeOwner | QFile::ExeUser);
}

/** One of the four requests, and the signal that ends it. */
struct Request {
    const char *name;
    QString folder;
    std::function<void(Certificates &)> send;
    void (Certificates::*finished)(const CertificateFile &, Certificates::Result);
};

const QString FileName = QStringLiteral("elo-mobile.crt");

const Request Requests[] = {
    {"install", Anchors,
     [](Certificates &certificates) { certificates.install(FileName, TrustStore::authority("elo-mobile")); },
     &Certificates::installFinished},
    {"uninstall", Anchors, [](Certificates &certificates) { certificates.uninstall(FileName); },
     &Certificates::uninstallFinished},
    {"blacklist", Blacklist,
     [](Certificates &certificates) {
         certificates.blacklist(FileName, TrustStore::authority("elo-mobile"));
     },
     &Certificates::blacklistFinished},
    {"unblacklist", Blacklist, [](Certificates &certificates) { certificates.unblacklist(FileName); },
     &Certificates::unblacklistFinished},
};

} // namespace

class CertificatesTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void noFile();
    void constructionReadsNothing();
    void listsFilesByName();
    void listsOtherNamesAndKindsNot();
    void oddContent_data();
    void oddContent();
    void namesAreNoPatterns();
    void severalCertificates();
    void hugeFiles();
    void copiesShareWhatWasRead();

    void newFilesAreListedAtTheirPlace();
    void goneFilesAreListedNoMore();
    void filesThatStayKeepWhatWasRead();
    void rewrittenFilesAreReadAgain();
    void replacedFilesAreReadAgain();
    void replacedFilesWithAnotherNameAreReadAgain();
    void fileThatGoesAndComesBack();
    void foldersAreToldApart();
    void extractedFolderIsTheSystems();
    void foldersThatAreNotThere();
    void unchangedFilesAreNotTouched();

    void systemCertificates();
    void helperGetsWhatItIsPromised_data();
    void helperGetsWhatItIsPromised();
    void outcomes_data();
    void outcomes();
    void helperThatCannotBeStarted_data();
    void helperThatCannotBeStarted();
    void runInvalidatesWhatWasRead();
    void failedStartKeepsWhatWasRead();
    void fileOfARequestIsTheListedOne();
    void requestsDoNotReadTheFolder();
    void realHelperInstallsAndUninstalls();
    void realHelperBlacklistsAndUnblacklists();
    void realHelperRefuses_data();
    void realHelperRefuses();
    void installsLists();
    void largeDataReachesTheHelper();
    void helperThatDoesNotRead();
    void manyRequestsForOneFile();
    void runsOutliveTheirObject();
    void failedStartOutlivesItsObject();
    void deletionInASlot();
    void worksThroughTheMetaObject();

private:
    /** The result of @p request, once it has come; there is no other signal of a finished request. */
    Certificates::Result resultOf(const Request &request, CertificateFile *file = nullptr);

    /** What was logged, without what Qt says of its own when a process goes before it has read all. */
    QStringList takeWarnings();

    std::unique_ptr<MessageLog> m_log;
    QByteArray m_helper; ///< where the helper's link leads
};

void CertificatesTest::init()
{
    TrustStore::clear(Anchors);
    TrustStore::clear(Blacklist);
    if (m_helper.isEmpty())
        m_helper = QFile::encodeName(QFile::symLinkTarget(Helper));
    m_log = std::make_unique<MessageLog>();
}

void CertificatesTest::cleanup()
{
    const QStringList warnings = takeWarnings();
    m_log.reset();
    QFile::remove(Helper);
    QVERIFY(QFile::link(QFile::decodeName(m_helper), Helper));
    QCOMPARE(warnings, QStringList());
}

QStringList CertificatesTest::takeWarnings()
{
    QStringList warnings = m_log->takeWarnings();
    const QStringList noise = warnings.filter(QStringLiteral("QSocketNotifier: Invalid socket"));
    for (const QString &warning : noise)
        warnings.removeAll(warning);
    return warnings;
}

Certificates::Result CertificatesTest::resultOf(const Request &request, CertificateFile *file)
{
    Certificates certificates;
    SignalSequence seen(&certificates);
    int finished = 0;
    Certificates::Result outcome = Certificates::Success;
    connect(&certificates, request.finished, this,
            [&](const CertificateFile &about, Certificates::Result result) {
                ++finished;
                outcome = result;
                if (file)
                    *file = about;
            });
    request.send(certificates);
    // It returns at once, and nothing happens outside of the event loop.
    if (finished != 0 || !seen.take().isEmpty() || !waitUntil([&finished] { return finished > 0; }))
        qFatal("%s does not end as it should", request.name);
    const QStringList ends = seen.take().filter(QStringLiteral("Finished"));
    if (finished != 1 || ends.size() != 1)
        qFatal("%s ends more than once", request.name);
    return outcome;
}

void CertificatesTest::noFile()
{
    const CertificateFile none;
    QVERIFY(none.isNull());
    QCOMPARE(none.fileName(), QString());
    QCOMPARE(none.certificates().size(), 0);
    CertificateFile other;
    TrustStore::write(Anchors + QLatin1String("/a.crt"), TrustStore::authority("elo-mobile"));
    other = Certificates().installedFiles().constFirst();
    QVERIFY(!other.isNull());
    other = none;
    QVERIFY(other.isNull());
}

void CertificatesTest::constructionReadsNothing()
{
    TrustStore::write(Anchors + QLatin1String("/a.crt"), TrustStore::authority("elo-mobile"));
    TrustStore::OpenCounter opened(Anchors);
    Certificates certificates;
    QCOMPARE(opened.take(), 0);
    const QList<CertificateFile> files = certificates.installedFiles();
    QCOMPARE(opened.take(), 1); // the folder
    files.constFirst().certificates();
    QVERIFY(opened.take() > 0);
}

void CertificatesTest::listsFilesByName()
{
    for (const char *file : {"b.crt", "a.crt", "B.crt", "ab.crt", "10.crt", "9.crt"})
        TrustStore::write(Anchors + QLatin1Char('/') + QLatin1String(file), "x");
    TrustStore::write(Blacklist + QLatin1String("/z.crt"), "x");
    const Certificates certificates;
    QCOMPARE(names(certificates.installedFiles()),
             QStringList({QStringLiteral("10.crt"), QStringLiteral("9.crt"), QStringLiteral("B.crt"),
                          QStringLiteral("a.crt"), QStringLiteral("ab.crt"), QStringLiteral("b.crt")}));
    QCOMPARE(names(certificates.blacklistedFiles()), QStringList(QStringLiteral("z.crt")));
    for (const CertificateFile &file : certificates.installedFiles())
        QVERIFY(!file.isNull());
}

void CertificatesTest::listsOtherNamesAndKindsNot()
{
    TrustStore::write(Anchors + QLatin1String("/a.pem"), "x");
    TrustStore::write(Anchors + QLatin1String("/a.crt.old"), "x");
    TrustStore::write(Anchors + QLatin1String("/crt"), "x");
    QVERIFY(QDir(Anchors).mkdir(QStringLiteral("folder.crt")));
    QVERIFY(QFile::link(QStringLiteral("/no/such/file"), Anchors + QLatin1String("/dangling.crt")));
    QVERIFY(QFile::link(Anchors + QLatin1String("/folder.crt"), Anchors + QLatin1String("/to-folder.crt")));
    const Certificates certificates;
    QCOMPARE(names(certificates.installedFiles()), QStringList());

    // A link is a file when it leads to one, now or later.
    TrustStore::write(Anchors + QLatin1String("/a.pem"), TrustStore::authority("elo-mobile"));
    QVERIFY(QFile::link(Anchors + QLatin1String("/a.pem"), Anchors + QLatin1String("/link.crt")));
    QVERIFY(waitUntil([&] { return certificates.installedFiles().size() == 1; }));
    QCOMPARE(names(certificates.installedFiles().constFirst().certificates()),
             QStringList(QStringLiteral("Elo Mobile CA")));
}

void CertificatesTest::oddContent_data()
{
    QTest::addColumn<QByteArray>("content");
    const QByteArray good = TrustStore::authority("elo-mobile");
    QTest::newRow("empty") << QByteArray();
    QTest::newRow("text") << QByteArray("no certificate\n");
    QTest::newRow("binary") << QByteArray("\0\1\2\377\376-----BEGIN", 15);
    QTest::newRow("DER") << parsed(good).constFirst().toDer();
    QTest::newRow("cut off") << good.left(good.size() / 2);
    QTest::newRow("delimiters only") << QByteArray(
        "-----BEGIN CERTIFICATE-----\n-----END CERTIFICATE-----\n");
    QTest::newRow("another thing") << QByteArray(good).replace("CERTIFICATE", "PUBLIC KEY");
}

void CertificatesTest::oddContent()
{
    QFETCH(QByteArray, content);
    TrustStore::write(Anchors + QLatin1String("/odd.crt"), content);
    const Certificates certificates;
    QCOMPARE(names(certificates.installedFiles()), QStringList(QStringLiteral("odd.crt")));
    QCOMPARE(certificates.installedFiles().constFirst().certificates().size(), 0);
}

void CertificatesTest::namesAreNoPatterns()
{
    TrustStore::write(Anchors + QLatin1String("/a*.crt"), TrustStore::authority("elo-mobile"));
    TrustStore::write(Anchors + QLatin1String("/ab.crt"), TrustStore::authority("open-trust"));
    TrustStore::write(Anchors + QLatin1String("/a[b].crt"), TrustStore::authority("corvane-root"));
    Certificates certificates;
    const QList<CertificateFile> files = certificates.installedFiles();
    QCOMPARE(names(files),
             QStringList({QStringLiteral("a*.crt"), QStringLiteral("a[b].crt"), QStringLiteral("ab.crt")}));
    QCOMPARE(files.at(0).certificates(), parsed(TrustStore::authority("elo-mobile")));
    QCOMPARE(files.at(1).certificates(), parsed(TrustStore::authority("corvane-root")));
    QCOMPARE(files.at(2).certificates(), parsed(TrustStore::authority("open-trust")));

    // One that is not there stands for no others either.
    replaceHelper("exit 0");
    CertificateFile missing;
    connect(&certificates, &Certificates::uninstallFinished, this,
            [&missing](const CertificateFile &file) { missing = file; });
    certificates.uninstall(QStringLiteral("*b.crt"));
    QVERIFY(waitUntil([&] { return !missing.isNull(); }));
    QCOMPARE(missing.fileName(), QStringLiteral("*b.crt"));
    QCOMPARE(missing.certificates().size(), 0);
}

void CertificatesTest::severalCertificates()
{
    TrustStore::write(Anchors + QLatin1String("/several.crt"),
                      "# two\n" + TrustStore::authority("open-trust") + "between\n"
                          + TrustStore::authority("elo-mobile"));
    QCOMPARE(names(Certificates().installedFiles().constFirst().certificates()),
             QStringList({QStringLiteral("Open Trust Root CA"), QStringLiteral("Elo Mobile CA")}));
}

void CertificatesTest::hugeFiles()
{
    constexpr int count = 2000;
    TrustStore::write(Anchors + QLatin1String("/garbage.crt"), QByteArray(32 * 1024 * 1024, 'x'));
    TrustStore::write(Anchors + QLatin1String("/many.crt"),
                      TrustStore::authority("elo-mobile").repeated(count));
    const Certificates certificates;
    const QList<CertificateFile> files = certificates.installedFiles();
    QCOMPARE(files.first().certificates().size(), 0);
    QCOMPARE(files.last().certificates().size(), count);
}

void CertificatesTest::copiesShareWhatWasRead()
{
    TrustStore::write(Anchors + QLatin1String("/a.crt"), TrustStore::authority("elo-mobile"));
    const Certificates certificates;
    const CertificateFile file = certificates.installedFiles().constFirst();
    const CertificateFile copy(file);
    QCOMPARE(file.certificates().size(), 1);
    TrustStore::OpenCounter opened(Anchors);
    QCOMPARE(copy.certificates(), file.certificates());
    QCOMPARE(certificates.installedFiles().constFirst().certificates(), file.certificates());
    QCOMPARE(opened.take(), 0);
}

void CertificatesTest::newFilesAreListedAtTheirPlace()
{
    TrustStore::write(Anchors + QLatin1String("/b.crt"), "x");
    Certificates certificates;
    QCOMPARE(certificates.installedFiles().size(), 1);
    SignalSequence seen(&certificates);
    TrustStore::write(Anchors + QLatin1String("/c.crt"), "x");
    TrustStore::write(Anchors + QLatin1String("/a.crt"), "x");
    // The event loop has to tell.
    QCOMPARE(certificates.installedFiles().size(), 1);
    QVERIFY(waitUntil([&] { return certificates.installedFiles().size() == 3; }));
    QCOMPARE(names(certificates.installedFiles()),
             QStringList({QStringLiteral("a.crt"), QStringLiteral("b.crt"), QStringLiteral("c.crt")}));
    const QStringList signalsSeen = seen.take();
    QVERIFY(!signalsSeen.isEmpty());
    QCOMPARE(signalsSeen.count(QStringLiteral("installedFilesChanged()")), signalsSeen.size());
}

void CertificatesTest::goneFilesAreListedNoMore()
{
    for (const char *file : {"a.crt", "b.crt", "c.crt"})
        TrustStore::write(Anchors + QLatin1Char('/') + QLatin1String(file),
                          TrustStore::authority("elo-mobile"));
    Certificates certificates;
    const QList<CertificateFile> before = certificates.installedFiles();
    QCOMPARE(before.at(1).certificates().size(), 1);
    QVERIFY(QFile::remove(Anchors + QLatin1String("/b.crt")));
    QVERIFY(waitUntil([&] { return certificates.installedFiles().size() == 2; }));
    QCOMPARE(names(certificates.installedFiles()),
             QStringList({QStringLiteral("a.crt"), QStringLiteral("c.crt")}));
    // The old value still names its file, which has no certificates any more.
    QVERIFY(waitUntil([&] { return before.at(1).certificates().isEmpty(); }));
    QCOMPARE(before.at(1).fileName(), QStringLiteral("b.crt"));

    TrustStore::clear(Anchors);
    QVERIFY(waitUntil([&] { return certificates.installedFiles().isEmpty(); }));
}

void CertificatesTest::filesThatStayKeepWhatWasRead()
{
    TrustStore::write(Anchors + QLatin1String("/b.crt"), TrustStore::authority("elo-mobile"));
    Certificates certificates;
    const CertificateFile file = certificates.installedFiles().constFirst();
    QCOMPARE(file.certificates().size(), 1);
    TrustStore::write(Anchors + QLatin1String("/a.crt"), "x");
    QVERIFY(waitUntil([&] { return certificates.installedFiles().size() == 2; }));
    TrustStore::OpenCounter opened(Anchors);
    QCOMPARE(certificates.installedFiles().constLast().certificates().size(), 1);
    QCOMPARE(file.certificates().size(), 1);
    QCOMPARE(opened.take(), 0);
}

void CertificatesTest::rewrittenFilesAreReadAgain()
{
    for (const QString &folder : {Anchors, Blacklist}) {
        const QString path = folder + QLatin1String("/a.crt");
        TrustStore::write(path, TrustStore::authority("elo-mobile"));
        Certificates certificates;
        const CertificateFile file = folder == Anchors ? certificates.installedFiles().constFirst()
                                                       : certificates.blacklistedFiles().constFirst();
        QCOMPARE(names(file.certificates()), QStringList(QStringLiteral("Elo Mobile CA")));
        SignalSequence seen(&certificates);
        TrustStore::write(path, TrustStore::authority("open-trust"));
        QVERIFY(waitUntil(
            [&] { return names(file.certificates()) == QStringList(QStringLiteral("Open Trust Root CA")); }));
        const QStringList signalsSeen = seen.take();
        QVERIFY(!signalsSeen.isEmpty());
        QCOMPARE(signalsSeen.count(folder == Anchors ? QStringLiteral("installedFilesChanged()")
                                                     : QStringLiteral("blacklistedFilesChanged()")),
                 signalsSeen.size());
    }
}

void CertificatesTest::replacedFilesAreReadAgain()
{
    const QString path = Anchors + QLatin1String("/a.crt");
    TrustStore::write(path, TrustStore::authority("elo-mobile"));
    Certificates certificates;
    const CertificateFile file = certificates.installedFiles().constFirst();
    QCOMPARE(file.certificates().size(), 1);
    // More than once: the watch has to follow the name, not the file that had it first.
    for (const char *name : {"open-trust", "corvane-root", "elo-mobile"}) {
        TrustStore::write(path + QLatin1String(".new"), TrustStore::authority(name));
        QCOMPARE(std::rename(qPrintable(path + QLatin1String(".new")), qPrintable(path)), 0);
        const QList<QSslCertificate> expected = parsed(TrustStore::authority(name));
        QVERIFY(waitUntil([&] { return file.certificates() == expected; }));
        QCOMPARE(certificates.installedFiles().constFirst().certificates(), expected);
    }
}

void CertificatesTest::replacedFilesWithAnotherNameAreReadAgain()
{
    const QString path = Anchors + QLatin1String("/a.crt");
    TrustStore::write(path, TrustStore::authority("elo-mobile"));
    QCOMPARE(link(qPrintable(path), qPrintable(Anchors + QLatin1String("/same-file"))), 0);
    Certificates certificates;
    const CertificateFile file = certificates.installedFiles().constFirst();
    QCOMPARE(file.certificates().size(), 1);
    QVERIFY(QFile::remove(path));
    TrustStore::write(path, TrustStore::authority("open-trust"));
    const auto isNow = [&](const char *name) {
        return waitUntil([&] { return file.certificates() == parsed(TrustStore::authority(name)); });
    };
    QVERIFY(isNow("open-trust"));
    TrustStore::write(path, TrustStore::authority("corvane-root"));
    QVERIFY(isNow("corvane-root"));
}

void CertificatesTest::fileThatGoesAndComesBack()
{
    const QString path = Anchors + QLatin1String("/a.crt");
    TrustStore::write(path, TrustStore::authority("elo-mobile"));
    Certificates certificates;
    const CertificateFile file = certificates.installedFiles().constFirst();
    QCOMPARE(file.certificates().size(), 1);
    QVERIFY(QFile::remove(path));
    QVERIFY(waitUntil([&] { return file.certificates().isEmpty(); }));
    TrustStore::write(path, TrustStore::authority("open-trust"));
    QVERIFY(waitUntil([&] {
        const QList<CertificateFile> files = certificates.installedFiles();
        return files.size() == 1
            && files.constFirst().certificates() == parsed(TrustStore::authority("open-trust"));
    }));
    TrustStore::write(path, TrustStore::authority("corvane-root"));
    QVERIFY(waitUntil([&] {
        return certificates.installedFiles().constFirst().certificates()
            == parsed(TrustStore::authority("corvane-root"));
    }));
}

void CertificatesTest::foldersAreToldApart()
{
    Certificates certificates;
    SignalSequence seen(&certificates);
    TrustStore::write(Blacklist + QLatin1String("/a.crt"), "x");
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take().constFirst(), QStringLiteral("blacklistedFilesChanged()"));
    QVERIFY(waitUntil([&] { return certificates.blacklistedFiles().size() == 1; }));
    QCOMPARE(certificates.installedFiles().size(), 0);
}

void CertificatesTest::extractedFolderIsTheSystems()
{
    Certificates certificates;
    SignalSequence seen(&certificates);
    const QString path = Extracted + QLatin1String("/of-test.txt");
    TrustStore::write(path, "x");
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take().constFirst(), QStringLiteral("certificatesChanged()"));
    QVERIFY(QFile::remove(path));
}

void CertificatesTest::foldersThatAreNotThere()
{
    QVERIFY(QDir(Anchors).removeRecursively());
    Certificates certificates;
    QCOMPARE(certificates.installedFiles().size(), 0);
    TrustStore::write((QDir().mkpath(Anchors), Anchors + QLatin1String("/a.crt")),
                      TrustStore::authority("elo-mobile"));
    QCOMPARE(names(certificates.installedFiles()), QStringList(QStringLiteral("a.crt")));
    // From now on it is watched like any other.
    TrustStore::write(Anchors + QLatin1String("/b.crt"), "x");
    QVERIFY(waitUntil([&] { return certificates.installedFiles().size() == 2; }));

    QVERIFY(QDir(Anchors).removeRecursively());
    QVERIFY(waitUntil([&] { return certificates.installedFiles().isEmpty(); }));
    QVERIFY(QDir().mkpath(Anchors));
    TrustStore::write(Anchors + QLatin1String("/c.crt"), "x");
    QVERIFY(waitUntil(
        [&] { return names(certificates.installedFiles()) == QStringList(QStringLiteral("c.crt")); }));
}

void CertificatesTest::unchangedFilesAreNotTouched()
{
    for (int i = 0; i < 150; ++i)
        TrustStore::write(Anchors + QStringLiteral("/ca-%1.crt").arg(i), TrustStore::authority("elo-mobile"));
    const Certificates certificates;
    for (const CertificateFile &file : certificates.installedFiles())
        QCOMPARE(file.certificates().size(), 1);
    QCoreApplication::processEvents();
    TrustStore::OpenCounter opened(Anchors);
    const QList<CertificateFile> files = certificates.installedFiles();
    QCOMPARE(files.size(), 150);
    for (const CertificateFile &file : files)
        QCOMPARE(file.certificates().size(), 1);
    QCOMPARE(opened.take(), 0);
}

void CertificatesTest::systemCertificates()
{
    Certificates certificates;
    QCOMPARE(certificates.certificates(), QSslConfiguration::systemCaCertificates());
    const QStringList known = names(certificates.certificates());
    QVERIFY2(known.contains(QStringLiteral("Open Trust Root CA"))
                 && known.contains(QStringLiteral("Corvane Root CA")),
             qPrintable(known.join(QLatin1String(", "))));
}

void CertificatesTest::helperGetsWhatItIsPromised_data()
{
    QTest::addColumn<int>("index");
    for (int index = 0; index < 4; ++index)
        QTest::newRow(Requests[index].name) << index;
}

void CertificatesTest::helperGetsWhatItIsPromised()
{
    QFETCH(int, index);
    const Request &request = Requests[index];
    QTemporaryDir notes;
    const QByteArray folder = QFile::encodeName(notes.path());
    replaceHelper("echo \"$#:$*\" >" + folder + "/arguments; exec cat >" + folder + "/input");
    CertificateFile file;
    QCOMPARE(resultOf(request, &file), Certificates::Success);
    QCOMPARE(file.fileName(), FileName);
    QCOMPARE(TrustStore::contentOf(notes.filePath(QStringLiteral("arguments"))),
             "2:--" + QByteArray(request.name) + ' ' + QFile::encodeName(request.folder)
                 + "/elo-mobile.crt\n");
    const bool isRemoval = QByteArray(request.name).startsWith("un");
    QCOMPARE(TrustStore::contentOf(notes.filePath(QStringLiteral("input"))),
             isRemoval ? QByteArray() : TrustStore::authority("elo-mobile"));
}

void CertificatesTest::outcomes_data()
{
    QTest::addColumn<int>("index");
    QTest::addColumn<QByteArray>("script");
    QTest::addColumn<QStringList>("warnings");
    const auto rows = [](const char *name, const QByteArray &script, const QStringList &warnings) {
        for (int index = 0; index < 4; ++index) {
            QTest::newRow(qPrintable(
                QStringLiteral("%1, %2").arg(QLatin1String(name), QLatin1String(Requests[index].name))))
                << index << script << warnings;
        }
    };
    rows("success", "cat >/dev/null", {});
    rows("success with text", "cat >/dev/null; echo beware >&2; echo done", {});
    rows("failure", "cat >/dev/null; exit 3", {Failed + QStringLiteral(" \"\"")});
    rows("failure with text", "cat >/dev/null; echo told; echo 'no room' >&2; echo 'at all' >&2; exit 255",
         {Failed + QStringLiteral(" \"no room\\nat all\\n\"")});
    rows("crash", "cat >/dev/null; echo 'no room' >&2; kill -KILL $$",
         {Failed + QStringLiteral(" mdm-certificate crashed")});
}

void CertificatesTest::outcomes()
{
    QFETCH(int, index);
    QFETCH(QByteArray, script);
    QFETCH(QStringList, warnings);
    replaceHelper(script);
    CertificateFile file;
    QCOMPARE(resultOf(Requests[index], &file),
             warnings.isEmpty() ? Certificates::Success : Certificates::Failure);
    QCOMPARE(file.fileName(), FileName);
    QCOMPARE(takeWarnings(), warnings);
}

void CertificatesTest::helperThatCannotBeStarted_data()
{
    QTest::addColumn<int>("index");
    QTest::addColumn<QString>("kind");
    for (const char *kind : {"missing", "not executable", "folder", "dangling link", "no interpreter"}) {
        for (int index = 0; index < 4; ++index) {
            QTest::newRow(qPrintable(
                QStringLiteral("%1, %2").arg(QLatin1String(kind), QLatin1String(Requests[index].name))))
                << index << QString::fromLatin1(kind);
        }
    }
}

void CertificatesTest::helperThatCannotBeStarted()
{
    QFETCH(int, index);
    QFETCH(QString, kind);
    replaceHelper("exit 0");
    if (kind == QLatin1String("not executable")) {
        QVERIFY(QFile::setPermissions(Helper, QFile::ReadOwner | QFile::WriteOwner));
    } else if (kind == QLatin1String("no interpreter")) {
        TrustStore::write(Helper, "#!/no/such/interpreter\n");
    } else {
        QVERIFY(QFile::remove(Helper));
    }
    if (kind == QLatin1String("folder"))
        QVERIFY(QDir().mkdir(Helper));
    if (kind == QLatin1String("dangling link"))
        QVERIFY(QFile::link(QStringLiteral("/no/such/program"), Helper));

    CertificateFile file;
    QCOMPARE(resultOf(Requests[index], &file), Certificates::Failure);
    QCOMPARE(file.fileName(), FileName);
    QCOMPARE(takeWarnings(), QStringList(BrokenStart));
    QDir().rmdir(Helper);
}

void CertificatesTest::runInvalidatesWhatWasRead()
{
    const QString path = Anchors + QLatin1Char('/') + FileName;
    TrustStore::write(path, TrustStore::authority("elo-mobile"));
    Certificates certificates;
    const CertificateFile file = certificates.installedFiles().constFirst();
    for (const char *script : {"exit 0", "exit 1", "kill -KILL $$"}) {
        replaceHelper(script);
        QCOMPARE(file.certificates().size(), 1);
        TrustStore::OpenCounter opened(Anchors);
        bool readAgain = false;
        const QMetaObject::Connection connection
            = connect(&certificates, &Certificates::uninstallFinished, this, [&](const CertificateFile &) {
                  readAgain = file.certificates().size() == 1 && opened.take() > 0;
              });
        QSignalSpy finished(&certificates, &Certificates::uninstallFinished);
        certificates.uninstall(FileName);
        QVERIFY(waitUntil([&] { return !finished.isEmpty(); }));
        QVERIFY(readAgain);
        disconnect(connection);
    }
    takeWarnings();
}

void CertificatesTest::fileOfARequestIsTheListedOne()
{
    TrustStore::write(Anchors + QLatin1Char('/') + FileName, TrustStore::authority("elo-mobile"));
    replaceHelper("exit 0");
    Certificates certificates;
    const CertificateFile listed = certificates.installedFiles().constFirst();
    CertificateFile told;
    QSignalSpy finished(&certificates, &Certificates::uninstallFinished);
    connect(&certificates, &Certificates::uninstallFinished, this,
            [&told](const CertificateFile &file) { told = file; });
    certificates.uninstall(FileName);
    QVERIFY(waitUntil([&] { return !finished.isEmpty(); }));
    QCOMPARE(told.certificates().size(), 1);
    // They share what one of them has read.
    TrustStore::OpenCounter opened(Anchors);
    QCOMPARE(listed.certificates().size(), 1);
    QCOMPARE(opened.take(), 0);
}

void CertificatesTest::failedStartKeepsWhatWasRead()
{
    TrustStore::write(Anchors + QLatin1Char('/') + FileName, TrustStore::authority("elo-mobile"));
    QVERIFY(QFile::remove(Helper));
    Certificates certificates;
    const CertificateFile file = certificates.installedFiles().constFirst();
    QCOMPARE(file.certificates().size(), 1);
    QSignalSpy finished(&certificates, &Certificates::uninstallFinished);
    certificates.uninstall(FileName);
    QVERIFY(waitUntil([&] { return !finished.isEmpty(); }));
    TrustStore::OpenCounter opened(Anchors);
    QCOMPARE(file.certificates().size(), 1);
    QCOMPARE(opened.take(), 0);
    QCOMPARE(takeWarnings(), QStringList(BrokenStart));
}

void CertificatesTest::requestsDoNotReadTheFolder()
{
    TrustStore::write(Anchors + QLatin1Char('/') + FileName, TrustStore::authority("elo-mobile"));
    replaceHelper("exit 0");
    Certificates certificates;
    CertificateFile told;
    const auto take = [&told](const CertificateFile &file) {
        told = file;
    };
    connect(&certificates, &Certificates::uninstallFinished, this, take);
    connect(&certificates, &Certificates::unblacklistFinished, this, take);
    const auto fileOf = [&](void (Certificates::*request)(const QString &)) {
        told = CertificateFile();
        (certificates.*request)(FileName);
        waitUntil([&] { return !told.isNull(); });
        return told;
    };
    // Nobody has asked for the list, so that there is none to look at.
    TrustStore::OpenCounter opened(Anchors);
    const CertificateFile unlisted = fileOf(&Certificates::uninstall);
    QCOMPARE(opened.take(), 0);
    QCOMPARE(unlisted.fileName(), FileName);
    QCOMPARE(unlisted.certificates().size(), 1);

    // The list as it stands, also when it is not true any more.
    const CertificateFile listed = certificates.installedFiles().constFirst();
    QVERIFY(QFile::remove(Anchors + QLatin1Char('/') + FileName));
    QSignalSpy changed(&certificates, &Certificates::installedFilesChanged);
    QVERIFY(waitUntil([&] { return !changed.isEmpty(); }));
    opened.take();
    const CertificateFile gone = fileOf(&Certificates::uninstall);
    QCOMPARE(opened.take(), 0);
    TrustStore::write(Anchors + QLatin1Char('/') + FileName, TrustStore::authority("elo-mobile"));
    QCOMPARE(gone.certificates().size(), 1);
    opened.take();
    QCOMPARE(listed.certificates().size(), 1);
    QCOMPARE(opened.take(), 0);

    // A file of that name in the other folder is another file.
    const CertificateFile other = fileOf(&Certificates::unblacklist);
    QCOMPARE(other.fileName(), FileName);
    QCOMPARE(other.certificates().size(), 0);
}

void CertificatesTest::realHelperInstallsAndUninstalls()
{
    Certificates certificates;
    SignalSequence seen(&certificates);
    QCOMPARE(certificates.installedFiles().size(), 0);
    certificates.install(FileName, TrustStore::authority("elo-mobile"));
    QVERIFY(waitUntil([&] {
        return seen.signalsSeen().contains(QStringLiteral("installFinished(elo-mobile.crt, 0)"))
            && certificates.installedFiles().size() == 1;
    }));
    QCOMPARE(names(certificates.installedFiles().constFirst().certificates()),
             QStringList(QStringLiteral("Elo Mobile CA")));
    QVERIFY(names(certificates.certificates()).contains(QStringLiteral("Elo Mobile CA")));
    QVERIFY(waitUntil([&] { return seen.signalsSeen().contains(QStringLiteral("certificatesChanged()")); }));

    certificates.uninstall(FileName);
    QVERIFY(waitUntil([&] {
        return seen.signalsSeen().contains(QStringLiteral("uninstallFinished(elo-mobile.crt, 0)"))
            && certificates.installedFiles().isEmpty();
    }));
    QVERIFY(!names(certificates.certificates()).contains(QStringLiteral("Elo Mobile CA")));
    QVERIFY(!QFileInfo::exists(Anchors + QLatin1Char('/') + FileName));
}

void CertificatesTest::realHelperBlacklistsAndUnblacklists()
{
    Certificates certificates;
    SignalSequence seen(&certificates);
    certificates.blacklist(QStringLiteral("bad.crt"), TrustStore::authority("open-trust"));
    QVERIFY(waitUntil([&] {
        return seen.signalsSeen().contains(QStringLiteral("blacklistFinished(bad.crt, 0)"))
            && certificates.blacklistedFiles().size() == 1;
    }));
    QVERIFY(!names(certificates.certificates()).contains(QStringLiteral("Open Trust Root CA")));
    QVERIFY(!names(certificates.certificates()).isEmpty());
    certificates.unblacklist(QStringLiteral("bad.crt"));
    QVERIFY(waitUntil([&] {
        return seen.signalsSeen().contains(QStringLiteral("unblacklistFinished(bad.crt, 0)"))
            && certificates.blacklistedFiles().isEmpty();
    }));
    QVERIFY(names(certificates.certificates()).contains(QStringLiteral("Open Trust Root CA")));
}

void CertificatesTest::realHelperRefuses_data()
{
    QTest::addColumn<QString>("fileName");
    QTest::addColumn<QByteArray>("data");
    QTest::addColumn<QString>("reason");
    const QByteArray good = TrustStore::authority("elo-mobile");
    QTest::newRow("nothing") << FileName << QByteArray()
                             << QStringLiteral("standard input has no certificate in PEM form");
    QTest::newRow("garbage") << FileName << QByteArray("\0\1garbage", 9)
                             << QStringLiteral("standard input has no certificate in PEM form");
    QTest::newRow("damaged") << FileName << good + QByteArray(good).replace("M", "A")
                             << QStringLiteral("certificate 2 of 2 is damaged");
    QTest::newRow("huge") << FileName << QByteArray(5 * 1024 * 1024, 'x')
                          << QStringLiteral("standard input has more than 4 MiB");
    QTest::newRow("no name") << QString() << good << QStringLiteral("%1/ is no file of %1").arg(Anchors);
    QTest::newRow("elsewhere") << QStringLiteral("../a.crt") << good
                               << QStringLiteral("%1/../a.crt is no file of %1").arg(Anchors);
    QTest::newRow("hidden") << QStringLiteral(".crt") << good
                            << QStringLiteral("%1/.crt is no file of %1").arg(Anchors);
}

void CertificatesTest::realHelperRefuses()
{
    QFETCH(QString, fileName);
    QFETCH(QByteArray, data);
    QFETCH(QString, reason);
    Certificates certificates;
    QSignalSpy finished(&certificates, &Certificates::installFinished);
    certificates.install(fileName, data);
    QVERIFY(waitUntil([&] { return !finished.isEmpty(); }));
    QCOMPARE(finished.constFirst().at(1).value<Certificates::Result>(), Certificates::Failure);
    QCOMPARE(takeWarnings(), QStringList(Failed + QStringLiteral(" \"mdm-certificate: %1\\n\"").arg(reason)));
    QCOMPARE(QDir(Anchors).entryList(QDir::Files | QDir::Hidden), QStringList());
}

void CertificatesTest::installsLists()
{
    const QList<QSslCertificate> list
        = parsed(TrustStore::authority("elo-mobile") + TrustStore::authority("open-trust"));
    QCOMPARE(list.size(), 2);
    Certificates certificates;
    QSignalSpy installed(&certificates, &Certificates::installFinished);
    QSignalSpy blacklisted(&certificates, &Certificates::blacklistFinished);
    certificates.install(QStringLiteral("two.crt"), list);
    certificates.blacklist(QStringLiteral("two.crt"), list);
    QVERIFY(waitUntil([&] { return !installed.isEmpty() && !blacklisted.isEmpty(); }));
    for (const QString &folder : {Anchors, Blacklist})
        QCOMPARE(parsed(TrustStore::contentOf(folder + QLatin1String("/two.crt"))), list);

    replaceHelper("cat >\"$2\"");
    certificates.install(QStringLiteral("pem.crt"), list);
    QVERIFY(waitUntil([&] { return installed.size() == 2; }));
    QCOMPARE(TrustStore::contentOf(Anchors + QLatin1String("/pem.crt")),
             list.at(0).toPem() + list.at(1).toPem());
    certificates.install(QStringLiteral("none.crt"), QList<QSslCertificate>());
    QVERIFY(waitUntil([&] { return installed.size() == 3; }));
    QCOMPARE(QFileInfo(Anchors + QLatin1String("/none.crt")).size(), 0);
}

void CertificatesTest::largeDataReachesTheHelper()
{
    // More than a pipe holds.
    const QByteArray data = TrustStore::authority("elo-mobile").repeated(1000);
    replaceHelper("cat >\"$2\"");
    Certificates certificates;
    QSignalSpy finished(&certificates, &Certificates::installFinished);
    certificates.install(FileName, data);
    QVERIFY(waitUntil([&] { return !finished.isEmpty(); }));
    QCOMPARE(TrustStore::contentOf(Anchors + QLatin1Char('/') + FileName), data);
}

void CertificatesTest::helperThatDoesNotRead()
{
    const QByteArray data(1024 * 1024, 'x');
    replaceHelper("exec <&-; exit 0");
    Certificates certificates;
    QSignalSpy finished(&certificates, &Certificates::installFinished);
    certificates.install(FileName, data);
    QVERIFY(waitUntil([&] { return !finished.isEmpty(); }));
    QCOMPARE(finished.constFirst().at(1).value<Certificates::Result>(), Certificates::Success);
}

void CertificatesTest::manyRequestsForOneFile()
{
    constexpr int count = 50;
    Certificates certificates;
    QSignalSpy finished(&certificates, &Certificates::installFinished);
    const QByteArray contents[]
        = {TrustStore::authority("elo-mobile"), TrustStore::authority("leaked-trust")};
    for (int i = 0; i < count; ++i)
        certificates.install(FileName, contents[i % 2]);
    QVERIFY(waitUntil([&] { return finished.size() == count; }));
    for (const QList<QVariant> &arguments : qAsConst(finished))
        QCOMPARE(arguments.at(1).value<Certificates::Result>(), Certificates::Success);
    // One of them came last, and left a whole file.
    const QList<QSslCertificate> last = parsed(TrustStore::contentOf(Anchors + QLatin1Char('/') + FileName));
    QVERIFY(last == parsed(contents[0]) || last == parsed(contents[1]));
    QVERIFY(waitUntil([&] {
        const QList<CertificateFile> files = certificates.installedFiles();
        return files.size() == 1 && files.constFirst().certificates() == last;
    }));
    QVERIFY(certificates.certificates().contains(last.constFirst()));
    QCOMPARE(QDir(Anchors).entryList(QDir::Files | QDir::Hidden).size(), 1);
}

void CertificatesTest::runsOutliveTheirObject()
{
    QTemporaryDir notes;
    const QString done = notes.filePath(QStringLiteral("done"));
    replaceHelper("cat >/dev/null; echo sorry >&2; echo >" + QFile::encodeName(done) + "; exit 1");
    {
        Certificates certificates;
        certificates.install(FileName, TrustStore::authority("elo-mobile"));
    }
    // The result is dropped, what went wrong is still logged.
    QStringList warnings;
    QVERIFY(waitUntil([&] { return !(warnings += takeWarnings()).isEmpty(); }));
    QCOMPARE(warnings, QStringList(Failed + QStringLiteral(" \"sorry\\n\"")));
    QVERIFY(QFileInfo::exists(done));
}

void CertificatesTest::failedStartOutlivesItsObject()
{
    QVERIFY(QFile::remove(Helper));
    {
        Certificates certificates;
        certificates.uninstall(FileName);
    }
    QStringList warnings;
    QVERIFY(waitUntil([&] { return !(warnings += takeWarnings()).isEmpty(); }));
    QCOMPARE(warnings, QStringList(BrokenStart));
}

void CertificatesTest::deletionInASlot()
{
    for (const char *script : {"exit 0", "exit 1", "kill -KILL $$"}) {
        replaceHelper(script);
        auto certificates = std::make_unique<Certificates>();
        connect(certificates.get(), &Certificates::uninstallFinished, this, [&] { certificates.reset(); });
        certificates->uninstall(FileName);
        QVERIFY(waitUntil([&] { return !certificates; }));
    }
    QVERIFY(QFile::remove(Helper));
    auto certificates = std::make_unique<Certificates>();
    connect(certificates.get(), &Certificates::uninstallFinished, this, [&] { certificates.reset(); });
    certificates->uninstall(FileName);
    QVERIFY(waitUntil([&] { return !certificates; }));

    for (const QString &path : {Anchors + QLatin1String("/a.crt"), Blacklist + QLatin1String("/a.crt")}) {
        TrustStore::write(path, "x");
        certificates = std::make_unique<Certificates>();
        certificates->installedFiles();
        certificates->blacklistedFiles();
        connect(certificates.get(), &Certificates::installedFilesChanged, this,
                [&] { certificates.reset(); });
        connect(certificates.get(), &Certificates::blacklistedFilesChanged, this,
                [&] { certificates.reset(); });
        TrustStore::write(path, "y");
        QVERIFY(waitUntil([&] { return !certificates; }));
    }
    takeWarnings();
}

void CertificatesTest::worksThroughTheMetaObject()
{
    replaceHelper("exit 0");
    Certificates certificates;
    const QSignalSpy spy(
        &certificates,
        SIGNAL(uninstallFinished(Corvane::Mdm::CertificateFile, Corvane::Mdm::Certificates::Result)));
    QVERIFY(spy.isValid());
    CertificateFile queued;
    connect(
        &certificates, &Certificates::uninstallFinished, this,
        [&queued](const CertificateFile &file) { queued = file; }, Qt::QueuedConnection);
    certificates.uninstall(FileName);
    QVERIFY(waitUntil([&] { return !queued.isNull(); }));
    QCOMPARE(queued.fileName(), FileName);
    QCOMPARE(spy.size(), 1);
    QCOMPARE(spy.constFirst().at(0).value<CertificateFile>().fileName(), FileName);
    QCOMPARE(spy.constFirst().at(1).value<Certificates::Result>(), Certificates::Success);

    QStringList declared;
    const QMetaObject &meta = Certificates::staticMetaObject;
    for (int index = meta.methodOffset(); index < meta.methodCount(); ++index)
        declared << QString::fromLatin1(meta.method(index).name());
    QCOMPARE(declared,
             QStringList({QStringLiteral("installFinished"), QStringLiteral("uninstallFinished"),
                          QStringLiteral("blacklistFinished"), QStringLiteral("unblacklistFinished"),
                          QStringLiteral("certificatesChanged"), QStringLiteral("installedFilesChanged"),
                          QStringLiteral("blacklistedFilesChanged")}));
    QCOMPARE(QMetaType::type("Corvane::Mdm::CertificateFile"), qMetaTypeId<CertificateFile>());
    QCOMPARE(QMetaType::type("Corvane::Mdm::Certificates::Result"), qMetaTypeId<Certificates::Result>());
}

QTEST_GUILESS_MAIN(CertificatesTest)
#include "certificates_test.moc"
