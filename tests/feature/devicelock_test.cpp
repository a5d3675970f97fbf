// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"
#include "texts.h"
#include "waiting.h"

#include <corvanemdm/devicelock.h>

#include <QtCore/QDir>
#include <QtCore/QJsonArray>
#include <QtCore/QMetaEnum>
#include <QtCore/QPointer>
#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::DeviceLock;

Q_DECLARE_METATYPE(DeviceLock::ClearOptions)
Q_DECLARE_METATYPE(DeviceLock::ManagerLockoutMode)

namespace
{

const QString Service = QStringLiteral("org.veldmobile.devicelock");
const QString StatePath = QStringLiteral("/devicelock/state");
const QString StateInterface = QStringLiteral("org.veldmobile.devicelock.State");
const QString ManagementPath = QStringLiteral("/mdm");
const QString ClearDevice = QStringLiteral("ClearDevice");
const QString SetLockoutMode = QStringLiteral("SetLockoutMode");
const QString SetSecurityCode = QStringLiteral("SetSecurityCode");
const QString Code = QStringLiteral("2468");

/** One of the three commands, seen from outside. */
struct Command {
    QString method;
    QString arguments; ///< as send() sends them
    void (*send)(DeviceLock &);
    bool (DeviceLock::*isBusy)() const;
    const char *busyProperty;
    QString busyChanged;
    QString succeeded;
    QString failed;
};

const Command lockoutCommand{SetLockoutMode,
                             QStringLiteral("(uint32 1, @a{sv} {})"),
                             [](DeviceLock &lock) { lock.setLockoutMode(DeviceLock::ManagerLockoutOn); },
                             &DeviceLock::settingLockoutMode,
                             "settingLockoutMode",
                             QStringLiteral("settingLockoutModeChanged()"),
                             QStringLiteral("lockoutModeChanged()"),
                             QStringLiteral("lockoutModeError()")};
const Command clearCommand{ClearDevice,
                           QStringLiteral("(uint32 0,)"),
                           [](DeviceLock &lock) { lock.clearDevice(); },
                           &DeviceLock::clearingDevice,
                           "clearingDevice",
                           QStringLiteral("clearingDeviceChanged()"),
                           QStringLiteral("deviceCleared()"),
                           QStringLiteral("clearDeviceError()")};
const Command codeCommand{SetSecurityCode,
                          QStringLiteral("('2468',)"),
                          [](DeviceLock &lock) { lock.setSecurityCode(Code); },
                          &DeviceLock::changingSecurityCode,
                          "changingSecurityCode",
                          QStringLiteral("changingSecurityCodeChanged()"),
                          QStringLiteral("securityCodeChanged()"),
                          QStringLiteral("securityCodeChangeError()")};

} // namespace

Q_DECLARE_METATYPE(const Command *)

class DeviceLockTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void stateIsUndefinedUntilTheDaemonHasTold();
    void stateFollowsTheDaemon();
    void everyStateIsPassedOn();
    void statesThatThereAreNotAreUndefined();
    void stateWithoutAnAnswerIsUndefined_data();
    void stateWithoutAnAnswerIsUndefined();
    void answersAfterTheEndOfAnObjectAreDropped();

    void commandSucceeds_data();
    void commandSucceeds();
    void commandFails_data();
    void commandFails();
    void commandIsSuperseded_data();
    void commandIsSuperseded();
    void lateAnswerToASupersededCommandIsNotTold_data();
    void lateAnswerToASupersededCommandIsNotTold();
    void objectDiesWhileACommandRuns_data();
    void objectDiesWhileACommandRuns();
    void objectDiesInEachOfTheSignals_data();
    void objectDiesInEachOfTheSignals();
    void commandIsGivenAgainInItsOwnSignals();
    void commandsAreIndependentOfEachOther();

    void clearOptionsOnTheWire_data();
    void clearOptionsOnTheWire();
    void lockoutFeedbackOnTheWire();
    void feedbackThatCannotBeSentFails();
    void securityCodesOnTheWire();

    void clearingErasesAndShutsDown();
    void clearingEverythingRestarts();

    void metaObjectKnowsTheApi();
    void commandsThroughTheMetaObject();

private:
    void commandData();
    /** Sends a command that is answered late, and waits for that: what was late before has come then. */
    void outwaitLateAnswers();

    std::unique_ptr<Phone> m_phone;
};

