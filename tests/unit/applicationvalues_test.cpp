// SPDX-License-Identifier: LGPL-2.1-or-later
#include "signalsequence.h"
#include "texts.h"
#include "waiting.h"

#include <corvanemdm/applications.h>

#include <QtCore/QPointer>
#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::ApplicationEntry;
using Corvane::Mdm::ApplicationOperation;
using Corvane::Mdm::Applications;
using Corvane::Mdm::PackageEntry;

using Signal = void (ApplicationOperation::*)(ApplicationOperation *);
Q_DECLARE_METATYPE(Signal)

/** What of the applications needs no phone: values, and how an operation ends. */
class ApplicationValuesTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void packageEntry();
    void packageIsValidWithNameAndVersion_data();
    void packageIsValidWithNameAndVersion();
    void applicationEntry();
    void valuesTravelAsVariants();
    void pendingOperation();
    void success();
    void failure();
    void onlyTheFirstEndCounts();
    void metaObjects();
    void endQueuedByName();
    void deletionInASlot_data();
    void deletionInASlot();
};

void ApplicationValuesTest::packageEntry()
{
    const PackageEntry none;
    QCOMPARE(none.name(), QString());
    QCOMPARE(none.version(), QString());
    QCOMPARE(none.vendor(), QString());
    QVERIFY(!none.isValid());

    PackageEntry notes(QStringLiteral("notes"), QStringLiteral("1.2"), QStringLiteral("Acme"));
    const PackageEntry copy(notes);
    notes = none;
    QVERIFY(!notes.isValid());
    notes = *&notes;
    QCOMPARE(copy.name(), QStringLiteral("notes"));
    QCOMPARE(copy.version(), QStringLiteral("1.2"));
    QCOMPARE(copy.vendor(), QStringLiteral("Acme"));
}

void ApplicationValuesTest::packageIsValidWithNameAndVersion_data()
{
    QTest::addColumn<QString>("name");
    QTest::addColumn<QString>("version");
    QTest::addColumn<bool>("valid");
    QTest::newRow("both") << "n"
                          << "1" << true;
    QTest::newRow("no name") << ""
                             << "1" << false;
    QTest::newRow("no version") << "n"
                                << "" << false;
    QTest::newRow("neither") << ""
                             << "" << false;
}

void ApplicationValuesTest::packageIsValidWithNameAndVersion()
{
    QFETCH(QString, name);
    QFETCH(QString, version);
    QFETCH(bool, valid);
    QCOMPARE(PackageEntry(name, version, QString()).isValid(), valid);
}

void ApplicationValuesTest::applicationEntry()
{
    const ApplicationEntry none;
    QCOMPARE(none.name(), QString());
    QVERIFY(!none.package().isValid());
    QCOMPARE(none.iconPath(), QString());

    const PackageEntry package(QStringLiteral("notes"), QStringLiteral("1.2"), QString());
    ApplicationEntry notes(QStringLiteral("Notes"), package, QStringLiteral("/icon.png"));
    const ApplicationEntry copy(notes);
    notes = none;
    QCOMPARE(notes.name(), QString());
    QCOMPARE(copy.name(), QStringLiteral("Notes"));
    QCOMPARE(copy.package().name(), QStringLiteral("notes"));
    QCOMPARE(copy.iconPath(), QStringLiteral("/icon.png"));
}

void ApplicationValuesTest::valuesTravelAsVariants()
{
    const PackageEntry package(QStringLiteral("notes"), QStringLiteral("1.2"), QString());
    QCOMPARE(QVariant::fromValue(package).value<PackageEntry>().name(), QStringLiteral("notes"));
    const ApplicationEntry entry(QStringLiteral("Notes"), package, QString());
    QCOMPARE(QVariant::fromValue(entry).value<ApplicationEntry>().name(), QStringLiteral("Notes"));
}

void ApplicationValuesTest::pendingOperation()
{
    ApplicationOperation operation;
    SignalSequence seen(&operation);
    QVERIFY(!operation.isFinished());
    QVERIFY(operation.isSucceeded());
    QCOMPARE(operation.package(), QString());
    QCOMPARE(operation.version(), QString());
    QCOMPARE(operation.errorString(), QString());
    operation.setError(QStringLiteral("Late"));
    QCOMPARE(operation.errorString(), QStringLiteral("Late"));
    QVERIFY(operation.isSucceeded());
    QCOMPARE(seen.take(), QStringList());
}

void ApplicationValuesTest::success()
{
    const QPointer<ApplicationOperation> operation(new ApplicationOperation);
    SignalSequence seen(operation);
    const QSignalSpy spy(operation, SIGNAL(finished(ApplicationOperation *)));
    connect(operation, &ApplicationOperation::succeeded, this, [](ApplicationOperation *sender) {
        QVERIFY(sender->isFinished());
        QVERIFY(sender->isSucceeded());
    });
    operation->setFinished();
    QCOMPARE(seen.take(), texts({"succeeded()", "finished()"}));
    QCOMPARE(spy.first().first().value<ApplicationOperation *>(), operation.data());
    // It goes with the event loop.
    QVERIFY(operation);
    QCoreApplication::sendPostedEvents(operation, QEvent::DeferredDelete);
    QVERIFY(!operation);
}

