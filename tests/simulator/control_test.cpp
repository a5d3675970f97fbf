// SPDX-License-Identifier: LGPL-2.1-or-later
#include "client.h"
#include "waiting.h"

#include <QtCore/QDir>
#include <QtCore/QElapsedTimer>
#include <QtCore/QJsonDocument>
#include <QtCore/QJsonObject>
#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusPendingCallWatcher>
#include <QtTest/QTest>

namespace
{

const QString controlService = QStringLiteral("org.corvaneos.simulator");
const QString controlPath = QStringLiteral("/org/corvaneos/simulator");
const QString controlInterface = QStringLiteral("org.corvaneos.simulator.Control");
const QString ofono = QStringLiteral("org.ofono");
const QString proxy = QStringLiteral("org.corvaneos.mdmproxy");
const QString updatePath = QStringLiteral("/Corvane/Mdm/Proxy/SoftwareUpdate");
const QString updateInterface = QStringLiteral("org.corvaneos.mdmproxy.softwareupdate");
const QString filterPath = QStringLiteral("/mdm/voicecallfilter/dial");
const QString filterInterface = QStringLiteral("org.corvaneos.ofono.mdm.VoiceCallFilter");
const QString introspectable = QStringLiteral("org.freedesktop.DBus.Introspectable");
const QString introspect = QStringLiteral("Introspect");
const QString getAll = QStringLiteral("GetAll");
const QString all = QStringLiteral("reply(1, 2, [])");
const QString refused = QStringLiteral("org.corvaneos.simulator.Error.InvalidArguments: ");
const QString done = QStringLiteral("reply()");

} // namespace

/** What steers the simulated phone, over the bus. */
class ControlTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void offersTheContracts_data();
    void offersTheContracts();
    void stopsAndStartsServices();
    void startsNoServiceWhoseNameIsTaken();
    void leavesCallsOfAStoppedServiceUnanswered();
    void failsCalls();
    void answersLate();
    void neverAnswers();
    void answersOtherwise();
    void spoilsSomeCallsOnly();
    void spoilsAnyMember();
    void endsFaults();
    void refusesWrongFaults_data();
    void refusesWrongFaults();
    void emitsSignals();
    void refusesWrongSignals();
    void keepsAJournal();
    void announcesCalls();
    void listsAndRefusesActions();
    void tellsTheState();

private:
    QString control(const QString &member, const QVariantList &arguments = {}) const
    {
        return textOf(m_client->control(member, arguments));
    }
    QString fault(const QString &kind, const QVariantMap &options = {}, const QString &member = getAll) const
    {
        return control(QStringLiteral("SetFault"),
                       {ofono, filterPath, filterInterface, member, kind, options});
    }
    QString filterCall(const QString &member = getAll, const QVariantList &arguments = {}) const
    {
        return textOf(m_client->call(ofono, filterPath, filterInterface, member, arguments));
    }
    /** The journal as "number service sender path interface member signature arguments", without the times.
     */
    QStringList journal(quint64 after = 0) const;

    std::unique_ptr<Client> m_client;
};

void ControlTest::init()
{
    m_client = std::make_unique<Client>();
    QCOMPARE(control(QStringLiteral("ClearFaults")), done);
    QCOMPARE(control(QStringLiteral("ClearJournal")), done);
}

void ControlTest::cleanup()
{
    m_client.reset();
}

QStringList ControlTest::journal(quint64 after) const
{
    const QDBusMessage answer = m_client->control(QStringLiteral("Journal"), {after});
    const QDBusArgument entries = qvariant_cast<QDBusArgument>(answer.arguments().first());
    QStringList lines;
    entries.beginArray();
    while (!entries.atEnd()) {
        quint64 number = 0;
        quint64 time = 0;
        QString service;
        QString sender;
        QString path;
        QString interface;
        QString member;
        QString signature;
        QString arguments;
        entries.beginStructure();
        entries >> number >> time >> service >> sender >> path >> interface >> member >> signature
            >> arguments;
        entries.endStructure();
        lines << QStringList{QString::number(number),
                             service,
                             sender,
                             path,
                             interface,
                             member,
                             signature,
                             arguments}
                     .join(QLatin1Char(' '));
    }
    entries.endArray();
    return lines;
}

