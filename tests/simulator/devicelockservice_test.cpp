// SPDX-License-Identifier: LGPL-2.1-or-later
#include "client.h"
#include "waiting.h"

#include <QtCore/QFile>
#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QJsonObject>
#include <QtDBus/QDBusVariant>
#include <QtTest/QtTest>

#include <memory>

namespace
{

const QString service = QStringLiteral("org.veldmobile.devicelock");
const QString socketPath = QStringLiteral("/run/veld-devicelock/socket");
const QString statePath = QStringLiteral("/devicelock/state");
const QString stateInterface = QStringLiteral("org.veldmobile.devicelock.State");
const QString managementPath = QStringLiteral("/mdm");
const QString managementInterface = QStringLiteral("org.corvaneos.devicelock.DeviceManagement");
const QString changed = QStringLiteral("Changed");
const QString settingsFile = QStringLiteral("/usr/share/dapple/devicelock/devicelock_settings.conf");
const QString sideloading = QStringLiteral("/desktop/veld/devicelock/sideloading_allowed");
const QString code = QStringLiteral("2468");

const QString done = QStringLiteral("reply()");
const QString invalid = QStringLiteral("org.freedesktop.DBus.Error.InvalidArgs: ");
const QString denied = QStringLiteral("org.freedesktop.DBus.Error.AccessDenied: ");
const QString refused = QStringLiteral("org.corvaneos.simulator.Error.InvalidArguments: ");

std::unique_ptr<Client> newPeer()
{
    return std::make_unique<Client>(QStringLiteral("unix:path=") + socketPath);
}

QByteArray settings()
{
    QFile file(settingsFile);
    return file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray();
}

void writeSettings(const QByteArray &text)
{
    QFile file(settingsFile);
    QVERIFY(file.open(QIODevice::WriteOnly));
    QCOMPARE(file.write(text), qint64(text.size()));
}

} // namespace

/** The simulated device-lock daemon, as its peers see it. */
class DeviceLockServiceTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void offersItsContracts_data();
    void offersItsContracts();
    void busHasTheNameAlone();
    void tellsTheState();
    void managerLocksOutAndLetsIn();
    void managerLetsInToALockedPhone();
    void keepsTheFeedback();
    void refusesLockoutModesThatAreNone();
    void takesCodes_data();
    void takesCodes();
    void tooManyWrongCodesLock();
    void withoutACodeThereIsNoLock();
    void changesSideloading();
    void refusesOtherSettings();
    void clearsAndShutsDown();
    void clearsAndRestarts();
    void refusesOptionsThatAreNone_data();
    void refusesOptionsThatAreNone();
    void refusesArgumentsOfAnotherType_data();
    void refusesArgumentsOfAnotherType();
    void knowsNothingElse();
    void everyPeerIsTold();
    void keepsTheLockOverARestart();

private:
    static QDBusMessage manage(const Client &peer, const char *method, const QVariantList &arguments)
    {
        return peer.call(QString(), managementPath, managementInterface, QLatin1String(method), arguments);
    }
    QString manage(const char *method, const QVariantList &arguments) const
    {
        return textOf(manage(*m_peer, method, arguments));
    }
    QString lockOut(uint mode, const QVariantMap &feedback = QVariantMap()) const
    {
        return manage("SetLockoutMode", {mode, feedback});
    }
    static QString state(const Client &peer)
    {
        return textOf(peer.call(QString(), statePath, stateInterface, QStringLiteral("Get")));
    }
    QString state() const { return state(*m_peer); }
    /** What has been announced since the last call. */
    QStringList announced() const { return m_peer->takeSignals(QString()); }
    QString act(const char *action, const QStringList &arguments = QStringList()) const
    {
        return textOf(m_bus.control(QStringLiteral("Act"), {QLatin1String(action), arguments}));
    }
    /** The phone's own view. */
    QJsonObject phone() const
    {
        const QDBusMessage answer = m_bus.control(QStringLiteral("State"));
        return QJsonDocument::fromJson(answer.arguments().constFirst().toString().toUtf8()).object();
    }
    QJsonObject lock() const { return phone().value(QLatin1String("deviceLock")).toObject(); }
    bool isOn() const { return phone().value(QLatin1String("power")) == QLatin1String("on"); }
    /** No event tells of it. */
    bool waitForTheEndOfThePeer() const
    {
        return waitUntil([this] {
            phone();
            return !m_peer->isConnected();
        });
    }
    bool isNamed() const
    {
        return textOf(m_bus.call(
                   QStringLiteral("org.freedesktop.DBus"), QStringLiteral("/org/freedesktop/DBus"),
                   QStringLiteral("org.freedesktop.DBus"), QStringLiteral("NameHasOwner"), {service}))
            == QLatin1String("reply(true)");
    }

    Client m_bus;
    std::unique_ptr<Client> m_peer;
    QByteArray m_settings;
};

