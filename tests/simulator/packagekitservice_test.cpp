// SPDX-License-Identifier: LGPL-2.1-or-later
#include "client.h"
#include "waiting.h"

#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QJsonObject>
#include <QtCore/QProcess>
#include <QtDBus/QDBusObjectPath>
#include <QtTest/QtTest>

#include <memory>

namespace
{

const QString service = QStringLiteral("org.freedesktop.PackageKit");
const QString path = QStringLiteral("/org/freedesktop/PackageKit");
const QString interface = QStringLiteral("org.freedesktop.PackageKit");
const QString transactionInterface = QStringLiteral("org.freedesktop.PackageKit.Transaction");
const QString properties = QStringLiteral("org.freedesktop.DBus.Properties");

constexpr quint64 noFilter = 1 << 1;
constexpr quint64 installedFilter = 1 << 2;
constexpr quint64 notInstalledFilter = 1 << 3;
constexpr quint64 newestFilter = 1 << 16;
constexpr quint64 onlyTrusted = 1 << 1;
constexpr quint64 noFlag = 1 << 0;

const QString success = QStringLiteral("Finished(1)");
const QString failure = QStringLiteral("Finished(2)");
const QString cancelled = QStringLiteral("Finished(3)");

/** What the package manager of the phone says of a package; empty: it is not installed. */
QString queried(const QString &package)
{
    QProcess rpm;
    rpm.start(QStringLiteral("rpm"), {QStringLiteral("-q"), package});
    if (!rpm.waitForFinished())
        qFatal("rpm does not end");
    return rpm.exitCode() == 0 ? QString::fromUtf8(rpm.readAllStandardOutput()).trimmed() : QString();
}

QStringList ids(std::initializer_list<const char *> list)
{
    QStringList result;
    for (const char *id : list)
        result << QLatin1String(id);
    return result;
}

} // namespace

/** The simulated package manager, by messages alone. */
class PackageKitServiceTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void daemonDescribesItself();
    void resolves_data();
    void resolves();
    void packagesOneByOne();
    void listsAll();
    void refreshes();
    void installsWithWhatIsNeeded();
    void replacesAnOlderVersion();
    void refusals_data();
    void refusals();
    void unsignedPackageMayBeAllowed();
    void removesDependentsWhenAllowed();
    void autoremoveTakesWhatCameAlong();
    void changesHappenOneAfterTheOther();
    void transactionIsUsedOnce();
    void transactionBelongsToItsClient();
    void cancels();
    void clientThatLeavesCancels();
    void clientThatLeavesTooLateCancelsNothing();
    void transactionTellsItsProgress();
    void transactionVanishes();
    void stopForgetsTransactions();
    void publishesAndWithdraws();
    void stateListsPackages();

private:
    static QString create(const Client &client);
    /** Watches what tells of @p transaction. */
    void watch(const QString &transaction);
    /** Sends the request and waits for the end: what was told, but for the runtime. */
    QStringList perform(const QString &method, const QVariantList &arguments, bool plural = true);
    /** The signals after @p told until the transaction has ended, and @p told before them. */
    QStringList waitForEnd(QStringList told = {});
    QStringList install(const QStringList &packages, quint64 flags = onlyTrusted)
    {
        return perform(QStringLiteral("InstallPackages"), {flags, packages});
    }
    QStringList remove(const QStringList &packages, bool allowDependents = false, bool autoremove = false)
    {
        return perform(QStringLiteral("RemovePackages"),
                       {onlyTrusted, packages, allowDependents, autoremove});
    }
    QString act(const QString &action, const QStringList &arguments) const
    {
        return textOf(m_client->control(QStringLiteral("Act"), {action, arguments}));
    }

    std::unique_ptr<Client> m_client;
    QStringList m_seen;
};

void PackageKitServiceTest::init()
{
    m_client = std::make_unique<Client>();
    m_seen.clear();
}

void PackageKitServiceTest::cleanup()
{
    m_client.reset();
}

QString PackageKitServiceTest::create(const Client &client)
{
    const QDBusMessage reply = client.call(service, path, interface, QStringLiteral("CreateTransaction"));
    return qvariant_cast<QDBusObjectPath>(reply.arguments().value(0)).path();
}

