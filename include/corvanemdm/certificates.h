// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_CERTIFICATES_H
#define CORVANEMDM_CERTIFICATES_H

#include <corvanemdm/corvanemdm_global.h>

#include <QtCore/QByteArray>
#include <QtCore/QExplicitlySharedDataPointer>
#include <QtCore/QList>
#include <QtCore/QMetaType>
#include <QtCore/QObject>
#include <QtCore/QString>
#include <QtNetwork/QSslCertificate>

namespace Corvane
{
namespace Mdm
{

class CertificateFilePrivate;
class CertificateInstaller;
class CertificatesPrivate;

/**
 * @brief A file of certificates among those that the phone trusts or distrusts.
 *
 * A value: copies share what was read of the file, and learn together that it has to be read again.
 */
class CORVANEMDM_EXPORT CertificateFile
{
public:
    /** Makes one that stands for no file. */
    CertificateFile();
    /** Shares the record of @p other. */
    CertificateFile(const CertificateFile &other);
    ~CertificateFile();
    /** Shares the record of @p other from now on. */
    CertificateFile &operator=(const CertificateFile &other);

    /** Whether it stands for no file. */
    bool isNull() const;

    /** The name of the file within its folder; empty for no file. */
    QString fileName() const;

    /**
     * The certificates in the file, in its order. Reads the file the first time, and again once it has
     * changed.
     * @return empty for no file, and for one that is not there, cannot be read or has no certificate in PEM
     * form.
     */
    QList<QSslCertificate> certificates() const;

private:
    friend class CertificateInstaller;
    friend class CertificatesPrivate;
    explicit CertificateFile(CertificateFilePrivate *record);

    QExplicitlySharedDataPointer<CertificateFilePrivate> d;
};

/**
 * @brief Manages which certificate authorities the phone trusts.
 *
 * Files are written and removed by the phone's helper program, one process a request. A request returns at
 * once, and its signal tells the outcome once the event loop runs; why it failed is logged. Requests are
 * independent, also of each other when they are about one file, and of this object: one that was started is
 * carried out after the object is gone. Nothing is asked of a service, and nothing of it is kept.
 *
 * What the queries have read is kept until the event loop tells that the files have changed.
 *
 * Sources: the folders "extracted/pem", "source/anchors" and "source/blacklist" of "/etc/pki/ca-trust", and
 * the program "/usr/libexec/mdm-certificate".
 */
class CORVANEMDM_EXPORT Certificates : public QObject
{
    Q_OBJECT

public:
    /** What became of a request. */
    enum Result {
        Success = 0, ///< done
        Failure = 1 ///< the helper refused or could not be run; a warning tells more
    };
    Q_ENUM(Result)

    /** Begins to watch the folders. */
    explicit Certificates(QObject *parent = nullptr);
    ~Certificates() override;

    /** The authorities that the system trusts, as Qt finds them; reads them anew each time. */
    QList<QSslCertificate> certificates() const;

    /** The files ("*.crt") that were installed to be trusted in addition, by name. */
    QList<CertificateFile> installedFiles() const;

    /** The files ("*.crt") of certificates that are not trusted whoever vouches for them, by name. */
    QList<CertificateFile> blacklistedFiles() const;

    /**
     * Makes the phone trust the certificates in @p data, in PEM form, which become the file @p fileName.
     * Ends with installFinished().
     */
    void install(const QString &fileName, const QByteArray &data);

    /** The same with @p certificates. */
    void install(const QString &fileName, const QList<QSslCertificate> &certificates);

    /** Removes an installed file. Ends with uninstallFinished(). */
    void uninstall(const QString &fileName);

    /**
     * Makes the phone distrust the certificates in @p data, in PEM form, which become the file @p fileName.
     * Ends with blacklistFinished().
     */
    void blacklist(const QString &fileName, const QByteArray &data);

    /** The same with @p certificates. */
    void blacklist(const QString &fileName, const QList<QSslCertificate> &certificates);

    /** Removes a file of distrusted certificates. Ends with unblacklistFinished(). */
    void unblacklist(const QString &fileName);

Q_SIGNALS:
    /** A request of install() has come to its end. */
    void installFinished(const CertificateFile &file, Certificates::Result result);
    /** A request of uninstall() has come to its end. */
    void uninstallFinished(const CertificateFile &file, Certificates::Result result);
    /** A request of blacklist() has come to its end. */
    void blacklistFinished(const CertificateFile &file, Certificates::Result result);
    /** A request of unblacklist() has come to its end. */
    void unblacklistFinished(const CertificateFile &file, Certificates::Result result);
    /** What certificates() tells may have changed. */
    void certificatesChanged();
    /** installedFiles(), or what is in one of them, may have changed. */
    void installedFilesChanged();
    /** blacklistedFiles(), or what is in one of them, may have changed. */
    void blacklistedFilesChanged();

private:
    Q_DISABLE_COPY(Certificates)
    CertificatesPrivate *const d;
};

} // namespace Mdm
} // namespace Corvane

Q_DECLARE_METATYPE(Corvane::Mdm::CertificateFile)

#endif // CORVANEMDM_CERTIFICATES_H
