// SPDX-License-Identifier: LGPL-2.1-or-later
#include "truststore.h"

#include "service.h"
#include "wait.h"

#include <QtCore/QCryptographicHash>
#include <QtCore/QFileInfo>

namespace Corvane
{
namespace Agent
{

using Mdm::CertificateFile;
using Mdm::Certificates;

namespace
{

const QLatin1String suffix(".crt");

/** The helper's own words in @p warning: quoted, with escapes, after the library's. */
QString refusalIn(const QString &warning)
{
    const int quote = warning.indexOf(QLatin1Char('"'));
    if (quote < 0)
        return warning;
    QString text = warning.mid(quote + 1);
    text.chop(1);
    text.replace(QLatin1String("\\n"), QLatin1String("\n"));
    text.replace(QLatin1String("\\\""), QLatin1String("\""));
    QStringList lines = text.split(QLatin1Char('\n'), Qt::SkipEmptyParts);
    lines.replaceInStrings(QStringLiteral("mdm-certificate: "), QString());
    return lines.isEmpty() ? QStringLiteral("it does not tell why") : lines.join(QLatin1String("; "));
}

/** The first of what names people give to a subject or an issuer. */
QString nameOf(const std::function<QStringList(QSslCertificate::SubjectInfo)> &infoOf)
{
    for (const QSslCertificate::SubjectInfo part :
         {QSslCertificate::CommonName, QSslCertificate::OrganizationalUnitName,
          QSslCertificate::Organization}) {
        const QStringList names = infoOf(part);
        if (!names.isEmpty())
            return names.join(QLatin1String(", "));
    }
    return QString();
}

} // namespace

TrustStore::TrustStore(std::chrono::milliseconds timeout, QObject *parent)
    : QObject(parent)
    , m_timeout(timeout)
    , m_warnings(QStringLiteral("^(?:Installing certificate failed:|Unable to execute mdm-certificate)"),
                 [this](const QString &warning) { m_refusal = refusalIn(warning); })
{
    connect(&m_certificates, &Certificates::installedFilesChanged, this, &TrustStore::changed);
    connect(&m_certificates, &Certificates::blacklistedFilesChanged, this, &TrustStore::changed);
}

QList<CertificateFile> TrustStore::files(bool trusted) const
{
    return trusted ? m_certificates.installedFiles() : m_certificates.blacklistedFiles();
}

Reply TrustStore::put(bool trusted, const QString &fileName, const QByteArray &pem)
{
    if (trusted)
        return perform(&Certificates::installFinished, [&] { m_certificates.install(fileName, pem); });
    return perform(&Certificates::blacklistFinished, [&] { m_certificates.blacklist(fileName, pem); });
}

Reply TrustStore::remove(bool trusted, const QString &fileName)
{
    if (trusted)
        return perform(&Certificates::uninstallFinished, [&] { m_certificates.uninstall(fileName); });
    return perform(&Certificates::unblacklistFinished, [&] { m_certificates.unblacklist(fileName); });
}

Reply TrustStore::perform(Finished finished, const std::function<void()> &request)
{
    const Service helper = Service::certificateHelper();
    Wait wait(helper, m_timeout, QStringLiteral("finish"));
    connect(&m_certificates, finished, &wait,
            [this, waiting = &wait, helper](const CertificateFile &, Certificates::Result result) {
                waiting->end(result == Certificates::Success ? Reply::Done : Reply::Refused,
                             helper.refusal(m_refusal));
            });
    request();
    return wait.run();
}

QString certificateFileName(const QString &source)
{
    return QFileInfo(source).completeBaseName() + suffix;
}

QString certificateFileNameFault(const QString &name)
{
    const bool isUsable = name.endsWith(suffix) && name.size() > suffix.size()
        && !name.contains(QLatin1Char('/')) && !name.startsWith(QLatin1Char('.'));
    return isUsable ? QString() : QStringLiteral("must be a file name that ends in .crt");
}

QString subjectOf(const QSslCertificate &certificate)
{
    return nameOf([&](QSslCertificate::SubjectInfo part) { return certificate.subjectInfo(part); });
}

QString issuerOf(const QSslCertificate &certificate)
{
    return nameOf([&](QSslCertificate::SubjectInfo part) { return certificate.issuerInfo(part); });
}

QString fingerprintOf(const QSslCertificate &certificate)
{
    return QString::fromLatin1(certificate.digest(QCryptographicHash::Sha256).toHex());
}

} // namespace Agent
} // namespace Corvane