void ControlTest::offersTheContracts_data()
{
    QTest::addColumn<QString>("service");
    QTest::addColumn<QString>("path");

    const auto row = [](const char *interface, const QString &service, const QString &path) {
        QTest::newRow(interface) << service << path;
    };
    row("org.corvaneos.simulator.Control", controlService, controlPath);
    row("org.corvaneos.mdmproxy.softwareupdate", proxy, updatePath);
    row("org.corvaneos.ofono.mdm.VoiceCallFilter", ofono, filterPath);
    row("org.ofono.Manager", ofono, QStringLiteral("/"));
    row("org.ofono.Modem", ofono, QStringLiteral("/ril_0"));
    row("org.ofono.SimManager", ofono, QStringLiteral("/ril_0"));
}

void ControlTest::offersTheContracts()
{
    QFETCH(QString, service);
    QFETCH(QString, path);
    const QString interface = QString::fromLatin1(QTest::currentDataTag());

    QFile file(QStringLiteral(CONTRACTS_FOLDER "/%1.xml").arg(interface));
    QVERIFY2(file.open(QIODevice::ReadOnly), qPrintable(file.fileName()));
    QStringList contract = membersOf(file.readAll(), interface);
    const QDBusMessage answer = m_client->call(service, path, introspectable, introspect);
    QStringList offered = membersOf(answer.arguments().value(0).toByteArray(), interface);
    contract.sort();
    offered.sort();
    QVERIFY(!contract.isEmpty());
    QCOMPARE(offered, contract);
}

void ControlTest::stopsAndStartsServices()
{
    const QString stop = QStringLiteral("StopService");
    const QString start = QStringLiteral("StartService");
    // Which services there are beside these is no matter of the controls.
    const auto tells = [this](const char *service) {
        return control(QStringLiteral("Services")).contains(QLatin1String(service));
    };
    QVERIFY(tells("(org.corvaneos.mdmproxy, true)"));
    QVERIFY(tells("(org.ofono, true)"));
    // Stopping and starting what is stopped or running does nothing.
    QCOMPARE(control(start, {ofono}), done);
    QCOMPARE(control(stop, {ofono}), done);
    QCOMPARE(control(stop, {ofono}), done);
    QVERIFY(tells("(org.corvaneos.mdmproxy, true)"));
    QVERIFY(tells("(org.ofono, false)"));
    QVERIFY(filterCall().startsWith(QLatin1String("org.freedesktop.DBus.Error.ServiceUnknown")));
    QCOMPARE(control(start, {ofono}), done);
    QCOMPARE(filterCall(), all);

    for (const QString &method : {stop, start}) {
        const QString answer = control(method, {QStringLiteral("org.x")});
        QVERIFY(answer.startsWith(refused + QStringLiteral("There is no service \"org.x\"; there are ")));
        QVERIFY(answer.contains(QLatin1String("org.corvaneos.mdmproxy, ")));
    }
}

void ControlTest::startsNoServiceWhoseNameIsTaken()
{
    QCOMPARE(control(QStringLiteral("StopService"), {ofono}), done);
    const QString bus = QStringLiteral("org.freedesktop.DBus");
    const QString busPath = QStringLiteral("/org/freedesktop/DBus");
    QCOMPARE(textOf(m_client->call(bus, busPath, bus, QStringLiteral("RequestName"), {ofono, 0u})),
             QStringLiteral("reply(1)"));
    const QString answer = control(QStringLiteral("StartService"), {ofono});
    QVERIFY2(answer.endsWith(QLatin1String("the name org.ofono is taken on the phone's bus")),
             qPrintable(answer));
    QVERIFY(control(QStringLiteral("Services")).contains(QLatin1String("(org.ofono, false)")));
    QCOMPARE(textOf(m_client->call(bus, busPath, bus, QStringLiteral("ReleaseName"), {ofono})),
             QStringLiteral("reply(1)"));
    QCOMPARE(control(QStringLiteral("StartService"), {ofono}), done);
    QCOMPARE(filterCall(), all);
}

