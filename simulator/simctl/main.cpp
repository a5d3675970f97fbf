// SPDX-License-Identifier: LGPL-2.1-or-later
#include "busaddress.h"
#include "controlnames.h"
#include "glibpointers.h"
#include "secrets.h"

#include <QtCore/QDateTime>
#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QJsonObject>
#include <QtCore/QStringList>

#include <CLI/CLI.hpp>

#include <algorithm>
#include <cstdio>
#include <functional>
#include <numeric>
#include <string>
#include <vector>

namespace
{

using namespace Corvane::Simulator;

enum ExitStatus { Done = 0, Refused = 1, WrongUsage = 2, NoPhone = 3 };

constexpr char noPhoneText[] = "no simulated phone is here; run this inside one, for example: "
                               "corvane-simulator -- corvane-simctl services";

constexpr char examples[] = R"(Examples:
  corvane-simctl act sim pull 1
  corvane-simctl act update publish 5.1.0
  corvane-simctl stop org.ofono
  corvane-simctl fault error org.ofono AddRule --error org.ofono.Error.Failed --times 1
  corvane-simctl fault late org.corvaneos.mdmproxy "" --delay 2000
  corvane-simctl fault reply org.corvaneos.mdmproxy latestAvailableUpdateVersion --arguments "uint32 7"
  corvane-simctl emit org.ofono /ril_0 org.ofono.Modem PropertyChanged "'Online'" "<false>"
  corvane-simctl journal --follow --service org.ofono
  corvane-simctl state softwareUpdate

Values are GVariant text: 'text' (with the quotes), 7, uint32 7, true, objectpath '/x', <'in a variant'>,
[('244051234567890', uint32 1)]. Exit status: 0 done, 1 refused, 2 wrong usage, 3 no simulated phone here.)";

/** Ends the program with one line. */
struct Failure {
    ExitStatus status;
    std::string text;
};

/** How many letters have to change to get from one word to the other. */
std::size_t distance(const std::string &from, const std::string &to)
{
    std::vector<std::size_t> row(to.size() + 1);
    std::iota(row.begin(), row.end(), 0);
    for (std::size_t i = 1; i <= from.size(); ++i) {
        std::size_t diagonal = std::exchange(row[0], i);
        for (std::size_t j = 1; j <= to.size(); ++j) {
            const std::size_t replaced = diagonal + (from[i - 1] == to[j - 1] ? 0 : 1);
            diagonal = std::exchange(row[j], std::min({row[j] + 1, row[j - 1] + 1, replaced}));
        }
    }
    return row.back();
}

/** "did you mean X?" when one of @p known is near; all of them otherwise. */
std::string advice(const std::string &given, const std::vector<std::string> &known)
{
    if (known.empty())
        return "there is none";
    const auto nearest = std::min_element(known.begin(), known.end(),
                                          [&](const std::string &left, const std::string &right) {
                                              return distance(given, left) < distance(given, right);
                                          });
    if (distance(given, *nearest) <= std::max<std::size_t>(2, given.size() / 3))
        return "did you mean \"" + *nearest + "\"?";
    std::string all = "there are ";
    for (const std::string &each : known)
        all += (&each == &known.front() ? "" : ", ") + each;
    return all;
}

/** Rows in columns as wide as they need to be. */
void printTable(const std::vector<std::vector<std::string>> &rows)
{
    std::vector<std::size_t> widths;
    for (const auto &row : rows) {
        widths.resize(std::max(widths.size(), row.size()));
        for (std::size_t i = 0; i < row.size(); ++i)
            widths[i] = std::max(widths[i], row[i].size());
    }
    for (const auto &row : rows) {
        std::string line;
        for (std::size_t i = 0; i < row.size(); ++i) {
            line += row[i];
            if (i + 1 < row.size())
                line.append(widths[i] - row[i].size() + 2, ' ');
        }
        std::printf("%s\n", line.c_str());
    }
}

/** The control interface of the phone that this runs in. */
class Phone
{
public:
    Phone();
    /** The answer to @p method, a tuple. */
    Variant call(const char *method, GVariant *arguments = nullptr) const;
    /** Calls @p handler with each new entry of the journal, for ever. */
    void followJournal(std::function<void(GVariant *)> handler);

private:
    GObjectPointer<GDBusConnection> m_connection;
    std::function<void(GVariant *)> m_journalHandler;
};

