// SPDX-License-Identifier: LGPL-2.1-or-later
#include "component.h"
#include "packagestore.h"
#include "packagetransaction.h"
#include "refusal.h"
#include "sandbox.h"
#include "service.h"

#include <QtCore/QFile>
#include <QtCore/QFileInfo>
#include <QtCore/QJsonDocument>
#include <QtCore/QRegularExpression>

#include <deque>
#include <map>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String serviceName("org.freedesktop.PackageKit");
const QLatin1String objectPath("/org/freedesktop/PackageKit");
const QLatin1String interfaceName("org.freedesktop.PackageKit");

constexpr guint32 authorized = 1;
constexpr guint32 online = 2;

/** Leads the transactions of PackageKit's clients: those that change something one after the other. */
class PackageKit : public Component
{
public:
    explicit PackageKit(const QJsonObject &profile);

    void attach(Service &service) override;
    void detach() override;
    void describe(QJsonObject &state) const override;
    std::vector<Action> actions() override;

private:
    using TransactionPointer = std::shared_ptr<PackageTransaction>;

    PropertyReaders properties() const;
    QString create(const QString &client);
    MethodHandlers handlersFor(const TransactionPointer &transaction);
    void refresh(const TransactionPointer &transaction);
    void change(const TransactionPointer &transaction, quint32 role, quint64 flags,
                std::function<PackageStore::Change()> plan);
    void tellFound(const TransactionPointer &transaction, quint32 role,
                   const std::function<std::vector<PackageStore::Found>()> &look);

    /** Runs @p work once no other transaction holds the database. */
    void queue(const TransactionPointer &transaction, std::function<void()> work);
    void runNext();
    void makeProgress(const TransactionPointer &transaction, const PackageStore::Change &change);
    void finish(const TransactionPointer &transaction, PackageTransaction::Exit exit);
    void fail(const TransactionPointer &transaction, const PackageError &error);
    void forget(const QString &path);
    void tellList() const;
    QStringList unfinished() const;

    QString publish(const QStringList &arguments);
    QString withdraw(const QString &name);

    // what the phone stores
    PackageStore m_store;
    const QString m_refreshFails;
    const guint m_milliseconds;

    // what the daemon keeps while it runs
    struct Waiting {
        TransactionPointer transaction;
        std::function<void()> work;
    };
    Service *m_service = nullptr;
    std::map<QString, TransactionPointer> m_transactions; ///< by path
    std::deque<Waiting> m_queue;
    TransactionPointer m_running; ///< the one that holds the database
    quint32 m_lastNumber = 0;
};

PackageKit::PackageKit(const QJsonObject &profile)
    : m_store(profile)
    , m_refreshFails(profile.value(QLatin1String("refreshFails")).toString())
    , m_milliseconds(guint(profile.value(QLatin1String("milliseconds")).toInt()))
{
}

PropertyReaders PackageKit::properties() const
{
    const auto number = [](guint32 value) {
        return [value] {
            return g_variant_new_uint32(value);
        };
    };
    const auto bits = [](guint64 value) {
        return [value] {
            return g_variant_new_uint64(value);
        };
    };
    const auto text = [](const char *value) {
        return [value] {
            return g_variant_new_string(value);
        };
    };
    constexpr guint64 roles = 1 << PackageTransaction::GetPackages | 1 << PackageTransaction::InstallPackages
        | 1 << PackageTransaction::RefreshCache | 1 << PackageTransaction::RemovePackages
        | 1 << PackageTransaction::Resolve;
    constexpr guint64 filters = 1 << 2 | 1 << 3 | 1 << 16;
    return {
        {QStringLiteral("VersionMajor"), number(1)},
        {QStringLiteral("VersionMinor"), number(2)},
        {QStringLiteral("VersionMicro"), number(6)},
        {QStringLiteral("BackendName"), text("corvane")},
        {QStringLiteral("BackendDescription"), text("Simulated phone")},
        {QStringLiteral("BackendAuthor"), text("")},
        {QStringLiteral("Roles"), bits(roles)},
        {QStringLiteral("Groups"), bits(0)},
        {QStringLiteral("Filters"), bits(filters)},
        {QStringLiteral("MimeTypes"),
         [] {
             return g_variant_new_strv(nullptr, 0);
         }},
        {QStringLiteral("Locked"),
         [this] {
             return g_variant_new_boolean(m_running != nullptr);
         }},
        {QStringLiteral("NetworkState"), number(online)},
        {QStringLiteral("DistroId"), text("corvaneos;5;noarch")},
    };
}

