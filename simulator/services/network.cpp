// SPDX-License-Identifier: LGPL-2.1-or-later
#include "network.h"

#include "connman.h"
#include "service.h"

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String serviceInterface("net.connman.Service");
const QLatin1String autoConnectProperty("AutoConnect");
const QLatin1String proxyProperty("Proxy.Configuration");
const QLatin1String errorProperty("Error");

const QLatin1String wifiType("wifi");
const QLatin1String cellularType("cellular");
const QLatin1String ethernetType("ethernet");

const QLatin1String idleState("idle");
const QLatin1String failureState("failure");
const QLatin1String associationState("association");
const QLatin1String configurationState("configuration");
const QLatin1String readyState("ready");
const QLatin1String onlineState("online");
const QLatin1String disconnectState("disconnect");

constexpr quint8 usualStrength = 60; // percent
constexpr guint64 bytesAPacket = 1400;

QString wirelessIdentifier(const QString &name, const QString &security)
{
    return QStringLiteral("wifi_02c0ffee0001_%1_managed_%2")
        .arg(QString::fromLatin1(name.toUtf8().toHex()), security);
}

Variant fromNumber(guint64 number)
{
    return Variant(g_variant_new_uint64(number));
}

} // namespace

Properties DataTotals::properties() const
{
    const auto packets = [](guint64 bytes) {
        return fromNumber((bytes + bytesAPacket - 1) / bytesAPacket);
    };
    return {
        {QStringLiteral("RX.Packets"), packets(receivedBytes)},
        {QStringLiteral("TX.Packets"), packets(sentBytes)},
        {QStringLiteral("RX.Bytes"), fromNumber(receivedBytes)},
        {QStringLiteral("TX.Bytes"), fromNumber(sentBytes)},
        {QStringLiteral("RX.Errors"), fromNumber(0)},
        {QStringLiteral("TX.Errors"), fromNumber(0)},
        {QStringLiteral("RX.Dropped"), fromNumber(0)},
        {QStringLiteral("TX.Dropped"), fromNumber(0)},
        {QStringLiteral("Time"), fromNumber(seconds)},
    };
}

Network::Network(const QJsonObject &profile, const Surroundings &surroundings)
    : m_surroundings(surroundings)
    , m_type(profile.value(QLatin1String("type")).toString())
    , m_name(profile.value(QLatin1String("name")).toString())
    , m_strength(quint8(profile.value(QLatin1String("strength")).toInt(usualStrength)))
    , m_isInReach(profile.value(QLatin1String("inReach")).toBool(true))
    , m_isSaved(profile.value(QLatin1String("saved")).toBool(false))
    , m_isAutomatic(profile.value(QLatin1String("autoConnect")).toBool(true))
    , m_proxy(profile.value(QLatin1String("proxy")).toObject())
    , m_nextError(profile.value(QLatin1String("fails")).toString())
{
    if (m_type == wifiType) {
        m_security = profile.value(QLatin1String("security")).toString(QStringLiteral("psk"));
        m_identifier = wirelessIdentifier(m_name, m_security);
    } else {
        // A plugged cable is kept at once.
        m_isSaved = true;
        m_identifier = QStringLiteral("ethernet_02c0ffee0002_cable");
    }
}

Network::Network(const CellularLink &link, const Surroundings &surroundings)
    : m_surroundings(surroundings)
    , m_type(cellularType)
    , m_name(link.provider)
    , m_contextPath(link.contextPath)
    , m_strength(usualStrength)
    , m_isSaved(true)
    , m_isAutomatic(false)
    , m_isRoaming(link.isRoaming)
{
    const QString context = m_contextPath.mid(m_contextPath.lastIndexOf(QLatin1Char('/')) + 1);
    m_identifier = QStringLiteral("cellular_%1_%2").arg(link.imsi, context);
}

QString Network::path() const
{
    return QStringLiteral("/net/connman/service/") + m_identifier;
}

bool Network::isConnected() const
{
    return m_state == readyState || m_state == onlineState;
}

bool Network::isOnline() const
{
    return m_state == onlineState;
}

bool Network::isBusy() const
{
    return m_state != idleState && m_state != failureState && m_state != disconnectState;
}

bool Network::wantsConnection() const
{
    return m_state == idleState && m_isSaved && m_isAutomatic && !m_isUnwanted && !m_isRoaming;
}

DataTotals Network::totals(bool roaming) const
{
    DataTotals totals = roaming ? m_roaming : m_home;
    if (isConnected() && roaming == m_isRoaming)
        totals.seconds += guint64((g_get_monotonic_time() - m_connectedSince) / G_USEC_PER_SEC);
    return totals;
}

