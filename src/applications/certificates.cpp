// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/certificates.h>

#include "certificateinstaller_p.h"
#include "certificates_p.h"

#include <QtCore/QDir>
#include <QtCore/QFileInfo>
#include <QtNetwork/QSslConfiguration>

#include <algorithm>

namespace Corvane
{
namespace Mdm
{

namespace
{

const QLatin1String extractedFolder("/etc/pki/ca-trust/extracted/pem");
const QLatin1String anchorsFolder("/etc/pki/ca-trust/source/anchors");
const QLatin1String blacklistFolder("/etc/pki/ca-trust/source/blacklist");

const QLatin1String certificateFiles("*.crt");

void registerTypes()
{
    qRegisterMetaType<CertificateFile>("Corvane::Mdm::CertificateFile");
    qRegisterMetaType<Certificates::Result>("Corvane::Mdm::Certificates::Result");
    // The signals are declared with the short spellings; connections by name and queued ones look them up.
    qRegisterMetaType<CertificateFile>("CertificateFile");
    qRegisterMetaType<Certificates::Result>("Certificates::Result");
}

QByteArray pemOf(const QList<QSslCertificate> &certificates)
{
    QByteArray pem;
    for (const QSslCertificate &certificate : certificates)
        pem += certificate.toPem();
    return pem;
}

} // namespace

CertificateFilePrivate::CertificateFilePrivate(const QString &filePath)
    : path(filePath)
    , fileName(QFileInfo(filePath).fileName())
{
}

CertificateFile::CertificateFile() = default;
CertificateFile::CertificateFile(const CertificateFile &other) = default;
CertificateFile::~CertificateFile() = default;
CertificateFile &CertificateFile::operator=(const CertificateFile &other) = default;

CertificateFile::CertificateFile(CertificateFilePrivate *record)
    : d(record)
{
}

bool CertificateFile::isNull() const
{
    return !d;
}

QString CertificateFile::fileName() const
{
    return d ? d->fileName : QString();
}

QList<QSslCertificate> CertificateFile::certificates() const
{
    if (!d)
        return {};
    if (!d->loaded) {
        d->certificates
            = QSslCertificate::fromPath(d->path, QSsl::Pem, QSslCertificate::PatternSyntax::FixedString);
        d->loaded = true;
    }
    return d->certificates;
}

CertificatesPrivate::CertificatesPrivate(Certificates *certificates)
    : QObject(certificates)
    , installed{anchorsFolder, &Certificates::installedFilesChanged, {}}
    , blacklisted{blacklistFolder, &Certificates::blacklistedFilesChanged, {}}
    , q(certificates)
{
    registerTypes();
    connect(&m_watcher, &QFileSystemWatcher::directoryChanged, this, &CertificatesPrivate::directoryChanged);
    connect(&m_watcher, &QFileSystemWatcher::fileChanged, this, &CertificatesPrivate::fileChanged);
    for (const QString &path : {QString(extractedFolder), installed.path, blacklisted.path})
        watch(path);
}

bool CertificatesPrivate::watch(const QString &path)
{
    // The watcher logs what it has no right to look at.
    return QFileInfo(path).isReadable() && m_watcher.addPath(path);
}

QList<CertificateFile> CertificatesPrivate::filesOf(Folder &folder)
{
    if (folder.loaded)
        return folder.files;
    // What happens to a folder that could not be watched would not be told: it is read each time. A folder
    // that is watched from now on has to be watched before it is read.
    folder.loaded = m_watcher.directories().contains(folder.path) || watch(folder.path);
    merge(folder, QDir(folder.path).entryList(QStringList(certificateFiles), QDir::Files, QDir::Name));

    const QStringList watched = m_watcher.files();
    for (const CertificateFile &file : qAsConst(folder.files)) {
        // It has been replaced since it was read, or it is new, or nobody would have told.
        if (!watched.contains(file.d->path)) {
            watch(file.d->path);
            file.d->loaded = false;
        }
    }
    return folder.files;
}

void CertificatesPrivate::merge(Folder &folder, const QStringList &names)
{
    QList<CertificateFile> merged;
    merged.reserve(names.size());
    auto known = folder.files.cbegin();
    for (const QString &name : names) {
        known = std::find_if(known, folder.files.cend(),
                             [&name](const CertificateFile &file) { return file.d->fileName >= name; });
        if (known != folder.files.cend() && known->d->fileName == name)
            merged.append(*known);
        else
            merged.append(CertificateFile(new CertificateFilePrivate(folder.path + QLatin1Char('/') + name)));
    }
    folder.files = merged;
}

void CertificatesPrivate::directoryChanged(const QString &path)
{
    // One that was replaced is not watched any more.
    if (!m_watcher.directories().contains(path))
        watch(path);
    if (path == extractedFolder) {
        Q_EMIT q->certificatesChanged();
        return;
    }
    for (Folder *folder : {&installed, &blacklisted}) {
        if (folder->path != path)
            continue;
        folder->loaded = false;
        Q_EMIT(q->*folder->changed)();
        return;
    }
}

void CertificatesPrivate::fileChanged(const QString &path)
{
    // There may be another file of that name now, while the watched one lives on under another.
    m_watcher.removePath(path);
    watch(path);
    for (Folder *folder : {&installed, &blacklisted}) {
        const auto changed
            = std::find_if(folder->files.cbegin(), folder->files.cend(),
                           [&path](const CertificateFile &file) { return file.d->path == path; });
        if (changed == folder->files.cend())
            continue;
        changed->d->loaded = false;
        Q_EMIT(q->*folder->changed)();
        return;
    }
}

void CertificatesPrivate::run(const Folder &folder, const QString &operation, const QString &fileName,
                              const QByteArray &data, Finished finished)
{
    const auto known
        = std::find_if(folder.files.cbegin(), folder.files.cend(),
                       [&fileName](const CertificateFile &file) { return file.d->fileName == fileName; });
    const CertificateFile file = known != folder.files.cend()
        ? *known
        : CertificateFile(new CertificateFilePrivate(folder.path + QLatin1Char('/') + fileName));
    auto *installer = new CertificateInstaller(file, q, finished);
    installer->run(operation, data);
}

Certificates::Certificates(QObject *parent)
    : QObject(parent)
    , d(new CertificatesPrivate(this))
{
}

Certificates::~Certificates()
{
    delete d;
}

QList<QSslCertificate> Certificates::certificates() const
{
    return QSslConfiguration::systemCaCertificates();
}

QList<CertificateFile> Certificates::installedFiles() const
{
    return d->filesOf(d->installed);
}

QList<CertificateFile> Certificates::blacklistedFiles() const
{
    return d->filesOf(d->blacklisted);
}

void Certificates::install(const QString &fileName, const QByteArray &data)
{
    d->run(d->installed, QStringLiteral("--install"), fileName, data, &Certificates::installFinished);
}

void Certificates::install(const QString &fileName, const QList<QSslCertificate> &certificates)
{
    install(fileName, pemOf(certificates));
}

void Certificates::uninstall(const QString &fileName)
{
    d->run(d->installed, QStringLiteral("--uninstall"), fileName, {}, &Certificates::uninstallFinished);
}

void Certificates::blacklist(const QString &fileName, const QByteArray &data)
{
    d->run(d->blacklisted, QStringLiteral("--blacklist"), fileName, data, &Certificates::blacklistFinished);
}

void Certificates::blacklist(const QString &fileName, const QList<QSslCertificate> &certificates)
{
    blacklist(fileName, pemOf(certificates));
}

void Certificates::unblacklist(const QString &fileName)
{
    d->run(d->blacklisted, QStringLiteral("--unblacklist"), fileName, {}, &Certificates::unblacklistFinished);
}

} // namespace Mdm
} // namespace Corvane
