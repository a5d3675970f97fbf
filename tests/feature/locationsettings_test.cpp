// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "signalsequence.h"
#include "texts.h"
#include "waiting.h"

#include <corvanemdm/locationsettings.h>

#include <QtCore/QDir>
#include <QtCore/QFile>
#include <QtCore/QMetaEnum>
#include <QtCore/QMetaProperty>
#include <QtCore/QProcess>
#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::LocationSettings;

namespace
{

const QString Folder = QStringLiteral("/etc/location");
const QString FileName = QStringLiteral("/etc/location/location.conf");
const QString Here = QStringLiteral("here");
const QString Mls = QStringLiteral("mls");
const QString Unknown = QStringLiteral("No such aGPS provider: \"skyhook\"");

/** Writes the file as an editor does, or another program. */
void write(const QByteArray &content)
{
    QDir().mkpath(Folder);
    QFile file(FileName);
    QVERIFY(file.open(QIODevice::WriteOnly | QIODevice::Truncate));
    file.write(content);
}

void writeGroup(const QByteArray &entries)
{
    write("[location]\n" + entries);
}

QByteArray content()
{
    QFile file(FileName);
    return file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray("<none>");
}

/** What the file has at @p key, empty when nothing. */
QByteArray stored(const QByteArray &key)
{
    const QList<QByteArray> lines = content().split('\n');
    for (const QByteArray &line : lines) {
        if (line.startsWith(key + '='))
            return line.mid(key.size() + 1);
    }
    return QByteArray();
}

/** All that is plain, such as "enabled gps flight mode:0 sources:0". */
QString textOf(const LocationSettings &settings)
{
    QStringList words;
    if (settings.locationEnabled())
        words << QStringLiteral("enabled");
    if (settings.gpsEnabled())
        words << QStringLiteral("gps");
    if (settings.gpsFlightMode())
        words << QStringLiteral("flight");
    words << QStringLiteral("mode:%1").arg(settings.locationMode());
    words << QStringLiteral("sources:%1").arg(quint32(settings.allowedDataSources()));
    return words.join(QLatin1Char(' '));
}

/** The settings in another process. */
class Client
{
public:
    Client()
    {
        m_process.start(QStringLiteral(LOCATION_CLIENT), QStringList());
        m_process.waitForStarted();
    }
    ~Client()
    {
        m_process.closeWriteChannel();
        m_process.waitForFinished();
    }

    QString nextLine()
    {
        waitUntil([this] { return m_process.canReadLine(); });
        return QString::fromUtf8(m_process.readLine()).trimmed();
    }
    QString ask(const char *line)
    {
        m_process.write(QByteArray(line) + '\n');
        return nextLine();
    }

private:
    QProcess m_process;
};

} // namespace

class LocationSettingsTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();

    void theSimulatedPhonesOwn();
    void filesThatAreNone_data();
    void filesThatAreNone();
    void readsEachValue_data();
    void readsEachValue();
    void writesEachValue();
    void keepsTheRestOfTheFile();
    void setsNothingThatIsSo();
    void makesFileAndFolder();
    void refusedWriteChangesNothing();
    void asynchronousModeTellsLater();
    void followsTheFile();
    void followsFoldersThatComeAndGo();
    void otherProcesses();
    void settersDoNotUndoEachOther();
    void availabilityIsKeptForTheProcess();
    void providersAreAskedForEachTime();
    void unknownProviders();
    void agpsStates_data();
    void agpsStates();
    void unavailableProvidersAreLeftAlone();
    void dataSourcesAreAllowedInPart();
    void dataSourcesAreDisallowedAsAWhole();
    void deletionInASlot();
    void worksThroughTheMetaObject();
    void enumeratorsAndProperties();
};

void LocationSettingsTest::initTestCase()
{
    // This process keeps it: both are there.
    const LocationSettings settings;
    QVERIFY(settings.agpsAvailable(Here));
    QVERIFY(settings.agpsAvailable(Mls));
}

void LocationSettingsTest::theSimulatedPhonesOwn()
{
    const LocationSettings settings;
    QCOMPARE(textOf(settings), QStringLiteral("enabled gps mode:0 sources:2115011617"));
    QVERIFY(settings.gpsAvailable());
    QVERIFY(QFile::rename(QStringLiteral("/dev/gnss0"), QStringLiteral("/dev/gnss")));
    QVERIFY(!settings.gpsAvailable());
    QVERIFY(QFile::rename(QStringLiteral("/dev/gnss"), QStringLiteral("/dev/gnss0")));
}