void ControlTest::leavesCallsOfAStoppedServiceUnanswered()
{
    fault(QStringLiteral("never"));
    m_client->callAndNote(ofono, filterPath, filterInterface, getAll);
    QVERIFY(waitUntil([&] { return !journal().isEmpty(); }));
    QCOMPARE(control(QStringLiteral("StopService"), {ofono}), done);
    QVERIFY(m_client->waitForSignals(1));
    QCOMPARE(m_client->takeSignals(proxy), QStringList{QStringLiteral("org.freedesktop.DBus.Error.NoReply")});
    QCOMPARE(control(QStringLiteral("StartService"), {ofono}), done);
}

void ControlTest::failsCalls()
{
    fault(QStringLiteral("error"),
          {{QStringLiteral("error"), QStringLiteral("a.b.C")},
           {QStringLiteral("message"), QStringLiteral("No way")}});
    QCOMPARE(filterCall(), QStringLiteral("a.b.C: No way"));
    fault(QStringLiteral("error"));
    QCOMPARE(filterCall(),
             QStringLiteral("org.freedesktop.DBus.Error.Failed: The simulated phone was told to fail"));
    // A fault stands in for the call.
    fault(QStringLiteral("error"), {}, QStringLiteral("SetDefaultAction"));
    filterCall(QStringLiteral("SetDefaultAction"), {1u});
    control(QStringLiteral("ClearFaults"));
    QCOMPARE(filterCall(), all);
}

void ControlTest::answersLate()
{
    constexpr quint32 delay = 300;
    fault(QStringLiteral("late"), {{QStringLiteral("delay"), delay}, {QStringLiteral("times"), 1u}});
    QElapsedTimer elapsed;
    elapsed.start();
    m_client->callAndNote(ofono, filterPath, filterInterface, getAll);
    // Other calls are answered meanwhile.
    QCOMPARE(filterCall(), all);
    // The fault is used up by now; its answer comes all the same.
    QVERIFY(m_client->waitForSignals(1));
    QVERIFY2(elapsed.elapsed() >= delay, qPrintable(QString::number(elapsed.elapsed())));
    QCOMPARE(m_client->takeSignals(ofono), QStringList{QStringLiteral("answer")});

    // What the call does is done at once, an error is an answer too.
    fault(QStringLiteral("late"), {{QStringLiteral("delay"), 1u}}, QStringLiteral("RemoveRule"));
    QCOMPARE(filterCall(QStringLiteral("RemoveRule"), {QStringLiteral("1")}),
             QStringLiteral("org.ofono.Error.NotFound: There is no rule for \"1\""));
}

void ControlTest::neverAnswers()
{
    fault(QStringLiteral("never"), {}, QStringLiteral("SetDefaultAction"));
    m_client->callAndNote(ofono, filterPath, filterInterface, QStringLiteral("SetDefaultAction"), {1u});
    QCOMPARE(filterCall(), all);
    QCOMPARE(m_client->takeSignals(ofono), QStringList());
}

void ControlTest::answersOtherwise()
{
    fault(QStringLiteral("reply"),
          {{QStringLiteral("arguments"),
            boxed({QStringLiteral("text"), QStringList{QStringLiteral("list")}, true})}});
    QCOMPARE(filterCall(), QStringLiteral("reply(text, [list], true)"));
    fault(QStringLiteral("reply"));
    QCOMPARE(filterCall(), done);
}

