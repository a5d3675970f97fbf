// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_NOTIFICATIONINFO_H
#define CORVANEMDM_NOTIFICATIONINFO_H

#include <corvanemdm/corvanemdm_global.h>

#include <QtCore/QDateTime>
#include <QtCore/QList>
#include <QtCore/QMetaType>
#include <QtCore/QObject>
#include <QtCore/QString>
#include <QtCore/QVariantList>

namespace Corvane
{
namespace Mdm
{

class NotificationInfoPrivate;

/** @brief A notification of the phone. */
struct NotificationData {
    uint id = 0; ///< the phone's number for it; it gives one to a new notification, whatever stands here
    int urgency = 0; ///< 0 low, 1 normal, 2 critical
    QString owner; ///< the program that it belongs to
    QString category; ///< its kind, such as "x-corvane.message"
    QString appName; ///< the application's name, for people
    QString appIcon; ///< the name of the application's icon, or a file
    QString summary; ///< its one-line text
    QString body; ///< what it says below the summary
    QString subText; ///< what it says beside the application's name
    /**
     * When it happened. Of the form of time only local time and UTC travel: an offset becomes UTC and a time
     * zone local time, with date and time as they are.
     */
    QDateTime timestamp;
    /**
     * What can be done about it, each a map: the name, the label, and how to call the program over D-Bus.
     * Maps and lists inside are QVariantMap and QVariantList, down to four levels below this list.
     */
    QVariantList remoteActions;
};

/**
 * @brief Creates, updates, closes and lists the notifications of the phone.
 *
 * Every call blocks until the MDM proxy has answered, or for QtDBus's default timeout (25 s). A call that
 * fails is logged, with the error, and gives an empty result.
 *
 * Construction looks the proxy up, which blocks. An object that was made while the proxy was away works once
 * it is there.
 *
 * Source: MDM proxy "org.corvaneos.mdmproxy", object "/Corvane/Mdm/Proxy/NotificationInfo".
 */
class CORVANEMDM_EXPORT NotificationInfo : public QObject
{
    Q_OBJECT

public:
    /** Looks the proxy up, which blocks; a proxy that is away is not reported. */
    explicit NotificationInfo(QObject *parent = nullptr);
    ~NotificationInfo() override;

    /**
     * Shows a new notification.
     * @return its number, or 0 and the warning "Failed to create notification:". Remote actions that hold
     * something D-Bus has no type for, an invalid QVariant included, fail before anything is sent.
     */
    Q_INVOKABLE uint createNotification(const Corvane::Mdm::NotificationData &data);

    /**
     * Makes the notification @p notificationId like @p data, whose own number does not count.
     * @return its number, or 0 and the warning "Failed to update notification:".
     */
    Q_INVOKABLE uint updateNotification(uint notificationId, const Corvane::Mdm::NotificationData &data);

    /**
     * Takes a notification away.
     * @return whether the proxy has done so; if not, with the warning "Failed to close notification:".
     */
    Q_INVOKABLE bool closeNotification(uint notificationId);

    /**
     * The notifications of the program @p owner, or those of all programs without one, in the phone's order.
     * An empty list, and the warning "Failed to retrieve notifications:", when the proxy does not tell.
     *
     * Remote actions that are nested deeper than four levels, or hold types other than a{sv}, av and simple
     * ones, are logged ("Failed to expand remote actions from notification") and stay as D-Bus delivered
     * them; the rest of that notification is whole.
     */
    Q_INVOKABLE QList<Corvane::Mdm::NotificationData> notifications(const QString &owner = QString()) const;

    /**
     * The notifications of one category; as notifications() but for the warning, "Failed to retrieve
     * notifications by category:".
     */
    Q_INVOKABLE QList<Corvane::Mdm::NotificationData> notificationsByCategory(const QString &category) const;

private:
    Q_DISABLE_COPY(NotificationInfo)
    NotificationInfoPrivate *const d;
};

} // namespace Mdm
} // namespace Corvane

Q_DECLARE_METATYPE(Corvane::Mdm::NotificationData)

#endif // CORVANEMDM_NOTIFICATIONINFO_H
