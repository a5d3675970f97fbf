// SPDX-License-Identifier: LGPL-2.1-or-later
#include "client.h"

#include <QtCore/QDateTime>
#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QJsonObject>
#include <QtDBus/QDBusMetaType>
#include <QtTest/QTest>

#include <memory>

/** A date and time as the wire has it: any numbers. */
struct WireTime {
    int date[3];
    int time[4];
    int meaning;
};
Q_DECLARE_METATYPE(WireTime)

QDBusArgument &operator<<(QDBusArgument &out, const WireTime &time)
{
    out.beginStructure();
    out.beginStructure();
    out << time.date[0] << time.date[1] << time.date[2];
    out.endStructure();
    out.beginStructure();
    out << time.time[0] << time.time[1] << time.time[2] << time.time[3];
    out.endStructure();
    out << time.meaning;
    out.endStructure();
    return out;
}

const QDBusArgument &operator>>(const QDBusArgument &in, WireTime &)
{
    return in;
}

namespace
{

const QString service = QStringLiteral("org.corvaneos.mdmproxy");
const QString path = QStringLiteral("/Corvane/Mdm/Proxy/CallStatistics");
const QString interface = QStringLiteral("org.corvaneos.mdmproxy.callstatistics");
const QString finished = QStringLiteral("searchFinished");
const QString failure = QStringLiteral("searchFinished(false, [])");

constexpr int local = 0;
constexpr int utc = 1;
constexpr int offset = 2;
constexpr int zone = 3;

constexpr WireTime open{{0, 0, 0}, {-1, -1, -1, -1}, local};
constexpr qint64 firstOfMarch = 1772323200; // 2026-03-01, UTC
constexpr qint64 day = 24 * 60 * 60;

WireTime march(int dayOfMonth, int hour = 0, int millisecond = 0, int meaning = utc)
{
    return {{2026, 3, dayOfMonth}, {hour, 0, 0, millisecond}, meaning};
}

/** The signal with the values for the first, third and fifth of March; -1: no such result. */
QString found(int first, int third, int fifth)
{
    QStringList results;
    const int values[] = {first, third, fifth};
    for (int i = 0; i < 3; ++i) {
        if (values[i] >= 0)
            results << QStringLiteral("(%1, %2)").arg(firstOfMarch + 2 * i * day).arg(values[i]);
    }
    return QStringLiteral("searchFinished(true, [%1])").arg(results.join(QStringLiteral(", ")));
}

} // namespace

/** The call-statistics object of the simulated MDM proxy. */
class CallStatisticsServiceTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void init();

    void searchesItsLog_data();
    void searchesItsLog();
    void failsWhatItCannotSearch_data();
    void failsWhatItCannotSearch();
    void tellsEverybodyAfterTheAnswer();
    void searchesInLocalTime();
    void keepsTheLog();
    void refusesWhatIsNoCall_data();
    void refusesWhatIsNoCall();

private:
    QString search(int direction, int measure, const WireTime &start, const WireTime &end) const
    {
        return textOf(
            m_client->call(service, path, interface, QStringLiteral("search"),
                           {direction, measure, QVariant::fromValue(start), QVariant::fromValue(end)}));
    }
    QString log(const QStringList &arguments) const
    {
        return textOf(m_client->control(QStringLiteral("Act"), {QStringLiteral("call log"), arguments}));
    }

    std::unique_ptr<Client> m_client;
};

void CallStatisticsServiceTest::initTestCase()
{
    qDBusRegisterMetaType<WireTime>();
}

void CallStatisticsServiceTest::init()
{
    m_client = std::make_unique<Client>();
    m_client->watch(service, path, interface, {finished});
}

