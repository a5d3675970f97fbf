// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_WIRENOTIFICATION_H
#define CORVANE_TEST_WIRENOTIFICATION_H

#include <QtCore/QDateTime>
#include <QtCore/QList>
#include <QtCore/QMetaType>
#include <QtCore/QString>
#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusMetaType>
#include <QtDBus/QDBusVariant>

/** A notification as the wire has it: any remote actions. */
struct WireNotification {
    uint id = 0;
    int urgency = 0;
    QString texts[7]; ///< owner, category, application's name and icon, summary, body, sub-text
    QDateTime time;
    QList<QDBusVariant> remoteActions;
};
Q_DECLARE_METATYPE(WireNotification)

inline QDBusArgument &operator<<(QDBusArgument &out, const WireNotification &notification)
{
    out.beginStructure();
    out << notification.id << notification.urgency;
    for (const QString &text : notification.texts)
        out << text;
    out << notification.time << notification.remoteActions;
    out.endStructure();
    return out;
}

inline const QDBusArgument &operator>>(const QDBusArgument &in, WireNotification &notification)
{
    in.beginStructure();
    in >> notification.id >> notification.urgency;
    for (QString &text : notification.texts)
        in >> text;
    in >> notification.time >> notification.remoteActions;
    in.endStructure();
    return in;
}

inline void registerWireNotification()
{
    qDBusRegisterMetaType<QList<QDBusVariant>>();
    qDBusRegisterMetaType<WireNotification>();
    qDBusRegisterMetaType<QList<WireNotification>>();
}

#endif // CORVANE_TEST_WIRENOTIFICATION_H
