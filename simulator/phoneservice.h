// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_PHONESERVICE_H
#define CORVANE_SIMULATOR_PHONESERVICE_H

#include "component.h"

#include <QtCore/QString>

#include <functional>
#include <memory>
#include <vector>

namespace Corvane
{
namespace Simulator
{

class Service;

/** A bus name of the phone, simulated or a real daemon's, with what can be done to the part behind it. */
class PhoneService
{
public:
    /** What became of a start or a stop; @p problem is empty when all is well. */
    using Done = std::function<void(const QString &problem)>;

    explicit PhoneService(const QString &name)
        : m_name(name)
    {
    }
    virtual ~PhoneService() = default;
    PhoneService(const PhoneService &) = delete;
    PhoneService &operator=(const PhoneService &) = delete;

    QString name() const { return m_name; }
    void addComponent(std::unique_ptr<Component> component) { m_components.push_back(std::move(component)); }
    const std::vector<std::unique_ptr<Component>> &components() const { return m_components; }

    virtual bool isRunning() const = 0;
    /** The service as one whose calls, answers and signals can be steered; null for a real daemon. */
    virtual Service *simulated() { return nullptr; }
    /** @p done is called when the service can be used. */
    virtual void start(const Done &done) = 0;
    /** @p done is called when the name has left the bus; calls that wait for an answer get none. */
    virtual void stop(const Done &done) = 0;

private:
    const QString m_name;
    std::vector<std::unique_ptr<Component>> m_components;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_PHONESERVICE_H
