// SPDX-License-Identifier: LGPL-2.1-or-later
#include "component.h"
#include "ofono.h"
#include "refusal.h"
#include "service.h"

#include <QtCore/QJsonArray>
#include <QtCore/QRegularExpression>
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
const QLatin1String modemInterface("org.ofono.Modem");
const QLatin1String simInterface("org.ofono.SimManager");
const QLatin1String propertyChanged("PropertyChanged");

const QLatin1String poweredProperty("Powered");
const QLatin1String onlineProperty("Online");

using Properties = std::vector<std::pair<QString, Variant>>;

Variant fromText(const QString &text)
{
    return Variant(g_variant_new_string(text.toUtf8().constData()));
}

Variant fromBool(bool value)
{
    return Variant(g_variant_new_boolean(value));
}

Variant fromList(const QStringList &list)
{
    GVariantBuilder strings;
    g_variant_builder_init(&strings, G_VARIANT_TYPE_STRING_ARRAY);
    for (const QString &string : list)
        g_variant_builder_add(&strings, "s", string.toUtf8().constData());
    return Variant(g_variant_builder_end(&strings));
}

GVariant *toVariant(const Properties &properties)
{
    GVariantBuilder map;
    g_variant_builder_init(&map, G_VARIANT_TYPE_VARDICT);
    for (const auto &[name, value] : properties)
        g_variant_builder_add(&map, "{sv}", name.toUtf8().constData(), value.get());
    return g_variant_builder_end(&map);
}

/** The modem of one SIM slot. */
class Modem
{
public:
    Modem(std::size_t slot, const Sim &sim);

    QString path() const { return m_path; }
    void attach(Service &service);
    void detach() { m_service = nullptr; }
    Properties properties() const;
    QJsonObject describe() const;
    void pullSim();
    void insertSim();

private:
    QStringList interfaces() const;
    QStringList features() const;
    Properties simProperties() const;
    void offerSim();
    void setProperty(MethodCall &call);
    void setPowered(bool powered);
    void setOnline(bool online);
    void emitChange(const QString &interface, const QString &name, const Variant &value) const;

    const std::size_t m_slot;
    const QString m_path;
    const Sim &m_sim;
    bool m_powered = true;
    bool m_online = true;
    Service *m_service = nullptr;
};

Modem::Modem(std::size_t slot, const Sim &sim)
    : m_slot(slot)
    , m_path(QStringLiteral("/ril_%1").arg(slot))
    , m_sim(sim)
{
}

void Modem::attach(Service &service)
{
    m_service = &service;
    service.addObject(m_path, modemInterface,
                      {
                          {QStringLiteral("GetProperties"),
                           [this](MethodCall &call) {
                               call.reply(g_variant_new("(@a{sv})", toVariant(properties())));
                           }},
                          {QStringLiteral("SetProperty"),
                           [this](MethodCall &call) {
                               setProperty(call);
                           }},
                      });
    if (m_powered)
        offerSim();
}

void Modem::offerSim()
{
    m_service->addObject(m_path, simInterface,
                         {
                             {QStringLiteral("GetProperties"),
                              [this](MethodCall &call) {
                                  call.reply(g_variant_new("(@a{sv})", toVariant(simProperties())));
                              }},
                         });
}

QStringList Modem::interfaces() const
{
    return m_powered ? QStringList{simInterface} : QStringList();
}

QStringList Modem::features() const
{
    return m_powered && m_sim.present ? QStringList{QStringLiteral("sim")} : QStringList();
}

Properties Modem::properties() const
{
    return {
        {poweredProperty, fromBool(m_powered)},
        {onlineProperty, fromBool(m_online)},
        {QStringLiteral("Lockdown"), fromBool(false)},
        {QStringLiteral("Emergency"), fromBool(false)},
        {QStringLiteral("Name"), fromText(QStringLiteral("Slot %1").arg(m_slot))},
        {QStringLiteral("Manufacturer"), fromText(QStringLiteral("Corvane"))},
        {QStringLiteral("Model"), fromText(QStringLiteral("Simulated modem"))},
        {QStringLiteral("Revision"), fromText(QStringLiteral("1.0"))},
        {QStringLiteral("Serial"), fromText(QStringLiteral("35824005111110%1").arg(m_slot))},
        {QStringLiteral("Type"), fromText(QStringLiteral("hardware"))},
        {QStringLiteral("Features"), fromList(features())},
        {QStringLiteral("Interfaces"), fromList(interfaces())},
    };
}