Phone::Phone()
{
    m_connection.reset(g_dbus_connection_new_for_address_sync(
        busAddress,
        GDBusConnectionFlags(G_DBUS_CONNECTION_FLAGS_AUTHENTICATION_CLIENT
                             | G_DBUS_CONNECTION_FLAGS_MESSAGE_BUS_CONNECTION),
        nullptr, nullptr, nullptr));
    if (!m_connection)
        throw Failure{NoPhone, noPhoneText};
}

Variant Phone::call(const char *method, GVariant *arguments) const
{
    ErrorSlot error;
    Variant reply(g_dbus_connection_call_sync(m_connection.get(), ControlNames::service, ControlNames::path,
                                              ControlNames::interface, method, arguments, nullptr,
                                              G_DBUS_CALL_FLAGS_NO_AUTO_START, G_MAXINT, nullptr, &error));
    if (reply)
        return reply;
    if (g_error_matches(error.get(), G_DBUS_ERROR, G_DBUS_ERROR_SERVICE_UNKNOWN)
        || g_error_matches(error.get(), G_DBUS_ERROR, G_DBUS_ERROR_NAME_HAS_NO_OWNER))
        throw Failure{NoPhone, noPhoneText};
    g_dbus_error_strip_remote_error(error.get());
    throw Failure{Refused, error->message};
}

void Phone::followJournal(std::function<void(GVariant *)> handler)
{
    m_journalHandler = std::move(handler);
    g_dbus_connection_signal_subscribe(
        m_connection.get(), ControlNames::service, ControlNames::interface, "CallReceived",
        ControlNames::path, nullptr, G_DBUS_SIGNAL_FLAGS_NONE,
        [](GDBusConnection *, const gchar *, const gchar *, const gchar *, const gchar *, GVariant *arguments,
           gpointer data) {
            const Variant entry(g_variant_get_child_value(arguments, 0));
            static_cast<Phone *>(data)->m_journalHandler(entry.get());
        },
        this, nullptr);
}

std::vector<std::string> serviceNames(const Phone &phone)
{
    const Variant reply = phone.call("Services");
    const Variant list(g_variant_get_child_value(reply.get(), 0));
    std::vector<std::string> names;
    for (gsize i = 0; i < g_variant_n_children(list.get()); ++i) {
        const gchar *name = nullptr;
        g_variant_get_child(list.get(), i, "(&sb)", &name, nullptr);
        names.emplace_back(name);
    }
    return names;
}

void requireService(const Phone &phone, const std::string &name)
{
    const std::vector<std::string> known = serviceNames(phone);
    if (std::find(known.begin(), known.end(), name) == known.end()) {
        throw Failure{Refused, "there is no service \"" + name + "\"; " + advice(name, known)};
    }
}

/** Values for an argument of type av. */
GVariant *parseValues(const std::vector<std::string> &texts)
{
    std::vector<Variant> values;
    for (const std::string &text : texts) {
        ErrorSlot error;
        Variant value(g_variant_parse(nullptr, text.c_str(), nullptr, nullptr, &error));
        if (!value) {
            throw Failure{WrongUsage,
                          "\"" + text + "\" is no GVariant text: " + error->message + "; a string is \"'"
                              + text + "'\""};
        }
        values.push_back(value);
    }
    GVariantBuilder builder;
    g_variant_builder_init(&builder, G_VARIANT_TYPE("av"));
    for (const Variant &value : values)
        g_variant_builder_add(&builder, "v", value.get());
    return g_variant_builder_end(&builder);
}

void showServices(const Phone &phone)
{
    const Variant reply = phone.call("Services");
    const Variant list(g_variant_get_child_value(reply.get(), 0));
    std::vector<std::vector<std::string>> rows;
    for (gsize i = 0; i < g_variant_n_children(list.get()); ++i) {
        const gchar *name = nullptr;
        gboolean isRunning = FALSE;
        g_variant_get_child(list.get(), i, "(&sb)", &name, &isRunning);
        rows.push_back({name, isRunning ? "running" : "stopped"});
    }
    printTable(rows);
}

struct FaultOptions {
    std::string kind;
    std::string service;
    std::string member;
    std::string path;
    std::string interface;
    std::string error;
    std::string message;
    guint32 delay = 0;
    guint32 times = 0;
    std::vector<std::string> arguments;
};

