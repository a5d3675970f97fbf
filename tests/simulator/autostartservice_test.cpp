// SPDX-License-Identifier: LGPL-2.1-or-later
#include "client.h"

#include <QtCore/QDir>
#include <QtCore/QFile>
#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QJsonObject>
#include <QtTest/QTest>

namespace
{

const QString service = QStringLiteral("org.corvaneos.mdmproxy");
const QString path = QStringLiteral("/Corvane/Mdm/Proxy/Autostart");
const QString interface = QStringLiteral("org.corvaneos.mdmproxy.autostart");
const QString folder = QStringLiteral("/usr/share/applications/");
const QByteArray entry = "[Desktop Entry]\nType=Application\nName=Mail\nExec=/usr/bin/mail --start\n";

void write(const QString &fileName, const QByteArray &content)
{
    QFile file(folder + fileName);
    QVERIFY(file.open(QIODevice::WriteOnly));
    QCOMPARE(file.write(content), qint64(content.size()));
}

} // namespace

/** The autostart object of the simulated MDM proxy. */
class AutostartServiceTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void cleanup();

    void looksAtTheDesktopFile_data();
    void looksAtTheDesktopFile();
    void namesMeanFilesOfTheApplications();
    void entriesOutliveTheirFiles();
    void keepsWhatItWasTold();

private:
    QString call(const char *method, const QString &argument) const
    {
        return textOf(m_client.call(service, path, interface, QLatin1String(method), {argument}));
    }
    QString query() const { return textOf(m_client.call(service, path, interface, QStringLiteral("query"))); }
    QString startSession() const
    {
        return textOf(
            m_client.control(QStringLiteral("Act"), {QStringLiteral("session start"), QStringList()}));
    }

    Client m_client;
};

void AutostartServiceTest::initTestCase()
{
    write(QStringLiteral("test-mail.desktop"), entry);
}

void AutostartServiceTest::cleanup()
{
    call("remove", QStringLiteral("test-mail.desktop"));
}

void AutostartServiceTest::looksAtTheDesktopFile_data()
{
    QTest::addColumn<QString>("name");
    QTest::addColumn<QByteArray>("content");
    QTest::addColumn<int>("result");
    const QString odd = QStringLiteral("test-odd.desktop");
    QTest::newRow("good") << odd << entry << 0;
    QTest::newRow("no command") << odd << QByteArray("[Desktop Entry]\nType=Application\n") << 2;
    QTest::newRow("blank command") << odd << QByteArray("[Desktop Entry]\nType=Application\nExec= \n") << 2;
    QTest::newRow("no type") << odd << QByteArray("[Desktop Entry]\nExec=/bin/true\n") << 2;
    QTest::newRow("link") << odd << QByteArray("[Desktop Entry]\nType=Link\nExec=/bin/true\n") << 2;
    QTest::newRow("hidden") << odd << entry + QByteArray("Hidden=true\n") << 2;
    QTest::newRow("not hidden") << odd << entry + QByteArray("Hidden=false\n") << 0;
    QTest::newRow("other group") << odd << QByteArray(entry).replace("Desktop Entry", "Entry") << 2;
    QTest::newRow("empty") << odd << QByteArray() << 2;
    QTest::newRow("no key file") << odd
                                 << QByteArray("\x7f"
                                               "ELF\0\0\1",
                                               7)
                                 << 2;
    QTest::newRow("other name") << QStringLiteral("test-odd.txt") << entry << 2;
}

void AutostartServiceTest::looksAtTheDesktopFile()
{
    QFETCH(QString, name);
    QFETCH(QByteArray, content);
    QFETCH(int, result);
    write(name, content);
    QCOMPARE(call("add", name), QStringLiteral("reply(%1)").arg(result));
    QCOMPARE(call("remove", name), QStringLiteral("reply(%1)").arg(result));
    QVERIFY(QFile::remove(folder + name));
}

void AutostartServiceTest::namesMeanFilesOfTheApplications()
{
    QCOMPARE(call("add", QStringLiteral("test-none.desktop")), QStringLiteral("reply(2)"));
    QCOMPARE(call("add", QString()), QStringLiteral("reply(2)"));
    QCOMPARE(call("add", folder), QStringLiteral("reply(2)"));
    QVERIFY(QDir(folder).mkdir(QStringLiteral("test-folder.desktop")));
    QCOMPARE(call("add", QStringLiteral("test-folder.desktop")), QStringLiteral("reply(2)"));

    QCOMPARE(call("add", QStringLiteral("test-mail.desktop")), QStringLiteral("reply(0)"));
    QCOMPARE(call("add", folder + QLatin1String("test-mail.desktop")), QStringLiteral("reply(3)"));
    QCOMPARE(call("add", folder + QLatin1String("../applications//test-mail.desktop")),
             QStringLiteral("reply(3)"));
    QCOMPARE(query(), QStringLiteral("reply([%1test-mail.desktop])").arg(folder));
    QCOMPARE(startSession(), QStringLiteral("reply(%1test-mail.desktop: /usr/bin/mail --start)").arg(folder));
    QCOMPARE(call("remove", QStringLiteral("test-mail.desktop")), QStringLiteral("reply(0)"));
    QCOMPARE(call("remove", QStringLiteral("test-mail.desktop")), QStringLiteral("reply(2)"));
    QCOMPARE(query(), QStringLiteral("reply([])"));
    QCOMPARE(startSession(), QStringLiteral("reply(Nothing starts with the session)"));
}

void AutostartServiceTest::entriesOutliveTheirFiles()
{
    write(QStringLiteral("test-short.desktop"), entry);
    QCOMPARE(call("add", QStringLiteral("test-short.desktop")), QStringLiteral("reply(0)"));
    QVERIFY(QFile::remove(folder + QLatin1String("test-short.desktop")));
    QCOMPARE(query(), QStringLiteral("reply([%1test-short.desktop])").arg(folder));
    QCOMPARE(startSession(), QStringLiteral("reply(Nothing starts with the session)"));
    QCOMPARE(call("add", QStringLiteral("test-short.desktop")), QStringLiteral("reply(2)"));
    QCOMPARE(call("remove", QStringLiteral("test-short.desktop")), QStringLiteral("reply(0)"));
}

void AutostartServiceTest::keepsWhatItWasTold()
{
    QCOMPARE(call("add", QStringLiteral("test-mail.desktop")), QStringLiteral("reply(0)"));
    m_client.control(QStringLiteral("StopService"), {service});
    m_client.control(QStringLiteral("StartService"), {service});
    QCOMPARE(query(), QStringLiteral("reply([%1test-mail.desktop])").arg(folder));
    const QByteArray json
        = m_client.control(QStringLiteral("State")).arguments().constFirst().toString().toUtf8();
    QCOMPARE(QJsonDocument::fromJson(json).object().value(QLatin1String("autostart")).toArray(),
             QJsonArray{folder + QLatin1String("test-mail.desktop")});
}

QTEST_GUILESS_MAIN(AutostartServiceTest)
#include "autostartservice_test.moc"
