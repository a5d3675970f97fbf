// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_CONNECTIVITYSETTINGS_H
#define CORVANEMDM_CONNECTIVITYSETTINGS_H

#include <corvanemdm/corvanemdm_global.h>

#include <QtCore/QFlags>
#include <QtCore/QMap>
#include <QtCore/QMetaType>
#include <QtCore/QObject>
#include <QtCore/QString>
#include <QtCore/QStringList>
#include <QtCore/QVector>

namespace Corvane
{
namespace Mdm
{

class ConnectivitySettingsPrivate;

/**
 * @brief Switches Wi-Fi and flight mode, and manages mobile data: radio technologies, connections and access
 * points.
 *
 * Wi-Fi and flight mode are asked of the connection manager directly, which blocks, or mirrored through its
 * client library, which does not; the mode of construction decides.
 *
 * Everything else blocks in either mode: each operation asks one question after the other, and each question
 * waits for its answer, for QtDBus's default timeout (25 s) at most; when a service does not even describe
 * its objects, the first question to one waits as long once more. What fails is told by a warning and an
 * empty or false result; nothing is retried or rolled back.
 *
 * SIMs are named by their IMSI, modems by the object path that the telephony service has for them.
 *
 * Source: connection manager "net.connman" and telephony service "org.ofono", with the extension
 * "org.veldmobile.ofono.ModemManager".
 */
class CORVANEMDM_EXPORT ConnectivitySettings : public QObject
{
    Q_OBJECT
    /** Whether Wi-Fi and flight mode can be asked for. */
    Q_PROPERTY(bool ready READ ready NOTIFY readyChanged)
    /** Whether all radios are off. */
    Q_PROPERTY(bool flightModeEnabled READ flightModeEnabled NOTIFY flightModeEnabledChanged)
    /** Whether Wi-Fi has power. */
    Q_PROPERTY(bool wlanEnabled READ wlanEnabled NOTIFY wlanEnabledChanged)

public:
    /** How Wi-Fi and flight mode are reached. With any other value an object never is ready. */
    enum Mode : int {
        NetworkManagerMode = 0, ///< mirrored; values arrive after construction
        DBusMode = 1 ///< asked each time, which blocks
    };

    /** A generation of mobile networks. */
    enum CellularTechnology : int {
        TechnologyNone = 0, ///< as a selection: no restriction
        Technology2G = 1, ///< "gsm"
        Technology3G = 2, ///< "umts"
        Technology4G = 4, ///< "lte"
        Technology5G = 8 ///< never among the supported ones
    };
    Q_ENUM(CellularTechnology)
    /** A set of generations. */
    Q_DECLARE_FLAGS(CellularTechnologies, CellularTechnology)
    Q_FLAG(CellularTechnologies)

    /** @brief One access point of a SIM: what the telephony service keeps as a connection context. */
    struct MobileNetworkAccessPointSettings {
        /** What the access point is for. A SIM is taken to have one of each. */
        enum Type : int {
            Internet = 0, ///< "internet", and any type that is none of the others
            Mms = 1, ///< "mms": multimedia messages
            Ims = 2 ///< "ims": the operator's own services
        };
        /** The IP protocol that it is used with. */
        enum Protocol : int {
            ProtocolIp = 0, ///< "ip": version 4
            ProtocolIpv6 = 1, ///< "ipv6"
            ProtocolDual = 2 ///< "dual": both
        };
        /** How user name and password are proven to the network. */
        enum AuthenticationMethod : int {
            AuthenticationNone = 0, ///< "none"
            AuthenticationPap = 1, ///< "pap"
            AuthenticationChap = 2, ///< "chap"
            AuthenticationAny = 3 ///< "any", and what else the service may say
        };

        Type type = Internet; ///< which one of the SIM's
        QString name; ///< for people
        QString accessPointName; ///< the APN
        QString username; ///< for authentication
        QString password; ///< for authentication
        Protocol protocol = ProtocolIp; ///< of the connection
        AuthenticationMethod authenticationMethod = AuthenticationNone; ///< of the connection
        QString messageCenter; ///< address of the multimedia message centre
        QString messageProxy; ///< proxy for multimedia messages

        /** Whether it has a name or an access point name. */
        bool isValid() const { return !name.isEmpty() || !accessPointName.isEmpty(); }
    };

    /** In DBusMode. */
    explicit ConnectivitySettings(QObject *parent = nullptr);
    /** DBusMode looks the connection manager up, which blocks; one that is away is not reported. */
    explicit ConnectivitySettings(Mode mode, QObject *parent = nullptr);
    ~ConnectivitySettings() override;

    /** In DBusMode always; in NetworkManagerMode while the connection manager has Wi-Fi. */
    bool ready() const;

