// SPDX-License-Identifier: LGPL-2.1-or-later
#include "stranger.h"

#include "busaddress.h"
#include "controlnames.h"
#include "drivernames.h"

#include <QtCore/QDir>
#include <QtCore/QFile>
#include <QtCore/QFileInfo>

#include <gio/gunixfdlist.h>

#include <algorithm>
#include <csignal>
#include <cstdio>
#include <fcntl.h>
#include <sys/wait.h>

using Corvane::Simulator::ErrorSlot;
using Corvane::Simulator::GCharPointer;
using Corvane::Simulator::GObjectPointer;
using Corvane::Simulator::Variant;
namespace ControlNames = Corvane::Simulator::ControlNames;

namespace
{

const char socketService[] = "org.veldmobile.devicelock";
const char socketPath[] = "/run/veld-devicelock/socket";

/** Whose client library, which is the distribution's, does not survive signals of other types. */
const char trustedService[] = "org.freedesktop.PackageKit";
const char trustedPath[] = "/org/freedesktop/PackageKit";

constexpr std::size_t rememberedMessages = 12;
constexpr guint longestHold = 20; // milliseconds; a client that blocks waits no longer

/** What is in memory of the process @p id, in KiB. */
qint64 residentMemory(GPid id)
{
    QFile status(QStringLiteral("/proc/%1/statm").arg(id));
    return status.open(QIODevice::ReadOnly) ? status.readAll().split(' ').value(1).toLongLong() * 4 : 0;
}

bool isFrom(GDBusMessage *message, const char *interface)
{
    return g_strcmp0(g_dbus_message_get_interface(message), interface) == 0;
}

QByteArray describe(GDBusMessage *message)
{
    return QByteArray(g_dbus_message_get_path(message)) + ' ' + g_dbus_message_get_interface(message) + '.'
        + g_dbus_message_get_member(message);
}

} // namespace

/** A call on its way from the bus's thread to the main loop. */
struct Stranger::Incoming {
    Stranger *stranger;
    Pointer<GDBusConnection> connection;
    Pointer<GDBusMessage> call;
};

Stranger::Stranger(const RunSettings &settings)
    : m_settings(settings)
    , m_loop(g_main_loop_new(nullptr, false))
{
    ErrorSlot error;
    const auto flags = GDBusConnectionFlags(G_DBUS_CONNECTION_FLAGS_AUTHENTICATION_CLIENT
                                            | G_DBUS_CONNECTION_FLAGS_MESSAGE_BUS_CONNECTION);
    m_bus.reset(g_dbus_connection_new_for_address_sync(Corvane::Simulator::busAddress, flags, nullptr,
                                                       nullptr, &error));
    if (!m_bus)
        qFatal("%s (run it inside corvane-simulator)", error->message);
    m_record = std::make_unique<PhoneRecord>(m_bus.get(), CONTRACTS_FOLDER);
    takeOver();
}

Stranger::~Stranger()
{
    if (m_heldTimer)
        g_source_remove(m_heldTimer);
    m_held.clear();
    // The phone is left as it was found.
    for (const QByteArray &service : m_record->services()) {
        if (!m_namesAway.contains(service))
            setServicePresent(service, false);
        control("StartService", service);
    }
    g_dbus_connection_close_sync(m_bus.get(), nullptr, nullptr);
    g_main_loop_unref(m_loop);
}

/** Sends the phone's services away, and takes their names. */
void Stranger::takeOver()
{
    for (const QByteArray &service : m_record->services()) {
        control("StopService", service);
        setServicePresent(service, true);
    }
    setNameOwned(DriverNames::service, true);
    listen(m_bus.get());
}

void Stranger::control(const char *method, const QByteArray &service)
{
    ErrorSlot error;
    const Variant reply(g_dbus_connection_call_sync(
        m_bus.get(), ControlNames::service, ControlNames::path, ControlNames::interface, method,
        g_variant_new("(s)", service.constData()), nullptr, G_DBUS_CALL_FLAGS_NONE, -1, nullptr, &error));
    if (!reply)
        qFatal("%s of %s: %s", method, service.constData(), error->message);
}

