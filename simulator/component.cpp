// SPDX-License-Identifier: LGPL-2.1-or-later
#include "component.h"

#include <algorithm>

namespace Corvane
{
namespace Simulator
{

namespace
{
std::vector<ComponentType> &registered()
{
    static std::vector<ComponentType> types;
    return types;
}
} // namespace

ComponentRegistration::ComponentRegistration(ComponentType type)
{
    std::vector<ComponentType> &types = registered();
    const auto after
        = std::upper_bound(types.begin(), types.end(), type,
                           [](const auto &left, const auto &right) { return left.service < right.service; });
    types.insert(after, std::move(type));
}

const std::vector<ComponentType> &ComponentRegistration::all()
{
    return registered();
}

} // namespace Simulator
} // namespace Corvane
