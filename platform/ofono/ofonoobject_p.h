// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_OFONO_OFONOOBJECT_P_H
#define CORVANEMDM_PLATFORM_OFONO_OFONOOBJECT_P_H

#include "frame/serviceobject_p.h"

/** One interface of one object of the telephony service. */
class OfonoObject : public ServiceObject
{
public:
    OfonoObject(const QString &path, QLatin1String interface, QObject *parent)
        : ServiceObject(QStringLiteral("org.ofono"), path, interface, parent)
    {
    }
};

#endif // CORVANEMDM_PLATFORM_OFONO_OFONOOBJECT_P_H
