// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"
#include "waiting.h"

#include <corvanemdm/applications.h>

#include <QtCore/QFile>
#include <QtCore/QPointer>
#include <QtCore/QProcess>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusConnectionInterface>
#include <QtDBus/QDBusMessage>
#include <QtTest/QtTest>
#include <QtXml/QDomDocument>

#include <memory>

using Corvane::Mdm::ApplicationEntry;
using Corvane::Mdm::ApplicationOperation;
using Corvane::Mdm::Applications;
using Corvane::Mdm::PackageEntry;

namespace
{

const QString Service = QStringLiteral("org.freedesktop.PackageKit");

/** The signals of an operation in their order and the reason of its failure, once it has deleted itself. */
QString outcomeOf(ApplicationOperation *operation)
{
    SignalSequence seen(operation);
    QString reason;
    QObject::connect(operation, &ApplicationOperation::finished,
                     [&reason](ApplicationOperation *finished) { reason = finished->errorString(); });
    const QPointer<ApplicationOperation> pending(operation);
    const bool ended = waitUntil([&] {
        QCoreApplication::sendPostedEvents(pending, QEvent::DeferredDelete);
        return !pending;
    });
    return ended ? seen.take().join(QLatin1Char(' ')) + QLatin1String(": ") + reason
                 : QStringLiteral("no end");
}

/** What rpm itself says, line by line. */
QStringList rpm(const QStringList &arguments)
{
    QProcess process;
    process.start(QStringLiteral("rpm"), arguments);
    if (!process.waitForFinished())
        qFatal("rpm does not end");
    return QString::fromUtf8(process.readAllStandardOutput()).split(QLatin1Char('\n'), Qt::SkipEmptyParts);
}

/** "method Name in:s out:u", "signal ..." and "property ..." of each member of an interface. */
QStringList members(const QByteArray &xml, const QString &interface)
{
    QDomDocument document;
    document.setContent(xml);
    QStringList found;
    const QDomNodeList interfaces = document.elementsByTagName(QStringLiteral("interface"));
    for (int i = 0; i < interfaces.size(); ++i) {
        const QDomElement element = interfaces.at(i).toElement();
        if (element.attribute(QStringLiteral("name")) != interface)
            continue;
        for (QDomElement member = element.firstChildElement(); !member.isNull();
             member = member.nextSiblingElement()) {
            if (member.tagName() == QLatin1String("annotation"))
                continue;
            QStringList words{member.tagName(), member.attribute(QStringLiteral("name")),
                              member.attribute(QStringLiteral("type")),
                              member.attribute(QStringLiteral("access"))};
            for (QDomElement argument = member.firstChildElement(QStringLiteral("arg")); !argument.isNull();
                 argument = argument.nextSiblingElement(QStringLiteral("arg"))) {
                const bool isOut = member.tagName() == QLatin1String("signal")
                    || argument.attribute(QStringLiteral("direction")) == QLatin1String("out");
                words << (isOut ? QStringLiteral("out:") : QStringLiteral("in:"))
                        + argument.attribute(QStringLiteral("type"));
            }
            words.removeAll(QString());
            found << words.join(QLatin1Char(' '));
        }
    }
    return found;
}

} // namespace

/** The distribution's PackageKit, which asks its polkitd, and an rpm database that rpm itself reads as well.
 */
class RealPackageKitTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void cleanup();

    void untrustedPackageIsNotInstalled();
    void versionsAreCompared();
    void removalFails();
    void severalAtATime();
    void daemonThatDies();
    void daemonThatWasNeverThere();
    void destructionWhileItWorks();
    void contractsAreTheRealOnes_data();
    void contractsAreTheRealOnes();
    void packagesAsRpmListsThem();
    void ownersAsRpmTellsThem();

private:
    Phone m_phone;
};

void RealPackageKitTest::cleanup()
{
    m_phone.startService(Service);
}

void RealPackageKitTest::untrustedPackageIsNotInstalled()
{
    Applications applications;
    MessageLog log;
    QCOMPARE(outcomeOf(applications.installPackage(QStringLiteral("vips-doc"))),
             QStringLiteral("failed() finished(): Can't install as untrusted"));
    QCOMPARE(
        log.takeWarnings().last(),
        QStringLiteral("Error installing package : PackageKit::Transaction::ErrorCannotInstallRepoUnsigned"));
}

void RealPackageKitTest::versionsAreCompared()
{
    Applications applications;
    MessageLog log;
    // Only the version that is there gets as far as being refused.
    ApplicationOperation *exact
        = applications.installPackage(QStringLiteral("vips-doc"), QStringLiteral("7.12.4-2.fc8"));
    QCOMPARE(outcomeOf(exact), QStringLiteral("failed() finished(): Can't install as untrusted"));
    ApplicationOperation *other
        = applications.installPackage(QStringLiteral("vips-doc"), QStringLiteral("7.12.4"));
    QCOMPARE(outcomeOf(other), QStringLiteral("failed() finished(): Package not found: vips-doc"));
}

void RealPackageKitTest::removalFails()
{
    Applications applications;
    MessageLog log;
    QCOMPARE(outcomeOf(applications.removePackage(QStringLiteral("powertop"), true)),
             QStringLiteral("failed() finished(): No network connection available"));
    QCOMPARE(log.takeWarnings().last(),
             QStringLiteral("Error uninstalling package : PackageKit::Transaction::ErrorNoNetwork"));
    QCOMPARE(outcomeOf(applications.removePackage(QStringLiteral("no-such-package"))),
             QStringLiteral("failed() finished(): Package not found: no-such-package"));
}

