// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_CONTROL_H
#define CORVANE_SIMULATOR_CONTROL_H

#include "busconnection.h"
#include "faults.h"
#include "journal.h"
#include "phoneservice.h"

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
    Control(std::vector<std::unique_ptr<PhoneService>> &services, Journal &journal, FaultTable &faults,
            const QJsonObject &identity);

private:
    PhoneService &service(const QString &name) const;
    /** The service called @p name, which is refused when it is a real daemon. */
    Service &simulatedService(const QString &name) const;
    GVariant *describeServices() const;
    void emitServiceSignal(MethodCall &call) const;
    GVariant *describeActions() const;
    QString act(const QString &name, const QStringList &arguments) const;
    QString state() const;

    std::vector<std::unique_ptr<PhoneService>> &m_services;
    Journal &m_journal;
    FaultTable &m_faults;
    const QJsonObject m_identity;
    BusConnection m_connection;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_CONTROL_H
