// SPDX-License-Identifier: LGPL-2.1-or-later
#include "waiting.h"

#include <mlite/mgconfitem.h>

#include <QtCore/QProcess>
#include <QtCore/QRegularExpression>
#include <QtTest/QtTest>

#include <dconf.h>

#include <cstring>

namespace
{

const QString Folder = QStringLiteral("/desktop/corvane/test/");
const QString Key = Folder + QStringLiteral("key");
const QString KeyBeside = Folder + QStringLiteral("key-beside");
constexpr char WithoutSessionBus[] = "--without-session-bus";

/** Writes @p text, a value in GVariant's text form, as another program would; null removes what is there. */
void writeElsewhere(const QString &path, const char *text)
{
    DConfClient *client = dconf_client_new();
    GVariant *value = text ? g_variant_new_parsed(text) : nullptr;
    QVERIFY(dconf_client_write_sync(client, path.toUtf8().constData(), value, nullptr, nullptr, nullptr));
    g_object_unref(client);
}

/** What the test starts anew where there is no session bus; the status tells what went wrong first. */
int runWithoutSessionBus()
{
    MGConfItem stored(Key);
    if (stored.value(false) != QVariant(true))
        return 1;
    MGConfItem missing(KeyBeside);
    if (missing.value().isValid() || missing.value(7) != QVariant(7))
        return 2;
    QObject::connect(&missing, &MGConfItem::valueChanged, [] {});
    missing.set(1);
    missing.unset();
    for (int i = 0; i < 10; ++i)
        QCoreApplication::processEvents();
    if (stored.value(false) != QVariant(true))
        return 3;
    return 0;
}

} // namespace

/** On a session bus of its own, with the real service of the configuration store. */
class MGConfItemTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void cleanup();

    void missingReadsAsDefault();
    void keyThatIsNone_data();
    void keyThatIsNone();
    void storesEachType_data();
    void storesEachType();
    void readsTypesOfOthers_data();
    void readsTypesOfOthers();
    void typeWithoutPlaceIsRefused();
    void unsetIsMissing();
    void tellsChanges();
    void tellsChangesOfTheFolder();
    void worksWithoutASessionBus();
};

void MGConfItemTest::cleanup()
{
    writeElsewhere(Folder, nullptr);
}

void MGConfItemTest::missingReadsAsDefault()
{
    const MGConfItem item(Key);
    QCOMPARE(item.key(), Key);
    QVERIFY(!item.value().isValid());
    QCOMPARE(item.value(true), QVariant(true));
    QCOMPARE(item.value(QStringLiteral("text")), QVariant(QStringLiteral("text")));
}

void MGConfItemTest::keyThatIsNone_data()
{
    QTest::addColumn<QString>("key");
    QTest::newRow("empty") << QString();
    QTest::newRow("relative") << "desktop/key";
    QTest::newRow("folder") << Folder;
    QTest::newRow("empty part") << "/desktop//key";
}

void MGConfItemTest::keyThatIsNone()
{
    QFETCH(QString, key);
    MGConfItem item(key);
    QCOMPARE(item.value(1), QVariant(1));
    QTest::ignoreMessage(QtWarningMsg,
                         QRegularExpression(QStringLiteral("^No key of the configuration store: ")));
    item.set(1);
    QTest::ignoreMessage(QtWarningMsg,
                         QRegularExpression(QStringLiteral("^No key of the configuration store: ")));
    item.unset();
    connect(&item, &MGConfItem::valueChanged, this, [] {});
}

void MGConfItemTest::storesEachType_data()
{
    QTest::addColumn<QVariant>("value");
    QTest::newRow("true") << QVariant(true);
    QTest::newRow("false") << QVariant(false);
    QTest::newRow("int") << QVariant(-7);
    QTest::newRow("uint") << QVariant(4000000000u);
    QTest::newRow("longlong") << QVariant(Q_INT64_C(-5000000000));
    QTest::newRow("ulonglong") << QVariant(Q_UINT64_C(18000000000000000000));
    QTest::newRow("double") << QVariant(2.5);
    QTest::newRow("text") << QVariant(QStringLiteral("Grüße"));
    QTest::newRow("empty text") << QVariant(QString());
    QTest::newRow("list") << QVariant(QStringList({QStringLiteral("a"), QString(), QStringLiteral("ö")}));
    QTest::newRow("empty list") << QVariant(QStringList());
}

void MGConfItemTest::storesEachType()
{
    QFETCH(QVariant, value);
    MGConfItem item(Key);
    const MGConfItem other(Key);
    item.set(value);
    // At once here, and elsewhere when it is stored.
    QCOMPARE(item.value(), value);
    QCOMPARE(item.value().userType(), value.userType());
    QVERIFY(waitUntil([&] {
        QCoreApplication::postEvent(qApp, new QEvent(QEvent::User)); // the file is not waited for
        return other.value() == value;
    }));
    QCOMPARE(other.value().userType(), value.userType());
}

