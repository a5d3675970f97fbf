// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"
#include "texts.h"
#include "waiting.h"

#include <corvanemdm/locationinfo.h>

#include <QtCore/QMap>
#include <QtCore/QMetaProperty>
#include <QtTest/QtTest>

#include <cmath>
#include <functional>
#include <limits>
#include <memory>
#include <tuple>

using Corvane::Mdm::LocationInfo;

namespace
{

const QString Service = QStringLiteral("org.corvaneos.mdmproxy");
const QString Path = QStringLiteral("/Corvane/Mdm/Proxy/LocationInfo");
const QString Interface = QStringLiteral("org.corvaneos.mdmproxy.locationinfo");

const QString Failed = QStringLiteral("QDBusError(\"com.example.Broken\", \"Out of order\")");

/** "latitude longitude altitude milliseconds", "none" without a time. */
QString textOf(const LocationInfo::Position &position)
{
    return QStringLiteral("%1 %2 %3 %4")
        .arg(position.latitude)
        .arg(position.longitude)
        .arg(position.altitude)
        .arg(position.timestamp.isValid() ? QString::number(position.timestamp.toMSecsSinceEpoch())
                                          : QStringLiteral("none"));
}

/** What can happen to an object. */
enum Event {
    Start,
    Stop,
    Request,
    PositionReported,
    SatellitesReported,
    PositionRead,
    PositionReadInVain,
    SatellitesRead,
    SatellitesReadInVain
};
const QVector<Event> allEvents{Start,
                               Stop,
                               Request,
                               PositionReported,
                               SatellitesReported,
                               PositionRead,
                               PositionReadInVain,
                               SatellitesRead,
                               SatellitesReadInVain};
const char *const eventNames[]
    = {"start",         "stop",        "request",         "position report", "satellites",
       "read position", "no position", "read satellites", "no satellites"};

QString textOf(const QVector<Event> &events)
{
    QStringList names;
    for (const Event event : events)
        names << QLatin1String(eventNames[event]);
    return names.join(QLatin1String(", "));
}

/** What is seen of an event: the calls that the service gets, and the signals. */
struct Effects {
    QStringList calls;
    QStringList signalled;

    bool operator==(const Effects &other) const
    {
        return calls == other.calls && signalled == other.signalled;
    }
    QString toString() const
    {
        return calls.join(QLatin1Char(' ')) + QLatin1Char('|') + signalled.join(QLatin1Char(' '));
    }
};

/** The five flags of an object. */
struct Flags {
    bool positionStale = false;
    bool satellitesStale = false;
    bool positionOnce = false;
    bool satellitesOnce = false;
    bool running = false;

    auto tied() const
    {
        return std::tie(positionStale, satellitesStale, positionOnce, satellitesOnce, running);
    }
    bool operator<(const Flags &other) const { return tied() < other.tied(); }

    /** The table: what @p event does to the flags, and what is seen of it. */
    Effects apply(Event event);

private:
    Effects reported(bool *stale, bool *once, bool otherOnce, const char *signal);
};

Effects Flags::reported(bool *stale, bool *once, bool otherOnce, const char *signal)
{
    *stale = false;
    const bool ends = *once && !otherOnce && !running;
    const bool isTold = *once || running;
    *once = false;
    return {ends ? texts({"stopUpdates"}) : QStringList(), isTold ? texts({signal}) : QStringList()};
}

Effects Flags::apply(Event event)
{
    switch (event) {
    case Start:
        running = positionStale = satellitesStale = true;
        return {texts({"startUpdates"}), {}};
    case Stop:
        running = false;
        return {texts({"stopUpdates"}), {}};
    case Request:
        positionStale = satellitesStale = positionOnce = satellitesOnce = true;
        return {texts({"startUpdates"}), {}};
    case PositionReported:
        return reported(&positionStale, &positionOnce, satellitesOnce, "positionChanged()");
    case SatellitesReported:
        return reported(&satellitesStale, &satellitesOnce, positionOnce, "satellitesChanged()");
    case PositionRead:
        return {std::exchange(positionStale, false) ? texts({"position"}) : QStringList(), {}};
    case PositionReadInVain:
        return {positionStale ? texts({"position"}) : QStringList(), {}};
    case SatellitesRead:
    case SatellitesReadInVain:
        return {satellitesStale ? texts({"satellitesInUse", "satellitesInView"}) : QStringList(), {}};
    }
    return {};
}

} // namespace

class LocationInfoTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void nothingIsAskedAtFirst();
    void positionStrings_data();
    void positionStrings();
    void reportsUpdateSilentlyWhileIdle();
    void startAsksUntilTheFirstReport();
    void satellitesAreAskedForEachTime();
    void requestIsStoppedByTheSecondReport_data();
    void requestIsStoppedByTheSecondReport();
    void requestDuringContinuousUpdates();
    void garbageCountsAsAReport();
    void everyEventInEveryState();
    void failedCallsAreLogged();
    void failedFetchKeepsWhatIsKnown();
    void answersOfAnotherType();
    void signalsOfAnotherShapeAreNotTaken();
    void serviceThatIsNotThere();
    void serviceThatComesBack();
    void deletionInASlot_data();
    void deletionInASlot();
    void worksThroughTheMetaObject();
    void drivesAlongATrack();
    void oneFixOfTheReceiver();

private:
    void standIn();
    void report(const QString &position);
    void report(int inUse, int inView);
    QStringList calls();
    void perform(LocationInfo *info, Event event);
    void checkEvent(Flags state, const QVector<Event> &way, Event event, const QVector<Event> &probe);

    std::unique_ptr<Phone> m_phone;
};

void LocationInfoTest::init()
{
    m_phone = std::make_unique<Phone>();
}

void LocationInfoTest::cleanup()
{
    m_phone->clearFaults();
    m_phone->startService(Service);
    LocationInfo().stopUpdates();
    m_phone->settle(Service);
}

/** The proxy answers and does nothing: what the receiver reports is the test's to tell. */
void LocationInfoTest::standIn()
{
    m_phone->answerCalls(Service, Path, QStringLiteral("startUpdates"), {});
    m_phone->answerCalls(Service, Path, QStringLiteral("stopUpdates"), {});
    m_phone->answerCalls(Service, Path, QStringLiteral("position"), {QStringLiteral("1.5;-2.5;3;4000")});
    m_phone->answerCalls(Service, Path, QStringLiteral("satellitesInUse"), {5});
    m_phone->answerCalls(Service, Path, QStringLiteral("satellitesInView"), {9});
    m_phone->settle(Service);
    calls();
}

void LocationInfoTest::report(const QString &position)
{
    m_phone->emitSignal(Service, Path, Interface, QStringLiteral("positionChanged"), {position});
}

void LocationInfoTest::report(int inUse, int inView)
{
    m_phone->emitSignal(Service, Path, Interface, QStringLiteral("satellitesChanged"), {inUse, inView});
}

/** The names of the methods that were called. */
QStringList LocationInfoTest::calls()
{
    QStringList names;
    const QStringList journal = m_phone->takeJournal(Service);
    for (const QString &entry : journal)
        names << entry.section(QLatin1Char(' '), 1, 1);
    return names;
}

void LocationInfoTest::nothingIsAskedAtFirst()
{
    standIn();
    MessageLog log;
    const LocationInfo info;
    QCOMPARE(textOf(info.position()), QStringLiteral("0 0 0 none"));
    QCOMPARE(info.latitude(), 0.0);
    QCOMPARE(info.timestamp(), QDateTime());
    QCOMPARE(info.satellitesInUse(), -1);
    QCOMPARE(info.satellitesInView(), -1);
    QCOMPARE(calls(), QStringList());
    QCOMPARE(log.takeWarnings(), QStringList());
}