void Stranger::listen(GDBusConnection *connection)
{
    g_dbus_connection_add_filter(
        connection,
        [](GDBusConnection *source, GDBusMessage *message, gboolean incoming,
           gpointer data) -> GDBusMessage * {
            if (!incoming || g_dbus_message_get_message_type(message) != G_DBUS_MESSAGE_TYPE_METHOD_CALL)
                return message;
            // In the order of arrival, as all have the same priority.
            g_main_context_invoke_full(
                nullptr, G_PRIORITY_DEFAULT,
                [](gpointer invocation) -> gboolean {
                    auto *arrived = static_cast<Incoming *>(invocation);
                    arrived->stranger->handle(arrived->connection.get(), arrived->call.get());
                    return G_SOURCE_REMOVE;
                },
                new Incoming{static_cast<Stranger *>(data),
                             Pointer<GDBusConnection>(G_DBUS_CONNECTION(g_object_ref(source))),
                             Pointer<GDBusMessage>(message)},
                [](gpointer invocation) { delete static_cast<Incoming *>(invocation); });
            return nullptr;
        },
        this, nullptr);
}

void Stranger::setSocketOpen(bool isOpen)
{
    if (!isOpen) {
        for (const Pointer<GDBusConnection> &peer : m_peers) {
            g_signal_handlers_disconnect_by_data(peer.get(), this);
            g_dbus_connection_close_sync(peer.get(), nullptr, nullptr);
        }
        m_peers.clear();
        if (m_socket)
            g_dbus_server_stop(m_socket.get());
        m_socket.reset();
        QFile::remove(QLatin1String(socketPath));
        return;
    }
    QDir().mkpath(QFileInfo(QLatin1String(socketPath)).path());
    const GCharPointer id(g_dbus_generate_guid());
    ErrorSlot error;
    m_socket.reset(g_dbus_server_new_sync((QByteArray("unix:path=") + socketPath).constData(),
                                          G_DBUS_SERVER_FLAGS_NONE, id.get(), nullptr, nullptr, &error));
    if (!m_socket)
        qFatal("nobody can be let in at %s: %s", socketPath, error->message);
    g_signal_connect(m_socket.get(), "new-connection",
                     G_CALLBACK(+[](GDBusServer *, GDBusConnection *peer, gpointer data) -> gboolean {
                         static_cast<Stranger *>(data)->acceptPeer(peer);
                         return TRUE;
                     }),
                     this);
    g_dbus_server_start(m_socket.get());
}

void Stranger::acceptPeer(GDBusConnection *peer)
{
    listen(peer);
    g_signal_connect(peer, "closed",
                     G_CALLBACK(+[](GDBusConnection *closed, gboolean, GError *, gpointer data) {
                         static_cast<Stranger *>(data)->forgetPeer(closed);
                     }),
                     this);
    m_peers.emplace_back(G_DBUS_CONNECTION(g_object_ref(peer)));
}

void Stranger::forgetPeer(GDBusConnection *peer)
{
    const auto isIt = [peer](const Pointer<GDBusConnection> &each) {
        return each.get() == peer;
    };
    m_peers.erase(std::remove_if(m_peers.begin(), m_peers.end(), isIt), m_peers.end());
}

int Stranger::run(const QByteArray &subject, const QByteArrayList &arguments)
{
    m_life = m_settings.from;
    if (!startSubject(subject, arguments))
        return 1;
    m_sinceLastCall.start();
    const guint watch = g_timeout_add_seconds(
        1,
        [](gpointer data) -> gboolean {
            static_cast<Stranger *>(data)->watchForHangs();
            return G_SOURCE_CONTINUE;
        },
        this);
    g_main_loop_run(m_loop);
    g_source_remove(watch);
    return m_status;
}

bool Stranger::startSubject(const QByteArray &subject, const QByteArrayList &arguments)
{
    std::vector<gchar *> words{const_cast<gchar *>(subject.constData())};
    for (const QByteArray &argument : arguments)
        words.push_back(const_cast<gchar *>(argument.constData()));
    words.push_back(nullptr);
    ErrorSlot error;
    const auto flags = GSpawnFlags(G_SPAWN_DO_NOT_REAP_CHILD | G_SPAWN_LEAVE_DESCRIPTORS_OPEN);
    if (!g_spawn_async(nullptr, words.data(), nullptr, flags, nullptr, nullptr, &m_subject, &error)) {
        std::fprintf(stderr, "the subject does not start: %s\n", error->message);
        return false;
    }
    g_child_watch_add(
        m_subject,
        [](GPid, gint waitStatus, gpointer data) { static_cast<Stranger *>(data)->subjectEnded(waitStatus); },
        this);
    return true;
}