void MGConfItemTest::readsTypesOfOthers_data()
{
    QTest::addColumn<QByteArray>("stored");
    QTest::addColumn<QVariant>("value");
    QTest::newRow("byte") << QByteArray("byte 200") << QVariant(200u);
    QTest::newRow("int16") << QByteArray("int16 -3") << QVariant(-3);
    QTest::newRow("uint16") << QByteArray("uint16 60000") << QVariant(60000u);
    QTest::newRow("object path") << QByteArray("objectpath '/a'") << QVariant(QStringLiteral("/a"));
    QTest::newRow("signature") << QByteArray("signature 'as'") << QVariant(QStringLiteral("as"));
    QTest::newRow("variant") << QByteArray("<true>") << QVariant(true);
    QTest::newRow("tuple") << QByteArray("(1, true)") << QVariant();
    QTest::newRow("dictionary") << QByteArray("{'a': 1}") << QVariant();
    QTest::newRow("numbers") << QByteArray("[1, 2]") << QVariant();
}

void MGConfItemTest::readsTypesOfOthers()
{
    QFETCH(QByteArray, stored);
    QFETCH(QVariant, value);
    writeElsewhere(Key, stored.constData());
    const MGConfItem item(Key);
    QCOMPARE(item.value(), value);
    QCOMPARE(item.value(QStringLiteral("default")),
             value.isValid() ? value : QVariant(QStringLiteral("default")));
}

void MGConfItemTest::typeWithoutPlaceIsRefused()
{
    writeElsewhere(Key, "1");
    MGConfItem item(Key);
    QTest::ignoreMessage(QtWarningMsg,
                         QRegularExpression(QStringLiteral("^No value for the configuration store: ")));
    item.set(QVariantMap());
    QTest::ignoreMessage(QtWarningMsg,
                         QRegularExpression(QStringLiteral("^No value for the configuration store: ")));
    item.set(QVariant());
    QCOMPARE(item.value(), QVariant(1));
}

void MGConfItemTest::unsetIsMissing()
{
    writeElsewhere(Key, "true");
    MGConfItem item(Key);
    QCOMPARE(item.value(false), QVariant(true));
    item.unset();
    QVERIFY(!item.value().isValid());
    QCOMPARE(item.value(false), QVariant(false));
}

void MGConfItemTest::tellsChanges()
{
    MGConfItem item(Key);
    QList<QVariant> seen;
    connect(&item, &MGConfItem::valueChanged, this, [&] { seen.append(item.value()); });
    item.set(1);
    QCOMPARE(seen, QList<QVariant>({1}));

    // Following starts with the connection, but not at once.
    QVERIFY(waitUntil([&] {
        writeElsewhere(Key, seen.size() % 2 ? "2" : "3");
        QCoreApplication::postEvent(qApp, new QEvent(QEvent::User));
        return seen.size() > 2;
    }));
    // Changes are told in the order of the writes: with one of the other key, those of this one are all here.
    MGConfItem beside(KeyBeside);
    int besideChanges = 0;
    connect(&beside, &MGConfItem::valueChanged, this, [&] { ++besideChanges; });
    QVERIFY(waitUntil([&] {
        writeElsewhere(KeyBeside, beside.value().toInt() % 2 ? "2" : "3");
        QCoreApplication::postEvent(qApp, new QEvent(QEvent::User));
        return besideChanges > 0;
    }));
    seen.clear();
    writeElsewhere(KeyBeside, "true");
    writeElsewhere(Key, "'last'");
    QVERIFY(waitUntil([&] { return !seen.isEmpty() && seen.last() == QVariant(QStringLiteral("last")); }));
    writeElsewhere(KeyBeside, "false");
    writeElsewhere(Key, nullptr);
    QVERIFY(waitUntil([&] { return !seen.last().isValid(); }));
    // Nothing but the values of the key itself, the last one once.
    QCOMPARE(seen.count(QVariant()), 1);
    QVERIFY(!seen.contains(QVariant(true)) && !seen.contains(QVariant(false)));
}

void MGConfItemTest::tellsChangesOfTheFolder()
{
    writeElsewhere(Key, "1");
    MGConfItem item(Key);
    int changes = 0;
    connect(&item, &MGConfItem::valueChanged, this, [&] { ++changes; });
    item.set(2);
    QVERIFY(waitUntil([&] {
        QCoreApplication::postEvent(qApp, new QEvent(QEvent::User));
        return MGConfItem(Key).value() == QVariant(2);
    }));
    const int before = changes;
    QVERIFY(waitUntil([&] {
        writeElsewhere(Key, "3");
        writeElsewhere(Folder, nullptr);
        QCoreApplication::postEvent(qApp, new QEvent(QEvent::User));
        return changes > before && !item.value().isValid();
    }));
}

void MGConfItemTest::worksWithoutASessionBus()
{
    writeElsewhere(Key, "true");
    QProcess child;
    QProcessEnvironment environment = QProcessEnvironment::systemEnvironment();
    environment.insert(QStringLiteral("DBUS_SESSION_BUS_ADDRESS"), QStringLiteral("unix:path=/nowhere"));
    child.setProcessEnvironment(environment);
    child.setProcessChannelMode(QProcess::ForwardedChannels);
    child.start(QCoreApplication::applicationFilePath(), {QLatin1String(WithoutSessionBus)});
    QVERIFY(child.waitForFinished());
    QCOMPARE(child.exitStatus(), QProcess::NormalExit);
    QCOMPARE(child.exitCode(), 0);
}

int main(int argc, char **argv)
{
    QCoreApplication application(argc, argv);
    if (argc > 1 && std::strcmp(argv[1], WithoutSessionBus) == 0)
        return runWithoutSessionBus();
    MGConfItemTest test;
    return QTest::qExec(&test, argc, argv);
}

#include "mgconfitem_test.moc"
