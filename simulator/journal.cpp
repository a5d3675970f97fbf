// SPDX-License-Identifier: LGPL-2.1-or-later
#include "journal.h"

namespace Corvane
{
namespace Simulator
{

void Journal::record(const QString &service, GDBusMessage *call)
{
    Entry entry{
        0,
        g_get_real_time(),
        service.toUtf8(),
        g_dbus_message_get_sender(call),
        g_dbus_message_get_path(call),
        g_dbus_message_get_interface(call),
        g_dbus_message_get_member(call),
        g_dbus_message_get_signature(call),
        Variant::shared(g_dbus_message_get_body(call)),
    };
    {
        const std::lock_guard<std::mutex> lock(m_mutex);
        entry.number = ++m_lastNumber;
        if (m_entries.size() == capacity)
            m_entries.pop_front();
        m_entries.push_back(entry);
    }
    if (m_announce)
        m_announce(describe(entry));
}

void Journal::clear()
{
    const std::lock_guard<std::mutex> lock(m_mutex);
    m_entries.clear();
}

GVariant *Journal::entriesAfter(quint64 after) const
{
    const std::lock_guard<std::mutex> lock(m_mutex);
    GVariantBuilder builder;
    g_variant_builder_init(&builder, G_VARIANT_TYPE("a(ttsssssss)"));
    for (const Entry &entry : m_entries) {
        if (entry.number > after)
            g_variant_builder_add_value(&builder, describe(entry));
    }
    return g_variant_builder_end(&builder);
}

GVariant *Journal::describe(const Entry &entry)
{
    const GCharPointer arguments(entry.arguments ? g_variant_print(entry.arguments.get(), TRUE)
                                                 : g_strdup("()"));
    return g_variant_new("(ttsssssss)", guint64(entry.number), guint64(entry.time), entry.service.constData(),
                         entry.sender.constData(), entry.path.constData(), entry.interface.constData(),
                         entry.member.constData(), entry.signature.constData(), arguments.get());
}

} // namespace Simulator
} // namespace Corvane