void DeviceLockTest::init()
{
    m_phone = std::make_unique<Phone>();
}

void DeviceLockTest::cleanup()
{
    m_phone->clearFaults();
    if (m_phone->state().value(QStringLiteral("power")).toString() == QLatin1String("off"))
        m_phone->act(QStringLiteral("power on"), {});
    DeviceLock lock;
    SignalSequence seen(&lock);
    lock.setLockoutMode(DeviceLock::ManagerLockoutOff);
    QVERIFY(waitUntil([&] { return seen.signalsSeen().contains(lockoutCommand.succeeded); }));
    // So that the next function finds nothing in the journal that is this one's.
    QVERIFY(waitUntil([&] { return lock.state() != DeviceLock::Undefined; }));
}

void DeviceLockTest::commandData()
{
    QTest::addColumn<const Command *>("command");
    QTest::newRow("setLockoutMode") << &lockoutCommand;
    QTest::newRow("clearDevice") << &clearCommand;
    QTest::newRow("setSecurityCode") << &codeCommand;
}

void DeviceLockTest::outwaitLateAnswers()
{
    m_phone->delayCalls(Service, ManagementPath, SetLockoutMode, 400);
    DeviceLock other;
    SignalSequence seen(&other);
    other.setLockoutMode(DeviceLock::ManagerLockoutOff);
    QVERIFY(waitUntil([&] { return seen.signalsSeen().contains(lockoutCommand.succeeded); }));
}

void DeviceLockTest::stateIsUndefinedUntilTheDaemonHasTold()
{
    DeviceLock lock;
    SignalSequence seen(&lock);
    QCOMPARE(lock.state(), DeviceLock::Undefined);
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), texts({"stateChanged()"}));
    QCOMPARE(lock.state(), DeviceLock::Unlocked);
    QCOMPARE(m_phone->takeJournalWithInterfaces(Service),
             QStringList(StatePath + QLatin1Char(' ') + StateInterface + QStringLiteral(".Get ()")));
}

void DeviceLockTest::stateFollowsTheDaemon()
{
    DeviceLock lock;
    DeviceLock second;
    SignalSequence seen(&lock);
    QVERIFY(
        waitUntil([&] { return second.state() == DeviceLock::Unlocked && lock.state() == second.state(); }));
    lock.setSecurityCode(Code);
    QVERIFY(waitUntil([&] { return seen.signalsSeen().contains(codeCommand.succeeded); }));
    seen.take();

    m_phone->act(QStringLiteral("lock close"), {});
    QVERIFY(seen.waitFor(1));
    QCOMPARE(lock.state(), DeviceLock::Locked);
    m_phone->act(QStringLiteral("lock enter"), {Code});
    QVERIFY(seen.waitFor(2));
    QCOMPARE(lock.state(), DeviceLock::Unlocked);
    m_phone->act(QStringLiteral("lock close"), {});
    for (int attempt = 0; attempt < 5; ++attempt)
        m_phone->act(QStringLiteral("lock enter"), {QStringLiteral("wrong")});
    QVERIFY(seen.waitFor(4));
    QCOMPARE(lock.state(), DeviceLock::CodeEntryLockout);
    QCOMPARE(seen.take(), texts({"stateChanged()", "stateChanged()", "stateChanged()", "stateChanged()"}));

    // One object locks out, all see it.
    second.setLockoutMode(DeviceLock::ManagerLockoutOn);
    QVERIFY(seen.waitFor(1));
    QCOMPARE(lock.state(), DeviceLock::ManagerLockout);
    second.setLockoutMode(DeviceLock::ManagerLockoutOff);
    QVERIFY(seen.waitFor(2));
    QCOMPARE(lock.state(), DeviceLock::Locked);
    QCOMPARE(seen.take(), texts({"stateChanged()", "stateChanged()"}));
    m_phone->act(QStringLiteral("lock enter"), {Code});
    QVERIFY(seen.waitFor(1));
}

void DeviceLockTest::everyStateIsPassedOn()
{
    DeviceLock lock;
    SignalSequence seen(&lock);
    QVERIFY(seen.waitFor(1));
    for (uint state : {3u, 1u, 2u, 0u}) {
        seen.take();
        m_phone->sendSignal(Service, StatePath, StateInterface, QStringLiteral("Changed"), {state});
        QVERIFY(seen.waitFor(1));
        QCOMPARE(uint(lock.state()), state);
        QCOMPARE(lock.property("state").toUInt(), state);
    }
}

