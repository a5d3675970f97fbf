// SPDX-License-Identifier: LGPL-2.1-or-later
#include "networkcables.h"

#include "refusal.h"

#include <QtCore/QJsonArray>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fstream>
#include <stdexcept>
#include <unistd.h>

namespace Corvane
{
namespace Simulator
{

namespace
{

const QLatin1String serviceName("net.connman");
const QLatin1String managerInterface("net.connman.Manager");

/** A program that the distribution has in a package of its own. */
struct Tool {
    const char *path;
    const char *package;
};

constexpr Tool ipTool{"/usr/sbin/ip", "iproute2"};
constexpr Tool ethtoolTool{"/usr/sbin/ethtool", "ethtool"};
constexpr Tool dnsmasqTool{"/usr/sbin/dnsmasq", "dnsmasq-base"};

std::vector<const gchar *> commandLine(const Tool &tool, const std::vector<std::string> &arguments)
{
    if (access(tool.path, X_OK) < 0)
        throw std::runtime_error(std::string(tool.path) + " is not there; install Debian's package "
                                 + tool.package);
    std::vector<const gchar *> line{tool.path};
    for (const std::string &argument : arguments)
        line.push_back(argument.c_str());
    line.push_back(nullptr);
    return line;
}

void run(const Tool &tool, const std::vector<std::string> &arguments)
{
    const std::vector<const gchar *> line = commandLine(tool, arguments);
    ErrorSlot error;
    const GObjectPointer<GSubprocess> process(g_subprocess_newv(
        line.data(), GSubprocessFlags(G_SUBPROCESS_FLAGS_STDOUT_SILENCE | G_SUBPROCESS_FLAGS_STDERR_PIPE),
        &error));
    gchar *text = nullptr;
    const bool isDone = process
        && g_subprocess_communicate_utf8(process.get(), nullptr, nullptr, nullptr, &text, &error)
        && g_subprocess_get_successful(process.get());
    const GCharPointer complaint(text);
    if (!isDone) {
        std::string sentence = tool.path;
        for (const std::string &argument : arguments)
            sentence += ' ' + argument;
        throw std::runtime_error(sentence + ": " + (error ? error->message : complaint.get()));
    }
}

void writeFile(const std::string &name, const char *content)
{
    std::ofstream file(name);
    file << content;
    if (!file.flush())
        throw std::runtime_error("cannot write " + name + ": " + std::strerror(errno));
}

} // namespace

/** Two interfaces that are the ends of one cable; ours is the one that ConnMan takes no notice of. */
struct NetworkCables::Cable {
    const std::string phoneEnd;
    const std::string ourEnd;
    const std::string network; ///< the first three numbers of its addresses
    bool isPlugged = true;
    GObjectPointer<GSubprocess> addressServer;

    Cable(const char *phone, const char *ours, const char *firstNumbers)
        : phoneEnd(phone)
        , ourEnd(ours)
        , network(firstNumbers)
    {
    }

    ~Cable()
    {
        if (addressServer)
            g_subprocess_force_exit(addressServer.get());
    }

    void lay()
    {
        run(ipTool, {"link", "add", phoneEnd, "type", "veth", "peer", "name", ourEnd});
        // ConnMan's own DHCP client reads raw packets, and drops those whose checksum is left to hardware.
        for (const std::string &end : {phoneEnd, ourEnd})
            run(ethtoolTool, {"-K", end, "tx", "off"});
        run(ipTool, {"address", "add", network + ".1/24", "dev", ourEnd});
        setPlugged(true);
        serveAddresses();
    }

    /** oFono's driver for emulated modems counts on: with each of them that goes online. */
    void alias(const std::string &stem)
    {
        constexpr int count = 200;
        std::vector<std::string> arguments{"link", "property", "add", "dev", phoneEnd};
        for (int number = 1; number < count; ++number) {
            arguments.emplace_back("altname");
            arguments.push_back(stem + std::to_string(number));
        }
        run(ipTool, arguments);
    }

    void setPlugged(bool plugged)
    {
        run(ipTool, {"link", "set", ourEnd, plugged ? "up" : "down"});
        isPlugged = plugged;
    }

    void serveAddresses()
    {
        const std::vector<std::string> arguments{
            "--keep-in-foreground",
            "--conf-file=/dev/null",
            // It is root here, and may not be able to become anybody else.
            "--user=root",
            "--group=",
            "--port=0",
            "--interface=" + ourEnd,
            "--bind-interfaces",
            "--dhcp-authoritative",
            "--no-ping", // nobody else is there
            "--dhcp-range=" + network + ".10," + network + ".99,1h",
            "--dhcp-leasefile=/run/corvane-simulator/" + ourEnd + ".leases",
            "--pid-file=",
            "--log-facility=/run/corvane-simulator/" + ourEnd + ".log",
        };
        const std::vector<const gchar *> line = commandLine(dnsmasqTool, arguments);
        ErrorSlot error;
        addressServer.reset(g_subprocess_newv(line.data(), G_SUBPROCESS_FLAGS_NONE, &error));
        if (!addressServer)
            throw std::runtime_error(error->message);
    }
};

/** Follows ConnMan until it has a network. */
class NetworkCables::BringUp
{
public:
    explicit BringUp(std::function<void()> done)
        : m_done(std::move(done))
    {
        m_connection.watchSignal(serviceName, QStringLiteral("PropertyChanged"), [this](const QString &path) {
            if (path == QLatin1String("/"))
                examine();
        });
        examine();
    }

