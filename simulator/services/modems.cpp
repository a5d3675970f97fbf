// SPDX-License-Identifier: LGPL-2.1-or-later
#include "component.h"
#include "modem.h"
#include "modemmanager.h"
#include "ofono.h"
#include "refusal.h"
#include "service.h"
#include "simtray.h"

#include <QtCore/QJsonArray>
#include <QtCore/QSet>

#include <algorithm>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String managerPath("/");
const QLatin1String managerInterface("org.ofono.Manager");

// The words that the telephony daemon documents.
const QStringList &pinStates()
{
    static const QStringList words{
        QStringLiteral("none"),       QStringLiteral("pin"),           QStringLiteral("phone"),
        QStringLiteral("firstphone"), QStringLiteral("pin2"),          QStringLiteral("network"),
        QStringLiteral("netsub"),     QStringLiteral("service"),       QStringLiteral("corp"),
        QStringLiteral("puk"),        QStringLiteral("firstphonepuk"), QStringLiteral("puk2"),
        QStringLiteral("networkpuk"), QStringLiteral("netsubpuk"),     QStringLiteral("servicepuk"),
        QStringLiteral("corppuk"),
    };
    return words;
}

const QStringList &registrationStates()
{
    static const QStringList words{QStringLiteral("unregistered"), QStringLiteral("registered"),
                                   QStringLiteral("searching"),    QStringLiteral("denied"),
                                   QStringLiteral("unknown"),      QStringLiteral("roaming")};
    return words;
}

void checkWord(const QString &word, const QStringList &known)
{
    if (!known.contains(word))
        throw Refusal(QStringLiteral("\"%1\" is none of %2").arg(word, known.join(QStringLiteral(", "))));
}

bool isOn(const QString &word)
{
    checkWord(word, {QStringLiteral("on"), QStringLiteral("off")});
    return word == QLatin1String("on");
}

class Modems : public Component
{
public:
    Modems(const QJsonObject &profile, Phone &phone);
    ~Modems() override;

    void attach(Service &service) override;
    void detach() override;
    void describe(QJsonObject &state) const override;
    std::vector<Action> actions() override;

private:
    void announce();
    void offerLinks();
    bool switchContext(const QString &contextPath, bool isActive);
    QString lockSim(const QStringList &arguments);
    QString changeSim(const QString &slotText, const std::function<void(Sim &)> &change);
    QString chooseSim(const QStringList &arguments);
    QString setModemThere(const QString &slotText, bool isThere);
    QString setModemEnabled(const QString &slotText, bool enabled);
    QString setRegistration(const QStringList &arguments);

    Phone &m_phone;
    const SimTray m_tray;
    ContextStore m_contexts;
    ModemList m_modems; ///< by slot
    ModemManager m_manager;
    Service *m_service = nullptr;
};

ModemList createModems(const QJsonObject &profile, const Phone &phone, ContextStore &contexts,
                       const std::function<void()> &changed)
{
    ModemList modems;
    const QJsonArray slotProfiles = profile.value(QLatin1String("sims")).toArray();
    for (std::size_t slot = 0; slot < phone.sims.size(); ++slot) {
        modems.push_back(std::make_unique<Modem>(slot, phone.sims[slot],
                                                 slotProfiles.at(int(slot)).toObject(), contexts, changed));
    }
    return modems;
}

Modems::Modems(const QJsonObject &profile, Phone &phone)
    : m_phone(phone)
    , m_tray(phone, [this](std::size_t) { announce(); })
    , m_contexts(profile.value(QLatin1String("sims")).toArray())
    , m_modems(createModems(profile, phone, m_contexts, [this] { announce(); }))
    , m_manager(m_modems, profile.value(QLatin1String("telephony")).toObject(), [this] { announce(); })
{
    m_phone.cellularLinks.setActivator(
        [this](const QString &contextPath, bool isActive) { return switchContext(contextPath, isActive); });
    m_phone.cellularLinks.watchFlightMode([this](bool isOn) {
        for (const std::unique_ptr<Modem> &modem : m_modems)
            modem->setOnline(!isOn);
        announce();
    });
    for (const std::unique_ptr<Modem> &modem : m_modems)
        modem->setExtended(m_manager.isOffered());
}

