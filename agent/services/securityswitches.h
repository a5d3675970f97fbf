// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SECURITYSWITCHES_H
#define CORVANE_SECURITYSWITCHES_H

#include "answer.h"

#include <corvanemdm/securitysettings.h>

#include <QtCore/QObject>

#include <chrono>

namespace Corvane
{
namespace Agent
{

/** Developer mode and sideloading, with every change awaited. */
class SecuritySwitches : public QObject
{
    Q_OBJECT

public:
    explicit SecuritySwitches(std::chrono::milliseconds timeout, QObject *parent = nullptr);

    bool developerMode() const;
    /** Waits until the package has been installed or removed. */
    Reply setDeveloperMode(bool enabled);

    /** Refused when the phone does not say. */
    Answer<bool> sideloading() const;
    Reply setSideloading(bool allowed);

Q_SIGNALS:
    /** Developer mode is another one, through this object. */
    void developerModeChanged();

private:
    Mdm::SecuritySettings m_settings;
    std::chrono::milliseconds m_timeout;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_SECURITYSWITCHES_H
