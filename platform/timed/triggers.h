// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_TIMED_TRIGGERS_H
#define CORVANEMDM_PLATFORM_TIMED_TRIGGERS_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QMap>
#include <QtCore/QMetaType>
#include <QtDBus/QDBusArgument>

namespace Maemo
{
namespace Timed
{
namespace Event
{

/** When the time daemon's events are due: event number to seconds since the epoch; a{uu} on the wire. */
class Triggers : public QMap<quint32, quint32>
{
};

CORVANEMDM_PLATFORM_EXPORT QDBusArgument &operator<<(QDBusArgument &out, const Triggers &triggers);
CORVANEMDM_PLATFORM_EXPORT const QDBusArgument &operator>>(const QDBusArgument &in, Triggers &triggers);

} // namespace Event
} // namespace Timed
} // namespace Maemo

Q_DECLARE_METATYPE(Maemo::Timed::Event::Triggers)

#endif // CORVANEMDM_PLATFORM_TIMED_TRIGGERS_H
