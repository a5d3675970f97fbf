// SPDX-License-Identifier: LGPL-2.1-or-later
#include "device/notificationinfo_p.h"

#include <benchmark/benchmark.h>

#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusMetaType>
#include <QtDBus/QDBusVariant>

using Corvane::Mdm::NotificationData;
using Corvane::Mdm::NotificationInfo;

namespace
{

/** As the library's, but what is nested stays as QtDBus leaves it. */
struct PlainNotification {
    NotificationData data;
};

QDBusArgument &operator<<(QDBusArgument &out, const PlainNotification &notification)
{
    return Corvane::Mdm::operator<<(out, notification.data);
}

const QDBusArgument &operator>>(const QDBusArgument &in, PlainNotification &notification)
{
    NotificationData &data = notification.data;
    in.beginStructure();
    in >> data.id >> data.urgency >> data.owner >> data.category >> data.appName >> data.appIcon
        >> data.summary >> data.body >> data.subText >> data.timestamp >> data.remoteActions;
    in.endStructure();
    return in;
}

/** The message as the proxy sends it, still to be read. */
QDBusArgument throughTheProxy(int count)
{
    NotificationInfo info;
    NotificationData data;
    data.owner = QStringLiteral("benchmark");
    data.summary = QStringLiteral("Missed call");
    data.body = QStringLiteral("+358 40 1112233");
    data.timestamp = QDateTime::currentDateTimeUtc();
    const QVariantMap argument{
        {QStringLiteral("number"), QStringLiteral("+358401112233")},
        {QStringLiteral("times"), QVariantList{1, 2, 3}},
    };
    for (const char *name : {"default", "callBack"}) {
        data.remoteActions.append(QVariantMap{
            {QStringLiteral("name"), QLatin1String(name)},
            {QStringLiteral("displayName"), QStringLiteral("Call back")},
            {QStringLiteral("method"), QStringLiteral("openCallHistory")},
            {QStringLiteral("arguments"), QVariantList{argument}},
        });
    }
    QVector<uint> numbers;
    for (int i = 0; i < count; ++i)
        numbers.append(info.createNotification(data));
    QDBusMessage call = QDBusMessage::createMethodCall(
        QStringLiteral("org.corvaneos.mdmproxy"), QStringLiteral("/Corvane/Mdm/Proxy/NotificationInfo"),
        QStringLiteral("org.corvaneos.mdmproxy.notificationinfo"), QStringLiteral("notifications"));
    call.setArguments({data.owner});
    const QDBusMessage all = QDBusConnection::systemBus().call(call);
    for (const uint number : qAsConst(numbers))
        info.closeNotification(number);
    return all.arguments().value(0).value<QDBusArgument>();
}

template <typename Notification> void parse(benchmark::State &state)
{
    const QDBusArgument message = throughTheProxy(int(state.range(0)));
    for (auto _ : state) {
        const QDBusArgument unread = message; // reading advances the one that is read
        QList<Notification> notifications;
        unread >> notifications;
        if (notifications.size() != state.range(0))
            state.SkipWithError("not all came back");
        benchmark::DoNotOptimize(notifications);
    }
}

} // namespace

Q_DECLARE_METATYPE(PlainNotification)

BENCHMARK_TEMPLATE(parse, NotificationData)
    ->Name("notifications/library")
    ->Arg(1000)
    ->Unit(benchmark::kMicrosecond);
BENCHMARK_TEMPLATE(parse, PlainNotification)
    ->Name("notifications/QtDBus")
    ->Arg(1000)
    ->Unit(benchmark::kMicrosecond);
