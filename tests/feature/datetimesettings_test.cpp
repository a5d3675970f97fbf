// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"
#include "texts.h"
#include "waiting.h"

#include <corvanemdm/datetimesettings.h>

#include <QtCore/QDir>
#include <QtCore/QFile>
#include <QtCore/QMetaProperty>
#include <QtCore/QTimeZone>
#include <QtDBus/QDBusMetaType>
#include <QtTest/QtTest>

#include <cstdlib>
#include <memory>

using Corvane::Mdm::DateTimeSettings;

namespace
{

const QString Service = QStringLiteral("org.freedesktop.timedate1");
const QString Path = QStringLiteral("/org/freedesktop/timedate1");
const QString FileName = QStringLiteral("/etc/datetime/datetime.conf");
const QString ZoneTable = QStringLiteral("/usr/share/zoneinfo/zone.tab");

void write(const QString &fileName, const QByteArray &content)
{
    QFile file(fileName);
    QVERIFY(file.open(QIODevice::WriteOnly | QIODevice::Truncate));
    file.write(content);
}

QByteArray content(const QString &fileName)
{
    QFile file(fileName);
    return file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray("<none>");
}

} // namespace

class DateTimeSettingsTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void nothingIsKnownAtFirst();
    void getsReady();
    void setsTheTimeZone();
    void refusesUnknownTimeZones_data();
    void refusesUnknownTimeZones();
    void zonesComeFromTheTable();
    void zonesAreReadOnce();
    void missingTableHasNoZones();
    void switchesAutomaticTime();
    void switchesAutomaticTimeZone();
    void followsWhatOthersSet();
    void setsTimeAndDate();
    void noTimesOfDay_data();
    void noTimesOfDay();
    void noDates();
    void automaticTimeRefusesTheClock();
    void refusalsAreLogged();
    void serviceThatIsNotThere();
    void serviceThatRestarts();
    void propertiesOfAnotherType();
    void announcementsOfAnotherShapeAreNotTaken();
    void deletionInASlot_data();
    void deletionInASlot();
    void destructionWithCallsPending();
    void worksThroughTheMetaObject();

private:
    /** The simulated phone's own clock, which is not the machine's. */
    QDateTime clock() const;
    QString zone() const { return state().value(QLatin1String("timeZone")).toString(); }
    QJsonObject state() const { return m_phone->state().value(QLatin1String("clock")).toObject(); }
    std::unique_ptr<DateTimeSettings> ready() const;

    std::unique_ptr<Phone> m_phone;
};

void DateTimeSettingsTest::init()
{
    m_phone = std::make_unique<Phone>();
}

void DateTimeSettingsTest::cleanup()
{
    m_phone->clearFaults();
    m_phone->startService(Service);
    const auto settings = ready();
    settings->setAutomaticDateTimeUpdate(true);
    settings->setAutomaticTimeZoneUpdate(true);
    settings->setTimeZone(QStringLiteral("Europe/Helsinki"));
    m_phone->settle(Service);
}

QDateTime DateTimeSettingsTest::clock() const
{
    return QDateTime::fromString(state().value(QLatin1String("time")).toString(), Qt::ISODateWithMs);
}

std::unique_ptr<DateTimeSettings> DateTimeSettingsTest::ready() const
{
    auto settings = std::make_unique<DateTimeSettings>();
    waitUntil([&] { return settings->ready(); });
    return settings;
}

void DateTimeSettingsTest::nothingIsKnownAtFirst()
{
    MessageLog log;
    const DateTimeSettings settings;
    QVERIFY(!settings.ready());
    QVERIFY(!settings.automaticDateTimeUpdate());
    QCOMPARE(settings.timeZone(), QString());
    // That one is no service's.
    QVERIFY(settings.automaticTimeZoneUpdate());
    QCOMPARE(log.takeWarnings(), QStringList());
}

void DateTimeSettingsTest::getsReady()
{
    DateTimeSettings settings;
    SignalSequence seen(&settings);
    QVERIFY(seen.waitFor(3));
    QVERIFY(settings.ready());
    QVERIFY(settings.automaticDateTimeUpdate());
    QCOMPARE(settings.timeZone(), QStringLiteral("Europe/Helsinki"));
    m_phone->settle(Service);
    QCOMPARE(seen.take(), texts({"automaticDateTimeUpdateChanged()", "timeZoneChanged()", "readyChanged()"}));
}