void LocationInfoTest::positionStrings_data()
{
    QTest::addColumn<QString>("text");
    QTest::addColumn<QString>("position");
    QTest::addColumn<bool>("isValid");
    const QString none = QStringLiteral("0 0 0 none");
    const auto row = [](const char *text, const QString &position, bool isValid) {
        QTest::newRow(text) << QString::fromLatin1(text) << position << isValid;
    };
    row("60.1699;24.9384;17.5;1772467385123", QStringLiteral("60.1699 24.9384 17.5 1772467385123"), true);
    row("-33.8688;-151.25;-3.5;-1000", QStringLiteral("-33.8688 -151.25 -3.5 -1000"), true);
    row("1e1;+2;0x3;4", QStringLiteral("10 2 0 4"), true);
    row("60,5;24.5;;", QStringLiteral("0 24.5 0 0"), true);
    row("north;east;up;now", QStringLiteral("0 0 0 0"), true);
    row(";;;", QStringLiteral("0 0 0 0"), true);
    row("1;2;3;4.5", QStringLiteral("1 2 3 0"), true);
    row("1;2;3;99999999999999999999", QStringLiteral("1 2 3 0"), true);
    row("1;2;3;9223372036854775807", QStringLiteral("1 2 3 9223372036854775807"), true);
    row("", none, false);
    row("1", none, false);
    row("1;2;3", none, false);
    row("1;2;3;4;5", none, false);
    row("1;2;3;4;", none, false);
}

void LocationInfoTest::positionStrings()
{
    QFETCH(QString, text);
    QFETCH(QString, position);
    QFETCH(bool, isValid);
    const QStringList complaint = isValid
        ? QStringList()
        : QStringList(QStringLiteral("Invalid position information received: \"%1\"").arg(text));
    standIn();
    LocationInfo info;
    MessageLog log;
    report(QStringLiteral("7;7;7;7"));
    report(text);
    QCOMPARE(log.takeWarnings(), complaint);
    QCOMPARE(textOf(info.position()), position);
    QCOMPARE(info.timestamp().timeSpec(), position.endsWith(QLatin1String("none")) ? Qt::LocalTime : Qt::UTC);

    // The same text as the answer to a question.
    m_phone->answerCalls(Service, Path, QStringLiteral("position"), {text});
    info.startUpdates();
    QCOMPARE(textOf(info.position()), position);
    QCOMPARE(log.takeWarnings(), complaint);
    // It was an answer: it is not asked again.
    QCOMPARE(textOf(info.position()), position);
    QCOMPARE(log.takeWarnings(), QStringList());
    QCOMPARE(calls(), texts({"startUpdates", "position"}));
}

void LocationInfoTest::reportsUpdateSilentlyWhileIdle()
{
    standIn();
    LocationInfo info;
    SignalSequence seen(&info);
    report(QStringLiteral("1;2;3;4"));
    report(6, 11);
    QCOMPARE(textOf(info.position()), QStringLiteral("1 2 3 4"));
    QCOMPARE(info.latitude(), 1.0);
    QCOMPARE(info.longitude(), 2.0);
    QCOMPARE(info.altitude(), 3.0);
    QCOMPARE(info.timestamp().toMSecsSinceEpoch(), 4);
    QCOMPARE(info.satellitesInUse(), 6);
    QCOMPARE(info.satellitesInView(), 11);
    QCOMPARE(seen.take(), QStringList());
    QCOMPARE(calls(), QStringList());
}

