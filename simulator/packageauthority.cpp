// SPDX-License-Identifier: LGPL-2.1-or-later
#include "packageauthority.h"

#include "databaseprogram.h"

#include <stdexcept>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QString busName = QStringLiteral("org.freedesktop.PolicyKit1");
constexpr char program[] = "/usr/lib/polkit-1/polkitd";

} // namespace

PackageAuthority::PackageAuthority(const Phone &phone)
{
    fillPackageDatabase(phone.installedPackages);
    m_connection.watchNames([this](const QString &changed, const QString &) {
        if (changed == busName)
            look();
    });
}

PackageAuthority::~PackageAuthority()
{
    if (m_process)
        g_subprocess_force_exit(m_process.get());
}

std::map<std::string, std::string> PackageAuthority::prepare()
{
    // It stays when PackageKit goes.
    if (m_process)
        return {};
    ErrorSlot error;
    m_process.reset(g_subprocess_new(
        GSubprocessFlags(G_SUBPROCESS_FLAGS_STDOUT_SILENCE | G_SUBPROCESS_FLAGS_STDERR_SILENCE), &error,
        program, "--no-debug", nullptr));
    if (!m_process)
        throw std::runtime_error(std::string(error->message) + "; install Debian's package polkitd");
    return {};
}

void PackageAuthority::bringUp(std::function<void()> done)
{
    m_done = std::move(done);
    look();
}

QString PackageAuthority::missing() const
{
    return QStringLiteral("%1, which takes root, is not on the bus").arg(busName);
}

void PackageAuthority::look()
{
    if (!m_done || !m_connection.nameHasOwner(busName))
        return;
    const auto done = std::exchange(m_done, nullptr);
    done();
}

} // namespace Simulator
} // namespace Corvane
