// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"

#include <corvanemdm/softwareupdate.h>

#include <QtCore/QElapsedTimer>
#include <QtTest/QtTest>

/** A proxy that never answers: on its own, as it takes as long as QtDBus waits. */
class SoftwareUpdateUnansweredTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void queryGivesUpAfterTheDefaultTimeout()
    {
        Phone phone;
        Corvane::Mdm::SoftwareUpdate update;
        phone.swallowCalls(QStringLiteral("org.corvaneos.mdmproxy"), QString(),
                           QStringLiteral("latestAvailableUpdateVersion"));
        MessageLog log;
        QElapsedTimer elapsed;
        elapsed.start();
        QCOMPARE(update.latestAvailableUpdateVersion(), QString());
        QVERIFY(elapsed.elapsed() >= 24000);
        QVERIFY(elapsed.elapsed() < 60000);
        const QStringList warnings = log.takeWarnings();
        QCOMPARE(warnings.size(), 1);
        QVERIFY2(
            warnings.first().startsWith(QLatin1String("Failed to get latest available OS version "
                                                      "QDBusError(\"org.freedesktop.DBus.Error.NoReply\", ")),
            qPrintable(warnings.first()));
    }
};

QTEST_GUILESS_MAIN(SoftwareUpdateUnansweredTest)
#include "softwareupdate_unanswered_test.moc"
