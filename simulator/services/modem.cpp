// SPDX-License-Identifier: LGPL-2.1-or-later
#include "modem.h"

#include "ofono.h"
#include "service.h"

#include <QtCore/QJsonArray>

#include <algorithm>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String modemInterface("org.ofono.Modem");
const QLatin1String simInterface("org.ofono.SimManager");
const QLatin1String registrationInterface("org.ofono.NetworkRegistration");
const QLatin1String radioInterface("org.ofono.RadioSettings");
const QLatin1String connectionInterface("org.ofono.ConnectionManager");
const QLatin1String simInfoInterface("org.veldmobile.ofono.SimInfo");

const QLatin1String poweredProperty("Powered");
const QLatin1String onlineProperty("Online");
const QLatin1String technologyPreference("TechnologyPreference");

const QLatin1String cardIdentifier("CardIdentifier");
const QLatin1String serviceProviderName("ServiceProviderName");
const QLatin1String subscriberIdentity("SubscriberIdentity");

constexpr quint8 signalStrength = 70; // percent

} // namespace

QStringList Modem::technologiesOf(const QJsonObject &slotProfile)
{
    const QJsonValue listed = slotProfile.value(QLatin1String("technologies"));
    if (!listed.isArray())
        return {QStringLiteral("gsm"), QStringLiteral("umts"), QStringLiteral("lte")};
    const QJsonArray words = listed.toArray();
    QStringList technologies;
    for (const QJsonValue &technology : words)
        technologies << technology.toString();
    return technologies;
}

Modem::Modem(std::size_t slot, const Sim &sim, const QJsonObject &slotProfile, ContextStore &contexts,
             std::function<void()> changed)
    : m_slot(slot)
    , m_path(QStringLiteral("/ril_%1").arg(slot))
    , m_sim(sim)
    , m_changed(std::move(changed))
    , m_isEnabled(slotProfile.value(QLatin1String("enabled")).toBool(true))
    , m_isPowered(m_isEnabled)
    , m_isOnline(m_isEnabled)
    , m_registration(slotProfile.value(QLatin1String("registration")).toString(QStringLiteral("registered")))
    , m_technologies(technologiesOf(slotProfile))
    , m_technologyPreference(slotProfile.value(QLatin1String("technologyPreference")).toString(anyTechnology))
    , m_mobileData(m_path, contexts, m_changed)
{
    // What the card brings comes before what the network makes of it.
    addInterface(simInterface, &Modem::hasSim, &Modem::simProperties);
    addSimInfo();
    addInterface(modemInterface, &Modem::isThere, &Modem::properties,
                 {{QStringLiteral("SetProperty"), [this](MethodCall &call) {
                       setProperty(call);
                   }}});
    addInterface(registrationInterface, &Modem::hasRegistration, &Modem::registrationProperties);
    addInterface(radioInterface, &Modem::hasUsableSim, &Modem::radioProperties,
                 {{QStringLiteral("SetProperty"), [this](MethodCall &call) {
                       setRadioProperty(call);
                   }}});
    addInterface(connectionInterface, &Modem::hasUsableSim, &Modem::connectionProperties,
                 m_mobileData.methods());
}

void Modem::addInterface(QLatin1String name, bool (Modem::*isOffered)() const,
                         Properties (Modem::*known)() const, MethodHandlers furtherMethods)
{
    MethodHandlers methods = std::move(furtherMethods);
    methods[QStringLiteral("GetProperties")] = [this, known](MethodCall &call) {
        call.reply(g_variant_new("(@a{sv})", toVariant((this->*known)())));
    };
    m_interfaces.push_back({name, isOffered, known, std::move(methods), Interface::PropertyChanged});
}

void Modem::addSimInfo()
{
    MethodHandlers methods;
    for (const QLatin1String name : {cardIdentifier, serviceProviderName, subscriberIdentity}) {
        methods[QStringLiteral("Get") + name] = [this, name](MethodCall &call) {
            const Properties known = simInfoProperties();
            const auto found = std::find_if(known.begin(), known.end(),
                                            [&](const auto &property) { return property.first == name; });
            call.reply(g_variant_new("(@s)", found->second.get()));
        };
    }
    m_interfaces.push_back({simInfoInterface, &Modem::hasSimInfo, &Modem::simInfoProperties,
                            std::move(methods), Interface::OneEach});
}

