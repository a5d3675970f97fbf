// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commands.h"
#include "devicelocker.h"
#include "exitstatus.h"
#include "interruption.h"
#include "output.h"
#include "secretinput.h"
#include "service.h"
#include "wait.h"

#include <QtCore/QSysInfo>

#include <fcntl.h>
#include <iostream>
#include <string>
#include <unistd.h>

namespace Corvane
{
namespace Agent
{

using Mdm::DeviceLock;

namespace
{

const QLatin1String modeName("MODE");
const QLatin1String messageName("--message");
const QLatin1String rebootName("--reboot");
const QLatin1String partitionsName("--partitions");
const QLatin1String mediaName("--external-media");
const QLatin1String yesName("--yes");

const QString on = QStringLiteral("on");

const SecretInput &codeInput()
{
    static const SecretInput input(QStringLiteral("code"), QStringLiteral("security code"),
                                   SecretInput::Required);
    return input;
}

QString stateText(DeviceLock::State state)
{
    switch (state) {
    case DeviceLock::Unlocked:
        return QStringLiteral("The phone is unlocked.");
    case DeviceLock::Locked:
        return QStringLiteral("The phone is locked.");
    case DeviceLock::ManagerLockout:
        return QStringLiteral("The phone is locked by its manager.");
    case DeviceLock::CodeEntryLockout:
        return QStringLiteral("The phone is locked after too many wrong codes.");
    case DeviceLock::Undefined:
        break;
    }
    return QStringLiteral("The phone does not tell how it is locked.");
}

QString encryptionText(bool isEncrypted)
{
    return isEncrypted ? QStringLiteral("The user's data are encrypted.")
                       : QStringLiteral("The user's data are not encrypted.");
}

/** Tells that a command has been done. */
int report(const Reply &reply, const Values &values, const QString &text, const QJsonObject &json)
{
    if (reply.isDone())
        printResult(values, text, json);
    return conclude(reply);
}

int runStatus(DeviceLocker &locker, const Values &values)
{
    const Reply opened = locker.open();
    if (!opened.isDone())
        return conclude(opened);
    const DeviceLock &lock = locker.lock();
    const bool isEncrypted = lock.isHomeEncrypted();
    return report(opened, values, stateText(lock.state()) + QLatin1Char('\n') + encryptionText(isEncrypted),
                  {{QStringLiteral("state"), DeviceLocker::wordOf(lock.state())},
                   {QStringLiteral("homeEncrypted"), isEncrypted}});
}

int runWatch(DeviceLocker &locker, const Values &values)
{
    const Reply opened = locker.open();
    if (!opened.isDone())
        return conclude(opened);
    const EventLog log(wantsJson(values));
    const auto write = [&](const QString &event) {
        const DeviceLock::State state = locker.lock().state();
        log.write(stateText(state),
                  {{QStringLiteral("event"), event}, {QStringLiteral("state"), DeviceLocker::wordOf(state)}});
    };
    Wait wait(Service::deviceLock(), Wait::Forever, QString());
    QObject::connect(&locker.lock(), &DeviceLock::stateChanged, &wait, [&] {
        // A daemon that goes is told of by the end of the watch.
        if (locker.lock().state() != DeviceLock::Undefined)
            write(QStringLiteral("stateChanged"));
    });
    write(QStringLiteral("watching"));
    return concludeWatch(wait.run());
}

int runLockout(DeviceLocker &locker, const Values &values)
{
    const bool isOn = values.first(modeName) == on;
    return report(locker.setLockout(isOn, values.first(messageName)), values,
                  isOn ? QStringLiteral("The phone is locked by its manager.")
                       : QStringLiteral("The manager's lockout is over."),
                  {{QStringLiteral("lockout"), isOn}});
}

int runSetCode(DeviceLocker &locker, const Values &values)
{
    const SecretInput::Result code = codeInput().read(values);
    if (code.status != ExitDone)
        return code.status;
    return report(locker.setCode(code.text), values, QStringLiteral("The security code is set."),
                  {{QStringLiteral("changed"), true}});
}

DeviceLock::ClearOptions clearOptionsOf(const Values &values)
{
    DeviceLock::ClearOptions options;
    options.setFlag(DeviceLock::RebootAfterClear, values.has(rebootName));
    options.setFlag(DeviceLock::WipePartitions, values.has(partitionsName));
    options.setFlag(DeviceLock::ClearExternalMedia, values.has(mediaName));
    return options;
}

/** Asks whether the person at the keyboard means this very phone. */
Reply confirm(DeviceLock::ClearOptions options)
{
    const QString device = QSysInfo::machineHostName();
    QStringList losses{QStringLiteral("the data of its user")};
    if (options.testFlag(DeviceLock::WipePartitions))
        losses << QStringLiteral("the data partition as a whole");
    if (options.testFlag(DeviceLock::ClearExternalMedia))
        losses << QStringLiteral("memory cards");
    std::cerr << qPrintable(
        QStringLiteral(
            "This erases %1 on \"%2\", for good, and then %3.\nType the name of the device to go on: ")
            .arg(losses.join(QStringLiteral(", ")), device,
                 options.testFlag(DeviceLock::RebootAfterClear) ? QStringLiteral("restarts it")
                                                                : QStringLiteral("shuts it down")))
              << std::flush;
    // A standard input that has been closed cannot be waited for.
    if (::fcntl(STDIN_FILENO, F_GETFD) != -1 && !Interruption::waitForInput(STDIN_FILENO)) {
        std::cerr << std::endl;
        return {Reply::Interrupted, QStringLiteral("interrupted; nothing was erased")};
    }
    std::string line;
    if (!std::getline(std::cin, line) || ::isatty(STDIN_FILENO) == 0)
        std::cerr << std::endl; // which nobody has typed
    if (QString::fromLocal8Bit(line.c_str()).trimmed() == device)
        return {};
    return {Reply::Refused, QStringLiteral("that is not the name of this device; nothing was erased")};
}

int runWipe(DeviceLocker &locker, const Values &values)
{
    const DeviceLock::ClearOptions options = clearOptionsOf(values);
    if (!values.has(yesName)) {
        const Reply confirmed = confirm(options);
        if (!confirmed.isDone())
            return conclude(confirmed);
    }
    return report(locker.wipe(options), values,
                  options.testFlag(DeviceLock::RebootAfterClear)
                      ? QStringLiteral("The data are erased; the phone restarts.")
                      : QStringLiteral("The data are erased; the phone shuts down."),
                  {{QStringLiteral("erased"), true}});
}

Command command(const QString &name, const QString &summary, const QString &description,
                int (*run)(DeviceLocker &, const Values &))
{
    Command command;
    command.name = name;
    command.summary = summary;
    command.description = description;
    command.options = {jsonOption(),
                       timeoutOption(QStringLiteral(
                           "Give up when the phone has not answered after so many seconds (default: 25)"))};
    command.run = [run](const Values &values) -> int {
        const Reply running = Service::deviceLock().ensureRunning();
        if (!running.isDone())
            return conclude(running);
        DeviceLocker locker(timeoutsOf(values).confirmation);
        return run(locker, values);
    };
    return command;
}

Command lockoutCommand()
{
    Command lockout = command(
        QStringLiteral("lockout"), QStringLiteral("Keep everybody out of the phone, or let them in again"),
        QStringLiteral("MODE is on or off. No code opens a phone that its manager has locked.\n\n"
                       "Examples:\n"
                       "  mdmctl lock lockout on --message \"Lost. Please call +358 40 1234567.\"\n"
                       "  mdmctl lock lockout off\n\n"
                       "JSON: {\"lockout\": true}"),
        runLockout);
    lockout.arguments = {{modeName,
                          QStringLiteral("on or off"),
                          {on, QStringLiteral("off")},
                          {},
                          Argument::Word,
                          Argument::One}};
    lockout.options.append(
        {messageName, QStringLiteral("What the phone shows who finds it"), QStringLiteral("TEXT"), {}});
    return lockout;
}

Command wipeCommand()
{
    Command wipe = command(
        QStringLiteral("wipe"), QStringLiteral("Erase the user's data, for good, and shut the phone down"),
        QStringLiteral(
            "Says what it is going to do, and goes on when the name of the device, its host name, is "
            "typed, or\nwith --yes. The security code and all locks go with the data.\n\n"
            "JSON: {\"erased\": true}"),
        runWipe);
    wipe.options.append(
        {rebootName, QStringLiteral("Restart the phone instead of shutting it down"), {}, {}});
    wipe.options.append({partitionsName, QStringLiteral("Erase the data partition as a whole"), {}, {}});
    wipe.options.append({mediaName, QStringLiteral("Erase memory cards as well"), {}, {}});
    wipe.options.append({yesName, QStringLiteral("Do not ask"), {}, {}});
    return wipe;
}

} // namespace

Command lockCommand()
{
    Command setCode
        = command(QStringLiteral("set-code"), QStringLiteral("Set the code that unlocks the phone"),
                  QStringLiteral(
                      "Asks for the code unless it is told where that is. It is never an argument: those are "
                      "for everybody\nto see.\n\nJSON: {\"changed\": true}"),
                  runSetCode);
    setCode.options += codeInput().options();
    // Wrong usage is told before anything is looked for.
    setCode.run = [run = setCode.run](const Values &values) -> int {
        const QString fault = codeInput().fault(values);
        if (fault.isEmpty())
            return run(values);
        printError(fault);
        return ExitUsage;
    };

    Command lock;
    lock.name = QStringLiteral("lock");
    lock.summary = QStringLiteral("Show how the phone is locked, lock it and wipe it");
    lock.description = QStringLiteral("Examples:\n"
                                      "  mdmctl lock status\n"
                                      "  mdmctl lock lockout on --message \"Lost\"\n"
                                      "  mdmctl lock set-code --code-file -");
    lock.commands = {
        command(
            QStringLiteral("status"),
            QStringLiteral("Show how the phone is locked, and whether it is encrypted"),
            QStringLiteral("JSON: {\"state\": \"unlocked\", \"homeEncrypted\": true}. \"state\" is unlocked, "
                           "locked, manager-lockout,\ncode-lockout (after too many wrong codes) or unknown."),
            runStatus),
        command(
            QStringLiteral("watch"), QStringLiteral("Follow how the phone is locked"),
            QStringLiteral("Prints one line a change until it is interrupted (Ctrl-C, exit status 0).\n\n"
                           "JSON: one object a line with \"time\", \"event\" (watching at the start, then "
                           "stateChanged) and\n\"state\", as lock status has it."),
            runWatch),
        lockoutCommand(),
        setCode,
        wipeCommand(),
    };
    return lock;
}

} // namespace Agent
} // namespace Corvane
