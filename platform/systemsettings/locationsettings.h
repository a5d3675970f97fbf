// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_SYSTEMSETTINGS_LOCATIONSETTINGS_H
#define CORVANEMDM_PLATFORM_SYSTEMSETTINGS_LOCATIONSETTINGS_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QFlags>
#include <QtCore/QObject>

/**
 * How the phone may find out where it is: group "location" of the key file "/etc/location/location.conf".
 *
 * What the file does not tell, or not in a form that can be read, is false, 0, CustomMode and no sources.
 * Changes are written at once and announced to every object in every process. A change that cannot be written
 * is logged, and has not happened.
 */
class CORVANEMDM_PLATFORM_EXPORT LocationSettings : public QObject
{
    Q_OBJECT

public:
    enum Mode {
        AsynchronousMode = 0, ///< what the file says is known, and announced, once the event loop runs
        SynchronousMode = 1 ///< what the file says is known from the beginning
    };
    Q_ENUM(Mode)

    /** Which of the sources are used; "mode". */
    enum LocationMode : int {
        HighAccuracyMode = 0,
        BatterySavingMode = 1,
        DeviceOnlyMode = 2,
        CustomMode = 3
    };
    Q_ENUM(LocationMode)

    /** How a provider of assistance data stands; "here_state", "mls_online_state". */
    enum OnlineState {
        OnlineAGpsAgreementNotAccepted = 0,
        OnlineAGpsDisabled = 1, ///< the agreement is accepted
        OnlineAGpsEnabled = 2
    };
    Q_ENUM(OnlineState)

    /** What a position may be made of; "allowed_data_sources" is their sum. */
    enum DataSource : quint32 {
        NoDataSources = 0x0,
        OnlineDataSources = 0x1,
        DeviceSensorsData = 0x20,
        BluetoothData = 0x400,
        WlanData = 0x8000,
        CellTowerData = 0x100000,
        GpsData = 0x2000000,
        GlonassData = 0x4000000,
        BeidouData = 0x8000000,
        GalileoData = 0x10000000,
        QzssData = 0x20000000,
        SbasData = 0x40000000,
        LastDataSource = 0x80000000
    };
    Q_DECLARE_FLAGS(DataSources, DataSource)
    Q_FLAG(DataSources)

    explicit LocationSettings(QObject *parent = nullptr);
    explicit LocationSettings(Mode mode, QObject *parent = nullptr);
    ~LocationSettings() override;

    /** Whether the kernel has a receiver for satellite navigation. */
    bool gpsAvailable() const;

    bool locationEnabled() const;
    void setLocationEnabled(bool enabled);
    bool gpsEnabled() const;
    void setGpsEnabled(bool enabled);
    /** Whether satellite navigation has to rest. */
    bool gpsFlightMode() const;
    void setGpsFlightMode(bool flightMode);
    LocationMode locationMode() const;
    void setLocationMode(LocationMode mode);
    DataSources allowedDataSources() const;
    void setAllowedDataSources(DataSources sources);

    // Assistance data of two providers.
    bool hereAvailable() const;
    OnlineState hereState() const;
    void setHereState(OnlineState state);
    bool mlsAvailable() const;
    bool mlsEnabled() const;
    void setMlsEnabled(bool enabled);
    OnlineState mlsOnlineState() const;
    void setMlsOnlineState(OnlineState state);

Q_SIGNALS:
    void locationEnabledChanged();
    void gpsEnabledChanged();
    void gpsFlightModeChanged();
    void locationModeChanged();
    void allowedDataSourcesChanged();

private:
    Q_DISABLE_COPY(LocationSettings)

    class Private;
    Private *const d;
};

Q_DECLARE_OPERATORS_FOR_FLAGS(LocationSettings::DataSources)

#endif // CORVANEMDM_PLATFORM_SYSTEMSETTINGS_LOCATIONSETTINGS_H
