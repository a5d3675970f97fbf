// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_CALLALARM_H
#define CORVANE_TEST_CALLALARM_H

#include <QtCore/QObject>
#include <QtDBus/QDBusConnection>

/** Wakes the event loop up with each call that the phone's services receive, so that waiting for one takes no
 * time. */
class CallAlarm : public QObject
{
    Q_OBJECT

public:
    CallAlarm()
    {
        const bool connected = QDBusConnection::systemBus().connect(
            QStringLiteral("org.corvaneos.simulator"), QStringLiteral("/org/corvaneos/simulator"),
            QStringLiteral("org.corvaneos.simulator.Control"), QStringLiteral("CallReceived"), this,
            SLOT(ring()));
        if (!connected)
            qFatal("cannot listen to the phone's journal");
    }

private Q_SLOTS:
    void ring() { }
};

#endif // CORVANE_TEST_CALLALARM_H