void PackageKit::attach(Service &service)
{
    m_service = &service;
    service.watchClients([this](const QString &client) {
        const auto transactions = m_transactions;
        for (const auto &[path, transaction] : transactions) {
            if (transaction->client() == client && transaction->isCancellable())
                finish(transaction, PackageTransaction::Cancelled);
        }
    });
    service.addObject(objectPath, interfaceName,
                      {
                          {QStringLiteral("CanAuthorize"),
                           [](MethodCall &call) {
                               call.reply(g_variant_new("(u)", authorized));
                           }},
                          {QStringLiteral("CreateTransaction"),
                           [this](MethodCall &call) {
                               const QString path = create(call.sender());
                               call.reply(g_variant_new("(o)", path.toUtf8().constData()));
                           }},
                          {QStringLiteral("GetTransactionList"),
                           [this](MethodCall &call) {
                               GVariantBuilder list;
                               g_variant_builder_init(&list, G_VARIANT_TYPE_OBJECT_PATH_ARRAY);
                               const QStringList paths = unfinished();
                               for (const QString &path : paths)
                                   g_variant_builder_add(&list, "o", path.toUtf8().constData());
                               call.reply(g_variant_new("(ao)", &list));
                           }},
                      },
                      properties());
}

void PackageKit::detach()
{
    // What waits for its time keeps its transaction.
    for (const auto &[path, transaction] : m_transactions)
        transaction->timer().stop();
    m_service = nullptr;
    m_queue.clear();
    m_running.reset();
    m_transactions.clear();
}

QString PackageKit::create(const QString &client)
{
    const QString path = QStringLiteral("/%1_corvane").arg(++m_lastNumber);
    const auto transaction = std::make_shared<PackageTransaction>(*m_service, path, client);
    m_transactions.emplace(path, transaction);
    transaction->offer(handlersFor(transaction));
    return path;
}

MethodHandlers PackageKit::handlersFor(const TransactionPointer &transaction)
{
    // The transaction owns its handlers.
    const std::weak_ptr<PackageTransaction> weak(transaction);
    const auto once = [weak](std::function<void(const TransactionPointer &, MethodCall &)> handle) {
        return [weak, handle](MethodCall &call) {
            const TransactionPointer used = weak.lock();
            used->use(call.sender());
            handle(used, call);
        };
    };
    return {
        {QStringLiteral("SetHints"),
         [weak](MethodCall &call) {
             weak.lock()->setHints(call.sender(), call.texts(0));
             call.reply();
         }},
        {QStringLiteral("Cancel"),
         [this, weak](MethodCall &call) {
             const TransactionPointer cancelled = weak.lock();
             cancelled->checkCancellable(call.sender());
             call.reply();
             cancelled->tellError(PackageError::TransactionCancelled,
                                  QStringLiteral("The transaction was cancelled"));
             finish(cancelled, PackageTransaction::Cancelled);
         }},
        {QStringLiteral("RefreshCache"), once([this](const TransactionPointer &used, MethodCall &call) {
             call.reply();
             refresh(used);
         })},
        {QStringLiteral("GetPackages"), once([this](const TransactionPointer &used, MethodCall &call) {
             const quint64 filter = call.bits(0);
             call.reply();
             tellFound(used, PackageTransaction::GetPackages, [this, filter] { return m_store.all(filter); });
         })},
        {QStringLiteral("Resolve"), once([this](const TransactionPointer &used, MethodCall &call) {
             const quint64 filter = call.bits(0);
             const QStringList wanted = call.texts(1);
             call.reply();
             tellFound(used, PackageTransaction::Resolve,
                       [this, filter, wanted] { return m_store.find(wanted, filter); });
         })},
        {QStringLiteral("InstallPackages"), once([this](const TransactionPointer &used, MethodCall &call) {
             const quint64 flags = call.bits(0);
             const QStringList ids = call.texts(1);
             call.reply();
             change(used, PackageTransaction::InstallPackages, flags, [this, flags, ids] {
                 return m_store.installation(ids, flags & PackageTransaction::OnlyTrusted);
             });
         })},
        {QStringLiteral("RemovePackages"), once([this](const TransactionPointer &used, MethodCall &call) {
             const QStringList ids = call.texts(1);
             const bool allowDependents = call.flag(2);
             const bool autoremove = call.flag(3);
             const quint64 flags = call.bits(0);
             call.reply();
             change(used, PackageTransaction::RemovePackages, flags,
                    [this, ids, allowDependents, autoremove] {
                        return m_store.removal(ids, allowDependents, autoremove);
                    });
         })},
    };
}

