// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_SERVICE_H
#define CORVANE_SIMULATOR_SERVICE_H

#include "busconnection.h"
#include "component.h"
#include "faults.h"
#include "journal.h"

#include <QtCore/QString>

#include <functional>
#include <memory>
#include <vector>

namespace Corvane
{
namespace Simulator
{

/** A bus name of the phone with the components behind it; it can be stopped and started again. */
class Service
{
public:
    Service(const QString &name, Journal &journal, FaultTable &faults);
    ~Service();

    QString name() const { return m_name; }
    void addComponent(std::unique_ptr<Component> component);
    const std::vector<std::unique_ptr<Component>> &components() const { return m_components; }

    bool isRunning() const { return m_connection != nullptr; }
    void start();
    /** Returns when the name has left the bus; calls that wait for an answer get none. */
    void stop();

    /** For components while they are attached. */
    void addObject(const QString &path, const QString &interface, MethodHandlers handlers);
    void removeObject(const QString &path, const QString &interface);
    /** @p handler is given the unique name of each client that leaves the bus. */
    void watchClients(std::function<void(const QString &client)> handler);

    /** Emits a signal if the service runs; @p arguments is a tuple, or null for none. */
    void emitSignal(const QString &path, const QString &interface, const QString &member,
                    GVariant *arguments = nullptr, const QString &destination = QString()) const;

private:
    void disconnect();

    const QString m_name;
    Journal &m_journal;
    FaultTable &m_faults;
    std::vector<std::unique_ptr<Component>> m_components;
    std::vector<std::function<void(const QString &)>> m_clientHandlers;
    std::unique_ptr<BusConnection> m_connection;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_SERVICE_H
