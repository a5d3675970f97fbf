// SPDX-License-Identifier: LGPL-2.1-or-later
#include "component.h"
#include "mdmproxy.h"
#include "refusal.h"
#include "service.h"

#include <QtCore/QDateTime>
#include <QtCore/QJsonArray>

#include <algorithm>
#include <array>
#include <map>
#include <optional>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String objectPath("/Corvane/Mdm/Proxy/CallStatistics");
const QLatin1String interfaceName("org.corvaneos.mdmproxy.callstatistics");

constexpr int longestCall = 24 * 60 * 60; // s

// Selectors as the contract numbers them.
enum Direction { AnyDirection = 0, Outgoing = 1, Incoming = 2, Missed = 3 };
enum Measure { Count = 0, Duration = 1 };

/** The profile's words for the directions from Outgoing on. */
const std::array<QLatin1String, 3> directionWords{QLatin1String("outgoing"), QLatin1String("incoming"),
                                                  QLatin1String("missed")};

std::optional<Direction> directionCalled(const QString &word)
{
    const auto found = std::find(directionWords.begin(), directionWords.end(), word);
    if (found == directionWords.end())
        return std::nullopt;
    return Direction(std::distance(directionWords.begin(), found) + Outgoing);
}

QDateTime timeFrom(const QString &text)
{
    return QDateTime::fromString(text, Qt::ISODate).toUTC();
}

struct Call {
    QDateTime time; ///< of its beginning, in UTC
    Direction direction;
    int seconds;
};

struct Range {
    QDateTime start; ///< open when invalid, as is the end
    QDateTime end;

    bool isInverted() const { return start.isValid() && end.isValid() && start >= end; }
    bool contains(const QDateTime &time) const
    {
        return (!start.isValid() || time >= start) && (!end.isValid() || time < end);
    }
};

/** The date and time in @p value, a ((iii)(iiii)i): invalid when open, nothing when there is no such time. */
std::optional<QDateTime> dateTimeFrom(const Variant &value)
{
    struct {
        int year, month, day, hour, minute, second, millisecond, meaning;
    } in;
    g_variant_get(value.get(), "((iii)(iiii)i)", &in.year, &in.month, &in.day, &in.hour, &in.minute,
                  &in.second, &in.millisecond, &in.meaning);
    const QDate date(in.year, in.month, in.day);
    const QTime time(in.hour, in.minute, in.second, in.millisecond);
    if (in.meaning < Qt::LocalTime || in.meaning > Qt::TimeZone)
        return std::nullopt;
    if (date.isNull() && time.isNull())
        return QDateTime();
    if (!date.isValid() || !time.isValid())
        return std::nullopt;
    const bool isUtc = in.meaning == Qt::UTC || in.meaning == Qt::OffsetFromUTC;
    return QDateTime(date, time, isUtc ? Qt::UTC : Qt::LocalTime);
}

class CallStatistics : public Component
{
public:
    explicit CallStatistics(const QJsonArray &profile);

    void attach(Service &service) override;
    void detach() override { m_service = nullptr; }
    void describe(QJsonObject &state) const override;
    std::vector<Action> actions() override;

private:
    void search(MethodCall &call) const;
    /** The a(xi) for the calls in @p range. */
    GVariant *results(int direction, int measure, const Range &range) const;
    QString enter(const QStringList &arguments);

    std::vector<Call> m_log;
    Service *m_service = nullptr;
};

CallStatistics::CallStatistics(const QJsonArray &profile)
{
    for (const QJsonValue &entry : profile) {
        const QJsonObject call = entry.toObject();
        m_log.push_back({timeFrom(call.value(QLatin1String("time")).toString()),
                         directionCalled(call.value(QLatin1String("direction")).toString()).value_or(Missed),
                         call.value(QLatin1String("seconds")).toInt()});
    }
}

void CallStatistics::attach(Service &service)
{
    m_service = &service;
    service.addObject(objectPath, interfaceName,
                      {
                          {QStringLiteral("search"),
                           [this](MethodCall &call) {
                               search(call);
                           }},
                      });
}

