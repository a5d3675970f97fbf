// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commands.h"
#include "devicelocker.h"
#include "exitstatus.h"
#include "service.h"
#include "simcards.h"
#include "table.h"
#include "wait.h"
#include "warningcapture.h"

#include <corvanemdm/applications.h>
#include <corvanemdm/batteryinfo.h>
#include <corvanemdm/sysinfo.h>

#include <QtCore/QJsonArray>

#include <algorithm>
#include <chrono>

namespace Corvane
{
namespace Agent
{

using Mdm::DeviceLock;
using Mdm::SimInfo;
using Mdm::SysInfo;

namespace
{

/** What is known of the phone, for people and for programs. */
class Inventory
{
public:
    void add(const QString &title, const QString &text)
    {
        m_rows.append({title, text.isEmpty() ? QStringLiteral("not known") : text});
    }
    void add(const QString &title, const QString &member, const QString &text)
    {
        add(title, text);
        addMember(member, text.isEmpty() ? QJsonValue() : QJsonValue(text));
    }
    void addMember(const QString &member, const QJsonValue &value) { m_json.insert(member, value); }

    /** Why there is nothing to tell under @p title. */
    void addMissing(const QString &title, const QString &member, const Service &service, const Reply &reply)
    {
        add(title, QStringLiteral("not known: ") + reply.text);
        addMember(member, QJsonValue());
        if (reply.outcome == Reply::ServiceLost)
            m_missing.append(service.name);
    }

    QString toString() const
    {
        Table table({QStringLiteral("WHAT"), QStringLiteral("VALUE")});
        for (const QStringList &row : m_rows)
            table.addRow(row);
        return table.toString();
    }

