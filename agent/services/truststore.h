// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TRUSTSTORE_H
#define CORVANE_TRUSTSTORE_H

#include "reply.h"
#include "warningcapture.h"

#include <corvanemdm/certificates.h>

#include <QtCore/QObject>

#include <chrono>
#include <functional>

namespace Corvane
{
namespace Agent
{

/** Whom the phone trusts, with every request awaited until its end. */
class TrustStore : public QObject
{
    Q_OBJECT

public:
    explicit TrustStore(std::chrono::milliseconds timeout, QObject *parent = nullptr);

    const Mdm::Certificates &certificates() const { return m_certificates; }

    /** The files that are trusted in addition to the system's, or those that are not trusted. */
    QList<Mdm::CertificateFile> files(bool trusted) const;

    /** Makes @p pem the content of a file that is trusted, or of one that is not. */
    Reply put(bool trusted, const QString &fileName, const QByteArray &pem);
    Reply remove(bool trusted, const QString &fileName);

Q_SIGNALS:
    /** The files may be others now. */
    void changed();

private:
    using Finished = void (Mdm::Certificates::*)(const Mdm::CertificateFile &, Mdm::Certificates::Result);
    Reply perform(Finished finished, const std::function<void()> &request);

    Mdm::Certificates m_certificates;
    std::chrono::milliseconds m_timeout;
    QString m_refusal; ///< what the library has told of the request that failed
    WarningCapture m_warnings;
};

/** The file name that the phone lists certificates under which come from @p source. */
QString certificateFileName(const QString &source);

/** What is wrong with @p name as the name of a certificate file; empty when nothing is. */
QString certificateFileNameFault(const QString &name);

/** "Elo Mobile CA": what people know the subject of @p certificate by. */
QString subjectOf(const QSslCertificate &certificate);
QString issuerOf(const QSslCertificate &certificate);
/** Of SHA-256, in hexadecimal digits. */
QString fingerprintOf(const QSslCertificate &certificate);

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_TRUSTSTORE_H