void CallStatistics::search(MethodCall &call) const
{
    int direction = 0;
    int measure = 0;
    GVariant *startArgument = nullptr;
    GVariant *endArgument = nullptr;
    g_variant_get(call.arguments(), "(ii@((iii)(iiii)i)@((iii)(iiii)i))", &direction, &measure,
                  &startArgument, &endArgument);
    const std::optional<QDateTime> start = dateTimeFrom(Variant(startArgument));
    const std::optional<QDateTime> end = dateTimeFrom(Variant(endArgument));
    call.reply();

    const bool isPossible = direction >= AnyDirection && direction <= Missed && measure >= Count
        && measure <= Duration && start && end && !Range{*start, *end}.isInverted();
    GVariant *found = isPossible ? results(direction, measure, {*start, *end})
                                 : g_variant_new_array(G_VARIANT_TYPE("(xi)"), nullptr, 0);
    m_service->emitSignal(objectPath, interfaceName, QStringLiteral("searchFinished"),
                          g_variant_new("(b@a(xi))", gboolean(isPossible), found));
}

GVariant *CallStatistics::results(int direction, int measure, const Range &range) const
{
    std::map<QDate, int> days;
    for (const Call &call : m_log) {
        if (range.contains(call.time) && (direction == AnyDirection || direction == call.direction))
            days[call.time.date()] += measure == Count ? 1 : call.seconds;
    }
    GVariantBuilder list;
    g_variant_builder_init(&list, G_VARIANT_TYPE("a(xi)"));
    for (const auto &[day, value] : days)
        g_variant_builder_add(&list, "(xi)", gint64(day.startOfDay(Qt::UTC).toSecsSinceEpoch()), value);
    return g_variant_builder_end(&list);
}

QString CallStatistics::enter(const QStringList &arguments)
{
    const std::optional<Direction> direction = directionCalled(arguments.first());
    if (!direction) {
        throw Refusal(
            QStringLiteral("\"%1\" is no kind of call; there are outgoing, incoming and missed ones")
                .arg(arguments.first()));
    }
    bool isDuration = true;
    const int seconds = arguments.size() > 1 ? arguments.at(1).toInt(&isDuration) : 0;
    if (!isDuration || seconds < 0 || seconds > longestCall)
        throw Refusal(QStringLiteral("\"%1\" is no duration; it is a number of seconds, at most a day's")
                          .arg(arguments.at(1)));
    if (direction == Missed && seconds > 0)
        throw Refusal(QStringLiteral("A missed call has no duration; leave it out or make it 0"));
    const QDateTime time = arguments.size() > 2 ? timeFrom(arguments.at(2)) : QDateTime::currentDateTimeUtc();
    if (!time.isValid())
        throw Refusal(QStringLiteral("\"%1\" is no time; one is 2026-03-02T09:15:00Z").arg(arguments.at(2)));
    m_log.push_back({time, *direction, seconds});
    return QStringLiteral("The log has %1 calls").arg(m_log.size());
}

void CallStatistics::describe(QJsonObject &state) const
{
    QJsonArray log;
    for (const Call &call : m_log) {
        log << QJsonObject{
            {QStringLiteral("time"), call.time.toString(Qt::ISODate)},
            {QStringLiteral("direction"), directionWords.at(std::size_t(call.direction - Outgoing))},
            {QStringLiteral("seconds"), call.seconds}};
    }
    state.insert(QStringLiteral("callLog"), log);
}

std::vector<Action> CallStatistics::actions()
{
    return {
        {QStringLiteral("call log"), QStringLiteral("outgoing|incoming|missed [SECONDS [TIME]]"),
         QStringLiteral("enters a call that began at TIME, or now, into the log of calls"), 1, 3,
         [this](const QStringList &arguments) {
             return enter(arguments);
         }},
    };
}

QString problemOf(const QJsonObject &profile)
{
    const QJsonArray log = profile.value(QLatin1String("callLog")).toArray();
    for (int i = 0; i < log.size(); ++i) {
        const QJsonObject call = log.at(i).toObject();
        const QString time = call.value(QLatin1String("time")).toString();
        if (!timeFrom(time).isValid())
            return QStringLiteral("/callLog/%1/time: there is no such time as %2").arg(i).arg(time);
        const bool isMissed = directionCalled(call.value(QLatin1String("direction")).toString()) == Missed;
        if (isMissed && call.value(QLatin1String("seconds")).toInt() > 0)
            return QStringLiteral("/callLog/%1/seconds: a missed call has no duration; must be 0").arg(i);
    }
    return QString();
}

const ComponentRegistration registration({
    MdmProxy::serviceName,
    [](const QJsonObject &profile, Phone &) {
        return std::make_unique<CallStatistics>(profile.value(QLatin1String("callLog")).toArray());
    },
    problemOf,
});

} // namespace

} // namespace Simulator
} // namespace Corvane
