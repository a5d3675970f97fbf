// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_POLICYSECTIONS_H
#define CORVANE_POLICYSECTIONS_H

#include "policysection.h"
#include "timeouts.h"

#include <memory>
#include <vector>

namespace Corvane
{
namespace Agent
{

using PolicySections = std::vector<std::unique_ptr<PolicySection>>;

/** One section for each feature family that policies know, in the order of reports. */
PolicySections makePolicySections(const Timeouts &timeouts);

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_POLICYSECTIONS_H
