// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_PROXIES_H
#define CORVANE_PROXIES_H

#include "proxyconfiguration.h"
#include "reply.h"

#include <corvanemdm/netproxy.h>

#include <QtCore/QObject>

#include <chrono>
#include <memory>

namespace Corvane
{
namespace Agent
{

/** The proxies of the phone and of its networks, of which one is selected; with every change awaited until it
 * is confirmed. */
class Proxies : public QObject
{
    Q_OBJECT

public:
    /** What the proxy of the whole phone is called beside the identifiers of networks. */
    static QString global() { return QStringLiteral("global"); }

    explicit Proxies(std::chrono::milliseconds timeout, QObject *parent = nullptr);

    /** Waits until the proxies are known; the global one is selected then. */
    Reply open();

    /** The networks that @p name is the identifier or the name of. Changes the selection. */
    QStringList networksNamed(const QString &name);
    /** The saved networks of @p technology, or of all, without the global proxy. */
    QStringList networks(const QString &technology = QString()) const;

    Reply select(const QString &identifier);
    /** The names of what is selected; @c identifier for machines, @c name for people. */
    QString identifier() const { return m_proxy->getIdentifier(); }
    QString name() const { return m_proxy->getName(); }
    ProxyConfiguration configuration() const;
    Reply configure(const ProxyConfiguration &wanted);

    /** Whether the global proxy is used in place of those of the networks. */
    bool usesGlobal() const;
    Reply useGlobal(bool global);

Q_SIGNALS:
    /** What is selected, or what is used, has been announced. */
    void changed();

private:
    /** After a change that was not confirmed, the library's copy is not what the phone has. */
    Reply outcomeOf(const Reply &reply);

    const std::chrono::milliseconds m_timeout;
    std::unique_ptr<Mdm::NetProxy> m_proxy;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_PROXIES_H