void PackageKitServiceTest::watch(const QString &transaction)
{
    m_client->watch(service, transaction, transactionInterface,
                    ids({"Package", "Packages", "ErrorCode", "Finished"}));
}

QStringList PackageKitServiceTest::waitForEnd(QStringList told)
{
    const bool ended = waitUntil([&] {
        told += m_client->takeSignals(service);
        return !told.isEmpty() && told.last().startsWith(QLatin1String("Finished("));
    });
    if (!ended)
        return QStringList(QStringLiteral("no end"));
    // The runtime is any number.
    told.last() = told.last().section(QLatin1Char(','), 0, 0) + QLatin1Char(')');
    return told;
}

QStringList PackageKitServiceTest::perform(const QString &method, const QVariantList &arguments, bool plural)
{
    const QString transaction = create(*m_client);
    watch(transaction);
    if (plural) {
        m_client->call(service, transaction, transactionInterface, QStringLiteral("SetHints"),
                       {QStringList(QStringLiteral("supports-plural-signals=true"))});
    }
    const QString answer
        = textOf(m_client->call(service, transaction, transactionInterface, method, arguments));
    return answer == QLatin1String("reply()") ? waitForEnd() : QStringList(answer);
}

void PackageKitServiceTest::daemonDescribesItself()
{
    const auto property = [this](const char *name) {
        return textOf(m_client->call(service, path, properties, QStringLiteral("Get"),
                                     {interface, QString::fromLatin1(name)}));
    };
    QCOMPARE(property("VersionMajor"), QStringLiteral("reply(<1>)"));
    QCOMPARE(property("BackendName"), QStringLiteral("reply(<corvane>)"));
    QCOMPARE(property("Locked"), QStringLiteral("reply(<false>)"));
    const QDBusMessage all = m_client->call(service, path, properties, QStringLiteral("GetAll"), {interface});
    QCOMPARE(qdbus_cast<QVariantMap>(all.arguments().first()).size(), 13);
    QCOMPARE(textOf(m_client->call(service, path, interface, QStringLiteral("CanAuthorize"),
                                   {QStringLiteral("org.freedesktop.packagekit.package-install")})),
             QStringLiteral("reply(1)"));
    QCOMPARE(textOf(m_client->call(service, path, interface, QStringLiteral("GetTransactionList"))),
             QStringLiteral("reply([])"));
}

void PackageKitServiceTest::resolves_data()
{
    QTest::addColumn<quint64>("filter");
    QTest::addColumn<QStringList>("names");
    QTest::addColumn<QString>("found");
    const QString notes = QStringLiteral("(1, corvane-notes;1.2.0-5;noarch;installed, corvane-notes)");
    const QString newMail = QStringLiteral("(2, acme-mail;2.1.0-3;noarch;store, acme-mail)");
    const QString oldMail = QStringLiteral("(2, acme-mail;2.0.0-7;noarch;store, acme-mail)");
    QTest::newRow("installed") << noFilter << ids({"corvane-notes"}) << notes;
    QTest::newRow("all versions") << noFilter << ids({"acme-mail"})
                                  << newMail + QLatin1String(", ") + oldMail;
    QTest::newRow("newest") << newestFilter << ids({"acme-mail"}) << newMail;
    QTest::newRow("among the installed") << installedFilter << ids({"acme-mail", "corvane-notes"}) << notes;
    QTest::newRow("among the others") << notInstalledFilter << ids({"acme-mail", "corvane-notes"})
                                      << newMail + QLatin1String(", ") + oldMail;
    QTest::newRow("by identifier") << noFilter << ids({"acme-mail;2.0.0-7;noarch;store"}) << oldMail;
    QTest::newRow("nothing") << noFilter << ids({"no-such-package"}) << QString();
}

void PackageKitServiceTest::resolves()
{
    QFETCH(quint64, filter);
    QFETCH(QStringList, names);
    QFETCH(QString, found);
    QStringList expected;
    if (!found.isEmpty())
        expected << QStringLiteral("Packages([%1])").arg(found);
    QCOMPARE(perform(QStringLiteral("Resolve"), {filter, names}), expected << success);
}

void PackageKitServiceTest::packagesOneByOne()
{
    // For clients that do not know of lists.
    QCOMPARE(perform(QStringLiteral("Resolve"), {noFilter, ids({"acme-mail"})}, false),
             QStringList({QStringLiteral("Package(2, acme-mail;2.1.0-3;noarch;store, acme-mail)"),
                          QStringLiteral("Package(2, acme-mail;2.0.0-7;noarch;store, acme-mail)"), success}));
}

