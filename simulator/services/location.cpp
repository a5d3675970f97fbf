// SPDX-License-Identifier: LGPL-2.1-or-later
#include "component.h"
#include "mdmproxy.h"
#include "refusal.h"
#include "sandbox.h"
#include "service.h"
#include "timer.h"

#include <QtCore/QDateTime>
#include <QtCore/QFile>
#include <QtCore/QJsonArray>

#include <algorithm>
#include <array>
#include <cmath>
#include <set>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String objectPath("/Corvane/Mdm/Proxy/LocationInfo");
const QLatin1String interfaceName("org.corvaneos.mdmproxy.locationinfo");

constexpr char settingsFile[] = "/etc/location/location.conf";
constexpr char settingsGroup[] = "location";
const QLatin1String receiverDevice("/dev/gnss0");

constexpr double degreesToRadians = 3.14159265358979323846 / 180;
constexpr double earthRadius = 6371008.8; // m
constexpr int satellitesForAFix = 4;

struct Place {
    double latitude; ///< degrees
    double longitude; ///< degrees
    double altitude; ///< m
};

struct Satellites {
    int inUse = 0;
    int inView = 0;
};

double distance(const Place &from, const Place &to)
{
    const double north = (to.latitude - from.latitude) * degreesToRadians;
    const double east = (to.longitude - from.longitude) * degreesToRadians;
    const double chord = std::pow(std::sin(north / 2), 2)
        + std::cos(from.latitude * degreesToRadians) * std::cos(to.latitude * degreesToRadians)
            * std::pow(std::sin(east / 2), 2);
    return 2 * earthRadius * std::asin(std::min(1.0, std::sqrt(chord)));
}

Place between(const Place &from, const Place &to, double share)
{
    const auto part = [share](double begin, double end) {
        return begin + (end - begin) * share;
    };
    return {part(from.latitude, to.latitude), part(from.longitude, to.longitude),
            part(from.altitude, to.altitude)};
}

Place placeFrom(const QJsonValue &value)
{
    const QJsonObject point = value.toObject();
    return {point.value(QLatin1String("latitude")).toDouble(),
            point.value(QLatin1String("longitude")).toDouble(),
            point.value(QLatin1String("altitude")).toDouble()};
}

/** The way that the phone goes, to its end and back again. */
class Track
{
public:
    explicit Track(std::vector<Place> places)
        : m_places(std::move(places))
    {
        for (std::size_t i = 1; i < m_places.size(); ++i)
            m_length += distance(m_places[i - 1], m_places[i]);
    }

    Place after(double metres) const
    {
        double left = m_length > 0 ? std::fmod(metres, 2 * m_length) : 0;
        if (left > m_length)
            left = 2 * m_length - left;
        for (std::size_t i = 1; i < m_places.size(); ++i) {
            const double leg = distance(m_places[i - 1], m_places[i]);
            if (left <= leg && leg > 0)
                return between(m_places[i - 1], m_places[i], left / leg);
            left -= leg;
        }
        return m_places.back();
    }

private:
    std::vector<Place> m_places;
    double m_length = 0; // m, one way
};

/** Whether the settings let the receiver run. */
bool isAllowed()
{
    const std::unique_ptr<GKeyFile, GlibDeleter<g_key_file_unref>> settings(g_key_file_new());
    g_key_file_load_from_file(settings.get(), settingsFile, G_KEY_FILE_NONE, nullptr);
    const auto isSet = [&settings](const char *key) {
        return g_key_file_get_boolean(settings.get(), settingsGroup, key, nullptr) != FALSE;
    };
    return isSet("enabled") && isSet("gps_enabled") && !isSet("gps_flight_mode");
}

/** What a receiver sees that has made @p reports reports since it was started: it finds more and more. */
Satellites satellitesAfter(int reports, int reportsToFix)
{
    // The sky turns, and houses come and go.
    static constexpr std::array<int, 8> sky{12, 12, 13, 14, 14, 13, 11, 12};
    const int inView = sky.at(std::size_t(reports) % sky.size());
    const int found = reportsToFix > 0 ? satellitesForAFix * reports / reportsToFix : inView;
    return {std::min(reports < reportsToFix ? found : found + 1, inView - 3), inView};
}

