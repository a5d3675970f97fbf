// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef VELDMOBILE_SIMSLOTS_H
#define VELDMOBILE_SIMSLOTS_H

#include <map>
#include <set>
#include <string>
#include <vector>

namespace VeldMobile
{

/** Orders "/modem_10" after "/modem_9". */
struct PathOrder {
    bool operator()(const std::string &left, const std::string &right) const;
};

/** What oFono tells of one modem. */
struct Modem {
    std::string imei;
    bool powered = false;
    bool online = false;
    bool hasSimManager = false;
    bool simPresent = false;
    std::string imsi;
    std::string iccid;
    std::string provider;
    bool providerIsSettled = false; ///< its name is known, or that the card has none

    void forgetSim();
    /** The IMSI once everything else is known: who waits for it finds the rest. */
    const std::string &announcedImsi() const;
};

/** What was chosen, and is kept over restarts. */
struct Choice {
    std::string voiceSim; ///< IMSI; empty: the first
    std::string dataSim;
    std::set<std::string> disabledModems; ///< so that a modem which is new is enabled

    bool operator==(const Choice &other) const
    {
        return voiceSim == other.voiceSim && dataSim == other.dataSim
            && disabledModems == other.disabledModems;
    }
};

/** The SIM slots of the phone: modems and choice as they are, and what follows from them. */
class SimSlots
{
public:
    /** All that is announced. */
    struct View {
        std::vector<std::string> availableModems;
        std::vector<std::string> enabledModems;
        std::vector<bool> presentSims;
        std::string defaultVoiceSim;
        std::string defaultDataSim;
        std::map<std::string, Modem, PathOrder> modems;
        bool ready = false;
    };

    std::map<std::string, Modem, PathOrder> modems; ///< by path
    Choice choice;
    bool ready = false; ///< every modem that was there at the start has been looked into

    Modem *find(const std::string &path);
    bool isEnabled(const std::string &path) const { return choice.disabledModems.count(path) == 0; }
    /** Whether it is in the phone, announced or not. */
    bool hasSim(const std::string &imsi) const;
    /** @p choice with exactly @p enabled enabled among the modems that are there. */
    Choice choiceWithEnabled(const std::vector<std::string> &enabled) const;
    View view() const;

private:
    std::string effectiveSim(const std::string &chosen) const;
};

} // namespace VeldMobile

#endif // VELDMOBILE_SIMSLOTS_H