    QString state() const { return m_state; }

private:
    void examine()
    {
        m_connection.call(
            {serviceName, QStringLiteral("/"), managerInterface, QStringLiteral("GetProperties")}, nullptr,
            [this](const Variant &reply, const GError *) {
                if (reply && g_variant_is_of_type(reply.get(), G_VARIANT_TYPE("(a{sv})")))
                    conclude(reply);
            });
    }

    void conclude(const Variant &reply)
    {
        const Variant properties(g_variant_get_child_value(reply.get(), 0));
        gboolean isOffline = FALSE;
        g_variant_lookup(properties.get(), "OfflineMode", "b", &isOffline);
        const gchar *state = "";
        g_variant_lookup(properties.get(), "State", "&s", &state);
        m_state = QString::fromUtf8(state);
        const bool isUp = m_state == QLatin1String("ready") || m_state == QLatin1String("online");
        // Its owner may destroy this object on it.
        if ((isUp || isOffline) && m_done)
            std::exchange(m_done, nullptr)();
    }

    std::function<void()> m_done;
    QString m_state;
    BusConnection m_connection;
};

NetworkCables::NetworkCables() = default;

NetworkCables::~NetworkCables() = default;

std::map<std::string, std::string> NetworkCables::prepare()
{
    if (m_cables.empty()) {
        std::vector<std::unique_ptr<Cable>> cables;
        cables.push_back(std::make_unique<Cable>("eth0", "ve-cable", "192.0.2"));
        cables.push_back(std::make_unique<Cable>("dummy0", "ve-cell", "198.51.100"));
        for (const std::unique_ptr<Cable> &cable : cables)
            cable->lay();
        cables.back()->alias("dummy");
        m_cables = std::move(cables);
        // What ConnMan comes back to from flight mode is what somebody once has switched on.
        writeFile("/var/lib/connman/settings",
                  "[global]\nOfflineMode=false\n\n[Wired]\nEnable=true\n\n"
                  "[Cellular]\nEnable=true\n");
    }
    return {};
}

void NetworkCables::bringUp(std::function<void()> done)
{
    m_bringUp = std::make_unique<BringUp>(std::move(done));
}

QString NetworkCables::missing() const
{
    return QStringLiteral("the wired network is not up, but \"%1\"")
        .arg(m_bringUp ? m_bringUp->state() : QString());
}

void NetworkCables::release()
{
    m_bringUp.reset();
}

void NetworkCables::describe(QJsonObject &state) const
{
    QJsonArray cables;
    for (const std::unique_ptr<Cable> &cable : m_cables) {
        cables << QJsonObject{{QStringLiteral("interface"), QString::fromStdString(cable->phoneEnd)},
                              {QStringLiteral("plugged"), cable->isPlugged}};
    }
    state.insert(QStringLiteral("cables"), cables);
}

QString NetworkCables::setPlugged(const QStringList &arguments, bool isPlugged)
{
    QStringList known;
    for (const std::unique_ptr<Cable> &cable : m_cables) {
        known << QString::fromStdString(cable->phoneEnd);
        if (arguments.first() != known.last())
            continue;
        try {
            cable->setPlugged(isPlugged);
        } catch (const std::runtime_error &error) {
            throw Refusal(QString::fromUtf8(error.what()));
        }
        return QString();
    }
    throw Refusal(QStringLiteral("There is no cable at \"%1\"; there are %2")
                      .arg(arguments.first(), known.join(QStringLiteral(", "))));
}

std::vector<Action> NetworkCables::actions()
{
    const auto plugging = [this](bool isPlugged) {
        return [this, isPlugged](const QStringList &arguments) {
            return setPlugged(arguments, isPlugged);
        };
    };
    return {
        {QStringLiteral("cable unplug"), QStringLiteral("INTERFACE"),
         QStringLiteral("pulls the cable out of an interface: eth0, or dummy0, which is mobile data"), 1, 1,
         plugging(false)},
        {QStringLiteral("cable plug"), QStringLiteral("INTERFACE"), QStringLiteral("puts it back in"), 1, 1,
         plugging(true)},
    };
}

} // namespace Simulator
} // namespace Corvane
