// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_BUSCONNECTION_H
#define CORVANE_SIMULATOR_BUSCONNECTION_H

#include "busaddress.h"
#include "glibpointers.h"

#include <QtCore/QString>
#include <QtCore/QStringList>

#include <functional>
#include <map>
#include <stdexcept>
#include <vector>

namespace Corvane
{
namespace Simulator
{

/** The bus could not be reached or refused something that it never refuses. */
class BusError : public std::runtime_error
{
public:
    using std::runtime_error::runtime_error;
};

/** Thrown by a method's handler: the caller is answered with this error. */
class MethodError : public std::runtime_error
{
public:
    MethodError(const QString &name, const QString &message)
        : std::runtime_error(message.toStdString())
        , m_name(name)
    {
    }
    QString name() const { return m_name; }

private:
    QString m_name;
};

/** One method call that waits for its answer. */
class MethodCall
{
public:
    explicit MethodCall(GDBusMethodInvocation *invocation)
        : m_invocation(invocation)
    {
    }
    QString sender() const;
    /** The tuple of the arguments; its type is the contract's. */
    GVariant *arguments() const;
    /** The argument at @p index, a string or an object path. */
    QString text(gsize index) const;
    /** The argument at @p index, an unsigned number. */
    guint32 number(gsize index) const;
    /** The argument at @p index, an unsigned number of 64 bits. */
    guint64 bits(gsize index) const;
    /** The argument at @p index, a boolean. */
    bool flag(gsize index) const;
    /** The argument at @p index, a list of strings. */
    QStringList texts(gsize index) const;

    /** Answers with @p values, a tuple of the contract's type, or with nothing. */
    void reply(GVariant *values = nullptr);
    /** Answers with an error: for handlers that keep the call, and can throw no more. */
    void fail(const MethodError &error);

private:
    GDBusMethodInvocation *m_invocation;
};

using MethodHandler = std::function<void(MethodCall &)>;
using MethodHandlers = std::map<QString, MethodHandler>;
/** Gives the present value of each property. */
using PropertyReaders = std::map<QString, std::function<GVariant *()>>;

/** A private connection to the phone's bus with the objects that are offered over it. */
class BusConnection
{
public:
    BusConnection();
    ~BusConnection();
    BusConnection(const BusConnection &) = delete;
    BusConnection &operator=(const BusConnection &) = delete;

    GDBusConnection *get() const { return m_connection.get(); }

    void ownName(const QString &name);
    /** Returns when the name has left the bus. */
    void releaseName(const QString &name);
    bool nameHasOwner(const QString &name) const;
    /** @p handler learns of every name that gets or loses its owner; none is missed from here on. */
    void watchNames(std::function<void(const QString &name, const QString &newOwner)> handler);

    /** Where a method is, for call(). */
    struct Method {
        QString service;
        QString path;
        QString interface;
        QString name;
    };
    /**
     * Calls @p method, and @p handler with its answer: null, and the error, when there is none. It is not
     * called any more once this connection is destroyed.
     */
    void call(const Method &method, GVariant *arguments,
              std::function<void(const Variant &reply, const GError *error)> handler) const;
    /** Calls @p method without waiting for its answer. */
    void send(const Method &method, GVariant *arguments) const;
    /** @p handler learns of every signal of @p member that @p service emits. */
    void watchSignal(const QString &service, const QString &member,
                     std::function<void(const QString &path)> handler);

    /** Offers @p interface at @p path; each method and each property of its contract has a handler. */
    void addObject(const QString &path, const QString &interface, MethodHandlers handlers,
                   PropertyReaders properties = {});
    void removeObject(const QString &path, const QString &interface);

    /** @p arguments is a tuple, or null for none; without a destination the signal is a broadcast. */
    void emitSignal(const QString &path, const QString &interface, const QString &member, GVariant *arguments,
                    const QString &destination = QString()) const;

private:
    struct Object {
        QString path;
        QString interface;
        MethodHandlers handlers;
        PropertyReaders properties;
        guint registration = 0;
    };

    Variant callBus(const char *method, GVariant *arguments) const;

    GObjectPointer<GDBusConnection> m_connection;
    std::vector<std::unique_ptr<Object>> m_objects;
    std::function<void(const QString &, const QString &)> m_nameHandler;
    guint m_nameSubscription = 0;
    std::function<void(const QString &)> m_signalHandler;
    guint m_signalSubscription = 0;
    GObjectPointer<GCancellable> m_lifetime; ///< ends the calls that wait for an answer
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_BUSCONNECTION_H
