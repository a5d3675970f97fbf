// SPDX-License-Identifier: LGPL-2.1-or-later
#include <systemsettings/batterystatus.h>

#include "remoteproperties_p.h"

#include <QtCore/QPointer>
#include <QtCore/QtMath>

namespace
{

const QLatin1String service("org.freedesktop.UPower");
const QLatin1String deviceInterface("org.freedesktop.UPower.Device");

// The service's numbers.
constexpr uint batteryType = 2;
constexpr uint emptyState = 3;
constexpr uint fullState = 4;
constexpr uint lowWarning = 3;
constexpr uint criticalWarning = 4;

} // namespace

class BatteryStatus::Private
{
public:
    struct Values {
        Status status = BatteryStatusUnknown;
        ChargerStatus charger = ChargerStatusUnknown;
        int percentage = -1;
    };

    explicit Private(BatteryStatus *battery);

    BatteryStatus *const q;
    Values values;

private:
    Values told() const;
    void set(const Values &now);

    RemoteProperties m_power;
    RemoteProperties m_battery; ///< all batteries taken together
};

BatteryStatus::Private::Private(BatteryStatus *battery)
    : q(battery)
    , m_power(service, QStringLiteral("/org/freedesktop/UPower"), service)
    , m_battery(service, QStringLiteral("/org/freedesktop/UPower/devices/DisplayDevice"), deviceInterface)
{
    qRegisterMetaType<Status>("BatteryStatus::Status");
    qRegisterMetaType<ChargerStatus>("BatteryStatus::ChargerStatus");
    for (const RemoteProperties *each : {&m_power, &m_battery})
        QObject::connect(each, &RemoteProperties::changed, q, [this] { set(told()); });
    QObject::connect(&m_power, &RemoteProperties::serviceLeft, q, [this] { set(Values()); });
}

BatteryStatus::Private::Values BatteryStatus::Private::told() const
{
    Values told;
    const QVariant onBattery = m_power.value(QStringLiteral("OnBattery"));
    if (onBattery.isValid())
        told.charger = onBattery.toBool() ? Disconnected : Connected;
    if (m_battery.value(QStringLiteral("Type")).toUInt() != batteryType
        || !m_battery.value(QStringLiteral("IsPresent")).toBool())
        return told;

    const double percentage = m_battery.value(QStringLiteral("Percentage")).toDouble();
    told.percentage = qRound(qBound(0.0, percentage, 100.0));
    const uint state = m_battery.value(QStringLiteral("State")).toUInt();
    const uint warning = m_battery.value(QStringLiteral("WarningLevel")).toUInt();
    if (state == emptyState || warning >= criticalWarning)
        told.status = Empty;
    else if (warning == lowWarning)
        told.status = Low;
    else
        told.status = state == fullState || told.percentage == 100 ? Full : Normal;
    return told;
}

void BatteryStatus::Private::set(const Values &now)
{
    const Values before = values;
    values = now;
    // A receiver may delete the object, and this with it.
    const QPointer<BatteryStatus> alive(q);
    if (now.status != before.status)
        Q_EMIT alive->statusChanged(now.status);
    if (alive && now.charger != before.charger)
        Q_EMIT alive->chargerStatusChanged(now.charger);
    if (alive && now.percentage != before.percentage)
        Q_EMIT alive->chargePercentageChanged(now.percentage);
}

BatteryStatus::BatteryStatus(QObject *parent)
    : QObject(parent)
    , d(new Private(this))
{
}

BatteryStatus::~BatteryStatus()
{
    delete d;
}

BatteryStatus::Status BatteryStatus::status() const
{
    return d->values.status;
}

BatteryStatus::ChargerStatus BatteryStatus::chargerStatus() const
{
    return d->values.charger;
}

int BatteryStatus::chargePercentage() const
{
    return d->values.percentage;
}
