// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "texts.h"
#include "wirenotification.h"

#include <corvanemdm/notificationinfo.h>

#include <QtCore/QJsonArray>
#include <QtCore/QRegularExpression>
#include <QtCore/QTimeZone>
#include <QtDBus/QDBusArgument>
#include <QtDBus/QDBusMetaType>
#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusSignature>
#include <QtDBus/QDBusUnixFileDescriptor>
#include <QtDBus/QDBusVariant>
#include <QtTest/QtTest>

using Corvane::Mdm::NotificationData;
using Corvane::Mdm::NotificationInfo;
using Notifications = QList<NotificationData>;

/** Things that a remote action may not hold, and one that it may: a list of variants in structures. */
struct Numbers {
    int first = 0;
    int second = 0;
};
Q_DECLARE_METATYPE(Numbers)
struct Boxed {
    QDBusVariant content;
};
Q_DECLARE_METATYPE(Boxed)
using TextMap = QMap<QString, QString>;
Q_DECLARE_METATYPE(TextMap)

QDBusArgument &operator<<(QDBusArgument &out, const Numbers &numbers)
{
    out.beginStructure();
    out << numbers.first << numbers.second;
    out.endStructure();
    return out;
}

QDBusArgument &operator<<(QDBusArgument &out, const Boxed &boxed)
{
    out.beginStructure();
    out << boxed.content;
    out.endStructure();
    return out;
}

// QtDBus wants them; nothing here is read.
const QDBusArgument &operator>>(const QDBusArgument &in, Numbers &)
{
    return in;
}
const QDBusArgument &operator>>(const QDBusArgument &in, Boxed &)
{
    return in;
}

namespace
{

const QString Service = QStringLiteral("org.corvaneos.mdmproxy");
const QString Path = QStringLiteral("/Corvane/Mdm/Proxy/NotificationInfo");

constexpr int deepestShape = 6;

template <typename T> QVariant variant(const T &value)
{
    return QVariant::fromValue(value);
}

QString call(const char *member, const QString &arguments)
{
    return QStringLiteral("%1 %2 (%3)").arg(Path, QLatin1String(member), arguments);
}

NotificationData dataNamed(const QString &summary)
{
    NotificationData data;
    data.owner = QStringLiteral("test");
    data.category = QStringLiteral("x-test");
    data.summary = summary;
    data.timestamp = QDateTime(QDate(2026, 3, 1), QTime(4, 5, 6, 7), Qt::UTC);
    return data;
}

WireNotification wireNotification(uint id, const QVariantList &remoteActions)
{
    WireNotification notification;
    notification.id = id;
    notification.urgency = -2;
    for (int text = 0; text < 7; ++text)
        notification.texts[text] = QString::number(text);
    notification.time = QDateTime(QDate(2026, 3, 1), QTime(4, 5, 6, 7), Qt::UTC);
    for (const QVariant &action : remoteActions)
        notification.remoteActions.append(QDBusVariant(action));
    return notification;
}

/** Whether all but the remote actions is as in wireNotification(). */
bool isWhole(const NotificationData &data, uint id)
{
    const NotificationData expected{
        id,
        -2,
        QStringLiteral("0"),
        QStringLiteral("1"),
        QStringLiteral("2"),
        QStringLiteral("3"),
        QStringLiteral("4"),
        QStringLiteral("5"),
        QStringLiteral("6"),
        QDateTime(QDate(2026, 3, 1), QTime(4, 5, 6, 7), Qt::UTC),
        {},
    };
    return data.id == expected.id && data.urgency == expected.urgency && data.owner == expected.owner
        && data.category == expected.category && data.appName == expected.appName
        && data.appIcon == expected.appIcon && data.summary == expected.summary && data.body == expected.body
        && data.subText == expected.subText && data.timestamp == expected.timestamp
        && data.timestamp.timeSpec() == Qt::UTC;
}

/** The containers around a number, outermost first: m for a{sv}, l for av, s for a(v). */
QStringList shapesOfDepth(int depth)
{
    QStringList shapes{QString()};
    for (int level = 0; level < depth; ++level) {
        QStringList deeper;
        for (const QString &shape : qAsConst(shapes)) {
            for (const char container : {'m', 'l', 's'})
                deeper << shape + QLatin1Char(container);
        }
        shapes = deeper;
    }
    return shapes;
}

/** What goes over the wire, and what is read of it: there a(v) has become a list. */
QVariant nested(const QString &shape, bool onTheWire)
{
    if (shape.isEmpty())
        return 7;
    const QVariant inner = nested(shape.mid(1), onTheWire);
    if (shape.at(0) == QLatin1Char('m'))
        return QVariantMap{{QStringLiteral("before"), true}, {QStringLiteral("key"), inner}};
    if (shape.at(0) == QLatin1Char('l') || !onTheWire)
        return QVariantList{QStringLiteral("before"), inner};
    return variant(QList<Boxed>{{QDBusVariant(QVariant(QStringLiteral("before")))}, {QDBusVariant(inner)}});
}

/** What is logged of a shape that is too deep. */
QStringList complaints(const QString &shape)
{
    constexpr int deepestAllowed = 4;
    QStringList lines;
    if (shape.size() <= deepestAllowed)
        return lines;
    if (shape.at(deepestAllowed) == QLatin1Char('m'))
        lines << QStringLiteral("Too many recursions, not expanding map at depth 5");
    for (int level = deepestAllowed; level >= 0; --level) {
        const bool isMap = shape.at(level) == QLatin1Char('m');
        const bool inMap = level > 0 && shape.at(level - 1) == QLatin1Char('m');
        lines << QStringLiteral("Unable to expand %1 value %2")
                     .arg(isMap ? QLatin1String("map") : QLatin1String("list"),
                          inMap ? QLatin1String("for key: \"key\"") : QLatin1String("in list"));
    }
    lines << QStringLiteral("Failed to expand remote actions from notification");
    return lines;
}

bool isRaw(const QVariant &value)
{
    return value.userType() == qMetaTypeId<QDBusArgument>();
}

} // namespace

class NotificationInfoTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void init();
    void cleanup();

    void signatures();
    void createSendsTheStructure_data();
    void createSendsTheStructure();
    void createdOneIsListed();
    void updateReplacesAllButTheNumber();
    void closedOneIsGone();
    void listsByOwnerAndCategory();
    void closeDoesNotReadTheAnswer();
    void readsTheFieldsInOrder();
    void expandsNestedActions_data();
    void expandsNestedActions();
    void typesThatNoActionHas_data();
    void typesThatNoActionHas();
    void whatIsLeftAlone();
    void oneMalformedActionSparesTheOthers();
    void whatWasReadCanBeSentAgain();
    void actionsThatCannotBeSent_data();
    void actionsThatCannotBeSent();
    void errorsGiveEmptyValues();
    void answersOfAnotherType_data();
    void answersOfAnotherType();
    void serviceThatIsNotThere();
    void worksThroughTheMetaObject();

private:
    Notifications answeredWith(const QList<WireNotification> &answer);

    std::unique_ptr<Phone> m_phone;
};

void NotificationInfoTest::initTestCase()
{
    registerWireNotification();
    qDBusRegisterMetaType<Numbers>();
    qDBusRegisterMetaType<QList<Numbers>>();
    qDBusRegisterMetaType<Boxed>();
    qDBusRegisterMetaType<QList<Boxed>>();
    qDBusRegisterMetaType<TextMap>();
    qDBusRegisterMetaType<QList<int>>();
    qDBusRegisterMetaType<QList<QVariantMap>>();
}

void NotificationInfoTest::init()
{
    m_phone = std::make_unique<Phone>();
}

void NotificationInfoTest::cleanup()
{
    m_phone->clearFaults();
    m_phone->startService(Service);
}

Notifications NotificationInfoTest::answeredWith(const QList<WireNotification> &answer)
{
    m_phone->answerCalls(Service, Path, QStringLiteral("notifications"), {variant(answer)});
    const NotificationInfo info;
    return info.notifications();
}