void setFault(const Phone &phone, const CLI::App &command, const FaultOptions &given)
{
    requireService(phone, given.service);
    const Variant values(parseValues(given.arguments));
    GVariantBuilder options;
    g_variant_builder_init(&options, G_VARIANT_TYPE_VARDICT);
    if (command.count("--error"))
        g_variant_builder_add(&options, "{sv}", "error", g_variant_new_string(given.error.c_str()));
    if (command.count("--message"))
        g_variant_builder_add(&options, "{sv}", "message", g_variant_new_string(given.message.c_str()));
    if (command.count("--delay"))
        g_variant_builder_add(&options, "{sv}", "delay", g_variant_new_uint32(given.delay));
    if (command.count("--times"))
        g_variant_builder_add(&options, "{sv}", "times", g_variant_new_uint32(given.times));
    if (command.count("--arguments"))
        g_variant_builder_add(&options, "{sv}", "arguments", values.get());
    const Variant reply = phone.call("SetFault",
                                     g_variant_new("(sssssa{sv})", given.service.c_str(), given.path.c_str(),
                                                   given.interface.c_str(), given.member.c_str(),
                                                   given.kind.c_str(), &options));
    guint32 id = 0;
    g_variant_get(reply.get(), "(u)", &id);
    std::printf("fault %u\n", id);
}

void showFaults(const Phone &phone)
{
    const Variant reply = phone.call("Faults");
    const Variant list(g_variant_get_child_value(reply.get(), 0));
    const auto orAny = [](const gchar *text) {
        return std::string(*text ? text : "*");
    };
    std::vector<std::vector<std::string>> rows;
    for (gsize i = 0; i < g_variant_n_children(list.get()); ++i) {
        guint32 id = 0;
        const gchar *service = nullptr;
        const gchar *path = nullptr;
        const gchar *interface = nullptr;
        const gchar *member = nullptr;
        const gchar *kind = nullptr;
        GVariant *rawOptions = nullptr;
        g_variant_get_child(list.get(), i, "(u&s&s&s&s&s@a{sv})", &id, &service, &path, &interface, &member,
                            &kind, &rawOptions);
        const Variant options(rawOptions);
        const GCharPointer text(g_variant_print(options.get(), FALSE));
        rows.push_back(
            {std::to_string(id), kind, service, orAny(path), orAny(interface), orAny(member), text.get()});
    }
    printTable(rows);
}

void emitSignal(const Phone &phone, const std::string &service, const std::string &path,
                const std::string &interface, const std::string &member,
                const std::vector<std::string> &texts)
{
    requireService(phone, service);
    phone.call("EmitSignal",
               g_variant_new("(ssss@av)", service.c_str(), path.c_str(), interface.c_str(), member.c_str(),
                             parseValues(texts)));
}

struct JournalOptions {
    quint64 after = 0;
    std::string service;
    bool json = false;
    bool follow = false;
    bool clear = false;
    bool secrets = false;
};

/** Prints one entry, a (ttsssssss), and returns its number. */
quint64 printEntry(GVariant *entry, const JournalOptions &options)
{
    guint64 number = 0;
    guint64 time = 0;
    const gchar *service = nullptr;
    const gchar *sender = nullptr;
    const gchar *path = nullptr;
    const gchar *interface = nullptr;
    const gchar *member = nullptr;
    const gchar *signature = nullptr;
    const gchar *arguments = nullptr;
    g_variant_get(entry, "(tt&s&s&s&s&s&s&s)", &number, &time, &service, &sender, &path, &interface, &member,
                  &signature, &arguments);
    if (!options.service.empty() && options.service != service)
        return number;
    const std::string shown
        = options.secrets ? arguments : argumentsWithoutSecrets({interface, member, signature, arguments});
    if (options.json) {
        const QJsonObject object{
            {QStringLiteral("number"), double(number)},
            {QStringLiteral("time"), double(time)},
            {QStringLiteral("service"), QString::fromUtf8(service)},
            {QStringLiteral("sender"), QString::fromUtf8(sender)},
            {QStringLiteral("path"), QString::fromUtf8(path)},
            {QStringLiteral("interface"), QString::fromUtf8(interface)},
            {QStringLiteral("member"), QString::fromUtf8(member)},
            {QStringLiteral("signature"), QString::fromUtf8(signature)},
            {QStringLiteral("arguments"), QString::fromStdString(shown)},
        };
        std::printf("%s\n", QJsonDocument(object).toJson(QJsonDocument::Compact).constData());
    } else {
        const QString clock
            = QDateTime::fromMSecsSinceEpoch(qint64(time / 1000)).toString(QStringLiteral("hh:mm:ss.zzz"));
        std::printf("%llu  %s  %s  %s  %s  %s.%s%s\n", static_cast<unsigned long long>(number),
                    qPrintable(clock), service, sender, path, interface, member, shown.c_str());
    }
    std::fflush(stdout);
    return number;
}

