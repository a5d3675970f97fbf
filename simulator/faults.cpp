// SPDX-License-Identifier: LGPL-2.1-or-later
#include "faults.h"

#include "refusal.h"

#include <QtCore/QStringList>

#include <algorithm>
#include <array>

namespace Corvane
{
namespace Simulator
{

namespace
{

struct KindDescription {
    Fault::Kind kind;
    const char *name;
    std::array<const char *, 2> options; ///< beside "times", which all have
};

constexpr std::array<KindDescription, 4> kinds{{
    {Fault::Kind::Error, "error", {"error", "message"}},
    {Fault::Kind::Late, "late", {"delay", nullptr}},
    {Fault::Kind::Never, "never", {nullptr, nullptr}},
    {Fault::Kind::Reply, "reply", {"arguments", nullptr}},
}};

const KindDescription &kindNamed(const QString &name)
{
    for (const KindDescription &kind : kinds) {
        if (name == QLatin1String(kind.name))
            return kind;
    }
    throw Refusal(
        QStringLiteral("There is no fault \"%1\"; there are error, late, never and reply").arg(name));
}

const KindDescription &description(Fault::Kind kind)
{
    return *std::find_if(kinds.begin(), kinds.end(), [kind](const auto &each) { return each.kind == kind; });
}

void checkOptionNames(const KindDescription &kind, GVariant *options)
{
    QStringList known;
    for (const char *option : kind.options) {
        if (option)
            known << QLatin1String(option);
    }
    known << QStringLiteral("times");

    GVariantIter iter;
    g_variant_iter_init(&iter, options);
    const gchar *key = nullptr;
    while (g_variant_iter_next(&iter, "{&sv}", &key, nullptr)) {
        const QString name = QString::fromUtf8(key);
        if (!known.contains(name)) {
            throw Refusal(QStringLiteral("The fault \"%1\" has no option \"%2\"; it has %3")
                              .arg(QLatin1String(kind.name), name, known.join(QStringLiteral(", "))));
        }
    }
}

/** The option as a value of @p type; null when it is not given. */
Variant option(GVariant *options, const char *name, const GVariantType *type)
{
    Variant value(g_variant_lookup_value(options, name, nullptr));
    if (value && !g_variant_is_of_type(value.get(), type)) {
        throw Refusal(QStringLiteral("The option \"%1\" is of type \"%2\"; it must be \"%3\"")
                          .arg(QLatin1String(name), QLatin1String(g_variant_get_type_string(value.get())),
                               QString::fromUtf8(g_variant_type_peek_string(type),
                                                 int(g_variant_type_get_string_length(type)))));
    }
    return value;
}

} // namespace

quint32 FaultTable::add(const QString &service, const QString &path, const QString &interface,
                        const QString &member, const QString &kind, GVariant *options)
{
    if (!path.isEmpty() && !g_variant_is_object_path(path.toUtf8().constData()))
        throw Refusal(
            QStringLiteral("\"%1\" is no object path; leave it empty to match all of them").arg(path));
    if (!interface.isEmpty() && !g_dbus_is_interface_name(interface.toUtf8().constData())) {
        throw Refusal(QStringLiteral("\"%1\" is no interface name; leave it empty to match all of them")
                          .arg(interface));
    }
    if (!member.isEmpty() && !g_dbus_is_member_name(member.toUtf8().constData()))
        throw Refusal(
            QStringLiteral("\"%1\" is no method name; leave it empty to match all of them").arg(member));

    const KindDescription &chosen = kindNamed(kind);
    checkOptionNames(chosen, options);

    Fault fault;
    fault.service = service;
    fault.path = path;
    fault.interface = interface;
    fault.member = member;
    fault.kind = chosen.kind;

    if (const Variant times = option(options, "times", G_VARIANT_TYPE_UINT32)) {
        fault.times = g_variant_get_uint32(times.get());
        if (fault.times == 0u)
            throw Refusal(QStringLiteral("The option \"times\" must be 1 or more"));
    }
    switch (fault.kind) {
    case Fault::Kind::Error: {
        const Variant name = option(options, "error", G_VARIANT_TYPE_STRING);
        const Variant message = option(options, "message", G_VARIANT_TYPE_STRING);
        fault.errorName = name ? QString::fromUtf8(g_variant_get_string(name.get(), nullptr))
                               : QStringLiteral("org.freedesktop.DBus.Error.Failed");
        fault.errorMessage = message ? QString::fromUtf8(g_variant_get_string(message.get(), nullptr))
                                     : QStringLiteral("The simulated phone was told to fail");
        if (!g_dbus_is_error_name(fault.errorName.toUtf8().constData())) {
            throw Refusal(QStringLiteral("\"%1\" is no error name; one is org.freedesktop.DBus.Error.Failed")
                              .arg(fault.errorName));
        }
        break;
    }
    case Fault::Kind::Late: {
        const Variant delay = option(options, "delay", G_VARIANT_TYPE_UINT32);
        if (!delay)
            throw Refusal(QStringLiteral("The fault \"late\" needs the option \"delay\", in milliseconds"));
        fault.delay = g_variant_get_uint32(delay.get());
        break;
    }
    case Fault::Kind::Reply: {
        GVariantBuilder tuple;
        g_variant_builder_init(&tuple, G_VARIANT_TYPE_TUPLE);
        if (const Variant values = option(options, "arguments", G_VARIANT_TYPE("av"))) {
            for (gsize i = 0; i < g_variant_n_children(values.get()); ++i) {
                const Variant boxed(g_variant_get_child_value(values.get(), i));
                const Variant value(g_variant_get_variant(boxed.get()));
                g_variant_builder_add_value(&tuple, value.get());
            }
        }
        fault.arguments = Variant(g_variant_builder_end(&tuple));
        break;
    }
    case Fault::Kind::Never:
        break;
    }

    const std::lock_guard<std::mutex> lock(m_mutex);
    fault.id = ++m_lastId;
    m_faults.push_front(fault);
    return fault.id;
}

bool FaultTable::remove(quint32 id)
{
    const std::lock_guard<std::mutex> lock(m_mutex);
    const auto found
        = std::find_if(m_faults.begin(), m_faults.end(), [id](const Fault &each) { return each.id == id; });
    if (found == m_faults.end())
        return false;
    m_faults.erase(found);
    return true;
}

void FaultTable::clear()
{
    const std::lock_guard<std::mutex> lock(m_mutex);
    m_faults.clear();
}

std::optional<Fault> FaultTable::take(const QString &service, GDBusMessage *call)
{
    const auto matches = [](const QString &wanted, const gchar *actual) {
        return wanted.isEmpty() || wanted == QString::fromUtf8(actual);
    };

    const std::lock_guard<std::mutex> lock(m_mutex);
    const auto found = std::find_if(m_faults.begin(), m_faults.end(), [&](const Fault &each) {
        return each.service == service && matches(each.path, g_dbus_message_get_path(call))
            && matches(each.interface, g_dbus_message_get_interface(call))
            && matches(each.member, g_dbus_message_get_member(call));
    });
    if (found == m_faults.end())
        return std::nullopt;
    const Fault fault = *found;
    if (found->times && --*found->times == 0)
        m_faults.erase(found);
    return fault;
}

GVariant *FaultTable::describe() const
{
    const std::lock_guard<std::mutex> lock(m_mutex);
    GVariantBuilder faults;
    g_variant_builder_init(&faults, G_VARIANT_TYPE("a(usssssa{sv})"));
    for (const Fault &fault : m_faults) {
        GVariantBuilder options;
        g_variant_builder_init(&options, G_VARIANT_TYPE_VARDICT);
        switch (fault.kind) {
        case Fault::Kind::Error:
            g_variant_builder_add(&options, "{sv}", "error",
                                  g_variant_new_string(fault.errorName.toUtf8().constData()));
            g_variant_builder_add(&options, "{sv}", "message",
                                  g_variant_new_string(fault.errorMessage.toUtf8().constData()));
            break;
        case Fault::Kind::Late:
            g_variant_builder_add(&options, "{sv}", "delay", g_variant_new_uint32(fault.delay));
            break;
        case Fault::Kind::Reply: {
            GVariantBuilder arguments;
            g_variant_builder_init(&arguments, G_VARIANT_TYPE("av"));
            for (gsize i = 0; i < g_variant_n_children(fault.arguments.get()); ++i) {
                const Variant value(g_variant_get_child_value(fault.arguments.get(), i));
                g_variant_builder_add(&arguments, "v", value.get());
            }
            g_variant_builder_add(&options, "{sv}", "arguments", g_variant_builder_end(&arguments));
            break;
        }
        case Fault::Kind::Never:
            break;
        }
        if (fault.times)
            g_variant_builder_add(&options, "{sv}", "times", g_variant_new_uint32(*fault.times));
        g_variant_builder_add(&faults, "(usssssa{sv})", fault.id, fault.service.toUtf8().constData(),
                              fault.path.toUtf8().constData(), fault.interface.toUtf8().constData(),
                              fault.member.toUtf8().constData(), description(fault.kind).name, &options);
    }
    return g_variant_builder_end(&faults);
}

} // namespace Simulator
} // namespace Corvane
