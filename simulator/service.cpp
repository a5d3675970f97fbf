// SPDX-License-Identifier: LGPL-2.1-or-later
#include "service.h"

#include "traffic.h"

namespace Corvane
{
namespace Simulator
{

Service::Service(const QString &name, Journal &journal, FaultTable &faults)
    : PhoneService(name)
    , m_journal(journal)
    , m_faults(faults)
{
}

Service::~Service()
{
    disconnect();
}

void Service::start(const Done &done)
{
    m_connection = std::make_unique<BusConnection>();
    Traffic::watch(m_connection->get(), name(), m_journal, m_faults);
    m_connection->watchNames([this](const QString &client, const QString &newOwner) {
        if (!client.startsWith(QLatin1Char(':')) || !newOwner.isEmpty())
            return;
        for (const auto &handler : m_clientHandlers)
            handler(client);
    });
    for (const std::unique_ptr<Component> &component : components())
        component->attach(*this);
    // The name comes last: who sees it finds all objects.
    try {
        m_connection->ownName(name());
    } catch (const BusError &error) {
        disconnect();
        done(QString::fromUtf8(error.what()));
        return;
    }
    done(QString());
}

void Service::stop(const Done &done)
{
    if (isRunning()) {
        m_connection->releaseName(name());
        disconnect();
    }
    done(QString());
}

void Service::disconnect()
{
    if (!isRunning())
        return;
    for (const std::unique_ptr<Component> &component : components())
        component->detach();
    m_clientHandlers.clear();
    m_socket.reset();
    m_connection.reset();
}

void Service::listenAt(const QString &path)
{
    m_socket = std::make_unique<PeerSocket>(path, [this](GDBusConnection *connection) {
        Traffic::watch(connection, name(), m_journal, m_faults);
    });
}

void Service::addObject(const QString &path, const QString &interface, MethodHandlers handlers,
                        PropertyReaders properties)
{
    if (m_socket)
        m_socket->addObject(path, interface, handlers, properties);
    else
        m_connection->addObject(path, interface, std::move(handlers), std::move(properties));
}

void Service::removeObject(const QString &path, const QString &interface)
{
    if (m_socket)
        m_socket->removeObject(path, interface);
    else
        m_connection->removeObject(path, interface);
}

void Service::watchClients(std::function<void(const QString &)> handler)
{
    m_clientHandlers.push_back(std::move(handler));
}

void Service::emitSignal(const QString &path, const QString &interface, const QString &member,
                         GVariant *arguments, const QString &destination) const
{
    // Owned here: a service that is stopped would leave a floating value behind.
    const Variant values(arguments);
    if (m_socket)
        m_socket->emitSignal(path, interface, member, values);
    else if (isRunning())
        m_connection->emitSignal(path, interface, member, values.get(), destination);
}

void Service::callClient(const BusConnection::Method &method, GVariant *arguments) const
{
    const Variant values(arguments);
    if (isRunning())
        m_connection->send(method, values.get());
}

} // namespace Simulator
} // namespace Corvane
