// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"

#include <corvanemdm/applications.h>

#include <QtCore/QFile>
#include <QtTest/QtTest>

#include <dlfcn.h>
#include <fcntl.h>
#include <rpm/header.h>
#include <rpm/rpmdb.h>
#include <rpm/rpmlib.h>
#include <rpm/rpmtd.h>
#include <rpm/rpmts.h>

#include <functional>
#include <utility>

using Corvane::Mdm::ApplicationEntry;
using Corvane::Mdm::Applications;
using Corvane::Mdm::PackageEntry;

namespace
{

const QString DatabaseFile = QStringLiteral("/var/lib/rpm/rpmdb.sqlite");

/** Adds a header to the phone's database that no package manager would. */
void addHeader(const std::function<void(Header)> &fill)
{
    const rpmts transactions = rpmtsCreate();
    if (rpmtsOpenDB(transactions, O_RDWR) != 0)
        qFatal("the package database cannot be opened (run the test inside corvane-simulator)");
    const rpmtxn lock = rpmtxnBegin(transactions, RPMTXN_WRITE);
    Header header = headerNew();
    headerPutString(header, RPMTAG_RELEASE, "1");
    headerPutString(header, RPMTAG_ARCH, "noarch");
    headerPutString(header, RPMTAG_OS, "linux");
    fill(header);
    header = headerReload(header, RPMTAG_HEADERIMMUTABLE);
    if (rpmtsImportHeader(lock, header, 0) != RPMRC_OK)
        qFatal("the header cannot be added");
    headerFree(header);
    rpmtxnEnd(lock);
    rpmtsFree(transactions);
}

/** Gives @p header a number where a text belongs. */
void putNumber(Header header, rpmTagVal tag)
{
    uint32_t number = 7;
    rpmtd_s data = {};
    data.tag = tag;
    data.type = RPM_INT32_TYPE;
    data.data = &number;
    data.count = 1;
    if (!headerPut(header, &data, HEADERPUT_DEFAULT))
        qFatal("the header cannot be given a number");
}

/** What the next search of the database finds in place of the first header that is there, if it is given. */
Header damagedHeader = nullptr;

int configurationsRead = 0;

QString textOf(const PackageEntry &package)
{
    return QStringList({package.name(), package.version(), package.vendor()}).join(QLatin1Char('|'));
}

} // namespace

// librpm does not close a database that is none.
extern "C" Q_DECL_EXPORT const char *__lsan_default_suppressions();
extern "C" const char *__lsan_default_suppressions()
{
    return "leak:libsqlite3";
}

// This librpm passes over headers that are damaged, others do not. The library finds this function before
// librpm's.
extern "C" Q_DECL_EXPORT Header rpmdbNextIterator(rpmdbMatchIterator iterator)
{
    static const auto next
        = reinterpret_cast<Header (*)(rpmdbMatchIterator)>(dlsym(RTLD_NEXT, "rpmdbNextIterator"));
    const Header found = next(iterator);
    return found && damagedHeader ? std::exchange(damagedHeader, nullptr) : found;
}

// The same, to see how often rpm's configuration is read.
extern "C" Q_DECL_EXPORT int rpmReadConfigFiles(const char *file, const char *target)
{
    if (file || target)
        qFatal("it is not the default configuration of rpm that is read");
    ++configurationsRead;
    static const auto next
        = reinterpret_cast<int (*)(const char *, const char *)>(dlsym(RTLD_NEXT, "rpmReadConfigFiles"));
    return next(file, target);
}

Q_DECLARE_METATYPE(std::function<void(Header)>)

/** What the package database may hold that is not as it should be. */
class PackageHeadersTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void configurationIsReadOnce();
    void headers_data();
    void headers();
    void headerWithoutANameIsPassedOver();
    void damagedHeaders_data();
    void damagedHeaders();
    void ownerWithoutAVersion();
    void severalOwnersOfOneFile();
    void noDatabase();
    void brokenDatabase();

private:
    int m_known = 0; ///< packages of the phone, and those that the tests added
};

void PackageHeadersTest::initTestCase()
{
    // Not when the library is loaded, and not with each object.
    QCOMPARE(configurationsRead, 0);
    m_known = Applications().getInstalledPackages().size();
    QVERIFY(m_known > 0);
}

void PackageHeadersTest::configurationIsReadOnce()
{
    QCOMPARE(configurationsRead, 1);
    const Applications another;
    QCOMPARE(another.getInstalledPackages().size(), m_known);
    QCOMPARE(configurationsRead, 1);
}