void Stranger::subjectEnded(int waitStatus)
{
    const quint64 messages = m_answers + m_signals + m_calls;
    if (m_isOver && waitStatus == 0) {
        std::printf(
            "%llu messages (%llu answers, %llu signals, %llu calls), %llu departures of services, in %llu "
            "lives from %llu on, seed %llu: no crash, no hang; memory %+lld KiB in the last 90 %%\n",
            messages, m_answers, m_signals, m_calls, m_departures, m_livesLived, m_settings.from,
            m_settings.seed, m_isOver ? -m_memoryAtStart : 0);
        m_status = 0;
    } else {
        QByteArray how = "ended with status " + QByteArray::number(WEXITSTATUS(waitStatus));
        if (m_hangs)
            how = "gave no sign of life for " + QByteArray::number(m_settings.patience) + " s";
        else if (WIFSIGNALED(waitStatus))
            how = "was ended by signal " + QByteArray::number(WTERMSIG(waitStatus));
        std::fprintf(
            stderr,
            "FAILED: the subject %s at message %llu of life %llu (%s), message %llu of the run, seed "
            "%llu.\nThe last messages, newest last:\n%s%s",
            how.constData(), m_sentInLife, m_life, qPrintable(m_class), messages, m_settings.seed,
            describeLast().constData(), replayCommand().constData());
    }
    g_main_loop_quit(m_loop);
}

void Stranger::watchForHangs()
{
    if (m_sinceLastCall.elapsed() < qint64(m_settings.patience) * 1000)
        return;
    m_hangs = true;
    // Not SIGKILL: a core or a sanitizer may tell where.
    kill(m_subject, SIGABRT);
    m_sinceLastCall.start();
}

QByteArray Stranger::describeLast() const
{
    QByteArray text;
    for (const Sent &sent : m_last) {
        const GCharPointer printed(sent.arguments ? g_variant_print(sent.arguments.get(), true) : nullptr);
        text += "  " + sent.what + ' ' + QByteArray(printed.get()).left(400) + '\n';
    }
    return text;
}

QByteArray Stranger::replayCommand() const
{
    QByteArray classes;
    for (const QString &name : m_settings.hasAllClasses ? QStringList() : m_settings.classes)
        classes += " --class " + name.toUtf8();
    const QByteArray life = QByteArray::number(m_life);
    return "This life alone: --seed " + QByteArray::number(m_settings.seed) + classes + " --from " + life
        + " --lives 1 --verbose\nAll up to it:    --seed " + QByteArray::number(m_settings.seed) + classes
        + " --from " + QByteArray::number(m_settings.from) + " --lives "
        + QByteArray::number(m_life - m_settings.from + 1) + '\n';
}

void Stranger::handle(GDBusConnection *connection, GDBusMessage *call)
{
    m_sinceLastCall.start();
    if (isFrom(call, DriverNames::interface)) {
        handleDriver(call);
        return;
    }
    if (g_dbus_message_get_sender(call))
        m_subjectName = g_dbus_message_get_sender(call);
    remember(call);
    if (!(g_dbus_message_get_flags(call) & G_DBUS_MESSAGE_FLAGS_NO_REPLY_EXPECTED))
        answer(connection, call);
}

void Stranger::handleDriver(GDBusMessage *call)
{
    const QByteArray member = g_dbus_message_get_member(call);
    m_subjectName = g_dbus_message_get_sender(call);
    releaseHeld();
    const Pointer<GDBusMessage> reply(g_dbus_message_new_method_reply(call));
    if (member == DriverNames::next) {
        g_dbus_message_set_body(reply.get(), nextLife().get());
    } else if (member == DriverNames::words) {
        GVariantBuilder words;
        g_variant_builder_init(&words, G_VARIANT_TYPE_STRING_ARRAY);
        for (const QByteArray &word : m_record->values().words())
            g_variant_builder_add(&words, "s", word.constData());
        g_dbus_message_set_body(reply.get(), g_variant_new("(as)", &words));
    } else {
        guint32 count = 0;
        g_variant_get(g_dbus_message_get_body(call), "(u)", &count);
        say(count);
    }
    g_dbus_connection_send_message(m_bus.get(), reply.get(), G_DBUS_SEND_MESSAGE_FLAGS_NONE, nullptr,
                                   nullptr);
}

