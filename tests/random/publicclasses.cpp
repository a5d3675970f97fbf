// SPDX-License-Identifier: LGPL-2.1-or-later
// Every public class of the library with all that it can be asked to do, but for what its properties do.
#include "testedclass.h"

#include <corvanemdm/applications.h>
#include <corvanemdm/callstatistics.h>
#include <corvanemdm/connectivitysettings.h>
#include <corvanemdm/locationinfo.h>
#include <corvanemdm/notificationinfo.h>
#include <corvanemdm/simfilter.h>
#include <corvanemdm/siminfo.h>
#include <corvanemdm/simmobiledatafilter.h>
#include <corvanemdm/simsmsfilter.h>
#include <corvanemdm/simvoicecallfilter.h>
#include <corvanemdm/softwareupdate.h>

#include <corvanemdm/autostart.h>
#include <corvanemdm/certificates.h>
#include <corvanemdm/emailaccountprovisioner.h>
#include <corvanemdm/genericaccountprovisioner.h>
#include <corvanemdm/netproxy.h>
#include <corvanemdm/networkdatacounter.h>
#if __has_include(<corvanemdm/devicelock.h>)
#include <corvanemdm/devicelock.h>
#endif
#if __has_include(<corvanemdm/securitysettings.h>)
#include <corvanemdm/securitysettings.h>
#endif
#include <corvanemdm/batteryinfo.h>
#include <corvanemdm/datetimesettings.h>
#include <corvanemdm/locationsettings.h>

using namespace Corvane::Mdm;

template <> struct RandomArgument<SimFilter::Rule> {
    static SimFilter::Rule make(ArgumentSource &source)
    {
        const auto imsi = randomArgument<QString>(source);
        return SimFilter::Rule(imsi, randomArgument<SimFilter::Action>(source));
    }
};

template <> struct RandomArgument<CallStatistics::Filter> {
    static CallStatistics::Filter make(ArgumentSource &source)
    {
        CallStatistics::Filter filter;
        filter.firstSelector = randomArgument<int>(source);
        filter.secondSelector = randomArgument<int>(source);
        filter.start = randomArgument<QDateTime>(source);
        filter.end = randomArgument<QDateTime>(source);
        return filter;
    }
};

template <> struct RandomArgument<NotificationData> {
    static NotificationData make(ArgumentSource &source)
    {
        NotificationData data;
        data.id = randomArgument<uint>(source);
        data.urgency = randomArgument<int>(source);
        for (QString *text : {&data.owner, &data.category, &data.appName, &data.appIcon, &data.summary,
                              &data.body, &data.subText}) {
            *text = randomArgument<QString>(source);
        }
        data.timestamp = randomArgument<QDateTime>(source);
        data.remoteActions = randomArgument<QVariantList>(source);
        return data;
    }
};

using AccessPoint = ConnectivitySettings::MobileNetworkAccessPointSettings;

template <> struct RandomArgument<AccessPoint> {
    static AccessPoint make(ArgumentSource &source)
    {
        AccessPoint settings;
        settings.type = randomArgument<AccessPoint::Type>(source);
        settings.protocol = randomArgument<AccessPoint::Protocol>(source);
        settings.authenticationMethod = randomArgument<AccessPoint::AuthenticationMethod>(source);
        for (QString *text : {&settings.name, &settings.accessPointName, &settings.username,
                              &settings.password, &settings.messageCenter, &settings.messageProxy}) {
            *text = randomArgument<QString>(source);
        }
        return settings;
    }
};

template <> struct RandomArgument<QSslCertificate> {
    static QSslCertificate make(ArgumentSource &source)
    {
        return QSslCertificate(randomArgument<QByteArray>(source));
    }
};

#define CALL(method) call(#method, &Tested::method)

