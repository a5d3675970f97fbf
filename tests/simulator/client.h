// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_CLIENT_H
#define CORVANE_TEST_CLIENT_H

#include "wirerule.h"

#include <QtCore/QObject>
#include <QtCore/QSet>
#include <QtCore/QStringList>
#include <QtCore/QVariantList>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusError>
#include <QtDBus/QDBusMessage>

/**
 * A client of the phone's bus with a connection of its own, which knows nothing but messages.
 *
 * It notes each signal that reaches it from the watched objects, in the order of arrival, as
 * "member(arguments)".
 */
class Client : public QObject
{
    Q_OBJECT

public:
    /** Connections that come and go race in QtDBus itself: one of its own is for clients that are told apart
     * by it. */
    enum Connection { Shared, Own };

    explicit Client(Connection connection = Shared);
    /** A client at the socket of a service, rather than of the bus: @p peerAddress is the socket's, and
     * services have no names there. */
    explicit Client(const QString &peerAddress);
    ~Client() override;

    QString uniqueName() const;
    bool isConnected() const { return m_connection.isConnected(); }
    /** Calls and waits; an interface that is empty is left out of the message. */
    QDBusMessage call(const QString &service, const QString &path, const QString &interface,
                      const QString &member, const QVariantList &arguments = {}) const;
    QDBusMessage control(const QString &member, const QVariantList &arguments = {}) const;
    /** Sends a call whose answer is dropped. */
    void send(const QString &service, const QString &path, const QString &interface, const QString &member,
              const QVariantList &arguments = {}) const;

    /** Sends a call whose answer is noted among the signals, as "answer" or the name of the error. */
    void callAndNote(const QString &service, const QString &path, const QString &interface,
                     const QString &member, const QVariantList &arguments = {});

    void watch(const QString &service, const QString &path, const QString &interface,
               const QStringList &members);
    bool waitForSignals(int count) const;
    /** The signals since construction or the last call; what @p service has sent before is among them. */
    QStringList takeSignals(const QString &service);

private Q_SLOTS:
    void note(const QDBusMessage &signal);
    void noteAnswer();
    void noteError(const QDBusError &error);

private:
    static QDBusMessage callOver(const QDBusConnection &connection, const QDBusMessage &message);

    const QString m_connectionName; ///< empty: shared
    const bool m_isPeer;
    QDBusConnection m_connection;
    QSet<QString> m_watched; ///< services
    QStringList m_signals;
};

/** @p values as an argument of type av. */
QVariant boxed(const QVariantList &values);
/** The methods and signals of @p interface in @p xml, each with the directions, types and names of its
 * arguments. */
QStringList membersOf(const QByteArray &xml, const QString &interface);
/** "name: message" of an error, "reply(arguments)" of anything else. */
QString textOf(const QDBusMessage &message);

#endif // CORVANE_TEST_CLIENT_H
