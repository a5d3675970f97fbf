// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_PHONE_H
#define CORVANE_TEST_PHONE_H

#include <QtCore/QJsonObject>
#include <QtCore/QStringList>
#include <QtCore/QVariantList>
#include <QtCore/QVariantMap>

/**
 * The simulated phone that the test runs in, steered through its control interface.
 *
 * A request that the phone refuses ends the test program: it is a mistake in the test.
 */
class Phone
{
public:
    Phone();
    ~Phone();

    void stopService(const QString &service);
    void startService(const QString &service);

    /** @p member fails with @p error from now on; an empty @p path stands for any. */
    void failCalls(const QString &service, const QString &path, const QString &member, const QString &error,
                   const QString &message);
    /**
     * Only the call with @p number, from 1, fails of those of @p member. Of faults for the same calls,
     * the one that was set last comes first, and the others once it is used up.
     */
    void failCall(int number, const QString &service, const QString &path, const QString &member,
                  const QString &error, const QString &message);
    /** So many calls of @p member are answered as they should be, whatever was set before. */
    void letCallsPass(int count, const QString &service, const QString &path, const QString &member);
    /** @p member is answered with @p arguments from now on. */
    void answerCalls(const QString &service, const QString &path, const QString &member,
                     const QVariantList &arguments);
    /** @p member is answered @p milliseconds later than it could be. */
    void delayCalls(const QString &service, const QString &path, const QString &member, uint milliseconds);
    /** @p member is never answered. */
    void swallowCalls(const QString &service, const QString &path, const QString &member);
    void clearFaults();

    /** Emits a signal. */
    void sendSignal(const QString &service, const QString &path, const QString &interface,
                    const QString &member, const QVariantList &arguments = QVariantList());
    /** Emits a signal and waits until this process has taken it in. */
    void emitSignal(const QString &service, const QString &path, const QString &interface,
                    const QString &member, const QVariantList &arguments = QVariantList());

    /** Another client of the bus emits what only @p service may; waits as emitSignal() does. */
    void forgeSignal(const QString &service, const QString &path, const QString &interface,
                     const QString &member, const QVariantList &arguments = QVariantList());

    /**
     * Waits until this process has taken in all that @p service has sent to it so far: what it sends is
     * delivered in order, so the answer to one more call comes last.
     */
    void settle(const QString &service);

    /** Calls received since construction or the last call, as "path member arguments"; without introspection.
     */
    QStringList takeJournal(const QString &service);
    /** The same of several services, in the order in which they received them. */
    QStringList takeJournal(const QStringList &services);
    /** The same as "path interface.member arguments". */
    QStringList takeJournalWithInterfaces(const QString &service);

    /** The D-Bus signature of the last call that was taken from the journal. */
    QString lastSignature() const { return m_lastSignature; }

    void act(const QString &action, const QStringList &arguments);
    /** The phone's own view of its state. */
    QJsonObject state() const;

private:
    QStringList takeJournal(const QStringList &services, bool withInterfaces);
    void ping(const QString &service) const;
    QVariantList control(const QString &method, const QVariantList &arguments = QVariantList()) const;
    void setFault(const QString &service, const QString &path, const QString &member, const QString &kind,
                  const QVariantMap &options);

    quint64 m_journalPosition = 0;
    QString m_lastSignature;
};

#endif // CORVANE_TEST_PHONE_H
