// SPDX-License-Identifier: LGPL-2.1-or-later
#include "peersocket.h"

#include <QtCore/QDir>
#include <QtCore/QFile>
#include <QtCore/QFileInfo>

#include <algorithm>

namespace Corvane
{
namespace Simulator
{

PeerSocket::PeerSocket(const QString &path, std::function<void(GDBusConnection *)> welcome)
    : m_path(path)
    , m_welcome(std::move(welcome))
{
    QDir().mkpath(QFileInfo(path).path());
    QFile::remove(path);
    const GCharPointer guid(g_dbus_generate_guid());
    ErrorSlot error;
    m_server.reset(g_dbus_server_new_sync(("unix:path=" + path.toUtf8()).constData(),
                                          G_DBUS_SERVER_FLAGS_NONE, guid.get(), nullptr, nullptr, &error));
    if (!m_server)
        throw BusError(error->message);
    g_signal_connect(m_server.get(), "new-connection",
                     G_CALLBACK(+[](GDBusServer *, GDBusConnection *connection, gpointer data) -> gboolean {
                         static_cast<PeerSocket *>(data)->take(connection);
                         return TRUE;
                     }),
                     this);
    g_dbus_server_start(m_server.get());
}

PeerSocket::~PeerSocket()
{
    g_signal_handlers_disconnect_by_data(m_server.get(), this);
    g_dbus_server_stop(m_server.get());
    QFile::remove(m_path);
    for (const Peer &peer : m_peers) {
        g_signal_handlers_disconnect_by_data(peer.connection.get(), this);
        // What has been answered is to arrive.
        g_dbus_connection_flush_sync(peer.connection.get(), nullptr, nullptr);
        g_dbus_connection_close_sync(peer.connection.get(), nullptr, nullptr);
    }
}

void PeerSocket::take(GDBusConnection *connection)
{
    m_welcome(connection);
    Peer peer{GObjectPointer<GDBusConnection>(G_DBUS_CONNECTION(g_object_ref(connection))),
              std::make_unique<ExportedObjects>(connection)};
    for (const Offer &offer : m_offers)
        peer.objects->add(offer.path, offer.interface, offer.handlers, offer.properties);
    g_signal_connect(connection, "closed",
                     G_CALLBACK(+[](GDBusConnection *closed, gboolean, GError *, gpointer data) {
                         static_cast<PeerSocket *>(data)->drop(closed);
                     }),
                     this);
    m_peers.push_back(std::move(peer));
}

void PeerSocket::drop(GDBusConnection *connection)
{
    m_peers.remove_if([connection](const Peer &peer) { return peer.connection.get() == connection; });
}

void PeerSocket::addObject(const QString &path, const QString &interface, const MethodHandlers &handlers,
                           const PropertyReaders &properties)
{
    m_offers.push_back({path, interface, handlers, properties});
    for (const Peer &peer : m_peers)
        peer.objects->add(path, interface, handlers, properties);
}

void PeerSocket::removeObject(const QString &path, const QString &interface)
{
    m_offers.erase(std::remove_if(m_offers.begin(), m_offers.end(),
                                  [&](const Offer &offer) {
                                      return offer.path == path && offer.interface == interface;
                                  }),
                   m_offers.end());
    for (const Peer &peer : m_peers)
        peer.objects->remove(path, interface);
}

void PeerSocket::emitSignal(const QString &path, const QString &interface, const QString &member,
                            const Variant &arguments) const
{
    for (const Peer &peer : m_peers)
        emitSignalOver(peer.connection.get(), path, interface, member, arguments.get());
}

} // namespace Simulator
} // namespace Corvane
