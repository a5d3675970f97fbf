// SPDX-License-Identifier: LGPL-2.1-or-later
#include "policysections.h"

#include "packagesection.h"
#include "proxysection.h"
#include "radiosection.h"
#include "rulesection.h"
#include "softwareupdatesection.h"

namespace Corvane
{
namespace Agent
{

PolicySections makePolicySections(const Timeouts &timeouts)
{
    PolicySections sections;
    for (const RuleFamily &family : {RuleFamily::calls(), RuleFamily::sms(), RuleFamily::data()})
        sections.push_back(std::make_unique<RuleSection>(family, timeouts.confirmation));
    sections.push_back(std::make_unique<PackageSection>(timeouts.silence));
    sections.push_back(std::make_unique<ProxySection>(timeouts.confirmation));
    for (const Radio radio : {Radio::FlightMode, Radio::WiFi})
        sections.push_back(std::make_unique<RadioSection>(radio, timeouts.confirmation));
    sections.push_back(std::make_unique<SoftwareUpdateSection>(timeouts.silence));
    return sections;
}

} // namespace Agent
} // namespace Corvane