void ApplicationValuesTest::failure()
{
    const QPointer<ApplicationOperation> operation(new ApplicationOperation);
    SignalSequence seen(operation);
    connect(operation, &ApplicationOperation::failed, this, [](ApplicationOperation *sender) {
        QVERIFY(!sender->isFinished());
        QVERIFY(!sender->isSucceeded());
    });
    connect(operation, &ApplicationOperation::finished, this,
            [](ApplicationOperation *sender) { QVERIFY(sender->isFinished()); });
    operation->setFinishedWithError();
    QCOMPARE(seen.take(), texts({"failed()", "finished()"}));
    QCoreApplication::sendPostedEvents(operation, QEvent::DeferredDelete);
    QVERIFY(!operation);
}

void ApplicationValuesTest::onlyTheFirstEndCounts()
{
    auto *operation = new ApplicationOperation;
    SignalSequence seen(operation);
    operation->setFinished();
    operation->setFinished();
    operation->setFinishedWithError();
    QVERIFY(operation->isSucceeded());
    QCOMPARE(seen.take(), texts({"succeeded()", "finished()"}));

    operation = new ApplicationOperation;
    SignalSequence failing(operation);
    connect(operation, &ApplicationOperation::failed, operation, &ApplicationOperation::setFinished);
    operation->setFinishedWithError();
    operation->setFinished();
    QCOMPARE(failing.take(), texts({"failed()", "finished()"}));
}

void ApplicationValuesTest::metaObjects()
{
    const QMetaObject &meta = ApplicationOperation::staticMetaObject;
    QStringList methods;
    for (int index = meta.methodOffset(); index < meta.methodCount(); ++index) {
        const QMetaMethod method = meta.method(index);
        methods.append(
            QString::fromLatin1(method.methodSignature() + ' ' + method.parameterNames().join(' ')));
        QCOMPARE(method.methodType(),
                 index - meta.methodOffset() < 3 ? QMetaMethod::Signal : QMetaMethod::Slot);
        QCOMPARE(method.access(), QMetaMethod::Public);
    }
    QCOMPARE(methods,
             texts({"finished(ApplicationOperation*) applicationOperation",
                    "failed(ApplicationOperation*) applicationOperation",
                    "succeeded(ApplicationOperation*) applicationOperation", "setError(QString) errorString",
                    "setFinished() ", "setFinishedWithError() "}));
    QCOMPARE(meta.propertyCount(), QObject::staticMetaObject.propertyCount());
    // The feature itself tells nothing.
    QCOMPARE(Applications::staticMetaObject.propertyCount(), QObject::staticMetaObject.propertyCount());
    QCOMPARE(Applications::staticMetaObject.methodCount(), QObject::staticMetaObject.methodCount());
}

void ApplicationValuesTest::endQueuedByName()
{
    const QPointer<ApplicationOperation> operation(new ApplicationOperation);
    SignalSequence seen(operation);
    QVERIFY(QMetaObject::invokeMethod(operation, "setError", Qt::QueuedConnection,
                                      Q_ARG(QString, QStringLiteral("Broken"))));
    QVERIFY(QMetaObject::invokeMethod(operation, "setFinishedWithError", Qt::QueuedConnection));
    QString reason;
    // Queued as well: the pointer has to be known to the meta-object system.
    connect(
        operation, &ApplicationOperation::failed, operation,
        [&reason](ApplicationOperation *sender) { reason = sender->errorString(); }, Qt::QueuedConnection);
    QCOMPARE(seen.take(), QStringList());
    QVERIFY(waitUntil([&] { return !operation; }));
    QCOMPARE(seen.take(), texts({"failed()", "finished()"}));
    QCOMPARE(reason, QStringLiteral("Broken"));
    QCOMPARE(QMetaType::type("Corvane::Mdm::ApplicationOperation*"), qMetaTypeId<ApplicationOperation *>());
    QCOMPARE(QMetaType::type("ApplicationOperation*"), qMetaTypeId<ApplicationOperation *>());
}

void ApplicationValuesTest::deletionInASlot_data()
{
    QTest::addColumn<Signal>("signal");
    QTest::addColumn<bool>("succeeds");
    QTest::addColumn<int>("finishedSignals");
    QTest::newRow("failed") << Signal(&ApplicationOperation::failed) << false << 0;
    QTest::newRow("finished, failed") << Signal(&ApplicationOperation::finished) << false << 1;
    QTest::newRow("succeeded") << Signal(&ApplicationOperation::succeeded) << true << 0;
    QTest::newRow("finished, succeeded") << Signal(&ApplicationOperation::finished) << true << 1;
}

void ApplicationValuesTest::deletionInASlot()
{
    QFETCH(Signal, signal);
    QFETCH(bool, succeeds);
    QFETCH(int, finishedSignals);
    auto operation = std::make_unique<ApplicationOperation>();
    const QSignalSpy finished(operation.get(), &ApplicationOperation::finished);
    connect(operation.get(), signal, this, [&] { operation.reset(); });
    if (succeeds)
        operation->setFinished();
    else
        operation->setFinishedWithError();
    QVERIFY(!operation);
    QCOMPARE(finished.size(), finishedSignals);
}

QTEST_GUILESS_MAIN(ApplicationValuesTest)
#include "applicationvalues_test.moc"
