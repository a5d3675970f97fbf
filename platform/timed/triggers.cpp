// SPDX-License-Identifier: LGPL-2.1-or-later
#include <timed/triggers.h>

namespace Maemo
{
namespace Timed
{
namespace Event
{

// The base class has streaming operators of its own; naming it keeps these from calling themselves.
using Base = QMap<quint32, quint32>;

QDBusArgument &operator<<(QDBusArgument &out, const Triggers &triggers)
{
    return out << static_cast<const Base &>(triggers);
}

const QDBusArgument &operator>>(const QDBusArgument &in, Triggers &triggers)
{
    return in >> static_cast<Base &>(triggers);
}

} // namespace Event
} // namespace Timed
} // namespace Maemo