Properties Modem::simProperties() const
{
    Properties properties{{QStringLiteral("Present"), fromBool(m_sim.present)}};
    if (m_sim.present) {
        properties.insert(properties.end(),
                          {
                              {QStringLiteral("SubscriberIdentity"), fromText(m_sim.imsi)},
                              {QStringLiteral("CardIdentifier"), fromText(m_sim.iccid)},
                              {QStringLiteral("ServiceProviderName"), fromText(m_sim.provider)},
                              {QStringLiteral("SubscriberNumbers"), fromList(m_sim.numbers)},
                              {QStringLiteral("MobileCountryCode"), fromText(m_sim.imsi.left(3))},
                              {QStringLiteral("MobileNetworkCode"), fromText(m_sim.imsi.mid(3, 2))},
                              {QStringLiteral("PinRequired"), fromText(QStringLiteral("none"))},
                          });
    }
    return properties;
}

void Modem::setProperty(MethodCall &call)
{
    const QString name = call.text(0);
    if (name != poweredProperty && name != onlineProperty)
        throw Ofono::invalidArguments(QStringLiteral("There is no property %1 that could be set").arg(name));
    Variant value(g_variant_get_child_value(call.arguments(), 1));
    value = Variant(g_variant_get_variant(value.get()));
    if (!g_variant_is_of_type(value.get(), G_VARIANT_TYPE_BOOLEAN))
        throw Ofono::invalidArguments(QStringLiteral("%1 is a boolean").arg(name));
    const bool wanted = g_variant_get_boolean(value.get());
    if (name == onlineProperty && wanted && !m_powered)
        throw Ofono::notAvailable(QStringLiteral("The modem is not powered"));
    call.reply();

    if (name == poweredProperty)
        setPowered(wanted);
    else
        setOnline(wanted);
}

void Modem::setPowered(bool powered)
{
    if (powered == m_powered)
        return;
    if (!powered)
        setOnline(false);
    m_powered = powered;
    if (powered)
        offerSim();
    else
        m_service->removeObject(m_path, simInterface);
    emitChange(modemInterface, poweredProperty, fromBool(powered));
    emitChange(modemInterface, QStringLiteral("Interfaces"), fromList(interfaces()));
    emitChange(modemInterface, QStringLiteral("Features"), fromList(features()));
}

void Modem::setOnline(bool online)
{
    if (online == m_online)
        return;
    m_online = online;
    emitChange(modemInterface, onlineProperty, fromBool(online));
}

void Modem::emitChange(const QString &interface, const QString &name, const Variant &value) const
{
    if (m_service) {
        m_service->emitSignal(m_path, interface, propertyChanged,
                              g_variant_new("(sv)", name.toUtf8().constData(), value.get()));
    }
}

void Modem::pullSim()
{
    if (!m_powered)
        return;
    emitChange(simInterface, QStringLiteral("Present"), fromBool(false));
    emitChange(modemInterface, QStringLiteral("Features"), fromList(features()));
}

void Modem::insertSim()
{
    if (!m_powered)
        return;
    for (const auto &[name, value] : simProperties())
        emitChange(simInterface, name, value);
    emitChange(modemInterface, QStringLiteral("Features"), fromList(features()));
}

QJsonObject Modem::describe() const
{
    return {{QStringLiteral("path"), m_path},
            {QStringLiteral("powered"), m_powered},
            {QStringLiteral("online"), m_online}};
}

class Modems : public Component
{
public:
    explicit Modems(Phone &phone);

    void attach(Service &service) override;
    void detach() override;
    void describe(QJsonObject &state) const override;
    std::vector<Action> actions() override;

private:
    std::size_t slot(const QString &text) const;
    QString pullSim(const QString &slotText);
    QString insertSim(const QStringList &arguments);

    Phone &m_phone;
    std::vector<Modem> m_modems; ///< by slot
};

Modems::Modems(Phone &phone)
    : m_phone(phone)
{
    m_modems.reserve(phone.sims.size());
    for (std::size_t slot = 0; slot < phone.sims.size(); ++slot)
        m_modems.emplace_back(slot, phone.sims[slot]);
}

