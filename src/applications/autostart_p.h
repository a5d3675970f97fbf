// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_AUTOSTART_P_H
#define CORVANEMDM_AUTOSTART_P_H

#include <corvanemdm/autostart.h>

#include <QtDBus/QDBusInterface>

namespace Corvane
{
namespace Mdm
{

class AutostartPrivate : public QObject
{
    Q_OBJECT

public:
    explicit AutostartPrivate(Autostart *autostart);

    /** Calls @p method about @p desktopFile; @p failure is logged when it could not be asked. */
    Autostart::Result request(const QString &method, const QString &desktopFile, const char *failure);
    QStringList query(Autostart::Result &result);

private:
    QDBusInterface m_interface;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_AUTOSTART_P_H