Variant Stranger::nextLife()
{
    // All services are there at the beginning of a life.
    while (!m_namesAway.isEmpty())
        setServicePresent(m_namesAway.takeLast(), true);
    const quint64 messages = m_answers + m_signals + m_calls;
    if (m_livesLived > 0)
        ++m_life;
    if (m_memoryAtStart == 0 && messages >= m_settings.messages / 10)
        m_memoryAtStart = residentMemory(m_subject);
    m_isOver = m_settings.lives > 0 ? m_livesLived == m_settings.lives : messages >= m_settings.messages;
    if (m_isOver) {
        m_memoryAtStart -= residentMemory(m_subject);
        return Variant(g_variant_new("(tts)", m_settings.seed, m_life, ""));
    }
    ++m_livesLived;
    m_class = m_settings.classes.at(int(m_life % quint64(m_settings.classes.size())));
    m_counts.clear();
    m_clientPaths.clear();
    m_sentInLife = 0;
    if (m_settings.verbose)
        std::fprintf(stderr, "life %llu: %s\n", m_life, qPrintable(m_class));
    return Variant(g_variant_new("(tts)", m_settings.seed, m_life, m_class.toUtf8().constData()));
}

/** Learns from @p call which services matter to objects of the present class, and of what objects they tell.
 */
void Stranger::remember(GDBusMessage *call)
{
    for (const Offer &offer : m_record->offers()) {
        if (isFrom(call, offer.interface->name))
            m_touched[m_class].insert({offer.service, offer.interface->name});
    }
    GVariant *arguments = g_dbus_message_get_body(call);
    for (gsize i = 0; arguments && i < g_variant_n_children(arguments); ++i) {
        const Variant argument(g_variant_get_child_value(arguments, i));
        if (g_variant_is_of_type(argument.get(), G_VARIANT_TYPE_OBJECT_PATH))
            m_clientPaths.append(g_variant_get_string(argument.get(), nullptr));
    }
}

void Stranger::answer(GDBusConnection *connection, GDBusMessage *call)
{
    const QByteArray what = describe(call);
    Random random(m_settings.seed, m_life, what + QByteArray::number(m_counts[what]++));
    ++m_answers;
    const bool isHeld = random.chance(3);
    Pointer<GDBusMessage> reply;
    Variant arguments;
    if (random.chance(10)) {
        reply = errorTo(call, random);
    } else {
        reply.reset(g_dbus_message_new_method_reply(call));
        arguments = answerTo(call, random);
    }
    if (!isHeld) {
        send(connection, reply.get(), arguments, "answer to " + what);
        return;
    }
    g_dbus_message_set_body(reply.get(), arguments.get());
    m_held.push_back({Pointer<GDBusConnection>(G_DBUS_CONNECTION(g_object_ref(connection))), std::move(reply),
                      "late answer to " + what});
    if (m_heldTimer)
        return;
    m_heldTimer = g_timeout_add(
        longestHold,
        [](gpointer data) -> gboolean {
            auto *stranger = static_cast<Stranger *>(data);
            stranger->m_heldTimer = 0;
            stranger->releaseHeld();
            return G_SOURCE_REMOVE;
        },
        this);
}

Variant Stranger::answerTo(GDBusMessage *call, Random &random) const
{
    const QByteArray interface(g_dbus_message_get_interface(call));
    const QByteArray member(g_dbus_message_get_member(call));
    const int kind = random.below(100);
    const Variant known = m_record->answer(g_dbus_message_get_path(call), interface, member);
    if (known && kind < 60)
        return kind < 35 ? known : m_record->values().changed(known.get(), random);
    const std::optional<QByteArray> signature = m_record->answerSignature(interface, member);
    if (signature && kind < 85)
        return argumentsOf(*signature, random);
    return argumentsOf(ValueGenerator::signature(random, 4), random);
}