void DateTimeSettingsTest::setsTheTimeZone()
{
    const auto settings = ready();
    SignalSequence seen(settings.get());
    m_phone->takeJournal(Service);
    settings->setTimeZone(QStringLiteral("America/Sao_Paulo"));
    QCOMPARE(settings->timeZone(), QStringLiteral("Europe/Helsinki"));
    QVERIFY(seen.waitFor(1));
    QCOMPARE(settings->timeZone(), QStringLiteral("America/Sao_Paulo"));
    QCOMPARE(seen.take(), texts({"timeZoneChanged()"}));
    QCOMPARE(m_phone->takeJournal(Service),
             QStringList(Path + QLatin1String(" SetTimezone ('America/Sao_Paulo', false)")));
    QCOMPARE(zone(), QStringLiteral("America/Sao_Paulo"));
    // The same once more: it is sent, and nothing changes.
    settings->setTimeZone(QStringLiteral("America/Sao_Paulo"));
    m_phone->settle(Service);
    QCOMPARE(seen.take(), QStringList());
}

void DateTimeSettingsTest::refusesUnknownTimeZones_data()
{
    QTest::addColumn<QString>("name");
    QTest::newRow("lower case") << QStringLiteral("europe/helsinki");
    QTest::newRow("upper case") << QStringLiteral("EUROPE/HELSINKI");
    QTest::newRow("one letter") << QStringLiteral("Europe/helsinki");
    QTest::newRow("part") << QStringLiteral("Helsinki");
    QTest::newRow("none") << QString();
    QTest::newRow("not in the table") << QStringLiteral("Etc/UTC");
}

void DateTimeSettingsTest::refusesUnknownTimeZones()
{
    QFETCH(QString, name);
    const auto settings = ready();
    m_phone->takeJournal(Service);
    MessageLog log;
    settings->setTimeZone(name);
    QCOMPARE(log.takeWarnings(), QStringList(QStringLiteral("Time zone \"%1\" is not supported").arg(name)));
    m_phone->settle(Service);
    QCOMPARE(m_phone->takeJournal(Service), QStringList());
    QCOMPARE(settings->timeZone(), QStringLiteral("Europe/Helsinki"));
}

void DateTimeSettingsTest::zonesComeFromTheTable()
{
    const QByteArray original = content(ZoneTable);
    QStringList names;
    const QList<QByteArray> lines = original.split('\n');
    for (const QByteArray &line : lines) {
        if (!line.startsWith('#') && !line.isEmpty())
            names << QString::fromUtf8(line.split('\t').at(2));
    }
    QVERIFY(names.size() > 400);
    QCOMPARE(DateTimeSettings().supportedTimeZones(), names);

    write(ZoneTable,
          "# comment\tx\tNo/Zone\n\nFI\t+6010+02458\tEurope/Helsinki\tthe north\nXX\nAQ\t-1\tOur/Base\n");
    QCOMPARE(DateTimeSettings().supportedTimeZones(), texts({"Europe/Helsinki", "Our/Base"}));
    write(ZoneTable, original);
}

void DateTimeSettingsTest::zonesAreReadOnce()
{
    const QByteArray original = content(ZoneTable);
    const auto before = ready();
    write(ZoneTable, original + "XX\t+0000+00000\tOur/Base\n");
    MessageLog log;
    QVERIFY(!before->supportedTimeZones().contains(QStringLiteral("Our/Base")));
    before->setTimeZone(QStringLiteral("Our/Base"));
    QCOMPARE(log.takeWarnings(), texts({"Time zone \"Our/Base\" is not supported"}));
    DateTimeSettings after;
    m_phone->takeJournal(Service);
    after.setTimeZone(QStringLiteral("Our/Base"));
    // Now it is the service that does not have it.
    QStringList warnings;
    QVERIFY(waitUntil([&] { return !(warnings += log.takeWarnings()).isEmpty(); }));
    QCOMPARE(
        warnings,
        texts(
            {"Cannot set the time zone: QDBusError(\"org.freedesktop.DBus.Error.InvalidArgs\", \"Invalid or "
             "not installed time zone 'Our/Base'\")"}));
    write(ZoneTable, original);
}

void DateTimeSettingsTest::missingTableHasNoZones()
{
    const QString away = ZoneTable + QLatin1String(".away");
    QVERIFY(QFile::rename(ZoneTable, away));
    MessageLog log;
    DateTimeSettings settings;
    QCOMPARE(settings.supportedTimeZones(), QStringList());
    settings.setTimeZone(QStringLiteral("Europe/Helsinki"));
    QCOMPARE(log.takeWarnings(), texts({"Time zone \"Europe/Helsinki\" is not supported"}));
    QVERIFY(QFile::rename(away, ZoneTable));
}

