// SPDX-License-Identifier: LGPL-2.1-or-later
#include "objectpathproperties_p.h"

#include <QtDBus/QDBusMetaType>

namespace Corvane
{
namespace Mdm
{

QDBusArgument &operator<<(QDBusArgument &out, const ObjectPathProperties &object)
{
    out.beginStructure();
    out << object.path << object.properties;
    out.endStructure();
    return out;
}

const QDBusArgument &operator>>(const QDBusArgument &in, ObjectPathProperties &object)
{
    in.beginStructure();
    in >> object.path >> object.properties;
    in.endStructure();
    return in;
}

void registerObjectPathProperties()
{
    // Other threads wait until all of it is done.
    static const bool registered = [] {
        qRegisterMetaType<ObjectPathProperties>("Corvane::Mdm::ObjectPathProperties");
        qDBusRegisterMetaType<ObjectPathProperties>();
        qRegisterMetaType<ObjectPathPropertiesList>("Corvane::Mdm::ObjectPathPropertiesList");
        qDBusRegisterMetaType<ObjectPathPropertiesList>();
        return true;
    }();
    Q_UNUSED(registered)
}

} // namespace Mdm
} // namespace Corvane
