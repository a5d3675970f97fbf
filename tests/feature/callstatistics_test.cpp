// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"
#include "texts.h"
#include "waiting.h"

#include <corvanemdm/callstatistics.h>

#include <QtCore/QTimeZone>
#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusMetaType>
#include <QtTest/QtTest>

#include <limits>
#include <memory>

using Corvane::Mdm::CallStatistics;
using Results = QList<CallStatistics::Result>;

/** A result as the service sends it. */
struct WireResult {
    qint64 time;
    qint32 value;
};
Q_DECLARE_METATYPE(WireResult)

QDBusArgument &operator<<(QDBusArgument &out, const WireResult &result)
{
    out.beginStructure();
    out << result.time << result.value;
    out.endStructure();
    return out;
}

const QDBusArgument &operator>>(const QDBusArgument &in, WireResult &result)
{
    in.beginStructure();
    in >> result.time >> result.value;
    in.endStructure();
    return in;
}

namespace
{

const QString Service = QStringLiteral("org.corvaneos.mdmproxy");
const QString Path = QStringLiteral("/Corvane/Mdm/Proxy/CallStatistics");
const QString Interface = QStringLiteral("org.corvaneos.mdmproxy.callstatistics");

const char *const Open = "((0, 0, 0), (-1, -1, -1, -1), 0)";

QDateTime utc(const char *text)
{
    return text[0] ? QDateTime::fromString(QString::fromLatin1(text), Qt::ISODateWithMs) : QDateTime();
}

QVariant wire(const QList<WireResult> &results)
{
    return QVariant::fromValue(results);
}

} // namespace

class CallStatisticsTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void init();
    void cleanup();

    void constructionSendsNothing();
    void searchSendsTheFourValues_data();
    void searchSendsTheFourValues();
    void rangeThatIsNone_data();
    void rangeThatIsNone();
    void resultsBecomeUtcTimes();
    void timesThatNoDateHas();
    void failureHasNoResults();
    void signalOfAnotherClientIsNotTaken();
    void signalsOfAnotherShapeAreNotTaken();
    void everyObjectGetsEveryAnswer();
    void severalSearchesAtATime();
    void refusedSearchIsLogged();
    void serviceThatIsNotThere();
    void serviceThatGoesAndComesBack();
    void destructionWithACallPending();
    void deletionInASlot();
    void worksThroughTheMetaObject();

private:
    QStringList callsFor(const CallStatistics::Filter &filter);
    void emitFinished(bool success, const QList<WireResult> &results);

    std::unique_ptr<Phone> m_phone;
};

void CallStatisticsTest::initTestCase()
{
    qDBusRegisterMetaType<WireResult>();
    qDBusRegisterMetaType<QList<WireResult>>();
}

void CallStatisticsTest::init()
{
    m_phone = std::make_unique<Phone>();
}

void CallStatisticsTest::cleanup()
{
    m_phone->clearFaults();
    m_phone->startService(Service);
}

QStringList CallStatisticsTest::callsFor(const CallStatistics::Filter &filter)
{
    CallStatistics statistics;
    statistics.search(filter);
    m_phone->settle(Service);
    return m_phone->takeJournal(Service);
}

void CallStatisticsTest::emitFinished(bool success, const QList<WireResult> &results)
{
    m_phone->emitSignal(Service, Path, Interface, QStringLiteral("searchFinished"), {success, wire(results)});
}

void CallStatisticsTest::constructionSendsNothing()
{
    const CallStatistics statistics;
    m_phone->settle(Service);
    QCOMPARE(m_phone->takeJournal(Service), QStringList());
    const CallStatistics::Filter filter;
    QCOMPARE(filter.firstSelector, 0);
    QCOMPARE(filter.secondSelector, 0);
    QVERIFY(!filter.start.isValid() && !filter.end.isValid());
}

