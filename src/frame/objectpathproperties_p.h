// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_OBJECTPATHPROPERTIES_P_H
#define CORVANEMDM_OBJECTPATHPROPERTIES_P_H

#include <QtCore/QList>
#include <QtCore/QMetaType>
#include <QtCore/QVariantMap>
#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusObjectPath>

namespace Corvane
{
namespace Mdm
{

/** An object and its properties, (oa{sv}) on the wire, as the telephony service and the connection manager
 * list them. */
struct ObjectPathProperties {
    QDBusObjectPath path;
    QVariantMap properties;
};

/** a(oa{sv}) on the wire. */
typedef QList<ObjectPathProperties> ObjectPathPropertiesList;

QDBusArgument &operator<<(QDBusArgument &out, const ObjectPathProperties &object);
const QDBusArgument &operator>>(const QDBusArgument &in, ObjectPathProperties &object);

/** To be called before the first reply of these types is read; works once per process. */
void registerObjectPathProperties();

} // namespace Mdm
} // namespace Corvane

Q_DECLARE_METATYPE(Corvane::Mdm::ObjectPathProperties)

#endif // CORVANEMDM_OBJECTPATHPROPERTIES_P_H
