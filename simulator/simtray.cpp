// SPDX-License-Identifier: LGPL-2.1-or-later
#include "simtray.h"

#include "refusal.h"

#include <QtCore/QRegularExpression>

#include <algorithm>

namespace Corvane
{
namespace Simulator
{

SimTray::SimTray(Phone &phone, std::function<void(std::size_t)> changed)
    : m_phone(phone)
    , m_changed(std::move(changed))
{
}

std::size_t SimTray::slot(const QString &text) const
{
    if (const std::optional<std::size_t> slot = m_phone.slotNumbered(text))
        return *slot;
    throw Refusal(QStringLiteral("There is no SIM slot \"%1\"; the phone has %2, numbered from 0")
                      .arg(text)
                      .arg(m_phone.sims.size()));
}

Sim &SimTray::card(std::size_t slot) const
{
    Sim &sim = m_phone.sims[slot];
    if (!sim.present)
        throw Refusal(QStringLiteral("There is no SIM in slot %1").arg(slot));
    return sim;
}

QJsonArray SimTray::describe() const
{
    QJsonArray sims;
    for (const Sim &sim : m_phone.sims) {
        sims << QJsonObject{
            {QStringLiteral("imsi"), sim.imsi},
            {QStringLiteral("iccid"), sim.iccid},
            {QStringLiteral("provider"), sim.provider},
            {QStringLiteral("numbers"), QJsonArray::fromStringList(sim.numbers)},
            {QStringLiteral("present"), sim.present},
            {QStringLiteral("pin"), sim.pin},
        };
    }
    return sims;
}

QString SimTray::pull(const QString &slotText) const
{
    const std::size_t index = slot(slotText);
    Sim &sim = card(index);
    sim.present = false;
    m_changed(index);
    return QStringLiteral("The SIM %1 is out of slot %2").arg(sim.imsi).arg(index);
}

QString SimTray::insert(const QStringList &arguments) const
{
    static const QRegularExpression imsiDigits(QStringLiteral("\\A[0-9]{6,15}\\z"));
    const std::size_t index = slot(arguments.first());
    Sim &sim = m_phone.sims[index];
    if (sim.present)
        throw Refusal(QStringLiteral("There is a SIM in slot %1; pull it first").arg(index));
    const QString imsi = arguments.size() > 1 ? arguments.at(1) : sim.imsi;
    if (!imsiDigits.match(imsi).hasMatch()) {
        throw Refusal(imsi.isEmpty()
                          ? QStringLiteral("Slot %1 never had a SIM; name the IMSI of the new one").arg(index)
                          : QStringLiteral("\"%1\" is no IMSI; it has 6 to 15 digits").arg(imsi));
    }
    const bool elsewhere = std::any_of(m_phone.sims.begin(), m_phone.sims.end(),
                                       [&](const Sim &other) { return other.present && other.imsi == imsi; });
    if (elsewhere)
        throw Refusal(QStringLiteral("The SIM %1 is in another slot; pull it there first").arg(imsi));

    if (imsi != sim.imsi)
        sim = m_phone.cardWithImsi(imsi);
    sim.present = true;
    m_changed(index);
    return QStringLiteral("The SIM %1 is in slot %2").arg(imsi).arg(index);
}

std::vector<Action> SimTray::actions() const
{
    return {
        {QStringLiteral("sim pull"), QStringLiteral("SLOT"), QStringLiteral("takes the SIM out of a slot"), 1,
         1,
         [this](const QStringList &arguments) {
             return pull(arguments.first());
         }},
        {QStringLiteral("sim insert"), QStringLiteral("SLOT [IMSI]"),
         QStringLiteral("puts the SIM back, or another one in its place"), 1, 2,
         [this](const QStringList &arguments) {
             return insert(arguments);
         }},
    };
}

} // namespace Simulator
} // namespace Corvane