void LocationSettingsTest::filesThatAreNone_data()
{
    QTest::addColumn<QByteArray>("file");
    QTest::newRow("empty") << QByteArray("");
    QTest::newRow("no key file") << QByteArray("enabled=true\n");
    QTest::newRow("no group") << QByteArray("[other]\nenabled=true\n");
    QTest::newRow("no key") << QByteArray("[location]\n");
    QTest::newRow("binary") << QByteArray("\0\xff[location]\nenabled=true\n", 27);
    QTest::newRow("text for a number") << QByteArray(
        "[location]\nenabled=yes\ngps_enabled=2\ngps_flight_mode=\nmode=high\nallowed_data_sources=all\n");
    QTest::newRow("numbers that are none") << QByteArray(
        "[location]\nmode=4\nallowed_data_sources=4294967296\nhere_state=3\nmls_online_state=-1\n");
    QTest::newRow("negative") << QByteArray("[location]\nmode=-1\nallowed_data_sources=-1\n");
}

void LocationSettingsTest::filesThatAreNone()
{
    QFETCH(QByteArray, file);
    write(file);
    MessageLog log;
    const LocationSettings settings;
    QCOMPARE(textOf(settings), QStringLiteral("mode:3 sources:0"));
    QVERIFY(!settings.agpsAgreementAccepted(Here));
    QVERIFY(!settings.agpsEnabled(Mls));
    QCOMPARE(settings.availableAgpsProviders(), QStringList());
    QCOMPARE(log.takeWarnings(), QStringList());

    QFile::remove(FileName);
    QCOMPARE(textOf(LocationSettings()), QStringLiteral("mode:3 sources:0"));
    QDir().rmdir(Folder);
    QCOMPARE(textOf(LocationSettings()), QStringLiteral("mode:3 sources:0"));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void LocationSettingsTest::readsEachValue_data()
{
    QTest::addColumn<QByteArray>("entry");
    QTest::addColumn<QString>("settings");
    QTest::newRow("enabled") << QByteArray("enabled=true") << "enabled mode:3 sources:0";
    QTest::newRow("gps") << QByteArray("gps_enabled=true") << "gps mode:3 sources:0";
    QTest::newRow("flight") << QByteArray("gps_flight_mode=true") << "flight mode:3 sources:0";
    QTest::newRow("mode") << QByteArray("mode=2") << "mode:2 sources:0";
    QTest::newRow("sources") << QByteArray("allowed_data_sources=33") << "mode:3 sources:33";
    QTest::newRow("highest source") << QByteArray("allowed_data_sources=4294967295")
                                    << "mode:3 sources:4294967295";
}

void LocationSettingsTest::readsEachValue()
{
    QFETCH(QByteArray, entry);
    QFETCH(QString, settings);
    writeGroup(entry + '\n');
    QCOMPARE(textOf(LocationSettings()), settings);
    QCOMPARE(textOf(LocationSettings(LocationSettings::SynchronousMode)), settings);
}

void LocationSettingsTest::writesEachValue()
{
    writeGroup("");
    LocationSettings settings;
    SignalSequence seen(&settings);
    settings.setLocationEnabled(true);
    settings.setGpsEnabled(true);
    settings.setGpsFlightMode(true);
    settings.setLocationMode(LocationSettings::BatterySavingMode);
    settings.setAllowedDataSources(LocationSettings::WlanData | LocationSettings::LastDataSource);
    QCOMPARE(content(),
             QByteArray("[location]\nenabled=true\ngps_enabled=true\ngps_flight_mode=true\nmode=1\n"
                        "allowed_data_sources=2147516416\n"));
    QCOMPARE(textOf(settings), QStringLiteral("enabled gps flight mode:1 sources:2147516416"));
    QCOMPARE(textOf(LocationSettings()), textOf(settings));
    QCOMPARE(seen.take(),
             texts({"locationEnabledChanged()", "gpsEnabledChanged()", "gpsFlightModeChanged()",
                    "locationModeChanged()", "allowedDataSourcesChanged()"}));
    settings.setLocationEnabled(false);
    settings.setAllowedDataSources(LocationSettings::NoDataSources);
    QCOMPARE(stored("enabled"), QByteArray("false"));
    QCOMPARE(stored("allowed_data_sources"), QByteArray("0"));
    QCOMPARE(seen.take(), texts({"locationEnabledChanged()", "allowedDataSourcesChanged()"}));
}

void LocationSettingsTest::keepsTheRestOfTheFile()
{
    write("# Ours\n\n[other]\nkey=value\n\n[location]\n# Off by default\nenabled=false\nunknown=1\n");
    LocationSettings settings;
    settings.setLocationEnabled(true);
    QCOMPARE(content(),
             QByteArray("# Ours\n\n[other]\nkey=value\n\n[location]\n# Off by default\nenabled=true\n"
                        "unknown=1\n"));
    QCOMPARE(QDir(Folder).entryList(QDir::Files | QDir::Hidden), texts({"location.conf"}));
}

void LocationSettingsTest::setsNothingThatIsSo()
{
    writeGroup("enabled=true\nmode=2\n");
    LocationSettings settings;
    SignalSequence seen(&settings);
    const QDateTime before = QFileInfo(FileName).lastModified();
    settings.setLocationEnabled(true);
    settings.setLocationMode(LocationSettings::DeviceOnlyMode);
    QCOMPARE(QFileInfo(FileName).lastModified(), before);
    QCOMPARE(seen.take(), QStringList());
}

void LocationSettingsTest::makesFileAndFolder()
{
    QFile::remove(FileName);
    QDir().rmdir(Folder);
    LocationSettings settings;
    settings.setGpsEnabled(true);
    QCOMPARE(content(), QByteArray("[location]\ngps_enabled=true\n"));
    // Everybody may read it.
    QVERIFY(QFile::permissions(FileName) & QFile::ReadOther);
}

void LocationSettingsTest::refusedWriteChangesNothing()
{
    QFile::remove(FileName);
    QVERIFY(QDir().rmdir(Folder));
    QFile inTheWay(Folder);
    QVERIFY(inTheWay.open(QIODevice::WriteOnly));
    inTheWay.close();
    MessageLog log;
    LocationSettings settings;
    SignalSequence seen(&settings);
    settings.setLocationEnabled(true);
    QVERIFY(!settings.locationEnabled());
    QCOMPARE(seen.take(), QStringList());
    const QStringList warnings = log.takeWarnings();
    QCOMPARE(warnings.size(), 1);
    QVERIFY2(warnings.first().startsWith(
                 QLatin1String("Cannot change the setting enabled in \"/etc/location/location.conf\" ")),
             qPrintable(warnings.first()));
    QVERIFY(inTheWay.remove());
}

void LocationSettingsTest::asynchronousModeTellsLater()
{
    writeGroup("enabled=true\nmode=1\n");
    const LocationSettings settings(LocationSettings::AsynchronousMode);
    SignalSequence seen(const_cast<LocationSettings *>(&settings));
    QCOMPARE(textOf(settings), QStringLiteral("mode:3 sources:0"));
    QVERIFY(seen.waitFor(2));
    QCOMPARE(textOf(settings), QStringLiteral("enabled mode:1 sources:0"));
    QCOMPARE(seen.take(), texts({"locationEnabledChanged()", "locationModeChanged()"}));
    // Any other number is as 0.
    QCOMPARE(textOf(LocationSettings(LocationSettings::Mode(2))), QStringLiteral("mode:3 sources:0"));
}

void LocationSettingsTest::followsTheFile()
{
    writeGroup("enabled=true\n");
    LocationSettings settings;
    SignalSequence seen(&settings);
    // Written in place, replaced, removed, and there again.
    write("[location]\nenabled=true\ngps_enabled=true\n");
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), texts({"gpsEnabledChanged()"}));

    QFile next(FileName + QLatin1String(".next"));
    QVERIFY(next.open(QIODevice::WriteOnly));
    next.write("[location]\nmode=0\n");
    next.close();
    QCOMPARE(
        std::rename(QFile::encodeName(next.fileName()).constData(), QFile::encodeName(FileName).constData()),
        0);
    QVERIFY(seen.waitFor(3));
    QCOMPARE(seen.take(),
             texts({"locationEnabledChanged()", "gpsEnabledChanged()", "locationModeChanged()"}));

    QVERIFY(QFile::remove(FileName));
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), texts({"locationModeChanged()"}));
    QCOMPARE(settings.locationMode(), LocationSettings::CustomMode);

    writeGroup("gps_flight_mode=true\n");
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), texts({"gpsFlightModeChanged()"}));
}