void CallStatisticsServiceTest::searchesItsLog_data()
{
    QTest::addColumn<int>("direction");
    QTest::addColumn<int>("measure");
    QTest::addColumn<WireTime>("start");
    QTest::addColumn<WireTime>("end");
    QTest::addColumn<QString>("results");
    QTest::newRow("how many") << 0 << 0 << open << open << found(3, 1, 1);
    QTest::newRow("how long") << 0 << 1 << open << open << found(65, 40, 7);
    QTest::newRow("outgoing") << 1 << 0 << open << open << found(1, 1, 1);
    QTest::newRow("incoming") << 2 << 1 << open << open << found(5, -1, -1);
    QTest::newRow("missed") << 3 << 0 << open << open << found(1, -1, -1);
    QTest::newRow("missed, how long") << 3 << 1 << open << open << found(0, -1, -1);
    QTest::newRow("from the start on") << 0 << 0 << march(3) << open << found(-1, 1, 1);
    QTest::newRow("after the start") << 0 << 0 << march(3, 0, 1) << open << found(-1, -1, 1);
    QTest::newRow("before the end") << 0 << 0 << open << march(3) << found(3, -1, -1);
    QTest::newRow("within") << 0 << 1 << march(1, 10, 1) << march(3, 0, 1) << found(5, 40, -1);
    QTest::newRow("offset that has not travelled")
        << 0 << 0 << march(3, 0, 0, offset) << open << found(-1, 1, 1);
    QTest::newRow("open, meant in UTC")
        << 0 << 0 << WireTime{{0, 0, 0}, {-1, -1, -1, -1}, utc} << open << found(3, 1, 1);
    QTest::newRow("none") << 0 << 0 << march(6) << open << found(-1, -1, -1);
}

void CallStatisticsServiceTest::searchesItsLog()
{
    QFETCH(int, direction);
    QFETCH(int, measure);
    QFETCH(WireTime, start);
    QFETCH(WireTime, end);
    QFETCH(QString, results);
    QCOMPARE(search(direction, measure, start, end), QStringLiteral("reply()"));
    QCOMPARE(m_client->takeSignals(service), QStringList(results));
}

void CallStatisticsServiceTest::failsWhatItCannotSearch_data()
{
    QTest::addColumn<int>("direction");
    QTest::addColumn<int>("measure");
    QTest::addColumn<WireTime>("start");
    QTest::addColumn<WireTime>("end");
    QTest::newRow("direction") << 4 << 0 << open << open;
    QTest::newRow("negative direction") << -1 << 0 << open << open;
    QTest::newRow("measure") << 0 << 2 << open << open;
    QTest::newRow("negative measure") << 0 << -1 << open << open;
    QTest::newRow("inverted range") << 0 << 0 << march(5) << march(1);
    QTest::newRow("empty range") << 0 << 0 << march(1) << march(1);
    QTest::newRow("no such day") << 0 << 0 << march(32) << open;
    QTest::newRow("no such hour") << 0 << 0 << open << march(1, 24);
    QTest::newRow("day without a time") << 0 << 0 << WireTime{{2026, 3, 1}, {-1, -1, -1, -1}, utc} << open;
    QTest::newRow("time without a day") << 0 << 0 << WireTime{{0, 0, 0}, {0, 0, 0, 0}, utc} << open;
    QTest::newRow("no such meaning") << 0 << 0 << march(1, 0, 0, 4) << open;
    QTest::newRow("negative meaning") << 0 << 0 << open << march(1, 0, 0, -1);
}

void CallStatisticsServiceTest::failsWhatItCannotSearch()
{
    QFETCH(int, direction);
    QFETCH(int, measure);
    QFETCH(WireTime, start);
    QFETCH(WireTime, end);
    QCOMPARE(search(direction, measure, start, end), QStringLiteral("reply()"));
    QCOMPARE(m_client->takeSignals(service), QStringList(failure));
}