Properties Network::properties() const
{
    Properties properties{{QStringLiteral("State"), fromText(m_state)}};
    if (m_state == failureState)
        properties.push_back({errorProperty, fromText(m_error)});
    properties.push_back({QStringLiteral("Name"), fromText(m_name)});
    properties.push_back({QStringLiteral("Type"), fromText(m_type)});
    if (m_type == wifiType)
        properties.push_back({QStringLiteral("Security"), fromList({m_security})});
    if (m_type != ethernetType)
        properties.push_back({QStringLiteral("Strength"), fromByte(m_strength)});
    properties.push_back({QStringLiteral("Favorite"), fromBool(m_isSaved)});
    properties.push_back({QStringLiteral("Immutable"), fromBool(false)});
    properties.push_back({autoConnectProperty, fromBool(m_isAutomatic)});
    if (m_type == cellularType)
        properties.push_back({QStringLiteral("Roaming"), fromBool(m_isRoaming)});
    Properties address;
    if (isConnected()) {
        address.push_back({QStringLiteral("Method"), fromText(QStringLiteral("dhcp"))});
        address.push_back({QStringLiteral("Address"), fromText(QStringLiteral("192.0.2.17"))});
        address.push_back({QStringLiteral("Netmask"), fromText(QStringLiteral("255.255.255.0"))});
    }
    properties.push_back({QStringLiteral("IPv4"), Variant(toVariant(address))});
    properties.push_back(
        {QStringLiteral("Proxy"),
         isConnected() ? m_surroundings.proxyInUse(m_proxy).toVariant() : Variant(toVariant({}))});
    properties.push_back({proxyProperty, m_proxy.toVariant()});
    return properties;
}

QJsonObject Network::describe() const
{
    QJsonObject state{
        {QStringLiteral("identifier"), m_identifier},
        {QStringLiteral("type"), m_type},
        {QStringLiteral("name"), m_name},
        {QStringLiteral("state"), m_state},
        {QStringLiteral("saved"), m_isSaved},
        {QStringLiteral("autoConnect"), m_isAutomatic},
        {QStringLiteral("inReach"), m_isInReach},
        {QStringLiteral("proxy"), m_proxy.toJson()},
    };
    if (m_type == cellularType)
        state.insert(QStringLiteral("roaming"), m_isRoaming);
    for (const bool roaming : {false, true}) {
        const DataTotals data = totals(roaming);
        const QJsonObject totalsState{{QStringLiteral("received"), double(data.receivedBytes)},
                                      {QStringLiteral("sent"), double(data.sentBytes)}};
        state.insert(roaming ? QStringLiteral("dataRoaming") : QStringLiteral("dataHome"), totalsState);
    }
    return state;
}

void Network::setInReach(bool isInReach)
{
    if (isInReach == m_isInReach)
        return;
    m_isInReach = isInReach;
    if (!isInReach)
        end(idleState);
    m_surroundings.changed();
}

void Network::setProxy(const ProxyConfiguration &proxy)
{
    m_proxy = proxy;
    announceProxy();
    m_surroundings.changed();
}

void Network::setOnline(bool isOnline)
{
    if (isConnected())
        m_state = isOnline ? onlineState : readyState;
}

void Network::follow(const CellularLink &link)
{
    m_name = link.provider;
    if (link.isRoaming != m_isRoaming) {
        const bool wasConnected = isConnected();
        const bool isRoaming = link.isRoaming;
        // The seconds so far are those of the network that was.
        (m_isRoaming ? m_roaming : m_home).seconds = totals(m_isRoaming).seconds;
        if (wasConnected)
            m_connectedSince = g_get_monotonic_time();
        m_isRoaming = isRoaming;
    }
    if (link.isActive && (m_state == idleState || m_state == failureState))
        beConnected();
    else if (!link.isActive && isConnected())
        end(idleState);
    m_surroundings.changed();
}

void Network::setState(const QString &state)
{
    const bool wasConnected = isConnected();
    DataTotals &totalsNow = m_isRoaming ? m_roaming : m_home;
    if (wasConnected)
        totalsNow.seconds = totals(m_isRoaming).seconds;
    m_state = state;
    if (isConnected())
        m_connectedSince = g_get_monotonic_time();
}

void Network::connect()
{
    m_isUnwanted = false;
    m_error.clear();
    step(associationState);
}

void Network::beConnected()
{
    m_isUnwanted = false;
    m_isSaved = true;
    setState(readyState);
}

/** Enters @p state on the way to a connection, and goes on from there. */
void Network::step(const QString &state)
{
    setState(state);
    if (state == readyState) {
        m_isSaved = true;
        finishAttempt(nullptr);
    } else {
        m_timer.start(m_surroundings.stepMilliseconds, [this, state] {
            const bool mustFail = state == associationState && m_nextError.isEmpty() && m_type == cellularType
                && !m_surroundings.links.activate(m_contextPath, true);
            const QString error
                = mustFail ? QStringLiteral("connect-failed") : std::exchange(m_nextError, QString());
            if (error.isEmpty()) {
                step(state == associationState ? configurationState : readyState);
                return;
            }
            m_error = error;
            setState(failureState);
            const MethodError failed = ConnMan::error("Failed", "Input/output error");
            finishAttempt(&failed);
        });
    }
    m_surroundings.changed();
}

