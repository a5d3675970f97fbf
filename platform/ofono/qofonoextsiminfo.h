// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_OFONO_QOFONOEXTSIMINFO_H
#define CORVANEMDM_PLATFORM_OFONO_QOFONOEXTSIMINFO_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QObject>
#include <QtCore/QString>

/** What identifies the SIM of one modem: "org.veldmobile.ofono.SimInfo" at the modem's path. Nothing blocks.
 */
class CORVANEMDM_PLATFORM_EXPORT QOfonoExtSimInfo : public QObject
{
    Q_OBJECT

public:
    explicit QOfonoExtSimInfo(QObject *parent = nullptr);
    ~QOfonoExtSimInfo() override;

    QString modemPath() const;
    /** Follows the modem at @p path from now on. */
    void setModemPath(const QString &path);

    /** Whether all values below are known; they may be empty, as without a card. */
    bool isValid() const;
    /** The ICCID. */
    QString cardIdentifier() const;
    /** The IMSI. */
    QString subscriberIdentity() const;
    QString serviceProviderName() const;

Q_SIGNALS:
    void validChanged(bool valid);
    void cardIdentifierChanged(const QString &cardIdentifier);
    void subscriberIdentityChanged(const QString &subscriberIdentity);
    void serviceProviderNameChanged(const QString &serviceProviderName);

private:
    Q_DISABLE_COPY(QOfonoExtSimInfo)

    class Private;
    Private *const d;
};

#endif // CORVANEMDM_PLATFORM_OFONO_QOFONOEXTSIMINFO_H