void DateTimeSettingsTest::switchesAutomaticTime()
{
    const auto settings = ready();
    SignalSequence seen(settings.get());
    settings->setAutomaticDateTimeUpdate(false);
    QVERIFY(settings->automaticDateTimeUpdate());
    QVERIFY(seen.waitFor(1));
    QVERIFY(!settings->automaticDateTimeUpdate());
    settings->setAutomaticDateTimeUpdate(true);
    QVERIFY(seen.waitFor(2));
    QCOMPARE(seen.take(), texts({"automaticDateTimeUpdateChanged()", "automaticDateTimeUpdateChanged()"}));
    QVERIFY(settings->automaticDateTimeUpdate());
}

void DateTimeSettingsTest::switchesAutomaticTimeZone()
{
    const auto settings = ready();
    DateTimeSettings other;
    waitUntil([&] { return other.ready(); });
    SignalSequence seen(settings.get());
    SignalSequence othersSeen(&other);
    settings->setAutomaticTimeZoneUpdate(false);
    QVERIFY(!settings->automaticTimeZoneUpdate());
    QCOMPARE(seen.take(), texts({"automaticTimeZoneUpdateChanged()"}));
    QCOMPARE(content(FileName), QByteArray("[datetime]\nautomatic_timezone=false\n"));
    QVERIFY(othersSeen.waitFor(1));
    QVERIFY(!other.automaticTimeZoneUpdate());
    QCOMPARE(othersSeen.take(), texts({"automaticTimeZoneUpdateChanged()"}));

    // With it, the phone takes on the zone that the network tells.
    m_phone->act(QStringLiteral("clock zone"), {QStringLiteral("Asia/Tokyo")});
    QCOMPARE(zone(), QStringLiteral("Europe/Helsinki"));
    settings->setAutomaticTimeZoneUpdate(true);
    m_phone->act(QStringLiteral("clock zone"), {QStringLiteral("Asia/Tokyo")});
    QVERIFY(waitUntil([&] { return settings->timeZone() == QLatin1String("Asia/Tokyo"); }));
}

void DateTimeSettingsTest::followsWhatOthersSet()
{
    const auto settings = ready();
    DateTimeSettings other;
    SignalSequence seen(settings.get());
    other.setTimeZone(QStringLiteral("Asia/Tokyo"));
    other.setAutomaticDateTimeUpdate(false);
    QVERIFY(seen.waitFor(2));
    QCOMPARE(seen.take(), texts({"timeZoneChanged()", "automaticDateTimeUpdateChanged()"}));
    write(FileName, "[datetime]\n");
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), texts({"automaticTimeZoneUpdateChanged()"}));
}

void DateTimeSettingsTest::setsTimeAndDate()
{
    const QTimeZone helsinki("Europe/Helsinki");
    const auto settings = ready();
    const QDateTime machine = QDateTime::currentDateTimeUtc();
    settings->setAutomaticDateTimeUpdate(false);
    m_phone->settle(Service);
    SignalSequence seen(settings.get());
    // One right after the other: the day is still there when the time is set.
    settings->setDate(QDate(2031, 7, 4));
    settings->setTime(12, 30);
    QVERIFY(seen.waitFor(2));
    QCOMPARE(seen.take(), texts({"dateTimeChanged()", "dateTimeChanged()"}));
    const QDateTime wanted(QDate(2031, 7, 4), QTime(12, 30), helsinki);
    QVERIFY(clock() >= wanted && clock() < wanted.addSecs(300));

    settings->setDate(QDate(2020, 2, 29));
    QVERIFY(seen.waitFor(1));
    const QDateTime leapDay(QDate(2020, 2, 29), QTime(12, 30), helsinki);
    QVERIFY(clock() >= leapDay && clock() < leapDay.addSecs(300));
    // The machine's own clock has gone on as ever.
    QVERIFY(std::abs(machine.secsTo(QDateTime::currentDateTimeUtc())) < 300);
}

void DateTimeSettingsTest::noTimesOfDay_data()
{
    QTest::addColumn<int>("hour");
    QTest::addColumn<int>("minute");
    QTest::newRow("24:00") << 24 << 0;
    QTest::newRow("-1:00") << -1 << 0;
    QTest::newRow("0:60") << 0 << 60;
    QTest::newRow("0:-1") << 0 << -1;
}

