// SPDX-License-Identifier: LGPL-2.1-or-later
#include <devicelock/velddbusresponse.h>

#include <QtDBus/QDBusError>
#include <QtDBus/QDBusPendingCallWatcher>

namespace VeldDBus
{

Response::Response(const QDBusPendingCall &answer, QObject *parent)
    : QObject(parent)
{
    auto *watcher = new QDBusPendingCallWatcher(answer, this);
    connect(watcher, &QDBusPendingCallWatcher::finished, this, [this, watcher] {
        // A receiver may delete the parent, which must not take this along in the midst of a signal.
        setParent(nullptr);
        deleteLater();
        if (watcher->isError())
            Q_EMIT failure(watcher->error());
        else
            Q_EMIT success();
    });
}

} // namespace VeldDBus