Modems::~Modems()
{
    m_phone.cellularLinks.setActivator(nullptr);
    m_phone.cellularLinks.watchFlightMode(nullptr);
}

void Modems::attach(Service &service)
{
    m_service = &service;
    service.addObject(managerPath, managerInterface,
                      {
                          {QStringLiteral("GetModems"),
                           [this](MethodCall &call) {
                               GVariantBuilder modems;
                               g_variant_builder_init(&modems, G_VARIANT_TYPE("a(oa{sv})"));
                               for (const std::unique_ptr<Modem> &modem : m_modems) {
                                   if (modem->isThere())
                                       g_variant_builder_add(&modems, "(o@a{sv})",
                                                             modem->path().toUtf8().constData(),
                                                             toVariant(modem->properties()));
                               }
                               call.reply(g_variant_new("(a(oa{sv}))", &modems));
                           }},
                      });
    for (const std::unique_ptr<Modem> &modem : m_modems)
        modem->attach(service);
    m_manager.attach(service);
    offerLinks();
}

void Modems::detach()
{
    for (const std::unique_ptr<Modem> &modem : m_modems)
        modem->detach();
    m_manager.detach();
    m_service = nullptr;
    offerLinks();
}

/** Makes every interface tell what has changed. */
void Modems::announce()
{
    m_manager.announce();
    for (const std::unique_ptr<Modem> &modem : m_modems)
        modem->announce();
    // A default SIM is one whose IMSI has been told.
    m_manager.announceDefaults();
    offerLinks();
}

/** Tells the connection manager what it can make networks of. */
void Modems::offerLinks()
{
    CellularLinks::Links links;
    for (const std::unique_ptr<Modem> &modem : m_modems) {
        const CellularLinks::Links ofModem = m_service ? modem->links() : CellularLinks::Links();
        links.insert(links.end(), ofModem.begin(), ofModem.end());
    }
    m_phone.cellularLinks.offer(links);
}

/** As the connection manager does. */
bool Modems::switchContext(const QString &contextPath, bool isActive)
{
    const int nameBegins = contextPath.lastIndexOf(QLatin1Char('/')) + 1;
    for (const std::unique_ptr<Modem> &modem : m_modems) {
        if (!m_service || modem->path() != contextPath.left(nameBegins - 1))
            continue;
        try {
            modem->mobileData().activate(contextPath.mid(nameBegins), isActive);
        } catch (const MethodError &) {
            return false;
        }
        announce();
        return true;
    }
    return false;
}

void Modems::describe(QJsonObject &state) const
{
    state.insert(QStringLiteral("sims"), m_tray.describe());

    QJsonArray modems;
    for (const std::unique_ptr<Modem> &modem : m_modems)
        modems << modem->describe();
    state.insert(QStringLiteral("modems"), modems);
    state.insert(QStringLiteral("telephony"), m_manager.describe());
}

QString Modems::lockSim(const QStringList &arguments)
{
    const std::size_t index = m_tray.slot(arguments.at(0));
    const QString pin = arguments.at(1);
    checkWord(pin, pinStates());
    Sim &sim = m_tray.card(index);
    const bool wasUsable = sim.isUsable();
    sim.pin = pin;
    if (wasUsable && !sim.isUsable()) {
        // Nothing locks a card in use; it asks for its PIN when it starts anew.
        sim.present = false;
        announce();
        sim.present = true;
    }
    announce();
    return QStringLiteral("The SIM in slot %1 requires \"%2\"").arg(QString::number(index), pin);
}

