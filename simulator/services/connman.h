// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_CONNMAN_H
#define CORVANE_SIMULATOR_CONNMAN_H

#include "busconnection.h"

namespace Corvane
{
namespace Simulator
{

/** What the parts of the connection manager share. Its errors have one text each. */
namespace ConnMan
{

const QLatin1String serviceName("net.connman");
const QLatin1String managerPath("/");

inline MethodError error(const char *name, const char *text)
{
    return MethodError(QStringLiteral("net.connman.Error.") + QLatin1String(name), QLatin1String(text));
}

inline MethodError invalidArguments()
{
    return error("InvalidArguments", "Invalid arguments");
}

inline MethodError invalidProperty()
{
    return error("InvalidProperty", "Invalid property");
}

inline MethodError notSupported()
{
    return error("NotSupported", "Not supported");
}

/** The value of a "SetProperty"; of type @p type, unless that is null. */
inline Variant propertyValue(const MethodCall &call, const GVariantType *type = nullptr)
{
    const Variant wrapped(g_variant_get_child_value(call.arguments(), 1));
    Variant value(g_variant_get_variant(wrapped.get()));
    if (type && !g_variant_is_of_type(value.get(), type))
        throw invalidArguments();
    return value;
}

inline bool propertyFlag(const MethodCall &call)
{
    return g_variant_get_boolean(propertyValue(call, G_VARIANT_TYPE_BOOLEAN).get());
}

} // namespace ConnMan
} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_CONNMAN_H