void DeviceLockServiceTest::init()
{
    if (m_settings.isEmpty())
        m_settings = settings();
    m_peer = newPeer();
    QVERIFY(m_peer->isConnected());
    m_peer->watch(QString(), statePath, stateInterface, {changed});
}

void DeviceLockServiceTest::cleanup()
{
    m_bus.control(QStringLiteral("StartService"), {service});
    if (!isOn())
        act("power on");
    writeSettings(m_settings);
    m_peer = newPeer();
    if (state() == QLatin1String("reply(0)") && lock().value(QLatin1String("code")).toString().isEmpty())
        return;
    // Only this forgets the code.
    const int restarts = phone().value(QLatin1String("restarts")).toInt();
    QCOMPARE(manage("ClearDevice", {1u}), done);
    QVERIFY(waitUntil(
        [&] { return phone().value(QLatin1String("restarts")).toInt() > restarts && isOn() && isNamed(); }));
}

void DeviceLockServiceTest::offersItsContracts_data()
{
    QTest::addColumn<QString>("path");
    QTest::newRow(qPrintable(stateInterface)) << statePath;
    QTest::newRow(qPrintable(managementInterface)) << managementPath;
}

void DeviceLockServiceTest::offersItsContracts()
{
    QFETCH(QString, path);
    const QString interface = QString::fromLatin1(QTest::currentDataTag());
    QFile file(QStringLiteral(CONTRACTS_FOLDER "/%1.xml").arg(interface));
    QVERIFY2(file.open(QIODevice::ReadOnly), qPrintable(file.fileName()));
    QStringList contract = membersOf(file.readAll(), interface);
    const QDBusMessage answer = m_peer->call(
        QString(), path, QStringLiteral("org.freedesktop.DBus.Introspectable"), QStringLiteral("Introspect"));
    QStringList offered = membersOf(answer.arguments().value(0).toByteArray(), interface);
    contract.sort();
    offered.sort();
    QVERIFY(!contract.isEmpty());
    QCOMPARE(offered, contract);
}

void DeviceLockServiceTest::busHasTheNameAlone()
{
    QVERIFY(isNamed());
    const QString unknown = QStringLiteral("org.freedesktop.DBus.Error.UnknownMethod");
    QVERIFY(
        textOf(m_bus.call(service, statePath, stateInterface, QStringLiteral("Get"))).startsWith(unknown));
    QVERIFY(
        textOf(m_bus.call(service, managementPath, managementInterface, QStringLiteral("ClearDevice"), {0u}))
            .startsWith(unknown));
}

void DeviceLockServiceTest::tellsTheState()
{
    QCOMPARE(state(), QStringLiteral("reply(0)"));
    QCOMPARE(m_peer->call(QString(), statePath, stateInterface, QStringLiteral("Get")).signature(),
             QStringLiteral("u"));
    QCOMPARE(lock().value(QLatin1String("state")).toString(), QStringLiteral("unlocked"));
    QCOMPARE(announced(), QStringList());
}

void DeviceLockServiceTest::managerLocksOutAndLetsIn()
{
    QCOMPARE(lockOut(1), done);
    QCOMPARE(state(), QStringLiteral("reply(2)"));
    // What there is already is no error, and no change.
    QCOMPARE(lockOut(1), done);
    QCOMPARE(announced(), QStringList(QStringLiteral("Changed(2)")));
    QCOMPARE(act("lock enter", {code}),
             refused + QLatin1String("The phone takes no code; it is in manager-lockout"));
    QCOMPARE(lockOut(0), done);
    QCOMPARE(state(), QStringLiteral("reply(0)"));
    QCOMPARE(lockOut(0), done);
    QCOMPARE(announced(), QStringList(QStringLiteral("Changed(0)")));

    // It is announced when it is done, which the answer tells.
    m_peer->callAndNote(QString(), managementPath, managementInterface, QStringLiteral("SetLockoutMode"),
                        {1u, QVariantMap()});
    QVERIFY(m_peer->waitForSignals(2));
    QCOMPARE(announced(), QStringList({QStringLiteral("Changed(2)"), QStringLiteral("answer")}));
}

