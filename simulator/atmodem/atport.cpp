// SPDX-License-Identifier: LGPL-2.1-or-later
#include "atport.h"

#include <cstdio>
#include <stdexcept>

namespace Corvane
{
namespace Simulator
{

AtPort::AtPort(AtModem &modem)
    : m_modem(modem)
    , m_service(g_socket_service_new())
{
    const GObjectPointer<GInetAddress> loopback(g_inet_address_new_loopback(G_SOCKET_FAMILY_IPV4));
    const GObjectPointer<GSocketAddress> wanted(g_inet_socket_address_new(loopback.get(), 0));
    GSocketAddress *effective = nullptr;
    ErrorSlot error;
    if (!g_socket_listener_add_address(G_SOCKET_LISTENER(m_service.get()), wanted.get(), G_SOCKET_TYPE_STREAM,
                                       G_SOCKET_PROTOCOL_TCP, nullptr, &effective, &error))
        throw std::runtime_error(std::string("cannot open a port for a modem: ") + error->message);
    const GObjectPointer<GSocketAddress> address(effective);
    m_number = g_inet_socket_address_get_port(G_INET_SOCKET_ADDRESS(address.get()));

    g_signal_connect(m_service.get(), "incoming",
                     G_CALLBACK(+[](GSocketService *, GSocketConnection *connection, GObject *,
                                    gpointer data) -> gboolean {
                         static_cast<AtPort *>(data)->accept(connection);
                         return TRUE;
                     }),
                     this);
    m_modem.setAnnouncer([this](const QString &line) { send(line); });
}

AtPort::~AtPort()
{
    m_modem.setAnnouncer({});
    g_socket_service_stop(m_service.get());
    g_socket_listener_close(G_SOCKET_LISTENER(m_service.get()));
    g_signal_handlers_disconnect_by_data(m_service.get(), this);
    hangUp();
}

void AtPort::accept(GSocketConnection *connection)
{
    hangUp();
    m_modem.reset();
    m_connection.reset(static_cast<GSocketConnection *>(g_object_ref(connection)));
    GSocket *socket = g_socket_connection_get_socket(connection);
    g_socket_set_blocking(socket, FALSE);
    GSource *source = g_socket_create_source(socket, G_IO_IN, nullptr);
    const GSocketSourceFunc handler = [](GSocket *, GIOCondition, gpointer data) -> gboolean {
        static_cast<AtPort *>(data)->read();
        return G_SOURCE_CONTINUE;
    };
    g_source_set_callback(source, G_SOURCE_FUNC(handler), this, nullptr);
    m_source = g_source_attach(source, nullptr);
    g_source_unref(source);
}

void AtPort::hangUp()
{
    if (m_source)
        g_source_remove(std::exchange(m_source, 0));
    m_connection.reset();
    m_received.clear();
}

void AtPort::read()
{
    char buffer[1024];
    ErrorSlot error;
    const gssize count = g_socket_receive(g_socket_connection_get_socket(m_connection.get()), buffer,
                                          sizeof buffer, nullptr, &error);
    if (count < 0 && g_error_matches(error.get(), G_IO_ERROR, G_IO_ERROR_WOULD_BLOCK))
        return;
    if (count <= 0) {
        hangUp();
        return;
    }
    m_received.append(buffer, int(count));
    for (int end = m_received.indexOf('\r'); end >= 0; end = m_received.indexOf('\r')) {
        const QString line = QString::fromUtf8(m_received.left(end)).trimmed();
        m_received.remove(0, end + 1);
        if (line.isEmpty())
            continue;
        trace("<", line);
        const QStringList answer = m_modem.answer(line);
        for (const QString &each : answer)
            send(each);
    }
}

void AtPort::send(const QString &line)
{
    if (!m_connection)
        return;
    trace(">", line);
    const QByteArray bytes = "\r\n" + line.toUtf8() + "\r\n";
    // A client that does not read even these few bytes is gone, which reading will tell.
    g_socket_send(g_socket_connection_get_socket(m_connection.get()), bytes.constData(), gsize(bytes.size()),
                  nullptr, nullptr);
}

void AtPort::trace(const char *direction, const QString &line) const
{
    if (!m_traceLabel.isEmpty())
        std::fprintf(stderr, "%s %s %s\n", qUtf8Printable(m_traceLabel), direction, qUtf8Printable(line));
}

} // namespace Simulator
} // namespace Corvane
