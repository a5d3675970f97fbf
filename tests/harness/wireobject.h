// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_WIREOBJECT_H
#define CORVANE_TEST_WIREOBJECT_H

#include <QtCore/QVariantMap>
#include <QtCore/QVector>
#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusObjectPath>

#include <utility>

/** An object with its properties, as an argument of a signal or an answer that a test makes up. */
struct WireObject {
    QDBusObjectPath path;
    QVariantMap properties;

    /** Once, before any of these is sent. */
    static void registerTypes();
    /** "a(oa{sv})" of objects whose paths are @p prefix and the given ends. */
    static QVariant list(const QString &prefix, const QVector<std::pair<QString, QVariantMap>> &objects);
    /** "ao" */
    static QVariant paths(const QStringList &paths);
};
Q_DECLARE_METATYPE(WireObject)

QDBusArgument &operator<<(QDBusArgument &out, const WireObject &object);
const QDBusArgument &operator>>(const QDBusArgument &in, WireObject &object);

#endif // CORVANE_TEST_WIREOBJECT_H
