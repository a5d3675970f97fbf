// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_FRAME_SERVICEOBJECT_P_H
#define CORVANEMDM_PLATFORM_FRAME_SERVICEOBJECT_P_H

#include "callanswer_p.h"
#include "signalconnection_p.h"

#include <QtCore/QObject>
#include <QtCore/QSharedPointer>
#include <QtCore/QString>
#include <QtCore/QThreadStorage>
#include <QtCore/QVariantMap>
#include <QtCore/QVector>
#include <QtCore/QWeakPointer>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusPendingReply>

#include <memory>
#include <optional>

/** The object of its class that the users in a thread share; it lives as long as one of them holds it. */
template <typename Shared, typename Make> QSharedPointer<Shared> sharedInThread(Make make)
{
    static QThreadStorage<QWeakPointer<Shared>> instances;
    QSharedPointer<Shared> instance = instances.localData().toStrongRef();
    if (!instance) {
        instance.reset(make());
        instances.setLocalData(instance.toWeakRef());
    }
    return instance;
}

/** An object that a service lists, with its properties. */
struct ListedObject {
    QString path;
    QVariantMap properties;
};

/** The list at @p index of what @p message carries; empty unless that is of type a(oa{sv}). */
std::optional<QVector<ListedObject>> listedObjects(const QDBusMessage &message, int index = 0);

/** Knows who owns a service's name. Nothing blocks, unless asked to; the first answer comes with
 * ownerChanged(). */
class ServiceOwner : public QObject
{
    Q_OBJECT

public:
    /** The one for @p service in the calling thread. */
    static QSharedPointer<ServiceOwner> of(const QString &service);

    /** A unique name, so that nothing of an earlier run of the service is taken for this one's. */
    QString owner() const { return m_owner; }
    /** Asks the bus, and waits for its answer. */
    void waitUntilKnown();

Q_SIGNALS:
    /** The service came or went; between two owners it is away. */
    void ownerChanged();

private:
    explicit ServiceOwner(const QString &service);
    QDBusMessage question() const;
    void setOwner(const QString &owner);

    const QString m_service;
    QString m_owner;
    QString m_nextOwner; // of a change that the watcher has not told to its end
};

/** One interface of one object of a service, or of all its objects, through the comings and goings of the
 * service. */
class ServiceObject : public QObject
{
    Q_OBJECT

public:
    /** An empty @p path stands for all objects: they can be followed, but not called. */
    ServiceObject(const QString &service, const QString &path, QLatin1String interface, QObject *parent);

    QString path() const { return m_path; }
    bool isServiceThere() const { return m_answers != nullptr; }

    /** Connects @p member to @p slot of @p receiver for every run of the service; before start(). */
    void follow(const char *member, QObject *receiver, const char *slot);
    /** Signals what is so already, and from now on what changes. */
    void start();

    /**
     * Calls @p method, and @p handler with the answer, a QDBusPendingReply; only while the service is there.
     * The answer is waited for as long as the service lives, and dropped with it or by forgetCalls().
     */
    template <typename Reply, typename Handler> void call(QLatin1String method, Handler handler)
    {
        callAt<Reply>(m_path, method, {}, handler);
    }
    /** The same for @p method of the object at @p path. */
    template <typename Reply, typename Handler>
    void callAt(const QString &path, QLatin1String method, const QVariantList &arguments, Handler handler)
    {
        send(path, method, arguments, [handler](const QDBusMessage &answer) { handler(Reply(answer)); });
    }
    void forgetCalls();

Q_SIGNALS:
    void serviceAppeared();
    void serviceLeft();

private:
    struct Connection {
        const char *member;
        QObject *receiver;
        const char *slot;
    };

    void send(const QString &path, QLatin1String method, const QVariantList &arguments,
              const CallAnswer::Handler &handler) const;
    DBusSignal signalOf(const Connection &connection) const;
    void connectSignals();
    void disconnectSignals();
    void ownerChanged();

    const QSharedPointer<ServiceOwner> m_service;
    const QString m_path;
    const QLatin1String m_interface;
    QVector<Connection> m_connections;
    QString m_owner; // with which the connections are
    std::unique_ptr<QObject> m_answers; // what is answered after its end is dropped
};

#endif // CORVANEMDM_PLATFORM_FRAME_SERVICEOBJECT_P_H
