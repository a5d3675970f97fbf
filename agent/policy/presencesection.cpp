// SPDX-License-Identifier: LGPL-2.1-or-later
#include "presencesection.h"

#include <QtCore/QJsonArray>
#include <QtCore/QStringList>

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String requiredMember("required");
const QLatin1String forbiddenMember("forbidden");

const QString present = QStringLiteral("present");
const QString absent = QStringLiteral("absent");

Setting::Value presence(bool isPresent)
{
    return {isPresent, isPresent ? present : absent};
}

} // namespace

QString PresenceSection::pathOf(const QJsonValue &entry) const
{
    return member() + QLatin1Char('.') + nameOf(entry);
}

QString PresenceSection::fault(const QJsonObject &wanted) const
{
    QStringList names;
    for (const QLatin1String list : {requiredMember, forbiddenMember}) {
        const QJsonArray entries = wanted.value(list).toArray();
        for (int i = 0; i < entries.size(); ++i) {
            const QString name = nameOf(entries.at(i));
            if (names.contains(name)) {
                return QStringLiteral("/%1/%2/%3: must be named once; \"%4\" is there already")
                    .arg(member(), list)
                    .arg(i)
                    .arg(name);
            }
            names.append(name);
        }
    }
    return QString();
}

QVector<Setting> PresenceSection::settings(const QJsonObject &wanted) const
{
    QVector<Setting> settings;
    for (const QLatin1String list : {requiredMember, forbiddenMember}) {
        const QJsonArray entries = wanted.value(list).toArray();
        for (const QJsonValue &entry : entries) {
            Setting setting;
            setting.path = pathOf(entry);
            setting.wanted = presence(list == requiredMember);
            settings.append(setting);
        }
    }
    return settings;
}

QVector<Setting> PresenceSection::compare(const QJsonObject &wanted)
{
    m_entries.clear();
    for (const QLatin1String list : {requiredMember, forbiddenMember}) {
        const QJsonArray entries = wanted.value(list).toArray();
        for (const QJsonValue &entry : entries)
            m_entries.insert(pathOf(entry), entry);
    }
    const Reply looked = look();
    m_presentPaths.reset();
    if (looked.isDone())
        m_presentPaths = presentPaths();
    QVector<Setting> settings = this->settings(wanted);
    for (Setting &setting : settings) {
        setting = looked.isDone() ? compared(setting, m_entries.value(setting.path))
                                  : setting.with(Setting::Failed, looked.text);
    }
    return settings;
}

Setting PresenceSection::compared(Setting setting, const QJsonValue &entry) const
{
    const bool isPresent = has(entry);
    setting.present = presence(isPresent);
    if (setting.present.json == setting.wanted.json)
        return setting;
    if (isPresent)
        return setting.with(Setting::Different, QStringLiteral("remove it"));
    const QString why = obstacle(entry);
    return why.isEmpty() ? setting.with(Setting::Different, QStringLiteral("add it"))
                         : setting.with(Setting::Unsupported, why);
}

QSet<QString> PresenceSection::presentPaths() const
{
    QSet<QString> paths;
    for (auto entry = m_entries.cbegin(); entry != m_entries.cend(); ++entry) {
        if (has(entry.value()))
            paths.insert(entry.key());
    }
    return paths;
}

bool PresenceSection::mayHaveDrifted()
{
    return look().isDone() && m_presentPaths != presentPaths();
}

Reply PresenceSection::change(const Setting &setting)
{
    const QJsonValue entry = m_entries.value(setting.path);
    const bool isWanted = setting.wanted.json.toBool();
    const Reply reply = isWanted ? add(entry) : remove(entry);
    if (reply.isDone() && m_presentPaths) {
        if (isWanted)
            m_presentPaths->insert(setting.path);
        else
            m_presentPaths->remove(setting.path);
    }
    return reply;
}

} // namespace Agent
} // namespace Corvane
