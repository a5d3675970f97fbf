// SPDX-License-Identifier: LGPL-2.1-or-later
#include "mobiledata.h"

#include "ofono.h"
#include "service.h"

#include <algorithm>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String managerInterface("org.ofono.ConnectionManager");
const QLatin1String contextInterface("org.ofono.ConnectionContext");

const QLatin1String activeProperty("Active");
const QLatin1String poweredProperty("Powered");
const QLatin1String roamingProperty("RoamingAllowed");
const QLatin1String typeProperty("Type");
const QLatin1String accessPointNameProperty("AccessPointName");
const QLatin1String internetType("internet");

/** A property of a context, its member in the profile, and what it can be. */
struct TextProperty {
    QString name;
    QString member;
    QString initial;
    QStringList words; ///< none: any text
};

/** In the order in which the daemon tells them. */
const std::vector<TextProperty> &textProperties()
{
    static const std::vector<TextProperty> properties{
        {accessPointNameProperty, QStringLiteral("apn"), QString(), {}},
        {typeProperty,
         QStringLiteral("type"),
         internetType,
         {internetType, QStringLiteral("mms"), QStringLiteral("ims"), QStringLiteral("wap")}},
        {QStringLiteral("Username"), QStringLiteral("username"), QString(), {}},
        {QStringLiteral("Password"), QStringLiteral("password"), QString(), {}},
        {QStringLiteral("Protocol"),
         QStringLiteral("protocol"),
         QStringLiteral("ip"),
         {QStringLiteral("ip"), QStringLiteral("ipv6"), QStringLiteral("dual")}},
        {QStringLiteral("AuthenticationMethod"),
         QStringLiteral("authentication"),
         QStringLiteral("none"),
         {QStringLiteral("none"), QStringLiteral("pap"), QStringLiteral("chap"), QStringLiteral("any")}},
        {QStringLiteral("Name"), QStringLiteral("name"), QStringLiteral("Internet"), {}},
        {QStringLiteral("MessageCenter"), QStringLiteral("messageCenter"), QString(), {}},
        {QStringLiteral("MessageProxy"), QStringLiteral("messageProxy"), QString(), {}},
    };
    return properties;
}

const TextProperty *textProperty(const QString &name)
{
    const auto found = std::find_if(textProperties().begin(), textProperties().end(),
                                    [&name](const TextProperty &each) { return each.name == name; });
    return found == textProperties().end() ? nullptr : &*found;
}

bool isWord(const TextProperty &property, const QString &text)
{
    return property.words.isEmpty() || property.words.contains(text);
}

/** The lowest number that no context has. */
QString newName(const ContextStore::List &contexts)
{
    for (int number = 1;; ++number) {
        const QString name = QStringLiteral("context%1").arg(number);
        const bool isTaken = std::any_of(contexts.begin(), contexts.end(),
                                         [&name](const auto &each) { return each.name == name; });
        if (!isTaken)
            return name;
    }
}

void append(ContextStore::List &contexts, const QJsonObject &accessPoint)
{
    ConnectionContext context;
    context.name = newName(contexts);
    for (const TextProperty &property : textProperties())
        context.texts.insert(property.name, accessPoint.value(property.member).toString(property.initial));
    contexts.push_back(context);
}

} // namespace

bool ConnectionContext::isForInternet() const
{
    return text(typeProperty) == internetType && !text(accessPointNameProperty).isEmpty();
}

Properties ConnectionContext::properties() const
{
    Properties properties{{activeProperty, fromBool(isActive)}};
    for (const TextProperty &property : textProperties())
        properties.push_back({property.name, fromText(texts.value(property.name))});
    return properties;
}

ContextStore::ContextStore(const QJsonArray &sims)
{
    for (const QJsonValue &sim : sims) {
        const QJsonValue accessPoints = sim.toObject().value(QLatin1String("accessPoints"));
        if (!accessPoints.isArray())
            continue;
        List &list = m_contexts[sim.toObject().value(QLatin1String("imsi")).toString()];
        const QJsonArray described = accessPoints.toArray();
        for (const QJsonValue &accessPoint : described)
            append(list, accessPoint.toObject());
    }
}

