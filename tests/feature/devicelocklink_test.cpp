// SPDX-License-Identifier: LGPL-2.1-or-later
// The way to the device-lock daemon: there, not there, gone, back again, and talking nonsense.
#include "messagelog.h"
#include "phone.h"
#include "servicerestarts.h"
#include "signalsequence.h"
#include "waiting.h"

#include <corvanemdm/devicelock.h>

#include <QtCore/QDir>
#include <QtCore/QElapsedTimer>
#include <QtCore/QFile>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusServer>
#include <QtTest/QtTest>

#include <memory>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>
#include <vector>

using Corvane::Mdm::DeviceLock;

namespace
{

const QString Service = QStringLiteral("org.veldmobile.devicelock");
const QString ManagementPath = QStringLiteral("/mdm");
const QString SetSecurityCode = QStringLiteral("SetSecurityCode");
const QString SocketFolder = QStringLiteral("/run/veld-devicelock");
const QString SocketPath = QStringLiteral("/run/veld-devicelock/socket");
const QString Code = QStringLiteral("2468");

constexpr int LongestRunMicroseconds = 20000; // somewhat longer than until the state is known

const QString connectFailed = QStringLiteral("Failed to reconnect to host. ");
const QString available = QStringLiteral("The device lock socket is available to connect to");

const QString busy = QStringLiteral("changingSecurityCodeChanged()");
const QString changed = QStringLiteral("securityCodeChanged()");
const QString failed = QStringLiteral("securityCodeChangeError()");

bool isConnected(uint number)
{
    return QDBusConnection(QStringLiteral("org.corvaneos.mdm.%1").arg(number)).isConnected();
}

int openFiles()
{
    return int(QDir(QStringLiteral("/proc/self/fd")).entryList(QDir::AllEntries | QDir::System).size());
}

/** The signals without those of the state, which have a time of their own. */
QStringList ofCommands(QStringList signalsSeen)
{
    signalsSeen.removeAll(QStringLiteral("stateChanged()"));
    return signalsSeen;
}

/** Sets the code again and again until that is done: the object may not have its new connection yet. */
bool untilCodeIsSet(DeviceLock &lock, const SignalSequence &seen)
{
    return waitUntil([&] {
        const bool isSet = seen.signalsSeen().contains(changed);
        if (!isSet && !lock.changingSecurityCode())
            lock.setSecurityCode(Code);
        return isSet;
    });
}

/** Counts the reconnections that are logged while it lives, instead of printing them. */
class Reconnections
{
public:
    Reconnections()
    {
        s_count = 0;
        s_previous = qInstallMessageHandler(handle);
    }
    ~Reconnections() { qInstallMessageHandler(s_previous); }
    Q_DISABLE_COPY(Reconnections)

    /** Waits for @p number of them, those since the last call. */
    bool waitFor(int number = 1)
    {
        const bool done = waitUntil([number] { return s_count >= number; }) && s_count == number;
        s_count = 0;
        return done;
    }
    int count() const { return s_count; }

private:
    static void handle(QtMsgType type, const QMessageLogContext &context, const QString &message)
    {
        if (type == QtDebugMsg && message == available)
            ++s_count;
        else
            s_previous(type, context, message);
    }

    static int s_count;
    static QtMessageHandler s_previous;
};

int Reconnections::s_count = 0;
QtMessageHandler Reconnections::s_previous = nullptr;

/** Listens at the daemon's socket, and knows no D-Bus. */
class RawSocket
{
public:
    RawSocket()
        : m_socket(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0))
    {
        QDir().mkpath(SocketFolder);
        QFile::remove(SocketPath);
        sockaddr_un address{};
        address.sun_family = AF_UNIX;
        qstrcpy(address.sun_path, SocketPath.toLatin1().constData());
        if (bind(m_socket, reinterpret_cast<const sockaddr *>(&address), sizeof address) < 0
            || listen(m_socket, 10) < 0)
            qFatal("cannot listen at the device-lock daemon's socket");
    }
    ~RawSocket()
    {
        for (const int peer : m_peers)
            close(peer);
        close(m_socket);
        QFile::remove(SocketPath);
    }
    Q_DISABLE_COPY(RawSocket)