QString Modems::changeSim(const QString &slotText, const std::function<void(Sim &)> &change)
{
    change(m_phone.sims[m_tray.slot(slotText)]);
    announce();
    return QString();
}

QString Modems::chooseSim(const QStringList &arguments)
{
    checkWord(arguments.at(0), {QStringLiteral("voice"), QStringLiteral("data")});
    const std::size_t index = m_tray.slot(arguments.at(1));
    const Sim &sim = m_phone.sims[index];
    if (!sim.isUsable())
        throw Refusal(QStringLiteral("There is no SIM in slot %1 that could be used").arg(index));
    if (arguments.at(0) == QLatin1String("voice"))
        m_manager.chooseVoiceSim(sim.imsi);
    else
        m_manager.chooseDataSim(sim.imsi);
    announce();
    return QStringLiteral("The SIM %1 is the %2 SIM").arg(sim.imsi, arguments.at(0));
}

QString Modems::setModemThere(const QString &slotText, bool isThere)
{
    const std::size_t index = m_tray.slot(slotText);
    Modem &modem = *m_modems[index];
    if (modem.isThere() == isThere) {
        throw Refusal(isThere ? QStringLiteral("The modem of slot %1 is there").arg(index)
                              : QStringLiteral("The modem of slot %1 is away").arg(index));
    }
    modem.setThere(isThere);
    const QString path = modem.path();
    // Who hears of the modem finds it.
    modem.announce();
    if (m_service) {
        const QString member = isThere ? QStringLiteral("ModemAdded") : QStringLiteral("ModemRemoved");
        m_service->emitSignal(
            managerPath, managerInterface, member,
            isThere ? g_variant_new("(o@a{sv})", path.toUtf8().constData(), toVariant(modem.properties()))
                    : g_variant_new("(o)", path.toUtf8().constData()));
    }
    announce();
    return QString();
}

QString Modems::setModemEnabled(const QString &slotText, bool enabled)
{
    m_modems[m_tray.slot(slotText)]->setEnabled(enabled);
    announce();
    return QString();
}

QString Modems::setRegistration(const QStringList &arguments)
{
    const std::size_t index = m_tray.slot(arguments.at(0));
    checkWord(arguments.at(1), registrationStates());
    m_modems[index]->setRegistration(arguments.at(1));
    announce();
    return QString();
}

