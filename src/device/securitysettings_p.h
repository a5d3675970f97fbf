// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_SECURITYSETTINGS_P_H
#define CORVANEMDM_SECURITYSETTINGS_P_H

#include <corvanemdm/applications.h>
#include <corvanemdm/securitysettings.h>

#include "devicelockconnection_p.h"

#include <QtCore/QObject>

#include <memory>

namespace Corvane
{
namespace Mdm
{

/** What the settings need, made when it is needed first. */
class SecuritySettingsPrivate : public QObject
{
    Q_OBJECT

public:
    explicit SecuritySettingsPrivate(SecuritySettings *securitySettings);

    Applications *applications();
    DevicelockConnection *devicelockConnection();
    void follow(ApplicationOperation *operation);

private Q_SLOTS:
    void checkPackage(const QString &package, bool success);

private:
    SecuritySettings *const q;
    std::unique_ptr<DevicelockConnection> m_devicelockConnection;
    std::unique_ptr<Applications> m_applications;
    QObject m_answers; ///< goes first: what is left to be done fails when Applications goes, and is not told
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_SECURITYSETTINGS_P_H
