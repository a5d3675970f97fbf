// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/autostart.h>

#include "autostart_p.h"
#include "frame/mdmproxy_p.h"

#include <QtCore/QDebug>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusReply>

namespace Corvane
{
namespace Mdm
{

namespace
{

/** Whether @p reply is an answer; the message of the error is logged after @p failure when it is none. */
template <typename T> bool isAnswer(const QDBusReply<T> &reply, const char *failure)
{
    if (!reply.isValid())
        qWarning() << failure << reply.error().message();
    return reply.isValid();
}

} // namespace

AutostartPrivate::AutostartPrivate(Autostart *autostart)
    : QObject(autostart)
    , m_interface(MdmProxy::Service, MdmProxy::Autostart.path, MdmProxy::Autostart.interface,
                  QDBusConnection::systemBus())
{
}

Autostart::Result AutostartPrivate::request(const QString &method, const QString &desktopFile,
                                            const char *failure)
{
    const QDBusReply<int> reply = m_interface.call(method, desktopFile);
    return isAnswer(reply, failure) ? Autostart::Result(reply.value()) : Autostart::InternalError;
}

QStringList AutostartPrivate::query(Autostart::Result &result)
{
    const QDBusReply<QStringList> reply = m_interface.call(QStringLiteral("query"));
    const bool answered = isAnswer(reply, "Got invalid reply to Autostart::query, error is:");
    result = answered ? Autostart::Success : Autostart::InternalError;
    return answered ? reply.value() : QStringList();
}

Autostart::Autostart(QObject *parent)
    : QObject(parent)
    , d(new AutostartPrivate(this))
{
}

Autostart::~Autostart()
{
    delete d;
}

Autostart::Result Autostart::add(const QString &desktopFile)
{
    return d->request(QStringLiteral("add"), desktopFile, "Got invalid reply to Autostart::add, error is:");
}

Autostart::Result Autostart::remove(const QString &desktopFile)
{
    return d->request(QStringLiteral("remove"), desktopFile,
                      "Got invalid reply to Autostart::remove, error is:");
}

QStringList Autostart::query(Result &result) const
{
    return d->query(result);
}

} // namespace Mdm
} // namespace Corvane