quint64 printJournal(const Phone &phone, const JournalOptions &options)
{
    const Variant reply = phone.call("Journal", g_variant_new("(t)", guint64(options.after)));
    const Variant list(g_variant_get_child_value(reply.get(), 0));
    quint64 last = options.after;
    for (gsize i = 0; i < g_variant_n_children(list.get()); ++i)
        last = printEntry(Variant(g_variant_get_child_value(list.get(), i)).get(), options);
    return last;
}

void showJournal(Phone &phone, const JournalOptions &options)
{
    if (!options.service.empty())
        requireService(phone, options.service);
    if (options.clear) {
        phone.call("ClearJournal");
        return;
    }
    if (!options.follow) {
        printJournal(phone, options);
        return;
    }
    // Subscribed first, so that nothing is lost between the old entries and the new ones.
    quint64 last = 0;
    phone.followJournal([&](GVariant *entry) {
        guint64 number = 0;
        g_variant_get_child(entry, 0, "t", &number);
        if (number > last)
            last = printEntry(entry, options);
    });
    last = printJournal(phone, options);
    const GMainLoopPointer loop(g_main_loop_new(nullptr, FALSE));
    g_main_loop_run(loop.get());
}

void flatten(const QString &name, const QJsonValue &value, std::vector<std::vector<std::string>> &rows)
{
    if (value.isObject() && !value.toObject().isEmpty()) {
        const QJsonObject object = value.toObject();
        for (auto member = object.begin(); member != object.end(); ++member)
            flatten(name.isEmpty() ? member.key() : name + QLatin1Char('.') + member.key(), member.value(),
                    rows);
        return;
    }
    if (value.isArray() && !value.toArray().isEmpty()) {
        const QJsonArray array = value.toArray();
        for (int i = 0; i < array.size(); ++i)
            flatten(QStringLiteral("%1[%2]").arg(name).arg(i), array.at(i), rows);
        return;
    }
    const QString text = value.isString() || value.isDouble() ? value.toVariant().toString()
        : value.isBool()                                      ? QVariant(value.toBool()).toString()
                                                              : QStringLiteral("none");
    rows.push_back({name.toStdString(), text.toStdString()});
}

void showState(const Phone &phone, const std::string &part, bool json)
{
    const Variant reply = phone.call("State");
    const gchar *text = nullptr;
    g_variant_get(reply.get(), "(&s)", &text);
    const QJsonObject state = QJsonDocument::fromJson(text).object();
    QJsonValue shown = state;
    if (!part.empty()) {
        shown = state.value(QString::fromStdString(part));
        if (shown.isUndefined()) {
            std::vector<std::string> known;
            const QStringList parts = state.keys();
            for (const QString &each : parts)
                known.push_back(each.toStdString());
            throw Failure{Refused, "the phone has no part \"" + part + "\"; " + advice(part, known)};
        }
    }
    if (!json) {
        std::vector<std::vector<std::string>> rows;
        flatten(QString::fromStdString(part), shown, rows);
        printTable(rows);
    } else if (shown.isObject()) {
        std::printf("%s", QJsonDocument(shown.toObject()).toJson().constData());
    } else if (shown.isArray()) {
        std::printf("%s", QJsonDocument(shown.toArray()).toJson().constData());
    } else {
        // A document has no room for a bare value; as the only element of an array it is written right.
        const QByteArray boxed = QJsonDocument(QJsonArray{shown}).toJson(QJsonDocument::Compact);
        std::printf("%s\n", boxed.mid(1, boxed.size() - 2).constData());
    }
}

struct ActionRow {
    std::string name;
    std::string usage;
    std::string description;
};

std::vector<ActionRow> actions(const Phone &phone)
{
    const Variant reply = phone.call("Actions");
    const Variant list(g_variant_get_child_value(reply.get(), 0));
    std::vector<ActionRow> rows;
    for (gsize i = 0; i < g_variant_n_children(list.get()); ++i) {
        const gchar *name = nullptr;
        const gchar *usage = nullptr;
        const gchar *description = nullptr;
        g_variant_get_child(list.get(), i, "(&s&s&s)", &name, &usage, &description);
        rows.push_back({name, usage, description});
    }
    return rows;
}

