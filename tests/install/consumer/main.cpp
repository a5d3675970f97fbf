// SPDX-License-Identifier: LGPL-2.1-or-later
// Uses every public class from outside of the project. Where no service answers, it must work as well.
#include <corvanemdm/applications.h>
#include <corvanemdm/autostart.h>
#include <corvanemdm/batteryinfo.h>
#include <corvanemdm/callstatistics.h>
#include <corvanemdm/certificates.h>
#include <corvanemdm/connectivitysettings.h>
#include <corvanemdm/corvanemdm_global.h>
#include <corvanemdm/datetimesettings.h>
#include <corvanemdm/emailaccountprovisioner.h>
#include <corvanemdm/genericaccountprovisioner.h>
#include <corvanemdm/locationinfo.h>
#include <corvanemdm/locationsettings.h>
#include <corvanemdm/netproxy.h>
#include <corvanemdm/networkdatacounter.h>
#include <corvanemdm/notificationinfo.h>
#include <corvanemdm/provisioner.h>
#include <corvanemdm/simfilter.h>
#include <corvanemdm/siminfo.h>
#include <corvanemdm/simmobiledatafilter.h>
#include <corvanemdm/simsmsfilter.h>
#include <corvanemdm/simvoicecallfilter.h>
#include <corvanemdm/softwareupdate.h>

#include <QtCore/QCoreApplication>
#include <QtCore/QDebug>
#include <QtCore/QTextStream>

#include <algorithm>
#include <iterator>

using namespace Corvane::Mdm;

