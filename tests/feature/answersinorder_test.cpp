// SPDX-License-Identifier: LGPL-2.1-or-later
// What a service says after its answer counts, however late the program looks: on a busy machine an answer
// and the signals that follow it are there before anybody waits for them.
#include "phone.h"
#include "waiting.h"

#include <corvanemdm/datetimesettings.h>
#include <corvanemdm/devicelock.h>
#include <corvanemdm/simvoicecallfilter.h>

#include <ofono/qofonosimmanager.h>

#include <QtCore/QDeadlineTimer>
#include <QtCore/QThread>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusPendingCallWatcher>
#include <QtDBus/QDBusVariant>
#include <QtTest/QtTest>

#include <dlfcn.h>

using Corvane::Mdm::DateTimeSettings;
using Corvane::Mdm::DeviceLock;
using Corvane::Mdm::SimFilter;
using Corvane::Mdm::SimVoiceCallFilter;

/** Stands before the constructor of QDBusPendingCallWatcher: the answer is there before the watcher. */
Q_DECL_EXPORT void constructWatcherLate(
    QDBusPendingCallWatcher *watcher, const QDBusPendingCall &call,
    QObject *parent) __asm__("_ZN23QDBusPendingCallWatcherC1ERK16QDBusPendingCallP7QObject");

void constructWatcherLate(QDBusPendingCallWatcher *watcher, const QDBusPendingCall &call, QObject *parent)
{
    using Constructor = void (*)(QDBusPendingCallWatcher *, const QDBusPendingCall &, QObject *);
    static const auto constructor = reinterpret_cast<Constructor>(
        dlsym(RTLD_NEXT, "_ZN23QDBusPendingCallWatcherC1ERK16QDBusPendingCallP7QObject"));
    // Some calls are not answered before others have been sent.
    const QDeadlineTimer longEnough(200);
    while (!call.isFinished() && !longEnough.hasExpired())
        QThread::yieldCurrentThread();
    constructor(watcher, call, parent);
}

/** Nothing in here runs the event loop between a question and what comes after its answer. */
class AnswersInOrderTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void cleanup();

    void simManager();
    void callFilter();
    void timeZone();
    void lockState();

private:
    /** Waits until what @p service has sent over @p connection so far is in this process. */
    static void receive(const QDBusConnection &connection, const QString &service)
    {
        const QDBusMessage reply = connection.call(QDBusMessage::createMethodCall(
            service, QStringLiteral("/"), QStringLiteral("org.freedesktop.DBus.Peer"),
            QStringLiteral("Ping")));
        QCOMPARE(reply.type(), QDBusMessage::ReplyMessage);
    }
    /** Waits until all that @p service was asked before has been answered: as Phone::settle(), without the
     * event loop. */
    void letAnswer(const QDBusConnection &connection, const QString &service) const
    {
        receive(connection, service);
        m_phone.state();
        receive(connection, service);
    }
    void announce(const QString &service, const QString &path, const QString &interface,
                  const QString &member, const QVariantList &arguments)
    {
        const QDBusConnection bus = QDBusConnection::systemBus();
        letAnswer(bus, service);
        m_phone.sendSignal(service, path, interface, member, arguments);
        receive(bus, service);
    }

    Phone m_phone;
};

void AnswersInOrderTest::cleanup()
{
    m_phone.clearFaults();
}

void AnswersInOrderTest::simManager()
{
    const QString service = QStringLiteral("org.ofono");
    QOfonoSimManager known; // who owns the service, too
    known.setModemPath(QStringLiteral("/ril_0"));
    QVERIFY(waitUntil([&] { return known.isValid(); }));

    QOfonoSimManager sim;
    sim.setModemPath(QStringLiteral("/ril_1"));
    announce(service, QStringLiteral("/ril_1"), QStringLiteral("org.ofono.SimManager"),
             QStringLiteral("PropertyChanged"),
             {QStringLiteral("SubscriberIdentity"),
              QVariant::fromValue(QDBusVariant(QStringLiteral("310150123456789")))});
    QVERIFY(waitUntil([&] { return sim.isValid(); }));
    m_phone.settle(service);
    QCOMPARE(sim.subscriberIdentity(), QStringLiteral("310150123456789"));
}

void AnswersInOrderTest::callFilter()
{
    const QString service = QStringLiteral("org.ofono");
    const SimVoiceCallFilter filter;
    announce(service, QStringLiteral("/mdm/voicecallfilter/dial"),
             QStringLiteral("org.corvaneos.ofono.mdm.VoiceCallFilter"),
             QStringLiteral("DefaultActionChanged"), {1u});
    QVERIFY(waitUntil([&] { return filter.ready(); }));
    m_phone.settle(service);
    QCOMPARE(filter.defaultDialAction(), SimFilter::Block);
}

void AnswersInOrderTest::timeZone()
{
    const QString service = QStringLiteral("org.freedesktop.timedate1");
    const DateTimeSettings settings;
    announce(
        service, QStringLiteral("/org/freedesktop/timedate1"),
        QStringLiteral("org.freedesktop.DBus.Properties"), QStringLiteral("PropertiesChanged"),
        {service, QVariantMap{{QStringLiteral("Timezone"), QStringLiteral("Asia/Tokyo")}}, QStringList()});
    QVERIFY(waitUntil([&] { return settings.ready(); }));
    m_phone.settle(service);
    QCOMPARE(settings.timeZone(), QStringLiteral("Asia/Tokyo"));
}

void AnswersInOrderTest::lockState()
{
    const QString service = QStringLiteral("org.veldmobile.devicelock");
    const DeviceLock lock;
    const QDBusConnection link(QStringLiteral("org.veldmobile.devicelock.0"));
    QVERIFY(link.isConnected());
    letAnswer(link, QString());
    m_phone.sendSignal(service, QStringLiteral("/devicelock/state"),
                       QStringLiteral("org.veldmobile.devicelock.State"), QStringLiteral("Changed"), {1u});
    receive(link, QString());
    QVERIFY(waitUntil([&] { return lock.state() != DeviceLock::Undefined; }));
    // A command is answered after all that was said before.
    m_phone.settle(service);
    receive(link, QString());
    QCoreApplication::processEvents();
    QCoreApplication::processEvents();
    QCOMPARE(lock.state(), DeviceLock::Locked);
}

QTEST_GUILESS_MAIN(AnswersInOrderTest)
#include "answersinorder_test.moc"
