// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_LOCATIONSETTINGS_H
#define CORVANEMDM_LOCATIONSETTINGS_H

#include <corvanemdm/corvanemdm_global.h>

#include <QtCore/QFlags>
#include <QtCore/QMetaType>
#include <QtCore/QObject>
#include <QtCore/QString>
#include <QtCore/QStringList>

namespace Corvane
{
namespace Mdm
{

class LocationSettingsPrivate;

/**
 * @brief Decides whether and how the phone finds out where it is.
 *
 * Assistance data (aGPS), which make the first fix faster, come from two providers, "here" and "mls". Each is
 * used only after its usage agreement has been accepted. A name that is neither is logged ("No such aGPS
 * provider:") and has nothing.
 *
 * No call blocks on a service. Changes are written at once; those of other programs are followed while the
 * event loop runs. What the phone does not tell is false, CustomMode and no sources.
 *
 * Source: the phone's settings library.
 */
class CORVANEMDM_EXPORT LocationSettings : public QObject
{
    Q_OBJECT
    /** @see gpsAvailable() */
    Q_PROPERTY(bool gpsAvailable READ gpsAvailable CONSTANT)
    /** @see locationEnabled() */
    Q_PROPERTY(
        bool locationEnabled READ locationEnabled WRITE setLocationEnabled NOTIFY locationEnabledChanged)
    /** @see gpsEnabled() */
    Q_PROPERTY(bool gpsEnabled READ gpsEnabled WRITE setGpsEnabled NOTIFY gpsEnabledChanged)
    /** @see gpsFlightMode() */
    Q_PROPERTY(bool gpsFlightMode READ gpsFlightMode WRITE setGpsFlightMode NOTIFY gpsFlightModeChanged)
    /** @see locationMode() */
    Q_PROPERTY(Corvane::Mdm::LocationSettings::LocationMode locationMode READ locationMode WRITE
                   setLocationMode NOTIFY locationModeChanged)
    /** @see allowedDataSources() */
    Q_PROPERTY(Corvane::Mdm::LocationSettings::DataSources allowedDataSources READ allowedDataSources WRITE
                   setAllowedDataSources NOTIFY allowedDataSourcesChanged)

public:
    /** When the settings are known. */
    enum Mode : int {
        AsynchronousMode = 0, ///< once the event loop runs; the change signals tell
        SynchronousMode = 1 ///< when the object is made
    };
    Q_ENUM(Mode)

    /** What the phone chooses its sources by. */
    enum LocationMode : int {
        HighAccuracyMode = 0, ///< all that help
        BatterySavingMode = 1, ///< no satellites
        DeviceOnlyMode = 2, ///< nothing from the network
        CustomMode = 3 ///< as the single settings say
    };
    Q_ENUM(LocationMode)

    /** What a position may be made of. Flags. */
    enum DataSource : quint32 {
        NoDataSources = 0x0, ///< nothing
        OnlineDataSources = 0x1, ///< services in the network
        DeviceSensorsData = 0x20, ///< movement
        BluetoothData = 0x400, ///< devices nearby
        WlanData = 0x8000, ///< wireless networks nearby
        CellTowerData = 0x100000, ///< cells of the mobile network
        GpsData = 0x2000000, ///< satellites
        GlonassData = 0x4000000, ///< satellites
        BeidouData = 0x8000000, ///< satellites
        GalileoData = 0x10000000, ///< satellites
        QzssData = 0x20000000, ///< satellites
        SbasData = 0x40000000, ///< satellites that correct others
        LastDataSource = 0x80000000 ///< the highest flag
    };
    Q_DECLARE_FLAGS(DataSources, DataSource)
    Q_FLAG(DataSources)

    /** As with SynchronousMode. */
    explicit LocationSettings(QObject *parent = nullptr);
    explicit LocationSettings(Mode mode, QObject *parent = nullptr);
    ~LocationSettings() override;

    /** Whether the phone has a receiver for satellite navigation. */
    bool gpsAvailable() const;

    /** Whether programs may know where the phone is. */
    bool locationEnabled() const;
    void setLocationEnabled(bool enabled); ///< see locationEnabled()
    /** Whether satellites are used. */
    bool gpsEnabled() const;
    void setGpsEnabled(bool enabled); ///< see gpsEnabled()
    /** Whether satellite navigation rests as on a flight. */
    bool gpsFlightMode() const;
    void setGpsFlightMode(bool flightMode); ///< see gpsFlightMode()
    /** What the phone chooses its sources by. */
    LocationMode locationMode() const;
    void setLocationMode(LocationMode mode); ///< see locationMode()
    /** What a position may be made of. */
    DataSources allowedDataSources() const;
    void setAllowedDataSources(DataSources sources); ///< see allowedDataSources()

    /**
     * Whether the phone has the provider. The first call in a process asks for both; the answers are kept
     * for the rest of it.
     */
    Q_INVOKABLE bool agpsAvailable(const QString &agpsProvider) const;
    /** The providers that the phone has: it is asked each time. "mls" comes before "here". */
    Q_INVOKABLE QStringList availableAgpsProviders() const;
    /** Whether the provider is used; false for one that is not available. */
    Q_INVOKABLE bool agpsEnabled(const QString &agpsProvider) const;
    /** Whether the usage agreement of the provider is accepted; false for one that is not available. */
    Q_INVOKABLE bool agpsAgreementAccepted(const QString &agpsProvider) const;
    /**
     * Uses the provider, or not. Without an accepted agreement it cannot be used: "Unable to enable MLS
     * Online aGPS - usage agreement has not been accepted!", and the same for HERE. Nothing happens to one
     * that is not available.
     */
    Q_INVOKABLE void setAgpsEnabled(const QString &agpsProvider, bool value);
    /**
     * Accepts the usage agreement of the provider, which does not make it used; or withdraws it, so that the
     * provider is used no more. Nothing happens for one that is not available.
     */
    Q_INVOKABLE void setAgpsAgreementAccepted(const QString &agpsProvider, bool value);

    /** Allows what is not allowed yet of @p dataSource, which may be a combination: DataSource(int). */
    Q_INVOKABLE void allowDataSource(Corvane::Mdm::LocationSettings::DataSource dataSource);
    /** Allows @p dataSource no more, if all of it was allowed; part of a combination is left as it is. */
    Q_INVOKABLE void disallowDataSource(Corvane::Mdm::LocationSettings::DataSource dataSource);

Q_SIGNALS:
    void locationEnabledChanged(); ///< see locationEnabled()
    void gpsEnabledChanged(); ///< see gpsEnabled()
    void gpsFlightModeChanged(); ///< see gpsFlightMode()
    void locationModeChanged(); ///< see locationMode()
    void allowedDataSourcesChanged(); ///< see allowedDataSources()

private:
    Q_DISABLE_COPY(LocationSettings)
    LocationSettingsPrivate *const d;
};

Q_DECLARE_OPERATORS_FOR_FLAGS(LocationSettings::DataSources)

} // namespace Mdm
} // namespace Corvane

Q_DECLARE_METATYPE(Corvane::Mdm::LocationSettings::DataSource)

#endif // CORVANEMDM_LOCATIONSETTINGS_H
