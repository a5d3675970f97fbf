// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef VELDMOBILE_CHOICEFILE_H
#define VELDMOBILE_CHOICEFILE_H

#include "simslots.h"

#include <string>

namespace VeldMobile
{

/** What is stored at @p fileName; nothing chosen when there is no such file. Problems go to @p problem. */
Choice readChoice(const std::string &fileName, std::string &problem);

/** Replaces the file as a whole. @return what went wrong, or an empty text */
std::string writeChoice(const std::string &fileName, const Choice &choice);

} // namespace VeldMobile

#endif // VELDMOBILE_CHOICEFILE_H
