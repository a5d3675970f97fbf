// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_SYSTEMSETTINGS_BATTERYSTATUS_H
#define CORVANEMDM_PLATFORM_SYSTEMSETTINGS_BATTERYSTATUS_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QObject>

/**
 * The battery and its charger: "org.freedesktop.UPower" on the system bus.
 *
 * Nothing blocks: all is unknown until the service has told it, and again when the service is away.
 */
class CORVANEMDM_PLATFORM_EXPORT BatteryStatus : public QObject
{
    Q_OBJECT
    /** @see status() */
    Q_PROPERTY(BatteryStatus::Status status READ status NOTIFY statusChanged)
    /** @see chargerStatus() */
    Q_PROPERTY(BatteryStatus::ChargerStatus chargerStatus READ chargerStatus NOTIFY chargerStatusChanged)
    /** @see chargePercentage() */
    Q_PROPERTY(int chargePercentage READ chargePercentage NOTIFY chargePercentageChanged)

public:
    /** How full the battery is, in words. */
    enum Status {
        BatteryStatusUnknown = -1, ///< not told, or there is no battery
        Full = 0, ///< as full as it gets
        Normal = 1, ///< neither full nor low
        Low = 2, ///< the phone warns its user
        Empty = 3 ///< the phone is about to switch itself off
    };
    Q_ENUM(Status)

    /** Whether the phone gets power from outside. */
    enum ChargerStatus {
        ChargerStatusUnknown = -1, ///< not told
        Disconnected = 0, ///< it lives on its battery
        Connected = 1 ///< it does
    };
    Q_ENUM(ChargerStatus)

    /** Asks the service, without waiting. */
    explicit BatteryStatus(QObject *parent = nullptr);
    ~BatteryStatus() override;

    /** How full the battery is, in words. */
    Status status() const;
    /** Whether the phone gets power from outside. */
    ChargerStatus chargerStatus() const;
    /** How full the battery is, 0 to 100; -1 when that is not known. */
    int chargePercentage() const;

Q_SIGNALS:
    void statusChanged(BatteryStatus::Status status); ///< see status()
    void chargerStatusChanged(BatteryStatus::ChargerStatus status); ///< see chargerStatus()
    void chargePercentageChanged(int percentage); ///< see chargePercentage()

private:
    Q_DISABLE_COPY(BatteryStatus)

    class Private;
    Private *const d;
};

#endif // CORVANEMDM_PLATFORM_SYSTEMSETTINGS_BATTERYSTATUS_H
