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
    explicit Power(const QJsonObject &profile)
        : m_isPresent(profile.value(QLatin1String("present")).toBool())
        , m_percentage(profile.value(QLatin1String("percentage")).toDouble())
        , m_hasCharger(profile.value(QLatin1String("charger")).toBool())
    {
    }

    void attach(Service &service) override;
    void detach() override { m_service = nullptr; }
    void describe(QJsonObject &state) const override;
    std::vector<Action> actions() override;

private:
    State state() const;
    Warning warning() const;
    Properties power() const { return {{QStringLiteral("OnBattery"), fromBool(!m_hasCharger)}}; }
    Properties device() const;
    PropertyReaders deviceReaders() const;
    void announce();
    QString setLevel(const QString &text);
    QString setCharger(const QString &word);

    const bool m_isPresent;
    double m_percentage;
    bool m_hasCharger;

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
             if (m_isPresent)
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
                            return g_variant_new_boolean(!m_hasCharger);
                        }}});
    service.addObject(displayPath, deviceInterface, {}, deviceReaders());
    if (m_isPresent)
        service.addObject(batteryPath, deviceInterface, {}, deviceReaders());
    m_toldOfPower.reset(power());
    m_toldOfDisplay.reset(device());
    m_toldOfBattery.reset(device());
}

State Power::state() const
{
    if (!m_isPresent)
        return UnknownState;
    if (m_hasCharger)
        return m_percentage < full ? Charging : FullyCharged;
    return m_percentage > 0 ? Discharging : Empty;
}

Warning Power::warning() const
{
    if (!m_isPresent || m_hasCharger || m_percentage > low)
        return NoWarning;
    if (m_percentage > critical)
        return LowWarning;
    return m_percentage > action ? CriticalWarning : ActionWarning;
}

Properties Power::device() const
{
    return {
        {QStringLiteral("Type"), Variant(g_variant_new_uint32(m_isPresent ? BatteryType : UnknownType))},
        {QStringLiteral("PowerSupply"), fromBool(m_isPresent)},
        {QStringLiteral("IsPresent"), fromBool(m_isPresent)},
        {QStringLiteral("State"), Variant(g_variant_new_uint32(state()))},
        {QStringLiteral("Percentage"), Variant(g_variant_new_double(m_isPresent ? m_percentage : 0))},
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
    if (m_isPresent)
        announceChanges(*m_service, batteryPath, deviceInterface, &m_toldOfBattery, device());
}

QString Power::setLevel(const QString &text)
{
    bool isNumber = false;
    const double percentage = text.toDouble(&isNumber);
    if (!isNumber || !(percentage >= 0 && percentage <= full))
        throw Refusal(QStringLiteral("\"%1\" is no level; it is a number from 0 to 100").arg(text));
    if (!m_isPresent)
        throw Refusal(QStringLiteral("The phone has no battery"));
    m_percentage = percentage;
    announce();
    return QString();
}

QString Power::setCharger(const QString &word)
{
    if (word != QLatin1String("on") && word != QLatin1String("off"))
        throw Refusal(QStringLiteral("\"%1\" is neither on nor off").arg(word));
    m_hasCharger = word == QLatin1String("on");
    announce();
    return QString();
}

void Power::describe(QJsonObject &state) const
{
    state.insert(QStringLiteral("battery"),
                 QJsonObject{{QStringLiteral("present"), m_isPresent},
                             {QStringLiteral("percentage"), m_percentage},
                             {QStringLiteral("charger"), m_hasCharger}});
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
    [](const QJsonObject &profile, Phone &) {
        return std::make_unique<Power>(profile.value(QLatin1String("battery")).toObject());
    },
    problemOf,
});

} // namespace

} // namespace Simulator
} // namespace Corvane