void LocationSettingsTest::followsFoldersThatComeAndGo()
{
    QFile::remove(FileName);
    QDir().rmdir(Folder);
    LocationSettings settings;
    SignalSequence seen(&settings);
    writeGroup("enabled=true\n");
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), texts({"locationEnabledChanged()"}));
    QVERIFY(QDir(Folder).removeRecursively());
    QVERIFY(seen.waitFor(1));
    QCOMPARE(seen.take(), texts({"locationEnabledChanged()"}));
    QVERIFY(!settings.locationEnabled());
    writeGroup("enabled=true\n");
    QVERIFY(seen.waitFor(1));
    QVERIFY(settings.locationEnabled());
}

void LocationSettingsTest::otherProcesses()
{
    writeGroup("enabled=false\n");
    LocationSettings settings;
    SignalSequence seen(&settings);
    Client other;
    QCOMPARE(other.ask("enabled"), QStringLiteral("false"));
    settings.setLocationEnabled(true);
    QCOMPARE(other.nextLine(), QStringLiteral("changed true"));
    QCOMPARE(seen.take(), texts({"locationEnabledChanged()"}));

    QCOMPARE(other.ask("enable false"), QStringLiteral("changed false"));
    QCOMPARE(other.nextLine(), QStringLiteral("done"));
    QVERIFY(seen.waitFor(1));
    QVERIFY(!settings.locationEnabled());
}

