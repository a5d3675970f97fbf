// SPDX-License-Identifier: LGPL-2.1-or-later
#include "simcards.h"

#include "service.h"
#include "wait.h"

#include <QtCore/QCoreApplication>

namespace Corvane
{
namespace Agent
{

using Mdm::SimInfo;

namespace
{

/** How often the library asks on when an answer has come: of modems, of their interfaces. */
constexpr int furtherQuestions = 2;

} // namespace

SimCards::SimCards(std::chrono::milliseconds timeout, QObject *parent)
    : QObject(parent)
    , m_timeout(timeout)
{
    connect(&m_info, &SimInfo::simStateChanged, this, &SimCards::changed);
}

Reply SimCards::ask() const
{
    // Every slot has a modem with a serial number, whether or not there is a SIM.
    if (!m_info.imeiCodes().isEmpty())
        return {};
    if (!Service::telephony().isRunning())
        return Service::telephony().notRunning();
    return untold();
}

Reply SimCards::untold()
{
    return {Reply::Refused, Service::telephony().toString() + QLatin1String(" does not tell its SIM slots")};
}

Reply SimCards::open()
{
    const Reply asked = ask();
    if (!asked.isDone())
        return asked;
    const int slots = m_info.imeiCodes().size();
    Wait wait(Service::telephony(), m_timeout, QStringLiteral("tell which SIMs are in the phone"));
    wait.until(&m_info, &SimInfo::simStateChanged,
               [this, slots] { return m_info.simSlotStates().size() >= slots; });
    const Reply told = wait.run();
    if (!told.isDone())
        return told;
    // Each slot has a state now, maybe without a content yet. The service answers in order: when it has
    // answered one more question, the answers to those that the library had asked are here.
    for (int question = 0; question <= furtherQuestions; ++question) {
        m_info.imeiCodes();
        QCoreApplication::processEvents();
    }
    return {};
}

QStringList SimCards::imsis() const
{
    QStringList imsis;
    const QList<SimInfo::SlotInfo> slots = m_info.subscriberIdentities();
    for (const SimInfo::SlotInfo &slot : slots)
        imsis.append(slot.value);
    return imsis;
}

} // namespace Agent
} // namespace Corvane
