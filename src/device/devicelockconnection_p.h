// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_DEVICELOCKCONNECTION_P_H
#define CORVANEMDM_DEVICELOCKCONNECTION_P_H

#include <devicelock/velddbusconnection.h>
#include <devicelock/velddbusinterface.h>

#include <QtCore/QObject>
#include <QtDBus/QDBusServiceWatcher>

namespace Corvane
{
namespace Mdm
{

/** The peer connection to the device-lock daemon; renewed when the daemon comes back. */
class DevicelockConnection : public QObject
{
    Q_OBJECT

public:
    explicit DevicelockConnection(QObject *parent = nullptr);

    /** What device management may ask the daemon for. */
    VeldDBus::Interface *interface() { return &m_interface; }

private:
    void daemonAppeared();
    void reconnect();

    QDBusServiceWatcher m_daemonWatcher;
    VeldDBus::Connection m_connection;
    VeldDBus::Interface m_interface;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_DEVICELOCKCONNECTION_P_H
