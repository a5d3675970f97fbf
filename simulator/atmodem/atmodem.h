// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_ATMODEM_H
#define CORVANE_SIMULATOR_ATMODEM_H

#include "phone.h"

#include <QtCore/QStringList>

#include <functional>

namespace Corvane
{
namespace Simulator
{

/**
 * A modem that speaks AT commands (3GPP 27.007), with the SIM of its slot.
 *
 * It knows nothing of the line over which it is reached: a command line goes in, the lines of the answer come
 * out. Commands that it does not know are answered "OK", so that a driver gets on with what it knows.
 */
class AtModem
{
public:
    /** As +CREG numbers them. */
    enum Registration { NotRegistered = 0, Home = 1, Searching = 2, Denied = 3, Unknown = 4, Roaming = 5 };

    /**
     * @p sim is the card of slot number @p slot, which outlives the modem and may change. When it requires a
     * PIN that is 1234; a PUK is any eight digits.
     */
    AtModem(Sim &sim, std::size_t slot);

    /** The lines of the answer to @p commandLine: information, the result, and what it leads to unasked. */
    QStringList answer(const QString &commandLine);

    /** @p announcer is given the lines that the modem sends unasked while it answers nothing. */
    void setAnnouncer(std::function<void(const QString &line)> announcer)
    {
        m_announcer = std::move(announcer);
    }
    /** The other end of the line is new: what it has switched on is off again. */
    void reset();

    /** The card was put in or taken out. */
    void cardChanged();
    /** What the network answers while the radio is on and the card can be used. */
    void setNetwork(Registration registration);

    bool isRadioOn() const { return m_function == FullFunction; }
    /** As the modem tells it now. */
    Registration registration() const;

private:
    struct Command;
    enum Lock { Unlocked, PinLocked, PukLocked };
    enum Function { MinimumFunction = 0, FullFunction = 1, RadioOff = 4 };

    Lock lock() const;
    static Command parsed(const QString &text);
    QString performAll(const QString &commandLine, QStringList &lines);
    QString perform(const Command &command, QStringList &lines);
    QString performIdentity(const Command &command, QStringList &lines) const;
    QString performCard(const Command &command, QStringList &lines);
    QString performNetwork(const Command &command, QStringList &lines);
    QString accessFile(const QStringList &arguments, QStringList &lines) const;
    QString enterPin(const QStringList &arguments);
    QString performRegistration(const Command &command, int &reporting, QStringList &lines) const;
    void setFunction(Function function);
    void announceCard(bool isPresent);
    void announceRegistration(Registration before);
    void announce(const QString &line);
    QString registrationLine(const QString &name, int reporting, bool isQuery) const;

    Sim &m_sim;
    const std::size_t m_slot;
    std::function<void(const QString &)> m_announcer;
    Function m_function = MinimumFunction;
    Registration m_network = Home;
    QString m_pin;
    bool m_asksForPin = false; ///< each time that the card gets power
    int m_attemptsLeft;
    int m_voiceReporting = 0; ///< of +CREG: 0 none, 1 the state, 2 and the cell
    int m_dataReporting = 0; ///< of +CGREG
    bool m_numericOperator = false;
    bool m_isAnswering = false;
    QStringList m_announcements; ///< that wait until the answer is complete
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_ATMODEM_H
