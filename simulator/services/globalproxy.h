// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_GLOBALPROXY_H
#define CORVANE_SIMULATOR_GLOBALPROXY_H

#include "busconnection.h"
#include "proxyconfiguration.h"

#include <QtCore/QJsonObject>

#include <functional>

namespace Corvane
{
namespace Simulator
{

class Service;

/** The proxy of the phone as a whole, which the connection manager has from a plug-in. */
class GlobalProxy
{
public:
    /** @p profile is its part of the phone's; @p changed follows every change. */
    GlobalProxy(const QJsonObject &profile, std::function<void()> changed);

    void attach(Service &service);
    void detach() { m_service = nullptr; }

    /** What is used by a network whose own proxy is @p own. */
    ProxyConfiguration inPlaceOf(const ProxyConfiguration &own) const;
    QJsonObject describe() const;

    void setActive(bool isActive);
    void setConfiguration(const ProxyConfiguration &configuration);

private:
    Variant property(const QString &name) const;
    void setProperty(MethodCall &call);
    void announce(const QString &name) const;

    const std::function<void()> m_changed;
    bool m_isActive;
    ProxyConfiguration m_configuration;
    Service *m_service = nullptr;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_GLOBALPROXY_H