class Location : public Component
{
public:
    explicit Location(const QJsonObject &profile);

    void attach(Service &service) override;
    void detach() override;
    void describe(QJsonObject &state) const override;
    std::vector<Action> actions() override;

private:
    bool isRunning() const { return !m_clients.empty() && m_service; }
    void start(const QString &client);
    void stop(const QString &client);
    void scheduleReport();
    void report();
    QString positionText() const;
    QString move(const QStringList &arguments);

    // the phone and its way
    Track m_track;
    const double m_speed; // m/s
    const int m_interval; // ms
    const int m_reportsToFix;
    bool m_hasSignal = true;
    double m_way = 0; // m
    Place m_place;
    QDateTime m_time; ///< of the last fix

    // what the proxy keeps while it runs
    Service *m_service = nullptr;
    std::set<QString> m_clients;
    Satellites m_satellites;
    int m_reports = 0; ///< since the receiver was started
    Timer m_timer;
};

Location::Location(const QJsonObject &profile)
    : m_track([&profile] {
        std::vector<Place> places;
        const QJsonArray track = profile.value(QLatin1String("track")).toArray();
        std::transform(track.begin(), track.end(), std::back_inserter(places), placeFrom);
        return Track(places);
    }())
    , m_speed(profile.value(QLatin1String("speed")).toDouble())
    , m_interval(profile.value(QLatin1String("intervalMilliseconds")).toInt())
    , m_reportsToFix(profile.value(QLatin1String("reportsToFix")).toInt())
    , m_place(m_track.after(0))
    , m_time(QDateTime::currentDateTimeUtc())
{
    // As the kernel shows one; nothing reads it.
    if (profile.value(QLatin1String("receiver")).toBool())
        QFile(receiverDevice).open(QIODevice::WriteOnly);
}

void Location::attach(Service &service)
{
    m_service = &service;
    service.watchClients([this](const QString &client) { stop(client); });
    service.addObject(objectPath, interfaceName,
                      {
                          {QStringLiteral("startUpdates"),
                           [this](MethodCall &call) {
                               call.reply();
                               start(call.sender());
                           }},
                          {QStringLiteral("stopUpdates"),
                           [this](MethodCall &call) {
                               stop(call.sender());
                               call.reply();
                           }},
                          {QStringLiteral("position"),
                           [this](MethodCall &call) {
                               call.reply(g_variant_new("(s)", positionText().toUtf8().constData()));
                           }},
                          {QStringLiteral("satellitesInUse"),
                           [this](MethodCall &call) {
                               call.reply(g_variant_new("(i)", gint32(m_satellites.inUse)));
                           }},
                          {QStringLiteral("satellitesInView"),
                           [this](MethodCall &call) {
                               call.reply(g_variant_new("(i)", gint32(m_satellites.inView)));
                           }},
                      });
}

void Location::detach()
{
    m_timer.stop();
    m_clients.clear();
    m_satellites = {};
    m_service = nullptr;
}

void Location::start(const QString &client)
{
    const bool wasRunning = isRunning();
    m_clients.insert(client);
    if (wasRunning)
        return;
    m_reports = 0;
    scheduleReport();
}

void Location::stop(const QString &client)
{
    if (m_clients.erase(client) == 0 || isRunning())
        return;
    m_timer.stop();
    m_satellites = {};
}

void Location::scheduleReport()
{
    m_timer.start(guint(m_interval), [this] {
        report();
        scheduleReport();
    });
}

