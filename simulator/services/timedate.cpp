// SPDX-License-Identifier: LGPL-2.1-or-later
#include "component.h"
#include "properties.h"
#include "refusal.h"
#include "sandbox.h"
#include "service.h"

#include <QtCore/QDateTime>
#include <QtCore/QTimeZone>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String serviceName("org.freedesktop.timedate1");
const QLatin1String objectPath("/org/freedesktop/timedate1");
const QLatin1String interfaceName("org.freedesktop.timedate1");
const QLatin1String invalidArguments("org.freedesktop.DBus.Error.InvalidArgs");

constexpr char settingsFile[] = "/etc/datetime/datetime.conf";
constexpr char settingsGroup[] = "datetime";
constexpr char automaticZoneKey[] = "automatic_timezone";

bool isZone(const QString &name)
{
    return QTimeZone::isTimeZoneIdAvailable(name.toUtf8());
}

bool zoneIsAutomatic()
{
    const std::unique_ptr<GKeyFile, GlibDeleter<g_key_file_unref>> settings(g_key_file_new());
    g_key_file_load_from_file(settings.get(), settingsFile, G_KEY_FILE_NONE, nullptr);
    return g_key_file_get_boolean(settings.get(), settingsGroup, automaticZoneKey, nullptr) != FALSE;
}

/** Clock and time zone of the phone. The machine's own clock is read, and never set. */
class TimeDate : public Component
{
public:
    explicit TimeDate(const QJsonObject &profile)
        : m_zone(profile.value(QLatin1String("timeZone")).toString())
        , m_followsNetwork(profile.value(QLatin1String("automaticTime")).toBool())
    {
    }

    void attach(Service &service) override;
    void detach() override { m_service = nullptr; }
    void describe(QJsonObject &state) const override;
    std::vector<Action> actions() override;

private:
    MethodHandlers methods();
    PropertyReaders properties() const;
    void setTime(MethodCall &call);
    void setZone(const QString &zone);
    void setFollowsNetwork(bool follows);
    gint64 now() const { return g_get_real_time() + m_offset; }
    /** What is told when it changes. */
    Properties announced() const;
    void announce();
    QString hearOfZone(const QString &zone);

    QString m_zone;
    bool m_followsNetwork;
    gint64 m_offset = 0; ///< microseconds that the phone's clock is ahead of the machine's

    Service *m_service = nullptr;
    PropertyChanges m_told;
};

void TimeDate::attach(Service &service)
{
    m_service = &service;
    service.addObject(objectPath, interfaceName, methods(), properties());
    m_told.reset(announced());
}

MethodHandlers TimeDate::methods()
{
    return {
        {QStringLiteral("SetTime"),
         [this](MethodCall &call) {
             setTime(call);
         }},
        {QStringLiteral("SetTimezone"),
         [this](MethodCall &call) {
             const QString zone = call.text(0);
             if (!isZone(zone))
                 throw MethodError(invalidArguments,
                                   QStringLiteral("Invalid or not installed time zone '%1'").arg(zone));
             call.reply();
             setZone(zone);
         }},
        {QStringLiteral("SetNTP"),
         [this](MethodCall &call) {
             const bool follows = call.flag(0);
             call.reply();
             setFollowsNetwork(follows);
         }},
        {QStringLiteral("ListTimezones"),
         [](MethodCall &call) {
             QStringList zones;
             const QList<QByteArray> ids = QTimeZone::availableTimeZoneIds();
             for (const QByteArray &id : ids)
                 zones << QString::fromUtf8(id);
             call.reply(g_variant_new("(@as)", fromList(zones).get()));
         }},
    };
}

PropertyReaders TimeDate::properties() const
{
    return {
        {QStringLiteral("Timezone"),
         [this] {
             return g_variant_new_string(m_zone.toUtf8().constData());
         }},
        {QStringLiteral("LocalRTC"),
         [] {
             return g_variant_new_boolean(FALSE);
         }},
        {QStringLiteral("CanNTP"),
         [] {
             return g_variant_new_boolean(TRUE);
         }},
        {QStringLiteral("NTP"),
         [this] {
             return g_variant_new_boolean(m_followsNetwork);
         }},
        {QStringLiteral("NTPSynchronized"),
         [this] {
             return g_variant_new_boolean(m_followsNetwork);
         }},
        {QStringLiteral("TimeUSec"),
         [this] {
             return g_variant_new_uint64(guint64(now()));
         }},
        {QStringLiteral("RTCTimeUSec"),
         [this] {
             return g_variant_new_uint64(guint64(now()));
         }},
    };
}