Variant Stranger::argumentsOf(const QByteArray &signature, Random &random) const
{
    return m_record->values().arguments(signature, random);
}

GObjectPointer<GDBusMessage> Stranger::errorTo(GDBusMessage *call, Random &random) const
{
    static const char *const names[] = {"org.freedesktop.DBus.Error.NoReply",
                                        "org.freedesktop.DBus.Error.UnknownMethod",
                                        "org.freedesktop.DBus.Error.ServiceUnknown",
                                        "org.freedesktop.DBus.Error.AccessDenied",
                                        "org.freedesktop.DBus.Error.Failed",
                                        "net.connman.Error.InProgress",
                                        "org.ofono.Error.NotAvailable",
                                        "a.b"};
    const QByteArray message = m_record->values().text(random);
    return GObjectPointer<GDBusMessage>(
        g_dbus_message_new_method_error_literal(call, random.pick(names), message.constData()));
}

void Stranger::releaseHeld()
{
    while (!m_held.empty()) {
        const Held held = std::move(m_held.front());
        m_held.pop_front();
        send(held.connection.get(), held.answer.get(),
             Variant::shared(g_dbus_message_get_body(held.answer.get())), held.what);
    }
}

void Stranger::say(quint32 count)
{
    Random random(m_settings.seed, m_life, "say" + QByteArray::number(m_counts["say"]++));
    for (; count > 0; --count) {
        flipName(random);
        if (!random.chance(15) || !sendCall(random))
            sendSignal(random);
    }
}

const Offer &Stranger::offerToSignal(Random &random) const
{
    const std::vector<Offer> &offers = m_record->offers();
    const auto touched = m_touched.find(m_class);
    // Most of them where somebody may listen.
    const bool isOfInterface = random.chance(50);
    if (touched != m_touched.end() && random.chance(85)) {
        for (int tries = 0; tries < 50; ++tries) {
            const Offer &offer = random.pick(offers);
            if (touched->second.count(isOfInterface ? QByteArray(offer.interface->name) : offer.service))
                return offer;
        }
    }
    return random.pick(offers);
}

void Stranger::sendSignal(Random &random)
{
    const Offer &offer = offerToSignal(random);
    const GDBusInterfaceInfo *interface = offer.interface;
    if (!m_record->unoffered().empty() && random.chance(10))
        interface = random.pick(m_record->unoffered());
    QByteArray name = interface->name;
    QByteArray member("PropertyChanged");
    QByteArray signature("sv");
    std::size_t count = 0;
    while (interface->signals && interface->signals[count])
        ++count;
    if (interface->properties && *interface->properties && random.chance(count > 0 ? 30 : 80)) {
        name = "org.freedesktop.DBus.Properties";
        member = "PropertiesChanged";
        signature = "sa{sv}as";
    } else if (count > 0) {
        const GDBusSignalInfo *chosen = interface->signals[random.below(int(count))];
        member = chosen->name;
        signature = signatureOf(chosen->args);
    }
    const QByteArray path = random.chance(5) ? m_record->values().objectPath(random) : offer.path;
    if (random.chance(15) && offer.service != trustedService && !path.startsWith(trustedPath))
        signature = ValueGenerator::signature(random, 4);
    const Pointer<GDBusMessage> signal(
        g_dbus_message_new_signal(path.constData(), name.constData(), member.constData()));
    GDBusConnection *connection = m_bus.get();
    // To the subject alone: none is lost because nobody has asked the bus for it.
    if (offer.service == socketService && !m_peers.empty())
        connection = random.pick(m_peers).get();
    else
        g_dbus_message_set_destination(signal.get(), m_subjectName.constData());
    ++m_signals;
    send(connection, signal.get(), argumentsOf(signature, random), "signal " + describe(signal.get()));
}