void PackageKitServiceTest::listsAll()
{
    const QStringList told = perform(QStringLiteral("GetPackages"), {installedFilter});
    QCOMPARE(told.size(), 2);
    QCOMPARE(told.first().count(QLatin1String("(1, ")), 5);
}

void PackageKitServiceTest::refreshes()
{
    QCOMPARE(perform(QStringLiteral("RefreshCache"), {true}), QStringList(success));
}

void PackageKitServiceTest::installsWithWhatIsNeeded()
{
    QCOMPARE(install(ids({"acme-mail;2.1.0-3;noarch;store"})), QStringList(success));
    QCOMPARE(queried(QStringLiteral("acme-mail")), QStringLiteral("acme-mail-2.1.0-3.noarch"));
    QCOMPARE(queried(QStringLiteral("acme-certificates")),
             QStringLiteral("acme-certificates-2026.1-1.noarch"));
    QVERIFY(QFile::exists(QStringLiteral("/usr/share/applications/acme-mail.desktop")));
    QVERIFY(QFile::exists(QStringLiteral("/usr/share/icons/hicolor/128x128/apps/acme-mail.png")));

    QCOMPARE(remove(ids({"acme-certificates;2026.1-1;noarch;installed"})),
             QStringList({QStringLiteral("ErrorCode(13, acme-mail needs acme-certificates)"), failure}));
    QCOMPARE(
        remove(ids({"acme-mail;2.1.0-3;noarch;installed", "acme-certificates;2026.1-1;noarch;installed"})),
        QStringList(success));
    QCOMPARE(queried(QStringLiteral("acme-mail")), QString());
    QVERIFY(!QFile::exists(QStringLiteral("/usr/share/applications/acme-mail.desktop")));
}

void PackageKitServiceTest::replacesAnOlderVersion()
{
    QCOMPARE(install(ids({"acme-mail;2.0.0-7;noarch;store"})), QStringList(success));
    QCOMPARE(install(ids({"acme-mail;2.1.0-3;noarch;store"})), QStringList(success));
    QCOMPARE(queried(QStringLiteral("acme-mail")), QStringLiteral("acme-mail-2.1.0-3.noarch"));
    QCOMPARE(install(ids({"acme-mail;2.0.0-7;noarch;store"})),
             QStringList({QStringLiteral("ErrorCode(9, A newer version of acme-mail is already installed)"),
                          failure}));
    QCOMPARE(install(ids({"acme-mail;2.1.0-3;noarch;store"})),
             QStringList({QStringLiteral("ErrorCode(9, acme-mail is already installed)"), failure}));
    QCOMPARE(remove(ids({"acme-mail;2.1.0-3;noarch;installed"}), false, true), QStringList(success));
}

void PackageKitServiceTest::refusals_data()
{
    QTest::addColumn<bool>("installing");
    QTest::addColumn<QString>("package");
    QTest::addColumn<QString>("error");
    QTest::newRow("no identifier") << true << "acme-mail"
                                   << "6, The package id 'acme-mail' is not valid";
    QTest::newRow("unknown") << true << "a;1-1;noarch;store"
                             << "8, The package 'a;1-1;noarch;store' is in no source";
    QTest::newRow("unsigned") << true << "acme-untrusted;0.1-1;noarch;store"
                              << "50, acme-untrusted is not signed";
    QTest::newRow("fails") << true << "acme-broken;1.0-1;noarch;store"
                           << "58, The disk is full";
    QTest::newRow("not installed") << false << "a;1-1;noarch;installed"
                                   << "7, The package 'a;1-1;noarch;installed' is not installed";
    QTest::newRow("another version")
        << false << "corvane-notes;1.0-1;noarch;installed"
        << "7, The package 'corvane-notes;1.0-1;noarch;installed' is not installed";
    QTest::newRow("essential") << false << "corvane-base;4.0.2-1;noarch;installed"
                               << "20, corvane-base is essential to the phone";
    QTest::newRow("needed") << false << "corvane-library;1.0-1;noarch;installed"
                            << "13, corvane-notes needs corvane-library";
    QTest::newRow("does not go") << false << "acme-agent;1.1.0-1;noarch;installed"
                                 << "59, The agent does not let go";
}