ContextStore::List &ContextStore::contexts(const QString &imsi)
{
    const auto [contexts, isNew] = m_contexts.try_emplace(imsi);
    if (isNew && !imsi.isEmpty())
        append(contexts->second, {{QStringLiteral("apn"), QStringLiteral("internet")}});
    return contexts->second;
}

MobileData::MobileData(const QString &modemPath, ContextStore &store, std::function<void()> changed)
    : m_modemPath(modemPath)
    , m_store(store)
    , m_changed(std::move(changed))
{
}

ContextStore::List &MobileData::contextsOfSim() const
{
    return m_store.contexts(m_imsi);
}

void MobileData::setSim(const QString &imsi)
{
    if (imsi == m_imsi)
        return;
    deactivateAll();
    m_imsi = imsi;
}

void MobileData::setServed(bool served, bool roaming)
{
    m_isServed = served;
    m_isRoaming = roaming;
    if (!isAttached())
        deactivateAll();
}

bool MobileData::isAttached() const
{
    return m_isPowered && m_isServed && (m_isRoamingAllowed || !m_isRoaming) && !m_imsi.isEmpty();
}

void MobileData::deactivateAll()
{
    for (ConnectionContext &context : contextsOfSim())
        context.isActive = false;
}

Properties MobileData::properties() const
{
    return {
        {QStringLiteral("Attached"), fromBool(isAttached())},
        {roamingProperty, fromBool(m_isRoamingAllowed)},
        {poweredProperty, fromBool(m_isPowered)},
    };
}

MethodHandlers MobileData::methods()
{
    return {
        {QStringLiteral("SetProperty"),
         [this](MethodCall &call) {
             setManagerProperty(call);
         }},
        {QStringLiteral("GetContexts"),
         [this](MethodCall &call) {
             GVariantBuilder list;
             g_variant_builder_init(&list, G_VARIANT_TYPE("a(oa{sv})"));
             for (const ConnectionContext &context : contexts())
                 g_variant_builder_add(&list, "(o@a{sv})", pathOf(context).toUtf8().constData(),
                                       toVariant(context.properties()));
             call.reply(g_variant_new("(a(oa{sv}))", &list));
         }},
        {QStringLiteral("AddContext"),
         [this](MethodCall &call) {
             addContext(call);
         }},
        {QStringLiteral("RemoveContext"),
         [this](MethodCall &call) {
             removeContext(call);
         }},
    };
}

QString MobileData::pathOf(const ConnectionContext &context) const
{
    return m_modemPath + QLatin1Char('/') + context.name;
}

ConnectionContext &MobileData::contextNamed(const QString &name)
{
    ContextStore::List &contexts = contextsOfSim();
    const auto found = std::find_if(contexts.begin(), contexts.end(),
                                    [&name](const ConnectionContext &each) { return each.name == name; });
    if (found == contexts.end())
        throw Ofono::notFound(QStringLiteral("There is no context %1").arg(name));
    return *found;
}

void MobileData::activate(const QString &contextName, bool isActive)
{
    ConnectionContext &context = contextNamed(contextName);
    if (isActive && !isAttached())
        throw Ofono::notAttached(QStringLiteral("GPRS is not attached"));
    if (isActive && context.text(accessPointNameProperty).isEmpty())
        throw Ofono::failed(QStringLiteral("The context has no access point name"));
    context.isActive = isActive;
}

void MobileData::setManagerProperty(MethodCall &call)
{
    const Ofono::PropertyRequest request(call);
    bool *property = request.name() == poweredProperty ? &m_isPowered
        : request.name() == roamingProperty            ? &m_isRoamingAllowed
                                                       : nullptr;
    if (!property)
        throw request.unknown();
    *property = request.flag();
    call.reply();
    if (!isAttached())
        deactivateAll();
    m_changed();
}

