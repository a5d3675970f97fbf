// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_LOCATIONINFO_H
#define CORVANEMDM_LOCATIONINFO_H

#include <corvanemdm/corvanemdm_global.h>

#include <QtCore/QDateTime>
#include <QtCore/QMetaType>
#include <QtCore/QObject>

namespace Corvane
{
namespace Mdm
{

class LocationInfoPrivate;

/**
 * @brief Tells where the phone is, continuously or once, and how many satellites it sees.
 *
 * startUpdates() keeps the receiver running until stopUpdates(), and signals each report. requestUpdate()
 * signals one new position and one satellite report, and then lets the receiver rest again unless continuous
 * updates run. Reports that nobody of this object asked for, but another program, update the values silently.
 *
 * The getters answer with what was reported last. Between a start or a request and the first report that
 * follows, they ask the phone for what it knows so far, which blocks.
 *
 * Source: MDM proxy "org.corvaneos.mdmproxy", object "/Corvane/Mdm/Proxy/LocationInfo". Every call blocks
 * until it has answered, or for QtDBus's default timeout (25 s); one that fails is logged, with the error.
 */
class CORVANEMDM_EXPORT LocationInfo : public QObject
{
    Q_OBJECT
    /** @see position() */
    Q_PROPERTY(double latitude READ latitude NOTIFY positionChanged)
    /** @see position() */
    Q_PROPERTY(double longitude READ longitude NOTIFY positionChanged)
    /** @see position() */
    Q_PROPERTY(double altitude READ altitude NOTIFY positionChanged)
    /** @see position() */
    Q_PROPERTY(QDateTime timestamp READ timestamp NOTIFY positionChanged)
    /** @see position() */
    Q_PROPERTY(Corvane::Mdm::LocationInfo::Position position READ position NOTIFY positionChanged)
    /** @see satellitesInUse() */
    Q_PROPERTY(int satellitesInUse READ satellitesInUse NOTIFY satellitesChanged)
    /** @see satellitesInView() */
    Q_PROPERTY(int satellitesInView READ satellitesInView NOTIFY satellitesChanged)

public:
    /** @brief A place at a time. */
    struct Position {
        double latitude = 0.0; ///< degrees, north positive
        double longitude = 0.0; ///< degrees, east positive
        double altitude = 0.0; ///< metres above sea level
        QDateTime timestamp; ///< of the fix, in UTC to the millisecond; invalid when there is none
    };

    /** Looks the proxy up, which blocks; a proxy that is away is not reported. */
    explicit LocationInfo(QObject *parent = nullptr);
    ~LocationInfo() override;

    double latitude() const; ///< that of position()
    double longitude() const; ///< that of position()
    double altitude() const; ///< that of position()
    QDateTime timestamp() const; ///< that of position()
    /**
     * Where the phone was when it last knew. Asks for it, which blocks, when updates were started or
     * requested and no position has been reported since, and answers next from what it got.
     * @return a default Position when nothing is known, when the phone does not tell (warning "Failed to
     * retrieve position:"), or when it told something else than a position ("Invalid position information
     * received:").
     */
    Position position() const;

    /**
     * How many satellites the last position came from. Asks each time, which blocks, when updates were
     * started or requested and no satellites have been reported since.
     * @return -1 when nothing is known or the phone does not tell (warning "Failed to retrieve satellites in
     * use:").
     */
    int satellitesInUse() const;
    /** How many satellites the receiver sees; as satellitesInUse(), "Failed to retrieve satellites in view:".
     */
    int satellitesInView() const;

    /** Reports from now on; a failure is the warning "Failed to start location updates:". */
    Q_INVOKABLE void startUpdates();
    /**
     * Reports no more; a failure is the warning "Failed to stop location updates:". The proxy counts
     * programs, not objects: reports end for all objects of the program.
     */
    Q_INVOKABLE void stopUpdates();
    /** Reports one position and satellites once; a failure is the warning "Failed to request location
     * update:". */
    Q_INVOKABLE void requestUpdate();

Q_SIGNALS:
    /** A position was reported that was asked for; not necessarily another one than before. */
    void positionChanged();
    /** Satellites were reported as they were asked for. */
    void satellitesChanged();

private:
    Q_DISABLE_COPY(LocationInfo)
    LocationInfoPrivate *const d;
};

} // namespace Mdm
} // namespace Corvane

Q_DECLARE_METATYPE(Corvane::Mdm::LocationInfo::Position)

#endif // CORVANEMDM_LOCATIONINFO_H
