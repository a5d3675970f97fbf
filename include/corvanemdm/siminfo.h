// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_SIMINFO_H
#define CORVANEMDM_SIMINFO_H

#include <corvanemdm/corvanemdm_global.h>

#include <QtCore/QDebug>
#include <QtCore/QList>
#include <QtCore/QMetaType>
#include <QtCore/QObject>
#include <QtCore/QString>
#include <QtCore/QStringList>

namespace Corvane
{
namespace Mdm
{

class SimInfoPrivate;

/**
 * @brief Tells what is in each SIM slot of the phone, and announces each change.
 *
 * The states are mirrored: they arrive after construction, with simStateChanged(), and are kept up from then
 * on. Looking up a modem's objects blocks, in the constructor or in the event loop.
 *
 * The queries that return a list of slots ask the service instead: they block until it has answered, for
 * QtDBus's default timeout (25 s) at most with each question, and as long once more when it does not even
 * describe the object.
 *
 * While the telephony service is away or not ready the last states are kept; available() tells. A service
 * without the extension for several SIMs has no states to tell, and queries find nothing.
 *
 * Source: telephony service "org.ofono", its modems and SIMs, with the extensions
 * "org.veldmobile.ofono.ModemManager" and "org.veldmobile.ofono.SimInfo".
 */
class CORVANEMDM_EXPORT SimInfo : public QObject
{
    Q_OBJECT
    /** Whether the telephony service is available. */
    Q_PROPERTY(bool available READ available NOTIFY availableChanged)

public:
    /** What has to be entered before the SIM can be used. */
    enum PinRequired : int {
        UnknownPinState = -1, ///< there is no SIM, the slot is not enabled, or it has not been told yet
        PinNotRequired = 0, ///< neither PIN nor PUK
        SimPinRequired = 1, ///< the SIM's PIN
        SimPukRequired = 2 ///< the SIM's PUK, after too many wrong PINs
    };

    /** How the SIM stands to the mobile network. */
    enum NetworkRegistrationStatus : int {
        UnknownRegistrationStatus = -1, ///< not told
        NotRegistered = 0, ///< and not looking for a network
        Registered = 1, ///< at home
        SearchingForRegistration = 2, ///< looking for a network
        RegistrationDenied = 3, ///< the network refused the SIM
        Roaming = 4 ///< registered, but not at home
    };
    Q_ENUM(NetworkRegistrationStatus)

    /**
     * @brief What is known of one slot.
     *
     * A slot whose modem is away or off has its path alone. Comparisons leave out cardIdentifier,
     * serviceProviderName and subscriberNumbers: a change of these alone is neither announced nor taken over.
     */
    class CORVANEMDM_EXPORT SimState
    {
    public:
        SimState();

        /** Whether path, flags, PIN state, registration and IMSI are the same. */
        bool operator==(const SimState &other) const;
        /** Whether any of them differs. */
        bool operator!=(const SimState &other) const;
        /** By modem path, as the other orders. */
        bool operator<(const SimState &other) const;
        /** By modem path. */
        bool operator>(const SimState &other) const;
        /** By modem path. */
        bool operator<=(const SimState &other) const;
        /** By modem path. */
        bool operator>=(const SimState &other) const;

        /** All fields in one line, for people. */
        operator QString() const;

        QString modemPath; ///< the telephony service's object path of the slot's modem
        bool present; ///< a card is in the slot
        bool voiceSim; ///< calls go over this slot; also true without a card
        bool dataSim; ///< mobile data goes over this slot; also true without a card
        bool enabled; ///< the slot is in use
        SimInfo::PinRequired pinRequired; ///< UnknownPinState without a card
        SimInfo::NetworkRegistrationStatus networkRegistration; ///< of the slot's modem
        QString imsi; ///< subscriber identity; empty before the PIN has been entered
        QString cardIdentifier; ///< ICCID
        QString serviceProviderName; ///< as the card has it
        QStringList subscriberNumbers; ///< the card's own telephone numbers
    };

    /** @brief What a query found in one slot. */
    class CORVANEMDM_EXPORT SlotInfo
    {
    public:
        /** The first slot, with nothing in it. */
        SlotInfo();
        /** @p slotValue in the slot @p slotIndex. */
        SlotInfo(int slotIndex, const QString &slotValue);

        /** "Slot(0) = (244051234567890)". */
        operator QString() const;

        int slot; ///< from 0, in the order of the service's list of modems
        QString value; ///< what was asked for
    };

    /** Follows the service from now on; what it knows arrives later, unless another object of the thread has
     * been told already. */
    explicit SimInfo(QObject *parent = nullptr);
    ~SimInfo() override;

    /** Whether the service is there and has told its modems; false at first, unless another object of the
     * thread has been told already. */
    bool available() const;

    /** What is known of each slot, by modem path; also of those whose modem has gone. */
    QList<SimInfo::SimState> simSlotStates() const;

    /**
     * Asks for the serial numbers of the modems; blocks.
     * @return one entry a slot; empty (and a debug message) when the service could not be asked.
     */
    QList<SimInfo::SlotInfo> imeiCodes() const;

    /**
     * Asks for the IMSIs of the SIMs; blocks, with one question a slot.
     * @return slots without a SIM, or whose modem does not tell, are left out.
     */
    QList<SimInfo::SlotInfo> subscriberIdentities() const;

    /**
     * Asks for the ICCIDs of the cards; blocks, with one question a slot.
     * @return slots without a card, or whose modem does not tell, are left out.
     */
    QList<SimInfo::SlotInfo> cardIdentifier() const;

    /**
     * Asks for the telephone numbers of the SIMs; blocks, with one question a slot.
     * @return several numbers of a SIM are joined with ","; slots that have none are left out.
     */
    QList<SimInfo::SlotInfo> subscriberNumbers() const;

    /** Whether cards can be swapped without a restart: unless the phone is configured to warn of one. */
    bool hotSwappingSupported() const;

Q_SIGNALS:
    /** The telephony service came or went. */
    void availableChanged(bool available);
    /** A slot is not as before; @p state is among simSlotStates() already. */
    void simStateChanged(const SimInfo::SimState &state);

private:
    Q_DISABLE_COPY(SimInfo)
    SimInfoPrivate *const d;
};

/** Writes "unknown", "not required", "PIN required" or "PUK required". */
CORVANEMDM_EXPORT QDebug operator<<(QDebug debug, const SimInfo::PinRequired &pinRequired);

/** Writes "unknown", "unregistered", "registered", "searching", "denied" or "roaming". */
CORVANEMDM_EXPORT QDebug operator<<(QDebug debug, const SimInfo::NetworkRegistrationStatus &status);

/** Writes slot and value, or "SlotInfo (this = 0x0)" for a null pointer. */
CORVANEMDM_EXPORT QDebug operator<<(QDebug debug, const SimInfo::SlotInfo *info);

} // namespace Mdm
} // namespace Corvane

Q_DECLARE_METATYPE(Corvane::Mdm::SimInfo::SimState)

#endif // CORVANEMDM_SIMINFO_H
