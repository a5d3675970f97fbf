// SPDX-License-Identifier: LGPL-2.1-or-later
#include "emulatedmodems.h"

#include "refusal.h"
#include "services/ofono.h"

#include <QtCore/QJsonArray>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fstream>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String modemInterface("org.ofono.Modem");
const QLatin1String simInterface("org.ofono.SimManager");
const QLatin1String registrationInterface("org.ofono.NetworkRegistration");

constexpr char configurationFile[] = "/run/corvane-simulator/phonesim.conf";

/** The modems are called as on the simulated phone, so that whatever runs there finds them here, too. */
QString modemName(std::size_t slot)
{
    return QStringLiteral("ril_%1").arg(slot);
}

QString modemPath(std::size_t slot)
{
    return QLatin1Char('/') + modemName(slot);
}

struct NetworkState {
    QLatin1String name;
    AtModem::Registration registration;
};

/** As oFono calls them. */
const NetworkState networkStates[] = {
    {QLatin1String("unregistered"), AtModem::NotRegistered},
    {QLatin1String("registered"), AtModem::Home},
    {QLatin1String("searching"), AtModem::Searching},
    {QLatin1String("denied"), AtModem::Denied},
    {QLatin1String("unknown"), AtModem::Unknown},
    {QLatin1String("roaming"), AtModem::Roaming},
};

/** The answer of an oFono object to "GetProperties". */
class Properties
{
public:
    explicit Properties(const Variant &reply)
    {
        if (reply && g_variant_is_of_type(reply.get(), G_VARIANT_TYPE("(a{sv})")))
            m_dictionary = Variant(g_variant_get_child_value(reply.get(), 0));
    }
    bool isOn(const char *name) const
    {
        gboolean value = FALSE;
        return m_dictionary && g_variant_lookup(m_dictionary.get(), name, "b", &value) && value;
    }
    QString text(const char *name) const
    {
        const gchar *value = nullptr;
        if (m_dictionary)
            g_variant_lookup(m_dictionary.get(), name, "&s", &value);
        return QString::fromUtf8(value);
    }
    QStringList list(const char *name) const
    {
        const gchar **values = nullptr;
        QStringList list;
        if (m_dictionary && g_variant_lookup(m_dictionary.get(), name, "^a&s", &values)) {
            for (const gchar **value = values; *value; ++value)
                list << QString::fromUtf8(*value);
            g_free(values);
        }
        return list;
    }

private:
    Variant m_dictionary;
};

} // namespace

/** Switches the modems on through oFono, and follows them until their SIMs are in use. */
class EmulatedModems::BringUp
{
public:
    BringUp(const Phone &phone, std::function<void()> done);

    QString missing() const;

private:
    struct Step {
        QString missing; ///< what the modem lacks, for people; empty when it is up
        bool isSwitchedOn = false; ///< or has refused to be: what it is counts from then on
        bool isExamined = false;
        bool isStale = false; ///< something changed while it was examined
    };

    void set(std::size_t slot, const char *property, std::function<void()> next);
    void getProperties(std::size_t slot, QLatin1String interface,
                       std::function<void(const Properties &)> next);
    void examine(std::size_t slot);
    void examineSim(std::size_t slot, const Properties &modem);
    void conclude(std::size_t slot, const QString &missing);

    const Phone &m_phone;
    std::function<void()> m_done;
    std::vector<Step> m_steps; ///< by slot
    BusConnection m_connection;
};

EmulatedModems::BringUp::BringUp(const Phone &phone, std::function<void()> done)
    : m_phone(phone)
    , m_done(std::move(done))
    , m_steps(phone.sims.size(), {QStringLiteral("is not powered"), false, false, false})
{
    m_connection.watchSignal(Ofono::serviceName, QStringLiteral("PropertyChanged"),
                             [this](const QString &path) {
                                 for (std::size_t slot = 0; slot < m_steps.size(); ++slot) {
                                     if (path == modemPath(slot))
                                         examine(slot);
                                 }
                             });
    for (std::size_t slot = 0; slot < m_steps.size(); ++slot) {
        set(slot, "Powered", [this, slot] {
            set(slot, "Online", [this, slot] {
                m_steps[slot].missing = QStringLiteral("is not examined");
                m_steps[slot].isSwitchedOn = true;
                examine(slot);
            });
        });
    }
}

QString EmulatedModems::BringUp::missing() const
{
    QStringList sentences;
    for (std::size_t slot = 0; slot < m_steps.size(); ++slot) {
        if (!m_steps[slot].missing.isEmpty())
            sentences << QStringLiteral("modem %1 %2").arg(modemPath(slot), m_steps[slot].missing);
    }
    return sentences.join(QStringLiteral(", "));
}

