// SPDX-License-Identifier: LGPL-2.1-or-later
#include "devicelockconnection_p.h"

#include <QtCore/QDebug>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusError>

#include <atomic>

namespace Corvane
{
namespace Mdm
{

namespace
{

const QLatin1String DaemonService("org.veldmobile.devicelock");
const QLatin1String SocketAddress("unix:path=/run/veld-devicelock/socket");
const QLatin1String ManagementPath("/mdm");
const QLatin1String ManagementInterface("org.corvaneos.devicelock.DeviceManagement");

/** Never under a name that another one in this process has, or has had: QtDBus would hand out that one. */
QDBusConnection openPeerConnection()
{
    static std::atomic<uint> count{0}; // over all threads
    return QDBusConnection::connectToPeer(SocketAddress, QStringLiteral("org.corvaneos.mdm.%1").arg(count++));
}

} // namespace

DevicelockConnection::DevicelockConnection(QObject *parent)
    : QObject(parent)
    , m_daemonWatcher(DaemonService, QDBusConnection::systemBus(), QDBusServiceWatcher::WatchForRegistration)
    , m_connection(openPeerConnection())
    , m_interface(this, m_connection, QString(), ManagementPath, ManagementInterface)
{
    connect(&m_daemonWatcher, &QDBusServiceWatcher::serviceRegistered, this,
            &DevicelockConnection::daemonAppeared);
    connect(&m_connection, &VeldDBus::Connection::lost, this, &DevicelockConnection::reconnect);
}

void DevicelockConnection::daemonAppeared()
{
    // A connection that seems to be there may be one to the daemon before this one.
    if (m_connection.isConnected())
        m_connection.verify();
    else
        reconnect();
}

void DevicelockConnection::reconnect()
{
    qDebug("The device lock socket is available to connect to");
    if (!m_connection.reconnect(openPeerConnection()))
        qWarning("Failed to reconnect to host. %s",
                 qPrintable(m_connection.connection().lastError().message()));
}

} // namespace Mdm
} // namespace Corvane
