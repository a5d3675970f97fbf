// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/notificationinfo.h>

#include "frame/blockingquery_p.h"
#include "frame/marshalling_p.h"
#include "frame/mdmproxy_p.h"
#include "notificationinfo_p.h"

#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMetaType>
#include <QtDBus/QDBusVariant>

#include <algorithm>

namespace Corvane
{
namespace Mdm
{

namespace
{

/** How far below the list of remote actions, which is at depth 0, anything is read. */
constexpr int deepestLevel = 4;

void registerTypes()
{
    qRegisterMetaType<NotificationData>("Corvane::Mdm::NotificationData");
    qDBusRegisterMetaType<NotificationData>();
    qRegisterMetaType<QList<NotificationData>>("QList<Corvane::Mdm::NotificationData>");
    qDBusRegisterMetaType<QList<NotificationData>>();
}

bool isMap(const QDBusArgument &argument)
{
    return argument.currentType() == QDBusArgument::MapType
        && argument.currentSignature() == QLatin1String("a{sv}");
}

bool isListOfStructures(const QDBusArgument &argument)
{
    return argument.currentSignature() == QLatin1String("a(v)");
}

bool isList(const QDBusArgument &argument)
{
    return argument.currentType() == QDBusArgument::ArrayType
        && (argument.currentSignature() == QLatin1String("av") || isListOfStructures(argument));
}

QVariantList listFrom(const QDBusArgument &argument)
{
    const bool hasStructures = isListOfStructures(argument);
    QVariantList list;
    argument.beginArray();
    while (!argument.atEnd()) {
        QDBusVariant element;
        if (hasStructures)
            argument.beginStructure();
        argument >> element;
        if (hasStructures)
            argument.endStructure();
        list.append(element.variant());
    }
    argument.endArray();
    return list;
}

void warnOfMap(const QString *key)
{
    if (key)
        qWarning() << "Unable to expand map value for key:" << *key;
    else
        qWarning() << "Unable to expand map value in list";
}

void warnOfList(const QString *key)
{
    if (key)
        qWarning() << "Unable to expand list value for key:" << *key;
    else
        qWarning() << "Unable to expand list value in list";
}

void warnOfType(const QDBusArgument &argument, const QString *key)
{
    QDebug warning = qWarning();
    warning << "Don't know how to expand type:" << argument.currentType();
    if (key)
        warning << "for key:" << *key << "with signature:";
    else
        warning << "in list with signature:";
    warning << argument.currentSignature();
}

bool expandMap(QVariantMap *map, int depth);
bool expandList(QVariantList *list, int depth);

/** Replaces @p value, at @p key of a map or in a list, if D-Bus left it unread. */
bool expandValue(QVariant *value, int depth, const QString *key)
{
    if (value->userType() != qMetaTypeId<QDBusArgument>())
        return true;
    const auto argument = value->value<QDBusArgument>();
    if (isMap(argument)) {
        auto map = qdbus_cast<QVariantMap>(argument);
        if (!expandMap(&map, depth)) {
            warnOfMap(key);
            return false;
        }
        *value = map;
    } else if (isList(argument)) {
        QVariantList list = listFrom(argument);
        if (!expandList(&list, depth)) {
            warnOfList(key);
            return false;
        }
        *value = list;
    } else {
        warnOfType(argument, key);
        return false;
    }
    return true;
}

bool expandMap(QVariantMap *map, int depth)
{
    if (depth > deepestLevel) {
        qWarning() << "Too many recursions, not expanding map at depth" << depth;
        return false;
    }
    for (auto entry = map->begin(); entry != map->end(); ++entry) {
        if (!expandValue(&*entry, depth + 1, &entry.key()))
            return false;
    }
    return true;
}

bool expandList(QVariantList *list, int depth)
{
    // Silently: whoever asked for the list tells.
    return depth <= deepestLevel && std::all_of(list->begin(), list->end(), [depth](QVariant &value) {
               return expandValue(&value, depth + 1, nullptr);
           });
}

} // namespace

QDBusArgument &operator<<(QDBusArgument &out, const NotificationData &data)
{
    // What cannot be sent is refused before anything is open.
    if (!isMarshallable(data.remoteActions))
        return out << QDBusVariant();
    out.beginStructure();
    out << data.id << data.urgency << data.owner << data.category << data.appName << data.appIcon
        << data.summary << data.body << data.subText << data.timestamp;
    out.beginArray(qMetaTypeId<QDBusVariant>());
    for (const QVariant &action : data.remoteActions)
        out << QDBusVariant(action);
    out.endArray();
    out.endStructure();
    return out;
}

const QDBusArgument &operator>>(const QDBusArgument &in, NotificationData &data)
{
    in.beginStructure();
    in >> data.id >> data.urgency >> data.owner >> data.category >> data.appName >> data.appIcon
        >> data.summary >> data.body >> data.subText >> data.timestamp;
    data.remoteActions = listFrom(in);
    in.endStructure();
    if (!expandList(&data.remoteActions, 0))
        qWarning() << "Failed to expand remote actions from notification";
    return in;
}

NotificationInfoPrivate::NotificationInfoPrivate()
    : m_interface(MdmProxy::Service, MdmProxy::NotificationInfo.path, MdmProxy::NotificationInfo.interface,
                  QDBusConnection::systemBus())
{
    registerTypes();
}

NotificationInfo::NotificationInfo(QObject *parent)
    : QObject(parent)
    , d(new NotificationInfoPrivate)
{
}

NotificationInfo::~NotificationInfo()
{
    delete d;
}

uint NotificationInfo::createNotification(const NotificationData &data)
{
    return blockingQuery<uint>(d->interface(), QStringLiteral("createNotification"),
                               "Failed to create notification:", {QVariant::fromValue(data)});
}

uint NotificationInfo::updateNotification(uint notificationId, const NotificationData &data)
{
    return blockingQuery<uint>(d->interface(), QStringLiteral("updateNotification"),
                               "Failed to update notification:", {notificationId, QVariant::fromValue(data)});
}

bool NotificationInfo::closeNotification(uint notificationId)
{
    const QDBusReply<void> reply = d->interface()->call(QStringLiteral("closeNotification"), notificationId);
    if (reply.isValid())
        return true;
    qWarning() << "Failed to close notification:" << reply.error().message();
    return false;
}

QList<NotificationData> NotificationInfo::notifications(const QString &owner) const
{
    return blockingQuery<QList<NotificationData>>(d->interface(), QStringLiteral("notifications"),
                                                  "Failed to retrieve notifications:", {owner});
}

QList<NotificationData> NotificationInfo::notificationsByCategory(const QString &category) const
{
    return blockingQuery<QList<NotificationData>>(
        d->interface(), QStringLiteral("notificationsByCategory"),
        "Failed to retrieve notifications by category:", {category});
}

} // namespace Mdm
} // namespace Corvane