void DateTimeSettingsTest::noTimesOfDay()
{
    QFETCH(int, hour);
    QFETCH(int, minute);
    const auto settings = ready();
    m_phone->takeJournal(Service);
    MessageLog log;
    settings->setTime(hour, minute);
    QCOMPARE(log.takeWarnings(), QStringList(QStringLiteral("No time of day: %1 %2").arg(hour).arg(minute)));
    m_phone->settle(Service);
    QCOMPARE(m_phone->takeJournal(Service), QStringList());
}

void DateTimeSettingsTest::noDates()
{
    const auto settings = ready();
    settings->setAutomaticDateTimeUpdate(false);
    m_phone->settle(Service);
    SignalSequence seen(settings.get());
    m_phone->takeJournal(Service);
    MessageLog log;
    settings->setDate(QDate());
    QCOMPARE(log.takeWarnings(), texts({"No date: QDate(Invalid)"}));
    settings->setDate(QDate::fromJulianDay(2LL * 1000 * 1000 * 1000));
    QStringList warnings;
    QVERIFY(waitUntil([&] { return !(warnings += log.takeWarnings()).isEmpty(); }));
    QVERIFY2(warnings.first().startsWith(QLatin1String("No clock shows QDateTime(")),
             qPrintable(warnings.first()));
    // What comes next is not held up.
    settings->setTime(1, 2);
    QVERIFY(seen.waitFor(1));
    QCOMPARE(m_phone->takeJournal(Service).size(), 1);
}

void DateTimeSettingsTest::automaticTimeRefusesTheClock()
{
    const auto settings = ready();
    SignalSequence seen(settings.get());
    MessageLog log;
    settings->setTime(1, 2);
    settings->setDate(QDate(2030, 1, 1));
    QStringList warnings;
    QVERIFY(waitUntil([&] { return (warnings += log.takeWarnings()).size() >= 2; }));
    for (const QString &warning : qAsConst(warnings))
        QCOMPARE(
            warning,
            QStringLiteral("Cannot set the clock: QDBusError(\"org.freedesktop.timedate1."
                           "AutomaticTimeSyncEnabled\", \"Automatic time synchronization is enabled\")"));
    QCOMPARE(seen.take(), QStringList());
}

void DateTimeSettingsTest::refusalsAreLogged()
{
    const auto settings = ready();
    SignalSequence seen(settings.get());
    m_phone->failCalls(Service, Path, QString(), QStringLiteral("com.example.Broken"),
                       QStringLiteral("Out of order"));
    const QString error = QStringLiteral(" QDBusError(\"com.example.Broken\", \"Out of order\")");
    MessageLog log;
    settings->setTimeZone(QStringLiteral("Asia/Tokyo"));
    settings->setAutomaticDateTimeUpdate(false);
    settings->setTime(1, 2);
    QStringList warnings;
    QVERIFY(waitUntil([&] { return (warnings += log.takeWarnings()).size() >= 3; }));
    QCOMPARE(warnings,
             QStringList({QLatin1String("Cannot set the time zone:") + error,
                          QLatin1String("Cannot switch automatic time:") + error,
                          QLatin1String("Cannot read the clock:") + error}));
    QCOMPARE(seen.take(), QStringList());

    QVERIFY(QFile::remove(FileName));
    QVERIFY(seen.waitFor(1));
    QVERIFY(QDir().rmdir(QStringLiteral("/etc/datetime")));
    write(QStringLiteral("/etc/datetime"), "in the way");
    seen.take();
    settings->setAutomaticTimeZoneUpdate(true);
    QVERIFY(!settings->automaticTimeZoneUpdate());
    QVERIFY(log.takeWarnings().value(0).startsWith(
        QLatin1String("Cannot change the setting automatic_timezone in")));
    QVERIFY(QFile::remove(QStringLiteral("/etc/datetime")));
}

