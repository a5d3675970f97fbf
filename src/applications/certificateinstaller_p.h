// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_CERTIFICATEINSTALLER_P_H
#define CORVANEMDM_CERTIFICATEINSTALLER_P_H

#include <corvanemdm/certificates.h>

#include <QtCore/QPointer>
#include <QtCore/QProcess>

namespace Corvane
{
namespace Mdm
{

/** One run of the helper program. Nobody's child: it deletes itself once it has told the outcome. */
class CertificateInstaller : public QProcess
{
    Q_OBJECT

public:
    /** @p signal is what @p owner emits at the end, if it is still there. */
    CertificateInstaller(const CertificateFile &file, Certificates *owner,
                         void (Certificates::*signal)(const CertificateFile &, Certificates::Result));

    /** Makes the helper do @p operation to the file, with @p data to read. */
    void run(const QString &operation, const QByteArray &data);

private:
    void handleFinished(int exitCode, QProcess::ExitStatus status);
    void handleError(QProcess::ProcessError error);
    void conclude(Certificates::Result result);

    const CertificateFile m_file;
    const QPointer<Certificates> m_owner;
    void (Certificates::*const m_signal)(const CertificateFile &, Certificates::Result);
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_CERTIFICATEINSTALLER_P_H
