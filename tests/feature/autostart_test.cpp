// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"

#include <corvanemdm/autostart.h>

#include <QtCore/QFile>
#include <QtCore/QMetaEnum>
#include <QtTest/QtTest>

#include <limits>
#include <memory>

using Corvane::Mdm::Autostart;

namespace
{

const QString Service = QStringLiteral("org.corvaneos.mdmproxy");
const QString Path = QStringLiteral("/Corvane/Mdm/Proxy/Autostart");
const QString Entry = QStringLiteral("/usr/share/applications/agent-of-test.desktop");

} // namespace

class AutostartTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase();
    void init();
    void cleanup();

    void addsListsAndRemoves();
    void sendsTheNameAsItIs_data();
    void sendsTheNameAsItIs();
    void theServiceJudges();
    void numbersWithoutANameArePassedOn_data();
    void numbersWithoutANameArePassedOn();
    void errorsAreLogged();
    void answersOfAnotherShapeAreErrors();
    void listKeepsTheServicesOrder();
    void serviceThatIsNotThere();
    void serviceThatGoesAndComesBack();
    void metaObjectKnowsTheResults();

private:
    std::unique_ptr<Phone> m_phone;
};

void AutostartTest::initTestCase()
{
    QFile file(Entry);
    QVERIFY(file.open(QIODevice::WriteOnly));
    file.write("[Desktop Entry]\nType=Application\nName=Agent\nExec=/usr/bin/agent\n");
}

void AutostartTest::init()
{
    m_phone = std::make_unique<Phone>();
}

void AutostartTest::cleanup()
{
    m_phone->clearFaults();
    m_phone->startService(Service);
    Autostart().remove(Entry);
}

void AutostartTest::addsListsAndRemoves()
{
    MessageLog log;
    Autostart autostart;
    Autostart::Result result = Autostart::InternalError;
    QCOMPARE(autostart.query(result), QStringList());
    QCOMPARE(result, Autostart::Success);

    QCOMPARE(autostart.add(Entry), Autostart::Success);
    result = Autostart::InternalError;
    QCOMPARE(autostart.query(result), QStringList(Entry));
    QCOMPARE(result, Autostart::Success);
    // It is the service's state, not the object's.
    QCOMPARE(Autostart().query(result), QStringList(Entry));

    QCOMPARE(autostart.remove(Entry), Autostart::Success);
    QCOMPARE(autostart.query(result), QStringList());
    QCOMPARE(log.takeWarnings(), QStringList());
}

void AutostartTest::sendsTheNameAsItIs_data()
{
    QTest::addColumn<QString>("name");
    QTest::addColumn<QString>("arguments");
    QTest::newRow("path") << Entry << QStringLiteral("('%1',)").arg(Entry);
    QTest::newRow("file name") << QStringLiteral("a b.desktop") << QStringLiteral("('a b.desktop',)");
    QTest::newRow("empty") << QString() << QStringLiteral("('',)");
    QTest::newRow("letters") << QStringLiteral("\u00e4\u4e2d.desktop")
                             << QStringLiteral("('\u00e4\u4e2d.desktop',)");
}

void AutostartTest::sendsTheNameAsItIs()
{
    QFETCH(QString, name);
    QFETCH(QString, arguments);
    Autostart autostart;
    autostart.add(name);
    autostart.remove(name);
    Autostart::Result result = Autostart::Success;
    autostart.query(result);
    const QString call = QStringLiteral("%1 org.corvaneos.mdmproxy.autostart.%2 %3");
    QCOMPARE(m_phone->takeJournalWithInterfaces(Service),
             QStringList({call.arg(Path, QStringLiteral("add"), arguments),
                          call.arg(Path, QStringLiteral("remove"), arguments),
                          call.arg(Path, QStringLiteral("query"), QStringLiteral("()"))}));
}

void AutostartTest::theServiceJudges()
{
    MessageLog log;
    Autostart autostart;
    QCOMPARE(autostart.add(QStringLiteral("/no/such.desktop")), Autostart::InvalidDesktopFile);
    QCOMPARE(autostart.remove(QStringLiteral("/no/such.desktop")), Autostart::InvalidDesktopFile);
    QCOMPARE(autostart.add(Entry), Autostart::Success);
    QCOMPARE(autostart.add(Entry), Autostart::AlreadyAutostarted);
    QCOMPARE(log.takeWarnings(), QStringList());
}

void AutostartTest::numbersWithoutANameArePassedOn_data()
{
    QTest::addColumn<int>("number");
    QTest::newRow("next") << 4;
    QTest::newRow("negative") << -1;
    QTest::newRow("smallest") << std::numeric_limits<int>::min();
    QTest::newRow("largest") << std::numeric_limits<int>::max();
}

void AutostartTest::numbersWithoutANameArePassedOn()
{
    QFETCH(int, number);
    m_phone->answerCalls(Service, Path, QStringLiteral("add"), {number});
    m_phone->answerCalls(Service, Path, QStringLiteral("remove"), {number});
    MessageLog log;
    Autostart autostart;
    QCOMPARE(int(autostart.add(Entry)), number);
    QCOMPARE(int(autostart.remove(Entry)), number);
    QCOMPARE(log.takeWarnings(), QStringList());
}

