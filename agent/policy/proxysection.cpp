// SPDX-License-Identifier: LGPL-2.1-or-later
#include "proxysection.h"

#include "schemaexplanation.h"

#include <algorithm>

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String useMember("use");
const QLatin1String globalMember("global");
const QLatin1String networksMember("networks");

const QLatin1String usePath("proxy.use");
const QLatin1String globalPath("proxy.global");
const QLatin1String networksPath("proxy.networks.");

Setting::Value valueOf(const ProxyConfiguration &configuration)
{
    return {configuration.toJson(), configuration.toString()};
}

ProxyConfiguration wantedBy(const Setting &setting)
{
    return ProxyConfiguration::fromJson(setting.wanted.json.toObject());
}

/** What the schema cannot say of a configuration. */
QString faultOf(const QJsonObject &configuration, const QStringList &steps)
{
    const auto member = [&](const char *name) {
        return configuration.value(QLatin1String(name));
    };
    const auto at = [&](const QStringList &further) {
        return jsonPointer(QStringList(QStringLiteral("proxy")) + steps + further);
    };
    const QString method = member("method").toString();
    const QStringList servers = ProxyConfiguration::fromJson(configuration).servers;
    if (method == QLatin1String("manual") && servers.isEmpty())
        return at({}) + QStringLiteral(": a manual proxy needs \"servers\"");
    if (method == QLatin1String("automatic") && member("url").toString().isEmpty())
        return at({}) + QStringLiteral(": an automatic proxy needs \"url\"");
    for (int i = 0; i < servers.size(); ++i) {
        const QString fault = ProxyConfiguration::urlFault(servers.at(i));
        if (!fault.isEmpty())
            return QStringLiteral("%1: %2; is \"%3\"")
                .arg(at({QStringLiteral("servers"), QString::number(i)}), fault, servers.at(i));
    }
    const QString url = member("url").toString();
    const QString fault = url.isEmpty() ? QString() : ProxyConfiguration::urlFault(url);
    return fault.isEmpty() ? QString()
                           : QStringLiteral("%1: %2; is \"%3\"").arg(at({QStringLiteral("url")}), fault, url);
}

} // namespace

ProxySection::ProxySection(std::chrono::milliseconds timeout)
    : m_timeout(timeout)
{
}

QString ProxySection::member() const
{
    return QStringLiteral("proxy");
}

Service ProxySection::service() const
{
    return Service::connectionManager();
}

QString ProxySection::fault(const QJsonObject &wanted) const
{
    QString fault = faultOf(wanted.value(globalMember).toObject(), {globalMember});
    const QJsonObject networks = wanted.value(networksMember).toObject();
    for (auto network = networks.begin(); fault.isEmpty() && network != networks.end(); ++network)
        fault = faultOf(network.value().toObject(), {networksMember, network.key()});
    return fault;
}

QVector<Setting> ProxySection::settings(const QJsonObject &wanted) const
{
    QVector<Setting> settings;
    const auto add = [&settings](const QString &path, const QJsonObject &configuration) {
        Setting setting;
        setting.path = path;
        setting.wanted = valueOf(ProxyConfiguration::fromJson(configuration));
        settings.append(setting);
    };
    // A proxy is in order before it is used.
    if (wanted.contains(globalMember))
        add(globalPath, wanted.value(globalMember).toObject());
    const QJsonObject networks = wanted.value(networksMember).toObject();
    for (auto network = networks.begin(); network != networks.end(); ++network)
        add(networksPath + network.key(), network.value().toObject());
    if (wanted.contains(useMember)) {
        Setting setting;
        setting.path = usePath;
        setting.wanted = {wanted.value(useMember), wanted.value(useMember).toString()};
        settings.append(setting);
    }
    return settings;
}

Reply ProxySection::open(const QJsonObject &)
{
    m_proxies = std::make_unique<Proxies>(m_timeout);
    const Reply opened = m_proxies->open();
    if (opened.isDone()) {
        follow(Proxies::global());
    }
    return opened;
}

