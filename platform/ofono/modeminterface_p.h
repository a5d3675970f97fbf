// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_OFONO_MODEMINTERFACE_P_H
#define CORVANEMDM_PLATFORM_OFONO_MODEMINTERFACE_P_H

#include <ofono/qofonomanager.h>

#include "ofonoobject_p.h"

#include <QtCore/QObject>
#include <QtCore/QSharedPointer>
#include <QtDBus/QDBusVariant>

/** An interface that a modem offers at times: it goes with the service, the modem, or what the modem lists.
 */
class ModemInterface : public QObject
{
    Q_OBJECT

public:
    enum Listing {
        AlwaysListed, ///< the modem's property "Interfaces" tells for certain
        MaybeListed ///< an extension: it may be there without being listed
    };

    ModemInterface(const QString &modemPath, QLatin1String interface, Listing listing, QObject *parent);

    OfonoObject *object() { return &m_object; }
    void start();

Q_SIGNALS:
    /** The interface may have come: ask it. One that the modem never lists may also have gone. */
    void mayHaveCome();
    void hasGone();

private Q_SLOTS:
    void modemPropertyChanged(const QString &name, const QDBusVariant &value);

private:
    const QLatin1String m_interface;
    const QSharedPointer<QOfonoManager> m_manager;
    OfonoObject m_object;
    OfonoObject m_modem;
    bool m_listingTells; // the interface has been listed, or always is: without that it is not there
    bool m_isListed = false;
};

#endif // CORVANEMDM_PLATFORM_OFONO_MODEMINTERFACE_P_H
