// SPDX-License-Identifier: LGPL-2.1-or-later
// The phone's certificate helper: writes or removes one file of the trust store, and extracts the store anew.
#include "truststore.h"

#include <QtCore/QDir>
#include <QtCore/QFile>
#include <QtCore/QFileInfo>
#include <QtCore/QSaveFile>
#include <QtCore/QStringList>
#include <QtNetwork/QSslCertificate>

#include <algorithm>
#include <cstdio>
#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

namespace
{

using namespace Corvane::Simulator;

constexpr qint64 mostBytes = 4 * 1024 * 1024;

constexpr char usage[]
    = "usage: mdm-certificate --install|--uninstall|--blacklist|--unblacklist FILE\n"
      "Certificates to install or to blacklist are read from standard input, in PEM form.\n";

enum ExitStatus { Done = 0, Failed = 1, WrongUsage = 2 };

/** Ends the program with one line. */
struct Failure {
    QString text;
};

struct Operation {
    QLatin1String option;
    QLatin1String folder;
    bool writes;
};

const Operation operations[] = {
    {QLatin1String("--install"), TrustStore::anchorsFolder, true},
    {QLatin1String("--uninstall"), TrustStore::anchorsFolder, false},
    {QLatin1String("--blacklist"), TrustStore::blacklistFolder, true},
    {QLatin1String("--unblacklist"), TrustStore::blacklistFolder, false},
};

void say(const QString &text)
{
    std::fprintf(stderr, "mdm-certificate: %s\n", qUtf8Printable(text));
}

/** Keeps other helpers out until the program ends. */
void lockTrustStore()
{
    const int fd = open(TrustStore::folder.data(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    int result = fd;
    while (result >= 0 && (result = flock(fd, LOCK_EX)) < 0 && errno == EINTR)
        result = 0;
    if (result < 0)
        throw Failure{QStringLiteral("cannot lock %1: %2").arg(TrustStore::folder, qt_error_string(errno))};
}

QByteArray readStandardInput()
{
    QFile input;
    if (!input.open(stdin, QIODevice::ReadOnly))
        throw Failure{QStringLiteral("cannot read standard input")};
    QByteArray data;
    while (data.size() <= mostBytes) {
        const QByteArray more = input.read(mostBytes);
        if (more.isEmpty())
            break;
        data += more;
    }
    if (data.size() > mostBytes)
        throw Failure{QStringLiteral("standard input has more than 4 MiB")};
    return data;
}

/** The text of the certificates in @p data, which must be good ones. */
QByteArray checked(const QByteArray &data)
{
    const QByteArrayList certificates = TrustStore::certificatesIn(data);
    if (certificates.isEmpty())
        throw Failure{QStringLiteral("standard input has no certificate in PEM form")};
    for (int i = 0; i < certificates.size(); ++i) {
        const QList<QSslCertificate> read = QSslCertificate::fromData(certificates.at(i), QSsl::Pem);
        if (read.size() != 1 || read.first().isNull())
            throw Failure{
                QStringLiteral("certificate %1 of %2 is damaged").arg(i + 1).arg(certificates.size())};
    }
    return certificates.join('\n') + '\n';
}

void write(const QString &path, const QByteArray &content)
{
    // Whoever reads the file finds the old one or the new one, and never a part.
    QSaveFile file(path);
    if (!file.open(QIODevice::WriteOnly) || file.write(content) != content.size() || !file.commit())
        throw Failure{QStringLiteral("cannot write %1: %2").arg(path, file.errorString())};
}

/** All certificates in the files of @p folder. */
QByteArrayList certificatesOf(const QString &folder)
{
    QByteArrayList certificates;
    const QStringList names = QDir(folder).entryList(QDir::Files, QDir::Name);
    for (const QString &name : names) {
        QFile file(folder + QLatin1Char('/') + name);
        const QByteArrayList found
            = file.open(QIODevice::ReadOnly) ? TrustStore::certificatesIn(file.readAll()) : QByteArrayList();
        if (found.isEmpty())
            say(QStringLiteral("%1 has no certificate; left out").arg(file.fileName()));
        certificates += found;
    }
    return certificates;
}

void extract()
{
    QByteArrayList trusted;
    QFile system(TrustStore::systemBundle);
    if (system.open(QIODevice::ReadOnly))
        trusted = TrustStore::certificatesIn(system.readAll());
    trusted += certificatesOf(TrustStore::anchorsFolder);
    write(TrustStore::extractedBundle,
          TrustStore::extracted(trusted, certificatesOf(TrustStore::blacklistFolder)));
}

void perform(const Operation &operation, const QString &path)
{
    const QString name = path.section(QLatin1Char('/'), -1);
    if (path != operation.folder + QLatin1Char('/') + name || name.isEmpty()
        || name.startsWith(QLatin1Char('.')))
        throw Failure{QStringLiteral("%1 is no file of %2").arg(path, operation.folder)};
    const QByteArray content = operation.writes ? checked(readStandardInput()) : QByteArray();
    lockTrustStore();
    if (operation.writes) {
        write(path, content);
    } else {
        QFile file(path);
        if (!file.remove())
            throw Failure{QStringLiteral("cannot remove %1: %2").arg(path, file.errorString())};
    }
    extract();
}

} // namespace

int main(int argc, char *argv[])
{
    const QLatin1String option(argc == 3 ? argv[1] : "");
    const auto operation = std::find_if(std::begin(operations), std::end(operations),
                                        [&](const Operation &each) { return each.option == option; });
    if (operation == std::end(operations)) {
        std::fputs(usage, stderr);
        return WrongUsage;
    }
    try {
        perform(*operation, QFile::decodeName(argv[2]));
    } catch (const Failure &failure) {
        say(failure.text);
        return Failed;
    }
    return Done;
}