void PackageKitServiceTest::refusals()
{
    QFETCH(bool, installing);
    QFETCH(QString, package);
    QFETCH(QString, error);
    QCOMPARE(installing ? install({package}) : remove({package}),
             QStringList({QStringLiteral("ErrorCode(%1)").arg(error), failure}));
}

void PackageKitServiceTest::unsignedPackageMayBeAllowed()
{
    QCOMPARE(install(ids({"acme-untrusted;0.2-1;noarch;store"}), noFlag), QStringList(success));
    QCOMPARE(remove(ids({"acme-untrusted;0.2-1;noarch;installed"})), QStringList(success));
}

void PackageKitServiceTest::removesDependentsWhenAllowed()
{
    QCOMPARE(install(ids({"acme-mail;2.1.0-3;noarch;store"})), QStringList(success));
    QCOMPARE(remove(ids({"acme-certificates;2026.1-1;noarch;installed"}), true), QStringList(success));
    QCOMPARE(queried(QStringLiteral("acme-mail")), QString());
}

void PackageKitServiceTest::autoremoveTakesWhatCameAlong()
{
    QCOMPARE(install(ids({"acme-mail;2.1.0-3;noarch;store"})), QStringList(success));
    QCOMPARE(remove(ids({"acme-mail;2.1.0-3;noarch;installed"}), false, true), QStringList(success));
    QCOMPARE(queried(QStringLiteral("acme-certificates")), QString());
    // What was asked for by itself stays.
    QCOMPARE(install(ids({"acme-certificates;2026.1-1;noarch;store"})), QStringList(success));
    QCOMPARE(install(ids({"acme-mail;2.1.0-3;noarch;store"})), QStringList(success));
    QCOMPARE(remove(ids({"acme-mail;2.1.0-3;noarch;installed"}), false, true), QStringList(success));
    QVERIFY(!queried(QStringLiteral("acme-certificates")).isEmpty());
    QCOMPARE(remove(ids({"acme-certificates;2026.1-1;noarch;installed"})), QStringList(success));
}

void PackageKitServiceTest::changesHappenOneAfterTheOther()
{
    const QStringList transactions{create(*m_client), create(*m_client)};
    for (const QString &transaction : transactions)
        watch(transaction);
    m_client->watch(service, path, interface, ids({"TransactionListChanged"}));
    const auto send = [&](int index, const QString &package) {
        m_client->send(service, transactions.at(index), transactionInterface,
                       QStringLiteral("InstallPackages"), {onlyTrusted, QStringList(package)});
    };
    send(0, QStringLiteral("acme-broken;1.0-1;noarch;store"));
    send(1, QStringLiteral("acme-untrusted;0.1-1;noarch;store"));
    QVERIFY(m_client->waitForSignals(8));
    QStringList told = m_client->takeSignals(service);
    for (QString &signal : told) {
        if (signal.startsWith(QLatin1String("Finished")))
            signal = signal.section(QLatin1Char(','), 0, 0) + QLatin1Char(')');
    }
    const QString list = QStringLiteral("TransactionListChanged([%1])");
    QCOMPARE(told,
             QStringList({list.arg(transactions.first()), list.arg(transactions.join(QLatin1String(", "))),
                          QStringLiteral("ErrorCode(58, The disk is full)"), failure,
                          list.arg(transactions.last()),
                          QStringLiteral("ErrorCode(50, acme-untrusted is not signed)"), failure,
                          list.arg(QString())}));
}

void PackageKitServiceTest::transactionIsUsedOnce()
{
    const QString transaction = create(*m_client);
    const QVariantList arguments{noFilter, ids({"acme-mail"})};
    QCOMPARE(textOf(m_client->call(service, transaction, transactionInterface, QStringLiteral("Resolve"),
                                   arguments)),
             QStringLiteral("reply()"));
    QCOMPARE(
        textOf(
            m_client->call(service, transaction, transactionInterface, QStringLiteral("Resolve"), arguments)),
        QStringLiteral("org.freedesktop.PackageKit.Transaction.InvalidState: The transaction has been used "
                       "already"));
}