void LocationInfoTest::startAsksUntilTheFirstReport()
{
    standIn();
    LocationInfo info;
    SignalSequence seen(&info);
    report(QStringLiteral("1;2;3;4"));
    info.startUpdates();
    QCOMPARE(textOf(info.position()), QStringLiteral("1.5 -2.5 3 4000"));
    QCOMPARE(info.altitude(), 3.0);
    QCOMPARE(calls(), texts({"startUpdates", "position"}));
    report(QStringLiteral("5;6;7;8"));
    report(QStringLiteral("5;6;7;8"));
    QCOMPARE(info.longitude(), 6.0);
    QCOMPARE(seen.take(), texts({"positionChanged()", "positionChanged()"}));
    info.stopUpdates();
    report(QStringLiteral("9;9;9;9"));
    QCOMPARE(info.longitude(), 9.0);
    QCOMPARE(seen.take(), QStringList());
    QCOMPARE(calls(), texts({"stopUpdates"}));

    // Each of the fields can be the one that asks.
    using Getter = std::function<void()>;
    const Getter getters[]
        = {[&] { QCOMPARE(info.latitude(), 1.5); }, [&] { QCOMPARE(info.longitude(), -2.5); },
           [&] { QCOMPARE(info.altitude(), 3.0); },
           [&] {
               QCOMPARE(info.timestamp().toMSecsSinceEpoch(), 4000);
           }};
    for (const Getter &getter : getters) {
        info.startUpdates();
        getter();
        getter();
        QCOMPARE(calls(), texts({"startUpdates", "position"}));
    }
}

void LocationInfoTest::satellitesAreAskedForEachTime()
{
    standIn();
    LocationInfo info;
    info.startUpdates();
    QCOMPARE(info.satellitesInUse(), 5);
    QCOMPARE(info.satellitesInUse(), 5);
    QCOMPARE(info.satellitesInView(), 9);
    QCOMPARE(calls(), texts({"startUpdates", "satellitesInUse", "satellitesInUse", "satellitesInView"}));
    report(0, -1);
    QCOMPARE(info.satellitesInUse(), 0);
    QCOMPARE(info.satellitesInView(), -1);
    QCOMPARE(calls(), QStringList());
    // What was asked for last is kept, too.
    info.requestUpdate();
    QCOMPARE(info.satellitesInUse(), 5);
    report(std::numeric_limits<int>::max(), std::numeric_limits<int>::min());
    QCOMPARE(info.satellitesInUse(), std::numeric_limits<int>::max());
    QCOMPARE(info.satellitesInView(), std::numeric_limits<int>::min());
}

void LocationInfoTest::requestIsStoppedByTheSecondReport_data()
{
    QTest::addColumn<bool>("positionFirst");
    QTest::newRow("position first") << true;
    QTest::newRow("satellites first") << false;
}

void LocationInfoTest::requestIsStoppedByTheSecondReport()
{
    QFETCH(bool, positionFirst);
    standIn();
    LocationInfo info;
    SignalSequence seen(&info);
    info.requestUpdate();
    QCOMPARE(calls(), texts({"startUpdates"}));
    for (int times = 0; times < 2; ++times) {
        positionFirst ? report(QStringLiteral("1;2;3;4")) : report(4, 8);
        QCOMPARE(calls(), QStringList());
    }
    QCOMPARE(seen.take(), texts({positionFirst ? "positionChanged()" : "satellitesChanged()"}));
    positionFirst ? report(4, 8) : report(QStringLiteral("1;2;3;4"));
    QCOMPARE(calls(), texts({"stopUpdates"}));
    QCOMPARE(seen.take(), texts({positionFirst ? "satellitesChanged()" : "positionChanged()"}));
    report(QStringLiteral("5;2;3;4"));
    report(5, 8);
    QCOMPARE(seen.take(), QStringList());
    QCOMPARE(calls(), QStringList());
    QCOMPARE(info.latitude(), 5.0);
    QCOMPARE(info.satellitesInUse(), 5);
}

