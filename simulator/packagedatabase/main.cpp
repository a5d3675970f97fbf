// SPDX-License-Identifier: LGPL-2.1-or-later
// Writes packages to an rpm database: real headers, made from the profile's words. A program of its own, so
// that the phone starts without librpm, and without the signal handlers that librpm sets while a database is
// open for writing.
#include "package.h"

#include <CLI/CLI.hpp>

#include <QtCore/QFile>
#include <QtCore/QFileInfo>
#include <QtCore/QJsonDocument>

#include <fcntl.h>
#include <rpm/header.h>
#include <rpm/rpmdb.h>
#include <rpm/rpmds.h>
#include <rpm/rpmlib.h>
#include <rpm/rpmmacro.h>
#include <rpm/rpmts.h>

#include <cstdio>
#include <ctime>
#include <memory>
#include <stdexcept>

using Corvane::Simulator::Package;

namespace
{

struct Free {
    void operator()(rpmts transactions) const { rpmtsFree(transactions); }
    void operator()(rpmtxn lock) const { rpmtxnEnd(lock); }
    void operator()(rpmdbMatchIterator matches) const { rpmdbFreeIterator(matches); }
    void operator()(Header header) const { headerFree(header); }
};
using Transactions = std::unique_ptr<rpmts_s, Free>;
using Lock = std::unique_ptr<rpmtxn_s, Free>;
using Matches = std::unique_ptr<rpmdbMatchIterator_s, Free>;
using HeaderPointer = std::unique_ptr<headerToken_s, Free>;

class Failure : public std::runtime_error
{
public:
    using std::runtime_error::runtime_error;
};

void put(Header header, rpmTagVal tag, const QString &text)
{
    if (!text.isEmpty())
        headerPutString(header, tag, text.toUtf8().constData());
}

void putFiles(Header header, const Package &package)
{
    constexpr rpm_mode_t plainFile = 0100644;
    std::map<QString, uint32_t> folders;
    for (const auto &[path, content] : package.files) {
        const QString folder = QFileInfo(path).path() + QLatin1Char('/');
        const auto number = uint32_t(folders.size());
        const auto [known, isNew] = folders.emplace(folder, number);
        if (isNew)
            headerPutString(header, RPMTAG_DIRNAMES, folder.toUtf8().constData());
        headerPutString(header, RPMTAG_BASENAMES, QFileInfo(path).fileName().toUtf8().constData());
        headerPutUint32(header, RPMTAG_DIRINDEXES, &known->second, 1);
        const auto size = uint32_t(content.size());
        headerPutUint32(header, RPMTAG_FILESIZES, &size, 1);
        headerPutUint16(header, RPMTAG_FILEMODES, &plainFile, 1);
        const char installed = RPMFILE_STATE_NORMAL;
        headerPutChar(header, RPMTAG_FILESTATES, &installed, 1);
        headerPutString(header, RPMTAG_FILEUSERNAME, "root");
        headerPutString(header, RPMTAG_FILEGROUPNAME, "root");
    }
}

HeaderPointer headerOf(const Package &package)
{
    HeaderPointer header(headerNew());
    put(header.get(), RPMTAG_NAME, package.name);
    put(header.get(), RPMTAG_VERSION, package.version);
    put(header.get(), RPMTAG_RELEASE, package.release);
    put(header.get(), RPMTAG_VENDOR, package.vendor);
    put(header.get(), RPMTAG_SUMMARY, package.summary);
    put(header.get(), RPMTAG_ARCH, QStringLiteral("noarch"));
    put(header.get(), RPMTAG_OS, QStringLiteral("linux"));
    // Without it the package would count as a source package.
    put(header.get(), RPMTAG_SOURCERPM,
        QStringLiteral("%1-%2.src.rpm").arg(package.name, package.fullVersion()));
    const uint32_t exactly = RPMSENSE_EQUAL;
    put(header.get(), RPMTAG_PROVIDENAME, package.name);
    put(header.get(), RPMTAG_PROVIDEVERSION, package.fullVersion());
    headerPutUint32(header.get(), RPMTAG_PROVIDEFLAGS, &exactly, 1);
    const uint32_t anyVersion = RPMSENSE_ANY;
    for (const QString &needed : package.needs) {
        put(header.get(), RPMTAG_REQUIRENAME, needed);
        headerPutString(header.get(), RPMTAG_REQUIREVERSION, "");
        headerPutUint32(header.get(), RPMTAG_REQUIREFLAGS, &anyVersion, 1);
    }
    putFiles(header.get(), package);
    // What came with the package is apart from what the installation adds.
    header.reset(headerReload(header.release(), RPMTAG_HEADERIMMUTABLE));
    const auto now = uint32_t(std::time(nullptr));
    headerPutUint32(header.get(), RPMTAG_INSTALLTIME, &now, 1);
    return header;
}

Transactions openDatabase()
{
    Transactions transactions(rpmtsCreate());
    if (rpmtsOpenDB(transactions.get(), O_RDWR | O_CREAT) != 0)
        throw Failure("the database cannot be opened");
    return transactions;
}

void addPackages(rpmts transactions, const std::vector<Package> &packages)
{
    const Lock lock(rpmtxnBegin(transactions, RPMTXN_WRITE));
    for (const Package &package : packages) {
        const HeaderPointer header = headerOf(package);
        if (rpmtsImportHeader(lock.get(), header.get(), 0) != RPMRC_OK)
            throw Failure("cannot add " + package.name.toStdString());
    }
}

void removePackages(rpmts transactions, const std::vector<std::string> &names)
{
    for (const std::string &name : names) {
        const Matches matches(rpmtsInitIterator(transactions, RPMDBI_NAME, name.c_str(), 0));
        const Header header = rpmdbNextIterator(matches.get());
        if (!header || rpmtsAddEraseElement(transactions, header, -1) != 0)
            throw Failure(name + " is not installed");
    }
    rpmtsSetFlags(transactions, RPMTRANS_FLAG_JUSTDB | RPMTRANS_FLAG_NOSCRIPTS | RPMTRANS_FLAG_NOTRIGGERS);
    if (rpmtsRun(transactions, nullptr, RPMPROB_FILTER_NONE) != 0)
        throw Failure("the packages cannot be removed");
}

/** Standard input: packages as a profile lists them, or a whole profile with those that it has installed. */
QJsonArray readPackages()
{
    QFile input;
    if (!input.open(stdin, QIODevice::ReadOnly))
        throw Failure("standard input cannot be read");
    const QJsonDocument document = QJsonDocument::fromJson(input.readAll());
    if (document.isArray())
        return document.array();
    const QJsonValue installed
        = document.object().value(QLatin1String("packages")).toObject().value(QLatin1String("installed"));
    if (!installed.isArray())
        throw Failure("no packages on standard input");
    return installed.toArray();
}

/** Notes in @p folder what the database in it was made of: a phone with other packages does not take it. */
void note(const QJsonArray &packages, const std::string &folder)
{
    QFile file(QString::fromStdString(folder) + QLatin1String("/packages.json"));
    const QByteArray content = QJsonDocument(packages).toJson(QJsonDocument::Compact);
    if (!file.open(QIODevice::WriteOnly) || file.write(content) != content.size())
        throw Failure("cannot write to " + folder);
}

} // namespace