void PackageKitServiceTest::transactionBelongsToItsClient()
{
    const QString transaction = create(*m_client);
    const Client other(Client::Own);
    for (const char *member : {"SetHints", "RefreshCache", "Cancel"}) {
        QVariantList arguments;
        if (qstrcmp(member, "SetHints") == 0)
            arguments << QStringList();
        else if (qstrcmp(member, "RefreshCache") == 0)
            arguments << false;
        QCOMPARE(
            textOf(other.call(service, transaction, transactionInterface, QLatin1String(member), arguments)),
            QStringLiteral("org.freedesktop.PackageKit.Transaction.RefusedByPolicy: The transaction belongs "
                           "to another client"));
    }
}

void PackageKitServiceTest::cancels()
{
    const auto cancel = [this](const QString &transaction) {
        return textOf(m_client->call(service, transaction, transactionInterface, QStringLiteral("Cancel")));
    };
    const QString transaction = create(*m_client);
    watch(transaction);
    const QString notNow = QStringLiteral(
        "org.freedesktop.PackageKit.Transaction.InvalidState: The transaction cannot be cancelled now");
    QCOMPARE(cancel(transaction), notNow);
    m_client->send(service, transaction, transactionInterface, QStringLiteral("InstallPackages"),
                   {onlyTrusted, ids({"acme-certificates;2026.1-1;noarch;store"})});
    QCOMPARE(cancel(transaction), QStringLiteral("reply()"));
    QCOMPARE(waitForEnd(),
             QStringList({QStringLiteral("ErrorCode(17, The transaction was cancelled)"), cancelled}));
    QCOMPARE(cancel(transaction), notNow);
    QCOMPARE(queried(QStringLiteral("acme-certificates")), QString());
    // The database is free for others.
    QCOMPARE(perform(QStringLiteral("RefreshCache"), {false}), QStringList(success));
}

void PackageKitServiceTest::clientThatLeavesCancels()
{
    auto leaving = std::make_unique<Client>(Client::Own);
    const QString transaction = create(*leaving);
    watch(transaction);
    leaving->call(service, transaction, transactionInterface, QStringLiteral("InstallPackages"),
                  {onlyTrusted, ids({"acme-certificates;2026.1-1;noarch;store"})});
    leaving.reset();
    QCOMPARE(waitForEnd(), QStringList(cancelled));
    QCOMPARE(queried(QStringLiteral("acme-certificates")), QString());
}

void PackageKitServiceTest::clientThatLeavesTooLateCancelsNothing()
{
    auto leaving = std::make_unique<Client>(Client::Own);
    const QString transaction = create(*leaving);
    watch(transaction);
    m_client->watch(service, transaction, properties, ids({"PropertiesChanged"}));
    leaving->call(service, transaction, transactionInterface, QStringLiteral("InstallPackages"),
                  {onlyTrusted, ids({"acme-certificates;2026.1-1;noarch;store"})});
    QStringList told;
    QVERIFY(waitUntil([&] {
        told += m_client->takeSignals(service);
        return told.join(QLatin1Char(' ')).contains(QLatin1String("AllowCancel=<false>"));
    }));
    // The database is being written.
    leaving.reset();
    told = waitForEnd(told);
    QCOMPARE(told.filter(QStringLiteral("Finished")), QStringList(success));
    QVERIFY(!queried(QStringLiteral("acme-certificates")).isEmpty());
    // The next one's turn comes.
    QCOMPARE(remove(ids({"acme-certificates;2026.1-1;noarch;installed"})), QStringList(success));
}

void PackageKitServiceTest::transactionTellsItsProgress()
{
    const QString transaction = create(*m_client);
    watch(transaction);
    m_client->watch(service, transaction, properties, ids({"PropertiesChanged"}));
    m_client->call(service, transaction, transactionInterface, QStringLiteral("InstallPackages"),
                   {onlyTrusted, ids({"acme-certificates;2026.1-1;noarch;store"})});
    QString told = waitForEnd().join(QLatin1Char(' '));
    told.remove(QStringLiteral("org.freedesktop.PackageKit.Transaction, ")).remove(QStringLiteral(", []"));
    QCOMPARE(told,
             QStringLiteral("PropertiesChanged({Role=<11>}) PropertiesChanged({Status=<1>}) "
                            "PropertiesChanged({Status=<9>}) PropertiesChanged({Percentage=<25>}) "
                            "PropertiesChanged({Percentage=<50>}) PropertiesChanged({Percentage=<75>}) "
                            "PropertiesChanged({Percentage=<100>}) PropertiesChanged({AllowCancel=<false>}) "
                            "PropertiesChanged({Status=<18>}) Finished(1)"));
    const auto property = [&](const char *name) {
        return textOf(m_client->call(service, transaction, properties, QStringLiteral("Get"),
                                     {transactionInterface, QString::fromLatin1(name)}));
    };
    QCOMPARE(property("Role"), QStringLiteral("reply(<11>)"));
    QCOMPARE(property("Status"), QStringLiteral("reply(<18>)"));
    QCOMPARE(property("TransactionFlags"), QStringLiteral("reply(<2>)"));
    QCOMPARE(remove(ids({"acme-certificates;2026.1-1;noarch;installed"})), QStringList(success));
}