void ControlTest::spoilsSomeCallsOnly()
{
    const QString set = QStringLiteral("SetFault");
    const QString error = QStringLiteral("error");
    const QVariantMap none;
    const QString failed = QStringLiteral("org.freedesktop.DBus.Error.Failed");
    const QString otherPath = QStringLiteral("/mdm/voicecallfilter/incoming");
    const auto otherCall = [&] {
        return textOf(m_client->call(ofono, otherPath, filterInterface, getAll));
    };

    control(set, {ofono, otherPath, QString(), QString(), error, none});
    QCOMPARE(filterCall(), all);
    QVERIFY(otherCall().startsWith(failed));
    control(QStringLiteral("ClearFaults"));

    control(set, {ofono, QString(), QStringLiteral("org.ofono.Modem"), QString(), error, none});
    control(set, {ofono, QString(), QString(), QStringLiteral("AddRule"), error, none});
    control(set, {proxy, QString(), QString(), QString(), error, none});
    QCOMPARE(filterCall(), all);
    control(set, {ofono, QString(), QString(), QString(), error, none});
    QVERIFY(filterCall().startsWith(failed));
    QVERIFY(otherCall().startsWith(failed));
}

void ControlTest::spoilsAnyMember()
{
    control(QStringLiteral("SetFault"),
            {ofono, QString(), QString(), introspect, QStringLiteral("error"), QVariantMap()});
    control(QStringLiteral("SetFault"),
            {ofono, QString(), QString(), QStringLiteral("NoSuchMethod"), QStringLiteral("reply"),
             QVariantMap()});
    QVERIFY(textOf(m_client->call(ofono, filterPath, introspectable, introspect))
                .startsWith(QLatin1String("org.freedesktop.DBus.Error.Failed")));
    QCOMPARE(filterCall(QStringLiteral("NoSuchMethod")), done);
}

void ControlTest::endsFaults()
{
    const auto failWith = [this](const QString &message, const QVariantMap &more) {
        QVariantMap options = more;
        options.insert(QStringLiteral("message"), message);
        return m_client
            ->control(QStringLiteral("SetFault"),
                      {ofono, filterPath, filterInterface, getAll, QStringLiteral("error"), options})
            .arguments()
            .first()
            .toUInt();
    };
    const QString error = QStringLiteral("org.freedesktop.DBus.Error.Failed: ");
    const quint32 older = failWith(QStringLiteral("older"), {});
    const quint32 newer = failWith(QStringLiteral("newer"), {{QStringLiteral("times"), 2u}});
    QVERIFY(newer > older);
    QCOMPARE(filterCall(), error + QStringLiteral("newer"));
    QCOMPARE(control(QStringLiteral("Faults")),
             QStringLiteral("reply([(%1, org.ofono, %3, %4, GetAll, error, "
                            "{error=<org.freedesktop.DBus.Error.Failed>, message=<newer>, times=<1>}), "
                            "(%2, org.ofono, %3, %4, GetAll, error, "
                            "{error=<org.freedesktop.DBus.Error.Failed>, message=<older>})])")
                 .arg(QString::number(newer), QString::number(older), filterPath, filterInterface));
    QCOMPARE(filterCall(), error + QStringLiteral("newer"));
    QCOMPARE(filterCall(), error + QStringLiteral("older"));
    QCOMPARE(filterCall(), error + QStringLiteral("older"));
    QCOMPARE(control(QStringLiteral("ClearFault"), {older}), done);
    QCOMPARE(filterCall(), all);
    QCOMPARE(control(QStringLiteral("ClearFault"), {older}),
             refused
                 + QStringLiteral("There is no fault %1; \"corvane-simctl faults\" lists those that are set")
                       .arg(older));
}

