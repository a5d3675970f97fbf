// SPDX-License-Identifier: LGPL-2.1-or-later
#include "wait.h"

#include "interruption.h"

#include <QtDBus/QDBusConnection>

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String refusals(
    R"(^Method call failed: |GetAll\(\) failed: |^search\(\) failed: |^The connection manager refused )");

QString seconds(std::chrono::milliseconds time)
{
    return QString::number(double(time.count()) / 1000);
}

} // namespace

Wait::Wait(const Service &service, std::chrono::milliseconds time, const QString &awaited)
    : m_service(service)
    , m_watcher(service.name, QDBusConnection::systemBus(), QDBusServiceWatcher::WatchForUnregistration)
    , m_refusals(refusals, [this](const QString &reason) { end(Reply::Refused, m_service.refusal(reason)); })
{
    connect(&m_watcher, &QDBusServiceWatcher::serviceUnregistered, this,
            [this] { end(Reply::ServiceLost, m_service.notRunning().text); });
    connect(&m_bus, &SystemBus::lost, this, [this](const Reply &reply) { end(reply.outcome, reply.text); });
    if (Interruption *interruption = Interruption::instance()) {
        connect(interruption, &Interruption::requested, this, [this] { end(Reply::Interrupted); });
        if (interruption->isRequested())
            end(Reply::Interrupted);
    }
    if (time == Forever)
        return;
    connect(&m_timer, &QTimer::timeout, this, [this, time, awaited] {
        end(Reply::TimedOut,
            QStringLiteral("%1 did not %2 within %3 s").arg(m_service.toString(), awaited, seconds(time)));
    });
    m_timer.setSingleShot(true);
    m_timer.start(time);
}

void Wait::end(Reply::Outcome outcome, const QString &text)
{
    if (m_ended)
        return;
    m_ended = true;
    m_reply = {outcome, outcome == Reply::Interrupted ? QStringLiteral("interrupted") : text};
    m_loop.quit();
}

void Wait::prolong()
{
    if (m_timer.isActive())
        m_timer.start();
}

Reply Wait::run()
{
    // A service that left before the watcher was in place is told by nobody.
    if (!m_ended && !m_service.isRunning())
        end(Reply::ServiceLost, m_service.notRunning().text);
    if (!m_ended)
        m_loop.exec();
    // The bus refuses in the place of a service that died over the request.
    if (m_reply.outcome == Reply::Refused && !m_service.isRunning())
        return m_service.notRunning();
    return m_reply;
}

} // namespace Agent
} // namespace Corvane
