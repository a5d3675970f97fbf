// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_NOTIFICATIONINFO_P_H
#define CORVANEMDM_NOTIFICATIONINFO_P_H

#include <corvanemdm/notificationinfo.h>

#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusInterface>

namespace Corvane
{
namespace Mdm
{

class NotificationInfoPrivate : public QObject
{
    Q_OBJECT

public:
    NotificationInfoPrivate();

    QDBusInterface *interface() { return &m_interface; }

private:
    QDBusInterface m_interface;
};

// (uisssssss((iii)(iiii)i)av) on the wire.
QDBusArgument &operator<<(QDBusArgument &out, const NotificationData &data);
const QDBusArgument &operator>>(const QDBusArgument &in, NotificationData &data);

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_NOTIFICATIONINFO_P_H
