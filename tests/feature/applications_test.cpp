// SPDX-License-Identifier: LGPL-2.1-or-later
#include "messagelog.h"
#include "phone.h"
#include "signalsequence.h"
#include "texts.h"
#include "waiting.h"

#include <corvanemdm/applications.h>

#include <QtCore/QDir>
#include <QtCore/QPointer>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtTest/QtTest>

#include <memory>

using Corvane::Mdm::ApplicationEntry;
using Corvane::Mdm::ApplicationOperation;
using Corvane::Mdm::Applications;
using Corvane::Mdm::PackageEntry;

namespace
{

const QString Service = QStringLiteral("org.freedesktop.PackageKit");
const QString EntryFolder = QStringLiteral("/usr/share/applications/");

/** "name version vendor" of each, in the order of the database. */
QStringList packageTexts(const QList<PackageEntry> &packages)
{
    QStringList result;
    for (const PackageEntry &package : packages)
        result.append(
            QStringList({package.name(), package.version(), package.vendor()}).join(QLatin1Char(' ')));
    return result;
}

QStringList installed(const Applications &applications)
{
    QStringList packages = packageTexts(applications.getInstalledPackages());
    packages.sort();
    return packages;
}

/** "name package icon" of each, sorted: folders have no order. */
QStringList applicationTexts(const Applications &applications)
{
    QStringList result;
    const QList<ApplicationEntry> entries = applications.getInstalledApplications();
    for (const ApplicationEntry &entry : entries) {
        const QString package = entry.package().isValid() ? entry.package().name() : QStringLiteral("-");
        result.append(QStringList({entry.name(), package, entry.iconPath()}).join(QLatin1Char(' ')));
    }
    result.sort();
    return result;
}

void writeFile(const QString &path, const QByteArray &content)
{
    QDir().mkpath(QFileInfo(path).path());
    QFile file(path);
    if (!file.open(QIODevice::WriteOnly) || file.write(content) != content.size())
        qFatal("cannot write %s (run the test inside corvane-simulator)", qPrintable(path));
}

/** Follows an operation past its end. */
class Outcome
{
public:
    explicit Outcome(ApplicationOperation *operation)
        : m_signals(operation)
        , m_operation(operation)
    {
        QObject::connect(operation, &ApplicationOperation::finished, &m_signals,
                         [this](ApplicationOperation *finished) { m_error = finished->errorString(); });
    }

    /** The signals in their order and the reason of a failure, once the operation has deleted itself. */
    QString wait()
    {
        const auto isGone = [this] {
            // What is deleted outside of an event loop waits for the outermost one, which no test runs.
            QCoreApplication::sendPostedEvents(m_operation, QEvent::DeferredDelete);
            return !m_operation;
        };
        if (!waitUntil(isGone))
            return QStringLiteral("the operation is still there");
        const QString names = m_signals.take().join(QLatin1Char(' '));
        return m_error.isEmpty() ? names : names + QLatin1String(": ") + m_error;
    }

    bool isPending() const { return m_signals.signalsSeen().isEmpty(); }
    QPointer<ApplicationOperation> operation() const { return m_operation; }

private:
    SignalSequence m_signals;
    const QPointer<ApplicationOperation> m_operation;
    QString m_error;
};

const QString Succeeded = QStringLiteral("succeeded() finished()");
const QString Failed = QStringLiteral("failed() finished()");

QString failedWith(const char *reason)
{
    return Failed + QLatin1String(": ") + QLatin1String(reason);
}

} // namespace

class ApplicationsTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void listsPackages();
    void listsApplications();
    void applicationsThatAreNotListed_data();
    void applicationsThatAreNotListed();
    void iconsOfApplications_data();
    void iconsOfApplications();
    void oddFilesAmongTheApplications();
    void packageOfALinkedEntry();

    void installsTheNewestVersion();
    void installsWhatWasAskedFor();
    void whatIsSentToInstall();
    void whatIsSentToRemove();
    void versionThatIsNotThere();
    void packageThatIsNotThere();
    void removesForGood();
    void removesWhatCameAlong();
    void removalOfWhatIsNotInstalled();
    void removalOfWhatOthersNeed();
    void untrustedPackage();

    void secondInstallIsRefused();
    void secondRemovalIsRefused();
    void installAndRemovalOfOneName();
    void nameIsFreeAgainWhenItsOperationEnds();
    void severalAtATime();

    void failuresOfEachPhase_data();
    void failuresOfEachPhase();
    void callsThatFail_data();
    void callsThatFail();
    void exitsWithoutAReason_data();
    void exitsWithoutAReason();
    void errorsOfEachPhase_data();
    void errorsOfEachPhase();
    void transactionThatVanishes_data();
    void transactionThatVanishes();
    void laterMatchReplacesAnEarlierOne();
    void whatComesAfterTheEndIsIgnored();
    void debugTexts();
    void daemonThatIsNotThere();
    void daemonThatGoes_data();
    void daemonThatGoes();

    void destructionInEachPhase_data();
    void destructionInEachPhase();
    void destructionWithSeveralPending();
    void destructionAfterARefusal();
    void destructionAfterADeletedOperation();
    void requestsDuringDestruction();
    void deletedOperation_data();
    void deletedOperation();
    void deletionInASlot_data();
    void deletionInASlot();
    void worksThroughTheMetaObject();

private:
    /** Lets @p member go unanswered, so that the test can tell how its transaction ends. */
    void takeOver(const QString &member) { m_phone->swallowCalls(Service, QString(), member); }
    /** The path of the transaction that was asked for @p member, once it was. */
    QString transactionOf(const QString &member);
    void tell(const QString &transaction, const char *signal, const QVariantList &arguments = QVariantList());

    std::unique_ptr<Phone> m_phone;
};

QString ApplicationsTest::transactionOf(const QString &member)
{
    QString path;
    waitUntil([&] {
        const QStringList calls = m_phone->takeJournal(Service);
        for (const QString &call : calls) {
            if (call.section(QLatin1Char(' '), 1, 1) == member)
                path = call.section(QLatin1Char(' '), 0, 0);
        }
        return !path.isEmpty();
    });
    return path;
}

