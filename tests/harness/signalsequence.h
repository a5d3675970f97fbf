// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_SIGNALSEQUENCE_H
#define CORVANE_TEST_SIGNALSEQUENCE_H

#include <corvanemdm/siminfo.h>

#include <QtCore/QMetaMethod>
#include <QtCore/QObject>
#include <QtCore/QStringList>
#include <QtCore/QVector>

/** What comparisons look at, such as "/ril_0 present voice data enabled pin:0 net:1 244051234567890". */
QString simStateText(const Corvane::Mdm::SimInfo::SimState &state);

/**
 * Records every signal that the classes of an object declare, in the order of emission and with its
 * arguments, as "name(argument, argument)". Rules read "244:block", lists of rules "[244:block 262:allow]",
 * results of call statistics "2026-03-01T00:00:00Z=3", SIM states as simStateText() writes them, maps
 * "{Method=auto URL=http://example}", URLs "[http://a http://b]", reports on data "wifi_1 wlan tx:1 rx:2
 * time:3".
 *
 * Connects through the meta-object alone, as a binding to another language would.
 */
class SignalSequence : public QObject
{
public:
    explicit SignalSequence(QObject *object);

    const QStringList &signalsSeen() const { return m_seen; }
    /** The signals since construction or the last call. */
    QStringList take();
    /** Waits until @p count signals have been seen. */
    bool waitFor(int count);

    int qt_metacall(QMetaObject::Call call, int id, void **arguments) override;

private:
    QVector<QMetaMethod> m_signals;
    QStringList m_seen;
};

#endif // CORVANE_TEST_SIGNALSEQUENCE_H
