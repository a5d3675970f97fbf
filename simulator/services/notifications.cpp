// SPDX-License-Identifier: LGPL-2.1-or-later
#include "component.h"
#include "mdmproxy.h"
#include "refusal.h"
#include "service.h"

#include <QtCore/QDateTime>
#include <QtCore/QJsonArray>

#include <cmath>
#include <limits>
#include <map>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String objectPath("/Corvane/Mdm/Proxy/NotificationInfo");
const QLatin1String interfaceName("org.corvaneos.mdmproxy.notificationinfo");
const QLatin1String notFound("org.corvaneos.mdmproxy.Error.NotFound");

constexpr int normalUrgency = 1;

/** The texts in the order of the wire, as the profile names them. */
const char *const textNames[] = {"owner", "category", "appName", "appIcon", "summary", "body", "subText"};
constexpr std::size_t textCount = std::size(textNames);
enum Text { Owner = 0, Category = 1, Summary = 4, Body = 5 };

struct Notification {
    gint32 urgency = normalUrgency;
    QString texts[textCount];
    Variant time; ///< "((iii)(iiii)i)"
    Variant remoteActions; ///< "av"
};

Variant wireTime(const QDateTime &time)
{
    const QDateTime utc = time.toUTC();
    const QDate date = utc.date();
    const QTime clock = utc.time();
    return Variant(g_variant_new("((iii)(iiii)i)", date.year(), date.month(), date.day(), clock.hour(),
                                 clock.minute(), clock.second(), clock.msec(), int(Qt::UTC)));
}

bool isNoTime(const Variant &time)
{
    int year = 0;
    int month = 0;
    int day = 0;
    g_variant_get(time.get(), "((iii)(iiii)i)", &year, &month, &day, nullptr, nullptr, nullptr, nullptr,
                  nullptr);
    return year == 0 && month == 0 && day == 0;
}

/** A floating value; a number becomes one of D-Bus's whole ones where it can. */
GVariant *toVariant(const QJsonValue &value)
{
    switch (value.type()) {
    case QJsonValue::Bool:
        return g_variant_new_boolean(value.toBool());
    case QJsonValue::Double: {
        const double number = value.toDouble();
        const bool isInt = std::trunc(number) == number && number >= std::numeric_limits<gint32>::min()
            && number <= std::numeric_limits<gint32>::max();
        return isInt ? g_variant_new_int32(gint32(number)) : g_variant_new_double(number);
    }
    case QJsonValue::Array: {
        GVariantBuilder list;
        g_variant_builder_init(&list, G_VARIANT_TYPE("av"));
        const QJsonArray elements = value.toArray();
        for (const QJsonValue &element : elements)
            g_variant_builder_add(&list, "v", toVariant(element));
        return g_variant_builder_end(&list);
    }
    case QJsonValue::Object: {
        GVariantBuilder map;
        g_variant_builder_init(&map, G_VARIANT_TYPE_VARDICT);
        const QJsonObject members = value.toObject();
        for (auto member = members.begin(); member != members.end(); ++member)
            g_variant_builder_add(&map, "{sv}", member.key().toUtf8().constData(), toVariant(member.value()));
        return g_variant_builder_end(&map);
    }
    default:
        return g_variant_new_string(value.toString().toUtf8().constData());
    }
}

QDateTime timeFrom(const QJsonObject &notification)
{
    return QDateTime::fromString(notification.value(QLatin1String("time")).toString(), Qt::ISODate);
}

Notification notificationFrom(const QJsonObject &object)
{
    Notification notification;
    notification.urgency = object.value(QLatin1String("urgency")).toInt(normalUrgency);
    for (std::size_t text = 0; text < textCount; ++text)
        notification.texts[text] = object.value(QLatin1String(textNames[text])).toString();
    notification.time = wireTime(object.contains(QLatin1String("time")) ? timeFrom(object)
                                                                        : QDateTime::currentDateTimeUtc());
    notification.remoteActions = Variant(toVariant(object.value(QLatin1String("remoteActions")).toArray()));
    return notification;
}

/** @p value is "(uisssssss((iii)(iiii)i)av)". */
Notification notificationFrom(GVariant *value)
{
    Notification notification;
    gsize field = 1;
    const auto next = [value, &field] {
        return Variant(g_variant_get_child_value(value, field++));
    };
    notification.urgency = g_variant_get_int32(next().get());
    for (QString &text : notification.texts)
        text = QString::fromUtf8(g_variant_get_string(next().get(), nullptr));
    notification.time = next();
    notification.remoteActions = next();
    return notification;
}

GVariant *toVariant(guint32 id, const Notification &notification)
{
    GVariantBuilder structure;
    g_variant_builder_init(&structure, G_VARIANT_TYPE("(uisssssss((iii)(iiii)i)av)"));
    g_variant_builder_add(&structure, "u", id);
    g_variant_builder_add(&structure, "i", notification.urgency);
    for (const QString &text : notification.texts)
        g_variant_builder_add(&structure, "s", text.toUtf8().constData());
    g_variant_builder_add_value(&structure, notification.time.get());
    g_variant_builder_add_value(&structure, notification.remoteActions.get());
    return g_variant_builder_end(&structure);
}

class Notifications : public Component
{
public:
    explicit Notifications(const QJsonArray &profile);

    void attach(Service &service) override;
    void detach() override { }
    void describe(QJsonObject &state) const override;
    std::vector<Action> actions() override;

private:
    using ById = std::map<guint32, Notification>;

    guint32 add(const Notification &notification);
    void update(MethodCall &call);
    void close(MethodCall &call);
    /** Answers with those whose text @p text is @p wanted. */
    void list(MethodCall &call, Text text, const QString &wanted) const;
    ById::iterator find(guint32 id);

