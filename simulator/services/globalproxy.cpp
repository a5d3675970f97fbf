// SPDX-License-Identifier: LGPL-2.1-or-later
#include "globalproxy.h"

#include "connman.h"
#include "properties.h"
#include "service.h"

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String proxyInterface("org.corvaneos.connman.GlobalProxy");
const QLatin1String activeProperty("Active");
const QLatin1String configurationProperty("Configuration");

} // namespace

GlobalProxy::GlobalProxy(const QJsonObject &profile, std::function<void()> changed)
    : m_changed(std::move(changed))
    , m_isActive(profile.value(QLatin1String("active")).toBool(false))
    , m_configuration(profile.value(QLatin1String("configuration")).toObject())
{
}

void GlobalProxy::attach(Service &service)
{
    m_service = &service;
    service.addObject(ConnMan::managerPath, proxyInterface,
                      {
                          {QStringLiteral("GetProperty"),
                           [this](MethodCall &call) {
                               call.reply(g_variant_new("(v)", property(call.text(0)).get()));
                           }},
                          {QStringLiteral("SetProperty"),
                           [this](MethodCall &call) {
                               setProperty(call);
                           }},
                      });
}

ProxyConfiguration GlobalProxy::inPlaceOf(const ProxyConfiguration &own) const
{
    return m_isActive ? m_configuration : own;
}

Variant GlobalProxy::property(const QString &name) const
{
    if (name == activeProperty)
        return fromBool(m_isActive);
    if (name == configurationProperty)
        return m_configuration.toVariant();
    throw ConnMan::invalidProperty();
}

void GlobalProxy::setProperty(MethodCall &call)
{
    const QString name = call.text(0);
    if (name == activeProperty)
        setActive(ConnMan::propertyFlag(call));
    else if (name == configurationProperty)
        setConfiguration(ProxyConfiguration(ConnMan::propertyValue(call)));
    else
        throw ConnMan::invalidProperty();
    call.reply();
}

void GlobalProxy::setActive(bool isActive)
{
    m_isActive = isActive;
    announce(activeProperty);
    m_changed();
}

void GlobalProxy::setConfiguration(const ProxyConfiguration &configuration)
{
    m_configuration = configuration;
    announce(configurationProperty);
    m_changed();
}

void GlobalProxy::announce(const QString &name) const
{
    if (m_service) {
        m_service->emitSignal(ConnMan::managerPath, proxyInterface, QStringLiteral("PropertyChanged"),
                              g_variant_new("(sv)", name.toUtf8().constData(), property(name).get()));
    }
}

QJsonObject GlobalProxy::describe() const
{
    return {{QStringLiteral("active"), m_isActive},
            {QStringLiteral("configuration"), m_configuration.toJson()}};
}

} // namespace Simulator
} // namespace Corvane
