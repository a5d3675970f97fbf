// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_MARSHALLING_P_H
#define CORVANEMDM_MARSHALLING_P_H

#include <QtCore/QVariant>
#include <QtCore/QVariantList>
#include <QtCore/QVariantMap>
#include <QtDBus/QDBusMetaType>
#include <QtDBus/QDBusVariant>

#include <algorithm>

namespace Corvane
{
namespace Mdm
{

/**
 * Whether D-Bus has a type for @p value and for all that is in its lists and maps.
 *
 * QtDBus notices as well, but in the middle of writing, and then never frees the structures that are open.
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
    return value.isValid() && QDBusMetaType::typeToSignature(value.userType());
}

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_MARSHALLING_P_H
