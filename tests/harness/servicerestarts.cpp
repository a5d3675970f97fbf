// SPDX-License-Identifier: LGPL-2.1-or-later
#include "servicerestarts.h"

#include "endurance.h"

namespace
{

constexpr quint32 usualSeed = 20261121;

int numberFromEnvironment(const char *name, int usual)
{
    bool isNumber = false;
    const int number = qEnvironmentVariableIntValue(name, &isNumber);
    return isNumber ? number : usual;
}

} // namespace

ServiceRestarts::ServiceRestarts(Phone &phone, const QString &service, int longestRun, int usualRounds)
    : m_phone(phone)
    , m_service(service)
    , m_longestRun(longestRun)
    , m_rounds(numberFromEnvironment("CORVANE_RESTARTS", 2 * usualRounds) / 2)
    , m_seed(quint32(numberFromEnvironment("CORVANE_SEED", usualSeed)))
    , m_random(m_seed)
{
}

void ServiceRestarts::stop()
{
    m_phone.stopService(m_service);
}

void ServiceRestarts::runOn()
{
    passTime(m_longestRun);
}

void ServiceRestarts::runBriefly()
{
    passTime(m_longestRun / 4);
    m_phone.startService(m_service);
    ++m_restarts;
    runOn();
    m_phone.stopService(m_service);
    // What the run has left behind arrives now, and not with the next one.
    passTime(m_longestRun / 4);
}

void ServiceRestarts::start()
{
    m_phone.startService(m_service);
    ++m_restarts;
}

void ServiceRestarts::endRound()
{
    if (++m_roundsEnded == m_rounds / 10)
        m_memoryAtStart = residentMemory();
}

QString ServiceRestarts::summary() const
{
    const qint64 growth = m_memoryAtStart ? residentMemory() - m_memoryAtStart : 0;
    return QString::asprintf("%d restarts (seed %u), memory %+lld KiB since restart %d", m_restarts, m_seed,
                             growth, m_rounds / 10 * 2);
}

void ServiceRestarts::passTime(int mostMicroseconds)
{
    runFor(m_random.bounded(mostMicroseconds));
}
