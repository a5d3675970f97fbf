// SPDX-License-Identifier: LGPL-2.1-or-later
#include "component.h"
#include "hardware.h"
#include "mdmproxy.h"
#include "refusal.h"
#include "service.h"
#include "timer.h"

#include <QtCore/QJsonArray>
#include <QtCore/QRegularExpression>
#include <QtCore/QSet>
#include <QtCore/QVersionNumber>

#include <algorithm>
#include <map>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String objectPath("/Corvane/Mdm/Proxy/SoftwareUpdate");
const QLatin1String interfaceName("org.corvaneos.mdmproxy.softwareupdate");

const QLatin1String infoChanged("softwareUpdateInfoChanged");
const QLatin1String updateFailed("softwareUpdateFailed");

constexpr int progressStep = 10;
constexpr int defaultSize = 100; // MiB

/** Versions that differ only in trailing zeros or spelling are the same one. */
QVersionNumber numberOf(const QString &version)
{
    return QVersionNumber::fromString(version).normalized();
}

struct Update {
    QString version;
    int size;
    QString downloadFails; ///< the reason; empty when it succeeds
    QString installFails;
};

Update updateFrom(const QJsonObject &object)
{
    return {object.value(QLatin1String("version")).toString(),
            object.value(QLatin1String("size")).toInt(defaultSize),
            object.value(QLatin1String("downloadFails")).toString(),
            object.value(QLatin1String("installFails")).toString()};
}

class SoftwareUpdate : public Component
{
public:
    explicit SoftwareUpdate(const QJsonObject &profile);

    void attach(Service &service) override;
    void detach() override;
    void describe(QJsonObject &state) const override;
    std::vector<Action> actions() override;

private:
    enum class Operation { None, Checking, Downloading, Installing };

    void registerClient(const QString &client);
    void unregisterClient(const QString &client);
    void tellClients(const QString &signal, GVariant *arguments = nullptr) const;
    void tellFailure(const QString &reason) const;

    bool refusedAsBusy() const;
    void check();
    void finishCheck();
    void download(const QString &version);
    void makeProgress(int percent);
    void install();
    void finishInstallation();

    QString latest() const;
    const Update *inCatalogue(const QString &version) const;
    QString publish(const QStringList &arguments);
    QString withdraw(const QString &version);

    // what the phone stores
    QString m_installed;
    std::vector<Update> m_catalogue;
    QStringList m_found; ///< the versions above the installed one that the phone knows of
    QString m_downloaded;
    const QString m_checkFails;
    const int m_checkMilliseconds;
    const int m_downloadMilliseconds;
    const int m_installMilliseconds;

    // what the proxy keeps while it runs
    Service *m_service = nullptr;
    std::map<QString, int> m_clients; ///< how often each has registered
    Operation m_operation = Operation::None;
    Update m_update; ///< that is being downloaded or installed
    int m_percent = 0;
    Timer m_timer;
};

SoftwareUpdate::SoftwareUpdate(const QJsonObject &profile)
    : m_installed(profile.value(QLatin1String("installed")).toString())
    , m_checkFails(profile.value(QLatin1String("checkFails")).toString())
    , m_checkMilliseconds(profile.value(QLatin1String("checkMilliseconds")).toInt())
    , m_downloadMilliseconds(profile.value(QLatin1String("downloadMilliseconds")).toInt())
    , m_installMilliseconds(profile.value(QLatin1String("installMilliseconds")).toInt())
{
    const QJsonArray catalogue = profile.value(QLatin1String("catalogue")).toArray();
    for (const QJsonValue &update : catalogue)
        m_catalogue.push_back(updateFrom(update.toObject()));
}

void SoftwareUpdate::attach(Service &service)
{
    m_service = &service;
    service.watchClients([this](const QString &client) { m_clients.erase(client); });
    service.addObject(objectPath, interfaceName,
                      {
                          {QStringLiteral("registerClient"),
                           [this](MethodCall &call) {
                               registerClient(call.sender());
                               call.reply();
                           }},
                          {QStringLiteral("unregisterClient"),
                           [this](MethodCall &call) {
                               unregisterClient(call.sender());
                               call.reply();
                           }},
                          {QStringLiteral("latestAvailableUpdateVersion"),
                           [this](MethodCall &call) {
                               call.reply(g_variant_new("(s)", latest().toUtf8().constData()));
                           }},
                          {QStringLiteral("softwareUpdateIsAvailable"),
                           [this](MethodCall &call) {
                               call.reply(g_variant_new("(b)", gboolean(!m_found.isEmpty())));
                           }},
                          {QStringLiteral("checkForSoftwareUpdate"),
                           [this](MethodCall &call) {
                               call.reply();
                               check();
                           }},
                          {QStringLiteral("downloadSoftwareUpdate"),
                           [this](MethodCall &call) {
                               const QString version = call.text(0);
                               call.reply();
                               download(version);
                           }},
                          {QStringLiteral("installSoftwareUpdate"),
                           [this](MethodCall &call) {
                               call.reply();
                               install();
                           }},
                      });
}