void CallStatisticsTest::searchSendsTheFourValues_data()
{
    QTest::addColumn<int>("first");
    QTest::addColumn<int>("second");
    QTest::addColumn<QDateTime>("start");
    QTest::addColumn<QDateTime>("end");
    QTest::addColumn<QString>("arguments");

    const QDateTime start = utc("2026-03-01T10:20:30.400Z");
    const QDateTime end = utc("2026-03-02T00:00:00Z");
    const QString startText = QStringLiteral("((2026, 3, 1), (10, 20, 30, 400), 1)");
    const QString endText = QStringLiteral("((2026, 3, 2), (0, 0, 0, 0), 1)");
    const QString open = QString::fromLatin1(Open);
    const auto arguments = [](int first, int second, const QString &from, const QString &to) {
        return QStringLiteral("(%1, %2, %3, %4)").arg(first).arg(second).arg(from, to);
    };
    QTest::newRow("range") << 1 << 2 << start << end << arguments(1, 2, startText, endText);
    QTest::newRow("selectors pass through")
        << -1 << std::numeric_limits<int>::max() << start << end
        << arguments(-1, std::numeric_limits<int>::max(), startText, endText);
    QTest::newRow("open") << 0 << 0 << QDateTime() << QDateTime() << arguments(0, 0, open, open);
    QTest::newRow("open, in UTC") << 0 << 0 << QDateTime(QDate(), QTime(), Qt::UTC) << QDateTime()
                                  << arguments(0, 0, QStringLiteral("((0, 0, 0), (-1, -1, -1, -1), 1)"),
                                               open);
    QTest::newRow("open start") << 0 << 0 << QDateTime() << end << arguments(0, 0, open, endText);
    QTest::newRow("open end") << 0 << 0 << start << QDateTime() << arguments(0, 0, startText, open);
    QTest::newRow("local time") << 0 << 0 << QDateTime(QDate(2026, 3, 1), QTime(1, 2, 3)) << end
                                << arguments(0, 0, QStringLiteral("((2026, 3, 1), (1, 2, 3, 0), 0)"),
                                             endText);
    // Neither the offset nor the zone has a place in Qt's form.
    QTest::newRow("offset") << 0 << 0 << utc("2026-03-01T01:02:03+02:00") << end
                            << arguments(0, 0, QStringLiteral("((2026, 3, 1), (1, 2, 3, 0), 2)"), endText);
    QTest::newRow("zone") << 0 << 0
                          << QDateTime(QDate(2026, 3, 1), QTime(1, 2, 3), QTimeZone("Europe/Helsinki")) << end
                          << arguments(0, 0, QStringLiteral("((2026, 3, 1), (1, 2, 3, 0), 3)"), endText);
}

