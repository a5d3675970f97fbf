// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMSOFPHONE_H
#define CORVANE_SIMSOFPHONE_H

#include <QtCore/QMap>
#include <QtCore/QObject>
#include <QtCore/QString>
#include <QtCore/QStringList>
#include <QtDBus/QDBusObjectPath>
#include <QtDBus/QDBusVariant>

class QDBusMessage;
class QDBusPendingCallWatcher;

namespace Corvane
{
namespace Agent
{

/** The SIMs that are in the phone, as the telephony service knows them. Nothing blocks. */
class SimsOfPhone : public QObject
{
    Q_OBJECT

public:
    explicit SimsOfPhone(QObject *parent = nullptr);

    /** Whether all modems have been asked. */
    bool isReady() const;

    /** Why the modems could not be asked; empty when they could. */
    QString error() const;

    /** The subscriber identities, in the order of the modems' paths. */
    QStringList imsis() const;

Q_SIGNALS:
    void changed();

private Q_SLOTS:
    void modemAdded(const QDBusObjectPath &path);
    void modemRemoved(const QDBusObjectPath &path);
    void modemPropertyChanged(const QString &name, const QDBusVariant &value, const QDBusMessage &message);
    void simPropertyChanged(const QString &name, const QDBusVariant &value, const QDBusMessage &message);

private:
    void askForModems();
    void askForSim(const QString &modem);
    void setImsi(const QString &modem, const QString &imsi);

    QMap<QString, QString> m_imsiOfModem; // empty: no SIM, or one that does not tell yet
    QMap<QString, QDBusPendingCallWatcher *>
        m_asked; // the last question to each modem that has yet to answer
    bool m_modemsKnown = false;
    QString m_error;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_SIMSOFPHONE_H
