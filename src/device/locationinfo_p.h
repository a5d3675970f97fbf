// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_LOCATIONINFO_P_H
#define CORVANEMDM_LOCATIONINFO_P_H

#include <corvanemdm/locationinfo.h>

#include <QtDBus/QDBusInterface>

namespace Corvane
{
namespace Mdm
{

class LocationInfoPrivate : public QObject
{
    Q_OBJECT

public:
    explicit LocationInfoPrivate(LocationInfo *info);

    /** Receives the proxy's reports from now on. */
    void connectSignals();

    void startUpdates();
    void stopUpdates();
    void requestUpdate();

    LocationInfo::Position position();
    int satellitesInUse();
    int satellitesInView();

private Q_SLOTS:
    void handlePositionChanged(const QString &text);
    void handleSatellitesChanged(int inUse, int inView);

private:
    int satellites(int *cached, const QString &method, const char *failure);
    void stopAfterBothReports();

    LocationInfo *const q;
    QDBusInterface m_interface;
    LocationInfo::Position m_position;
    int m_satellitesInUse = -1;
    int m_satellitesInView = -1;
    bool m_positionStale = false;
    bool m_satellitesStale = false;
    bool m_positionRequestedOnce = false;
    bool m_satellitesRequestedOnce = false;
    bool m_updatesRunning = false;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_LOCATIONINFO_P_H
