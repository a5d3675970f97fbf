// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commandline.h"
#include "commands.h"
#include "completion.h"
#include "exitstatus.h"
#include "interruption.h"
#include "output.h"
#include "warningcapture.h"

#include <QtCore/QCoreApplication>
#include <QtCore/QEvent>

using namespace Corvane::Agent;

namespace
{

Command program()
{
    Command mdmctl;
    mdmctl.name = QStringLiteral("mdmctl");
    mdmctl.summary = QStringLiteral("Manages this phone: what it may do, and what is installed on it.");
    mdmctl.description = QStringLiteral("Examples:\n"
                                        "  mdmctl update status\n"
                                        "  mdmctl calls add dial 244051234567890 block\n"
                                        "  mdmctl install acme-mail\n"
                                        "  mdmctl flight-mode on\n"
                                        "  mdmctl policy check company-phone.json\n"
                                        "\n"
                                        "Results go to standard output, as tables or, with --json, as JSON; "
                                        "what went wrong\nand progress go to standard error. Options go "
                                        "behind the command they are for; --json may\nalso come first, as in "
                                        "\"mdmctl --json info\".\n"
                                        "\n"
                                        "Exit status:\n"
                                        "  0  done\n"
                                        "  1  refused or failed\n"
                                        "  2  wrong usage: nothing was sent\n"
                                        "  3  the service that it takes is not available");
    mdmctl.commands = {infoCommand(),
                       updateCommand(),
                       callsCommand(),
                       smsCommand(),
                       dataCommand(),
                       simCommand(),
                       callStatisticsCommand(),
                       wifiCommand(),
                       flightModeCommand(),
                       cellularCommand(),
                       apnCommand(),
                       proxyCommand(),
                       countersCommand(),
                       packagesCommand(),
                       applicationsCommand(),
                       installCommand(),
                       removeCommand(),
                       accountCommand(),
                       certificatesCommand(),
                       autostartCommand(),
                       notifyCommand(),
                       locationCommand(),
                       timeCommand(),
                       lockCommand(),
                       securityCommand(),
                       policyCommand()};
    mdmctl.commands.append(completionCommand(mdmctl));
    return mdmctl;
}

} // namespace

int main(int argc, char *argv[])
{
    WarningCapture::install("mdmctl: ");
    const QCoreApplication application(argc, argv);
    const Interruption interruption;
    const int status = runCommandLine(program(), QCoreApplication::arguments().mid(1));
    // As QCoreApplication::exec() does when it ends; here, event loops run only inside the commands.
    QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
    if (flushOutput())
        return status;
    printError(QStringLiteral("standard output cannot be written"));
    return ExitFailed;
}