void LocationInfoTest::requestDuringContinuousUpdates()
{
    standIn();
    LocationInfo info;
    SignalSequence seen(&info);
    info.startUpdates();
    info.requestUpdate();
    for (int times = 0; times < 2; ++times) {
        report(QStringLiteral("1;2;3;4"));
        report(4, 8);
    }
    QCOMPARE(calls(), texts({"startUpdates", "startUpdates"}));
    QCOMPARE(seen.take(),
             texts({"positionChanged()", "satellitesChanged()", "positionChanged()", "satellitesChanged()"}));
    // Updates that end before the request is fulfilled leave it to end by itself.
    info.requestUpdate();
    info.stopUpdates();
    report(QStringLiteral("1;2;3;4"));
    report(4, 8);
    QCOMPARE(calls(), texts({"startUpdates", "stopUpdates", "stopUpdates"}));
    QCOMPARE(seen.take(), texts({"positionChanged()", "satellitesChanged()"}));
}

void LocationInfoTest::garbageCountsAsAReport()
{
    standIn();
    LocationInfo info;
    SignalSequence seen(&info);
    MessageLog log;
    for (const char *text : {"1;2;3", "1;2;3;4;5"}) {
        info.requestUpdate();
        report(4, 8);
        report(QLatin1String(text));
        QCOMPARE(textOf(info.position()), QStringLiteral("0 0 0 none"));
        QCOMPARE(calls(), texts({"startUpdates", "stopUpdates"}));
        QCOMPARE(seen.take(), texts({"satellitesChanged()", "positionChanged()"}));
        QCOMPARE(
            log.takeWarnings(),
            QStringList(
                QStringLiteral("Invalid position information received: \"%1\"").arg(QLatin1String(text))));
    }
}

void LocationInfoTest::perform(LocationInfo *info, Event event)
{
    switch (event) {
    case Start:
        info->startUpdates();
        break;
    case Stop:
        info->stopUpdates();
        break;
    case Request:
        info->requestUpdate();
        break;
    case PositionReported:
        report(QStringLiteral("1;2;3;4"));
        break;
    case SatellitesReported:
        report(4, 8);
        break;
    case PositionRead:
        info->position();
        break;
    case SatellitesRead:
        info->satellitesInUse();
        info->satellitesInView();
        break;
    case PositionReadInVain:
    case SatellitesReadInVain:
        m_phone->failCalls(Service, Path, QString(), QStringLiteral("com.example.Broken"), QString());
        perform(info, event == PositionReadInVain ? PositionRead : SatellitesRead);
        break;
    }
}

void LocationInfoTest::everyEventInEveryState()
{
    // The shortest way to each state that can be reached.
    QMap<Flags, QVector<Event>> ways{{Flags(), {}}};
    QVector<Flags> ahead{Flags()};
    while (!ahead.isEmpty()) {
        const Flags state = ahead.takeFirst();
        for (const Event event : allEvents) {
            Flags next = state;
            next.apply(event);
            if (ways.contains(next))
                continue;
            ways.insert(next, ways.value(state) + QVector<Event>{event});
            ahead.append(next);
        }
    }
    QCOMPARE(ways.size(), 24);

    standIn();
    // What shows all flags. Only after a stop do reports tell what was requested during continuous updates.
    const QVector<Event> probe{SatellitesRead, PositionRead, SatellitesReported, PositionReported};
    const QVector<Event> probeAfterStop{Stop, SatellitesReported, PositionReported};
    const MessageLog log;
    for (auto way = ways.cbegin(); way != ways.cend(); ++way) {
        for (const Event event : allEvents) {
            checkEvent(way.key(), *way, event, probe);
            if (way.key().running || event == Start)
                checkEvent(way.key(), *way, event, probeAfterStop);
            if (QTest::currentTestFailed())
                return;
        }
    }
}

void LocationInfoTest::checkEvent(Flags state, const QVector<Event> &way, Event event,
                                  const QVector<Event> &probe)
{
    LocationInfo info;
    SignalSequence seen(&info);
    for (const Event each : way)
        perform(&info, each);
    calls();
    seen.take();
    for (const Event each : QVector<Event>{event} + probe) {
        const Effects expected = state.apply(each);
        perform(&info, each);
        const Effects effects{calls(), seen.take()};
        QVERIFY2(
            effects == expected,
            qPrintable(QStringLiteral("%1 after %2 and %3: %4 in place of %5")
                           .arg(QLatin1String(eventNames[each]), textOf(way),
                                QLatin1String(eventNames[event]), effects.toString(), expected.toString())));
        if (each == PositionReadInVain || each == SatellitesReadInVain)
            standIn();
    }
}

