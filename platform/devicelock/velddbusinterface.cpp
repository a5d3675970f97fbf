// SPDX-License-Identifier: LGPL-2.1-or-later
#include <devicelock/velddbusinterface.h>

#include <devicelock/velddbusconnection.h>
#include <devicelock/velddbusresponse.h>

#include <QtDBus/QDBusError>
#include <QtDBus/QDBusPendingCall>

namespace VeldDBus
{

class Interface::Private
{
public:
    QDBusMessage message(const QString &method, const QVariantList &arguments) const
    {
        QDBusMessage call = QDBusMessage::createMethodCall(service, path, interface, method);
        call.setArguments(arguments);
        return call;
    }

    const Connection &connection;
    const QString service;
    const QString path;
    const QString interface;
};

Interface::Interface(QObject *parent, const Connection &connection, const QString &service,
                     const QString &path, const QString &interface)
    : QObject(parent)
    , d(new Private{connection, service, path, interface})
{
}

Interface::~Interface()
{
    delete d;
}

Response *Interface::call(const QString &method, const QVariantList &arguments)
{
    // QtDBus makes no answer to a call over a connection that never was.
    const QDBusPendingCall answer = d->connection.isConnected()
        ? d->connection.connection().asyncCall(d->message(method, arguments))
        : QDBusPendingCall::fromError(
            QDBusError(QDBusError::Disconnected, QStringLiteral("There is no connection")));
    return new Response(answer, d->connection, this);
}

QDBusMessage Interface::blockingCall(const QString &method, const QVariantList &arguments) const
{
    return d->connection.connection().call(d->message(method, arguments));
}

} // namespace VeldDBus
