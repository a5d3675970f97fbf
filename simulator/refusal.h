// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_REFUSAL_H
#define CORVANE_SIMULATOR_REFUSAL_H

#include "busconnection.h"
#include "controlnames.h"

namespace Corvane
{
namespace Simulator
{

/** A request to the control interface that is refused, with a sentence that says what would be right. */
class Refusal : public MethodError
{
public:
    explicit Refusal(const QString &sentence)
        : MethodError(QLatin1String(ControlNames::refusal), sentence)
    {
    }
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_REFUSAL_H