void Modem::attach(Service &service)
{
    m_service = &service;
    followSim();
    for (Interface &interface : m_interfaces) {
        interface.isOnBus = false;
        setOnBus(interface);
    }
    m_mobileData.attach(service);
}

void Modem::detach()
{
    m_mobileData.detach();
    m_service = nullptr;
}

/** Lets mobile data know what SIM and what network there are now. */
void Modem::followSim()
{
    const QString status = hasRegistration() ? registration() : QString();
    const bool isRoaming = status == QLatin1String("roaming");
    m_mobileData.setSim(hasUsableSim() ? m_sim.imsi : QString());
    m_mobileData.setServed(status == QLatin1String("registered") || isRoaming, isRoaming);
}

/** Puts @p interface on the bus or takes it off, as it is now; what it tells then needs no announcement. */
void Modem::setOnBus(Interface &interface)
{
    const bool isOffered = (this->*interface.isOffered)();
    if (isOffered == interface.isOnBus)
        return;
    interface.isOnBus = isOffered;
    if (isOffered) {
        m_service->addObject(m_path, interface.name, interface.methods);
        interface.changes.reset((this->*interface.properties)());
    } else {
        m_service->removeObject(m_path, interface.name);
    }
}

void Modem::announce()
{
    followSim();
    if (!m_service)
        return;
    // Who hears of an interface finds it.
    for (Interface &interface : m_interfaces)
        setOnBus(interface);
    m_mobileData.announce();
    for (Interface &interface : m_interfaces) {
        if (!interface.isOnBus)
            continue;
        interface.changes.take((this->*interface.properties)(), [&](const QString &name, GVariant *value) {
            emitChange(interface, name, value);
        });
    }
}

void Modem::emitChange(const Interface &interface, const QString &name, GVariant *value) const
{
    if (interface.changeSignals == Interface::OneEach) {
        m_service->emitSignal(m_path, interface.name, name + QStringLiteral("Changed"),
                              g_variant_new("(@s)", value));
    } else {
        m_service->emitSignal(m_path, interface.name, QStringLiteral("PropertyChanged"),
                              g_variant_new("(sv)", name.toUtf8().constData(), value));
    }
}

QString Modem::imei() const
{
    return QStringLiteral("35824005111110%1").arg(m_slot);
}

QStringList Modem::interfaces() const
{
    QStringList offered;
    for (const Interface &interface : m_interfaces) {
        if (interface.name != modemInterface && (this->*interface.isOffered)())
            offered << interface.name;
    }
    return offered;
}

QStringList Modem::features() const
{
    QStringList features;
    if (hasRegistration())
        features << QStringLiteral("net");
    if (hasUsableSim())
        features << QStringLiteral("rat") << QStringLiteral("gprs");
    if (hasSim() && m_sim.present)
        features << QStringLiteral("sim");
    return features;
}

Properties Modem::properties() const
{
    return {
        {poweredProperty, fromBool(m_isPowered)},
        {onlineProperty, fromBool(m_isOnline)},
        {QStringLiteral("Lockdown"), fromBool(false)},
        {QStringLiteral("Emergency"), fromBool(false)},
        {QStringLiteral("Name"), fromText(QStringLiteral("Slot %1").arg(m_slot))},
        {QStringLiteral("Manufacturer"), fromText(QStringLiteral("Corvane"))},
        {QStringLiteral("Model"), fromText(QStringLiteral("Simulated modem"))},
        {QStringLiteral("Revision"), fromText(QStringLiteral("1.0"))},
        {QStringLiteral("Serial"), fromText(imei())},
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
                              {cardIdentifier, fromText(m_sim.iccid)},
                              {QStringLiteral("PinRequired"), fromText(m_sim.pin)},
                          });
    }
    if (m_sim.isUsable()) {
        properties.insert(properties.end(),
                          {
                              {serviceProviderName, fromText(m_sim.provider)},
                              {QStringLiteral("SubscriberNumbers"), fromList(m_sim.numbers)},
                              {QStringLiteral("MobileCountryCode"), fromText(m_sim.imsi.left(3))},
                              {QStringLiteral("MobileNetworkCode"), fromText(m_sim.imsi.mid(3, 2))},
                              {subscriberIdentity, fromText(m_sim.imsi)},
                          });
    }
    return properties;
}

