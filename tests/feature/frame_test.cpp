// SPDX-License-Identifier: LGPL-2.1-or-later
#include "frame/asynccommand_p.h"
#include "frame/blockingquery_p.h"
#include "frame/mdmproxy_p.h"
#include "frame/objectpathproperties_p.h"
#include "platform/frame/signalconnection_p.h"

#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"
#include "waiting.h"

#include <timed/triggers.h>

#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusInterface>
#include <QtDBus/QDBusMetaType>
#include <QtDBus/QDBusPendingReply>
#include <QtTest/QtTest>

#include <memory>

using namespace Corvane::Mdm;

namespace
{

const QString Echo = QStringLiteral("com.example.Echo");

} // namespace

/** A feature with one command, as a feature's header has it. */
class Feature : public QObject
{
    Q_OBJECT

public:
    Feature()
        : command(this, &Feature::busyChanged, &Feature::done, &Feature::failed)
    {
        connect(this, &Feature::busyChanged, this, [this] { busyValues.append(command.isBusy()); });
    }

    void call()
    {
        command.follow(
            new QDBusPendingCallWatcher(QDBusConnection::systemBus().asyncCall(QDBusMessage::createMethodCall(
                MdmProxy::Service, MdmProxy::SoftwareUpdate.path, MdmProxy::SoftwareUpdate.interface,
                QStringLiteral("registerClient")))));
    }

    AsyncCommand<Feature> command;
    QList<bool> busyValues;

Q_SIGNALS:
    void done();
    void failed();
    void busyChanged();
};

/** Sends back whatever it is called with. */
class EchoObject : public QObject
{
    Q_OBJECT
    Q_CLASSINFO("D-Bus Interface", "com.example.Echo")

public Q_SLOTS:
    void echo(const QDBusMessage &message)
    {
        message.setDelayedReply(true);
        signature = message.signature();
        QDBusConnection::systemBus().send(message.createReply(message.arguments()));
    }

public:
    QString signature;
};

/** Listens to a service by name, as the features do. */
class Listener : public QObject
{
    Q_OBJECT

public Q_SLOTS:
    void textArrived(const QString &text) { seen.append(text); }
    void propertyArrived(const QString &name, const QDBusVariant &) { seen.append(name); }
    void messageArrived(const QDBusMessage &message) { seen.append(message.signature()); }
    void somethingArrived() { seen.append(QStringLiteral("something")); }

public:
    QStringList seen;
};

class FrameTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init() { m_phone = std::make_unique<Phone>(); }

    void cleanup() { m_phone->clearFaults(); }

    void endpoints();
    void blockingQueryReturnsTheAnswerOrTheEmptyValue();
    void commandIsBusyUntilItIsAnswered();
    void commandFails();
    void newerCommandSupersedesTheOlder();
    void commandDiesWithItsFeature();
    void featureDeletedWhileTheCommandEnds();
    void objectPathPropertiesFromTheWire();
    void objectPathPropertiesThereAndBack();
    void triggersThereAndBack();
    void signalsOfOtherTypesAreNotTaken_data();
    void signalsOfOtherTypesAreNotTaken();
    void signalConnectionsEnd();

private:
    template <typename T> T thereAndBack(const T &value, QString *signature);

    std::unique_ptr<Phone> m_phone;
};

template <typename T> T FrameTest::thereAndBack(const T &value, QString *signature)
{
    // A connection of its own, so that the message is really sent.
    const QString name = QStringLiteral("echo");
    QDBusConnection other = QDBusConnection::connectToBus(QDBusConnection::SystemBus, name);
    EchoObject object;
    QDBusConnection::systemBus().registerObject(QStringLiteral("/"), &object,
                                                QDBusConnection::ExportAllSlots);
    QDBusMessage call = QDBusMessage::createMethodCall(QDBusConnection::systemBus().baseService(),
                                                       QStringLiteral("/"), Echo, QStringLiteral("echo"));
    call.setArguments({QVariant::fromValue(value)});
    const QDBusPendingCallWatcher watcher(other.asyncCall(call));
    const QDBusPendingReply<T> reply = watcher;
    if (!waitUntil([&] { return watcher.isFinished(); }) || reply.isError())
        qFatal("no echo: %s", qPrintable(reply.error().message()));
    QDBusConnection::systemBus().unregisterObject(QStringLiteral("/"));
    QDBusConnection::disconnectFromBus(name);
    *signature = object.signature;
    return reply.value();
}

void FrameTest::endpoints()
{
    QCOMPARE(MdmProxy::Service, QLatin1String("org.corvaneos.mdmproxy"));
    const QVector<QPair<MdmProxy::Endpoint, const char *>> table
        = {{MdmProxy::Accounts, "Accounts"},
           {MdmProxy::CallStatistics, "CallStatistics"},
           {MdmProxy::LocationInfo, "LocationInfo"},
           {MdmProxy::NotificationInfo, "NotificationInfo"},
           {MdmProxy::SoftwareUpdate, "SoftwareUpdate"},
           {MdmProxy::Autostart, "Autostart"}};
    for (const auto &row : table) {
        const QString feature = QString::fromLatin1(row.second);
        QCOMPARE(row.first.path, QStringLiteral("/Corvane/Mdm/Proxy/") + feature);
        QCOMPARE(row.first.interface, QStringLiteral("org.corvaneos.mdmproxy.") + feature.toLower());
    }
}

