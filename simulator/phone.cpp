// SPDX-License-Identifier: LGPL-2.1-or-later
#include "phone.h"

#include <QtCore/QJsonArray>

namespace Corvane
{
namespace Simulator
{

bool Sim::isUsable() const
{
    // A second PIN guards a few of the card's functions alone.
    static const QStringList harmless{QStringLiteral("none"), QStringLiteral("pin2"), QStringLiteral("puk2")};
    return present && harmless.contains(pin);
}

Sim Phone::cardWithImsi(const QString &imsi) const
{
    const auto known = m_cards.find(imsi);
    if (known != m_cards.end())
        return known->second;
    Sim sim;
    sim.imsi = imsi;
    // A card number begins with 89; the rest only has to be as unique as the IMSI.
    sim.iccid = QStringLiteral("8900") + imsi.rightJustified(15, QLatin1Char('0'));
    sim.provider = QStringLiteral("Operator ") + imsi.left(5);
    sim.present = true;
    return sim;
}

Phone::Phone(const QJsonObject &profile)
{
    const QJsonObject power = profile.value(QLatin1String("battery")).toObject();
    battery = {power.value(QLatin1String("present")).toBool(),
               power.value(QLatin1String("percentage")).toDouble(),
               power.value(QLatin1String("charger")).toBool()};

    const QJsonArray slots = profile.value(QLatin1String("sims")).toArray();
    for (const QJsonValue &slot : slots) {
        const QJsonObject card = slot.toObject();
        Sim sim;
        if (card.contains(QLatin1String("imsi")))
            sim = cardWithImsi(card.value(QLatin1String("imsi")).toString());
        sim.iccid = card.value(QLatin1String("iccid")).toString(sim.iccid);
        sim.provider = card.value(QLatin1String("provider")).toString(sim.provider);
        sim.present = card.value(QLatin1String("present")).toBool(sim.present);
        sim.pin = card.value(QLatin1String("pin")).toString(sim.pin);
        const QJsonArray numbers = card.value(QLatin1String("numbers")).toArray();
        for (const QJsonValue &number : numbers)
            sim.numbers << number.toString();
        m_cards.emplace(sim.imsi, sim);
        sims.push_back(sim);
    }
}

QJsonObject Battery::describe() const
{
    return {{QStringLiteral("present"), isPresent},
            {QStringLiteral("percentage"), percentage},
            {QStringLiteral("charger"), hasCharger}};
}

std::optional<std::size_t> Phone::slotNumbered(const QString &text) const
{
    for (std::size_t slot = 0; slot < sims.size(); ++slot) {
        if (text == QString::number(slot))
            return slot;
    }
    return std::nullopt;
}

} // namespace Simulator
} // namespace Corvane
