// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_CONNECTIVITYSETTINGS_P_H
#define CORVANEMDM_CONNECTIVITYSETTINGS_P_H

#include <corvanemdm/connectivitysettings.h>

#include <connman/networkmanager.h>
#include <connman/networktechnology.h>

#include <QtCore/QPointer>
#include <QtDBus/QDBusInterface>
#include <QtDBus/QDBusVariant>

#include <memory>

namespace Corvane
{
namespace Mdm
{

class ConnectivitySettingsPrivate : public QObject
{
    Q_OBJECT

public:
    struct DeferredDeletion {
        void operator()(QObject *object) const { object->deleteLater(); }
    };
    using InterfacePointer = std::unique_ptr<QDBusInterface, DeferredDeletion>;

    /** The direction in which mobile data is switched. */
    struct MobileDataSwitch {
        bool on;
        QLatin1String method;
        QStringList harmlessErrors; ///< messages of errors that mean that there is nothing left to do
        const char *failure;
        const char *alreadyDone;
    };

    ConnectivitySettingsPrivate(ConnectivitySettings *settings, ConnectivitySettings::Mode mode);

    bool isReady() const;

    /** The object of an access point, once the SIM has become the one for mobile data; or null. */
    InterfacePointer openContext(const QString &contextPath, const QString &imsi);
    /** The connection manager's object for mobile data through a SIM; or null. */
    InterfacePointer mobileDataService(const QString &imsi, QString *contextPath = nullptr);
    bool switchMobileData(const QString &imsi, const MobileDataSwitch &wanted);

    ConnectivitySettings *const q;
    QPointer<NetworkManager>
        networkManager; ///< not ours, and of the thread: it may be gone at the end of the program
    QPointer<NetworkTechnology> wlanTechnology;
    QDBusInterface *wlanTechInterface = nullptr;
    QDBusInterface *connmanManagerInterface = nullptr;

private Q_SLOTS:
    void initialiseWlanTechnology();
    void wlanTechPropertyChanged(const QString &name, const QDBusVariant &value);
    void connmanManagerPropertyChanged(const QString &name, const QDBusVariant &value);

private:
    void createNetworkManager();
    void createInterfaces();

    bool m_hasWlanTechnology = false; ///< as it was announced
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_CONNECTIVITYSETTINGS_P_H
