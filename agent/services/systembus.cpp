// SPDX-License-Identifier: LGPL-2.1-or-later
#include "systembus.h"

#include <QtCore/QCoreApplication>
#include <QtCore/QEvent>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusError>

namespace Corvane
{
namespace Agent
{

SystemBus::SystemBus(QObject *parent)
    : QObject(parent)
{
    QDBusConnection::systemBus().connect(QString(), QStringLiteral("/org/freedesktop/DBus/Local"),
                                         QStringLiteral("org.freedesktop.DBus.Local"),
                                         QStringLiteral("Disconnected"), this, SLOT(tellLost()));
}

Reply SystemBus::reach()
{
    const QDBusConnection bus = QDBusConnection::systemBus();
    if (!bus.isConnected())
        return {Reply::ServiceLost,
                QStringLiteral("the system bus cannot be reached: %1").arg(bus.lastError().message())};
    // QtDBus holds signals back until events are first delivered, and may then let later ones get ahead of
    // them. So that is done before there is anything to hear.
    static const bool isDelivering = [] {
        QCoreApplication::sendPostedEvents(nullptr, QEvent::MetaCall);
        return true;
    }();
    Q_UNUSED(isDelivering)
    return {};
}

void SystemBus::tellLost()
{
    Q_EMIT lost({Reply::ServiceLost, QStringLiteral("the system bus is gone")});
}

} // namespace Agent
} // namespace Corvane