void CallStatisticsTest::searchSendsTheFourValues()
{
    QFETCH(int, first);
    QFETCH(int, second);
    QFETCH(QDateTime, start);
    QFETCH(QDateTime, end);
    QFETCH(QString, arguments);
    MessageLog log;
    QCOMPARE(callsFor({first, second, start, end}),
             QStringList(QStringLiteral("/Corvane/Mdm/Proxy/CallStatistics search ") + arguments));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void CallStatisticsTest::rangeThatIsNone_data()
{
    QTest::addColumn<QDateTime>("start");
    QTest::addColumn<QDateTime>("end");
    QTest::newRow("empty") << utc("2026-03-01T10:00:00Z") << utc("2026-03-01T10:00:00Z");
    QTest::newRow("empty, in two zones") << utc("2026-03-01T10:00:00Z") << utc("2026-03-01T12:00:00+02:00");
    QTest::newRow("inverted") << utc("2026-03-01T10:00:00.001Z") << utc("2026-03-01T10:00:00Z");
}

void CallStatisticsTest::rangeThatIsNone()
{
    QFETCH(QDateTime, start);
    QFETCH(QDateTime, end);
    CallStatistics statistics;
    SignalSequence seen(&statistics);
    MessageLog log;
    statistics.search({0, 0, start, end});
    const QStringList warnings = log.takeWarnings();
    QCOMPARE(warnings.size(), 2);
    QCOMPARE(warnings.first(), QStringLiteral("Error: filter end date/time is not after start date/time"));
    // Qt's own words on the call that finds nobody.
    QVERIFY2(warnings.last().startsWith(QLatin1String(
                 "QMetaObject::invokeMethod: No such method Corvane::Mdm::CallStatistics::searchFinished"
                 "(bool,QList<Corvane::Mdm::CallStatisticsPrivate::StatisticData>)")),
             qPrintable(warnings.last()));
    m_phone->settle(Service);
    QCOMPARE(m_phone->takeJournal(Service), QStringList());
    QCOMPARE(seen.take(), QStringList());
    QCOMPARE(log.takeWarnings(), QStringList());
}

void CallStatisticsTest::resultsBecomeUtcTimes()
{
    CallStatistics statistics;
    SignalSequence seen(&statistics);
    Results results;
    connect(&statistics, &CallStatistics::searchFinished, this,
            [&results](bool, const Results &found) { results = found; });
    // In the service's order, whatever it is.
    emitFinished(true,
                 {{1772323200, 3},
                  {0, std::numeric_limits<qint32>::min()},
                  {-1, std::numeric_limits<qint32>::max()},
                  {0, 0}});
    QCOMPARE(seen.take(),
             texts({"searchFinished(true, [2026-03-01T00:00:00Z=3 1970-01-01T00:00:00Z=-2147483648 "
                    "1969-12-31T23:59:59Z=2147483647 1970-01-01T00:00:00Z=0])"}));
    QCOMPARE(results.size(), 4);
    for (const CallStatistics::Result &result : qAsConst(results))
        QCOMPARE(result.time.timeSpec(), Qt::UTC);
    QCOMPARE(results.at(1).time, QDateTime(QDate(1970, 1, 1), QTime(0, 0), Qt::UTC));

    emitFinished(true, {});
    QCOMPARE(seen.take(), texts({"searchFinished(true, [])"}));
}

void CallStatisticsTest::timesThatNoDateHas()
{
    CallStatistics statistics;
    Results results;
    connect(&statistics, &CallStatistics::searchFinished, this,
            [&results](bool, const Results &found) { results = found; });
    emitFinished(true,
                 {{std::numeric_limits<qint64>::max(), 1}, {std::numeric_limits<qint64>::min(), 2}, {60, 3}});
    QCOMPARE(results.size(), 3);
    QVERIFY(!results.at(0).time.isValid());
    QVERIFY(!results.at(1).time.isValid());
    QCOMPARE(results.at(2).time, utc("1970-01-01T00:01:00Z"));
    QCOMPARE(results.at(1).value, 2);
}

void CallStatisticsTest::failureHasNoResults()
{
    CallStatistics statistics;
    SignalSequence seen(&statistics);
    emitFinished(false, {});
    emitFinished(false, {{0, 1}});
    QCOMPARE(seen.take(), texts({"searchFinished(false, [])", "searchFinished(false, [])"}));
}

void CallStatisticsTest::signalOfAnotherClientIsNotTaken()
{
    CallStatistics statistics;
    SignalSequence seen(&statistics);
    const QVariantList arguments{true, wire({{0, 1}})};
    m_phone->forgeSignal(Service, Path, Interface, QStringLiteral("searchFinished"), arguments);
    QCOMPARE(seen.take(), QStringList());
    m_phone->emitSignal(Service, Path, Interface, QStringLiteral("searchFinished"), arguments);
    QCOMPARE(seen.take().size(), 1);
}

void CallStatisticsTest::signalsOfAnotherShapeAreNotTaken()
{
    CallStatistics statistics;
    SignalSequence seen(&statistics);
    const auto emitAs = [this](const QString &path, const QString &interface, const QVariantList &arguments) {
        m_phone->emitSignal(Service, path, interface, QStringLiteral("searchFinished"), arguments);
    };
    emitAs(Path, Interface, {});
    emitAs(Path, Interface, {true});
    emitAs(Path, Interface, {1, wire({{0, 1}})});
    emitAs(Path, Interface, {true, QStringList()});
    emitAs(QStringLiteral("/Corvane/Mdm/Proxy/SoftwareUpdate"), Interface, {true, wire({{0, 1}})});
    emitAs(Path, QStringLiteral("org.corvaneos.mdmproxy.softwareupdate"), {true, wire({{0, 1}})});
    QCOMPARE(seen.take(), QStringList());
}

void CallStatisticsTest::everyObjectGetsEveryAnswer()
{
    CallStatistics asking;
    auto gone = std::make_unique<CallStatistics>();
    CallStatistics listening;
    gone.reset();
    SignalSequence askingSeen(&asking);
    SignalSequence listeningSeen(&listening);
    asking.search({2, 0, QDateTime(), QDateTime()});
    QVERIFY(askingSeen.waitFor(1));
    QVERIFY(listeningSeen.waitFor(1));
    m_phone->settle(Service);
    const QStringList expected = texts({"searchFinished(true, [2026-03-01T00:00:00Z=1])"});
    QCOMPARE(askingSeen.take(), expected);
    QCOMPARE(listeningSeen.take(), expected);
    QCOMPARE(m_phone->takeJournal(Service).size(), 1);
}

void CallStatisticsTest::severalSearchesAtATime()
{
    CallStatistics statistics;
    SignalSequence seen(&statistics);
    statistics.search({3, 0, QDateTime(), QDateTime()});
    statistics.search({2, 1, QDateTime(), QDateTime()});
    statistics.search({9, 0, QDateTime(), QDateTime()});
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(seen.waitFor(3));
    QCOMPARE(seen.take(),
             texts({"searchFinished(true, [2026-03-01T00:00:00Z=1])",
                    "searchFinished(true, [2026-03-01T00:00:00Z=5])", "searchFinished(false, [])"}));
}

void CallStatisticsTest::refusedSearchIsLogged()
{
    CallStatistics statistics;
    SignalSequence seen(&statistics);
    m_phone->failCalls(Service, Path, QStringLiteral("search"), QStringLiteral("com.example.Broken"),
                       QStringLiteral("Out of order"));
    MessageLog log;
    statistics.search({});
    QCOMPARE(log.takeWarnings(), QStringList());
    m_phone->settle(Service);
    QCOMPARE(log.takeWarnings(), texts({"search() failed: \"com.example.Broken\" \"Out of order\""}));
    QCOMPARE(seen.take(), QStringList());

    // An answer that nobody asked for is no error.
    m_phone->clearFaults();
    m_phone->answerCalls(Service, Path, QStringLiteral("search"), {QStringLiteral("done")});
    statistics.search({});
    m_phone->settle(Service);
    QCOMPARE(log.takeWarnings(), QStringList());
    QCOMPARE(seen.take(), QStringList());
}

void CallStatisticsTest::serviceThatIsNotThere()
{
    m_phone->stopService(Service);
    MessageLog log;
    CallStatistics statistics;
    SignalSequence seen(&statistics);
    QCOMPARE(log.takeWarnings(), QStringList());
    statistics.search({});
    QStringList warnings;
    QVERIFY(waitUntil([&] { return !(warnings += log.takeWarnings()).isEmpty(); }));
    QCOMPARE(warnings.size(), 1);
    QVERIFY2(warnings.first().startsWith(
                 QLatin1String("search() failed: \"org.freedesktop.DBus.Error.ServiceUnknown\" \"")),
             qPrintable(warnings.first()));

    m_phone->startService(Service);
    statistics.search({2, 0, QDateTime(), QDateTime()});
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), texts({"searchFinished(true, [2026-03-01T00:00:00Z=1])"}));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void CallStatisticsTest::serviceThatGoesAndComesBack()
{
    CallStatistics statistics;
    SignalSequence seen(&statistics);
    m_phone->stopService(Service);
    m_phone->startService(Service);
    statistics.search({3, 0, QDateTime(), QDateTime()});
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), texts({"searchFinished(true, [2026-03-01T00:00:00Z=1])"}));
}