void ControlTest::refusesWrongFaults_data()
{
    QTest::addColumn<QVariantList>("arguments");
    QTest::addColumn<QString>("sentence");

    const QString never = QStringLiteral("never");
    const QString error = QStringLiteral("error");
    const QString text = QStringLiteral("x");
    const auto row = [](const char *name, const QVariantList &arguments, const char *sentence) {
        QTest::newRow(name) << arguments << QString::fromLatin1(sentence);
    };
    row("service", {text, QString(), QString(), QString(), never, QVariantMap()},
        "There is no service \"x\"; there are ");
    row("path", {ofono, text, QString(), QString(), never, QVariantMap()},
        "\"x\" is no object path; leave it empty to match all of them");
    row("interface", {ofono, QString(), text, QString(), never, QVariantMap()},
        "\"x\" is no interface name; leave it empty to match all of them");
    row("member", {ofono, QString(), QString(), QStringLiteral("x.y"), never, QVariantMap()},
        "\"x.y\" is no method name; leave it empty to match all of them");
    row("kind", {ofono, QString(), QString(), QString(), text, QVariantMap()},
        "There is no fault \"x\"; there are error, late, never and reply");
    row("option", {ofono, QString(), QString(), QString(), error, QVariantMap{{QStringLiteral("delay"), 1u}}},
        "The fault \"error\" has no option \"delay\"; it has error, message, times");
    row("option type", {ofono, QString(), QString(), QString(), error, QVariantMap{{error, 1u}}},
        "The option \"error\" is of type \"u\"; it must be \"s\"");
    row("error name", {ofono, QString(), QString(), QString(), error, QVariantMap{{error, text}}},
        "\"x\" is no error name; one is org.freedesktop.DBus.Error.Failed");
    row("no delay", {ofono, QString(), QString(), QString(), QStringLiteral("late"), QVariantMap()},
        "The fault \"late\" needs the option \"delay\", in milliseconds");
    row("no times",
        {ofono, QString(), QString(), QString(), never, QVariantMap{{QStringLiteral("times"), 0u}}},
        "The option \"times\" must be 1 or more");
}

void ControlTest::refusesWrongFaults()
{
    QFETCH(QVariantList, arguments);
    QFETCH(QString, sentence);
    const QString answer = control(QStringLiteral("SetFault"), arguments);
    QVERIFY2(answer.startsWith(refused + sentence), qPrintable(answer));
    QCOMPARE(control(QStringLiteral("Faults")), QStringLiteral("reply([])"));
}

void ControlTest::emitsSignals()
{
    const QString path = QStringLiteral("/some/where");
    const QString interface = QStringLiteral("org.example.Odd");
    const QString odd = QStringLiteral("Odd");
    m_client->watch(ofono, path, interface, {odd});
    const QVariantList values{7, QStringLiteral("text"), boxed({true, QStringList{QStringLiteral("a")}})};
    QCOMPARE(control(QStringLiteral("EmitSignal"), {ofono, path, interface, odd, boxed(values)}), done);
    QCOMPARE(control(QStringLiteral("EmitSignal"), {ofono, path, interface, odd, boxed({})}), done);
    QCOMPARE(m_client->takeSignals(ofono),
             (QStringList{QStringLiteral("Odd(7, text, [<true>, <[a]>])"), QStringLiteral("Odd()")}));
}

void ControlTest::refusesWrongSignals()
{
    const QString emitSignal = QStringLiteral("EmitSignal");
    const QVariant none = boxed({});
    const QString path = QStringLiteral("/a");
    const QString interface = QStringLiteral("a.b");
    const QString member = QStringLiteral("C");
    QVERIFY(control(emitSignal, {member, path, interface, member, none}).startsWith(refused));
    QCOMPARE(control(emitSignal, {ofono, member, interface, member, none}),
             refused + QStringLiteral("\"C\" is no object path; one is /mdm/voicecallfilter/dial"));
    QCOMPARE(control(emitSignal, {ofono, path, member, member, none}),
             refused + QStringLiteral("\"C\" is no interface name; one is org.ofono.Modem"));
    QCOMPARE(control(emitSignal, {ofono, path, interface, interface, none}),
             refused + QStringLiteral("\"a.b\" is no signal name; one is PropertyChanged"));
    control(QStringLiteral("StopService"), {ofono});
    QCOMPARE(control(emitSignal, {ofono, path, interface, member, none}),
             refused + QStringLiteral("org.ofono is stopped; start it before it can emit a signal"));
    control(QStringLiteral("StartService"), {ofono});
}