void DeviceLockServiceTest::managerLetsInToALockedPhone()
{
    QCOMPARE(manage("SetSecurityCode", {code}), done);
    QCOMPARE(lockOut(1), done);
    QCOMPARE(lockOut(0), done);
    QCOMPARE(state(), QStringLiteral("reply(1)"));
    // Nobody is locked out: it stays as it is.
    QCOMPARE(lockOut(0), done);
    QCOMPARE(announced(), QStringList({QStringLiteral("Changed(2)"), QStringLiteral("Changed(1)")}));
}

void DeviceLockServiceTest::keepsTheFeedback()
{
    QVERIFY(!lock().contains(QLatin1String("feedback")));
    QCOMPARE(lockOut(1, {{QStringLiteral("title"), QStringLiteral("Lost")}, {QStringLiteral("odd"), 7}}),
             done);
    const QString kept = lock().value(QLatin1String("feedback")).toString();
    QVERIFY2(kept.contains(QLatin1String("'title': <'Lost'>")) && kept.contains(QLatin1String("'odd': <7>")),
             qPrintable(kept));
    QCOMPARE(lockOut(0), done);
    QVERIFY(!lock().contains(QLatin1String("feedback")));
}

void DeviceLockServiceTest::refusesLockoutModesThatAreNone()
{
    QCOMPARE(lockOut(2), invalid + QLatin1String("There is no lockout mode 2"));
    QCOMPARE(lockOut(4294967295u), invalid + QLatin1String("There is no lockout mode 4294967295"));
    QCOMPARE(state(), QStringLiteral("reply(0)"));
    QCOMPARE(announced(), QStringList());
}

void DeviceLockServiceTest::takesCodes_data()
{
    QTest::addColumn<QString>("text");
    QTest::addColumn<QString>("answer");
    const QString length = invalid + QLatin1String("The code must have 4 to 42 characters");
    const QString control = invalid + QLatin1String("The code must not have control characters");
    QTest::newRow("none") << QString() << length;
    QTest::newRow("3") << QStringLiteral("123") << length;
    QTest::newRow("4") << QStringLiteral("1234") << done;
    QTest::newRow("42") << QString(42, QLatin1Char('x')) << done;
    QTest::newRow("43") << QString(43, QLatin1Char('x')) << length;
    QTest::newRow("letters") << QStringLiteral("\u00e4 'q' \U0001f512") << done;
    QTest::newRow("newline") << QStringLiteral("123\n4") << control;
}

void DeviceLockServiceTest::takesCodes()
{
    QFETCH(QString, text);
    QFETCH(QString, answer);
    QCOMPARE(manage("SetSecurityCode", {text}), answer);
    QCOMPARE(lock().value(QLatin1String("code")).toString(), answer == done ? text : QString());
    // A code alone does not lock.
    QCOMPARE(state(), QStringLiteral("reply(0)"));
    QCOMPARE(announced(), QStringList());
}

void DeviceLockServiceTest::tooManyWrongCodesLock()
{
    manage("SetSecurityCode", {code});
    QCOMPARE(act("lock close"), QStringLiteral("reply(locked)"));
    for (int attempt = 0; attempt < 4; ++attempt)
        QCOMPARE(act("lock enter", {QStringLiteral("wrong")}), QStringLiteral("reply(locked)"));
    // The right one takes back those that were wrong.
    QCOMPARE(act("lock enter", {code}), QStringLiteral("reply(unlocked)"));
    act("lock close");
    for (int attempt = 0; attempt < 4; ++attempt)
        act("lock enter", {QStringLiteral("wrong")});
    QCOMPARE(state(), QStringLiteral("reply(1)"));
    QCOMPARE(act("lock enter", {QStringLiteral("wrong")}), QStringLiteral("reply(code-lockout)"));
    QCOMPARE(state(), QStringLiteral("reply(3)"));
    QCOMPARE(act("lock enter", {code}),
             refused + QLatin1String("The phone takes no code; it is in code-lockout"));
    QCOMPARE(announced(),
             QStringList({QStringLiteral("Changed(1)"), QStringLiteral("Changed(0)"),
                          QStringLiteral("Changed(1)"), QStringLiteral("Changed(3)")}));
    // A new code counts anew, and the manager can end it.
    QCOMPARE(manage("SetSecurityCode", {QStringLiteral("1357")}), done);
    QCOMPARE(lock().value(QLatin1String("wrongCodes")).toInt(), 0);
    QCOMPARE(lockOut(1), done);
    QCOMPARE(lockOut(0), done);
    QCOMPARE(state(), QStringLiteral("reply(1)"));
}

