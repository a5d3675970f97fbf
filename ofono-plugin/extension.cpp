// SPDX-License-Identifier: LGPL-2.1-or-later
#include "extension.h"

#include "choicefile.h"
#include "introspection.h"

#include <ofono/dbus.h>
#include <ofono/log.h>

#include <algorithm>
#include <cstring>
#include <iterator>
#include <utility>

namespace VeldMobile
{

namespace
{

constexpr int interfaceVersion = 1;

constexpr char rootPath[] = "/";
constexpr char modemManagerInterface[] = "org.veldmobile.ofono.ModemManager";
constexpr char simInfoInterface[] = "org.veldmobile.ofono.SimInfo";
constexpr char invalidArguments[] = "org.ofono.Error.InvalidArguments";
constexpr char failed[] = "org.ofono.Error.Failed";

constexpr char getProperties[] = "GetProperties";
constexpr char setProperty[] = "SetProperty";
constexpr char propertyChanged[] = "PropertyChanged";
constexpr char introspectMember[] = "Introspect";

/** What of oFono's is listened to. */
constexpr const char *followedInterfaces[]
    = {OFONO_MANAGER_INTERFACE, OFONO_MODEM_INTERFACE, OFONO_SIM_MANAGER_INTERFACE};

std::string matchRule(const std::string &ownName, const char *interface)
{
    return "type='signal',sender='" + ownName + "',interface='" + interface + "'";
}

Message error(DBusMessage *call, const char *name, const std::string &text)
{
    return Message(dbus_message_new_error(call, name, text.c_str()));
}

template <typename... Values> Message answer(DBusMessage *call, const Values &...values)
{
    return withArguments(dbus_message_new_method_return(call), values...);
}

bool isError(DBusMessage *message)
{
    return dbus_message_get_type(message) == DBUS_MESSAGE_TYPE_ERROR;
}

/** Phones that are reached over Bluetooth are modems of oFono, too, but no slots of this phone. */
bool isOfThisPhone(const std::string &modemType)
{
    return modemType != "hfp" && modemType != "sap";
}

} // namespace

struct Extension::Method {
    const char *interface;
    const char *member;
    const char *signature;
    Message (Extension::*handle)(DBusMessage *call);
};

const Extension::Method Extension::methods[] = {
    {modemManagerInterface, "GetInterfaceVersion", "", &Extension::getInterfaceVersion},
    {modemManagerInterface, "GetAvailableModems", "", &Extension::getAvailableModems},
    {modemManagerInterface, "GetEnabledModems", "", &Extension::getEnabledModems},
    {modemManagerInterface, "GetPresentSims", "", &Extension::getPresentSims},
    {modemManagerInterface, "GetIMEI", "", &Extension::getImei},
    {modemManagerInterface, "GetDefaultVoiceSim", "", &Extension::getDefaultVoiceSim},
    {modemManagerInterface, "GetDefaultDataSim", "", &Extension::getDefaultDataSim},
    {modemManagerInterface, "GetReady", "", &Extension::getReady},
    {modemManagerInterface, "SetEnabledModems", "ao", &Extension::setEnabledModems},
    {modemManagerInterface, "SetDefaultVoiceSim", "s", &Extension::setDefaultVoiceSim},
    {modemManagerInterface, "SetDefaultDataSim", "s", &Extension::setDefaultDataSim},
    {simInfoInterface, "GetCardIdentifier", "", &Extension::getCardIdentifier},
    {simInfoInterface, "GetSubscriberIdentity", "", &Extension::getSubscriberIdentity},
    {simInfoInterface, "GetServiceProviderName", "", &Extension::getServiceProviderName},
};

Extension::Extension(DBusConnection *connection, const std::string &choiceFile)
    : m_connection(dbus_connection_ref(connection))
    , m_ownName(dbus_bus_get_unique_name(connection))
    , m_choiceFile(choiceFile)
{
    std::string problem;
    m_slots.choice = readChoice(choiceFile, problem);
    if (!problem.empty())
        ofono_warn("Cannot read the chosen SIMs: %s", problem.c_str());

    if (!dbus_connection_add_filter(m_connection, filter, this, nullptr))
        throw std::bad_alloc();
    // Without a place for the error libdbus does not wait for the bus.
    for (const char *interface : followedInterfaces)
        dbus_bus_add_match(m_connection, matchRule(m_ownName, interface).c_str(), nullptr);
    ++m_openQuestions;
    ask(OFONO_MANAGER_PATH, OFONO_MANAGER_INTERFACE, "GetModems", [this](DBusMessage *modems) {
        --m_openQuestions;
        modemsTold(modems);
    });
}

Extension::~Extension()
{
    for (const Request &request : m_requests) {
        dbus_pending_call_cancel(request.call);
        dbus_pending_call_unref(request.call);
    }
    for (const char *interface : followedInterfaces)
        dbus_bus_remove_match(m_connection, matchRule(m_ownName, interface).c_str(), nullptr);
    dbus_connection_remove_filter(m_connection, filter, this);
    dbus_connection_unref(m_connection);
}

DBusHandlerResult Extension::filter(DBusConnection *, DBusMessage *message, void *extension) noexcept
{
    auto *self = static_cast<Extension *>(extension);
    switch (dbus_message_get_type(message)) {
    case DBUS_MESSAGE_TYPE_METHOD_CALL:
        return self->handleCall(message);
    case DBUS_MESSAGE_TYPE_SIGNAL:
        self->handleSignal(message);
        break;
    default:
        break;
    }
    // Signals are for everybody.
    return DBUS_HANDLER_RESULT_NOT_YET_HANDLED;
}

DBusHandlerResult Extension::handleCall(DBusMessage *call)
{
    const char *path = dbus_message_get_path(call);
    if (!path)
        return DBUS_HANDLER_RESULT_NOT_YET_HANDLED;
    if (dbus_message_is_method_call(call, DBUS_INTERFACE_INTROSPECTABLE, introspectMember)) {
        // Our own question is for oFono.
        const bool isOurs = dbus_message_has_sender(call, m_ownName.c_str());
        if (isOurs || !(std::strcmp(path, rootPath) == 0 || m_slots.find(path)))
            return DBUS_HANDLER_RESULT_NOT_YET_HANDLED;
        introspect(call);
        return DBUS_HANDLER_RESULT_HANDLED;
    }
    for (const Method &method : methods) {
        if (!dbus_message_is_method_call(call, method.interface, method.member) || !offers(method, path))
            continue;
        Message result = dbus_message_has_signature(call, method.signature)
            ? (this->*method.handle)(call)
            : error(call, invalidArguments, "Invalid arguments in method call");
        if (!dbus_message_get_no_reply(call))
            send(std::move(result));
        // After the answer, as oFono does it.
        announce();
        return DBUS_HANDLER_RESULT_HANDLED;
    }
    return DBUS_HANDLER_RESULT_NOT_YET_HANDLED;
}

bool Extension::offers(const Method &method, const std::string &path)
{
    if (method.interface == modemManagerInterface)
        return path == rootPath;
    const Modem *modem = m_slots.find(path);
    return modem && modem->hasSimManager;
}

void Extension::introspect(DBusMessage *call)
{
    const std::string path = dbus_message_get_path(call);
    // The closure has to be copyable.
    const std::shared_ptr<DBusMessage> waiting(dbus_message_ref(call), dbus_message_unref);
    ask(path, DBUS_INTERFACE_INTROSPECTABLE, introspectMember, [this, waiting, path](DBusMessage *ofonos) {
        DBusMessageIter text;
        std::string document;
        if (!isError(ofonos) && dbus_message_iter_init(ofonos, &text))
            document = textAt(text);
        const std::size_t end = document.rfind("</node>");
        if (end == std::string::npos) {
            send(error(waiting.get(), failed, "oFono does not describe " + path));
            return;
        }
        const Modem *modem = m_slots.find(path);
        if (path == rootPath)
            document.insert(end, modemManagerIntrospection);
        else if (modem && modem->hasSimManager)
            document.insert(end, simInfoIntrospection);
        send(answer(waiting.get(), document));
    });
}

Message Extension::getInterfaceVersion(DBusMessage *call)
{
    return answer(call, interfaceVersion);
}

Message Extension::getAvailableModems(DBusMessage *call)
{
    return answer(call, ObjectPaths{m_slots.view().availableModems});
}

Message Extension::getEnabledModems(DBusMessage *call)
{
    return answer(call, ObjectPaths{m_slots.view().enabledModems});
}

Message Extension::getPresentSims(DBusMessage *call)
{
    return answer(call, m_slots.view().presentSims);
}

Message Extension::getImei(DBusMessage *call)
{
    std::vector<std::string> imeis;
    for (const auto &[path, modem] : m_slots.modems)
        imeis.push_back(modem.imei);
    return answer(call, imeis);
}

Message Extension::getDefaultVoiceSim(DBusMessage *call)
{
    return answer(call, m_slots.view().defaultVoiceSim);
}

Message Extension::getDefaultDataSim(DBusMessage *call)
{
    return answer(call, m_slots.view().defaultDataSim);
}

Message Extension::getReady(DBusMessage *call)
{
    return answer(call, m_slots.ready);
}

Message Extension::setEnabledModems(DBusMessage *call)
{
    DBusMessageIter argument;
    dbus_message_iter_init(call, &argument);
    const std::vector<std::string> wanted = textsAt(argument);
    for (const std::string &path : wanted) {
        if (!m_slots.find(path))
            return error(call, invalidArguments, "There is no modem " + path);
    }
    const std::set<std::string> before = m_slots.choice.disabledModems;
    Message result = choose(call, m_slots.choiceWithEnabled(wanted));
    for (const auto &[path, modem] : m_slots.modems) {
        keepDisabledOffline(path);
        if (before.count(path) && m_slots.isEnabled(path) && modem.powered)
            setOnline(path, true);
    }
    return result;
}

Message Extension::setDefaultVoiceSim(DBusMessage *call)
{
    return setDefaultSim(call, &Choice::voiceSim);
}

Message Extension::setDefaultDataSim(DBusMessage *call)
{
    return setDefaultSim(call, &Choice::dataSim);
}

Message Extension::setDefaultSim(DBusMessage *call, std::string Choice::*sim)
{
    DBusMessageIter argument;
    dbus_message_iter_init(call, &argument);
    const std::string imsi = textAt(argument);
    if (!imsi.empty() && !m_slots.hasSim(imsi))
        return error(call, invalidArguments, "There is no SIM " + imsi + " in the phone");
    Choice changed = m_slots.choice;
    changed.*sim = imsi;
    return choose(call, changed);
}

Message Extension::choose(DBusMessage *call, const Choice &choice)
{
    if (!(choice == m_slots.choice)) {
        const std::string problem = writeChoice(m_choiceFile, choice);
        if (!problem.empty()) {
            ofono_error("Cannot store the chosen SIMs: %s", problem.c_str());
            return error(call, failed, problem);
        }
        m_slots.choice = choice;
    }
    return answer(call);
}

Message Extension::getCardIdentifier(DBusMessage *call)
{
    return answer(call, modemOf(call).iccid);
}

Message Extension::getSubscriberIdentity(DBusMessage *call)
{
    return answer(call, modemOf(call).announcedImsi());
}

Message Extension::getServiceProviderName(DBusMessage *call)
{
    return answer(call, modemOf(call).provider);
}

const Modem &Extension::modemOf(DBusMessage *call)
{
    return *m_slots.find(dbus_message_get_path(call));
}

void Extension::handleSignal(DBusMessage *signal)
{
    const char *path = dbus_message_get_path(signal);
    if (!path || !dbus_message_has_sender(signal, m_ownName.c_str()))
        return;
    DBusMessageIter argument;
    if (dbus_message_is_signal(signal, OFONO_MANAGER_INTERFACE, "ModemAdded")) {
        if (!dbus_message_has_signature(signal, "oa{sv}"))
            return;
        dbus_message_iter_init(signal, &argument);
        const std::string added = textAt(argument);
        dbus_message_iter_next(&argument);
        addModem(added, argument);
    } else if (dbus_message_is_signal(signal, OFONO_MANAGER_INTERFACE, "ModemRemoved")) {
        if (!dbus_message_has_signature(signal, "o"))
            return;
        dbus_message_iter_init(signal, &argument);
        m_slots.modems.erase(textAt(argument));
    } else if (Modem *modem = m_slots.find(path); modem && dbus_message_has_signature(signal, "sv")) {
        DBusMessageIter value;
        dbus_message_iter_init(signal, &argument);
        const std::string name = textAt(argument);
        dbus_message_iter_next(&argument);
        dbus_message_iter_recurse(&argument, &value);
        if (dbus_message_is_signal(signal, OFONO_MODEM_INTERFACE, propertyChanged))
            takeModemProperty(path, name, value);
        else if (dbus_message_is_signal(signal, OFONO_SIM_MANAGER_INTERFACE, propertyChanged))
            takeSimProperty(*modem, name, value);
    }
    announce();
}

void Extension::ask(const std::string &path, const char *interface, const char *member, Answer answer,
                    Message call)
{
    if (!call)
        call
            = withArguments(dbus_message_new_method_call(m_ownName.c_str(), path.c_str(), interface, member));
    DBusPendingCall *pending = nullptr;
    if (!dbus_connection_send_with_reply(m_connection, call.get(), &pending, DBUS_TIMEOUT_USE_DEFAULT))
        throw std::bad_alloc();
    // There is none when the connection is closed, and then nothing is left to be done.
    if (!pending)
        return;
    Request &request = m_requests.emplace_back(Request{this, pending, std::move(answer)});
    const auto notify = [](DBusPendingCall *answered, void *data) {
        auto *self = static_cast<Request *>(data)->extension;
        const auto found = std::find_if(self->m_requests.begin(), self->m_requests.end(),
                                        [data](const Request &each) { return &each == data; });
        const Message reply(dbus_pending_call_steal_reply(answered));
        const Answer take = std::move(found->answer);
        self->m_requests.erase(found);
        take(reply.get());
        dbus_pending_call_unref(answered);
        self->announce();
    };
    if (!dbus_pending_call_set_notify(pending, notify, &request, nullptr))
        throw std::bad_alloc();
}

void Extension::modemsTold(DBusMessage *answer)
{
    if (isError(answer) || !dbus_message_has_signature(answer, "a(oa{sv})")) {
        ofono_error("oFono does not tell its modems");
        return;
    }
    DBusMessageIter list;
    DBusMessageIter element;
    dbus_message_iter_init(answer, &list);
    for (dbus_message_iter_recurse(&list, &element);
         dbus_message_iter_get_arg_type(&element) != DBUS_TYPE_INVALID; dbus_message_iter_next(&element)) {
        DBusMessageIter member;
        dbus_message_iter_recurse(&element, &member);
        const std::string path = textAt(member);
        dbus_message_iter_next(&member);
        addModem(path, member);
    }
    becomeReadyWhenAllIsTold();
}

void Extension::addModem(const std::string &path, DBusMessageIter properties)
{
    bool isSlot = true;
    DBusMessageIter searched = properties;
    forEachEntry(searched, [&](const std::string &name, DBusMessageIter &value) {
        if (name == "Type")
            isSlot = isOfThisPhone(textAt(value));
    });
    // Who listens before asking may hear of a modem twice.
    if (!isSlot || !m_slots.modems.emplace(path, Modem()).second)
        return;
    forEachEntry(properties, [&](const std::string &name, DBusMessageIter &value) {
        takeModemProperty(path, name, value);
    });
}

void Extension::takeModemProperty(const std::string &path, const std::string &name, DBusMessageIter &value)
{
    Modem &modem = *m_slots.find(path);
    if (name == "Powered") {
        modem.powered = isTrue(value);
    } else if (name == "Online") {
        modem.online = isTrue(value);
        keepDisabledOffline(path);
    } else if (name == "Serial") {
        modem.imei = textAt(value);
    } else if (name == "Interfaces") {
        const std::vector<std::string> interfaces = textsAt(value);
        const bool hasSimManager
            = std::find(interfaces.begin(), interfaces.end(), OFONO_SIM_MANAGER_INTERFACE)
            != interfaces.end();
        if (hasSimManager == modem.hasSimManager)
            return;
        modem.hasSimManager = hasSimManager;
        if (hasSimManager)
            askForSim(path);
        else
            modem.forgetSim();
    }
}

void Extension::askForSim(const std::string &path)
{
    ++m_openQuestions;
    ask(path, OFONO_SIM_MANAGER_INTERFACE, getProperties, [this, path](DBusMessage *properties) {
        --m_openQuestions;
        DBusMessageIter dictionary;
        Modem *modem = m_slots.find(path);
        // Both may have gone meanwhile.
        if (modem && modem->hasSimManager && !isError(properties)
            && dbus_message_iter_init(properties, &dictionary)) {
            forEachEntry(dictionary, [modem](const std::string &name, DBusMessageIter &value) {
                takeSimProperty(*modem, name, value);
            });
        }
        becomeReadyWhenAllIsTold();
    });
}

void Extension::takeSimProperty(Modem &modem, const std::string &name, DBusMessageIter &value)
{
    if (name == "Present") {
        modem.simPresent = isTrue(value);
        if (!modem.simPresent)
            modem.forgetSim();
    } else if (name == "SubscriberIdentity") {
        modem.imsi = textAt(value);
    } else if (name == "CardIdentifier") {
        modem.iccid = textAt(value);
    } else if (name == "ServiceProviderName") {
        modem.provider = textAt(value);
        modem.providerIsSettled = true;
    }
}

void Extension::searchForProviders()
{
    for (auto search = m_searches.begin(); search != m_searches.end();) {
        const Modem *modem = m_slots.find(search->first);
        search = modem && !modem->imsi.empty() ? std::next(search) : m_searches.erase(search);
    }
    for (const auto &[path, modem] : m_slots.modems) {
        if (modem.imsi.empty() || modem.providerIsSettled)
            continue;
        const auto settled = [this, searched = path](const std::string &name) {
            Modem &found = *m_slots.find(searched);
            found.provider = name;
            found.providerIsSettled = true;
            announce();
        };
        m_searches.try_emplace(path, path, settled).first->second.tryToAsk();
    }
}

void Extension::keepDisabledOffline(const std::string &path)
{
    if (!m_slots.isEnabled(path) && m_slots.find(path)->online)
        setOnline(path, false);
}

void Extension::setOnline(const std::string &path, bool online)
{
    Message call = withArguments(
        dbus_message_new_method_call(m_ownName.c_str(), path.c_str(), OFONO_MODEM_INTERFACE, setProperty),
        "Online");
    DBusMessageIter end;
    DBusMessageIter variant;
    dbus_message_iter_init_append(call.get(), &end);
    if (!dbus_message_iter_open_container(&end, DBUS_TYPE_VARIANT, DBUS_TYPE_BOOLEAN_AS_STRING, &variant))
        throw std::bad_alloc();
    append(variant, online);
    if (!dbus_message_iter_close_container(&end, &variant))
        throw std::bad_alloc();
    ask(
        path, OFONO_MODEM_INTERFACE, setProperty,
        [this, path, online](DBusMessage *answer) {
            if (isError(answer))
                ofono_warn("Cannot take the modem %s %s: %s", path.c_str(), online ? "online" : "offline",
                           dbus_message_get_error_name(answer));
            // It was enabled again while it was busy, and refused to go online then.
            if (!online && m_slots.find(path) && m_slots.isEnabled(path))
                setOnline(path, true);
        },
        std::move(call));
}

void Extension::becomeReadyWhenAllIsTold()
{
    if (m_openQuestions == 0)
        m_slots.ready = true;
}

void Extension::announce()
{
    searchForProviders();
    const SimSlots::View before = std::exchange(m_announced, m_slots.view());
    // Changes of ours made by what is sent here come back as messages, not as calls.
    const SimSlots::View &now = m_announced;
    if (now.availableModems != before.availableModems)
        emitSignal(rootPath, modemManagerInterface, "AvailableModemsChanged",
                   ObjectPaths{now.availableModems});
    if (now.enabledModems != before.enabledModems)
        emitSignal(rootPath, modemManagerInterface, "EnabledModemsChanged", ObjectPaths{now.enabledModems});
    for (std::size_t i = 0; i < now.presentSims.size(); ++i) {
        // A slot that is new in the list starts empty.
        const bool was = i < before.presentSims.size() && before.presentSims[i];
        if (now.presentSims[i] != was)
            emitSignal(rootPath, modemManagerInterface, "PresentSimsChanged", int(i),
                       bool(now.presentSims[i]));
    }
    for (const auto &[path, modem] : now.modems) {
        const auto found = before.modems.find(path);
        const Modem old = found == before.modems.end() ? Modem() : found->second;
        if (modem.iccid != old.iccid)
            emitSignal(path, simInfoInterface, "CardIdentifierChanged", modem.iccid);
        if (modem.provider != old.provider)
            emitSignal(path, simInfoInterface, "ServiceProviderNameChanged", modem.provider);
        if (modem.announcedImsi() != old.announcedImsi())
            emitSignal(path, simInfoInterface, "SubscriberIdentityChanged", modem.announcedImsi());
    }
    if (now.defaultVoiceSim != before.defaultVoiceSim)
        emitSignal(rootPath, modemManagerInterface, "DefaultVoiceSimChanged", now.defaultVoiceSim);
    if (now.defaultDataSim != before.defaultDataSim)
        emitSignal(rootPath, modemManagerInterface, "DefaultDataSimChanged", now.defaultDataSim);
    if (now.ready != before.ready)
        emitSignal(rootPath, modemManagerInterface, "ReadyChanged", now.ready);
}

template <typename... Values>
void Extension::emitSignal(const std::string &path, const char *interface, const char *member,
                           const Values &...values)
{
    send(withArguments(dbus_message_new_signal(path.c_str(), interface, member), values...));
}

void Extension::send(Message message)
{
    if (!dbus_connection_send(m_connection, message.get(), nullptr))
        throw std::bad_alloc();
}

} // namespace VeldMobile