void PackageKit::refresh(const TransactionPointer &transaction)
{
    transaction->begin(PackageTransaction::RefreshCache, 0);
    queue(transaction, [this, transaction] {
        transaction->setStatus(PackageTransaction::RefreshingCache);
        transaction->timer().start(m_milliseconds, [this, transaction] {
            if (m_refreshFails.isEmpty())
                finish(transaction, PackageTransaction::Success);
            else
                fail(transaction, PackageError(PackageError::NoCache, m_refreshFails));
        });
    });
}

void PackageKit::tellFound(const TransactionPointer &transaction, quint32 role,
                           const std::function<std::vector<PackageStore::Found>()> &look)
{
    transaction->begin(role, 0);
    transaction->setStatus(PackageTransaction::Querying);
    transaction->timer().start(0, [this, transaction, look] {
        transaction->tellPackages(look());
        finish(transaction, PackageTransaction::Success);
    });
}

void PackageKit::change(const TransactionPointer &transaction, quint32 role, quint64 flags,
                        std::function<PackageStore::Change()> plan)
{
    transaction->begin(role, flags);
    queue(transaction, [this, transaction, role, plan = std::move(plan)] {
        transaction->setStatus(role == PackageTransaction::InstallPackages ? PackageTransaction::Installing
                                                                           : PackageTransaction::Removing);
        try {
            makeProgress(transaction, plan());
        } catch (const PackageError &error) {
            fail(transaction, error);
        }
    });
}

void PackageKit::makeProgress(const TransactionPointer &transaction, const PackageStore::Change &change)
{
    constexpr guint32 step = 25;
    const bool removing = change.added.empty();
    transaction->setPercentage(transaction->percentage() + step);
    if (transaction->percentage() >= 2 * step && !change.fails.isEmpty()) {
        fail(transaction,
             PackageError(removing ? PackageError::FailedToRemove : PackageError::FailedToInstall,
                          change.fails));
        return;
    }
    if (transaction->percentage() < 100) {
        transaction->timer().start(m_milliseconds * step / 100,
                                   [this, transaction, change] { makeProgress(transaction, change); });
        return;
    }
    transaction->setCancellable(false);
    // The daemon may be gone when the database has been written.
    const std::weak_ptr<PackageTransaction> weak(transaction);
    m_store.make(change, [this, weak](const QString &problem) {
        const TransactionPointer made = weak.lock();
        if (!made) {
            runNext();
            return;
        }
        if (problem.isEmpty())
            finish(made, PackageTransaction::Success);
        else
            fail(made, PackageError(PackageError::TransactionError, problem));
    });
}

void PackageKit::queue(const TransactionPointer &transaction, std::function<void()> work)
{
    transaction->setStatus(PackageTransaction::WaitingForOthers);
    m_queue.push_back({transaction, std::move(work)});
    tellList();
    runNext();
}

