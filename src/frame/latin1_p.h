// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_LATIN1_P_H
#define CORVANEMDM_LATIN1_P_H

#include <QtCore/QLatin1String>

namespace Corvane
{
namespace Mdm
{

/** A constant in every compiler's eyes: QLatin1String(const char *) counts characters, which Clang does not
 * accept. */
constexpr QLatin1String operator""_L1(const char *text, std::size_t size)
{
    return QLatin1String(text, int(size));
}

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_LATIN1_P_H
