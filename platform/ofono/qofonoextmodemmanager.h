// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_OFONO_QOFONOEXTMODEMMANAGER_H
#define CORVANEMDM_PLATFORM_OFONO_QOFONOEXTMODEMMANAGER_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QList>
#include <QtCore/QObject>
#include <QtCore/QSharedPointer>
#include <QtCore/QString>
#include <QtCore/QStringList>

/**
 * The SIM slots of the phone as a whole: "org.veldmobile.ofono.ModemManager" at "/" of the telephony service.
 * Nothing blocks. A service without that extension is never ready here.
 */
class CORVANEMDM_PLATFORM_EXPORT QOfonoExtModemManager : public QObject
{
    Q_OBJECT

public:
    /** The one object of the calling thread. */
    static QSharedPointer<QOfonoExtModemManager> instance();
    ~QOfonoExtModemManager() override;

    /** Whether all that is told below is known, and the service says that it is ready. */
    bool ready() const;
    /** Object paths of the modems, one a slot. */
    QStringList availableModems() const;
    /** Those of them that are in use. */
    QStringList enabledModems() const;
    /** Whether there is a SIM, by the index of the available modems. */
    QList<bool> presentSims() const;
    /** IMSI of the SIM that calls are made with; empty when there is none. */
    QString defaultVoiceSim() const;
    /** IMSI of the SIM that mobile data goes over; empty when there is none. */
    QString defaultDataSim() const;

Q_SIGNALS:
    void readyChanged(bool ready);
    void enabledModemsChanged(const QStringList &modems);
    void defaultVoiceSimChanged(const QString &imsi);
    void defaultDataSimChanged(const QString &imsi);

private:
    Q_DISABLE_COPY(QOfonoExtModemManager)
    QOfonoExtModemManager();

    class Private;
    Private *const d;
};

#endif // CORVANEMDM_PLATFORM_OFONO_QOFONOEXTMODEMMANAGER_H