void PackageKit::runNext()
{
    if (m_running || m_queue.empty() || m_store.isBusy())
        return;
    const Waiting next = m_queue.front();
    m_queue.pop_front();
    m_running = next.transaction;
    next.work();
}

void PackageKit::finish(const TransactionPointer &transaction, PackageTransaction::Exit exit)
{
    // Keeps what waits for nothing but its own end.
    constexpr guint keptMilliseconds = 5000;
    transaction->finish(exit);
    for (auto waiting = m_queue.begin(); waiting != m_queue.end();)
        waiting = waiting->transaction == transaction ? m_queue.erase(waiting) : waiting + 1;
    const QString path = transaction->path();
    transaction->timer().start(keptMilliseconds, [this, path] { forget(path); });
    if (m_running == transaction) {
        m_running.reset();
        tellList();
        runNext();
    }
}

void PackageKit::fail(const TransactionPointer &transaction, const PackageError &error)
{
    transaction->tellError(error.code(), error.details());
    finish(transaction, PackageTransaction::Failed);
}

void PackageKit::forget(const QString &path)
{
    const auto found = m_transactions.find(path);
    const TransactionPointer transaction = found->second;
    m_transactions.erase(found);
    transaction->withdraw();
}

QStringList PackageKit::unfinished() const
{
    QStringList paths;
    for (const auto &[path, transaction] : m_transactions) {
        if (transaction->isBegun() && !transaction->isFinished())
            paths << path;
    }
    return paths;
}

void PackageKit::tellList() const
{
    GVariantBuilder list;
    g_variant_builder_init(&list, G_VARIANT_TYPE_STRING_ARRAY);
    const QStringList paths = unfinished();
    for (const QString &path : paths)
        g_variant_builder_add(&list, "s", path.toUtf8().constData());
    m_service->emitSignal(objectPath, interfaceName, QStringLiteral("TransactionListChanged"),
                          g_variant_new("(as)", &list));
}

QString PackageKit::publish(const QStringList &arguments)
{
    static const QRegularExpression pattern(
        QStringLiteral("\\A([0-9]+(?:\\.[0-9]+)*)(?:-([0-9]+(?:\\.[0-9]+)*))?\\z"));
    const QRegularExpressionMatch version = pattern.match(arguments.at(1));
    if (!version.hasMatch())
        throw Refusal(QStringLiteral("\"%1\" is no version; one is 1.2.0 or 1.2.0-3").arg(arguments.at(1)));
    QJsonObject json{{QStringLiteral("name"), arguments.first()},
                     {QStringLiteral("version"), version.captured(1)}};
    if (!version.captured(2).isEmpty())
        json.insert(QStringLiteral("release"), version.captured(2));
    const Package package = Package::fromJson(json);
    m_store.publish(package);
    if (m_service)
        m_service->emitSignal(objectPath, interfaceName, QStringLiteral("UpdatesChanged"));
    return QStringLiteral("%1 %2 can be installed").arg(package.name, package.fullVersion());
}

QString PackageKit::withdraw(const QString &name)
{
    if (!m_store.withdraw(name))
        throw Refusal(QStringLiteral("The sources have no package \"%1\"").arg(name));
    if (m_service)
        m_service->emitSignal(objectPath, interfaceName, QStringLiteral("UpdatesChanged"));
    return QStringLiteral("%1 is withdrawn").arg(name);
}

void PackageKit::describe(QJsonObject &state) const
{
    QJsonObject part = m_store.describe();
    part.insert(QStringLiteral("transactions"), unfinished().size());
    state.insert(QStringLiteral("packages"), part);
}

std::vector<Action> PackageKit::actions()
{
    return {
        {QStringLiteral("package publish"), QStringLiteral("NAME VERSION[-RELEASE]"),
         QStringLiteral("puts a package into the sources that the phone installs from"), 2, 2,
         [this](const QStringList &arguments) {
             return publish(arguments);
         }},
        {QStringLiteral("package withdraw"), QStringLiteral("NAME"),
         QStringLiteral("takes a package out of the sources"), 1, 1,
         [this](const QStringList &arguments) {
             return withdraw(arguments.first());
         }},
    };
}

