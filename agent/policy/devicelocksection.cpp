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

Setting::Value allowedOrNot(bool value)
{
    return {value, value ? QStringLiteral("allowed") : QStringLiteral("forbidden")};
}

} // namespace

DeviceLockSection::DeviceLockSection(std::chrono::milliseconds timeout)
    : m_timeout(timeout)
{
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

Reply DeviceLockSection::open(const QJsonObject &)
{
    m_locker = std::make_unique<DeviceLocker>(m_timeout);
    m_switches = std::make_unique<SecuritySwitches>(m_timeout);
    const Reply opened = m_locker->open();
    connect(&m_locker->lock(), &DeviceLock::stateChanged, this, &DeviceLockSection::drifted);
    return opened;
}

void DeviceLockSection::close()
{
    m_locker.reset();
    m_switches.reset();
}

bool DeviceLockSection::mayHaveDrifted()
{
    return m_sideloadingSeen && *m_sideloadingSeen != m_switches->sideloading().value;
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

Setting DeviceLockSection::compareSideloading(Setting setting)
{
    const Answer<bool> sideloading = m_switches->sideloading();
    m_sideloadingSeen = sideloading.value;
    // A phone that does not say can be told all the same.
    if (!sideloading.reply.isDone())
        return setting.with(Setting::Different, sideloading.reply.text);
    setting.present = allowedOrNot(sideloading.value);
    return setting.compared();
}

Reply DeviceLockSection::change(const Setting &setting)
{
    const bool wanted = setting.wanted.json.toBool();
    if (setting.path == lockoutPath)
        return m_locker->setLockout(wanted);
    const Reply reply = m_switches->setSideloading(wanted);
    if (reply.isDone())
        m_sideloadingSeen = wanted;
    return reply;
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
