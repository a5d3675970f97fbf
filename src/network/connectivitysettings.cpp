// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/connectivitysettings.h>

#include "connectivitysettings_p.h"
#include "frame/objectpathproperties_p.h"
#include "platform/frame/signalconnection_p.h"

#include <QtCore/QDebug>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusReply>

#include <glib.h>

#include <algorithm>
#include <iterator>

namespace Corvane
{
namespace Mdm
{

namespace
{

using AccessPoint = ConnectivitySettings::MobileNetworkAccessPointSettings;
using CellularTechnologies = ConnectivitySettings::CellularTechnologies;
using InterfacePointer = ConnectivitySettingsPrivate::InterfacePointer;

const QLatin1String ConnmanService("net.connman");
const QLatin1String ConnmanManagerInterface("net.connman.Manager");
const QLatin1String ConnmanTechnologyInterface("net.connman.Technology");
const QLatin1String ConnmanServiceInterface("net.connman.Service");
const QLatin1String WlanTechnologyPath("/net/connman/technology/wifi");
const QLatin1String CellularServicePrefix("/net/connman/service/cellular_");
const QLatin1String WlanType("wifi");
const QLatin1String CellularType("cellular");

const QLatin1String OfonoService("org.ofono");
const QLatin1String OfonoManagerInterface("org.ofono.Manager");
const QLatin1String SimManagerInterface("org.ofono.SimManager");
const QLatin1String RadioSettingsInterface("org.ofono.RadioSettings");
const QLatin1String ConnectionManagerInterface("org.ofono.ConnectionManager");
const QLatin1String ConnectionContextInterface("org.ofono.ConnectionContext");
const QLatin1String ModemManagerInterface("org.veldmobile.ofono.ModemManager");
constexpr int OldestModemManagerVersion = 1;

const QLatin1String RootPath("/");
const QLatin1String GetProperties("GetProperties");
const QLatin1String SetProperty("SetProperty");
const QLatin1String PropertyChanged("PropertyChanged");

const QLatin1String PoweredProperty("Powered");
const QLatin1String OfflineModeProperty("OfflineMode");
const QLatin1String AutoConnectProperty("AutoConnect");
const QLatin1String StateProperty("State");
const QLatin1String OnlineState("online");
const QLatin1String ReadyState("ready");
const QLatin1String SubscriberIdentityProperty("SubscriberIdentity");
const QLatin1String AvailableTechnologiesProperty("AvailableTechnologies");
const QLatin1String TechnologyPreferenceProperty("TechnologyPreference");
const QLatin1String TypeProperty("Type");
const QLatin1String NameProperty("Name");
const QLatin1String AccessPointNameProperty("AccessPointName");
const QLatin1String UsernameProperty("Username");
const QLatin1String PasswordProperty("Password");
const QLatin1String ProtocolProperty("Protocol");
const QLatin1String AuthenticationMethodProperty("AuthenticationMethod");
const QLatin1String MessageCenterProperty("MessageCenter");
const QLatin1String MessageProxyProperty("MessageProxy");

const QLatin1String AnyTechnology("any");

/** A selectable set: a generation with those before it. */
struct TechnologySet {
    QLatin1String word; ///< the telephony service's, of the newest generation
    ConnectivitySettings::CellularTechnology newest;
    CellularTechnologies technologies;
};

const TechnologySet technologySets[] = {
    {QLatin1String("gsm"), ConnectivitySettings::Technology2G, ConnectivitySettings::Technology2G},
    {QLatin1String("umts"), ConnectivitySettings::Technology3G,
     ConnectivitySettings::Technology2G | ConnectivitySettings::Technology3G},
    {QLatin1String("lte"), ConnectivitySettings::Technology4G,
     ConnectivitySettings::Technology2G | ConnectivitySettings::Technology3G
         | ConnectivitySettings::Technology4G},
};

// By value of the enumerations.
const QLatin1String typeWords[] = {QLatin1String("internet"), QLatin1String("mms"), QLatin1String("ims")};
const QLatin1String protocolWords[] = {QLatin1String("ip"), QLatin1String("ipv6"), QLatin1String("dual")};
const QLatin1String authenticationWords[]
    = {QLatin1String("none"), QLatin1String("pap"), QLatin1String("chap"), QLatin1String("any")};

/** The value that @p text stands for, or @p unknown. */
template <typename Enum, std::size_t count>
Enum fromWord(const QString &text, const QLatin1String (&words)[count], Enum unknown)
{
    const auto *found = std::find(std::begin(words), std::end(words), text);
    return found == std::end(words) ? unknown : Enum(std::distance(std::begin(words), found));
}

/** The word for @p value, or null. */
template <std::size_t count> const QLatin1String *toWord(int value, const QLatin1String (&words)[count])
{
    return value >= 0 && value < int(count) ? &words[value] : nullptr;
}

AccessPoint::Type typeOf(const QString &word)
{
    return fromWord(word, typeWords, AccessPoint::Internet);
}

AccessPoint::Protocol protocolOf(const QString &word)
{
    const auto unknown = AccessPoint::Protocol(-1);
    const AccessPoint::Protocol protocol = fromWord(word, protocolWords, unknown);
    if (protocol != unknown)
        return protocol;
    qWarning() << "Unknown protocol:" << word << ", assuming IP";
    return AccessPoint::ProtocolIp;
}

QString wordFor(AccessPoint::Protocol protocol)
{
    if (const QLatin1String *word = toWord(protocol, protocolWords))
        return *word;
    qWarning() << "Unknown protocol:" << int(protocol) << ", assuming ip";
    return protocolWords[AccessPoint::ProtocolIp];
}

AccessPoint::AuthenticationMethod authenticationMethodOf(const QVariant &word)
{
    return word.isValid() ? fromWord(word.toString(), authenticationWords, AccessPoint::AuthenticationAny)
                          : AccessPoint::AuthenticationNone;
}

QString wordFor(AccessPoint::AuthenticationMethod method)
{
    const QLatin1String *word = toWord(method, authenticationWords);
    return word ? *word : authenticationWords[AccessPoint::AuthenticationNone];
}

AccessPoint accessPointFrom(const QVariantMap &properties)
{
    const auto text = [&properties](QLatin1String name) {
        return properties.value(name).toString();
    };
    AccessPoint accessPoint;
    accessPoint.type = typeOf(text(TypeProperty));
    accessPoint.name = text(NameProperty);
    accessPoint.accessPointName = text(AccessPointNameProperty);
    accessPoint.username = text(UsernameProperty);
    accessPoint.password = text(PasswordProperty);
    accessPoint.protocol = protocolOf(text(ProtocolProperty));
    accessPoint.authenticationMethod = authenticationMethodOf(properties.value(AuthenticationMethodProperty));
    accessPoint.messageCenter = text(MessageCenterProperty);
    accessPoint.messageProxy = text(MessageProxyProperty);
    return accessPoint;
}

/** The properties of an object that tells them in the way of both services; empty, with an error, or not. */
QVariantMap readProperties(QDBusInterface *object, QDBusError *error = nullptr)
{
    const QDBusReply<QVariantMap> reply = object->call(GetProperties);
    if (error)
        *error = reply.error();
    return reply.value();
}

/** Both services want the value wrapped as a variant; the error is invalid when they took it. */
QDBusError writeProperty(QDBusInterface *object, QLatin1String name, const QVariant &value)
{
    const QDBusReply<void> reply
        = object->call(SetProperty, QString(name), QVariant::fromValue(QDBusVariant(value)));
    return reply.error();
}

/** Whether @p property is true; without it, @p failure is logged. */
bool readFlag(QDBusInterface *object, QLatin1String property, const char *failure)
{
    const QVariantMap properties = readProperties(object);
    if (!properties.contains(property))
        qWarning() << failure;
    return properties.value(property).toBool();
}

/** Asks for the one value of an answer; @p failure and the error's message are logged without one. */
template <typename T> bool ask(const QDBusMessage &answer, const char *failure, T *value)
{
    const QDBusReply<T> reply = answer;
    if (!reply.isValid()) {
        qWarning() << failure << reply.error().message();
        return false;
    }
    *value = reply.value();
    return true;
}

bool meansMissing(const QDBusError &error)
{
    return error.type() == QDBusError::UnknownMethod || error.type() == QDBusError::UnknownInterface
        || error.type() == QDBusError::UnknownObject;
}

QStringList modemsWithoutExtension()
{
    QDBusInterface manager(OfonoService, RootPath, OfonoManagerInterface, QDBusConnection::systemBus());
    ObjectPathPropertiesList modems;
    ask(manager.call(QStringLiteral("GetModems")), "Unable to get modems:", &modems);
    QStringList paths;
    for (const ObjectPathProperties &modem : qAsConst(modems))
        paths << modem.path.path();
    return paths;
}

/** Whether the telephony service has @p modemPath; logged if not. */
bool hasModem(const ConnectivitySettings *settings, const QString &modemPath)
{
    const QStringList known = settings->modemPaths();
    if (known.contains(modemPath))
        return true;
    qWarning() << "No such modem path:" << modemPath << "in:" << known;
    return false;
}

QVariantMap radioSettings(const QString &modemPath)
{
    QDBusInterface radio(OfonoService, modemPath, RadioSettingsInterface, QDBusConnection::systemBus());
    QDBusError error;
    const QVariantMap properties = readProperties(&radio, &error);
    if (error.isValid())
        qWarning() << "Unable to get radio settings properties:" << error.message();
    return properties;
}

QVector<CellularTechnologies> supportedTechnologies(const QString &modemPath)
{
    const QStringList available
        = radioSettings(modemPath).value(AvailableTechnologiesProperty).toStringList();
    QVector<CellularTechnologies> supported;
    for (const TechnologySet &set : technologySets) {
        if (available.contains(set.word))
            supported << set.technologies;
    }
    if (supported.isEmpty())
        supported << ConnectivitySettings::TechnologyNone;
    return supported;
}

QLatin1String technologyPreference(CellularTechnologies technologies)
{
    const auto newest
        = std::find_if(std::rbegin(technologySets), std::rend(technologySets),
                       [technologies](const TechnologySet &set) { return technologies & set.newest; });
    return newest == std::rend(technologySets) ? AnyTechnology : newest->word;
}

/** The connection contexts of a modem, in the telephony service's order. */
ObjectPathPropertiesList contextsOfModem(const QString &modemPath)
{
    QDBusInterface connections(OfonoService, modemPath, ConnectionManagerInterface,
                               QDBusConnection::systemBus());
    ObjectPathPropertiesList contexts;
    ask(connections.call(QStringLiteral("GetContexts")), "Unable to get contexts:", &contexts);
    return contexts;
}

ObjectPathPropertiesList contextsOfSim(const ConnectivitySettings *settings, const QString &imsi)
{
    const QStringList modems = settings->modemPaths();
    for (const QString &modem : modems) {
        if (settings->modemSimImsi(modem) == imsi)
            return contextsOfModem(modem);
    }
    return {};
}

QString typeWord(const ObjectPathProperties &object)
{
    return object.properties.value(TypeProperty).toString();
}

/** Writes all of @p settings, one after the other; what is refused is logged. */
bool writeAccessPoint(QDBusInterface *context, const AccessPoint &settings, const QString &imsi)
{
    bool areTaken = true;
    const auto write = [&](QLatin1String property, const QString &value, const char *failure) {
        if (!writeProperty(context, property, value).isValid())
            return;
        qWarning() << failure << imsi;
        areTaken = false;
    };
    write(NameProperty, settings.name, "Unable to set connection name for the given IMSI:");
    write(AccessPointNameProperty, settings.accessPointName,
          "Unable to set access point name for the given IMSI:");
    write(UsernameProperty, settings.username, "Unable to set username for the given IMSI:");
    write(PasswordProperty, settings.password, "Unable to set password for the given IMSI:");
    // Agents look for this text, which is not that of the property.
    write(AuthenticationMethodProperty, wordFor(settings.authenticationMethod),
          "Unable to set protocol for the given IMSI:");
    write(ProtocolProperty, wordFor(settings.protocol), "Unable to set protocol for the given IMSI:");
    write(MessageCenterProperty, settings.messageCenter, "Unable to set message center for the given IMSI:");
    write(MessageProxyProperty, settings.messageProxy, "Unable to set message proxy for the given IMSI:");
    return areTaken;
}

} // namespace

ConnectivitySettingsPrivate::ConnectivitySettingsPrivate(ConnectivitySettings *settings,
                                                         ConnectivitySettings::Mode mode)
    : QObject(settings)
    , q(settings)
{
    registerObjectPathProperties();
    qRegisterMetaType<CellularTechnologies>();
    if (mode == ConnectivitySettings::NetworkManagerMode)
        createNetworkManager();
    else if (mode == ConnectivitySettings::DBusMode)
        createInterfaces();
}

void ConnectivitySettingsPrivate::createNetworkManager()
{
    networkManager = NetworkManagerFactory::createInstance();
    if (!networkManager) {
        qWarning() << "Unable to initialise ConnMan NetworkManager, functionality will be disabled!";
        return;
    }
    connect(networkManager, &NetworkManager::offlineModeChanged, q,
            &ConnectivitySettings::flightModeEnabledChanged);
    connect(networkManager, &NetworkManager::technologiesChanged, this,
            &ConnectivitySettingsPrivate::initialiseWlanTechnology);
    connect(networkManager, &NetworkManager::technologiesEnabledChanged, this,
            &ConnectivitySettingsPrivate::initialiseWlanTechnology);
    initialiseWlanTechnology();
}

void ConnectivitySettingsPrivate::createInterfaces()
{
    const QDBusConnection bus = QDBusConnection::systemBus();
    wlanTechInterface
        = new QDBusInterface(ConnmanService, WlanTechnologyPath, ConnmanTechnologyInterface, bus, this);
    connmanManagerInterface
        = new QDBusInterface(ConnmanService, RootPath, ConnmanManagerInterface, bus, this);
    connectDBusSignal(bus, {ConnmanService, WlanTechnologyPath, ConnmanTechnologyInterface, PropertyChanged},
                      this, SLOT(wlanTechPropertyChanged(QString, QDBusVariant)));
    connectDBusSignal(bus, {ConnmanService, RootPath, ConnmanManagerInterface, PropertyChanged}, this,
                      SLOT(connmanManagerPropertyChanged(QString, QDBusVariant)));
}

bool ConnectivitySettingsPrivate::isReady() const
{
    return connmanManagerInterface || wlanTechnology;
}

void ConnectivitySettingsPrivate::initialiseWlanTechnology()
{
    NetworkTechnology *technology = networkManager->getTechnology(WlanType);
    // One that was deleted is not held any more, but has not been announced as gone.
    if (technology == wlanTechnology && m_hasWlanTechnology == (technology != nullptr))
        return;
    if (wlanTechnology)
        wlanTechnology->disconnect(q);
    wlanTechnology = technology;
    if (technology)
        connect(technology, &NetworkTechnology::poweredChanged, q, &ConnectivitySettings::wlanEnabledChanged);

    const bool hadWlanTechnology = std::exchange(m_hasWlanTechnology, technology != nullptr);
    // A receiver of the first signal may delete the object.
    const QPointer<ConnectivitySettings> settings(q);
    if (m_hasWlanTechnology != hadWlanTechnology)
        Q_EMIT q->readyChanged();
    if (settings)
        Q_EMIT settings->wlanEnabledChanged();
}

void ConnectivitySettingsPrivate::wlanTechPropertyChanged(const QString &name, const QDBusVariant &)
{
    if (name == PoweredProperty)
        Q_EMIT q->wlanEnabledChanged();
}

void ConnectivitySettingsPrivate::connmanManagerPropertyChanged(const QString &name, const QDBusVariant &)
{
    if (name == OfflineModeProperty)
        Q_EMIT q->flightModeEnabledChanged();
}

InterfacePointer ConnectivitySettingsPrivate::openContext(const QString &contextPath, const QString &imsi)
{
    QDBusInterface modemManager(OfonoService, RootPath, ModemManagerInterface, QDBusConnection::systemBus());
    const QDBusReply<void> reply = modemManager.call(QStringLiteral("SetDefaultDataSim"), imsi);
    if (!reply.isValid()) {
        qWarning() << "Unable to set the default data SIM:" << reply.error().message();
        return nullptr;
    }
    return InterfacePointer(new QDBusInterface(OfonoService, contextPath, ConnectionContextInterface,
                                               QDBusConnection::systemBus(), this));
}

InterfacePointer ConnectivitySettingsPrivate::mobileDataService(const QString &imsi, QString *contextPath)
{
    const ObjectPathPropertiesList contexts = contextsOfSim(q, imsi);
    const auto context = std::find_if(contexts.begin(), contexts.end(), [](const ObjectPathProperties &each) {
        return typeWord(each) != typeWords[AccessPoint::Mms] && typeWord(each) != typeWords[AccessPoint::Ims];
    });
    if (context == contexts.end()) {
        qWarning() << "Unable to find \"internet\" connection context for IMSI:" << imsi;
        return nullptr;
    }
    const QString path = context->path.path();
    if (contextPath)
        *contextPath = path;

    const QString expected
        = CellularServicePrefix + imsi + QLatin1Char('_') + path.mid(path.lastIndexOf(QLatin1Char('/')) + 1);
    QDBusInterface manager(ConnmanService, RootPath, ConnmanManagerInterface, QDBusConnection::systemBus());
    const QDBusReply<ObjectPathPropertiesList> reply = manager.call(QStringLiteral("GetServices"));
    if (!reply.isValid()) {
        qWarning() << "Unable to read network services";
        return nullptr;
    }
    const ObjectPathPropertiesList services = reply.value();
    const bool isThere
        = std::any_of(services.begin(), services.end(), [&expected](const ObjectPathProperties &each) {
              return each.path.path() == expected && typeWord(each) == CellularType;
          });
    if (!isThere) {
        qWarning() << "Unable to find network service:" << expected << "of type:" << CellularType
                   << "from IMSI:" << imsi;
        return nullptr;
    }
    return InterfacePointer(new QDBusInterface(ConnmanService, expected, ConnmanServiceInterface,
                                               QDBusConnection::systemBus(), this));
}

bool ConnectivitySettingsPrivate::switchMobileData(const QString &imsi, const MobileDataSwitch &wanted)
{
    InterfacePointer service = mobileDataService(imsi);
    if (!service)
        return false;

    const QDBusError autoConnectError = writeProperty(service.get(), AutoConnectProperty, wanted.on);
    if (autoConnectError.isValid())
        qWarning() << "Unable to set auto connect:" << autoConnectError.message();

    const QDBusReply<void> reply = service->call(wanted.method);
    const QString message = reply.error().message();
    service.reset();
    if (!reply.isValid() && !wanted.harmlessErrors.contains(message)) {
        qWarning() << wanted.failure << message;
        return false;
    }

    if (q->isConnectedToMobileNetwork(imsi) == wanted.on) {
        qInfo() << wanted.alreadyDone << imsi;
        return true;
    }
    return !autoConnectError.isValid();
}

ConnectivitySettings::ConnectivitySettings(QObject *parent)
    : ConnectivitySettings(DBusMode, parent)
{
}

ConnectivitySettings::ConnectivitySettings(Mode mode, QObject *parent)
    : QObject(parent)
    , d(new ConnectivitySettingsPrivate(this, mode))
{
}

ConnectivitySettings::~ConnectivitySettings()
{
    delete d;
}

bool ConnectivitySettings::ready() const
{
    return d->isReady();
}

bool ConnectivitySettings::flightModeEnabled() const
{
    if (d->networkManager)
        return d->networkManager->offlineMode();
    return d->connmanManagerInterface
        && readFlag(d->connmanManagerInterface, OfflineModeProperty,
                    "OfflineMode property not returned for ConnMan!");
}

bool ConnectivitySettings::wlanEnabled() const
{
    if (d->wlanTechnology)
        return d->wlanTechnology->powered();
    return d->wlanTechInterface
        && readFlag(d->wlanTechInterface, PoweredProperty,
                    "Powered property not returned for WLAN technology!");
}

void ConnectivitySettings::setWlanEnabled(bool enabled)
{
    if (d->wlanTechnology && d->wlanTechnology->powered() != enabled)
        d->wlanTechnology->setPowered(enabled);
    if (d->wlanTechInterface) {
        const QDBusError error = writeProperty(d->wlanTechInterface, PoweredProperty, enabled);
        if (error.isValid())
            qWarning() << "Unable to set the power of the WLAN technology:" << error.message();
        Q_EMIT wlanEnabledChanged();
    }
}

void ConnectivitySettings::setFlightModeEnabled(bool enabled)
{
    if (d->networkManager && d->networkManager->offlineMode() != enabled)
        d->networkManager->setOfflineMode(enabled);
    if (d->connmanManagerInterface) {
        const QDBusError error = writeProperty(d->connmanManagerInterface, OfflineModeProperty, enabled);
        if (error.isValid())
            qWarning() << "Unable to set the offline mode:" << error.message();
        Q_EMIT flightModeEnabledChanged();
    }
}

QStringList ConnectivitySettings::modemPaths() const
{
    QDBusInterface modemManager(OfonoService, RootPath, ModemManagerInterface, QDBusConnection::systemBus());
    const QDBusReply<int> version = modemManager.call(QStringLiteral("GetInterfaceVersion"));
    if (!version.isValid() && !meansMissing(version.error())) {
        qWarning() << "Unable to determine modem manager interface version:" << version.error().message();
        return {};
    }
    if (!version.isValid() || version.value() < OldestModemManagerVersion)
        return modemsWithoutExtension();

    QList<QDBusObjectPath> modems;
    ask(modemManager.call(QStringLiteral("GetAvailableModems")),
        "Unable to get modem manager interface properties:", &modems);
    QStringList paths;
    for (const QDBusObjectPath &modem : qAsConst(modems))
        paths << modem.path();
    return paths;
}

QString ConnectivitySettings::modemSimImsi(const QString &modemPath) const
{
    QVariantMap properties;
    // A text that is no path ends the program in the D-Bus library.
    if (g_variant_is_object_path(modemPath.toUtf8().constData())) {
        QDBusInterface sim(OfonoService, modemPath, SimManagerInterface, QDBusConnection::systemBus());
        properties = readProperties(&sim);
    }
    if (!properties.contains(SubscriberIdentityProperty))
        qWarning() << "Subscriber Identity property not returned for SIM:" << modemPath;
    return properties.value(SubscriberIdentityProperty).toString();
}

QStringList ConnectivitySettings::mobileNetworkImsis() const
{
    QStringList imsis;
    const QStringList modems = modemPaths();
    for (const QString &modem : modems) {
        const QString imsi = modemSimImsi(modem);
        if (!imsi.isEmpty() && !contextsOfModem(modem).isEmpty())
            imsis << imsi;
    }
    return imsis;
}

QVector<CellularTechnologies> ConnectivitySettings::supportedCellularTechnologies(
    const QString &modemPath) const
{
    return hasModem(this, modemPath) ? supportedTechnologies(modemPath) : QVector<CellularTechnologies>();
}

CellularTechnologies ConnectivitySettings::selectedCellularTechnologies(const QString &modemPath) const
{
    if (!hasModem(this, modemPath))
        return TechnologyNone;
    const QString preference = radioSettings(modemPath).value(TechnologyPreferenceProperty).toString();
    if (preference.isEmpty() || preference == AnyTechnology)
        return TechnologyNone;
    // What is newer than the known ones counts as the newest of them.
    const auto *newest
        = std::find_if(std::begin(technologySets), std::prev(std::end(technologySets)),
                       [&preference](const TechnologySet &set) { return set.word == preference; });
    return newest->technologies;
}

bool ConnectivitySettings::selectCellularTechnologies(const QString &modemPath, CellularTechnologies techs)
{
    if (!hasModem(this, modemPath))
        return false;
    const QVector<CellularTechnologies> supported = supportedTechnologies(modemPath);
    if (techs != TechnologyNone && !supported.contains(techs)) {
        qWarning() << "Unsupported cellular technologies selection specified for modem:" << modemPath;
        return false;
    }

    QDBusInterface radio(OfonoService, modemPath, RadioSettingsInterface, QDBusConnection::systemBus());
    const QDBusError error
        = writeProperty(&radio, TechnologyPreferenceProperty, QString(technologyPreference(techs)));
    if (error.isValid())
        qWarning() << "Unable to set the preferred radio technology:" << error.message();
    return !error.isValid();
}

bool ConnectivitySettings::isConnectedToMobileNetwork(const QString &imsi) const
{
    QString contextPath;
    const InterfacePointer service = d->mobileDataService(imsi, &contextPath);
    if (!service)
        return false;
    QDBusError error;
    const QVariantMap properties = readProperties(service.get(), &error);
    if (error.isValid()) {
        qWarning() << error.message();
        return false;
    }
    if (!properties.contains(StateProperty)) {
        qWarning() << "Connection State property not returned for connection:" << contextPath
                   << "from IMSI:" << imsi;
        return false;
    }
    const QString state = properties.value(StateProperty).toString();
    return state == OnlineState || state == ReadyState;
}

bool ConnectivitySettings::connectToMobileNetwork(const QString &imsi)
{
    return d->switchMobileData(imsi,
                               {true,
                                QLatin1String("Connect"),
                                {QStringLiteral("Already connected"), QStringLiteral("In progress")},
                                "Unable to connect:",
                                "Already connected to network via IMSI:"});
}

bool ConnectivitySettings::disconnectFromMobileNetwork(const QString &imsi)
{
    return d->switchMobileData(imsi,
                               {false,
                                QLatin1String("Disconnect"),
                                {QStringLiteral("Not connected")},
                                "Unable to disconnect:",
                                "Already disconnected from network via IMSI:"});
}

QMap<AccessPoint::Type, AccessPoint> ConnectivitySettings::accessPointSettings(const QString &imsi) const
{
    QMap<AccessPoint::Type, AccessPoint> accessPoints;
    const ObjectPathPropertiesList contexts = contextsOfSim(this, imsi);
    for (const ObjectPathProperties &context : contexts) {
        const InterfacePointer object = d->openContext(context.path.path(), imsi);
        if (!object)
            break;
        QDBusError error;
        const QVariantMap properties = readProperties(object.get(), &error);
        if (error.isValid()) {
            qWarning() << "Unable to get access point settings:" << error.message();
            continue;
        }
        const AccessPoint accessPoint = accessPointFrom(properties);
        accessPoints.insert(accessPoint.type, accessPoint);
    }
    return accessPoints;
}

bool ConnectivitySettings::setAccessPointSettings(const QString &imsi, const AccessPoint &settings)
{
    const ObjectPathPropertiesList contexts = contextsOfSim(this, imsi);
    if (contexts.isEmpty())
        return false;
    const auto context
        = std::find_if(contexts.begin(), contexts.end(), [&settings](const ObjectPathProperties &each) {
              return typeOf(typeWord(each)) == settings.type;
          });
    if (context == contexts.end()) {
        qWarning() << "Unable to find" << int(settings.type) << "connection context for IMSI:" << imsi;
        return false;
    }
    const InterfacePointer object = d->openContext(context->path.path(), imsi);
    if (!object)
        return false;

    const bool reconnect = settings.type == AccessPoint::Internet && isConnectedToMobileNetwork(imsi);
    if (reconnect)
        disconnectFromMobileNetwork(imsi);
    const bool areTaken = writeAccessPoint(object.get(), settings, imsi);
    if (reconnect)
        connectToMobileNetwork(imsi);
    return areTaken;
}

} // namespace Mdm
} // namespace Corvane
