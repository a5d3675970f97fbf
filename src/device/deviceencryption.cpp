// SPDX-License-Identifier: LGPL-2.1-or-later
#include "deviceencryption_p.h"

#include <QtCore/QLoggingCategory>

#include <libcryptsetup.h>

#include <memory>

namespace Corvane
{
namespace Mdm
{

namespace
{

constexpr char HomeDevice[] = "/dev/corvane/home";

Q_LOGGING_CATEGORY(lcEncryption, "org.corvaneos.device.encryption", QtWarningMsg)

struct Free {
    void operator()(crypt_device *device) const { crypt_free(device); }
};

void logMessage(int, const char *text, void *)
{
    qCDebug(lcEncryption, "%s", qUtf8Printable(QString::fromLocal8Bit(text).trimmed()));
}

} // namespace

bool DeviceEncryption::isHomeEncrypted()
{
    // Without a callback libcryptsetup writes to standard error. There is no device yet that could have one
    // of its own, and the one for all devices is the application's: it is taken for this call alone.
    crypt_device *initialised = nullptr;
    crypt_set_log_callback(nullptr, logMessage, nullptr);
    const int result = crypt_init(&initialised, HomeDevice);
    crypt_set_log_callback(nullptr, nullptr, nullptr);
    if (result < 0) {
        qCDebug(lcEncryption, "Could not initialize crypt_device");
        return false;
    }
    const std::unique_ptr<crypt_device, Free> device(initialised);
    crypt_set_log_callback(device.get(), logMessage, nullptr);
    if (crypt_load(device.get(), nullptr, nullptr) < 0) {
        qCDebug(lcEncryption, "Could not load LUKS parameters for crypt_device");
        return false;
    }
    return true;
}

} // namespace Mdm
} // namespace Corvane
