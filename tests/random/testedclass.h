// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_TESTEDCLASS_H
#define CORVANE_TEST_TESTEDCLASS_H

#include "randomarguments.h"

#include <QtCore/QObject>

#include <functional>
#include <tuple>
#include <type_traits>
#include <vector>

/** Something that can be done with an object. */
struct Operation {
    const char *name;
    std::function<void(QObject *object, ArgumentSource &source)> perform;
};

/** A class that is to withstand any message. */
struct TestedClass {
    const char *name;
    std::function<QObject *(QObject *parent, ArgumentSource &source)> create;
    std::vector<Operation> operations;
};

/** An object that a function has made may be deleted before it is done; other results are of no interest. */
template <typename Result> void dealWith(const Result &result, ArgumentSource &source)
{
    if constexpr (std::is_convertible_v<Result, QObject *>) {
        if (source.random.chance(20))
            delete result;
    }
}

/** Calls @p method, a member function of @p Class, with random arguments. */
template <typename Class, typename Result, typename... Arguments, typename Method>
Operation randomCall(const char *name, Method method)
{
    return {name, [method](QObject *object, ArgumentSource &source) {
                // In braces, so that the arguments are drawn in their order.
                std::tuple<std::decay_t<Arguments>...> arguments{
                    randomArgument<std::decay_t<Arguments>>(source)...};
                const auto perform = [&](auto &...each) -> Result {
                    return (static_cast<Class *>(object)->*method)(each...);
                };
                if constexpr (std::is_void_v<Result>)
                    std::apply(perform, arguments);
                else
                    dealWith(std::apply(perform, arguments), source);
            }};
}

template <typename Class, typename Result, typename... Arguments>
Operation call(const char *name, Result (Class::*method)(Arguments...))
{
    return randomCall<Class, Result, Arguments...>(name, method);
}

template <typename Class, typename Result, typename... Arguments>
Operation call(const char *name, Result (Class::*method)(Arguments...) const)
{
    return randomCall<Class, Result, Arguments...>(name, method);
}

template <typename Class> TestedClass testedClass(const char *name, std::vector<Operation> operations)
{
    return {name, [](QObject *parent, ArgumentSource &) -> QObject * { return new Class(parent); },
            std::move(operations)};
}

/** The classes that this program is about. */
const std::vector<TestedClass> &testedClasses();

#endif // CORVANE_TEST_TESTEDCLASS_H
