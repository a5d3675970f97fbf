// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_OFONO_H
#define CORVANE_SIMULATOR_OFONO_H

#include "busconnection.h"

namespace Corvane
{
namespace Simulator
{

/** What the parts of the telephony daemon share. */
namespace Ofono
{

const QLatin1String serviceName("org.ofono");

inline MethodError invalidArguments(const QString &message)
{
    return MethodError(QStringLiteral("org.ofono.Error.InvalidArguments"), message);
}

inline MethodError invalidFormat(const QString &message)
{
    return MethodError(QStringLiteral("org.ofono.Error.InvalidFormat"), message);
}

inline MethodError notFound(const QString &message)
{
    return MethodError(QStringLiteral("org.ofono.Error.NotFound"), message);
}

inline MethodError notAvailable(const QString &message)
{
    return MethodError(QStringLiteral("org.ofono.Error.NotAvailable"), message);
}

inline MethodError notAttached(const QString &message)
{
    return MethodError(QStringLiteral("org.ofono.Error.NotAttached"), message);
}

inline MethodError inUse(const QString &message)
{
    return MethodError(QStringLiteral("org.ofono.Error.InUse"), message);
}

inline MethodError failed(const QString &message)
{
    return MethodError(QStringLiteral("org.ofono.Error.Failed"), message);
}

/** What a client wants a property to be: the arguments of a "SetProperty". */
class PropertyRequest
{
public:
    explicit PropertyRequest(const MethodCall &call)
        : m_name(call.text(0))
    {
        const Variant wrapped(g_variant_get_child_value(call.arguments(), 1));
        m_value = Variant(g_variant_get_variant(wrapped.get()));
    }

    QString name() const { return m_name; }
    /** The value; throws MethodError when it is none of that type. */
    bool flag() const
    {
        if (!g_variant_is_of_type(m_value.get(), G_VARIANT_TYPE_BOOLEAN))
            throw invalidArguments(QStringLiteral("%1 is a boolean").arg(m_name));
        return g_variant_get_boolean(m_value.get());
    }
    QString text() const
    {
        if (!g_variant_is_of_type(m_value.get(), G_VARIANT_TYPE_STRING))
            throw invalidArguments(QStringLiteral("%1 is a string").arg(m_name));
        return QString::fromUtf8(g_variant_get_string(m_value.get(), nullptr));
    }

    MethodError unknown() const
    {
        return invalidArguments(QStringLiteral("There is no property %1 that could be set").arg(m_name));
    }

private:
    QString m_name;
    Variant m_value;
};

} // namespace Ofono
} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_OFONO_H