void ApplicationsTest::tell(const QString &transaction, const char *signal, const QVariantList &arguments)
{
    m_phone->emitSignal(Service, transaction, QStringLiteral("org.freedesktop.PackageKit.Transaction"),
                        QLatin1String(signal), arguments);
}

void ApplicationsTest::init()
{
    m_phone = std::make_unique<Phone>();
}

void ApplicationsTest::cleanup()
{
    m_phone->clearFaults();
    // What ended with its feature waits for an event loop.
    QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
}

void ApplicationsTest::listsPackages()
{
    const Applications applications;
    QCOMPARE(installed(applications),
             texts({"acme-agent 1.1.0 Acme", "corvane-base 4.0.2 Corvane", "corvane-library 1.0 ",
                    "corvane-notes 1.2.0 Corvane", "corvane-setup 1.0 Corvane"}));
    // In the order of the database, which is the order of installation.
    QCOMPARE(packageTexts(applications.getInstalledPackages()).first(),
             QStringLiteral("corvane-base 4.0.2 Corvane"));
    QVERIFY(applications.getInstalledPackages().first().isValid());
}

void ApplicationsTest::listsApplications()
{
    const Applications applications;
    QCOMPARE(applicationTexts(applications),
             texts({"Agent acme-agent /usr/share/acme-agent/icon.png",
                    "Notes corvane-notes /usr/share/icons/hicolor/128x128/apps/notes.png"}));
}

void ApplicationsTest::applicationsThatAreNotListed_data()
{
    QTest::addColumn<QByteArray>("keys");
    QTest::addColumn<bool>("listed");
    const QByteArray valid = "Type=Application\nName=Extra\nExec=extra\n";
    QTest::newRow("plain") << valid << true;
    QTest::newRow("not to be displayed") << valid + "NoDisplay=true\n" << false;
    QTest::newRow("to be displayed") << valid + "NoDisplay=false\n" << true;
    QTest::newRow("not in this environment") << valid + "NotShowIn=X-Meego;\n" << false;
    QTest::newRow("not in this environment either") << valid + "NotShowIn=GNOME;X-Meego;KDE\n" << false;
    QTest::newRow("not in others") << valid + "NotShowIn=GNOME;KDE;\n" << true;
    QTest::newRow("environment in another case") << valid + "NotShowIn=x-meego;\n" << true;
    QTest::newRow("environment of a longer name") << valid + "NotShowIn=X-Meego-Tablet;\n" << true;
    QTest::newRow("only in others") << valid + "OnlyShowIn=GNOME;\n" << true;
    QTest::newRow("without a name") << QByteArray("Type=Application\nExec=extra\n") << false;
    QTest::newRow("without a command") << QByteArray("Type=Application\nName=Extra\n") << false;
}

void ApplicationsTest::applicationsThatAreNotListed()
{
    QFETCH(QByteArray, keys);
    QFETCH(bool, listed);
    const QString file = EntryFolder + QStringLiteral("extra.desktop");
    writeFile(file, "[Desktop Entry]\n" + keys);
    MessageLog log;
    const Applications applications;
    QCOMPARE(applicationTexts(applications).contains(QStringLiteral("Extra - ")), listed);
    QCOMPARE(applicationTexts(applications).size(), listed ? 3 : 2);
    QCOMPARE(log.takeWarnings(), QStringList());
    QVERIFY(QFile::remove(file));
}

void ApplicationsTest::iconsOfApplications_data()
{
    QTest::addColumn<QByteArray>("icon");
    QTest::addColumn<QString>("path");
    QTest::newRow("path of a file") << QByteArray("/usr/share/extra/icon") << "/usr/share/extra/icon";
    QTest::newRow("path with a detour")
        << QByteArray("/usr/share/../share/extra/icon") << "/usr/share/../share/extra/icon";
    QTest::newRow("path of nothing") << QByteArray("/usr/share/extra/nothing.png") << "";
    QTest::newRow("path of a folder") << QByteArray("/usr/share/extra") << "";
    QTest::newRow("name") << QByteArray("notes") << "/usr/share/icons/hicolor/128x128/apps/notes.png";
    QTest::newRow("unknown name") << QByteArray("no-such-icon") << "";
    // An icon's name means no file beside the program.
    QTest::newRow("name of a file beside us") << QByteArray("extra-icon-in-this-folder") << "";
    QTest::newRow("none") << QByteArray() << "";
}

void ApplicationsTest::iconsOfApplications()
{
    QFETCH(QByteArray, icon);
    QFETCH(QString, path);
    writeFile(QStringLiteral("/usr/share/extra/icon"), "x");
    writeFile(QStringLiteral("/usr/share/extra/extra-icon-in-this-folder"), "x");
    const QString folder = QDir::currentPath();
    QVERIFY(QDir::setCurrent(QStringLiteral("/usr/share/extra")));
    const QString file = EntryFolder + QStringLiteral("extra.desktop");
    writeFile(file, "[Desktop Entry]\nType=Application\nName=Extra\nExec=extra\nIcon=" + icon + '\n');
    const Applications applications;
    const QStringList listed = applicationTexts(applications);
    QVERIFY(QDir::setCurrent(folder));
    QVERIFY(QFile::remove(file));
    QVERIFY2(listed.contains(QStringLiteral("Extra - ") + path), qPrintable(listed.join(QLatin1Char('\n'))));
}

