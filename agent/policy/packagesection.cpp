// SPDX-License-Identifier: LGPL-2.1-or-later
#include "packagesection.h"

#include "schemaexplanation.h"

#include <QtCore/QJsonArray>

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String packagesMember("packages");
const QLatin1String requiredMember("required");
const QLatin1String forbiddenMember("forbidden");
const QLatin1String pinnedMember("pinned");
const QLatin1String nameMember("name");
const QLatin1String versionMember("version");

const QString notInstalled = QStringLiteral("not installed");

/** One package that the policy names. */
struct Named {
    QLatin1String list;
    int index;
    QString name;
    QString version; ///< of pinned ones

    QString path() const
    {
        return QStringList{QString(packagesMember), QString(list), name}.join(QLatin1Char('.'));
    }
};

QVector<Named> namedIn(const QJsonObject &wanted)
{
    QVector<Named> all;
    for (const QLatin1String list : {requiredMember, pinnedMember, forbiddenMember}) {
        const QJsonArray packages = wanted.value(list).toArray();
        for (int index = 0; index < packages.size(); ++index) {
            const QJsonValue package = packages.at(index);
            const QJsonObject pinned = package.toObject();
            all.append({list, index, pinned.value(nameMember).toString(package.toString()),
                        pinned.value(versionMember).toString()});
        }
    }
    return all;
}

/** Whether @p installed, which has no release, may be what @p pinned means, which has one. */
bool isVersion(const QString &installed, const QString &pinned)
{
    return installed == pinned || pinned.startsWith(installed + QLatin1Char('-'));
}

} // namespace

PackageSection::PackageSection(std::chrono::milliseconds timeout)
    : m_timeout(timeout)
{
}

QString PackageSection::member() const
{
    return packagesMember;
}

Service PackageSection::service() const
{
    return Service::packageKit();
}

QString PackageSection::fault(const QJsonObject &wanted) const
{
    QMap<QString, QLatin1String> lists;
    const QVector<Named> all = namedIn(wanted);
    for (const Named &package : all) {
        if (lists.contains(package.name)) {
            const QStringList steps{member(), QString(package.list), QString::number(package.index)};
            return QStringLiteral(R"(%1: must be named once; "%2" is among the %3 packages already)")
                .arg(jsonPointer(steps), package.name, lists.value(package.name));
        }
        lists.insert(package.name, package.list);
    }
    return QString();
}

QVector<Setting> PackageSection::settings(const QJsonObject &wanted) const
{
    QVector<Setting> settings;
    const QVector<Named> all = namedIn(wanted);
    for (const Named &package : all) {
        Setting setting;
        setting.path = package.path();
        if (package.list == pinnedMember)
            setting.wanted = {package.version, package.version};
        else if (package.list == requiredMember)
            setting.wanted = {true, QStringLiteral("installed")};
        else
            setting.wanted = {false, notInstalled};
        settings.append(setting);
    }
    return settings;
}

Reply PackageSection::open(const QJsonObject &)
{
    m_manager = std::make_unique<PackageManager>(m_timeout);
    m_known = installed();
    // PackageKit is idle after each thing that it did, those that changed nothing included.
    connect(m_manager.get(), &PackageManager::idle, this, [this] {
        if (mayHaveDrifted())
            Q_EMIT drifted();
    });
    return {};
}

void PackageSection::close()
{
    m_manager.reset();
}

PackageSection::Packages PackageSection::installed() const
{
    Packages versions;
    const QList<Mdm::PackageEntry> packages = m_manager->packages();
    for (const Mdm::PackageEntry &package : packages)
        versions.insert(package.name(), package.version());
    return versions;
}

QVector<Setting> PackageSection::compare(const QJsonObject &wanted)
{
    m_known = installed();
    QVector<Setting> settings = this->settings(wanted);
    const QVector<Named> all = namedIn(wanted);
    for (int index = 0; index < settings.size(); ++index)
        settings[index] = compared(settings.at(index), m_known.value(all.at(index).name));
    return settings;
}

Setting PackageSection::compared(Setting setting, const QString &version)
{
    const QJsonValue wanted = setting.wanted.json;
    setting.present = version.isEmpty() ? Setting::Value{QJsonValue::Null, notInstalled}
                                        : Setting::Value{version, version};
    if (wanted.isString()) {
        if (!version.isEmpty() && isVersion(version, wanted.toString()))
            return setting;
        return setting.with(Setting::Different, QLatin1String("install ") + wanted.toString());
    }
    if (wanted.toBool() == !version.isEmpty())
        return setting;
    return setting.with(Setting::Different,
                        wanted.toBool() ? QStringLiteral("install the newest version")
                                        : QStringLiteral("remove it"));
}

Reply PackageSection::change(const Setting &setting)
{
    // Names may have dots of their own.
    const QString name = setting.path.section(QLatin1Char('.'), 2);
    const QJsonValue wanted = setting.wanted.json;
    const bool forbidden = wanted.isBool() && !wanted.toBool();
    const Reply reply
        = forbidden ? m_manager->remove(name, true) : m_manager->install(name, wanted.toString());
    m_known = installed();
    return reply;
}

QJsonObject PackageSection::exported()
{
    return {{requiredMember, QJsonArray::fromStringList(installed().keys())}};
}

} // namespace Agent
} // namespace Corvane
