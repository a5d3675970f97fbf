// SPDX-License-Identifier: LGPL-2.1-or-later
// Follows the rules for incoming calls, and has calls blocked for the SIM whose IMSI the command line names.
#include <corvanemdm/simvoicecallfilter.h>

#include <QtCore/QCoreApplication>
#include <QtCore/QTextStream>
#include <QtCore/QTimer>

#include <chrono>

using Corvane::Mdm::SimFilter;
using Corvane::Mdm::SimVoiceCallFilter;

int main(int argc, char **argv)
{
    QCoreApplication application(argc, argv);
    QTextStream out(stdout);
    if (argc != 2) {
        out << "usage: follow-incoming-rules IMSI\n";
        return 2;
    }

    const SimFilter::Rule wanted(QString::fromLocal8Bit(argv[1]), SimFilter::Block);
    SimVoiceCallFilter filter;
    const auto show = [&] {
        const SimFilter::RuleList rules = filter.incomingRules();
        out << rules.size() << (rules.size() == 1 ? " rule" : " rules") << " for incoming calls\n";
        for (const SimFilter::Rule &rule : rules)
            out << "    " << QString(rule) << '\n';
    };

    // The one signal that comes once for each change; the list is the service's, so it confirms our request.
    QObject::connect(&filter, &SimVoiceCallFilter::incomingRulesChanged, &application, [&] {
        show();
        if (filter.incomingRules().contains(wanted)) {
            out << "in force\n";
            application.quit();
        }
    });
    // Requests are possible once the service's rules are known; false means that nothing was sent.
    QObject::connect(&filter, &SimVoiceCallFilter::readyChanged, &application, [&] {
        if (filter.incomingRules().isEmpty())
            show();
        if (!filter.incomingRules().contains(wanted) && !filter.setIncomingRule(wanted)) {
            out << "no valid IMSI: " << wanted.imsi << '\n';
            application.exit(1);
        }
    });
    QTimer::singleShot(std::chrono::seconds(10), &application, [&] {
        out << "the telephony service did not confirm the rule\n";
        application.exit(1);
    });
    return application.exec();
}
