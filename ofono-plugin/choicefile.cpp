// SPDX-License-Identifier: LGPL-2.1-or-later
#include "choicefile.h"

#include <glib.h>

#include <memory>

namespace VeldMobile
{

namespace
{

constexpr char group[] = "SimSlots";
constexpr char voiceSimKey[] = "DefaultVoiceSim";
constexpr char dataSimKey[] = "DefaultDataSim";
constexpr char disabledModemsKey[] = "DisabledModems";

struct Free {
    void operator()(gchar *text) const { g_free(text); }
    void operator()(gchar **list) const { g_strfreev(list); }
    void operator()(GKeyFile *file) const { g_key_file_unref(file); }
};
using KeyFile = std::unique_ptr<GKeyFile, Free>;
using Text = std::unique_ptr<gchar, Free>;

std::string textOf(GError *error)
{
    const std::string text = error->message;
    g_error_free(error);
    return text;
}

std::string read(GKeyFile *file, const char *key)
{
    const Text value(g_key_file_get_string(file, group, key, nullptr));
    return value ? value.get() : std::string();
}

} // namespace

Choice readChoice(const std::string &fileName, std::string &problem)
{
    Choice choice;
    const KeyFile file(g_key_file_new());
    GError *error = nullptr;
    if (!g_key_file_load_from_file(file.get(), fileName.c_str(), G_KEY_FILE_NONE, &error)) {
        const bool isMissing = g_error_matches(error, G_FILE_ERROR, G_FILE_ERROR_NOENT);
        const std::string text = textOf(error);
        if (!isMissing)
            problem = text;
        return choice;
    }
    choice.voiceSim = read(file.get(), voiceSimKey);
    choice.dataSim = read(file.get(), dataSimKey);
    const std::unique_ptr<gchar *, Free> disabled(
        g_key_file_get_string_list(file.get(), group, disabledModemsKey, nullptr, nullptr));
    for (gchar **path = disabled.get(); path && *path; ++path)
        choice.disabledModems.insert(*path);
    return choice;
}

std::string writeChoice(const std::string &fileName, const Choice &choice)
{
    constexpr int ownersOnly = 0600; // it tells who is called with whose SIM
    const KeyFile file(g_key_file_new());
    if (!choice.voiceSim.empty())
        g_key_file_set_string(file.get(), group, voiceSimKey, choice.voiceSim.c_str());
    if (!choice.dataSim.empty())
        g_key_file_set_string(file.get(), group, dataSimKey, choice.dataSim.c_str());
    std::vector<const gchar *> disabled;
    for (const std::string &path : choice.disabledModems)
        disabled.push_back(path.c_str());
    if (!disabled.empty())
        g_key_file_set_string_list(file.get(), group, disabledModemsKey, disabled.data(), disabled.size());

    gsize length = 0;
    const Text content(g_key_file_to_data(file.get(), &length, nullptr));
    GError *error = nullptr;
    if (g_file_set_contents_full(fileName.c_str(), content.get(), gssize(length),
                                 G_FILE_SET_CONTENTS_CONSISTENT, ownersOnly, &error))
        return {};
    return textOf(error);
}

} // namespace VeldMobile
