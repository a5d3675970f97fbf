// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_PEERSOCKET_H
#define CORVANE_SIMULATOR_PEERSOCKET_H

#include "busconnection.h"

#include <QtCore/QString>

#include <functional>
#include <list>
#include <memory>
#include <vector>

namespace Corvane
{
namespace Simulator
{

/** A socket where clients connect to a service directly, with the objects that are offered to each of them.
 */
class PeerSocket
{
public:
    /** @p welcome is given each new connection before its first message. Throws BusError. */
    PeerSocket(const QString &path, std::function<void(GDBusConnection *)> welcome);
    ~PeerSocket();
    PeerSocket(const PeerSocket &) = delete;
    PeerSocket &operator=(const PeerSocket &) = delete;

    /** For the connections of the present and of the future; as those of ExportedObjects. */
    void addObject(const QString &path, const QString &interface, const MethodHandlers &handlers,
                   const PropertyReaders &properties);
    void removeObject(const QString &path, const QString &interface);
    /** To every client; @p arguments is a tuple, or null for none. */
    void emitSignal(const QString &path, const QString &interface, const QString &member,
                    const Variant &arguments) const;

private:
    struct Peer {
        GObjectPointer<GDBusConnection> connection;
        std::unique_ptr<ExportedObjects> objects;
    };
    struct Offer {
        QString path;
        QString interface;
        MethodHandlers handlers;
        PropertyReaders properties;
    };

    void take(GDBusConnection *connection);
    void drop(GDBusConnection *connection);

    const QString m_path;
    const std::function<void(GDBusConnection *)> m_welcome;
    GObjectPointer<GDBusServer> m_server;
    std::vector<Offer> m_offers;
    std::list<Peer> m_peers;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_PEERSOCKET_H