void AutostartTest::errorsAreLogged()
{
    m_phone->failCalls(Service, Path, QString(), QStringLiteral("com.example.Broken"),
                       QStringLiteral("Out of order"));
    Autostart autostart;
    MessageLog log;
    QCOMPARE(autostart.add(Entry), Autostart::InternalError);
    QCOMPARE(log.takeWarnings(),
             QStringList(QStringLiteral("Got invalid reply to Autostart::add, error is: \"Out of order\"")));
    QCOMPARE(autostart.remove(Entry), Autostart::InternalError);
    QCOMPARE(
        log.takeWarnings(),
        QStringList(QStringLiteral("Got invalid reply to Autostart::remove, error is: \"Out of order\"")));
    Autostart::Result result = Autostart::Success;
    QCOMPARE(autostart.query(result), QStringList());
    QCOMPARE(result, Autostart::InternalError);
    QCOMPARE(
        log.takeWarnings(),
        QStringList(QStringLiteral("Got invalid reply to Autostart::query, error is: \"Out of order\"")));
}

void AutostartTest::answersOfAnotherShapeAreErrors()
{
    const QString odd = QStringLiteral("0");
    m_phone->answerCalls(Service, Path, QString(), {odd});
    Autostart autostart;
    MessageLog log;
    QCOMPARE(autostart.add(Entry), Autostart::InternalError);
    QCOMPARE(autostart.remove(Entry), Autostart::InternalError);
    Autostart::Result result = Autostart::Success;
    QCOMPARE(autostart.query(result), QStringList());
    QCOMPARE(result, Autostart::InternalError);
    const QStringList warnings = log.takeWarnings();
    QCOMPARE(warnings.size(), 3);
    for (const QString &warning : warnings)
        QVERIFY2(warning.contains(QLatin1String("Unexpected reply signature")), qPrintable(warning));

    m_phone->clearFaults();
    m_phone->answerCalls(Service, Path, QString(), {});
    QCOMPARE(autostart.add(Entry), Autostart::InternalError);
    QCOMPARE(log.takeWarnings().size(), 1);
}

void AutostartTest::listKeepsTheServicesOrder()
{
    const QStringList entries{QStringLiteral("z"), QStringLiteral("a"), QString(), QStringLiteral("a")};
    m_phone->answerCalls(Service, Path, QStringLiteral("query"), {entries});
    Autostart::Result result = Autostart::InternalError;
    const Autostart autostart;
    QCOMPARE(autostart.query(result), entries);
    QCOMPARE(result, Autostart::Success);
}

void AutostartTest::serviceThatIsNotThere()
{
    m_phone->stopService(Service);
    MessageLog log;
    Autostart autostart;
    QCOMPARE(log.takeWarnings(), QStringList());
    QCOMPARE(autostart.add(QStringLiteral("any")), Autostart::InternalError);
    QCOMPARE(autostart.remove(QStringLiteral("any")), Autostart::InternalError);
    Autostart::Result result = Autostart::Success;
    QCOMPARE(autostart.query(result), QStringList());
    QCOMPARE(result, Autostart::InternalError);
    const QStringList warnings = log.takeWarnings();
    QCOMPARE(warnings.size(), 3);
    const QStringList methods{QStringLiteral("add"), QStringLiteral("remove"), QStringLiteral("query")};
    for (int i = 0; i < methods.size(); ++i) {
        QVERIFY2(warnings.at(i).startsWith(
                     QStringLiteral("Got invalid reply to Autostart::%1, error is: \"").arg(methods.at(i))),
                 qPrintable(warnings.at(i)));
    }

    m_phone->startService(Service);
    QCOMPARE(autostart.add(Entry), Autostart::Success);
    QCOMPARE(log.takeWarnings(), QStringList());
}

void AutostartTest::serviceThatGoesAndComesBack()
{
    Autostart autostart;
    QCOMPARE(autostart.add(Entry), Autostart::Success);
    m_phone->stopService(Service);
    m_phone->startService(Service);
    Autostart::Result result = Autostart::InternalError;
    QCOMPARE(autostart.query(result), QStringList(Entry));
}

void AutostartTest::metaObjectKnowsTheResults()
{
    const QMetaEnum results = QMetaEnum::fromType<Autostart::Result>();
    QStringList keys;
    for (int index = 0; index < results.keyCount(); ++index)
        keys << QStringLiteral("%1=%2").arg(QLatin1String(results.key(index))).arg(results.value(index));
    QCOMPARE(keys.join(QLatin1Char(' ')),
             QStringLiteral("Success=0 InternalError=1 InvalidDesktopFile=2 AlreadyAutostarted=3"));
    // No signals and no properties of its own.
    QCOMPARE(Autostart::staticMetaObject.methodCount(), QObject::staticMetaObject.methodCount());
    QCOMPARE(Autostart::staticMetaObject.propertyCount(), QObject::staticMetaObject.propertyCount());
}

QTEST_GUILESS_MAIN(AutostartTest)
#include "autostart_test.moc"