void NotificationInfoTest::signatures()
{
    const NotificationInfo info;
    QCOMPARE(QDBusMetaType::typeToSignature(qMetaTypeId<NotificationData>()), "(uisssssss((iii)(iiii)i)av)");
    QCOMPARE(QDBusMetaType::typeToSignature(qMetaTypeId<Notifications>()), "a(uisssssss((iii)(iiii)i)av)");
    QCOMPARE(QMetaType::type("Corvane::Mdm::NotificationData"), qMetaTypeId<NotificationData>());
    QCOMPARE(QMetaType::type("QList<Corvane::Mdm::NotificationData>"), qMetaTypeId<Notifications>());
    const NotificationInfo again;
    QCOMPARE(QMetaType::type("Corvane::Mdm::NotificationData"), qMetaTypeId<NotificationData>());
}

void NotificationInfoTest::createSendsTheStructure_data()
{
    QTest::addColumn<QDateTime>("time");
    QTest::addColumn<QString>("wireTime");
    const QDate date(2026, 3, 1);
    const QTime time(4, 5, 6, 7);
    QTest::newRow("UTC") << QDateTime(date, time, Qt::UTC) << "((2026, 3, 1), (4, 5, 6, 7), 1)";
    QTest::newRow("local time") << QDateTime(date, time) << "((2026, 3, 1), (4, 5, 6, 7), 0)";
    QTest::newRow("offset") << QDateTime(date, time, Qt::OffsetFromUTC, 7200)
                            << "((2026, 3, 1), (4, 5, 6, 7), 2)";
    QTest::newRow("zone") << QDateTime(date, time, QTimeZone("Europe/Helsinki"))
                          << "((2026, 3, 1), (4, 5, 6, 7), 3)";
    QTest::newRow("none") << QDateTime() << "((0, 0, 0), (-1, -1, -1, -1), 0)";
}

