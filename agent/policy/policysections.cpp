// SPDX-License-Identifier: LGPL-2.1-or-later
#include "policysections.h"

#include "callsection.h"
#include "softwareupdatesection.h"

namespace Corvane
{
namespace Agent
{

PolicySections makePolicySections(const Timeouts &timeouts)
{
    PolicySections sections;
    sections.push_back(std::make_unique<CallSection>(timeouts.confirmation));
    sections.push_back(std::make_unique<SoftwareUpdateSection>(timeouts.silence));
    return sections;
}

} // namespace Agent
} // namespace Corvane