std::vector<Action> Modems::actions()
{
    std::vector<Action> actions = m_tray.actions();
    const std::vector<Action> own{
        {QStringLiteral("sim lock"), QStringLiteral("SLOT PIN-STATE"),
         QStringLiteral("makes the SIM require a PIN (pin), an unblocking key (puk)... or none"), 2, 2,
         [this](const QStringList &arguments) {
             return lockSim(arguments);
         }},
        {QStringLiteral("sim default"), QStringLiteral("voice|data SLOT"),
         QStringLiteral("chooses the SIM for calls or for mobile data"), 2, 2,
         [this](const QStringList &arguments) {
             return chooseSim(arguments);
         }},
        {QStringLiteral("sim provider"), QStringLiteral("SLOT NAME"),
         QStringLiteral("renames the provider of the SIM"), 2, 2,
         [this](const QStringList &arguments) {
             return changeSim(arguments.first(), [&](Sim &sim) { sim.provider = arguments.at(1); });
         }},
        {QStringLiteral("sim numbers"), QStringLiteral("SLOT [NUMBER...]"),
         QStringLiteral("writes the subscriber's own numbers to the SIM"), 1, 20,
         [this](const QStringList &arguments) {
             return changeSim(arguments.first(), [&](Sim &sim) { sim.numbers = arguments.mid(1); });
         }},
        {QStringLiteral("network"), QStringLiteral("SLOT STATUS"),
         QStringLiteral("what the network makes of the SIM: ")
             + registrationStates().join(QStringLiteral(", ")),
         2, 2,
         [this](const QStringList &arguments) {
             return setRegistration(arguments);
         }},
        {QStringLiteral("modem remove"), QStringLiteral("SLOT"),
         QStringLiteral("makes the modem of a slot vanish"), 1, 1,
         [this](const QStringList &arguments) {
             return setModemThere(arguments.first(), false);
         }},
        {QStringLiteral("modem add"), QStringLiteral("SLOT"), QStringLiteral("brings the modem back"), 1, 1,
         [this](const QStringList &arguments) {
             return setModemThere(arguments.first(), true);
         }},
        {QStringLiteral("modem disable"), QStringLiteral("SLOT"),
         QStringLiteral("takes a slot out of use: its modem has no power"), 1, 1,
         [this](const QStringList &arguments) {
             return setModemEnabled(arguments.first(), false);
         }},
        {QStringLiteral("modem enable"), QStringLiteral("SLOT"), QStringLiteral("takes it into use again"), 1,
         1,
         [this](const QStringList &arguments) {
             return setModemEnabled(arguments.first(), true);
         }},
        {QStringLiteral("phone ready"), QStringLiteral("on|off"),
         QStringLiteral("whether the telephony service has looked into all slots"), 1, 1,
         [this](const QStringList &arguments) {
             m_manager.setReady(isOn(arguments.first()));
             announce();
             return QString();
         }},
        {QStringLiteral("phone extensions"), QStringLiteral("on|off"),
         QStringLiteral("without them the telephony service is a stock one"), 1, 1,
         [this](const QStringList &arguments) {
             m_manager.setOffered(isOn(arguments.first()));
             for (const std::unique_ptr<Modem> &modem : m_modems)
                 modem->setExtended(m_manager.isOffered());
             announce();
             return QString();
         }},
    };
    actions.insert(actions.end(), own.begin(), own.end());
    return actions;
}

QString problemOf(const QJsonObject &profile)
{
    QSet<QString> seen;
    const QJsonArray sims = profile.value(QLatin1String("sims")).toArray();
    for (int slot = 0; slot < sims.size(); ++slot) {
        const QJsonObject sim = sims.at(slot).toObject();
        const QString imsi = sim.value(QLatin1String("imsi")).toString();
        if (!imsi.isEmpty() && seen.contains(imsi))
            return QStringLiteral("/sims/%1/imsi: %2 is in another slot; each SIM needs its own")
                .arg(slot)
                .arg(imsi);
        if (imsi.isEmpty() && sim.value(QLatin1String("present")).toBool(true)) {
            return QStringLiteral(
                       "/sims/%1: a SIM that is present needs \"imsi\"; an empty slot has \"present\": false")
                .arg(slot);
        }
        seen.insert(imsi);

        const QString preference = sim.value(QLatin1String("technologyPreference")).toString();
        if (!preference.isEmpty() && preference != Modem::anyTechnology
            && !Modem::technologiesOf(sim).contains(preference)) {
            return QStringLiteral("/sims/%1/technologyPreference: the slot's technologies are without %2")
                .arg(slot)
                .arg(preference);
        }
    }

    const QJsonObject telephony = profile.value(QLatin1String("telephony")).toObject();
    for (const char *choice : {"voiceSim", "dataSim"}) {
        const QJsonValue slot = telephony.value(QLatin1String(choice));
        if (slot.isDouble()
            && sims.at(slot.toInt()).toObject().value(QLatin1String("imsi")).toString().isEmpty()) {
            return QStringLiteral("/telephony/%1: slot %2 has no card")
                .arg(QLatin1String(choice))
                .arg(slot.toInt());
        }
    }
    return QString();
}

const ComponentRegistration registration({
    Ofono::serviceName,
    [](const QJsonObject &profile, Phone &phone) { return std::make_unique<Modems>(profile, phone); },
    problemOf,
});

} // namespace

} // namespace Simulator
} // namespace Corvane