QString repeated(const QString &pointer, const QString &what)
{
    return QStringLiteral("%1: %2 is there already; each is allowed once").arg(pointer, what);
}

QString problemOf(const QJsonObject &profile)
{
    const QJsonObject part = profile.value(QLatin1String("packages")).toObject();
    const std::vector<Package> installed = packagesFrom(part.value(QLatin1String("installed")).toArray());
    QStringList names;
    for (const Package &package : installed) {
        if (names.contains(package.name))
            return repeated(QStringLiteral("/packages/installed/%1/name").arg(names.size()), package.name);
        names << package.name;
    }
    for (std::size_t index = 0; index < installed.size(); ++index) {
        for (const QString &need : installed[index].needs) {
            if (!names.contains(need))
                return QStringLiteral("/packages/installed/%1/requires: %2 is not installed")
                    .arg(index)
                    .arg(need);
        }
    }
    QStringList available;
    for (const Package &package : packagesFrom(part.value(QLatin1String("available")).toArray())) {
        const QString version = package.name + QLatin1Char(' ') + package.fullVersion();
        if (available.contains(version))
            return repeated(QStringLiteral("/packages/available/%1").arg(available.size()), version);
        available << version;
    }
    return QString();
}

QByteArray contentOf(const QString &fileName)
{
    QFile file(fileName);
    return file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray();
}

/** The database that was made of these packages when the phone was built; empty when it was made of others.
 */
QByteArray preparedDatabase(const QJsonArray &installed)
{
    const QString folder = QFileInfo(QFile::symLinkTarget(QStringLiteral("/proc/self/exe"))).path()
        + QLatin1String("/" CORVANE_DATA_FROM_PROGRAMS "/package-database/");
    const bool fits = contentOf(folder + QLatin1String("packages.json"))
        == QJsonDocument(installed).toJson(QJsonDocument::Compact);
    return fits ? contentOf(folder + QLatin1String("rpmdb.sqlite")) : QByteArray();
}

void addFiles(const QJsonObject &profile, PhoneFiles &phone)
{
    // The phone shows its own applications, and none of the machine's.
    for (const char *folder : {"/usr/share/applications", "/usr/share/icons", "/usr/share/pixmaps"})
        phone.ownFolders.push_back(folder);
    phone.files["/usr/share/icons/default/index.theme"]
        = "[Icon Theme]\nName=Default\nComment=The phone's own\nInherits=hicolor\n";
    phone.files["/usr/share/icons/hicolor/index.theme"]
        = "[Icon Theme]\nName=Hicolor\nComment=What applications "
          "bring\nDirectories=128x128/apps,scalable/apps\n\n"
          "[128x128/apps]\nSize=128\nContext=Applications\nType=Threshold\n\n"
          "[scalable/apps]\nSize=128\nMinSize=8\nMaxSize=512\nContext=Applications\nType=Scalable\n";
    phone.files["/etc/rpm/macros"] = "%_dbpath /var/lib/rpm\n";
    phone.writableFolders.push_back("/var/lib/rpm");

    const QJsonArray installed
        = profile.value(QLatin1String("packages")).toObject().value(QLatin1String("installed")).toArray();
    for (const Package &package : packagesFrom(installed)) {
        for (const auto &[path, content] : package.files)
            phone.files[path.toStdString()] = content.toStdString();
    }
    const QByteArray database = preparedDatabase(installed);
    if (!database.isEmpty())
        phone.files["/var/lib/rpm/rpmdb.sqlite"] = database.toStdString();
}

const ComponentRegistration registration({
    serviceName,
    [](const QJsonObject &profile, Phone &) {
        return std::make_unique<PackageKit>(profile.value(QLatin1String("packages")).toObject());
    },
    problemOf,
    addFiles,
});

} // namespace

} // namespace Simulator
} // namespace Corvane