void DeviceLockServiceTest::withoutACodeThereIsNoLock()
{
    QCOMPARE(act("lock close"),
             refused + QLatin1String("The phone has no security code, so it cannot be locked"));
    QCOMPARE(announced(), QStringList());
}

void DeviceLockServiceTest::changesSideloading()
{
    const auto change = [this](bool allowed) {
        return manage("ChangeSetting", {sideloading, QVariant::fromValue(QDBusVariant(allowed))});
    };
    writeSettings("# kept\n[desktop]\nveld\\devicelock\\automatic_locking=5\n");
    // It is written when the answer comes.
    QCOMPARE(change(true), done);
    QVERIFY(settings().contains("\nveld\\devicelock\\sideloading_allowed=1\n"));
    // The rest stays.
    QVERIFY(settings().contains("# kept\n"));
    QVERIFY(settings().contains("\nveld\\devicelock\\automatic_locking=5\n"));
    QCOMPARE(change(false), done);
    QVERIFY(settings().contains("\nveld\\devicelock\\sideloading_allowed=0\n"));
    QVERIFY(QFile::remove(settingsFile));
    QCOMPARE(change(true), done);
    QCOMPARE(settings(), QByteArray("[desktop]\nveld\\devicelock\\sideloading_allowed=1\n"));
    QCOMPARE(announced(), QStringList());
}

void DeviceLockServiceTest::refusesOtherSettings()
{
    const QByteArray before = settings();
    const auto change = [this](const QString &key, const QVariant &value) {
        return manage("ChangeSetting", {key, QVariant::fromValue(QDBusVariant(value))});
    };
    for (const QVariant &value : {QVariant(1), QVariant(QStringLiteral("true")), QVariant(QStringList())})
        QCOMPARE(change(sideloading, value),
                 invalid + QStringLiteral("The setting \"%1\" is true or false").arg(sideloading));
    for (const QString &key : {QString(), QStringLiteral("/desktop/veld/devicelock/code_is_set")})
        QCOMPARE(change(key, true),
                 denied + QStringLiteral("There is no setting \"%1\" that could be changed").arg(key));
    QCOMPARE(settings(), before);
}

void DeviceLockServiceTest::clearsAndShutsDown()
{
    manage("SetSecurityCode", {code});
    lockOut(1, {{QStringLiteral("title"), QStringLiteral("Lost")}});
    announced();
    m_peer->callAndNote(QString(), managementPath, managementInterface, QStringLiteral("ClearDevice"), {0u});
    // Answered before the phone goes down.
    QVERIFY(m_peer->waitForSignals(2));
    QVERIFY(waitForTheEndOfThePeer());
    QVERIFY(waitUntil([this] { return !isOn() && !isNamed(); }));
    QVERIFY(!QFile::exists(socketPath));
    QVERIFY(!newPeer()->isConnected());

    QCOMPARE(act("power on"), done);
    QCOMPARE(act("power on"), refused + QLatin1String("The phone is on already"));
    QVERIFY(isNamed());
    const auto peer = newPeer();
    QCOMPARE(state(*peer), QStringLiteral("reply(0)"));
    QCOMPARE(lock().value(QLatin1String("code")).toString(), QString());
    QVERIFY(!lock().contains(QLatin1String("feedback")));
    QVERIFY(phone()
                .value(QLatin1String("storage"))
                .toObject()
                .value(QLatin1String("userFiles"))
                .toArray()
                .isEmpty());
}

void DeviceLockServiceTest::clearsAndRestarts()
{
    manage("SetSecurityCode", {code});
    act("lock close");
    announced();
    const int before = phone().value(QLatin1String("restarts")).toInt();
    m_peer->callAndNote(QString(), managementPath, managementInterface, QStringLiteral("ClearDevice"), {7u});
    QVERIFY(m_peer->waitForSignals(2));
    QVERIFY(waitForTheEndOfThePeer());
    QVERIFY(waitUntil([&] {
        return phone().value(QLatin1String("restarts")).toInt() == before + 1 && isOn() && isNamed();
    }));
    QCOMPARE(state(*newPeer()), QStringLiteral("reply(0)"));
    const QJsonObject storage = phone().value(QLatin1String("storage")).toObject();
    QVERIFY(storage.value(QLatin1String("cardFiles")).toArray().isEmpty());
}

void DeviceLockServiceTest::refusesOptionsThatAreNone_data()
{
    QTest::addColumn<uint>("options");
    QTest::addColumn<uint>("unknown");
    QTest::newRow("8") << 8u << 8u;
    QTest::newRow("9") << 9u << 8u;
    QTest::newRow("all bits") << 4294967295u << 4294967288u;
}

