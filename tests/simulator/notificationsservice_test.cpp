// SPDX-License-Identifier: LGPL-2.1-or-later
#include "client.h"
#include "wirenotification.h"

#include <QtTest/QtTest>

namespace
{

const QString service = QStringLiteral("org.corvaneos.mdmproxy");
const QString path = QStringLiteral("/Corvane/Mdm/Proxy/NotificationInfo");
const QString interface = QStringLiteral("org.corvaneos.mdmproxy.notificationinfo");

constexpr char owner[] = "notificationsservice_test";

} // namespace

/** The notification object of the simulated MDM proxy. */
class NotificationsServiceTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase() { registerWireNotification(); }
    void cleanup();

    void hasThoseOfTheProfile();
    void givesEachANumberOfItsOwn();
    void givesATimeToThoseWithoutOne();
    void keepsWhatItIsGiven();
    void keepsThemWhenStopped();
    void refusesUnknownNumbers();
    void peoplePostAndDismiss();

private:
    QDBusMessage call(const char *member, const QVariantList &arguments) const
    {
        return m_client.call(service, path, interface, QLatin1String(member), arguments);
    }
    uint create(const WireNotification &notification) const
    {
        return call("createNotification", {QVariant::fromValue(notification)}).arguments().value(0).toUInt();
    }
    QList<WireNotification> list(const QString &of = QLatin1String(owner)) const
    {
        return qdbus_cast<QList<WireNotification>>(call("notifications", {of}).arguments().value(0));
    }
    QString act(const char *action, const QStringList &arguments) const
    {
        return textOf(m_client.control(QStringLiteral("Act"), {QLatin1String(action), arguments}));
    }
    static WireNotification notification()
    {
        WireNotification notification;
        notification.texts[0] = QLatin1String(owner);
        return notification;
    }

    Client m_client;
};

void NotificationsServiceTest::cleanup()
{
    const QList<WireNotification> mine = list();
    for (const WireNotification &notification : mine)
        call("closeNotification", {notification.id});
}

void NotificationsServiceTest::hasThoseOfTheProfile()
{
    const QList<WireNotification> all = list(QString());
    QCOMPARE(all.size(), 2);
    QCOMPARE(all.first().id, 1U);
    QCOMPARE(all.first().urgency, 1);
    QCOMPARE(all.first().time, QDateTime(QDate(2026, 3, 2), QTime(16, 3, 5), Qt::UTC));
    QCOMPARE(all.first().remoteActions.size(), 1);
    QCOMPARE(all.last().urgency, 0);
    QCOMPARE(all.last().texts[4], QStringLiteral("Elo Mobile"));
    QCOMPARE(list(QStringLiteral("messages")).size(), 1);
}

void NotificationsServiceTest::givesEachANumberOfItsOwn()
{
    WireNotification given = notification();
    given.id = 1;
    const uint first = create(given);
    const uint second = create(given);
    QVERIFY(first > 1);
    QCOMPARE(second, first + 1);
    call("closeNotification", {second});
    QCOMPARE(create(given), second + 1);
}

void NotificationsServiceTest::givesATimeToThoseWithoutOne()
{
    const QDateTime before = QDateTime::currentDateTimeUtc();
    const uint id = create(notification());
    const QDateTime given = list().value(0).time;
    QCOMPARE(given.timeSpec(), Qt::UTC);
    QVERIFY(given >= before && given <= QDateTime::currentDateTimeUtc());

    QCOMPARE(call("updateNotification", {id, QVariant::fromValue(notification())}).arguments(),
             QVariantList{id});
    QCOMPARE(list().value(0).time, given);

    WireNotification timed = notification();
    timed.time = QDateTime(QDate(2025, 1, 2), QTime(3, 4, 5, 6));
    call("updateNotification", {id, QVariant::fromValue(timed)});
    QCOMPARE(list().value(0).time, timed.time);
    QCOMPARE(list().value(0).time.timeSpec(), Qt::LocalTime);
}

void NotificationsServiceTest::keepsWhatItIsGiven()
{
    WireNotification given = notification();
    given.urgency = -7;
    for (int text = 1; text < 7; ++text)
        given.texts[text] = QStringLiteral("text %1 \u2603").arg(text);
    given.remoteActions = {QDBusVariant(QVariantMap{{QStringLiteral("n"), QVariantList{1, QStringList()}}}),
                           QDBusVariant(true)};
    create(given);
    const QList<WireNotification> kept = list();
    QCOMPARE(kept.size(), 1);
    QCOMPARE(kept.first().urgency, -7);
    for (int text = 0; text < 7; ++text)
        QCOMPARE(kept.first().texts[text], given.texts[text]);
    QCOMPARE(kept.first().remoteActions.size(), 2);
    QCOMPARE(kept.first().remoteActions.last().variant(), QVariant(true));

    given.texts[1] = QStringLiteral("elsewhere");
    create(given);
    const QVariantList found = call("notificationsByCategory", {given.texts[1]}).arguments();
    QCOMPARE(qdbus_cast<QList<WireNotification>>(found.value(0)).size(), 1);
}

void NotificationsServiceTest::keepsThemWhenStopped()
{
    create(notification());
    m_client.control(QStringLiteral("StopService"), {service});
    m_client.control(QStringLiteral("StartService"), {service});
    QCOMPARE(list().size(), 1);
}

void NotificationsServiceTest::refusesUnknownNumbers()
{
    const QString refusal
        = QStringLiteral("org.corvaneos.mdmproxy.Error.NotFound: There is no notification 4294967295");
    QCOMPARE(textOf(call("closeNotification", {4294967295U})), refusal);
    QCOMPARE(textOf(call("updateNotification", {4294967295U, QVariant::fromValue(notification())})), refusal);
}

void NotificationsServiceTest::peoplePostAndDismiss()
{
    const QString answer = act("notification post", {QLatin1String(owner), QStringLiteral("Hello")});
    const QList<WireNotification> posted = list();
    QCOMPARE(posted.size(), 1);
    QCOMPARE(answer, QStringLiteral("reply(Notification %1)").arg(posted.first().id));
    QCOMPARE(posted.first().texts[4], QStringLiteral("Hello"));
    QCOMPARE(posted.first().texts[5], QString());
    QCOMPARE(posted.first().remoteActions.size(), 0);

    const QString number = QString::number(posted.first().id);
    QCOMPARE(act("notification dismiss", {number}), QStringLiteral("reply()"));
    QCOMPARE(list().size(), 0);
    QCOMPARE(act("notification dismiss", {number}),
             QStringLiteral("org.corvaneos.simulator.Error.InvalidArguments: There is no notification ")
                 + number);
}

QTEST_GUILESS_MAIN(NotificationsServiceTest)
#include "notificationsservice_test.moc"
