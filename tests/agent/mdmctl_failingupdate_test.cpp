// SPDX-License-Identifier: LGPL-2.1-or-later
#include "mdmctl.h"

#include <QtTest/QtTest>

/** An update whose installation fails as soon as it has begun, before anybody can wait for its end. */
class MdmctlFailingUpdateTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void failureAtOnceIsTold();
};

void MdmctlFailingUpdateTest::failureAtOnceIsTold()
{
    const auto run = [](const char *arguments) {
        return Mdmctl::run(QString::fromUtf8(arguments).split(QLatin1Char(' ')));
    };
    QCOMPARE(run("update check").status, 0);
    QCOMPARE(run("update download").status, 0);
    const Mdmctl::Result failed = run("update install --wait --timeout 5");
    QCOMPARE(failed.errors, QStringLiteral("mdmctl: the phone reports: The update is damaged\n"));
    QCOMPARE(failed.output, QString());
    QCOMPARE(failed.status, 1);
}

QTEST_GUILESS_MAIN(MdmctlFailingUpdateTest)
#include "mdmctl_failingupdate_test.moc"