namespace
{

TestedClass simVoiceCallFilter()
{
    using Tested = SimVoiceCallFilter;
    return testedClass<Tested>("SimVoiceCallFilter",
                               {CALL(setDefaultDialAction), CALL(setDialRules), CALL(setDialRule),
                                CALL(hasDialRuleForImsi), CALL(removeDialRule), CALL(clearDialRules),
                                CALL(setDefaultIncomingAction), CALL(setIncomingRules), CALL(setIncomingRule),
                                CALL(hasIncomingRuleForImsi), CALL(removeIncomingRule),
                                CALL(clearIncomingRules)});
}

TestedClass simSmsFilter()
{
    using Tested = SimSmsFilter;
    return testedClass<Tested>("SimSmsFilter",
                               {CALL(setDefaultTextAction), CALL(setTextRules), CALL(setTextRule),
                                CALL(hasTextRuleForImsi), CALL(removeTextRule), CALL(clearTextRules)});
}

TestedClass simMobileDataFilter()
{
    using Tested = SimMobileDataFilter;
    return testedClass<Tested>("SimMobileDataFilter",
                               {CALL(setDefaultAction), CALL(setRules), CALL(setRule), CALL(hasRuleForImsi),
                                CALL(removeRule), CALL(clearRules)});
}

TestedClass simInfo()
{
    using Tested = SimInfo;
    return testedClass<Tested>("SimInfo",
                               {CALL(simSlotStates), CALL(imeiCodes), CALL(subscriberIdentities),
                                CALL(cardIdentifier), CALL(subscriberNumbers), CALL(hotSwappingSupported)});
}

TestedClass callStatistics()
{
    using Tested = CallStatistics;
    return testedClass<Tested>("CallStatistics", {CALL(search)});
}

TestedClass notificationInfo()
{
    using Tested = NotificationInfo;
    return testedClass<Tested>("NotificationInfo",
                               {CALL(createNotification), CALL(updateNotification), CALL(closeNotification),
                                CALL(notifications), CALL(notificationsByCategory)});
}

TestedClass softwareUpdate()
{
    using Tested = SoftwareUpdate;
    return testedClass<Tested>("SoftwareUpdate",
                               {CALL(latestAvailableUpdateVersion), CALL(softwareUpdateIsAvailable),
                                CALL(checkForSoftwareUpdate), CALL(downloadSoftwareUpdate),
                                CALL(installSoftwareUpdate)});
}

TestedClass locationInfo()
{
    using Tested = LocationInfo;
    return testedClass<Tested>(
        "LocationInfo",
        {CALL(latitude), CALL(position), CALL(startUpdates), CALL(stopUpdates), CALL(requestUpdate)});
}

TestedClass applications()
{
    using Tested = Applications;
    return testedClass<Tested>("Applications",
                               {CALL(getInstalledPackages), CALL(getInstalledApplications),
                                CALL(installPackage), CALL(removePackage)});
}

TestedClass applicationOperation()
{
    using Tested = ApplicationOperation;
    return testedClass<Tested>("ApplicationOperation",
                               {CALL(package), CALL(version), CALL(errorString), CALL(isFinished),
                                CALL(isSucceeded), CALL(setError), CALL(setFinished),
                                CALL(setFinishedWithError)});
}

TestedClass connectivitySettings()
{
    using Tested = ConnectivitySettings;
    TestedClass tested = testedClass<Tested>(
        "ConnectivitySettings",
        {CALL(setWlanEnabled), CALL(setFlightModeEnabled), CALL(modemPaths), CALL(modemSimImsi),
         CALL(mobileNetworkImsis), CALL(supportedCellularTechnologies), CALL(selectedCellularTechnologies),
         CALL(selectCellularTechnologies), CALL(isConnectedToMobileNetwork), CALL(connectToMobileNetwork),
         CALL(disconnectFromMobileNetwork), CALL(accessPointSettings), CALL(setAccessPointSettings)});
    tested.create = [](QObject *parent, ArgumentSource &source) -> QObject * {
        return new Tested(randomArgument<Tested::Mode>(source), parent);
    };
    return tested;
}

TestedClass netProxy()
{
    using Tested = NetProxy;
    return testedClass<Tested>(
        "NetProxy",
        {CALL(selectProxy), CALL(getIdentifier), CALL(getName), CALL(getIdentifiers), CALL(getTechnologies)});
}

TestedClass networkDataCounter()
{
    using Tested = NetworkDataCounter;
    return testedClass<Tested>("NetworkDataCounter", {CALL(setActive), CALL(resetCounter)});
}

TestedClass emailAccountProvisioner()
{
    using Tested = Accounts::EmailAccountProvisioner;
    return testedClass<Tested>("EmailAccountProvisioner",
                               {CALL(createAccount), CALL(deleteAccount), CALL(listAccounts)});
}

TestedClass genericAccountProvisioner()
{
    using Tested = Accounts::GenericAccountProvisioner;
    return testedClass<Tested>("GenericAccountProvisioner",
                               {CALL(createAccount), CALL(deleteAccount), CALL(listAccounts)});
}

TestedClass autostart()
{
    using Tested = Autostart;
    const Operation query{"query", [](QObject *object, ArgumentSource &) {
                              Autostart::Result result = Autostart::Success;
                              static_cast<Autostart *>(object)->query(result);
                          }};
    return testedClass<Tested>("Autostart", {CALL(add), CALL(remove), query});
}

TestedClass certificates()
{
    using Tested = Certificates;
    using Data = void (Tested::*)(const QString &, const QByteArray &);
    using List = void (Tested::*)(const QString &, const QList<QSslCertificate> &);
    return testedClass<Tested>("Certificates",
                               {CALL(certificates), CALL(installedFiles), CALL(blacklistedFiles),
                                CALL(uninstall), CALL(unblacklist),
                                call("install", static_cast<Data>(&Tested::install)),
                                call("install", static_cast<List>(&Tested::install)),
                                call("blacklist", static_cast<Data>(&Tested::blacklist)),
                                call("blacklist", static_cast<List>(&Tested::blacklist))});
}

#if __has_include(<corvanemdm/devicelock.h>)
TestedClass deviceLock()
{
    using Tested = DeviceLock;
    return testedClass<Tested>(
        "DeviceLock",
        {CALL(isHomeEncrypted), CALL(setLockoutMode), CALL(clearDevice), CALL(setSecurityCode)});
}
#endif

#if __has_include(<corvanemdm/securitysettings.h>)
TestedClass securitySettings()
{
    using Tested = SecuritySettings;
    return testedClass<Tested>("SecuritySettings",
                               {CALL(developerModeEnabled), CALL(setDeveloperModeEnabled),
                                CALL(sideloadingAllowed), CALL(setSideloadingAllowed)});
}
#endif

TestedClass dateTimeSettings()
{
    using Tested = DateTimeSettings;
    return testedClass<Tested>("DateTimeSettings", {CALL(setTime), CALL(setDate), CALL(supportedTimeZones)});
}

TestedClass locationSettings()
{
    using Tested = LocationSettings;
    TestedClass tested = testedClass<Tested>("LocationSettings",
                                             {CALL(agpsAvailable), CALL(availableAgpsProviders),
                                              CALL(agpsEnabled), CALL(agpsAgreementAccepted),
                                              CALL(setAgpsEnabled), CALL(setAgpsAgreementAccepted),
                                              CALL(allowDataSource), CALL(disallowDataSource)});
    tested.create = [](QObject *parent, ArgumentSource &source) -> QObject * {
        return new Tested(randomArgument<Tested::Mode>(source), parent);
    };
    return tested;
}

TestedClass batteryInfo()
{
    return testedClass<BatteryInfo>("BatteryInfo", {});
}

} // namespace

const std::vector<TestedClass> &testedClasses()
{
    static const std::vector<TestedClass> classes
    {
        simInfo(), simVoiceCallFilter(), simSmsFilter(), simMobileDataFilter(),
            testedClass<SimFilter>("SimFilter", {}), callStatistics(), notificationInfo(), softwareUpdate(),
            locationInfo(), connectivitySettings(), applications(), applicationOperation(), netProxy(),
            networkDataCounter(), emailAccountProvisioner(), genericAccountProvisioner(), autostart(),
            certificates(),
#if __has_include(<corvanemdm/devicelock.h>)
            deviceLock(),
#endif
#if __has_include(<corvanemdm/securitysettings.h>)
            securitySettings(),
#endif
            dateTimeSettings(), locationSettings(), batteryInfo(),
    };
    return classes;
}
