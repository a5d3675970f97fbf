// SPDX-License-Identifier: LGPL-2.1-or-later
#include "certificateinstaller_p.h"

#include "certificates_p.h"

#include <QtCore/QDebug>

namespace Corvane
{
namespace Mdm
{

namespace
{
const QLatin1String helperProgram("/usr/libexec/mdm-certificate");
}

CertificateInstaller::CertificateInstaller(const CertificateFile &file, Certificates *owner,
                                           void (Certificates::*signal)(const CertificateFile &,
                                                                        Certificates::Result))
    : m_file(file)
    , m_owner(owner)
    , m_signal(signal)
{
    connect(this, QOverload<int, QProcess::ExitStatus>::of(&QProcess::finished), this,
            &CertificateInstaller::handleFinished);
    connect(this, &QProcess::errorOccurred, this, &CertificateInstaller::handleError);
}

void CertificateInstaller::run(const QString &operation, const QByteArray &data)
{
    start(helperProgram, {operation, m_file.d->path}, QIODevice::ReadWrite);
    // A process that there is no room for has failed by now.
    if (state() == NotRunning)
        return;
    if (!data.isEmpty())
        write(data);
    closeWriteChannel();
}

void CertificateInstaller::handleFinished(int exitCode, QProcess::ExitStatus status)
{
    deleteLater();
    m_file.d->loaded = false;
    if (status == CrashExit) {
        qWarning() << "Installing certificate failed: mdm-certificate crashed";
        conclude(Certificates::Failure);
    } else if (exitCode != 0) {
        qWarning() << "Installing certificate failed:" << readAllStandardError();
        conclude(Certificates::Failure);
    } else {
        conclude(Certificates::Success);
    }
}

void CertificateInstaller::handleError(QProcess::ProcessError error)
{
    // All others come with the end of the process, which tells what became of it.
    if (error != FailedToStart)
        return;
    deleteLater();
    qWarning() << "Unable to execute mdm-certificate";
    conclude(Certificates::Failure);
}

void CertificateInstaller::conclude(Certificates::Result result)
{
    if (m_owner)
        Q_EMIT(m_owner->*m_signal)(m_file, result);
}

} // namespace Mdm
} // namespace Corvane
