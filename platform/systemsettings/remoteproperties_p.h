// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_SYSTEMSETTINGS_REMOTEPROPERTIES_P_H
#define CORVANEMDM_PLATFORM_SYSTEMSETTINGS_REMOTEPROPERTIES_P_H

#include <QtCore/QObject>
#include <QtCore/QString>
#include <QtCore/QStringList>
#include <QtCore/QVariantMap>

#include <memory>

class QDBusMessage;

/** The properties of an object on the system bus, mirrored through the restarts of its service. */
class RemoteProperties : public QObject
{
    Q_OBJECT

public:
    /** Asks for all of them, without waiting; a service that the bus can start is started. */
    RemoteProperties(const QString &service, const QString &path, const QString &interface,
                     QObject *parent = nullptr);

    /** Invalid for one that the service has not told. */
    QVariant value(const QString &name) const { return m_values.value(name); }

Q_SIGNALS:
    /** All were told, for the first time or after a restart, or some have changed. */
    void changed();
    /** The service has left the bus, and nothing is known. */
    void serviceLeft();

private Q_SLOTS:
    void propertiesChanged(const QString &interface, const QVariantMap &changed,
                           const QStringList &invalidated);

private:
    void askForAll();
    void answered(const QDBusMessage &answer);

    const QString m_service;
    const QString m_path;
    const QString m_interface;
    QVariantMap m_values;
    std::unique_ptr<QObject> m_question; ///< while there is one whose answer counts
};

#endif // CORVANEMDM_PLATFORM_SYSTEMSETTINGS_REMOTEPROPERTIES_P_H