Properties Modem::simInfoProperties() const
{
    return {
        {cardIdentifier, fromText(m_sim.present ? m_sim.iccid : QString())},
        {serviceProviderName, fromText(m_sim.isUsable() ? m_sim.provider : QString())},
        {subscriberIdentity, fromText(m_sim.isUsable() ? m_sim.imsi : QString())},
    };
}

QString Modem::registration() const
{
    return m_sim.isUsable() ? m_registration : QStringLiteral("unregistered");
}

Properties Modem::registrationProperties() const
{
    const QString status = registration();
    Properties properties{{QStringLiteral("Mode"), fromText(QStringLiteral("auto"))}};
    if (status == QLatin1String("registered") || status == QLatin1String("roaming")) {
        properties.insert(properties.end(),
                          {
                              {QStringLiteral("Name"), fromText(m_sim.provider)},
                              {QStringLiteral("MobileCountryCode"), fromText(m_sim.imsi.left(3))},
                              {QStringLiteral("MobileNetworkCode"), fromText(m_sim.imsi.mid(3, 2))},
                              {QStringLiteral("Technology"), fromText(QStringLiteral("lte"))},
                              {QStringLiteral("Strength"), fromByte(signalStrength)},
                          });
    }
    properties.push_back({QStringLiteral("Status"), fromText(status)});
    return properties;
}

CellularLinks::Links Modem::links() const
{
    CellularLinks::Links links;
    if (!m_mobileData.isAttached())
        return links;
    const bool isRoaming = registration() == QLatin1String("roaming");
    for (const ConnectionContext &context : m_mobileData.contexts()) {
        if (context.isForInternet())
            links.push_back({m_path + QLatin1Char('/') + context.name, m_sim.imsi, m_sim.provider, isRoaming,
                             context.isActive});
    }
    return links;
}

Properties Modem::radioProperties() const
{
    return {
        {technologyPreference, fromText(m_technologyPreference)},
        {QStringLiteral("AvailableTechnologies"), fromList(m_technologies)},
    };
}

void Modem::setRadioProperty(MethodCall &call)
{
    const Ofono::PropertyRequest request(call);
    if (request.name() != technologyPreference)
        throw request.unknown();
    const QString wanted = request.text();
    if (wanted != anyTechnology && !m_technologies.contains(wanted))
        throw Ofono::invalidArguments(QStringLiteral("The modem has no technology \"%1\"").arg(wanted));
    call.reply();
    m_technologyPreference = wanted;
    m_changed();
}

void Modem::setProperty(MethodCall &call)
{
    const Ofono::PropertyRequest request(call);
    const QString name = request.name();
    if (name != poweredProperty && name != onlineProperty)
        throw request.unknown();
    const bool wanted = request.flag();
    if (name == onlineProperty && wanted && !m_isPowered)
        throw Ofono::notAvailable(QStringLiteral("The modem is not powered"));
    call.reply();

    if (name == poweredProperty) {
        m_isPowered = wanted;
        m_isOnline = m_isOnline && wanted;
    } else {
        m_isOnline = wanted;
    }
    m_changed();
}

void Modem::setEnabled(bool enabled)
{
    if (enabled == m_isEnabled)
        return;
    m_isEnabled = enabled;
    m_isPowered = enabled;
    m_isOnline = enabled;
}

QJsonObject Modem::describe() const
{
    return {
        {QStringLiteral("path"), m_path},
        {QStringLiteral("there"), m_isThere},
        {QStringLiteral("enabled"), m_isEnabled},
        {QStringLiteral("powered"), m_isPowered},
        {QStringLiteral("online"), m_isOnline},
        {QStringLiteral("registration"), registration()},
        {QStringLiteral("technologyPreference"), m_technologyPreference},
        {QStringLiteral("attached"), m_mobileData.isAttached()},
        {QStringLiteral("accessPoints"), m_mobileData.describe()},
    };
}

} // namespace Simulator
} // namespace Corvane