void PackageHeadersTest::headers_data()
{
    using Fill = std::function<void(Header)>;
    QTest::addColumn<Fill>("fill");
    QTest::addColumn<QString>("package");
    QTest::addColumn<bool>("valid");
    QTest::addColumn<QStringList>("warnings");
    const auto put = [](Header header, rpmTagVal tag, const char *text) {
        headerPutString(header, tag, text);
    };
    const QStringList none;
    QTest::newRow("all three") << Fill([put](Header header) {
        put(header, RPMTAG_NAME, "whole");
        put(header, RPMTAG_VERSION, "1.0");
        put(header, RPMTAG_VENDOR, "Caf\303\251");
    }) << QString::fromUtf8("whole|1.0|Caf\303\251")
                               << true << none;
    QTest::newRow("no vendor") << Fill([put](Header header) {
        put(header, RPMTAG_NAME, "plain");
        put(header, RPMTAG_VERSION, "1.0");
    }) << "plain|1.0|" << true << none;
    QTest::newRow("no version") << Fill([put](Header header) { put(header, RPMTAG_NAME, "unversioned"); })
                                << "unversioned||" << false
                                << QStringList(QStringLiteral("rpm headerGet failed for version"));
    QTest::newRow("empty name") << Fill([put](Header header) {
        put(header, RPMTAG_NAME, "");
        put(header, RPMTAG_VERSION, "1.0");
    }) << "|1.0|" << false << none;
}

void PackageHeadersTest::headers()
{
    QFETCH(std::function<void(Header)>, fill);
    QFETCH(QString, package);
    QFETCH(bool, valid);
    QFETCH(QStringList, warnings);
    MessageLog log;
    const Applications applications;
    applications.getInstalledPackages();
    const QStringList before = log.takeWarnings();
    addHeader(fill);
    const QList<PackageEntry> packages = applications.getInstalledPackages();
    QCOMPARE(packages.size(), ++m_known);
    // The newest comes last.
    QCOMPARE(textOf(packages.last()), package);
    QCOMPARE(packages.last().isValid(), valid);
    QCOMPARE(log.takeWarnings(), before + warnings);
}

void PackageHeadersTest::headerWithoutANameIsPassedOver()
{
    // For librpm such a header is damaged.
    addHeader([](Header header) { headerPutString(header, RPMTAG_VERSION, "2.0"); });
    QCOMPARE(Applications().getInstalledPackages().size(), m_known);
}

void PackageHeadersTest::damagedHeaders_data()
{
    using Fill = std::function<void(Header)>;
    QTest::addColumn<Fill>("fill");
    QTest::addColumn<QString>("package");
    QTest::addColumn<QStringList>("warnings");
    const QString noName = QStringLiteral("rpm headerGet failed for name");
    const QString noVersion = QStringLiteral("rpm headerGet failed for version");
    const QString noText = QStringLiteral("RPM header didn't return string as expected");
    const auto put = [](Header header, rpmTagVal tag, const char *text) {
        headerPutString(header, tag, text);
    };
    QTest::newRow("no name") << Fill([put](Header header) {
        put(header, RPMTAG_VERSION, "1.0");
        put(header, RPMTAG_VENDOR, "Acme");
    }) << "|1.0|Acme" << QStringList(noName);
    QTest::newRow("nothing") << Fill([](Header) {}) << "||" << QStringList({noName, noVersion});
    QTest::newRow("name that is no text") << Fill([put](Header header) {
        putNumber(header, RPMTAG_NAME);
        put(header, RPMTAG_VERSION, "1.0");
    }) << "|1.0|" << QStringList(noText);
    QTest::newRow("version that is no text") << Fill([put](Header header) {
        put(header, RPMTAG_NAME, "odd");
        putNumber(header, RPMTAG_VERSION);
        put(header, RPMTAG_VENDOR, "Acme");
    }) << "odd||Acme" << QStringList(noText);
    QTest::newRow("vendor that is no text") << Fill([put](Header header) {
        put(header, RPMTAG_NAME, "odd");
        put(header, RPMTAG_VERSION, "1.0");
        putNumber(header, RPMTAG_VENDOR);
    }) << "odd|1.0|" << QStringList(noText);
}

void PackageHeadersTest::damagedHeaders()
{
    QFETCH(std::function<void(Header)>, fill);
    QFETCH(QString, package);
    QFETCH(QStringList, warnings);
    const Header header = headerNew();
    fill(header);
    // The other packages have warnings of their own.
    MessageLog log;
    const Applications applications;
    applications.getInstalledPackages();
    const QStringList ofTheOthers = log.takeWarnings();
    damagedHeader = header;
    const QList<PackageEntry> packages = applications.getInstalledPackages();
    QCOMPARE(log.takeWarnings(), warnings + ofTheOthers);
    headerFree(header);
    QCOMPARE(packages.size(), m_known);
    QCOMPARE(textOf(packages.first()), package);
}

