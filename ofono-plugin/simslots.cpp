// SPDX-License-Identifier: LGPL-2.1-or-later
#include "simslots.h"

#include <algorithm>
#include <cstring>

namespace VeldMobile
{

bool PathOrder::operator()(const std::string &left, const std::string &right) const
{
    return strverscmp(left.c_str(), right.c_str()) < 0;
}

void Modem::forgetSim()
{
    simPresent = false;
    imsi.clear();
    iccid.clear();
    provider.clear();
    providerIsSettled = false;
}

const std::string &Modem::announcedImsi() const
{
    static const std::string none;
    return providerIsSettled ? imsi : none;
}

Modem *SimSlots::find(const std::string &path)
{
    const auto found = modems.find(path);
    return found == modems.end() ? nullptr : &found->second;
}

bool SimSlots::hasSim(const std::string &imsi) const
{
    return !imsi.empty() && std::any_of(modems.begin(), modems.end(), [&](const auto &each) {
        return each.second.imsi == imsi;
    });
}

Choice SimSlots::choiceWithEnabled(const std::vector<std::string> &enabled) const
{
    Choice changed = choice;
    for (const auto &[path, modem] : modems) {
        if (std::find(enabled.begin(), enabled.end(), path) != enabled.end())
            changed.disabledModems.erase(path);
        else
            changed.disabledModems.insert(path);
    }
    return changed;
}

SimSlots::View SimSlots::view() const
{
    View view;
    view.ready = ready;
    view.modems = modems;
    for (const auto &[path, modem] : modems) {
        view.availableModems.push_back(path);
        view.presentSims.push_back(modem.simPresent);
        if (isEnabled(path))
            view.enabledModems.push_back(path);
    }
    view.defaultVoiceSim = effectiveSim(choice.voiceSim);
    view.defaultDataSim = effectiveSim(choice.dataSim);
    return view;
}

std::string SimSlots::effectiveSim(const std::string &chosen) const
{
    std::string first;
    for (const auto &[path, modem] : modems) {
        if (!isEnabled(path) || modem.announcedImsi().empty())
            continue;
        if (modem.announcedImsi() == chosen)
            return chosen;
        if (first.empty())
            first = modem.announcedImsi();
    }
    return first;
}

} // namespace VeldMobile
