// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/locationsettings.h>

#include "locationsettings_p.h"

#include <QtCore/QDebug>
#include <QtCore/QPointer>

namespace Corvane
{
namespace Mdm
{

namespace
{

const QLatin1String here("here");
const QLatin1String mls("mls");

/** The platform's states of a provider, under the names that this class has for them. */
constexpr auto agreementNotAccepted = ::LocationSettings::OnlineAGpsAgreementNotAccepted;
constexpr auto providerDisabled = ::LocationSettings::OnlineAGpsDisabled;
constexpr auto providerEnabled = ::LocationSettings::OnlineAGpsEnabled;

/** Which providers the phone has, as the first object that was asked has found it. */
struct Availability {
    bool here;
    bool mls;

    static const Availability &of(const LocationSettingsPrivate *settings)
    {
        static const Availability first{settings->hereAvailable(), settings->mlsAvailable()};
        return first;
    }
};

::LocationSettings::OnlineState stateOf(const LocationSettingsPrivate *settings, const QString &provider)
{
    return provider == mls ? settings->mlsOnlineState() : settings->hereState();
}

void setState(LocationSettingsPrivate *settings, const QString &provider,
              ::LocationSettings::OnlineState state)
{
    if (provider == mls)
        settings->setMlsOnlineState(state);
    else
        settings->setHereState(state);
}

} // namespace

LocationSettingsPrivate::LocationSettingsPrivate(Mdm::LocationSettings *settings,
                                                 Mdm::LocationSettings::Mode mode)
    : ::LocationSettings(mode == Mdm::LocationSettings::SynchronousMode ? SynchronousMode : AsynchronousMode)
    , q(settings)
{
    qRegisterMetaType<Mdm::LocationSettings::DataSource>("Corvane::Mdm::LocationSettings::DataSource");
    qRegisterMetaType<Mdm::LocationSettings::DataSources>("Corvane::Mdm::LocationSettings::DataSources");
}

void LocationSettingsPrivate::forwardSignals()
{
    using Public = Mdm::LocationSettings;
    connect(this, &LocationSettings::locationEnabledChanged, q, &Public::locationEnabledChanged);
    connect(this, &LocationSettings::gpsEnabledChanged, q, &Public::gpsEnabledChanged);
    connect(this, &LocationSettings::gpsFlightModeChanged, q, &Public::gpsFlightModeChanged);
    connect(this, &LocationSettings::locationModeChanged, q, &Public::locationModeChanged);
    connect(this, &LocationSettings::allowedDataSourcesChanged, q, &Public::allowedDataSourcesChanged);
}

LocationSettings::LocationSettings(QObject *parent)
    : LocationSettings(SynchronousMode, parent)
{
}

LocationSettings::LocationSettings(Mode mode, QObject *parent)
    : QObject(parent)
    , d(new LocationSettingsPrivate(this, mode))
{
    d->forwardSignals();
}

LocationSettings::~LocationSettings()
{
    delete d;
}

bool LocationSettings::gpsAvailable() const
{
    return d->gpsAvailable();
}

bool LocationSettings::locationEnabled() const
{
    return d->locationEnabled();
}

void LocationSettings::setLocationEnabled(bool enabled)
{
    d->setLocationEnabled(enabled);
}

bool LocationSettings::gpsEnabled() const
{
    return d->gpsEnabled();
}

void LocationSettings::setGpsEnabled(bool enabled)
{
    d->setGpsEnabled(enabled);
}

bool LocationSettings::gpsFlightMode() const
{
    return d->gpsFlightMode();
}

void LocationSettings::setGpsFlightMode(bool flightMode)
{
    d->setGpsFlightMode(flightMode);
}

LocationSettings::LocationMode LocationSettings::locationMode() const
{
    return LocationMode(d->locationMode());
}

void LocationSettings::setLocationMode(LocationMode mode)
{
    d->setLocationMode(::LocationSettings::LocationMode(mode));
}

LocationSettings::DataSources LocationSettings::allowedDataSources() const
{
    return DataSources(QFlag(d->allowedDataSources()));
}

void LocationSettings::setAllowedDataSources(DataSources sources)
{
    d->setAllowedDataSources(::LocationSettings::DataSources(QFlag(sources)));
}

bool LocationSettings::agpsAvailable(const QString &agpsProvider) const
{
    const Availability &available = Availability::of(d);
    if (agpsProvider == here)
        return available.here;
    if (agpsProvider == mls)
        return available.mls;
    qWarning() << "No such aGPS provider:" << agpsProvider;
    return false;
}

QStringList LocationSettings::availableAgpsProviders() const
{
    QStringList providers;
    if (d->mlsAvailable())
        providers << mls;
    if (d->hereAvailable())
        providers << here;
    return providers;
}

bool LocationSettings::agpsEnabled(const QString &agpsProvider) const
{
    if (!agpsAvailable(agpsProvider))
        return false;
    return (agpsProvider != mls || d->mlsEnabled()) && stateOf(d, agpsProvider) == providerEnabled;
}

bool LocationSettings::agpsAgreementAccepted(const QString &agpsProvider) const
{
    return agpsAvailable(agpsProvider) && stateOf(d, agpsProvider) != agreementNotAccepted;
}

void LocationSettings::setAgpsEnabled(const QString &agpsProvider, bool value)
{
    if (!agpsAvailable(agpsProvider))
        return;
    // What others have changed meanwhile is announced along with it, to who may delete this.
    const QPointer<LocationSettings> alive(this);
    if (agpsProvider == mls)
        d->setMlsEnabled(value);
    if (!alive)
        return;
    const ::LocationSettings::OnlineState state = stateOf(d, agpsProvider);
    if (state == agreementNotAccepted) {
        if (value && agpsProvider == mls)
            qWarning() << "Unable to enable MLS Online aGPS - usage agreement has not been accepted!";
        else if (value)
            qWarning() << "Unable to enable HERE aGPS - usage agreement has not been accepted!";
        return;
    }
    if (value && state == providerDisabled)
        setState(d, agpsProvider, providerEnabled);
    else if (!value && state == providerEnabled)
        setState(d, agpsProvider, providerDisabled);
}

void LocationSettings::setAgpsAgreementAccepted(const QString &agpsProvider, bool value)
{
    if (!agpsAvailable(agpsProvider))
        return;
    if (!value)
        setState(d, agpsProvider, agreementNotAccepted);
    else if (stateOf(d, agpsProvider) == agreementNotAccepted)
        setState(d, agpsProvider, providerDisabled);
}

void LocationSettings::allowDataSource(DataSource dataSource)
{
    const DataSources allowed = allowedDataSources();
    if (!allowed.testFlag(dataSource))
        setAllowedDataSources(allowed | dataSource);
}

void LocationSettings::disallowDataSource(DataSource dataSource)
{
    const DataSources allowed = allowedDataSources();
    if (allowed.testFlag(dataSource))
        setAllowedDataSources(allowed & ~DataSources(dataSource));
}

} // namespace Mdm
} // namespace Corvane
