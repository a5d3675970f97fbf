// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "rulechanneltest.h"
#include "signalsequence.h"
#include "waiting.h"

#include <corvanemdm/simmobiledatafilter.h>
#include <corvanemdm/simsmsfilter.h>
#include <corvanemdm/simvoicecallfilter.h>

#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusMetaType>
#include <QtTest/QtTest>

#include <dlfcn.h>

#include <memory>

using Corvane::Mdm::SimMobileDataFilter;
using Corvane::Mdm::SimSmsFilter;
using Corvane::Mdm::SimVoiceCallFilter;

namespace
{

const QString Service = QStringLiteral("org.ofono");

/** Signals that QtDBus is not to connect, as "path member"; of each of them when it is the path alone. */
QStringList refused; // clazy:exclude=non-pod-global-static

/** What was asked of QtDBus, in this order: "connect <path>" and "call <path> <member>". */
QStringList requests; // clazy:exclude=non-pod-global-static

/** The service's object for one kind of traffic, its signals in the order in which the filter connects them,
 * and what it calls them in its warnings. */
struct Channel {
    QString path;
    QString interface;
    QString logPrefix;
    QStringList members; ///< rule added, changed and removed, rules changed, default action changed
};

const QStringList Members{QStringLiteral("RuleAdded"), QStringLiteral("RuleChanged"),
                          QStringLiteral("RuleRemoved"), QStringLiteral("RulesChanged"),
                          QStringLiteral("DefaultActionChanged")};
const QString VoiceInterface = QStringLiteral("org.corvaneos.ofono.mdm.VoiceCallFilter");

const Channel Dial{QStringLiteral("/mdm/voicecallfilter/dial"), VoiceInterface, QStringLiteral("(dial) "),
                   Members};
const Channel Incoming{QStringLiteral("/mdm/voicecallfilter/incoming"), VoiceInterface,
                       QStringLiteral("(incoming) "), Members};
const Channel Text{QStringLiteral("/mdm/smsfilter/textin"),
                   QStringLiteral("org.corvaneos.ofono.mdm.SmsFilter"),
                   QString(),
                   {QStringLiteral("TextRuleAdded"), QStringLiteral("TextRuleChanged"),
                    QStringLiteral("TextRuleRemoved"), QStringLiteral("TextRulesChanged"),
                    QStringLiteral("DefaultTextActionChanged")}};
const Channel Data{QStringLiteral("/mdm/gprsfilter"), QStringLiteral("org.corvaneos.ofono.mdm.GprsFilter"),
                   QString(), Members};

template <typename Filter> std::unique_ptr<QObject> make()
{
    return std::make_unique<Filter>();
}

/** A filter and its kinds of traffic, in the order in which it connects them. */
struct Kind {
    const char *name;
    std::unique_ptr<QObject> (*make)();
    QList<Channel> channels;
};

const Kind Kinds[] = {
    {"calls", make<SimVoiceCallFilter>, {Dial, Incoming}},
    {"texts", make<SimSmsFilter>, {Text}},
    {"mobile data", make<SimMobileDataFilter>, {Data}},
};

QString warningFor(const Channel &channel, const QString &member)
{
    return QLatin1String("Failed to connect to ") + channel.logPrefix + member;
}

} // namespace

// QtDBus refuses a signal only once the bus is lost. The library finds this function before QtDBus's own.
Q_DECL_EXPORT bool QDBusConnection::connect(const QString &service, const QString &path,
                                            const QString &interface, const QString &name,
                                            const QStringList &argumentMatch, const QString &signature,
                                            QObject *receiver, const char *slot)
{
    requests << QLatin1String("connect ") + path;
    if (refused.contains(path) || refused.contains(path + QLatin1Char(' ') + name))
        return false;
    using Connect = bool (*)(QDBusConnection *, const QString &, const QString &, const QString &,
                             const QString &, const QStringList &, const QString &, QObject *, const char *);
    static const auto next = reinterpret_cast<Connect>(
        dlsym(RTLD_NEXT, "_ZN15QDBusConnection7connectERK7QStringS2_S2_S2_RK11QStringListS2_P7QObjectPKc"));
    return next(this, service, path, interface, name, argumentMatch, signature, receiver, slot);
}

