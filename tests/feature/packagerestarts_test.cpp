// SPDX-License-Identifier: LGPL-2.1-or-later
#include "endurance.h"
#include "messagelog.h"
#include "phone.h"
#include "waiting.h"

#include <corvanemdm/applications.h>

#include <QtCore/QJsonArray>
#include <QtCore/QPointer>
#include <QtCore/QRandomGenerator>
#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::ApplicationOperation;
using Corvane::Mdm::Applications;
using Corvane::Mdm::PackageEntry;

namespace
{

const QString Service = QStringLiteral("org.freedesktop.PackageKit");
constexpr int Restarts = 60;
constexpr quint32 Seed = 20261121;
constexpr int LongestRunMicroseconds = 400000; // longer than all operations of a round take

/** How the operations of a round end. */
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
};

void PackageRestartsTest::everyOperationEndsOnce()
{
    Phone phone;
    auto log = std::make_unique<MessageLog>();
    QRandomGenerator random(Seed);
    auto applications = std::make_unique<Applications>();
    const QStringList packages{QStringLiteral("acme-mail"), QStringLiteral("acme-certificates"),
                               QStringLiteral("acme-broken"), QStringLiteral("no-such-package")};
    Ends all;
    qint64 memoryAtStart = 0;
    for (int round = 0; round < Restarts; ++round) {
        Ends ends;
        std::vector<QPointer<ApplicationOperation>> operations;
        for (const QString &package : packages) {
            for (const bool install : {true, false}) {
                ApplicationOperation *operation = install ? applications->installPackage(package)
                                                          : applications->removePackage(package, true);
                connect(operation, &ApplicationOperation::succeeded, this, [&ends] { ++ends.succeeded; });
                connect(operation, &ApplicationOperation::failed, this, [&ends] { ++ends.failed; });
                connect(operation, &ApplicationOperation::finished, this, [&ends] { ++ends.finished; });
                operations.emplace_back(operation);
            }
        }
        runFor(random.bounded(LongestRunMicroseconds));
        // Once in a while it is the feature that goes.
        if (random.bounded(10) == 0)
            applications = std::make_unique<Applications>();
        phone.stopService(Service);
        runFor(random.bounded(LongestRunMicroseconds / 40));
        phone.startService(Service);

        QVERIFY(waitUntil([&] {
            QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
            return std::none_of(operations.begin(), operations.end(),
                                [](const QPointer<ApplicationOperation> &each) { return each; });
        }));
        QCOMPARE(ends.finished, int(operations.size()));
        QCOMPARE(ends.succeeded + ends.failed, ends.finished);
        all.succeeded += ends.succeeded;
        all.failed += ends.failed;
        log->takeWarnings();
        if (round == Restarts / 10)
            memoryAtStart = residentMemory();
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
    log.reset();
    qInfo("%d restarts (seed %u), %d operations succeeded, %d failed, memory %+lld KiB since restart %d",
          Restarts, Seed, all.succeeded, all.failed, residentMemory() - memoryAtStart, Restarts / 10);
    QVERIFY(all.succeeded > 0);
    QVERIFY(all.failed > 0);
}

QTEST_GUILESS_MAIN(PackageRestartsTest)
#include "packagerestarts_test.moc"