    /** Waits for a client. */
    int accept()
    {
        m_peers.push_back(::accept4(m_socket, nullptr, nullptr, SOCK_CLOEXEC));
        return m_peers.back();
    }

private:
    const int m_socket;
    std::vector<int> m_peers;
};

} // namespace

class DeviceLockLinkTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void namesOfConnectionsNeverRepeat();
    void noConnectionOutlivesItsObject();
    void daemonThatIsNotThere();
    void daemonThatComesLater();
    void daemonThatGoesUnderACommand();
    void daemonThatRestartsAtOnce();
    void daemonThatRestartsAtAnyMoment();
    void nameWithoutASocket();
    void registrationWhileConnectedIsNothing();
    void halfOpenSocket();
    void silentSocket();
    void garbage_data();
    void garbage();

private:
    bool waitForState(const DeviceLock &lock, DeviceLock::State state) const;

    std::unique_ptr<Phone> m_phone;
    std::unique_ptr<Reconnections> m_reconnections;
};

void DeviceLockLinkTest::init()
{
    m_phone = std::make_unique<Phone>();
    m_reconnections = std::make_unique<Reconnections>();
}

void DeviceLockLinkTest::cleanup()
{
    m_phone->clearFaults();
    m_phone->startService(Service);
    m_reconnections.reset();
}

bool DeviceLockLinkTest::waitForState(const DeviceLock &lock, DeviceLock::State state) const
{
    return waitUntil([&] { return lock.state() == state; });
}

// The first, as it expects the numbers from 0 on.
void DeviceLockLinkTest::namesOfConnectionsNeverRepeat()
{
    auto first = std::make_unique<DeviceLock>();
    QVERIFY(isConnected(0) && !isConnected(1));
    auto second = std::make_unique<DeviceLock>();
    QVERIFY(isConnected(0) && isConnected(1) && !isConnected(2));

    first.reset();
    second.reset();
    QVERIFY(!isConnected(0) && !isConnected(1));

    std::vector<std::unique_ptr<DeviceLock>> many;
    for (int count = 0; count < 50; ++count)
        many.push_back(std::make_unique<DeviceLock>());
    for (uint number = 2; number < 52; ++number)
        QVERIFY2(isConnected(number), qPrintable(QString::number(number)));
    QVERIFY(!isConnected(52));

    // Each takes a new one to reconnect, too.
    for (const auto &lock : many)
        QVERIFY(waitForState(*lock, DeviceLock::Unlocked));
    m_phone->stopService(Service);
    for (const auto &lock : many)
        QVERIFY(waitForState(*lock, DeviceLock::Undefined));
    m_phone->startService(Service);
    QVERIFY(m_reconnections->waitFor(50));
    for (uint number = 52; number < 102; ++number)
        QVERIFY2(isConnected(number), qPrintable(QString::number(number)));
    QVERIFY(!isConnected(2) && !isConnected(51) && !isConnected(102));

    // Without a daemon a number is used up as well.
    many.clear();
    m_phone->stopService(Service);
    {
        const DeviceLock unconnected;
    }
    m_phone->startService(Service);
    const DeviceLock connected;
    QVERIFY(!isConnected(102) && isConnected(103));
}

void DeviceLockLinkTest::noConnectionOutlivesItsObject()
{
    {
        const DeviceLock warmUp;
        QVERIFY(waitForState(warmUp, DeviceLock::Unlocked));
    }
    const auto closeAll = [](int before) {
        return waitUntil([before] { return openFiles() <= before; });
    };
    const int before = openFiles();
    for (int count = 0; count < 100; ++count) {
        const DeviceLock lock;
        if (count % 2 == 0)
            QVERIFY(waitForState(lock, DeviceLock::Unlocked));
    }
    QVERIFY2(closeAll(before), qPrintable(QString::number(openFiles() - before)));
}