void DateTimeSettingsTest::serviceThatIsNotThere()
{
    m_phone->stopService(Service);
    MessageLog log;
    DateTimeSettings settings;
    SignalSequence seen(&settings);
    settings.setTimeZone(QStringLiteral("Asia/Tokyo"));
    QStringList warnings;
    QVERIFY(waitUntil([&] { return !(warnings += log.takeWarnings()).isEmpty(); }));
    QVERIFY2(warnings.first().startsWith(QLatin1String(
                 "Cannot set the time zone: QDBusError(\"org.freedesktop.DBus.Error.ServiceUnknown\"")),
             qPrintable(warnings.first()));
    QVERIFY(!settings.ready());
    QCOMPARE(settings.timeZone(), QString());
    QCOMPARE(settings.supportedTimeZones().isEmpty(), false);

    m_phone->startService(Service);
    QVERIFY(seen.waitFor(3));
    QVERIFY(settings.ready());
    QCOMPARE(settings.timeZone(), QStringLiteral("Europe/Helsinki"));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void DateTimeSettingsTest::serviceThatRestarts()
{
    const auto settings = ready();
    SignalSequence seen(settings.get());
    m_phone->stopService(Service);
    QVERIFY(settings->ready());
    QCOMPARE(settings->timeZone(), QStringLiteral("Europe/Helsinki"));
    // While it is away the network tells another zone.
    m_phone->act(QStringLiteral("clock zone"), {QStringLiteral("Asia/Tokyo")});
    m_phone->startService(Service);
    QVERIFY(seen.waitFor(1));
    QCOMPARE(settings->timeZone(), QStringLiteral("Asia/Tokyo"));
    m_phone->settle(Service);
    QCOMPARE(seen.take(), texts({"timeZoneChanged()"}));
    settings->setTimeZone(QStringLiteral("Europe/Berlin"));
    QVERIFY(seen.waitFor(1));
}

void DateTimeSettingsTest::propertiesOfAnotherType()
{
    m_phone->answerCalls(Service, Path, QStringLiteral("GetAll"), {7});
    MessageLog log;
    DateTimeSettings settings;
    QStringList warnings;
    QVERIFY(waitUntil([&] { return !(warnings += log.takeWarnings()).isEmpty(); }));
    QVERIFY2(warnings.first().startsWith(
                 QLatin1String("Cannot read the properties of \"org.freedesktop.timedate1\" QDBusError(")),
             qPrintable(warnings.first()));
    QVERIFY(!settings.ready());

    m_phone->answerCalls(
        Service, Path, QStringLiteral("GetAll"),
        {QVariantMap{{QStringLiteral("Timezone"), 7}, {QStringLiteral("NTP"), QStringLiteral("x")}}});
    m_phone->answerCalls(Service, Path, QStringLiteral("Get"), {QVariant::fromValue(QStringLiteral("noon"))});
    DateTimeSettings odd;
    QVERIFY(waitUntil([&] { return odd.ready(); }));
    odd.setTime(1, 2);
    QVERIFY(waitUntil([&] { return !(warnings += log.takeWarnings()).isEmpty() && warnings.size() >= 2; }));
    QVERIFY2(warnings.last().startsWith(QLatin1String("Cannot read the clock: QDBusError(")),
             qPrintable(warnings.last()));
}

void DateTimeSettingsTest::announcementsOfAnotherShapeAreNotTaken()
{
    qDBusRegisterMetaType<QList<int>>();
    const auto settings = ready();
    SignalSequence seen(settings.get());
    const auto announce = [this](const QVariantList &arguments) {
        m_phone->emitSignal(Service, Path, QStringLiteral("org.freedesktop.DBus.Properties"),
                            QStringLiteral("PropertiesChanged"), arguments);
    };
    const QVariantMap changed{{QStringLiteral("Timezone"), QStringLiteral("Asia/Tokyo")}};
    const QVariant numbers = QVariant::fromValue(QList<int>{1, 2});
    announce({Service, numbers, QStringList()});
    announce({Service, changed, numbers});
    announce({Service, changed});
    announce({7, changed, QStringList()});
    QCOMPARE(seen.take(), QStringList());
    announce({Service, changed, QStringList()});
    QCOMPARE(seen.take(), texts({"timeZoneChanged()"}));
    QCOMPARE(settings->timeZone(), QStringLiteral("Asia/Tokyo"));
}

void DateTimeSettingsTest::deletionInASlot_data()
{
    QTest::addColumn<QByteArray>("signal");
    for (const char *signal :
         {SIGNAL(readyChanged()), SIGNAL(automaticDateTimeUpdateChanged()), SIGNAL(timeZoneChanged()),
          SIGNAL(automaticTimeZoneUpdateChanged()), SIGNAL(dateTimeChanged())})
        QTest::newRow(signal) << QByteArray(signal);
}

void DateTimeSettingsTest::deletionInASlot()
{
    QFETCH(QByteArray, signal);
    ready()->setAutomaticDateTimeUpdate(false);
    m_phone->settle(Service);
    QObject slot;
    auto *settings = new DateTimeSettings;
    const QPointer<DateTimeSettings> alive(settings);
    struct Deleter : QObject {
    };
    SignalSequence seen(settings);
    if (signal == SIGNAL(readyChanged()) || signal == SIGNAL(timeZoneChanged())) {
        // Both come with the first answer.
        const auto which = signal == SIGNAL(readyChanged()) ? &DateTimeSettings::readyChanged
                                                            : &DateTimeSettings::timeZoneChanged;
        connect(settings, which, &slot, [&] { delete alive.data(); });
    } else {
        QVERIFY(waitUntil([&] { return settings->ready(); }));
        const auto which = signal == SIGNAL(dateTimeChanged()) ? &DateTimeSettings::dateTimeChanged
            : signal == SIGNAL(automaticTimeZoneUpdateChanged())
            ? &DateTimeSettings::automaticTimeZoneUpdateChanged
            : &DateTimeSettings::automaticDateTimeUpdateChanged;
        connect(settings, which, &slot, [&] { delete alive.data(); });
        if (signal == SIGNAL(dateTimeChanged()))
            settings->setTime(1, 2);
        else if (signal == SIGNAL(automaticTimeZoneUpdateChanged()))
            settings->setAutomaticTimeZoneUpdate(false);
        else
            settings->setAutomaticDateTimeUpdate(true);
    }
    QVERIFY(waitUntil([&] { return !alive; }));
}

void DateTimeSettingsTest::destructionWithCallsPending()
{
    m_phone->delayCalls(Service, Path, QString(), 20);
    MessageLog log;
    {
        DateTimeSettings settings;
        settings.setTime(1, 2);
        settings.setDate(QDate(2030, 1, 1));
        settings.setTimeZone(QStringLiteral("Asia/Tokyo"));
    }
    m_phone->settle(Service);
    QCOMPARE(log.takeWarnings(), QStringList());
}

void DateTimeSettingsTest::worksThroughTheMetaObject()
{
    const auto settings = ready();
    QVERIFY(settings->property("ready").toBool());
    QCOMPARE(settings->property("timeZone").toString(), QStringLiteral("Europe/Helsinki"));
    QVERIFY(settings->setProperty("timeZone", QStringLiteral("Asia/Tokyo")));
    QVERIFY(settings->setProperty("automaticDateTimeUpdate", false));
    QVERIFY(settings->setProperty("automaticTimeZoneUpdate", false));
    QVERIFY(waitUntil([&] {
        return settings->property("timeZone") == QStringLiteral("Asia/Tokyo")
            && !settings->property("automaticDateTimeUpdate").toBool();
    }));
    QVERIFY(!settings->property("automaticTimeZoneUpdate").toBool());
    SignalSequence seen(settings.get());
    QVERIFY(QMetaObject::invokeMethod(settings.get(), "setTime", Q_ARG(int, 1), Q_ARG(int, 2)));
    QVERIFY(QMetaObject::invokeMethod(settings.get(), "setDate", Q_ARG(QDate, QDate(2030, 1, 1))));
    QVERIFY(seen.waitFor(2));
    const QMetaObject &meta = DateTimeSettings::staticMetaObject;
    QStringList properties;
    for (int i = meta.propertyOffset(); i < meta.propertyCount(); ++i) {
        const QMetaProperty property = meta.property(i);
        QVERIFY(property.isReadable());
        properties << QStringLiteral("%1 %2 %3 %4")
                          .arg(QLatin1String(property.typeName()), QLatin1String(property.name()),
                               property.isWritable() ? QStringLiteral("rw") : QStringLiteral("r"),
                               QLatin1String(property.notifySignal().name()));
    }
    QCOMPARE(
        properties,
        texts({"bool ready r readyChanged", "bool automaticDateTimeUpdate rw automaticDateTimeUpdateChanged",
               "bool automaticTimeZoneUpdate rw automaticTimeZoneUpdateChanged",
               "QString timeZone rw timeZoneChanged"}));
    QStringList zones;
    QVERIFY(
        QMetaObject::invokeMethod(settings.get(), "supportedTimeZones", Q_RETURN_ARG(QStringList, zones)));
    QCOMPARE(zones, settings->supportedTimeZones());
}

QTEST_GUILESS_MAIN(DateTimeSettingsTest)
#include "datetimesettings_test.moc"
