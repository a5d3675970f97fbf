// SPDX-License-Identifier: LGPL-2.1-or-later
#include "traffic.h"

namespace Corvane
{
namespace Simulator
{

namespace
{

struct HeldAnswer {
    GObjectPointer<GDBusConnection> connection;
    GObjectPointer<GDBusMessage> answer;
};

void sendAnswer(GDBusConnection *connection, GDBusMessage *answer)
{
    // Fails only when the service was stopped meanwhile, which leaves the caller without an answer as it
    // should.
    g_dbus_connection_send_message(connection, answer, G_DBUS_SEND_MESSAGE_FLAGS_NONE, nullptr, nullptr);
}

} // namespace

Traffic::Traffic(const QString &service, Journal &journal, FaultTable &faults)
    : m_service(service)
    , m_journal(journal)
    , m_faults(faults)
{
}

void Traffic::watch(GDBusConnection *connection, const QString &service, Journal &journal, FaultTable &faults)
{
    g_dbus_connection_add_filter(
        connection,
        [](GDBusConnection *source, GDBusMessage *message, gboolean incoming, gpointer data) {
            return static_cast<Traffic *>(data)->filter(source, message, incoming);
        },
        new Traffic(service, journal, faults), [](gpointer data) { delete static_cast<Traffic *>(data); });
}

GDBusMessage *Traffic::filter(GDBusConnection *connection, GDBusMessage *message, bool incoming)
{
    bool passes = true;
    switch (g_dbus_message_get_message_type(message)) {
    case G_DBUS_MESSAGE_TYPE_METHOD_CALL:
        passes = !incoming || admit(connection, message);
        break;
    case G_DBUS_MESSAGE_TYPE_METHOD_RETURN:
    case G_DBUS_MESSAGE_TYPE_ERROR:
        passes = incoming || dismiss(connection, message);
        break;
    default:
        break;
    }
    if (passes)
        return message;
    g_object_unref(message);
    return nullptr;
}

bool Traffic::admit(GDBusConnection *connection, GDBusMessage *call)
{
    m_journal.record(m_service, call);

    const std::optional<Fault> fault = m_faults.take(m_service, call);
    if (!fault)
        return true;

    const bool wantsAnswer = !(g_dbus_message_get_flags(call) & G_DBUS_MESSAGE_FLAGS_NO_REPLY_EXPECTED);
    GObjectPointer<GDBusMessage> answer;
    switch (fault->kind) {
    case Fault::Kind::Late:
        if (wantsAnswer)
            m_late[{g_dbus_message_get_sender(call), g_dbus_message_get_serial(call)}] = fault->delay;
        return true;
    case Fault::Kind::Never:
        return false;
    case Fault::Kind::Error:
        answer.reset(g_dbus_message_new_method_error_literal(call, fault->errorName.toUtf8().constData(),
                                                             fault->errorMessage.toUtf8().constData()));
        break;
    case Fault::Kind::Reply:
        answer.reset(g_dbus_message_new_method_reply(call));
        g_dbus_message_set_body(answer.get(), fault->arguments.get());
        break;
    }
    if (wantsAnswer)
        sendAnswer(connection, answer.get());
    return false;
}

bool Traffic::dismiss(GDBusConnection *connection, GDBusMessage *answer)
{
    const auto late
        = m_late.find({g_dbus_message_get_destination(answer), g_dbus_message_get_reply_serial(answer)});
    if (late == m_late.end())
        return true;

    auto *held = new HeldAnswer;
    held->connection.reset(G_DBUS_CONNECTION(g_object_ref(connection)));
    held->answer.reset(g_dbus_message_copy(answer, nullptr));
    g_timeout_add_full(
        G_PRIORITY_DEFAULT, late->second,
        [](gpointer data) -> gboolean {
            const auto *due = static_cast<HeldAnswer *>(data);
            sendAnswer(due->connection.get(), due->answer.get());
            return G_SOURCE_REMOVE;
        },
        held, [](gpointer data) { delete static_cast<HeldAnswer *>(data); });
    m_late.erase(late);
    return false;
}

} // namespace Simulator
} // namespace Corvane
