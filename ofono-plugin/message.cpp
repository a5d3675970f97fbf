// SPDX-License-Identifier: LGPL-2.1-or-later
#include "message.h"

#include <new>

namespace VeldMobile
{

namespace
{

void appendBasic(DBusMessageIter &end, int type, const void *value)
{
    if (!dbus_message_iter_append_basic(&end, type, value))
        throw std::bad_alloc();
}

void appendText(DBusMessageIter &end, int type, const char *text)
{
    appendBasic(end, type, &text);
}

template <typename Append>
void appendArray(DBusMessageIter &end, const char *elementSignature, Append appendElements)
{
    DBusMessageIter array;
    if (!dbus_message_iter_open_container(&end, DBUS_TYPE_ARRAY, elementSignature, &array))
        throw std::bad_alloc();
    appendElements(array);
    if (!dbus_message_iter_close_container(&end, &array))
        throw std::bad_alloc();
}

} // namespace

void append(DBusMessageIter &end, const std::string &text)
{
    append(end, text.c_str());
}

void append(DBusMessageIter &end, const char *text)
{
    appendText(end, DBUS_TYPE_STRING, text);
}

void append(DBusMessageIter &end, bool value)
{
    const dbus_bool_t wire = value;
    appendBasic(end, DBUS_TYPE_BOOLEAN, &wire);
}

void append(DBusMessageIter &end, int value)
{
    const dbus_int32_t wire = value;
    appendBasic(end, DBUS_TYPE_INT32, &wire);
}

void append(DBusMessageIter &end, const ObjectPaths &paths)
{
    appendArray(end, DBUS_TYPE_OBJECT_PATH_AS_STRING, [&](DBusMessageIter &array) {
        for (const std::string &path : paths.paths)
            appendText(array, DBUS_TYPE_OBJECT_PATH, path.c_str());
    });
}

void append(DBusMessageIter &end, const std::vector<std::string> &texts)
{
    appendArray(end, DBUS_TYPE_STRING_AS_STRING, [&](DBusMessageIter &array) {
        for (const std::string &text : texts)
            append(array, text);
    });
}

void append(DBusMessageIter &end, const std::vector<bool> &values)
{
    appendArray(end, DBUS_TYPE_BOOLEAN_AS_STRING, [&](DBusMessageIter &array) {
        for (const bool value : values)
            append(array, value);
    });
}

std::string textAt(DBusMessageIter &value)
{
    const int type = dbus_message_iter_get_arg_type(&value);
    if (type != DBUS_TYPE_STRING && type != DBUS_TYPE_OBJECT_PATH)
        return {};
    const char *text = nullptr;
    dbus_message_iter_get_basic(&value, &text);
    return text;
}

bool isTrue(DBusMessageIter &value)
{
    dbus_bool_t wire = FALSE;
    if (dbus_message_iter_get_arg_type(&value) == DBUS_TYPE_BOOLEAN)
        dbus_message_iter_get_basic(&value, &wire);
    return wire;
}

std::vector<std::string> textsAt(DBusMessageIter &value)
{
    std::vector<std::string> texts;
    if (dbus_message_iter_get_arg_type(&value) != DBUS_TYPE_ARRAY)
        return texts;
    DBusMessageIter element;
    for (dbus_message_iter_recurse(&value, &element);
         dbus_message_iter_get_arg_type(&element) != DBUS_TYPE_INVALID; dbus_message_iter_next(&element))
        texts.push_back(textAt(element));
    return texts;
}

void forEachEntry(DBusMessageIter &dictionary,
                  const std::function<void(const std::string &, DBusMessageIter &)> &take)
{
    if (dbus_message_iter_get_arg_type(&dictionary) != DBUS_TYPE_ARRAY
        || dbus_message_iter_get_element_type(&dictionary) != DBUS_TYPE_DICT_ENTRY)
        return;
    DBusMessageIter entry;
    for (dbus_message_iter_recurse(&dictionary, &entry);
         dbus_message_iter_get_arg_type(&entry) != DBUS_TYPE_INVALID; dbus_message_iter_next(&entry)) {
        DBusMessageIter member;
        dbus_message_iter_recurse(&entry, &member);
        const std::string name = textAt(member);
        dbus_message_iter_next(&member);
        if (dbus_message_iter_get_arg_type(&member) != DBUS_TYPE_VARIANT)
            continue;
        DBusMessageIter value;
        dbus_message_iter_recurse(&member, &value);
        take(name, value);
    }
}

} // namespace VeldMobile
