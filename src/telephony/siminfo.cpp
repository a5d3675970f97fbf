// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/siminfo.h>

#include "frame/asynccommand_p.h"
#include "platform/frame/signalconnection_p.h"
#include "siminfo_p.h"

#include <mlite/mgconfitem.h>

#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusPendingReply>

#include <algorithm>
#include <optional>
#include <utility>

namespace Corvane
{
namespace Mdm
{

namespace
{

const QLatin1String OfonoService("org.ofono");
const QLatin1String RootPath("/");
const QLatin1String ModemInterface("org.ofono.Modem");
const QLatin1String SimManagerInterface("org.ofono.SimManager");
const QLatin1String NetworkRegistrationInterface("org.ofono.NetworkRegistration");
const QLatin1String ModemManagerInterface("org.veldmobile.ofono.ModemManager");
const QLatin1String SimInfoInterface("org.veldmobile.ofono.SimInfo");

const QLatin1String PropertyChanged("PropertyChanged");
const QLatin1String GetProperties("GetProperties");
const QLatin1String InterfacesProperty("Interfaces");
const QLatin1String StatusProperty("Status");
const QLatin1String SubscriberIdentityProperty("SubscriberIdentity");
const QLatin1String SubscriberNumbersProperty("SubscriberNumbers");
constexpr char StatusKept[] = "Status"; // the same as a property of the interface object

const QLatin1String RebootWarningKey("/desktop/dapple-tevrik-home/reboot_warning_on_sim_remove");

const char *const modemPropertySlot = SLOT(modemPropertyChanged(QString, QDBusVariant, QDBusMessage));
const char *const registrationPropertySlot
    = SLOT(networkRegistrationPropertyChanged(QString, QDBusVariant, QDBusMessage));

SimInfo::NetworkRegistrationStatus registrationStatus(const QString &status)
{
    static const std::pair<QLatin1String, SimInfo::NetworkRegistrationStatus> known[] = {
        {QLatin1String("unregistered"), SimInfo::NotRegistered},
        {QLatin1String("registered"), SimInfo::Registered},
        {QLatin1String("searching"), SimInfo::SearchingForRegistration},
        {QLatin1String("denied"), SimInfo::RegistrationDenied},
        {QLatin1String("roaming"), SimInfo::Roaming},
    };
    const auto *found = std::find_if(std::begin(known), std::end(known),
                                     [&status](const auto &each) { return each.first == status; });
    return found == std::end(known) ? SimInfo::UnknownRegistrationStatus : found->second;
}

/** The first value of the answer to @p method; empty when there was no such answer. */
template <typename T>
std::optional<T> waitForAnswer(const QString &path, QLatin1String interface, QLatin1String method)
{
    QDBusInterface object(OfonoService, path, interface, QDBusConnection::systemBus());
    auto *watcher = new QDBusPendingCallWatcher(object.asyncCall(method));
    watcher->waitForFinished();
    watcher->deleteLater();
    const QDBusPendingReply<T> reply = *watcher;
    return reply.isError() ? std::nullopt : std::optional<T>(reply.value());
}

/** Asks each modem in turn; @p ask returns the value for its path, or an empty one to leave the slot out. */
template <typename Ask> QList<SimInfo::SlotInfo> askEachModem(Ask ask)
{
    QList<SimInfo::SlotInfo> infos;
    const auto modems = waitForAnswer<QList<QDBusObjectPath>>(RootPath, ModemManagerInterface,
                                                              QLatin1String("GetAvailableModems"));
    for (int slot = 0; modems && slot < modems->size(); ++slot) {
        const QString value = ask(modems->at(slot).path());
        if (!value.isEmpty())
            infos.append(SimInfo::SlotInfo(slot, value));
    }
    return infos;
}

QVariant simProperty(const QString &path, QLatin1String name)
{
    const auto properties = waitForAnswer<QVariantMap>(path, SimManagerInterface, GetProperties);
    return properties ? properties->value(name) : QVariant();
}

QString trueOrFalse(bool value)
{
    return value ? QStringLiteral("true") : QStringLiteral("false");
}

} // namespace

SimInfo::SimState::SimState()
    : present(false)
    , voiceSim(false)
    , dataSim(false)
    , enabled(false)
    , pinRequired(UnknownPinState)
    , networkRegistration(UnknownRegistrationStatus)
{
}

bool SimInfo::SimState::operator==(const SimState &other) const
{
    return modemPath == other.modemPath && present == other.present && voiceSim == other.voiceSim
        && dataSim == other.dataSim && enabled == other.enabled && pinRequired == other.pinRequired
        && networkRegistration == other.networkRegistration && imsi == other.imsi;
}

bool SimInfo::SimState::operator!=(const SimState &other) const
{
    return !(*this == other);
}

bool SimInfo::SimState::operator<(const SimState &other) const
{
    return modemPath < other.modemPath;
}

bool SimInfo::SimState::operator>(const SimState &other) const
{
    return other < *this;
}

bool SimInfo::SimState::operator<=(const SimState &other) const
{
    return !(other < *this);
}

bool SimInfo::SimState::operator>=(const SimState &other) const
{
    return !(*this < other);
}

SimInfo::SimState::operator QString() const
{
    const QString pinText = pinRequired == UnknownPinState
        ? QStringLiteral("unknown")
        : trueOrFalse(pinRequired == SimPinRequired || pinRequired == SimPukRequired);
    // In two steps, as so many values are taken at most; in each step all at once, so that a "%1" in a value
    // stays what it is.
    return QStringLiteral("SimState(%1), imsi: %2, present: %3, voice SIM: %4, data SIM: %5, enabled: %6, "
                          "PIN required: %7, Network reg: %8, ")
               .arg(modemPath, imsi, trueOrFalse(present), trueOrFalse(voiceSim), trueOrFalse(dataSim),
                    trueOrFalse(enabled), pinText, QString::number(networkRegistration))
        + QStringLiteral("ICCID: %1, Service provider: %2, Subscriber numbers: %3")
              .arg(cardIdentifier, serviceProviderName, subscriberNumbers.join(QLatin1String(", ")));
}

SimInfo::SlotInfo::SlotInfo()
    : slot(0)
{
}

SimInfo::SlotInfo::SlotInfo(int slotIndex, const QString &slotValue)
    : slot(slotIndex)
    , value(slotValue)
{
}

SimInfo::SlotInfo::operator QString() const
{
    return QStringLiteral("Slot(%1) = (%2)").arg(QString::number(slot), value);
}

QDebug operator<<(QDebug debug, const SimInfo::PinRequired &pinRequired)
{
    const char *words = "";
    switch (pinRequired) {
    case SimInfo::UnknownPinState:
        words = "unknown";
        break;
    case SimInfo::PinNotRequired:
        words = "not required";
        break;
    case SimInfo::SimPinRequired:
        words = "PIN required";
        break;
    case SimInfo::SimPukRequired:
        words = "PUK required";
        break;
    }
    return debug << words;
}

QDebug operator<<(QDebug debug, const SimInfo::NetworkRegistrationStatus &status)
{
    const char *word = "";
    switch (status) {
    case SimInfo::UnknownRegistrationStatus:
        word = "unknown";
        break;
    case SimInfo::NotRegistered:
        word = "unregistered";
        break;
    case SimInfo::Registered:
        word = "registered";
        break;
    case SimInfo::SearchingForRegistration:
        word = "searching";
        break;
    case SimInfo::RegistrationDenied:
        word = "denied";
        break;
    case SimInfo::Roaming:
        word = "roaming";
        break;
    }
    return debug << word;
}

QDebug operator<<(QDebug debug, const SimInfo::SlotInfo *info)
{
    const QDebugStateSaver saver(debug);
    debug.nospace();
    if (info)
        debug << "SlotInfo(" << info->slot << ") = " << info->value;
    else
        debug << "SlotInfo (this = 0x0)";
    return debug;
}

SimInfoPrivate::SimInfoPrivate(SimInfo *simInfo)
    : QObject(simInfo)
    , q(simInfo)
    , ofonoManager(QOfonoManager::instance())
    , modemManager(QOfonoExtModemManager::instance())
{
    registerTypes();

    connect(ofonoManager.data(), &QOfonoManager::availableChanged, q, &SimInfo::availableChanged);
    connect(ofonoManager.data(), &QOfonoManager::modemAdded, this, &SimInfoPrivate::modemAdded);
    connect(ofonoManager.data(), &QOfonoManager::modemRemoved, this, &SimInfoPrivate::modemRemoved);

    connect(modemManager.data(), &QOfonoExtModemManager::readyChanged, this,
            &SimInfoPrivate::modemReadyChanged);
    connect(modemManager.data(), &QOfonoExtModemManager::enabledModemsChanged, this,
            &SimInfoPrivate::updateAllSims);
    connect(modemManager.data(), &QOfonoExtModemManager::defaultVoiceSimChanged, this,
            &SimInfoPrivate::updateAllSims);
    connect(modemManager.data(), &QOfonoExtModemManager::defaultDataSimChanged, this,
            &SimInfoPrivate::updateAllSims);

    if (modemManager->ready())
        modemReadyChanged(true);
}

SimInfoPrivate::~SimInfoPrivate() = default;

void SimInfoPrivate::registerTypes()
{
    // Other threads wait until all of it is done.
    static const bool registered = [] {
        qRegisterMetaType<SimInfo::SimState>("Corvane::Mdm::SimInfo::SimState");
        // The signal is declared with the short spelling; connections by name and queued ones look it up.
        qRegisterMetaType<SimInfo::SimState>("SimInfo::SimState");
        return true;
    }();
    Q_UNUSED(registered)
}

void SimInfoPrivate::modemReadyChanged(bool ready)
{
    if (ready) {
        const QStringList modems = modemManager->availableModems();
        for (const QString &path : modems) {
            initModemInterface(path);
            simManagerInstance(path);
        }
        updateSimStates(modems);
        return;
    }

    const QStringList simManagers = m_simManagers.keys();
    for (const QString &path : simManagers)
        removeSimManager(path);
    const QStringList registrations = m_registrationInterfaces.keys();
    for (const QString &path : registrations)
        removeNetworkRegistration(path);
    const QStringList modems = m_modemInterfaces.keys();
    for (const QString &path : modems)
        removeModemInterface(path);
}

void SimInfoPrivate::modemAdded(const QString &path)
{
    if (!modemManager->ready())
        return;
    simManagerInstance(path);
    initModemInterface(path);
    updateSimState(path);
}

void SimInfoPrivate::modemRemoved(const QString &path)
{
    removeSimManager(path);
    removeModemInterface(path);
    removeNetworkRegistration(path);
    updateSimState(path);
}

void SimInfoPrivate::simManagerInstance(const QString &path)
{
    if (m_simManagers.contains(path))
        return;

    constexpr auto update = qOverload<>(&SimInfoPrivate::updateSimState);
    auto *simManager = new QOfonoSimManager(this);
    connect(simManager, &QOfonoSimManager::validChanged, this, update);
    connect(simManager, &QOfonoSimManager::pinRequiredChanged, this, update);
    connect(simManager, &QOfonoSimManager::presenceChanged, this, update);
    connect(simManager, &QOfonoSimManager::subscriberNumbersChanged, this, update);
    connect(simManager, &QOfonoSimManager::subscriberIdentityChanged, this, update);
    m_simManagers.insert(path, simManager);

    auto *simInfo = new QOfonoExtSimInfo(this);
    connect(simInfo, &QOfonoExtSimInfo::validChanged, this, update);
    connect(simInfo, &QOfonoExtSimInfo::subscriberIdentityChanged, this, update);
    connect(simInfo, &QOfonoExtSimInfo::serviceProviderNameChanged, this, update);
    connect(simInfo, &QOfonoExtSimInfo::cardIdentifierChanged, this, update);
    m_simInfos.insert(path, simInfo);

    simManager->setModemPath(path);
    simInfo->setModemPath(path);
}

void SimInfoPrivate::removeSimManager(const QString &path)
{
    delete m_simManagers.take(path);
    delete m_simInfos.take(path);
}

QDBusInterface *SimInfoPrivate::createInterface(
    const QString &path, QLatin1String interface, const char *changedSlot,
    void (SimInfoPrivate::*finishedSlot)(QDBusPendingCallWatcher *))
{
    const QDBusConnection bus = QDBusConnection::systemBus();
    auto *object = new QDBusInterface(OfonoService, path, interface, bus, this);
    connectDBusSignal(bus, {OfonoService, path, interface, PropertyChanged}, this, changedSlot);
    // The answer goes with the interface that asked.
    askForState(object, GetProperties, this, finishedSlot, object);
    return object;
}

void SimInfoPrivate::deleteInterface(QDBusInterface *interface, const char *changedSlot)
{
    if (!interface)
        return;
    disconnectDBusSignal(QDBusConnection::systemBus(),
                         {OfonoService, interface->path(), interface->interface(), PropertyChanged}, this,
                         changedSlot);
    delete interface;
}

void SimInfoPrivate::initModemInterface(const QString &path)
{
    // One that is there already asked a modem that has just been announced anew.
    removeModemInterface(path);
    m_modemInterfaces.insert(path,
                             createInterface(path, ModemInterface, modemPropertySlot,
                                             &SimInfoPrivate::modemGetPropertiesFinished));
}

void SimInfoPrivate::removeModemInterface(const QString &path)
{
    deleteInterface(m_modemInterfaces.take(path), modemPropertySlot);
}

void SimInfoPrivate::initNetworkRegistration(const QString &path)
{
    m_registrationInterfaces.insert(
        path,
        createInterface(path, NetworkRegistrationInterface, registrationPropertySlot,
                        &SimInfoPrivate::networkRegistrationGetPropertiesFinished));
}

void SimInfoPrivate::removeNetworkRegistration(const QString &path)
{
    deleteInterface(m_registrationInterfaces.take(path), registrationPropertySlot);
}

void SimInfoPrivate::modemGetPropertiesFinished(QDBusPendingCallWatcher *watcher)
{
    const QString path = static_cast<QDBusInterface *>(watcher->parent())->path();
    const QDBusPendingReply<QVariantMap> reply = *watcher;
    watcher->deleteLater();
    if (!reply.isError())
        modemInterfacesChanged(path, reply.value().value(InterfacesProperty).toStringList());
}

void SimInfoPrivate::modemPropertyChanged(const QString &name, const QDBusVariant &value,
                                          const QDBusMessage &message)
{
    const QString path = message.path();
    if (name == InterfacesProperty && m_modemInterfaces.contains(path))
        modemInterfacesChanged(path, value.variant().toStringList());
}

void SimInfoPrivate::modemInterfacesChanged(const QString &path, const QStringList &interfaces)
{
    if (!interfaces.contains(NetworkRegistrationInterface))
        removeNetworkRegistration(path); // the state follows with the next change of the modem's SIM
    else if (!m_registrationInterfaces.value(path))
        initNetworkRegistration(path);
}

void SimInfoPrivate::networkRegistrationGetPropertiesFinished(QDBusPendingCallWatcher *watcher)
{
    auto *registration = static_cast<QDBusInterface *>(watcher->parent());
    const QDBusPendingReply<QVariantMap> reply = *watcher;
    watcher->deleteLater();
    if (!reply.isError())
        registration->setProperty(StatusKept, reply.value().value(StatusProperty).toString());
    updateSimState(registration->path());
}

void SimInfoPrivate::networkRegistrationPropertyChanged(const QString &name, const QDBusVariant &value,
                                                        const QDBusMessage &message)
{
    QDBusInterface *registration = m_registrationInterfaces.value(message.path());
    if (name != StatusProperty || !registration)
        return;
    registration->setProperty(StatusKept, value.variant().toString());
    updateSimState(registration->path());
}

void SimInfoPrivate::updateAllSims()
{
    if (modemManager->ready())
        updateSimStates(modemManager->availableModems());
}

void SimInfoPrivate::updateSimStates(const QStringList &paths)
{
    const QPointer<SimInfoPrivate> alive(this);
    for (auto path = paths.begin(); alive && path != paths.end(); ++path)
        updateSimState(*path);
}

void SimInfoPrivate::updateSimState()
{
    if (const auto *simManager = qobject_cast<QOfonoSimManager *>(sender()))
        updateSimState(simManager->modemPath());
    else if (const auto *simInfo = qobject_cast<QOfonoExtSimInfo *>(sender()))
        updateSimState(simInfo->modemPath());
}

void SimInfoPrivate::updateSimState(const QString &path)
{
    SimInfo::SimState state;
    buildSimState(&state, path);
    if (state == simStates.value(path))
        return;
    simStates.insert(path, state);
    Q_EMIT q->simStateChanged(state);
}

void SimInfoPrivate::buildSimState(SimInfo::SimState *state, const QString &path) const
{
    state->modemPath = path;

    const QOfonoSimManager *simManager = m_simManagers.value(path);
    const QOfonoExtSimInfo *simInfo = m_simInfos.value(path);
    const QDBusInterface *registration = m_registrationInterfaces.value(path);
    if (!simManager || !simManager->isValid() || !simInfo || !simInfo->isValid() || !registration
        || !registration->isValid()) {
        return;
    }

    state->present = simManager->present();
    state->subscriberNumbers = simManager->subscriberNumbers();
    state->imsi = simInfo->subscriberIdentity();
    state->cardIdentifier = simInfo->cardIdentifier();
    state->serviceProviderName = simInfo->serviceProviderName();
    // A slot without a card, or the only one, has nobody to share calls and data with.
    const bool alone = !state->present || !hasMultiSimSupport();
    state->voiceSim = alone || modemManager->defaultVoiceSim() == state->imsi;
    state->dataSim = alone || modemManager->defaultDataSim() == state->imsi;
    state->pinRequired = pinRequired(path, simManager);
    state->networkRegistration = registrationStatus(registration->property(StatusKept).toString());
    state->enabled = modemManager->enabledModems().contains(path);
}

bool SimInfoPrivate::hasMultiSimSupport() const
{
    return modemManager->ready() && modemManager->availableModems().size() > 1;
}

SimInfo::PinRequired SimInfoPrivate::pinRequired(const QString &path,
                                                 const QOfonoSimManager *simManager) const
{
    const int index = modemManager->availableModems().indexOf(path);
    if (!modemManager->enabledModems().contains(path) || !modemManager->presentSims().value(index, false)
        || !simManager->present()) {
        return SimInfo::UnknownPinState;
    }
    switch (simManager->pinRequired()) {
    case QOfonoSimManager::SimPin:
        return SimInfo::SimPinRequired;
    case QOfonoSimManager::SimPuk:
        return SimInfo::SimPukRequired;
    default:
        return SimInfo::PinNotRequired;
    }
}

SimInfo::SimInfo(QObject *parent)
    : QObject(parent)
    , d(new SimInfoPrivate(this))
{
}

SimInfo::~SimInfo()
{
    delete d;
}

bool SimInfo::available() const
{
    return d->ofonoManager->available();
}

QList<SimInfo::SimState> SimInfo::simSlotStates() const
{
    return d->simStates.values();
}

QList<SimInfo::SlotInfo> SimInfo::imeiCodes() const
{
    QList<SlotInfo> infos;
    const auto imeis = waitForAnswer<QStringList>(RootPath, ModemManagerInterface, QLatin1String("GetIMEI"));
    if (!imeis) {
        qDebug() << "Failed to fetch IMEI codes. Wait SimInfo to change available before calling this.";
        return infos;
    }
    for (int slot = 0; slot < imeis->size(); ++slot)
        infos.append(SlotInfo(slot, imeis->at(slot)));
    return infos;
}

QList<SimInfo::SlotInfo> SimInfo::subscriberIdentities() const
{
    return askEachModem(
        [](const QString &path) { return simProperty(path, SubscriberIdentityProperty).toString(); });
}

QList<SimInfo::SlotInfo> SimInfo::cardIdentifier() const
{
    return askEachModem([](const QString &path) {
        return waitForAnswer<QString>(path, SimInfoInterface, QLatin1String("GetCardIdentifier"))
            .value_or(QString());
    });
}

QList<SimInfo::SlotInfo> SimInfo::subscriberNumbers() const
{
    return askEachModem([](const QString &path) {
        return simProperty(path, SubscriberNumbersProperty).toStringList().join(QLatin1Char(','));
    });
}

bool SimInfo::hotSwappingSupported() const
{
    return !MGConfItem(RebootWarningKey).value(false).toBool();
}

} // namespace Mdm
} // namespace Corvane
