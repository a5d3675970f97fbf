// SPDX-License-Identifier: LGPL-2.1-or-later
// The radio settings of emulated modems. oFono's own driver for such modems can tell them, but not change
// them.
#include <ofono/plugin.h>
#include <ofono/radio-settings.h>
#include <ofono/types.h>

#include <glib.h>

#include <map>

namespace
{

struct Radio {
    ofono_radio_access_mode mode; ///< what it was restricted to
    guint introduction; ///< while oFono does not know yet that it is there
};

std::map<ofono_radio_settings *, Radio> radios;

// There is a function of that name as well.
constexpr struct ofono_error success = {OFONO_ERROR_TYPE_NO_ERROR, 0};

int probe(ofono_radio_settings *settings, unsigned int, void *)
{
    // oFono takes note of the driver only after this.
    const guint introduction = g_idle_add(
        [](gpointer radio) -> gboolean {
            auto *known = static_cast<ofono_radio_settings *>(radio);
            radios[known].introduction = 0;
            ofono_radio_settings_register(known);
            return G_SOURCE_REMOVE;
        },
        settings);
    radios[settings] = {OFONO_RADIO_ACCESS_MODE_ANY, introduction};
    return 0;
}

void forget(ofono_radio_settings *settings)
{
    if (const guint introduction = radios[settings].introduction)
        g_source_remove(introduction);
    radios.erase(settings);
}

void tellMode(ofono_radio_settings *settings, ofono_radio_settings_rat_mode_query_cb_t answer, void *data)
{
    answer(&success, radios[settings].mode, data);
}

void setMode(ofono_radio_settings *settings, ofono_radio_access_mode mode,
             ofono_radio_settings_rat_mode_set_cb_t answer, void *data)
{
    radios[settings].mode = mode;
    answer(&success, data);
}

void tellTechnologies(ofono_radio_settings *, ofono_radio_settings_available_rats_query_cb_t answer,
                      void *data)
{
    answer(&success, OFONO_RADIO_ACCESS_MODE_GSM | OFONO_RADIO_ACCESS_MODE_UMTS | OFONO_RADIO_ACCESS_MODE_LTE,
           data);
}

/** Of the same name as oFono's own: it takes the one that was registered last. */
ofono_radio_settings_driver driver()
{
    ofono_radio_settings_driver driver = {};
    driver.name = "phonesim";
    driver.probe = probe;
    driver.remove = forget;
    driver.query_rat_mode = tellMode;
    driver.set_rat_mode = setMode;
    driver.query_available_rats = tellTechnologies;
    return driver;
}

const ofono_radio_settings_driver emulatedRadio = driver();

int initialize()
{
    return ofono_radio_settings_driver_register(&emulatedRadio);
}

void finish()
{
    ofono_radio_settings_driver_unregister(&emulatedRadio);
}

} // namespace

OFONO_PLUGIN_DEFINE(emulatedradio, "Radio settings of emulated modems", OFONO_VERSION,
                    OFONO_PLUGIN_PRIORITY_LOW, initialize, finish)