void LocationSettingsTest::settersDoNotUndoEachOther()
{
    writeGroup("enabled=false\n");
    LocationSettings one;
    LocationSettings two;
    // Neither has seen what the other did.
    one.setLocationEnabled(true);
    two.setGpsEnabled(true);
    two.setLocationEnabled(false);
    one.setLocationEnabled(true);
    QCOMPARE(stored("enabled"), QByteArray("true"));
    QCOMPARE(stored("gps_enabled"), QByteArray("true"));
}

void LocationSettingsTest::availabilityIsKeptForTheProcess()
{
    writeGroup("here_available=true\nmls_available=false\n");
    Client first;
    QCOMPARE(first.ask("available here"), QStringLiteral("true"));
    writeGroup("here_available=false\nmls_available=true\n");
    // The other one was asked for at the same time.
    QCOMPARE(first.ask("available mls"), QStringLiteral("false"));
    QCOMPARE(first.ask("available here"), QStringLiteral("true"));
    Client second;
    QCOMPARE(second.ask("available mls"), QStringLiteral("true"));
    QCOMPARE(second.ask("available here"), QStringLiteral("false"));
}

void LocationSettingsTest::providersAreAskedForEachTime()
{
    writeGroup("here_available=true\nmls_available=true\n");
    QCOMPARE(LocationSettings().availableAgpsProviders(), texts({"mls", "here"}));
    writeGroup("here_available=true\n");
    QCOMPARE(LocationSettings().availableAgpsProviders(), texts({"here"}));
    writeGroup("mls_available=true\n");
    QCOMPARE(LocationSettings().availableAgpsProviders(), texts({"mls"}));
    writeGroup("");
    const LocationSettings settings;
    QCOMPARE(settings.availableAgpsProviders(), QStringList());
    QVERIFY(settings.agpsAvailable(Here));
    writeGroup("here_available=true\n");
    QVERIFY(waitUntil([&] { return settings.availableAgpsProviders() == texts({"here"}); }));
}

