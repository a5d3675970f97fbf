// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "servicerestarts.h"
#include "waiting.h"

#include <corvanemdm/applications.h>

#include <QtCore/QJsonArray>
#include <QtCore/QLoggingCategory>
#include <QtCore/QPointer>
#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::ApplicationOperation;
using Corvane::Mdm::Applications;
using Corvane::Mdm::PackageEntry;

namespace
{

const QString Service = QStringLiteral("org.freedesktop.PackageKit");
constexpr int LongestRunMicroseconds = 250000; // longer than until the first ones have succeeded
constexpr int UsualRounds = 30; // a round has much to do

/** How operations ended. */
struct Ends {
    int succeeded = 0;
    int failed = 0;
    int finished = 0;
};

QStringList sorted(QStringList list)
{
    list.sort();
    return list;
}

} // namespace

/** PackageKit goes away at moments that nobody chose, the same ones in every run of the test. */
class PackageRestartsTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void everyOperationEndsOnce();

private:
    /** Begins to install and to remove what is there, what fails and what does not exist. */
    void request(Applications &applications, Ends &ends);
    void follow(ApplicationOperation *operation, Ends &ends);
    bool waitForTheEnds();

    std::vector<QPointer<ApplicationOperation>> m_operations;
};

void PackageRestartsTest::request(Applications &applications, Ends &ends)
{
    for (const QString &package : {QStringLiteral("acme-mail"), QStringLiteral("acme-certificates"),
                                   QStringLiteral("acme-broken"), QStringLiteral("no-such-package")}) {
        follow(applications.installPackage(package), ends);
        follow(applications.removePackage(package, true), ends);
    }
}

void PackageRestartsTest::follow(ApplicationOperation *operation, Ends &ends)
{
    connect(operation, &ApplicationOperation::succeeded, this, [&ends] { ++ends.succeeded; });
    connect(operation, &ApplicationOperation::failed, this, [&ends] { ++ends.failed; });
    connect(operation, &ApplicationOperation::finished, this, [&ends] { ++ends.finished; });
    m_operations.emplace_back(operation);
}

bool PackageRestartsTest::waitForTheEnds()
{
    return waitUntil([this] {
        QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
        return std::none_of(m_operations.begin(), m_operations.end(),
                            [](const QPointer<ApplicationOperation> &each) { return each; });
    });
}

void PackageRestartsTest::everyOperationEndsOnce()
{
    Phone phone;
    ServiceRestarts restarts(phone, Service, LongestRunMicroseconds, UsualRounds);
    auto log = std::make_unique<MessageLog>();
    // Of thousands of failures, nobody reads the reasons.
    QLoggingCategory::defaultCategory()->setEnabled(QtDebugMsg, false);
    auto applications = std::make_unique<Applications>();
    Ends all;
    for (int round = 0; round < restarts.rounds(); ++round) {
        Ends ends;
        request(*applications, ends);
        restarts.runOn();
        // Once in a while it is the feature that goes.
        if (round % 10 == 0)
            applications = std::make_unique<Applications>();
        restarts.stop();
        request(*applications, ends);
        restarts.runBriefly();
        restarts.start();

        QVERIFY(waitForTheEnds());
        QCOMPARE(ends.finished, int(m_operations.size()));
        QCOMPARE(ends.succeeded + ends.failed, ends.finished);
        all.succeeded += ends.succeeded;
        all.failed += ends.failed;
        m_operations.clear();
        log->takeWarnings();
        restarts.endRound();
    }
    // Neither is the database any the worse for it.
    QStringList listed;
    QStringList held;
    QVERIFY(waitUntil([&] {
        listed.clear();
        held.clear();
        const QList<PackageEntry> entries = applications->getInstalledPackages();
        for (const PackageEntry &entry : entries)
            listed << entry.name();
        const QJsonArray installed = phone.state()
                                         .value(QLatin1String("packages"))
                                         .toObject()
                                         .value(QLatin1String("installed"))
                                         .toArray();
        for (const QJsonValue &package : installed)
            held << package.toObject().value(QLatin1String("name")).toString();
        return sorted(listed) == sorted(held);
    }));
    QCOMPARE(listed.removeDuplicates(), 0);

    // The object still works: what is there by now can be removed, and installed anew.
    const QString package = QStringLiteral("acme-certificates");
    Ends last;
    if (listed.contains(QStringLiteral("acme-mail"))) {
        follow(applications->removePackage(QStringLiteral("acme-mail"), false), last);
        QVERIFY(waitForTheEnds());
    }
    if (listed.contains(package)) {
        follow(applications->removePackage(package), last);
        QVERIFY(waitForTheEnds());
    }
    follow(applications->installPackage(package), last);
    QVERIFY(waitForTheEnds());
    QCOMPARE(last.succeeded, int(m_operations.size()));
    QCOMPARE(last.finished, int(m_operations.size()));
    log.reset();
    qInfo("%s, %d operations succeeded, %d failed", qPrintable(restarts.summary()), all.succeeded,
          all.failed);
    QVERIFY(all.failed > 0);
}

QTEST_GUILESS_MAIN(PackageRestartsTest)
#include "packagerestarts_test.moc"
