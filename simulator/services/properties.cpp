// SPDX-License-Identifier: LGPL-2.1-or-later
#include "properties.h"

#include "service.h"

#include <algorithm>

namespace Corvane
{
namespace Simulator
{

Variant fromText(const QString &text)
{
    return Variant(g_variant_new_string(text.toUtf8().constData()));
}

Variant fromBool(bool value)
{
    return Variant(g_variant_new_boolean(value));
}

Variant fromByte(quint8 value)
{
    return Variant(g_variant_new_byte(value));
}

Variant fromList(const QStringList &list)
{
    GVariantBuilder strings;
    g_variant_builder_init(&strings, G_VARIANT_TYPE_STRING_ARRAY);
    for (const QString &string : list)
        g_variant_builder_add(&strings, "s", string.toUtf8().constData());
    return Variant(g_variant_builder_end(&strings));
}

GVariant *toVariant(const Properties &properties)
{
    GVariantBuilder map;
    g_variant_builder_init(&map, G_VARIANT_TYPE_VARDICT);
    for (const auto &[name, value] : properties)
        g_variant_builder_add(&map, "{sv}", name.toUtf8().constData(), value.get());
    return g_variant_builder_end(&map);
}

void PropertyChanges::take(const Properties &now,
                           const std::function<void(const QString &, GVariant *)> &announce)
{
    const Properties told = std::exchange(m_told, now);
    for (const auto &property : now) {
        const bool isTold = std::any_of(told.begin(), told.end(), [&](const auto &each) {
            return each.first == property.first && g_variant_equal(each.second.get(), property.second.get());
        });
        if (!isTold)
            announce(property.first, property.second.get());
    }
}

void announceChanges(const Service &service, const QString &path, const QString &interface,
                     PropertyChanges *told, const Properties &now)
{
    Properties changed;
    told->take(now, [&changed](const QString &name, GVariant *value) {
        changed.emplace_back(name, Variant::shared(value));
    });
    if (!changed.empty()) {
        service.emitSignal(path, QStringLiteral("org.freedesktop.DBus.Properties"),
                           QStringLiteral("PropertiesChanged"),
                           g_variant_new("(s@a{sv}@as)", interface.toUtf8().constData(), toVariant(changed),
                                         g_variant_new_strv(nullptr, 0)));
    }
}

} // namespace Simulator
} // namespace Corvane
