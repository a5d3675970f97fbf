// SPDX-License-Identifier: LGPL-2.1-or-later
#include "proxyconfiguration.h"

#include <QtCore/QJsonArray>
#include <QtCore/QUrl>

namespace Corvane
{
namespace Agent
{

using Mdm::NetProxy;

namespace
{

const QLatin1String methodMember("method");
const QLatin1String serversMember("servers");
const QLatin1String exclusionsMember("exclusions");
const QLatin1String urlMember("url");

const QLatin1String directMethod("direct");
const QLatin1String manualMethod("manual");
const QLatin1String automaticMethod("automatic");

QStringList toList(const QJsonValue &array)
{
    QStringList list;
    const QJsonArray items = array.toArray();
    for (const QJsonValue &item : items)
        list.append(item.toString());
    return list;
}

} // namespace

ProxyConfiguration ProxyConfiguration::fromJson(const QJsonObject &object)
{
    ProxyConfiguration configuration;
    const QString method = object.value(methodMember).toString();
    if (method == manualMethod)
        configuration.type = NetProxy::Manual;
    else if (method == automaticMethod)
        configuration.type = NetProxy::Automatic;
    configuration.servers = toList(object.value(serversMember));
    configuration.exclusions = toList(object.value(exclusionsMember));
    configuration.url = object.value(urlMember).toString();
    return configuration;
}

QJsonObject ProxyConfiguration::toJson() const
{
    switch (type) {
    case NetProxy::Manual:
        return {{methodMember, QString(manualMethod)},
                {serversMember, QJsonArray::fromStringList(servers)},
                {exclusionsMember, QJsonArray::fromStringList(exclusions)}};
    case NetProxy::Automatic:
        return {{methodMember, QString(automaticMethod)}, {urlMember, url}};
    case NetProxy::Direct:
    case NetProxy::Invalid:
        break;
    }
    return {{methodMember, QString(directMethod)}};
}

QString ProxyConfiguration::toString() const
{
    const QLatin1String separator(", ");
    switch (type) {
    case NetProxy::Manual:
        return QStringLiteral("manual: ") + servers.join(separator)
            + (exclusions.isEmpty() ? QString() : QStringLiteral(", but not ") + exclusions.join(separator));
    case NetProxy::Automatic:
        return QStringLiteral("automatic: ") + (url.isEmpty() ? QStringLiteral("found by the network") : url);
    case NetProxy::Direct:
    case NetProxy::Invalid:
        break;
    }
    return directMethod;
}

QString ProxyConfiguration::urlFault(const QString &url)
{
    const QUrl parsed(url, QUrl::StrictMode);
    const bool isUsable = parsed.isValid() && !parsed.scheme().isEmpty()
        && (!parsed.host().isEmpty() || parsed.isLocalFile());
    return isUsable ? QString() : QStringLiteral("must be a URL, such as http://proxy.example:3128");
}

} // namespace Agent
} // namespace Corvane