namespace
{

bool simFilterWorks()
{
    const SimFilter::Rule rule(QStringLiteral("244120000000001"), SimFilter::Allow);
    QString text;
    QDebug(&text) << rule.action << &rule;
    return SimFilter::isValidImsi(rule.imsi) && !SimFilter::isValidImsi(QStringLiteral("244x"))
        && QString(rule) == QLatin1String("Rule (imsi=244120000000001, action=2)")
        && text.contains(QLatin1String("allow"));
}

bool simInfoWorks()
{
    const SimInfo info;
    QObject::connect(&info, &SimInfo::simStateChanged, &info, [](const SimInfo::SimState &) {});
    const SimInfo::SlotInfo slot(1, QStringLiteral("x"));
    QString text;
    QDebug(&text) << SimInfo::UnknownPinState << SimInfo::Roaming << &slot;
    // Nothing is known before the event loop has run.
    return !info.available() && info.simSlotStates().isEmpty() && text.contains(QLatin1String("roaming"))
        && QString(slot) == QLatin1String("Slot(1) = (x)");
}

bool connectivitySettingsWork()
{
    ConnectivitySettings settings;
    QObject::connect(&settings, &ConnectivitySettings::wlanEnabledChanged, &settings, [] {});
    const ConnectivitySettings mirror(ConnectivitySettings::NetworkManagerMode);
    ConnectivitySettings::MobileNetworkAccessPointSettings accessPoint;
    const auto twoAndThree = ConnectivitySettings::Technology2G | ConnectivitySettings::Technology3G;
    return settings.ready() && !mirror.wlanEnabled() && int(twoAndThree) == 3 && !accessPoint.isValid()
        && !settings.setAccessPointSettings(QStringLiteral("244120000000001"), accessPoint);
}

bool simVoiceCallFilterWorks()
{
    SimVoiceCallFilter filter;
    QObject::connect(&filter, &SimVoiceCallFilter::readyChanged, &filter, [] {});
    // Not ready before the event loop has run, so that no request is a change.
    return !filter.ready() && filter.dialRules().isEmpty() && !filter.clearIncomingRules();
}

bool provisionersWork()
{
    Accounts::EmailAccountProvisioner email;
    email.setEmailAddress(QStringLiteral("a@example.org"));
    Accounts::GenericAccountProvisioner generic;
    generic.setUsername(QStringLiteral("a"));
    Accounts::Provisioner &provisioner = generic;
    // Where nobody answers, an account cannot be deleted either.
    return !email.canCreateAccount() && !email.createAccount() && email.error() == 1
        && !provisioner.deleteAccount(0) && provisioner.error() != 0 && !provisioner.errorMessage().isEmpty();
}

bool certificatesWork()
{
    const Certificates certificates;
    QObject::connect(&certificates, &Certificates::installFinished, &certificates,
                     [](const CertificateFile &, Certificates::Result) {});
    const QList<CertificateFile> files = certificates.installedFiles() + certificates.blacklistedFiles();
    return CertificateFile().isNull()
        && std::none_of(files.begin(), files.end(),
                        [](const CertificateFile &file) { return file.isNull(); });
}

bool autostartWorks()
{
    Autostart autostart;
    Autostart::Result result = Autostart::AlreadyAutostarted;
    const QStringList entries = autostart.query(result);
    // Where nobody answers, nothing starts; an application that there is not cannot be added anywhere.
    return (result == Autostart::InternalError || result == Autostart::Success) && entries.isEmpty()
        && autostart.add(QStringLiteral("no-such.desktop")) != Autostart::Success;
}

bool otherFiltersWork()
{
    SimSmsFilter texts;
    QObject::connect(&texts, &SimSmsFilter::readyChanged, &texts, [] {});
    SimMobileDataFilter data;
    QObject::connect(&data, &SimMobileDataFilter::readyChanged, &data, [] {});
    return !texts.ready() && !texts.clearTextRules() && !data.ready() && !data.clearRules();
}

bool callStatisticsWork()
{
    CallStatistics statistics;
    int answers = 0;
    QObject::connect(&statistics, &CallStatistics::searchFinished, &statistics,
                     [&answers](bool, const QList<CallStatistics::Result> &) { ++answers; });
    statistics.search(CallStatistics::Filter());
    return answers == 0;
}

bool applicationsWork()
{
    Applications applications;
    // Nothing but the phone's own lists tells how many there are.
    const QList<PackageEntry> packages = applications.getInstalledPackages();
    const QList<ApplicationEntry> entries = applications.getInstalledApplications();
    ApplicationOperation operation;
    QObject::connect(&operation, &ApplicationOperation::finished, &operation, [](ApplicationOperation *) {});
    return packages.size() >= 0 && entries.size() >= 0 && !PackageEntry().isValid()
        && ApplicationEntry().name().isEmpty() && operation.isSucceeded();
}

bool notificationInfoWorks()
{
    NotificationInfo info;
    NotificationData data;
    data.summary = QStringLiteral("Consumer");
    const uint id = info.createNotification(data);
    return id == 0 ? info.notifications().isEmpty() : info.closeNotification(id);
}

bool locationInfoWorks()
{
    LocationInfo info;
    QObject::connect(&info, &LocationInfo::positionChanged, &info, [] {});
    // Nothing is asked for before something was requested.
    const LocationInfo::Position position = info.position();
    return info.satellitesInUse() == -1 && !position.timestamp.isValid() && position.latitude == 0.0;
}

bool netProxyWorks()
{
    NetProxy proxy;
    QObject::connect(&proxy, &NetProxy::validChanged, &proxy, [](bool) {});
    // Nothing is selected before the event loop has run.
    return !proxy.isValid() && proxy.type() == NetProxy::Invalid && !proxy.setType(NetProxy::Direct)
        && proxy.getIdentifiers(QStringLiteral("global")) == QStringList(QStringLiteral("global"));
}

bool networkDataCounterWorks()
{
    NetworkDataCounter counter;
    int updates = 0;
    QObject::connect(&counter, &NetworkDataCounter::counterUpdate, &counter,
                     [&updates](const NetworkDataCounter::Update &) { ++updates; });
    counter.setUpdateInterval(5);
    return !counter.active() && counter.updateInterval() == 5 && updates == 0;
}

bool locationSettingsWork()
{
    const LocationSettings settings;
    QObject::connect(&settings, &LocationSettings::locationEnabledChanged, &settings, [] {});
    const LocationSettings::DataSources satellites = LocationSettings::GpsData | LocationSettings::SbasData;
    return satellites.testFlag(LocationSettings::GpsData)
        && settings.availableAgpsProviders().contains(QStringLiteral("here"))
        == settings.agpsAvailable(QStringLiteral("here"));
}

bool dateTimeSettingsWork()
{
    DateTimeSettings settings;
    QObject::connect(&settings, &DateTimeSettings::timeZoneChanged, &settings, [] {});
    // Nothing is known before the event loop has run.
    return !settings.ready() && settings.timeZone().isEmpty()
        && settings.supportedTimeZones().contains(QStringLiteral("Europe/Helsinki"));
}

bool batteryInfoWorks()
{
    const BatteryInfo battery;
    QObject::connect(&battery, &BatteryInfo::chargePercentageChanged, &battery, [](int) {});
    return battery.chargePercentage() == -1 && battery.status() == BatteryInfo::BatteryStatusUnknown;
}

QString latestVersion()
{
    const SoftwareUpdate update;
    QObject::connect(&update, &SoftwareUpdate::softwareUpdateInfoChanged, &update, [] {});
    return update.softwareUpdateIsAvailable() ? update.latestAvailableUpdateVersion()
                                              : QStringLiteral("none");
}

} // namespace

int main(int argc, char **argv)
{
    QCoreApplication application(argc, argv);
    bool (*const checks[])() = {
        simFilterWorks,          simInfoWorks,         connectivitySettingsWork, simVoiceCallFilterWorks,
        otherFiltersWork,        callStatisticsWork,   applicationsWork,         notificationInfoWorks,
        locationInfoWorks,       locationSettingsWork, dateTimeSettingsWork,     batteryInfoWorks,
        provisionersWork,        autostartWorks,       certificatesWork,         netProxyWorks,
        networkDataCounterWorks,
    };
    const bool works
        = std::all_of(std::begin(checks), std::end(checks), [](bool (*check)()) { return check(); });
    QTextStream(stdout) << (works ? "consumer works" : "consumer fails") << ", update: " << latestVersion()
                        << '\n';
    return works ? 0 : 1;
}
