// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMCARDS_H
#define CORVANE_SIMCARDS_H

#include "reply.h"

#include <corvanemdm/siminfo.h>

#include <QtCore/QObject>
#include <QtCore/QStringList>

#include <chrono>

namespace Corvane
{
namespace Agent
{

/** The SIMs of the phone. Asking for what is so now blocks, following what changes does not. */
class SimCards : public QObject
{
    Q_OBJECT

public:
    explicit SimCards(std::chrono::milliseconds timeout, QObject *parent = nullptr);

    const Mdm::SimInfo &info() const { return m_info; }

    /** Whether the telephony service tells its slots; a stock one does not. */
    Reply ask() const;

    /** The answer of a telephony service that does not. */
    static Reply untold();

    /** Waits until the states of all slots are known. */
    Reply open();

    /** The subscriber identities of the SIMs that are in the phone and can be used. */
    QStringList imsis() const;

Q_SIGNALS:
    void changed();

private:
    Mdm::SimInfo m_info;
    std::chrono::milliseconds m_timeout;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_SIMCARDS_H