void ProxySection::close()
{
    m_followed.clear();
    m_proxies.reset();
}

/** A selection hears of its own proxy alone, so that each that is to be followed has one. */
void ProxySection::follow(const QString &identifier)
{
    const bool isFollowed = std::any_of(m_followed.begin(), m_followed.end(),
                                        [&](const auto &each) { return each->identifier() == identifier; });
    if (isFollowed)
        return;
    auto followed = std::make_unique<Proxies>(m_timeout);
    if (!followed->open().isDone() || !followed->select(identifier).isDone())
        return;
    connect(followed.get(), &Proxies::changed, this, &ProxySection::drifted);
    m_followed.push_back(std::move(followed));
}

QVector<Setting> ProxySection::compare(const QJsonObject &wanted)
{
    // Those of networks that have gone would be silent for good.
    m_followed.erase(std::remove_if(m_followed.begin(), m_followed.end(),
                                    [](const auto &each) { return each->identifier().isEmpty(); }),
                     m_followed.end());
    QVector<Setting> compared = settings(wanted);
    for (Setting &setting : compared) {
        if (setting.path == usePath)
            setting = compareUse(setting);
        else if (setting.path == globalPath)
            setting = compareGlobal(setting);
        else
            setting = compareNetworks(setting, setting.path.mid(networksPath.size()));
    }
    return compared;
}

Setting ProxySection::compareUse(Setting setting) const
{
    const QString use = m_proxies->usesGlobal() ? globalMember : networksMember;
    setting.present = {use, use};
    setting.status = setting.wanted.text == use ? Setting::Compliant : Setting::Different;
    return setting;
}

Setting ProxySection::compareGlobal(Setting setting)
{
    const Reply selected = m_proxies->select(Proxies::global());
    if (!selected.isDone())
        return setting.with(Setting::Failed, selected.text);
    const ProxyConfiguration present = m_proxies->configuration();
    setting.present = valueOf(present);
    setting.status = present == wantedBy(setting) ? Setting::Compliant : Setting::Different;
    return setting;
}

Setting ProxySection::compareNetworks(Setting setting, const QString &name)
{
    const QStringList networks = m_proxies->networksNamed(name);
    if (networks.isEmpty())
        return setting.with(Setting::Unsupported, QStringLiteral("the phone has no such network saved now"));
    setting.status = Setting::Compliant;
    for (const QString &network : networks) {
        follow(network);
        if (!m_proxies->select(network).isDone())
            continue; // it has just gone
        const ProxyConfiguration present = m_proxies->configuration();
        const bool isAsWanted = present == wantedBy(setting);
        // Of several networks with that name, the first that differs is shown.
        if (setting.status == Setting::Compliant)
            setting.present = valueOf(present);
        if (!isAsWanted)
            setting.status = Setting::Different;
    }
    return setting;
}

Reply ProxySection::change(const Setting &setting)
{
    if (setting.path == usePath)
        return m_proxies->useGlobal(setting.wanted.text == globalMember);
    const QStringList targets = setting.path == globalPath
        ? QStringList(Proxies::global())
        : m_proxies->networksNamed(setting.path.mid(networksPath.size()));
    for (const QString &target : targets) {
        Reply reply = m_proxies->select(target);
        if (reply.isDone())
            reply = m_proxies->configure(wantedBy(setting));
        if (!reply.isDone())
            return reply;
    }
    return {};
}

QJsonObject ProxySection::exported()
{
    QJsonObject exported{{useMember, m_proxies->usesGlobal() ? globalMember : networksMember}};
    if (m_proxies->select(Proxies::global()).isDone())
        exported.insert(globalMember, m_proxies->configuration().toJson());
    QJsonObject networks;
    const QStringList identifiers = m_proxies->networks();
    for (const QString &identifier : identifiers) {
        if (m_proxies->select(identifier).isDone())
            networks.insert(identifier, m_proxies->configuration().toJson());
    }
    if (!networks.isEmpty())
        exported.insert(networksMember, networks);
    return exported;
}

} // namespace Agent
} // namespace Corvane
