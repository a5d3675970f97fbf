// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"

#include <corvanemdm/connectivitysettings.h>
#include <corvanemdm/netproxy.h>

#include <QtCore/QElapsedTimer>
#include <QtCore/QRegularExpression>
#include <QtTest/QtTest>

#include <functional>
#include <memory>
#include <thread>
#include <vector>

using Corvane::Mdm::ConnectivitySettings;
using Corvane::Mdm::NetProxy;
using AccessPoint = ConnectivitySettings::MobileNetworkAccessPointSettings;

namespace
{

const QString Connman = QStringLiteral("net.connman");
const QString Ofono = QStringLiteral("org.ofono");
const QString Modem = QStringLiteral("/ril_0");
const QString Imsi = QStringLiteral("244051234567890");

} // namespace

/**
 * Services that never answer: on their own, as each question takes as long as QtDBus waits, which nobody can
 * change from outside. The questions are asked at the same time, in a thread and by an object each.
 */
class NetworkUnansweredTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void questionsGiveUpAfterTheDefaultTimeout();
};

void NetworkUnansweredTest::questionsGiveUpAfterTheDefaultTimeout()
{
    Phone phone;
    const QString getProperties = QStringLiteral("GetProperties");
    const QString setProperty = QStringLiteral("SetProperty");
    phone.swallowCalls(Connman, QString(), getProperties);
    phone.swallowCalls(Connman, QString(), setProperty);
    phone.swallowCalls(Connman, QString(), QStringLiteral("GetProperty"));
    phone.swallowCalls(Ofono, Modem, setProperty);
    phone.swallowCalls(Ofono, QStringLiteral("/"), QStringLiteral("SetDefaultDataSim"));

    struct Question {
        std::function<bool(ConnectivitySettings &)> isEmpty;
        QString warning; // the beginning of it
    };
    const QString noReply = QStringLiteral("\"Did not receive a reply");
    const std::vector<Question> questions{
        {[](ConnectivitySettings &settings) { return !settings.wlanEnabled(); },
         QStringLiteral("Powered property not returned for WLAN technology!")},
        {[](ConnectivitySettings &settings) { return !settings.flightModeEnabled(); },
         QStringLiteral("OfflineMode property not returned for ConnMan!")},
        {[](ConnectivitySettings &settings) { return !settings.isConnectedToMobileNetwork(Imsi); }, noReply},
        {[](ConnectivitySettings &settings) { return settings.accessPointSettings(Imsi).isEmpty(); },
         QStringLiteral("Unable to set the default data SIM: ") + noReply},
        {[](ConnectivitySettings &settings) {
             return !settings.selectCellularTechnologies(Modem, ConnectivitySettings::Technology2G);
         },
         QStringLiteral("Unable to set the preferred radio technology: ") + noReply},
        {[](ConnectivitySettings &settings) {
             int changes = 0;
             QObject::connect(&settings, &ConnectivitySettings::wlanEnabledChanged, [&] { ++changes; });
             settings.setWlanEnabled(false);
             return changes == 1;
         },
         QStringLiteral("Unable to set the power of the WLAN technology: ") + noReply},
    };

    struct Answer {
        bool isEmpty = false;
        qint64 milliseconds = 0;
    };
    // This one does not wait, and is done before the others are.
    NetProxy proxy;
    for (const char *message : {"^MDM Proxy: error:  ", "^MDM Proxy: global proxy proxy error:  "}) {
        QTest::ignoreMessage(
            QtDebugMsg,
            QRegularExpression(QLatin1String(message)
                               + QStringLiteral("QDBusError\\(\"org.freedesktop.DBus.Error.NoReply\", ")));
    }
    std::vector<Answer> answers(questions.size());
    QStringList warnings;
    {
        MessageLog log;
        std::vector<std::thread> threads;
        for (std::size_t index = 0; index < questions.size(); ++index) {
            threads.emplace_back([&question = questions[index], &answer = answers[index]] {
                ConnectivitySettings settings;
                QElapsedTimer elapsed;
                elapsed.start();
                answer.isEmpty = question.isEmpty(settings);
                answer.milliseconds = elapsed.elapsed();
            });
        }
        for (std::thread &thread : threads)
            thread.join();
        warnings = log.takeWarnings();
    }

    for (std::size_t index = 0; index < questions.size(); ++index) {
        const QByteArray what = questions[index].warning.toUtf8();
        QVERIFY2(answers[index].isEmpty, what.constData());
        QVERIFY2(answers[index].milliseconds >= 20000, what.constData());
        QVERIFY2(answers[index].milliseconds < 60000, what.constData());
        int told = 0;
        for (const QString &warning : qAsConst(warnings))
            told += warning.startsWith(questions[index].warning) ? 1 : 0;
        QVERIFY2(told == 1, what.constData());
    }
    QCOMPARE(warnings.size(), int(questions.size()));

    phone.settle(Connman);
    QVERIFY(!proxy.isValid());
    QCOMPARE(proxy.getIdentifier(), QString());
}

QTEST_GUILESS_MAIN(NetworkUnansweredTest)

#include "networkunanswered_test.moc"