void DeviceLockTest::statesThatThereAreNotAreUndefined()
{
    DeviceLock lock;
    SignalSequence seen(&lock);
    QVERIFY(seen.waitFor(1));
    const auto tell = [this](const QVariant &state) {
        m_phone->sendSignal(Service, StatePath, StateInterface, QStringLiteral("Changed"), {state});
    };
    tell(5u);
    QVERIFY(seen.waitFor(2));
    QCOMPARE(lock.state(), DeviceLock::Undefined);
    // Undefined as well, of another shape, of another object, of another interface: nothing that is a change.
    tell(0xffffffffu);
    tell(QStringLiteral("1"));
    tell(1);
    m_phone->sendSignal(Service, StatePath, StateInterface, QStringLiteral("Changed"), {});
    m_phone->sendSignal(Service, ManagementPath, StateInterface, QStringLiteral("Changed"), {1u});
    m_phone->sendSignal(Service, StatePath, QStringLiteral("org.corvaneos.devicelock.DeviceManagement"),
                        QStringLiteral("Changed"), {1u});
    tell(0u);
    QVERIFY(seen.waitFor(3));
    QCOMPARE(lock.state(), DeviceLock::Unlocked);
    QCOMPARE(seen.take(), texts({"stateChanged()", "stateChanged()", "stateChanged()"}));
}

void DeviceLockTest::stateWithoutAnAnswerIsUndefined_data()
{
    QTest::addColumn<QVariantList>("answer");
    QTest::addColumn<bool>("fails");
    QTest::newRow("text") << QVariantList{QStringLiteral("0")} << false;
    QTest::newRow("signed") << QVariantList{0} << false;
    QTest::newRow("nothing") << QVariantList() << false;
    QTest::newRow("a number that is no state") << QVariantList{4711u} << false;
    QTest::newRow("error") << QVariantList() << true;
}