void Modems::attach(Service &service)
{
    service.addObject(managerPath, managerInterface,
                      {
                          {QStringLiteral("GetModems"),
                           [this](MethodCall &call) {
                               GVariantBuilder modems;
                               g_variant_builder_init(&modems, G_VARIANT_TYPE("a(oa{sv})"));
                               for (const Modem &modem : m_modems) {
                                   g_variant_builder_add(&modems, "(o@a{sv})",
                                                         modem.path().toUtf8().constData(),
                                                         toVariant(modem.properties()));
                               }
                               call.reply(g_variant_new("(a(oa{sv}))", &modems));
                           }},
                      });
    for (Modem &modem : m_modems)
        modem.attach(service);
}

void Modems::detach()
{
    for (Modem &modem : m_modems)
        modem.detach();
}

void Modems::describe(QJsonObject &state) const
{
    QJsonArray sims;
    for (const Sim &sim : m_phone.sims) {
        sims << QJsonObject{
            {QStringLiteral("imsi"), sim.imsi},
            {QStringLiteral("iccid"), sim.iccid},
            {QStringLiteral("provider"), sim.provider},
            {QStringLiteral("numbers"), QJsonArray::fromStringList(sim.numbers)},
            {QStringLiteral("present"), sim.present},
        };
    }
    state.insert(QStringLiteral("sims"), sims);

    QJsonArray modems;
    for (const Modem &modem : m_modems)
        modems << modem.describe();
    state.insert(QStringLiteral("modems"), modems);
}

std::size_t Modems::slot(const QString &text) const
{
    if (const std::optional<std::size_t> slot = m_phone.slotNumbered(text))
        return *slot;
    throw Refusal(QStringLiteral("There is no SIM slot \"%1\"; the phone has %2, numbered from 0")
                      .arg(text)
                      .arg(m_phone.sims.size()));
}

QString Modems::pullSim(const QString &slotText)
{
    const std::size_t index = slot(slotText);
    Sim &sim = m_phone.sims[index];
    if (!sim.present)
        throw Refusal(QStringLiteral("There is no SIM in slot %1").arg(index));
    sim.present = false;
    m_modems[index].pullSim();
    return QStringLiteral("The SIM %1 is out of slot %2").arg(sim.imsi).arg(index);
}

QString Modems::insertSim(const QStringList &arguments)
{
    static const QRegularExpression imsiDigits(QStringLiteral("\\A[0-9]{6,15}\\z"));
    const std::size_t index = slot(arguments.first());
    Sim &sim = m_phone.sims[index];
    if (sim.present)
        throw Refusal(QStringLiteral("There is a SIM in slot %1; pull it first").arg(index));
    const QString imsi = arguments.size() > 1 ? arguments.at(1) : sim.imsi;
    if (!imsiDigits.match(imsi).hasMatch()) {
        throw Refusal(imsi.isEmpty()
                          ? QStringLiteral("Slot %1 never had a SIM; name the IMSI of the new one").arg(index)
                          : QStringLiteral("\"%1\" is no IMSI; it has 6 to 15 digits").arg(imsi));
    }
    const bool elsewhere = std::any_of(m_phone.sims.begin(), m_phone.sims.end(),
                                       [&](const Sim &other) { return other.present && other.imsi == imsi; });
    if (elsewhere)
        throw Refusal(QStringLiteral("The SIM %1 is in another slot; pull it there first").arg(imsi));

    if (imsi != sim.imsi)
        sim = m_phone.cardWithImsi(imsi);
    sim.present = true;
    m_modems[index].insertSim();
    return QStringLiteral("The SIM %1 is in slot %2").arg(imsi).arg(index);
}

std::vector<Action> Modems::actions()
{
    return {
        {QStringLiteral("sim pull"), QStringLiteral("SLOT"), QStringLiteral("takes the SIM out of a slot"), 1,
         1,
         [this](const QStringList &arguments) {
             return pullSim(arguments.first());
         }},
        {QStringLiteral("sim insert"), QStringLiteral("SLOT [IMSI]"),
         QStringLiteral("puts the SIM back, or another one in its place"), 1, 2,
         [this](const QStringList &arguments) {
             return insertSim(arguments);
         }},
    };
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
    }
    return QString();
}

const ComponentRegistration registration({
    Ofono::serviceName,
    [](const QJsonObject &, Phone &phone) { return std::make_unique<Modems>(phone); },
    problemOf,
});

} // namespace

} // namespace Simulator
} // namespace Corvane