void LocationSettingsTest::unknownProviders()
{
    writeGroup("here_available=true\nmls_available=true\n");
    const QByteArray before = content();
    LocationSettings settings;
    const QString provider = QStringLiteral("skyhook");
    MessageLog log;
    QVERIFY(!settings.agpsAvailable(provider));
    QCOMPARE(log.takeWarnings(), QStringList(Unknown));
    QVERIFY(!settings.agpsEnabled(provider));
    QCOMPARE(log.takeWarnings(), QStringList(Unknown));
    QVERIFY(!settings.agpsAgreementAccepted(provider));
    QCOMPARE(log.takeWarnings(), QStringList(Unknown));
    settings.setAgpsEnabled(provider, true);
    QCOMPARE(log.takeWarnings(), QStringList(Unknown));
    settings.setAgpsAgreementAccepted(provider, true);
    QCOMPARE(log.takeWarnings(), QStringList(Unknown));
    QVERIFY(!settings.agpsAvailable(QStringLiteral("HERE")));
    QCOMPARE(log.takeWarnings(), texts({"No such aGPS provider: \"HERE\""}));
    QCOMPARE(content(), before);
}

void LocationSettingsTest::agpsStates_data()
{
    QTest::addColumn<int>("state");
    QTest::addColumn<int>("enabled"); // after setAgpsEnabled(true)
    QTest::addColumn<int>("disabled");
    QTest::addColumn<int>("accepted"); // after setAgpsAgreementAccepted(true)
    QTest::newRow("not accepted") << 0 << 0 << 0 << 1;
    QTest::newRow("disabled") << 1 << 2 << 1 << 1;
    QTest::newRow("enabled") << 2 << 2 << 1 << 2;
}

void LocationSettingsTest::agpsStates()
{
    QFETCH(int, state);
    QFETCH(int, enabled);
    QFETCH(int, disabled);
    QFETCH(int, accepted);
    const struct {
        QString provider;
        QByteArray key;
        QString refusal;
    } providers[] = {
        {Here, "here_state",
         QStringLiteral("Unable to enable HERE aGPS - usage agreement has not been accepted!")},
        {Mls, "mls_online_state",
         QStringLiteral("Unable to enable MLS Online aGPS - usage agreement has not been accepted!")},
    };
    for (const auto &each : providers) {
        const auto inState = [&](bool mlsEnabled) {
            writeGroup(each.key + '=' + QByteArray::number(state)
                       + "\nmls_enabled=" + (mlsEnabled ? "true" : "false") + '\n');
            return std::make_unique<LocationSettings>();
        };
        const auto number = [&each] {
            return stored(each.key).toInt();
        };
        const bool isMls = each.provider == Mls;
        MessageLog log;
        auto settings = inState(true);
        QCOMPARE(settings->agpsEnabled(each.provider), state == 2);
        QCOMPARE(settings->agpsAgreementAccepted(each.provider), state != 0);
        QCOMPARE(inState(false)->agpsEnabled(each.provider), state == 2 && !isMls);

        settings = inState(false);
        settings->setAgpsEnabled(each.provider, true);
        QCOMPARE(number(), enabled);
        QCOMPARE(stored("mls_enabled"), QByteArray(isMls ? "true" : "false"));
        QCOMPARE(log.takeWarnings(), state == 0 ? QStringList(each.refusal) : QStringList());
        QCOMPARE(settings->agpsEnabled(each.provider), enabled == 2);

        settings = inState(true);
        settings->setAgpsEnabled(each.provider, false);
        QCOMPARE(number(), disabled);
        QCOMPARE(stored("mls_enabled"), QByteArray(isMls ? "false" : "true"));

        settings = inState(true);
        settings->setAgpsAgreementAccepted(each.provider, true);
        QCOMPARE(number(), accepted);
        QVERIFY(settings->agpsAgreementAccepted(each.provider));
        settings->setAgpsAgreementAccepted(each.provider, false);
        QCOMPARE(number(), 0);
        QVERIFY(!settings->agpsEnabled(each.provider));
        QVERIFY(!settings->agpsAgreementAccepted(each.provider));
        QCOMPARE(stored("mls_enabled"), QByteArray("true"));
        QCOMPARE(log.takeWarnings(), QStringList());
    }
}

void LocationSettingsTest::unavailableProvidersAreLeftAlone()
{
    // In a process of its own: this one has both for good.
    writeGroup("mls_available=true\nhere_state=1\n");
    const QByteArray before = content();
    QProcess process;
    process.start(QCoreApplication::applicationFilePath(), {QStringLiteral("withoutHere")});
    QVERIFY(process.waitForFinished());
    QCOMPARE(process.exitCode(), 0);
    QCOMPARE(content(), before);
}