void CallStatisticsTest::destructionWithACallPending()
{
    m_phone->delayCalls(Service, Path, QString(), 20);
    MessageLog log;
    {
        CallStatistics statistics;
        statistics.search({});
    }
    m_phone->settle(Service);
    QCOMPARE(log.takeWarnings(), QStringList());
}

void CallStatisticsTest::deletionInASlot()
{
    for (const bool success : {true, false}) {
        auto statistics = std::make_unique<CallStatistics>();
        connect(statistics.get(), &CallStatistics::searchFinished, this, [&] { statistics.reset(); });
        emitFinished(success, {{0, 1}});
        QVERIFY(!statistics);
    }
}

void CallStatisticsTest::worksThroughTheMetaObject()
{
    CallStatistics statistics;
    const QSignalSpy spy(&statistics, SIGNAL(searchFinished(bool, QList<CallStatistics::Result>)));
    QVERIFY(spy.isValid());
    Results queued;
    connect(
        &statistics, &CallStatistics::searchFinished, this,
        [&queued](bool, const Results &found) { queued = found; }, Qt::QueuedConnection);
    const CallStatistics::Filter filter{2, 1, QDateTime(), QDateTime()};
    QVERIFY(QMetaObject::invokeMethod(&statistics, "search", Qt::QueuedConnection,
                                      Q_ARG(Corvane::Mdm::CallStatistics::Filter, filter)));
    QVERIFY(waitUntil([&] { return !queued.isEmpty(); }));
    QCOMPARE(queued.first().value, 5);
    QCOMPARE(spy.size(), 1);
    QCOMPARE(spy.first().first().toBool(), true);
    QCOMPARE(spy.first().last().value<Results>().first().time, utc("2026-03-01T00:00:00Z"));
    QCOMPARE(QMetaType::type("QList<Corvane::Mdm::CallStatistics::Result>"), qMetaTypeId<Results>());
    QVERIFY(QMetaType::type("Corvane::Mdm::CallStatisticsPrivate::StatisticData") != QMetaType::UnknownType);
    QVERIFY(QMetaType::type("QList<Corvane::Mdm::CallStatisticsPrivate::StatisticData>")
            != QMetaType::UnknownType);
}

QTEST_GUILESS_MAIN(CallStatisticsTest)
#include "callstatistics_test.moc"