void ControlTest::keepsAJournal()
{
    const QString me = m_client->uniqueName();
    filterCall(QStringLiteral("SetDefaultAction"), {2u});
    const QStringList first = journal();
    QCOMPARE(first.size(), 1);
    const quint64 number = first.first().section(QLatin1Char(' '), 0, 0).toULongLong();
    QCOMPARE(first.first(),
             QStringLiteral("%1 org.ofono %2 %3 %4 SetDefaultAction u (uint32 2,)")
                 .arg(QString::number(number), me, filterPath, filterInterface));

    // Wrong signatures, unknown members, standard interfaces and spoilt calls count as well.
    filterCall(getAll, {1});
    filterCall(QStringLiteral("NoSuchMethod"));
    m_client->call(proxy, updatePath, introspectable, introspect);
    fault(QStringLiteral("error"));
    filterCall();
    QCOMPARE(journal(number),
             (QStringList{
                 QStringLiteral("%1 org.ofono %2 %3 %4 GetAll i (1,)")
                     .arg(QString::number(number + 1), me, filterPath, filterInterface),
                 QStringLiteral("%1 org.ofono %2 %3 %4 NoSuchMethod  ()")
                     .arg(QString::number(number + 2), me, filterPath, filterInterface),
                 QStringLiteral("%1 org.corvaneos.mdmproxy %2 %3 %4 Introspect  ()")
                     .arg(QString::number(number + 3), me, updatePath, introspectable),
                 QStringLiteral("%1 org.ofono %2 %3 %4 GetAll  ()")
                     .arg(QString::number(number + 4), me, filterPath, filterInterface),
             }));
    QCOMPARE(control(QStringLiteral("ClearJournal")), done);
    QCOMPARE(journal(), QStringList());
    filterCall();
    QVERIFY(journal().first().startsWith(QString::number(number + 5)));
}

void ControlTest::announcesCalls()
{
    m_client->watch(controlService, controlPath, controlInterface, {QStringLiteral("CallReceived")});
    filterCall(QStringLiteral("SetDefaultAction"), {2u});
    QVERIFY(m_client->waitForSignals(1));
    const QString signal = m_client->takeSignals(controlService).first();
    QVERIFY2(
        signal.startsWith(QLatin1String("CallReceived(("))
            && signal.endsWith(QStringLiteral("org.ofono, %1, %2, %3, SetDefaultAction, u, (uint32 2,)))")
                                   .arg(m_client->uniqueName(), filterPath, filterInterface)),
        qPrintable(signal));
}

void ControlTest::listsAndRefusesActions()
{
    const QString act = QStringLiteral("Act");
    const QString actions = control(QStringLiteral("Actions"));
    for (const char *usage :
         {"(sim pull, SLOT, ", "(sim insert, SLOT [IMSI], ", "(call dial, IMSI|SLOT [NUMBER], ",
          "(call incoming, IMSI|SLOT [NUMBER], ", "(text, IMSI|SLOT [NUMBER], ", "(data, IMSI|SLOT, ",
          "(call log, outgoing|incoming|missed [SECONDS [TIME]], ", "(update publish, VERSION [MIB], ",
          "(update withdraw, VERSION, "})
        QVERIFY2(actions.contains(QLatin1String(usage)), qPrintable(actions));
    const QString unknown = control(act, {QStringLiteral("sim push"), QStringList()});
    QVERIFY2(unknown.startsWith(refused + QStringLiteral("There is no action \"sim push\"; there are ")),
             qPrintable(unknown));
    QCOMPARE(control(act, {QStringLiteral("sim pull"), QStringList()}),
             refused + QStringLiteral("\"sim pull\" takes SLOT; it was given 0 arguments"));
}

void ControlTest::tellsTheState()
{
    const QByteArray json
        = m_client->control(QStringLiteral("State")).arguments().first().toString().toUtf8();
    const QJsonObject state = QJsonDocument::fromJson(json).object();
    // A part of each service, and what belongs to none.
    for (const char *part : {"callFilters", "name", "notifications", "sims", "softwareUpdate"})
        QVERIFY2(state.contains(QLatin1String(part)), part);
    QCOMPARE(state.value(QLatin1String("name")).toString(), QStringLiteral("dual-sim"));
}

QTEST_GUILESS_MAIN(ControlTest)
#include "control_test.moc"
