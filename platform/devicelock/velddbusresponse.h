// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_DEVICELOCK_VELDDBUSRESPONSE_H
#define CORVANEMDM_PLATFORM_DEVICELOCK_VELDDBUSRESPONSE_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QObject>
#include <QtDBus/QDBusPendingCall>

class QDBusError;

namespace VeldDBus
{

class Connection;

/**
 * The answer to a call. It signals once, from the event loop, and is deleted by itself soon after; who
 * deletes it before hears nothing of the answer.
 */
class CORVANEMDM_PLATFORM_EXPORT Response : public QObject
{
    Q_OBJECT

public:
    /** @param connection the one that @p answer comes over */
    Response(const QDBusPendingCall &answer, const Connection &connection, QObject *parent);
    ~Response() override;

Q_SIGNALS:
    void success();
    void failure(const QDBusError &error);

private:
    Q_DISABLE_COPY(Response)

    class Private;
    Private *const d;
};

} // namespace VeldDBus

#endif // CORVANEMDM_PLATFORM_DEVICELOCK_VELDDBUSRESPONSE_H