void DeviceLockLinkTest::daemonThatIsNotThere()
{
    m_phone->stopService(Service);
    MessageLog log;
    DeviceLock lock;
    SignalSequence seen(&lock);
    QCOMPARE(lock.state(), DeviceLock::Undefined);

    lock.setSecurityCode(Code);
    lock.clearDevice();
    lock.setLockoutMode(DeviceLock::ManagerLockoutOn);
    // Busy now, and no longer as soon as the event loop runs.
    QVERIFY(lock.changingSecurityCode() && lock.clearingDevice() && lock.settingLockoutMode());
    const QStringList sent{busy, QStringLiteral("clearingDeviceChanged()"),
                           QStringLiteral("settingLockoutModeChanged()")};
    QCOMPARE(seen.take(), sent);
    QVERIFY(seen.waitFor(6));
    QVERIFY(!lock.changingSecurityCode() && !lock.clearingDevice() && !lock.settingLockoutMode());
    QCOMPARE(seen.take(),
             QStringList({busy, failed, QStringLiteral("clearingDeviceChanged()"),
                          QStringLiteral("clearDeviceError()"), QStringLiteral("settingLockoutModeChanged()"),
                          QStringLiteral("lockoutModeError()")}));

    // One that supersedes another, and one whose object dies.
    lock.setSecurityCode(Code);
    lock.setSecurityCode(Code);
    QVERIFY(seen.waitFor(4));
    QCOMPARE(seen.take(), QStringList({busy, busy, busy, failed}));
    {
        DeviceLock dying;
        dying.setSecurityCode(Code);
    }
    QCOMPARE(log.takeWarnings(), QStringList());
}

void DeviceLockLinkTest::daemonThatComesLater()
{
    m_phone->stopService(Service);
    DeviceLock lock;
    SignalSequence seen(&lock);
    m_phone->startService(Service);
    QVERIFY(m_reconnections->waitFor());
    QVERIFY(waitForState(lock, DeviceLock::Unlocked));
    QVERIFY(untilCodeIsSet(lock, seen));
    QCOMPARE(seen.signalsSeen().count(QStringLiteral("stateChanged()")), 1);
}

void DeviceLockLinkTest::daemonThatGoesUnderACommand()
{
    m_phone->swallowCalls(Service, ManagementPath, SetSecurityCode);
    DeviceLock lock;
    SignalSequence seen(&lock);
    QVERIFY(waitForState(lock, DeviceLock::Unlocked));
    seen.take();
    lock.setSecurityCode(Code);
    QVERIFY(waitUntil([&] { return !m_phone->takeJournal(Service).filter(SetSecurityCode).isEmpty(); }));
    QVERIFY(lock.changingSecurityCode());
    MessageLog log;
    m_phone->stopService(Service);
    QVERIFY(seen.waitFor(4));
    QCOMPARE(ofCommands(seen.take()), QStringList({busy, busy, failed}));
    QVERIFY(!lock.changingSecurityCode());
    QCOMPARE(lock.state(), DeviceLock::Undefined);
    QCOMPARE(log.takeWarnings(), QStringList());
}

void DeviceLockLinkTest::daemonThatRestartsAtOnce()
{
    DeviceLock lock;
    SignalSequence seen(&lock);
    QVERIFY(waitForState(lock, DeviceLock::Unlocked));
    // The old link may still look alive when the name is back.
    m_phone->stopService(Service);
    m_phone->startService(Service);
    QVERIFY(m_reconnections->waitFor());
    QVERIFY(untilCodeIsSet(lock, seen));
    QVERIFY(waitForState(lock, DeviceLock::Unlocked));
}

