// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_BLOCKINGQUERY_P_H
#define CORVANEMDM_BLOCKINGQUERY_P_H

#include <QtCore/QDebug>
#include <QtDBus/QDBusAbstractInterface>
#include <QtDBus/QDBusReply>

#include <optional>

namespace Corvane
{
namespace Mdm
{

/**
 * Calls @p method and waits for its answer.
 *
 * An error, a wrong reply type included, is logged as the sentence @p failure followed by the error, and
 * gives nothing.
 */
template <typename T>
std::optional<T> tryQuery(QDBusAbstractInterface *interface, const QString &method, const char *failure,
                          const QVariantList &arguments = QVariantList())
{
    const QDBusReply<T> reply = interface->callWithArgumentList(QDBus::AutoDetect, method, arguments);
    const QDBusError error = reply.error();
    if (error.isValid()) {
        qWarning() << failure << error;
        return std::nullopt;
    }
    return reply.value();
}

/** The same; gives @p empty when there is no answer. */
template <typename T>
T blockingQuery(QDBusAbstractInterface *interface, const QString &method, const char *failure,
                const QVariantList &arguments = QVariantList(), const T &empty = T())
{
    return tryQuery<T>(interface, method, failure, arguments).value_or(empty);
}

/** The same for a method whose answer says nothing but that it is done; what it says is not read. */
inline void blockingCommand(QDBusAbstractInterface *interface, const QString &method, const char *failure)
{
    const QDBusError error(interface->call(method));
    if (error.isValid())
        qWarning() << failure << error;
}

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_BLOCKINGQUERY_P_H