void PackageKitServiceTest::transactionVanishes()
{
    const QString transaction = create(*m_client);
    m_client->watch(service, transaction, transactionInterface, ids({"Destroy"}));
    m_client->call(service, transaction, transactionInterface, QStringLiteral("RefreshCache"), {false});
    QVERIFY(m_client->waitForSignals(1));
    QVERIFY(textOf(m_client->call(service, transaction, transactionInterface, QStringLiteral("Cancel")))
                .startsWith(QLatin1String("org.freedesktop.DBus.Error.Unknown")));
}

void PackageKitServiceTest::stopForgetsTransactions()
{
    const QString transaction = create(*m_client);
    m_client->call(service, transaction, transactionInterface, QStringLiteral("InstallPackages"),
                   {onlyTrusted, ids({"acme-broken;1.0-1;noarch;store"})});
    m_client->control(QStringLiteral("StopService"), {service});
    m_client->control(QStringLiteral("StartService"), {service});
    QVERIFY(textOf(m_client->call(service, transaction, transactionInterface, QStringLiteral("Cancel")))
                .startsWith(QLatin1String("org.freedesktop.DBus.Error.Unknown")));
    QCOMPARE(perform(QStringLiteral("RefreshCache"), {false}), QStringList(success));
}

void PackageKitServiceTest::publishesAndWithdraws()
{
    m_client->watch(service, path, interface, ids({"UpdatesChanged"}));
    QCOMPARE(act(QStringLiteral("package publish"), ids({"corvane-notes", "1.3.0-2"})),
             QStringLiteral("reply(corvane-notes 1.3.0-2 can be installed)"));
    QCOMPARE(m_client->takeSignals(service), QStringList(QStringLiteral("UpdatesChanged()")));
    QCOMPARE(install(ids({"corvane-notes;1.3.0-2;noarch;store"})), QStringList(success));
    QCOMPARE(queried(QStringLiteral("corvane-notes")), QStringLiteral("corvane-notes-1.3.0-2.noarch"));
    QCOMPARE(act(QStringLiteral("package withdraw"), ids({"corvane-notes"})),
             QStringLiteral("reply(corvane-notes is withdrawn)"));
    QVERIFY(act(QStringLiteral("package withdraw"), ids({"corvane-notes"}))
                .endsWith(QLatin1String("The sources have no package \"corvane-notes\"")));
    QVERIFY(act(QStringLiteral("package publish"), ids({"corvane-notes", "newest"}))
                .endsWith(QLatin1String("\"newest\" is no version; one is 1.2.0 or 1.2.0-3")));
}

void PackageKitServiceTest::stateListsPackages()
{
    const QJsonObject state
        = QJsonDocument::fromJson(
              m_client->control(QStringLiteral("State")).arguments().first().toString().toUtf8())
              .object()
              .value(QLatin1String("packages"))
              .toObject();
    QCOMPARE(state.value(QLatin1String("installed")).toArray().first().toObject(),
             QJsonObject({{QStringLiteral("name"), QStringLiteral("corvane-base")},
                          {QStringLiteral("version"), QStringLiteral("4.0.2-1")},
                          {QStringLiteral("vendor"), QStringLiteral("Corvane")}}));
    QCOMPARE(state.value(QLatin1String("available")).toArray().size(), 6);
    QCOMPARE(state.value(QLatin1String("transactions")), QJsonValue(0));
}

QTEST_GUILESS_MAIN(PackageKitServiceTest)
#include "packagekitservice_test.moc"