void MobileData::setContextProperty(const QString &contextName, MethodCall &call)
{
    const Ofono::PropertyRequest request(call);
    if (request.name() == activeProperty) {
        activate(contextName, request.flag());
    } else {
        const TextProperty *property = textProperty(request.name());
        if (!property)
            throw request.unknown();
        ConnectionContext &context = contextNamed(contextName);
        if (context.isActive)
            throw Ofono::inUse(QStringLiteral("The context is active"));
        const QString text = request.text();
        if (!isWord(*property, text))
            throw Ofono::invalidFormat(QStringLiteral("%1 cannot be \"%2\"").arg(property->name, text));
        context.texts.insert(property->name, text);
    }
    call.reply();
    m_changed();
}

void MobileData::addContext(MethodCall &call)
{
    const QString type = call.text(0);
    if (!isWord(*textProperty(typeProperty), type))
        throw Ofono::invalidArguments(QStringLiteral("There are no contexts of the type \"%1\"").arg(type));
    append(contextsOfSim(), {{QStringLiteral("type"), type}});
    const ConnectionContext context = contexts().back();
    const QByteArray path = pathOf(context).toUtf8();
    call.reply(g_variant_new("(o)", path.constData()));
    announce();
    emitManagerSignal("ContextAdded",
                      g_variant_new("(o@a{sv})", path.constData(), toVariant(context.properties())));
    m_changed();
}

void MobileData::removeContext(MethodCall &call)
{
    const QString path = call.text(0);
    const QString name = path.mid(path.lastIndexOf(QLatin1Char('/')) + 1);
    if (path != pathOf(contextNamed(name)))
        throw Ofono::notFound(QStringLiteral("There is no context %1").arg(path));
    ContextStore::List &contexts = contextsOfSim();
    contexts.erase(std::remove_if(contexts.begin(), contexts.end(),
                                  [&name](const ConnectionContext &each) { return each.name == name; }),
                   contexts.end());
    call.reply();
    announce();
    emitManagerSignal("ContextRemoved", g_variant_new("(o)", path.toUtf8().constData()));
    m_changed();
}

void MobileData::emitManagerSignal(const char *member, GVariant *arguments) const
{
    m_service->emitSignal(m_modemPath, managerInterface, QLatin1String(member), arguments);
}

void MobileData::attach(Service &service)
{
    m_service = &service;
    m_offered.clear();
    announce();
}

void MobileData::detach()
{
    m_service = nullptr;
    deactivateAll();
}

void MobileData::announce()
{
    if (!m_service)
        return;
    for (auto offered = m_offered.begin(); offered != m_offered.end();) {
        const QString name = offered->first;
        const bool isThere = std::any_of(contexts().begin(), contexts().end(),
                                         [&name](const auto &each) { return each.name == name; });
        if (isThere) {
            ++offered;
            continue;
        }
        m_service->removeObject(m_modemPath + QLatin1Char('/') + name, contextInterface);
        offered = m_offered.erase(offered);
    }
    for (const ConnectionContext &context : contexts()) {
        const auto [offered, isNew] = m_offered.try_emplace(context.name);
        if (isNew) {
            offer(context);
            offered->second.reset(context.properties());
            continue;
        }
        offered->second.take(context.properties(), [&](const QString &name, GVariant *value) {
            m_service->emitSignal(pathOf(context), contextInterface, QStringLiteral("PropertyChanged"),
                                  g_variant_new("(sv)", name.toUtf8().constData(), value));
        });
    }
}

void MobileData::offer(const ConnectionContext &context)
{
    const QString name = context.name;
    m_service->addObject(pathOf(context), contextInterface,
                         {
                             {QStringLiteral("GetProperties"),
                              [this, name](MethodCall &call) {
                                  call.reply(
                                      g_variant_new("(@a{sv})", toVariant(contextNamed(name).properties())));
                              }},
                             {QStringLiteral("SetProperty"),
                              [this, name](MethodCall &call) {
                                  setContextProperty(name, call);
                              }},
                         });
}

QJsonArray MobileData::describe() const
{
    QJsonArray list;
    for (const ConnectionContext &context : contexts()) {
        QJsonObject described{{QStringLiteral("path"), pathOf(context)},
                              {QStringLiteral("active"), context.isActive}};
        for (const TextProperty &property : textProperties())
            described.insert(property.member, context.text(property.name));
        list << described;
    }
    return list;
}

} // namespace Simulator
} // namespace Corvane