void SoftwareUpdate::detach()
{
    m_service = nullptr;
    m_clients.clear();
    m_operation = Operation::None;
    m_timer.stop();
}

void SoftwareUpdate::registerClient(const QString &client)
{
    ++m_clients[client];
}

void SoftwareUpdate::unregisterClient(const QString &client)
{
    const auto found = m_clients.find(client);
    if (found != m_clients.end() && --found->second == 0)
        m_clients.erase(found);
}

void SoftwareUpdate::tellClients(const QString &signal, GVariant *arguments) const
{
    const Variant values(arguments);
    // Each emission uses up a reference.
    for (const auto &[client, times] : m_clients)
        m_service->emitSignal(objectPath, interfaceName, signal,
                              values ? g_variant_ref(values.get()) : nullptr, client);
}

void SoftwareUpdate::tellFailure(const QString &reason) const
{
    tellClients(updateFailed, g_variant_new("(s)", reason.toUtf8().constData()));
}

bool SoftwareUpdate::refusedAsBusy() const
{
    if (m_operation == Operation::None)
        return false;
    tellFailure(QStringLiteral("Another operation is running"));
    return true;
}

void SoftwareUpdate::check()
{
    if (refusedAsBusy())
        return;
    m_operation = Operation::Checking;
    m_timer.start(guint(m_checkMilliseconds), [this] { finishCheck(); });
}

void SoftwareUpdate::finishCheck()
{
    m_operation = Operation::None;
    if (!m_checkFails.isEmpty()) {
        tellFailure(m_checkFails);
        return;
    }
    m_found.clear();
    for (const Update &update : m_catalogue) {
        if (numberOf(update.version) > numberOf(m_installed))
            m_found << update.version;
    }
    tellClients(infoChanged);
}

void SoftwareUpdate::download(const QString &version)
{
    const Update *update = m_found.contains(version) ? inCatalogue(version) : nullptr;
    if (!update) {
        tellFailure(QStringLiteral("Version %1 is not available").arg(version));
        return;
    }
    if (refusedAsBusy())
        return;
    m_operation = Operation::Downloading;
    m_update = *update;
    tellClients(QStringLiteral("softwareUpdateDownloading"),
                g_variant_new("(s)", version.toUtf8().constData()));
    makeProgress(0);
}

void SoftwareUpdate::makeProgress(int percent)
{
    m_percent = percent;
    tellClients(QStringLiteral("softwareUpdateDownloadProgress"), g_variant_new("(i)", gint32(percent)));
    if (percent >= 50 && !m_update.downloadFails.isEmpty()) {
        m_operation = Operation::None;
        tellFailure(m_update.downloadFails);
        return;
    }
    if (percent == 100) {
        m_operation = Operation::None;
        m_downloaded = m_update.version;
        tellClients(QStringLiteral("softwareUpdateDownloaded"));
        return;
    }
    m_timer.start(guint(m_downloadMilliseconds * progressStep / 100),
                  [this] { makeProgress(m_percent + progressStep); });
}

void SoftwareUpdate::install()
{
    if (refusedAsBusy())
        return;
    if (m_downloaded.isEmpty()) {
        tellFailure(QStringLiteral("No update has been downloaded"));
        return;
    }
    m_operation = Operation::Installing;
    // An update that was withdrawn after its download can still be installed.
    const Update *update = inCatalogue(m_downloaded);
    m_update = update ? *update : Update{m_downloaded, defaultSize, QString(), QString()};
    tellClients(QStringLiteral("softwareUpdateInstallationStarted"));
    m_timer.start(guint(m_installMilliseconds), [this] { finishInstallation(); });
}

void SoftwareUpdate::finishInstallation()
{
    m_operation = Operation::None;
    if (!m_update.installFails.isEmpty()) {
        tellFailure(m_update.installFails);
        return;
    }
    m_installed = m_update.version;
    setOperatingSystem(m_installed);
    m_downloaded.clear();
    m_found.erase(
        std::remove_if(m_found.begin(), m_found.end(),
                       [this](const QString &version) { return numberOf(version) <= numberOf(m_installed); }),
        m_found.end());
    tellClients(infoChanged);
}

QString SoftwareUpdate::latest() const
{
    const auto highest
        = std::max_element(m_found.begin(), m_found.end(), [](const QString &left, const QString &right) {
              return numberOf(left) < numberOf(right);
          });
    return highest == m_found.end() ? QString() : *highest;
}

const Update *SoftwareUpdate::inCatalogue(const QString &version) const
{
    const auto found = std::find_if(m_catalogue.begin(), m_catalogue.end(),
                                    [&](const Update &update) { return update.version == version; });
    return found == m_catalogue.end() ? nullptr : &*found;
}

