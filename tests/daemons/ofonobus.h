// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_OFONOBUS_H
#define CORVANE_TEST_OFONOBUS_H

#include <QtCore/QObject>
#include <QtCore/QStringList>
#include <QtCore/QVariantList>
#include <QtCore/QVariantMap>
#include <QtDBus/QDBusMessage>

class Phone;

namespace OfonoBus
{

constexpr char service[] = "org.ofono";
constexpr char managerInterface[] = "org.ofono.Manager";
constexpr char modemInterface[] = "org.ofono.Modem";
constexpr char simInterface[] = "org.ofono.SimManager";
constexpr char registrationInterface[] = "org.ofono.NetworkRegistration";
constexpr char modemManagerInterface[] = "org.veldmobile.ofono.ModemManager";
constexpr char simInfoInterface[] = "org.veldmobile.ofono.SimInfo";

/** Calls a method of oFono, and waits for the answer. */
QDBusMessage call(const char *path, const char *interface, const char *member,
                  const QVariantList &arguments = QVariantList());

/** The answer as text, "error NAME" when it is one; see toText(). */
QString answer(const char *path, const char *interface, const char *member,
               const QVariantList &arguments = QVariantList());

/** What "GetProperties" tells; empty when there is no such interface. */
QVariantMap properties(const char *path, const char *interface);

/** Arguments as "one two", lists in brackets. */
QString toText(const QVariantList &arguments);

QVariant objectPaths(const QStringList &paths);

/**
 * Makes the modems what they were when the phone came up, whatever a test that failed has left: the service
 * runs, the cards are in their slots and ask for nothing, all modems are enabled and online, no SIM is
 * chosen. Some of it takes effect only later.
 */
void restoreModems(Phone &phone);

} // namespace OfonoBus

/** Records the signals of some interfaces of oFono, on all objects, as "/path Member arguments". */
class OfonoSignals : public QObject
{
    Q_OBJECT

public:
    explicit OfonoSignals(const QStringList &interfaces);

    QStringList take();
    /** Waits until @p signal has come. */
    bool waitFor(const QString &signal);

private Q_SLOTS:
    void record(const QDBusMessage &signal);

private:
    QStringList m_seen;
};

#endif // CORVANE_TEST_OFONOBUS_H
