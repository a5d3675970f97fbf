// SPDX-License-Identifier: LGPL-2.1-or-later
#include "profile.h"
#include "realdaemons.h"
#include "supervisor.h"

#include <CLI/CLI.hpp>

#include <algorithm>
#include <sstream>

namespace
{

using namespace Corvane::Simulator;

constexpr int wrongUsage = 2;

constexpr char description[] = "Runs a command, or an interactive shell, inside a simulated phone.";

constexpr char explanation[]
    = R"(The phone has a system bus of its own, with the phone's services on it, and its own
/etc, /usr, /var, /run, /dev, processes, network and host name: whatever is changed
there is gone at the end. /tmp, /home and all other folders are the machine's own.
Inside, corvane-simctl steers the phone.

Exit status: the command's; 128+N when signal N ended it; 127 when it was not found;
2 wrong usage or profile; 125 when the phone could not be set up or broke down.

Examples:
  corvane-simulator                                      a shell in a dual-SIM phone
  corvane-simulator -- mdmctl update check               one command
  corvane-simulator --device my-phone.json ./my-agent    with a phone of one's own
  corvane-simulator --real ofono -- dbus-send --system --print-reply \
      --dest=org.ofono / org.ofono.Manager.GetModems     with the distribution's oFono
)";

/** CLI11 knows nothing of the command that follows. */
class HelpText : public CLI::Formatter
{
public:
    std::string make_usage(const CLI::App *, std::string) const override
    {
        return "Usage: corvane-simulator [--device PROFILE] [--real NAME,...] [--] [COMMAND [ARGS...]]\n\n";
    }
};

/** The number of leading arguments that are options of ours; the rest is the command. */
std::size_t countOwnArguments(const CLI::App &app, const std::vector<std::string> &arguments)
{
    std::size_t index = 0;
    while (index < arguments.size()) {
        const std::string &argument = arguments[index];
        if (argument == "--" || argument == "-" || argument.rfind('-', 0) != 0)
            break;
        const CLI::Option *option = app.get_option_no_throw(argument);
        index += option && option->get_items_expected_max() > 0 ? 2 : 1;
    }
    return std::min(index, arguments.size());
}

/** Those that @p list names, separated by commas. */
std::vector<RealDaemon> realDaemonsNamed(const std::string &list)
{
    std::vector<RealDaemon> chosen;
    std::istringstream names(list);
    for (std::string name; std::getline(names, name, ',');) {
        const auto &known = realDaemons();
        const auto found = std::find_if(known.begin(), known.end(), [&](const RealDaemon &daemon) {
            return daemon.name.toStdString() == name;
        });
        if (found == known.end()) {
            std::string all;
            for (const RealDaemon &daemon : known)
                all += (all.empty() ? "" : ", ") + daemon.name.toStdString();
            throw CLI::ValidationError("--real",
                                       "there is no real daemon \"" + name + "\"; there are: " + all);
        }
        const auto rival = std::find_if(chosen.begin(), chosen.end(), [&](const RealDaemon &daemon) {
            return daemon.busNames.first() == found->busNames.first();
        });
        if (rival != chosen.end())
            throw CLI::ValidationError(
                "--real", rival->name.toStdString() + " and " + name + " are one and the same service");
        chosen.push_back(*found);
    }
    return chosen;
}

} // namespace

int main(int argc, char *argv[])
{
    CLI::App app(description, "corvane-simulator");
    app.formatter(std::make_shared<HelpText>());
    app.footer(explanation);

    std::string device;
    std::string realNames;
    app.add_option("--device", device, "the phone's profile, a JSON file; \"-\" reads standard input")
        ->type_name("PROFILE");
    app.add_option("--real", realNames, "daemons of the distribution to run in place of simulated services")
        ->type_name("NAME,...");
    app.set_version_flag("--version", "corvane-simulator " CORVANEMDM_VERSION);

    RunSettings settings;
    try {
        const std::vector<std::string> arguments(argv + 1, argv + argc);
        const auto ownEnd = arguments.begin() + std::ptrdiff_t(countOwnArguments(app, arguments));
        // CLI11 takes them in reverse.
        app.parse(std::vector<std::string>(std::make_reverse_iterator(ownEnd), arguments.rend()));
        auto commandBegin = ownEnd;
        if (commandBegin != arguments.end() && *commandBegin == "--")
            ++commandBegin;
        settings.command.assign(commandBegin, arguments.end());
        settings.realDaemons = realDaemonsNamed(realNames);
    } catch (const CLI::Success &success) {
        return app.exit(success);
    } catch (const CLI::ExtrasError &error) {
        std::fprintf(stderr, "corvane-simulator: %s; there are --device, --real, --version and --help\n",
                     error.what());
        return wrongUsage;
    } catch (const CLI::ParseError &error) {
        std::fprintf(stderr, "corvane-simulator: %s; see corvane-simulator --help\n", error.what());
        return wrongUsage;
    }

    settings.profile = readProfile(QString::fromLocal8Bit(device.c_str()));
    if (!settings.profile.isValid()) {
        std::fprintf(stderr, "corvane-simulator: %s\n", qPrintable(settings.profile.error));
        return wrongUsage;
    }
    return runInPhone(settings);
}
