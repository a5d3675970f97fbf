// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_MARSHALLING_P_H
#define CORVANEMDM_MARSHALLING_P_H

#include <QtCore/QVariant>
#include <QtCore/QVariantList>
#include <QtCore/QVariantMap>
#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusMetaType>
#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusSignature>
#include <QtDBus/QDBusUnixFileDescriptor>
#include <QtDBus/QDBusVariant>

#include <algorithm>

namespace Corvane
{
namespace Mdm
{

/**
 * Whether D-Bus has a type for @p value and for all that is in its lists and maps.
 *
 * QtDBus notices as well, but in the middle of writing: it never frees the structures that are open then, and
 * ends the program over a map.
 */
inline bool isMarshallable(const QVariant &value)
{
    const auto all = [](const auto &values) {
        return std::all_of(values.begin(), values.end(), isMarshallable);
    };
    if (value.userType() == QMetaType::QVariantList)
        return all(value.toList());
    if (value.userType() == QMetaType::QVariantMap)
        return all(value.toMap());
    if (value.userType() == QMetaType::QVariantHash)
        return all(value.toHash());
    if (value.userType() == qMetaTypeId<QDBusVariant>())
        return isMarshallable(value.value<QDBusVariant>().variant());
    // As a service has sent it: that can be sent again. One for writing need not be one value.
    if (value.userType() == qMetaTypeId<QDBusArgument>())
        return value.value<QDBusArgument>().currentType() != QDBusArgument::UnknownType;
    if (value.userType() == qMetaTypeId<QDBusObjectPath>())
        return !value.value<QDBusObjectPath>().path().isEmpty();
    if (value.userType() == qMetaTypeId<QDBusSignature>())
        return !value.value<QDBusSignature>().signature().isEmpty();
    if (value.userType() == qMetaTypeId<QDBusUnixFileDescriptor>())
        return value.value<QDBusUnixFileDescriptor>().isValid();
    return value.isValid() && QDBusMetaType::typeToSignature(value.userType());
}

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_MARSHALLING_P_H