void LocationInfoTest::failedCallsAreLogged()
{
    standIn();
    LocationInfo info;
    report(QStringLiteral("1;2;3;4"));
    m_phone->failCalls(Service, Path, QString(), QStringLiteral("com.example.Broken"),
                       QStringLiteral("Out of order"));
    MessageLog log;
    info.startUpdates();
    QCOMPARE(log.takeWarnings(), QStringList(QLatin1String("Failed to start location updates: ") + Failed));
    info.requestUpdate();
    QCOMPARE(log.takeWarnings(), QStringList(QLatin1String("Failed to request location update: ") + Failed));
    QCOMPARE(textOf(info.position()), QStringLiteral("0 0 0 none"));
    QCOMPARE(log.takeWarnings(), QStringList(QLatin1String("Failed to retrieve position: ") + Failed));
    QCOMPARE(info.satellitesInUse(), -1);
    QCOMPARE(log.takeWarnings(),
             QStringList(QLatin1String("Failed to retrieve satellites in use: ") + Failed));
    QCOMPARE(info.satellitesInView(), -1);
    QCOMPARE(log.takeWarnings(),
             QStringList(QLatin1String("Failed to retrieve satellites in view: ") + Failed));
    info.stopUpdates();
    QCOMPARE(log.takeWarnings(), QStringList(QLatin1String("Failed to stop location updates: ") + Failed));

    // The flags stay as they were set before the calls failed.
    SignalSequence seen(&info);
    report(QStringLiteral("1;2;3;4"));
    report(4, 8);
    QCOMPARE(seen.take(), texts({"positionChanged()", "satellitesChanged()"}));
    QCOMPARE(log.takeWarnings(), QStringList(QLatin1String("Failed to stop location updates: ") + Failed));
}

void LocationInfoTest::failedFetchKeepsWhatIsKnown()
{
    standIn();
    LocationInfo info;
    report(QStringLiteral("1;2;3;4"));
    report(4, 8);
    info.startUpdates();
    m_phone->failCalls(Service, Path, QString(), QStringLiteral("com.example.Broken"), QString());
    const MessageLog log;
    QCOMPARE(textOf(info.position()), QStringLiteral("0 0 0 none"));
    QCOMPARE(info.longitude(), 0.0);
    QCOMPARE(info.satellitesInUse(), -1);
    m_phone->clearFaults();
    standIn();
    // The next read tries again.
    QCOMPARE(textOf(info.position()), QStringLiteral("1.5 -2.5 3 4000"));
    QCOMPARE(info.satellitesInUse(), 5);
}

void LocationInfoTest::answersOfAnotherType()
{
    m_phone->answerCalls(Service, Path, QString(), {true});
    LocationInfo info;
    MessageLog log;
    info.startUpdates();
    // What these answer is not read.
    QCOMPARE(log.takeWarnings(), QStringList());
    QCOMPARE(textOf(info.position()), QStringLiteral("0 0 0 none"));
    QCOMPARE(info.satellitesInUse(), -1);
    QCOMPARE(info.satellitesInView(), -1);
    const QString unexpected = QStringLiteral("QDBusError(\"org.freedesktop.DBus.Error.InvalidSignature\", "
                                              "\"Unexpected reply signature: got \\\"b\\\" (bool), expected "
                                              "\\\"%1\\\" (%2)\")");
    const QString noText = unexpected.arg(QLatin1String("s"), QLatin1String("QString"));
    const QString noNumber = unexpected.arg(QLatin1String("i"), QLatin1String("int"));
    QCOMPARE(log.takeWarnings(),
             QStringList({QLatin1String("Failed to retrieve position: ") + noText,
                          QLatin1String("Failed to retrieve satellites in use: ") + noNumber,
                          QLatin1String("Failed to retrieve satellites in view: ") + noNumber}));
}

