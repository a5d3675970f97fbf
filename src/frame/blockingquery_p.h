// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_BLOCKINGQUERY_P_H
#define CORVANEMDM_BLOCKINGQUERY_P_H

#include <QtCore/QDebug>
#include <QtDBus/QDBusAbstractInterface>
#include <QtDBus/QDBusReply>

namespace Corvane
{
namespace Mdm
{

/**
 * Calls @p method and waits for its answer.
 *
 * An error, a wrong reply type included, is logged as the sentence @p failure followed by the error, and
 * gives @p empty.
 */
template <typename T>
T blockingQuery(QDBusAbstractInterface *interface, const QString &method, const char *failure,
                const QVariantList &arguments = QVariantList(), const T &empty = T())
{
    const QDBusReply<T> reply = interface->callWithArgumentList(QDBus::AutoDetect, method, arguments);
    const QDBusError error = reply.error();
    if (error.isValid()) {
        qWarning() << failure << error;
        return empty;
    }
    return reply.value();
}

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_BLOCKINGQUERY_P_H
