// SPDX-License-Identifier: LGPL-2.1-or-later
#include "devicesettings.h"

#include <corvanemdm/locationsettings.h>

#include <QtCore/QJsonArray>

namespace Corvane
{
namespace Agent
{

using Mdm::LocationSettings;

namespace
{

// By value of the enumeration.
const QStringList &modes()
{
    static const QStringList words{QStringLiteral("high-accuracy"), QStringLiteral("battery-saving"),
                                   QStringLiteral("device-only"), QStringLiteral("custom")};
    return words;
}

struct Source {
    QString word;
    LocationSettings::DataSource flag;
};

const QVector<Source> &sources()
{
    static const QVector<Source> all{
        {QStringLiteral("online"), LocationSettings::OnlineDataSources},
        {QStringLiteral("sensors"), LocationSettings::DeviceSensorsData},
        {QStringLiteral("bluetooth"), LocationSettings::BluetoothData},
        {QStringLiteral("wlan"), LocationSettings::WlanData},
        {QStringLiteral("cells"), LocationSettings::CellTowerData},
        {QStringLiteral("gps"), LocationSettings::GpsData},
        {QStringLiteral("glonass"), LocationSettings::GlonassData},
        {QStringLiteral("beidou"), LocationSettings::BeidouData},
        {QStringLiteral("galileo"), LocationSettings::GalileoData},
        {QStringLiteral("qzss"), LocationSettings::QzssData},
        {QStringLiteral("sbas"), LocationSettings::SbasData},
    };
    return all;
}

QStringList sourceWords()
{
    QStringList words;
    for (const Source &source : sources())
        words.append(source.word);
    return words;
}

QJsonValue wordsOf(LocationSettings::DataSources flags)
{
    QJsonArray words;
    for (const Source &source : sources()) {
        if (flags & source.flag)
            words.append(source.word);
    }
    return words;
}

/** @p present with the sources that have a word as @p words have them; others stay as they are. */
LocationSettings::DataSources flagsOf(const QJsonValue &words, LocationSettings::DataSources present)
{
    for (const Source &source : sources())
        present.setFlag(source.flag, words.toArray().contains(source.word));
    return present;
}

/** The settings are in a file, so that no service has to be there. */
class Location : public DeviceSettings
{
public:
    explicit Location(std::chrono::milliseconds timeout);

    Service service() const override { return Service::bus(); }
    Reply open() override;

private:
    void addSwitch(const QString &name, const QString &description, bool (LocationSettings::*get)() const,
                   void (LocationSettings::*change)(bool), bool needsReceiver);
    void addProvider(const QString &provider, const QString &people);

    std::unique_ptr<LocationSettings> m_phone;
};

Location::Location(std::chrono::milliseconds timeout)
    : DeviceSettings(timeout, nullptr)
{
    addSwitch(QStringLiteral("enabled"), QStringLiteral("Whether programs may know where the phone is"),
              &LocationSettings::locationEnabled, &LocationSettings::setLocationEnabled, false);
    add({QStringLiteral("mode"),
         QStringLiteral("What the phone chooses its sources by"),
         DeviceSetting::Word,
         modes(),
         [this] { return modes().value(m_phone->locationMode()); },
         [this](const QJsonValue &mode) {
             m_phone->setLocationMode(LocationSettings::LocationMode(modes().indexOf(mode.toString())));
         },
         {}});
    addSwitch(QStringLiteral("gps"), QStringLiteral("Whether satellites are used"),
              &LocationSettings::gpsEnabled, &LocationSettings::setGpsEnabled, true);
    addSwitch(QStringLiteral("gpsFlightMode"),
              QStringLiteral("Whether satellite navigation rests as on a flight"),
              &LocationSettings::gpsFlightMode, &LocationSettings::setGpsFlightMode, true);
    add({QStringLiteral("sources"),
         QStringLiteral("What a position may be made of"),
         DeviceSetting::Words,
         sourceWords(),
         [this] { return wordsOf(m_phone->allowedDataSources()); },
         [this](const QJsonValue &words) {
             m_phone->setAllowedDataSources(flagsOf(words, m_phone->allowedDataSources()));
         },
         {}});
    addProvider(QStringLiteral("mls"), QStringLiteral("MLS"));
    addProvider(QStringLiteral("here"), QStringLiteral("HERE"));
}

Reply Location::open()
{
    m_phone = std::make_unique<LocationSettings>();
    connect(m_phone.get(), &LocationSettings::locationEnabledChanged, this, &DeviceSettings::changed);
    connect(m_phone.get(), &LocationSettings::gpsEnabledChanged, this, &DeviceSettings::changed);
    connect(m_phone.get(), &LocationSettings::gpsFlightModeChanged, this, &DeviceSettings::changed);
    connect(m_phone.get(), &LocationSettings::locationModeChanged, this, &DeviceSettings::changed);
    connect(m_phone.get(), &LocationSettings::allowedDataSourcesChanged, this, &DeviceSettings::changed);
    return {};
}

void Location::addSwitch(const QString &name, const QString &description,
                         bool (LocationSettings::*get)() const, void (LocationSettings::*change)(bool),
                         bool needsReceiver)
{
    add({name,
         description,
         DeviceSetting::Switch,
         {},
         [this, get] { return ((*m_phone).*get)(); },
         [this, change](const QJsonValue &value) { ((*m_phone).*change)(value.toBool()); },
         [this, needsReceiver](const QJsonValue &) {
             return needsReceiver && !m_phone->gpsAvailable()
                 ? QStringLiteral("the phone has no receiver for satellites")
                 : QString();
         }});
}

void Location::addProvider(const QString &provider, const QString &people)
{
    // That an agreement is missing is told by the library.
    const auto absence = [this, provider, people] {
        return m_phone->availableAgpsProviders().contains(provider)
            ? QString()
            : QStringLiteral("the phone has no %1").arg(people);
    };
    // The agreement comes first: what it is for cannot be used without.
    add({provider + QLatin1String("Agreement"),
         QStringLiteral("Whether the usage agreement of %1 is accepted").arg(people),
         DeviceSetting::Switch,
         {},
         [this, provider] { return m_phone->agpsAgreementAccepted(provider); },
         [this, provider](const QJsonValue &value) {
             m_phone->setAgpsAgreementAccepted(provider, value.toBool());
         },
         [absence](const QJsonValue &) {
             return absence();
         }});
    add({provider,
         QStringLiteral("Whether assistance data of %1 are used").arg(people),
         DeviceSetting::Switch,
         {},
         [this, provider] { return m_phone->agpsEnabled(provider); },
         [this, provider](const QJsonValue &value) { m_phone->setAgpsEnabled(provider, value.toBool()); },
         [absence](const QJsonValue &) {
             return absence();
         }});
}

} // namespace

std::unique_ptr<DeviceSettings> makeLocationSettings(std::chrono::milliseconds timeout)
{
    return std::make_unique<Location>(timeout);
}

} // namespace Agent
} // namespace Corvane
