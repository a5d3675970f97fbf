// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_DRIVERNAMES_H
#define CORVANE_TEST_DRIVERNAMES_H

/** Where the subject is told what to do: by the same process that pretends to be the services. */
namespace DriverNames
{
constexpr char service[] = "org.corvaneos.stranger";
constexpr char path[] = "/";
constexpr char interface[] = "org.corvaneos.stranger.Driver";
/** -> as, words that strings may be made of. */
constexpr char words[] = "Words";
/** -> tts, seed, number of the next life, class to begin with; the class is empty at the end. */
constexpr char next[] = "Next";
/** u -> , sends so many messages, then answers. */
constexpr char emit[] = "Emit";
} // namespace DriverNames

#endif // CORVANE_TEST_DRIVERNAMES_H
