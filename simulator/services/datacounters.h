// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_DATACOUNTERS_H
#define CORVANE_SIMULATOR_DATACOUNTERS_H

#include "network.h"

#include <QtCore/QJsonArray>

#include <map>
#include <memory>
#include <vector>

namespace Corvane
{
namespace Simulator
{

/** The clients of the connection manager that are told of the data that networks carry. */
class DataCounters
{
public:
    using Networks = std::vector<std::unique_ptr<Network>>;

    explicit DataCounters(const Networks &networks);

    void attach(Service &service);
    void detach();

    /** Handlers of the manager's methods. */
    void add(MethodCall &call);
    void remove(MethodCall &call);

    /** The client has left the bus. */
    void forgetClient(const QString &owner);
    /** Tells each that is not registered any more. */
    void releaseAll();
    /** What @p network has carried has changed, or it has been connected. */
    void reportTraffic(const Network &network);
    /** Sends a report as it is given: the dictionaries are texts of values of type a{sv}; throws Refusal. */
    void sendUsage(const QString &networkPath, const QString &home, const QString &roaming) const;
    QJsonArray describe() const;

private:
    /** What a counter has been told of a network. */
    struct Told {
        Properties home;
        Properties roaming;
        guint64 bytes = 0;
    };
    struct Counter {
        QString owner;
        QString path;
        guint32 accuracy = 0; ///< KiB
        guint32 period = 0; ///< seconds
        std::map<QString, Told> told; ///< by the network's path
        Timer timer;
    };

    void reportPeriodically(Counter &counter);
    void report(Counter &counter, const Network &network);
    void send(const Counter &counter, const char *member, GVariant *arguments) const;
    void removeIf(const std::function<bool(const Counter &)> &matches);

    const Networks &m_networks;
    std::vector<std::unique_ptr<Counter>> m_counters;
    Service *m_service = nullptr;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_DATACOUNTERS_H
