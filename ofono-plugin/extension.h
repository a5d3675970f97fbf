// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef VELDMOBILE_EXTENSION_H
#define VELDMOBILE_EXTENSION_H

#include "message.h"
#include "providername.h"
#include "simslots.h"

#include <list>
#include <string>

namespace VeldMobile
{

/**
 * Offers the extension interfaces on oFono's own connection, and follows its modems and SIMs.
 *
 * oFono's plug-in interface does not tell of modems that come and go, nor the number of a card. So this is a
 * client of the daemon that it is in: it listens to its signals, in the order in which everybody gets them.
 */
class Extension
{
public:
    Extension(DBusConnection *connection, const std::string &choiceFile);
    ~Extension();
    Extension(const Extension &) = delete;
    Extension &operator=(const Extension &) = delete;

private:
    struct Method;
    using Answer = std::function<void(DBusMessage *answer)>;
    struct Request {
        Extension *extension;
        DBusPendingCall *call;
        Answer answer;
    };

    static DBusHandlerResult filter(DBusConnection *, DBusMessage *message, void *extension) noexcept;
    static const Method methods[];

    // What others want of us.
    DBusHandlerResult handleCall(DBusMessage *call);
    bool offers(const Method &method, const std::string &path);
    void introspect(DBusMessage *call);
    Message getInterfaceVersion(DBusMessage *call);
    Message getAvailableModems(DBusMessage *call);
    Message getEnabledModems(DBusMessage *call);
    Message getPresentSims(DBusMessage *call);
    Message getImei(DBusMessage *call);
    Message getDefaultVoiceSim(DBusMessage *call);
    Message getDefaultDataSim(DBusMessage *call);
    Message getReady(DBusMessage *call);
    Message setEnabledModems(DBusMessage *call);
    Message setDefaultVoiceSim(DBusMessage *call);
    Message setDefaultDataSim(DBusMessage *call);
    Message getCardIdentifier(DBusMessage *call);
    Message getSubscriberIdentity(DBusMessage *call);
    Message getServiceProviderName(DBusMessage *call);
    Message setDefaultSim(DBusMessage *call, std::string Choice::*sim);
    /** Stores @p choice and makes it so, or says why not. */
    Message choose(DBusMessage *call, const Choice &choice);
    const Modem &modemOf(DBusMessage *call);

    // What we want of oFono.
    void handleSignal(DBusMessage *signal);
    void ask(const std::string &path, const char *interface, const char *member, Answer answer,
             Message call = {});
    void modemsTold(DBusMessage *answer);
    void addModem(const std::string &path, DBusMessageIter properties);
    void takeModemProperty(const std::string &path, const std::string &name, DBusMessageIter &value);
    void askForSim(const std::string &path);
    static void takeSimProperty(Modem &modem, const std::string &name, DBusMessageIter &value);
    /** Sees to it that the provider's name of each SIM is searched for. */
    void searchForProviders();
    void setOnline(const std::string &path, bool online);
    void keepDisabledOffline(const std::string &path);

    void becomeReadyWhenAllIsTold();
    /** Something may have changed: tells what is different from the last time. */
    void announce();
    template <typename... Values>
    void emitSignal(const std::string &path, const char *interface, const char *member,
                    const Values &...values);
    void send(Message message);

    DBusConnection *const m_connection;
    const std::string m_ownName;
    const std::string m_choiceFile;
    SimSlots m_slots;
    SimSlots::View m_announced;
    std::map<std::string, ProviderName> m_searches; ///< by modem, while it has an IMSI
    std::list<Request> m_requests; ///< not answered yet
    int m_openQuestions = 0; ///< before everything is known
};

} // namespace VeldMobile

#endif // VELDMOBILE_EXTENSION_H
