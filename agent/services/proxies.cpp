// SPDX-License-Identifier: LGPL-2.1-or-later
#include "proxies.h"

#include "service.h"
#include "wait.h"

namespace Corvane
{
namespace Agent
{

using Mdm::NetProxy;

namespace
{

const QString confirmation = QStringLiteral("confirm the change");

} // namespace

Proxies::Proxies(std::chrono::milliseconds timeout, QObject *parent)
    : QObject(parent)
    , m_timeout(timeout)
{
}

Reply Proxies::open()
{
    m_proxy = std::make_unique<NetProxy>();
    Wait wait(Service::connectionManager(), m_timeout, QStringLiteral("tell its proxies"));
    wait.until(m_proxy.get(), &NetProxy::validChanged, [this] { return m_proxy->isValid(); });
    const Reply told = wait.run();
    if (!told.isDone())
        return told;
    connect(m_proxy.get(), &NetProxy::proxyConfigChanged, this, &Proxies::changed);
    connect(m_proxy.get(), &NetProxy::activeTypeChanged, this, &Proxies::changed);
    connect(m_proxy.get(), &NetProxy::validChanged, this, &Proxies::changed);
    return {};
}

QStringList Proxies::networks(const QString &technology) const
{
    QStringList networks = m_proxy->getIdentifiers(technology);
    networks.removeAll(global());
    return networks;
}

QStringList Proxies::networksNamed(const QString &name)
{
    const QStringList all = networks();
    if (all.contains(name))
        return {name};
    QStringList found;
    for (const QString &network : all) {
        if (m_proxy->selectProxy(network) && m_proxy->getName() == name)
            found.append(network);
    }
    return found;
}

Reply Proxies::select(const QString &identifier)
{
    if (m_proxy->selectProxy(identifier))
        return {};
    if (!Service::connectionManager().isRunning())
        return Service::connectionManager().notRunning();
    return {Reply::Refused, QStringLiteral("there is no saved network %1 now").arg(identifier)};
}

ProxyConfiguration Proxies::configuration() const
{
    return {m_proxy->type(), QUrl::toStringList(m_proxy->manualProxies()), m_proxy->manualExclusions(),
            m_proxy->automaticUrl().toString()};
}

Reply Proxies::configure(const ProxyConfiguration &wanted)
{
    if (configuration() == wanted)
        return {};
    Wait wait(Service::connectionManager(), m_timeout, confirmation);
    connect(m_proxy.get(), &NetProxy::proxyConfigChanged, &wait, [&] {
        if (configuration() == wanted)
            wait.end(Reply::Done);
    });
    // The type comes last: what belongs to it is sent with it, and only then when it is another one.
    if (wanted.type == NetProxy::Manual) {
        m_proxy->setManualExclusions(wanted.exclusions);
        m_proxy->setManualProxies(QUrl::fromStringList(wanted.servers));
    } else if (wanted.type == NetProxy::Automatic) {
        m_proxy->setAutomaticUrl(QUrl(wanted.url));
    }
    if (m_proxy->type() != wanted.type)
        m_proxy->setType(wanted.type);
    return outcomeOf(wait.run());
}

bool Proxies::usesGlobal() const
{
    return m_proxy->activeType() == NetProxy::Global;
}

Reply Proxies::useGlobal(bool global)
{
    if (usesGlobal() == global)
        return {};
    Wait wait(Service::connectionManager(), m_timeout, confirmation);
    connect(m_proxy.get(), &NetProxy::activeTypeChanged, &wait, [&] {
        if (usesGlobal() == global)
            wait.end(Reply::Done);
    });
    m_proxy->setActiveType(global ? NetProxy::Global : NetProxy::Service);
    return outcomeOf(wait.run());
}

Reply Proxies::outcomeOf(const Reply &reply)
{
    if (!reply.isDone() && Service::connectionManager().isRunning()) {
        const QString selected = identifier();
        if (open().isDone())
            m_proxy->selectProxy(selected);
    }
    return reply;
}

} // namespace Agent
} // namespace Corvane
