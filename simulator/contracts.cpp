// SPDX-License-Identifier: LGPL-2.1-or-later
#include "contracts.h"

#include "glibpointers.h"

#include <QtCore/QFile>

#include <map>

namespace Corvane
{
namespace Simulator
{

GDBusInterfaceInfo *contractOf(const QString &interface)
{
    static std::map<QString, GNodeInfoPointer> contracts;

    GNodeInfoPointer &node = contracts[interface];
    if (!node) {
        QFile file(QStringLiteral(":/dbus/%1.xml").arg(interface));
        if (!file.open(QIODevice::ReadOnly))
            qFatal("no contract of %s is built in", qUtf8Printable(interface));
        ErrorSlot error;
        node.reset(g_dbus_node_info_new_for_xml(file.readAll().constData(), &error));
        if (!node)
            qFatal("the contract of %s: %s", qUtf8Printable(interface), error->message);
    }
    return g_dbus_node_info_lookup_interface(node.get(), interface.toUtf8().constData());
}

} // namespace Simulator
} // namespace Corvane