void EmulatedModems::BringUp::set(std::size_t slot, const char *property, std::function<void()> next)
{
    m_connection.call({Ofono::serviceName, modemPath(slot), modemInterface, QStringLiteral("SetProperty")},
                      g_variant_new("(sv)", property, g_variant_new_boolean(TRUE)),
                      [this, slot, property, next](const Variant &, const GError *error) {
                          if (error) {
                              m_steps[slot].missing = QStringLiteral("refused to be %1 (%2)")
                                                          .arg(QString::fromLatin1(property).toLower(),
                                                               QString::fromUtf8(error->message));
                              m_steps[slot].isSwitchedOn = true;
                              return;
                          }
                          next();
                      });
}

void EmulatedModems::BringUp::getProperties(std::size_t slot, QLatin1String interface,
                                            std::function<void(const Properties &)> next)
{
    m_connection.call({Ofono::serviceName, modemPath(slot), interface, QStringLiteral("GetProperties")},
                      nullptr,
                      // An interface that has just gone has no properties; its going is announced.
                      [next](const Variant &reply, const GError *) { next(Properties(reply)); });
}

void EmulatedModems::BringUp::examine(std::size_t slot)
{
    Step &step = m_steps[slot];
    if (!step.isSwitchedOn || step.missing.isEmpty())
        return;
    step.isStale = step.isExamined;
    if (step.isExamined)
        return;
    step.isExamined = true;
    getProperties(slot, modemInterface, [this, slot](const Properties &modem) {
        if (modem.list("Interfaces").contains(simInterface))
            examineSim(slot, modem);
        else
            conclude(slot, QStringLiteral("has no SIM manager"));
    });
}

void EmulatedModems::BringUp::examineSim(std::size_t slot, const Properties &modem)
{
    const Sim &card = m_phone.sims[slot];
    const bool isOnline = modem.isOn("Online");
    const bool hasRegistration = modem.list("Interfaces").contains(registrationInterface);
    getProperties(slot, simInterface, [this, slot, card, isOnline, hasRegistration](const Properties &sim) {
        const bool isLocked = sim.isOn("Present") && !sim.text("PinRequired").isEmpty()
            && sim.text("PinRequired") != QLatin1String("none");
        if (sim.isOn("Present") != card.present)
            conclude(slot, QStringLiteral("has not seen whether there is a SIM"));
        else if (!card.present || isLocked)
            conclude(slot, QString());
        else if (sim.text("SubscriberIdentity") != card.imsi || sim.list("SubscriberNumbers") != card.numbers)
            conclude(slot, QStringLiteral("has not read its SIM"));
        else if (!isOnline)
            // Somebody keeps it from the network, which is not ours to judge.
            conclude(slot, QString());
        else if (!hasRegistration)
            conclude(slot, QStringLiteral("is not registered"));
        else
            getProperties(slot, registrationInterface, [this, slot, card, sim](const Properties &network) {
                const bool isRegistered = network.text("Status") == QLatin1String("registered")
                    || network.text("Status") == QLatin1String("roaming");
                const bool hasName = sim.text("ServiceProviderName") == card.provider;
                conclude(slot,
                         !isRegistered ? QStringLiteral("is not registered")
                             : hasName ? QString()
                                       : QStringLiteral("does not know its provider's name"));
            });
    });
}

void EmulatedModems::BringUp::conclude(std::size_t slot, const QString &missing)
{
    Step &step = m_steps[slot];
    step.missing = missing;
    step.isExamined = false;
    if (missing.isEmpty()) {
        const bool isUp = std::all_of(m_steps.begin(), m_steps.end(),
                                      [](const Step &each) { return each.missing.isEmpty(); });
        // Its owner may destroy this object on it.
        if (isUp)
            std::exchange(m_done, nullptr)();
    } else if (std::exchange(step.isStale, false)) {
        examine(slot);
    }
}

EmulatedModems::EmulatedModems(Phone &phone)
    : m_phone(phone)
    , m_tray(phone, [this](std::size_t slot) { m_slots[slot]->modem.cardChanged(); })
{
    for (std::size_t slot = 0; slot < phone.sims.size(); ++slot)
        m_slots.push_back(std::make_unique<Slot>(phone.sims[slot], slot));
}

EmulatedModems::~EmulatedModems() = default;

std::map<std::string, std::string> EmulatedModems::prepare()
{
    std::ofstream file(configurationFile);
    // oFono lists first what comes last.
    for (std::size_t slot = m_slots.size(); slot-- > 0;) {
        file << '[' << modemName(slot).toStdString()
             << "]\nDriver=phonesim\nAddress=127.0.0.1\nPort=" << m_slots[slot]->port.number() << "\n\n";
    }
    if (!file.flush())
        throw std::runtime_error(std::string("cannot write ") + configurationFile + ": "
                                 + std::strerror(errno));
    return {{"OFONO_PHONESIM_CONFIG", configurationFile}};
}