    /**
     * DBusMode blocks; false, with a warning, also when it cannot be read. NetworkManagerMode: false until it
     * is known, and as it last was while the connection manager is away.
     */
    bool flightModeEnabled() const;

    /** False (and, in DBusMode, a warning) also when it is not known. DBusMode blocks. */
    bool wlanEnabled() const;

    /**
     * Switches Wi-Fi on or off; DBusMode blocks.
     *
     * In NetworkManagerMode nothing is sent when it is so already, and wlanEnabledChanged() tells when it is
     * done. In DBusMode wlanEnabledChanged() follows at once, after a refusal (and a warning) too, and again
     * when the connection manager announces the change.
     */
    void setWlanEnabled(bool enabled);

    /** Switches flight mode on or off, with flightModeEnabledChanged(), as setWlanEnabled() does Wi-Fi. */
    void setFlightModeEnabled(bool enabled);

    /**
     * Asks for the modems; blocks.
     * @return their object paths, by slot: those that the extension of the telephony service has, or, where
     * that is missing, those that the service itself lists. Empty (and a warning) when it could not be asked.
     */
    QStringList modemPaths() const;

    /**
     * Asks for the IMSI of the SIM in a modem; blocks.
     * @return empty (and a warning) when there is no SIM, or it has not told its IMSI.
     */
    QString modemSimImsi(const QString &modemPath) const;

    /** Asks for the IMSIs of the SIMs that have access points, by modem; blocks. */
    QStringList mobileNetworkImsis() const;

    /**
     * Asks for what selectCellularTechnologies() accepts; blocks.
     * @return sets that grow by one generation each: a modem never offers a newer one without the older ones.
     * A set of TechnologyNone alone stands for a modem that offers no choice; empty (and a warning) for an
     * unknown modem.
     */
    QVector<CellularTechnologies> supportedCellularTechnologies(const QString &modemPath) const;

    /**
     * Asks for the set that was selected; blocks.
     * @return TechnologyNone when nothing restricts the modem, and (with a warning) when it is unknown.
     */
    CellularTechnologies selectedCellularTechnologies(const QString &modemPath) const;

    /**
     * Restricts a modem to @p techs, one of its supported sets, or, with TechnologyNone, to nothing; blocks.
     * @return whether the modem took it; the reason otherwise is a warning.
     */
    Q_INVOKABLE bool selectCellularTechnologies(
        const QString &modemPath, Corvane::Mdm::ConnectivitySettings::CellularTechnologies techs);

    /** Asks whether mobile data is up through a SIM; blocks. False (and a warning) when it is not known. */
    bool isConnectedToMobileNetwork(const QString &imsi) const;

    /**
     * Brings mobile data up through a SIM, and lets it come up by itself from now on; blocks. A connection
     * manager that keeps this choice only for networks it has connected before refuses it the first time,
     * which is a warning.
     * @return whether it is up or, when the connection manager has only agreed to try, whether it will come
     * up by itself too. The reason otherwise is a warning.
     */
    bool connectToMobileNetwork(const QString &imsi);

    /**
     * Takes mobile data through a SIM down, and keeps it from coming up by itself; blocks.
     * @return whether it is down or, while it is still going down, whether it will stay so. The reason
     * otherwise is a warning.
     */
    bool disconnectFromMobileNetwork(const QString &imsi);

    /**
     * Reads the access points of a SIM; blocks. Makes the SIM the one for mobile data, which a telephony
     * service without the extension has no way to do: there (with a warning) no access point can be read or
     * written.
     * @return by type; of several of the same type the last one. Those that cannot be read are left out (with
     * a warning). Empty for an unknown SIM.
     */
    QMap<MobileNetworkAccessPointSettings::Type, MobileNetworkAccessPointSettings> accessPointSettings(
        const QString &imsi) const;

    /**
     * Writes @p settings to the SIM's access point of their type, the first if there are several; blocks.
     * Makes the SIM the one for mobile data. Mobile data that is up through the SIM is taken down before an
     * access point of type Internet is written, and brought up again afterwards.
     * @return whether every value was taken. One that is refused (with a warning) does not keep the others
     * from being written.
     */
    bool setAccessPointSettings(const QString &imsi, const MobileNetworkAccessPointSettings &settings);

Q_SIGNALS:
    /** Wi-Fi and flight mode have become known, or are not any more. */
    void readyChanged();
    /** Flight mode was switched, or tried to be. */
    void flightModeEnabledChanged();
    /** Wi-Fi was switched, or tried to be, or has come or gone. */
    void wlanEnabledChanged();

private:
    Q_DISABLE_COPY(ConnectivitySettings)
    ConnectivitySettingsPrivate *const d;
};

Q_DECLARE_OPERATORS_FOR_FLAGS(ConnectivitySettings::CellularTechnologies)

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_CONNECTIVITYSETTINGS_H
