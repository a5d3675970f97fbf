// SPDX-License-Identifier: LGPL-2.1-or-later
#include <devicelock/velddbusresponse.h>

#include <devicelock/velddbusconnection.h>

#include <QtDBus/QDBusError>
#include <QtDBus/QDBusPendingCallWatcher>

namespace VeldDBus
{

class Response::Private
{
public:
    const std::shared_ptr<void> link;
    QDBusPendingCallWatcher watcher; // goes before the link that the answer comes over
};

Response::Response(const QDBusPendingCall &answer, const Connection &connection, QObject *parent)
    : QObject(parent)
    , d(new Private{connection.hold(), QDBusPendingCallWatcher(answer)})
{
    connect(&d->watcher, &QDBusPendingCallWatcher::finished, this, [this] {
        // A receiver may delete the parent, which must not take this along in the midst of a signal.
        setParent(nullptr);
        deleteLater();
        if (d->watcher.isError())
            Q_EMIT failure(d->watcher.error());
        else
            Q_EMIT success();
    });
}

Response::~Response()
{
    delete d;
}

} // namespace VeldDBus
