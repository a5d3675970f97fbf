// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_AUTOSTART_H
#define CORVANEMDM_AUTOSTART_H

#include <corvanemdm/corvanemdm_global.h>

#include <QtCore/QObject>
#include <QtCore/QString>
#include <QtCore/QStringList>

namespace Corvane
{
namespace Mdm
{

class AutostartPrivate;

/**
 * @brief Makes applications start with the user session.
 *
 * Every call blocks until the MDM proxy has answered, or for QtDBus's default timeout (25 s); construction
 * looks the proxy up, which blocks as well. An object that was made while the proxy was away works once it is
 * there.
 *
 * Source: MDM proxy "org.corvaneos.mdmproxy", object "/Corvane/Mdm/Proxy/Autostart".
 */
class CORVANEMDM_EXPORT Autostart : public QObject
{
    Q_OBJECT

public:
    /** What became of a call. The proxy may answer with other numbers, which are passed on as they are. */
    enum Result : int {
        Success = 0,
        InternalError = 1, ///< the proxy failed, or could not be asked
        InvalidDesktopFile = 2, ///< the proxy does not accept the desktop entry
        AlreadyAutostarted = 3, ///< the application starts with the session already
    };
    Q_ENUM(Result)

    /** Looks the proxy up, which blocks; a proxy that is away is not reported. */
    explicit Autostart(QObject *parent = nullptr);
    ~Autostart() override;

    /**
     * Makes the application start with the session from now on.
     * @param desktopFile names its desktop entry; the proxy judges it.
     * @return the proxy's answer, or InternalError (with a warning) when it could not be asked.
     */
    Result add(const QString &desktopFile);

    /**
     * Makes the application start with the session no more.
     * @param desktopFile names its desktop entry; the proxy judges it.
     * @return the proxy's answer, or InternalError (with a warning) when it could not be asked.
     */
    Result remove(const QString &desktopFile);

    /**
     * The desktop entries that start with the session, as the proxy names them and in its order.
     * @param result is set to Success, or to InternalError (with a warning) when the proxy could not be
     * asked.
     * @return empty also when the proxy could not be asked.
     */
    QStringList query(Result &result) const;

private:
    Q_DISABLE_COPY(Autostart)
    AutostartPrivate *const d;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_AUTOSTART_H