int main(int argc, char *argv[])
{
    CLI::App app("Writes packages to the rpm database of a simulated phone.", "corvane-package-database");
    std::string folder;
    std::vector<std::string> names;
    app.add_subcommand("add", "adds the packages of a JSON array on standard input");
    auto *prepare
        = app.add_subcommand("prepare", "makes the database for phones with the profile on standard input");
    prepare->add_option("FOLDER", folder, "where it is made")->required();
    auto *remove = app.add_subcommand("remove", "removes packages, whatever needs them");
    remove->add_option("NAME", names, "names of packages")->required();
    app.require_subcommand(1);
    CLI11_PARSE(app, argc, argv);

    try {
        if (rpmReadConfigFiles(nullptr, nullptr) != 0)
            throw Failure("rpm's configuration cannot be read");
        if (prepare->parsed())
            rpmPushMacro(nullptr, "_dbpath", nullptr, folder.c_str(), RMIL_CMDLINE);
        const Transactions transactions = openDatabase();
        if (remove->parsed()) {
            removePackages(transactions.get(), names);
            return 0;
        }
        const QJsonArray packages = readPackages();
        addPackages(transactions.get(), Corvane::Simulator::packagesFrom(packages));
        if (prepare->parsed())
            note(packages, folder);
    } catch (const Failure &failure) {
        std::fprintf(stderr, "corvane-package-database: %s\n", failure.what());
        return 1;
    }
    return 0;
}
