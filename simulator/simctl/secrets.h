// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_SECRETS_H
#define CORVANE_SIMULATOR_SECRETS_H

#include <string>

namespace Corvane
{
namespace Simulator
{

/** A method call as the journal has it. */
struct JournalCall {
    std::string interface;
    std::string member;
    std::string signature;
    std::string arguments; ///< GVariant text
};

/**
 * The arguments of @p call with '***' in the place of secrets: of arguments that the contract calls so, and
 * of values that are named as passwords are, in a dictionary or behind their name.
 */
std::string argumentsWithoutSecrets(const JournalCall &call);

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_SECRETS_H
