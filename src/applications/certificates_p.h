// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_CERTIFICATES_P_H
#define CORVANEMDM_CERTIFICATES_P_H

#include <corvanemdm/certificates.h>

#include <QtCore/QFileSystemWatcher>
#include <QtCore/QSharedData>

namespace Corvane
{
namespace Mdm
{

/** The record that copies of a CertificateFile share. */
class CertificateFilePrivate : public QSharedData
{
public:
    explicit CertificateFilePrivate(const QString &filePath);

    const QString path;
    const QString fileName;
    QList<QSslCertificate> certificates;
    bool loaded = false;
};

class CertificatesPrivate : public QObject
{
    Q_OBJECT

public:
    using Finished = void (Certificates::*)(const CertificateFile &, Certificates::Result);
    using Changed = void (Certificates::*)();

    /** A folder of certificate files, and what is known of it. */
    struct Folder {
        const QString path;
        const Changed changed;
        QList<CertificateFile> files; ///< by name
        bool loaded = false;
    };

    explicit CertificatesPrivate(Certificates *certificates);

    /** The files of @p folder, which is read when it has changed since the last time. */
    QList<CertificateFile> filesOf(Folder &folder);

    /** Makes the helper do @p operation to a file of @p folder; @p data is what it reads. */
    void run(const Folder &folder, const QString &operation, const QString &fileName, const QByteArray &data,
             Finished finished);

    Folder installed;
    Folder blacklisted;

private:
    void directoryChanged(const QString &path);
    void fileChanged(const QString &path);
    /** Makes sure that changes of @p path are told from now on. */
    bool watch(const QString &path);
    void merge(Folder &folder, const QStringList &names);

    Certificates *const q;
    QFileSystemWatcher m_watcher;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_CERTIFICATES_P_H
