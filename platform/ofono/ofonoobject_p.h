// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_OFONO_OFONOOBJECT_P_H
#define CORVANEMDM_PLATFORM_OFONO_OFONOOBJECT_P_H

#include <QtCore/QObject>
#include <QtCore/QSharedPointer>
#include <QtCore/QString>
#include <QtCore/QThreadStorage>
#include <QtCore/QVector>
#include <QtCore/QWeakPointer>
#include <QtDBus/QDBusPendingCallWatcher>
#include <QtDBus/QDBusPendingReply>

#include <memory>

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

/** Knows who owns the telephony service's name. Nothing blocks; the first answer comes with ownerChanged().
 */
class OfonoService : public QObject
{
    Q_OBJECT

public:
    static QSharedPointer<OfonoService> instance();

    /** A unique name, so that nothing of an earlier run of the service is taken for this one's. */
    QString owner() const { return m_owner; }

Q_SIGNALS:
    /** The service came or went; between two owners it is away. */
    void ownerChanged();

private:
    OfonoService();
    void setOwner(const QString &owner);

    QString m_owner;
};

/** One interface of one object of the telephony service, through the comings and goings of the service. */
class OfonoObject : public QObject
{
    Q_OBJECT

public:
    OfonoObject(const QString &path, QLatin1String interface, QObject *parent);

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
        auto *watcher = new QDBusPendingCallWatcher(send(method), m_answers.get());
        connect(watcher, &QDBusPendingCallWatcher::finished, m_answers.get(),
                [handler](QDBusPendingCallWatcher *finished) {
                    finished->deleteLater();
                    handler(Reply(*finished));
                });
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

    QDBusPendingCall send(QLatin1String method) const;
    void connectSignals();
    void disconnectSignals();
    void ownerChanged();

    const QSharedPointer<OfonoService> m_service;
    const QString m_path;
    const QLatin1String m_interface;
    QVector<Connection> m_connections;
    QString m_owner; // with which the connections are
    std::unique_ptr<QObject> m_answers; // parent of what waits for an answer
};

#endif // CORVANEMDM_PLATFORM_OFONO_OFONOOBJECT_P_H
