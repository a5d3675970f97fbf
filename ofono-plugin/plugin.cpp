// SPDX-License-Identifier: LGPL-2.1-or-later
#include "extension.h"

#include <ofono/dbus.h>
#include <ofono/log.h>
#include <ofono/plugin.h>
#include <ofono/storage.h>

#include <cerrno>
#include <exception>
#include <memory>

namespace
{

std::unique_ptr<VeldMobile::Extension> extension;

int initialize()
{
    DBusConnection *connection = ofono_dbus_get_connection();
    if (!connection)
        return -EIO;
    try {
        extension = std::make_unique<VeldMobile::Extension>(
            connection, std::string(ofono_storage_dir()) + "/veldmobile-sims");
    } catch (const std::exception &error) {
        ofono_error("The SIM extension cannot start: %s", error.what());
        return -ENOMEM;
    }
    return 0;
}

void finish()
{
    extension.reset();
}

} // namespace

OFONO_PLUGIN_DEFINE(veldmobile, "Modem manager and SIM information extensions", OFONO_VERSION,
                    OFONO_PLUGIN_PRIORITY_DEFAULT, initialize, finish)