void DeviceLockServiceTest::refusesOptionsThatAreNone()
{
    QFETCH(uint, options);
    QFETCH(uint, unknown);
    manage("SetSecurityCode", {code});
    QCOMPARE(manage("ClearDevice", {options}),
             invalid + QStringLiteral("There is no option %1").arg(unknown));
    // Nothing of it was done.
    QVERIFY(isOn());
    QCOMPARE(lock().value(QLatin1String("code")).toString(), code);
}

void DeviceLockServiceTest::refusesArgumentsOfAnotherType_data()
{
    QTest::addColumn<QByteArray>("method");
    QTest::addColumn<QVariantList>("arguments");
    const QVariantMap nothing;
    QTest::newRow("no mode") << QByteArray("SetLockoutMode") << QVariantList();
    QTest::newRow("no feedback") << QByteArray("SetLockoutMode") << QVariantList{1u};
    QTest::newRow("signed mode") << QByteArray("SetLockoutMode") << QVariantList{1, nothing};
    QTest::newRow("no options") << QByteArray("ClearDevice") << QVariantList();
    QTest::newRow("signed options") << QByteArray("ClearDevice") << QVariantList{0};
    QTest::newRow("two options") << QByteArray("ClearDevice") << QVariantList{0u, 0u};
    QTest::newRow("number for a code") << QByteArray("SetSecurityCode") << QVariantList{1234};
    QTest::newRow("bare value") << QByteArray("ChangeSetting") << QVariantList{sideloading, true};
}

void DeviceLockServiceTest::refusesArgumentsOfAnotherType()
{
    QFETCH(QByteArray, method);
    QFETCH(QVariantList, arguments);
    const QString answer = manage(method, arguments);
    QVERIFY2(answer.startsWith(invalid), qPrintable(answer));
    QVERIFY(isOn());
    QCOMPARE(announced(), QStringList());
}

void DeviceLockServiceTest::knowsNothingElse()
{
    const auto answer = [this](const QString &path, const QString &interface, const char *method) {
        return textOf(m_peer->call(QString(), path, interface, QLatin1String(method)));
    };
    const QString unknown = QStringLiteral("org.freedesktop.DBus.Error.UnknownMethod: ");
    QVERIFY(answer(managementPath, managementInterface, "Explode").startsWith(unknown));
    QVERIFY(answer(managementPath, stateInterface, "Get").startsWith(unknown));
    QVERIFY(answer(statePath, managementInterface, "ClearDevice").startsWith(unknown));
    QVERIFY(answer(QStringLiteral("/other"), stateInterface, "Get").startsWith(unknown));
}

void DeviceLockServiceTest::everyPeerIsTold()
{
    const auto second = newPeer();
    second->watch(QString(), statePath, stateInterface, {changed});
    Client bus(Client::Own);
    bus.watch(service, statePath, stateInterface, {changed});
    auto third = newPeer();
    QCOMPARE(state(*third), QStringLiteral("reply(0)"));
    // One that leaves takes nothing along.
    third.reset();
    QCOMPARE(textOf(manage(*second, "SetLockoutMode", {1u, QVariantMap()})), done);
    QCOMPARE(announced(), QStringList(QStringLiteral("Changed(2)")));
    QCOMPARE(second->takeSignals(QString()), QStringList(QStringLiteral("Changed(2)")));
    QCOMPARE(state(), QStringLiteral("reply(2)"));
    // The bus is not.
    QCOMPARE(bus.takeSignals(service), QStringList());
}

void DeviceLockServiceTest::keepsTheLockOverARestart()
{
    manage("SetSecurityCode", {code});
    act("lock close");
    m_bus.control(QStringLiteral("StopService"), {service});
    QVERIFY(!isNamed());
    QVERIFY(!QFile::exists(socketPath));
    QVERIFY(waitForTheEndOfThePeer());
    m_bus.control(QStringLiteral("StartService"), {service});
    // Who sees the name can connect.
    QVERIFY(isNamed());
    const auto peer = newPeer();
    QVERIFY(peer->isConnected());
    QCOMPARE(state(*peer), QStringLiteral("reply(1)"));
    QCOMPARE(act("lock enter", {code}), QStringLiteral("reply(unlocked)"));
    QCOMPARE(state(*peer), QStringLiteral("reply(0)"));
}

QTEST_GUILESS_MAIN(DeviceLockServiceTest)
#include "devicelockservice_test.moc"