void FrameTest::blockingQueryReturnsTheAnswerOrTheEmptyValue()
{
    QDBusInterface proxy(MdmProxy::Service, MdmProxy::SoftwareUpdate.path, MdmProxy::SoftwareUpdate.interface,
                         QDBusConnection::systemBus());
    const QString method = QStringLiteral("downloadSoftwareUpdate");
    m_phone->takeJournal(MdmProxy::Service);
    m_phone->answerCalls(MdmProxy::Service, QString(), method, {42});
    QCOMPARE(blockingQuery<int>(&proxy, method, "Failed to count", {QStringLiteral("5.1")}, -1), 42);
    QCOMPARE(
        m_phone->takeJournal(MdmProxy::Service),
        QStringList(QStringLiteral("/Corvane/Mdm/Proxy/SoftwareUpdate downloadSoftwareUpdate ('5.1',)")));

    m_phone->failCalls(MdmProxy::Service, QString(), method, QStringLiteral("com.example.Broken"),
                       QStringLiteral("Why"));
    QTest::ignoreMessage(QtWarningMsg, "Failed to count QDBusError(\"com.example.Broken\", \"Why\")");
    QCOMPARE(blockingQuery<int>(&proxy, method, "Failed to count", {QStringLiteral("5.1")}, -1), -1);
    QTest::ignoreMessage(QtWarningMsg, "Failed to name QDBusError(\"com.example.Broken\", \"Why\")");
    QVERIFY(blockingQuery<QString>(&proxy, method, "Failed to name", {QStringLiteral("5.1")}).isNull());
}

void FrameTest::commandIsBusyUntilItIsAnswered()
{
    Feature feature;
    SignalSequence seen(&feature);
    QVERIFY(!feature.command.isBusy());
    feature.call();
    QCOMPARE(seen.take(), QStringList(QStringLiteral("busyChanged()")));
    QVERIFY(seen.waitFor(2));
    QCOMPARE(seen.take(), QStringList({QStringLiteral("busyChanged()"), QStringLiteral("done()")}));
    QCOMPARE(feature.busyValues, QList<bool>({true, false}));
}

void FrameTest::commandFails()
{
    m_phone->failCalls(MdmProxy::Service, QString(), QString(), QStringLiteral("com.example.Broken"),
                       QString());
    Feature feature;
    SignalSequence seen(&feature);
    feature.call();
    QVERIFY(seen.waitFor(3));
    QCOMPARE(seen.take(),
             QStringList({QStringLiteral("busyChanged()"), QStringLiteral("busyChanged()"),
                          QStringLiteral("failed()")}));
    QCOMPARE(feature.busyValues, QList<bool>({true, false}));
}

void FrameTest::newerCommandSupersedesTheOlder()
{
    m_phone->failCalls(MdmProxy::Service, QString(), QString(), QStringLiteral("com.example.Broken"),
                       QString());
    Feature feature;
    SignalSequence seen(&feature);
    feature.call();
    m_phone->clearFaults();
    feature.call();
    QVERIFY(feature.command.isBusy());
    QVERIFY(seen.waitFor(4));
    m_phone->settle(MdmProxy::Service);
    QCOMPARE(seen.take(),
             QStringList({QStringLiteral("busyChanged()"), QStringLiteral("busyChanged()"),
                          QStringLiteral("busyChanged()"), QStringLiteral("done()")}));
    QCOMPARE(feature.busyValues, QList<bool>({true, true, false}));
}

void FrameTest::commandDiesWithItsFeature()
{
    m_phone->delayCalls(MdmProxy::Service, QString(), QStringLiteral("registerClient"), 10);
    {
        Feature feature;
        feature.call();
    }
    m_phone->settle(MdmProxy::Service);
}

void FrameTest::featureDeletedWhileTheCommandEnds()
{
    auto feature = std::make_unique<Feature>();
    feature->call();
    int ended = 0;
    connect(feature.get(), &Feature::done, this, [&ended] { ++ended; });
    connect(feature.get(), &Feature::busyChanged, this, [&feature] { feature.reset(); });
    QVERIFY(waitUntil([&] { return !feature; }));
    m_phone->settle(MdmProxy::Service);
    QCOMPARE(ended, 0);
}