void PackageHeadersTest::ownerWithoutAVersion()
{
    const char *const entry = "/usr/share/applications/orphan.desktop";
    QFile file{QString::fromLatin1(entry)};
    QVERIFY(file.open(QIODevice::WriteOnly));
    file.write("[Desktop Entry]\nType=Application\nName=Orphan\nExec=orphan\n");
    file.close();
    addHeader([](Header header) {
        headerPutString(header, RPMTAG_NAME, "orphan");
        const char *name = "orphan.desktop";
        const char *folder = "/usr/share/applications/";
        const uint32_t index = 0;
        headerPutStringArray(header, RPMTAG_BASENAMES, &name, 1);
        headerPutStringArray(header, RPMTAG_DIRNAMES, &folder, 1);
        headerPutUint32(header, RPMTAG_DIRINDEXES, &index, 1);
    });
    ++m_known;
    MessageLog log;
    const QList<ApplicationEntry> entries = Applications().getInstalledApplications();
    const auto orphan = std::find_if(entries.begin(), entries.end(), [](const ApplicationEntry &each) {
        return each.name() == QLatin1String("Orphan");
    });
    QVERIFY(orphan != entries.end());
    QCOMPARE(textOf(orphan->package()), QStringLiteral("orphan||"));
    QVERIFY(!orphan->package().isValid());
    QCOMPARE(log.takeWarnings(), QStringList(QStringLiteral("rpm headerGet failed for version")));
    QVERIFY(file.remove());
}

void PackageHeadersTest::severalOwnersOfOneFile()
{
    const auto addOwner = [this](const char *package) {
        addHeader([package](Header header) {
            headerPutString(header, RPMTAG_NAME, package);
            headerPutString(header, RPMTAG_VERSION, "1.0");
            const char *name = "shared.desktop";
            const char *folder = "/usr/share/applications/";
            const uint32_t index = 0;
            headerPutStringArray(header, RPMTAG_BASENAMES, &name, 1);
            headerPutStringArray(header, RPMTAG_DIRNAMES, &folder, 1);
            headerPutUint32(header, RPMTAG_DIRINDEXES, &index, 1);
        });
        ++m_known;
    };
    addOwner("first-owner");
    addOwner("second-owner");
    QFile file(QStringLiteral("/usr/share/applications/shared.desktop"));
    QVERIFY(file.open(QIODevice::WriteOnly));
    file.write("[Desktop Entry]\nType=Application\nName=Shared\nExec=shared\n");
    file.close();
    const QList<ApplicationEntry> entries = Applications().getInstalledApplications();
    QVERIFY(file.remove());
    QStringList owners;
    for (const ApplicationEntry &entry : entries) {
        if (entry.name() == QLatin1String("Shared"))
            owners << entry.package().name();
    }
    QCOMPARE(owners, QStringList(QStringLiteral("first-owner")));
}

void PackageHeadersTest::noDatabase()
{
    const QString aside = DatabaseFile + QStringLiteral(".aside");
    QVERIFY(QFile::rename(DatabaseFile, aside));
    const Applications applications;
    QCOMPARE(applications.getInstalledPackages().size(), 0);
    const QList<ApplicationEntry> entries = applications.getInstalledApplications();
    QVERIFY(!entries.isEmpty());
    for (const ApplicationEntry &entry : entries)
        QVERIFY(!entry.package().isValid());
    QFile::remove(DatabaseFile);
    QVERIFY(QFile::rename(aside, DatabaseFile));
    QCOMPARE(applications.getInstalledPackages().size(), m_known);
}

void PackageHeadersTest::brokenDatabase()
{
    const QString aside = DatabaseFile + QStringLiteral(".aside");
    QVERIFY(QFile::rename(DatabaseFile, aside));
    QFile broken(DatabaseFile);
    QVERIFY(broken.open(QIODevice::WriteOnly));
    broken.write(QByteArray(100000, 'x'));
    broken.close();
    const Applications applications;
    QCOMPARE(applications.getInstalledPackages().size(), 0);
    QVERIFY(!applications.getInstalledApplications().isEmpty());
    QVERIFY(broken.remove());
    QVERIFY(QFile::rename(aside, DatabaseFile));
    QCOMPARE(applications.getInstalledPackages().size(), m_known);
}

QTEST_GUILESS_MAIN(PackageHeadersTest)
#include "packageheaders_test.moc"