void CallStatisticsServiceTest::tellsEverybodyAfterTheAnswer()
{
    Client other;
    other.watch(service, path, interface, {finished});
    m_client->callAndNote(service, path, interface, QStringLiteral("search"),
                          {3, 0, QVariant::fromValue(open), QVariant::fromValue(open)});
    QVERIFY(m_client->waitForSignals(2));
    QCOMPARE(m_client->takeSignals(service), QStringList({QStringLiteral("answer"), found(1, -1, -1)}));
    QCOMPARE(other.takeSignals(service), QStringList(found(1, -1, -1)));
}

void CallStatisticsServiceTest::searchesInLocalTime()
{
    // The test and the phone's services are in one time zone.
    const QDateTime start = QDateTime(QDate(2026, 3, 3), QTime(0, 0), Qt::UTC).toLocalTime();
    for (const int meaning : {local, zone}) {
        const WireTime wireStart{{start.date().year(), start.date().month(), start.date().day()},
                                 {start.time().hour(), start.time().minute(), 0, 0},
                                 meaning};
        QCOMPARE(search(0, 0, wireStart, open), QStringLiteral("reply()"));
        QCOMPARE(m_client->takeSignals(service), QStringList(found(-1, 1, 1)));
    }
}

void CallStatisticsServiceTest::keepsTheLog()
{
    QCOMPARE(
        log({QStringLiteral("outgoing"), QStringLiteral("12"), QStringLiteral("2026-04-01T09:00:00+03:00")}),
        QStringLiteral("reply(The log has 6 calls)"));
    QCOMPARE(log({QStringLiteral("missed")}), QStringLiteral("reply(The log has 7 calls)"));
    m_client->control(QStringLiteral("StopService"), {service});
    m_client->control(QStringLiteral("StartService"), {service});

    const QByteArray json
        = m_client->control(QStringLiteral("State")).arguments().first().toString().toUtf8();
    const QJsonArray calls = QJsonDocument::fromJson(json).object().value(QLatin1String("callLog")).toArray();
    QCOMPARE(calls.size(), 7);
    QCOMPARE(calls.at(5).toObject(),
             QJsonObject({{QStringLiteral("time"), QStringLiteral("2026-04-01T06:00:00Z")},
                          {QStringLiteral("direction"), QStringLiteral("outgoing")},
                          {QStringLiteral("seconds"), 12}}));
    QCOMPARE(search(1, 1, {{2026, 4, 1}, {6, 0, 0, 0}, utc}, open), QStringLiteral("reply()"));
    QCOMPARE(m_client->takeSignals(service),
             QStringList(QStringLiteral("searchFinished(true, [(%1, 12)])").arg(firstOfMarch + 31 * day)));
}

void CallStatisticsServiceTest::refusesWhatIsNoCall_data()
{
    QTest::addColumn<QStringList>("arguments");
    QTest::addColumn<QString>("reason");
    const auto row = [](const char *arguments, const char *reason) {
        QTest::newRow(arguments) << QString::fromLatin1(arguments).split(QLatin1Char(' '))
                                 << QString::fromLatin1(reason);
    };
    row("dialled 1", "\"dialled\" is no kind of call; there are outgoing, incoming and missed ones");
    row("incoming -1", "\"-1\" is no duration; it is a number of seconds, at most a day's");
    row("incoming 86401", "\"86401\" is no duration; it is a number of seconds, at most a day's");
    row("incoming long", "\"long\" is no duration; it is a number of seconds, at most a day's");
    row("missed 3", "A missed call has no duration; leave it out or make it 0");
    row("incoming 3 noon", "\"noon\" is no time; one is 2026-03-02T09:15:00Z");
}

void CallStatisticsServiceTest::refusesWhatIsNoCall()
{
    QFETCH(QStringList, arguments);
    QFETCH(QString, reason);
    QCOMPARE(log(arguments), QStringLiteral("org.corvaneos.simulator.Error.InvalidArguments: ") + reason);
}

QTEST_GUILESS_MAIN(CallStatisticsServiceTest)
#include "callstatisticsservice_test.moc"