void LocationSettingsTest::dataSourcesAreAllowedInPart()
{
    writeGroup("");
    LocationSettings settings;
    SignalSequence seen(&settings);
    settings.allowDataSource(LocationSettings::WlanData);
    settings.allowDataSource(LocationSettings::WlanData);
    QCOMPARE(seen.take(), texts({"allowedDataSourcesChanged()"}));
    const int both = int(LocationSettings::WlanData | LocationSettings::GpsData);
    settings.allowDataSource(LocationSettings::DataSource(both));
    QCOMPARE(int(settings.allowedDataSources()), both);
    settings.allowDataSource(LocationSettings::DataSource(both));
    QCOMPARE(seen.take(), texts({"allowedDataSourcesChanged()"}));
    // Nothing is not allowed yet where something is, but it adds nothing.
    settings.allowDataSource(LocationSettings::NoDataSources);
    QCOMPARE(int(settings.allowedDataSources()), both);
    settings.allowDataSource(LocationSettings::LastDataSource);
    QVERIFY(settings.allowedDataSources().testFlag(LocationSettings::LastDataSource));
}

void LocationSettingsTest::dataSourcesAreDisallowedAsAWhole()
{
    writeGroup("");
    LocationSettings settings;
    settings.setAllowedDataSources(LocationSettings::WlanData);
    SignalSequence seen(&settings);
    const auto both
        = LocationSettings::DataSource(int(LocationSettings::WlanData | LocationSettings::GpsData));
    settings.disallowDataSource(both);
    settings.disallowDataSource(LocationSettings::GpsData);
    settings.disallowDataSource(LocationSettings::NoDataSources);
    QCOMPARE(settings.allowedDataSources(), LocationSettings::DataSources(LocationSettings::WlanData));
    QCOMPARE(seen.take(), QStringList());
    settings.setAllowedDataSources(LocationSettings::DataSources(both) | LocationSettings::OnlineDataSources);
    settings.disallowDataSource(both);
    QCOMPARE(settings.allowedDataSources(),
             LocationSettings::DataSources(LocationSettings::OnlineDataSources));
    QCOMPARE(seen.take(), texts({"allowedDataSourcesChanged()", "allowedDataSourcesChanged()"}));
    settings.disallowDataSource(LocationSettings::OnlineDataSources);
    settings.disallowDataSource(LocationSettings::NoDataSources);
    QCOMPARE(int(settings.allowedDataSources()), 0);
}

void LocationSettingsTest::deletionInASlot()
{
    writeGroup("");
    auto settings = std::make_unique<LocationSettings>();
    connect(settings.get(), &LocationSettings::locationEnabledChanged, this, [&] { settings.reset(); });
    settings->setLocationEnabled(true);
    QVERIFY(!settings);

    settings = std::make_unique<LocationSettings>();
    connect(settings.get(), &LocationSettings::locationEnabledChanged, this, [&] { settings.reset(); });
    writeGroup("gps_enabled=true\n");
    QVERIFY(waitUntil([&] { return !settings; }));

    // A change of somebody else's comes to light with one that is made here.
    writeGroup("mls_available=true\nmls_online_state=1\n");
    settings = std::make_unique<LocationSettings>();
    connect(settings.get(), &LocationSettings::locationEnabledChanged, this, [&] { settings.reset(); });
    writeGroup("mls_available=true\nmls_online_state=1\nenabled=true\n");
    settings->setAgpsEnabled(Mls, true);
    QVERIFY(!settings);
    QCOMPARE(stored("mls_enabled"), QByteArray("true"));
    QCOMPARE(stored("mls_online_state"), QByteArray("1"));
}