// How the library asks for a state. It goes on to QtDBus's own.
Q_DECL_EXPORT bool QDBusConnection::callWithCallback(const QDBusMessage &message, QObject *receiver,
                                                     const char *returnMethod, const char *errorMethod,
                                                     int timeout) const
{
    requests << QStringLiteral("call %1 %2").arg(message.path(), message.member());
    using Call
        = bool (*)(const QDBusConnection *, const QDBusMessage &, QObject *, const char *, const char *, int);
    static const auto next = reinterpret_cast<Call>(
        dlsym(RTLD_NEXT, "_ZNK15QDBusConnection16callWithCallbackERK12QDBusMessageP7QObjectPKcS6_i"));
    return next(this, message, receiver, returnMethod, errorMethod, timeout);
}

/** Filters that the bus does not let hear all that they want to. */
class FilterConnectionsTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void cleanup();
    void oneSignal_data();
    void oneSignal();
    void allSignals_data();
    void allSignals();
    void listensBeforeItAsks_data() { allSignals_data(); }
    void listensBeforeItAsks();
};

void FilterConnectionsTest::initTestCase()
{
    qDBusRegisterMetaType<WireRule>();
    qDBusRegisterMetaType<QList<WireRule>>();
}

void FilterConnectionsTest::cleanup()
{
    refused.clear();
}

void FilterConnectionsTest::oneSignal_data()
{
    QTest::addColumn<int>("kind");
    QTest::addColumn<int>("channel");
    QTest::addColumn<QString>("member");
    for (int kind = 0; kind < int(std::size(Kinds)); ++kind) {
        for (int channel = 0; channel < Kinds[kind].channels.size(); ++channel) {
            for (const QString &member : Kinds[kind].channels.at(channel).members)
                QTest::addRow("%s, %d, %s", Kinds[kind].name, channel, qPrintable(member))
                    << kind << channel << member;
        }
    }
}

void FilterConnectionsTest::oneSignal()
{
    QFETCH(int, kind);
    QFETCH(int, channel);
    QFETCH(QString, member);
    Phone phone;
    MessageLog log;
    const Channel &spoilt = Kinds[kind].channels.at(channel);
    refused << spoilt.path + QLatin1Char(' ') + member;
    const std::unique_ptr<QObject> filter = Kinds[kind].make();
    QCOMPARE(log.takeWarnings(), QStringList(warningFor(spoilt, member)));

    // The rest goes on: what there is is asked for, and the other signals are heard.
    QVERIFY(waitUntil([&filter] { return filter->property("ready").toBool(); }));
    SignalSequence seen(filter.get());
    for (const Channel &each : Kinds[kind].channels) {
        for (const QString &signal : each.members) {
            const bool isDefault = signal == each.members.at(4);
            if (!isDefault && signal != each.members.at(3))
                continue;
            seen.take();
            for (const quint32 action : {1u, 2u}) {
                phone.emitSignal(Service, each.path, each.interface, signal,
                                 {isDefault ? QVariant(action) : wire({wireRule("1", action)})});
            }
            QCOMPARE(seen.take().isEmpty(), each.path == spoilt.path && signal == member);
        }
    }
    QCOMPARE(log.takeWarnings(), QStringList());
}

void FilterConnectionsTest::allSignals_data()
{
    QTest::addColumn<int>("kind");
    for (int kind = 0; kind < int(std::size(Kinds)); ++kind)
        QTest::newRow(Kinds[kind].name) << kind;
}

void FilterConnectionsTest::allSignals()
{
    QFETCH(int, kind);
    QStringList warnings;
    for (const Channel &channel : Kinds[kind].channels) {
        refused << channel.path;
        for (const QString &member : channel.members)
            warnings << warningFor(channel, member);
    }
    MessageLog log;
    const std::unique_ptr<QObject> filter = Kinds[kind].make();
    QCOMPARE(log.takeWarnings(), warnings);
    QVERIFY(waitUntil([&filter] { return filter->property("ready").toBool(); }));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void FilterConnectionsTest::listensBeforeItAsks()
{
    QFETCH(int, kind);
    const Phone phone;
    requests.clear();
    const std::unique_ptr<QObject> filter = Kinds[kind].make();
    for (const Channel &channel : Kinds[kind].channels) {
        const QString call = QStringLiteral("call %1 GetAll").arg(channel.path);
        const QString connection = QLatin1String("connect ") + channel.path;
        QCOMPARE(requests.count(call), 1);
        QCOMPARE(requests.count(connection), channel.members.size());
        QVERIFY(requests.lastIndexOf(connection) < requests.indexOf(call));
    }
}

QTEST_GUILESS_MAIN(FilterConnectionsTest)
#include "filterconnections_test.moc"
