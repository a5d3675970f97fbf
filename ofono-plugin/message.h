// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef VELDMOBILE_MESSAGE_H
#define VELDMOBILE_MESSAGE_H

#include <dbus/dbus.h>

#include <functional>
#include <memory>
#include <new>
#include <string>
#include <vector>

namespace VeldMobile
{

struct MessageUnref {
    void operator()(DBusMessage *message) const { dbus_message_unref(message); }
};
using Message = std::unique_ptr<DBusMessage, MessageUnref>;

/** Object paths as an argument of a message. */
struct ObjectPaths {
    std::vector<std::string> paths;
};

void append(DBusMessageIter &end, const std::string &text);
void append(DBusMessageIter &end, const char *text);
void append(DBusMessageIter &end, bool value);
void append(DBusMessageIter &end, int value);
void append(DBusMessageIter &end, const ObjectPaths &paths);
void append(DBusMessageIter &end, const std::vector<std::string> &texts);
void append(DBusMessageIter &end, const std::vector<bool> &values);

/** @p message with @p values at its end; libdbus fails only when there is no memory left. */
template <typename... Values> Message withArguments(DBusMessage *message, const Values &...values)
{
    Message owned(message);
    if (!owned)
        throw std::bad_alloc();
    DBusMessageIter end;
    dbus_message_iter_init_append(owned.get(), &end);
    (append(end, values), ...);
    return owned;
}

/** The string or object path that @p value is; empty when it is neither. */
std::string textAt(DBusMessageIter &value);
/** Whether @p value is a boolean, and true. */
bool isTrue(DBusMessageIter &value);
/** The strings or object paths of the array that @p value is. */
std::vector<std::string> textsAt(DBusMessageIter &value);

/** Calls @p take with each entry of the a{sv} that @p dictionary is; the value is what the variant holds. */
void forEachEntry(DBusMessageIter &dictionary,
                  const std::function<void(const std::string &name, DBusMessageIter &value)> &take);

} // namespace VeldMobile

#endif // VELDMOBILE_MESSAGE_H
