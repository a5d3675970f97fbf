// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_PHONE_H
#define CORVANE_SIMULATOR_PHONE_H

#include "cellularlinks.h"

#include <QtCore/QJsonArray>
#include <QtCore/QJsonObject>
#include <QtCore/QString>
#include <QtCore/QStringList>

#include <functional>
#include <map>
#include <optional>
#include <vector>

namespace Corvane
{
namespace Simulator
{

/** A SIM card, in its slot or, when not present, beside it. */
struct Sim {
    QString imsi;
    QString iccid;
    QString provider;
    QStringList numbers;
    bool present = false;
    QString pin = QStringLiteral("none"); ///< what it requires, in the telephony daemon's words

    /** Whether the phone can read all of it and use it. */
    bool isUsable() const;
};

struct Battery {
    bool isPresent = false;
    double percentage = 0; ///< 0 to 100
    bool hasCharger = false; ///< that is connected

    QJsonObject describe() const;
};

/** What several services know of the phone. */
class Phone
{
public:
    /** @p profile is complete and has been checked. */
    explicit Phone(const QJsonObject &profile);

    /** The card with @p imsi: one of the profile, or one made up for it. */
    Sim cardWithImsi(const QString &imsi) const;

    /** The slot that @p text is the number of; empty when there is no such slot. */
    std::optional<std::size_t> slotNumbered(const QString &text) const;

    std::vector<Sim> sims; ///< by slot
    QJsonArray installedPackages; ///< when the phone was new, in the profile's words
    Battery battery;
    CellularLinks cellularLinks;

    /** Stops every service as soon as what is under way has been answered, and starts them again to restart.
     */
    std::function<void(bool restart)> goDown;
    /** Starts every service of a phone that is off. */
    std::function<void()> comeUp;
    bool isOn = true;
    int restarts = 0; ///< since the simulator started

private:
    std::map<QString, Sim> m_cards; ///< of the profile, by IMSI
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_PHONE_H
