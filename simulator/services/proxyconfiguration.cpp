// SPDX-License-Identifier: LGPL-2.1-or-later
#include "proxyconfiguration.h"

#include "connman.h"
#include "properties.h"
#include "refusal.h"

#include <QtCore/QJsonArray>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String directMethod("direct");
const QLatin1String manualMethod("manual");
const QLatin1String automaticMethod("auto");

QStringList toList(const QJsonValue &array)
{
    QStringList list;
    const QJsonArray items = array.toArray();
    for (const QJsonValue &item : items)
        list << item.toString();
    return list;
}

/** The value of @p key, of type @p type; null when it is missing. */
Variant lookUp(const Variant &dictionary, const char *key, const GVariantType *type)
{
    Variant value(g_variant_lookup_value(dictionary.get(), key, nullptr));
    if (value && !g_variant_is_of_type(value.get(), type))
        throw ConnMan::invalidArguments();
    return value;
}

QString lookUpText(const Variant &dictionary, const char *key)
{
    const Variant value = lookUp(dictionary, key, G_VARIANT_TYPE_STRING);
    return value ? QString::fromUtf8(g_variant_get_string(value.get(), nullptr)) : QString();
}

QStringList lookUpList(const Variant &dictionary, const char *key)
{
    const Variant value = lookUp(dictionary, key, G_VARIANT_TYPE_STRING_ARRAY);
    QStringList list;
    for (gsize i = 0; value && i < g_variant_n_children(value.get()); ++i) {
        const Variant item(g_variant_get_child_value(value.get(), i));
        list << QString::fromUtf8(g_variant_get_string(item.get(), nullptr));
    }
    return list;
}

} // namespace

ProxyConfiguration::ProxyConfiguration(const QJsonObject &object)
    : m_method(object.value(QLatin1String("method")).toString())
    , m_servers(toList(object.value(QLatin1String("servers"))))
    , m_excludes(toList(object.value(QLatin1String("excludes"))))
    , m_url(object.value(QLatin1String("url")).toString())
{
}

ProxyConfiguration::ProxyConfiguration(const QStringList &words)
    : m_method(words.value(0))
{
    if (m_method == manualMethod && words.size() > 1 && words.size() <= 3) {
        m_servers = words.at(1).split(QLatin1Char(','), Qt::SkipEmptyParts);
        m_excludes = words.value(2).split(QLatin1Char(','), Qt::SkipEmptyParts);
    } else if (m_method == automaticMethod && words.size() <= 2) {
        m_url = words.value(1);
    } else if (m_method != directMethod || words.size() > 1) {
        throw Refusal(
            QStringLiteral("\"%1\" is no proxy; one is %2").arg(words.join(QLatin1Char(' ')), usage()));
    }
}

ProxyConfiguration::ProxyConfiguration(const Variant &dictionary)
{
    if (!g_variant_is_of_type(dictionary.get(), G_VARIANT_TYPE_VARDICT))
        throw ConnMan::invalidArguments();
    m_method = lookUpText(dictionary, "Method");
    if (m_method == manualMethod) {
        m_servers = lookUpList(dictionary, "Servers");
        m_excludes = lookUpList(dictionary, "Excludes");
    } else if (m_method == automaticMethod) {
        m_url = lookUpText(dictionary, "URL");
    }
    const bool isComplete = m_method == directMethod || m_method == automaticMethod
        || (m_method == manualMethod && !m_servers.isEmpty());
    if (!isComplete)
        throw ConnMan::invalidArguments();
}

QString ProxyConfiguration::usage()
{
    return QStringLiteral("direct | auto [URL] | manual SERVER,... [EXCLUDE,...]");
}

Variant ProxyConfiguration::toVariant() const
{
    Properties properties;
    if (!m_method.isEmpty())
        properties.push_back({QStringLiteral("Method"), fromText(m_method)});
    if (m_method == manualMethod) {
        properties.push_back({QStringLiteral("Servers"), fromList(m_servers)});
        if (!m_excludes.isEmpty())
            properties.push_back({QStringLiteral("Excludes"), fromList(m_excludes)});
    }
    if (!m_url.isEmpty())
        properties.push_back({QStringLiteral("URL"), fromText(m_url)});
    return Variant(Simulator::toVariant(properties));
}

QJsonObject ProxyConfiguration::toJson() const
{
    QJsonObject object;
    if (!m_method.isEmpty())
        object.insert(QStringLiteral("method"), m_method);
    if (!m_servers.isEmpty())
        object.insert(QStringLiteral("servers"), QJsonArray::fromStringList(m_servers));
    if (!m_excludes.isEmpty())
        object.insert(QStringLiteral("excludes"), QJsonArray::fromStringList(m_excludes));
    if (!m_url.isEmpty())
        object.insert(QStringLiteral("url"), m_url);
    return object;
}

} // namespace Simulator
} // namespace Corvane
