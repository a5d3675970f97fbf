// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_CONTROL_H
#define CORVANE_SIMULATOR_CONTROL_H

#include "busconnection.h"
#include "faults.h"
#include "journal.h"
#include "service.h"

#include <QtCore/QJsonObject>

#include <memory>
#include <vector>

namespace Corvane
{
namespace Simulator
{

/** Steers the phone: offers org.corvaneos.simulator.Control, as its contract has it. */
class Control
{
public:
    /** @p identity is what State() tells of the phone itself, beside its parts. */
    Control(std::vector<std::unique_ptr<Service>> &services, Journal &journal, FaultTable &faults,
            const QJsonObject &identity);

private:
    Service &service(const QString &name) const;
    GVariant *describeServices() const;
    void emitServiceSignal(MethodCall &call) const;
    GVariant *describeActions() const;
    QString act(const QString &name, const QStringList &arguments) const;
    QString state() const;

    std::vector<std::unique_ptr<Service>> &m_services;
    Journal &m_journal;
    FaultTable &m_faults;
    const QJsonObject m_identity;
    BusConnection m_connection;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_CONTROL_H
