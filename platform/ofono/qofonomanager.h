// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_OFONO_QOFONOMANAGER_H
#define CORVANEMDM_PLATFORM_OFONO_QOFONOMANAGER_H

#include <corvanemdm_platform_global.h>

#include <QtCore/QObject>
#include <QtCore/QSharedPointer>
#include <QtCore/QStringList>

/** The modems of the telephony service: "org.ofono.Manager" at "/". Nothing blocks. */
class CORVANEMDM_PLATFORM_EXPORT QOfonoManager : public QObject
{
    Q_OBJECT

public:
    /** The one object of the calling thread. */
    static QSharedPointer<QOfonoManager> instance();
    ~QOfonoManager() override;

    /** Whether the service is there and has told its modems. */
    bool available() const;
    /** Object paths, in the service's order; empty while the service is away. */
    QStringList modems() const;

Q_SIGNALS:
    void availableChanged(bool available);
    /** The service announced a new modem; those that it has when it becomes available are not announced. */
    void modemAdded(const QString &path);
    void modemRemoved(const QString &path);

private:
    Q_DISABLE_COPY(QOfonoManager)
    QOfonoManager();

    class Private;
    Private *const d;
};

#endif // CORVANEMDM_PLATFORM_OFONO_QOFONOMANAGER_H
