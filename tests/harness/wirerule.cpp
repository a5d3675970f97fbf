// SPDX-License-Identifier: LGPL-2.1-or-later
#include "wirerule.h"

QDBusArgument &operator<<(QDBusArgument &out, const WireRule &rule)
{
    out.beginStructure();
    out << rule.imsi << rule.action;
    out.endStructure();
    return out;
}

const QDBusArgument &operator>>(const QDBusArgument &in, WireRule &rule)
{
    in.beginStructure();
    in >> rule.imsi >> rule.action;
    in.endStructure();
    return in;
}
