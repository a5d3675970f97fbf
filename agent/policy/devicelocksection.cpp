// SPDX-License-Identifier: LGPL-2.1-or-later
#include "devicelocksection.h"

namespace Corvane
{
namespace Agent
{

using Mdm::DeviceLock;

namespace
{

const QLatin1String lockoutMember("lockout");
const QLatin1String sideloadingMember("sideloading");
const QLatin1String lockoutPath("deviceLock.lockout");
const QLatin1String sideloadingPath("deviceLock.sideloading");

constexpr std::chrono::milliseconds lookEvery(2000);

Setting::Value allowedOrNot(bool value)
{
    return {value, value ? QStringLiteral("allowed") : QStringLiteral("forbidden")};
}

} // namespace

DeviceLockSection::DeviceLockSection(std::chrono::milliseconds timeout)
    : m_timeout(timeout)
{
    connect(&m_look, &QTimer::timeout, this, &DeviceLockSection::lookAtSideloading);
}

QString DeviceLockSection::member() const
{
    return QStringLiteral("deviceLock");
}

Service DeviceLockSection::service() const
{
    return Service::deviceLock();
}

QString DeviceLockSection::fault(const QJsonObject &) const
{
    return QString();
}

QVector<Setting> DeviceLockSection::settings(const QJsonObject &wanted) const
{
    QVector<Setting> settings;
    if (wanted.contains(lockoutMember)) {
        Setting setting;
        setting.path = lockoutPath;
        setting.wanted = Setting::Value::onOff(wanted.value(lockoutMember).toBool());
        settings.append(setting);
    }
    if (wanted.contains(sideloadingMember)) {
        Setting setting;
        setting.path = sideloadingPath;
        setting.wanted = allowedOrNot(wanted.value(sideloadingMember).toBool());
        settings.append(setting);
    }
    return settings;
}

Reply DeviceLockSection::open(const QJsonObject &wanted)
{
    m_locker = std::make_unique<DeviceLocker>(m_timeout);
    m_switches = std::make_unique<SecuritySwitches>(m_timeout);
    const Reply opened = m_locker->open();
    connect(&m_locker->lock(), &DeviceLock::stateChanged, this, &DeviceLockSection::drifted);
    if (wanted.contains(sideloadingMember)) {
        m_sideloadingSeen = m_switches->sideloading().value;
        m_look.start(lookEvery);
    }
    return opened;
}

void DeviceLockSection::close()
{
    m_look.stop();
    m_locker.reset();
    m_switches.reset();
}

void DeviceLockSection::lookAtSideloading()
{
    const bool isAllowed = m_switches->sideloading().value;
    if (isAllowed == m_sideloadingSeen)
        return;
    m_sideloadingSeen = isAllowed;
    Q_EMIT drifted();
}

QVector<Setting> DeviceLockSection::compare(const QJsonObject &wanted)
{
    QVector<Setting> settings = this->settings(wanted);
    for (Setting &setting : settings)
        setting = setting.path == lockoutPath ? compareLockout(setting) : compareSideloading(setting);
    return settings;
}

Setting DeviceLockSection::compareLockout(Setting setting) const
{
    const DeviceLock::State state = m_locker->lock().state();
    if (state == DeviceLock::Undefined)
        return setting.with(Setting::Failed, QStringLiteral("the phone does not tell how it is locked"));
    setting.present = Setting::Value::onOff(state == DeviceLock::ManagerLockout);
    return setting.compared();
}

Setting DeviceLockSection::compareSideloading(Setting setting) const
{
    const Answer<bool> sideloading = m_switches->sideloading();
    // A phone that does not say can be told all the same.
    if (!sideloading.reply.isDone())
        return setting.with(Setting::Different, sideloading.reply.text);
    setting.present = allowedOrNot(sideloading.value);
    return setting.compared();
}

Reply DeviceLockSection::change(const Setting &setting)
{
    const bool wanted = setting.wanted.json.toBool();
    return setting.path == lockoutPath ? m_locker->setLockout(wanted) : m_switches->setSideloading(wanted);
}

QJsonObject DeviceLockSection::exported()
{
    QJsonObject section{{lockoutMember, m_locker->lock().state() == DeviceLock::ManagerLockout}};
    const Answer<bool> sideloading = m_switches->sideloading();
    if (sideloading.reply.isDone())
        section.insert(sideloadingMember, sideloading.value);
    return section;
}

} // namespace Agent
} // namespace Corvane