    QString post(const QStringList &arguments);
    QString dismiss(const QString &number);

    ById m_notifications;
    guint32 m_lastId = 0;
};

Notifications::Notifications(const QJsonArray &profile)
{
    for (const QJsonValue &notification : profile)
        add(notificationFrom(notification.toObject()));
}

void Notifications::attach(Service &service)
{
    service.addObject(objectPath, interfaceName,
                      {
                          {QStringLiteral("createNotification"),
                           [this](MethodCall &call) {
                               const Variant data(g_variant_get_child_value(call.arguments(), 0));
                               Notification created = notificationFrom(data.get());
                               if (isNoTime(created.time))
                                   created.time = wireTime(QDateTime::currentDateTimeUtc());
                               call.reply(g_variant_new("(u)", add(created)));
                           }},
                          {QStringLiteral("updateNotification"),
                           [this](MethodCall &call) {
                               update(call);
                           }},
                          {QStringLiteral("closeNotification"),
                           [this](MethodCall &call) {
                               close(call);
                           }},
                          {QStringLiteral("notifications"),
                           [this](MethodCall &call) {
                               list(call, Owner, call.text(0));
                           }},
                          {QStringLiteral("notificationsByCategory"),
                           [this](MethodCall &call) {
                               list(call, Category, call.text(0));
                           }},
                      });
}

guint32 Notifications::add(const Notification &notification)
{
    m_notifications.emplace(++m_lastId, notification);
    return m_lastId;
}

Notifications::ById::iterator Notifications::find(guint32 id)
{
    const auto found = m_notifications.find(id);
    if (found == m_notifications.end())
        throw MethodError(notFound, QStringLiteral("There is no notification %1").arg(id));
    return found;
}

void Notifications::update(MethodCall &call)
{
    const auto found = find(call.number(0));
    const Variant data(g_variant_get_child_value(call.arguments(), 1));
    Notification updated = notificationFrom(data.get());
    if (isNoTime(updated.time))
        updated.time = found->second.time;
    found->second = updated;
    call.reply(g_variant_new("(u)", found->first));
}

void Notifications::close(MethodCall &call)
{
    m_notifications.erase(find(call.number(0)));
    call.reply();
}

void Notifications::list(MethodCall &call, Text text, const QString &wanted) const
{
    const bool isAny = text == Owner && wanted.isEmpty();
    GVariantBuilder found;
    g_variant_builder_init(&found, G_VARIANT_TYPE("a(uisssssss((iii)(iiii)i)av)"));
    for (const auto &[id, notification] : m_notifications) {
        if (isAny || notification.texts[text] == wanted)
            g_variant_builder_add_value(&found, toVariant(id, notification));
    }
    call.reply(g_variant_new("(a(uisssssss((iii)(iiii)i)av))", &found));
}

void Notifications::describe(QJsonObject &state) const
{
    QJsonArray list;
    for (const auto &[id, notification] : m_notifications) {
        QJsonObject entry{{QStringLiteral("id"), int(id)}, {QStringLiteral("urgency"), notification.urgency}};
        for (std::size_t text = 0; text < textCount; ++text)
            entry.insert(QLatin1String(textNames[text]), notification.texts[text]);
        const GCharPointer time(g_variant_print(notification.time.get(), FALSE));
        entry.insert(QStringLiteral("time"), QString::fromUtf8(time.get()));
        const GCharPointer actions(g_variant_print(notification.remoteActions.get(), FALSE));
        entry.insert(QStringLiteral("remoteActions"), QString::fromUtf8(actions.get()));
        list << entry;
    }
    state.insert(QStringLiteral("notifications"), list);
}

QString Notifications::post(const QStringList &arguments)
{
    Notification notification;
    notification.texts[Owner] = arguments.at(0);
    notification.texts[Summary] = arguments.at(1);
    notification.texts[Body] = arguments.value(2);
    notification.time = wireTime(QDateTime::currentDateTimeUtc());
    notification.remoteActions = Variant(g_variant_new_array(G_VARIANT_TYPE_VARIANT, nullptr, 0));
    return QStringLiteral("Notification %1").arg(add(notification));
}

QString Notifications::dismiss(const QString &number)
{
    const auto found = m_notifications.find(number.toUInt());
    if (found == m_notifications.end())
        throw Refusal(QStringLiteral("There is no notification %1").arg(number));
    m_notifications.erase(found);
    return QString();
}

std::vector<Action> Notifications::actions()
{
    return {
        {QStringLiteral("notification post"), QStringLiteral("OWNER SUMMARY [BODY]"),
         QStringLiteral("shows a notification, as the program OWNER would"), 2, 3,
         [this](const QStringList &arguments) {
             return post(arguments);
         }},
        {QStringLiteral("notification dismiss"), QStringLiteral("NUMBER"),
         QStringLiteral("swipes a notification away"), 1, 1,
         [this](const QStringList &arguments) {
             return dismiss(arguments.first());
         }},
    };
}

QString problemOf(const QJsonObject &profile)
{
    const QJsonArray list = profile.value(QLatin1String("notifications")).toArray();
    for (int i = 0; i < list.size(); ++i) {
        const QJsonObject notification = list.at(i).toObject();
        if (notification.contains(QLatin1String("time")) && !timeFrom(notification).isValid())
            return QStringLiteral("/notifications/%1/time: there is no such time as %2")
                .arg(i)
                .arg(notification.value(QLatin1String("time")).toString());
    }
    return QString();
}

const ComponentRegistration registration({
    MdmProxy::serviceName,
    [](const QJsonObject &profile, Phone &) {
        return std::make_unique<Notifications>(profile.value(QLatin1String("notifications")).toArray());
    },
    problemOf,
});

} // namespace

} // namespace Simulator
} // namespace Corvane
