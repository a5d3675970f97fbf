// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/securitysettings.h>

#include "securitysettings_p.h"

#include <QtCore/QDebug>
#include <QtCore/QFileInfo>
#include <QtDBus/QDBusError>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusVariant>

#include <glib.h>

namespace Corvane
{
namespace Mdm
{

namespace
{

const QLatin1String DeveloperPackage("tevrik-developer-mode");
const QLatin1String DeveloperProgram("/usr/bin/devel-su");

const QLatin1String ChangeSetting("ChangeSetting");
const QLatin1String SideloadingKey("/desktop/veld/devicelock/sideloading_allowed");

// The same setting as the daemon stores it.
constexpr char SettingsFile[] = "/usr/share/dapple/devicelock/devicelock_settings.conf";
constexpr char SettingsGroup[] = "desktop";
constexpr char StoredSideloadingKey[] = "veld\\devicelock\\sideloading_allowed";

/** Lets a std::unique_ptr hold what GLib frees in ways of its own. */
struct Free {
    void operator()(GKeyFile *file) const { g_key_file_free(file); }
    void operator()(GError *error) const { g_error_free(error); }
};

} // namespace

SecuritySettingsPrivate::SecuritySettingsPrivate(SecuritySettings *securitySettings)
    : q(securitySettings)
{
}

Applications *SecuritySettingsPrivate::applications()
{
    if (!m_applications)
        m_applications = std::make_unique<Applications>();
    return m_applications.get();
}

DevicelockConnection *SecuritySettingsPrivate::devicelockConnection()
{
    if (!m_devicelockConnection)
        m_devicelockConnection = std::make_unique<DevicelockConnection>();
    return m_devicelockConnection.get();
}

void SecuritySettingsPrivate::follow(ApplicationOperation *operation)
{
    connect(operation, &ApplicationOperation::finished, &m_answers,
            [this](const ApplicationOperation *finished) {
                checkPackage(finished->package(), finished->isSucceeded());
            });
}

void SecuritySettingsPrivate::checkPackage(const QString &package, bool success)
{
    if (package != DeveloperPackage)
        return;
    if (success)
        Q_EMIT q->developerModeEnabledChanged();
    else
        Q_EMIT q->developerModeChangeError();
}

SecuritySettings::SecuritySettings(QObject *parent)
    : QObject(parent)
    , d(new SecuritySettingsPrivate(this))
{
}

SecuritySettings::~SecuritySettings()
{
    delete d;
}

bool SecuritySettings::developerModeEnabled() const
{
    return QFileInfo::exists(DeveloperProgram);
}

void SecuritySettings::setDeveloperModeEnabled(bool enabled)
{
    if (developerModeEnabled() == enabled)
        return;
    Applications *applications = d->applications();
    d->follow(enabled ? applications->installPackage(DeveloperPackage)
                      : applications->removePackage(DeveloperPackage, true));
}

bool SecuritySettings::sideloadingAllowed() const
{
    const std::unique_ptr<GKeyFile, Free> file(g_key_file_new());
    g_key_file_load_from_file(file.get(), SettingsFile, G_KEY_FILE_NONE, nullptr);
    GError *failure = nullptr;
    const int value = g_key_file_get_integer(file.get(), SettingsGroup, StoredSideloadingKey, &failure);
    const std::unique_ptr<GError, Free> error(failure);
    if (error && !g_error_matches(error.get(), G_KEY_FILE_ERROR, G_KEY_FILE_ERROR_KEY_NOT_FOUND))
        qWarning() << "Unable to fetch sideloading key" << error->message;
    return value > 0;
}

bool SecuritySettings::setSideloadingAllowed(bool allowed)
{
    const QDBusMessage reply = d->devicelockConnection()->interface()->blockingCall(
        ChangeSetting, {QString(SideloadingKey), QVariant::fromValue(QDBusVariant(allowed))});
    if (reply.type() == QDBusMessage::ErrorMessage) {
        qWarning() << "Failed to change sideloading state" << QDBusError(reply);
        return false;
    }
    return true;
}

} // namespace Mdm
} // namespace Corvane
