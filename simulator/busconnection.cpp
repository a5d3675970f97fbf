// SPDX-License-Identifier: LGPL-2.1-or-later
#include "busconnection.h"

#include "contracts.h"

#include <algorithm>

namespace Corvane
{
namespace Simulator
{

namespace
{
constexpr char busName[] = "org.freedesktop.DBus";
constexpr char busPath[] = "/org/freedesktop/DBus";
constexpr char busInterface[] = "org.freedesktop.DBus";

// Numbers of the bus protocol, which GDBus has no names for.
constexpr guint32 nameFlagDoNotQueue = 4;
constexpr guint32 requestNamePrimaryOwner = 1;
} // namespace

QString MethodCall::sender() const
{
    return QString::fromUtf8(g_dbus_method_invocation_get_sender(m_invocation));
}

GVariant *MethodCall::arguments() const
{
    return g_dbus_method_invocation_get_parameters(m_invocation);
}

QString MethodCall::text(gsize index) const
{
    const Variant value(g_variant_get_child_value(arguments(), index));
    return QString::fromUtf8(g_variant_get_string(value.get(), nullptr));
}

guint32 MethodCall::number(gsize index) const
{
    return g_variant_get_uint32(Variant(g_variant_get_child_value(arguments(), index)).get());
}

guint64 MethodCall::bits(gsize index) const
{
    return g_variant_get_uint64(Variant(g_variant_get_child_value(arguments(), index)).get());
}

bool MethodCall::flag(gsize index) const
{
    return g_variant_get_boolean(Variant(g_variant_get_child_value(arguments(), index)).get());
}

QStringList MethodCall::texts(gsize index) const
{
    const Variant list(g_variant_get_child_value(arguments(), index));
    QStringList values;
    for (gsize i = 0; i < g_variant_n_children(list.get()); ++i) {
        const Variant value(g_variant_get_child_value(list.get(), i));
        values << QString::fromUtf8(g_variant_get_string(value.get(), nullptr));
    }
    return values;
}

void MethodCall::reply(GVariant *values)
{
    g_dbus_method_invocation_return_value(m_invocation, values);
}

void MethodCall::fail(const MethodError &error)
{
    g_dbus_method_invocation_return_dbus_error(m_invocation, error.name().toUtf8().constData(), error.what());
}

BusConnection::BusConnection()
    : m_lifetime(g_cancellable_new())
{
    ErrorSlot error;
    m_connection.reset(g_dbus_connection_new_for_address_sync(
        busAddress,
        GDBusConnectionFlags(G_DBUS_CONNECTION_FLAGS_AUTHENTICATION_CLIENT
                             | G_DBUS_CONNECTION_FLAGS_MESSAGE_BUS_CONNECTION),
        nullptr, nullptr, &error));
    if (!m_connection)
        throw BusError(error->message);
}

BusConnection::~BusConnection()
{
    g_cancellable_cancel(m_lifetime.get());
    if (m_signalSubscription)
        g_dbus_connection_signal_unsubscribe(m_connection.get(), m_signalSubscription);
    if (m_nameSubscription)
        g_dbus_connection_signal_unsubscribe(m_connection.get(), m_nameSubscription);
    for (const std::unique_ptr<Object> &object : m_objects)
        g_dbus_connection_unregister_object(m_connection.get(), object->registration);
    g_dbus_connection_close_sync(m_connection.get(), nullptr, nullptr);
}

Variant BusConnection::callBus(const char *method, GVariant *arguments) const
{
    ErrorSlot error;
    Variant reply(g_dbus_connection_call_sync(m_connection.get(), busName, busPath, busInterface, method,
                                              arguments, nullptr, G_DBUS_CALL_FLAGS_NONE, -1, nullptr,
                                              &error));
    if (!reply)
        throw BusError(error->message);
    return reply;
}

void BusConnection::ownName(const QString &name)
{
    guint32 result = 0;
    const Variant reply
        = callBus("RequestName", g_variant_new("(su)", name.toUtf8().constData(), nameFlagDoNotQueue));
    g_variant_get(reply.get(), "(u)", &result);
    if (result != requestNamePrimaryOwner)
        throw BusError("the name " + name.toStdString() + " is taken on the phone's bus");
}

void BusConnection::releaseName(const QString &name)
{
    callBus("ReleaseName", g_variant_new("(s)", name.toUtf8().constData()));
}

bool BusConnection::nameHasOwner(const QString &name) const
{
    gboolean hasOwner = FALSE;
    g_variant_get(callBus("NameHasOwner", g_variant_new("(s)", name.toUtf8().constData())).get(), "(b)",
                  &hasOwner);
    return hasOwner;
}

void BusConnection::watchNames(std::function<void(const QString &, const QString &)> handler)
{
    m_nameHandler = std::move(handler);
    m_nameSubscription = g_dbus_connection_signal_subscribe(
        m_connection.get(), busName, busInterface, "NameOwnerChanged", busPath, nullptr,
        G_DBUS_SIGNAL_FLAGS_NONE,
        [](GDBusConnection *, const gchar *, const gchar *, const gchar *, const gchar *, GVariant *arguments,
           gpointer data) {
            const gchar *name = nullptr;
            const gchar *newOwner = nullptr;
            g_variant_get(arguments, "(&s&s&s)", &name, nullptr, &newOwner);
            static_cast<BusConnection *>(data)->m_nameHandler(QString::fromUtf8(name),
                                                              QString::fromUtf8(newOwner));
        },
        this, nullptr);
}

void BusConnection::call(const Method &method, GVariant *arguments,
                         std::function<void(const Variant &, const GError *)> handler) const
{
    using Handler = std::function<void(const Variant &, const GError *)>;
    g_dbus_connection_call(
        m_connection.get(), method.service.toUtf8().constData(), method.path.toUtf8().constData(),
        method.interface.toUtf8().constData(), method.name.toUtf8().constData(), arguments, nullptr,
        G_DBUS_CALL_FLAGS_NONE, -1, m_lifetime.get(),
        [](GObject *connection, GAsyncResult *result, gpointer data) {
            const std::unique_ptr<Handler> called(static_cast<Handler *>(data));
            ErrorSlot error;
            const Variant reply(g_dbus_connection_call_finish(G_DBUS_CONNECTION(connection), result, &error));
            if (!g_error_matches(error.get(), G_IO_ERROR, G_IO_ERROR_CANCELLED))
                (*called)(reply, error.get());
        },
        new Handler(std::move(handler)));
}

void BusConnection::send(const Method &method, GVariant *arguments) const
{
    g_dbus_connection_call(m_connection.get(), method.service.toUtf8().constData(),
                           method.path.toUtf8().constData(), method.interface.toUtf8().constData(),
                           method.name.toUtf8().constData(), arguments, nullptr, G_DBUS_CALL_FLAGS_NONE, -1,
                           nullptr, nullptr, nullptr);
}

void BusConnection::watchSignal(const QString &service, const QString &member,
                                std::function<void(const QString &)> handler)
{
    m_signalHandler = std::move(handler);
    m_signalSubscription = g_dbus_connection_signal_subscribe(
        m_connection.get(), service.toUtf8().constData(), nullptr, member.toUtf8().constData(), nullptr,
        nullptr, G_DBUS_SIGNAL_FLAGS_NONE,
        [](GDBusConnection *, const gchar *, const gchar *path, const gchar *, const gchar *, GVariant *,
           gpointer data) { static_cast<BusConnection *>(data)->m_signalHandler(QString::fromUtf8(path)); },
        this, nullptr);
}

void BusConnection::addObject(const QString &path, const QString &interface, MethodHandlers handlers,
                              PropertyReaders properties)
{
    static const GDBusInterfaceVTable vtable = {
        [](GDBusConnection *, const gchar *, const gchar *, const gchar *, const gchar *member, GVariant *,
           GDBusMethodInvocation *invocation, gpointer data) {
            const auto *object = static_cast<const Object *>(data);
            MethodCall call(invocation);
            try {
                object->handlers.at(QString::fromUtf8(member))(call);
            } catch (const MethodError &error) {
                call.fail(error);
            }
        },
        [](GDBusConnection *, const gchar *, const gchar *, const gchar *, const gchar *name, GError **,
           gpointer data) {
            return static_cast<const Object *>(data)->properties.at(QString::fromUtf8(name))();
        },
        nullptr,
        {},
    };

    GDBusInterfaceInfo *contract = contractOf(interface);
    for (GDBusMethodInfo **method = contract->methods; method && *method; ++method) {
        if (!handlers.count(QString::fromUtf8((*method)->name)))
            qFatal("%s at %s does not handle %s", qUtf8Printable(interface), qUtf8Printable(path),
                   (*method)->name);
    }

    for (GDBusPropertyInfo **property = contract->properties; property && *property; ++property) {
        if (!properties.count(QString::fromUtf8((*property)->name)))
            qFatal("%s at %s has no %s", qUtf8Printable(interface), qUtf8Printable(path), (*property)->name);
    }

    auto object = std::make_unique<Object>();
    object->path = path;
    object->interface = interface;
    object->handlers = std::move(handlers);
    object->properties = std::move(properties);
    ErrorSlot error;
    object->registration = g_dbus_connection_register_object(
        m_connection.get(), path.toUtf8().constData(), contract, &vtable, object.get(), nullptr, &error);
    if (error)
        throw BusError(error->message);
    m_objects.push_back(std::move(object));
}

void BusConnection::removeObject(const QString &path, const QString &interface)
{
    const auto found = std::find_if(m_objects.begin(), m_objects.end(), [&](const auto &object) {
        return object->path == path && object->interface == interface;
    });
    if (found == m_objects.end())
        return;
    g_dbus_connection_unregister_object(m_connection.get(), (*found)->registration);
    m_objects.erase(found);
}

void BusConnection::emitSignal(const QString &path, const QString &interface, const QString &member,
                               GVariant *arguments, const QString &destination) const
{
    g_dbus_connection_emit_signal(m_connection.get(),
                                  destination.isEmpty() ? nullptr : destination.toUtf8().constData(),
                                  path.toUtf8().constData(), interface.toUtf8().constData(),
                                  member.toUtf8().constData(), arguments, nullptr);
}

} // namespace Simulator
} // namespace Corvane
