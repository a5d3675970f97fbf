// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_TEST_SERVICERESTARTS_H
#define CORVANE_TEST_SERVICERESTARTS_H

#include "phone.h"

#include <QtCore/QRandomGenerator>
#include <QtCore/QString>

/**
 * Stops and starts a service of the phone at moments that nobody chose: the same ones in every run of a test,
 * as they are drawn from a seed.
 *
 * The environment may ask for another seed or more rounds, with CORVANE_SEED and CORVANE_RESTARTS.
 */
class ServiceRestarts
{
public:
    /** @p longestRun is somewhat more than clients need until they know all of the service, or have done with
     * it what they do in a round, in microseconds. */
    ServiceRestarts(Phone &phone, const QString &service, int longestRun, int usualRounds = 100);

    /** Each of them has two restarts. */
    int rounds() const { return m_rounds; }

    /** The service goes away for a while. */
    void stop();
    /** It runs on for as long as it may take until all is done, or any shorter time. */
    void runOn();
    /** It comes, and goes away again at any point of being taken up by its clients. */
    void runBriefly();
    /** It comes to stay. */
    void start();
    /** To be called at the end of each round, with all that belongs to it gone. */
    void endRound();

    /** "200 restarts (seed 1), memory +12 KiB since restart 20". */
    QString summary() const;

private:
    void passTime(int mostMicroseconds);

    Phone &m_phone;
    const QString m_service;
    const int m_longestRun;
    const int m_rounds;
    const quint32 m_seed;
    QRandomGenerator m_random;
    int m_roundsEnded = 0;
    int m_restarts = 0;
    qint64 m_memoryAtStart = 0;
};

#endif // CORVANE_TEST_SERVICERESTARTS_H
