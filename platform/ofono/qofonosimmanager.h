// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_OFONO_QOFONOSIMMANAGER_H
#define CORVANEMDM_PLATFORM_OFONO_QOFONOSIMMANAGER_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QObject>
#include <QtCore/QString>
#include <QtCore/QStringList>

/**
 * The SIM of one modem: "org.ofono.SimManager" at the modem's path. Nothing blocks.
 *
 * All values are known and in place before any of them is signalled. They are empty unless the object is
 * valid(), and those of the card unless it is present().
 */
class CORVANEMDM_PLATFORM_EXPORT QOfonoSimManager : public QObject
{
    Q_OBJECT

public:
    /**
     * What the SIM waits for before it can be used. The SIM's own PINs come first, then the PINs of the
     * phone's locks in the service's order, and from 9 on the keys that unblock them in the same order.
     */
    enum PinType {
        NoPin = 0, ///< "none", and any word that the service does not document
        SimPin = 1, ///< "pin"
        SimPin2 = 2, ///< "pin2"
        PhoneToSimPin = 3, ///< "phone"
        PhoneToFirstSimPin = 4, ///< "firstphone"
        NetworkPersonalizationPin = 5, ///< "network"
        NetworkSubsetPersonalizationPin = 6, ///< "netsub"
        ServiceProviderPersonalizationPin = 7, ///< "service"
        CorporatePersonalizationPin = 8, ///< "corp"
        SimPuk = 9, ///< "puk"
        SimPuk2 = 10, ///< "puk2"
        PhoneToFirstSimPuk = 11, ///< "firstphonepuk"
        NetworkPersonalizationPuk = 12, ///< "networkpuk"
        NetworkSubsetPersonalizationPuk = 13, ///< "netsubpuk"
        ServiceProviderPersonalizationPuk = 14, ///< "servicepuk"
        CorporatePersonalizationPuk = 15 ///< "corppuk"
    };
    Q_ENUM(PinType)

    explicit QOfonoSimManager(QObject *parent = nullptr);
    ~QOfonoSimManager() override;

    QString modemPath() const;
    /** Follows the modem at @p path from now on. */
    void setModemPath(const QString &path);

    /** Whether the modem offers its SIM and has told the SIM's properties. */
    bool isValid() const;
    bool present() const;
    PinType pinRequired() const;
    QStringList subscriberNumbers() const;
    /** The IMSI. */
    QString subscriberIdentity() const;

Q_SIGNALS:
    void validChanged(bool valid);
    void presenceChanged(bool present);
    void pinRequiredChanged(int pinRequired);
    void subscriberNumbersChanged(const QStringList &subscriberNumbers);
    void subscriberIdentityChanged(const QString &subscriberIdentity);

private:
    Q_DISABLE_COPY(QOfonoSimManager)

    class Private;
    Private *const d;
};

#endif // CORVANEMDM_PLATFORM_OFONO_QOFONOSIMMANAGER_H