void EmulatedModems::bringUp(std::function<void()> done)
{
    if (m_slots.empty()) {
        done();
        return;
    }
    m_bringUp = std::make_unique<BringUp>(m_phone, std::move(done));
}

QString EmulatedModems::missing() const
{
    return m_bringUp ? m_bringUp->missing() : QString();
}

void EmulatedModems::release()
{
    m_bringUp.reset();
}

void EmulatedModems::describe(QJsonObject &state) const
{
    QJsonArray modems;
    for (std::size_t slot = 0; slot < m_slots.size(); ++slot) {
        const AtModem &modem = m_slots[slot]->modem;
        const AtModem::Registration registration = modem.registration();
        const auto found
            = std::find_if(std::begin(networkStates), std::end(networkStates),
                           [&](const NetworkState &each) { return each.registration == registration; });
        modems << QJsonObject{
            {QStringLiteral("path"), modemPath(slot)},
            {QStringLiteral("online"), modem.isRadioOn()},
            {QStringLiteral("registration"), found->name},
        };
    }
    state.insert(QStringLiteral("sims"), m_tray.describe());
    state.insert(QStringLiteral("modems"), modems);
}

QString EmulatedModems::lockSim(const QStringList &arguments)
{
    const std::size_t slot = m_tray.slot(arguments.first());
    Sim &sim = m_tray.card(slot);
    static const QStringList known{QStringLiteral("none"), QStringLiteral("pin"), QStringLiteral("puk")};
    const QString &pin = arguments.at(1);
    if (!known.contains(pin))
        throw Refusal(QStringLiteral("\"%1\" is none of %2").arg(pin, known.join(QStringLiteral(", "))));
    // oFono asks a card what it requires when it comes, and never again by itself.
    sim.present = false;
    m_slots[slot]->modem.cardChanged();
    sim.present = true;
    sim.pin = pin;
    m_slots[slot]->modem.cardChanged();
    return QStringLiteral("The SIM in slot %1 requires \"%2\"").arg(QString::number(slot), pin);
}

QString EmulatedModems::setNetwork(const QStringList &arguments)
{
    const std::size_t slot = m_tray.slot(arguments.first());
    QStringList known;
    for (const NetworkState &state : networkStates) {
        if (arguments.at(1) == state.name) {
            m_slots[slot]->modem.setNetwork(state.registration);
            return QStringLiteral("The modem of slot %1 is told: %2").arg(slot).arg(state.name);
        }
        known << state.name;
    }
    throw Refusal(QStringLiteral("\"%1\" is no state of registration; there are %2")
                      .arg(arguments.at(1), known.join(QStringLiteral(", "))));
}

QString EmulatedModems::setTrace(const QStringList &arguments)
{
    const QString &wanted = arguments.first();
    if (wanted != QLatin1String("on") && wanted != QLatin1String("off"))
        throw Refusal(QStringLiteral("\"%1\" is neither on nor off").arg(wanted));
    for (std::size_t slot = 0; slot < m_slots.size(); ++slot)
        m_slots[slot]->port.setTraceLabel(wanted == QLatin1String("on") ? modemPath(slot) : QString());
    return QString();
}

std::vector<Action> EmulatedModems::actions()
{
    const auto bound = [this](QString (EmulatedModems::*action)(const QStringList &)) {
        return [this, action](const QStringList &arguments) {
            return (this->*action)(arguments);
        };
    };
    std::vector<Action> actions = m_tray.actions();
    const std::vector<Action> own{
        {QStringLiteral("sim lock"), QStringLiteral("SLOT none|pin|puk"),
         QStringLiteral("puts the SIM in anew, so that it requires its PIN, which is 1234, or its PUK"), 2, 2,
         bound(&EmulatedModems::lockSim)},
        {QStringLiteral("network"), QStringLiteral("SLOT STATUS"),
         QStringLiteral("what the network makes of the SIM: unregistered, registered, searching, denied, "
                        "unknown, roaming"),
         2, 2, bound(&EmulatedModems::setNetwork)},
        {QStringLiteral("modem trace"), QStringLiteral("on|off"),
         QStringLiteral("prints what oFono and the modems say to each other on standard error"), 1, 1,
         bound(&EmulatedModems::setTrace)},
    };
    actions.insert(actions.end(), own.begin(), own.end());
    return actions;
}

} // namespace Simulator
} // namespace Corvane