void TimeDate::setTime(MethodCall &call)
{
    gint64 time = 0;
    gboolean isRelative = FALSE;
    g_variant_get(call.arguments(), "(xbb)", &time, &isRelative, nullptr);
    if (m_followsNetwork)
        throw MethodError(QStringLiteral("org.freedesktop.timedate1.AutomaticTimeSyncEnabled"),
                          QStringLiteral("Automatic time synchronization is enabled"));
    gint64 offset = 0;
    const bool isOutOfRange = isRelative ? __builtin_add_overflow(m_offset, time, &offset)
                                         : __builtin_sub_overflow(time, g_get_real_time(), &offset);
    if (isOutOfRange || (!isRelative && time <= 0))
        throw MethodError(invalidArguments, QStringLiteral("Invalid absolute time"));
    m_offset = offset;
    call.reply();
}

void TimeDate::setZone(const QString &zone)
{
    m_zone = zone;
    announce();
}

void TimeDate::setFollowsNetwork(bool follows)
{
    m_followsNetwork = follows;
    if (follows)
        m_offset = 0;
    announce();
}

Properties TimeDate::announced() const
{
    return {{QStringLiteral("Timezone"), fromText(m_zone)},
            {QStringLiteral("NTP"), fromBool(m_followsNetwork)}};
}

void TimeDate::announce()
{
    if (m_service)
        announceChanges(*m_service, objectPath, interfaceName, &m_told, announced());
}

QString TimeDate::hearOfZone(const QString &zone)
{
    if (!isZone(zone))
        throw Refusal(QStringLiteral("\"%1\" is no time zone; one is Europe/Helsinki").arg(zone));
    if (!zoneIsAutomatic())
        return QStringLiteral("The phone stays in %1").arg(m_zone);
    setZone(zone);
    return QStringLiteral("The phone is in %1 now").arg(m_zone);
}

void TimeDate::describe(QJsonObject &state) const
{
    const QDateTime time = QDateTime::fromMSecsSinceEpoch(now() / 1000, Qt::UTC);
    state.insert(QStringLiteral("clock"),
                 QJsonObject{{QStringLiteral("timeZone"), m_zone},
                             {QStringLiteral("automaticTime"), m_followsNetwork},
                             {QStringLiteral("automaticTimeZone"), zoneIsAutomatic()},
                             {QStringLiteral("time"), time.toString(Qt::ISODateWithMs)}});
}

std::vector<Action> TimeDate::actions()
{
    return {
        {QStringLiteral("clock zone"), QStringLiteral("ZONE"),
         QStringLiteral("the network tells its time zone, which the phone takes on when that is automatic"),
         1, 1,
         [this](const QStringList &arguments) {
             return hearOfZone(arguments.first());
         }},
    };
}

QString problemOf(const QJsonObject &profile)
{
    const QString zone
        = profile.value(QLatin1String("clock")).toObject().value(QLatin1String("timeZone")).toString();
    return isZone(zone) ? QString()
                        : QStringLiteral("/clock/timeZone: there is no such time zone as %1").arg(zone);
}

void addFiles(const QJsonObject &profile, PhoneFiles &files)
{
    const bool isAutomatic
        = profile.value(QLatin1String("clock")).toObject().value(QLatin1String("automaticTimeZone")).toBool();
    files.files[settingsFile] = std::string("[") + settingsGroup + "]\n" + automaticZoneKey + '='
        + (isAutomatic ? "true" : "false") + '\n';
}

const ComponentRegistration registration({
    serviceName,
    [](const QJsonObject &profile, Phone &) {
        return std::make_unique<TimeDate>(profile.value(QLatin1String("clock")).toObject());
    },
    problemOf,
    addFiles,
});

} // namespace

} // namespace Simulator
} // namespace Corvane