void LocationInfoTest::signalsOfAnotherShapeAreNotTaken()
{
    standIn();
    LocationInfo info;
    report(QStringLiteral("1;2;3;4"));
    report(4, 8);
    const auto emitAs = [this](const QString &path, const QString &interface, const char *member,
                               const QVariantList &arguments) {
        m_phone->emitSignal(Service, path, interface, QLatin1String(member), arguments);
    };
    emitAs(Path, Interface, "positionChanged", {});
    emitAs(Path, Interface, "positionChanged", {7});
    emitAs(Path, Interface, "satellitesChanged", {7});
    emitAs(Path, Interface, "satellitesChanged", {7U, 7U});
    emitAs(Path, Interface, "satellitesChanged", {QStringLiteral("7"), 7});
    const QString otherPath = QStringLiteral("/Corvane/Mdm/Proxy/NotificationInfo");
    emitAs(otherPath, Interface, "satellitesChanged", {7, 7});
    emitAs(Path, QStringLiteral("org.corvaneos.mdmproxy.notificationinfo"), "satellitesChanged", {7, 7});
    QCOMPARE(textOf(info.position()), QStringLiteral("1 2 3 4"));
    QCOMPARE(info.satellitesInUse(), 4);
    QCOMPARE(info.satellitesInView(), 8);
}

void LocationInfoTest::serviceThatIsNotThere()
{
    m_phone->stopService(Service);
    MessageLog log;
    LocationInfo info;
    QCOMPARE(info.satellitesInUse(), -1);
    QCOMPARE(log.takeWarnings(), QStringList());
    info.startUpdates();
    QCOMPARE(info.satellitesInUse(), -1);
    QCOMPARE(textOf(info.position()), QStringLiteral("0 0 0 none"));
    const QStringList warnings = log.takeWarnings();
    QCOMPARE(warnings.size(), 3);
    QVERIFY2(warnings.first().startsWith(
                 QLatin1String("Failed to start location updates: "
                               "QDBusError(\"org.freedesktop.DBus.Error.ServiceUnknown\"")),
             qPrintable(warnings.first()));
}

void LocationInfoTest::serviceThatComesBack()
{
    m_phone->stopService(Service);
    const MessageLog log;
    LocationInfo info;
    SignalSequence seen(&info);
    m_phone->startService(Service);
    info.requestUpdate();
    QVERIFY(waitUntil([&] { return seen.signalsSeen().contains(QLatin1String("positionChanged()")); }));
    // A receiver that lost its proxy is started anew by whoever wants it.
    info.startUpdates();
    m_phone->stopService(Service);
    m_phone->startService(Service);
    seen.take();
    info.startUpdates();
    QVERIFY(waitUntil([&] { return seen.signalsSeen().contains(QLatin1String("positionChanged()")); }));
}

void LocationInfoTest::deletionInASlot_data()
{
    QTest::addColumn<bool>("byPosition");
    QTest::newRow("position") << true;
    QTest::newRow("satellites") << false;
}

void LocationInfoTest::deletionInASlot()
{
    QFETCH(bool, byPosition);
    standIn();
    auto info = std::make_unique<LocationInfo>();
    info->requestUpdate();
    byPosition ? report(4, 8) : report(QStringLiteral("1;2;3;4"));
    const auto signal = byPosition ? &LocationInfo::positionChanged : &LocationInfo::satellitesChanged;
    connect(info.get(), signal, this, [&] { info.reset(); });
    byPosition ? report(QStringLiteral("1;2;3;4")) : report(4, 8);
    QVERIFY(!info);
    QCOMPARE(calls(), texts({"startUpdates", "stopUpdates"}));
}