    QJsonObject toJson() const
    {
        QJsonObject json = m_json;
        json.insert(QStringLiteral("missingServices"), QJsonArray::fromStringList(m_missing));
        return json;
    }

private:
    QVector<QStringList> m_rows;
    QJsonObject m_json;
    QStringList m_missing;
};

void addDevice(Inventory &inventory)
{
    const QString manufacturer = SysInfo::manufacturer();
    const QString product = SysInfo::productName();
    const QString model = SysInfo::deviceModel();
    QStringList names{manufacturer, product};
    if (model != product)
        names.append(model.isEmpty() ? model : QStringLiteral("(%1)").arg(model));
    names.removeAll(QString());
    inventory.add(QStringLiteral("device"), names.join(QLatin1Char(' ')));
    inventory.addMember(QStringLiteral("manufacturer"), manufacturer);
    inventory.addMember(QStringLiteral("productName"), product);
    inventory.addMember(QStringLiteral("model"), model);
    inventory.add(QStringLiteral("identity"), QStringLiteral("deviceUid"), SysInfo::deviceUid());
    inventory.add(QStringLiteral("system"), QStringLiteral("softwareVersion"), SysInfo::softwareVersion());
    inventory.addMember(QStringLiteral("softwareVersionId"), SysInfo::softwareVersionId());
}

void addSims(Inventory &inventory, const Timeouts &timeouts)
{
    const QString member = QStringLiteral("sims");
    const Service telephony = Service::telephony();
    Reply reply = telephony.ensureRunning();
    if (!reply.isDone())
        return inventory.addMissing(QStringLiteral("SIMs"), member, telephony, reply);
    SimCards cards(timeouts.confirmation);
    reply = cards.open();
    if (!reply.isDone())
        return inventory.addMissing(QStringLiteral("SIMs"), member, telephony, reply);
    const QList<SimInfo::SlotInfo> imeis = cards.info().imeiCodes();
    const QList<SimInfo::SimState> states = cards.info().simSlotStates();
    QJsonArray json;
    for (int slot = 0; slot < states.size(); ++slot) {
        const SimInfo::SimState &state = states.at(slot);
        QString imei;
        for (const SimInfo::SlotInfo &info : imeis) {
            if (info.slot == slot)
                imei = info.value;
        }
        QStringList words{state.present ? state.imsi : QStringLiteral("no SIM"), state.serviceProviderName,
                          state.subscriberNumbers.join(QLatin1String(" "))};
        if (!imei.isEmpty())
            words.append(QStringLiteral("IMEI ") + imei);
        words.removeAll(QString());
        inventory.add(QStringLiteral("SIM %1").arg(slot), words.join(QLatin1String(", ")));
        json.append(
            QJsonObject{{QStringLiteral("present"), state.present},
                        {QStringLiteral("imsi"), state.imsi},
                        {QStringLiteral("provider"), state.serviceProviderName},
                        {QStringLiteral("numbers"), QJsonArray::fromStringList(state.subscriberNumbers)},
                        {QStringLiteral("imei"), imei}});
    }
    if (states.isEmpty())
        inventory.add(QStringLiteral("SIMs"), QStringLiteral("none"));
    inventory.addMember(member, json);
}

void addAddresses(Inventory &inventory)
{
    // That the phone has no Bluetooth address to tell is seen in the table.
    const WarningCapture missing(QStringLiteral("^Unable to read file bluetooth MAC address"),
                                 [](const QString &) {});
    inventory.add(QStringLiteral("WLAN"), QStringLiteral("wlanAddress"), SysInfo::wlanMacAddress());
    inventory.add(QStringLiteral("Bluetooth"), QStringLiteral("bluetoothAddress"),
                  SysInfo::bluetoothMacAddress());
}

void addLock(Inventory &inventory, const Timeouts &timeouts)
{
    const QString member = QStringLiteral("lockState");
    const Service daemon = Service::deviceLock();
    Reply reply = daemon.ensureRunning();
    DeviceLocker locker(timeouts.confirmation);
    if (reply.isDone())
        reply = locker.open();
    if (reply.isDone())
        inventory.add(QStringLiteral("lock"), member, DeviceLocker::wordOf(locker.lock().state()));
    else
        inventory.addMissing(QStringLiteral("lock"), member, daemon, reply);
    const bool isEncrypted = locker.lock().isHomeEncrypted();
    inventory.add(QStringLiteral("user's data"),
                  isEncrypted ? QStringLiteral("encrypted") : QStringLiteral("not encrypted"));
    inventory.addMember(QStringLiteral("homeEncrypted"), isEncrypted);
}

void addBattery(Inventory &inventory, const Timeouts &timeouts)
{
    const QString title = QStringLiteral("battery");
    // A phone without a battery never tells of one.
    constexpr std::chrono::milliseconds longest(2000);
    const Service power{QStringLiteral("org.freedesktop.UPower"), QStringLiteral("power service")};
    Reply reply = power.ensureRunning();
    Mdm::BatteryInfo battery;
    if (reply.isDone()) {
        Wait wait(power, std::min(timeouts.confirmation, longest), QStringLiteral("tell of a battery"));
        wait.until(&battery, &BatteryStatus::chargePercentageChanged,
                   [&battery] { return battery.chargePercentage() >= 0; });
        reply = wait.run();
    }
    if (!reply.isDone())
        return inventory.addMissing(title, title, power, reply);
    inventory.add(title, QStringLiteral("%1%").arg(battery.chargePercentage()));
    inventory.addMember(title, battery.chargePercentage());
}

void addPackages(Inventory &inventory)
{
    const int count = Mdm::Applications().getInstalledPackages().size();
    inventory.add(QStringLiteral("packages"), QString::number(count));
    inventory.addMember(QStringLiteral("packages"), count);
}

int runInfo(const Values &values)
{
    const Timeouts timeouts = timeoutsOf(values);
    Inventory inventory;
    addDevice(inventory);
    addSims(inventory, timeouts);
    addAddresses(inventory);
    addLock(inventory, timeouts);
    addBattery(inventory, timeouts);
    addPackages(inventory);
    printResult(values, inventory.toString(), inventory.toJson());
    return ExitDone;
}

} // namespace

Command infoCommand()
{
    Command info;
    info.name = QStringLiteral("info");
    info.summary = QStringLiteral("Show what is known of this phone, on one screen");
    info.description = QStringLiteral(
        "What a service would have to tell that is not there is not known; the rest is shown all the "
        "same.\n\n"
        "JSON: {\"manufacturer\": \"...\", \"productName\": \"...\", \"model\": \"...\", \"deviceUid\": "
        "\"...\",\n"
        "\"softwareVersion\": \"...\", \"softwareVersionId\": \"...\", \"sims\": [{\"present\": true, "
        "\"imsi\": "
        "\"...\",\n\"provider\": \"...\", \"numbers\": [], \"imei\": \"...\"}], \"wlanAddress\": \"...\", "
        "\"bluetoothAddress\": \"...\",\n\"lockState\": \"unlocked\", \"homeEncrypted\": true, \"battery\": "
        "76, "
        "\"packages\": 3, "
        "\"missingServices\": []}.\nWhat is not known is null.");
    info.options = {jsonOption(),
                    timeoutOption(QStringLiteral("Wait so many seconds for each service (default: 25)"))};
    info.run = runInfo;
    return info;
}

} // namespace Agent
} // namespace Corvane
