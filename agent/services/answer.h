// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_ANSWER_H
#define CORVANE_ANSWER_H

#include "reply.h"
#include "service.h"

#include <functional>

namespace Corvane
{
namespace Agent
{

/** What a service was asked for, or why it is not known. */
template <typename T> struct Answer {
    Reply reply;
    T value = T();
};

/**
 * Has @p question asked, whose failure the library tells by a warning that matches @p failures, and by
 * nothing else. A refused reply names the service, and has the reason that the warning gives.
 */
Reply ask(const Service &service, const QString &failures, const std::function<void()> &question);

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_ANSWER_H
