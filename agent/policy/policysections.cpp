// SPDX-License-Identifier: LGPL-2.1-or-later
#include "policysections.h"

#include "accountsection.h"
#include "autostartsection.h"
#include "cellularsection.h"
#include "certificatesection.h"
#include "devicelocksection.h"
#include "devicesettingssection.h"
#include "packagesection.h"
#include "proxysection.h"
#include "radiosection.h"
#include "rulesection.h"
#include "securitysection.h"
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
    for (const Radio radio : {Radio::FlightMode, Radio::WiFi})
        sections.push_back(std::make_unique<RadioSection>(radio, timeouts.confirmation));
    sections.push_back(std::make_unique<CellularSection>(timeouts.confirmation));
    sections.push_back(std::make_unique<ProxySection>(timeouts.confirmation));
    sections.push_back(std::make_unique<AccountSection>());
    sections.push_back(std::make_unique<CertificateSection>(timeouts.confirmation));
    sections.push_back(std::make_unique<AutostartSection>());
    sections.push_back(std::make_unique<DeviceSettingsSection>(QStringLiteral("location"),
                                                               makeLocationSettings, timeouts.confirmation));
    sections.push_back(std::make_unique<DeviceSettingsSection>(QStringLiteral("time"), makeClockSettings,
                                                               timeouts.confirmation));
    sections.push_back(std::make_unique<DeviceLockSection>(timeouts.confirmation));
    sections.push_back(std::make_unique<SecuritySection>(timeouts.silence));
    sections.push_back(std::make_unique<SoftwareUpdateSection>(timeouts.silence));
    return sections;
}

} // namespace Agent
} // namespace Corvane