void DeviceLockLinkTest::daemonThatRestartsAtAnyMoment()
{
    ServiceRestarts restarts(*m_phone, Service, LongestRunMicroseconds);
    DeviceLock lock;
    SignalSequence seen(&lock);
    QVERIFY(waitForState(lock, DeviceLock::Unlocked));
    QVERIFY(untilCodeIsSet(lock, seen));
    const auto isForgotten = [&lock] {
        return lock.state() == DeviceLock::Undefined && !lock.changingSecurityCode();
    };
    const int before = openFiles();
    auto log = std::make_unique<MessageLog>();
    int cutShort = 0;
    qint64 slowest = 0;
    for (int round = 0; round < restarts.rounds(); ++round) {
        // Half of the times it goes while something is asked of it.
        if (round % 2 == 0)
            lock.setSecurityCode(Code);
        restarts.stop();
        QVERIFY(waitUntil(isForgotten));

        // A run that ends at any point of being taken up...
        seen.take();
        restarts.runBriefly();
        QVERIFY(waitUntil(isForgotten));
        cutShort += seen.take().isEmpty() ? 1 : 0;

        // ... and one that lasts.
        restarts.start();
        QElapsedTimer elapsed;
        elapsed.start();
        QVERIFY(waitForState(lock, DeviceLock::Unlocked));
        slowest = qMax(slowest, elapsed.elapsed());
        QVERIFY(untilCodeIsSet(lock, seen));

        // The object still works: what happens now is told once.
        seen.take();
        m_phone->act(QStringLiteral("lock close"), {});
        QVERIFY(waitForState(lock, DeviceLock::Locked));
        m_phone->act(QStringLiteral("lock enter"), {Code});
        QVERIFY(waitForState(lock, DeviceLock::Unlocked));
        // A command is answered after all that was told before.
        const QString state = QStringLiteral("stateChanged()");
        lock.setSecurityCode(Code);
        QVERIFY(seen.waitFor(5));
        QCOMPARE(seen.take(), QStringList({state, state, busy, busy, changed}));
        restarts.endRound();
    }
    // Who was told of a daemon that had gone again by then did not reach it.
    const QStringList warnings = log->takeWarnings();
    log.reset();
    for (const QString &warning : warnings)
        QVERIFY2(warning.startsWith(connectFailed), qPrintable(warning));
    QVERIFY2(waitUntil([before] { return openFiles() <= before; }),
             qPrintable(QString::number(openFiles() - before)));
    qInfo("%s, %d runs of the daemon cut short before its state was known, slowest return %lld ms",
          qPrintable(restarts.summary()), cutShort, slowest);
}

void DeviceLockLinkTest::nameWithoutASocket()
{
    m_phone->stopService(Service);
    DeviceLock lock;
    {
        MessageLog log;
        QVERIFY(QDBusConnection::systemBus().registerService(Service));
        QVERIFY(m_reconnections->waitFor());
        QStringList warnings;
        QVERIFY(waitUntil([&] {
            warnings += log.takeWarnings();
            return !warnings.isEmpty();
        }));
        QCOMPARE(warnings.size(), 1);
        QVERIFY2(warnings.first().startsWith(connectFailed), qPrintable(warnings.first()));
        // The reason is there, and of this attempt.
        QVERIFY2(warnings.first().contains(SocketPath), qPrintable(warnings.first()));
    }
    QVERIFY(QDBusConnection::systemBus().unregisterService(Service));
    // Still usable: it tries again with the next registration.
    m_phone->startService(Service);
    QVERIFY(m_reconnections->waitFor());
    QVERIFY(waitForState(lock, DeviceLock::Unlocked));
}

void DeviceLockLinkTest::registrationWhileConnectedIsNothing()
{
    m_phone->stopService(Service);
    // A server of QtDBus in this very process: it answers what every D-Bus library answers, and no more.
    QDir().mkpath(SocketFolder);
    QDBusServer server(QStringLiteral("unix:path=") + SocketPath);
    QVERIFY(server.isConnected());
    server.setAnonymousAuthenticationAllowed(true);
    std::vector<QDBusConnection> peers;
    connect(&server, &QDBusServer::newConnection, this,
            [&peers](const QDBusConnection &peer) { peers.push_back(peer); });
    {
        DeviceLock lock;
        SignalSequence seen(&lock);
        QVERIFY(waitUntil([&] { return peers.size() == 2; }));
        MessageLog log;
        for (int round = 0; round < 3; ++round) {
            QVERIFY(QDBusConnection::systemBus().registerService(Service));
            QVERIFY(QDBusConnection::systemBus().unregisterService(Service));
        }
        // An object that nobody knows is an error, and as good as an answer that the link is the old one.
        lock.setSecurityCode(Code);
        QVERIFY(seen.waitFor(3));
        QCOMPARE(seen.take(), QStringList({busy, busy, failed}));
        QCOMPARE(peers.size(), std::size_t(2));
        QCOMPARE(m_reconnections->count(), 0);
        QCOMPARE(log.takeWarnings(), QStringList());
    }
    for (const QDBusConnection &peer : peers)
        QDBusConnection::disconnectFromPeer(peer.name());
    QFile::remove(SocketPath);
}