void DeviceLockTest::stateWithoutAnAnswerIsUndefined()
{
    QFETCH(QVariantList, answer);
    QFETCH(bool, fails);
    const QString get = QStringLiteral("Get");
    if (fails)
        m_phone->failCalls(Service, StatePath, get, QStringLiteral("com.example.Broken"), QString());
    else
        m_phone->answerCalls(Service, StatePath, get, answer);
    MessageLog log;
    DeviceLock lock;
    SignalSequence seen(&lock);
    // What the daemon announces counts all the same.
    QVERIFY(waitUntil([&] { return !m_phone->takeJournal(Service).isEmpty(); }));
    m_phone->settle(Service);
    m_phone->sendSignal(Service, StatePath, StateInterface, QStringLiteral("Changed"), {1u});
    QVERIFY(seen.waitFor(1));
    QCOMPARE(lock.state(), DeviceLock::Locked);
    QCOMPARE(seen.take(), texts({"stateChanged()"}));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void DeviceLockTest::answersAfterTheEndOfAnObjectAreDropped()
{
    m_phone->delayCalls(Service, StatePath, QStringLiteral("Get"), 50);
    for (int count = 0; count < 10; ++count)
        DeviceLock lock;
    outwaitLateAnswers();
}

void DeviceLockTest::commandSucceeds_data()
{
    commandData();
}

void DeviceLockTest::commandSucceeds()
{
    QFETCH(const Command *, command);
    // Not for real: the phone would go down.
    m_phone->answerCalls(Service, ManagementPath, command->method, {});
    DeviceLock lock;
    QVERIFY(waitUntil([&] { return lock.state() != DeviceLock::Undefined; }));
    m_phone->takeJournal(Service);
    SignalSequence seen(&lock);
    QVERIFY(!(lock.*command->isBusy)());
    QCOMPARE(lock.property(command->busyProperty), QVariant(false));

    MessageLog log;
    command->send(lock);
    QVERIFY((lock.*command->isBusy)());
    QCOMPARE(lock.property(command->busyProperty), QVariant(true));
    QCOMPARE(seen.take(), QStringList(command->busyChanged));

    QVERIFY(seen.waitFor(2));
    QVERIFY(!(lock.*command->isBusy)());
    QCOMPARE(seen.take(), QStringList({command->busyChanged, command->succeeded}));
    QCOMPARE(m_phone->takeJournalWithInterfaces(Service),
             QStringList(ManagementPath + QStringLiteral(" org.corvaneos.devicelock.DeviceManagement.")
                         + command->method + QLatin1Char(' ') + command->arguments));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void DeviceLockTest::commandFails_data()
{
    commandData();
}

void DeviceLockTest::commandFails()
{
    QFETCH(const Command *, command);
    m_phone->failCalls(Service, ManagementPath, command->method, QStringLiteral("com.example.Broken"),
                       QStringLiteral("Out of order"));
    DeviceLock lock;
    QVERIFY(waitUntil([&] { return lock.state() != DeviceLock::Undefined; }));
    SignalSequence seen(&lock);
    MessageLog log;
    command->send(lock);
    QVERIFY((lock.*command->isBusy)());
    QVERIFY(seen.waitFor(3));
    QVERIFY(!(lock.*command->isBusy)());
    QCOMPARE(seen.take(), QStringList({command->busyChanged, command->busyChanged, command->failed}));
    // The reason is not for the client.
    QCOMPARE(log.takeWarnings(), QStringList());

    // A command that failed can be given again.
    m_phone->answerCalls(Service, ManagementPath, command->method, {});
    command->send(lock);
    QVERIFY(seen.waitFor(3));
    QCOMPARE(seen.take(), QStringList({command->busyChanged, command->busyChanged, command->succeeded}));
}

void DeviceLockTest::commandIsSuperseded_data()
{
    commandData();
}

void DeviceLockTest::commandIsSuperseded()
{
    QFETCH(const Command *, command);
    DeviceLock lock;
    QVERIFY(waitUntil([&] { return lock.state() != DeviceLock::Undefined; }));
    SignalSequence seen(&lock);
    m_phone->swallowCalls(Service, ManagementPath, command->method);
    command->send(lock);
    QVERIFY(waitUntil([&] { return !m_phone->takeJournal(Service).filter(command->method).isEmpty(); }));
    m_phone->failCalls(Service, ManagementPath, command->method, QStringLiteral("com.example.Broken"),
                       QString());
    command->send(lock);
    QVERIFY((lock.*command->isBusy)());
    QVERIFY(seen.waitFor(4));
    QVERIFY(!(lock.*command->isBusy)());
    QCOMPARE(
        seen.take(),
        QStringList({command->busyChanged, command->busyChanged, command->busyChanged, command->failed}));
}

void DeviceLockTest::lateAnswerToASupersededCommandIsNotTold_data()
{
    commandData();
}

void DeviceLockTest::lateAnswerToASupersededCommandIsNotTold()
{
    QFETCH(const Command *, command);
    DeviceLock lock;
    QVERIFY(waitUntil([&] { return lock.state() != DeviceLock::Undefined; }));
    SignalSequence seen(&lock);
    // The first answer is a success that comes late, after the second, which is a failure.
    m_phone->delayCalls(Service, ManagementPath, command->method, 200);
    if (command == &clearCommand)
        lock.clearDevice(DeviceLock::ClearOptions(64)); // which the daemon refuses
    else
        command->send(lock);
    QVERIFY(waitUntil([&] { return !m_phone->takeJournal(Service).filter(command->method).isEmpty(); }));
    m_phone->failCalls(Service, ManagementPath, command->method, QStringLiteral("com.example.Broken"),
                       QString());
    command->send(lock);
    const QStringList expected{command->busyChanged, command->busyChanged, command->busyChanged,
                               command->failed};
    QVERIFY(waitUntil([&] { return seen.signalsSeen().contains(command->failed); }));
    outwaitLateAnswers();
    QStringList signalsSeen = seen.take();
    signalsSeen.removeAll(QStringLiteral("stateChanged()"));
    QCOMPARE(signalsSeen, expected);
}

void DeviceLockTest::objectDiesWhileACommandRuns_data()
{
    commandData();
}

void DeviceLockTest::objectDiesWhileACommandRuns()
{
    QFETCH(const Command *, command);
    m_phone->answerCalls(Service, ManagementPath, command->method, {});
    {
        DeviceLock lock;
        command->send(lock); // not even sent before the end, maybe
    }
    outwaitLateAnswers();
    m_phone->clearFaults();
    m_phone->delayCalls(Service, ManagementPath, command->method, 100);
    {
        DeviceLock lock;
        if (command == &clearCommand)
            lock.clearDevice(DeviceLock::ClearOptions(64));
        else
            command->send(lock);
        QVERIFY(waitUntil([&] { return !m_phone->takeJournal(Service).filter(command->method).isEmpty(); }));
    }
    outwaitLateAnswers();
}

void DeviceLockTest::objectDiesInEachOfTheSignals_data()
{
    QTest::addColumn<const Command *>("command");
    QTest::addColumn<bool>("succeeds");
    for (const Command *command : {&lockoutCommand, &clearCommand, &codeCommand}) {
        QTest::newRow(qPrintable(command->succeeded)) << command << true;
        QTest::newRow(qPrintable(command->failed)) << command << false;
    }
}

void DeviceLockTest::objectDiesInEachOfTheSignals()
{
    QFETCH(const Command *, command);
    QFETCH(bool, succeeds);
    if (succeeds)
        m_phone->answerCalls(Service, ManagementPath, command->method, {});
    else
        m_phone->failCalls(Service, ManagementPath, command->method, QStringLiteral("com.example.Broken"),
                           QString());
    for (int deadly = 1; deadly <= 3; ++deadly) {
        QPointer<DeviceLock> lock(new DeviceLock);
        int count = 0;
        const auto notice = [&lock, &count, deadly] {
            if (++count == deadly)
                delete lock;
        };
        connect(lock, &DeviceLock::settingLockoutModeChanged, notice);
        connect(lock, &DeviceLock::clearingDeviceChanged, notice);
        connect(lock, &DeviceLock::changingSecurityCodeChanged, notice);
        connect(lock, &DeviceLock::lockoutModeChanged, notice);
        connect(lock, &DeviceLock::lockoutModeError, notice);
        connect(lock, &DeviceLock::deviceCleared, notice);
        connect(lock, &DeviceLock::clearDeviceError, notice);
        connect(lock, &DeviceLock::securityCodeChanged, notice);
        connect(lock, &DeviceLock::securityCodeChangeError, notice);
        command->send(*lock);
        QVERIFY(waitUntil([&] { return !lock; }));
        QCOMPARE(count, deadly);
    }
}

void DeviceLockTest::commandIsGivenAgainInItsOwnSignals()
{
    m_phone->answerCalls(Service, ManagementPath, SetSecurityCode, {});
    DeviceLock lock;
    QVERIFY(waitUntil([&] { return lock.state() != DeviceLock::Undefined; }));
    int left = 3;
    connect(&lock, &DeviceLock::securityCodeChanged, &lock, [&] {
        if (--left > 0)
            lock.setSecurityCode(Code);
    });
    SignalSequence seen(&lock);
    lock.setSecurityCode(Code);
    QVERIFY(waitUntil([&] { return left == 0; }));
    QVERIFY(!lock.changingSecurityCode());
    QCOMPARE(seen.take().count(codeCommand.succeeded), 3);
}

void DeviceLockTest::commandsAreIndependentOfEachOther()
{
    m_phone->swallowCalls(Service, ManagementPath, ClearDevice);
    m_phone->failCalls(Service, ManagementPath, SetLockoutMode, QStringLiteral("com.example.Broken"),
                       QString());
    DeviceLock lock;
    QVERIFY(waitUntil([&] { return lock.state() != DeviceLock::Undefined; }));
    SignalSequence seen(&lock);
    lock.clearDevice();
    lock.setLockoutMode(DeviceLock::ManagerLockoutOn);
    lock.setSecurityCode(Code);
    QVERIFY(lock.clearingDevice() && lock.settingLockoutMode() && lock.changingSecurityCode());
    QVERIFY(seen.waitFor(7));
    QCOMPARE(seen.take(),
             QStringList({clearCommand.busyChanged, lockoutCommand.busyChanged, codeCommand.busyChanged,
                          lockoutCommand.busyChanged, lockoutCommand.failed, codeCommand.busyChanged,
                          codeCommand.succeeded}));
    QVERIFY(lock.clearingDevice() && !lock.settingLockoutMode() && !lock.changingSecurityCode());
}

void DeviceLockTest::clearOptionsOnTheWire_data()
{
    QTest::addColumn<DeviceLock::ClearOptions>("options");
    QTest::addColumn<QString>("arguments");
    QTest::newRow("shut down") << DeviceLock::ClearOptions(DeviceLock::ShutdownAfterClear)
                               << QStringLiteral("(uint32 0,)");
    QTest::newRow("restart") << DeviceLock::ClearOptions(DeviceLock::RebootAfterClear)
                             << QStringLiteral("(uint32 1,)");
    QTest::newRow("partitions") << DeviceLock::ClearOptions(DeviceLock::WipePartitions)
                                << QStringLiteral("(uint32 2,)");
    QTest::newRow("media") << DeviceLock::ClearOptions(DeviceLock::ClearExternalMedia)
                           << QStringLiteral("(uint32 4,)");
    QTest::newRow("all") << (DeviceLock::RebootAfterClear | DeviceLock::WipePartitions
                             | DeviceLock::ClearExternalMedia)
                         << QStringLiteral("(uint32 7,)");
}

void DeviceLockTest::clearOptionsOnTheWire()
{
    QFETCH(DeviceLock::ClearOptions, options);
    QFETCH(QString, arguments);
    m_phone->answerCalls(Service, ManagementPath, ClearDevice, {});
    DeviceLock lock;
    SignalSequence seen(&lock);
    lock.clearDevice(options);
    QVERIFY(waitUntil([&] { return seen.signalsSeen().contains(clearCommand.succeeded); }));
    QVERIFY(
        m_phone->takeJournal(Service).contains(ManagementPath + QStringLiteral(" ClearDevice ") + arguments));
}

void DeviceLockTest::lockoutFeedbackOnTheWire()
{
    DeviceLock lock;
    SignalSequence seen(&lock);
    lock.setLockoutMode(DeviceLock::ManagerLockoutOn,
                        {{QStringLiteral("message"), QStringLiteral("Call 4711 \u00fc")},
                         {QStringLiteral("number"), 7u},
                         {QStringLiteral("more"), QVariantMap{{QStringLiteral("a"), true}}}});
    QVERIFY(waitUntil([&] { return seen.signalsSeen().contains(lockoutCommand.succeeded); }));
    const QStringList calls = m_phone->takeJournal(Service).filter(SetLockoutMode);
    QCOMPARE(calls.size(), 1);
    QVERIFY2(calls.first().startsWith(QLatin1String("/mdm SetLockoutMode (uint32 1, {")),
             qPrintable(calls.first()));
    for (const char *part :
         {"'message': <'Call 4711 \u00fc'>", "'number': <uint32 7>", "'more': <{'a': <true>}>"})
        QVERIFY2(calls.first().contains(QString::fromUtf8(part)), part);

    lock.setLockoutMode(DeviceLock::ManagerLockoutOff);
    QVERIFY(waitUntil([&] { return seen.signalsSeen().count(lockoutCommand.succeeded) == 2; }));
    QCOMPARE(m_phone->takeJournal(Service).filter(SetLockoutMode),
             QStringList(QStringLiteral("/mdm SetLockoutMode (uint32 0, @a{sv} {})")));

    // A mode that there is not is the daemon's matter.
    lock.setLockoutMode(DeviceLock::ManagerLockoutMode(7));
    QVERIFY(waitUntil([&] { return seen.signalsSeen().contains(lockoutCommand.failed); }));
}

void DeviceLockTest::feedbackThatCannotBeSentFails()
{
    const QVariantMap feedback{
        {QStringLiteral("more"), QVariantList{QVariantMap{{QStringLiteral("nothing"), QVariant()}}}}};
    DeviceLock lock;
    QVERIFY(waitUntil([&] { return lock.state() != DeviceLock::Undefined; }));
    SignalSequence seen(&lock);
    lock.setLockoutMode(DeviceLock::ManagerLockoutOn, feedback);
    QVERIFY(lock.settingLockoutMode());
    QVERIFY(seen.waitFor(3));
    QVERIFY(!lock.settingLockoutMode());
    QCOMPARE(seen.take(),
             QStringList({lockoutCommand.busyChanged, lockoutCommand.busyChanged, lockoutCommand.failed}));
    QCOMPARE(m_phone->takeJournal(Service).filter(SetLockoutMode), QStringList());

    // A newer command supersedes it, and it a newer one.
    lock.setLockoutMode(DeviceLock::ManagerLockoutOn, feedback);
    lock.setLockoutMode(DeviceLock::ManagerLockoutOff);
    QVERIFY(seen.waitFor(4));
    QCOMPARE(seen.take(),
             QStringList({lockoutCommand.busyChanged, lockoutCommand.busyChanged, lockoutCommand.busyChanged,
                          lockoutCommand.succeeded}));
    lock.setLockoutMode(DeviceLock::ManagerLockoutOff);
    lock.setLockoutMode(DeviceLock::ManagerLockoutOn, feedback);
    QVERIFY(seen.waitFor(4));
    QCOMPARE(seen.take(),
             QStringList({lockoutCommand.busyChanged, lockoutCommand.busyChanged, lockoutCommand.busyChanged,
                          lockoutCommand.failed}));

    // Its object may go before it has failed.
    auto *brief = new DeviceLock;
    brief->setLockoutMode(DeviceLock::ManagerLockoutOn, feedback);
    delete brief;
    QCoreApplication::processEvents();
}

void DeviceLockTest::securityCodesOnTheWire()
{
    DeviceLock lock;
    SignalSequence seen(&lock);
    lock.setSecurityCode(QString());
    QVERIFY(waitUntil([&] { return seen.signalsSeen().contains(codeCommand.failed); }));
    const QString code = QStringLiteral("\u00e4 'quoted' \U0001f512");
    lock.setSecurityCode(code);
    QVERIFY(waitUntil([&] { return seen.signalsSeen().contains(codeCommand.succeeded); }));
    QCOMPARE(m_phone->state().value(QStringLiteral("deviceLock")).toObject().value(QStringLiteral("code")),
             QJsonValue(code));
}

void DeviceLockTest::clearingErasesAndShutsDown()
{
    const auto storage = [this] {
        return m_phone->state().value(QStringLiteral("storage")).toObject();
    };
    const QJsonArray card = storage().value(QStringLiteral("cardFiles")).toArray();
    QVERIFY(!storage().value(QStringLiteral("userFiles")).toArray().isEmpty());
    QVERIFY(!card.isEmpty());

    DeviceLock lock;
    SignalSequence seen(&lock);
    QVERIFY(seen.waitFor(1));
    seen.take();
    lock.clearDevice();
    // The answer arrives although the phone goes down.
    QVERIFY(waitUntil([&] { return lock.state() == DeviceLock::Undefined; }));
    QStringList signalsSeen = seen.take();
    QCOMPARE(signalsSeen.last(), QStringLiteral("stateChanged()"));
    signalsSeen.removeAll(QStringLiteral("stateChanged()"));
    QCOMPARE(signalsSeen,
             QStringList({clearCommand.busyChanged, clearCommand.busyChanged, clearCommand.succeeded}));
    QCOMPARE(m_phone->state().value(QStringLiteral("power")).toString(), QStringLiteral("off"));
    QCOMPARE(storage().value(QStringLiteral("userFiles")).toArray(), QJsonArray());
    QCOMPARE(storage().value(QStringLiteral("cardFiles")).toArray(), card);
    QVERIFY(QDir(QStringLiteral("/var/lib/corvane/home")).isEmpty());
    QVERIFY(lock.isHomeEncrypted());

    QTest::ignoreMessage(QtDebugMsg, "The device lock socket is available to connect to");
    m_phone->act(QStringLiteral("power on"), {});
    QVERIFY(waitUntil([&] { return lock.state() == DeviceLock::Unlocked; }));
}

void DeviceLockTest::clearingEverythingRestarts()
{
    DeviceLock lock;
    SignalSequence seen(&lock);
    QVERIFY(waitUntil([&] { return lock.state() != DeviceLock::Undefined; }));
    lock.setSecurityCode(Code);
    QVERIFY(waitUntil([&] { return seen.signalsSeen().contains(codeCommand.succeeded); }));
    QVERIFY(lock.isHomeEncrypted());

    // The phone may be up again before anybody looks.
    bool wasDown = false;
    connect(&lock, &DeviceLock::stateChanged, &lock, [&] {
        if (lock.state() == DeviceLock::Undefined)
            wasDown = true;
    });
    lock.clearDevice(DeviceLock::RebootAfterClear | DeviceLock::WipePartitions
                     | DeviceLock::ClearExternalMedia);
    QVERIFY(waitUntil([&] { return seen.signalsSeen().contains(clearCommand.succeeded); }));
    QVERIFY(waitUntil([&] { return wasDown && lock.state() == DeviceLock::Unlocked; }));
    QVERIFY(!lock.isHomeEncrypted());
    QVERIFY(QDir(QStringLiteral("/run/media/card")).isEmpty());
    const QJsonObject state = m_phone->state();
    QCOMPARE(state.value(QStringLiteral("power")).toString(), QStringLiteral("on"));
    QCOMPARE(state.value(QStringLiteral("restarts")).toInt(), 1);
    QCOMPARE(state.value(QStringLiteral("deviceLock")).toObject().value(QStringLiteral("code")).toString(),
             QString());
}

void DeviceLockTest::metaObjectKnowsTheApi()
{
    const QMetaObject &meta = DeviceLock::staticMetaObject;
    const QMetaEnum states = meta.enumerator(meta.indexOfEnumerator("State"));
    const auto valuesOf = [](const QMetaEnum &enumeration) {
        QStringList values;
        for (int i = 0; i < enumeration.keyCount(); ++i)
            values
                << QStringLiteral("%1=%2").arg(QLatin1String(enumeration.key(i))).arg(enumeration.value(i));
        return values;
    };
    QCOMPARE(valuesOf(states),
             texts({"Unlocked=0", "Locked=1", "ManagerLockout=2", "CodeEntryLockout=3", "Undefined=4"}));
    const QMetaEnum options = meta.enumerator(meta.indexOfEnumerator("ClearOptions"));
    QVERIFY(options.isFlag());
    QCOMPARE(
        valuesOf(options),
        texts({"ShutdownAfterClear=0", "RebootAfterClear=1", "WipePartitions=2", "ClearExternalMedia=4"}));
    QCOMPARE(meta.indexOfEnumerator("ManagerLockoutMode"), -1);

    // name, notify signal
    const std::pair<const char *, const char *> properties[] = {
        {"state", "stateChanged"},
        {"settingLockoutMode", "settingLockoutModeChanged"},
        {"clearingDevice", "clearingDeviceChanged"},
        {"changingSecurityCode", "changingSecurityCodeChanged"},
        {"homeEncrypted", ""},
    };
    for (const auto &[name, notify] : properties) {
        const QMetaProperty property = meta.property(meta.indexOfProperty(name));
        QVERIFY2(property.isReadable() && !property.isWritable(), name);
        QCOMPARE(property.notifySignal().name(), QByteArray(notify));
    }
    QStringList signalNames;
    for (int index = meta.methodOffset(); index < meta.methodCount(); ++index) {
        if (meta.method(index).methodType() == QMetaMethod::Signal)
            signalNames << QString::fromLatin1(meta.method(index).methodSignature());
    }
    QCOMPARE(
        signalNames,
        texts({"stateChanged()", "lockoutModeChanged()", "lockoutModeError()", "settingLockoutModeChanged()",
               "deviceCleared()", "clearDeviceError()", "clearingDeviceChanged()", "securityCodeChanged()",
               "securityCodeChangeError()", "changingSecurityCodeChanged()"}));
}

void DeviceLockTest::commandsThroughTheMetaObject()
{
    m_phone->answerCalls(Service, ManagementPath, ClearDevice, {});
    DeviceLock lock;
    SignalSequence seen(&lock);
    QVERIFY(QMetaObject::invokeMethod(&lock, "setSecurityCode", Q_ARG(QString, Code)));
    QVERIFY(QMetaObject::invokeMethod(&lock, "clearDevice"));
    QVERIFY(QMetaObject::invokeMethod(
        &lock, "setLockoutMode",
        Q_ARG(Corvane::Mdm::DeviceLock::ManagerLockoutMode, DeviceLock::ManagerLockoutOn)));
    bool encrypted = false;
    QVERIFY(QMetaObject::invokeMethod(&lock, "isHomeEncrypted", Q_RETURN_ARG(bool, encrypted)));
    QCOMPARE(lock.property("homeEncrypted"), QVariant(encrypted));
    QVERIFY(waitUntil([&] {
        return seen.signalsSeen().contains(codeCommand.succeeded)
            && seen.signalsSeen().contains(clearCommand.succeeded)
            && seen.signalsSeen().contains(lockoutCommand.succeeded);
    }));
}

QTEST_GUILESS_MAIN(DeviceLockTest)
#include "devicelock_test.moc"