/** Calls an object of the subject's own, if it has told of any. */
bool Stranger::sendCall(Random &random)
{
    std::vector<GDBusMethodInfo *> methods;
    std::vector<const char *> interfaces;
    for (GDBusInterfaceInfo *interface : m_record->unoffered()) {
        for (GDBusMethodInfo **method = interface->methods; method && *method; ++method) {
            methods.push_back(*method);
            interfaces.push_back(interface->name);
        }
    }
    if (m_clientPaths.isEmpty() || methods.empty())
        return false;
    const int chosen = random.below(int(methods.size()));
    const QByteArray path = random.pick(m_clientPaths);
    const QByteArray signature = random.chance(15) ? ValueGenerator::signature(random, 4)
                                                   : signatureOf(methods[std::size_t(chosen)]->in_args);
    const Pointer<GDBusMessage> call(
        g_dbus_message_new_method_call(m_subjectName.constData(), path.constData(),
                                       interfaces[std::size_t(chosen)], methods[std::size_t(chosen)]->name));
    g_dbus_message_set_flags(call.get(), G_DBUS_MESSAGE_FLAGS_NO_REPLY_EXPECTED);
    ++m_calls;
    send(m_bus.get(), call.get(), argumentsOf(signature, random), "call " + describe(call.get()));
    return true;
}

/** Now and then a service leaves, or one that has left returns. */
void Stranger::flipName(Random &random)
{
    if (!m_namesAway.isEmpty() && random.chance(30)) {
        setServicePresent(m_namesAway.takeFirst(), true);
    } else if (random.chance(3)) {
        const QByteArray name = offerToSignal(random).service;
        if (m_namesAway.contains(name))
            return;
        ++m_departures;
        setServicePresent(name, false);
        m_namesAway.append(name);
    }
}

void Stranger::setServicePresent(const QByteArray &service, bool isPresent)
{
    setNameOwned(service, isPresent);
    if (service == socketService)
        setSocketOpen(isPresent);
}

void Stranger::setNameOwned(const QByteArray &name, bool isOwned)
{
    if (m_settings.verbose)
        std::fprintf(stderr, "  %s %s\n", name.constData(), isOwned ? "comes" : "leaves");
    constexpr guint32 doNotQueue = 4;
    GVariant *arguments = isOwned ? g_variant_new("(su)", name.constData(), doNotQueue)
                                  : g_variant_new("(s)", name.constData());
    ErrorSlot error;
    const Variant reply(g_dbus_connection_call_sync(
        m_bus.get(), "org.freedesktop.DBus", "/org/freedesktop/DBus", "org.freedesktop.DBus",
        isOwned ? "RequestName" : "ReleaseName", arguments, G_VARIANT_TYPE("(u)"), G_DBUS_CALL_FLAGS_NONE, -1,
        nullptr, &error));
    guint32 result = 0;
    if (reply)
        g_variant_get(reply.get(), "(u)", &result);
    if (result != 1)
        qFatal("%s cannot be %s: %s", name.constData(), isOwned ? "owned" : "released",
               error ? error->message : "somebody else has it");
}

void Stranger::send(GDBusConnection *connection, GDBusMessage *message, const Variant &arguments,
                    const QByteArray &what)
{
    g_dbus_message_set_body(message, arguments.get());
    if (arguments && mayHoldHandles(g_variant_get_type(arguments.get()))) {
        const GObjectPointer<GUnixFDList> handles(g_unix_fd_list_new());
        const int file = open("/dev/null", O_RDONLY | O_CLOEXEC);
        g_unix_fd_list_append(handles.get(), file, nullptr);
        close(file);
        g_dbus_message_set_unix_fd_list(message, handles.get());
    }
    ++m_sentInLife;
    const gchar *error = g_dbus_message_get_error_name(message);
    m_last.push_back({error ? what + ": " + error : what, arguments});
    if (m_last.size() > rememberedMessages)
        m_last.pop_front();
    if (m_settings.verbose) {
        const GCharPointer printed(arguments ? g_variant_print(arguments.get(), true) : nullptr);
        std::fprintf(stderr, "  %s %.400s\n", m_last.back().what.constData(), printed ? printed.get() : "");
    }
    ErrorSlot problem;
    // A peer may have left.
    if (!g_dbus_connection_is_closed(connection)
        && !g_dbus_connection_send_message(connection, message, G_DBUS_SEND_MESSAGE_FLAGS_NONE, nullptr,
                                           &problem))
        qWarning("%s is not sent: %s", what.constData(), problem->message);
}
