// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_DEVICELOCK_VELDDBUSINTERFACE_H
#define CORVANEMDM_PLATFORM_DEVICELOCK_VELDDBUSINTERFACE_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QObject>
#include <QtCore/QVariantList>
#include <QtDBus/QDBusMessage>

namespace VeldDBus
{

class Connection;
class Response;

/** One interface of one object at the other end of a connection. Making one sends nothing. */
class CORVANEMDM_PLATFORM_EXPORT Interface : public QObject
{
    Q_OBJECT

public:
    /** @param connection must live longer; each call goes over the peer connection that it has then. */
    Interface(QObject *parent, const Connection &connection, const QString &service, const QString &path,
              const QString &interface);
    ~Interface() override;

    /** Sends a call. Without a connection the response fails, as any other from the event loop. */
    Response *call(const QString &method, const QVariantList &arguments = QVariantList());
    /** Sends a call and waits for its answer, for QtDBus's default timeout (25 s) at most. */
    QDBusMessage blockingCall(const QString &method, const QVariantList &arguments = QVariantList()) const;

private:
    Q_DISABLE_COPY(Interface)

    class Private;
    Private *const d;
};

} // namespace VeldDBus

#endif // CORVANEMDM_PLATFORM_DEVICELOCK_VELDDBUSINTERFACE_H