void DeviceLockLinkTest::halfOpenSocket()
{
    m_phone->stopService(Service);
    DeviceLock lock;
    SignalSequence seen(&lock);
    {
        // Listens, and never accepts.
        RawSocket socket;
        DeviceLock second;
        SignalSequence secondSeen(&second);
        second.setSecurityCode(Code);
        QVERIFY(second.changingSecurityCode());
        QVERIFY(QDBusConnection::systemBus().registerService(Service));
        QVERIFY(m_reconnections->waitFor());
        QVERIFY(QDBusConnection::systemBus().unregisterService(Service));
        // The connection seems to be there, and nothing blocks.
        lock.setSecurityCode(Code);
        QVERIFY(lock.changingSecurityCode());
        QCOMPARE(lock.state(), DeviceLock::Undefined);
        QCOMPARE(secondSeen.take(), QStringList(busy));
    }
    // Its end is the end of what was sent over it.
    QVERIFY(waitUntil([&] { return seen.signalsSeen().contains(failed); }));
    QVERIFY(!lock.changingSecurityCode());
    m_phone->startService(Service);
    QVERIFY(m_reconnections->waitFor());
    QVERIFY(waitForState(lock, DeviceLock::Unlocked));
}

void DeviceLockLinkTest::silentSocket()
{
    m_phone->stopService(Service);
    RawSocket socket;
    auto lock = std::make_unique<DeviceLock>();
    SignalSequence seen(lock.get());
    socket.accept();
    socket.accept();
    lock->setSecurityCode(Code);
    QVERIFY(lock->changingSecurityCode());
    QCOMPARE(lock->state(), DeviceLock::Undefined);
    // An object that waits can go.
    lock.reset();
    QCOMPARE(seen.take(), QStringList(busy));
}

void DeviceLockLinkTest::garbage_data()
{
    QTest::addColumn<QByteArray>("text");
    QTest::newRow("nothing") << QByteArray();
    QTest::newRow("not D-Bus") << QByteArray("HTTP/1.1 400 Bad Request\r\n\r\n");
    QTest::newRow("refusal") << QByteArray("REJECTED EXTERNAL\r\n");
    QTest::newRow("no end of line") << QByteArray(100000, 'x');
    QTest::newRow("bytes") << QByteArray::fromHex("00ff80fe00000000deadbeef0d0a0d0a00");
    // Agrees to the authentication, to send no message after it.
    QTest::newRow("message") << QByteArray("OK 00112233445566778899aabbccddeeff\r\nAGREE_UNIX_FD\r\n")
            + QByteArray(4096, '\xff');
    QTest::newRow("broken header") << QByteArray("OK 00112233445566778899aabbccddeeff\r\nAGREE_UNIX_FD\r\nl")
            + QByteArray(4096, '\0');
}

void DeviceLockLinkTest::garbage()
{
    QFETCH(QByteArray, text);
    m_phone->stopService(Service);
    DeviceLock lock;
    SignalSequence seen(&lock);
    {
        RawSocket socket;
        QVERIFY(QDBusConnection::systemBus().registerService(Service));
        QVERIFY(m_reconnections->waitFor());
        QVERIFY(QDBusConnection::systemBus().unregisterService(Service));
        lock.setSecurityCode(Code);
        for (int count = 0; count < 2; ++count) {
            // The two of the object, in any order.
            const int peer = socket.accept();
            QVERIFY(peer >= 0);
            QVERIFY(send(peer, text.constData(), std::size_t(text.size()), MSG_NOSIGNAL) == text.size());
            shutdown(peer, SHUT_RDWR);
        }
        QVERIFY(waitUntil([&] { return seen.signalsSeen().contains(failed); }));
    }
    QVERIFY(!lock.changingSecurityCode());
    QCOMPARE(lock.state(), DeviceLock::Undefined);

    m_phone->startService(Service);
    QVERIFY(m_reconnections->waitFor());
    QVERIFY(waitForState(lock, DeviceLock::Unlocked));
}

QTEST_GUILESS_MAIN(DeviceLockLinkTest)
#include "devicelocklink_test.moc"