void LocationSettingsTest::worksThroughTheMetaObject()
{
    writeGroup("");
    LocationSettings settings;
    for (const char *name : {"locationEnabled", "gpsEnabled", "gpsFlightMode"}) {
        QVERIFY(!settings.property(name).toBool());
        QVERIFY(settings.setProperty(name, true));
        QVERIFY(settings.property(name).toBool());
    }
    QVERIFY(settings.setProperty("locationMode", LocationSettings::DeviceOnlyMode));
    QCOMPARE(settings.property("locationMode").value<LocationSettings::LocationMode>(),
             LocationSettings::DeviceOnlyMode);
    QVERIFY(settings.setProperty(
        "allowedDataSources", QVariant::fromValue(LocationSettings::WlanData | LocationSettings::GpsData)));
    QCOMPARE(settings.property("allowedDataSources").value<LocationSettings::DataSources>(),
             LocationSettings::WlanData | LocationSettings::GpsData);
    QVERIFY(settings.property("gpsAvailable").toBool());
    const QMetaObject *meta = settings.metaObject();
    QVERIFY(meta->property(meta->indexOfProperty("gpsAvailable")).isConstant());

    bool available = false;
    QVERIFY(QMetaObject::invokeMethod(&settings, "agpsAvailable", Q_RETURN_ARG(bool, available),
                                      Q_ARG(QString, Mls)));
    QVERIFY(available);
    QVERIFY(QMetaObject::invokeMethod(
        &settings, "disallowDataSource",
        Q_ARG(Corvane::Mdm::LocationSettings::DataSource, LocationSettings::GpsData)));
    QCOMPARE(settings.allowedDataSources(), LocationSettings::DataSources(LocationSettings::WlanData));
    const QMetaEnum modes = QMetaEnum::fromType<LocationSettings::LocationMode>();
    QCOMPARE(modes.keyToValue("CustomMode"), 3);
    QCOMPARE(QMetaEnum::fromType<LocationSettings::DataSources>().keyToValue("SbasData"), 0x40000000);
}

void LocationSettingsTest::enumeratorsAndProperties()
{
    const QMetaObject &meta = LocationSettings::staticMetaObject;
    const auto valuesOf = [&meta](const char *name) {
        const QMetaEnum enumeration = meta.enumerator(meta.indexOfEnumerator(name));
        QStringList values;
        for (int i = 0; i < enumeration.keyCount(); ++i)
            values << QStringLiteral("%1=0x%2")
                          .arg(QLatin1String(enumeration.key(i)))
                          .arg(uint(enumeration.value(i)), 0, 16);
        return values;
    };
    QCOMPARE(
        valuesOf("LocationMode"),
        texts({"HighAccuracyMode=0x0", "BatterySavingMode=0x1", "DeviceOnlyMode=0x2", "CustomMode=0x3"}));
    QCOMPARE(valuesOf("DataSources"),
             texts({"NoDataSources=0x0", "OnlineDataSources=0x1", "DeviceSensorsData=0x20",
                    "BluetoothData=0x400", "WlanData=0x8000", "CellTowerData=0x100000", "GpsData=0x2000000",
                    "GlonassData=0x4000000", "BeidouData=0x8000000", "GalileoData=0x10000000",
                    "QzssData=0x20000000", "SbasData=0x40000000", "LastDataSource=0x80000000"}));
    QVERIFY(meta.enumerator(meta.indexOfEnumerator("DataSources")).isFlag());

    QStringList properties;
    for (int i = meta.propertyOffset(); i < meta.propertyCount(); ++i) {
        const QMetaProperty property = meta.property(i);
        properties << QStringLiteral("%1 %2 %3")
                          .arg(QLatin1String(property.name()),
                               property.isWritable() ? QStringLiteral("rw") : QStringLiteral("r"),
                               property.isConstant() ? QStringLiteral("constant")
                                                     : QLatin1String(property.notifySignal().name()));
    }
    QCOMPARE(
        properties,
        texts({"gpsAvailable r constant", "locationEnabled rw locationEnabledChanged",
               "gpsEnabled rw gpsEnabledChanged", "gpsFlightMode rw gpsFlightModeChanged",
               "locationMode rw locationModeChanged", "allowedDataSources rw allowedDataSourcesChanged"}));
}

int main(int argc, char **argv)
{
    QCoreApplication application(argc, argv);
    if (QCoreApplication::arguments().contains(QLatin1String("withoutHere"))) {
        LocationSettings settings;
        settings.setAgpsEnabled(Here, true);
        settings.setAgpsAgreementAccepted(Here, false);
        return settings.agpsEnabled(Here) || settings.agpsAgreementAccepted(Here);
    }
    LocationSettingsTest test;
    return QTest::qExec(&test, argc, argv);
}

#include "locationsettings_test.moc"