void Location::report()
{
    m_way += m_speed * m_interval / 1000;
    if (!isAllowed()) {
        m_reports = 0;
        m_satellites = {};
        return;
    }
    ++m_reports;
    m_satellites = m_hasSignal ? satellitesAfter(m_reports, m_reportsToFix) : Satellites();
    m_service->emitSignal(objectPath, interfaceName, QStringLiteral("satellitesChanged"),
                          g_variant_new("(ii)", m_satellites.inUse, m_satellites.inView));
    if (m_satellites.inUse < satellitesForAFix)
        return;
    m_place = m_track.after(m_way);
    m_time = QDateTime::currentDateTimeUtc();
    m_service->emitSignal(objectPath, interfaceName, QStringLiteral("positionChanged"),
                          g_variant_new("(s)", positionText().toUtf8().constData()));
}

QString Location::positionText() const
{
    // As exact as receivers are: a decimetre.
    return QStringLiteral("%1;%2;%3;%4")
        .arg(QString::number(m_place.latitude, 'f', 6), QString::number(m_place.longitude, 'f', 6),
             QString::number(m_place.altitude, 'f', 1))
        .arg(m_time.toMSecsSinceEpoch());
}

QString Location::move(const QStringList &arguments)
{
    std::array<double, 3> numbers{};
    for (int i = 0; i < arguments.size(); ++i) {
        bool isNumber = false;
        numbers.at(std::size_t(i)) = arguments.at(i).toDouble(&isNumber);
        if (!isNumber)
            throw Refusal(QStringLiteral("\"%1\" is no number").arg(arguments.at(i)));
    }
    const auto [latitude, longitude, altitude] = numbers;
    if (!(std::abs(latitude) <= 90 && std::abs(longitude) <= 180))
        throw Refusal(
            QStringLiteral("There is no such place: latitudes go from -90 to 90 and longitudes from "
                           "-180 to 180 degrees"));
    m_track = Track({{latitude, longitude, altitude}});
    return QString();
}

void Location::describe(QJsonObject &state) const
{
    state.insert(QStringLiteral("location"),
                 QJsonObject{{QStringLiteral("position"), positionText()},
                             {QStringLiteral("running"), isRunning()},
                             {QStringLiteral("signal"), m_hasSignal},
                             {QStringLiteral("satellitesInUse"), m_satellites.inUse},
                             {QStringLiteral("satellitesInView"), m_satellites.inView}});
}

std::vector<Action> Location::actions()
{
    return {
        {QStringLiteral("location move"), QStringLiteral("LATITUDE LONGITUDE [ALTITUDE]"),
         QStringLiteral("takes the phone to a place, where it stays; the next report tells"), 2, 3,
         [this](const QStringList &arguments) {
             return move(arguments);
         }},
        {QStringLiteral("location signal"), QStringLiteral("on|off"),
         QStringLiteral("without it, as in a tunnel, the receiver sees no satellites"), 1, 1,
         [this](const QStringList &arguments) {
             const QString &word = arguments.first();
             if (word != QLatin1String("on") && word != QLatin1String("off"))
                 throw Refusal(QStringLiteral("\"%1\" is neither on nor off").arg(word));
             m_hasSignal = word == QLatin1String("on");
             return QString();
         }},
    };
}

void addFiles(const QJsonObject &profile, PhoneFiles &files)
{
    const QJsonObject settings
        = profile.value(QLatin1String("location")).toObject().value(QLatin1String("settings")).toObject();
    std::string content = std::string("[") + settingsGroup + "]\n";
    for (auto setting = settings.begin(); setting != settings.end(); ++setting) {
        const QVariant value = setting.value().isBool() ? setting.value().toVariant()
                                                        : QVariant(qint64(setting.value().toDouble()));
        content += setting.key().toStdString() + '=' + value.toString().toStdString() + '\n';
    }
    files.files[settingsFile] = content;
}

QString problemOf(const QJsonObject &)
{
    return QString();
}

const ComponentRegistration registration({
    MdmProxy::serviceName,
    [](const QJsonObject &profile, Phone &) {
        return std::make_unique<Location>(profile.value(QLatin1String("location")).toObject());
    },
    problemOf,
    addFiles,
});

} // namespace

} // namespace Simulator
} // namespace Corvane
