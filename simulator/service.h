// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_SERVICE_H
#define CORVANE_SIMULATOR_SERVICE_H

#include "busconnection.h"
#include "faults.h"
#include "journal.h"
#include "phoneservice.h"

#include <QtCore/QString>

#include <functional>
#include <memory>
#include <vector>

namespace Corvane
{
namespace Simulator
{

/** A simulated service: the components behind its name answer the calls. */
class Service : public PhoneService
{
public:
    Service(const QString &name, Journal &journal, FaultTable &faults);
    ~Service() override;

    bool isRunning() const override { return m_connection != nullptr; }
    Service *simulated() override { return this; }
    /** Done at once; throws BusError. */
    void start(const Done &done) override;
    void stop(const Done &done) override;

    /** For components while they are attached. */
    void addObject(const QString &path, const QString &interface, MethodHandlers handlers,
                   PropertyReaders properties = {});
    void removeObject(const QString &path, const QString &interface);
    /** @p handler is given the unique name of each client that leaves the bus. */
    void watchClients(std::function<void(const QString &client)> handler);

    /** Emits a signal if the service runs; @p arguments is a tuple, or null for none. */
    void emitSignal(const QString &path, const QString &interface, const QString &member,
                    GVariant *arguments = nullptr, const QString &destination = QString()) const;

    /** Calls a method of a client, if the service runs, and leaves its answer alone. */
    void callClient(const BusConnection::Method &method, GVariant *arguments) const;

private:
    void disconnect();

    Journal &m_journal;
    FaultTable &m_faults;
    std::vector<std::function<void(const QString &)>> m_clientHandlers;
    std::unique_ptr<BusConnection> m_connection;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_SERVICE_H
