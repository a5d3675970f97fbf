// SPDX-License-Identifier: LGPL-2.1-or-later
#include "packagetransaction.h"

#include <unistd.h>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String interfaceName("org.freedesktop.PackageKit.Transaction");
const QLatin1String propertiesInterface("org.freedesktop.DBus.Properties");

constexpr guint32 installedInfo = 1;
constexpr guint32 availableInfo = 2;

MethodError refused(const QString &message)
{
    return MethodError(interfaceName + QStringLiteral(".RefusedByPolicy"), message);
}

MethodError invalidState(const QString &message)
{
    return MethodError(interfaceName + QStringLiteral(".InvalidState"), message);
}

} // namespace

PackageTransaction::PackageTransaction(Service &service, const QString &path, const QString &client)
    : m_service(service)
    , m_path(path)
    , m_client(client)
    , m_created(g_get_monotonic_time())
{
}

PropertyReaders PackageTransaction::properties() const
{
    const auto number = [](const guint32 &value) {
        return [&value] {
            return g_variant_new_uint32(value);
        };
    };
    const auto noNumber = [] {
        return g_variant_new_uint32(0);
    };
    return {
        {QStringLiteral("Role"), number(m_role)},
        {QStringLiteral("Status"), number(m_status)},
        {QStringLiteral("LastPackage"),
         [] {
             return g_variant_new_string("");
         }},
        {QStringLiteral("Uid"),
         [] {
             return g_variant_new_uint32(getuid());
         }},
        {QStringLiteral("Percentage"), number(m_percentage)},
        {QStringLiteral("AllowCancel"),
         [this] {
             return g_variant_new_boolean(m_cancellable);
         }},
        {QStringLiteral("CallerActive"),
         [] {
             return g_variant_new_boolean(TRUE);
         }},
        {QStringLiteral("ElapsedTime"),
         [this] {
             return g_variant_new_uint32(guint32((g_get_monotonic_time() - m_created) / G_USEC_PER_SEC));
         }},
        {QStringLiteral("RemainingTime"), noNumber},
        {QStringLiteral("Speed"), noNumber},
        {QStringLiteral("DownloadSizeRemaining"),
         [] {
             return g_variant_new_uint64(0);
         }},
        {QStringLiteral("TransactionFlags"),
         [this] {
             return g_variant_new_uint64(m_flags);
         }},
    };
}

void PackageTransaction::offer(MethodHandlers handlers)
{
    m_service.addObject(m_path, interfaceName, std::move(handlers), properties());
}

void PackageTransaction::withdraw()
{
    emitSignal("Destroy");
    m_service.removeObject(m_path, interfaceName);
}

void PackageTransaction::checkClient(const QString &client) const
{
    if (client != m_client)
        throw refused(QStringLiteral("The transaction belongs to another client"));
}

void PackageTransaction::use(const QString &client)
{
    checkClient(client);
    if (m_used)
        throw invalidState(QStringLiteral("The transaction has been used already"));
    m_used = true;
}

void PackageTransaction::setHints(const QString &client, const QStringList &hints)
{
    checkClient(client);
    m_pluralSignals = hints.contains(QLatin1String("supports-plural-signals=true"));
}

void PackageTransaction::checkCancellable(const QString &client) const
{
    checkClient(client);
    if (!isBegun() || !isCancellable())
        throw invalidState(QStringLiteral("The transaction cannot be cancelled now"));
}

void PackageTransaction::begin(quint32 role, quint64 flags)
{
    m_role = role;
    m_flags = flags;
    tellProperty("Role", g_variant_new_uint32(role));
}

void PackageTransaction::setStatus(Status status)
{
    m_status = status;
    tellProperty("Status", g_variant_new_uint32(status));
}

void PackageTransaction::setPercentage(guint32 percentage)
{
    m_percentage = percentage;
    tellProperty("Percentage", g_variant_new_uint32(percentage));
}

void PackageTransaction::setCancellable(bool cancellable)
{
    m_cancellable = cancellable;
    tellProperty("AllowCancel", g_variant_new_boolean(cancellable));
}

void PackageTransaction::tellPackages(const std::vector<PackageStore::Found> &packages) const
{
    GVariantBuilder all;
    g_variant_builder_init(&all, G_VARIANT_TYPE("a(uss)"));
    for (const PackageStore::Found &package : packages) {
        GVariant *told = g_variant_new("(uss)", package.installed ? installedInfo : availableInfo,
                                       package.id.toUtf8().constData(), package.summary.toUtf8().constData());
        if (m_pluralSignals)
            g_variant_builder_add_value(&all, told);
        else
            emitSignal("Package", told);
    }
    const Variant list(g_variant_new("(a(uss))", &all));
    if (m_pluralSignals && !packages.empty())
        emitSignal("Packages", g_variant_ref(list.get()));
}

void PackageTransaction::tellError(PackageError::Code code, const QString &details) const
{
    emitSignal("ErrorCode", g_variant_new("(us)", guint32(code), details.toUtf8().constData()));
}

void PackageTransaction::finish(Exit exit)
{
    m_timer.stop();
    setStatus(FinishedStatus);
    constexpr gint64 microsecondsPerMillisecond = 1000;
    const auto runtime = guint32((g_get_monotonic_time() - m_created) / microsecondsPerMillisecond);
    emitSignal("Finished", g_variant_new("(uu)", guint32(exit), runtime));
}

void PackageTransaction::tellProperty(const char *name, GVariant *value) const
{
    GVariantBuilder changed;
    g_variant_builder_init(&changed, G_VARIANT_TYPE_VARDICT);
    g_variant_builder_add(&changed, "{sv}", name, value);
    m_service.emitSignal(m_path, propertiesInterface, QStringLiteral("PropertiesChanged"),
                         g_variant_new("(s@a{sv}@as)", interfaceName.data(), g_variant_builder_end(&changed),
                                       g_variant_new_strv(nullptr, 0)));
}

void PackageTransaction::emitSignal(const char *member, GVariant *arguments) const
{
    m_service.emitSignal(m_path, interfaceName, QLatin1String(member), arguments);
}

} // namespace Simulator
} // namespace Corvane