void NotificationInfoTest::createSendsTheStructure()
{
    QFETCH(QDateTime, time);
    QFETCH(QString, wireTime);
    NotificationInfo info;
    const NotificationData data{
        4294967295U,
        -2147483647 - 1,
        QStringLiteral("owner"),
        QStringLiteral("category"),
        QStringLiteral("app"),
        QStringLiteral("icon"),
        QStringLiteral("summary"),
        QStringLiteral("body"),
        QStringLiteral("sub"),
        time,
        {QVariantMap{
             {QStringLiteral("name"), QStringLiteral("default")},
             {QStringLiteral("arguments"), QVariantList{1, QVariantMap{{QStringLiteral("deep"), true}}}}},
         QStringLiteral("no map"), QByteArray("\1")},
    };
    const QString structure
        = QStringLiteral("(uint32 4294967295, -2147483648, 'owner', 'category', 'app', 'icon', 'summary', "
                         "'body', 'sub', %1, [<{'arguments': <[<1>, <{'deep': <true>}>]>, 'name': "
                         "<'default'>}>, <'no map'>, <[byte 0x01]>])")
              .arg(wireTime);
    m_phone->takeJournal(Service);
    MessageLog log;
    const uint id = info.createNotification(data);
    QVERIFY(id > 0);
    QCOMPARE(m_phone->takeJournal(Service),
             QStringList(call("createNotification", structure + QLatin1Char(','))));
    QCOMPARE(info.updateNotification(id, data), id);
    QCOMPARE(m_phone->takeJournal(Service),
             QStringList(call("updateNotification", QStringLiteral("uint32 %1, ").arg(id) + structure)));
    QVERIFY(info.closeNotification(id));
    QCOMPARE(m_phone->takeJournal(Service),
             QStringList(call("closeNotification", QStringLiteral("uint32 %1,").arg(id))));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void NotificationInfoTest::createdOneIsListed()
{
    NotificationInfo info;
    NotificationData data = dataNamed(QStringLiteral("Created"));
    data.remoteActions = {QVariantMap{
        {QStringLiteral("name"), QStringLiteral("default")},
        {QStringLiteral("arguments"),
         QVariantList{QVariantMap{{QStringLiteral("list"), QVariantList{1, 2.5, QStringLiteral("x")}}}}}}};
    MessageLog log;
    const uint id = info.createNotification(data);
    const Notifications mine = info.notifications(QStringLiteral("test"));
    QCOMPARE(mine.size(), 1);
    QCOMPARE(mine.first().id, id);
    QCOMPARE(mine.first().summary, QStringLiteral("Created"));
    QCOMPARE(mine.first().timestamp, data.timestamp);
    QCOMPARE(mine.first().remoteActions, data.remoteActions);
    QVERIFY(info.closeNotification(id));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void NotificationInfoTest::updateReplacesAllButTheNumber()
{
    NotificationInfo info;
    const uint first = info.createNotification(dataNamed(QStringLiteral("First")));
    const uint second = info.createNotification(dataNamed(QStringLiteral("Second")));
    QVERIFY(first != second);
    NotificationData changed = dataNamed(QStringLiteral("Changed"));
    changed.id = second;
    QCOMPARE(info.updateNotification(first, changed), first);
    const Notifications mine = info.notifications(QStringLiteral("test"));
    QCOMPARE(mine.size(), 2);
    QCOMPARE(mine.first().id, first);
    QCOMPARE(mine.first().summary, QStringLiteral("Changed"));
    QCOMPARE(mine.last().summary, QStringLiteral("Second"));
    QVERIFY(info.closeNotification(first));
    QVERIFY(info.closeNotification(second));
}

void NotificationInfoTest::closedOneIsGone()
{
    NotificationInfo info;
    NotificationInfo other;
    const uint id = info.createNotification(dataNamed(QStringLiteral("Short-lived")));
    QVERIFY(other.closeNotification(id));
    QCOMPARE(info.notifications(QStringLiteral("test")).size(), 0);

    const QString reason = QStringLiteral("There is no notification %1").arg(id);
    MessageLog log;
    QVERIFY(!info.closeNotification(id));
    QCOMPARE(log.takeWarnings(),
             QStringList(QStringLiteral("Failed to close notification: \"%1\"").arg(reason)));
    QCOMPARE(info.updateNotification(id, dataNamed(QStringLiteral("Late"))), 0U);
    QCOMPARE(log.takeWarnings(),
             QStringList(QStringLiteral("Failed to update notification: "
                                        "QDBusError(\"org.corvaneos.mdmproxy.Error.NotFound\", \"%1\")")
                             .arg(reason)));
}

void NotificationInfoTest::listsByOwnerAndCategory()
{
    const NotificationInfo info;
    m_phone->takeJournal(Service);
    MessageLog log;
    const Notifications all = info.notifications();
    QCOMPARE(m_phone->takeJournal(Service), QStringList(call("notifications", QStringLiteral("'',"))));
    QCOMPARE(all.size(), 2);
    QCOMPARE(all.first().category, QStringLiteral("x-corvane.call.missed"));
    QCOMPARE(all.first().remoteActions.first().toMap().value(QStringLiteral("arguments")).toList().size(), 1);

    const Notifications messages = info.notifications(QStringLiteral("messages"));
    QCOMPARE(m_phone->takeJournal(Service),
             QStringList(call("notifications", QStringLiteral("'messages',"))));
    QCOMPARE(messages.size(), 1);
    QCOMPARE(messages.first().appName, QStringLiteral("Messages"));
    QCOMPARE(messages.first().remoteActions, QVariantList());

    const Notifications missed = info.notificationsByCategory(QStringLiteral("x-corvane.call.missed"));
    QCOMPARE(m_phone->takeJournal(Service),
             QStringList(call("notificationsByCategory", QStringLiteral("'x-corvane.call.missed',"))));
    QCOMPARE(missed.size(), 1);
    QCOMPARE(missed.first().owner, QStringLiteral("voicecall-ui"));
    QCOMPARE(info.notificationsByCategory(QString()).size(), 0);
    QCOMPARE(info.notifications(QStringLiteral("nobody")).size(), 0);
    QCOMPARE(log.takeWarnings(), QStringList());
}

void NotificationInfoTest::closeDoesNotReadTheAnswer()
{
    NotificationInfo info;
    MessageLog log;
    const QVariantList answers[] = {{}, {false}, {QStringLiteral("no"), 0}};
    for (const QVariantList &answer : answers) {
        m_phone->answerCalls(Service, Path, QStringLiteral("closeNotification"), answer);
        QVERIFY(info.closeNotification(1));
    }
    QCOMPARE(log.takeWarnings(), QStringList());
}

void NotificationInfoTest::readsTheFieldsInOrder()
{
    MessageLog log;
    const Notifications read = answeredWith({wireNotification(3, {})});
    QCOMPARE(read.size(), 1);
    QVERIFY(isWhole(read.first(), 3));
    QCOMPARE(read.first().remoteActions, QVariantList());
    QCOMPARE(log.takeWarnings(), QStringList());
    QCOMPARE(answeredWith({}).size(), 0);
    QCOMPARE(log.takeWarnings(), QStringList());
}

void NotificationInfoTest::expandsNestedActions_data()
{
    QTest::addColumn<int>("depth");
    for (int depth = 0; depth <= deepestShape; ++depth)
        QTest::addRow("depth %d", depth) << depth;
}

void NotificationInfoTest::expandsNestedActions()
{
    QFETCH(int, depth);
    const QStringList shapes = shapesOfDepth(depth);
    QList<WireNotification> answer;
    for (int i = 0; i < shapes.size(); ++i)
        answer << wireNotification(uint(i), {nested(shapes.at(i), true), QStringLiteral("next")});
    MessageLog log;
    const Notifications read = answeredWith(answer);
    QStringList warnings = log.takeWarnings();

    QCOMPARE(read.size(), shapes.size());
    for (int i = 0; i < shapes.size(); ++i) {
        const QByteArray shape = shapes.at(i).toLatin1();
        const QStringList expected = complaints(shapes.at(i));
        QCOMPARE(warnings.mid(0, expected.size()), expected);
        warnings = warnings.mid(expected.size());

        QVERIFY2(isWhole(read.at(i), uint(i)), shape);
        const QVariantList actions = read.at(i).remoteActions;
        QCOMPARE(actions.size(), 2);
        QCOMPARE(actions.last(), QVariant(QStringLiteral("next")));
        if (expected.isEmpty())
            QVERIFY2(actions.first() == nested(shapes.at(i), false), shape);
        else
            QVERIFY2(isRaw(actions.first()), shape);
    }
    QCOMPARE(warnings, QStringList());
}

void NotificationInfoTest::typesThatNoActionHas_data()
{
    QTest::addColumn<QVariant>("value");
    QTest::addColumn<QString>("typeAndSignature");
    constexpr int array = QDBusArgument::ArrayType;
    constexpr int structure = QDBusArgument::StructureType;
    constexpr int map = QDBusArgument::MapType;
    const auto row = [](const char *signature, const QVariant &value, int type) {
        QTest::newRow(signature) << value
                                 << QStringLiteral("%1|\"%2\"").arg(type).arg(QLatin1String(signature));
    };
    row("a(ii)", variant(QList<Numbers>{{1, 2}}), array);
    row("(ii)", variant(Numbers{1, 2}), structure);
    row("(v)", variant(Boxed{QDBusVariant(1)}), structure);
    row("ai", variant(QList<int>{1}), array);
    row("a{ss}", variant(TextMap{{QStringLiteral("a"), QStringLiteral("b")}}), map);
    row("aa{sv}", variant(QList<QVariantMap>{{}}), array);
    row("((iii)(iiii)i)", variant(QDateTime::currentDateTime()), structure);
}

void NotificationInfoTest::typesThatNoActionHas()
{
    QFETCH(QVariant, value);
    QFETCH(QString, typeAndSignature);
    const QString type = typeAndSignature.section(QLatin1Char('|'), 0, 0);
    const QString signature = typeAndSignature.section(QLatin1Char('|'), 1);
    const QString inList
        = QStringLiteral("Don't know how to expand type: %1 in list with signature: %2").arg(type, signature);
    const QString inMap
        = QStringLiteral("Don't know how to expand type: %1 for key: \"odd\" with signature: %2")
              .arg(type, signature);
    const QString failed = QStringLiteral("Failed to expand remote actions from notification");

    MessageLog log;
    const Notifications read = answeredWith(
        {wireNotification(1, {value}), wireNotification(2, {QVariantMap{{QStringLiteral("odd"), value}}}),
         wireNotification(3, {variant(QVariantList{value})})});
    QCOMPARE(log.takeWarnings(),
             QStringList({inList, failed, inMap, QStringLiteral("Unable to expand map value in list"), failed,
                          inList, QStringLiteral("Unable to expand list value in list"), failed}));
    QCOMPARE(read.size(), 3);
    for (int i = 0; i < read.size(); ++i) {
        QVERIFY(isWhole(read.at(i), uint(i + 1)));
        QCOMPARE(read.at(i).remoteActions.size(), 1);
        QVERIFY(isRaw(read.at(i).remoteActions.first()));
    }
    // What could not be expanded is still as it came.
    const auto raw = read.at(1).remoteActions.first().value<QDBusArgument>();
    QCOMPARE(qdbus_cast<QVariantMap>(raw).keys(), texts({"odd"}));
}

void NotificationInfoTest::whatIsLeftAlone()
{
    const QVariantList simple{true,
                              variant(uchar(1)),
                              variant(short(-2)),
                              variant(ushort(3)),
                              -4,
                              5U,
                              -6LL,
                              7ULL,
                              8.5,
                              QStringLiteral("text"),
                              QByteArray("\0\1", 2),
                              QStringList{QStringLiteral("a"), QStringLiteral("b")}};
    MessageLog log;
    QVariantList read = answeredWith({wireNotification(1, simple)}).value(0).remoteActions;
    QCOMPARE(read, simple);
    for (int i = 0; i < read.size(); ++i)
        QCOMPARE(read.at(i).userType(), simple.at(i).userType());

    read = answeredWith({wireNotification(1,
                                          {variant(QDBusVariant(QDBusVariant(1).variant())),
                                           variant(QDBusObjectPath(QStringLiteral("/a"))),
                                           variant(QDBusSignature(QStringLiteral("a{sv}")))})})
               .value(0)
               .remoteActions;
    QCOMPARE(read.size(), 3);
    QCOMPARE(read.at(0).value<QDBusVariant>().variant(), QVariant(1));
    QCOMPARE(read.at(1).value<QDBusObjectPath>().path(), QStringLiteral("/a"));
    QCOMPARE(read.at(2).value<QDBusSignature>().signature(), QStringLiteral("a{sv}"));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void NotificationInfoTest::oneMalformedActionSparesTheOthers()
{
    const QVariantMap good{{QStringLiteral("name"), QStringLiteral("good")},
                           {QStringLiteral("in"), QVariantMap{{QStringLiteral("n"), 1}}}};
    const QVariant bad = variant(QList<Numbers>{{1, 2}});
    MessageLog log;
    const Notifications read
        = answeredWith({wireNotification(1, {good, bad, good}), wireNotification(2, {good})});
    QCOMPARE(log.takeWarnings(),
             texts({"Don't know how to expand type: 2 in list with signature: \"a(ii)\"",
                    "Failed to expand remote actions from notification"}));
    QCOMPARE(read.size(), 2);
    QCOMPARE(read.at(0).remoteActions.size(), 3);
    QCOMPARE(read.at(0).remoteActions.first().toMap(), good);
    QVERIFY(isRaw(read.at(0).remoteActions.at(1)));
    QVERIFY(isWhole(read.at(1), 2));
    QCOMPARE(read.at(1).remoteActions.first().toMap(), good);
}

void NotificationInfoTest::whatWasReadCanBeSentAgain()
{
    const QString key = QStringLiteral("key");
    const QVariant odd = variant(QList<Numbers>{{1, 2}});
    const QVariantList actions{odd, QVariantMap{{key, odd}}, QVariantMap{{key, QVariantList{1}}}};
    MessageLog log;
    NotificationInfo info;
    const uint id = info.createNotification(dataNamed(QStringLiteral("Odd")));
    NotificationData data = answeredWith({wireNotification(id, actions)}).value(0);
    QVERIFY(isRaw(data.remoteActions.value(0)));
    QCOMPARE(log.takeWarnings().size(), 2);
    m_phone->clearFaults();
    m_phone->takeJournal(Service);

    data.body = QStringLiteral("changed");
    QCOMPARE(info.updateNotification(id, data), id);
    const uint other = info.createNotification(data);
    QVERIFY(other != 0);
    const QStringList calls = m_phone->takeJournal(Service);
    QCOMPARE(calls.size(), 2);
    for (const QString &call : calls) {
        QVERIFY2(call.contains(QLatin1String("[<[(1, 2)]>, <{'key': <[(1, 2)]>}>, <{'key': <[<1>]>}>]")),
                 qPrintable(call));
    }
    QCOMPARE(log.takeWarnings(), QStringList());
    QVERIFY(info.closeNotification(id));
    QVERIFY(info.closeNotification(other));
}

void NotificationInfoTest::actionsThatCannotBeSent_data()
{
    QTest::addColumn<QVariantList>("actions");
    const QString key = QStringLiteral("key");
    const QVariant unknown = QVariant::fromValue(QRegularExpression());
    QTest::newRow("invalid") << QVariantList{QVariant()};
    QTest::newRow("after a good one") << QVariantList{QVariantMap{{key, 1}}, QVariant()};
    QTest::newRow("in a map") << QVariantList{QVariantMap{{key, QVariant()}}};
    QTest::newRow("in a list in a hash") << QVariantList{QVariantHash{{key, QVariantList{1, QVariant()}}}};
    QTest::newRow("of a type that the wire does not have") << QVariantList{QVariantMap{{key, unknown}}};
    QTest::newRow("empty path") << QVariantList{variant(QDBusObjectPath())};
    QTest::newRow("empty signature") << QVariantList{variant(QDBusSignature())};
    QTest::newRow("no file") << QVariantList{variant(QDBusUnixFileDescriptor())};
    QTest::newRow("nothing read") << QVariantList{variant(QDBusArgument())};
    QTest::newRow("in a box") << QVariantList{variant(QDBusVariant(unknown))};
}

/** Leaves nothing behind either, which the sanitizers see. */
void NotificationInfoTest::actionsThatCannotBeSent()
{
    QFETCH(QVariantList, actions);
    NotificationInfo info;
    NotificationData data = dataNamed(QStringLiteral("Unsendable"));
    data.remoteActions = actions;
    m_phone->takeJournal(Service);
    MessageLog log;
    QCOMPARE(info.createNotification(data), 0U);
    QStringList warnings = log.takeWarnings();
    QVERIFY(!warnings.isEmpty());
    QVERIFY2(warnings.last().startsWith(QLatin1String("Failed to create notification: QDBusError(")),
             qPrintable(warnings.last()));
    QCOMPARE(info.updateNotification(1, data), 0U);
    warnings = log.takeWarnings();
    QVERIFY2(warnings.last().startsWith(QLatin1String("Failed to update notification: QDBusError(")),
             qPrintable(warnings.last()));
    QCOMPARE(m_phone->takeJournal(Service), QStringList());
}

void NotificationInfoTest::errorsGiveEmptyValues()
{
    NotificationInfo info;
    QCOMPARE(info.notifications().size(), 2);
    m_phone->failCalls(Service, Path, QString(), QStringLiteral("com.example.Broken"),
                       QStringLiteral("Out of order"));
    const QString error = QStringLiteral(" QDBusError(\"com.example.Broken\", \"Out of order\")");
    MessageLog log;
    QCOMPARE(info.createNotification({}), 0U);
    QCOMPARE(log.takeWarnings(), QStringList(QStringLiteral("Failed to create notification:") + error));
    QCOMPARE(info.updateNotification(1, {}), 0U);
    QCOMPARE(log.takeWarnings(), QStringList(QStringLiteral("Failed to update notification:") + error));
    QCOMPARE(info.closeNotification(1), false);
    QCOMPARE(log.takeWarnings(), texts({"Failed to close notification: \"Out of order\""}));
    QCOMPARE(info.notifications(QStringLiteral("messages")).size(), 0);
    QCOMPARE(log.takeWarnings(), QStringList(QStringLiteral("Failed to retrieve notifications:") + error));
    QCOMPARE(info.notificationsByCategory(QStringLiteral("x")).size(), 0);
    QCOMPARE(log.takeWarnings(),
             QStringList(QStringLiteral("Failed to retrieve notifications by category:") + error));
    m_phone->clearFaults();
    QCOMPARE(info.notifications().size(), 2);
    QCOMPARE(log.takeWarnings(), QStringList());
}

void NotificationInfoTest::answersOfAnotherType_data()
{
    QTest::addColumn<QVariantList>("answer");
    QTest::newRow("nothing") << QVariantList();
    QTest::newRow("text") << QVariantList{QStringLiteral("7")};
    QTest::newRow("boolean") << QVariantList{true};
    QTest::newRow("other structures") << QVariantList{variant(QList<Numbers>{{1, 2}})};
    QTest::newRow("one, not a list") << QVariantList{variant(wireNotification(1, {}))};
}

void NotificationInfoTest::answersOfAnotherType()
{
    QFETCH(QVariantList, answer);
    m_phone->answerCalls(Service, Path, QString(), answer);
    NotificationInfo info;
    MessageLog log;
    QCOMPARE(info.createNotification({}), 0U);
    QCOMPARE(info.updateNotification(1, {}), 0U);
    QCOMPARE(info.notifications().size(), 0);
    QCOMPARE(info.notificationsByCategory(QString()).size(), 0);
    const QStringList warnings = log.takeWarnings();
    const QStringList expected
        = texts({"Failed to create notification: ", "Failed to update notification: ",
                 "Failed to retrieve notifications: ", "Failed to retrieve notifications by category: "});
    QCOMPARE(warnings.size(), expected.size());
    for (int i = 0; i < expected.size(); ++i)
        QVERIFY2(
            warnings.at(i).startsWith(
                expected.at(i) + QLatin1String("QDBusError(\"org.freedesktop.DBus.Error.InvalidSignature")),
            qPrintable(warnings.at(i)));
}

void NotificationInfoTest::serviceThatIsNotThere()
{
    m_phone->stopService(Service);
    MessageLog log;
    NotificationInfo info;
    QCOMPARE(log.takeWarnings(), QStringList());
    QCOMPARE(info.createNotification({}), 0U);
    QCOMPARE(info.closeNotification(1), false);
    QCOMPARE(info.notifications().size(), 0);
    const QStringList warnings = log.takeWarnings();
    QCOMPARE(warnings.size(), 3);
    QVERIFY2(warnings.first().startsWith(
                 QLatin1String("Failed to create notification: "
                               "QDBusError(\"org.freedesktop.DBus.Error.ServiceUnknown\"")),
             qPrintable(warnings.first()));

    m_phone->startService(Service);
    QCOMPARE(info.notifications().size(), 2);
    QCOMPARE(log.takeWarnings(), QStringList());
}

void NotificationInfoTest::worksThroughTheMetaObject()
{
    NotificationInfo info;
    const QMetaObject *meta = info.metaObject();
    QCOMPARE(meta->propertyCount() - meta->propertyOffset(), 0);
    uint id = 0;
    QVERIFY(QMetaObject::invokeMethod(
        &info, "createNotification", Q_RETURN_ARG(uint, id),
        Q_ARG(Corvane::Mdm::NotificationData, dataNamed(QStringLiteral("By name")))));
    Notifications found;
    QVERIFY(QMetaObject::invokeMethod(&info, "notifications",
                                      Q_RETURN_ARG(QList<Corvane::Mdm::NotificationData>, found),
                                      Q_ARG(QString, QStringLiteral("test"))));
    QCOMPARE(found.size(), 1);
    QCOMPARE(found.first().id, id);
    QVERIFY(QMetaObject::invokeMethod(&info, "notifications",
                                      Q_RETURN_ARG(QList<Corvane::Mdm::NotificationData>, found)));
    QCOMPARE(found.size(), 3);
    bool closed = false;
    QVERIFY(
        QMetaObject::invokeMethod(&info, "closeNotification", Q_RETURN_ARG(bool, closed), Q_ARG(uint, id)));
    QVERIFY(closed);
}

QTEST_GUILESS_MAIN(NotificationInfoTest)
#include "notificationinfo_test.moc"
