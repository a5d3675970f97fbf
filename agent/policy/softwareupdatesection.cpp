// SPDX-License-Identifier: LGPL-2.1-or-later
#include "softwareupdatesection.h"

#include <QtCore/QScopedValueRollback>

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String installMember("install");
const QLatin1String latest("latest");

} // namespace

SoftwareUpdateSection::SoftwareUpdateSection(std::chrono::milliseconds timeout)
    : m_timeout(timeout)
{
}

QString SoftwareUpdateSection::member() const
{
    return QStringLiteral("softwareUpdate");
}

Service SoftwareUpdateSection::service() const
{
    return Service::mdmProxy();
}

QString SoftwareUpdateSection::fault(const QJsonObject &) const
{
    return QString();
}

QVector<Setting> SoftwareUpdateSection::settings(const QJsonObject &wanted) const
{
    if (!wanted.contains(installMember))
        return {};
    Setting setting;
    setting.path = QStringLiteral("softwareUpdate.install");
    setting.wanted = {wanted.value(installMember), wanted.value(installMember).toString()};
    return {setting};
}

Reply SoftwareUpdateSection::open(const QJsonObject &)
{
    m_updater = std::make_unique<SoftwareUpdater>(m_timeout);
    connect(m_updater->updates(), &Mdm::SoftwareUpdate::softwareUpdateInfoChanged, this, [this] {
        if (!m_busy)
            Q_EMIT drifted();
    });
    connect(m_updater.get(), &SoftwareUpdater::downloadProgress, this,
            [this](int percent) { Q_EMIT progress(QStringLiteral("softwareUpdate.install"), percent); });
    return {};
}

void SoftwareUpdateSection::close()
{
    m_updater.reset();
}

Reply SoftwareUpdateSection::refresh()
{
    const QScopedValueRollback<bool> busy(m_busy, true);
    return m_updater->check();
}

QVector<Setting> SoftwareUpdateSection::compare(const QJsonObject &wanted)
{
    QVector<Setting> settings = this->settings(wanted);
    for (Setting &setting : settings) {
        const SoftwareUpdater::Offer offer = m_updater->offer();
        setting = offer.reply.isDone() ? compared(setting, offer.version)
                                       : setting.with(Setting::Failed, offer.reply.text);
    }
    return settings;
}

Setting SoftwareUpdateSection::compared(Setting setting, const QString &offered)
{
    if (offered.isEmpty()) {
        setting.present = {QJsonValue::Null, QStringLiteral("no update on offer")};
        return setting;
    }
    setting.present = {offered, offered + QLatin1String(" on offer")};
    if (setting.wanted.text == latest || setting.wanted.text == offered)
        return setting.with(Setting::Different, QLatin1String("install ") + offered);
    return setting.with(Setting::Unsupported,
                        QStringLiteral("the phone offers %1 and no other version").arg(offered));
}

Reply SoftwareUpdateSection::change(const Setting &setting)
{
    const QScopedValueRollback<bool> busy(m_busy, true);
    const QString version = setting.present.json.toString();
    Reply reply = m_updater->download(version);
    if (reply.isDone())
        reply = m_updater->install();
    if (reply.isDone())
        reply = m_updater->waitUntilInstalled(version);
    return reply;
}

QJsonObject SoftwareUpdateSection::exported()
{
    // With an update on offer the phone is at no version that a policy could name.
    const SoftwareUpdater::Offer offer = m_updater->offer();
    if (!offer.reply.isDone() || !offer.version.isEmpty())
        return {};
    return {{installMember, QString(latest)}};
}

} // namespace Agent
} // namespace Corvane