void showActions(const Phone &phone)
{
    std::vector<std::vector<std::string>> rows;
    for (const ActionRow &action : actions(phone))
        rows.push_back({action.name + " " + action.usage, action.description});
    printTable(rows);
}

/** The first @p count words, as a person wrote them. */
std::string join(const std::vector<std::string> &words, std::size_t count)
{
    std::string text;
    for (std::size_t i = 0; i < count; ++i)
        text += (i ? " " : "") + words[i];
    return text;
}

void act(const Phone &phone, const std::vector<std::string> &words)
{
    std::vector<std::string> known;
    for (const ActionRow &action : actions(phone)) {
        const auto length = std::size_t(std::count(action.name.begin(), action.name.end(), ' ')) + 1;
        known.push_back(action.name);
        if (words.size() < length || join(words, length) != action.name)
            continue;
        GVariantBuilder arguments;
        g_variant_builder_init(&arguments, G_VARIANT_TYPE_STRING_ARRAY);
        for (std::size_t i = length; i < words.size(); ++i)
            g_variant_builder_add(&arguments, "s", words[i].c_str());
        const Variant reply = phone.call("Act", g_variant_new("(sas)", action.name.c_str(), &arguments));
        const gchar *result = nullptr;
        g_variant_get(reply.get(), "(&s)", &result);
        if (*result)
            std::printf("%s\n", result);
        return;
    }
    const std::string given = join(words, std::min<std::size_t>(words.size(), 2));
    throw Failure{Refused, "there is no action \"" + given + "\"; " + advice(given, known)};
}

/** The arguments as CLI11 wants them: in reverse, and no value in brackets, which it would take apart. */
std::vector<std::string> argumentsForParser(int argc, char *argv[])
{
    std::vector<std::string> arguments(std::make_reverse_iterator(argv + argc),
                                       std::make_reverse_iterator(argv + 1));
    for (std::string &argument : arguments) {
        if (argument.rfind('[', 0) == 0)
            argument.insert(0, " ");
    }
    return arguments;
}

/** What can be asked for on the command line. The command is chosen when that is right, and run with the
 * phone. */
class CommandLine
{
public:
    CommandLine();

    void parse(int argc, char *argv[]);
    void run(Phone &phone) const { m_chosen(phone); }
    int finish(const CLI::Success &success) const { return m_app.exit(success); }

private:
    using Run = std::function<void(Phone &)>;

    CLI::App *add(const char *name, const char *text, const Run &run);
    CLI::App *addForService(const char *name, const char *text, const Run &run);
    void addServiceCommands();
    void addFaultCommands();
    void addSignalCommand();
    void addJournalCommand();
    void addPhoneCommands();

    CLI::App m_app{"Steers the simulated phone that it runs in.", "corvane-simctl"};
    Run m_chosen;
    std::string m_service;
    std::string m_path;
    std::string m_interface;
    std::string m_member;
    std::string m_part;
    std::vector<std::string> m_words;
    bool m_json = false;
    guint32 m_id = 0;
    FaultOptions m_fault;
    JournalOptions m_journal;
};

CommandLine::CommandLine()
{
    m_app.footer(examples);
    m_app.require_subcommand(1);
    m_app.set_version_flag("--version", "corvane-simctl " CORVANEMDM_VERSION);
    addServiceCommands();
    addFaultCommands();
    addSignalCommand();
    addJournalCommand();
    addPhoneCommands();
}

void CommandLine::parse(int argc, char *argv[])
{
    std::vector<std::string> known;
    for (const CLI::App *command : m_app.get_subcommands({}))
        known.push_back(command->get_name());
    if (argc > 1 && argv[1][0] != '-' && std::find(known.begin(), known.end(), argv[1]) == known.end())
        throw Failure{WrongUsage,
                      std::string("there is no command \"") + argv[1] + "\"; " + advice(argv[1], known)};
    m_app.parse(argumentsForParser(argc, argv));
}

CLI::App *CommandLine::add(const char *name, const char *text, const Run &run)
{
    CLI::App *command = m_app.add_subcommand(name, text);
    command->callback([this, run] { m_chosen = run; });
    return command;
}

CLI::App *CommandLine::addForService(const char *name, const char *text, const Run &run)
{
    CLI::App *command = add(name, text, run);
    command->add_option("SERVICE", m_service, "bus name of a service")->required();
    return command;
}