/** Answers those who have asked for the connection. */
void Network::finishAttempt(const MethodError *error)
{
    for (MethodCall &call : std::exchange(m_waiting, {})) {
        if (error)
            call.fail(*error);
        else
            call.reply();
    }
}

void Network::lose()
{
    end(idleState);
    m_surroundings.changed();
}

/** Ends a connection, and an attempt at one. */
void Network::end(const QString &state)
{
    const bool hadContext = m_type == cellularType && isBusy();
    m_timer.stop();
    setState(state);
    const MethodError aborted = ConnMan::error("OperationAborted", "Operation aborted");
    finishAttempt(&aborted);
    if (hadContext)
        m_surroundings.links.activate(m_contextPath, false);
}

void Network::count(guint64 receivedBytes, guint64 sentBytes)
{
    DataTotals &data = m_isRoaming ? m_roaming : m_home;
    data.receivedBytes += receivedBytes;
    data.sentBytes += sentBytes;
}

void Network::resetTotals()
{
    m_home = DataTotals();
    m_roaming = DataTotals();
    m_connectedSince = g_get_monotonic_time();
}

void Network::offer(Service *service)
{
    if (service) {
        service->addObject(path(), serviceInterface, methods());
        m_changes.reset(properties());
    } else if (m_service) {
        m_service->removeObject(path(), serviceInterface);
    }
    m_service = service;
}

void Network::forget()
{
    m_service = nullptr;
    end(idleState);
    m_error.clear();
    m_isUnwanted = false;
}

void Network::announce()
{
    if (m_service) {
        m_changes.take(properties(),
                       [this](const QString &name, GVariant *value) { emitChange(name, value); });
    }
}

void Network::announceProxy()
{
    if (!m_service)
        return;
    bool isAnnounced = false;
    m_changes.take(properties(), [&](const QString &name, GVariant *value) {
        emitChange(name, value);
        isAnnounced = isAnnounced || name == proxyProperty;
    });
    if (!isAnnounced)
        emitChange(proxyProperty, m_proxy.toVariant().get());
}

void Network::emitChange(const QString &name, GVariant *value) const
{
    m_service->emitSignal(path(), serviceInterface, QStringLiteral("PropertyChanged"),
                          g_variant_new("(sv)", name.toUtf8().constData(), value));
}

MethodHandlers Network::methods()
{
    const auto answering = [](auto act) {
        return [act](MethodCall &call) {
            act(call);
            call.reply();
        };
    };
    return {
        {QStringLiteral("GetProperties"),
         [this](MethodCall &call) {
             call.reply(g_variant_new("(@a{sv})", toVariant(properties())));
         }},
        {QStringLiteral("SetProperty"),
         [this](MethodCall &call) {
             setProperty(call);
         }},
        {QStringLiteral("ClearProperty"), answering([this](const MethodCall &call) { clearProperty(call); })},
        {QStringLiteral("Connect"),
         [this](MethodCall &call) {
             connectFor(call);
         }},
        {QStringLiteral("Disconnect"), answering([this](const MethodCall &) { disconnect(); })},
        {QStringLiteral("Remove"), answering([this](const MethodCall &) { remove(); })},
        {QStringLiteral("ResetCounters"), answering([this](const MethodCall &) { resetTotals(); })},
    };
}

void Network::setProperty(MethodCall &call)
{
    const QString name = call.text(0);
    if (name == proxyProperty) {
        m_proxy = ProxyConfiguration(ConnMan::propertyValue(call));
        announceProxy();
    } else if (name == autoConnectProperty) {
        const bool isAutomatic = ConnMan::propertyFlag(call);
        if (!m_isSaved)
            throw ConnMan::error("InvalidService", "Invalid service");
        m_isAutomatic = isAutomatic;
    } else {
        throw ConnMan::invalidProperty();
    }
    call.reply();
    m_surroundings.changed();
}

void Network::clearProperty(const MethodCall &call)
{
    if (call.text(0) != errorProperty || m_state != failureState)
        throw ConnMan::invalidProperty();
    m_error.clear();
    setState(idleState);
    m_surroundings.changed();
}

void Network::connectFor(MethodCall &call)
{
    if (isConnected())
        throw ConnMan::error("AlreadyConnected", "Already connected");
    if (isBusy())
        throw ConnMan::error("InProgress", "In progress");
    m_waiting.push_back(call);
    connect();
}

void Network::disconnect()
{
    if (!isBusy())
        throw ConnMan::error("NotConnected", "Not connected");
    m_isUnwanted = true;
    end(disconnectState);
    m_timer.start(m_surroundings.stepMilliseconds, [this] {
        setState(idleState);
        m_surroundings.changed();
    });
    m_surroundings.changed();
}

void Network::remove()
{
    if (m_type != wifiType)
        throw ConnMan::notSupported();
    end(idleState);
    m_isSaved = false;
    m_isAutomatic = true;
    m_error.clear();
    m_proxy = ProxyConfiguration();
    m_surroundings.changed();
}

} // namespace Simulator
} // namespace Corvane