void FrameTest::objectPathPropertiesFromTheWire()
{
    registerObjectPathProperties();
    registerObjectPathProperties();
    QDBusPendingReply<ObjectPathPropertiesList> reply = QDBusConnection::systemBus().asyncCall(
        QDBusMessage::createMethodCall(QStringLiteral("org.ofono"), QStringLiteral("/"),
                                       QStringLiteral("org.ofono.Manager"), QStringLiteral("GetModems")));
    reply.waitForFinished();
    QVERIFY2(!reply.isError(), qPrintable(reply.error().message()));
    const ObjectPathPropertiesList modems = reply.value();
    QCOMPARE(modems.size(), 2);
    QVERIFY(modems.first().path.path().startsWith(QLatin1Char('/')));
    QVERIFY(modems.first().path != modems.last().path);
    QVERIFY(modems.first()
                .properties.value(QStringLiteral("Interfaces"))
                .toStringList()
                .contains(QStringLiteral("org.ofono.SimManager")));
}

void FrameTest::objectPathPropertiesThereAndBack()
{
    registerObjectPathProperties();
    QCOMPARE(QMetaType::type("Corvane::Mdm::ObjectPathPropertiesList"),
             qMetaTypeId<ObjectPathPropertiesList>());
    ObjectPathProperties context;
    context.path = QDBusObjectPath(QStringLiteral("/ril_0/context1"));
    context.properties
        = {{QStringLiteral("Name"), QStringLiteral("Internet")}, {QStringLiteral("Active"), true}};
    QString signature;
    const ObjectPathPropertiesList back = thereAndBack(
        ObjectPathPropertiesList({context, ObjectPathProperties{QDBusObjectPath(QStringLiteral("/")), {}}}),
        &signature);
    QCOMPARE(signature, QStringLiteral("a(oa{sv})"));
    QCOMPARE(back.size(), 2);
    QCOMPARE(back.first().path, context.path);
    QCOMPARE(back.first().properties, context.properties);
    QVERIFY(back.last().properties.isEmpty());

    thereAndBack(context, &signature);
    QCOMPARE(signature, QStringLiteral("(oa{sv})"));
}

void FrameTest::triggersThereAndBack()
{
    Maemo::Timed::Event::Triggers triggers;
    triggers.insert(1, 1700000000U);
    triggers.insert(0xffffffffU, 0);
    QString signature;
    const Maemo::Timed::Event::Triggers back = thereAndBack(triggers, &signature);
    QCOMPARE(signature, QStringLiteral("a{uu}"));
    QCOMPARE(back, triggers);
}

void FrameTest::signalsOfOtherTypesAreNotTaken_data()
{
    QTest::addColumn<QByteArray>("slot");
    QTest::addColumn<QStringList>("expected");

    // Arrays, structures and maps are what QtDBus itself would end the program for.
    const QString text = QStringLiteral("text");
    QTest::newRow("text") << QByteArray(SLOT(textArrived(QString))) << QStringList{text};
    QTest::newRow("property") << QByteArray(SLOT(propertyArrived(QString, QDBusVariant)))
                              << QStringList{text};
    QTest::newRow("message") << QByteArray(SLOT(messageArrived(QDBusMessage)))
                             << QStringList{QStringLiteral("s"),     QStringLiteral("sv"),
                                            QStringLiteral("a{sv}"), QStringLiteral("as"),
                                            QStringLiteral("u"),     QString()};
    const QString something = QStringLiteral("something");
    QTest::newRow("nothing") << QByteArray(SLOT(somethingArrived()))
                             << QStringList{something, something, something, something, something, something};
}

void FrameTest::signalsOfOtherTypesAreNotTaken()
{
    QFETCH(QByteArray, slot);
    QFETCH(QStringList, expected);
    Listener listener;
    const DBusSignal signal{MdmProxy::Service, QStringLiteral("/example"), Echo, QStringLiteral("Changed")};
    QVERIFY(connectDBusSignal(QDBusConnection::systemBus(), signal, &listener, slot));

    const QVariantMap map{{QStringLiteral("key"), 1}};
    const QList<QVariantList> messages{
        {QStringLiteral("text")},
        {QStringLiteral("text"), QVariant::fromValue(QDBusVariant(map))},
        {map},
        {QStringList{QStringLiteral("a"), QStringLiteral("b")}},
        {3U},
        {},
    };
    for (const QVariantList &arguments : messages)
        m_phone->emitSignal(signal.service, signal.path, signal.interface, signal.member, arguments);
    QCOMPARE(listener.seen, expected);
}

void FrameTest::signalConnectionsEnd()
{
    Listener listener;
    const DBusSignal signal{MdmProxy::Service, QStringLiteral("/example"), Echo, QStringLiteral("Changed")};
    const char *const slot = SLOT(textArrived(QString));
    QVERIFY(connectDBusSignal(QDBusConnection::systemBus(), signal, &listener, slot));
    QVERIFY(disconnectDBusSignal(QDBusConnection::systemBus(), signal, &listener, slot));
    m_phone->emitSignal(signal.service, signal.path, signal.interface, signal.member,
                        {QStringLiteral("text")});
    QCOMPARE(listener.seen, QStringList());

    QVERIFY(!connectDBusSignal(QDBusConnection::systemBus(), signal, &listener, SLOT(absent(QString))));
}

QTEST_GUILESS_MAIN(FrameTest)
#include "frame_test.moc"
