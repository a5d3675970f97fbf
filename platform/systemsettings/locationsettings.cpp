// SPDX-License-Identifier: LGPL-2.1-or-later
#include <systemsettings/locationsettings.h>

#include "../keyfile_p.h"
#include "settingsfile_p.h"

#include <QtCore/QDir>
#include <QtCore/QPointer>

#include <memory>

namespace
{

const char group[] = "location";
const char locationEnabledKey[] = "enabled";
const char gpsEnabledKey[] = "gps_enabled";
const char gpsFlightModeKey[] = "gps_flight_mode";
const char locationModeKey[] = "mode";
const char dataSourcesKey[] = "allowed_data_sources";
const char hereAvailableKey[] = "here_available";
const char hereStateKey[] = "here_state";
const char mlsAvailableKey[] = "mls_available";
const char mlsEnabledKey[] = "mls_enabled";
const char mlsStateKey[] = "mls_online_state";

QString textOf(bool flag)
{
    return flag ? QStringLiteral("true") : QStringLiteral("false");
}

template <typename Enum> QString textOf(Enum value)
{
    return QString::number(quint32(value));
}

/** The number at @p key as one of the enumerators up to @p last, or @p missing. */
template <typename Enum> Enum enumFrom(const KeyFile &file, const char *key, Enum last, Enum missing)
{
    const int number = file.number(group, key, missing);
    return number >= 0 && number <= last ? Enum(number) : missing;
}

} // namespace

class LocationSettings::Private
{
public:
    struct Values {
        bool locationEnabled = false;
        bool gpsEnabled = false;
        bool gpsFlightMode = false;
        LocationMode mode = CustomMode;
        DataSources sources = NoDataSources;
        bool hereAvailable = false;
        OnlineState hereState = OnlineAGpsAgreementNotAccepted;
        bool mlsAvailable = false;
        bool mlsEnabled = false;
        OnlineState mlsState = OnlineAGpsAgreementNotAccepted;
    };

    explicit Private(LocationSettings *settings)
        : q(settings)
        , file(QStringLiteral("/etc/location/location.conf"))
    {
        QObject::connect(&file, &SettingsFile::changed, q, [this] { read(); });
    }

    Values stored() const;
    /** Takes what the file says, and announces what has changed. */
    void read();
    template <typename T> void write(const char *key, T value)
    {
        if (file.write(group, key, textOf(value)))
            read();
    }

    LocationSettings *const q;
    SettingsFile file;
    Values values;
};

LocationSettings::Private::Values LocationSettings::Private::stored() const
{
    const KeyFile settings(file.fileName());
    Values known;
    known.locationEnabled = settings.flag(group, locationEnabledKey);
    known.gpsEnabled = settings.flag(group, gpsEnabledKey);
    known.gpsFlightMode = settings.flag(group, gpsFlightModeKey);
    known.mode = enumFrom(settings, locationModeKey, CustomMode, CustomMode);
    known.sources = DataSources(QFlag(settings.text(group, dataSourcesKey).toUInt()));
    known.hereAvailable = settings.flag(group, hereAvailableKey);
    known.hereState = enumFrom(settings, hereStateKey, OnlineAGpsEnabled, OnlineAGpsAgreementNotAccepted);
    known.mlsAvailable = settings.flag(group, mlsAvailableKey);
    known.mlsEnabled = settings.flag(group, mlsEnabledKey);
    known.mlsState = enumFrom(settings, mlsStateKey, OnlineAGpsEnabled, OnlineAGpsAgreementNotAccepted);
    return known;
}

void LocationSettings::Private::read()
{
    const Values before = values;
    const Values now = stored();
    values = now;
    // A receiver may delete the object, and this with it.
    const QPointer<LocationSettings> alive(q);
    if (now.locationEnabled != before.locationEnabled)
        Q_EMIT alive->locationEnabledChanged();
    if (alive && now.gpsEnabled != before.gpsEnabled)
        Q_EMIT alive->gpsEnabledChanged();
    if (alive && now.gpsFlightMode != before.gpsFlightMode)
        Q_EMIT alive->gpsFlightModeChanged();
    if (alive && now.mode != before.mode)
        Q_EMIT alive->locationModeChanged();
    if (alive && now.sources != before.sources)
        Q_EMIT alive->allowedDataSourcesChanged();
}

LocationSettings::LocationSettings(QObject *parent)
    : LocationSettings(SynchronousMode, parent)
{
}

LocationSettings::LocationSettings(Mode mode, QObject *parent)
    : QObject(parent)
    , d(new Private(this))
{
    if (mode == SynchronousMode)
        d->read();
    else
        QMetaObject::invokeMethod(
            this, [this] { d->read(); }, Qt::QueuedConnection);
}

LocationSettings::~LocationSettings()
{
    delete d;
}

bool LocationSettings::gpsAvailable() const
{
    return !QDir(QStringLiteral("/dev"))
                .entryList({QStringLiteral("gnss[0-9]*")}, QDir::Files | QDir::System)
                .isEmpty();
}

bool LocationSettings::locationEnabled() const
{
    return d->values.locationEnabled;
}

void LocationSettings::setLocationEnabled(bool enabled)
{
    d->write(locationEnabledKey, enabled);
}

bool LocationSettings::gpsEnabled() const
{
    return d->values.gpsEnabled;
}

void LocationSettings::setGpsEnabled(bool enabled)
{
    d->write(gpsEnabledKey, enabled);
}

bool LocationSettings::gpsFlightMode() const
{
    return d->values.gpsFlightMode;
}

void LocationSettings::setGpsFlightMode(bool flightMode)
{
    d->write(gpsFlightModeKey, flightMode);
}

LocationSettings::LocationMode LocationSettings::locationMode() const
{
    return d->values.mode;
}

void LocationSettings::setLocationMode(LocationMode mode)
{
    d->write(locationModeKey, mode);
}

LocationSettings::DataSources LocationSettings::allowedDataSources() const
{
    return d->values.sources;
}

void LocationSettings::setAllowedDataSources(DataSources sources)
{
    d->write(dataSourcesKey, sources);
}

bool LocationSettings::hereAvailable() const
{
    return d->values.hereAvailable;
}

LocationSettings::OnlineState LocationSettings::hereState() const
{
    return d->values.hereState;
}

void LocationSettings::setHereState(OnlineState state)
{
    d->write(hereStateKey, state);
}

bool LocationSettings::mlsAvailable() const
{
    return d->values.mlsAvailable;
}

bool LocationSettings::mlsEnabled() const
{
    return d->values.mlsEnabled;
}

void LocationSettings::setMlsEnabled(bool enabled)
{
    d->write(mlsEnabledKey, enabled);
}

LocationSettings::OnlineState LocationSettings::mlsOnlineState() const
{
    return d->values.mlsState;
}

void LocationSettings::setMlsOnlineState(OnlineState state)
{
    d->write(mlsStateKey, state);
}