void CommandLine::addServiceCommands()
{
    const auto order = [this](Phone &phone, const char *method) {
        requireService(phone, m_service);
        phone.call(method, g_variant_new("(s)", m_service.c_str()));
    };
    add("services", "list the services that can be steered", showServices);
    addForService("stop", "stop a service, as if it had died",
                  [order](Phone &phone) { order(phone, "StopService"); });
    addForService("start", "start a stopped service",
                  [order](Phone &phone) { order(phone, "StartService"); });
    addForService("restart", "stop and start a service", [order](Phone &phone) {
        order(phone, "StopService");
        order(phone, "StartService");
    });
}

void CommandLine::addFaultCommands()
{
    CLI::App *setting
        = m_app.add_subcommand("fault", "make calls of a method fail, come late, never or answer wrongly");
    setting->callback([this, setting] {
        m_chosen = [this, setting](Phone &phone) {
            setFault(phone, *setting, m_fault);
        };
    });
    setting->add_option("KIND", m_fault.kind, "error, late, never or reply")
        ->required()
        ->check(CLI::IsMember({"error", "late", "never", "reply"}));
    setting->add_option("SERVICE", m_fault.service, "bus name of a service")->required();
    setting->add_option("MEMBER", m_fault.member, "name of the method; \"\" for all")->required();
    setting->add_option("--path", m_fault.path, "only calls of this object");
    setting->add_option("--interface", m_fault.interface, "only calls of this interface");
    setting->add_option("--error", m_fault.error, "error: its name");
    setting->add_option("--message", m_fault.message, "error: its text");
    setting->add_option("--delay", m_fault.delay, "late: milliseconds");
    setting->add_option("--arguments", m_fault.arguments, "reply: the values to answer with")
        ->type_name("GVARIANT");
    setting->add_option("--times", m_fault.times, "how many calls to spoil; all unless given");
    add("faults", "list the faults that are set", showFaults);
    add("clear-fault", "take a fault back",
        [this](Phone &phone) { phone.call("ClearFault", g_variant_new("(u)", m_id)); })
        ->add_option("ID", m_id, "number of the fault")
        ->required();
    add("clear-faults", "take all faults back", [](Phone &phone) { phone.call("ClearFaults"); });
}

void CommandLine::addSignalCommand()
{
    CLI::App *emitting = addForService("emit", "emit any signal from a service", [this](Phone &phone) {
        emitSignal(phone, m_service, m_path, m_interface, m_member, m_words);
    });
    emitting->add_option("PATH", m_path, "object that emits it")->required();
    emitting->add_option("INTERFACE", m_interface, "interface of the signal")->required();
    emitting->add_option("MEMBER", m_member, "name of the signal")->required();
    emitting->add_option("VALUE", m_words, "its arguments")->type_name("GVARIANT");
}

void CommandLine::addJournalCommand()
{
    CLI::App *reading = add("journal", "print the calls that the services received",
                            [this](Phone &phone) { showJournal(phone, m_journal); });
    reading->add_option("--after", m_journal.after, "only entries after this number");
    reading->add_option("--service", m_journal.service, "only calls of this service");
    reading->add_flag("--follow", m_journal.follow, "go on with each new call");
    reading->add_flag("--json", m_journal.json, "one JSON object a line");
    reading->add_flag("--secrets", m_journal.secrets, "show passwords as they are, in place of ***");
    reading->add_flag("--clear", m_journal.clear, "forget all entries instead");
}

void CommandLine::addPhoneCommands()
{
    CLI::App *looking = add("state", "print the state of the phone, or of one part of it",
                            [this](Phone &phone) { showState(phone, m_part, m_json); });
    looking->add_option("PART", m_part, "such as sims or softwareUpdate");
    looking->add_flag("--json", m_json, "as JSON");
    add("act", "do something to the phone", [this](Phone &phone) { act(phone, m_words); })
        ->add_option("ACTION", m_words, "words of an action and its arguments; see \"actions\"")
        ->required();
    add("actions", "list what can be done to the phone", showActions);
}

} // namespace

int main(int argc, char *argv[])
{
    CommandLine commandLine;
    try {
        commandLine.parse(argc, argv);
        Phone phone;
        commandLine.run(phone);
    } catch (const CLI::Success &success) {
        return commandLine.finish(success);
    } catch (const CLI::ParseError &error) {
        std::fprintf(stderr, "corvane-simctl: %s; see corvane-simctl --help\n", error.what());
        return WrongUsage;
    } catch (const Failure &failure) {
        std::fprintf(stderr, "corvane-simctl: %s\n", failure.text.c_str());
        return failure.status;
    }
    return Done;
}