void RealPackageKitTest::severalAtATime()
{
    Applications applications;
    MessageLog log;
    ApplicationOperation *removal = applications.removePackage(QStringLiteral("powertop"));
    ApplicationOperation *refused = applications.removePackage(QStringLiteral("powertop"));
    QString refusal;
    connect(refused, &ApplicationOperation::finished, this,
            [&refusal](ApplicationOperation *finished) { refusal = finished->errorString(); });
    QCOMPARE(outcomeOf(removal), QStringLiteral("failed() finished(): No network connection available"));
    QCOMPARE(refusal, QStringLiteral("Trying to remove a package which is already being removed"));
}

void RealPackageKitTest::daemonThatDies()
{
    Applications applications;
    MessageLog log;
    ApplicationOperation *operation = applications.installPackage(QStringLiteral("vips-doc"));
    // Its look at the sources takes seconds.
    bool stopped = false;
    connect(operation, &ApplicationOperation::finished, this, [&stopped] { QVERIFY(stopped); });
    const auto pid = QDBusConnection::systemBus().interface()->servicePid(Service);
    QVERIFY(pid.isValid());
    stopped = true;
    m_phone.stopService(Service);
    QCOMPARE(outcomeOf(operation), QStringLiteral("failed() finished(): "));
    m_phone.startService(Service);
    QCOMPARE(outcomeOf(applications.removePackage(QStringLiteral("no-such-package"))),
             QStringLiteral("failed() finished(): Package not found: no-such-package"));
}

void RealPackageKitTest::daemonThatWasNeverThere()
{
    m_phone.stopService(Service);
    Applications applications;
    MessageLog log;
    QCOMPARE(outcomeOf(applications.installPackage(QStringLiteral("vips-doc"))),
             QStringLiteral("failed() finished(): "));
    QCOMPARE(outcomeOf(applications.removePackage(QStringLiteral("powertop"))),
             QStringLiteral("failed() finished(): "));
}

void RealPackageKitTest::destructionWhileItWorks()
{
    MessageLog log;
    auto applications = std::make_unique<Applications>();
    ApplicationOperation *operation = applications->installPackage(QStringLiteral("vips-doc"));
    QString reason;
    connect(operation, &ApplicationOperation::finished, this,
            [&reason](ApplicationOperation *finished) { reason = finished->errorString(); });
    applications.reset();
    QCOMPARE(reason, QStringLiteral("Applications object destroyed while operation vips-doc in progress"));
    QCoreApplication::sendPostedEvents(operation, QEvent::DeferredDelete);
    // The daemon is still of use to others.
    Applications others;
    QCOMPARE(outcomeOf(others.removePackage(QStringLiteral("no-such-package"))),
             QStringLiteral("failed() finished(): Package not found: no-such-package"));
}

void RealPackageKitTest::contractsAreTheRealOnes_data()
{
    QTest::addColumn<QString>("path");
    QTest::newRow("org.freedesktop.PackageKit") << "/org/freedesktop/PackageKit";
    QTest::newRow("org.freedesktop.PackageKit.Transaction") << QString();
}

void RealPackageKitTest::contractsAreTheRealOnes()
{
    QFETCH(QString, path);
    const QString interface = QString::fromLatin1(QTest::currentDataTag());
    const QDBusConnection bus = QDBusConnection::systemBus();
    if (path.isEmpty()) {
        const QDBusMessage created
            = bus.call(QDBusMessage::createMethodCall(Service, QStringLiteral("/org/freedesktop/PackageKit"),
                                                      Service, QStringLiteral("CreateTransaction")));
        path = qvariant_cast<QDBusObjectPath>(created.arguments().value(0)).path();
    }
    const QDBusMessage introspected = bus.call(QDBusMessage::createMethodCall(
        Service, path, QStringLiteral("org.freedesktop.DBus.Introspectable"), QStringLiteral("Introspect")));
    const QStringList real = members(introspected.arguments().value(0).toString().toUtf8(), interface);
    QVERIFY(!real.isEmpty());

    QFile contract(QStringLiteral(CONTRACTS_FOLDER "/%1.xml").arg(interface));
    QVERIFY(contract.open(QIODevice::ReadOnly));
    const QStringList ours = members(contract.readAll(), interface);
    QVERIFY(ours.size() > 10);
    for (const QString &member : ours)
        QVERIFY2(real.contains(member), qPrintable(member));
}

void RealPackageKitTest::packagesAsRpmListsThem()
{
    const Applications applications;
    QStringList listed;
    const QList<PackageEntry> packages = applications.getInstalledPackages();
    for (const PackageEntry &package : packages)
        listed << QStringList({package.name(), package.version(), package.vendor()}).join(QLatin1Char('|'));
    QVERIFY(listed.size() > 5);
    QStringList rpms = rpm({QStringLiteral("-qa"), QStringLiteral("--nosignature"), QStringLiteral("--qf"),
                            QStringLiteral("%{NAME}|%{VERSION}|%{VENDOR}\\n")});
    QCOMPARE(listed, rpms);
}

void RealPackageKitTest::ownersAsRpmTellsThem()
{
    const Applications applications;
    const QList<ApplicationEntry> entries = applications.getInstalledApplications();
    QVERIFY(entries.size() > 3);
    for (const ApplicationEntry &entry : entries) {
        const QString name = entry.package().name();
        QVERIFY2(entry.package().isValid(), qPrintable(entry.name()));
        QCOMPARE(rpm({QStringLiteral("-qf"), QStringLiteral("--qf"), QStringLiteral("%{NAME}\\n"),
                      QStringLiteral("/usr/share/applications/%1.desktop").arg(name)}),
                 QStringList(name));
    }
}

QTEST_GUILESS_MAIN(RealPackageKitTest)
#include "realpackagekit_test.moc"