void LocationInfoTest::worksThroughTheMetaObject()
{
    standIn();
    LocationInfo info;
    report(QStringLiteral("1;2;3;4"));
    report(4, 8);
    QCOMPARE(textOf(info.property("position").value<LocationInfo::Position>()), QStringLiteral("1 2 3 4"));
    QCOMPARE(info.property("latitude").toDouble(), 1.0);
    QCOMPARE(info.property("longitude").toDouble(), 2.0);
    QCOMPARE(info.property("altitude").toDouble(), 3.0);
    QCOMPARE(info.property("timestamp").toDateTime().toMSecsSinceEpoch(), 4);
    QCOMPARE(info.property("satellitesInUse").toInt(), 4);
    QCOMPARE(info.property("satellitesInView").toInt(), 8);
    const QMetaObject *meta = info.metaObject();
    for (int i = meta->propertyOffset(); i < meta->propertyCount(); ++i) {
        QVERIFY(!meta->property(i).isWritable());
        QVERIFY(meta->property(i).hasNotifySignal());
    }
    for (const char *method : {"startUpdates", "requestUpdate", "stopUpdates"})
        QVERIFY(QMetaObject::invokeMethod(&info, method));
    QCOMPARE(calls(), texts({"startUpdates", "startUpdates", "stopUpdates"}));
}

void LocationInfoTest::drivesAlongATrack()
{
    MessageLog log;
    LocationInfo info;
    SignalSequence seen(&info);
    QVector<LocationInfo::Position> way;
    connect(&info, &LocationInfo::positionChanged, this, [&] { way << info.position(); });
    const QDateTime before = QDateTime::currentDateTimeUtc();
    info.startUpdates();
    QVERIFY(waitUntil([&] { return way.size() >= 5; }));
    info.stopUpdates();
    for (int i = 0; i < way.size(); ++i) {
        QCOMPARE(way.at(i).longitude, 24.5);
        QVERIFY(way.at(i).latitude > 60.1 && way.at(i).latitude < 60.2);
        QVERIFY(way.at(i).altitude > 9.9 && way.at(i).altitude < 30.0);
        QVERIFY(way.at(i).timestamp >= before.addMSecs(-1));
        // It stays on its way.
        QVERIFY(std::abs((way.at(i).altitude - 10) - 200 * (way.at(i).latitude - 60.1)) < 0.1);
    }
    QVERIFY(way.last().latitude > way.first().latitude);
    // Satellites come before the position that they give, and alone as long as they are too few.
    const QStringList order = seen.take();
    QCOMPARE(
        order.mid(0, 4),
        texts({"satellitesChanged()", "satellitesChanged()", "satellitesChanged()", "positionChanged()"}));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void LocationInfoTest::oneFixOfTheReceiver()
{
    MessageLog log;
    LocationInfo info;
    LocationInfo other;
    SignalSequence seen(&info);
    SignalSequence othersSeen(&other);
    calls();
    info.requestUpdate();
    QVERIFY(waitUntil([&] { return seen.signalsSeen().contains(QLatin1String("positionChanged()")); }));
    m_phone->settle(Service);
    QCOMPARE(seen.take(), texts({"satellitesChanged()", "positionChanged()"}));
    QCOMPARE(calls(), texts({"startUpdates", "stopUpdates"}));
    QVERIFY(info.satellitesInUse() >= 4);
    QVERIFY(info.satellitesInView() >= info.satellitesInUse());
    // The other object has seen it all, in silence.
    QCOMPARE(textOf(other.position()), textOf(info.position()));
    QCOMPARE(othersSeen.take(), QStringList());
    QVERIFY(!m_phone->state()
                 .value(QLatin1String("location"))
                 .toObject()
                 .value(QLatin1String("running"))
                 .toBool());
    QCOMPARE(log.takeWarnings(), QStringList());
}

QTEST_GUILESS_MAIN(LocationInfoTest)
#include "locationinfo_test.moc"