void ApplicationsTest::oddFilesAmongTheApplications()
{
    const QString folder = EntryFolder + QStringLiteral("folder.desktop");
    const QString link = EntryFolder + QStringLiteral("dangling.desktop");
    const QString binary = EntryFolder + QStringLiteral("binary.desktop");
    const QString other = EntryFolder + QStringLiteral("other.txt");
    QVERIFY(QDir().mkdir(folder));
    QVERIFY(QFile::link(QStringLiteral("/nowhere"), link));
    writeFile(binary, QByteArray(100000, '\xff'));
    writeFile(other, "[Desktop Entry]\nType=Application\nName=Other\nExec=other\n");
    MessageLog log;
    const Applications applications;
    QCOMPARE(applicationTexts(applications).size(), 2);
    QCOMPARE(log.takeWarnings(), QStringList());
    QVERIFY(QDir().rmdir(folder));
    for (const QString &file : {link, binary, other})
        QVERIFY(QFile::remove(file));
}

void ApplicationsTest::packageOfALinkedEntry()
{
    // The package owns the file, not a link to it.
    const QString link = EntryFolder + QStringLiteral("link.desktop");
    QVERIFY(QFile::link(EntryFolder + QStringLiteral("corvane-notes.desktop"), link));
    const Applications applications;
    QCOMPARE(applicationTexts(applications),
             texts({"Agent acme-agent /usr/share/acme-agent/icon.png",
                    "Notes - /usr/share/icons/hicolor/128x128/apps/notes.png",
                    "Notes corvane-notes /usr/share/icons/hicolor/128x128/apps/notes.png"}));
    QVERIFY(QFile::remove(link));
}

void ApplicationsTest::installsTheNewestVersion()
{
    Applications applications;
    const QStringList before = installed(applications);
    ApplicationOperation *operation = applications.installPackage(QStringLiteral("acme-mail"));
    QCOMPARE(operation->package(), QStringLiteral("acme-mail"));
    QCOMPARE(operation->version(), QString());
    QVERIFY(!operation->parent());
    QVERIFY(!operation->isFinished());
    Outcome outcome(operation);
    QCOMPARE(outcome.wait(), Succeeded);
    // What it needs came with it.
    QStringList expected = before + texts({"acme-certificates 2026.1 Acme", "acme-mail 2.1.0 Acme"});
    expected.sort();
    QCOMPARE(installed(applications), expected);
    QVERIFY(applicationTexts(applications)
                .contains(QStringLiteral(
                    "Acme Mail acme-mail /usr/share/icons/hicolor/128x128/apps/acme-mail.png")));

    Outcome again(applications.installPackage(QStringLiteral("acme-mail")));
    MessageLog log;
    QCOMPARE(again.wait(), failedWith("acme-mail is already installed"));
    QCOMPARE(log.takeWarnings(),
             texts({"Error installing package : PackageKit::Transaction::ErrorPackageAlreadyInstalled"}));

    Outcome removal(applications.removePackage(QStringLiteral("acme-mail"), true));
    QCOMPARE(removal.wait(), Succeeded);
    QCOMPARE(installed(applications), before);
}

void ApplicationsTest::installsWhatWasAskedFor()
{
    Applications applications;
    Outcome outcome(applications.installPackage(QStringLiteral("acme-mail"), QStringLiteral("2.0.0-7")));
    QCOMPARE(outcome.operation()->version(), QStringLiteral("2.0.0-7"));
    QCOMPARE(outcome.wait(), Succeeded);
    QVERIFY(installed(applications).contains(QStringLiteral("acme-mail 2.0.0 Acme")));
    Outcome removal(applications.removePackage(QStringLiteral("acme-mail"), true));
    QCOMPARE(removal.wait(), Succeeded);
}

void ApplicationsTest::whatIsSentToInstall()
{
    Applications applications;
    const auto sent = [this](Applications *client, const QString &version) {
        m_phone->takeJournal(Service);
        Outcome outcome(client->installPackage(QStringLiteral("acme-untrusted"), version));
        MessageLog log;
        outcome.wait();
        QStringList calls;
        const QStringList journal = m_phone->takeJournal(Service);
        for (const QString &call : journal) {
            // Without the transaction's path, and without how it is made.
            const QString words = call.section(QLatin1Char(' '), 1);
            if (!words.startsWith(QLatin1String("CreateTransaction"))
                && !words.startsWith(QLatin1String("SetHints")))
                calls.append(words);
        }
        return calls;
    };
    QCOMPARE(sent(&applications, QString()),
             texts({"RefreshCache (false,)", "Resolve (uint64 65536, ['acme-untrusted'])",
                    "InstallPackages (uint64 2, ['acme-untrusted;0.2-1;noarch;store'])"}));
    QCOMPARE(sent(&applications, QStringLiteral("0.1-1")),
             texts({"RefreshCache (false,)", "Resolve (uint64 2, ['acme-untrusted'])",
                    "InstallPackages (uint64 2, ['acme-untrusted;0.1-1;noarch;store'])"}));
}

void ApplicationsTest::whatIsSentToRemove()
{
    Applications applications;
    for (const bool autoremove : {false, true}) {
        m_phone->takeJournal(Service);
        Outcome outcome(applications.removePackage(QStringLiteral("corvane-base"), autoremove));
        MessageLog log;
        QCOMPARE(outcome.wait(), failedWith("corvane-base is essential to the phone"));
        QCOMPARE(log.takeWarnings(),
                 texts({"Error uninstalling package : "
                        "PackageKit::Transaction::ErrorCannotRemoveSystemPackage"}));
        const QString calls = m_phone->takeJournal(Service).join(QLatin1Char('\n'));
        QVERIFY2(calls.contains(QLatin1String("Resolve (uint64 4, ['corvane-base'])")), qPrintable(calls));
        QVERIFY2(calls.contains(
                     QStringLiteral("RemovePackages (uint64 2, ['corvane-base;4.0.2-1;noarch;installed'], "
                                    "false, %1)")
                         .arg(autoremove ? QLatin1String("true") : QLatin1String("false"))),
                 qPrintable(calls));
        QVERIFY(!calls.contains(QLatin1String("RefreshCache")));
    }
}

