// SPDX-License-Identifier: LGPL-2.1-or-later
#include "component.h"
#include "properties.h"
#include "refusal.h"
#include "service.h"

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String serviceName("org.freedesktop.UPower");
const QLatin1String objectPath("/org/freedesktop/UPower");
const QLatin1String displayPath("/org/freedesktop/UPower/devices/DisplayDevice");
const QLatin1String batteryPath("/org/freedesktop/UPower/devices/battery_battery");
const QLatin1String powerInterface("org.freedesktop.UPower");
const QLatin1String deviceInterface("org.freedesktop.UPower.Device");

// Numbers of the contract.
enum Type : guint32 { UnknownType = 0, BatteryType = 2 };
enum State : guint32 { UnknownState = 0, Charging = 1, Discharging = 2, Empty = 3, FullyCharged = 4 };
enum Warning : guint32 { NoWarning = 1, LowWarning = 3, CriticalWarning = 4, ActionWarning = 5 };

constexpr double full = 100;
constexpr double low = 20;
constexpr double critical = 5;
constexpr double action = 2;

class Power : public Component
{
public:
    explicit Power(Battery &battery)
        : m_battery(battery)
    {
    }

    void attach(Service &service) override;
    void detach() override { m_service = nullptr; }
    void describe(QJsonObject &state) const override;
    std::vector<Action> actions() override;

private:
    State state() const;
    Warning warning() const;
    Properties power() const { return {{QStringLiteral("OnBattery"), fromBool(!m_battery.hasCharger)}}; }
    Properties device() const;
    PropertyReaders deviceReaders() const;
    void announce();
    QString setLevel(const QString &text);
    QString setCharger(const QString &word);

    Battery &m_battery;

    Service *m_service = nullptr;
    PropertyChanges m_toldOfPower;
    PropertyChanges m_toldOfDisplay;
    PropertyChanges m_toldOfBattery;
};

void Power::attach(Service &service)
{
    m_service = &service;
    const MethodHandlers methods{
        {QStringLiteral("EnumerateDevices"),
         [this](MethodCall &call) {
             GVariantBuilder paths;
             g_variant_builder_init(&paths, G_VARIANT_TYPE_OBJECT_PATH_ARRAY);
             if (m_battery.isPresent)
                 g_variant_builder_add(&paths, "o", batteryPath.data());
             call.reply(g_variant_new("(ao)", &paths));
         }},
        {QStringLiteral("GetDisplayDevice"),
         [](MethodCall &call) {
             call.reply(g_variant_new("(o)", displayPath.data()));
         }},
    };
    service.addObject(objectPath, powerInterface, methods,
                      {{QStringLiteral("DaemonVersion"),
                        [] {
                            return g_variant_new_string("0.99.20");
                        }},
                       {QStringLiteral("OnBattery"), [this] {
                            return g_variant_new_boolean(!m_battery.hasCharger);
                        }}});
    service.addObject(displayPath, deviceInterface, {}, deviceReaders());
    if (m_battery.isPresent)
        service.addObject(batteryPath, deviceInterface, {}, deviceReaders());
    m_toldOfPower.reset(power());
    m_toldOfDisplay.reset(device());
    m_toldOfBattery.reset(device());
}

State Power::state() const
{
    if (!m_battery.isPresent)
        return UnknownState;
    if (m_battery.hasCharger)
        return m_battery.percentage < full ? Charging : FullyCharged;
    return m_battery.percentage > 0 ? Discharging : Empty;
}

Warning Power::warning() const
{
    if (!m_battery.isPresent || m_battery.hasCharger || m_battery.percentage > low)
        return NoWarning;
    if (m_battery.percentage > critical)
        return LowWarning;
    return m_battery.percentage > action ? CriticalWarning : ActionWarning;
}

Properties Power::device() const
{
    return {
        {QStringLiteral("Type"),
         Variant(g_variant_new_uint32(m_battery.isPresent ? BatteryType : UnknownType))},
        {QStringLiteral("PowerSupply"), fromBool(m_battery.isPresent)},
        {QStringLiteral("IsPresent"), fromBool(m_battery.isPresent)},
        {QStringLiteral("State"), Variant(g_variant_new_uint32(state()))},
        {QStringLiteral("Percentage"),
         Variant(g_variant_new_double(m_battery.isPresent ? m_battery.percentage : 0))},
        {QStringLiteral("WarningLevel"), Variant(g_variant_new_uint32(warning()))},
    };
}

PropertyReaders Power::deviceReaders() const
{
    PropertyReaders readers;
    const Properties properties = device();
    for (std::size_t i = 0; i < properties.size(); ++i)
        readers.emplace(properties[i].first, [this, i] { return g_variant_ref(device()[i].second.get()); });
    return readers;
}

void Power::announce()
{
    if (!m_service)
        return;
    announceChanges(*m_service, objectPath, powerInterface, &m_toldOfPower, power());
    announceChanges(*m_service, displayPath, deviceInterface, &m_toldOfDisplay, device());
    if (m_battery.isPresent)
        announceChanges(*m_service, batteryPath, deviceInterface, &m_toldOfBattery, device());
}

QString Power::setLevel(const QString &text)
{
    bool isNumber = false;
    const double percentage = text.toDouble(&isNumber);
    if (!isNumber || !(percentage >= 0 && percentage <= full))
        throw Refusal(QStringLiteral("\"%1\" is no level; it is a number from 0 to 100").arg(text));
    if (!m_battery.isPresent)
        throw Refusal(QStringLiteral("The phone has no battery"));
    m_battery.percentage = percentage;
    announce();
    return QString();
}

QString Power::setCharger(const QString &word)
{
    if (word != QLatin1String("on") && word != QLatin1String("off"))
        throw Refusal(QStringLiteral("\"%1\" is neither on nor off").arg(word));
    m_battery.hasCharger = word == QLatin1String("on");
    announce();
    return QString();
}

void Power::describe(QJsonObject &state) const
{
    state.insert(QStringLiteral("battery"), m_battery.describe());
}

std::vector<Action> Power::actions()
{
    return {
        {QStringLiteral("battery level"), QStringLiteral("PERCENT"),
         QStringLiteral("charges or drains the battery"), 1, 1,
         [this](const QStringList &arguments) {
             return setLevel(arguments.first());
         }},
        {QStringLiteral("battery charger"), QStringLiteral("on|off"),
         QStringLiteral("connects the charger, or takes it away"), 1, 1,
         [this](const QStringList &arguments) {
             return setCharger(arguments.first());
         }},
    };
}

QString problemOf(const QJsonObject &)
{
    return QString();
}

const ComponentRegistration registration({
    serviceName,
    [](const QJsonObject &, Phone &phone) { return std::make_unique<Power>(phone.battery); },
    problemOf,
});

} // namespace

} // namespace Simulator
} // namespace Corvane