QString SoftwareUpdate::publish(const QStringList &arguments)
{
    static const QRegularExpression dottedNumbers(QStringLiteral("\\A[0-9]+(\\.[0-9]+)*\\z"));
    const QString &version = arguments.first();
    if (!dottedNumbers.match(version).hasMatch())
        throw Refusal(QStringLiteral("\"%1\" is no version; one is 5.0.0.73").arg(version));
    if (inCatalogue(version))
        throw Refusal(QStringLiteral("Version %1 is in the catalogue already").arg(version));
    bool isSize = true;
    const int size = arguments.size() > 1 ? arguments.at(1).toInt(&isSize) : defaultSize;
    if (!isSize || size < 1)
        throw Refusal(
            QStringLiteral("\"%1\" is no size; it is a number of MiB, 1 or more").arg(arguments.at(1)));
    m_catalogue.push_back({version, size, QString(), QString()});

    if (numberOf(version) <= numberOf(m_installed))
        return QStringLiteral("%1 is published; the phone has %2 already").arg(version, m_installed);
    const QString before = latest();
    m_found << version;
    if (latest() != before)
        tellClients(infoChanged);
    return QStringLiteral("%1 is published and the phone has been told").arg(version);
}

QString SoftwareUpdate::withdraw(const QString &version)
{
    if (!inCatalogue(version)) {
        QStringList known;
        for (const Update &update : m_catalogue)
            known << update.version;
        throw Refusal(
            QStringLiteral("Version \"%1\" is not in the catalogue, which has %2")
                .arg(version, known.isEmpty() ? QStringLiteral("none") : known.join(QStringLiteral(", "))));
    }
    m_catalogue.erase(std::find_if(m_catalogue.begin(), m_catalogue.end(),
                                   [&](const Update &update) { return update.version == version; }));
    const QString before = latest();
    m_found.removeAll(version);
    if (latest() != before)
        tellClients(infoChanged);
    return QStringLiteral("%1 is withdrawn").arg(version);
}

void SoftwareUpdate::describe(QJsonObject &state) const
{
    QJsonArray catalogue;
    for (const Update &update : m_catalogue) {
        QJsonObject entry{{QStringLiteral("version"), update.version}, {QStringLiteral("size"), update.size}};
        if (!update.downloadFails.isEmpty())
            entry.insert(QStringLiteral("downloadFails"), update.downloadFails);
        if (!update.installFails.isEmpty())
            entry.insert(QStringLiteral("installFails"), update.installFails);
        catalogue << entry;
    }
    static const std::map<Operation, QString> operations{
        {Operation::None, QStringLiteral("none")},
        {Operation::Checking, QStringLiteral("checking")},
        {Operation::Downloading, QStringLiteral("downloading")},
        {Operation::Installing, QStringLiteral("installing")},
    };
    QJsonObject part{
        {QStringLiteral("installed"), m_installed},
        {QStringLiteral("catalogue"), catalogue},
        {QStringLiteral("checkMilliseconds"), m_checkMilliseconds},
        {QStringLiteral("downloadMilliseconds"), m_downloadMilliseconds},
        {QStringLiteral("installMilliseconds"), m_installMilliseconds},
        {QStringLiteral("available"), QJsonArray::fromStringList(m_found)},
        {QStringLiteral("latest"), latest()},
        {QStringLiteral("downloaded"), m_downloaded},
        {QStringLiteral("operation"), operations.at(m_operation)},
        {QStringLiteral("clients"), int(m_clients.size())},
    };
    if (!m_checkFails.isEmpty())
        part.insert(QStringLiteral("checkFails"), m_checkFails);
    state.insert(QStringLiteral("softwareUpdate"), part);
}

std::vector<Action> SoftwareUpdate::actions()
{
    return {
        {QStringLiteral("update publish"), QStringLiteral("VERSION [MIB]"),
         QStringLiteral("publishes an update, which the phone is told of at once"), 1, 2,
         [this](const QStringList &arguments) {
             return publish(arguments);
         }},
        {QStringLiteral("update withdraw"), QStringLiteral("VERSION"),
         QStringLiteral("takes an update out of the catalogue"), 1, 1,
         [this](const QStringList &arguments) {
             return withdraw(arguments.first());
         }},
    };
}

QString problemOf(const QJsonObject &profile)
{
    QSet<QString> seen;
    const QJsonArray catalogue = profile.value(QLatin1String("softwareUpdate"))
                                     .toObject()
                                     .value(QLatin1String("catalogue"))
                                     .toArray();
    for (int i = 0; i < catalogue.size(); ++i) {
        const QString version = catalogue.at(i).toObject().value(QLatin1String("version")).toString();
        if (seen.contains(version)) {
            return QStringLiteral(
                       "/softwareUpdate/catalogue/%1/version: %2 is in the catalogue already; each "
                       "version is allowed once")
                .arg(i)
                .arg(version);
        }
        seen.insert(version);
    }
    return QString();
}

const ComponentRegistration registration({
    MdmProxy::serviceName,
    [](const QJsonObject &profile, Phone &) {
        return std::make_unique<SoftwareUpdate>(profile.value(QLatin1String("softwareUpdate")).toObject());
    },
    problemOf,
});

} // namespace

} // namespace Simulator
} // namespace Corvane
