// SPDX-License-Identifier: LGPL-2.1-or-later
#include "cellularsection.h"

#include "schemaexplanation.h"
#include "secret.h"
#include "simrules.h"

#include <QtCore/QJsonArray>

#include <algorithm>

namespace Corvane
{
namespace Agent
{

using Modem = MobileNetworks::Modem;

namespace
{

const QLatin1String cellularMember("cellular");
const QLatin1String simsMember("sims");
const QLatin1String imsiMember("imsi");
const QLatin1String technologiesMember("technologies");
const QLatin1String accessPointsMember("accessPoints");
const QLatin1String connectedMember("connected");
const QLatin1String passwordFileMember("passwordFile");

/** What a setting is for each SIM: one value, or with several SIMs the values by IMSI. */
Setting::Value valueFor(const QString &wantedImsi, const QVector<QPair<QString, Setting::Value>> &values)
{
    if (wantedImsi != AnySim)
        return values.isEmpty() ? Setting::Value() : values.first().second;
    QJsonObject json;
    QStringList lines;
    for (const auto &[imsi, value] : values) {
        json.insert(imsi, value.json);
        const QStringList parts = value.text.split(QLatin1Char('\n'));
        for (const QString &part : parts)
            lines.append(QStringLiteral("%1: %2").arg(imsi, part));
    }
    return {json, lines.isEmpty() ? QStringLiteral("no SIMs") : lines.join(QLatin1Char('\n'))};
}

Setting::Value technologiesValue(const QString &name)
{
    return {name, name};
}

Setting::Value connectionValue(bool connected)
{
    return {connected, connected ? QStringLiteral("up") : QStringLiteral("down")};
}

Setting::Value accessPointValue(const QJsonObject &members)
{
    QStringList lines;
    for (const AccessPointMember &member : accessPointMembers()) {
        if (members.contains(member.name))
            lines.append(QStringLiteral("%1=%2").arg(member.name, members.value(member.name).toString()));
    }
    if (members.contains(passwordFileMember)) {
        const QString file = members.value(passwordFileMember).toString();
        lines.append(file.isEmpty() ? QStringLiteral("another password")
                                    : QStringLiteral("password of %1").arg(file));
    }
    return {members, lines.join(QLatin1Char('\n'))};
}

/** The members of @p wanted that an access point has, but for the password. */
QJsonObject withoutPassword(QJsonObject wanted)
{
    wanted.remove(passwordFileMember);
    return wanted;
}

QString quotedImsi(const QString &imsi)
{
    return QStringLiteral("no SIM %1 in the phone").arg(imsi);
}

} // namespace

QString CellularSection::Item::path() const
{
    QStringList steps{cellularMember, imsi};
    switch (kind) {
    case RadioTechnologies:
        steps.append(technologiesMember);
        break;
    case AccessPointOfType:
        steps += {accessPointsMember, accessPointTypeName(type)};
        break;
    case Connection:
        steps.append(connectedMember);
        break;
    }
    return steps.join(QLatin1Char('.'));
}

CellularSection::CellularSection(std::chrono::milliseconds timeout)
    : m_timeout(timeout)
{
}

QString CellularSection::member() const
{
    return cellularMember;
}

Service CellularSection::service() const
{
    return Service::telephony();
}

QString CellularSection::fault(const QJsonObject &wanted) const
{
    const QJsonArray sims = wanted.value(simsMember).toArray();
    QStringList seen;
    for (int i = 0; i < sims.size(); ++i) {
        const QJsonObject sim = sims.at(i).toObject();
        const QStringList steps{cellularMember, simsMember, QString::number(i)};
        const QString imsi = sim.value(imsiMember).toString();
        if (seen.contains(imsi)) {
            return QStringLiteral(R"(%1: must be named once; "%2" has settings already)")
                .arg(jsonPointer(steps + QStringList(imsiMember)), imsi);
        }
        seen.append(imsi);
        const QJsonObject accessPoints = sim.value(accessPointsMember).toObject();
        for (auto each = accessPoints.begin(); each != accessPoints.end(); ++each) {
            const QJsonValue file = each->toObject().value(passwordFileMember);
            const Secret secret = file.isString() ? secretFromFile(file.toString()) : Secret();
            if (!secret.reply.isDone()) {
                return QStringLiteral("%1: %2").arg(
                    jsonPointer(steps + QStringList{accessPointsMember, each.key(), passwordFileMember}),
                    secret.reply.text);
            }
        }
    }
    return QString();
}

QVector<CellularSection::Item> CellularSection::itemsOf(const QJsonObject &wanted)
{
    QVector<Item> items;
    const QJsonArray sims = wanted.value(simsMember).toArray();
    for (const QJsonValue &each : sims) {
        const QJsonObject sim = each.toObject();
        const QString imsi = sim.value(imsiMember).toString();
        if (sim.contains(technologiesMember)) {
            items.append(
                {Item::RadioTechnologies, imsi, AccessPoint::Internet, sim.value(technologiesMember), {}});
        }
        const QJsonObject accessPoints = sim.value(accessPointsMember).toObject();
        const QStringList names = accessPointTypeNames();
        for (const QString &name : names) {
            if (accessPoints.contains(name)) {
                items.append({Item::AccessPointOfType,
                              imsi,
                              *accessPointTypeNamed(name),
                              accessPoints.value(name),
                              {}});
            }
        }
        // What it connects to comes first.
        if (sim.contains(connectedMember))
            items.append({Item::Connection, imsi, AccessPoint::Internet, sim.value(connectedMember), {}});
    }
    return items;
}

Setting CellularSection::settingOf(const Item &item)
{
    Setting setting;
    setting.path = item.path();
    switch (item.kind) {
    case Item::RadioTechnologies:
        setting.wanted = technologiesValue(item.wanted.toString());
        break;
    case Item::AccessPointOfType:
        setting.wanted = accessPointValue(item.wanted.toObject());
        break;
    case Item::Connection:
        setting.wanted = connectionValue(item.wanted.toBool());
        break;
    }
    return setting;
}

QVector<Setting> CellularSection::settings(const QJsonObject &wanted) const
{
    QVector<Setting> settings;
    const QVector<Item> items = itemsOf(wanted);
    for (const Item &item : items)
        settings.append(settingOf(item));
    return settings;
}

Reply CellularSection::open(const QJsonObject &wanted)
{
    m_networks = std::make_unique<MobileNetworks>(m_timeout);
    if (wanted.isEmpty())
        return {};
    m_sims = std::make_unique<SimCards>(m_timeout);
    if (m_sims->ask().isDone())
        m_knownImsis = m_sims->imsis();
    connect(m_sims.get(), &SimCards::changed, this, &CellularSection::followSims);
    return {};
}

void CellularSection::close()
{
    m_networks.reset();
    m_sims.reset();
}

void CellularSection::followSims()
{
    // Looking at access points changes the SIM for mobile data, which must not bring this about again.
    const QStringList imsis = m_sims->imsis();
    if (imsis == m_knownImsis)
        return;
    m_knownImsis = imsis;
    Q_EMIT drifted();
}

QString CellularSection::modemOf(const QString &imsi) const
{
    const auto found = std::find_if(m_modems.cbegin(), m_modems.cend(),
                                    [&imsi](const Modem &modem) { return modem.imsi == imsi; });
    return found == m_modems.cend() ? QString() : found->path;
}

QVector<CellularSection::Item> CellularSection::locate(QVector<Item> items) const
{
    QStringList named;
    for (const Item &item : qAsConst(items))
        named.append(item.imsi);
    for (Item &item : items) {
        for (const Modem &modem : m_modems) {
            const bool isMeant
                = item.imsi == modem.imsi || (item.imsi == AnySim && !named.contains(modem.imsi));
            if (isMeant && !modem.imsi.isEmpty())
                item.targets.append(modem.imsi);
        }
    }
    return items;
}

Reply CellularSection::learn(const QVector<Item> &items)
{
    const Answer<QVector<Modem>> modems = m_networks->modems();
    m_modems = modems.value;
    m_items.clear();
    m_accessPoints = {};
    if (!modems.reply.isDone())
        return modems.reply;
    QStringList imsis;
    const QVector<Item> located = locate(items);
    for (const Item &item : located) {
        m_items.insert(item.path(), item);
        if (item.kind != Item::AccessPointOfType)
            continue;
        for (const QString &imsi : item.targets) {
            if (!imsis.contains(imsi))
                imsis.append(imsi);
        }
    }
    if (!imsis.isEmpty())
        m_accessPoints = m_networks->accessPoints(imsis);
    return {};
}

QVector<Setting> CellularSection::compare(const QJsonObject &wanted)
{
    const QVector<Item> items = itemsOf(wanted);
    const Reply learnt = learn(items);
    QVector<Setting> settings;
    for (const Item &item : items) {
        settings.append(learnt.isDone() ? compareItem(m_items.value(item.path()))
                                        : settingOf(item).unanswered(learnt));
    }
    return settings;
}

Setting CellularSection::compareItem(const Item &item) const
{
    if (item.targets.isEmpty() && item.imsi != AnySim)
        return settingOf(item).with(Setting::Unsupported, quotedImsi(item.imsi));
    switch (item.kind) {
    case Item::RadioTechnologies:
        return compareTechnologies(item);
    case Item::AccessPointOfType:
        return compareAccessPoint(item);
    case Item::Connection:
        break;
    }
    return compareConnection(item);
}

Setting CellularSection::compareTechnologies(const Item &item) const
{
    Setting setting = settingOf(item);
    const QString name = item.wanted.toString();
    const Technologies technologies = technologiesNamed(name).value_or(Technologies());
    QVector<QPair<QString, Setting::Value>> present;
    QVector<QPair<QString, Setting::Value>> wanted;
    for (const QString &imsi : item.targets) {
        const QString modem = modemOf(imsi);
        const Answer<QVector<Technologies>> supported = m_networks->supported(modem);
        if (!supported.reply.isDone())
            return setting.unanswered(supported.reply);
        if (technologies != Technologies() && !supported.value.contains(technologies)) {
            return setting.with(Setting::Unsupported,
                                QStringLiteral("modem %1 does not offer %2").arg(modem, name));
        }
        const Answer<Technologies> selected = m_networks->selected(modem);
        if (!selected.reply.isDone())
            return setting.unanswered(selected.reply);
        present.append({imsi, technologiesValue(technologiesName(selected.value))});
        wanted.append({imsi, technologiesValue(name)});
    }
    setting.present = valueFor(item.imsi, present);
    setting.wanted = valueFor(item.imsi, wanted);
    return setting.compared();
}

Answer<AccessPoint> CellularSection::wantedAccessPoint(const Item &item, const QString &imsi) const
{
    Answer<AccessPoint> answer;
    const QJsonObject members = item.wanted.toObject();
    answer.value
        = accessPointWith(m_accessPoints.value.value(imsi).value(item.type), withoutPassword(members));
    if (members.contains(passwordFileMember)) {
        const Secret secret = secretFromFile(members.value(passwordFileMember).toString());
        answer.reply = secret.reply;
        answer.value.password = secret.text;
    }
    return answer;
}

Setting CellularSection::compareAccessPoint(const Item &item) const
{
    Setting setting = settingOf(item);
    if (!m_accessPoints.reply.isDone())
        return setting.unanswered(m_accessPoints.reply);
    QVector<QPair<QString, Setting::Value>> present;
    QVector<QPair<QString, Setting::Value>> wanted;
    for (const QString &imsi : item.targets) {
        const MobileNetworks::AccessPoints accessPoints = m_accessPoints.value.value(imsi);
        if (!accessPoints.contains(item.type)) {
            return setting.with(Setting::Unsupported,
                                QStringLiteral("SIM %1 has no access point of this type").arg(imsi));
        }
        const Answer<AccessPoint> wantedHere = wantedAccessPoint(item, imsi);
        if (!wantedHere.reply.isDone())
            return setting.unanswered(wantedHere.reply);
        const QJsonObject all = accessPointToJson(accessPoints.value(item.type));
        QJsonObject named = item.wanted.toObject();
        for (auto member = named.begin(); member != named.end(); ++member) {
            if (member.key() != passwordFileMember)
                *member = all.value(member.key());
            else if (accessPoints.value(item.type).password != wantedHere.value.password)
                *member = QJsonValue::Null;
        }
        present.append({imsi, accessPointValue(named)});
        wanted.append({imsi, accessPointValue(item.wanted.toObject())});
    }
    setting.present = valueFor(item.imsi, present);
    setting.wanted = valueFor(item.imsi, wanted);
    return setting.compared();
}

Setting CellularSection::compareConnection(const Item &item) const
{
    Setting setting = settingOf(item);
    QVector<QPair<QString, Setting::Value>> present;
    QVector<QPair<QString, Setting::Value>> wanted;
    for (const QString &imsi : item.targets) {
        const Answer<bool> connected = m_networks->isConnected(imsi);
        if (!connected.reply.isDone())
            return setting.unanswered(connected.reply);
        present.append({imsi, connectionValue(connected.value)});
        wanted.append({imsi, connectionValue(item.wanted.toBool())});
    }
    setting.present = valueFor(item.imsi, present);
    setting.wanted = valueFor(item.imsi, wanted);
    return setting.compared();
}

Reply CellularSection::changeFor(const Item &item, const QString &imsi)
{
    switch (item.kind) {
    case Item::RadioTechnologies:
        return m_networks->select(modemOf(imsi),
                                  technologiesNamed(item.wanted.toString()).value_or(Technologies()));
    case Item::AccessPointOfType: {
        const Answer<AccessPoint> wanted = wantedAccessPoint(item, imsi);
        return wanted.reply.isDone() ? m_networks->setAccessPoint(imsi, wanted.value) : wanted.reply;
    }
    case Item::Connection:
        break;
    }
    return m_networks->setConnected(imsi, item.wanted.toBool());
}

Reply CellularSection::change(const Setting &setting)
{
    const Item item = m_items.value(setting.path);
    for (const QString &imsi : item.targets) {
        if (item.imsi == AnySim && setting.present.json[imsi] == setting.wanted.json[imsi])
            continue;
        const Reply changed = changeFor(item, imsi);
        if (!changed.isDone())
            return changed;
    }
    return {};
}

QJsonObject CellularSection::exportedSim(const Modem &modem) const
{
    QJsonObject sim{{imsiMember, modem.imsi}};
    const Answer<QVector<Technologies>> supported = m_networks->supported(modem.path);
    const Answer<Technologies> selected = m_networks->selected(modem.path);
    if (supported.reply.isDone() && selected.reply.isDone() && !supported.value.isEmpty())
        sim.insert(technologiesMember, technologiesName(selected.value));
    QJsonObject accessPoints;
    for (const AccessPoint &accessPoint : m_accessPoints.value.value(modem.imsi))
        accessPoints.insert(accessPointTypeName(accessPoint.type), accessPointToJson(accessPoint));
    if (!accessPoints.isEmpty())
        sim.insert(accessPointsMember, accessPoints);
    const Answer<bool> connected = m_networks->isConnected(modem.imsi);
    if (connected.reply.isDone())
        sim.insert(connectedMember, connected.value);
    return sim;
}

QJsonObject CellularSection::exported()
{
    const Answer<QVector<Modem>> modems = m_networks->modems();
    QStringList imsis;
    for (const Modem &modem : modems.value) {
        if (!modem.imsi.isEmpty())
            imsis.append(modem.imsi);
    }
    if (imsis.isEmpty())
        return {};
    m_accessPoints = m_networks->accessPoints(imsis);
    QJsonArray sims;
    for (const Modem &modem : modems.value) {
        if (!modem.imsi.isEmpty())
            sims.append(exportedSim(modem));
    }
    return {{simsMember, sims}};
}

} // namespace Agent
} // namespace Corvane