void ApplicationsTest::versionThatIsNotThere()
{
    Applications applications;
    MessageLog log;
    // The whole version has to be the same.
    for (const char *version : {"2.1.0", "2.1.0-30", "9.9.9-1"}) {
        Outcome outcome(applications.installPackage(QStringLiteral("acme-mail"), QLatin1String(version)));
        QCOMPARE(outcome.wait(), failedWith("Package not found: acme-mail"));
    }
    QCOMPARE(log.takeWarnings(), QStringList());
}

void ApplicationsTest::packageThatIsNotThere()
{
    Applications applications;
    MessageLog log;
    Outcome outcome(applications.installPackage(QStringLiteral("no-such-package")));
    QCOMPARE(outcome.wait(), failedWith("Package not found: no-such-package"));
    Outcome empty(applications.installPackage(QString()));
    QCOMPARE(empty.wait(), failedWith("Package not found: "));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void ApplicationsTest::removesForGood()
{
    Applications applications;
    QCOMPARE(Outcome(applications.installPackage(QStringLiteral("acme-certificates"))).wait(), Succeeded);
    QVERIFY(installed(applications).contains(QStringLiteral("acme-certificates 2026.1 Acme")));
    QVERIFY(QFile::exists(QStringLiteral("/usr/share/acme/certificates")));
    Outcome outcome(applications.removePackage(QStringLiteral("acme-certificates")));
    QCOMPARE(outcome.operation()->package(), QStringLiteral("acme-certificates"));
    QCOMPARE(outcome.wait(), Succeeded);
    QVERIFY(!installed(applications).contains(QStringLiteral("acme-certificates 2026.1 Acme")));
    QVERIFY(!QFile::exists(QStringLiteral("/usr/share/acme/certificates")));
}

void ApplicationsTest::removesWhatCameAlong()
{
    Applications applications;
    const QString certificates = QStringLiteral("acme-certificates 2026.1 Acme");
    QCOMPARE(Outcome(applications.installPackage(QStringLiteral("acme-mail"))).wait(), Succeeded);
    QCOMPARE(Outcome(applications.removePackage(QStringLiteral("acme-mail"), false)).wait(), Succeeded);
    QVERIFY(installed(applications).contains(certificates));
    QCOMPARE(Outcome(applications.installPackage(QStringLiteral("acme-mail"))).wait(), Succeeded);
    QCOMPARE(Outcome(applications.removePackage(QStringLiteral("acme-mail"), true)).wait(), Succeeded);
    QVERIFY(!installed(applications).contains(certificates));
}

void ApplicationsTest::removalOfWhatIsNotInstalled()
{
    Applications applications;
    MessageLog log;
    // That it could be installed does not count.
    Outcome outcome(applications.removePackage(QStringLiteral("acme-mail")));
    QCOMPARE(outcome.wait(), failedWith("Package not found: acme-mail"));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void ApplicationsTest::removalOfWhatOthersNeed()
{
    Applications applications;
    MessageLog log;
    Outcome outcome(applications.removePackage(QStringLiteral("corvane-library"), true));
    QCOMPARE(outcome.wait(), failedWith("corvane-notes needs corvane-library"));
    QCOMPARE(log.takeWarnings(),
             texts({"Error uninstalling package : PackageKit::Transaction::ErrorDepResolutionFailed"}));
}

void ApplicationsTest::untrustedPackage()
{
    Applications applications;
    MessageLog log;
    Outcome outcome(applications.installPackage(QStringLiteral("acme-untrusted")));
    QCOMPARE(outcome.wait(), failedWith("acme-untrusted is not signed"));
    QCOMPARE(log.takeWarnings(),
             texts({"Error installing package : PackageKit::Transaction::ErrorCannotInstallRepoUnsigned"}));
}

void ApplicationsTest::secondInstallIsRefused()
{
    Applications applications;
    Outcome first(applications.installPackage(QStringLiteral("acme-certificates")));
    MessageLog log;
    ApplicationOperation *refused
        = applications.installPackage(QStringLiteral("acme-certificates"), QStringLiteral("1-1"));
    const QString reason = QStringLiteral("Trying to install package which is already being installed");
    QCOMPARE(log.takeWarnings(), QStringList(reason));
    QCOMPARE(refused->errorString(), reason);
    QCOMPARE(refused->package(), QStringLiteral("acme-certificates"));
    QCOMPARE(refused->version(), QStringLiteral("1-1"));
    // Its end comes with the event loop, not before.
    QVERIFY(!refused->isFinished());
    Outcome second(refused);
    QCOMPARE(second.wait(), Failed + QLatin1String(": ") + reason);
    QVERIFY(first.isPending());
    QCOMPARE(first.wait(), Succeeded);
    QCOMPARE(Outcome(applications.removePackage(QStringLiteral("acme-certificates"))).wait(), Succeeded);
}

void ApplicationsTest::secondRemovalIsRefused()
{
    Applications applications;
    QCOMPARE(Outcome(applications.installPackage(QStringLiteral("acme-certificates"))).wait(), Succeeded);
    Outcome first(applications.removePackage(QStringLiteral("acme-certificates")));
    MessageLog log;
    ApplicationOperation *refused = applications.removePackage(QStringLiteral("acme-certificates"));
    const QString reason = QStringLiteral("Trying to remove a package which is already being removed");
    QCOMPARE(log.takeWarnings(), QStringList(reason));
    QCOMPARE(refused->errorString(), reason);
    QVERIFY(!refused->isFinished());
    Outcome second(refused);
    QCOMPARE(second.wait(), Failed + QLatin1String(": ") + reason);
    QCOMPARE(first.wait(), Succeeded);
}

void ApplicationsTest::installAndRemovalOfOneName()
{
    Applications applications;
    MessageLog log;
    Outcome installing(applications.installPackage(QStringLiteral("acme-certificates")));
    Outcome removing(applications.removePackage(QStringLiteral("acme-certificates")));
    QCOMPARE(log.takeWarnings(), QStringList());
    QCOMPARE(removing.wait(), failedWith("Package not found: acme-certificates"));
    QCOMPARE(installing.wait(), Succeeded);
    QCOMPARE(Outcome(applications.removePackage(QStringLiteral("acme-certificates"))).wait(), Succeeded);
}

void ApplicationsTest::nameIsFreeAgainWhenItsOperationEnds()
{
    Applications applications;
    MessageLog log;
    const QString name = QStringLiteral("no-such-package");
    // Already in the slot that hears of the end.
    QPointer<ApplicationOperation> second;
    ApplicationOperation *first = applications.installPackage(name);
    connect(first, &ApplicationOperation::failed, this, [&] { second = applications.installPackage(name); });
    Outcome outcome(first);
    QCOMPARE(outcome.wait(), failedWith("Package not found: no-such-package"));
    QVERIFY(second);
    QCOMPARE(Outcome(second).wait(), failedWith("Package not found: no-such-package"));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void ApplicationsTest::severalAtATime()
{
    Applications applications;
    Applications other;
    Outcome mail(applications.installPackage(QStringLiteral("acme-mail")));
    // Another object knows nothing of the first one's.
    Outcome same(other.installPackage(QStringLiteral("acme-mail")));
    Outcome missing(applications.installPackage(QStringLiteral("no-such-package")));
    Outcome removal(other.removePackage(QStringLiteral("no-such-package")));
    MessageLog log;
    // Which of the two PackageKit takes up first is its own affair.
    QStringList both{mail.wait(), same.wait()};
    both.sort();
    QCOMPARE(both, (QStringList{failedWith("acme-mail is already installed"), QString(Succeeded)}));
    QCOMPARE(missing.wait(), failedWith("Package not found: no-such-package"));
    QCOMPARE(removal.wait(), failedWith("Package not found: no-such-package"));
    QCOMPARE(Outcome(applications.removePackage(QStringLiteral("acme-mail"), true)).wait(), Succeeded);
}

void ApplicationsTest::failuresOfEachPhase_data()
{
    QTest::addColumn<QString>("package");
    QTest::addColumn<bool>("install");
    QTest::addColumn<QString>("outcome");
    QTest::addColumn<QString>("warning");
    QTest::newRow("install") << "acme-broken" << true << failedWith("The disk is full")
                             << "Error installing package : "
                                "PackageKit::Transaction::ErrorPackageFailedToInstall";
    QTest::newRow("remove") << "acme-agent" << false << failedWith("The agent does not let go")
                            << "Error uninstalling package : "
                               "PackageKit::Transaction::ErrorPackageFailedToRemove";
}

void ApplicationsTest::failuresOfEachPhase()
{
    QFETCH(QString, package);
    QFETCH(bool, install);
    QFETCH(QString, outcome);
    QFETCH(QString, warning);
    Applications applications;
    const QStringList before = installed(applications);
    MessageLog log;
    ApplicationOperation *operation
        = install ? applications.installPackage(package) : applications.removePackage(package);
    QCOMPARE(Outcome(operation).wait(), outcome);
    QCOMPARE(log.takeWarnings(), QStringList(warning));
    QCOMPARE(installed(applications), before);
}

void ApplicationsTest::callsThatFail_data()
{
    QTest::addColumn<QString>("member");
    QTest::addColumn<bool>("install");
    QTest::newRow("no transaction for an install") << "CreateTransaction" << true;
    QTest::newRow("no transaction for a removal") << "CreateTransaction" << false;
    QTest::newRow("no refresh") << "RefreshCache" << true;
    QTest::newRow("no resolving for an install") << "Resolve" << true;
    QTest::newRow("no resolving for a removal") << "Resolve" << false;
    QTest::newRow("no install") << "InstallPackages" << true;
    QTest::newRow("no removal") << "RemovePackages" << false;
}

void ApplicationsTest::callsThatFail()
{
    QFETCH(QString, member);
    QFETCH(bool, install);
    Applications applications;
    const QStringList before = installed(applications);
    m_phone->failCalls(Service, QString(), member, QStringLiteral("com.example.Broken"),
                       QStringLiteral("Out of order"));
    MessageLog log;
    const QString package = install ? QStringLiteral("acme-certificates") : QStringLiteral("corvane-notes");
    ApplicationOperation *operation
        = install ? applications.installPackage(package) : applications.removePackage(package);
    const QString outcome = Outcome(operation).wait();
    QVERIFY2(outcome.startsWith(Failed), qPrintable(outcome));
    QCOMPARE(installed(applications), before);
    // Only the last phase has a reason to tell.
    const bool isLast = member.endsWith(QLatin1String("Packages"));
    QCOMPARE(outcome, isLast ? failedWith("Out of order") : Failed);
    QCOMPARE(log.takeWarnings().size(), isLast ? 1 : 0);
    m_phone->clearFaults();
    // The name is free again.
    operation = install ? applications.installPackage(QStringLiteral("no-such-package"))
                        : applications.removePackage(QStringLiteral("no-such-package"));
    QCOMPARE(Outcome(operation).wait(), failedWith("Package not found: no-such-package"));
}

namespace
{

/** What PackageKit is asked for in each phase of a request. */
void addPhases()
{
    QTest::addColumn<QString>("member");
    QTest::addColumn<bool>("install");
    QTest::newRow("refresh") << "RefreshCache" << true;
    QTest::newRow("resolving for an install") << "Resolve" << true;
    QTest::newRow("install") << "InstallPackages" << true;
    QTest::newRow("resolving for a removal") << "Resolve" << false;
    QTest::newRow("removal") << "RemovePackages" << false;
}

ApplicationOperation *request(Applications *applications, bool install)
{
    return install ? applications->installPackage(QStringLiteral("acme-certificates"))
                   : applications->removePackage(QStringLiteral("corvane-notes"));
}

constexpr uint SuccessfulExit = 1;
constexpr uint FailedExit = 2;
constexpr uint AvailableInfo = 2;
constexpr uint NoNetwork = 2;

} // namespace

void ApplicationsTest::exitsWithoutAReason_data()
{
    addPhases();
}

void ApplicationsTest::exitsWithoutAReason()
{
    QFETCH(QString, member);
    QFETCH(bool, install);
    Applications applications;
    MessageLog log;
    // Anything that is no success, also numbers that nobody knows.
    for (const uint exit : {FailedExit, 3u, 8u, 0u, 99u}) {
        takeOver(member);
        Outcome outcome(request(&applications, install));
        const QString transaction = transactionOf(member);
        QVERIFY(outcome.isPending());
        tell(transaction, "Finished", {exit, 0u});
        QCOMPARE(outcome.wait(), Failed);
        m_phone->clearFaults();
    }
    QCOMPARE(log.takeWarnings(), QStringList());
}

void ApplicationsTest::errorsOfEachPhase_data()
{
    addPhases();
}

void ApplicationsTest::errorsOfEachPhase()
{
    QFETCH(QString, member);
    QFETCH(bool, install);
    const bool isLast = member.endsWith(QLatin1String("Packages"));
    Applications applications;
    takeOver(member);
    MessageLog log;
    Outcome outcome(request(&applications, install));
    const QString transaction = transactionOf(member);
    tell(transaction, "ErrorCode", {NoNetwork, QStringLiteral("The cable is out")});
    // An error is not the end yet.
    QVERIFY(outcome.isPending());
    const QString warning = install
        ? QStringLiteral("Error installing package : PackageKit::Transaction::ErrorNoNetwork")
        : QStringLiteral("Error uninstalling package : PackageKit::Transaction::ErrorNoNetwork");
    QCOMPARE(log.takeWarnings(), isLast ? QStringList(warning) : QStringList());
    tell(transaction, "Finished", {FailedExit, 0u});
    QCOMPARE(outcome.wait(), isLast ? failedWith("The cable is out") : Failed);

    // A number that nobody knows yet.
    Outcome unknown(request(&applications, install));
    const QString next = transactionOf(member);
    tell(next, "ErrorCode", {1000000u, QStringLiteral("Something new")});
    QCOMPARE(log.takeWarnings().join(QString()).endsWith(
                 QLatin1String(": PackageKit::Transaction::Error(1000000)")),
             isLast);
    tell(next, "Finished", {FailedExit, 0u});
    QCOMPARE(unknown.wait(), isLast ? failedWith("Something new") : Failed);
}

void ApplicationsTest::transactionThatVanishes_data()
{
    addPhases();
}

void ApplicationsTest::transactionThatVanishes()
{
    QFETCH(QString, member);
    QFETCH(bool, install);
    Applications applications;
    takeOver(member);
    MessageLog log;
    Outcome outcome(request(&applications, install));
    tell(transactionOf(member), "Destroy");
    const QString end = outcome.wait();
    QVERIFY2(end.startsWith(Failed), qPrintable(end));
}

void ApplicationsTest::laterMatchReplacesAnEarlierOne()
{
    Applications applications;
    takeOver(QStringLiteral("Resolve"));
    takeOver(QStringLiteral("InstallPackages"));
    MessageLog log;
    Outcome any(applications.installPackage(QStringLiteral("acme-mail")));
    QString transaction = transactionOf(QStringLiteral("Resolve"));
    const auto report = [&](const char *id) {
        tell(transaction, "Package", {AvailableInfo, QString::fromLatin1(id), QString()});
    };
    report("acme-mail;2.0-1;noarch;first");
    report("acme-mail;1.0-1;noarch;second");
    tell(transaction, "Finished", {SuccessfulExit, 0u});
    const auto installed = [this] {
        QString call;
        waitUntil([&] {
            call = m_phone->takeJournal(Service)
                       .filter(QStringLiteral("InstallPackages"))
                       .join(QLatin1Char(' '));
            return !call.isEmpty();
        });
        return call.section(QLatin1Char('['), 1).section(QLatin1Char(']'), 0, 0);
    };
    QCOMPARE(installed(), QStringLiteral("'acme-mail;1.0-1;noarch;second'"));

    // With a version, only those of it.
    Outcome versioned(applications.installPackage(QStringLiteral("acme-agent"), QStringLiteral("2.0-1")));
    transaction = transactionOf(QStringLiteral("Resolve"));
    report("acme-agent;2.0-1;noarch;first");
    report("acme-agent;2.0-1;noarch;second");
    report("acme-agent;2.0-10;noarch;third");
    report("acme-agent");
    report("");
    tell(transaction, "Package", {1000000u, QStringLiteral("acme-agent;3.0-1;noarch;fourth"), QString()});
    tell(transaction, "Finished", {SuccessfulExit, 0u});
    QCOMPARE(installed(), QStringLiteral("'acme-agent;2.0-1;noarch;second'"));
}

void ApplicationsTest::whatComesAfterTheEndIsIgnored()
{
    Applications applications;
    takeOver(QStringLiteral("RefreshCache"));
    MessageLog log;
    Outcome outcome(applications.installPackage(QStringLiteral("acme-certificates")));
    const QString transaction = transactionOf(QStringLiteral("RefreshCache"));
    for (const char *signal : {"Finished", "Finished"})
        m_phone->sendSignal(Service, transaction, QStringLiteral("org.freedesktop.PackageKit.Transaction"),
                            QLatin1String(signal), {FailedExit, 0u});
    m_phone->sendSignal(Service, transaction, QStringLiteral("org.freedesktop.PackageKit.Transaction"),
                        QStringLiteral("ErrorCode"), {NoNetwork, QStringLiteral("Too late")});
    m_phone->settle(Service);
    QCOMPARE(outcome.wait(), Failed);
}

void ApplicationsTest::debugTexts()
{
    Applications applications;
    for (const auto &[member, install, text] : {std::tuple("RefreshCache", true, "Error refreshing cache"),
                                                std::tuple("Resolve", true, "Error resolving package"),
                                                std::tuple("Resolve", false, "Error resolving package")}) {
        m_phone->failCalls(Service, QString(), QLatin1String(member), QStringLiteral("com.example.Broken"),
                           QStringLiteral("Out of order"));
        const QByteArray expected
            = QByteArray(text) + " PackageKit::Transaction::ErrorInternalError \"Out of order\"";
        QTest::ignoreMessage(QtDebugMsg, expected.constData());
        QCOMPARE(Outcome(request(&applications, install)).wait(), Failed);
        m_phone->clearFaults();
    }
    QTest::ignoreMessage(QtDebugMsg, "Uninstalling  \"corvane-base;4.0.2-1;noarch;installed\"");
    QTest::ignoreMessage(
        QtWarningMsg, "Error uninstalling package : PackageKit::Transaction::ErrorCannotRemoveSystemPackage");
    QCOMPARE(Outcome(applications.removePackage(QStringLiteral("corvane-base"))).wait(),
             failedWith("corvane-base is essential to the phone"));
}

void ApplicationsTest::daemonThatIsNotThere()
{
    m_phone->stopService(Service);
    MessageLog log;
    {
        Applications applications;
        QCOMPARE(Outcome(applications.installPackage(QStringLiteral("acme-mail"))).wait(), Failed);
        QCOMPARE(Outcome(applications.removePackage(QStringLiteral("corvane-notes"))).wait(), Failed);
        QCOMPARE(installed(applications).size(), 5);
    }
    m_phone->startService(Service);
    Applications applications;
    QCOMPARE(Outcome(applications.installPackage(QStringLiteral("no-such-package"))).wait(),
             failedWith("Package not found: no-such-package"));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void ApplicationsTest::daemonThatGoes_data()
{
    QTest::addColumn<QString>("member");
    QTest::addColumn<bool>("install");
    QTest::newRow("before a refresh") << "CreateTransaction" << true;
    QTest::newRow("before a resolving for a removal") << "CreateTransaction" << false;
    QTest::newRow("in a refresh") << "RefreshCache" << true;
    QTest::newRow("in a resolving") << "Resolve" << true;
    QTest::newRow("in a resolving for a removal") << "Resolve" << false;
    QTest::newRow("in an install") << "InstallPackages" << true;
    QTest::newRow("in a removal") << "RemovePackages" << false;
}

void ApplicationsTest::daemonThatGoes()
{
    QFETCH(QString, member);
    QFETCH(bool, install);
    Applications applications;
    MessageLog log;
    m_phone->swallowCalls(Service, QString(), member);
    const QString package = install ? QStringLiteral("acme-certificates") : QStringLiteral("acme-agent");
    Outcome outcome(install ? applications.installPackage(package) : applications.removePackage(package));
    QStringList calls;
    QVERIFY(waitUntil([&] {
        calls += m_phone->takeJournal(Service);
        return calls.join(QLatin1Char(' ')).contains(QLatin1Char(' ') + member + QLatin1Char(' '));
    }));
    QVERIFY(outcome.isPending());
    m_phone->stopService(Service);
    const QString end = outcome.wait();
    QVERIFY2(end.startsWith(Failed), qPrintable(end));

    m_phone->clearFaults();
    m_phone->startService(Service);
    Outcome next(install ? applications.installPackage(package)
                         : applications.removePackage(QStringLiteral("no-such-package")));
    QCOMPARE(next.wait(), install ? Succeeded : failedWith("Package not found: no-such-package"));
    if (install)
        QCOMPARE(Outcome(applications.removePackage(package)).wait(), Succeeded);
}

void ApplicationsTest::destructionInEachPhase_data()
{
    QTest::addColumn<QString>("member");
    QTest::addColumn<bool>("install");
    QTest::newRow("install, at once") << QString() << true;
    QTest::newRow("removal, at once") << QString() << false;
    QTest::newRow("refresh") << "RefreshCache" << true;
    QTest::newRow("resolving") << "Resolve" << true;
    QTest::newRow("install") << "InstallPackages" << true;
    QTest::newRow("resolving for a removal") << "Resolve" << false;
    QTest::newRow("removal") << "RemovePackages" << false;
}

void ApplicationsTest::destructionInEachPhase()
{
    QFETCH(QString, member);
    QFETCH(bool, install);
    auto applications = std::make_unique<Applications>();
    MessageLog log;
    const QString package = install ? QStringLiteral("acme-broken") : QStringLiteral("acme-agent");
    ApplicationOperation *operation
        = install ? applications->installPackage(package) : applications->removePackage(package);
    Outcome outcome(operation);
    if (!member.isEmpty()) {
        QStringList calls;
        QVERIFY(waitUntil([&] {
            calls += m_phone->takeJournal(Service);
            return calls.join(QLatin1Char(' ')).contains(QLatin1Char(' ') + member + QLatin1Char(' '));
        }));
    }
    QVERIFY(outcome.isPending());
    bool finishedInTime = false;
    connect(operation, &ApplicationOperation::finished, this, [&] { finishedInTime = true; });
    applications.reset();
    QVERIFY(finishedInTime);
    QCOMPARE(
        outcome.wait(),
        Failed
            + QStringLiteral(": Applications object destroyed while operation %1 in progress").arg(package));
    // Whatever PackageKit does for it now reaches nobody.
    QVERIFY(waitUntil([this] {
        return m_phone->state()
                   .value(QLatin1String("packages"))
                   .toObject()
                   .value(QLatin1String("transactions"))
            == QJsonValue(0);
    }));
    m_phone->settle(Service);
    QCOMPARE(log.takeWarnings(), QStringList());
}

void ApplicationsTest::destructionWithSeveralPending()
{
    auto applications = std::make_unique<Applications>();
    MessageLog log;
    Outcome install(applications->installPackage(QStringLiteral("acme-broken")));
    Outcome otherInstall(applications->installPackage(QStringLiteral("no-such-package")));
    Outcome removal(applications->removePackage(QStringLiteral("acme-broken")));
    applications.reset();
    const char *broken = "Applications object destroyed while operation acme-broken in progress";
    QCOMPARE(install.wait(), failedWith(broken));
    QCOMPARE(removal.wait(), failedWith(broken));
    QCOMPARE(otherInstall.wait(),
             failedWith("Applications object destroyed while operation no-such-package in progress"));
}

void ApplicationsTest::destructionAfterARefusal()
{
    auto applications = std::make_unique<Applications>();
    MessageLog log;
    Outcome first(applications->installPackage(QStringLiteral("acme-broken")));
    Outcome refused(applications->installPackage(QStringLiteral("acme-broken")));
    applications.reset();
    QVERIFY(refused.isPending());
    QCOMPARE(refused.wait(), failedWith("Trying to install package which is already being installed"));
    QCOMPARE(first.wait(),
             failedWith("Applications object destroyed while operation acme-broken in progress"));
}

void ApplicationsTest::destructionAfterADeletedOperation()
{
    auto applications = std::make_unique<Applications>();
    MessageLog log;
    delete applications->installPackage(QStringLiteral("acme-broken"));
    Outcome removal(applications->removePackage(QStringLiteral("acme-broken")));
    delete applications->removePackage(QStringLiteral("no-such-package"));
    applications.reset();
    QCOMPARE(removal.wait(),
             failedWith("Applications object destroyed while operation acme-broken in progress"));
    QCOMPARE(log.takeWarnings(), QStringList());
}

void ApplicationsTest::requestsDuringDestruction()
{
    auto applications = std::make_unique<Applications>();
    MessageLog log;
    ApplicationOperation *first = applications->installPackage(QStringLiteral("acme-broken"));
    Applications *dying = applications.get();
    std::unique_ptr<Outcome> install;
    std::unique_ptr<Outcome> removal;
    connect(first, &ApplicationOperation::failed, this, [&] {
        install = std::make_unique<Outcome>(dying->installPackage(QStringLiteral("acme-broken")));
        removal = std::make_unique<Outcome>(dying->removePackage(QStringLiteral("acme-agent")));
    });
    applications.reset();
    QVERIFY(install && removal);
    QCOMPARE(install->wait(),
             failedWith("Applications object destroyed while operation acme-broken in progress"));
    QCOMPARE(removal->wait(),
             failedWith("Applications object destroyed while operation acme-agent in progress"));
}

void ApplicationsTest::deletedOperation_data()
{
    QTest::addColumn<QString>("member");
    QTest::addColumn<bool>("install");
    QTest::newRow("at once") << QString() << true;
    QTest::newRow("refresh") << "RefreshCache" << true;
    QTest::newRow("resolving") << "Resolve" << true;
    QTest::newRow("install") << "InstallPackages" << true;
    QTest::newRow("removal") << "RemovePackages" << false;
}

void ApplicationsTest::deletedOperation()
{
    QFETCH(QString, member);
    QFETCH(bool, install);
    Applications applications;
    const QString package = install ? QStringLiteral("acme-broken") : QStringLiteral("acme-agent");
    ApplicationOperation *operation
        = install ? applications.installPackage(package) : applications.removePackage(package);
    MessageLog log;
    if (!member.isEmpty()) {
        QStringList calls;
        QVERIFY(waitUntil([&] {
            calls += m_phone->takeJournal(Service);
            return calls.join(QLatin1Char(' ')).contains(QLatin1Char(' ') + member + QLatin1Char(' '));
        }));
    }
    delete operation;
    // Once PackageKit is through with it, the name can be used again.
    QString outcome;
    QVERIFY(waitUntil([&] {
        outcome
            = Outcome(install ? applications.installPackage(package) : applications.removePackage(package))
                  .wait();
        return !outcome.contains(QLatin1String("Trying to"));
    }));
    QCOMPARE(outcome, install ? failedWith("The disk is full") : failedWith("The agent does not let go"));
}

void ApplicationsTest::deletionInASlot_data()
{
    QTest::addColumn<bool>("succeeds");
    QTest::addColumn<bool>("inFinished");
    QTest::newRow("failed") << false << false;
    QTest::newRow("finished, failed") << false << true;
    QTest::newRow("succeeded") << true << false;
    QTest::newRow("finished, succeeded") << true << true;
}

void ApplicationsTest::deletionInASlot()
{
    QFETCH(bool, succeeds);
    QFETCH(bool, inFinished);
    auto applications = std::make_unique<Applications>();
    const QString package
        = succeeds ? QStringLiteral("acme-certificates") : QStringLiteral("no-such-package");
    ApplicationOperation *operation = applications->installPackage(package);
    const auto signal = inFinished ? &ApplicationOperation::finished
        : succeeds                 ? &ApplicationOperation::succeeded
                                   : &ApplicationOperation::failed;
    connect(operation, signal, this, [&] { applications.reset(); });
    Outcome outcome(operation);
    QCOMPARE(outcome.wait(), succeeds ? Succeeded : failedWith("Package not found: no-such-package"));
    QVERIFY(!applications);
    if (succeeds) {
        Applications others;
        QCOMPARE(Outcome(others.removePackage(package)).wait(), Succeeded);
    }
}

void ApplicationsTest::worksThroughTheMetaObject()
{
    Applications applications;
    const QPointer<ApplicationOperation> operation
        = applications.installPackage(QStringLiteral("no-such-package"));
    const QSignalSpy failed(operation, SIGNAL(failed(ApplicationOperation *)));
    QVERIFY(failed.isValid());
    QString queued;
    connect(
        operation, &ApplicationOperation::finished, operation,
        [&queued](ApplicationOperation *finished) { queued = finished->errorString(); },
        Qt::QueuedConnection);
    QVERIFY(waitUntil([&queued] { return !queued.isEmpty(); }));
    QCOMPARE(failed.size(), 1);
    QCOMPARE(queued, QStringLiteral("Package not found: no-such-package"));
    // It may be gone already; then there is nothing left to be sent.
    if (operation)
        QCoreApplication::sendPostedEvents(operation, QEvent::DeferredDelete);
    QVERIFY(!operation);
}

QTEST_GUILESS_MAIN(ApplicationsTest)
#include "applications_test.moc"
