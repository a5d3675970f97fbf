// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_SIMINFO_P_H
#define CORVANEMDM_SIMINFO_P_H

#include <corvanemdm/siminfo.h>

#include <ofono/qofonoextmodemmanager.h>
#include <ofono/qofonoextsiminfo.h>
#include <ofono/qofonomanager.h>
#include <ofono/qofonosimmanager.h>

#include <QtCore/QMap>
#include <QtCore/QPointer>
#include <QtCore/QSharedPointer>
#include <QtDBus/QDBusInterface>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusPendingCallWatcher>
#include <QtDBus/QDBusVariant>

namespace Corvane
{
namespace Mdm
{

/** Follows the modems and keeps the states. A receiver of its signals may delete it at any of them. */
class SimInfoPrivate : public QObject
{
    Q_OBJECT

public:
    explicit SimInfoPrivate(SimInfo *simInfo);
    ~SimInfoPrivate() override;

    static void registerTypes();

    SimInfo *const q;
    QSharedPointer<QOfonoManager> ofonoManager;
    QSharedPointer<QOfonoExtModemManager> modemManager;
    QMap<QString, SimInfo::SimState> simStates; ///< the last ones, by modem path as all maps here

private Q_SLOTS:
    void modemReadyChanged(bool ready);
    void modemAdded(const QString &path);
    void modemRemoved(const QString &path);
    void updateAllSims();
    /** Of the modem whose SIM object sends the signal. */
    void updateSimState();

    // QtDBus adds the message, which tells the modem.
    void modemPropertyChanged(const QString &name, const QDBusVariant &value, const QDBusMessage &message);
    void modemGetPropertiesFinished(QDBusPendingCallWatcher *watcher);
    void networkRegistrationPropertyChanged(const QString &name, const QDBusVariant &value,
                                            const QDBusMessage &message);
    void networkRegistrationGetPropertiesFinished(QDBusPendingCallWatcher *watcher);

private:
    void simManagerInstance(const QString &path);
    void initModemInterface(const QString &path);
    void initNetworkRegistration(const QString &path);
    void removeSimManager(const QString &path);
    void removeModemInterface(const QString &path);
    void removeNetworkRegistration(const QString &path);
    void modemInterfacesChanged(const QString &path, const QStringList &interfaces);

    QDBusInterface *createInterface(const QString &path, QLatin1String interface, const char *changedSlot,
                                    void (SimInfoPrivate::*finishedSlot)(QDBusPendingCallWatcher *));
    void deleteInterface(QDBusInterface *interface, const char *changedSlot);

    void updateSimStates(const QStringList &paths);
    void updateSimState(const QString &path);
    void buildSimState(SimInfo::SimState *state, const QString &path) const;
    bool hasMultiSimSupport() const;
    SimInfo::PinRequired pinRequired(const QString &path, const QOfonoSimManager *simManager) const;

    QMap<QString, QOfonoSimManager *> m_simManagers;
    QMap<QString, QOfonoExtSimInfo *> m_simInfos;
    QMap<QString, QDBusInterface *> m_modemInterfaces;
    QMap<QString, QPointer<QDBusInterface>> m_registrationInterfaces;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_SIMINFO_P_H
