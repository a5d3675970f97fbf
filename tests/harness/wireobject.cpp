// SPDX-License-Identifier: LGPL-2.1-or-later
#include "wireobject.h"

#include <QtDBus/QDBusMetaType>

QDBusArgument &operator<<(QDBusArgument &out, const WireObject &object)
{
    out.beginStructure();
    out << object.path << object.properties;
    out.endStructure();
    return out;
}

const QDBusArgument &operator>>(const QDBusArgument &in, WireObject &object)
{
    in.beginStructure();
    in >> object.path >> object.properties;
    in.endStructure();
    return in;
}

void WireObject::registerTypes()
{
    qDBusRegisterMetaType<WireObject>();
    qDBusRegisterMetaType<QList<WireObject>>();
}

QVariant WireObject::list(const QString &prefix, const QVector<std::pair<QString, QVariantMap>> &objects)
{
    QList<WireObject> wire;
    for (const auto &[end, properties] : objects)
        wire.append({QDBusObjectPath(prefix + end), properties});
    return QVariant::fromValue(wire);
}

QVariant WireObject::paths(const QStringList &paths)
{
    QList<QDBusObjectPath> wire;
    for (const QString &path : paths)
        wire.append(QDBusObjectPath(path));
    return QVariant::fromValue(wire);
}
